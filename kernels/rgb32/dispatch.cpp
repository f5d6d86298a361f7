// 32-bit RGB family.
#include "kernels/table/choice.h"

using namespace kestrel;

namespace {

namespace id = kestrel::kernel_id;

// ---- YUV_RGB32_C_FAST ----

struct Choice {
  int kernel;
  bool isFinal;  // otherwise the generic converter draws the region again
};

Choice Final(int kernel) {
  return {kernel, true};
}

Choice DrawnAgain(int kernel) {
  return {kernel, false};
}

int ChoosePlanarToRgbBytes(const Question& q) {
  const bool plainBlocks = q.untransformed() && q.blockMode == 3;
  if (q.unit) {
    return plainBlocks && q.from(kI420) ? id::I420toBGR32_Fast_NORESAMPLE
                                        : id::I420toBGR32_Any_Fast_1x1;
  }
  if (q.bilinear) return id::I420toBGR32_Fast_BilNear;
  return plainBlocks && q.from(kI420) ? id::I420toBGR32_Fast_4x4 : id::I420toBGR32_Any_Fast_1x1;
}

Choice ChooseUnitPlanar(const Question& q, const MRECT& rect) {
  const bool blockedI420 = q.blockMode == 3 && q.from(kI420);
  if (q.mirrorX && q.swap && blockedI420) return DrawnAgain(id::I420toRGB32_Fast_NORESAMPLE_90);
  if (!q.untransformed()) return DrawnAgain(id::I420toRGB32_Any_Fast_1x1);
  if (blockedI420) {
    const bool onEights = ((rect.left | rect.top | rect.right | rect.bottom) & 7) == 0;
    return Final(onEights ? id::I420toRGB32_Fast_NORESAMPLE : id::I420toRGB32_Any_Fast_1x1);
  }
  return DrawnAgain(q.from(kI420) ? id::I420toRGB32_Fast_NORESAMPLE_1x1
                                  : id::I420toRGB32_Any_Fast_1x1);
}

Choice ChooseScaledPlanar(const Question& q) {
  const bool nearestI420 = !q.bilinear && q.from(kI420);
  if (q.untransformed()) {
    if (nearestI420) {
      return Final(q.blockMode == 3 ? id::I420toRGB32_Fast : id::I420toRGB32_Fast_1x1);
    }
    const bool blocked = q.bilinear && q.engine.params.passMode == 3 && q.from(kI420);
    return Final(blocked ? id::I420toRGB32_R0_Fast_BilNear_4x4 : id::I420toRGB32_Fast_BilNear);
  }
  if (q.mirrorX && q.swap) {
    if (!nearestI420) return DrawnAgain(id::I420toRGB32_Fast_BilNear);
    return DrawnAgain(q.blockMode == 3 ? id::I420toRGB32_Fast_90 : id::I420toRGB32_Fast_90_1x1);
  }
  return DrawnAgain(q.bilinear ? id::I420toRGB32_Fast_BilNear : id::I420toRGB32_Any_Fast_1x1);
}

Choice ChooseFromPlanar(const Question& q, const MRECT& rect) {
  if (q.destinationOrder == kRgbBytes) return Final(ChoosePlanarToRgbBytes(q));
  return q.unit ? ChooseUnitPlanar(q, rect) : ChooseScaledPlanar(q);
}

int ChooseNv21ToRgbBytes(const Question& q) {
  if (q.mirrorX && q.swap && !q.mirrorY) {
    return q.bilinear ? id::NV21toBGR32_Fast_BilNear_R90 : id::NV21toBGR32_Fast_NoResize_R90_2x2;
  }
  return q.bilinear && q.untransformed() ? id::NV21toBGR32_Fast_BilNear : kDeclined;
}

int ChooseFromYv12(const Question& q) {
  if (q.destinationOrder == kRgbBytes || !q.unit) return kDeclined;
  if (!q.untransformed()) return id::I420toRGB32_Any_Fast_1x1;
  return q.engine.params.passMode == 3 ? id::YV12toRGB32_Fast_NORESAMPLE_4x4
                                       : id::YV12toRGB32_Fast_NORESAMPLE_1x1;
}

// I422HtoBGR32_Fast_4x4 stands behind the other sources' tests, so that no job reaches it.
int ChooseToRgb32(const Question& q) {
  if (q.from(kYv12)) return ChooseFromYv12(q);
  if (q.from(kRgb32)) {
    const bool taken = q.engine.params.passMode == 3 && !q.bilinear && !q.unit;
    return taken && !q.orders(kRgbBytes) ? id::RGB2RGBFast_RGBA_N_RESIZE_4x4 : kDeclined;
  }
  if (q.destinationOrder != kRgbBytes) return kDeclined;
  if (q.from(kGrey)) return id::GreytoBGR32_Fast_BilNear;
  if (q.from(kNv21)) return ChooseNv21ToRgbBytes(q);
  const bool plainNearest = !q.bilinear && q.untransformed();
  return q.from(kI444) && plainNearest ? id::I444toRGB32_Any_Fast_1x1 : kDeclined;
}

// ---- YUYV_RGB32_FAST ----

// Layouts that this dispatcher never takes.
bool IsSpareFirst(uint32_t order) {
  return order == kSpareBgrBytes || order == kSpareRgbBytes;
}

int ChooseFromYuyv(const Question& q) {
  if (IsSpareFirst(q.destinationOrder) || !q.unit) return kDeclined;
  if (q.destinationOrder == kRgbBytes) return id::YUYVtoBGR32_Fast_NORESAMPLE;
  return q.untransformed() && q.blockMode == 3 ? id::YUYVtoRGB32_Fast_NORESAMPLE : kDeclined;
}

int ChooseToYuyv(const Question& q) {
  if (IsSpareFirst(q.sourceOrder) || !q.unit || q.blockMode != 3) return kDeclined;
  if (q.sourceOrder == kRgbBytes) {
    if (q.swap || q.mirrorY) return kDeclined;
    return q.mirrorX ? id::BGR32toYUYV_Fast_NORESAMPLE_HFlip : id::BGR32toYUYV_Fast_NORESAMPLE;
  }
  if (q.mirrorX && q.swap) return id::RGB32toYUYV_Fast_NORESAMPLE_90;
  if (q.mirrorX && q.mirrorY) return id::RGB32toYUYV_Fast_NORESAMPLE_180;
  if (q.swap && q.mirrorY) return id::RGB32toYUYV_Fast_NORESAMPLE_270;
  return q.untransformed() ? id::RGB32toYUYV_Fast_NORESAMPLE : kDeclined;
}

int ChooseToSemiPlanar(const Question& q) {
  if (q.sourceOrder == kBgrBytes || !q.unit || !q.untransformed()) return kDeclined;
  if (q.to(kNv12)) {
    return q.blockMode == 3 ? id::RGB32toNV12_Fast_NORESAMPLE_4x4 : id::RGB32toNV12_Fast_NORESAMPLE;
  }
  return q.blockMode == 3 ? id::RGB32toNV21_Fast_NORESAMPLE_4x4 : id::RGB32toNV21_Fast_NORESAMPLE;
}

int ChooseYuyv(const Question& q) {
  if (q.fromTo(kYuyv, kRgb32)) return ChooseFromYuyv(q);
  if (q.fromTo(kRgb32, kYuyv)) return ChooseToYuyv(q);
  return q.fromTo(kRgb32, kSemiPlanar) ? ChooseToSemiPlanar(q) : kDeclined;
}

// ---- ANY_ANY_C_FAST_RGB32 ----

int ChooseRgb24ToRgb32(const Question& q) {
  const bool turned = q.swap && q.mirrorX && !q.mirrorY;
  if (q.unit) {
    if (q.untransformed()) return id::RGB2RGBFast_RGB24_To_RGB32_NO_NO_AlphaSpecial;
    if (!turned) return kDeclined;
    return q.blockMode == 2 ? id::RGB2RGBFast_RGB24_TO_RGB32__BILINEARN_RESIZE_2x2
                            : id::RGB2RGBFast_RGB24_TO_RGB32__NoResample;
  }
  if (q.bilinear) {
    return turned && q.blockMode == 2 ? id::RGB2RGBFast_RGB24_TO_RGB32__BILINEARN_RESIZE_2x2
                                      : id::RGB2RGBFast_RGB24_TO_RGB32__BILINEARN_RESIZE_1x1;
  }
  const bool taken = q.orders(kRgbBytes) && q.blockMode == 3;
  return taken ? id::RGB2RGBFast_BGR24_TO_BGR32_N_RESIZE_4x4 : kDeclined;
}

int ChooseRgb32ToRgb24(const Question& q) {
  if (q.bilinear) {
    if (!q.orders(kBgrBytes)) return kDeclined;
    return q.blocked() ? id::RGB2RGBFast_RGB32_TO_RGB24_N_RESIZE_2x2
                       : id::RGB2RGBFast_RGB32_TO_RGB24_N_RESIZE_1x1;
  }
  const bool taken = q.orders(kRgbBytes) && q.blockMode == 3;
  return taken ? id::RGB2RGBFast_BGR32_TO_BGR24_N_RESIZE_4x4 : kDeclined;
}

int ChooseRgb32ToRgb32(const Question& q) {
  if (q.bilinear) {
    if (!q.orders(kBgrBytes)) return kDeclined;
    return q.blocked() ? id::RGB2RGBFast_RGB32_TO_RGB32__BILINEARN_RESIZE_4x4
                       : id::RGB2RGBFast_RGB32_TO_RGB32__BILINEARN_RESIZE_1x1;
  }
  // Also where only the place of blue differs: the branch for that case could never be taken.
  if (q.sourceOrder != q.destinationOrder) return kDeclined;
  if (q.destinationOrder != kRgbBytes) return id::RGB2RGBFast_RGB32_N_RESIZE;
  if (q.blockMode != 3) return id::RGB2RGBFast_BGR32_N_RESIZE_1x1;
  return q.untransformed() ? id::RGB2RGBFast_BGR32_N_RESIZE_4x4_R0
                           : id::RGB2RGBFast_BGR32_N_RESIZE_4x4;
}

int ChooseFromI444(const Question& q) {
  if (!q.untransformed()) return kDeclined;
  if (q.unit) return id::I444_TO_RGB32Fast_NORESAMPLE;
  const bool taken = q.bilinear && q.destinationOrder == kRgbBytes;
  return taken ? id::I444toBGR32_Fast_BilNear : kDeclined;
}

// At 1:1 a member's name follows the destination's bytes, not the source's chroma: all of them
// serve both sources.
int ChooseFromSemiPlanar(const Question& q) {
  if (!q.untransformed()) return kDeclined;
  if (q.unit) {
    if (q.destinationOrder == kBgrBytes) {
      return q.blocked() ? id::NV12_TO_RGB32Fast_NORESAMPLE_4x4 : id::NV12_TO_RGB32Fast_NORESAMPLE;
    }
    if (q.destinationOrder != kRgbBytes) return kDeclined;
    return q.blocked() ? id::NV21_TO_RGB32Fast_NORESAMPLE_4x4 : id::NV21_TO_RGB32Fast_NORESAMPLE;
  }
  // Equal steps are declined, on purpose.
  const bool taken = q.engine.stepX != q.engine.stepY && q.bilinear;
  return taken && q.destinationOrder == kBgrBytes ? id::NV21toRGB32_Fast_BilNear : kDeclined;
}

int ChooseAny(const Question& q) {
  if (q.fromTo(kRgb24, kRgb32)) return ChooseRgb24ToRgb32(q);
  if (q.fromTo(kRgb32, kRgb24)) return ChooseRgb32ToRgb24(q);
  if (q.fromTo(kRgb32, kRgb32)) return ChooseRgb32ToRgb32(q);
  if (q.fromTo(kI444, kRgb32)) return ChooseFromI444(q);
  return q.fromTo(kSemiPlanar, kRgb32) ? ChooseFromSemiPlanar(q) : kDeclined;
}

}  // namespace

extern "C" {

// Of the members for I420 and 4:2:2 in other orders than R, G, B, some do not end the search: they
// draw the region, the answer is 3 all the same, and no later dispatcher takes the job, so that the
// generic converter draws the region again.
uint32_t YUV_RGB32_C_FAST(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                          uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                          const EngineContext* context) {
  if (!IsComplete(rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context)) {
    return KESTREL_BAD_ARGUMENT;
  }
  if ((context->dstLayoutBit & kRgb32) == 0) return KESTREL_UNSUPPORTED;
  const Question q(*context);
  const Choice choice = q.from(kI420Or422) ? ChooseFromPlanar(q, *rect) : Final(ChooseToRgb32(q));
  if (choice.kernel == kDeclined) return KESTREL_UNSUPPORTED;
  const uint32_t answer = RunKernel(kKernels[choice.kernel], rect, dstPitches, srcPitches,
                                    dstPlanes, srcPlanes, context);
  return choice.isFinal ? answer : KESTREL_UNSUPPORTED;
}

uint32_t YUYV_RGB32_FAST(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                         uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                         const EngineContext* context) {
  return Dispatch({kYuyv | kRgb32, kRgb32 | kYuyv | kSemiPlanar}, ChooseYuyv, rect, dstPitches,
                  srcPitches, dstPlanes, srcPlanes, context);
}

uint32_t ANY_ANY_C_FAST_RGB32(const MRECT* rect, const int32_t* dstPitches,
                              const int32_t* srcPitches, uint8_t* const* dstPlanes,
                              const uint8_t* const* srcPlanes, const EngineContext* context) {
  return Dispatch({kRgb24 | kRgb32 | kI444 | kSemiPlanar, kRgb24 | kRgb32}, ChooseAny, rect,
                  dstPitches, srcPitches, dstPlanes, srcPlanes, context);
}

}  // extern "C"
