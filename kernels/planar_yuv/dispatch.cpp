// Planar and semi-planar YUV family.
#include "kernels/table/choice.h"

using namespace kestrel;

namespace {

namespace id = kestrel::kernel_id;

// Nearest jobs go to the block 3 kernel, bilinear ones to the block 2 kernel, no others to either.
int ScaledPair(const Question& q, int nearest, int bilinear) {
  if (!q.untransformed()) return kDeclined;
  if (q.blockMode == 3 && !q.bilinear) return nearest;
  if (q.blockMode == 2 && q.bilinear) return bilinear;
  return kDeclined;
}

// Never looks at levels: a job that changes them is taken, and its values are copied as they are.
int ChooseI420ToI422(const Question& q) {
  if (q.fromTo(kI420, kI440 | kI422)) {
    const bool turned = q.mirrorX && q.swap;
    if (q.unit) return turned ? id::I420_To_I422_Fast_NORESAMPLE_90 : kDeclined;
    const bool takes = !q.bilinear && (turned || q.untransformed());
    return takes ? id::I420_To_I422_Fast_90 : kDeclined;
  }
  if (!q.from(kPlanar) || q.source != q.destination) return kDeclined;
  if (q.unit) return id::YUV_To_YUV_NOREAMPLE_ROTATE_Fast;
  switch (q.source) {
    case kI420:
      return ScaledPair(q, id::I420_To_I420_REAMPLE_NOROTATE_Fast,
                        id::I420_To_I420_REAMPLE_NOROTATE_BILINEAR_Fast);
    case kI422:
      return ScaledPair(q, id::I422H_To_I422H_REAMPLE_NOROTATE_Fast,
                        id::I422H_To_I422H_REAMPLE_NOROTATE_BILINEAR_Fast);
    case kI440:
      return ScaledPair(q, id::I422V_To_I422V_REAMPLE_NOROTATE_Fast,
                        id::I422V_To_I422V_REAMPLE_BILINEAR_NOROTATE_Fast);
    default:
      return ScaledPair(q, id::I444_To_I444_REAMPLE_NOROTATE_Fast, kDeclined);
  }
}

// The table's first 58 lines by layout: bit i of from[k] says that line i takes sources 1 << k.
constexpr int kFirstLine = id::I422_TO_I420_NORESAMPLE_4x4;
constexpr int kLines = id::YUYVtoYUYVFast_N_RESAMPLE_R0_4x4 - kFirstLine + 1;
struct LinesByLayout {
  uint64_t from[32], to[32];
};
constexpr LinesByLayout SortLines() {
  constexpr uint32_t kSides[][2] = {
#define KERNEL(name, sources, destinations, ...) {sources, destinations},
#include "kernels/planar_yuv/kernels.def"
#undef KERNEL
  };
  LinesByLayout lines = {};
  for (int i = 0; i < kLines; ++i) {
    for (int k = 0; k < 32; ++k) {
      lines.from[k] |= uint64_t{kSides[i][0] >> k & 1} << i;
      lines.to[k] |= uint64_t{kSides[i][1] >> k & 1} << i;
    }
  }
  return lines;
}
constexpr LinesByLayout kLinesByLayout = SortLines();

// The first of these lines that accepts the job. Levels are never changed here.
int ChooseYuvToYuv(const Question& q) {
  if (q.engine.needsLevelTable != 0 || q.engine.pathKind != PATH_YUV_TO_YUV) return kDeclined;
  uint64_t lines = kLinesByLayout.from[__builtin_ctz(q.source)] &
                   kLinesByLayout.to[__builtin_ctz(q.destination)];
  for (; lines != 0; lines &= lines - 1) {
    const int line = kFirstLine + __builtin_ctzll(lines);
    if (Accepts(kKernels[line], q.engine)) return line;
  }
  return kDeclined;
}

}  // namespace

extern "C" {

uint32_t YUV2YUV_Fast(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                      uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                      const EngineContext* context) {
  return Dispatch({kYuv, kYuv}, ChooseYuvToYuv, rect, dstPitches, srcPitches, dstPlanes, srcPlanes,
                  context);
}

uint32_t I420_To_I422_Fast(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                           uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                           const EngineContext* context) {
  return Dispatch({kPlanar, kPlanar}, ChooseI420ToI422, rect, dstPitches, srcPitches, dstPlanes,
                  srcPlanes, context);
}

}  // extern "C"
