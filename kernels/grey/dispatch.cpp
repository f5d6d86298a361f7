// Grey family.
#include "kernels/table/choice.h"

using namespace kestrel;

namespace {

namespace id = kestrel::kernel_id;

int ChooseGrey(const Question& q) {
  const bool plain = !q.mirrorX && !q.swap;
  if (q.fromTo(kGrey, kGrey)) {
    if (q.unit) return id::Gray2Gray_C_NORESAMPLE_FAST;
    if (q.bilinear) {
      if (plain && q.blockMode == 3) return id::Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_4X4_FAST;
      if (plain && q.blockMode == 2) return id::Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST;
      return id::Gray_To_Gray_BILINEAR_Fast;
    }
    return plain && q.blockMode == 3 ? id::Gray2Gray_C_RESAMPLE_NOROTATE_FAST
                                     : id::Gray_To_Gray_Nearest_Fast;
  }
  // The luma plane of a planar image, in the one case that a block kernel serves.
  const bool taken = q.fromTo(kPlanar, kGrey) && q.bilinear && plain && q.blockMode == 2;
  return taken ? id::Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST : kDeclined;
}

}  // namespace

extern "C" uint32_t Gray2Gray_C_FAST(const MRECT* rect, const int32_t* dstPitches,
                                     const int32_t* srcPitches, uint8_t* const* dstPlanes,
                                     const uint8_t* const* srcPlanes,
                                     const EngineContext* context) {
  return Dispatch({kGrey | kPlanar, kGrey}, ChooseGrey, rect, dstPitches, srcPitches, dstPlanes,
                  srcPlanes, context);
}
