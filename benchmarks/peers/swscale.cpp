extern "C" {
#include <libavutil/log.h>
#include <libavutil/opt.h>
#include <libavutil/pixfmt.h>
#include <libswscale/swscale.h>
}

#include <algorithm>
#include <cmath>
#include <memory>
#include <string>
#include <vector>

#include "benchmarks/peers/composition.h"

namespace bench {
namespace {

AVPixelFormat PixelFormatOf(uint32_t format) {
  switch (LayoutOf(format)) {
    case FORMAT_NV21:
      return AV_PIX_FMT_NV21;
    case FORMAT_NV12:
      return AV_PIX_FMT_NV12;
    case FORMAT_I420:
      return AV_PIX_FMT_YUV420P;
    case FORMAT_YUYV:
      return AV_PIX_FMT_YUYV422;
    case FORMAT_GRAY8:
      return AV_PIX_FMT_GRAY8;
    case FORMAT_XBGR8888:
      return AV_PIX_FMT_RGBA;
    case FORMAT_RGB888:
      return AV_PIX_FMT_BGR24;
    case FORMAT_RGB565:
      return AV_PIX_FMT_RGB565LE;
    default:
      return AV_PIX_FMT_NONE;
  }
}

using Context = std::shared_ptr<SwsContext>;

// Null when the library refuses.
Context MakeContext(const Job& job, int flags) {
  Context context(sws_alloc_context(), sws_freeContext);
  const int range = IsFullRange(job) ? 1 : 0;
  const struct {
    const char* name;
    int64_t value;
  } options[] = {
      {"srcw", job.Shown().width},
      {"srch", job.Shown().height},
      {"src_format", PixelFormatOf(job.srcFormat)},
      {"dstw", job.dst.width},
      {"dsth", job.dst.height},
      {"dst_format", PixelFormatOf(job.dstFormat)},
      {"src_range", range},
      {"dst_range", range},
      {"sws_flags", flags},
      {"threads", 1},
  };
  for (const auto& option : options) {
    if (av_opt_set_int(context.get(), option.name, option.value, 0) < 0) return nullptr;
  }
  // Contrast acts about -384 here, not about 128, and before brightness, whose unit is 256 levels.
  const Adjustments& a = job.adjustments;
  const double contrast = 1 + a.contrast / 64.0;
  const double brightness = ((a.brightness - 128) * contrast + 128 - 384 * (contrast - 1)) / 256;
  const double saturation = 1 + a.saturation / 64.0;
  const int* coefficients = sws_getCoefficients(SWS_CS_ITU601);
  const auto set = [&] {
    return sws_setColorspaceDetails(context.get(), coefficients, range, coefficients, range,
                                    int(std::lround(brightness * 65536)),
                                    int(std::lround(contrast * 65536)),
                                    int(std::lround(saturation * 65536)));
  };
  set();  // kernels are chosen by it at creation, tables are made by it after
  if (sws_init_context(context.get(), nullptr, nullptr) < 0) return nullptr;
  if (set() < 0 && a.Any()) return nullptr;
  return context;
}

void Run(SwsContext* context, const Picture& src, const Picture& dst, bool upsideDown) {
  const uint8_t* from[4] = {};
  int fromPitch[4] = {};
  uint8_t* to[4] = {};
  int toPitch[4] = {};
  for (int i = 0; i < src.blockCount; ++i) {
    from[i] = src.block[i].start;
    fromPitch[i] = src.block[i].pitch;
  }
  for (int i = 0; i < dst.blockCount; ++i) {
    const Block& block = dst.block[i];
    to[i] = block.start + (upsideDown ? ptrdiff_t(block.rows - 1) * block.pitch : 0);
    toPitch[i] = upsideDown ? -block.pitch : block.pitch;
  }
  sws_scale(context, from, fromPitch, 0, src.size.height, to, toPitch);
}

struct Method {
  const char* name;
  int flags;
};

std::vector<Method> MethodsFor(const Job& job) {
  const Method point = {"SWS_POINT", SWS_POINT};
  const Method bilinear = {"SWS_BILINEAR", SWS_BILINEAR};
  const Method fast = {"SWS_FAST_BILINEAR", SWS_FAST_BILINEAR};
  if (!job.Scales()) return {point, bilinear, fast};
  return job.bilinear ? std::vector<Method>{bilinear, fast} : std::vector<Method>{point};
}

// The library's kernels fault on rows that are not aligned.
bool HasAlignedRows(const Picture& picture) {
  return std::all_of(picture.block, picture.block + picture.blockCount,
                     [](const Block& block) { return block.pitch % 16 == 0; });
}

std::vector<Plan> Plans(const Job& job, const Picture& src, const Picture& dst) {
  const bool upsideDown = job.transform == MPP_MIRROR_Y;
  if (job.transform != 0 && !upsideDown) return {};
  if (!HasAlignedRows(src) || !HasAlignedRows(dst)) return {};
  const Picture shown = src.Part(job.ShownX(), job.ShownY(), job.Shown());
  std::vector<Plan> plans;
  for (const Method& method : MethodsFor(job)) {
    const Context context = MakeContext(job, method.flags);
    if (context == nullptr) continue;
    Plan plan = {method.name,
                 [context, shown, dst, upsideDown] { Run(context.get(), shown, dst, upsideDown); }};
    if (job.withCreation) {
      plan.run = [job, flags = method.flags, shown, dst, upsideDown] {
        Run(MakeContext(job, flags).get(), shown, dst, upsideDown);
      };
    }
    plans.push_back(plan);
  }
  return plans;
}

}  // namespace

std::vector<Contender> SwscaleContenders() {
  av_log_set_level(AV_LOG_ERROR);
  return {{"swscale", Role::kPeer, Plans}};
}

std::string SwscaleVersion() {
  const unsigned version = swscale_version();
  return std::to_string(version >> 16) + "." + std::to_string(version >> 8 & 255) + "." +
         std::to_string(version & 255);
}

}  // namespace bench
