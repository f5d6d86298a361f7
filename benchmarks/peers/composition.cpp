#include "benchmarks/peers/composition.h"

#include <algorithm>

namespace bench {
namespace {

constexpr size_t kMaxSteps = 4;
constexpr int kMaxConversions = 2;

// What remains after a step, if the step does only what is wanted.
bool Apply(const Step& step, Pending* pending) {
  if ((step.scales && !pending->scale) || (step.adjusts && !pending->adjust)) return false;
  pending->scale = pending->scale && !step.scales;
  pending->adjust = pending->adjust && !step.adjusts;
  if (step.turns == 0) return true;
  if (step.turns == pending->turn) {
    pending->turn = 0;
    return true;
  }
  // Half of a turn by 180 degrees is a mirror; turns with exchanged axes are done in one go.
  const bool half = (pending->turn & MPP_SWAP_XY) == 0 && (step.turns & ~pending->turn) == 0;
  pending->turn &= ~step.turns;
  return half;
}

// Chroma samples of each component in 4 x 4 pixels; all 16 for RGB.
int64_t ChromaOf(uint32_t format) {
  return LayoutOf(format) == FORMAT_GRAY8 ? 0 : Picture(format, {4, 4}).SizeOf(1).Pixels();
}

// A sequence under construction.
struct Partial {
  std::vector<Step> steps;
  uint32_t format;
  Pending pending;
  int conversions;

  bool IsComplete(const Job& job) const {
    return !steps.empty() && format == job.dstFormat && pending.None();
  }
};

// The sequence longer by one step; false when the step is of no use.
bool Extend(const Partial& partial, const Step& step, const Job& job, Partial* longer) {
  Pending rest = partial.pending;
  if (!Apply(step, &rest)) return false;
  const bool converts = step.dstFormat != partial.format;
  const bool copies = !converts && !step.scales && !step.adjusts && step.turns == 0;
  const bool isCopyJob = partial.steps.empty() && rest.None() && partial.format == job.dstFormat;
  if (copies && !isCopyJob) return false;
  const int64_t leastChroma = std::min(ChromaOf(job.srcFormat), ChromaOf(job.dstFormat));
  if (ChromaOf(step.dstFormat) < leastChroma) return false;
  *longer = {partial.steps, step.dstFormat, rest, partial.conversions + converts};
  longer->steps.push_back(step);
  return longer->conversions <= kMaxConversions;
}

Plan MakePlan(const std::vector<Step>& steps, const Job& job, const Picture& src,
              const Picture& dst) {
  std::vector<Picture> pictures = {src};
  Plan plan;
  Size size = src.size;
  bool swapped = false;
  for (const Step& step : steps) {
    if (step.scales) size = swapped ? job.dst : job.UnturnedDst();
    if ((step.turns & MPP_SWAP_XY) != 0) {
      size = size.Turned();
      swapped = true;
    }
    const bool last = pictures.size() == steps.size();
    pictures.push_back(last ? dst : Picture(step.dstFormat, size));
    plan.description += (plan.description.empty() ? "" : " + ") + step.name;
  }
  plan.run = [pictures, steps] {
    for (size_t i = 0; i < steps.size(); ++i) steps[i].run(pictures[i], pictures[i + 1]);
  };
  return plan;
}

}  // namespace

std::vector<Plan> Compose(const Toolbox& toolbox, const Job& job, const Picture& src,
                          const Picture& dst) {
  const Picture shown = src.Part(job.ShownX(), job.ShownY(), job.Shown());
  std::vector<Partial> partials = {
      {{}, job.srcFormat, {job.Scales(), job.adjustments.Any(), job.transform}, 0}};
  std::vector<Plan> plans;
  for (size_t length = 0; length < kMaxSteps; ++length) {
    std::vector<Partial> longer;
    for (const Partial& partial : partials) {
      for (const Step& step : toolbox(partial.format, job)) {
        Partial next;
        if (!Extend(partial, step, job, &next)) continue;
        if (next.IsComplete(job)) {
          plans.push_back(MakePlan(next.steps, job, shown, dst));
        } else {
          longer.push_back(next);
        }
      }
    }
    partials = longer;
  }
  return plans;
}

uint32_t InStandardOf(const Job& job, uint32_t layout) {
  if (LayoutOf(layout) >> 28 < 5) return layout;
  const uint32_t yuv = job.srcFormat >> 28 >= 5 ? job.srcFormat : job.dstFormat;
  // Jobs without a YUV side may pass through full-range pictures.
  const uint32_t standard = yuv >> 28 >= 5 ? yuv & FORMAT_STANDARD_MASK : FORMAT_BT601_FULL;
  return layout | standard;
}

}  // namespace bench
