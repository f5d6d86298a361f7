// 16-bit RGB family. Whatever does not have red in its low bits is handled as red in the high ones.
#include "kernels/table/choice.h"

using namespace kestrel;

namespace {

namespace id = kestrel::kernel_id;

int ChoosePlanarToRedLow(const Question& q) {
  if (!q.unit) return q.bilinear ? id::YUV2RGBFast_B5G6R5 : id::YUV2RGBFast_B5G6R5_Nearest;
  if (q.blockMode != 3) return id::YUV2RGBFast_NORESAMPLE_B5G6R5;
  return q.dither ? kDeclined : id::YUV2RGBFast_NORESAMPLE_B5G6R5_4x4;
}

int ChooseFromPlanar(const Question& q) {
  if (q.destinationOrder == kRedLow) return ChoosePlanarToRedLow(q);
  if (q.unit) {
    if (q.blockMode != 3) return id::YUV2RGBFast_NORESAMPLE_R5G6B5;
    return q.dither ? id::YUV2RGBFast_NORESAMPLE_R5G6B5_4x4_Dither
                    : id::YUV2RGBFast_NORESAMPLE_R5G6B5_4x4;
  }
  if (q.bilinear) {
    if (q.dither) return id::YUV2RGBFast_R5G6B5;
    return q.blockMode == 2 && q.untransformed() ? id::YUV2RGBFast_R5G6B5_NODither_2x2
                                                 : id::YUV2RGBFast_R5G6B5_NODither;
  }
  if (q.dither) return kDeclined;
  // A 2x2 member for 4x4 engines, on purpose.
  return q.blockMode == 3 && q.untransformed() ? id::YUV2RGBFast_R5G6B5_Nearest_2x2
                                               : id::YUV2RGBFast_R5G6B5_Nearest;
}

// 270 degrees at 1:1.
int ChooseNv21Turned(const Question& q) {
  if (q.blockMode == 2) {
    return q.dither ? id::NV21_To_RGB565_NoResample_2x2_R270_Dither
                    : id::NV21_To_RGB565_NoResample_2x2_R270;
  }
  return q.blockMode == 3 && !q.dither ? id::NV21_To_RGB565_NoResample_4x4_R270
                                       : id::NV21_TO_RGBFast_R5G6B5_Nearest;
}

int ChooseFromNv21(const Question& q) {
  if (q.destinationOrder == kRedLow) return kDeclined;
  const bool plain = !q.mirrorX && !q.swap;
  if (q.unit) {
    if (plain && q.blockMode == 2) {
      return q.dither ? id::NV21_To_RGB565_NoResample_2x2_Dither
                      : id::NV21_To_RGB565_NoResample_2x2;
    }
    if (plain && !q.dither) return id::NV21_To_RGB565_NoResample_1x1;
    if (q.swap && q.mirrorY && !q.mirrorX) return ChooseNv21Turned(q);
    if (q.swap && q.mirrorY && !q.dither) return id::NV21_To_RGB565_NoResample_1x1_R90AndVertical;
    return id::NV21_TO_RGBFast_R5G6B5_Nearest;
  }
  const EngineContext& c = q.engine;
  const bool scaledBoth = c.stepX != 0x10000 && c.stepY != 0x10000;
  if (scaledBoth && plain && !q.bilinear && !q.dither) return id::NV21_TO_RGBFast_R5G6B5_Nearest;
  // The catch-all: with equal steps the nearest member also serves jobs that ask for blending,
  // dithering or a transform.
  return c.stepX == c.stepY ? id::NV21_TO_RGBFast_R5G6B5_Nearest : kDeclined;
}

// Members named NV21 serve both orders of chroma.
int ChooseFromNv12(const Question& q) {
  if (q.destinationOrder == kRedLow || q.mirrorX || q.swap || q.bilinear || q.dither) {
    return kDeclined;
  }
  if (q.unit) {
    return q.blockMode == 2 ? id::NV21_TO_RGBFast_R5G6B5_NoResample_2x2
                            : id::NV21_TO_RGBFast_R5G6B5_NoResample;
  }
  return q.blockMode == 2 ? id::NV21_TO_RGBFast_R5G6B5_Nearest_2x2
                          : id::NV21_TO_RGBFast_R5G6B5_Nearest;
}

int ChooseFromRgb16(const Question& q) {
  const bool redLow = q.sourceOrder == kRedLow;
  if (redLow != (q.destinationOrder == kRedLow)) return kDeclined;
  if (q.unit) {
    if (redLow) return kDeclined;
    const bool turned = q.mirrorX && q.swap && !q.mirrorY;
    return turned && q.blocked() ? id::RGB2RGBFast_NORESAMPLE_R5G6B5_2x2_R90
                                 : id::RGB2RGBFast_NORESAMPLE_R5G6B5;
  }
  if (q.bilinear) {
    if (q.blockMode == 2) return id::RGB2RGBFast_R5G6B5_BILINAR_RESIZE_2x2;
    return redLow ? kDeclined : id::RGB2RGBFast_R5G6B5;
  }
  return q.blockMode == 3 && q.untransformed() ? id::RGB2RGBFast_R5G6B5_N_RESIZE_4x4
                                               : id::RGB2RGBFast_R5G6B5_N_Resize;
}

int ChooseToPlanar(const Question& q) {
  if (q.sourceOrder == kRedLow) return kDeclined;
  if (!q.unit) return q.bilinear ? id::RGB2YUVFast_R5G6B5 : kDeclined;
  if (q.untransformed() && q.to(kI420)) {
    if (q.blockMode == 3) return id::RGB2YUVFast_NORESAMPLE_NOROTATE_R5G6B5_4x4;
    if (q.blockMode == 2) return id::RGB2YUVFast_NORESAMPLE_NOROTATE_R5G6B5_2x2;
  }
  return id::RGB2YUVFast_NORESAMPLE_R5G6B5;
}

int ChooseToNv12(const Question& q) {
  if (q.sourceOrder == kRedLow || !q.unit || !q.untransformed()) return kDeclined;
  return q.blockMode == 3 ? id::RGB2NV12Fast_NORESAMPLE_NOROTATE_R5G6B5_4x4
                          : id::RGB2NV12Fast_NORESAMPLE_R5G6B5;
}

int ChooseToYuyv(const Question& q) {
  if (!q.unit || !q.untransformed()) return kDeclined;
  if (q.sourceOrder == kRedLow) {
    return q.blockMode == 3 ? id::BGR2YUYVFast_NORESAMPLE_NOROTATE_B5G6R5_4x4
                            : id::BGR2YUYVFast_NORESAMPLE_B5G6R5;
  }
  return q.blockMode == 3 ? id::RGB2YUYVFast_NORESAMPLE_NOROTATE_R5G6B5_4x4
                          : id::RGB2YUYVFast_NORESAMPLE_R5G6B5;
}

int ChooseRgbBytesToRgb16(const Question& q) {
  if (q.unit) return kDeclined;
  if (q.destinationOrder == kRedLow && q.bilinear) {
    return q.blockMode == 2 ? id::RGB888Fast_R5G6B5_Resample_BILINEAR_2x2 : kDeclined;
  }
  if (q.bilinear || q.blockMode != 3) return kDeclined;
  return q.destinationOrder == kRedLow ? id::RGB888Fast_R5G6B5_Resample_4x4
                                       : id::BGR888Fast_R5G6B5_Resample_4x4;
}

int ChooseFromRgb24(const Question& q) {
  if (q.sourceOrder == kRgbBytes) return ChooseRgbBytesToRgb16(q);
  if (q.destinationOrder == kRedLow) return kDeclined;
  if (q.unit) {
    if (!q.untransformed()) return kDeclined;
    return q.dither ? id::RGB888Fast_NORESAMPLE_R5G6B5_Dither : id::RGB888Fast_NORESAMPLE_R5G6B5;
  }
  if (q.bilinear) {
    return q.blockMode == 2 ? id::RGB888Fast_R5G6B5_Resample_BILINEAR_2x2
                            : id::RGB888Fast_R5G6B5_Resample_BILINEAR_1x1;
  }
  if (q.untransformed()) return id::RGB888Fast_R5G6B5;
  return q.blockMode == 3 ? id::RGB888Fast_R5G6B5_Resample_4x4 : id::RGB888Fast_R5G6B5_Resample;
}

int ChooseRgb16(const Question& q) {
  if (q.to(kRgb16)) {
    if (q.from(kPlanar)) return ChooseFromPlanar(q);
    if (q.from(kNv21)) return ChooseFromNv21(q);
    if (q.from(kNv12)) return ChooseFromNv12(q);
    if (q.from(kRgb16)) return ChooseFromRgb16(q);
    return q.from(kRgb24) ? ChooseFromRgb24(q) : kDeclined;
  }
  if (q.fromTo(kRgb16, kPlanar)) return ChooseToPlanar(q);
  if (q.fromTo(kRgb16, kNv12)) return ChooseToNv12(q);
  return q.fromTo(kRgb16, kYuyv) ? ChooseToYuyv(q) : kDeclined;
}

}  // namespace

extern "C" uint32_t ANY_ANY_C_FAST_R5G6B5(const MRECT* rect, const int32_t* dstPitches,
                                          const int32_t* srcPitches, uint8_t* const* dstPlanes,
                                          const uint8_t* const* srcPlanes,
                                          const EngineContext* context) {
  return Dispatch({kPlanar | kSemiPlanar | kRgb16 | kRgb24, kRgb16 | kPlanar | kNv12 | kYuyv},
                  ChooseRgb16, rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);
}
