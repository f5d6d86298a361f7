// Grey family.
#include "kernels/table/kernels.h"

using namespace kestrel;

namespace {

constexpr int kDeclined = -1;

int ChooseGrey(const EngineContext& c) {
  const bool plain = c.mirrorX == 0 && c.swapXY == 0;
  if (c.srcFormat.code == CODE_GRAY8 && c.dstFormat.code == CODE_GRAY8) {
    if (c.stepX == 0x10000 && c.stepY == c.stepX) return kernel_id::Gray2Gray_C_NORESAMPLE_FAST;
    if (c.bilinear != 0) {
      if (plain && c.blockMode == 3) {
        return kernel_id::Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_4X4_FAST;
      }
      if (plain && c.blockMode == 2) {
        return kernel_id::Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST;
      }
      return kernel_id::Gray_To_Gray_BILINEAR_Fast;
    }
    return plain && c.blockMode == 3 ? kernel_id::Gray2Gray_C_RESAMPLE_NOROTATE_FAST
                                     : kernel_id::Gray_To_Gray_Nearest_Fast;
  }
  // The luma plane of a planar image, in the one case that a block kernel serves.
  const bool planar = c.srcFormat.code >= CODE_I420 && c.srcFormat.code <= CODE_I444;
  const bool taken =
      planar && c.dstFormat.code == CODE_GRAY8 && c.bilinear != 0 && plain && c.blockMode == 2;
  return taken ? kernel_id::Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST : kDeclined;
}

}  // namespace

extern "C" uint32_t Gray2Gray_C_FAST(const MRECT* rect, const int32_t* dstPitches,
                                     const int32_t* srcPitches, uint8_t* const* dstPlanes,
                                     const uint8_t* const* srcPlanes,
                                     const EngineContext* context) {
  if (context == nullptr) return KESTREL_BAD_ARGUMENT;
  if (context->pathKind != PATH_YUV_TO_YUV) return KESTREL_UNSUPPORTED;
  const int id = ChooseGrey(*context);
  if (id == kDeclined) return KESTREL_UNSUPPORTED;
  return RunKernel(kKernels[id], rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);
}
