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

#include "kernels/rows/rows_scalar.h"
#include "kernels/rows/weights.h"

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
// The bytes of kBytes pixels, by their place in the pixel.
struct PixelBytes {
  Bytes low, middle, high, alpha;
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
// base + the high half of the signed product.
inline Words AddHighProduct(Words base, Words a, Words b) {
  return base + Words{KESTREL_SIMD(mulhi_epi16)(a.v, b.v)};
}
// A number that words are multiplied by.
struct Factor {
  explicit Factor(int value) : words(SetWords(value)) {}
  Words words;
};
inline Words MultiplyAdd(Words sum, Words a, const Factor& f) {
  return sum + a * f.words;
}
inline Words MultiplySubtract(Words sum, Words a, const Factor& f) {
  return sum - a * f.words;
}
inline Product Multiply(Words a, const Factor& f) {
  return {{KESTREL_SIMD(mullo_epi16)(a.v, f.words.v)}, {KESTREL_SIMD(mulhi_epu16)(a.v, f.words.v)}};
}
// For CarryOf: every addend is prepared once.
inline Words PrepareCarry(Words addend) {
  return addend ^ SetWords(0x7FFF);
}
// -1 where low + addend, both unsigned, does not fit 16 bits.
inline Words CarryOf(Words low, Words preparedAddend) {
  return {KESTREL_SIMD(cmpgt_epi16)((low ^ SetWords(-0x8000)).v, preparedAddend.v)};
}

// A component of chroma, prepared for several words, and a word that it is converted to:
// offset + c * gain, in numbers of 32 bits.
struct ChromaFactor {
  explicit ChromaFactor(Words component) : c(component), times16(ShiftLeft<4>(component)) {}
  Words c, times16;
};
class ChromaWord {
 public:
  ChromaWord(int32_t gain, int32_t offset)
      : high_(gain >> 12),
        low_(gain & 4095),
        offset_(SetWords(offset >> 12)),
        carry_(PrepareCarry(SetWords((offset & 4095) << 4))) {}
  // Without its lowest 12 bits, and modulo 65536: four fractional bits are left.
  Words Sixteenths(const ChromaFactor& chroma) const {
    const Product low = Multiply(chroma.times16, low_);
    return MultiplyAdd(low.high + offset_, chroma.c, high_) - CarryOf(low.low, carry_);
  }
  // Without its lowest 16 bits.
  Words Whole(const ChromaFactor& chroma) const { return ShiftRight<4>(Sixteenths(chroma)); }

 private:
  Factor high_, low_;
  Words offset_, carry_;
};

// ---- Between bytes and words
inline WordsPair Widen(Bytes b) {
  return {{KESTREL_SIMD(unpacklo_epi8)(b.v, Zero())}, {KESTREL_SIMD(unpackhi_epi8)(b.v, Zero())}};
}
// Signed words clamped to bytes.
inline Bytes Narrow(Words low, Words high) {
  return {KESTREL_SIMD(packus_epi16)(low.v, high.v)};
}
template <int kBits>
inline Bytes NarrowShifted(Words low, Words high) {
  return Narrow(ShiftRight<kBits>(low), ShiftRight<kBits>(high));
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

inline PixelBytes Load4(const uint8_t* p) {
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
// Samples in the order in which Store4InTurn writes whole registers: both lanes of each hold
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
inline void Store4InTurn(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const Quads quads = Interleave4(a, b, c, d);
  for (int i = 0; i < 4; ++i) Store(p + kBytes * i, quads.v[i]);
}
inline void Store4(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const Quads quads = Interleave4(a, b, c, d);
  for (int i = 0; i < 4; ++i) StoreLanes(p, i, 4, quads.v[i]);
}

// Byte i of the channel is byte 3 * i + c of the 48 that three registers hold.
template <int kChannel>
inline Bytes PickOfThree(Register a, Register b, Register c) {
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
inline PixelBytes Load3(const uint8_t* p) {
  const Register a = LoadLanes(p, 0, 3);
  const Register b = LoadLanes(p, 1, 3);
  const Register c = LoadLanes(p, 2, 3);
  return {PickOfThree<0>(a, b, c), PickOfThree<1>(a, b, c), PickOfThree<2>(a, b, c), SetBytes(0)};
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
  // By halves: whole vectors would lie across two cache lines more often than not.
  Store16(p, HighLane(v));
  Store16(p + 16, LowLane(v));
#else
  Store(p, v);
#endif
}
inline Bytes SwapNeighbours(Bytes b) {
  const Words w = {b.v};
  return {(ShiftLeft<8>(w) | ShiftRightUnsigned<8>(w)).v};
}

// kWords pairs of a plan, as words: first byte low, second byte high.
inline __m128i GatherEight(const uint8_t* src, const PairPlan::Eight& eight) {
  return _mm_unpacklo_epi64(
      _mm_shuffle_epi8(Load16(src + eight.window[0]), Load8(eight.shuffle[0])),
      _mm_shuffle_epi8(Load16(src + eight.window[1]), Load8(eight.shuffle[1])));
}
inline Words GatherPairs(const uint8_t* src, const PairPlan::Eight* eights) {
#ifdef __AVX2__
  return {Join(GatherEight(src, eights[0]), GatherEight(src, eights[1]))};
#else
  return {GatherEight(src, eights[0])};
#endif
}

// ---- Pixels of four bytes
// Words for the bytes of pixels: `one` for byte `byte`, `others` for the rest.
inline Words QuadWords(int byte, int one, int others) {
  alignas(16) int16_t words[8];
  for (int i = 0; i < 8; ++i) words[i] = int16_t(i % 4 == byte ? one : others);
  return {Broadcast(Load16(words))};
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
inline Bytes GatherQuads(const uint8_t* src, const int32_t* offsets) {
#ifdef __AVX2__
  return {Join(GatherFourQuads(src, offsets), GatherFourQuads(src, offsets + 4))};
#else
  return {GatherFourQuads(src, offsets)};
#endif
}
// Each of a vector's pixels' weights for all its bytes.
inline WordsPair SpreadToQuads(const uint16_t* weights) {
  const __m128i low = _mm_setr_epi8(0, 1, 0, 1, 0, 1, 0, 1, 2, 3, 2, 3, 2, 3, 2, 3);
  const __m128i high = _mm_setr_epi8(4, 5, 4, 5, 4, 5, 4, 5, 6, 7, 6, 7, 6, 7, 6, 7);
#ifdef __AVX2__
  const Register w = Join(Load8(weights), Load8(weights + 4));
#else
  const Register w = Load8(weights);
#endif
  return {{KESTREL_SIMD(shuffle_epi8)(w, Broadcast(low))},
          {KESTREL_SIMD(shuffle_epi8)(w, Broadcast(high))}};
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
// (offset + low * w0 + middle * w1 + high * w2) >> 16 of the bytes of a pixel. 32768 fits as a
// negative number only, and a weight of more only in two parts.
template <Signs kSigns>
class WeightedSum {
 public:
  WeightedSum(const int32_t (&weights)[3], int32_t offset) {
    const int32_t sign = kNegated ? -1 : 1;
    const int32_t half = sign * weights[1] / 2;
    outer_ = Pair(sign * weights[0], sign * weights[2]);
    middle_ = Pair(half, sign * weights[1] - half);
    offset_ = KESTREL_SIMD(set1_epi32)(offset);
  }
  Bytes Of(Bytes low, Bytes middle, Bytes high) const {
    return Narrow(Eight(KESTREL_SIMD(unpacklo_epi8)(low.v, high.v),
                        KESTREL_SIMD(unpacklo_epi8)(middle.v, middle.v)),
                  Eight(KESTREL_SIMD(unpackhi_epi8)(low.v, high.v),
                        KESTREL_SIMD(unpackhi_epi8)(middle.v, middle.v)));
  }
  // The sums of kBytes pixels of four bytes, or of the second ones of as many pairs.
  template <bool kSeconds>
  Bytes OfPixels(const uint8_t* p) const {
    const Register pickOuter = Pick(0, 2);
    const Register pickMiddle = Pick(1, 1);
    Register sums[4];
    for (int i = 0; i < 4; ++i) {
      const Register pixels =
          kSeconds ? Odd(LoadLanes(p, 2 * i, 8), LoadLanes(p, 2 * i + 1, 8)) : LoadLanes(p, i, 4);
      sums[i] = Sums(KESTREL_SIMD(shuffle_epi8)(pixels, pickOuter),
                     KESTREL_SIMD(shuffle_epi8)(pixels, pickMiddle));
    }
    return Narrow({KESTREL_SIMD(packs_epi32)(sums[0], sums[1])},
                  {KESTREL_SIMD(packs_epi32)(sums[2], sums[3])});
  }

 private:
  static constexpr bool kNegated = kSigns != Signs::kAllPositive;

  static Register Pair(int32_t low, int32_t high) {
    return KESTREL_SIMD(set1_epi32)(int32_t((uint32_t(low) & 0xFFFF) | uint32_t(high) << 16));
  }
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
  // Of words: the outer bytes in turn, and the middle one twice; 32 bits for each pixel.
  Register Sums(Register outer, Register middle) const {
    const Register sum = KESTREL_SIMD(add_epi32)(KESTREL_SIMD(madd_epi16)(outer, outer_),
                                                 KESTREL_SIMD(madd_epi16)(middle, middle_));
    return KESTREL_SIMD(srai_epi32)(
        kNegated ? KESTREL_SIMD(sub_epi32)(offset_, sum) : KESTREL_SIMD(add_epi32)(offset_, sum),
        16);
  }
  Words Eight(Register outer, Register middle) const {
    const WordsPair o = Widen({outer});
    const WordsPair m = Widen({middle});
    return {KESTREL_SIMD(packs_epi32)(Sums(o.low.v, m.low.v), Sums(o.high.v, m.high.v))};
  }

  Register outer_, middle_, offset_;
};

template <typename Call>
void WithSum(const Weights& weights, const Call& call) {
  switch (weights.signs()) {
    case Signs::kAllPositive:
      return call(WeightedSum<Signs::kAllPositive>(weights.of, weights.offset));
    case Signs::kFirstPositive:
      return call(WeightedSum<Signs::kFirstPositive>(weights.of, weights.offset));
    default:
      return call(WeightedSum<Signs::kLastPositive>(weights.of, weights.offset));
  }
}

// The reference version is vectors already.
constexpr auto Transpose = scalar::Transpose;

}  // namespace
}  // namespace kestrel

#endif
