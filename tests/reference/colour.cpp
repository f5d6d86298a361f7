#include "tests/reference/colour.h"

#include <algorithm>
#include <cstdlib>

namespace reference {
namespace {

constexpr int64_t kHalf = 32768;
constexpr int64_t kLevel = 65536;  // 1.0 in Q16

struct ToRgbRow {
  int64_t y, vToRed, vToGreen, uToBlue, uToGreen, redBias, greenBias, blueBias;
};

struct ToYuvRow {
  int64_t redToY, greenToY, blueToY, redToU, greenToU, redToV, greenToV, blueToV;
};

ToRgbRow ToRgb(uint32_t standard) {
  switch (standard) {
    case CS_BT601_FULL:
      return {65536, 91881, 46802, 116130, 22554, 11760828, 8877496, 14864613};
    case CS_BT709_FULL:
      return {65536, 103206, 30677, 121609, 12275, 13210380, 5497894, 15565901};
    case CS_BT709_VIDEO:
      return {76605, 117952, 35062, 138982, 14031, 16323497, 5058226, 19015401};
    default:
      return {76605, 105048, 53510, 132796, 25788, 14671780, 8924535, 18223517};
  }
}

ToYuvRow ToYuv(uint32_t standard) {
  switch (standard) {
    case CS_BT601_FULL:
      return {19595, 38470, 7471, 11058, 21710, 32768, 27439, 5329};
    case CS_BT709_FULL:
      return {13933, 46871, 4732, 7510, 25258, 32768, 29766, 3005};
    case CS_BT709_VIDEO:
      return {11921, 40095, 4050, 6573, 22099, 28672, 26044, 2629};
    default:
      return {16763, 32910, 6391, 9676, 18999, 28672, 24012, 4663};
  }
}

int64_t HalvedWhenNegative(int64_t parameter) {
  return parameter < 0 ? parameter >> 1 : parameter;
}

// value * parts / 64, half away from zero.
int64_t SixtyFourths(int64_t value, int64_t parts) {
  const int64_t product = value * parts;
  const int64_t magnitude = (std::abs(product) * 4 + 128) / 256;
  return product < 0 ? -magnitude : magnitude;
}

int64_t AdjustLumaGain(int64_t gain, const Adjustments& adjustments) {
  return Scale(gain, adjustments.contrast);
}

int64_t AdjustChromaGain(int64_t gain, const Adjustments& adjustments) {
  return Scale(Scale(gain, adjustments.saturation), adjustments.contrast);
}

// Saturation keeps the chroma centre where it was, contrast turns about 128.
int64_t AdjustOffset(int64_t offset, int64_t chromaGain, const Adjustments& adjustments) {
  offset -= 2 * HalvedWhenNegative(adjustments.saturation) * chromaGain;
  return offset + SixtyFourths(offset - 128 * kLevel, HalvedWhenNegative(adjustments.contrast));
}

int64_t ClampToByte(int64_t value) {
  return std::clamp<int64_t>(value, 0, 255);
}

}  // namespace

int64_t Scale(int64_t value, int64_t parameter) {
  return SixtyFourths(value, HalvedWhenNegative(parameter) + 64);
}

YuvToRgb::YuvToRgb(const Format& source, const Format& destination, Adjustments adjustments) {
  if (source.IsGrey()) {
    adjustments.contrast = 0;
    adjustments.saturation = 0;
  }
  const ToRgbRow row = ToRgb(source.standard);
  yGain_ = AdjustLumaGain(row.y, adjustments);
  vToRed_ = AdjustChromaGain(row.vToRed, adjustments);
  vToGreen_ = AdjustChromaGain(-row.vToGreen, adjustments);
  uToGreen_ = AdjustChromaGain(-row.uToGreen, adjustments);
  uToBlue_ = AdjustChromaGain(row.uToBlue, adjustments);

  // The rounding half of green goes in before the contrast pivot, those of red and blue after it.
  const int64_t brightness = adjustments.brightness * row.y;
  offset_[kRed] = AdjustOffset(brightness - row.redBias, row.vToRed, adjustments) + kHalf;
  offset_[kGreen] =
      AdjustOffset(brightness + row.greenBias + kHalf, -row.uToGreen - row.vToGreen, adjustments);
  offset_[kBlue] = AdjustOffset(brightness - row.blueBias, row.uToBlue, adjustments) + kHalf;

  for (int c = 0; c < 3; ++c) {
    const int bits = int(destination.maskSize[c]);
    if (destination.bitsPerPixel == 16 && bits < 8) {
      droppedBits_[c] = 8 - bits;
      base_[c] = bits == 6 ? 288 : 64;
      maximum_[c] = (1 << bits) - 1;
    } else {
      droppedBits_[c] = 0;
      base_[c] = 512;
      maximum_[c] = 255;
    }
    offset_[c] += base_[c] << (droppedBits_[c] + 16);
  }
}

YuvToRgb::Carry YuvToRgb::StartCarry(bool dither) const {
  Carry carry;
  if (dither) {
    for (int c = 0; c < 3; ++c) {
      carry.mask[c] = (1 << droppedBits_[c]) - 1;
      carry.accumulator[c] = carry.mask[c] >> 1;
    }
  }
  return carry;
}

Triple YuvToRgb::Index(const Triple& yuv) const {
  const int64_t luma = (yuv[kY] * yGain_) * 16;
  const int64_t highV = (offset_[kRed] + yuv[kV] * vToRed_) >> 12;
  const int64_t lowV = (offset_[kGreen] + yuv[kV] * vToGreen_) >> 12;
  const int64_t highU = (offset_[kBlue] + yuv[kU] * uToBlue_) >> 12;
  const int64_t lowU = (yuv[kU] * uToGreen_) >> 12;

  // The low words reach into red and blue as fractions; they are part of the arithmetic.
  Triple index;
  index[kRed] = (highV * 65536 + (lowV & 0xFFFF) + luma) >> 20;
  index[kGreen] = ((lowU + lowV) * 65536 + luma) >> 20;
  index[kBlue] = (highU * 65536 + (lowU & 0xFFFF) + luma) >> 20;
  return index;
}

Triple YuvToRgb::Convert(const Triple& yuv, Carry* carry) const {
  Triple index = Index(yuv);
  Triple rgb;
  for (int c = 0; c < 3; ++c) {
    index[c] += carry->accumulator[c];
    carry->accumulator[c] = index[c] & carry->mask[c];
    rgb[c] = std::clamp<int64_t>((index[c] >> droppedBits_[c]) - base_[c], 0, maximum_[c]);
  }
  return rgb;
}

Triple YuvToRgb::ConvertTo8Bits(const Triple& yuv) const {
  Triple rgb = Index(yuv);
  for (int c = 0; c < 3; ++c) {
    rgb[c] = ClampToByte(rgb[c] - Zero(c));
  }
  return rgb;
}

ClampedCarry::ClampedCarry(const Format& destination) {
  for (int c = 0; c < 3; ++c) {
    droppedBits_[c] = std::max(8 - int(destination.maskSize[c]), 0);
    remainder_[c] = ((1 << droppedBits_[c]) - 1) / 2;  // 3 of 5 bits, 1 of 6 bits
  }
}

Triple ClampedCarry::Narrow(const Triple& rgb) {
  Triple fields;
  for (int c = 0; c < 3; ++c) {
    const int64_t sum = rgb[c] + remainder_[c];
    fields[c] = ClampToByte(sum) >> droppedBits_[c];
    remainder_[c] = sum % (1 << droppedBits_[c]);
  }
  return fields;
}

Triple SixBitYuvToRgb(const Triple& yuv) {
  const int64_t luma = 64 * yuv[kY];
  const int64_t u = yuv[kU] - 128;
  const int64_t v = yuv[kV] - 128;
  // The offsets are no roundings: whites come out as 255, 254, 254.
  const Triple sums = {luma + 90 * v + 35, luma - 46 * v - 22 * u - 35, luma + 113 * u - 52};
  Triple rgb;
  for (int c = 0; c < 3; ++c) {
    rgb[c] = std::clamp<int64_t>(sums[c], 0, 16320) / 64;
  }
  return rgb;
}

Triple RgbToYuv(const Triple& rgb, uint32_t standard) {
  const ToYuvRow row = ToYuv(standard);
  const int64_t foot = standard & CS_VIDEO_RANGE ? 16 * kLevel : 0;
  const int64_t centre = 128 * kLevel;
  const int64_t y =
      foot + rgb[kRed] * row.redToY + rgb[kGreen] * row.greenToY + rgb[kBlue] * row.blueToY;
  // The weight of blue in U is that of red in V.
  const int64_t u =
      centre - rgb[kRed] * row.redToU - rgb[kGreen] * row.greenToU + rgb[kBlue] * row.redToV;
  const int64_t v =
      centre + rgb[kRed] * row.redToV - rgb[kGreen] * row.greenToV - rgb[kBlue] * row.blueToV;
  return {(y >> 16) & 255, (u >> 16) & 255, (v >> 16) & 255};
}

LevelChange::LevelChange(uint32_t sourceStandard, uint32_t destinationStandard,
                         Adjustments adjustments) {
  const bool toVideo =
      (sourceStandard & CS_FULL_RANGE) != 0 && (destinationStandard & CS_VIDEO_RANGE) != 0;
  const bool toFull =
      (sourceStandard & CS_VIDEO_RANGE) != 0 && (destinationStandard & CS_FULL_RANGE) != 0;
  const int64_t brightness = adjustments.brightness * kLevel;
  int64_t lumaGain = kLevel, lumaOffset = brightness, chromaGain = kLevel, chromaOffset = 0;
  if (toVideo) {
    lumaGain = 56066;
    lumaOffset = brightness + 16 * kLevel;
    chromaGain = 57344;
    chromaOffset = 1048576;
  } else if (toFull) {
    lumaGain = 76608;
    lumaOffset = brightness + 1225728;  // added, not subtracted: luma 16 becomes 37
    chromaGain = 74901;
    chromaOffset = -1198372;
  }
  lumaGain_ = AdjustLumaGain(lumaGain, adjustments);
  lumaOffset_ = AdjustOffset(lumaOffset, 0, adjustments);
  chromaGain_ = AdjustChromaGain(chromaGain, adjustments);
  chromaOffset_ = AdjustOffset(chromaOffset, chromaGain, adjustments);
}

Triple LevelChange::Convert(const Triple& yuv) const {
  return {ClampToByte((lumaOffset_ + kHalf + yuv[kY] * lumaGain_) >> 16),
          ClampToByte((chromaOffset_ + kHalf + yuv[kU] * chromaGain_) >> 16),
          ClampToByte((chromaOffset_ + kHalf + yuv[kV] * chromaGain_) >> 16)};
}

}  // namespace reference
