// Pixel formats as the reference model sees them, decoded afresh from the public code.
#ifndef KESTREL_TESTS_REFERENCE_FORMAT_H
#define KESTREL_TESTS_REFERENCE_FORMAT_H

#include <cstdint>

#include "engine/format_codes.h"
#include "engine/records.h"

namespace reference {

// Arrays of three are indexed by these: channels of RGB, components of YUV.
enum Channel { kRed, kGreen, kBlue };
enum Component { kY, kU, kV };

struct Format {
  uint32_t code = 0;  // internal code
  int32_t planeCount = 1;

  // RGB and indexed.
  uint32_t bitsPerPixel = 0;
  uint32_t maskSize[3] = {0, 0, 0};
  uint32_t maskPosition[3] = {0, 0, 0};
  const uint8_t* palette = nullptr;

  // YUV and grey.
  uint32_t standard = 0;

  // Bytes from one sample to the next, place of the first sample, subsampling factors.
  int32_t step[3] = {1, 1, 1};
  int32_t offset[3] = {0, 0, 0};
  int32_t horizontal[3] = {1, 1, 1};
  int32_t vertical[3] = {1, 1, 1};

  bool IsRgb() const { return code == CODE_RGB; }
  bool IsGrey() const { return code == CODE_GRAY8; }
  bool HasSwappedLuma() const {
    return code >= CODE_YVYU_SWAPPED_LUMA && code <= CODE_VYUY_SWAPPED_LUMA;
  }
  bool HasVPlaneFirst() const { return code >= CODE_YV_ANY && code <= CODE_YV24; }
  // Index of the byte that the three masks leave over in a 32-bit pixel; outside 0..3: none.
  int32_t SpareByte() const;
};

// 0, or 3 for an unknown code.
uint32_t DecodeFormat(const MPPFORMAT& record, Format* format);

}  // namespace reference

#endif
