// Pixels whose channels are taken out of them first, by operations of any set. In an unnamed
// namespace, because files that are compiled for different sets must never share a function.
#ifndef KESTREL_KERNELS_ROWS_CHANNELS_H
#define KESTREL_KERNELS_ROWS_CHANNELS_H

#include "kernels/rows/rows_scalar.h"

namespace kestrel {
namespace {

inline FieldShifts ShiftsTo(const PixelFormat& format) {
  FieldShifts shifts;
  for (int c = 0; c < 3; ++c) shifts.right[c] = 8 - int32_t(format.size[c]);
  return shifts;
}

// Calls call(x, rgb, count) for pieces of the channels of n pixels.
template <typename Unpack, typename Call>
void ForChannels(Unpack unpack, const uint8_t* src, const PixelFormat& format, int n,
                 const Call& call) {
  constexpr int kPiece = 256;
  uint8_t channels[3][kPiece];
  uint8_t* const rgb[3] = {channels[0], channels[1], channels[2]};
  for (int x = 0; x < n; x += kPiece) {
    const int count = n - x < kPiece ? n - x : kPiece;
    unpack(rgb, src + ptrdiff_t{x} * format.bytes, format, count);
    call(x, rgb, count);
  }
}

// As pixelPairsToChroma.
template <typename Unpack, typename Convert>
void ChromaOfFields(Unpack unpack, Convert rgbToYuv, uint8_t* u, uint8_t* v, int step,
                    const uint8_t* src, const PixelFormat& format, RgbToYuvTables tables, int n) {
  ForChannels(unpack, src, format, 2 * n, [=](int x, uint8_t* const rgb[3], int count) {
    for (int c = 0; c < 3; ++c) {
      for (int i = 0; i < count / 2; ++i) rgb[c][i] = rgb[c][2 * i + 1];
    }
    uint8_t samples[128];
    rgbToYuv(samples, rgb, tables + 3, count / 2);
    scalar::WriteStrided(u + ptrdiff_t{x} / 2 * step, step, samples, count / 2);
    rgbToYuv(samples, rgb, tables + 5, count / 2);
    scalar::WriteStrided(v + ptrdiff_t{x} / 2 * step, step, samples, count / 2);
  });
}

// As repackPixels.
template <typename Unpack, typename Pack>
void RepackFields(Unpack unpack, Pack pack, uint8_t* dst, const uint8_t* src,
                  const PixelFormat& from, const PixelFormat& to, int n) {
  const FieldShifts shifts = ShiftsTo(to);
  const bool keepsAlpha = from.alphaByte >= 0 && to.alphaByte >= 0;
  ForChannels(unpack, src, from, n, [&](int x, uint8_t* const rgb[3], int count) {
    pack(dst + ptrdiff_t{x} * to.bytes, rgb, to, shifts, {~0u, 0}, count);
    if (!keepsAlpha) return;
    scalar::UnpackAlpha(rgb[0], src + ptrdiff_t{x} * from.bytes, from, count);
    scalar::PutAlpha(dst + ptrdiff_t{x} * to.bytes, rgb[0], to, count);
  });
}

}  // namespace
}  // namespace kestrel

#endif
