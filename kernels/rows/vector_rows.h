// Row operations on vectors, for any instruction set: the file that includes this has included
// vector_x86.h or vector_neon.h before. In an unnamed namespace, as those are.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_ROWS_H
#define KESTREL_KERNELS_ROWS_VECTOR_ROWS_H

#include <string.h>

#include "kernels/rows/channels.h"
#include "kernels/rows/indexed.h"

namespace kestrel {
namespace {

// ---- Runs of any length
constexpr bool kIsNarrowest = &kNarrower == &kScalarRows;

// A run's length is the last argument of an operation on it.
inline int LengthOf(int n) {
  return n;
}
template <typename First, typename... Others>
inline int LengthOf(const First&, const Others&... others) {
  return LengthOf(others...);
}

// An operation as the table has it: runs of fewer than kLeast units are left to the next narrower
// set, whose vectors they may fill.
template <auto kMember, auto kOperation, int kLeast = kBytes>
struct ForLong;
template <typename... Arguments, void (*RowOps::*kMember)(Arguments...),
          void (*kOperation)(Arguments...), int kLeast>
struct ForLong<kMember, kOperation, kLeast> {
  static void Run(Arguments... arguments) {
    if (LengthOf(arguments...) < kLeast) return (kNarrower.*kMember)(arguments...);
    kOperation(arguments...);
  }
};

// Part of a run.
struct Units {
  const uint8_t* start;
  int unit;
  const uint8_t* At(int i) const { return start + ptrdiff_t{i} * unit; }
};

// Stores of wide vectors cost twice as much where they cross cache lines. Units of kUnit bytes from
// `at` on, or below it, to the next address that a vector never crosses one from; 0 where there is
// none, and for runs that are too short to gain from it.
template <int kUnit>
inline int UnitsToBoundary(const uint8_t* at, int n, bool below = false) {
  if (kBytes < 32 || n < 4 * kBytes) return 0;
  const int address = int(reinterpret_cast<uintptr_t>(at) & (kBytes - 1));
  const int bytes = (below ? address : -address) & (kBytes - 1);
  // A third of some bytes, modulo a power of two up to 128.
  return kUnit == 3 ? bytes * 43 & (kBytes - 1) : bytes % kUnit == 0 ? bytes / kUnit : 0;
}

// Calls block(destinations, sources...) for each kBytes of n >= kBytes units. The second vector
// begins where stores are aligned, within the first, and the last one reaches back: those units are
// done twice. Where one source is written over the last vector is made before all others, in a
// copy. (Each kTogether units are something whole.)
template <int kDstUnit, int kTogether = 1, int kDsts, typename Block, typename... Sources>
inline void ForRun(uint8_t* const (&dst)[kDsts], int n, const Block& block, Sources... sources) {
  uint8_t* at[kDsts];
  for (int d = 0; d < kDsts; ++d) at[d] = dst[d];
  const auto advance = [&](int units) {
    for (int d = 0; d < kDsts; ++d) at[d] += units * kDstUnit;
    ((sources.start += units * sources.unit), ...);
  };
  const bool inPlace = ((sources.start == dst[0]) || ...);
  const bool isCopied = inPlace && n % kBytes != 0;
  uint8_t last[kDsts][kDstUnit * kBytes];
  if (isCopied) {
    uint8_t* into[kDsts];
    for (int d = 0; d < kDsts; ++d) into[d] = last[d];
    block(into, sources.At(n - kBytes)...);
  }
  const int lead = inPlace ? 0 : UnitsToBoundary<kDstUnit>(dst[0], n);
  if (lead != 0 && lead % kTogether == 0) {
    block(at, sources.start...);
    advance(lead);
    n -= lead;
  }
  // (Pointers that move on cost nothing where loads and stores can move them.)
  int vectors = n / kBytes;
  do {
    block(at, sources.start...);
    advance(kBytes);
  } while (--vectors != 0);
  const int rest = n % kBytes;
  if (isCopied) {
    for (int d = 0; d < kDsts; ++d) {
      memcpy(at[d] + (rest - kBytes) * kDstUnit, last[d], sizeof(last[d]));
    }
  } else if (rest != 0) {
    advance(rest - kBytes);
    block(at, sources.start...);
  }
}

// ---- Resampling
inline Words Blend(Words a, Words b, Words weights) {
  const Words difference = b - a;
  // Weights are unsigned: one of 0.5 and more counts as itself less one.
  return AddHighProduct(a + (difference & ShiftRight<15>(weights)), difference, weights);
}

void BlendColumns(uint8_t* dst, const uint8_t* a, const uint8_t* b, const uint16_t* weights,
                  int n) {
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* inA, const uint8_t* inB, const uint8_t* inWeights) {
        const WordsPair first = Widen(LoadBytes(inA));
        const WordsPair second = Widen(LoadBytes(inB));
        const WordsPair w = LoadPixelWords(inWeights);
        StoreBytes(out[0], Narrow(Blend(first.low, second.low, w.low),
                                  Blend(first.high, second.high, w.high)));
      },
      Units{a, 1}, Units{b, 1}, Units{reinterpret_cast<const uint8_t*>(weights), 2});
}

// (Vectors are no arguments of functions that are called: those would leave it to their callers to
// clear the upper parts of registers, which slow down what follows.)
template <bool kFromSecond, bool kKeepsByte>
void BlendRowsFrom(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight, int keptByte,
                   int n) {
  const Words w = SetWords(int(weight));
  const Bytes kept = QuadBytes(keptByte);
  uint8_t* const dsts[] = {dst};
  ForRun<1, kKeepsByte ? 4 : 1>(
      dsts, n,
      [=](uint8_t* const* out, const uint8_t* inA, const uint8_t* inB) {
        const Bytes first = LoadBytes(inA);
        Bytes second = LoadBytes(inB);
        if constexpr (kKeepsByte) second = SelectBits(kept, first, second);
        StoreBytes(out[0], AddShare(kFromSecond ? second : first, first, second, w));
      },
      Units{a, 1}, Units{b, 1});
}

// As in Blend: a weight of 0.5 and more counts as itself less one.
void BlendRows(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight, int n) {
  if (weight >= 32768) {
    BlendRowsFrom<true, false>(dst, a, b, weight, 0, n);
  } else {
    BlendRowsFrom<false, false>(dst, a, b, weight, 0, n);
  }
}

void BlendPixelRows(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight,
                    int alphaByte, int n) {
  if (alphaByte < 0) {
    BlendRows(dst, a, b, weight, 4 * n);
  } else if (weight >= 32768) {
    BlendRowsFrom<true, true>(dst, a, b, weight, alphaByte, 4 * n);
  } else {
    BlendRowsFrom<false, true>(dst, a, b, weight, alphaByte, 4 * n);
  }
}

constexpr int kQuads = kBytes / 4;  // pixels of four bytes in a vector

void GatherPixels(uint8_t* dst, const uint8_t* src, const int32_t* offsets, int bytes, int n) {
  int i = 0;
  if (bytes == 4) {
    const int32_t end = n > 0 ? offsets[n - 1] + 4 : 0;
    for (; i + kQuads <= n; i += kQuads) {
      StoreBytes(dst + 4 * i, GatherQuads(src, offsets + i, end));
    }
  }
  scalar::GatherPixels(dst + ptrdiff_t{i} * bytes, src, offsets + i, bytes, n - i);
}

// The bytes that a plan reads.
struct Extent {
  int32_t lowest, end;
};
inline Extent ExtentOf(const int32_t* offsets, int n, int stride) {
  int32_t lowest = INT32_MAX;
  int32_t highest = INT32_MIN;
  for (int i = 0; i < n; ++i) {
    const int32_t offset = offsets[ptrdiff_t{i} * stride];
    lowest = offset < lowest ? offset : lowest;
    highest = offset > highest ? offset : highest;
  }
  return {lowest, highest + 1};
}
// (A stride that compilers know to be 1 lets them take several at once.)
inline Extent ExtentOf(const PairPlan& plan) {
  const int32_t* const offsets = plan.first;
  const int units = plan.n / plan.unit;
  const Extent a =
      plan.stride == 1 ? ExtentOf(offsets, units, 1) : ExtentOf(offsets, units, plan.stride);
  const Extent b = plan.second == nullptr ? Extent{a.lowest + plan.apart, a.end + plan.apart}
                   : plan.stride == 1     ? ExtentOf(plan.second, units, 1)
                                          : ExtentOf(plan.second, units, plan.stride);
  return {a.lowest < b.lowest ? a.lowest : b.lowest,
          (a.end > b.end ? a.end : b.end) + plan.unit - 1};
}

// Pairs are taken in groups that fill a lane of 16 bytes, or with AVX-512 a whole vector; each from
// one, two or four windows.
constexpr int kGroup = kWindow / 2;

// Pairs that share a window: where it begins, from the lowest byte on, and where in it their bytes
// are, in turn. No window reaches beyond the bytes that the run reads anyway, [lowest, end). False
// when there is none.
constexpr uint16_t kNoWindow = 0xFFFF;
template <int kShared>
bool PlanWindow(const int32_t* firsts, const int32_t* seconds, const Extent& extent,
                uint16_t* window, uint8_t* at) {
  int32_t lowest = firsts[0];
  int32_t highest = firsts[0];
  for (int k = 0; k < kShared; ++k) {
    const int32_t low = firsts[k] < seconds[k] ? firsts[k] : seconds[k];
    const int32_t high = firsts[k] < seconds[k] ? seconds[k] : firsts[k];
    lowest = low < lowest ? low : lowest;
    highest = high > highest ? high : highest;
  }
  if (lowest > extent.end - kWindow) lowest = extent.end - kWindow;
  const int32_t start = lowest - extent.lowest;
  const bool fits = start >= 0 && start < kNoWindow && highest - lowest < kWindow;
  *window = fits ? uint16_t(start) : kNoWindow;
  if (!fits) {
    memset(at, 0, 2 * kShared);
    return false;
  }
  for (int k = 0; k < kShared; ++k) {
    const uint16_t both = uint16_t((firsts[k] - lowest) | (seconds[k] - lowest) << 8);
    memcpy(at + 2 * k, &both, sizeof(both));
  }
  return true;
}

// A plan's pairs in blocks of kPairs: first the windows of each group (with room for four), then
// two bytes for each pair. The last block reaches back over pairs of the one before it; one that is
// the only one and not full repeats its last pair.
constexpr int kWindowBytes = kPairs / kGroup * 4 * int(sizeof(uint16_t));
constexpr int kBlockBytes = PairPlan::kPreparedBytes * kPairs;
static_assert(kWindowBytes + 2 * kPairs <= kBlockBytes, "what is prepared has room");

inline int BlocksOf(const PairPlan& plan) {
  return (plan.n + kPairs - 1) / kPairs;
}
inline int FirstPairOf(const PairPlan& plan, int block) {
  const int first = block * kPairs;
  const int latest = plan.n < kPairs ? 0 : plan.n - kPairs;
  return first < latest ? first : latest;
}

// Plans of fewer pairs than a block has, or fewer bytes than a window. Even a block that is not
// full costs less than single pairs.
inline bool IsForNarrower(const PairPlan& plan) {
  return !kIsNarrowest && (plan.n < kPairs || plan.extent < kWindow);
}

// Weights are unsigned. A blend whose weight is 0.5 or more begins with the second byte: its pair
// is planned the other way around, and the rest of the weight counts. For all, what is kept is the
// negative of the weight, down to -0.5, by which the first byte less the second is multiplied.
inline bool BeginsWithSecond(uint16_t weight) {
  return weight >= 32768;
}
inline uint16_t NegativeWeight(uint16_t weight) {
  return BeginsWithSecond(weight) ? weight : uint16_t(-weight);
}

// Offsets of a group of pairs from one on, as they are blended. Beyond the last pair that one
// again.
struct GroupOffsets {
  int32_t first[kGroup], second[kGroup];
};
inline void ReadOffsets(const PairPlan& plan, int from, GroupOffsets* group) {
  int32_t* const firsts = group->first;
  int32_t* const seconds = group->second;
  const PairPlan::Lists lists(plan);
  const bool areBytes = from + kGroup <= plan.n && plan.unit == 1;
  // (Strides that compilers know let them take several at once.)
  if (areBytes && plan.stride == 1 && plan.weights == nullptr) {
    for (int k = 0; k < kGroup; ++k) firsts[k] = lists.first[from + k];
    for (int k = 0; k < kGroup; ++k) seconds[k] = lists.second[from + k] + lists.apart;
  } else if (areBytes && plan.stride == 2 && plan.weights == nullptr) {
    for (int k = 0; k < kGroup; ++k) firsts[k] = lists.first[2 * (from + k)];
    for (int k = 0; k < kGroup; ++k) seconds[k] = lists.second[2 * (from + k)] + lists.apart;
  } else if (areBytes && plan.stride == 1) {
    for (int k = 0; k < kGroup; ++k) {
      const int32_t a = lists.first[from + k];
      const int32_t b = lists.second[from + k] + lists.apart;
      const bool swap = BeginsWithSecond(plan.weights[from + k]);
      firsts[k] = swap ? b : a;
      seconds[k] = swap ? a : b;
    }
  } else if (from + kGroup <= plan.n && plan.unit == 4 && plan.weights != nullptr) {
    for (int k = 0; k < kGroup; k += 4) {
      const int unit = (from + k) / 4;
      const int32_t a = lists.First(unit);
      const int32_t b = lists.Second(unit);
      const bool swap = BeginsWithSecond(plan.weights[unit]);
      for (int byte = 0; byte < 4; ++byte) {
        firsts[k + byte] = (swap ? b : a) + byte;
        seconds[k + byte] = (swap ? a : b) + byte;
      }
      if (plan.keptByte < 0) continue;
      firsts[k + plan.keptByte] = seconds[k + plan.keptByte] = a + plan.keptByte;
    }
  } else {
    if (from >= plan.n) from = plan.n - 1;
    int unit = from / plan.unit;
    int byte = from % plan.unit;
    for (int k = 0; k < kGroup; ++k) {
      const int32_t a = lists.First(unit) + byte;
      const int32_t b = byte == plan.keptByte ? a : lists.Second(unit) + byte;
      const bool swap = plan.weights != nullptr && BeginsWithSecond(plan.weights[unit]);
      firsts[k] = swap ? b : a;
      seconds[k] = swap ? a : b;
      if (from + k + 1 >= plan.n) continue;
      if (++byte == plan.unit) {
        byte = 0;
        ++unit;
      }
    }
  }
}

// Whether all pairs have windows. Fewer than four for each group are given up with the first that
// has none.
template <int kWindows>
bool PlanWindows(PairPlan* plan, const Extent& extent) {
  constexpr int kShared = kGroup / kWindows;
  plan->windows = kWindows;
  plan->hasWindows = true;
  for (int i = 0; i < BlocksOf(*plan) * kPairs; i += kGroup) {
    const int group = i % kPairs / kGroup;
    GroupOffsets offsets;
    ReadOffsets(*plan, FirstPairOf(*plan, i / kPairs) + kGroup * group, &offsets);
    uint8_t* const block = plan->prepared + kBlockBytes * (i / kPairs);
    uint8_t at[2 * kGroup];
    for (int w = 0; w < kWindows; ++w) {
      uint16_t window;
      const int pair = kShared * w;
      const bool fits = PlanWindow<kShared>(offsets.first + pair, offsets.second + pair, extent,
                                            &window, at + 2 * pair);
      memcpy(block + sizeof(window) * size_t(group * kWindows + w), &window, sizeof(window));
      if (!fits) plan->hasWindows = false;
    }
    if (kWindows < 4 && !plan->hasWindows) return false;
    SetShuffle<kShared>(block + kWindowBytes + 2 * kGroup * group, at);
  }
  return plan->hasWindows;
}

// Of a block's pairs; none beyond the last.
void PlanWeights(uint16_t* blends, const PairPlan& plan, int from) {
  const int n = plan.n - from < kPairs ? plan.n - from : kPairs;
  if (plan.unit == 1) {
    for (int i = 0; i < n; ++i) blends[i] = NegativeWeight(plan.weights[from + i]);
  } else {
    int unit = from / plan.unit;
    int byte = from % plan.unit;
    for (int i = 0; i < n; ++i) {
      blends[i] = NegativeWeight(plan.weights[unit]);
      if (++byte == plan.unit) {
        byte = 0;
        ++unit;
      }
    }
  }
  for (int i = n; i < kPairs; ++i) blends[i] = 0;
}

void PlanPairs(PairPlan* plan) {
  if (plan->n == 0) return;
  const Extent extent = ExtentOf(*plan);
  plan->lowest = extent.lowest;
  plan->extent = extent.end - extent.lowest;
  if (IsForNarrower(*plan)) return kNarrower.planPairs(plan);
  if (!PlanWindows<1>(plan, extent) && !PlanWindows<2>(plan, extent)) {
    PlanWindows<4>(plan, extent);
  }
  if (plan->weights == nullptr) return;
  for (int block = 0; block < BlocksOf(*plan); ++block) {
    PlanWeights(plan->blends + kPairs * block, *plan, FirstPairOf(*plan, block));
  }
}

// Whether the pairs of a block have windows, four for each group.
bool HasWindows(const uint8_t* block) {
  uint16_t windows[kPairs / kGroup * 4];
  memcpy(windows, block, sizeof(windows));
  bool all = true;
  for (const uint16_t window : windows) all = all && window != kNoWindow;
  return all;
}

// Calls store(dst, pairs, block) for `count` blocks from one on.
template <int kWindows, typename Store>
inline void StoreBlocksOf(uint8_t* out, int step, const uint8_t* src, const uint8_t* prepared,
                          int block, int count, const Store& store) {
  for (; count > 0; --count, ++block, prepared += kBlockBytes, out += step) {
    store(out, GatherPairs<kWindows>(src, prepared, prepared + kWindowBytes), block);
  }
}
template <typename Store>
KESTREL_INLINE void StoreBlocks(uint8_t* out, int step, const uint8_t* src, const PairPlan& plan,
                                int block, int count, const Store& store) {
  const uint8_t* const prepared = plan.prepared + kBlockBytes * block;
  src += plan.lowest;
  if (plan.windows == 1) {
    StoreBlocksOf<1>(out, step, src, prepared, block, count, store);
  } else if (plan.windows == 2) {
    StoreBlocksOf<2>(out, step, src, prepared, block, count, store);
  } else {
    StoreBlocksOf<4>(out, step, src, prepared, block, count, store);
  }
}

// ForPairs where some have no windows. (Apart, because it would cost the others registers.)
template <int kDstUnit, typename Store, typename Other>
__attribute__((noinline)) void ForSomePairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan,
                                            const Store& store, const Other& other) {
  const int whole = plan.n / kPairs;
  for (int block = 0; block < whole; ++block) {
    if (HasWindows(plan.prepared + kBlockBytes * block)) {
      StoreBlocks(dst + block * kPairs * kDstUnit, 0, src, plan, block, 1, store);
    } else {
      other(block * kPairs, (block + 1) * kPairs);
    }
  }
  other(whole * kPairs, plan.n);
}

// Calls store(dst, pairs, block) for each block of a plan whose pairs have windows, other(i, end)
// for the pairs of any other.
template <int kDstUnit, typename Store, typename Other>
inline void ForPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan, const Store& store,
                     const Other& other) {
  if (!plan.hasWindows) return ForSomePairs<kDstUnit>(dst, src, plan, store, other);
  const int n = plan.n;
  const int whole = n / kPairs;
  StoreBlocks(dst, kPairs * kDstUnit, src, plan, 0, whole, store);
  if (whole * kPairs == n) return;
  uint8_t rest[kPairs * kDstUnit];
  StoreBlocks(whole > 0 ? dst + (n - kPairs) * kDstUnit : rest, 0, src, plan, whole, 1, store);
  if (whole == 0) memcpy(dst, rest, size_t(n) * kDstUnit);
}

void ReadPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan) {
  if (IsForNarrower(plan)) return kNarrower.readPairs(dst, src, plan);
  ForPairs<2>(
      dst, src, plan, [](uint8_t* out, const Pairs& pairs, int) { StorePairs(out, pairs); },
      [=, &plan](int i, int end) { scalar::ReadSomePairs(dst, src, plan, i, end); });
}

void BlendPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan) {
  if (IsForNarrower(plan)) return kNarrower.blendPairs(dst, src, plan);
  const uint16_t* const blends = plan.blends;
  ForPairs<1>(
      dst, src, plan,
      [=](uint8_t* out, const Pairs& pairs, int block) {
        StoreBlended(out, pairs, blends + kPairs * block);
      },
      [=, &plan](int i, int end) { scalar::BlendSomePairs(dst, src, plan, i, end); });
}

// ---- Packed pixels
// Which of the layouts that vectors know a format is: red, green and blue (or the reverse) from the
// lowest bits up, in bytes that may be followed by alpha, or in fields of 5, 6 and 5 bits.
struct PixelShape {
  explicit PixelShape(const PixelFormat& format) {
    const uint32_t* at = format.position;
    const uint32_t* size = format.size;
    blueFirst = at[0] > at[2];
    const uint32_t lowest = blueFirst ? at[2] : at[0];
    const uint32_t highest = blueFirst ? at[0] : at[2];
    const bool bytesInTurn = format.wholeBytes && lowest == 0 && at[1] == 8 && highest == 16;
    const bool is565 =
        size[0] == 5 && size[1] == 6 && size[2] == 5 && lowest == 0 && at[1] == 5 && highest == 11;
    const bool known = format.bytes == 2 ? is565 : format.bytes >= 3 && bytesInTurn;
    bytes = known ? format.bytes : 0;
  }
  int bytes;  // 0: none of them
  bool blueFirst;
};

// For channels by themselves, which bytes may have in any order: `at` says which one is where.
struct ChannelShape : PixelShape {
  explicit ChannelShape(const PixelFormat& format) : PixelShape(format) {
    if (bytes == 0 && format.bytes == 3 && format.wholeBytes) {
      int found[3] = {-1, -1, -1};
      for (int c = 0; c < 3; ++c) found[format.position[c] / 8] = c;
      if (found[0] < 0 || found[1] < 0 || found[2] < 0) return;
      bytes = 3;
      for (int k = 0; k < 3; ++k) at[k] = found[k];
    } else if (blueFirst) {
      at[0] = 2;
      at[2] = 0;
    }
  }
  int at[3] = {0, 1, 2};
};

// Pixels of 5, 6 and 5 bits from channels whose fields are in the top bits, or in the lowest.
inline Words Pack565(Words low, Words green, Words high) {
  return ShiftRightUnsigned<3>(low) | ShiftLeft<3>(green & SetWords(0xFC)) |
         ShiftLeft<8>(high & SetWords(0xF8));
}
inline Words PackFields565(Words low, Words green, Words high) {
  return low | ShiftLeft<5>(green) | ShiftLeft<11>(high);
}

// Channels by their place in the pixel. kBytes pixels.
template <int kPixel>
KESTREL_INLINE void StorePixels(uint8_t* dst, Bytes low, Bytes middle, Bytes high, Bytes alpha) {
  if constexpr (kPixel == 4) {
    Store4(dst, low, middle, high, alpha);
  } else if constexpr (kPixel == 3) {
    Store3(dst, low, middle, high);
  } else {
    const WordsPair l = Widen(low);
    const WordsPair m = Widen(middle);
    const WordsPair h = Widen(high);
    StorePixelWords(dst, {Pack565(l.low, m.low, h.low), Pack565(l.high, m.high, h.high)});
  }
}

template <int kPixel>
KESTREL_INLINE PixelBytes LoadPixels(const uint8_t* src) {
  if constexpr (kPixel == 4) {
    return Load4(src);
  } else if constexpr (kPixel == 3) {
    return Load3(src);
  } else {
    const WordsPair w = LoadPixelWords(src);
    const Words five = SetWords(0xF8);
    const Words six = SetWords(0xFC);
    return {Narrow(ShiftLeft<3>(w.low) & five, ShiftLeft<3>(w.high) & five),
            Narrow(ShiftRightUnsigned<3>(w.low) & six, ShiftRightUnsigned<3>(w.high) & six),
            Narrow(ShiftRightUnsigned<8>(w.low) & five, ShiftRightUnsigned<8>(w.high) & five),
            SetBytes(0)};
  }
}

// Calls call(PixelSize) of a shape that is known.
template <int kPixel>
struct PixelSize {
  static constexpr int value = kPixel;
};
template <typename Call>
inline void WithPixelSize(const PixelShape& shape, const Call& call) {
  if (shape.bytes == 4) {
    call(PixelSize<4>());
  } else if (shape.bytes == 3) {
    call(PixelSize<3>());
  } else {
    call(PixelSize<2>());
  }
}

inline uint8_t AlphaOf(AlphaFill alpha) {
  return uint8_t(alpha.bits >> 24);
}

// ---- Packed pixels of any layout, by way of planes of their bytes
struct BytePlanes {
  static constexpr int kMost = 256;  // pixels
  explicit BytePlanes(int bytes) {
    // A field may lie beyond the bytes of a pixel.
    for (int k = bytes; k < 4; ++k) memset(of[k], 0, sizeof(of[k]));
  }
  uint8_t of[4][kMost];
};

// Calls call(x, n) for pieces of a run of n >= kBytes, none of which is shorter than a vector.
template <typename Call>
inline void ForPieces(int n, const Call& call) {
  constexpr int kMost = BytePlanes::kMost;
  for (int x = 0; x < n;) {
    const int rest = n - x;
    const int count = rest <= kMost ? rest : rest < kMost + kBytes ? rest - kBytes : kMost;
    call(x, count);
    x += count;
  }
}

template <int kPixel>
void TakeBytesApart(BytePlanes* planes, const uint8_t* src, int n) {
  uint8_t* const dsts[] = {planes->of[0], planes->of[1], planes->of[2], planes->of[3]};
  ForRun<1>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* in) {
        PixelBytes p = {LoadBytes(in), SetBytes(0), SetBytes(0), SetBytes(0)};
        if constexpr (kPixel == 2) Load2(in, &p.low, &p.middle);
        if constexpr (kPixel == 3) p = Load3(in);
        if constexpr (kPixel == 4) p = Load4(in);
        StoreBytes(out[0], p.low);
        StoreBytes(out[1], p.middle);
        StoreBytes(out[2], p.high);
        StoreBytes(out[3], p.alpha);
      },
      Units{src, kPixel});
}
template <int kPixel>
void PutBytesTogether(uint8_t* dst, const BytePlanes& planes, int n) {
  uint8_t* const dsts[] = {dst};
  ForRun<kPixel>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* low, const uint8_t* middle, const uint8_t* high,
         const uint8_t* alpha) {
        if constexpr (kPixel == 1) StoreBytes(out[0], LoadBytes(low));
        if constexpr (kPixel == 2) Store2(out[0], LoadBytes(low), LoadBytes(middle));
        if constexpr (kPixel == 3) {
          Store3(out[0], LoadBytes(low), LoadBytes(middle), LoadBytes(high));
        }
        if constexpr (kPixel == 4) {
          Store4(out[0], LoadBytes(low), LoadBytes(middle), LoadBytes(high), LoadBytes(alpha));
        }
      },
      Units{planes.of[0], 1}, Units{planes.of[1], 1}, Units{planes.of[2], 1},
      Units{planes.of[3], 1});
}
template <typename Call>
inline void WithBytes(int bytes, const Call& call) {
  if (bytes == 4) {
    call(PixelSize<4>());
  } else if (bytes == 3) {
    call(PixelSize<3>());
  } else if (bytes == 2) {
    call(PixelSize<2>());
  } else {
    call(PixelSize<1>());
  }
}

// A field's top eight bits: the lower ones of them in one byte, the upper ones in the next.
void UnpackField(uint8_t* dst, const BytePlanes& planes, uint32_t position, uint32_t size, int n) {
  if (size == 0) {
    memset(dst, 0, size_t(n));
    return;
  }
  const uint32_t last = (position + size - 1) / 8;
  const uint32_t up = 8 * (last + 1) - position - size;
  const Bytes kept = SetBytes(size < 8 ? 0xFF << (8 - size) : 0xFF);
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, n,
      [=](uint8_t* const* out, const uint8_t* upper, const uint8_t* lower) {
        const Bytes level =
            ShiftLeft(LoadBytes(upper), up) | ShiftRightUnsigned(LoadBytes(lower), 8 - up);
        StoreBytes(out[0], level & kept);
      },
      Units{planes.of[last], 1}, Units{planes.of[last > 0 ? last - 1 : 0], 1});
}
void UnpackFields(uint8_t* const rgb[3], const uint8_t* src, const PixelFormat& format, int n) {
  BytePlanes planes(format.bytes);
  ForPieces(n, [&](int x, int count) {
    WithBytes(format.bytes, [&](auto size) {
      constexpr int kPixel = decltype(size)::value;
      TakeBytesApart<kPixel>(&planes, src + ptrdiff_t{x} * kPixel, count);
    });
    for (int c = 0; c < 3; ++c) {
      UnpackField(rgb[c] + x, planes, format.position[c], format.size[c], count);
    }
  });
}

// What channels add to a byte of pixels: levels shifted right and then left.
struct ByteOfFields {
  ByteOfFields(const PixelFormat& format, const FieldShifts& shifts, int byte) {
    for (int c = 0; c < 3; ++c) {
      const int32_t narrowing = shifts.right[c] > 0 ? shifts.right[c] : 0;
      // From this byte's lowest bit up to the field's.
      const int32_t up = int32_t(format.position[c]) + narrowing - shifts.right[c] - 8 * byte;
      right[c] = up < 0 ? uint32_t(narrowing - up < 8 ? narrowing - up : 8) : uint32_t(narrowing);
      left[c] = up < 0 ? 0 : uint32_t(up < 8 ? up : 8);
    }
  }
  uint32_t right[3], left[3];  // no more than 8
};
void PackByte(uint8_t* dst, const uint8_t* const rgb[3], int x, const ByteOfFields& fields,
              uint8_t keep, uint8_t bits, int n) {
  const Bytes kept = SetBytes(keep);
  const Bytes fixed = SetBytes(bits);
  const auto share = [=](int c, const uint8_t* in) {
    return ShiftLeft(ShiftRightUnsigned(LoadBytes(in), fields.right[c]), fields.left[c]);
  };
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, n,
      [=](uint8_t* const* out, const uint8_t* red, const uint8_t* green, const uint8_t* blue) {
        const Bytes all = share(0, red) | share(1, green) | share(2, blue);
        StoreBytes(out[0], (all & kept) | fixed);
      },
      Units{rgb[0] + x, 1}, Units{rgb[1] + x, 1}, Units{rgb[2] + x, 1});
}
void PackFields(uint8_t* dst, const uint8_t* const rgb[3], const PixelFormat& format,
                const FieldShifts& shifts, AlphaFill alpha, int n) {
  BytePlanes planes(format.bytes);
  ForPieces(n, [&](int x, int count) {
    for (int k = 0; k < format.bytes; ++k) {
      PackByte(planes.of[k], rgb, x, ByteOfFields(format, shifts, k),
               uint8_t(alpha.keep >> (8 * k)), uint8_t(alpha.bits >> (8 * k)), count);
    }
    WithBytes(format.bytes, [&](auto size) {
      constexpr int kPixel = decltype(size)::value;
      PutBytesTogether<kPixel>(dst + ptrdiff_t{x} * kPixel, planes, count);
    });
  });
}

void PackRgb(uint8_t* dst, const uint8_t* const rgb[3], const PixelFormat& format,
             const FieldShifts& shifts, AlphaFill alpha, int n) {
  const ChannelShape shape(format);
  const bool narrowed = shape.bytes == 2 && shifts.right[0] == 0;
  if (format.bytes == 0) return scalar::PackRgb(dst, rgb, format, shifts, alpha, n);
  if (shape.bytes == 0 || (shape.bytes == 2 && !narrowed && shifts.right[0] != 3)) {
    return PackFields(dst, rgb, format, shifts, alpha, n);
  }
  const Bytes fill = SetBytes(AlphaOf(alpha));
  uint8_t* const dsts[] = {dst};
  const Units low = {rgb[shape.at[0]], 1};
  const Units middle = {rgb[shape.at[1]], 1};
  const Units high = {rgb[shape.at[2]], 1};
  if (narrowed) {
    return ForRun<2>(
        dsts, n,
        [](uint8_t* const* out, const uint8_t* inLow, const uint8_t* inMiddle,
           const uint8_t* inHigh) {
          const WordsPair l = Widen(LoadBytes(inLow));
          const WordsPair m = Widen(LoadBytes(inMiddle));
          const WordsPair h = Widen(LoadBytes(inHigh));
          StorePixelWords(
              out[0], {PackFields565(l.low, m.low, h.low), PackFields565(l.high, m.high, h.high)});
        },
        low, middle, high);
  }
  WithPixelSize(shape, [&](auto size) {
    constexpr int kPixel = decltype(size)::value;
    ForRun<kPixel>(
        dsts, n,
        [=](uint8_t* const* out, const uint8_t* inLow, const uint8_t* inMiddle,
            const uint8_t* inHigh) {
          StorePixels<kPixel>(out[0], LoadBytes(inLow), LoadBytes(inMiddle), LoadBytes(inHigh),
                              fill);
        },
        low, middle, high);
  });
}

void UnpackRgb(uint8_t* const rgb[3], const uint8_t* src, const PixelFormat& format, int n) {
  const ChannelShape shape(format);
  if (format.bytes == 0) return scalar::UnpackRgb(rgb, src, format, n);
  if (shape.bytes == 0) return UnpackFields(rgb, src, format, n);
  uint8_t* const dsts[] = {rgb[shape.at[0]], rgb[shape.at[1]], rgb[shape.at[2]]};
  WithPixelSize(shape, [&](auto size) {
    constexpr int kPixel = decltype(size)::value;
    ForRun<1>(
        dsts, n,
        [](uint8_t* const* out, const uint8_t* in) {
          const PixelBytes pixels = LoadPixels<kPixel>(in);
          StoreBytes(out[0], pixels.low);
          StoreBytes(out[1], pixels.middle);
          StoreBytes(out[2], pixels.high);
        },
        Units{src, kPixel});
  });
}

constexpr auto TableUnpackRgb = ForLong<&RowOps::unpackRgb, UnpackRgb>::Run;
constexpr auto TablePackRgb = ForLong<&RowOps::packRgb, PackRgb>::Run;

template <int kIn, int kOut, bool kExchange>
void RepackRun(uint8_t* dst, const uint8_t* src, uint8_t keptAlpha, int n) {
  const Bytes kept = SetBytes(keptAlpha);
  uint8_t* const dsts[] = {dst};
  ForRun<kOut>(
      dsts, n,
      [=](uint8_t* const* out, const uint8_t* in) {
        const PixelBytes p = LoadPixels<kIn>(in);
        StorePixels<kOut>(out[0], kExchange ? p.high : p.low, p.middle, kExchange ? p.low : p.high,
                          p.alpha & kept);
      },
      Units{src, kIn});
}

void RepackPixels(uint8_t* dst, const uint8_t* src, const PixelFormat& from, const PixelFormat& to,
                  int n) {
  const PixelShape in(from);
  const PixelShape out(to);
  if (in.bytes == 0 || out.bytes == 0) {
    return RepackFields(TableUnpackRgb, TablePackRgb, dst, src, from, to, n);
  }
  WithPixelSize(in, [&](auto inSize) {
    WithPixelSize(out, [&](auto outSize) {
      constexpr int kIn = decltype(inSize)::value;
      constexpr int kOut = decltype(outSize)::value;
      const auto repack =
          in.blueFirst != out.blueFirst ? RepackRun<kIn, kOut, true> : RepackRun<kIn, kOut, false>;
      repack(dst, src, from.alphaByte >= 0 && to.alphaByte >= 0 ? 0xFF : 0, n);
    });
  });
}

void UnpackAlpha(uint8_t* alpha, const uint8_t* src, const PixelFormat& format, int n) {
  if (PixelShape(format).bytes != 4) return scalar::UnpackAlpha(alpha, src, format, n);
  uint8_t* const dsts[] = {alpha};
  ForRun<1>(
      dsts, n, [](uint8_t* const* out, const uint8_t* in) { StoreBytes(out[0], Load4(in).alpha); },
      Units{src, 4});
}

// ---- YUV to RGB
// What one component of chroma adds to the channel that it alone changes, and to green. The word
// for green in the tables is more than this share by greenBase.
struct ChromaShare {
  int32_t gain, offset;
  int32_t greenGain, greenOffset, greenBase;
  int32_t sixBitGain, sixBitOffset, sixBitGreenGain;
};

struct ChromaShares {
  explicit ChromaShares(const YuvToRgbWide& s) {
    // Where value 0 of a channel lies in the clamp table, as part of its offset.
    const auto base = [&](int c) { return s.base[c] << (s.narrowing[c] + 16); };
    const int32_t greenOffset = s.offset[1] - base(1);
    ofU = {s.uToB, s.offset[2] - base(2), s.uToG, 0, 0, 113, -14516, 22};
    ofV = {s.vToR, s.offset[0] - base(0), s.vToG, greenOffset, base(1), 90, -11485, 46};
  }
  ChromaShare ofU, ofV;
};

constexpr int kGreenOffset = 8669;  // in the six-bit form

// Chroma as it is taken from memory: a for the pixel's low channel and b for its high one.
// Half as many samples as pixels, or as many; in planes or in pairs.
enum class ChromaLayout {
  kHalfPlanes,
  kHalfPairsOfAB,
  kHalfPairsOfBA,
  kPlanes,
  kPairsOfAB,
  kPairsOfBA
};

template <YuvToRgbForm kForm>
struct ChromaTerms {
  // For the low, middle and high channel; then what carries into the low and the high one.
  static constexpr int kCount = kForm == YuvToRgbForm::kTable ? 5 : 3;
  Words term[kCount];
};

// The table form is the wide one too, because its sums of 16 bits saturate. Under any adjustment
// luma adds from 0 to less than 1024 levels, so what was clamped to the +-2048 of a word is beyond
// the same end of a channel's range as before. Each share of green fits a word.
template <YuvToRgbForm kForm>
class ColourStage {
 public:
  ColourStage(const YuvToRgbWide& s, const ChromaShare& a, const ChromaShare& b)
      : a_(a.gain, a.offset),
        b_(b.gain, b.offset),
        greenA_(a.greenGain, a.greenOffset),
        greenB_(b.greenGain, b.greenOffset),
        carryA_(PrepareCarry(SetWords(a.greenBase >> 12))),
        carryB_(PrepareCarry(SetWords(b.greenBase >> 12))),
        lumaWhole_(s.yGain >> 12),
        lumaPart_(s.yGain << 4 & 0xFFFF),
        sixA_(a.sixBitGain),
        sixB_(b.sixBitGain),
        sixGreenA_(a.sixBitGreenGain),
        sixGreenB_(b.sixBitGreenGain),
        sixOffsetA_(SetWords(a.sixBitOffset)),
        sixOffsetB_(SetWords(b.sixBitOffset)) {}

  // Wrapping sums have their lower bits right, whatever the adjustments.
  template <bool kWraps = false>
  KESTREL_INLINE ChromaTerms<kForm> Terms(Words a, Words b) const {
    if constexpr (kForm == YuvToRgbForm::kSixBits) {
      const Words green =
          MultiplySubtract(MultiplySubtract(SetWords(kGreenOffset), a, sixGreenA_), b, sixGreenB_);
      return {{ShiftRight<6>(MultiplyAdd(sixOffsetA_, a, sixA_)), ShiftRight<6>(green),
               ShiftRight<6>(MultiplyAdd(sixOffsetB_, b, sixB_))}};
    } else {
      const ChromaFactor factorA(a);
      const ChromaFactor factorB(b);
      const Words greenA = greenA_.Sixteenths(factorA);
      const Words greenB = greenB_.Sixteenths(factorB);
      const Words green = kWraps ? greenA + greenB : AddSaturated(greenA, greenB);
      if constexpr (kForm == YuvToRgbForm::kWholeLuma) {
        return {{a_.Whole(factorA), ShiftRight<4>(green), b_.Whole(factorB)}};
      } else {
        // What green takes of a component is the low half of that component's word in the tables.
        // (Prepared sums are differences.)
        return {{kWraps ? a_.Sixteenths(factorA) : a_.Clamped(factorA), green,
                 kWraps ? b_.Sixteenths(factorB) : b_.Clamped(factorB), carryA_ - greenA,
                 carryB_ - greenB}};
      }
    }
  }

  struct Channels {
    Words low, middle, high;
  };
  // With four fractional bits in the table form.
  template <bool kWraps = false>
  KESTREL_INLINE Channels Add(Words y, const Words* t) const {
    if constexpr (kForm == YuvToRgbForm::kTable) {
      const Product part = Multiply(y, lumaPart_);
      const Words luma = MultiplyAdd(part.high, y, lumaWhole_);
      const auto add = [](Words a, Words b) { return kWraps ? a + b : AddSaturated(a, b); };
      return {add(luma - CarryOf(part.low, t[3]), t[0]), add(luma, t[1]),
              add(luma - CarryOf(part.low, t[4]), t[2])};
    } else {
      return {y + t[0], y + t[1], y + t[2]};
    }
  }
  static Bytes Clamp(Words low, Words high) {
    return kForm == YuvToRgbForm::kTable ? NarrowShifted<4>(low, high) : Narrow(low, high);
  }

 private:
  ChromaWord a_, b_, greenA_, greenB_;
  Words carryA_, carryB_;
  Factor lumaWhole_, lumaPart_;
  Factor sixA_, sixB_, sixGreenA_, sixGreenB_;
  Words sixOffsetA_, sixOffsetB_;
};

// The six-bit form where each pixel has its own chroma: products are added to luma at once.
class SixBitStage {
 public:
  SixBitStage(const ChromaShare& a, const ChromaShare& b)
      : a_(a.sixBitGain),
        b_(b.sixBitGain),
        greenA_(a.sixBitGreenGain),
        greenB_(b.sixBitGreenGain),
        offsetA_(SetWords(a.sixBitOffset)),
        offsetB_(SetWords(b.sixBitOffset)),
        greenOffset_(SetWords(kGreenOffset)) {}

  struct Channels {
    Bytes low, middle, high;
  };
  Channels Convert(Bytes y, const Multiplicands& a, const Multiplicands& b) const {
    const WordsPair wide = Widen(y);
    const WordsPair luma = {ShiftLeft<6>(wide.low), ShiftLeft<6>(wide.high)};
    const auto plus = [&](Words offset) {
      return WordsPair{Fixed(luma.low + offset), Fixed(luma.high + offset)};
    };
    const auto fixed = [](WordsPair sum) { return WordsPair{Fixed(sum.low), Fixed(sum.high)}; };
    const auto narrow = [](WordsPair sum) { return NarrowShifted<6>(sum.low, sum.high); };
    const WordsPair green = fixed(MultiplySubtract(plus(greenOffset_), a, greenA_));
    return {narrow(MultiplyAdd(plus(offsetA_), a, a_)), narrow(MultiplySubtract(green, b, greenB_)),
            narrow(MultiplyAdd(plus(offsetB_), b, b_))};
  }

 private:
  ByteFactor a_, b_, greenA_, greenB_;
  Words offsetA_, offsetB_, greenOffset_;
};

// Rows of pixels with their chroma, 1 << rowShift of them to a row of it.
struct PixelLines {
  uint8_t* dst;
  ptrdiff_t dstPitch;
  const uint8_t* y;
  ptrdiff_t yPitch;
  const uint8_t* a;  // pairs: where they begin
  const uint8_t* b;
  ptrdiff_t aPitch, bPitch;
  int rows, rowShift;
};

constexpr bool IsHalf(ChromaLayout layout) {
  return layout < ChromaLayout::kPlanes;
}
constexpr bool IsPairs(ChromaLayout layout) {
  return layout != ChromaLayout::kPlanes && layout != ChromaLayout::kHalfPlanes;
}
constexpr bool IsBFirst(ChromaLayout layout) {
  return layout == ChromaLayout::kPairsOfBA || layout == ChromaLayout::kHalfPairsOfBA;
}
// Bytes of each plane for some pixels, of the pairs if there are such.
constexpr int ChromaBytes(ChromaLayout layout, int pixels) {
  const int samples = IsHalf(layout) ? pixels / 2 : pixels;
  return IsPairs(layout) ? 2 * samples : samples;
}

// Samples as the pixels of kPixel bytes are stored.
template <int kPixel, typename Samples>
inline Samples Ordered(Samples samples) {
  return kPixel == 4 ? InTurn(samples) : samples;
}

// The terms of words of pairs.
template <YuvToRgbForm kForm, ChromaLayout kLayout>
inline ChromaTerms<kForm> TermsOfPairs(const ColourStage<kForm>& stage, Words pairs) {
  const Words first = pairs & SetWords(0xFF);
  const Words second = ShiftRightUnsigned<8>(pairs);
  return IsBFirst(kLayout) ? stage.Terms(second, first) : stage.Terms(first, second);
}

template <YuvToRgbForm kForm, ChromaLayout kLayout, int kPixel>
KESTREL_INLINE void LoadTerms(const ColourStage<kForm>& stage, const uint8_t* a, const uint8_t* b,
                              ChromaTerms<kForm>* low, ChromaTerms<kForm>* high) {
  if constexpr (kLayout == ChromaLayout::kPlanes) {
    const WordsPair wideA = Widen(Ordered<kPixel>(LoadBytes(a)));
    const WordsPair wideB = Widen(Ordered<kPixel>(LoadBytes(b)));
    *low = stage.Terms(wideA.low, wideB.low);
    *high = stage.Terms(wideA.high, wideB.high);
    return;
  } else if constexpr (!IsHalf(kLayout)) {
    const WordsPair pairs = kPixel == 4 ? LoadPixelWordsInTurn(a) : LoadPixelWords(a);
    *low = TermsOfPairs<kForm, kLayout>(stage, pairs.low);
    *high = TermsOfPairs<kForm, kLayout>(stage, pairs.high);
    return;
  }
  ChromaTerms<kForm> terms;
  if constexpr (IsPairs(kLayout)) {
    terms = TermsOfPairs<kForm, kLayout>(stage, Ordered<kPixel>(LoadWords(a)));
  } else {
    terms = stage.Terms(Ordered<kPixel>(LoadHalf(a)), Ordered<kPixel>(LoadHalf(b)));
  }
#pragma GCC unroll 5  // or the terms would go through memory
  for (int k = 0; k < ChromaTerms<kForm>::kCount; ++k) {
    const WordsPair twice = Double(terms.term[k]);
    low->term[k] = twice.low;
    high->term[k] = twice.high;
  }
}

// Pixels from samples that were Ordered.
template <int kPixel>
KESTREL_INLINE void StoreOrdered(uint8_t* dst, Bytes low, Bytes middle, Bytes high, Bytes alpha) {
  if constexpr (kPixel == 4) {
    Store4InTurn(dst, low, middle, high, alpha);
  } else {
    StorePixels<kPixel>(dst, low, middle, high, alpha);
  }
}

template <YuvToRgbForm kForm, int kPixel>
KESTREL_INLINE void ConvertLine(const ColourStage<kForm>& stage, uint8_t* dst, const uint8_t* y,
                                const ChromaTerms<kForm>& low, const ChromaTerms<kForm>& high,
                                Bytes alpha) {
  const WordsPair luma = Widen(Ordered<kPixel>(LoadBytes(y)));
  const auto first = stage.Add(luma.low, low.term);
  const auto second = stage.Add(luma.high, high.term);
  StoreOrdered<kPixel>(dst, stage.Clamp(first.low, second.low),
                       stage.Clamp(first.middle, second.middle),
                       stage.Clamp(first.high, second.high), alpha);
}

// Where each pixel has its own chroma. Terms are not kept for the next row: registers cannot hold
// those of a whole vector of pixels.
template <ChromaLayout kLayout, int kPixel, YuvToRgbForm kForm>
KESTREL_INLINE void ConvertLine(const ColourStage<kForm>& stage, uint8_t* dst, const uint8_t* y,
                                const uint8_t* a, const uint8_t* b, Bytes alpha) {
  ChromaTerms<kForm> low, high;
  LoadTerms<kForm, kLayout, kPixel>(stage, a, b, &low, &high);
  ConvertLine<kForm, kPixel>(stage, dst, y, low, high, alpha);
}

template <ChromaLayout kLayout, int kPixel>
KESTREL_INLINE void ConvertLine(const SixBitStage& stage, uint8_t* dst, const uint8_t* y,
                                const uint8_t* a, const uint8_t* b, Bytes alpha) {
  MultiplicandsPair chroma;
  if constexpr (!IsPairs(kLayout)) {
    chroma = {ToMultiplicands(Ordered<kPixel>(LoadBytes(a))),
              ToMultiplicands(Ordered<kPixel>(LoadBytes(b)))};
  } else {
    chroma = LoadMultiplicands<kPixel == 4>(a);
    if constexpr (IsBFirst(kLayout)) chroma = {chroma.second, chroma.first};
  }
  const auto channels = stage.Convert(Ordered<kPixel>(LoadBytes(y)), chroma.first, chroma.second);
  StoreOrdered<kPixel>(dst, channels.low, channels.middle, channels.high, alpha);
}

// Asks for the cache lines of some rows of a block that is narrower than the picture it lies in.
// Nothing else would: they are stored to once, far from those before.
inline void PrefetchRows(const uint8_t* dst, ptrdiff_t pitch, int rows, int bytes) {
  for (int row = 0; row < rows; ++row) {
    for (int i = 0; i < bytes; i += 64) __builtin_prefetch(dst + row * pitch + i, 1);
  }
}

template <YuvToRgbForm kForm, bool kChromaIsShared>
struct StageFor {
  using Stage = ColourStage<kForm>;
};
template <>
struct StageFor<YuvToRgbForm::kSixBits, false> {
  using Stage = SixBitStage;
};

// n pixels of each row, whole vectors of them. Rows can be as short as a vector: what is done for
// each is as little as possible.
template <YuvToRgbForm kForm, ChromaLayout kLayout, int kPixel>
void ConvertVectors(const void* colourStage, const PixelLines& lines, uint8_t alphaByte, int n) {
  constexpr int kChroma = ChromaBytes(kLayout, kBytes);
  using Stage = typename StageFor<kForm, IsHalf(kLayout)>::Stage;
  const Stage stage = *static_cast<const Stage*>(colourStage);
  const Bytes alpha = SetBytes(alphaByte);
  const ptrdiff_t dstPitch = lines.dstPitch;
  const ptrdiff_t yPitch = lines.yPitch;
  const bool isNarrow = 2 * n * kPixel < (dstPitch < 0 ? -dstPitch : dstPitch);
  const int share = IsHalf(kLayout) ? 1 << lines.rowShift : 1;
  const int last = (1 << lines.rowShift) - 1;  // of rows that share chroma
  uint8_t* dstRow = lines.dst;
  const uint8_t* yRow = lines.y;
  const uint8_t* aRow = lines.a;
  const uint8_t* bRow = lines.b;
  for (int row = 0; row < lines.rows; row += share) {
    if (isNarrow && row + 2 * share <= lines.rows) {
      PrefetchRows(dstRow + share * dstPitch, dstPitch, share, n * kPixel);
    }
    uint8_t* dst = dstRow;
    const uint8_t* y = yRow;
    const uint8_t* a = aRow;
    const uint8_t* b = bRow;
    [[maybe_unused]] const bool two = share == 2 && row + 1 < lines.rows;
    for (int i = 0; i < n; i += kBytes) {
      if constexpr (!IsHalf(kLayout)) {
        ConvertLine<kLayout, kPixel>(stage, dst, y, a, b, alpha);
      } else {
        ChromaTerms<kForm> low, high;
        LoadTerms<kForm, kLayout, kPixel>(stage, a, b, &low, &high);
        ConvertLine<kForm, kPixel>(stage, dst, y, low, high, alpha);
        if (two) {
          ConvertLine<kForm, kPixel>(stage, dst + dstPitch, y + yPitch, low, high, alpha);
        }
      }
      dst += kBytes * kPixel;
      y += kBytes;
      a += kChroma;
      b += kChroma;
    }
    dstRow += share * dstPitch;
    yRow += share * yPitch;
    if (IsHalf(kLayout) || (row & last) == last) {
      aRow += lines.aPitch;
      bRow += lines.bPitch;
    }
  }
}

// A conversion with everything decided.
struct PixelConversion {
  void (*vectors)(const void* stage, const PixelLines& lines, uint8_t alpha, int n);
  const void* stage;
  ChromaLayout layout;
  int pixel;  // bytes
  uint8_t alpha;

  // The second vector begins where stores are aligned, and the last one reaches back: n is even
  // where two pixels share chroma.
  void Convert(const PixelLines& lines, int n) const {
    if (kIsNarrowest && n < kBytes) return ConvertCopies(lines, n);
    int lead = pixel == 4   ? UnitsToBoundary<4>(lines.dst, n)
               : pixel == 3 ? UnitsToBoundary<3>(lines.dst, n)
                            : UnitsToBoundary<2>(lines.dst, n);
    if (IsHalf(layout) && lead % 2 != 0) lead = 0;
    if (lead != 0) vectors(stage, lines, alpha, kBytes);
    const PixelLines rest = At(lines, lead);
    const int whole = (n - lead) / kBytes * kBytes;
    vectors(stage, rest, alpha, whole);
    if (lead + whole < n) vectors(stage, At(lines, n - kBytes), alpha, kBytes);
  }

 private:
  PixelLines At(const PixelLines& lines, int i) const {
    const int sample = ChromaBytes(layout, i);
    PixelLines at = lines;
    at.dst += ptrdiff_t{i} * pixel;
    at.y += i;
    at.a += sample;
    at.b += sample;
    return at;
  }

  // Up to 64 bytes; a library's copy would take longer to decide how.
  static void CopyFew(uint8_t* to, const uint8_t* from, int n) {
    if (n >= 32) {
      CopyEnds<32>(to, from, n);
    } else if (n >= 16) {
      CopyEnds<16>(to, from, n);
    } else if (n >= 8) {
      CopyEnds<8>(to, from, n);
    } else if (n >= 4) {
      CopyEnds<4>(to, from, n);
    } else {
      for (int i = 0; i < n; ++i) to[i] = from[i];
    }
  }
  template <int kSize>
  static void CopyEnds(uint8_t* to, const uint8_t* from, int n) {
    uint8_t first[kSize], last[kSize];
    memcpy(first, from, kSize);
    memcpy(last, from + n - kSize, kSize);
    memcpy(to, first, kSize);
    memcpy(to + n - kSize, last, kSize);
  }

  // Fewer pixels of each row than a vector has, some rows at once.
  void ConvertCopies(const PixelLines& lines, int n) const {
    constexpr int kRows = 16;
    uint8_t y[kRows][kBytes], a[kRows][2 * kBytes], b[kRows][kBytes];
    uint8_t pixels[kRows][4 * kBytes];
    const int chroma = ChromaBytes(layout, IsHalf(layout) ? n + 1 : n);
    for (int top = 0; top < lines.rows; top += kRows) {
      const int rows = lines.rows - top < kRows ? lines.rows - top : kRows;
      for (int row = 0; row < rows; ++row) {
        memset(y[row], 0, sizeof(y[row]));
        CopyFew(y[row], lines.y + (top + row) * lines.yPitch, n);
      }
      const int first = top >> lines.rowShift;
      for (int row = 0; row << lines.rowShift < rows; ++row) {
        memset(a[row], 0, sizeof(a[row]));
        CopyFew(a[row], lines.a + (first + row) * lines.aPitch, chroma);
        if (IsPairs(layout)) continue;
        memset(b[row], 0, sizeof(b[row]));
        CopyFew(b[row], lines.b + (first + row) * lines.bPitch, chroma);
      }
      vectors(stage,
              {pixels[0], 4 * kBytes, y[0], kBytes, a[0], b[0], 2 * kBytes, kBytes, rows,
               lines.rowShift},
              alpha, kBytes);
      for (int row = 0; row < rows; ++row) {
        CopyFew(lines.dst + (top + row) * lines.dstPitch, pixels[row], n * pixel);
      }
    }
  }
};

template <YuvToRgbForm kForm, int kPixel>
constexpr decltype(PixelConversion::vectors) kConverters[] = {
    ConvertVectors<kForm, ChromaLayout::kHalfPlanes, kPixel>,
    ConvertVectors<kForm, ChromaLayout::kHalfPairsOfAB, kPixel>,
    ConvertVectors<kForm, ChromaLayout::kHalfPairsOfBA, kPixel>,
    ConvertVectors<kForm, ChromaLayout::kPlanes, kPixel>,
    ConvertVectors<kForm, ChromaLayout::kPairsOfAB, kPixel>,
    ConvertVectors<kForm, ChromaLayout::kPairsOfBA, kPixel>,
};

// (A function by itself: what three forms prepare would take thrice the stack.)
template <YuvToRgbForm kForm>
__attribute__((noinline)) void ConvertYuv(const PixelRows& rows, const ChromaRows& chroma,
                                          const YuvToRgbWide& s, const PixelShape& shape,
                                          uint8_t alpha, int n) {
  const ChromaShares shares(s);
  const bool aIsU = shape.blueFirst;
  const ChromaShare& ofA = aIsU ? shares.ofU : shares.ofV;
  const ChromaShare& ofB = aIsU ? shares.ofV : shares.ofU;
  const ColourStage<kForm> stage(s, ofA, ofB);
  const SixBitStage sixBitStage(ofA, ofB);
  const uint8_t* a = aIsU ? chroma.u : chroma.v;
  const uint8_t* b = aIsU ? chroma.v : chroma.u;
  const ptrdiff_t aPitch = aIsU ? chroma.uPitch : chroma.vPitch;
  const ptrdiff_t bPitch = aIsU ? chroma.vPitch : chroma.uPitch;
  const ChromaLayout planes = chroma.shift != 0 ? ChromaLayout::kHalfPlanes : ChromaLayout::kPlanes;
  const int order = chroma.step == 1 ? 0 : a < b ? 1 : 2;
  const ChromaLayout layout = ChromaLayout(int(planes) + order);
  if (IsBFirst(layout)) a = b;  // where the pairs begin
  const auto& converters = shape.bytes == 4   ? kConverters<kForm, 4>
                           : shape.bytes == 3 ? kConverters<kForm, 3>
                                              : kConverters<kForm, 2>;
  const bool fused = kForm == YuvToRgbForm::kSixBits && !IsHalf(layout);
  const void* const chosen = fused ? static_cast<const void*>(&sixBitStage) : &stage;
  const PixelConversion conversion = {converters[int(layout)], chosen, layout, shape.bytes, alpha};
  conversion.Convert({rows.dst, rows.dstPitch, rows.y, rows.yPitch, a, b, aPitch, bPitch, rows.rows,
                      chroma.rowShift},
                     n);
}

void YuvToPixels(const PixelRows& rows, const ChromaRows& chroma, const YuvToRgb& colour,
                 const PixelFormat& format, AlphaFill alpha, int n);
// Copies cost less than single pixels.
constexpr int kLeastPixels = kIsNarrowest ? 0 : kBytes;
constexpr auto TableYuvToPixels = ForLong<&RowOps::yuvToPixels, YuvToPixels, kLeastPixels>::Run;

// Pixels of another layout, by way of pixels of four bytes and their channels: levels of 8 bits are
// narrowed as sums are, if the latter are no wider than they should be.
void YuvToFields(const PixelRows& rows, const ChromaRows& chroma, const YuvToRgb& colour,
                 const PixelFormat& format, AlphaFill alpha, int n) {
  constexpr int kPiece = 256;
  constexpr PixelFormat kQuad = {4, {8, 8, 8}, {16, 8, 0}, 3, true};
  const FieldShifts shifts = ShiftsTo(format);
  bool isKnown = true;
  for (int c = 0; c < 3; ++c) {
    const bool narrows = format.bytes == 2 && colour.form != YuvToRgbForm::kSixBits;
    const int32_t narrowing = narrows ? int32_t(colour.wide.narrowing[c]) : shifts.right[c];
    if (shifts.right[c] < 0 || narrowing != shifts.right[c]) isKnown = false;
  }
  if (!isKnown) return scalar::YuvToPixels(rows, chroma, colour, format, alpha, n);
  uint8_t quads[4 * kPiece], channels[3][kPiece];
  uint8_t* const rgb[3] = {channels[0], channels[1], channels[2]};
  for (int row = 0; row < rows.rows; ++row) {
    const int chromaRow = row >> chroma.rowShift;
    for (int x = 0; x < n; x += kPiece) {
      const int count = n - x < kPiece ? n - x : kPiece;
      const ptrdiff_t sample = ptrdiff_t{x >> chroma.shift} * chroma.step;
      ChromaRows part = chroma;
      part.u += chromaRow * chroma.uPitch + sample;
      part.v += chromaRow * chroma.vPitch + sample;
      TableYuvToPixels({quads, 0, rows.y + row * rows.yPitch + x, 0, 1}, part, colour, kQuad,
                       {~0u, 0}, count);
      TableUnpackRgb(rgb, quads, kQuad, count);
      TablePackRgb(rows.dst + row * rows.dstPitch + ptrdiff_t{x} * format.bytes, rgb, format,
                   shifts, alpha, count);
    }
  }
}

void YuvToPixels(const PixelRows& rows, const ChromaRows& chroma, const YuvToRgb& colour,
                 const PixelFormat& format, AlphaFill alpha, int n) {
  const PixelShape shape(format);
  const uint8_t fill = AlphaOf(alpha);
  if (shape.bytes == 0) return YuvToFields(rows, chroma, colour, format, alpha, n);
  if (n > kBytes && chroma.shift != 0 && n % 2 != 0) {
    // A vector that reached back to a pixel in the middle would tear those that share chroma.
    --n;
    const ptrdiff_t sample = ptrdiff_t{n / 2} * chroma.step;
    ChromaRows ofLast = chroma;
    ofLast.u += sample;
    ofLast.v += sample;
    TableYuvToPixels(
        {rows.dst + ptrdiff_t{n} * shape.bytes, rows.dstPitch, rows.y + n, rows.yPitch, rows.rows},
        ofLast, colour, format, alpha, 1);
  }
  switch (colour.form) {
    case YuvToRgbForm::kWholeLuma:
      return ConvertYuv<YuvToRgbForm::kWholeLuma>(rows, chroma, colour.wide, shape, fill, n);
    case YuvToRgbForm::kSixBits:
      return ConvertYuv<YuvToRgbForm::kSixBits>(rows, chroma, colour.wide, shape, fill, n);
    default:
      return ConvertYuv<YuvToRgbForm::kTable>(rows, chroma, colour.wide, shape, fill, n);
  }
}

// Sums of kBytes pixels, for each channel: with four fractional bits, saturating or wrapping.
template <bool kWraps>
KESTREL_INLINE void AddUp(const ColourStage<YuvToRgbForm::kTable>& stage, const uint8_t* y,
                          const uint8_t* u, const uint8_t* v, WordsPair (&sums)[3]) {
  const WordsPair luma = Widen(LoadBytes(y));
  const WordsPair wideU = Widen(LoadBytes(u));
  const WordsPair wideV = Widen(LoadBytes(v));
  const auto low = stage.Add<kWraps>(luma.low, stage.Terms<kWraps>(wideV.low, wideU.low).term);
  const auto high = stage.Add<kWraps>(luma.high, stage.Terms<kWraps>(wideV.high, wideU.high).term);
  sums[0] = {low.low, high.low};
  sums[1] = {low.middle, high.middle};
  sums[2] = {low.high, high.high};
}

inline ColourStage<YuvToRgbForm::kTable> RedFirstStage(const YuvToRgbWide& sums) {
  const ChromaShares shares(sums);
  return {sums, shares.ofV, shares.ofU};
}

void YuvToRgbByWideSums(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                        const YuvToRgbWide& s, int n) {
  const auto stage = RedFirstStage(s);
  uint8_t* const dsts[] = {rgb[0], rgb[1], rgb[2]};
  ForRun<1>(
      dsts, n,
      [&](uint8_t* const* out, const uint8_t* inY, const uint8_t* inU, const uint8_t* inV) {
        WordsPair sums[3];
        AddUp<false>(stage, inY, inU, inV, sums);
#pragma GCC unroll 3  // or the sums would go through memory
        for (int c = 0; c < 3; ++c) {
          const Bytes levels = stage.Clamp(sums[c].low, sums[c].high);
          StoreBytes(out[c], ShiftRightUnsigned(levels, s.narrowing[c]));
        }
      },
      Units{y, 1}, Units{u, 1}, Units{v, 1});
}

// Remainders of one channel. Each is the lowest bits of the sum of a level and the remainder before
// it, so it is those of the sum of all levels so far: what looks serial is a running sum.
class Remainders {
 public:
  Remainders(const Carry& carry, int c)
      : next_(SetBytes(carry.remainder[c])), mask_(SetBytes(carry.mask[c])) {}
  // Before each of the next kBytes pixels, of whose levels the lowest 8 bits are given.
  Bytes Before(Bytes levels) {
    const Bytes sums = RunningSums(levels) + next_;
    next_ = LastByte(sums);
    return (sums - levels) & mask_;
  }
  int32_t next() const {
    uint8_t bytes[kBytes];
    StoreBytes(bytes, next_ & mask_);
    return bytes[0];
  }

 private:
  Bytes next_, mask_;
};

void YuvToRgbCarry(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                   const YuvToRgbWide& s, Carry* carry, int n) {
  const auto stage = RedFirstStage(s);
  Remainders remainders[3] = {{*carry, 0}, {*carry, 1}, {*carry, 2}};
  int i = 0;
  for (; i + kBytes <= n; i += kBytes) {
    // Sums that wrap have the bits that remain, sums that saturate those that are seen.
    WordsPair wrapping[3], sums[3];
    AddUp<true>(stage, y + i, u + i, v + i, wrapping);
    AddUp<false>(stage, y + i, u + i, v + i, sums);
#pragma GCC unroll 3
    for (int c = 0; c < 3; ++c) {
      const Words mask = SetWords(0xFF);
      const Bytes levels = Narrow(ShiftRightUnsigned<4>(wrapping[c].low) & mask,
                                  ShiftRightUnsigned<4>(wrapping[c].high) & mask);
      const WordsPair before = Widen(remainders[c].Before(levels));
      const Bytes carried = Narrow(ShiftRight<4>(sums[c].low) + before.low,
                                   ShiftRight<4>(sums[c].high) + before.high);
      StoreBytes(rgb[c] + i, ShiftRightUnsigned(carried, s.narrowing[c]));
    }
  }
  for (int c = 0; c < 3; ++c) carry->remainder[c] = remainders[c].next();
  uint8_t* const rest[3] = {rgb[0] + i, rgb[1] + i, rgb[2] + i};
  kNarrower.yuvToRgbCarry(rest, y + i, u + i, v + i, s, carry, n - i);
}

void NarrowWithCarry(uint8_t* const dst[3], const uint8_t* const src[3], const FieldShifts& shifts,
                     Carry* carry, int n) {
  const int whole = n & -kBytes;
  for (int c = 0; c < 3; ++c) {
    Remainders remainders(*carry, c);
    for (int i = 0; i < whole; i += kBytes) {
      const Bytes levels = LoadBytes(src[c] + i);
      const Bytes carried = AddSaturated(levels, remainders.Before(levels));
      StoreBytes(dst[c] + i, ShiftRightUnsigned(carried, uint32_t(shifts.right[c])));
    }
    carry->remainder[c] = remainders.next();
  }
  uint8_t* const restOfDst[3] = {dst[0] + whole, dst[1] + whole, dst[2] + whole};
  const uint8_t* const restOfSrc[3] = {src[0] + whole, src[1] + whole, src[2] + whole};
  kNarrower.narrowWithCarry(restOfDst, restOfSrc, shifts, carry, n - whole);
}

// ---- RGB to YUV, levels
// The operands of sums for kBytes pixels, or for the second ones of as many pairs.
template <int kPixel, bool kSeconds>
KESTREL_INLINE auto LoadOperands(const uint8_t* p) {
  if constexpr (kPixel == 4) {
    return LoadQuadOperands<kSeconds>(p);
  } else if constexpr (!kSeconds) {
    return LoadPixels<kPixel>(p);
  } else {
    const PixelBytes a = LoadPixels<kPixel>(p);
    const PixelBytes b = LoadPixels<kPixel>(p + kBytes * kPixel);
    return PixelBytes{Seconds(a.low, b.low), Seconds(a.middle, b.middle), Seconds(a.high, b.high),
                      SetBytes(0)};
  }
}

void RgbToYuv(uint8_t* dst, const uint8_t* const rgb[3], RgbToYuvTables tables, int n) {
  uint8_t* const dsts[] = {dst};
  WithSum(Weights(tables, false), [&](const auto& sum) {
    ForRun<1>(
        dsts, n,
        [&](uint8_t* const* out, const uint8_t* r, const uint8_t* g, const uint8_t* b) {
          StoreBytes(out[0],
                     sum.Of(PixelBytes{LoadBytes(r), LoadBytes(g), LoadBytes(b), SetBytes(0)}));
        },
        Units{rgb[0], 1}, Units{rgb[1], 1}, Units{rgb[2], 1});
  });
}

constexpr auto TableRgbToYuv = ForLong<&RowOps::rgbToYuv, RgbToYuv>::Run;

void PixelsToYuv(uint8_t* dst, const uint8_t* src, const PixelFormat& format, RgbToYuvTables tables,
                 int n) {
  const PixelShape shape(format);
  if (shape.bytes == 0) {
    return ForChannels(TableUnpackRgb, src, format, n,
                       [=](int x, uint8_t* const rgb[3], int count) {
                         TableRgbToYuv(dst + x, rgb, tables, count);
                       });
  }
  uint8_t* const dsts[] = {dst};
  WithSum(Weights(tables, shape.blueFirst), [&](const auto& sum) {
    WithPixelSize(shape, [&](auto size) {
      constexpr int kPixel = decltype(size)::value;
      ForRun<1>(
          dsts, n,
          [&](uint8_t* const* out, const uint8_t* in) {
            StoreBytes(out[0], sum.Of(LoadOperands<kPixel, false>(in)));
          },
          Units{src, kPixel});
    });
  });
}

// Pairs of pixels, whose second ones become two components of chroma.
template <int kPixel>
struct ChromaRun {
  const uint8_t* src;
  int n;

  template <typename A, typename B>
  void WritePlanes(uint8_t* a, uint8_t* b, A sumOfA, B sumOfB) const {
    uint8_t* const dsts[] = {a, b};
    ForRun<1>(
        dsts, n,
        [=](uint8_t* const* out, const uint8_t* in) {
          const auto operands = LoadOperands<kPixel, true>(in);
          StoreBytes(out[0], sumOfA.Of(operands));
          StoreBytes(out[1], sumOfB.Of(operands));
        },
        Units{src, 2 * kPixel});
  }
  template <typename A, typename B>
  void WritePairs(uint8_t* dst, A sumOfA, B sumOfB) const {
    uint8_t* const dsts[] = {dst};
    ForRun<2>(
        dsts, n,
        [=](uint8_t* const* out, const uint8_t* in) {
          const auto operands = LoadOperands<kPixel, true>(in);
          const Bytes a = sumOfA.Of(operands);
          Store2(out[0], a, sumOfB.Of(operands));
        },
        Units{src, 2 * kPixel});
  }
};

void PixelPairsToChroma(uint8_t* u, uint8_t* v, int step, const uint8_t* src,
                        const PixelFormat& format, RgbToYuvTables tables, int n) {
  const PixelShape shape(format);
  const Weights weightsOfU(tables + 3, shape.blueFirst);
  const Weights weightsOfV(tables + 5, shape.blueFirst);
  if (shape.bytes == 0) {
    return ChromaOfFields(TableUnpackRgb, TableRgbToYuv, u, v, step, src, format, tables, n);
  }
  if (!AreOpposite(weightsOfU.signs(), weightsOfV.signs())) {
    return scalar::PixelPairsToChroma(u, v, step, src, format, tables, n);
  }
  // The component whose weights are like those of the pixel's low byte comes first.
  const bool uIsFirst = weightsOfU.signs() == Signs::kFirstPositive;
  const Weights& first = uIsFirst ? weightsOfU : weightsOfV;
  const Weights& last = uIsFirst ? weightsOfV : weightsOfU;
  uint8_t* const ofFirst = uIsFirst ? u : v;
  uint8_t* const ofLast = uIsFirst ? v : u;
  const bool inOrder = ofFirst < ofLast;
  WithSumOf<Signs::kFirstPositive>(first, [&](const auto& sumOfFirst) {
    WithSumOf<Signs::kLastPositive>(last, [&](const auto& sumOfLast) {
      WithPixelSize(shape, [&](auto size) {
        constexpr int kPixel = decltype(size)::value;
        const ChromaRun<kPixel> run = {src, n};
        if (step == 1) {
          run.WritePlanes(ofFirst, ofLast, sumOfFirst, sumOfLast);
        } else if (inOrder) {
          run.WritePairs(ofFirst, sumOfFirst, sumOfLast);
        } else {
          run.WritePairs(ofLast, sumOfLast, sumOfFirst);
        }
      });
    });
  });
}

void MapLevels(uint8_t* dst, const uint8_t* src, const LevelMap& levels, int n) {
  const Factor whole(levels.gain >> 16);
  const Factor part(levels.gain & 0xFFFF);
  const Words offset = SetWords(levels.offset >> 16);
  const Words carry = PrepareCarry(SetWords(levels.offset & 0xFFFF));
  const auto map = [=](Words level) {
    const Product product = Multiply(level, part);
    return MultiplyAdd(product.high + offset, level, whole) - CarryOf(product.low, carry);
  };
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, n,
      [=](uint8_t* const* out, const uint8_t* in) {
        const WordsPair level = Widen(LoadBytes(in));
        StoreBytes(out[0], Narrow(map(level.low), map(level.high)));
      },
      Units{src, 1});
}

// ---- Order of bytes
// Every kStep-th of some bytes, kBytes of them: the first of each group, or the last.
template <int kStep, bool kLast>
inline Bytes LoadEvery(const uint8_t* p) {
  if constexpr (kStep == 2) {
    Bytes first, second;
    Load2(p, &first, &second);
    return kLast ? second : first;
  } else if constexpr (kStep == 3) {
    const PixelBytes group = Load3(p);
    return kLast ? group.high : group.low;
  } else {
    const PixelBytes group = Load4(p);
    return kLast ? group.alpha : group.low;
  }
}

// The last vector reaches back, and has the wanted bytes last, because what is behind the run must
// not be read.
template <int kStep>
void ReadEvery(uint8_t* dst, const uint8_t* src, int n) {
  if (n <= kBytes) return scalar::ReadStrided(dst, src, kStep, n);
  int i = 0;
  for (; i + kBytes < n; i += kBytes) {
    StoreBytes(dst + i, LoadEvery<kStep, false>(src + kStep * i));
  }
  i = n - kBytes;
  StoreBytes(dst + i, LoadEvery<kStep, true>(src + kStep * i - (kStep - 1)));
}

void ReadStrided(uint8_t* dst, const uint8_t* src, ptrdiff_t step, int n) {
  switch (step) {
    case 2:
      return ReadEvery<2>(dst, src, n);
    case 3:
      return ReadEvery<3>(dst, src, n);
    case 4:
      return ReadEvery<4>(dst, src, n);
    default:
      return scalar::ReadStrided(dst, src, step, n);
  }
}

void Interleave(uint8_t* dst, const uint8_t* a, const uint8_t* b, int n) {
  uint8_t* const dsts[] = {dst};
  ForRun<2>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* inA, const uint8_t* inB) {
        Store2(out[0], LoadBytes(inA), LoadBytes(inB));
      },
      Units{a, 1}, Units{b, 1});
}

void Deinterleave(uint8_t* a, uint8_t* b, const uint8_t* src, int n) {
  uint8_t* const dsts[] = {a, b};
  ForRun<1>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* in) {
        Bytes first, second;
        Load2(in, &first, &second);
        StoreBytes(out[0], first);
        StoreBytes(out[1], second);
      },
      Units{src, 2});
}

void SwapPairs(uint8_t* dst, const uint8_t* src, int n) {
  uint8_t* const dsts[] = {dst};
  ForRun<1, 2>(
      dsts, 2 * n,
      [](uint8_t* const* out, const uint8_t* in) {
        StoreBytes(out[0], SwapNeighbours(LoadBytes(in)));
      },
      Units{src, 1});
}

template <bool kLumaFirst>
void SplitGroupsInOrder(uint8_t* luma, uint8_t* const chroma[2], const uint8_t* groups, int n) {
  uint8_t* const first = chroma[0];
  uint8_t* const second = chroma[1];
  const auto split = [=](int i) {
    const PixelBytes p = Load4(groups + ptrdiff_t{4} * i);
    Store2(luma + ptrdiff_t{2} * i, kLumaFirst ? p.low : p.middle, kLumaFirst ? p.high : p.alpha);
    StoreBytes(first + i, kLumaFirst ? p.middle : p.low);
    StoreBytes(second + i, kLumaFirst ? p.alpha : p.high);
  };
  int i = UnitsToBoundary<2>(luma, n);
  if (i != 0) split(0);
  for (; i + kBytes <= n; i += kBytes) split(i);
  if (i < n) split(n - kBytes);
}
void SplitGroups(uint8_t* luma, uint8_t* const chroma[2], const uint8_t* groups, bool lumaFirst,
                 int n) {
  if (lumaFirst) {
    SplitGroupsInOrder<true>(luma, chroma, groups, n);
  } else {
    SplitGroupsInOrder<false>(luma, chroma, groups, n);
  }
}

// n >= kBytes units downwards from the one at dst.
template <int kUnit>
void WriteReversed(uint8_t* dst, const uint8_t* src, int n) {
  constexpr int kUnits = kUnit == 3 ? kBytes : kBytes / kUnit;
  const auto write = [=](int i) {
    uint8_t* const to = dst - ptrdiff_t{i + kUnits - 1} * kUnit;
    const uint8_t* const from = src + ptrdiff_t{i} * kUnit;
    if constexpr (kUnit == 3) {
      const PixelBytes p = Load3(from);
      Store3(to, Reversed(p.low), Reversed(p.middle), Reversed(p.high));
    } else {
      StoreReversed<kUnit>(to, from);
    }
  };
  int i = UnitsToBoundary<kUnit>(dst + kUnit, n, true);
  if (i != 0) write(0);
  for (; i + kUnits <= n; i += kUnits) write(i);
  if (i < n) write(n - kUnits);
}

void WritePixels(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int bytes, int n) {
  if (step == bytes) {
    memcpy(dst, src, size_t(n) * size_t(bytes));
    return;
  }
#ifdef __AVX512VBMI__
  if (bytes == 3 && step == 4) return WriteThreesInFours(dst, src, n);
#endif
  if (step != -bytes) return scalar::WritePixels(dst, step, src, bytes, n);
  if (n < kBytes) {
    return kIsNarrowest ? scalar::WritePixels(dst, step, src, bytes, n)
                        : kNarrower.writePixels(dst, step, src, bytes, n);
  }
  if (bytes == 1) {
    WriteReversed<1>(dst, src, n);
  } else if (bytes == 2) {
    WriteReversed<2>(dst, src, n);
  } else if (bytes == 3) {
    WriteReversed<3>(dst, src, n);
  } else {
    WriteReversed<4>(dst, src, n);
  }
}

void WriteStrided(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int n) {
  if (step == -1) return WritePixels(dst, step, src, 1, n);
  scalar::WriteStrided(dst, step, src, n);
}

constexpr RowOps VectorRows(const char* name) noexcept {
  return {name,
          ReadStrided,
          scalar::Gather,
          GatherPixels,
          PlanPairs,
          ReadPairs,
          BlendPairs,
          ForLong<&RowOps::blendColumns, BlendColumns>::Run,
          ForLong<&RowOps::blendRows, BlendRows>::Run,
          ForLong<&RowOps::blendPixelRows, BlendPixelRows, kQuads>::Run,
          TableUnpackRgb,
          ForLong<&RowOps::unpackAlpha, UnpackAlpha>::Run,
          GatherPaletteEntries,
          ForLong<&RowOps::yuvToRgbWide, YuvToRgbByWideSums>::Run,
          YuvToRgbCarry,
          TableYuvToPixels,
          TableRgbToYuv,
          ForLong<&RowOps::pixelsToYuv, PixelsToYuv>::Run,
          ForLong<&RowOps::pixelPairsToChroma, PixelPairsToChroma>::Run,
          ForLong<&RowOps::mapLevels, MapLevels>::Run,
          NarrowWithCarry,
          TablePackRgb,
          ForLong<&RowOps::repackPixels, RepackPixels>::Run,
          scalar::PutAlpha,
          ForLong<&RowOps::interleave, Interleave>::Run,
          ForLong<&RowOps::deinterleave, Deinterleave>::Run,
          ForLong<&RowOps::swapPairs, SwapPairs, kBytes / 2>::Run,
          ForLong<&RowOps::splitGroups, SplitGroups>::Run,
          Transpose,
          WriteStrided,
          WritePixels};
}

}  // namespace
}  // namespace kestrel

#endif
