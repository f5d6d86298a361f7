// Vectors of bytes and of 16-bit words for x86-64: 16 bytes with SSE4.1, 32 with AVX2, 64 with
// AVX-512, by the flags of the file that includes this. Everything is in an unnamed namespace,
// because files with different flags must never share a function.
//
// Bytes are in the order of memory. Where words stand for the bytes of one vector they come as a
// pair, low and high halves, in an order that only these files know: registers have lanes of 16
// bytes, and halves are halves of each lane.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_X86_H
#define KESTREL_KERNELS_ROWS_VECTOR_X86_H

#include "kernels/rows/rows_scalar.h"
#ifdef __AVX512VBMI__
#include "kernels/rows/vector_x86_avx512.h"
#else
#include "kernels/rows/vector_x86_lanes.h"
#endif
#include "kernels/rows/transpose.h"
#include "kernels/rows/vector_x86_words.h"
#include "kernels/rows/weights.h"

namespace kestrel {
namespace {

// A sum that products are added to.
inline Words Fixed(Words sum) {
  return sum;
}

// ---- Bytes that are multiplied
using Multiplicands = WordsPair;
struct MultiplicandsPair {
  Multiplicands first, second;
};
inline Multiplicands ToMultiplicands(Bytes b) {
  return Widen(b);
}
// Of kBytes pairs.
template <bool kInTurn>
inline MultiplicandsPair LoadMultiplicands(const uint8_t* p) {
  const WordsPair pairs = kInTurn ? LoadPixelWordsInTurn(p) : LoadPixelWords(p);
  const Words mask = SetWords(0xFF);
  return {{pairs.low & mask, pairs.high & mask},
          {ShiftRightUnsigned<8>(pairs.low), ShiftRightUnsigned<8>(pairs.high)}};
}
using ByteFactor = Factor;
inline WordsPair MultiplyAdd(WordsPair sum, const Multiplicands& a, const ByteFactor& f) {
  return {MultiplyAdd(sum.low, a.low, f), MultiplyAdd(sum.high, a.high, f)};
}
inline WordsPair MultiplySubtract(WordsPair sum, const Multiplicands& a, const ByteFactor& f) {
  return {MultiplySubtract(sum.low, a.low, f), MultiplySubtract(sum.high, a.high, f)};
}

// base, which is a or b, and what a blend of the two adds to it.
inline Bytes AddShare(Bytes base, Bytes a, Bytes b, Words weight) {
  const WordsPair first = Widen(a);
  const WordsPair second = Widen(b);
  const WordsPair sum = Widen(base);
  return Narrow(AddHighProduct(sum.low, second.low - first.low, weight),
                AddHighProduct(sum.high, second.high - first.high, weight));
}

// ---- Order of bytes
// The odd bytes of two vectors.
inline Bytes Seconds(Bytes a, Bytes b) {
  return InOrder(Narrow(ShiftRightUnsigned<8>(Words{a.v}), ShiftRightUnsigned<8>(Words{b.v})));
}
// A block of a plan: of its windows and its shuffle.
template <int kWindows>
inline Pairs GatherPairs(const uint8_t* src, const uint8_t* windows, const uint8_t* shuffle) {
  constexpr int kHalf = kPairs / kWindow * kWindows;
  return {{GatherWords<kWindows>(src, windows, 0, shuffle),
           GatherWords<kWindows>(src, windows, kHalf, shuffle + kBytes)}};
}
inline void StoreBlended(uint8_t* p, const Pairs& pairs, const uint16_t* negativeWeights) {
  StoreBytes(p, InOrder(Narrow(Blended(pairs.words[0], negativeWeights),
                               Blended(pairs.words[1], negativeWeights + kWords))));
}
inline Bytes SwapNeighbours(Bytes b) {
  const Words w = {b.v};
  return {(ShiftLeft<8>(w) | ShiftRightUnsigned<8>(w)).v};
}

// ---- RGB to YUV
// Pixels of four bytes in words: their outer bytes in turn, and their middle one twice.
struct QuadOperands {
  Register outer[4], middle[4];
};
template <bool kSeconds>
KESTREL_INLINE QuadOperands LoadQuadOperands(const uint8_t* p) {
  const Register middleTwice =
      Broadcast(_mm_setr_epi8(1, -1, 1, -1, 5, -1, 5, -1, 9, -1, 9, -1, 13, -1, 13, -1));
  QuadOperands quads;
  for (int i = 0; i < 4; ++i) {
    const Register pixels = kSeconds ? LoadSecondQuads(p, i) : LoadQuads(p, i);
    quads.outer[i] = (Words{pixels} & SetWords(0xFF)).v;
    quads.middle[i] = KESTREL_SIMD(shuffle_epi8)(pixels, middleTwice);
  }
  return quads;
}

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
  KESTREL_INLINE Bytes Of(const PixelBytes& p) const {
    return Narrow(Eight(KESTREL_SIMD(unpacklo_epi8)(p.low.v, p.high.v),
                        KESTREL_SIMD(unpacklo_epi8)(p.middle.v, p.middle.v)),
                  Eight(KESTREL_SIMD(unpackhi_epi8)(p.low.v, p.high.v),
                        KESTREL_SIMD(unpackhi_epi8)(p.middle.v, p.middle.v)));
  }
  KESTREL_INLINE Bytes Of(const QuadOperands& quads) const {
    Register sums[4];
    for (int i = 0; i < 4; ++i) sums[i] = Sums(quads.outer[i], quads.middle[i]);
    return NarrowedQuads(Narrow({KESTREL_SIMD(packs_epi32)(sums[0], sums[1])},
                                {KESTREL_SIMD(packs_epi32)(sums[2], sums[3])}));
  }

 private:
  static constexpr bool kNegated = kSigns != Signs::kAllPositive;

  static Register Pair(int32_t low, int32_t high) {
    return KESTREL_SIMD(set1_epi32)(int32_t((uint32_t(low) & 0xFFFF) | uint32_t(high) << 16));
  }
  // Of words: the outer bytes in turn, and the middle one twice; 32 bits for each pixel.
  Register Sums(Register outer, Register middle) const {
#ifdef __AVX512VNNI__
    const Register start = kNegated ? Zero() : offset_;
    const Register sum =
        _mm512_dpwssd_epi32(_mm512_dpwssd_epi32(start, outer, outer_), middle, middle_);
    return _mm512_srai_epi32(kNegated ? _mm512_sub_epi32(offset_, sum) : sum, 16);
#else
    const Register sum = KESTREL_SIMD(add_epi32)(KESTREL_SIMD(madd_epi16)(outer, outer_),
                                                 KESTREL_SIMD(madd_epi16)(middle, middle_));
    return KESTREL_SIMD(srai_epi32)(
        kNegated ? KESTREL_SIMD(sub_epi32)(offset_, sum) : KESTREL_SIMD(add_epi32)(offset_, sum),
        16);
#endif
  }
  KESTREL_INLINE Words Eight(Register outer, Register middle) const {
    const WordsPair o = Widen({outer});
    const WordsPair m = Widen({middle});
    return {KESTREL_SIMD(packs_epi32)(Sums(o.low.v, m.low.v), Sums(o.high.v, m.high.v))};
  }

  Register outer_, middle_, offset_;
};

template <Signs kSigns, typename Call>
void WithSumOf(const Weights& weights, const Call& call) {
  call(WeightedSum<kSigns>(weights.of, weights.offset));
}

template <typename Call>
void WithSum(const Weights& weights, const Call& call) {
  switch (weights.signs()) {
    case Signs::kAllPositive:
      return WithSumOf<Signs::kAllPositive>(weights, call);
    case Signs::kFirstPositive:
      return WithSumOf<Signs::kFirstPositive>(weights, call);
    default:
      return WithSumOf<Signs::kLastPositive>(weights, call);
  }
}

// ---- Transposition
// Eight rows of four pixels of three bytes, which are turned as words with a byte to spare.
struct Block24 {
  static constexpr int kRows = 8;
  static constexpr int kColumns = 4;
  static void Write(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch) {
    const __m128i toStart = _mm_setr_epi8(0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, -1, -1, -1, -1);
    const __m128i toEnd = _mm_setr_epi8(-1, -1, -1, -1, 0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14);
    __m128i upper[kColumns], lower[kColumns];
    ReadFour(upper, src, srcPitch);
    ReadFour(lower, src + 4 * srcPitch, srcPitch);
    for (int i = 0; i < kColumns; ++i, dst += dstPitch) {
      const __m128i first = _mm_shuffle_epi8(upper[i], toEnd);
      const __m128i last = _mm_shuffle_epi8(lower[i], toStart);
      Store16(dst, _mm_alignr_epi8(last, first, 4));
      _mm_storel_epi64(reinterpret_cast<__m128i*>(dst + 16), _mm_srli_si128(last, 4));
    }
  }

 private:
  // Columns of four rows.
  static void ReadFour(__m128i (&columns)[4], const uint8_t* src, ptrdiff_t pitch) {
    const __m128i a = ReadRow(src);
    const __m128i b = ReadRow(src + pitch);
    const __m128i c = ReadRow(src + 2 * pitch);
    const __m128i d = ReadRow(src + 3 * pitch);
    const __m128i ab = _mm_unpacklo_epi32(a, b);
    const __m128i cd = _mm_unpacklo_epi32(c, d);
    const __m128i restOfAB = _mm_unpackhi_epi32(a, b);
    const __m128i restOfCD = _mm_unpackhi_epi32(c, d);
    columns[0] = _mm_unpacklo_epi64(ab, cd);
    columns[1] = _mm_unpackhi_epi64(ab, cd);
    columns[2] = _mm_unpacklo_epi64(restOfAB, restOfCD);
    columns[3] = _mm_unpackhi_epi64(restOfAB, restOfCD);
  }
  static __m128i ReadRow(const uint8_t* p) {
    const __m128i toWords = _mm_setr_epi8(0, 1, 2, -1, 3, 4, 5, -1, 6, 7, 8, -1, 9, 10, 11, -1);
    int32_t rest;
    __builtin_memcpy(&rest, p + 8, sizeof(rest));
    return _mm_shuffle_epi8(_mm_insert_epi32(Load8(p), rest, 2), toWords);
  }
};

#ifdef __AVX2__
// Two squares of 16 bytes side by side: a vector has a row of each, and later a column of each.
template <int kUnit>
struct TwoSquares {
  static constexpr int kRows = 16 / kUnit;
  static constexpr int kColumns = 2 * kRows;
  static void Write(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch) {
    // Sixteen rows do not fit the registers: two halves of eight, joined column by column.
    constexpr int kAtOnce = kRows < 8 ? kRows : 8;
    __m256i upper[kAtOnce], lower[kAtOnce];
    LoadPaired(upper, src, srcPitch);
    if constexpr (kUnit == 1) LoadPaired(lower, src + kAtOnce * srcPitch, srcPitch);
    for (int i = 0; i < kAtOnce; ++i) {
      if constexpr (kUnit == 1) {
        Store(dst, dstPitch, 2 * i, _mm256_unpacklo_epi64(upper[i], lower[i]));
        Store(dst, dstPitch, 2 * i + 1, _mm256_unpackhi_epi64(upper[i], lower[i]));
      } else {
        Store(dst, dstPitch, i, upper[i]);
      }
    }
  }

 private:
  template <int kCount>
  KESTREL_INLINE static void LoadPaired(__m256i (&rows)[kCount], const uint8_t* src,
                                        ptrdiff_t pitch) {
    for (int i = 0; i < kCount; ++i) rows[i] = Load(src + i * pitch);
    PairRows<(kCount == 8 ? 3 : 2)>(rows);
  }
  // Rows i and i + half, unit by unit in turn. After as many rounds as the number of a row has bits
  // the units of a column lie side by side.
  template <int kRounds, int kCount>
  KESTREL_INLINE static void PairRows(__m256i (&rows)[kCount]) {
    if constexpr (kRounds > 0) {
      __m256i paired[kCount];
      for (int i = 0; i < kCount / 2; ++i) {
        const __m256i a = rows[i];
        const __m256i b = rows[i + kCount / 2];
        paired[2 * i] = kUnit == 1   ? _mm256_unpacklo_epi8(a, b)
                        : kUnit == 2 ? _mm256_unpacklo_epi16(a, b)
                                     : _mm256_unpacklo_epi32(a, b);
        paired[2 * i + 1] = kUnit == 1   ? _mm256_unpackhi_epi8(a, b)
                            : kUnit == 2 ? _mm256_unpackhi_epi16(a, b)
                                         : _mm256_unpackhi_epi32(a, b);
      }
      PairRows<kRounds - 1>(paired);
      for (int i = 0; i < kCount; ++i) rows[i] = paired[i];
    }
  }
  KESTREL_INLINE static __m256i Load(const uint8_t* p) {
    return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p));
  }
  KESTREL_INLINE static void Store(uint8_t* dst, ptrdiff_t pitch, int column, __m256i columns) {
    Store16(dst + column * pitch, _mm256_castsi256_si128(columns));
    Store16(dst + (column + kRows) * pitch, _mm256_extracti128_si256(columns, 1));
  }
};

template <int kUnit>
bool TransposeTwoSquares(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch,
                         int rows, int columns) {
  using Block = TwoSquares<kUnit>;
  if (rows < Block::kRows || columns < Block::kColumns) return false;
  TransposeBy<Block, kUnit>(dst, dstPitch, src, srcPitch, rows, columns);
  return true;
}
#endif

// (The reference version is vectors of 16 bytes already, but for pixels of three.)
void Transpose(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch, int unit,
               int rows, int columns) {
  if (unit == 3) return TransposeBy<Block24, 3>(dst, dstPitch, src, srcPitch, rows, columns);
#ifdef __AVX2__
  const bool done = unit == 1 ? TransposeTwoSquares<1>(dst, dstPitch, src, srcPitch, rows, columns)
                    : unit == 2
                        ? TransposeTwoSquares<2>(dst, dstPitch, src, srcPitch, rows, columns)
                        : TransposeTwoSquares<4>(dst, dstPitch, src, srcPitch, rows, columns);
  if (done) return;
#endif
  scalar::Transpose(dst, dstPitch, src, srcPitch, unit, rows, columns);
}

}  // namespace
}  // namespace kestrel

#endif
