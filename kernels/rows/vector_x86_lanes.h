// How samples move within and between registers of SSE4.1 and AVX2. AVX2 works on two lanes of 16
// bytes each. Part of vector_x86.h, whose first lines hold here too.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_X86_LANES_H
#define KESTREL_KERNELS_ROWS_VECTOR_X86_LANES_H

#include "kernels/rows/rows_scalar.h"
#include "kernels/rows/vector_x86_words.h"

namespace kestrel {
namespace {

// ---- Loads and stores
#ifdef __AVX2__
inline Register Join(__m128i low, __m128i high) {
  return _mm256_inserti128_si256(_mm256_castsi128_si256(low), high, 1);
}
inline __m128i LowLane(Register v) {
  return _mm256_castsi256_si128(v);
}
inline __m128i HighLane(Register v) {
  return _mm256_extracti128_si256(v, 1);
}
// Register i of `count` that together hold a run: each lane works on its own half of the run, so
// that results of operations within lanes are in order.
inline Register LoadLanes(const uint8_t* p, int i, int count) {
  return Join(Load16(p + 16 * i), Load16(p + 16 * (count + i)));
}
inline void StoreLanes(uint8_t* p, int i, int count, Register v) {
  Store16(p + 16 * i, LowLane(v));
  Store16(p + 16 * (count + i), HighLane(v));
}
inline Words LoadHalf(const uint8_t* p) {
  return {_mm256_cvtepu8_epi16(Load16(p))};
}
#else
inline Register LoadLanes(const uint8_t* p, int i, int) {
  return Load16(p + 16 * i);
}
inline void StoreLanes(uint8_t* p, int i, int, Register v) {
  Store16(p + 16 * i, v);
}
inline Words LoadHalf(const uint8_t* p) {
  return {_mm_cvtepu8_epi16(Load8(p))};
}
#endif

// ---- Packed and planar
// Bytes of kBytes pairs apart.
KESTREL_INLINE void Load2(const uint8_t* p, Bytes* first, Bytes* second) {
  const Words a = {LoadLanes(p, 0, 2)};
  const Words b = {LoadLanes(p, 1, 2)};
  const Words mask = SetWords(0xFF);
  *first = Narrow(a & mask, b & mask);
  *second = Narrow(ShiftRightUnsigned<8>(a), ShiftRightUnsigned<8>(b));
}
KESTREL_INLINE void Store2(uint8_t* p, Bytes first, Bytes second) {
  StoreLanes(p, 0, 2, KESTREL_SIMD(unpacklo_epi8)(first.v, second.v));
  StoreLanes(p, 1, 2, KESTREL_SIMD(unpackhi_epi8)(first.v, second.v));
}
// Words of a vector's pixels, in order.
inline void StorePixelWords(uint8_t* p, WordsPair w) {
  StoreLanes(p, 0, 2, w.low.v);
  StoreLanes(p, 1, 2, w.high.v);
}
inline WordsPair LoadPixelWords(const uint8_t* p) {
  return {{LoadLanes(p, 0, 2)}, {LoadLanes(p, 1, 2)}};
}

KESTREL_INLINE PixelBytes Load4(const uint8_t* p) {
  // 0 4 8 12  1 5 9 13 ...: four bytes of each channel beside each other.
  const Register order =
      Broadcast(_mm_setr_epi8(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15));
  const Register a = KESTREL_SIMD(shuffle_epi8)(LoadLanes(p, 0, 4), order);
  const Register b = KESTREL_SIMD(shuffle_epi8)(LoadLanes(p, 1, 4), order);
  const Register c = KESTREL_SIMD(shuffle_epi8)(LoadLanes(p, 2, 4), order);
  const Register d = KESTREL_SIMD(shuffle_epi8)(LoadLanes(p, 3, 4), order);
  const Register low01 = KESTREL_SIMD(unpacklo_epi32)(a, b);
  const Register low23 = KESTREL_SIMD(unpacklo_epi32)(c, d);
  const Register high01 = KESTREL_SIMD(unpackhi_epi32)(a, b);
  const Register high23 = KESTREL_SIMD(unpackhi_epi32)(c, d);
  return {{KESTREL_SIMD(unpacklo_epi64)(low01, low23)},
          {KESTREL_SIMD(unpackhi_epi64)(low01, low23)},
          {KESTREL_SIMD(unpacklo_epi64)(high01, high23)},
          {KESTREL_SIMD(unpackhi_epi64)(high01, high23)}};
}

// Four-byte pixels in four registers, four pixels per lane.

// neighbouring pixels.
inline Register InTurn(Register v) {
#ifdef __AVX2__
  return _mm256_permutevar8x32_epi32(v, _mm256_setr_epi32(0, 2, 4, 6, 1, 3, 5, 7));
#else
  return v;
#endif
}
inline Bytes InTurn(Bytes b) {
  return {InTurn(b.v)};
}
inline Words InTurn(Words w) {
  return {InTurn(w.v)};
}
// Words of a vector's pixels, in that order.
inline WordsPair LoadPixelWordsInTurn(const uint8_t* p) {
#ifdef __AVX2__
  return {{_mm256_permute4x64_epi64(Load(p), 0xD8)},
          {_mm256_permute4x64_epi64(Load(p + kBytes), 0xD8)}};
#else
  return LoadPixelWords(p);
#endif
}
KESTREL_INLINE void Store4InTurn(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const Quads quads = Interleave4(a, b, c, d);
  for (int i = 0; i < 4; ++i) Store(p + kBytes * i, quads.v[i]);
}
KESTREL_INLINE void Store4(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const Quads quads = Interleave4(a, b, c, d);
  for (int i = 0; i < 4; ++i) StoreLanes(p, i, 4, quads.v[i]);
}

// Byte i of the channel is byte 3 * i + c of the 48 that three registers hold.
template <int kChannel>
KESTREL_INLINE Bytes PickOfThree(Register a, Register b, Register c) {
  alignas(16) int8_t order[3][16];
  for (int i = 0; i < 16; ++i) {
    for (int part = 0; part < 3; ++part) {
      const int from = 3 * i + kChannel - 16 * part;
      order[part][i] = int8_t(from >= 0 && from < 16 ? from : -1);
    }
  }
  const Words x = {KESTREL_SIMD(shuffle_epi8)(a, Broadcast(Load16(order[0])))};
  const Words y = {KESTREL_SIMD(shuffle_epi8)(b, Broadcast(Load16(order[1])))};
  const Words z = {KESTREL_SIMD(shuffle_epi8)(c, Broadcast(Load16(order[2])))};
  return {(x | y | z).v};
}
KESTREL_INLINE PixelBytes Load3(const uint8_t* p) {
  const Register a = LoadLanes(p, 0, 3);
  const Register b = LoadLanes(p, 1, 3);
  const Register c = LoadLanes(p, 2, 3);
  return {PickOfThree<0>(a, b, c), PickOfThree<1>(a, b, c), PickOfThree<2>(a, b, c), SetBytes(0)};
}
KESTREL_INLINE void Store3(uint8_t* p, Bytes a, Bytes b, Bytes c) {
  const Quads quads = Interleave4(a, b, c, c);
  // Twelve bytes of each register, the fourth byte of each pixel left out.
  const Register order =
      Broadcast(_mm_setr_epi8(0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, -1, -1, -1, -1));
  Register v[4];
  for (int i = 0; i < 4; ++i) v[i] = KESTREL_SIMD(shuffle_epi8)(quads.v[i], order);
  const auto join = [](Register x, Register y) { return (Words{x} | Words{y}).v; };
  StoreLanes(p, 0, 3, join(v[0], KESTREL_LANE_SHIFT(sl)(v[1], 12)));
  StoreLanes(p, 1, 3, join(KESTREL_LANE_SHIFT(sr)(v[1], 4), KESTREL_LANE_SHIFT(sl)(v[2], 8)));
  StoreLanes(p, 2, 3, join(KESTREL_LANE_SHIFT(sr)(v[2], 8), KESTREL_LANE_SHIFT(sl)(v[3], 4)));
}

// ---- Order of bytes
// Of each byte and all before it, modulo 256; and the last byte everywhere.
inline Bytes RunningSums(Bytes b) {
  Bytes sums = RunningSumsOfLanes(b);
#ifdef __AVX2__
  const Register last = _mm256_shuffle_epi8(sums.v, SetBytes(15).v);
  sums = sums + Bytes{_mm256_permute2x128_si256(last, last, 0x08)};
#endif
  return sums;
}
inline Bytes LastByte(Bytes b) {
  const Register last = KESTREL_SIMD(shuffle_epi8)(b.v, SetBytes(15).v);
#ifdef __AVX2__
  return {_mm256_permute4x64_epi64(last, 0xFF)};
#else
  return {last};
#endif
}
inline Bytes Reversed(Bytes b) {
  const Register v = KESTREL_SIMD(shuffle_epi8)(
      b.v, Broadcast(_mm_setr_epi8(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0)));
#ifdef __AVX2__
  return {_mm256_permute4x64_epi64(v, 0x4E)};
#else
  return {v};
#endif
}
// The last unit first.
template <int kUnit>
inline void StoreReversed(uint8_t* p, const uint8_t* src) {
  const Register order =
      Broadcast(kUnit == 1   ? _mm_setr_epi8(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0)
                : kUnit == 2 ? _mm_setr_epi8(14, 15, 12, 13, 10, 11, 8, 9, 6, 7, 4, 5, 2, 3, 0, 1)
                             : _mm_setr_epi8(12, 13, 14, 15, 8, 9, 10, 11, 4, 5, 6, 7, 0, 1, 2, 3));
  const Register v = KESTREL_SIMD(shuffle_epi8)(Load(src), order);
#ifdef __AVX2__
  // By halves: whole vectors would lie across two cache lines more often than not.
  Store16(p, HighLane(v));
  Store16(p + 16, LowLane(v));
#else
  Store(p, v);
#endif
}
// Of two vectors narrowed lane by lane: the first one's bytes before the second one's.
inline Bytes InOrder(Bytes narrowed) {
#ifdef __AVX2__
  return {_mm256_permute4x64_epi64(narrowed.v, 0xD8)};
#else
  return narrowed;
#endif
}

// Half a block of a plan: its windows and its shuffle.
template <int kWindows>
inline Words GatherWords(const uint8_t* src, const uint8_t* windows, int first,
                         const uint8_t* shuffle) {
  const auto window = [=](int i) { return src + WindowAt(windows, first + i); };
  const Register order = Load(shuffle);
  const auto gather = [&](int half) {
#ifdef __AVX2__
    const Register bytes = Join(Load16(window(half)), Load16(window(kWindows + half)));
#else
    const Register bytes = Load16(window(half));
#endif
    return KESTREL_SIMD(shuffle_epi8)(bytes, order);
  };
  if constexpr (kWindows == 1) {
    return {gather(0)};
  } else if constexpr (kWindows == 2) {
    return {KESTREL_SIMD(blend_epi16)(gather(0), gather(1), 0xF0)};
  } else {
    return {KESTREL_SIMD(blend_epi16)(KESTREL_SIMD(blend_epi16)(gather(0), gather(1), 0x0C),
                                      KESTREL_SIMD(blend_epi16)(gather(2), gather(3), 0xC0), 0xF0)};
  }
}

// ---- Pixels of four bytes
// Register i of kBytes pixels, and of the second ones of as many pairs, in an order that
// NarrowedQuads knows to set right when each pixel has become a byte.
inline Register LoadQuads(const uint8_t* p, int i) {
  return LoadLanes(p, i, 4);
}
inline Register LoadSecondQuads(const uint8_t* p, int i) {
  const Register a = LoadLanes(p, 2 * i, 8);
  const Register b = LoadLanes(p, 2 * i + 1, 8);
#ifdef __AVX2__
  return _mm256_castps_si256(
      _mm256_shuffle_ps(_mm256_castsi256_ps(a), _mm256_castsi256_ps(b), 0xDD));
#else
  return _mm_castps_si128(_mm_shuffle_ps(_mm_castsi128_ps(a), _mm_castsi128_ps(b), 0xDD));
#endif
}
inline Bytes NarrowedQuads(Bytes b) {
  return b;
}
inline __m128i GatherFourQuads(const uint8_t* src, const int32_t* offsets) {
  const auto quad = [src](int32_t offset) {
    int32_t value;
    __builtin_memcpy(&value, src + offset, 4);
    return value;
  };
  __m128i v = _mm_cvtsi32_si128(quad(offsets[0]));
  v = _mm_insert_epi32(v, quad(offsets[1]), 1);
  v = _mm_insert_epi32(v, quad(offsets[2]), 2);
  return _mm_insert_epi32(v, quad(offsets[3]), 3);
}
// Vectors may be loaded up to `end`.
KESTREL_INLINE Bytes GatherQuads(const uint8_t* src, const int32_t* offsets, int32_t end) {
#ifdef __AVX2__
  // Most often four pixels are among eight neighbours.
  const __m256i at = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(offsets));
  const __m256i first = _mm256_shuffle_epi32(at, 0);
  const __m256i distance = _mm256_sub_epi32(at, first);
  const bool near = _mm256_testz_si256(distance, _mm256_set1_epi32(~28)) != 0;
  if (near && offsets[0] + kBytes <= end && offsets[4] + kBytes <= end) {
    const __m256i index = _mm256_srli_epi32(distance, 2);
    return {_mm256_blend_epi32(_mm256_permutevar8x32_epi32(Load(src + offsets[0]), index),
                               _mm256_permutevar8x32_epi32(Load(src + offsets[4]), index), 0xF0)};
  }
  return {Join(GatherFourQuads(src, offsets), GatherFourQuads(src, offsets + 4))};
#else
  static_cast<void>(end);
  return {GatherFourQuads(src, offsets)};
#endif
}
}  // namespace
}  // namespace kestrel

#endif
