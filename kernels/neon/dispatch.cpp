// Vector kernels for the common camera conversions.
#include "kernels/table/choice.h"

using namespace kestrel;

namespace {

namespace id = kestrel::kernel_id;

// The members for one pair of sides, at 1:1 and bilinear. No two lines take the same pair.
struct Members {
  uint32_t sources, destinations;
  int unit, bilinear;
};

constexpr Members kMembers[] = {
    {kRgb32, kNv21, id::NEC_BGR32toNVXX_NoResize, id::NEC_BGR32toNV21_Fast_BilNear},
    {kRgb32, kNv12, id::NEC_BGR32toNVXX_NoResize, kDeclined},
    {kRgb24, kSemiPlanar, id::NEC_BGR24toNVXX_NoResize, kDeclined},
    {kRgb32, kI420, id::NEC_BGR32toI420_NoResize, id::NEC_BGR32toI420_BilNear},
    {kRgb32, kI422, id::NEC_BGR32toI422H_NoResize, kDeclined},
    {kRgb32, kI440, id::NEC_BGR32toI422V_NoResize, kDeclined},
    {kRgb32, kI444, id::NEC_BGR32toI444_NoResize, kDeclined},
    {kRgb32, kYuv444, id::NEC_BGR32toYUV_NoResize, kDeclined},
    {kNv21, kI420, kDeclined, id::NEC_NV21toI420_Fast_BilNear},
    {kI420 | kI422, kNv21, kDeclined, id::NEC_I4XXtoNV21_Fast_BilNear},
    {kSemiPlanar, kRgb32, id::NEC_NV21YCbCr601toBGR32_NoResize, id::NEC_NV21toBGR32_Fast_BilNear},
    {kNv21, kRgb24, id::NEC_NV21toRGB24_NoResize, id::NEC_NV21toBGR24_Fast_BilNear},
    {kNv12, kRgb24, id::NEC_NV12toRGB24_NoResize, kDeclined},
    {kI420, kRgb32, id::NEC_I420toBGR32_NoResize, id::NEC_I420toBGR32_BilNear},
    {kI422, kRgb32, id::NEC_I422HtoBGR32_NoResize, id::NEC_I422HtoBGR32_BilNear},
    {kI440, kRgb32, id::NEC_I422VtoBGR32_NoResize, id::NEC_I422VtoBGR32_BilNear},
    {kI444, kRgb32, id::NEC_I444toBGR32_NoResize, id::NEC_I444toBGR32_BilNear},
    {kYuv444, kRgb32, id::NEC_YUVtoBGR32_NoResize, kDeclined},
    {kYuyv, kRgb32, id::NEC_YUYVtoBGR32_NoResize, kDeclined},
    {kI420, kRgb24, id::NEC_I420toBGR24_NoResize, kDeclined},
    {kI422, kRgb24, id::NEC_I422HtoBGR24_NoResize, kDeclined},
    {kI440, kRgb24, id::NEC_I422VtoBGR24_NoResize, kDeclined},
    {kI444, kRgb24, id::NEC_I444toBGR24_NoResize, kDeclined},
    {kRgb24, kI420, id::NEC_BGR24toI420_NoResize, kDeclined},
};

int ChooseRgb16(const Question& q) {
  if (q.destinationOrder == kRedHigh) return id::NEC_NVtoRGB16_NoResize;
  if (q.destinationOrder == kRedLow) return id::NEC_NVtoBGR16_NoResize;
  return kDeclined;
}

// Neither dithering nor adjustments are looked at: the members ignore both.
int ChooseNeon(const Question& q) {
  const EngineContext& c = q.engine;
  const bool unit = c.unitStep != 0;
  const bool bilinear = c.params.resampleFlags == MPP_BILINEAR && !unit;
  const bool scaleTaken = unit || bilinear;
  if (q.blockMode != 3 || !scaleTaken || YuvSide(c).colourStandard != CS_BT601_FULL) {
    return kDeclined;
  }
  if (c.params.transformCode == 3) {  // the one transformed job that the family takes
    return bilinear && q.fromTo(kNv21, kRgb32) ? id::NEC_NV21toBGR32_Fast_BilNear_R90 : kDeclined;
  }
  if (c.params.transformCode != 0) return kDeclined;
  if (unit && q.fromTo(kSemiPlanar, kRgb16)) return ChooseRgb16(q);
  for (const Members& m : kMembers) {
    if (q.fromTo(m.sources, m.destinations)) return unit ? m.unit : m.bilinear;
  }
  return kDeclined;
}

}  // namespace

extern "C" {

uint32_t NEC_ALL(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                 uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                 const EngineContext* context) {
  return Dispatch({kAnyLayout, kAnyLayout}, ChooseNeon, rect, dstPitches, srcPitches, dstPlanes,
                  srcPlanes, context);
}

void NEC_DebugWin32() {}

}  // extern "C"
