// 24-bit RGB family. "Low" is red in the low byte (bytes R, G, B), "high" is bytes B, G, R.
#include "kernels/table/choice.h"

using namespace kestrel;

namespace {

namespace id = kestrel::kernel_id;

int ChooseFromPlanar(const Question& q) {
  if (q.destinationOrder == kRgbBytes) {
    if (q.unit) return id::YUV2RGBFast_NORESAMPLE_B8G8R8;
    return q.bilinear ? id::YUV2RGBFast_B8G8R8 : id::YUV2RGBFast_B8G8R8_Nearest;
  }
  if (q.unit) return id::YUV2RGBFast_NORESAMPLE;
  return q.bilinear ? id::YUV2RGBFast : id::YUV2RGBFast_R8G8B8_Nearest;
}

int ChooseNearestBlock(const Question& q) {
  if (q.mirrorX) return id::RGB2RGBFast_RGB888_N_RESIZE_4x4;
  if (q.swap) {
    return q.mirrorY ? id::RGB2RGBFast_RGB888_N_RESIZE_4x4_R270
                     : id::RGB2RGBFast_RGB888_N_RESIZE_4x4_SwapXY;
  }
  return q.mirrorY ? id::RGB2RGBFast_RGB888_N_RESIZE_4x4_VERTICAL
                   : id::RGB2RGBFast_RGB888_N_RESIZE_4x4_R0;
}

int ChooseFromRedLow(const Question& q) {
  if (q.unit) return kDeclined;
  if (q.destinationOrder == kBgrBytes) {
    const bool taken = !q.bilinear && q.blockMode == 3;
    return taken ? id::BGR2RGBFast_RGB888_N_RESIZE_4x4 : kDeclined;
  }
  if (q.destinationOrder != kRgbBytes) return kDeclined;
  if (q.bilinear) return q.blockMode == 2 ? id::RGB2RGBFast_RGB888_N_RESIZE_2x2 : kDeclined;
  return q.blockMode == 3 ? id::RGB2RGBFast_RGB888_N_RESIZE_4x4 : id::RGB2RGBFast_RGB888_N_RESIZE;
}

int ChooseFromRgb24(const Question& q) {
  if (q.sourceOrder == kRgbBytes) return ChooseFromRedLow(q);
  if (q.destinationOrder == kRgbBytes) return kDeclined;
  if (q.unit) return id::RGB2RGBFast_NORESAMPLE;
  if (q.bilinear) {
    return q.blockMode == 2 ? id::RGB2RGBFast_RGB888_N_RESIZE_2x2 : id::RGB2RGBFast;
  }
  return q.blockMode == 3 ? ChooseNearestBlock(q) : id::RGB2RGBFast_RGB888_N_RESIZE;
}

int ChooseToPlanar(const Question& q) {
  if (q.sourceOrder == kRgbBytes) return kDeclined;
  if (!q.unit) return q.bilinear ? id::RGB2YUVFast : kDeclined;
  // The 2x2 member stands behind this same test, so that no job reaches it: a 2x2 engine runs the
  // plain member.
  const bool blocked = q.untransformed() && q.blockMode == 3 && q.to(kI420);
  return blocked ? id::RGB2YUVFast_NORESAMPLE_NOROTATE_R8G8B8_4x4 : id::RGB2YUVFast_NORESAMPLE;
}

int ChooseRgb24(const Question& q) {
  if (q.fromTo(kPlanar, kRgb24)) return ChooseFromPlanar(q);
  if (q.fromTo(kRgb24, kRgb24)) return ChooseFromRgb24(q);
  if (q.fromTo(kRgb24, kPlanar)) return ChooseToPlanar(q);
  if (q.fromTo(kRgb32, kRgb24)) {
    const bool taken = q.orders(kBgrBytes) && q.unit;
    return taken ? id::RGB2RGBFast_RGB32_TO_RGB24_NORESAMPLE : kDeclined;
  }
  const bool taken = q.fromTo(kNv21, kRgb24) && q.destinationOrder != kRgbBytes && q.unit &&
                     !q.mirrorX && !q.swap && !q.dither;
  return taken ? id::NV21_To_RGB888_NoResample_1x1 : kDeclined;
}

}  // namespace

extern "C" uint32_t ANY_ANY_C_FAST_R8G8B8(const MRECT* rect, const int32_t* dstPitches,
                                          const int32_t* srcPitches, uint8_t* const* dstPlanes,
                                          const uint8_t* const* srcPlanes,
                                          const EngineContext* context) {
  return Dispatch({kPlanar | kNv21 | kRgb24 | kRgb32, kPlanar | kRgb24}, ChooseRgb24, rect,
                  dstPitches, srcPitches, dstPlanes, srcPlanes, context);
}
