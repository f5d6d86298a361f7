// Vectors of 16 bytes and of eight 16-bit words for NEON, 32-bit (without the additions of VFPv4)
// and 64-bit. The same names as in vector_x86.h; here halves of a pair are in plain order.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_NEON_H
#define KESTREL_KERNELS_ROWS_VECTOR_NEON_H

#include <arm_neon.h>
#include <stdint.h>

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
// Products of 32 bits as two vectors of halves.
struct Product {
  Words low, high;
};

constexpr int kBytes = 16;
constexpr int kWords = 8;

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
// Words clamped to bytes, half a vector of them.
inline void StoreHalf(uint8_t* p, Words w) {
  vst1_u8(p, vqmovun_s16(Signed(w)));
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
// Half of the doubled product, both rounded down: the product's high half.
inline Words MultiplyHigh(Words a, Words b) {
  return Unsigned(vshrq_n_s16(vqdmulhq_s16(Signed(a), Signed(b)), 1));
}
inline Product Multiply(Words a, Words b) {
  const uint32x4_t low = vmull_u16(vget_low_u16(a.v), vget_low_u16(b.v));
  const uint32x4_t high = vmull_u16(vget_high_u16(a.v), vget_high_u16(b.v));
  const uint16x8x2_t halves = vuzpq_u16(vreinterpretq_u16_u32(low), vreinterpretq_u16_u32(high));
  return {{halves.val[0]}, {halves.val[1]}};
}
// For CarryOf: every addend is prepared once.
inline Words PrepareCarry(Words addend) {
  return {vmvnq_u16(addend.v)};
}
// -1 where low + addend, both unsigned, does not fit 16 bits.
inline Words CarryOf(Words low, Words preparedAddend) {
  return {vcgtq_u16(low.v, preparedAddend.v)};
}

// ---- Between bytes and words
inline WordsPair Widen(Bytes b) {
  return {{vmovl_u8(vget_low_u8(b.v))}, {vmovl_u8(vget_high_u8(b.v))}};
}
// Signed words clamped to bytes.
inline Bytes Narrow(Words low, Words high) {
  return {vcombine_u8(vqmovun_s16(Signed(low)), vqmovun_s16(Signed(high)))};
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
inline void Load4(const uint8_t* p, Bytes (&channels)[4]) {
  const uint8x16x4_t pixels = vld4q_u8(p);
  for (int c = 0; c < 4; ++c) channels[c] = {pixels.val[c]};
}
inline void Store4(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const uint8x16x4_t pixels = {{a.v, b.v, c.v, d.v}};
  vst4q_u8(p, pixels);
}
inline void Load3(const uint8_t* p, Bytes (&channels)[3]) {
  const uint8x16x3_t pixels = vld3q_u8(p);
  for (int c = 0; c < 3; ++c) channels[c] = {pixels.val[c]};
}
inline void Store3(uint8_t* p, Bytes a, Bytes b, Bytes c) {
  const uint8x16x3_t pixels = {{a.v, b.v, c.v}};
  vst3q_u8(p, pixels);
}

// ---- Order of bytes
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

// Eight pairs of a plan, as words: first byte low, second byte high.
inline uint8x8_t GatherFour(const uint8_t* window, const uint8_t* shuffle) {
#ifdef __aarch64__
  return vqtbl1_u8(vld1q_u8(window), vld1_u8(shuffle));
#else
  const uint8x16_t v = vld1q_u8(window);
  return vtbl2_u8({{vget_low_u8(v), vget_high_u8(v)}}, vld1_u8(shuffle));
#endif
}
inline Words GatherPairs(const uint8_t* src, const int32_t* windows, const uint8_t (*shuffles)[8]) {
  return {vreinterpretq_u16_u8(vcombine_u8(GatherFour(src + windows[0], shuffles[0]),
                                           GatherFour(src + windows[1], shuffles[1])))};
}

// The odd bytes of two vectors.
inline Bytes Seconds(Bytes a, Bytes b) {
  return {vuzpq_u8(a.v, b.v).val[1]};
}

// ---- RGB to YUV
// (offset + r * w0 + g * w1 + b * w2) >> 16 of bytes. Each weight is 256 * high + low.
class WeightedSum {
 public:
  WeightedSum(const int32_t (&weights)[3], int32_t offset) : offset_(offset) {
    for (int c = 0; c < 3; ++c) {
      positive_[c] = weights[c] >= 0;
      magnitude_[c] = vdup_n_u16(uint16_t(positive_[c] ? weights[c] : -weights[c]));
    }
  }
  Bytes Of(Bytes r, Bytes g, Bytes b) const {
    return {vcombine_u8(Eight(vget_low_u8(r.v), vget_low_u8(g.v), vget_low_u8(b.v)),
                        Eight(vget_high_u8(r.v), vget_high_u8(g.v), vget_high_u8(b.v)))};
  }

 private:
  uint32x4_t Four(const uint16x4_t (&rgb)[3]) const {
    uint32x4_t sum = vdupq_n_u32(uint32_t(offset_));
    for (int c = 0; c < 3; ++c) {
      sum = positive_[c] ? vmlal_u16(sum, rgb[c], magnitude_[c])
                         : vmlsl_u16(sum, rgb[c], magnitude_[c]);
    }
    return sum;
  }
  uint8x8_t Eight(uint8x8_t r, uint8x8_t g, uint8x8_t b) const {
    const uint16x8_t wide[3] = {vmovl_u8(r), vmovl_u8(g), vmovl_u8(b)};
    const uint16x4_t low[3] = {vget_low_u16(wide[0]), vget_low_u16(wide[1]), vget_low_u16(wide[2])};
    const uint16x4_t high[3] = {vget_high_u16(wide[0]), vget_high_u16(wide[1]),
                                vget_high_u16(wide[2])};
    return vmovn_u16(vcombine_u16(vshrn_n_u32(Four(low), 16), vshrn_n_u32(Four(high), 16)));
  }

  uint16x4_t magnitude_[3];
  bool positive_[3];
  int32_t offset_;
};

// The sums of kBytes pixels of four bytes, or of the second ones of as many pairs.
class PixelSum {
 public:
  PixelSum(const WeightedSum& sum, bool blueFirst, bool alphaFirst)
      : sum_(sum), blueFirst_(blueFirst), alphaFirst_(alphaFirst) {}
  template <bool kSeconds>
  Bytes Of(const uint8_t* p) const {
    Bytes channels[4];
    Load4(p, channels);
    if (kSeconds) {
      Bytes more[4];
      Load4(p + 4 * kBytes, more);
      for (int c = 0; c < 4; ++c) channels[c] = Seconds(channels[c], more[c]);
    }
    const Bytes low = alphaFirst_ ? channels[1] : channels[0];
    const Bytes middle = alphaFirst_ ? channels[2] : channels[1];
    const Bytes high = alphaFirst_ ? channels[3] : channels[2];
    return sum_.Of(blueFirst_ ? high : low, middle, blueFirst_ ? low : high);
  }

 private:
  WeightedSum sum_;
  bool blueFirst_, alphaFirst_;
};

}  // namespace
}  // namespace kestrel

#endif
