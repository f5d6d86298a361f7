// Vectors of 16 bytes and of eight 16-bit words for NEON, 32-bit (without the additions of VFPv4)
// and 64-bit. The same names as in vector_x86.h; here halves of a pair are in plain order.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_NEON_H
#define KESTREL_KERNELS_ROWS_VECTOR_NEON_H

#include <arm_neon.h>
#include <stdint.h>

#include "kernels/rows/rows_scalar.h"
#include "kernels/rows/transpose.h"
#include "kernels/rows/weights.h"

namespace kestrel {
namespace {

struct Bytes {
  uint8x16_t v;
};
struct Words {
  uint16x8_t v;
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

constexpr int kBytes = 16;
constexpr int kWords = 8;
constexpr const RowOps& kNarrower = kScalarRows;  // the set for runs of fewer bytes

inline int16x8_t Signed(Words w) {
  return vreinterpretq_s16_u16(w.v);
}
inline Words Unsigned(int16x8_t v) {
  return {vreinterpretq_u16_s16(v)};
}

// ---- Loads and stores
inline Bytes LoadBytes(const uint8_t* p) {
  return {vld1q_u8(p)};
}
inline void StoreBytes(uint8_t* p, Bytes b) {
  vst1q_u8(p, b.v);
}
// Through bytes: words need not be aligned.
inline Words LoadWords(const void* p) {
  return {vreinterpretq_u16_u8(vld1q_u8(static_cast<const uint8_t*>(p)))};
}
inline void StoreWords(void* p, Words w) {
  vst1q_u8(static_cast<uint8_t*>(p), vreinterpretq_u8_u16(w.v));
}
inline Words LoadHalf(const uint8_t* p) {
  return {vmovl_u8(vld1_u8(p))};
}

// ---- Arithmetic of words, wrapping
inline Words SetWords(int value) {
  return {vdupq_n_u16(uint16_t(value))};
}
inline Bytes SetBytes(int value) {
  return {vdupq_n_u8(uint8_t(value))};
}
inline Words operator+(Words a, Words b) {
  return {vaddq_u16(a.v, b.v)};
}
inline Words operator-(Words a, Words b) {
  return {vsubq_u16(a.v, b.v)};
}
inline Words operator*(Words a, Words b) {
  return {vmulq_u16(a.v, b.v)};
}
inline Words operator&(Words a, Words b) {
  return {vandq_u16(a.v, b.v)};
}
inline Words operator|(Words a, Words b) {
  return {vorrq_u16(a.v, b.v)};
}
template <int kBits>
inline Words ShiftLeft(Words a) {
  return {vshlq_n_u16(a.v, kBits)};
}
// Arithmetic, and logical.
template <int kBits>
inline Words ShiftRight(Words a) {
  return Unsigned(vshrq_n_s16(Signed(a), kBits));
}
template <int kBits>
inline Words ShiftRightUnsigned(Words a) {
  return {vshrq_n_u16(a.v, kBits)};
}
// Signed, and clamped to 16 bits instead of wrapping.
inline Words AddSaturated(Words a, Words b) {
  return Unsigned(vqaddq_s16(Signed(a), Signed(b)));
}
// Of unsigned bytes: wrapping, and clamped to 255.
inline Bytes operator+(Bytes a, Bytes b) {
  return {vaddq_u8(a.v, b.v)};
}
inline Bytes operator-(Bytes a, Bytes b) {
  return {vsubq_u8(a.v, b.v)};
}
inline Bytes operator&(Bytes a, Bytes b) {
  return {vandq_u8(a.v, b.v)};
}
inline Bytes operator|(Bytes a, Bytes b) {
  return {vorrq_u8(a.v, b.v)};
}
// Bits of a where `selected` has ones, else of b.
inline Bytes SelectBits(Bytes selected, Bytes a, Bytes b) {
  return {vbslq_u8(selected.v, a.v, b.v)};
}
inline Bytes AddSaturated(Bytes a, Bytes b) {
  return {vqaddq_u8(a.v, b.v)};
}
// By no more than 8.
inline Bytes ShiftLeft(Bytes a, uint32_t bits) {
  return {vshlq_u8(a.v, vdupq_n_s8(int8_t(bits)))};
}
inline Bytes ShiftRightUnsigned(Bytes a, uint32_t bits) {
  return {vshlq_u8(a.v, vdupq_n_s8(int8_t(-int(bits))))};
}
// base + the high half of the signed product: half of the doubled product's, both rounded down.
inline Words AddHighProduct(Words base, Words a, Words b) {
  return Unsigned(vsraq_n_s16(Signed(base), vqdmulhq_s16(Signed(a), Signed(b)), 1));
}
// A number that words are multiplied by.
struct Factor {
  explicit Factor(int value) : lanes(vdup_n_u16(uint16_t(value))) {}
  uint16x4_t lanes;
};
inline Words MultiplyAdd(Words sum, Words a, const Factor& f) {
  return {vmlaq_lane_u16(sum.v, a.v, f.lanes, 0)};
}
inline Words MultiplySubtract(Words sum, Words a, const Factor& f) {
  return {vmlsq_lane_u16(sum.v, a.v, f.lanes, 0)};
}
inline Product Multiply(Words a, const Factor& f) {
  const uint32x4_t low = vmull_u16(vget_low_u16(a.v), f.lanes);
  const uint32x4_t high = vmull_u16(vget_high_u16(a.v), f.lanes);
  const uint16x8x2_t halves = vuzpq_u16(vreinterpretq_u16_u32(low), vreinterpretq_u16_u32(high));
  return {{halves.val[0]}, {halves.val[1]}};
}
// For CarryOf: every addend is prepared once.
inline Words PrepareCarry(Words addend) {
  return {vmvnq_u16(addend.v)};
}
// -1 where low + addend, both unsigned, does not fit 16 bits.
inline Words CarryOf(Words low, Words preparedAddend) {
  uint16x8_t carry = vcgtq_u16(low.v, preparedAddend.v);
  // Keeps the compiler from turning "minus -1" into "and 1, plus".
  __asm__("" : "+w"(carry));
  return {carry};
}

// A component of chroma, prepared for several words, and a word that it is converted to:
// offset + c * gain, in numbers of 32 bits.
struct ChromaFactor {
  explicit ChromaFactor(Words c)
      : low(vreinterpretq_s32_u32(vmovl_u16(vget_low_u16(c.v)))),
        high(vreinterpretq_s32_u32(vmovl_u16(vget_high_u16(c.v)))) {}
  int32x4_t low, high;
};
class ChromaWord {
 public:
  ChromaWord(int32_t gain, int32_t offset)
      : gain_(vdup_n_s32(gain)), offset_(vdupq_n_s32(offset)) {}
  // Without its lowest 12 bits, and modulo 65536: four fractional bits are left.
  Words Sixteenths(const ChromaFactor& c) const {
    return Unsigned(vcombine_s16(vshrn_n_s32(Sum(c.low), 12), vshrn_n_s32(Sum(c.high), 12)));
  }
  // The same clamped to 16 bits.
  Words Clamped(const ChromaFactor& c) const {
    return Unsigned(vcombine_s16(vqshrn_n_s32(Sum(c.low), 12), vqshrn_n_s32(Sum(c.high), 12)));
  }
  // Without its lowest 16 bits.
  Words Whole(const ChromaFactor& c) const {
    return Unsigned(vcombine_s16(vshrn_n_s32(Sum(c.low), 16), vshrn_n_s32(Sum(c.high), 16)));
  }

 private:
  int32x4_t Sum(int32x4_t c) const { return vmlaq_lane_s32(offset_, c, gain_, 0); }

  int32x2_t gain_;
  int32x4_t offset_;
};

// ---- Between bytes and words
inline WordsPair Widen(Bytes b) {
  return {{vmovl_u8(vget_low_u8(b.v))}, {vmovl_u8(vget_high_u8(b.v))}};
}
// Signed words clamped to bytes.
inline Bytes Narrow(Words low, Words high) {
  return {vcombine_u8(vqmovun_s16(Signed(low)), vqmovun_s16(Signed(high)))};
}
template <int kBits>
inline Bytes NarrowShifted(Words low, Words high) {
  return {vcombine_u8(vqshrun_n_s16(Signed(low), kBits), vqshrun_n_s16(Signed(high), kBits))};
}
// Each word twice: words of half as many samples become words for pixels.
inline WordsPair Double(Words w) {
  const uint16x8x2_t twice = vzipq_u16(w.v, w.v);
  return {{twice.val[0]}, {twice.val[1]}};
}

// ---- Packed and planar
inline void Load2(const uint8_t* p, Bytes* first, Bytes* second) {
  const uint8x16x2_t pairs = vld2q_u8(p);
  *first = {pairs.val[0]};
  *second = {pairs.val[1]};
}
inline void Store2(uint8_t* p, Bytes first, Bytes second) {
  const uint8x16x2_t pairs = {{first.v, second.v}};
  vst2q_u8(p, pairs);
}
inline void StorePixelWords(uint8_t* p, WordsPair w) {
  StoreWords(p, w.low);
  StoreWords(p + 16, w.high);
}
inline WordsPair LoadPixelWords(const uint8_t* p) {
  return {LoadWords(p), LoadWords(p + 16)};
}
inline PixelBytes Load4(const uint8_t* p) {
  const uint8x16x4_t pixels = vld4q_u8(p);
  return {{pixels.val[0]}, {pixels.val[1]}, {pixels.val[2]}, {pixels.val[3]}};
}
// The same for uses by halves of vectors, which 32-bit compilers copy from a load of whole ones.
inline PixelBytes Load4ByHalves(const uint8_t* p) {
#ifdef __aarch64__
  return Load4(p);
#else
  const uint8x8x4_t low = vld4_u8(p);
  const uint8x8x4_t high = vld4_u8(p + 32);
  return {{vcombine_u8(low.val[0], high.val[0])},
          {vcombine_u8(low.val[1], high.val[1])},
          {vcombine_u8(low.val[2], high.val[2])},
          {vcombine_u8(low.val[3], high.val[3])}};
#endif
}
inline void Store4(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const uint8x16x4_t pixels = {{a.v, b.v, c.v, d.v}};
  vst4q_u8(p, pixels);
}
// There is one order only.
inline Bytes InTurn(Bytes b) {
  return b;
}
inline Words InTurn(Words w) {
  return w;
}
inline WordsPair LoadPixelWordsInTurn(const uint8_t* p) {
  return LoadPixelWords(p);
}
inline void Store4InTurn(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  Store4(p, a, b, c, d);
}
inline PixelBytes Load3(const uint8_t* p) {
  const uint8x16x3_t pixels = vld3q_u8(p);
  return {{pixels.val[0]}, {pixels.val[1]}, {pixels.val[2]}, SetBytes(0)};
}
inline void Store3(uint8_t* p, Bytes a, Bytes b, Bytes c) {
  const uint8x16x3_t pixels = {{a.v, b.v, c.v}};
  vst3q_u8(p, pixels);
}

// ---- Order of bytes
// Of each byte and all before it, modulo 256; and the last byte everywhere.
inline Bytes RunningSums(Bytes b) {
  const uint8x16_t zero = vdupq_n_u8(0);
  uint8x16_t sums = vaddq_u8(b.v, vextq_u8(zero, b.v, 15));
  sums = vaddq_u8(sums, vextq_u8(zero, sums, 14));
  sums = vaddq_u8(sums, vextq_u8(zero, sums, 12));
  return {vaddq_u8(sums, vextq_u8(zero, sums, 8))};
}
inline Bytes LastByte(Bytes b) {
  return {vdupq_lane_u8(vget_high_u8(b.v), 7)};
}
inline Bytes Reversed(Bytes b) {
  const uint8x16_t halves = vrev64q_u8(b.v);
  return {vcombine_u8(vget_high_u8(halves), vget_low_u8(halves))};
}
// The last unit first.
template <int kUnit>
inline void StoreReversed(uint8_t* p, const uint8_t* src) {
  const uint8x16_t v = vld1q_u8(src);
  const uint8x16_t halves = kUnit == 1 ? vrev64q_u8(v)
                            : kUnit == 2
                                ? vreinterpretq_u8_u16(vrev64q_u16(vreinterpretq_u16_u8(v)))
                                : vreinterpretq_u8_u32(vrev64q_u32(vreinterpretq_u32_u8(v)));
  vst1q_u8(p, vcombine_u8(vget_high_u8(halves), vget_low_u8(halves)));
}
inline Bytes SwapNeighbours(Bytes b) {
  return {vrev16q_u8(b.v)};
}

// A sum that products are added to, or taken from. Compilers would rather add up the products
// first, and all channels at once, which takes copies and more registers than there are.
inline Words Fixed(Words sum) {
  __asm__ volatile("" : "+w"(sum.v));
  return sum;
}

// ---- Bytes that are multiplied
using Multiplicands = Bytes;
struct MultiplicandsPair {
  Multiplicands first, second;
};
inline Multiplicands ToMultiplicands(Bytes b) {
  return b;
}
// Of kBytes pairs.
template <bool kInTurn>
inline MultiplicandsPair LoadMultiplicands(const uint8_t* p) {
  MultiplicandsPair pair;
  Load2(p, &pair.first, &pair.second);
  return pair;
}
struct ByteFactor {
  explicit ByteFactor(int value) : v(vdup_n_u8(uint8_t(value))) {}
  uint8x8_t v;
};
inline WordsPair MultiplyAdd(WordsPair sum, Multiplicands a, const ByteFactor& f) {
  return {{vmlal_u8(sum.low.v, vget_low_u8(a.v), f.v)},
          {vmlal_u8(sum.high.v, vget_high_u8(a.v), f.v)}};
}
inline WordsPair MultiplySubtract(WordsPair sum, Multiplicands a, const ByteFactor& f) {
  return {{vmlsl_u8(sum.low.v, vget_low_u8(a.v), f.v)},
          {vmlsl_u8(sum.high.v, vget_high_u8(a.v), f.v)}};
}

// What a blend of a and b adds to the one that it begins with, modulo 256.
inline uint8x8_t Share(uint8x8_t a, uint8x8_t b, Words weights) {
  const int16x8_t difference = vreinterpretq_s16_u16(vsubl_u8(b, a));
  return vreinterpret_u8_s8(vshrn_n_s16(vqdmulhq_s16(difference, Signed(weights)), 1));
}
inline Bytes AddShare(Bytes base, Bytes a, Bytes b, Words weight) {
  const uint8x8_t low = Share(vget_low_u8(a.v), vget_low_u8(b.v), weight);
  const uint8x8_t high = Share(vget_high_u8(a.v), vget_high_u8(b.v), weight);
  return {vaddq_u8(base.v, vcombine_u8(low, high))};
}

// ---- Pairs of bytes
// kPairs of them, taken apart.
constexpr int kPairs = 16;
struct Pairs {
  uint8x16_t first, second;
};
inline void StorePairs(uint8_t* p, const Pairs& pairs) {
  const uint8x16x2_t both = {{pairs.first, pairs.second}};
  vst2q_u8(p, both);
}
// Bytes that windows have, by which pairs are taken from them. Of a window's pairs the first bytes,
// then the second ones.
constexpr int kWindow = 16;
template <int kShared>
inline void SetShuffle(uint8_t* shuffle, const uint8_t (&at)[kWindow]) {
  for (int k = 0; k < 8; ++k) {
    uint8_t* const window = shuffle + k / kShared * 2 * kShared + k % kShared;
    window[0] = at[2 * k];
    window[kShared] = at[2 * k + 1];
  }
}
inline void StoreBlended(uint8_t* p, const Pairs& pairs, const uint16_t* negativeWeights) {
  const uint8x8_t low =
      Share(vget_low_u8(pairs.second), vget_low_u8(pairs.first), LoadWords(negativeWeights));
  const uint8x8_t high =
      Share(vget_high_u8(pairs.second), vget_high_u8(pairs.first), LoadWords(negativeWeights + 8));
  vst1q_u8(p, vaddq_u8(pairs.first, vcombine_u8(low, high)));
}
inline uint8x8_t Pick(uint8x16_t window, uint8x8_t shuffle) {
#ifdef __aarch64__
  return vqtbl1_u8(window, shuffle);
#else
  return vtbl2_u8({{vget_low_u8(window), vget_high_u8(window)}}, shuffle);
#endif
}
// Eight bytes of two windows.
inline uint8x8_t PickHalves(const uint8_t* first, const uint8_t* second, uint8x8_t shuffle) {
  const uint8x8_t upper = vcreate_u8(0xFFFFFFFF00000000);
  return vbsl_u8(upper, Pick(vld1q_u8(second), shuffle), Pick(vld1q_u8(first), shuffle));
}
// Eight pairs of a plan's block: first bytes, then second ones.
template <int kWindows>
inline uint8x16_t GatherEight(const uint8_t* src, const uint16_t* windows, uint8x16_t shuffle) {
  const auto window = [=](int i) { return src + windows[i]; };
  const uint8x8_t order[] = {vget_low_u8(shuffle), vget_high_u8(shuffle)};
  if constexpr (kWindows == 1) {
    const uint8x16_t bytes = vld1q_u8(window(0));
    return vcombine_u8(Pick(bytes, order[0]), Pick(bytes, order[1]));
  } else if constexpr (kWindows == 2) {
    // Four first bytes and four second ones of either window.
    const uint32x2x2_t halves = vtrn_u32(vreinterpret_u32_u8(Pick(vld1q_u8(window(0)), order[0])),
                                         vreinterpret_u32_u8(Pick(vld1q_u8(window(1)), order[1])));
    return vcombine_u8(vreinterpret_u8_u32(halves.val[0]), vreinterpret_u8_u32(halves.val[1]));
  } else {
    // Two and two of each.
    const uint16x4x2_t halves =
        vuzp_u16(vreinterpret_u16_u8(PickHalves(window(0), window(1), order[0])),
                 vreinterpret_u16_u8(PickHalves(window(2), window(3), order[1])));
    return vcombine_u8(vreinterpret_u8_u16(halves.val[0]), vreinterpret_u8_u16(halves.val[1]));
  }
}
// A block of a plan: of its windows and its shuffle.
template <int kWindows>
inline Pairs GatherPairs(const uint8_t* src, const uint8_t* windows, const uint8_t* shuffle) {
  uint16_t window[2 * kWindows];
  __builtin_memcpy(window, windows, sizeof(window));
  const uint8x16_t a = GatherEight<kWindows>(src, window, vld1q_u8(shuffle));
  const uint8x16_t b = GatherEight<kWindows>(src, window + kWindows, vld1q_u8(shuffle + 16));
  return {vcombine_u8(vget_low_u8(a), vget_low_u8(b)),
          vcombine_u8(vget_high_u8(a), vget_high_u8(b))};
}

// ---- Pixels of four bytes
// All bits of one byte of each pixel.
inline Bytes QuadBytes(int byte) {
  return {vreinterpretq_u8_u32(vdupq_n_u32(0xFFu << (8 * byte)))};
}
// (Through bytes: pixels need not be aligned.)
inline uint32_t LoadQuad(const uint8_t* p) {
  uint32_t quad;
  __builtin_memcpy(&quad, p, 4);
  return quad;
}
inline Bytes GatherQuads(const uint8_t* src, const int32_t* offsets, int32_t) {
  uint32x4_t v = vdupq_n_u32(LoadQuad(src + offsets[0]));
  v = vsetq_lane_u32(LoadQuad(src + offsets[1]), v, 1);
  v = vsetq_lane_u32(LoadQuad(src + offsets[2]), v, 2);
  v = vsetq_lane_u32(LoadQuad(src + offsets[3]), v, 3);
  return {vreinterpretq_u8_u32(v)};
}
// The odd bytes of two vectors.
inline Bytes Seconds(Bytes a, Bytes b) {
  return {vuzpq_u8(a.v, b.v).val[1]};
}

// ---- RGB to YUV
// Bits above and below eight of the weights' magnitudes: all |weight| = 256 * high + low, or all
// 256 * high - low, so that sums of either part fit 16 bits.
struct WeightParts {
  int32_t high[3], low[3];
  bool minus;

  explicit WeightParts(const int32_t (&weights)[3]) : minus(false) {
    int32_t sum = 0;
    for (int c = 0; c < 3; ++c) {
      const int32_t magnitude = weights[c] < 0 ? -weights[c] : weights[c];
      high[c] = magnitude >> 8;
      low[c] = magnitude & 255;
      sum += low[c];
    }
    if (sum <= 256) return;
    minus = true;
    for (int c = 0; c < 3; ++c) {
      if (low[c] == 0) continue;
      ++high[c];
      low[c] = 256 - low[c];
    }
  }
};

template <bool kSeconds>
inline PixelBytes LoadQuadOperands(const uint8_t* p) {
  if constexpr (!kSeconds) return Load4ByHalves(p);
  const PixelBytes a = Load4(p);
  const PixelBytes b = Load4(p + 4 * kBytes);
  return {Seconds(a.low, b.low), Seconds(a.middle, b.middle), Seconds(a.high, b.high), SetBytes(0)};
}

// (offset + low * w0 + middle * w1 + high * w2) >> 16 of the bytes of a pixel. Bytes with a
// negative weight are complemented, which makes all products positive.
enum class LowParts { kPlus, kMinus, kPlusWithoutOffset };
template <Signs kSigns, LowParts kParts>
class WeightedSum {
 public:
  WeightedSum(const Weights& weights, const WeightParts& parts) {
    int32_t offset = weights.offset;
    for (int c = 0; c < 3; ++c) {
      if (weights.of[c] < 0) offset += 255 * weights.of[c];
      high_[c] = vdup_n_u8(uint8_t(parts.high[c]));
      low_[c] = vdup_n_u8(uint8_t(parts.low[c]));
    }
    // Sums of the low parts that count down start so high that they stay positive.
    constexpr int32_t kFloor = kParts == LowParts::kMinus ? 255 : 0;
    highOffset_ = vdupq_n_u16(uint16_t((offset >> 8) - kFloor));
    lowOffset_ = vdupq_n_u16(uint16_t((offset & 255) + 256 * kFloor));
  }
  Bytes Of(const PixelBytes& p) const {
    const uint8x16_t l = kSigns == Signs::kLastPositive ? vmvnq_u8(p.low.v) : p.low.v;
    const uint8x16_t m = kSigns != Signs::kAllPositive ? vmvnq_u8(p.middle.v) : p.middle.v;
    const uint8x16_t h = kSigns == Signs::kFirstPositive ? vmvnq_u8(p.high.v) : p.high.v;
    return {vcombine_u8(Eight(vget_low_u8(l), vget_low_u8(m), vget_low_u8(h)),
                        Eight(vget_high_u8(l), vget_high_u8(m), vget_high_u8(h)))};
  }

 private:
  uint8x8_t Eight(uint8x8_t l, uint8x8_t m, uint8x8_t h) const {
    constexpr bool kAnyOffset = kParts != LowParts::kPlusWithoutOffset;
    uint16x8_t low;
    if constexpr (kParts == LowParts::kMinus) {
      low = vmlsl_u8(vmlsl_u8(vmlsl_u8(lowOffset_, l, low_[0]), m, low_[1]), h, low_[2]);
      low = Fixed({low}).v;
    } else {
      const uint16x8_t first = kAnyOffset ? vmlal_u8(lowOffset_, h, low_[2]) : vmull_u8(h, low_[2]);
      low = vmlal_u8(vmlal_u8(first, m, low_[1]), l, low_[0]);
    }
    const uint16x8_t high = vmlal_u8(vmlal_u8(vmull_u8(h, high_[2]), m, high_[1]), l, high_[0]);
    const uint16x8_t sum = Fixed({vsraq_n_u16(high, low, 8)}).v;
    // An offset that is added last needs not be copied first.
    return kAnyOffset ? vaddhn_u16(sum, highOffset_) : vshrn_n_u16(sum, 8);
  }

  uint8x8_t high_[3], low_[3];
  uint16x8_t highOffset_, lowOffset_;
};

template <Signs kSigns, typename Call>
void WithSumOf(const Weights& weights, const Call& call) {
  const WeightParts parts(weights.of);
  if (parts.minus) return call(WeightedSum<kSigns, LowParts::kMinus>(weights, parts));
  if constexpr (kSigns == Signs::kAllPositive) {
    if (weights.offset == 0) {
      return call(WeightedSum<kSigns, LowParts::kPlusWithoutOffset>(weights, parts));
    }
  }
  call(WeightedSum<kSigns, LowParts::kPlus>(weights, parts));
}

// (Weights of every standard can be parted: a test of the rows looks at all of them.)
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
// Exchanges neighbouring units of two rows: the step that turns squares of 2 x 2.
inline void Turn8(uint8x16_t* a, uint8x16_t* b) {
  const uint8x16x2_t turned = vtrnq_u8(*a, *b);
  *a = turned.val[0];
  *b = turned.val[1];
}
inline void Turn16(uint8x16_t* a, uint8x16_t* b) {
  const uint16x8x2_t turned = vtrnq_u16(vreinterpretq_u16_u8(*a), vreinterpretq_u16_u8(*b));
  *a = vreinterpretq_u8_u16(turned.val[0]);
  *b = vreinterpretq_u8_u16(turned.val[1]);
}
inline void Turn32(uint8x16_t* a, uint8x16_t* b) {
  const uint32x4x2_t turned = vtrnq_u32(vreinterpretq_u32_u8(*a), vreinterpretq_u32_u8(*b));
  *a = vreinterpretq_u8_u32(turned.val[0]);
  *b = vreinterpretq_u8_u32(turned.val[1]);
}

inline void Turn64(uint8x16_t* a, uint8x16_t* b) {
#ifdef __aarch64__
  const uint64x2_t first = vreinterpretq_u64_u8(*a);
  const uint64x2_t second = vreinterpretq_u64_u8(*b);
  *a = vreinterpretq_u8_u64(vtrn1q_u64(first, second));
  *b = vreinterpretq_u8_u64(vtrn2q_u64(first, second));
#else
  // Compilers would move all four halves, through further registers.
  __asm__("vswp %f0, %e1" : "+w"(*a), "+w"(*b));
#endif
}

// Eight rows of 16 bytes. (One pointer that moves on costs no instruction; eight pointers do.)
struct Rows8 {
  uint8x16_t r0, r1, r2, r3, r4, r5, r6, r7;

  Rows8(const uint8_t* p, ptrdiff_t pitch) {
    r0 = vld1q_u8(p);
    r1 = vld1q_u8(p += pitch);
    r2 = vld1q_u8(p += pitch);
    r3 = vld1q_u8(p += pitch);
    r4 = vld1q_u8(p += pitch);
    r5 = vld1q_u8(p += pitch);
    r6 = vld1q_u8(p += pitch);
    r7 = vld1q_u8(p += pitch);
  }
};

// Where columns go, one after the other.
class Columns {
 public:
  Columns(uint8_t* dst, ptrdiff_t pitch) : dst_(dst), pitch_(pitch) {}
  void Put(uint8x8_t column) {
    vst1_u8(dst_, column);
    dst_ += pitch_;
  }
  void Put(uint8x16_t column) {
    vst1q_u8(dst_, column);
    dst_ += pitch_;
  }
  // A column's first half and second half.
  void Put(uint8x16_t first, uint8x16_t second) {
    vst1q_u8(dst_, first);
    vst1q_u8(dst_ + 16, second);
    dst_ += pitch_;
  }

 private:
  uint8_t* dst_;
  ptrdiff_t pitch_;
};

// Eight rows of 16 bytes.
struct Block8 {
  static constexpr int kRows = 8;
  static constexpr int kColumns = 16;
  static void Write(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch) {
    Rows8 r(src, srcPitch);
    Turn8(&r.r0, &r.r1);
    Turn8(&r.r2, &r.r3);
    Turn8(&r.r4, &r.r5);
    Turn8(&r.r6, &r.r7);
    Turn16(&r.r0, &r.r2);
    Turn16(&r.r1, &r.r3);
    Turn16(&r.r4, &r.r6);
    Turn16(&r.r5, &r.r7);
    Turn32(&r.r0, &r.r4);
    Turn32(&r.r1, &r.r5);
    Turn32(&r.r2, &r.r6);
    Turn32(&r.r3, &r.r7);
    Columns columns(dst, dstPitch);
    columns.Put(vget_low_u8(r.r0));
    columns.Put(vget_low_u8(r.r1));
    columns.Put(vget_low_u8(r.r2));
    columns.Put(vget_low_u8(r.r3));
    columns.Put(vget_low_u8(r.r4));
    columns.Put(vget_low_u8(r.r5));
    columns.Put(vget_low_u8(r.r6));
    columns.Put(vget_low_u8(r.r7));
    columns.Put(vget_high_u8(r.r0));
    columns.Put(vget_high_u8(r.r1));
    columns.Put(vget_high_u8(r.r2));
    columns.Put(vget_high_u8(r.r3));
    columns.Put(vget_high_u8(r.r4));
    columns.Put(vget_high_u8(r.r5));
    columns.Put(vget_high_u8(r.r6));
    columns.Put(vget_high_u8(r.r7));
  }
};

// Eight rows of eight pairs.
struct Block16 {
  static constexpr int kRows = 8;
  static constexpr int kColumns = 8;
  static void Write(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch) {
    Rows8 r(src, srcPitch);
    Turn16(&r.r0, &r.r1);
    Turn16(&r.r2, &r.r3);
    Turn16(&r.r4, &r.r5);
    Turn16(&r.r6, &r.r7);
    Turn32(&r.r0, &r.r2);
    Turn32(&r.r1, &r.r3);
    Turn32(&r.r4, &r.r6);
    Turn32(&r.r5, &r.r7);
    Turn64(&r.r0, &r.r4);
    Turn64(&r.r1, &r.r5);
    Turn64(&r.r2, &r.r6);
    Turn64(&r.r3, &r.r7);
    Columns columns(dst, dstPitch);
    columns.Put(r.r0);
    columns.Put(r.r1);
    columns.Put(r.r2);
    columns.Put(r.r3);
    columns.Put(r.r4);
    columns.Put(r.r5);
    columns.Put(r.r6);
    columns.Put(r.r7);
  }
};

// Eight rows of eight pixels of three bytes, each byte's plane by itself.
struct Block24 {
  static constexpr int kRows = 8;
  static constexpr int kColumns = 8;
  static void Write(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch) {
    uint8x8x3_t r0 = vld3_u8(src);
    uint8x8x3_t r1 = vld3_u8(src += srcPitch);
    uint8x8x3_t r2 = vld3_u8(src += srcPitch);
    uint8x8x3_t r3 = vld3_u8(src += srcPitch);
    uint8x8x3_t r4 = vld3_u8(src += srcPitch);
    uint8x8x3_t r5 = vld3_u8(src += srcPitch);
    uint8x8x3_t r6 = vld3_u8(src += srcPitch);
    uint8x8x3_t r7 = vld3_u8(src += srcPitch);
    Turn<1>(&r0, &r1);
    Turn<1>(&r2, &r3);
    Turn<1>(&r4, &r5);
    Turn<1>(&r6, &r7);
    Turn<2>(&r0, &r2);
    Turn<2>(&r1, &r3);
    Turn<2>(&r4, &r6);
    Turn<2>(&r5, &r7);
    Turn<4>(&r0, &r4);
    Turn<4>(&r1, &r5);
    Turn<4>(&r2, &r6);
    Turn<4>(&r3, &r7);
    vst3_u8(dst, r0);
    vst3_u8(dst += dstPitch, r1);
    vst3_u8(dst += dstPitch, r2);
    vst3_u8(dst += dstPitch, r3);
    vst3_u8(dst += dstPitch, r4);
    vst3_u8(dst += dstPitch, r5);
    vst3_u8(dst += dstPitch, r6);
    vst3_u8(dst += dstPitch, r7);
  }

 private:
  // Exchanges neighbouring units of kUnit bytes of two rows.
  template <int kUnit>
  static void Turn(uint8x8x3_t* a, uint8x8x3_t* b) {
    Turn<kUnit>(&a->val[0], &b->val[0]);
    Turn<kUnit>(&a->val[1], &b->val[1]);
    Turn<kUnit>(&a->val[2], &b->val[2]);
  }
  template <int kUnit>
  static void Turn(uint8x8_t* a, uint8x8_t* b) {
    if constexpr (kUnit == 1) {
      const uint8x8x2_t turned = vtrn_u8(*a, *b);
      *a = turned.val[0];
      *b = turned.val[1];
    } else if constexpr (kUnit == 2) {
      const uint16x4x2_t turned = vtrn_u16(vreinterpret_u16_u8(*a), vreinterpret_u16_u8(*b));
      *a = vreinterpret_u8_u16(turned.val[0]);
      *b = vreinterpret_u8_u16(turned.val[1]);
    } else {
      const uint32x2x2_t turned = vtrn_u32(vreinterpret_u32_u8(*a), vreinterpret_u32_u8(*b));
      *a = vreinterpret_u8_u32(turned.val[0]);
      *b = vreinterpret_u8_u32(turned.val[1]);
    }
  }
};

// Eight rows of four words.
struct Block32 {
  static constexpr int kRows = 8;
  static constexpr int kColumns = 4;
  static void Write(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch) {
    Rows8 r(src, srcPitch);
    Turn32(&r.r0, &r.r1);
    Turn32(&r.r2, &r.r3);
    Turn32(&r.r4, &r.r5);
    Turn32(&r.r6, &r.r7);
    Turn64(&r.r0, &r.r2);
    Turn64(&r.r1, &r.r3);
    Turn64(&r.r4, &r.r6);
    Turn64(&r.r5, &r.r7);
    Columns columns(dst, dstPitch);
    columns.Put(r.r0, r.r4);
    columns.Put(r.r1, r.r5);
    columns.Put(r.r2, r.r6);
    columns.Put(r.r3, r.r7);
  }
};

void Transpose(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch, int unit,
               int rows, int columns) {
  switch (unit) {
    case 1:
      return TransposeBy<Block8, 1>(dst, dstPitch, src, srcPitch, rows, columns);
    case 2:
      return TransposeBy<Block16, 2>(dst, dstPitch, src, srcPitch, rows, columns);
    case 3:
      return TransposeBy<Block24, 3>(dst, dstPitch, src, srcPitch, rows, columns);
    case 4:
      return TransposeBy<Block32, 4>(dst, dstPitch, src, srcPitch, rows, columns);
    default:
      return scalar::Transpose(dst, dstPitch, src, srcPitch, unit, rows, columns);
  }
}

}  // namespace
}  // namespace kestrel

#endif
