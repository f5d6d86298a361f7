// Planar and semi-planar YUV family.
#include "kernels/table/kernels.h"

using namespace kestrel;

namespace {

// What the second dispatcher's decisions depend on.
struct Question {
  explicit Question(const EngineContext& c)
      : source(c.srcFormat.code),
        destination(c.dstFormat.code),
        unit(c.stepX == 0x10000 && c.stepY == 0x10000),
        bilinear(c.bilinear != 0),
        swap(c.swapXY != 0),
        mirrorX(c.mirrorX != 0),
        mirrorY(c.mirrorY != 0),
        blockMode(c.blockMode) {}

  uint32_t source, destination;
  bool unit, bilinear, swap, mirrorX, mirrorY;
  uint32_t blockMode;

  bool untransformed() const { return !swap && !mirrorX && !mirrorY; }
  bool isPair(uint32_t code) const { return source == code && destination == code; }
};

constexpr int kDeclined = -1;

// Nearest jobs go to the block 3 kernel, bilinear ones to the block 2 kernel, no others to either.
int ScaledPair(const Question& q, int nearest, int bilinear) {
  if (!q.untransformed()) return kDeclined;
  if (q.blockMode == 3 && !q.bilinear) return nearest;
  if (q.blockMode == 2 && q.bilinear) return bilinear;
  return kDeclined;
}

int ChooseI420ToI422(const Question& q) {
  if (q.source == CODE_I420 && (q.destination == CODE_I440 || q.destination == CODE_I422)) {
    const bool turned = q.mirrorX && q.swap;
    if (q.unit) return turned ? kernel_id::I420_To_I422_Fast_NORESAMPLE_90 : kDeclined;
    const bool takes = !q.bilinear && (turned || q.untransformed());
    return takes ? kernel_id::I420_To_I422_Fast_90 : kDeclined;
  }
  if (q.isPair(CODE_I420) && !q.unit) {
    return ScaledPair(q, kernel_id::I420_To_I420_REAMPLE_NOROTATE_Fast,
                      kernel_id::I420_To_I420_REAMPLE_NOROTATE_BILINEAR_Fast);
  }
  if (q.isPair(CODE_I422) && !q.unit) {
    return ScaledPair(q, kernel_id::I422H_To_I422H_REAMPLE_NOROTATE_Fast,
                      kernel_id::I422H_To_I422H_REAMPLE_NOROTATE_BILINEAR_Fast);
  }
  if (q.isPair(CODE_I440) && !q.unit) {
    return ScaledPair(q, kernel_id::I422V_To_I422V_REAMPLE_NOROTATE_Fast,
                      kernel_id::I422V_To_I422V_REAMPLE_BILINEAR_NOROTATE_Fast);
  }
  if (q.isPair(CODE_I444) && !q.unit) {
    return ScaledPair(q, kernel_id::I444_To_I444_REAMPLE_NOROTATE_Fast, kDeclined);
  }
  const bool equal = q.source == q.destination && q.source >= CODE_I420 && q.source <= CODE_I444;
  return equal ? kernel_id::YUV_To_YUV_NOREAMPLE_ROTATE_Fast : kDeclined;
}

}  // namespace

extern "C" {

// The first of the table's first 58 lines that accepts the job. Levels are never changed here.
uint32_t YUV2YUV_Fast(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                      uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                      const EngineContext* context) {
  if (context == nullptr) return KESTREL_BAD_ARGUMENT;
  if (context->needsLevelTable != 0 || context->pathKind != PATH_YUV_TO_YUV) {
    return KESTREL_UNSUPPORTED;
  }
  for (int id = kernel_id::I422_TO_I420_NORESAMPLE_4x4;
       id <= kernel_id::YUYVtoYUYVFast_N_RESAMPLE_R0_4x4; ++id) {
    if (RunKernel(kKernels[id], rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context) ==
        KESTREL_OK) {
      return KESTREL_OK;
    }
  }
  return KESTREL_UNSUPPORTED;
}

// Never looks at levels: a job that changes them is taken, and its values are copied as they are.
uint32_t I420_To_I422_Fast(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                           uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                           const EngineContext* context) {
  if (context == nullptr) return KESTREL_BAD_ARGUMENT;
  if (context->pathKind != PATH_YUV_TO_YUV) return KESTREL_UNSUPPORTED;
  const int id = ChooseI420ToI422(Question(*context));
  if (id == kDeclined) return KESTREL_UNSUPPORTED;
  return RunKernel(kKernels[id], rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);
}

}  // extern "C"
