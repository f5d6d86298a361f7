// Colour arithmetic of the reference model: every formula evaluated per pixel in 64-bit integers,
// without tables, so nothing can wrap.
#ifndef KESTREL_TESTS_REFERENCE_COLOUR_H
#define KESTREL_TESTS_REFERENCE_COLOUR_H

#include <array>
#include <cstdint>

#include "tests/reference/format.h"

namespace reference {

using Triple = std::array<int64_t, 3>;  // R G B, or Y U V

struct Adjustments {
  int64_t brightness = 0;
  int64_t contrast = 0;
  int64_t saturation = 0;
  bool IsNeutral() const { return brightness == 0 && contrast == 0 && saturation == 0; }
};

// value times (p' + 64) / 64, where p' is p, halved when negative; half away from zero.
int64_t Scale(int64_t value, int64_t parameter);

// YUV to RGB under adjustments, for one destination.
class YuvToRgb {
 public:
  YuvToRgb() = default;
  YuvToRgb(const Format& source, const Format& destination, Adjustments adjustments);

  // Remainders dropped from narrow channels, carried to the next pixel.
  struct Carry {
    Triple mask{};
    Triple accumulator{};
  };
  Carry StartCarry(bool dither) const;

  // A destination of 16 bits per pixel receives values of the width of its channels (at most 8
  // bits), every other destination 8-bit values.
  Triple Convert(const Triple& yuv, Carry* carry) const;

  // 8-bit values for every destination, clamped before they are narrowed.
  Triple ConvertTo8Bits(const Triple& yuv) const;

 private:
  // Position of each channel among the values that narrowing starts from; value 0 is at Zero().
  Triple Index(const Triple& yuv) const;
  int64_t Zero(int channel) const { return base_[channel] << droppedBits_[channel]; }

  int64_t yGain_ = 0, vToRed_ = 0, vToGreen_ = 0, uToGreen_ = 0, uToBlue_ = 0;
  Triple offset_{};
  std::array<int, 3> droppedBits_{};
  Triple base_{};
  Triple maximum_{};
};

// The other rule for narrow channels: remainders of 8-bit values, clamped after carrying.
class ClampedCarry {
 public:
  explicit ClampedCarry(const Format& destination);
  Triple Narrow(const Triple& rgb);

 private:
  std::array<int, 3> droppedBits_{};
  Triple remainder_{};
};

// Full range BT.601 with factors of 1/64, whatever the standard and the adjustments. 8-bit values.
Triple SixBitYuvToRgb(const Triple& yuv);

// RGB to YUV; adjustments have no part in it. Results are truncated to 8 bits.
Triple RgbToYuv(const Triple& rgb, uint32_t standard);

// YUV to YUV with an adjustment or a change of range. The matrix is never changed.
class LevelChange {
 public:
  LevelChange() = default;
  LevelChange(uint32_t sourceStandard, uint32_t destinationStandard, Adjustments adjustments);
  Triple Convert(const Triple& yuv) const;

 private:
  int64_t lumaGain_ = 0, lumaOffset_ = 0, chromaGain_ = 0, chromaOffset_ = 0;
};

}  // namespace reference

#endif
