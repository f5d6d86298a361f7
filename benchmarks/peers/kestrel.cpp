#include <stdexcept>

#include "benchmarks/common/engine.h"
#include "benchmarks/peers/contender.h"

namespace bench {
namespace {

// What the documentation recommends: a tiled engine for whole pictures, block mode 2 where
// adjustments must be honoured.
uint32_t RecommendedPassMode(const Job& job) {
  return job.adjustments.Any() ? 2 : MPP_PASS_TILED;
}

// What a parameter record that is all zero gives.
uint32_t ZeroPassMode(const Job&) {
  return 0;
}

std::shared_ptr<const Engine> MakeEngine(const Job& job, uint32_t passMode) {
  MPPPARAM params = {};
  params.resampleFlags = job.bilinear ? MPP_BILINEAR : MPP_NEAREST;
  params.transformCode = job.transform;
  params.passMode = passMode;
  params.aspectMode = job.crop ? MPP_ASPECT_CROP : 0;
  params.brightness = job.adjustments.brightness;
  params.contrast = job.adjustments.contrast;
  params.saturation = job.adjustments.saturation;
  params.alpha = 255;
  auto engine = std::make_shared<const Engine>(
      MPPFORMAT{job.dstFormat, job.dst.width, job.dst.height, nullptr},
      MPPFORMAT{job.srcFormat, job.src.width, job.src.height, nullptr}, params);
  if (!engine->IsAccepted()) throw std::runtime_error("no engine for " + job.name);
  return engine;
}

Contender MakeContender(const char* name, Role role, uint32_t (*passModeFor)(const Job&)) {
  const auto plans = [passModeFor](const Job& job, const Picture& src, const Picture& dst) {
    const uint32_t passMode = passModeFor(job);
    Plan plan = {"passMode " + std::to_string(passMode), {}};
    if (job.withCreation) {
      plan.run = [job, passMode, src, dst] { MakeEngine(job, passMode)->Run(src, dst); };
    } else {
      plan.run = [engine = MakeEngine(job, passMode), src, dst] { engine->Run(src, dst); };
    }
    return std::vector<Plan>{plan};
  };
  return {name, role, plans};
}

}  // namespace

std::vector<Contender> KestrelContenders() {
  return {
      MakeContender("kestrel", Role::kOurs, RecommendedPassMode),
      MakeContender("kestrel-untiled", Role::kOther, ZeroPassMode),
  };
}

}  // namespace bench
