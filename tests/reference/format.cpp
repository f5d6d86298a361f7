#include "tests/reference/format.h"

#include <initializer_list>

namespace reference {
namespace {

constexpr uint32_t kOk = 0;
constexpr uint32_t kUnsupported = 3;

// A field of `bits` ones at `shift`; counts are unsigned words, and one of 32 or more leaves
// nothing.
uint32_t FieldMask(uint32_t bits, uint32_t shift) {
  return shift >= 32 ? 0 : ((uint32_t{1} << bits) - 1) << shift;
}

uint32_t CountBits(uint32_t mask) {
  uint32_t count = 0;
  for (int bit = 0; bit < 32; ++bit) {
    count += (mask >> bit) & 1;
  }
  return count;
}

uint32_t LowestBit(uint32_t mask) {
  for (uint32_t bit = 0; bit < 32; ++bit) {
    if ((mask >> bit) & 1) {
      return bit;
    }
  }
  return 0;
}

void SetRgbSteps(Format* format) {
  format->code = CODE_RGB;
  for (int32_t& step : format->step) {
    step = int32_t(format->bitsPerPixel + 7) / 8;
  }
}

uint32_t DecodeRgb(uint32_t code, Format* format) {
  switch ((code >> 24) & 15) {
    case 5:
      format->bitsPerPixel = 16;
      break;
    case 6:
      format->bitsPerPixel = 24;
      break;
    case 7:
      format->bitsPerPixel = 32;
      break;
    default:
      return kUnsupported;
  }
  const uint32_t red = ((code >> 8) & 15) + 1;
  const uint32_t green = ((code >> 4) & 15) + 1;
  const uint32_t blue = (code & 15) + 1;
  const bool redLowest = (code & 0x1000) != 0;
  const uint32_t spare = code >> 28 == 3 ? format->bitsPerPixel - red - green - blue : 0;

  const uint32_t lowest = redLowest ? red : blue;
  const uint32_t highest = redLowest ? blue : red;
  const uint32_t lowMask = FieldMask(lowest, spare);
  const uint32_t greenMask = FieldMask(green, spare + lowest);
  const uint32_t highMask = FieldMask(highest, spare + lowest + green);
  const uint32_t masks[3] = {redLowest ? lowMask : highMask, greenMask,
                             redLowest ? highMask : lowMask};
  for (int c = 0; c < 3; ++c) {
    format->maskSize[c] = CountBits(masks[c]);
    format->maskPosition[c] = LowestBit(masks[c]);
  }
  SetRgbSteps(format);
  return kOk;
}

uint32_t DecodeIndexed(const MPPFORMAT& record, Format* format) {
  switch (record.format) {
    case FORMAT_INDEX1:
      format->bitsPerPixel = 1;
      break;
    case FORMAT_INDEX4:
      format->bitsPerPixel = 4;
      break;
    case FORMAT_INDEX8:
      format->bitsPerPixel = 8;
      break;
    default:
      return kUnsupported;
  }
  format->palette = record.palette;
  SetRgbSteps(format);
  return kOk;
}

void SetStandard(uint32_t code, Format* format) {
  const uint32_t standards[4] = {CS_BT601_VIDEO, CS_BT601_FULL, CS_BT709_VIDEO, CS_BT709_FULL};
  format->standard = standards[(code >> 12) & 3];
}

void SetChroma(int32_t step, int32_t horizontal, int32_t vertical, Format* format) {
  for (int component : {kU, kV}) {
    format->step[component] = step;
    format->horizontal[component] = horizontal;
    format->vertical[component] = vertical;
  }
}

void SetOffsets(int32_t y, int32_t u, int32_t v, Format* format) {
  format->offset[kY] = y;
  format->offset[kU] = u;
  format->offset[kV] = v;
}

// One plane, groups of two pixels in four bytes.
uint32_t Packed422(uint32_t code, int32_t y, int32_t u, int32_t v, Format* format) {
  format->code = code;
  format->step[kY] = 2;
  SetChroma(4, 2, 1, format);
  SetOffsets(y, u, v, format);
  return kOk;
}

uint32_t Packed444(uint32_t code, int32_t y, int32_t u, int32_t v, Format* format) {
  format->code = code;
  format->step[kY] = 3;
  SetChroma(3, 1, 1, format);
  SetOffsets(y, u, v, format);
  return kOk;
}

uint32_t ThreePlanes(uint32_t code, int32_t chromaStep, int32_t horizontal, int32_t vertical,
                     Format* format) {
  format->code = code;
  format->planeCount = 3;
  SetChroma(chromaStep, horizontal, vertical, format);
  return kOk;
}

uint32_t DecodeYuv(uint32_t code, Format* format) {
  SetStandard(code, format);
  const uint32_t layout = code & ~FORMAT_STANDARD_MASK;
  switch (layout) {
    case FORMAT_YVYU:
      return Packed422(CODE_YVYU, 0, 3, 1, format);
    case FORMAT_YUYV:
      return Packed422(CODE_YUYV, 0, 1, 3, format);
    case FORMAT_UYVY:
      return Packed422(CODE_UYVY, 1, 0, 2, format);
    case FORMAT_VYUY:
      return Packed422(CODE_VYUY, 1, 2, 0, format);
    case FORMAT_YVYU_SWAPPED_LUMA:
      return Packed422(CODE_YVYU_SWAPPED_LUMA, 0, 3, 1, format);
    case FORMAT_YUYV_SWAPPED_LUMA:
      return Packed422(CODE_YUYV_SWAPPED_LUMA, 0, 1, 3, format);
    case FORMAT_UYVY_SWAPPED_LUMA:
      return Packed422(CODE_UYVY_SWAPPED_LUMA, 1, 0, 2, format);
    case FORMAT_VYUY_SWAPPED_LUMA:
      return Packed422(CODE_VYUY_SWAPPED_LUMA, 1, 2, 0, format);
    case FORMAT_YUV444:
      return Packed444(CODE_YUV444, 0, 1, 2, format);
    case FORMAT_YVU444:
      return Packed444(CODE_YVU444, 0, 2, 1, format);
    case FORMAT_UVY444:
      return Packed444(CODE_UVY444, 2, 0, 1, format);
    case FORMAT_VUY444:
      return Packed444(CODE_VUY444, 2, 1, 0, format);
    case FORMAT_I420:
      return ThreePlanes(CODE_I420, 1, 2, 2, format);
    case FORMAT_I422:
      return ThreePlanes(CODE_I422, 1, 2, 1, format);
    case FORMAT_I440:
      return ThreePlanes(CODE_I440, 1, 1, 2, format);
    case FORMAT_I444:
      return ThreePlanes(CODE_I444, 1, 1, 1, format);
    case FORMAT_YV12:
      return ThreePlanes(CODE_YV12, 1, 2, 2, format);
    case FORMAT_YV16:
      return ThreePlanes(CODE_YV16, 1, 2, 1, format);
    case FORMAT_YV440:
      return ThreePlanes(CODE_YV440, 1, 1, 2, format);
    case FORMAT_YV24:
      return ThreePlanes(CODE_YV24, 1, 1, 1, format);
    default:
      break;
  }
  if ((layout & 0x800) == 0 || (layout & 0x500) != 0) {
    return kUnsupported;
  }
  return ThreePlanes(layout & 0x200 ? CODE_YV_ANY : CODE_I_ANY, 1, int32_t((layout >> 4) & 15) + 1,
                     int32_t(layout & 15) + 1, format);
}

uint32_t DecodeGrey(uint32_t code, Format* format) {
  SetStandard(code, format);
  format->code = CODE_GRAY8;
  return ((code >> 24) & 15) == 4 ? kOk : kUnsupported;
}

uint32_t DecodeSemiPlanar(uint32_t code, Format* format) {
  SetStandard(code, format);
  const uint32_t layout = code & ~FORMAT_STANDARD_MASK;
  switch (layout) {
    case FORMAT_NV21:
    case FORMAT_NV12:
      return ThreePlanes(layout, 2, 2, 2, format);
    case FORMAT_NV61:
    case FORMAT_NV16:
      return ThreePlanes(layout, 2, 2, 1, format);
    case FORMAT_YUV_SPECIAL8:
      return Packed422(layout, 0, 2, 3, format);
    case FORMAT_YUV_SPECIAL9:
      format->code = layout;
      format->step[kY] = 4;
      SetChroma(4, 1, 1, format);
      SetOffsets(0, 1, 2, format);
      return kOk;
    default:
      return kUnsupported;
  }
}

}  // namespace

int32_t Format::SpareByte() const {
  return (48 - int32_t(maskPosition[kRed] + maskPosition[kGreen] + maskPosition[kBlue])) / 8;
}

uint32_t DecodeFormat(const MPPFORMAT& record, Format* format) {
  *format = Format();
  switch (record.format >> 28) {
    case 1:
    case 3:
      return DecodeRgb(record.format, format);
    case 4:
      return DecodeIndexed(record, format);
    case 5:
      return DecodeYuv(record.format, format);
    case 6:
      return DecodeGrey(record.format, format);
    case 7:
      return DecodeSemiPlanar(record.format, format);
    default:
      return kUnsupported;
  }
}

}  // namespace reference
