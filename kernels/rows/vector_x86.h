// Vectors of bytes and of 16-bit words for x86-64: 16 bytes with SSE4.1, 32 with AVX2, by the flags
// of the file that includes this. Everything is in an unnamed namespace, because files with
// different flags must never share a function.
//
// Bytes are in the order of memory. Where words stand for the bytes of one vector they come as a
// pair, low and high halves, in an order that only this file knows: AVX2 works on two lanes of 16
// bytes each, and halves are halves of each lane.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_X86_H
#define KESTREL_KERNELS_ROWS_VECTOR_X86_H

#include <immintrin.h>
#include <stdint.h>
#include <string.h>

namespace kestrel {
namespace {

#ifdef __AVX2__
#define KESTREL_SIMD(operation) _mm256_##operation
using Register = __m256i;
#else
#define KESTREL_SIMD(operation) _mm_##operation
using Register = __m128i;
#endif

struct Bytes {
  Register v;
};
struct Words {
  Register v;
};
struct WordsPair {
  Words low, high;
};
// Products of 32 bits as two vectors of halves.
struct Product {
  Words low, high;
};

constexpr int kBytes = int(sizeof(Register));
constexpr int kWords = kBytes / 2;

// ---- Loads and stores
inline __m128i Load16(const void* p) {
  return _mm_loadu_si128(static_cast<const __m128i*>(p));
}
inline void Store16(void* p, __m128i v) {
  _mm_storeu_si128(static_cast<__m128i*>(p), v);
}
inline __m128i Load8(const void* p) {
  return _mm_loadl_epi64(static_cast<const __m128i*>(p));
}

#ifdef __AVX2__
inline Register Load(const void* p) {
  return _mm256_loadu_si256(static_cast<const __m256i*>(p));
}
inline void Store(void* p, Register v) {
  _mm256_storeu_si256(static_cast<__m256i*>(p), v);
}
inline Register Join(__m128i low, __m128i high) {
  return _mm256_inserti128_si256(_mm256_castsi128_si256(low), high, 1);
}
inline __m128i LowLane(Register v) {
  return _mm256_castsi256_si128(v);
}
inline __m128i HighLane(Register v) {
  return _mm256_extracti128_si256(v, 1);
}
inline Register Broadcast(__m128i v) {
  return _mm256_broadcastsi128_si256(v);
}
inline Register Zero() {
  return _mm256_setzero_si256();
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
// Words clamped to bytes, half a vector of them.
inline void StoreHalf(uint8_t* p, Words w) {
  Store16(p, _mm_packus_epi16(LowLane(w.v), HighLane(w.v)));
}
#else
inline Register Load(const void* p) {
  return Load16(p);
}
inline void Store(void* p, Register v) {
  Store16(p, v);
}
inline Register Broadcast(__m128i v) {
  return v;
}
inline Register Zero() {
  return _mm_setzero_si128();
}
inline Register LoadLanes(const uint8_t* p, int i, int) {
  return Load16(p + 16 * i);
}
inline void StoreLanes(uint8_t* p, int i, int, Register v) {
  Store16(p + 16 * i, v);
}
inline Words LoadHalf(const uint8_t* p) {
  return {_mm_cvtepu8_epi16(Load8(p))};
}
inline void StoreHalf(uint8_t* p, Words w) {
  _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packus_epi16(w.v, w.v));
}
#endif

inline Bytes LoadBytes(const uint8_t* p) {
  return {Load(p)};
}
inline void StoreBytes(uint8_t* p, Bytes b) {
  Store(p, b.v);
}
inline Words LoadWords(const void* p) {
  return {Load(p)};
}
inline void StoreWords(void* p, Words w) {
  Store(p, w.v);
}

// ---- Arithmetic of words, wrapping
inline Words SetWords(int value) {
  return {KESTREL_SIMD(set1_epi16)(int16_t(value))};
}
inline Bytes SetBytes(int value) {
  return {KESTREL_SIMD(set1_epi8)(int8_t(value))};
}
inline Words operator+(Words a, Words b) {
  return {KESTREL_SIMD(add_epi16)(a.v, b.v)};
}
inline Words operator-(Words a, Words b) {
  return {KESTREL_SIMD(sub_epi16)(a.v, b.v)};
}
inline Words operator*(Words a, Words b) {
  return {KESTREL_SIMD(mullo_epi16)(a.v, b.v)};
}
#ifdef __AVX2__
inline Words operator&(Words a, Words b) {
  return {_mm256_and_si256(a.v, b.v)};
}
inline Words operator|(Words a, Words b) {
  return {_mm256_or_si256(a.v, b.v)};
}
inline Words operator^(Words a, Words b) {
  return {_mm256_xor_si256(a.v, b.v)};
}
#else
inline Words operator&(Words a, Words b) {
  return {_mm_and_si128(a.v, b.v)};
}
inline Words operator|(Words a, Words b) {
  return {_mm_or_si128(a.v, b.v)};
}
inline Words operator^(Words a, Words b) {
  return {_mm_xor_si128(a.v, b.v)};
}
#endif
template <int kBits>
inline Words ShiftLeft(Words a) {
  return {KESTREL_SIMD(slli_epi16)(a.v, kBits)};
}
// Arithmetic, and logical.
template <int kBits>
inline Words ShiftRight(Words a) {
  return {KESTREL_SIMD(srai_epi16)(a.v, kBits)};
}
template <int kBits>
inline Words ShiftRightUnsigned(Words a) {
  return {KESTREL_SIMD(srli_epi16)(a.v, kBits)};
}
inline Words MultiplyHigh(Words a, Words b) {
  return {KESTREL_SIMD(mulhi_epi16)(a.v, b.v)};
}
inline Product Multiply(Words a, Words b) {
  return {{KESTREL_SIMD(mullo_epi16)(a.v, b.v)}, {KESTREL_SIMD(mulhi_epu16)(a.v, b.v)}};
}
// For CarryOf: every addend is prepared once.
inline Words PrepareCarry(Words addend) {
  return addend ^ SetWords(0x7FFF);
}
// -1 where low + addend, both unsigned, does not fit 16 bits.
inline Words CarryOf(Words low, Words preparedAddend) {
  return {KESTREL_SIMD(cmpgt_epi16)((low ^ SetWords(-0x8000)).v, preparedAddend.v)};
}

// ---- Between bytes and words
inline WordsPair Widen(Bytes b) {
  return {{KESTREL_SIMD(unpacklo_epi8)(b.v, Zero())}, {KESTREL_SIMD(unpackhi_epi8)(b.v, Zero())}};
}
// Signed words clamped to bytes.
inline Bytes Narrow(Words low, Words high) {
  return {KESTREL_SIMD(packus_epi16)(low.v, high.v)};
}
// Each word twice: words of half as many samples become words for pixels.
inline WordsPair Double(Words w) {
  return {{KESTREL_SIMD(unpacklo_epi16)(w.v, w.v)}, {KESTREL_SIMD(unpackhi_epi16)(w.v, w.v)}};
}

// ---- Packed and planar
// Bytes of kBytes pairs apart.
inline void Load2(const uint8_t* p, Bytes* first, Bytes* second) {
  const Words a = {LoadLanes(p, 0, 2)};
  const Words b = {LoadLanes(p, 1, 2)};
  const Words mask = SetWords(0xFF);
  *first = Narrow(a & mask, b & mask);
  *second = Narrow(ShiftRightUnsigned<8>(a), ShiftRightUnsigned<8>(b));
}
inline void Store2(uint8_t* p, Bytes first, Bytes second) {
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

inline void Load4(const uint8_t* p, Bytes (&channels)[4]) {
  // 0 4 8 12  1 5 9 13 ...: four bytes of each channel beside each other.
  const Register order =
      Broadcast(_mm_setr_epi8(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15));
  Register quads[4];
  for (int i = 0; i < 4; ++i) {
    quads[i] = KESTREL_SIMD(shuffle_epi8)(LoadLanes(p, i, 4), order);
  }
  const Register low01 = KESTREL_SIMD(unpacklo_epi32)(quads[0], quads[1]);
  const Register low23 = KESTREL_SIMD(unpacklo_epi32)(quads[2], quads[3]);
  const Register high01 = KESTREL_SIMD(unpackhi_epi32)(quads[0], quads[1]);
  const Register high23 = KESTREL_SIMD(unpackhi_epi32)(quads[2], quads[3]);
  channels[0] = {KESTREL_SIMD(unpacklo_epi64)(low01, low23)};
  channels[1] = {KESTREL_SIMD(unpackhi_epi64)(low01, low23)};
  channels[2] = {KESTREL_SIMD(unpacklo_epi64)(high01, high23)};
  channels[3] = {KESTREL_SIMD(unpackhi_epi64)(high01, high23)};
}

// Four-byte pixels in four registers, four pixels per lane.
struct Quads {
  Register v[4];
};
inline Quads Interleave4(Bytes a, Bytes b, Bytes c, Bytes d) {
  const Register ab0 = KESTREL_SIMD(unpacklo_epi8)(a.v, b.v);
  const Register ab1 = KESTREL_SIMD(unpackhi_epi8)(a.v, b.v);
  const Register cd0 = KESTREL_SIMD(unpacklo_epi8)(c.v, d.v);
  const Register cd1 = KESTREL_SIMD(unpackhi_epi8)(c.v, d.v);
  return {{KESTREL_SIMD(unpacklo_epi16)(ab0, cd0), KESTREL_SIMD(unpackhi_epi16)(ab0, cd0),
           KESTREL_SIMD(unpacklo_epi16)(ab1, cd1), KESTREL_SIMD(unpackhi_epi16)(ab1, cd1)}};
}
inline void Store4(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const Quads quads = Interleave4(a, b, c, d);
  for (int i = 0; i < 4; ++i) StoreLanes(p, i, 4, quads.v[i]);
}

inline void Load3(const uint8_t* p, Bytes (&channels)[3]) {
  const Register v[3] = {LoadLanes(p, 0, 3), LoadLanes(p, 1, 3), LoadLanes(p, 2, 3)};
  // Byte i of channel c is byte 3 * i + c of the 48.
  for (int c = 0; c < 3; ++c) {
    alignas(16) int8_t order[3][16];
    for (int i = 0; i < 16; ++i) {
      for (int part = 0; part < 3; ++part) {
        const int from = 3 * i + c - 16 * part;
        order[part][i] = int8_t(from >= 0 && from < 16 ? from : -1);
      }
    }
    Words merged = {Zero()};
    for (int part = 0; part < 3; ++part) {
      merged = merged | Words{KESTREL_SIMD(shuffle_epi8)(v[part], Broadcast(Load16(order[part])))};
    }
    channels[c] = {merged.v};
  }
}
inline void Store3(uint8_t* p, Bytes a, Bytes b, Bytes c) {
  const Quads quads = Interleave4(a, b, c, c);
  // Twelve bytes of each register, the fourth byte of each pixel left out.
  const Register order =
      Broadcast(_mm_setr_epi8(0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, -1, -1, -1, -1));
  Register v[4];
  for (int i = 0; i < 4; ++i) v[i] = KESTREL_SIMD(shuffle_epi8)(quads.v[i], order);
  const auto join = [](Register x, Register y) { return (Words{x} | Words{y}).v; };
#ifdef __AVX2__
#define KESTREL_LANE_SHIFT(direction) _mm256_b##direction##li_epi128
#else
#define KESTREL_LANE_SHIFT(direction) _mm_b##direction##li_si128
#endif
  StoreLanes(p, 0, 3, join(v[0], KESTREL_LANE_SHIFT(sl)(v[1], 12)));
  StoreLanes(p, 1, 3, join(KESTREL_LANE_SHIFT(sr)(v[1], 4), KESTREL_LANE_SHIFT(sl)(v[2], 8)));
  StoreLanes(p, 2, 3, join(KESTREL_LANE_SHIFT(sr)(v[2], 8), KESTREL_LANE_SHIFT(sl)(v[3], 4)));
#undef KESTREL_LANE_SHIFT
}

// ---- Order of bytes
// The last unit first.
template <int kUnit>
inline void StoreReversed(uint8_t* p, const uint8_t* src) {
  const Register order =
      Broadcast(kUnit == 1   ? _mm_setr_epi8(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0)
                : kUnit == 2 ? _mm_setr_epi8(14, 15, 12, 13, 10, 11, 8, 9, 6, 7, 4, 5, 2, 3, 0, 1)
                             : _mm_setr_epi8(12, 13, 14, 15, 8, 9, 10, 11, 4, 5, 6, 7, 0, 1, 2, 3));
  const Register v = KESTREL_SIMD(shuffle_epi8)(Load(src), order);
#ifdef __AVX2__
  Store(p, _mm256_permute4x64_epi64(v, 0x4E));
#else
  Store(p, v);
#endif
}
inline Bytes SwapNeighbours(Bytes b) {
  const Words w = {b.v};
  return {(ShiftLeft<8>(w) | ShiftRightUnsigned<8>(w)).v};
}

// kWords pairs of a plan from pair i on, as words: first byte low, second byte high.
inline Words GatherPairs(const uint8_t* src, const int32_t* windows, const uint8_t (*shuffles)[8]) {
  __m128i eight[2];
  for (int i = 0; i < kBytes / 16; ++i) {
    eight[i] = _mm_unpacklo_epi64(
        _mm_shuffle_epi8(Load16(src + windows[2 * i]), Load8(shuffles[2 * i])),
        _mm_shuffle_epi8(Load16(src + windows[2 * i + 1]), Load8(shuffles[2 * i + 1])));
  }
#ifdef __AVX2__
  return {Join(eight[0], eight[1])};
#else
  return {eight[0]};
#endif
}

// The odd bytes of two vectors.
inline Bytes Seconds(Bytes a, Bytes b) {
  const Bytes narrow = Narrow(ShiftRightUnsigned<8>(Words{a.v}), ShiftRightUnsigned<8>(Words{b.v}));
#ifdef __AVX2__
  return {_mm256_permute4x64_epi64(narrow.v, 0xD8)};
#else
  return narrow;
#endif
}

// ---- RGB to YUV
// (offset + r * w0 + g * w1 + b * w2) >> 16 of bytes.
class WeightedSum {
 public:
  WeightedSum(const int32_t (&weights)[3], int32_t offset) {
    // 32768 fits as a negative number only, and a weight of more only in two parts.
    negated_ = weights[0] == 32768 || weights[2] == 32768;
    const int32_t sign = negated_ ? -1 : 1;
    const int32_t half = sign * weights[1] / 2;
    redBlue_ = Pair(sign * weights[0], sign * weights[2]);
    green_ = Pair(half, sign * weights[1] - half);
    offset_ = KESTREL_SIMD(set1_epi32)(offset);
  }
  Bytes Of(Bytes r, Bytes g, Bytes b) const {
    const Words low =
        Eight(KESTREL_SIMD(unpacklo_epi8)(r.v, b.v), KESTREL_SIMD(unpacklo_epi8)(g.v, g.v));
    const Words high =
        Eight(KESTREL_SIMD(unpackhi_epi8)(r.v, b.v), KESTREL_SIMD(unpackhi_epi8)(g.v, g.v));
    return Narrow(low, high);
  }
  // Of words: red and blue in turn, and green twice; one sum of 32 bits for each pair.
  Register Sums(Register redBlue, Register green) const {
    const Register sum = KESTREL_SIMD(add_epi32)(KESTREL_SIMD(madd_epi16)(redBlue, redBlue_),
                                                 KESTREL_SIMD(madd_epi16)(green, green_));
    return KESTREL_SIMD(srai_epi32)(
        negated_ ? KESTREL_SIMD(sub_epi32)(offset_, sum) : KESTREL_SIMD(add_epi32)(offset_, sum),
        16);
  }

 private:
  static Register Pair(int32_t low, int32_t high) {
    return KESTREL_SIMD(set1_epi32)(int32_t((uint32_t(low) & 0xFFFF) | uint32_t(high) << 16));
  }
  Words Eight(Register redBlue, Register green) const {
    const WordsPair rb = Widen({redBlue});
    const WordsPair gg = Widen({green});
    return {KESTREL_SIMD(packs_epi32)(Sums(rb.low.v, gg.low.v), Sums(rb.high.v, gg.high.v))};
  }

  Register redBlue_, green_, offset_;
  bool negated_;
};

// The sums of kBytes pixels of four bytes, or of the second ones of as many pairs.
class PixelSum {
 public:
  PixelSum(const WeightedSum& sum, bool blueFirst, bool alphaFirst) : sum_(sum) {
    const int first = alphaFirst ? 1 : 0;
    const int red = blueFirst ? first + 2 : first;
    const int blue = blueFirst ? first : first + 2;
    redBlue_ = Pick(red, blue);
    green_ = Pick(first + 1, first + 1);
  }
  template <bool kSeconds>
  Bytes Of(const uint8_t* p) const {
    Register sums[4];
    for (int i = 0; i < 4; ++i) {
      const Register pixels =
          kSeconds ? Odd(LoadLanes(p, 2 * i, 8), LoadLanes(p, 2 * i + 1, 8)) : LoadLanes(p, i, 4);
      sums[i] = sum_.Sums(KESTREL_SIMD(shuffle_epi8)(pixels, redBlue_),
                          KESTREL_SIMD(shuffle_epi8)(pixels, green_));
    }
    return Narrow({KESTREL_SIMD(packs_epi32)(sums[0], sums[1])},
                  {KESTREL_SIMD(packs_epi32)(sums[2], sums[3])});
  }

 private:
  // Bytes a and b of each pixel as words.
  static Register Pick(int a, int b) {
    return KESTREL_SIMD(add_epi8)(
        KESTREL_SIMD(set1_epi32)(int32_t(uint32_t(a) | 0x8000u | uint32_t(b) << 16 | 0x80000000u)),
        Broadcast(_mm_setr_epi32(0, 0x00040004, 0x00080008, 0x000C000C)));
  }
  // The second pixels of pairs.
  static Register Odd(Register a, Register b) {
#ifdef __AVX2__
    return _mm256_castps_si256(
        _mm256_shuffle_ps(_mm256_castsi256_ps(a), _mm256_castsi256_ps(b), 0xDD));
#else
    return _mm_castps_si128(_mm_shuffle_ps(_mm_castsi128_ps(a), _mm_castsi128_ps(b), 0xDD));
#endif
  }

  WeightedSum sum_;
  Register redBlue_, green_;
};

}  // namespace
}  // namespace kestrel

#endif
