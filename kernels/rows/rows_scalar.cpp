// The reference version of every row operation.
#include "kernels/rows/rows_scalar.h"

#include <string.h>

#include "kernels/rows/channels.h"
#include "kernels/rows/indexed.h"
#include "kernels/rows/transpose.h"

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "packed pixels are stored as words");

namespace kestrel {
namespace scalar {

// A step that the compiler knows makes a loop of vector shuffles.
template <ptrdiff_t kStep>
void ReadEvery(uint8_t* dst, const uint8_t* src, int n) {
  for (int i = 0; i < n; ++i) dst[i] = src[i * kStep];
}

void ReadStrided(uint8_t* dst, const uint8_t* src, ptrdiff_t step, int n) {
  switch (step) {
    case 1:
      memcpy(dst, src, size_t(n));
      return;
    case 2:
      return ReadEvery<2>(dst, src, n);
    case 3:
      return ReadEvery<3>(dst, src, n);
    default:
      for (int i = 0; i < n; ++i) dst[i] = src[i * step];
      return;
  }
}

void Gather(uint8_t* dst, const uint8_t* src, const int32_t* offsets, int n) {
  for (int i = 0; i < n; ++i) dst[i] = src[offsets[i]];
}

template <int kBytes>
void GatherUnits(uint8_t* dst, const uint8_t* src, const int32_t* offsets, int n) {
  for (int i = 0; i < n; ++i) memcpy(dst + i * kBytes, src + offsets[i], kBytes);
}

void GatherPixels(uint8_t* dst, const uint8_t* src, const int32_t* offsets, int bytes, int n) {
  switch (bytes) {
    case 1:
      return GatherUnits<1>(dst, src, offsets, n);
    case 2:
      return GatherUnits<2>(dst, src, offsets, n);
    case 3:
      return GatherUnits<3>(dst, src, offsets, n);
    default:
      return GatherUnits<4>(dst, src, offsets, n);
  }
}

// The result lies between a and b: always a byte.
static uint8_t Blend(int32_t a, int32_t b, int32_t weight) {
  return uint8_t((a * 65536 + weight * (b - a)) >> 16);
}

void BlendColumns(uint8_t* dst, const uint8_t* a, const uint8_t* b, const uint16_t* weights,
                  int n) {
  for (int i = 0; i < n; ++i) dst[i] = Blend(a[i], b[i], weights[i]);
}

void BlendRows(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight, int n) {
  for (int i = 0; i < n; ++i) dst[i] = Blend(a[i], b[i], int32_t(weight));
}

void BlendPixelRows(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight,
                    int alphaByte, int n) {
  for (int i = 0; i < 4 * n; ++i) {
    dst[i] = i % 4 == alphaByte ? a[i] : Blend(a[i], b[i], int32_t(weight));
  }
}

void PlanPairs(PairPlan*) {}

// (In copies of the plan's lists: a byte that is written might change those of a plan by
// reference.)
void ReadSomePairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan, int i, int end) {
  const PairPlan::Lists lists(plan);
  for (; i < end; ++i) {
    dst[2 * i] = src[lists.First(i)];
    dst[2 * i + 1] = src[lists.Second(i)];
  }
}

void ReadPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan) {
  ReadSomePairs(dst, src, plan, 0, plan.n);
}

template <int kUnit>
void BlendUnits(uint8_t* dst, const uint8_t* src, const PairPlan& plan, int i, int end) {
  const PairPlan::Lists lists(plan);
  const uint16_t* const weights = plan.weights;
  const int keptByte = plan.keptByte;
  const auto blend = [=](int unit, int byte, int endOfBytes) {
    const uint8_t* const first = src + lists.First(unit);
    const uint8_t* const second = src + lists.Second(unit);
    const int32_t weight = weights[unit];
    uint8_t* const out = dst + ptrdiff_t{unit} * kUnit;
    for (; byte < endOfBytes; ++byte) {
      out[byte] = byte == keptByte ? first[byte] : Blend(first[byte], second[byte], weight);
    }
  };
  int unit = i / kUnit;
  const int from = i % kUnit;
  if (from != 0) blend(unit++, from, end - i + from < kUnit ? end - i + from : kUnit);
  for (; (unit + 1) * kUnit <= end; ++unit) blend(unit, 0, kUnit);
  if (unit * kUnit < end) blend(unit, 0, end - unit * kUnit);
}

void BlendSomePairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan, int i, int end) {
  switch (plan.unit) {
    case 1:
      return BlendUnits<1>(dst, src, plan, i, end);
    case 3:
      return BlendUnits<3>(dst, src, plan, i, end);
    default:
      return BlendUnits<4>(dst, src, plan, i, end);
  }
}

void BlendPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan) {
  BlendSomePairs(dst, src, plan, 0, plan.n);
}

// Pixels are little-endian words, as every CPU this library is built for is.
// (Three bytes are not copied: a word that is stored in two pieces cannot be read at once.)
template <int kBytes>
uint32_t LoadPixel(const uint8_t* p) {
  if (kBytes == 3) return p[0] | uint32_t(p[1]) << 8 | uint32_t(p[2]) << 16;
  uint32_t pixel = 0;
  memcpy(&pixel, p, kBytes);
  return pixel;
}

template <int kBytes>
void StorePixel(uint8_t* p, uint32_t pixel) {
  memcpy(p, &pixel, kBytes);
}

// Some pixels as words, so that what is done to their fields can be done to several at once.
constexpr int kWords = 64;
template <int kBytes>
void LoadWords(uint32_t* words, const uint8_t* src, int n) {
  int i = 0;
  if (kBytes == 3) {
    // With the first byte of the next one.
    for (; i + 1 < n; ++i) words[i] = LoadPixel<4>(src + i * kBytes) & 0xFFFFFF;
  }
  for (; i < n; ++i) words[i] = LoadPixel<kBytes>(src + i * kBytes);
}

template <int kBytes>
void UnpackFields(uint8_t* const rgb[3], const uint8_t* src, const PixelFormat& format, int n) {
  uint32_t words[kWords] = {};
  for (int x = 0; x < n; x += kWords) {
    const int count = n - x < kWords ? n - x : kWords;
    LoadWords<kBytes>(words, src + ptrdiff_t{x} * kBytes, count);
    for (int c = 0; c < 3; ++c) {
      const uint32_t position = format.position[c];
      const uint32_t size = format.size[c];
      uint8_t* const levels = rgb[c] + x;
      if (size == 0) {
        memset(levels, 0, size_t(count));
        continue;
      }
      for (int i = 0; i < count; ++i) {
        levels[i] = uint8_t(words[i] >> position << (32 - size) >> 24);
      }
    }
  }
}

template <int kBytes>
void UnpackBytes(uint8_t* const rgb[3], const uint8_t* src, const PixelFormat& format, int n) {
  const uint8_t* const red = src + format.position[0] / 8;
  const uint8_t* const green = src + format.position[1] / 8;
  const uint8_t* const blue = src + format.position[2] / 8;
  for (int i = 0; i < n; ++i) {
    rgb[0][i] = red[i * kBytes];
    rgb[1][i] = green[i * kBytes];
    rgb[2][i] = blue[i * kBytes];
  }
}

void UnpackRgb(uint8_t* const rgb[3], const uint8_t* src, const PixelFormat& format, int n) {
  switch (format.bytes) {
    case 0:  // indexed pixels without a palette have no channels
      for (int c = 0; c < 3; ++c) memset(rgb[c], 0, size_t(n));
      return;
    case 1:
      return UnpackFields<1>(rgb, src, format, n);
    case 2:
      return UnpackFields<2>(rgb, src, format, n);
    case 3:
      return format.wholeBytes ? UnpackBytes<3>(rgb, src, format, n)
                               : UnpackFields<3>(rgb, src, format, n);
    default:
      return format.wholeBytes ? UnpackBytes<4>(rgb, src, format, n)
                               : UnpackFields<4>(rgb, src, format, n);
  }
}

void UnpackAlpha(uint8_t* alpha, const uint8_t* src, const PixelFormat& format, int n) {
  for (int i = 0; i < n; ++i) alpha[i] = src[i * format.bytes + format.alphaByte];
}

void GatherIndexed(uint8_t* dst, const uint8_t* row, const int32_t* columns, uint32_t bits,
                   const uint8_t* palette, int n) {
  GatherPaletteEntries(dst, row, columns, bits, palette, n);
}

void YuvToRgbByTable(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                     const YuvToRgbTable& table, int n) {
  // Copies, because a stored byte could be anything's as far as the compiler knows.
  uint8_t* const red = rgb[0];
  uint8_t* const green = rgb[1];
  uint8_t* const blue = rgb[2];
  const YuvToRgbTable t = table;
  for (int i = 0; i < n; ++i) {
    const uint32_t ty = t.y[y[i]];
    const uint32_t tu = t.u[u[i]];
    const uint32_t tv = t.v[v[i]];
    // Carries out of the low halves are part of the arithmetic.
    red[i] = t.clamp[(tv + ty) >> (20 + t.narrowing[0])];
    green[i] = t.clamp[(ty + ((tu + tv) << 16)) >> (20 + t.narrowing[1])];
    blue[i] = t.clamp[(tu + ty) >> (20 + t.narrowing[2])];
  }
}

// Clamp-table indices of one colour, before narrowing. The chroma words keep their truncation to
// 1/16 level and the low halves that the table form carries into R and B.
struct Indices {
  int32_t channel[3];
};

static Indices WideIndices(const YuvToRgbWide& s, int32_t y, int32_t u, int32_t v) {
  const int64_t luma = int64_t(y) * s.yGain * 16;
  const int64_t vRed = (s.offset[0] + v * s.vToR) >> 12;
  const int64_t vGreen = (s.offset[1] + v * s.vToG) >> 12;
  const int64_t uBlue = (s.offset[2] + u * s.uToB) >> 12;
  const int64_t uGreen = (u * s.uToG) >> 12;
  return {{int32_t((vRed * 65536 + (vGreen & 0xFFFF) + luma) >> 20),
           int32_t((luma + (uGreen + vGreen) * 65536) >> 20),
           int32_t((uBlue * 65536 + (uGreen & 0xFFFF) + luma) >> 20)}};
}

static uint8_t Narrow(const YuvToRgbWide& s, int channel, int32_t index) {
  const int32_t value = (index >> s.narrowing[channel]) - s.base[channel];
  return uint8_t(value < 0 ? 0 : value > s.maximum[channel] ? s.maximum[channel] : value);
}

void YuvToRgbByWideSums(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                        const YuvToRgbWide& sums, int n) {
  for (int i = 0; i < n; ++i) {
    const Indices index = WideIndices(sums, y[i], u[i], v[i]);
    for (int c = 0; c < 3; ++c) rgb[c][i] = Narrow(sums, c, index.channel[c]);
  }
}

void YuvToRgbCarry(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                   const YuvToRgbWide& sums, Carry* carry, int n) {
  for (int i = 0; i < n; ++i) {
    const Indices indices = WideIndices(sums, y[i], u[i], v[i]);
    for (int c = 0; c < 3; ++c) {
      const int32_t index = indices.channel[c] + carry->remainder[c];
      rgb[c][i] = Narrow(sums, c, index);
      carry->remainder[c] = index & carry->mask[c];
    }
  }
}

static uint8_t ClampToByte(int32_t value) {
  return uint8_t(value < 0 ? 0 : value > 255 ? 255 : value);
}

void YuvToRgbBySixBits(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                       int n) {
  uint8_t* const red = rgb[0];
  uint8_t* const green = rgb[1];
  uint8_t* const blue = rgb[2];
  for (int i = 0; i < n; ++i) {
    red[i] = ClampToByte(y[i] + ((90 * v[i] - 11485) >> 6));
    green[i] = ClampToByte(y[i] + ((8669 - 46 * v[i] - 22 * u[i]) >> 6));
    blue[i] = ClampToByte(y[i] + ((113 * u[i] - 14516) >> 6));
  }
}

void NarrowWithCarry(uint8_t* const dst[3], const uint8_t* const src[3], const FieldShifts& shifts,
                     Carry* carry, int n) {
  for (int c = 0; c < 3; ++c) {
    int32_t remainder = carry->remainder[c];
    for (int i = 0; i < n; ++i) {
      const int32_t sum = src[c][i] + remainder;
      dst[c][i] = uint8_t((sum > 255 ? 255 : sum) >> shifts.right[c]);
      remainder = sum & carry->mask[c];
    }
    carry->remainder[c] = remainder;
  }
}

void RgbToYuv(uint8_t* dst, const uint8_t* const rgb[3], RgbToYuvTables tables, int n) {
  const uint8_t* const red = rgb[0];
  const uint8_t* const green = rgb[1];
  const uint8_t* const blue = rgb[2];
  for (int i = 0; i < n; ++i) {
    dst[i] = uint8_t((tables[0][red[i]] + tables[1][green[i]] + tables[2][blue[i]]) >> 16);
  }
}

void MapLevels(uint8_t* dst, const uint8_t* src, const LevelMap& levels, int n) {
  for (int i = 0; i < n; ++i) dst[i] = levels.map[src[i]];
}

// Of pixels of whole bytes, `pitch` bytes apart.
void WholeBytesToYuv(uint8_t* dst, ptrdiff_t step, const uint8_t* src, ptrdiff_t pitch,
                     const PixelFormat& format, RgbToYuvTables tables, int n) {
  const uint8_t* const red = src + format.position[0] / 8;
  const uint8_t* const green = src + format.position[1] / 8;
  const uint8_t* const blue = src + format.position[2] / 8;
  for (int i = 0; i < n; ++i) {
    const ptrdiff_t at = i * pitch;
    dst[i * step] =
        uint8_t((tables[0][red[at]] + tables[1][green[at]] + tables[2][blue[at]]) >> 16);
  }
}

void PixelsToYuv(uint8_t* dst, const uint8_t* src, const PixelFormat& format, RgbToYuvTables tables,
                 int n) {
  if (format.wholeBytes) return WholeBytesToYuv(dst, 1, src, format.bytes, format, tables, n);
  ForChannels(UnpackRgb, src, format, n, [=](int x, uint8_t* const rgb[3], int count) {
    RgbToYuv(dst + x, rgb, tables, count);
  });
}

void PixelPairsToChroma(uint8_t* u, uint8_t* v, int step, const uint8_t* src,
                        const PixelFormat& format, RgbToYuvTables tables, int n) {
  if (format.wholeBytes) {
    const uint8_t* const seconds = src + format.bytes;
    const ptrdiff_t pitch = ptrdiff_t{2} * format.bytes;
    WholeBytesToYuv(u, step, seconds, pitch, format, tables + 3, n);
    WholeBytesToYuv(v, step, seconds, pitch, format, tables + 5, n);
    return;
  }
  ChromaOfFields(UnpackRgb, RgbToYuv, u, v, step, src, format, tables, n);
}

// A function by itself, or compilers would do all channels of a pixel at once, on scalars.
__attribute__((noinline)) static void AddField(uint32_t* __restrict words,
                                               const uint8_t* __restrict levels, int32_t right,
                                               int32_t left, int n) {
  for (int i = 0; i < n; ++i) words[i] |= uint32_t(levels[i]) >> right << left;
}

template <int kBytes>
void PackFields(uint8_t* dst, const uint8_t* const rgb[3], const PixelFormat& format,
                const FieldShifts& shifts, AlphaFill alpha, int n) {
  uint32_t words[kWords];
  for (int x = 0; x < n; x += kWords) {
    const int count = n - x < kWords ? n - x : kWords;
    memset(words, 0, sizeof(words));
    for (int c = 0; c < 3; ++c) {
      const int32_t right = shifts.right[c] > 0 ? shifts.right[c] : 0;
      AddField(words, rgb[c] + x, right, int32_t(format.position[c]) + right - shifts.right[c],
               count);
    }
    for (int i = 0; i < count; ++i) {
      StorePixel<kBytes>(dst + ptrdiff_t{x + i} * kBytes, (words[i] & alpha.keep) | alpha.bits);
    }
  }
}

template <int kBytes>
void PackBytes(uint8_t* dst, const uint8_t* const rgb[3], const PixelFormat& format,
               AlphaFill alpha, int n) {
  const uint8_t* const red = rgb[0];
  const uint8_t* const green = rgb[1];
  const uint8_t* const blue = rgb[2];
  const uint32_t toRed = format.position[0];
  const uint32_t toGreen = format.position[1];
  const uint32_t toBlue = format.position[2];
  for (int i = 0; i < n; ++i) {
    const uint32_t pixel =
        uint32_t(red[i]) << toRed | uint32_t(green[i]) << toGreen | uint32_t(blue[i]) << toBlue;
    StorePixel<kBytes>(dst + i * kBytes, (pixel & alpha.keep) | alpha.bits);
  }
}

void PackRgb(uint8_t* dst, const uint8_t* const rgb[3], const PixelFormat& format,
             const FieldShifts& shifts, AlphaFill alpha, int n) {
  switch (format.bytes) {
    case 1:
      return PackFields<1>(dst, rgb, format, shifts, alpha, n);
    case 2:
      return PackFields<2>(dst, rgb, format, shifts, alpha, n);
    case 3:
      return format.wholeBytes ? PackBytes<3>(dst, rgb, format, alpha, n)
                               : PackFields<3>(dst, rgb, format, shifts, alpha, n);
    default:
      return format.wholeBytes ? PackBytes<4>(dst, rgb, format, alpha, n)
                               : PackFields<4>(dst, rgb, format, shifts, alpha, n);
  }
}

static void YuvRowToPixels(uint8_t* dst, const uint8_t* y, const uint8_t* u, const uint8_t* v,
                           const ChromaRows& chroma, const YuvToRgb& colour,
                           const PixelFormat& format, const FieldShifts& shifts, AlphaFill alpha,
                           int n) {
  // Channels of a few pixels, then the pixels: a scalar CPU gains nothing from fusing the two.
  constexpr int kPiece = 64;
  uint8_t pieceU[kPiece], pieceV[kPiece], channels[3][kPiece];
  uint8_t* const rgb[3] = {channels[0], channels[1], channels[2]};
  for (int x = 0; x < n; x += kPiece) {
    const int count = n - x < kPiece ? n - x : kPiece;
    for (int i = 0; i < count; ++i) {
      const int sample = ((x + i) >> chroma.shift) * chroma.step;
      pieceU[i] = u[sample];
      pieceV[i] = v[sample];
    }
    switch (colour.form) {
      case YuvToRgbForm::kWide:
        YuvToRgbByWideSums(rgb, y + x, pieceU, pieceV, colour.wide, count);
        break;
      case YuvToRgbForm::kSixBits:
        YuvToRgbBySixBits(rgb, y + x, pieceU, pieceV, count);
        break;
      default:
        YuvToRgbByTable(rgb, y + x, pieceU, pieceV, colour.table, count);
        break;
    }
    PackRgb(dst + ptrdiff_t{x} * format.bytes, rgb, format, shifts, alpha, count);
  }
}

void YuvToPixels(const PixelRows& rows, const ChromaRows& chroma, const YuvToRgb& colour,
                 const PixelFormat& format, AlphaFill alpha, int n) {
  FieldShifts shifts = ShiftsTo(format);
  for (int c = 0; c < 3; ++c) {
    const bool narrowed = format.bytes == 2 && colour.form != YuvToRgbForm::kSixBits;
    if (narrowed && shifts.right[c] > 0) shifts.right[c] = 0;
  }
  for (int row = 0; row < rows.rows; ++row) {
    const int chromaRow = row >> chroma.rowShift;
    YuvRowToPixels(rows.dst + row * rows.dstPitch, rows.y + row * rows.yPitch,
                   chroma.u + chromaRow * chroma.uPitch, chroma.v + chromaRow * chroma.vPitch,
                   chroma, colour, format, shifts, alpha, n);
  }
}

void PutAlpha(uint8_t* pixels, const uint8_t* alpha, const PixelFormat& format, int n) {
  for (int i = 0; i < n; ++i) pixels[i * format.bytes + format.alphaByte] = alpha[i];
}

void RepackPixels(uint8_t* dst, const uint8_t* src, const PixelFormat& from, const PixelFormat& to,
                  int n) {
  RepackFields(UnpackRgb, PackRgb, dst, src, from, to, n);
}

template <ptrdiff_t kStep>
void WriteEvery(uint8_t* dst, const uint8_t* src, int n) {
  for (int i = 0; i < n; ++i) dst[i * kStep] = src[i];
}

void WriteStrided(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int n) {
  switch (step) {
    case 1:
      memcpy(dst, src, size_t(n));
      return;
    case -1:
      return WriteEvery<-1>(dst, src, n);
    case 2:
      return WriteEvery<2>(dst, src, n);
    case 3:
      return WriteEvery<3>(dst, src, n);
    case 4:
      return WriteEvery<4>(dst, src, n);
    default:
      for (int i = 0; i < n; ++i) dst[i * step] = src[i];
      return;
  }
}

template <int kBytes>
void WriteUnits(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int n) {
  if (step == -kBytes) {
    for (int i = 0; i < n; ++i) memcpy(dst - i * kBytes, src + i * kBytes, kBytes);
  } else {
    for (int i = 0; i < n; ++i) memcpy(dst + i * step, src + i * kBytes, kBytes);
  }
}

void WritePixels(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int bytes, int n) {
  if (step == bytes) {
    memcpy(dst, src, size_t(n) * size_t(bytes));
    return;
  }
  switch (bytes) {
    case 1:
      return WriteUnits<1>(dst, step, src, n);
    case 2:
      return WriteUnits<2>(dst, step, src, n);
    case 3:
      return WriteUnits<3>(dst, step, src, n);
    default:
      return WriteUnits<4>(dst, step, src, n);
  }
}

void Interleave(uint8_t* dst, const uint8_t* a, const uint8_t* b, int n) {
  for (int i = 0; i < n; ++i) {
    dst[2 * i] = a[i];
    dst[2 * i + 1] = b[i];
  }
}

void Deinterleave(uint8_t* a, uint8_t* b, const uint8_t* src, int n) {
  for (int i = 0; i < n; ++i) {
    a[i] = src[2 * i];
    b[i] = src[2 * i + 1];
  }
}

void SwapPairs(uint8_t* dst, const uint8_t* src, int n) {
  for (int i = 0; i < n; ++i) {
    const uint8_t first = src[2 * i];
    dst[2 * i] = src[2 * i + 1];
    dst[2 * i + 1] = first;
  }
}

void SplitGroups(uint8_t* luma, uint8_t* const chroma[2], const uint8_t* groups, bool lumaFirst,
                 int n) {
  uint8_t* const first = chroma[0];
  uint8_t* const second = chroma[1];
  const uint8_t* const y = groups + (lumaFirst ? 0 : 1);
  const uint8_t* const c = groups + (lumaFirst ? 1 : 0);
  for (int i = 0; i < n; ++i) {
    luma[2 * i] = y[4 * i];
    luma[2 * i + 1] = y[4 * i + 2];
    first[i] = c[4 * i];
    second[i] = c[4 * i + 2];
  }
}

// Vectors of 16 bytes as lanes of one unit each. Pairs: the low (high) halves of two, interleaved.
using Lanes1 = uint8_t __attribute__((vector_size(16)));
using Lanes2 = uint16_t __attribute__((vector_size(16)));
using Lanes4 = uint32_t __attribute__((vector_size(16)));
using Lanes8 = uint64_t __attribute__((vector_size(16)));

// Vectors anywhere in memory. Some compilers make calls of memcpy with 16 bytes.
template <typename Lanes>
Lanes LoadLanes(const uint8_t* p) {
  using Unaligned [[gnu::aligned(1), gnu::may_alias]] = Lanes;
  return *reinterpret_cast<const Unaligned*>(p);
}
template <typename Lanes>
void StoreLanes(uint8_t* p, Lanes lanes) {
  using Unaligned [[gnu::aligned(1), gnu::may_alias]] = Lanes;
  *reinterpret_cast<Unaligned*>(p) = lanes;
}

static Lanes1 LowPairs(Lanes1 a, Lanes1 b) {
  return __builtin_shufflevector(a, b, 0, 16, 1, 17, 2, 18, 3, 19, 4, 20, 5, 21, 6, 22, 7, 23);
}
static Lanes1 HighPairs(Lanes1 a, Lanes1 b) {
  return __builtin_shufflevector(a, b, 8, 24, 9, 25, 10, 26, 11, 27, 12, 28, 13, 29, 14, 30, 15,
                                 31);
}
static Lanes2 LowPairs(Lanes2 a, Lanes2 b) {
  return __builtin_shufflevector(a, b, 0, 8, 1, 9, 2, 10, 3, 11);
}
static Lanes2 HighPairs(Lanes2 a, Lanes2 b) {
  return __builtin_shufflevector(a, b, 4, 12, 5, 13, 6, 14, 7, 15);
}
static Lanes4 LowPairs(Lanes4 a, Lanes4 b) {
  return __builtin_shufflevector(a, b, 0, 4, 1, 5);
}
static Lanes4 HighPairs(Lanes4 a, Lanes4 b) {
  return __builtin_shufflevector(a, b, 2, 6, 3, 7);
}
static Lanes8 LowPairs(Lanes8 a, Lanes8 b) {
  return __builtin_shufflevector(a, b, 0, 2);
}
static Lanes8 HighPairs(Lanes8 a, Lanes8 b) {
  return __builtin_shufflevector(a, b, 1, 3);
}

// Pairs rows i and i + half. Each round turns the highest bit of a unit's row number into the
// lowest of its place within the row; after as many rounds as there are bits, the units of a column
// lie side by side. Recursion instead of a loop keeps the rows in registers.
template <int kRounds, typename Lanes, int kRows>
KESTREL_INLINE void PairRows(Lanes (&rows)[kRows]) {
  if constexpr (kRounds > 0) {
    Lanes paired[kRows];
    for (int i = 0; i < kRows / 2; ++i) {
      paired[2 * i] = LowPairs(rows[i], rows[i + kRows / 2]);
      paired[2 * i + 1] = HighPairs(rows[i], rows[i + kRows / 2]);
    }
    PairRows<kRounds - 1>(paired);
    for (int i = 0; i < kRows; ++i) rows[i] = paired[i];
  }
}

template <typename Lanes, int kRows>
KESTREL_INLINE void LoadPaired(Lanes (&rows)[kRows], const uint8_t* src, ptrdiff_t srcPitch) {
  for (int i = 0; i < kRows; ++i) rows[i] = LoadLanes<Lanes>(src + i * srcPitch);
  PairRows<(kRows == 8 ? 3 : 2)>(rows);
}

// A square of 16 bytes by as many rows as make 16 bytes of a column.
template <typename Lanes, int kUnit>
struct TransposedSquare {
  static constexpr int kSide = 16 / kUnit;
  static constexpr int kRows = kSide;
  static constexpr int kColumns = kSide;

  static void Write(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch) {
    Lanes rows[kSide];
    LoadPaired(rows, src, srcPitch);
    for (int i = 0; i < kSide; ++i) StoreLanes(dst + i * dstPitch, rows[i]);
  }
};

// Sixteen rows do not fit the registers: two halves of eight, joined column by column.
template <>
struct TransposedSquare<Lanes1, 1> {
  static constexpr int kRows = 16;
  static constexpr int kColumns = 16;

  static void Write(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch) {
    Lanes1 upper[8], lower[8];
    LoadPaired(upper, src, srcPitch);
    LoadPaired(lower, src + 8 * srcPitch, srcPitch);
    for (int i = 0; i < 8; ++i) {
      StoreLanes(dst + 2 * i * dstPitch, LowPairs(Lanes8(upper[i]), Lanes8(lower[i])));
      StoreLanes(dst + (2 * i + 1) * dstPitch, HighPairs(Lanes8(upper[i]), Lanes8(lower[i])));
    }
  }
};

void Transpose(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch, int unit,
               int rows, int columns) {
  switch (unit) {
    case 1:
      return TransposeBy<TransposedSquare<Lanes1, 1>, 1>(dst, dstPitch, src, srcPitch, rows,
                                                         columns);
    case 2:
      return TransposeBy<TransposedSquare<Lanes2, 2>, 2>(dst, dstPitch, src, srcPitch, rows,
                                                         columns);
    case 3:
      return TransposeUnits<3>(dst, dstPitch, src, srcPitch, rows, columns);
    default:
      return TransposeBy<TransposedSquare<Lanes4, 4>, 4>(dst, dstPitch, src, srcPitch, rows,
                                                         columns);
  }
}

}  // namespace scalar

const RowOps kScalarRows = {"scalar",
                            scalar::ReadStrided,
                            scalar::Gather,
                            scalar::GatherPixels,
                            scalar::PlanPairs,
                            scalar::ReadPairs,
                            scalar::BlendPairs,
                            scalar::BlendColumns,
                            scalar::BlendRows,
                            scalar::BlendPixelRows,
                            scalar::UnpackRgb,
                            scalar::UnpackAlpha,
                            scalar::GatherIndexed,
                            scalar::YuvToRgbByWideSums,
                            scalar::YuvToRgbCarry,
                            scalar::YuvToPixels,
                            scalar::RgbToYuv,
                            scalar::PixelsToYuv,
                            scalar::PixelPairsToChroma,
                            scalar::MapLevels,
                            scalar::NarrowWithCarry,
                            scalar::PackRgb,
                            scalar::RepackPixels,
                            scalar::PutAlpha,
                            scalar::Interleave,
                            scalar::Deinterleave,
                            scalar::SwapPairs,
                            scalar::SplitGroups,
                            scalar::Transpose,
                            scalar::WriteStrided,
                            scalar::WritePixels};

}  // namespace kestrel
