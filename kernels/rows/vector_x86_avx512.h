// How samples move within and between registers of AVX-512, whose permutations of bytes across all
// lanes cost no more than those within them. Part of vector_x86.h, whose first lines hold here too.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_X86_AVX512_H
#define KESTREL_KERNELS_ROWS_VECTOR_X86_AVX512_H

#include "kernels/rows/rows_scalar.h"
#include "kernels/rows/vector_x86_words.h"

namespace kestrel {
namespace {

// ---- Order within a register
struct Order {
  alignas(kBytes) uint8_t of[kBytes];
};
// Byte i of the result is byte order.of[i].
inline Register Reorder(Register v, const Order& order) {
  return _mm512_permutexvar_epi8(Load(order.of), v);
}
inline Register Reorder(__m256i v, const Order& order) {
  return Reorder(_mm512_castsi256_si512(v), order);
}
inline __m256i LowHalf(Register v) {
  return _mm512_castsi512_si256(v);
}
inline Register Join(__m128i a, __m128i b, __m128i c, __m128i d) {
  const __m256i low = _mm256_inserti128_si256(_mm256_castsi128_si256(a), b, 1);
  const __m256i high = _mm256_inserti128_si256(_mm256_castsi128_si256(c), d, 1);
  return _mm512_inserti64x4(_mm512_castsi256_si512(low), high, 1);
}

inline __m256i Load32(const void* p) {
  return _mm256_loadu_si256(static_cast<const __m256i*>(p));
}
inline Words LoadHalf(const uint8_t* p) {
  return {_mm512_cvtepu8_epi16(Load32(p))};
}
// Words of a vector's pixels, in order.
inline void StorePixelWords(uint8_t* p, WordsPair w) {
  const Register first = _mm512_setr_epi64(0, 1, 8, 9, 2, 3, 10, 11);
  const Register second = _mm512_setr_epi64(4, 5, 12, 13, 6, 7, 14, 15);
  Store(p, _mm512_permutex2var_epi64(w.low.v, first, w.high.v));
  Store(p + kBytes, _mm512_permutex2var_epi64(w.low.v, second, w.high.v));
}
inline WordsPair LoadPixelWords(const uint8_t* p) {
  const Register a = Load(p);
  const Register b = Load(p + kBytes);
  const Register low = _mm512_setr_epi64(0, 1, 4, 5, 8, 9, 12, 13);
  const Register high = _mm512_setr_epi64(2, 3, 6, 7, 10, 11, 14, 15);
  return {{_mm512_permutex2var_epi64(a, low, b)}, {_mm512_permutex2var_epi64(a, high, b)}};
}

// ---- Packed and planar
// kUnit registers hold kBytes pixels of as many bytes. To take them apart registers are turned
// until all have bytes of different channels at each place. Then each channel is selected by masks,
// which cost less than permutations, and at last put in order. Putting pixels together is the
// reverse.
template <int kUnit>
struct Turned {
  // Channel and number of the pixel that byte i of turned register r belongs to. Registers of three
  // bytes to a pixel need no turn; the others are turned by r bytes within each four.
  static constexpr int Channel(int r, int i) {
    return kUnit == 3 ? (i + r) % 3 : (i + 4 - r) % kUnit;
  }
  static constexpr int Pixel(int r, int i) {
    return (kBytes * r + (kUnit == 3 ? i : (i & ~3) + (i + 4 - r) % 4)) / kUnit;
  }
  static constexpr int RegisterOf(int channel, int i) {
    int r = 0;
    while (Channel(r, i) != channel) ++r;
    return r;
  }
  // Between what is selected of a channel and its samples in order.
  static constexpr Order ToPlanar(int channel) {
    Order order = {};
    for (int i = 0; i < kBytes; ++i) order.of[Pixel(RegisterOf(channel, i), i)] = uint8_t(i);
    return order;
  }
  static constexpr Order ToPacked(int channel) {
    Order order = {};
    for (int i = 0; i < kBytes; ++i) order.of[i] = uint8_t(Pixel(RegisterOf(channel, i), i));
    return order;
  }
};
template <int kUnit, int kChannel>
constexpr Order kToPlanar = Turned<kUnit>::ToPlanar(kChannel);
template <int kUnit, int kChannel>
constexpr Order kToPacked = Turned<kUnit>::ToPacked(kChannel);

template <int kPlaces>
inline Register Turn(Register v) {
  return _mm512_rol_epi32(v, 8 * kPlaces);
}
// a, and b where the mask has ones.
inline Register Select(uint64_t mask, Register a, Register b) {
  return _mm512_mask_blend_epi8(mask, a, b);
}
constexpr uint64_t kOddPlaces = 0xAAAAAAAAAAAAAAAA;

// Bytes of kBytes pairs apart.
KESTREL_INLINE void Load2(const uint8_t* p, Bytes* first, Bytes* second) {
  const Register a = Load(p);
  const Register b = Turn<1>(Load(p + kBytes));
  first->v = Reorder(Select(kOddPlaces, a, b), kToPlanar<2, 0>);
  second->v = Reorder(Select(kOddPlaces, b, a), kToPlanar<2, 1>);
}
KESTREL_INLINE void Store2(uint8_t* p, Bytes first, Bytes second) {
  const Register a = Reorder(first.v, kToPacked<2, 0>);
  const Register b = Reorder(second.v, kToPacked<2, 1>);
  Store(p, Select(kOddPlaces, a, b));
  Store(p + kBytes, Turn<3>(Select(kOddPlaces, b, a)));
}

// Places i take bytes of a, b and c in turn.
inline Register InThrees(Register a, Register b, Register c) {
  return Select(0x4924924924924924, Select(0x2492492492492492, a, b), c);
}
KESTREL_INLINE PixelBytes Load3(const uint8_t* p) {
  const Register a = Load(p);
  const Register b = Load(p + kBytes);
  const Register c = Load(p + 2 * kBytes);
  return {{Reorder(InThrees(a, c, b), kToPlanar<3, 0>)},
          {Reorder(InThrees(b, a, c), kToPlanar<3, 1>)},
          {Reorder(InThrees(c, b, a), kToPlanar<3, 2>)},
          SetBytes(0)};
}
KESTREL_INLINE void Store3(uint8_t* p, Bytes low, Bytes middle, Bytes high) {
  const Register a = Reorder(low.v, kToPacked<3, 0>);
  const Register b = Reorder(middle.v, kToPacked<3, 1>);
  const Register c = Reorder(high.v, kToPacked<3, 2>);
  Store(p, InThrees(a, b, c));
  Store(p + kBytes, InThrees(b, c, a));
  Store(p + 2 * kBytes, InThrees(c, a, b));
}

// Byte i of result k is from register (i - k) modulo 4, by which registers become channels and
// channels registers.
KESTREL_INLINE Quads SelectQuads(Register a, Register b, Register c, Register d) {
  const Register ab = Select(kOddPlaces, a, b);
  const Register ba = Select(kOddPlaces, b, a);
  const Register cd = Select(kOddPlaces, c, d);
  const Register dc = Select(kOddPlaces, d, c);
  constexpr uint64_t kUpperTwo = 0xCCCCCCCCCCCCCCCC;
  constexpr uint64_t kMiddleTwo = 0x6666666666666666;
  return {{Select(kUpperTwo, ab, cd), Select(kMiddleTwo, dc, ba), Select(kUpperTwo, cd, ab),
           Select(kMiddleTwo, ba, dc)}};
}
KESTREL_INLINE PixelBytes Load4(const uint8_t* p) {
  const Quads channels = SelectQuads(Load(p), Turn<1>(Load(p + kBytes)),
                                     Turn<2>(Load(p + 2 * kBytes)), Turn<3>(Load(p + 3 * kBytes)));
  return {{Reorder(channels.v[0], kToPlanar<4, 0>)},
          {Reorder(channels.v[1], kToPlanar<4, 1>)},
          {Reorder(channels.v[2], kToPlanar<4, 2>)},
          {Reorder(channels.v[3], kToPlanar<4, 3>)}};
}
KESTREL_INLINE void Store4(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const Quads quads = SelectQuads(Reorder(a.v, kToPacked<4, 0>), Reorder(b.v, kToPacked<4, 1>),
                                  Reorder(c.v, kToPacked<4, 2>), Reorder(d.v, kToPacked<4, 3>));
  Store(p, quads.v[0]);
  Store(p + kBytes, Turn<3>(quads.v[1]));
  Store(p + 2 * kBytes, Turn<2>(quads.v[2]));
  Store(p + 3 * kBytes, Turn<1>(quads.v[3]));
}

// Samples in the order in which Store4InTurn writes whole registers: the lanes of each hold
// neighbouring pixels. Twice is in plain order again.
inline Register InTurn(Register v) {
  return _mm512_permutexvar_epi32(
      _mm512_setr_epi32(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15), v);
}
inline Bytes InTurn(Bytes b) {
  return {InTurn(b.v)};
}
inline Words InTurn(Words w) {
  return {InTurn(w.v)};
}
// Words of a vector's pixels, in that order.
inline WordsPair LoadPixelWordsInTurn(const uint8_t* p) {
  const Register order = _mm512_setr_epi64(0, 4, 1, 5, 2, 6, 3, 7);
  return {{_mm512_permutexvar_epi64(order, Load(p))},
          {_mm512_permutexvar_epi64(order, Load(p + kBytes))}};
}
KESTREL_INLINE void Store4InTurn(uint8_t* p, Bytes a, Bytes b, Bytes c, Bytes d) {
  const Quads quads = Interleave4(a, b, c, d);
  for (int i = 0; i < 4; ++i) Store(p + kBytes * i, quads.v[i]);
}

// ---- Order of bytes
// To each lane the last byte of the lane so many before it.
template <int kLanes>
constexpr Order LastOfLanes() {
  Order order = {};
  for (int i = 16 * kLanes; i < kBytes; ++i) order.of[i] = uint8_t((i | 15) - 16 * kLanes);
  return order;
}
template <int kLanes>
constexpr Order kLastOfLanes = LastOfLanes<kLanes>();
template <int kLanes>
inline Bytes AddLastOfLanes(Bytes b) {
  constexpr uint64_t kHaveOne = ~uint64_t{0} << (16 * kLanes);
  const Register last = _mm512_maskz_permutexvar_epi8(kHaveOne, Load(kLastOfLanes<kLanes>.of), b.v);
  return b + Bytes{last};
}
// Of each byte and all before it, modulo 256; and the last byte everywhere.
inline Bytes RunningSums(Bytes b) {
  return AddLastOfLanes<2>(AddLastOfLanes<1>(RunningSumsOfLanes(b)));
}
inline Bytes LastByte(Bytes b) {
  return {_mm512_permutexvar_epi8(SetBytes(kBytes - 1).v, b.v)};
}

template <int kUnit>
constexpr Order Reversed() {
  Order order = {};
  for (int i = 0; i < kBytes; ++i) {
    order.of[i] = uint8_t(kBytes - kUnit - i / kUnit * kUnit + i % kUnit);
  }
  return order;
}
template <int kUnit>
constexpr Order kReversed = Reversed<kUnit>();
inline Bytes Reversed(Bytes b) {
  return {Reorder(b.v, kReversed<1>)};
}
// The last unit first.
template <int kUnit>
inline void StoreReversed(uint8_t* p, const uint8_t* src) {
  Store(p, Reorder(Load(src), kReversed<kUnit>));
}

// Of two vectors narrowed lane by lane: the first one's bytes before the second one's.
inline Bytes InOrder(Bytes narrowed) {
  return {_mm512_permutexvar_epi64(_mm512_setr_epi64(0, 2, 4, 6, 1, 3, 5, 7), narrowed.v)};
}

// Half a block of a plan: its windows and its shuffle.
template <int kWindows>
inline Words GatherWords(const uint8_t* src, const uint8_t* windows, int first,
                         const uint8_t* shuffle) {
  const auto window = [=](int i) { return src + WindowAt(windows, first + i); };
  const Register order = Load(shuffle);
  Register pairs = _mm512_permutexvar_epi8(order, Load(window(0)));
  constexpr int kShared = kBytes / kWindows;
  for (int i = 1; i < kWindows; ++i) {
    const __mmask64 others = ~uint64_t{0} << (kShared * i);
    pairs = _mm512_mask_permutexvar_epi8(pairs, others, order, Load(window(i)));
  }
  return {pairs};
}

// ---- Pixels that lie apart
// Pixels of three bytes, four apart: the bytes between them are not written.
constexpr Order ThreesInFours() {
  Order order = {};
  for (int i = 0; i < kBytes; ++i) order.of[i] = uint8_t(i / 4 * 3 + i % 4);
  return order;
}
constexpr Order kThreesInFours = ThreesInFours();
inline void WriteThreesInFours(uint8_t* dst, const uint8_t* src, int n) {
  constexpr int kPixels = kBytes / 4;
  for (int i = 0; i < n; i += kPixels) {
    const int absent = n - i < kPixels ? kPixels - (n - i) : 0;
    const __mmask64 read = ~uint64_t{0} >> (kPixels + 3 * absent);
    const __mmask64 written = uint64_t{0x7777777777777777} >> (4 * absent);
    const Register pixels = _mm512_maskz_loadu_epi8(read, src + ptrdiff_t{3} * i);
    _mm512_mask_storeu_epi8(dst + ptrdiff_t{4} * i, written, Reorder(pixels, kThreesInFours));
  }
}

// ---- Pixels of four bytes
// Register i of kBytes pixels, and of the second ones of as many pairs, in an order that
// NarrowedQuads knows to set right when each pixel has become a byte.
inline Register LoadQuads(const uint8_t* p, int i) {
  return Load(p + kBytes * i);
}
inline Register LoadSecondQuads(const uint8_t* p, int i) {
  const Register seconds =
      _mm512_setr_epi32(1, 3, 5, 7, 9, 11, 13, 15, 17, 19, 21, 23, 25, 27, 29, 31);
  return _mm512_permutex2var_epi32(Load(p + 2 * kBytes * i), seconds,
                                   Load(p + 2 * kBytes * i + kBytes));
}
inline Bytes NarrowedQuads(Bytes b) {
  return InTurn(b);
}
// By loads that select: the gather instruction is slow on many CPUs, inserting competes for the one
// port that permutes.
// Vectors may be loaded up to `end`.
KESTREL_INLINE Bytes GatherQuads(const uint8_t* src, const int32_t* offsets, int32_t end) {
  // Most often the pixels are among 32 neighbours.
  const Register distance = _mm512_sub_epi32(Load(offsets), _mm512_set1_epi32(offsets[0]));
  const bool near = _mm512_test_epi32_mask(distance, _mm512_set1_epi32(~124)) == 0;
  if (near && offsets[0] + 2 * kBytes <= end) {
    const uint8_t* const window = src + offsets[0];
    return {_mm512_permutex2var_epi32(Load(window), _mm512_srli_epi32(distance, 2),
                                      Load(window + kBytes))};
  }
  Register every4[4];
  for (int i = 0; i < 4; ++i) {
    const auto quad = [=](int lane) { return _mm_loadu_si32(src + offsets[4 * lane + i]); };
    Register v = _mm512_broadcastd_epi32(quad(0));
    v = _mm512_mask_broadcastd_epi32(v, 0x00F0, quad(1));
    v = _mm512_mask_broadcastd_epi32(v, 0x0F00, quad(2));
    every4[i] = _mm512_mask_broadcastd_epi32(v, 0xF000, quad(3));
  }
  const Register low = _mm512_mask_blend_epi32(0xAAAA, every4[0], every4[1]);
  const Register high = _mm512_mask_blend_epi32(0xAAAA, every4[2], every4[3]);
  return {_mm512_mask_blend_epi32(0xCCCC, low, high)};
}
}  // namespace
}  // namespace kestrel

#endif
