// Registers of x86-64 and arithmetic of their bytes and 16-bit words: 16 bytes with SSE4.1, 32 with
// AVX2, 64 with AVX-512, by the flags of the file that includes this. Part of vector_x86.h, whose
// first lines hold here too.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_X86_WORDS_H
#define KESTREL_KERNELS_ROWS_VECTOR_X86_WORDS_H

#if defined(__GNUC__) && !defined(__clang__)
// GCC takes the registers that its header leaves undefined on purpose for mistakes.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wmaybe-uninitialized"
#pragma GCC diagnostic ignored "-Wuninitialized"
#include <immintrin.h>
#pragma GCC diagnostic pop
#else
#include <immintrin.h>
#endif
#include <stdint.h>

#include "kernels/rows/rows.h"

namespace kestrel {
namespace {

// Operations on parts of registers, and on registers as a whole; and the set whose registers are
// the next narrower ones.
#if defined(__AVX512VBMI__)
#define KESTREL_SIMD(operation) _mm512_##operation
#define KESTREL_SIMD_WHOLE(operation) _mm512_##operation##_si512
using Register = __m512i;
constexpr const RowOps& kNarrower = kAvx2Rows;
#elif defined(__AVX2__)
#define KESTREL_SIMD(operation) _mm256_##operation
#define KESTREL_SIMD_WHOLE(operation) _mm256_##operation##_si256
using Register = __m256i;
constexpr const RowOps& kNarrower = kSse41Rows;
#else
#define KESTREL_SIMD(operation) _mm_##operation
#define KESTREL_SIMD_WHOLE(operation) _mm_##operation##_si128
using Register = __m128i;
constexpr const RowOps& kNarrower = kScalarRows;
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

inline Register Load(const void* p) {
  return KESTREL_SIMD_WHOLE(loadu)(static_cast<const Register*>(p));
}
inline void Store(void* p, Register v) {
  KESTREL_SIMD_WHOLE(storeu)(static_cast<Register*>(p), v);
}
inline Register Zero() {
  return KESTREL_SIMD_WHOLE(setzero)();
}
// The same in each lane of 16 bytes.
inline Register Broadcast(__m128i v) {
#if defined(__AVX512VBMI__)
  return _mm512_broadcast_i32x4(v);
#elif defined(__AVX2__)
  return _mm256_broadcastsi128_si256(v);
#else
  return v;
#endif
}

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
inline Words operator&(Words a, Words b) {
  return {KESTREL_SIMD_WHOLE(and)(a.v, b.v)};
}
inline Words operator|(Words a, Words b) {
  return {KESTREL_SIMD_WHOLE(or)(a.v, b.v)};
}
inline Words operator^(Words a, Words b) {
  return {KESTREL_SIMD_WHOLE(xor)(a.v, b.v)};
}
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
// Signed, and clamped to 16 bits instead of wrapping.
inline Words AddSaturated(Words a, Words b) {
  return {KESTREL_SIMD(adds_epi16)(a.v, b.v)};
}
// Of unsigned bytes: wrapping, and clamped to 255.
inline Bytes operator+(Bytes a, Bytes b) {
  return {KESTREL_SIMD(add_epi8)(a.v, b.v)};
}
inline Bytes operator-(Bytes a, Bytes b) {
  return {KESTREL_SIMD(sub_epi8)(a.v, b.v)};
}
inline Bytes operator&(Bytes a, Bytes b) {
  return {KESTREL_SIMD_WHOLE(and)(a.v, b.v)};
}
inline Bytes operator|(Bytes a, Bytes b) {
  return {KESTREL_SIMD_WHOLE(or)(a.v, b.v)};
}
// Bits of a where `selected` has ones, else of b.
inline Bytes SelectBits(Bytes selected, Bytes a, Bytes b) {
#ifdef __AVX512VBMI__
  return {_mm512_ternarylogic_epi32(selected.v, a.v, b.v, 0xCA)};
#else
  return {KESTREL_SIMD(blendv_epi8)(b.v, a.v, selected.v)};
#endif
}
inline Bytes AddSaturated(Bytes a, Bytes b) {
  return {KESTREL_SIMD(adds_epu8)(a.v, b.v)};
}
// By no more than 8.
inline Bytes ShiftLeft(Bytes a, uint32_t bits) {
  const Bytes shifted = {KESTREL_SIMD(sll_epi16)(a.v, _mm_cvtsi32_si128(int(bits)))};
  return shifted & SetBytes(0xFF << bits);
}
inline Bytes ShiftRightUnsigned(Bytes a, uint32_t bits) {
  const Bytes shifted = {KESTREL_SIMD(srl_epi16)(a.v, _mm_cvtsi32_si128(int(bits)))};
  return shifted & SetBytes(255 >> bits);
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
#ifdef __AVX512VBMI__
// For CarryOf: every addend is prepared once.
inline Words PrepareCarry(Words addend) {
  return addend ^ SetWords(-1);
}
// Words of -1 where low + addend, both unsigned, does not fit 16 bits; of 0 elsewhere.
struct CarryMask {
  __mmask32 mask;
};
inline CarryMask CarryOf(Words low, Words preparedAddend) {
  return {_mm512_cmpgt_epu16_mask(low.v, preparedAddend.v)};
}
inline Words operator-(Words a, CarryMask carry) {
  return {_mm512_mask_add_epi16(a.v, carry.mask, a.v, _mm512_set1_epi16(1))};
}
#else
// For CarryOf: every addend is prepared once.
inline Words PrepareCarry(Words addend) {
  return addend ^ SetWords(0x7FFF);
}
// -1 where low + addend, both unsigned, does not fit 16 bits.
inline Words CarryOf(Words low, Words preparedAddend) {
  return {KESTREL_SIMD(cmpgt_epi16)((low ^ SetWords(-0x8000)).v, preparedAddend.v)};
}
#endif

// A component of chroma, prepared for several words, and a word that it is converted to:
// offset + c * gain, in numbers of 32 bits.
struct ChromaFactor {
  explicit ChromaFactor(Words component)
      : c(component), times16(ShiftLeft<4>(component)), centred(component - SetWords(128)) {}
  Words c, times16, centred;
};
class ChromaWord {
 public:
  ChromaWord(int32_t gain, int32_t offset)
      : high_(gain >> 12),
        low_(gain & 4095),
        offset_(SetWords(offset >> 12)),
        carry_(PrepareCarry(SetWords((offset & 4095) << 4))),
        half_(gain >> 13),
        otherHalf_((gain >> 12) - (gain >> 13)),
        centre_(SetWords((offset >> 12) + (gain >> 12) * 128)) {}
  // Without its lowest 12 bits, and modulo 65536: four fractional bits are left.
  Words Sixteenths(const ChromaFactor& chroma) const {
    return MultiplyAdd(LowPart(chroma, offset_), chroma.c, high_);
  }
  // The same clamped to 16 bits, in two steps of which the first always fits.
  Words Clamped(const ChromaFactor& chroma) const {
    const Words part = MultiplyAdd(LowPart(chroma, centre_), chroma.centred, half_);
    return AddSaturated(part, chroma.centred * otherHalf_.words);
  }
  // Without its lowest 16 bits.
  Words Whole(const ChromaFactor& chroma) const { return ShiftRight<4>(Sixteenths(chroma)); }

 private:
  Words LowPart(const ChromaFactor& chroma, Words offset) const {
    const Product low = Multiply(chroma.times16, low_);
    return low.high + offset - CarryOf(low.low, carry_);
  }

  Factor high_, low_;
  Words offset_, carry_;
  Factor half_, otherHalf_;
  Words centre_;
};

// ---- Pairs of bytes
// kPairs of them as words: first byte low, second byte high.
constexpr int kPairs = kBytes;
struct Pairs {
  Words words[2];
};
inline void StorePairs(uint8_t* p, const Pairs& pairs) {
  StoreWords(p, pairs.words[0]);
  StoreWords(p + kBytes, pairs.words[1]);
}
// Bytes that windows have, by which pairs are taken from them. Of kShared pairs of a window two
// bytes for each say where in it they are.
#ifdef __AVX512VBMI__
constexpr int kWindow = 64;
#else
constexpr int kWindow = 16;
#endif
template <int kShared>
inline void SetShuffle(uint8_t* shuffle, const uint8_t (&at)[kWindow]) {
  __builtin_memcpy(shuffle, at, kWindow);
}
// Where window i begins. (One by one: compilers take longer to pick them out of a register.)
inline ptrdiff_t WindowAt(const uint8_t* windows, int i) {
  uint16_t window;
  __builtin_memcpy(&window, windows + sizeof(window) * size_t(i), sizeof(window));
  return window;
}
inline Words Blended(Words pairs, const uint16_t* negativeWeights) {
  const Register lessSecond = KESTREL_SIMD(set1_epi16)(int16_t(0xFF01));
  const Words difference = {KESTREL_SIMD(maddubs_epi16)(pairs.v, lessSecond)};
  return AddHighProduct(pairs & SetWords(0xFF), difference, LoadWords(negativeWeights));
}

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

// ---- Order within lanes
#if defined(__AVX2__)
#define KESTREL_LANE_SHIFT(direction) KESTREL_SIMD(b##direction##li_epi128)
#else
#define KESTREL_LANE_SHIFT(direction) _mm_b##direction##li_si128
#endif
// Of each byte of a lane and all before it there, modulo 256.
inline Bytes RunningSumsOfLanes(Bytes b) {
  b = b + Bytes{KESTREL_LANE_SHIFT(sl)(b.v, 1)};
  b = b + Bytes{KESTREL_LANE_SHIFT(sl)(b.v, 2)};
  b = b + Bytes{KESTREL_LANE_SHIFT(sl)(b.v, 4)};
  return b + Bytes{KESTREL_LANE_SHIFT(sl)(b.v, 8)};
}

// ---- Pixels of four bytes
// Four registers of them, four pixels to each lane: byte i of a lane of each of a..d becomes pixel
// i of that lane in all four.
struct Quads {
  Register v[4];
};
KESTREL_INLINE Quads Interleave4(Bytes a, Bytes b, Bytes c, Bytes d) {
  const Register ab0 = KESTREL_SIMD(unpacklo_epi8)(a.v, b.v);
  const Register ab1 = KESTREL_SIMD(unpackhi_epi8)(a.v, b.v);
  const Register cd0 = KESTREL_SIMD(unpacklo_epi8)(c.v, d.v);
  const Register cd1 = KESTREL_SIMD(unpackhi_epi8)(c.v, d.v);
  return {{KESTREL_SIMD(unpacklo_epi16)(ab0, cd0), KESTREL_SIMD(unpackhi_epi16)(ab0, cd0),
           KESTREL_SIMD(unpacklo_epi16)(ab1, cd1), KESTREL_SIMD(unpackhi_epi16)(ab1, cd1)}};
}
// All bits of one byte of each pixel.
inline Bytes QuadBytes(int byte) {
  return {KESTREL_SIMD(set1_epi32)(int32_t(0xFFu << (8 * byte)))};
}

}  // namespace
}  // namespace kestrel

#endif
