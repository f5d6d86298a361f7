// The public formats, for all programs that go through them or draw from them.
#ifndef KESTREL_TESTS_SUPPORT_FORMATS_H
#define KESTREL_TESTS_SUPPORT_FORMATS_H

#include <array>
#include <cstddef>
#include <cstdint>

#include "engine/format_codes.h"

namespace testing_support {

struct PublicFormat {
  const char* name;  // of its macro, without FORMAT_
  uint32_t code;
};

// Every format that has a name, in the order of engine/format_codes.h.
#define PUBLIC_FORMAT(name) \
  { #name, FORMAT_##name }
inline constexpr PublicFormat kPublicFormats[] = {
    PUBLIC_FORMAT(RGB565),
    PUBLIC_FORMAT(BGR565),
    PUBLIC_FORMAT(RGB666),
    PUBLIC_FORMAT(BGR666),
    PUBLIC_FORMAT(RGB888),
    PUBLIC_FORMAT(BGR888),
    PUBLIC_FORMAT(XRGB8888),
    PUBLIC_FORMAT(XBGR8888),
    PUBLIC_FORMAT(RGBX8888),
    PUBLIC_FORMAT(BGRX8888),
    PUBLIC_FORMAT(INDEX1),
    PUBLIC_FORMAT(INDEX4),
    PUBLIC_FORMAT(INDEX8),
    PUBLIC_FORMAT(YUYV),
    PUBLIC_FORMAT(YVYU),
    PUBLIC_FORMAT(UYVY),
    PUBLIC_FORMAT(VYUY),
    PUBLIC_FORMAT(YUYV_SWAPPED_LUMA),
    PUBLIC_FORMAT(YVYU_SWAPPED_LUMA),
    PUBLIC_FORMAT(UYVY_SWAPPED_LUMA),
    PUBLIC_FORMAT(VYUY_SWAPPED_LUMA),
    PUBLIC_FORMAT(YUV444),
    PUBLIC_FORMAT(YVU444),
    PUBLIC_FORMAT(UVY444),
    PUBLIC_FORMAT(VUY444),
    PUBLIC_FORMAT(I420),
    PUBLIC_FORMAT(I422),
    PUBLIC_FORMAT(I440),
    PUBLIC_FORMAT(I444),
    PUBLIC_FORMAT(YV12),
    PUBLIC_FORMAT(YV16),
    PUBLIC_FORMAT(YV440),
    PUBLIC_FORMAT(YV24),
    PUBLIC_FORMAT(GRAY8),
    PUBLIC_FORMAT(NV21),
    PUBLIC_FORMAT(NV12),
    PUBLIC_FORMAT(NV61),
    PUBLIC_FORMAT(NV16),
    PUBLIC_FORMAT(YUV_SPECIAL8),
    PUBLIC_FORMAT(YUV_SPECIAL9),
};
#undef PUBLIC_FORMAT

constexpr bool IsRgbCode(uint32_t code) {
  return code >> 28 == 1 || code >> 28 == 3;
}

constexpr bool IsIndexedCode(uint32_t code) {
  return code >> 28 == 4;
}

// YUV, grey and semi-planar: a colour standard may be added to the code.
constexpr bool HasStandard(uint32_t code) {
  return code >> 28 >= 5;
}

constexpr bool IsPlanarCode(uint32_t code) {
  return code >> 28 == 5 && (code & 0x800u) != 0;
}

constexpr bool IsSpecialCode(uint32_t code) {
  return (code & ~FORMAT_STANDARD_MASK) == FORMAT_YUV_SPECIAL8 ||
         (code & ~FORMAT_STANDARD_MASK) == FORMAT_YUV_SPECIAL9;
}

constexpr bool IsSemiPlanarCode(uint32_t code) {
  return code >> 28 == 7 && !IsSpecialCode(code);
}

// YUV with the samples of a pixel, or of a pair of pixels, side by side.
constexpr bool IsPackedYuvCode(uint32_t code) {
  return (code >> 28 == 5 && !IsPlanarCode(code)) || IsSpecialCode(code);
}

// Packed 4:2:2: pairs of pixels with one chroma sample of each kind.
constexpr bool HasPackedPairs(uint32_t code) {
  return code >> 28 == 5 && !IsPlanarCode(code) && (code & 0x10u) != 0;
}

constexpr bool IsAnyCode(uint32_t) {
  return true;
}

// The codes of the list that suit, in its order.
template <bool (*suits)(uint32_t code) = IsAnyCode>
constexpr auto PublicCodes() {
  constexpr size_t kCount = [] {
    size_t count = 0;
    for (const PublicFormat& format : kPublicFormats) {
      count += suits(format.code) ? 1 : 0;
    }
    return count;
  }();
  std::array<uint32_t, kCount> codes{};
  size_t at = 0;
  for (const PublicFormat& format : kPublicFormats) {
    if (suits(format.code)) {
      codes[at++] = format.code;
    }
  }
  return codes;
}

}  // namespace testing_support

#endif
