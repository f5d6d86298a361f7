// Decoding of public format codes, and where the samples of each layout lie.
#include "engine/postprocess.h"

namespace {

constexpr uint32_t Family(uint32_t code) {
  return code >> 28;
}

uint32_t ColourStandard(uint32_t publicCode) {
  switch (publicCode & FORMAT_STANDARD_MASK) {
    case FORMAT_BT601_FULL:
      return CS_BT601_FULL;
    case FORMAT_BT709_VIDEO:
      return CS_BT709_VIDEO;
    case FORMAT_BT709_FULL:
      return CS_BT709_FULL;
    default:
      return CS_BT601_VIDEO;
  }
}

// `bits` ones shifted up by `shift`; nothing is left of a mask shifted by a whole word.
uint32_t ChannelMask(uint32_t bits, uint32_t shift) {
  return shift >= 32 ? 0 : ((1u << bits) - 1) << shift;
}

uint32_t RgbBitsPerPixel(uint32_t code) {
  switch ((code >> 24) & 0xF) {
    case 5:
      return 16;
    case 6:
      return 24;
    case 7:
      return 32;
    default:
      return 0;
  }
}

uint32_t ParseRgb(FormatDesc* desc, uint32_t code) {
  const uint32_t bitsPerPixel = RgbBitsPerPixel(code);
  if (bitsPerPixel == 0) return KESTREL_UNSUPPORTED;
  const uint32_t red = ((code >> 8) & 0xF) + 1;
  const uint32_t green = ((code >> 4) & 0xF) + 1;
  const uint32_t blue = (code & 0xF) + 1;
  const bool redLowest = (code & 0x1000) != 0;
  // Family 3 packs the channels against the top of the word. More bits than the pixel has make the
  // start wrap far beyond 31, which empties the masks.
  const uint32_t start = Family(code) == 3 ? bitsPerPixel - red - green - blue : 0;
  desc->code = CODE_RGB;
  desc->colourStandard = bitsPerPixel;
  auto& masks = desc->layout.rgb;
  if (redLowest) {
    masks.redMask = ChannelMask(red, start);
    masks.greenMask = ChannelMask(green, start + red);
    masks.blueMask = ChannelMask(blue, start + red + green);
  } else {
    masks.blueMask = ChannelMask(blue, start);
    masks.greenMask = ChannelMask(green, start + blue);
    masks.redMask = ChannelMask(red, start + blue + green);
  }
  return KESTREL_OK;
}

uint32_t ParseIndexed(FormatDesc* desc, const MPPFORMAT& record) {
  switch (record.format) {
    case FORMAT_INDEX1:
      desc->colourStandard = 1;
      break;
    case FORMAT_INDEX4:
      desc->colourStandard = 4;
      break;
    case FORMAT_INDEX8:
      desc->colourStandard = 8;
      break;
    default:
      return KESTREL_UNSUPPORTED;
  }
  desc->code = CODE_RGB;
  desc->palette = record.palette;
  desc->layout.rgb.paletteWord = uint32_t(uintptr_t(record.palette));
  return KESTREL_OK;
}

// Internal code of a packed or planar YUV code without its standard bits; 0 for an unknown one.
uint32_t YuvCode(uint32_t code) {
  switch (code) {
    case FORMAT_YUYV:
      return CODE_YUYV;
    case FORMAT_YVYU:
      return CODE_YVYU;
    case FORMAT_UYVY:
      return CODE_UYVY;
    case FORMAT_VYUY:
      return CODE_VYUY;
    case FORMAT_YUYV_SWAPPED_LUMA:
      return CODE_YUYV_SWAPPED_LUMA;
    case FORMAT_YVYU_SWAPPED_LUMA:
      return CODE_YVYU_SWAPPED_LUMA;
    case FORMAT_UYVY_SWAPPED_LUMA:
      return CODE_UYVY_SWAPPED_LUMA;
    case FORMAT_VYUY_SWAPPED_LUMA:
      return CODE_VYUY_SWAPPED_LUMA;
    case FORMAT_YUV444:
      return CODE_YUV444;
    case FORMAT_YVU444:
      return CODE_YVU444;
    case FORMAT_UVY444:
      return CODE_UVY444;
    case FORMAT_VUY444:
      return CODE_VUY444;
    case FORMAT_I420:
      return CODE_I420;
    case FORMAT_I422:
      return CODE_I422;
    case FORMAT_I440:
      return CODE_I440;
    case FORMAT_I444:
      return CODE_I444;
    case FORMAT_YV12:
      return CODE_YV12;
    case FORMAT_YV440:
      return CODE_YV440;
    case FORMAT_YV16:
      return CODE_YV16;
    case FORMAT_YV24:
      return CODE_YV24;
    default:
      break;
  }
  const bool planar = (code & 0x800) != 0 && (code & 0x500) == 0;
  if (!planar) return 0;
  return (code & 0x200) != 0 ? CODE_YV_ANY : CODE_I_ANY;
}

void SetSubsampling(FormatDesc* desc, uint32_t horizontal, uint32_t vertical) {
  uint32_t* factors = desc->layout.subsample;
  factors[0] = factors[3] = 1;
  factors[1] = factors[2] = horizontal;
  factors[4] = factors[5] = vertical;
}

uint32_t ParseYuv(FormatDesc* desc, uint32_t code) {
  desc->colourStandard = ColourStandard(code);
  SetSubsampling(desc, ((code >> 4) & 0xF) + 1, (code & 0xF) + 1);
  const uint32_t internal = YuvCode(code & ~FORMAT_STANDARD_MASK);
  if (internal == 0) return KESTREL_UNSUPPORTED;
  desc->code = internal;
  return KESTREL_OK;
}

uint32_t ParseGrey(FormatDesc* desc, uint32_t code) {
  desc->code = CODE_GRAY8;
  desc->colourStandard = ColourStandard(code);
  return ((code >> 24) & 0xF) == 4 ? KESTREL_OK : KESTREL_UNSUPPORTED;
}

uint32_t ParseSemiPlanar(FormatDesc* desc, uint32_t code) {
  const uint32_t internal = code & ~FORMAT_STANDARD_MASK;
  desc->colourStandard = ColourStandard(code);
  switch (internal) {
    case CODE_NV21:
    case CODE_NV12:
      SetSubsampling(desc, 2, 2);
      break;
    case CODE_NV61:
    case CODE_NV16:
      SetSubsampling(desc, 2, 1);
      break;
    case CODE_YUV_SPECIAL8:
    case CODE_YUV_SPECIAL9:
      break;
    default:
      return KESTREL_UNSUPPORTED;
  }
  desc->code = internal;
  return KESTREL_OK;
}

// Where the samples of a layout lie. Factor 0 stands for the descriptor's own subsampling.
struct LayoutRow {
  uint32_t code;
  enum Kind : uint8_t { kPacked, kPlanar, kGrey } kind;
  uint8_t bitsPerPixel;
  uint8_t lumaStep, chromaStep;
  uint8_t yOffset, uOffset, vOffset;
  uint8_t horizontal, vertical;
};

constexpr LayoutRow kLayouts[] = {
    {CODE_YVYU, LayoutRow::kPacked, 16, 2, 4, 0, 3, 1, 2, 1},
    {CODE_YUYV, LayoutRow::kPacked, 16, 2, 4, 0, 1, 3, 2, 1},
    {CODE_UYVY, LayoutRow::kPacked, 16, 2, 4, 1, 0, 2, 2, 1},
    {CODE_VYUY, LayoutRow::kPacked, 16, 2, 4, 1, 2, 0, 2, 1},
    {CODE_YVYU_SWAPPED_LUMA, LayoutRow::kPacked, 16, 2, 4, 0, 3, 1, 2, 1},
    {CODE_YUYV_SWAPPED_LUMA, LayoutRow::kPacked, 16, 2, 4, 0, 1, 3, 2, 1},
    {CODE_UYVY_SWAPPED_LUMA, LayoutRow::kPacked, 16, 2, 4, 1, 0, 2, 2, 1},
    {CODE_VYUY_SWAPPED_LUMA, LayoutRow::kPacked, 16, 2, 4, 1, 2, 0, 2, 1},
    {CODE_YUV444, LayoutRow::kPacked, 24, 3, 3, 0, 1, 2, 1, 1},
    {CODE_YVU444, LayoutRow::kPacked, 24, 3, 3, 0, 2, 1, 1, 1},
    {CODE_UVY444, LayoutRow::kPacked, 24, 3, 3, 2, 0, 1, 1, 1},
    {CODE_VUY444, LayoutRow::kPacked, 24, 3, 3, 2, 1, 0, 1, 1},
    {CODE_UYV444, LayoutRow::kPacked, 24, 3, 3, 1, 0, 2, 1, 1},
    {CODE_VYU444, LayoutRow::kPacked, 24, 3, 3, 1, 2, 0, 1, 1},
    {CODE_GRAY8, LayoutRow::kGrey, 8, 1, 1, 0, 0, 0, 1, 1},
    {CODE_YV_ANY, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 0, 0},
    {CODE_YV12, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 2, 2},
    {CODE_YV440, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 1, 2},
    {CODE_YV16, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 2, 1},
    {CODE_YV24, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 1, 1},
    {CODE_I_ANY, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 0, 0},
    {CODE_I420, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 2, 2},
    {CODE_I440, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 1, 2},
    {CODE_I422, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 2, 1},
    {CODE_I444, LayoutRow::kPlanar, 8, 1, 1, 0, 0, 0, 1, 1},
    {CODE_NV21, LayoutRow::kPlanar, 8, 1, 2, 0, 0, 0, 2, 2},
    {CODE_NV12, LayoutRow::kPlanar, 8, 1, 2, 0, 0, 0, 2, 2},
    {CODE_NV61, LayoutRow::kPlanar, 8, 1, 2, 0, 0, 0, 2, 1},
    {CODE_NV16, LayoutRow::kPlanar, 8, 1, 2, 0, 0, 0, 2, 1},
    {CODE_YUV_SPECIAL8, LayoutRow::kPacked, 16, 2, 4, 0, 2, 3, 2, 1},
    {CODE_YUV_SPECIAL9, LayoutRow::kPacked, 8, 4, 4, 0, 1, 2, 1, 1},
};

// Codes ascend in the table, so halves of it can be left out.
const LayoutRow* FindLayout(uint32_t code) {
  constexpr uint32_t kRows = sizeof(kLayouts) / sizeof(kLayouts[0]);
  static_assert(kRows < 32, "the steps below reach row 31");
  uint32_t found = 0;
  for (uint32_t step = 16; step > 0; step /= 2) {
    if (found + step < kRows && kLayouts[found + step].code <= code) found += step;
  }
  return kLayouts[found].code == code ? &kLayouts[found] : nullptr;
}

// RGB layouts under the small codes of older callers.
struct LegacyRgb {
  uint32_t code, bitsPerPixel, redMask, greenMask, blueMask;
};

constexpr LegacyRgb kLegacyRgb[] = {
    {1, 24, 0xFF0000, 0xFF00, 0xFF}, {2, 24, 0xFF, 0xFF00, 0xFF0000}, {3, 24, 0x3F000, 0xFC0, 0x3F},
    {4, 24, 0x3F, 0xFC0, 0x3F000},   {5, 16, 0xF800, 0x7E0, 0x1F},    {6, 16, 0x1F, 0x7E0, 0xF800},
};

uint32_t NormaliseYuvCode(uint32_t code) {
  switch (code) {
    case 7:
    case 11:
      return CODE_YVYU;
    case 8:
    case 12:
      return CODE_YUYV;
    case 9:
    case 14:
      return CODE_UYVY;
    case 10:
    case 13:
      return CODE_VYUY;
    case 15:
      return CODE_I420;
    case 18:
      return CODE_GRAY8;
    case 19:
      return CODE_I440;
    case 20:
      return CODE_I422;
    case 21:
      return CODE_I444;
    case 39:
      return CODE_YV12;
    default:
      return code;
  }
}

// Rewrites a small RGB code, or 259, to CODE_RGB. True when the descriptor is RGB.
bool NormaliseRgb(FormatDesc* desc) {
  if (desc->code == CODE_RGB) return true;
  if (desc->code == 259) {
    desc->code = CODE_RGB;
    return true;
  }
  for (const LegacyRgb& row : kLegacyRgb) {
    if (row.code != desc->code) continue;
    desc->code = CODE_RGB;
    desc->colourStandard = row.bitsPerPixel;
    desc->layout.rgb.redMask = row.redMask;
    desc->layout.rgb.greenMask = row.greenMask;
    desc->layout.rgb.blueMask = row.blueMask;
    return true;
  }
  return false;
}

}  // namespace

extern "C" {

uint32_t MPParseFormat(FormatDesc* desc, const MPPFORMAT* record) {
  if (desc == nullptr || record == nullptr) return KESTREL_BAD_ARGUMENT;
  desc->width = record->width;
  desc->height = record->height;
  desc->palette = nullptr;
  switch (Family(record->format)) {
    case 1:
    case 3:
      return ParseRgb(desc, record->format);
    case 4:
      return ParseIndexed(desc, *record);
    case 5:
      return ParseYuv(desc, record->format);
    case 6:
      return ParseGrey(desc, record->format);
    case 7:
      return ParseSemiPlanar(desc, record->format);
    default:
      return KESTREL_UNSUPPORTED;
  }
}

uint32_t MPGetPlaneLayout(FormatDesc* desc, PlaneLayout* layout) {
  if (desc == nullptr || layout == nullptr) return 0;
  if (NormaliseRgb(desc)) {
    layout->code = CODE_RGB;
    layout->bitsPerPixel = desc->colourStandard;
    return layout->bitsPerPixel;
  }
  const LayoutRow* row = FindLayout(NormaliseYuvCode(desc->code));
  if (row == nullptr) {
    desc->code = layout->code;
    return 0;
  }
  desc->code = layout->code = row->code;
  if (row->kind == LayoutRow::kPacked) {
    layout->isPacked = 1;
  } else {
    layout->isPlanar = 1;
  }
  layout->bitsPerPixel = row->bitsPerPixel;
  return layout->bitsPerPixel;
}

uint32_t MPGetSubsampling(const FormatDesc* desc, PlaneLayout* layout, uint32_t* factors) {
  if (desc == nullptr || layout == nullptr || factors == nullptr) return KESTREL_BAD_ARGUMENT;
  if (desc->code == CODE_RGB) {
    layout->step[0] = layout->step[1] = layout->step[2] = int32_t((desc->colourStandard + 7) / 8);
    layout->planeCount = 1;
    layout->yOffset = layout->uOffset = layout->vOffset = 0;
    for (int i = 0; i < 6; ++i) factors[i] = 1;
    return KESTREL_OK;
  }
  const LayoutRow* row = FindLayout(desc->code);
  if (row == nullptr) return KESTREL_UNSUPPORTED;
  layout->step[0] = row->lumaStep;
  layout->step[1] = layout->step[2] = row->chromaStep;
  layout->planeCount = row->kind == LayoutRow::kPlanar ? 3 : 1;
  layout->yOffset = row->yOffset;
  layout->uOffset = row->uOffset;
  layout->vOffset = row->vOffset;
  const bool own = row->horizontal == 0;
  for (int i = 0; i < 3; ++i) {
    const bool chroma = i > 0;
    factors[i] = own ? desc->layout.subsample[i] : chroma ? row->horizontal : 1;
    factors[3 + i] = own ? desc->layout.subsample[3 + i] : chroma ? row->vertical : 1;
  }
  return KESTREL_OK;
}

uint32_t MGetMaskSize(uint32_t mask) {
  return uint32_t(__builtin_popcount(mask));
}

uint32_t MGetMaskPos(uint32_t mask) {
  return mask == 0 ? 0 : uint32_t(__builtin_ctz(mask));
}

}  // extern "C"
