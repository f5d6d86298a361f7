// Every row operation of every table against its description, written out plainly: many lengths,
// all alignments, noise, extremes and ramps, nothing touched beyond the runs it is given.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <ostream>

#include "tests/exact/exact_support.h"
#include "tests/reference/colour.h"
#include "tests/rows/row_tables.h"
#include "tests/rows/trial.h"

namespace rows_tests {
namespace {

using kestrel::AlphaFill;
using kestrel::Carry;
using kestrel::ChromaRows;
using kestrel::FieldShifts;
using kestrel::PairPlan;
using kestrel::PixelFormat;
using kestrel::PixelRows;
using kestrel::RowOps;
using kestrel::YuvToRgbForm;
using testing_support::GuardedBuffer;

// Every length as far as two of the widest vectors and a rest, then some of several vectors.
constexpr int kLongestOfAll = 130;
constexpr int kLongest = 260;
constexpr int kLongestPlan = 2048;
constexpr int NextLength(int n) {
  return n < kLongestOfAll ? n + 1 : n + 13;
}
static_assert((kLongest - kLongestOfAll) % 13 == 0, "the longest is among them");

// ---- Arguments ----------------------------------------------------------------------------------

constexpr PixelFormat kPixelFormats[] = {
    {2, {8, 8, 8}, {0, 8, 16}, -1, false},  // the last field lies beyond the pixel
    {2, {5, 6, 5}, {11, 5, 0}, -1, false},
    {2, {5, 6, 5}, {0, 5, 11}, -1, false},
    {2, {5, 5, 5}, {10, 5, 0}, -1, false},
    {2, {4, 4, 4}, {0, 4, 8}, -1, false},
    {1, {3, 3, 2}, {5, 2, 0}, -1, false},
    {3, {8, 8, 8}, {16, 8, 0}, -1, true},
    {3, {8, 8, 8}, {0, 8, 16}, -1, true},
    {3, {6, 6, 6}, {12, 6, 0}, -1, false},
    {3, {6, 6, 6}, {0, 6, 12}, -1, false},
    {3, {7, 8, 7}, {2, 9, 17}, -1, false},
    {3, {8, 8, 8}, {0, 16, 8}, -1, true},
    {3, {8, 8, 8}, {8, 16, 0}, -1, true},
    {3, {16, 7, 9}, {16, 9, 0}, -1, false},  // half of the first field lies beyond the pixel
    {4, {8, 8, 8}, {16, 8, 0}, -1, true},
    {3, {8, 8, 8}, {8, 8, 0}, -1, true},  // two of them share a byte
    {4, {8, 8, 8}, {16, 8, 0}, 3, true},
    {4, {8, 8, 8}, {0, 8, 16}, 3, true},
    {4, {8, 8, 8}, {24, 16, 8}, 0, true},
    {4, {8, 8, 8}, {8, 16, 24}, 0, true},
    {4, {2, 15, 15}, {30, 15, 0}, 0, false},
    {4, {10, 10, 10}, {20, 10, 0}, 2, false},
    {4, {16, 0, 9}, {0, 16, 20}, 1, false},
};
constexpr int kPixelFormatCount = int(std::size(kPixelFormats));

// The four of them that have whole bytes and alpha.
constexpr int kFirstWithAlpha = 16;

uint32_t Word(const uint8_t* pixel, int bytes) {
  uint32_t word = 0;
  for (int i = 0; i < bytes; ++i) {
    word |= uint32_t{pixel[i]} << (8 * i);
  }
  return word;
}

void PutWord(uint8_t* pixel, uint32_t word, int bytes) {
  for (int i = 0; i < bytes; ++i) {
    pixel[i] = uint8_t(word >> (8 * i));
  }
}

// The top 8 bits of each field, zero-filled below.
reference::Triple Levels(const uint8_t* pixel, const PixelFormat& format) {
  const uint64_t word = Word(pixel, format.bytes);
  reference::Triple levels{};
  for (size_t c = 0; c < 3; ++c) {
    const uint64_t field = (word >> format.position[c]) & ((uint64_t{1} << format.size[c]) - 1);
    levels[c] = int64_t((field << 8) >> format.size[c]);
  }
  return levels;
}

// Bytes from the first to the last of n units that lie `step` apart.
size_t Extent(int n, ptrdiff_t step, int unit = 1) {
  return n == 0 ? 0 : size_t(std::abs(step) * ptrdiff_t{n - 1} + unit);
}

// What lies first in memory is last in order when the step is negative.
ptrdiff_t FirstOf(int n, ptrdiff_t step) {
  return n == 0 || step >= 0 ? 0 : -step * (n - 1);
}

// Three channels as arguments.
struct Sources {
  explicit Sources(Trial* trial, int n) {
    for (const uint8_t*& channel : in) {
      channel = trial->Source(size_t(n));
    }
  }
  const uint8_t* in[3] = {};
};

struct Destinations {
  Destinations(Trial* trial, int n) {
    for (int c = 0; c < 3; ++c) {
      const Trial::Destination channel = trial->Written(size_t(n));
      got[c] = channel.got;
      expected[c] = channel.expected;
    }
  }
  void Expect(ptrdiff_t i, const reference::Triple& triple) {
    for (int c = 0; c < 3; ++c) {
      expected[c][i] = uint8_t(triple[size_t(c)]);
    }
  }
  uint8_t* got[3];
  uint8_t* expected[3];
};

std::vector<int32_t> DrawOffsets(Trial* trial, int n, int order, int32_t end) {
  std::vector<int32_t> offsets(size_t(n), 0);
  for (int i = 0; i < n; ++i) {
    switch (order) {
      case 0:
        offsets[size_t(i)] = trial->random().Between(0, end - 1);
        break;
      case 1:  // enlarging
        offsets[size_t(i)] = i * end / (2 * n);
        break;
      default:  // mirrored
        offsets[size_t(i)] = end - 1 - i * end / n;
        break;
    }
  }
  return offsets;
}

AlphaFill DrawAlpha(Trial* trial, const PixelFormat& format) {
  if (format.alphaByte < 0 || trial->random().Percent(30)) {
    return {0xFFFFFFFF, 0};
  }
  const int32_t shift = 8 * format.alphaByte;
  return {~(255u << shift), uint32_t(trial->random().Between(0, 255)) << shift};
}

// Of rows of so many bytes, with and without gaps between them, in either direction.
ptrdiff_t DrawPitch(Trial* trial, int rowBytes) {
  const int gap = trial->random().Percent(50) ? 0 : trial->random().Between(1, 20);
  return trial->random().Percent(25) ? -rowBytes - gap : rowBytes + gap;
}

// An engine from one kind of colour to the other, and the model of its colours.
struct ColourEngine {
  ColourEngine(uint32_t dst, uint32_t src, const MPPPARAM& params)
      : engine({dst, 1, 1}, {src, 1, 1}, params) {
    reference::Format dstFormat, srcFormat;
    reference::DecodeFormat({dst, 1, 1, nullptr}, &dstFormat);
    reference::DecodeFormat({src, 1, 1, nullptr}, &srcFormat);
    standard = dstFormat.standard;
    if (dstFormat.IsRgb()) {
      model = reference::YuvToRgb(srcFormat, dstFormat,
                                  {params.brightness, params.contrast, params.saturation});
    }
  }
  const EngineContext& context() const { return engine.context(); }

  kestrel::test::Engine engine;
  reference::YuvToRgb model;
  uint32_t standard;
};

constexpr uint32_t kStandards[] = {FORMAT_BT601_VIDEO, FORMAT_BT601_FULL, FORMAT_BT709_VIDEO,
                                   FORMAT_BT709_FULL};

// Fields of 5, 5, 5 and of 4, 4, 4 bits, which have no clamp table.
constexpr uint32_t kRgb555 = 0x15000444;
constexpr uint32_t kRgb444 = 0x15000333;

// To 8-bit channels and to 16 bits, from any standard, under any extremes of adjustments.
constexpr int kToRgbCount = 11;
constexpr int kAdjusted = kToRgbCount;
constexpr int kAdjusted16 = kToRgbCount + 1;
constexpr int kAllToRgbCount = kToRgbCount + 2;

const ColourEngine& AdjustedToRgb(Trial* trial, bool is16Bit) {
  static constexpr int32_t kExtremes[] = {-128, 0, 128};
  static const auto* const engines = [] {
    auto* const list = new std::vector<std::unique_ptr<ColourEngine>>;
    for (const uint32_t dst : {FORMAT_RGB888, FORMAT_RGB565}) {
      for (const uint32_t standard : kStandards) {
        for (int k = 0; k < 27; ++k) {
          list->push_back(std::make_unique<ColourEngine>(
              dst, FORMAT_I444 | standard,
              kestrel::test::Param().Adjust(kExtremes[k / 9], kExtremes[k / 3 % 3],
                                            kExtremes[k % 3])));
        }
      }
    }
    return list;
  }();
  const int half = int(engines->size()) / 2;
  return *(*engines)[size_t(trial->random().Between(0, half - 1) + (is16Bit ? half : 0))];
}

// Engines to 8-bit channels, to both orders of 16 bits, and some with gains beyond the clamp table.
const ColourEngine& ToRgb(Trial* trial, int variant) {
  if (variant >= kToRgbCount) {
    return AdjustedToRgb(trial, variant == kAdjusted16);
  }
  static const auto* const engines = [] {
    auto* const list = new std::vector<std::unique_ptr<ColourEngine>>;
    using kestrel::test::Param;
    const auto add = [list](uint32_t dst, uint32_t src, const Param& params) {
      list->push_back(std::make_unique<ColourEngine>(dst, FORMAT_I444 | src, params));
    };
    add(FORMAT_RGB888, FORMAT_BT601_VIDEO, Param());
    add(FORMAT_XBGR8888, FORMAT_BT709_FULL, Param().Adjust(-20, 10, -30));
    add(FORMAT_RGB565, FORMAT_BT601_FULL, Param());
    add(FORMAT_BGR565, FORMAT_BT709_VIDEO, Param().Adjust(15, -10, 20));
    add(FORMAT_RGB565, FORMAT_BT601_VIDEO, Param().Adjust(128, 128, 128));
    add(FORMAT_RGB888, FORMAT_BT709_FULL, Param().Adjust(-128, 128, 128));
    add(FORMAT_RGB888, FORMAT_BT709_FULL, Param());
    add(FORMAT_BGR565, FORMAT_BT601_FULL, Param().Adjust(-10, 0, 0));
    add(FORMAT_RGB666, FORMAT_BT709_VIDEO, Param().Adjust(5, 5, 5));
    add(kRgb555, FORMAT_BT601_VIDEO, Param().Adjust(20, 20, 20));
    add(kRgb444, FORMAT_BT709_FULL, Param());
    return list;
  }();
  return *engines->at(size_t(variant));
}

const ColourEngine& ToYuv(int variant) {
  static const auto* const engines = [] {
    auto* const list = new std::vector<std::unique_ptr<ColourEngine>>;
    for (const uint32_t standard : kStandards) {
      list->push_back(std::make_unique<ColourEngine>(FORMAT_I444 | standard, FORMAT_RGB888,
                                                     kestrel::test::Param()));
    }
    return list;
  }();
  return *engines->at(size_t(variant));
}

// ---- Operations ---------------------------------------------------------------------------------

// Calls an operation once for a run of n and works out what should become of its destinations.
struct Operation {
  const char* name;
  int variants;
  void (*call)(Trial* trial, const RowOps& ops, int n, int variant);
};

void PrintTo(const Operation& operation, std::ostream* out) {
  *out << operation.name;
}

void ReadStrided(Trial* trial, const RowOps& ops, int n, int variant) {
  const ptrdiff_t step = variant + 1;
  const uint8_t* const src = trial->Source(Extent(n, step));
  const auto dst = trial->Written(size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.expected[i] = src[i * step];
  }
  ops.readStrided(dst.got, src, step, n);
}

void Gather(Trial* trial, const RowOps& ops, int n, int variant) {
  const int32_t size = trial->random().Between(1, 2 * n + 1);
  const uint8_t* const src = trial->Source(size_t(size));
  const int32_t* const offsets = trial->Source(DrawOffsets(trial, n, variant, size));
  const auto dst = trial->Written(size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.expected[i] = src[offsets[i]];
  }
  ops.gather(dst.got, src, offsets, n);
}

// Offsets are of bytes; pixels start anywhere.
void GatherPixels(Trial* trial, const RowOps& ops, int n, int variant) {
  const int bytes = variant % 4 + 1;
  const int32_t starts = trial->random().Between(1, 2 * n * bytes + 1);
  const uint8_t* const src = trial->Source(size_t(starts + bytes - 1));
  const int32_t* const offsets = trial->Source(DrawOffsets(trial, n, variant / 4, starts));
  const auto dst = trial->Written(size_t(n) * size_t(bytes));
  for (ptrdiff_t i = 0; i < n; ++i) {
    std::copy_n(src + offsets[i], bytes, dst.expected + i * bytes);
  }
  ops.gatherPixels(dst.got, src, offsets, bytes, n);
}

// The sources of pairs: both lists in one, or each by itself. The longest run is a whole plan.
struct Pairs {
  Pairs(Trial* trial, int n, int variant) {
    plan.n = n == kLongest ? kLongestPlan : n;
    const int32_t size = trial->random().Between(1, 6 * plan.n + 1);
    src = trial->Source(size_t(size));
    std::vector<int32_t> first = DrawOffsets(trial, plan.n, variant % 3, size);
    std::vector<int32_t> second = DrawOffsets(trial, plan.n, variant % 3, size);
    if (trial->random().Percent(50)) {  // neighbours
      std::transform(first.begin(), first.end(), second.begin(),
                     [size](int32_t offset) { return std::min(offset + 1, size - 1); });
    }
    Prepare();
    if (variant < 3 && trial->random().Percent(30)) {
      plan.stride = 1;
      const int32_t most = std::min(2, size - 1);
      plan.apart = trial->random().Between(-most, most);
      std::transform(first.begin(), first.end(), first.begin(), [this, size](int32_t offset) {
        return std::clamp(offset, std::max(0, -plan.apart), size - 1 - std::max(0, plan.apart));
      });
      plan.first = trial->Source(first);
    } else if (variant < 3) {
      plan.stride = 1;
      plan.first = trial->Source(first);
      plan.second = trial->Source(second);
    } else {
      std::vector<int32_t> both;
      for (size_t i = 0; i < first.size(); ++i) {
        both.insert(both.end(), {first[i], second[i]});
      }
      plan.stride = 2;
      plan.first = trial->Source(both);
      plan.second = plan.first + 1;
    }
  }
  // Exactly as much memory as a plan asks for.
  void Prepare() {
    const size_t blocks = size_t(plan.n + PairPlan::kBlock - 1) / PairPlan::kBlock;
    prepared.resize(PairPlan::kPreparedBytes * blocks * PairPlan::kBlock);
    blends.resize(blocks * PairPlan::kBlock);
    plan.prepared = prepared.data();
    plan.blends = blends.data();
  }
  uint8_t First(ptrdiff_t i) const { return src[plan.first[i * plan.stride]]; }
  uint8_t Second(ptrdiff_t i) const {
    return plan.second != nullptr ? src[plan.second[i * plan.stride]]
                                  : src[plan.first[i * plan.stride] + plan.apart];
  }

  PairPlan plan{};
  std::vector<uint8_t> prepared;
  std::vector<uint16_t> blends;
  const uint8_t* src = nullptr;

 protected:
  Pairs() = default;
};

void ReadPairs(Trial* trial, const RowOps& ops, int n, int variant) {
  Pairs pairs(trial, n, variant);
  const auto dst = trial->Written(size_t(2) * size_t(pairs.plan.n));
  for (ptrdiff_t i = 0; i < pairs.plan.n; ++i) {
    dst.expected[2 * i] = pairs.First(i);
    dst.expected[2 * i + 1] = pairs.Second(i);
  }
  ops.planPairs(&pairs.plan);
  ops.readPairs(dst.got, pairs.src, pairs.plan);
}

int32_t DrawWeight(Trial* trial) {
  constexpr int32_t kWeights[] = {0, 1, 32767, 32768, 65535};
  return trial->random().Percent(30) ? trial->random().Pick(kWeights)
                                     : trial->random().Between(0, 65535);
}

uint8_t Blended(int64_t a, int64_t b, int64_t weight) {
  const int64_t product = (b - a) * weight;
  const int64_t floor = product >= 0 ? product / 65536 : -((-product + 65535) / 65536);
  return uint8_t(a + floor);
}

void BlendPairs(Trial* trial, const RowOps& ops, int n, int variant) {
  Pairs pairs(trial, n, variant);
  std::vector<uint16_t> drawn(size_t(pairs.plan.n), 0);
  std::generate(drawn.begin(), drawn.end(), [trial] { return uint16_t(DrawWeight(trial)); });
  pairs.plan.weights = trial->Source(drawn);
  const auto dst = trial->Written(size_t(pairs.plan.n));
  for (ptrdiff_t i = 0; i < pairs.plan.n; ++i) {
    dst.expected[i] = Blended(pairs.First(i), pairs.Second(i), pairs.plan.weights[i]);
  }
  ops.planPairs(&pairs.plan);
  ops.blendPairs(dst.got, pairs.src, pairs.plan);
}

// Variant 1 writes over a, variant 2 over b.
template <typename WeightOf, typename Call>
void Blend(Trial* trial, int n, int variant, WeightOf weightOf, Call call) {
  const size_t size = size_t(n);
  const auto dst = variant == 0 ? trial->Written(size) : trial->Changed(size);
  const uint8_t* const a = variant == 1 ? dst.got : trial->Source(size);
  const uint8_t* const b = variant == 2 ? dst.got : trial->Source(size);
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.expected[i] = Blended(a[i], b[i], weightOf(i));
  }
  call(dst.got, a, b);
}

void BlendColumns(Trial* trial, const RowOps& ops, int n, int variant) {
  std::vector<uint16_t> drawn(size_t(n), 0);
  std::generate(drawn.begin(), drawn.end(), [trial] { return uint16_t(DrawWeight(trial)); });
  const uint16_t* const weights = trial->Source(drawn);
  Blend(
      trial, n, variant, [weights](ptrdiff_t i) { return weights[i]; },
      [&](uint8_t* dst, const uint8_t* a, const uint8_t* b) {
        ops.blendColumns(dst, a, b, weights, n);
      });
}

void BlendRows(Trial* trial, const RowOps& ops, int n, int variant) {
  const uint32_t weight = uint32_t(DrawWeight(trial));
  Blend(
      trial, n, variant, [weight](ptrdiff_t) { return weight; },
      [&](uint8_t* dst, const uint8_t* a, const uint8_t* b) {
        ops.blendRows(dst, a, b, weight, n);
      });
}

// Pixels of three bytes, or of four of which one may be kept. Most often neighbours at a steady
// pace, with pixels of the same picture; else anywhere, from any byte on.
struct PixelPairs : Pairs {
  PixelPairs(Trial* trial, int n, int variant) {
    plan.unit = variant % 6 == 5 ? 3 : 4;
    plan.keptByte = variant % 6 < 4 ? variant % 6 : -1;
    const int pixels = n == kLongest ? kLongestPlan / 4 : n;
    plan.n = pixels * plan.unit;
    const bool areNeighbours = variant >= 6;
    const int32_t size = trial->random().Between(1, 8 * pixels + 1);
    const int32_t starts = areNeighbours ? size : size * 4;
    std::vector<int32_t> first = DrawOffsets(trial, pixels, variant / 6 % 3, starts);
    std::vector<int32_t> second = DrawOffsets(trial, pixels, variant / 6 % 3, starts);
    for (size_t i = 0; areNeighbours && i < first.size(); ++i) {
      second[i] = std::min(first[i] + 1, size - 1) * plan.unit;
      first[i] *= plan.unit;
    }
    src = trial->Source(size_t(areNeighbours ? size * plan.unit : starts + plan.unit - 1));
    plan.first = trial->Source(first);
    plan.second = trial->Source(second);
    Prepare();
  }
};

void BlendPixelPairs(Trial* trial, const RowOps& ops, int n, int variant) {
  PixelPairs pairs(trial, n, variant);
  PairPlan& plan = pairs.plan;
  std::vector<uint16_t> drawn(size_t(plan.n / plan.unit), 0);
  std::generate(drawn.begin(), drawn.end(), [trial] { return uint16_t(DrawWeight(trial)); });
  plan.weights = trial->Source(drawn);
  const auto dst = trial->Written(size_t(plan.n));
  for (ptrdiff_t i = 0; i < plan.n; ++i) {
    const ptrdiff_t pixel = i / plan.unit;
    const ptrdiff_t byte = i % plan.unit;
    const uint8_t kept = pairs.src[plan.first[pixel] + byte];
    const uint8_t other = pairs.src[plan.second[pixel] + byte];
    dst.expected[i] = byte == plan.keptByte ? kept : Blended(kept, other, plan.weights[pixel]);
  }
  ops.planPairs(&plan);
  ops.blendPairs(dst.got, pairs.src, plan);
}

void BlendPixelRows(Trial* trial, const RowOps& ops, int n, int variant) {
  const int alphaByte = variant == 4 ? -1 : variant;
  const int64_t weight = DrawWeight(trial);
  const uint8_t* const a = trial->Source(size_t(4) * size_t(n));
  const uint8_t* const b = trial->Source(size_t(4) * size_t(n));
  const auto dst = trial->Written(size_t(4) * size_t(n));
  for (ptrdiff_t i = 0; i < ptrdiff_t{4} * n; ++i) {
    dst.expected[i] = i % 4 == alphaByte ? a[i] : Blended(a[i], b[i], weight);
  }
  ops.blendPixelRows(dst.got, a, b, uint32_t(weight), alphaByte, n);
}

void UnpackRgb(Trial* trial, const RowOps& ops, int n, int variant) {
  const PixelFormat& format = kPixelFormats[variant];
  const uint8_t* const src = trial->Source(size_t(n) * size_t(format.bytes));
  Destinations dst(trial, n);
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.Expect(i, Levels(src + i * format.bytes, format));
  }
  ops.unpackRgb(dst.got, src, format, n);
}

void UnpackAlpha(Trial* trial, const RowOps& ops, int n, int variant) {
  const PixelFormat& format = kPixelFormats[kFirstWithAlpha + variant];
  const uint8_t* const src = trial->Source(size_t(n) * size_t(format.bytes));
  const auto dst = trial->Written(size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.expected[i] = src[i * format.bytes + format.alphaByte];
  }
  ops.unpackAlpha(dst.got, src, format, n);
}

void GatherIndexed(Trial* trial, const RowOps& ops, int n, int variant) {
  const uint32_t bits = 1u << (variant % 4);
  const int32_t width = trial->random().Between(1, 2 * n + 1);
  const uint8_t* const row = trial->Source((size_t(width) * bits + 7) / 8);
  const uint8_t* const palette = trial->Source(size_t{4} << bits);
  const int32_t* const columns = trial->Source(DrawOffsets(trial, n, variant / 4, width));
  const auto dst = trial->Written(size_t(4) * size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    uint32_t entry = 0;
    for (uint32_t bit = 0; bit < bits; ++bit) {  // numbered from the left, most significant first
      const uint32_t place = uint32_t(columns[i]) * bits + bit;
      entry = 2 * entry + ((row[place / 8] >> (7 - place % 8)) & 1);
    }
    std::copy_n(palette + 4 * size_t{entry}, 4, dst.expected + 4 * i);
  }
  ops.gatherIndexed(dst.got, row, columns, bits, palette, n);
}

void YuvToRgbWide(Trial* trial, const RowOps& ops, int n, int variant) {
  const ColourEngine& engine = ToRgb(trial, variant);
  const Sources yuv(trial, n);
  Destinations dst(trial, n);
  reference::YuvToRgb::Carry none{};
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.Expect(i, engine.model.Convert({yuv.in[0][i], yuv.in[1][i], yuv.in[2][i]}, &none));
  }
  ops.yuvToRgbWide(dst.got, yuv.in[0], yuv.in[1], yuv.in[2], WideOf(engine.context()), n);
}

// The remainders that a run leaves are those that the next one starts with.
void YuvToRgbCarry(Trial* trial, const RowOps& ops, int n, int variant) {
  const ColourEngine& engine = ToRgb(trial, variant);
  reference::YuvToRgb::Carry expected = engine.model.StartCarry(true);
  Carry carry{};
  for (size_t c = 0; c < 3; ++c) {
    expected.accumulator[c] = trial->random().Between(0, int32_t(expected.mask[c]));
    carry.mask[c] = int32_t(expected.mask[c]);
    carry.remainder[c] = int32_t(expected.accumulator[c]);
  }
  const Sources yuv(trial, n);
  Destinations dst(trial, n);
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.Expect(i, engine.model.Convert({yuv.in[0][i], yuv.in[1][i], yuv.in[2][i]}, &expected));
  }
  ops.yuvToRgbCarry(dst.got, yuv.in[0], yuv.in[1], yuv.in[2], WideOf(engine.context()), &carry, n);
  for (size_t c = 0; c < 3; ++c) {
    EXPECT_EQ(carry.remainder[c], expected.accumulator[c]);
    EXPECT_EQ(carry.mask[c], expected.mask[c]);
  }
}

// What engines do: each form of the colour arithmetic with a format whose fields it is made for.
constexpr struct {
  YuvToRgbForm form;
  int engine;
  int format;
} kYuvToPixels[] = {
    {YuvToRgbForm::kWide, kAdjusted, 6},   {YuvToRgbForm::kWide, kAdjusted, 7},
    {YuvToRgbForm::kWide, kAdjusted, 16},  {YuvToRgbForm::kWide, kAdjusted, 17},
    {YuvToRgbForm::kWide, kAdjusted, 18},  {YuvToRgbForm::kWide, kAdjusted, 19},
    {YuvToRgbForm::kTable, 0, 6},          {YuvToRgbForm::kTable, 0, 7},
    {YuvToRgbForm::kTable, 0, 16},         {YuvToRgbForm::kTable, 0, 17},
    {YuvToRgbForm::kTable, 0, 18},         {YuvToRgbForm::kTable, 0, 19},
    {YuvToRgbForm::kTable, 6, 6},          {YuvToRgbForm::kTable, 6, 7},
    {YuvToRgbForm::kTable, 6, 16},         {YuvToRgbForm::kTable, 6, 19},
    {YuvToRgbForm::kWholeLuma, 6, 6},      {YuvToRgbForm::kWholeLuma, 6, 7},
    {YuvToRgbForm::kWholeLuma, 6, 16},     {YuvToRgbForm::kWholeLuma, 6, 17},
    {YuvToRgbForm::kWholeLuma, 6, 18},     {YuvToRgbForm::kWholeLuma, 6, 19},
    {YuvToRgbForm::kSixBits, 6, 6},        {YuvToRgbForm::kSixBits, 6, 7},
    {YuvToRgbForm::kSixBits, 6, 16},       {YuvToRgbForm::kSixBits, 6, 17},
    {YuvToRgbForm::kSixBits, 6, 18},       {YuvToRgbForm::kSixBits, 6, 19},
    {YuvToRgbForm::kWide, kAdjusted16, 1}, {YuvToRgbForm::kWide, kAdjusted16, 2},
    {YuvToRgbForm::kTable, 2, 1},          {YuvToRgbForm::kTable, 2, 2},
    {YuvToRgbForm::kTable, 3, 1},          {YuvToRgbForm::kTable, 3, 2},
    {YuvToRgbForm::kWholeLuma, 2, 1},      {YuvToRgbForm::kWholeLuma, 2, 2},
    {YuvToRgbForm::kWholeLuma, 7, 1},      {YuvToRgbForm::kWholeLuma, 7, 2},
    {YuvToRgbForm::kSixBits, 2, 1},        {YuvToRgbForm::kSixBits, 2, 2},
    {YuvToRgbForm::kWide, 9, 3},           {YuvToRgbForm::kSixBits, 9, 3},
    {YuvToRgbForm::kWide, 10, 4},          {YuvToRgbForm::kSixBits, 10, 4},
    {YuvToRgbForm::kWide, 8, 8},           {YuvToRgbForm::kWide, 8, 9},
    {YuvToRgbForm::kTable, 8, 8},          {YuvToRgbForm::kTable, 8, 9},
    {YuvToRgbForm::kSixBits, 8, 8},        {YuvToRgbForm::kSixBits, 8, 9},
};
constexpr int kYuvToPixelsCount = int(std::size(kYuvToPixels));

// Whole packed pixels: chroma of each pixel or shared along and across rows, planes or pairs in
// either order, pitches of either sign.
void YuvToPixels(Trial* trial, const RowOps& ops, int n, int variant) {
  const YuvToRgbForm form = kYuvToPixels[variant].form;
  const ColourEngine& engine = ToRgb(trial, kYuvToPixels[variant].engine);
  const PixelFormat& format = kPixelFormats[kYuvToPixels[variant].format];
  const AlphaFill alpha = DrawAlpha(trial, format);
  if (form == YuvToRgbForm::kTable || form == YuvToRgbForm::kWholeLuma) {
    ASSERT_NE(engine.context().rgbSums.insideClampTable, 0u);
  }

  PixelRows rows{};
  rows.rows = trial->random().Between(1, 5);
  ChromaRows chroma{};
  chroma.shift = trial->random().Between(0, 1);
  chroma.rowShift = trial->random().Between(0, 1);
  chroma.step = trial->random().Between(1, 2);
  const int rowBytes = ((n + chroma.shift) >> chroma.shift) * chroma.step;
  const int chromaRows = ((rows.rows - 1) >> chroma.rowShift) + 1;
  const auto drawChroma = [&](ptrdiff_t* pitch) {
    *pitch = DrawPitch(trial, rowBytes);
    return n == 0
               ? trial->Source(0)
               : trial->Source(Extent(chromaRows, *pitch, rowBytes)) + FirstOf(chromaRows, *pitch);
  };
  chroma.u = drawChroma(&chroma.uPitch);
  if (chroma.step == 1) {
    chroma.v = drawChroma(&chroma.vPitch);
  } else {
    chroma.vPitch = chroma.uPitch;
    chroma.v = trial->random().Percent(50) ? chroma.u + 1 : chroma.u++;
  }

  rows.yPitch = DrawPitch(trial, n);
  rows.dstPitch = DrawPitch(trial, n * format.bytes);
  rows.y = trial->Source(n == 0 ? 0 : Extent(rows.rows, rows.yPitch, n)) +
           (n == 0 ? 0 : FirstOf(rows.rows, rows.yPitch));
  const auto dst = trial->Written(n == 0 ? 0 : Extent(rows.rows, rows.dstPitch, n * format.bytes));
  const ptrdiff_t first = n == 0 ? 0 : FirstOf(rows.rows, rows.dstPitch);
  rows.dst = dst.got + first;

  reference::YuvToRgb::Carry none{};
  for (ptrdiff_t j = 0; j < rows.rows; ++j) {
    for (ptrdiff_t i = 0; i < n; ++i) {
      const ptrdiff_t sample = (i >> chroma.shift) * chroma.step;
      const ptrdiff_t row = j >> chroma.rowShift;
      const reference::Triple yuv = {rows.y[j * rows.yPitch + i],
                                     chroma.u[row * chroma.uPitch + sample],
                                     chroma.v[row * chroma.vPitch + sample]};
      const reference::Triple rgb = form == YuvToRgbForm::kSixBits
                                        ? reference::SixBitYuvToRgb(yuv)
                                        : engine.model.Convert(yuv, &none);
      uint32_t word = 0;
      for (int c = 0; c < 3; ++c) {
        // The model narrows the channels of 16-bit pixels, but not what it makes of six-bit
        // factors.
        const bool isNarrow = format.bytes == 2 && form != YuvToRgbForm::kSixBits;
        const uint32_t drop = isNarrow ? 0 : 8 - format.size[c];
        word |= uint32_t(rgb[size_t(c)]) >> drop << format.position[c];
      }
      PutWord(dst.expected + first + j * rows.dstPitch + i * format.bytes,
              (word & alpha.keep) | alpha.bits, format.bytes);
    }
  }
  ops.yuvToPixels(rows, chroma, {form, TableOf(engine.context()), WideOf(engine.context())}, format,
                  alpha, n);
}

void RgbToYuv(Trial* trial, const RowOps& ops, int n, int variant) {
  constexpr int kFirstTables[] = {0, 3, 5};
  const ColourEngine& engine = ToYuv(variant / 3);
  const Sources rgb(trial, n);
  const auto dst = trial->Written(size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    const reference::Triple yuv =
        reference::RgbToYuv({rgb.in[0][i], rgb.in[1][i], rgb.in[2][i]}, engine.standard);
    dst.expected[i] = uint8_t(yuv[size_t(variant % 3)]);
  }
  ops.rgbToYuv(dst.got, rgb.in, RgbToYuvTablesOf(engine.context()) + kFirstTables[variant % 3], n);
}

// Of each format each channel.
void PixelsToYuv(Trial* trial, const RowOps& ops, int n, int variant) {
  constexpr int kFirstTables[] = {0, 3, 5};
  const PixelFormat& format = kPixelFormats[variant / 3];
  const ColourEngine& engine = ToYuv(trial->random().Between(0, 3));
  const uint8_t* const src = trial->Source(size_t(n) * size_t(format.bytes));
  const auto dst = trial->Written(size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    const reference::Triple yuv =
        reference::RgbToYuv(Levels(src + i * format.bytes, format), engine.standard);
    dst.expected[i] = uint8_t(yuv[size_t(variant % 3)]);
  }
  ops.pixelsToYuv(dst.got, src, format,
                  RgbToYuvTablesOf(engine.context()) + kFirstTables[variant % 3], n);
}

// Of each format: to two planes, to U and V in turn, to V and U in turn.
void PixelPairsToChroma(Trial* trial, const RowOps& ops, int n, int variant) {
  const PixelFormat& format = kPixelFormats[variant / 3];
  const ColourEngine& engine = ToYuv(trial->random().Between(0, 3));
  const uint8_t* const src = trial->Source(size_t(n) * 2 * size_t(format.bytes));
  const bool planes = variant % 3 == 0;
  const auto first = trial->Written(planes ? size_t(n) : 2 * size_t(n));
  const auto second = planes ? trial->Written(size_t(n)) : first;
  const ptrdiff_t step = planes ? 1 : 2;
  const ptrdiff_t u = variant % 3 == 2 ? 1 : 0;
  const ptrdiff_t v = variant % 3 == 1 ? 1 : 0;
  for (ptrdiff_t i = 0; i < n; ++i) {
    const uint8_t* const pixel = src + (2 * i + 1) * format.bytes;
    const reference::Triple yuv = reference::RgbToYuv(Levels(pixel, format), engine.standard);
    first.expected[u + i * step] = uint8_t(yuv[1]);
    second.expected[v + i * step] = uint8_t(yuv[2]);
  }
  ops.pixelPairsToChroma(first.got + u, second.got + v, int(step), src, format,
                         RgbToYuvTablesOf(engine.context()), n);
}

// Lines of the gains and offsets that adjustments can give. Variant 1 writes over its source.
void MapLevels(Trial* trial, const RowOps& ops, int n, int variant) {
  constexpr int32_t kGains[] = {0, 32768, 56066, 65536, 76608, 674109};
  constexpr int32_t kFarthest = 1 << 27;
  const bool isFar = trial->random().Percent(20);
  const int32_t gain = isFar ? trial->random().Between(0, 674109) : trial->random().Pick(kGains);
  const int32_t offset = isFar ? trial->random().Between(-kFarthest, kFarthest)
                               : trial->random().Between(-128, 128) * 65536 + 32768;
  std::vector<uint8_t> line(256);
  for (ptrdiff_t i = 0; i < 256; ++i) {
    line[size_t(i)] = uint8_t(std::clamp<int64_t>((int64_t{i} * gain + offset) >> 16, 0, 255));
  }
  const uint8_t* const map = trial->Source(line);
  const size_t size = size_t(n);
  const auto dst = variant == 0 ? trial->Written(size) : trial->Changed(size);
  const uint8_t* const src = variant == 0 ? trial->Source(size) : dst.got;
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.expected[i] = map[src[i]];
  }
  ops.mapLevels(dst.got, src, {map, gain, offset}, n);
}

// Fields of 5, 6, 5 and of 4, 8, 5 bits; the last variants write over their sources.
void NarrowWithCarry(Trial* trial, const RowOps& ops, int n, int variant) {
  constexpr FieldShifts kShifts[] = {{{3, 2, 3}}, {{4, 0, 3}}};
  const FieldShifts& shifts = kShifts[variant % 2];
  const bool inPlace = variant >= 2;
  Carry carry{};
  Carry expected{};
  uint8_t* got[3];
  const uint8_t* src[3];
  for (int c = 0; c < 3; ++c) {
    const int32_t mask = (1 << shifts.right[c]) - 1;
    carry.mask[c] = expected.mask[c] = mask;
    carry.remainder[c] = expected.remainder[c] = trial->random().Between(0, mask);
    const auto dst = inPlace ? trial->Changed(size_t(n)) : trial->Written(size_t(n));
    got[c] = dst.got;
    src[c] = inPlace ? dst.got : trial->Source(size_t(n));
    for (ptrdiff_t i = 0; i < n; ++i) {
      const int32_t sum = src[c][i] + expected.remainder[c];
      dst.expected[i] = uint8_t(std::min(sum, 255) >> shifts.right[c]);
      expected.remainder[c] = sum & mask;
    }
  }
  ops.narrowWithCarry(got, src, shifts, &carry, n);
  for (int c = 0; c < 3; ++c) {
    EXPECT_EQ(carry.remainder[c], expected.remainder[c]);
    EXPECT_EQ(carry.mask[c], expected.mask[c]);
  }
}

// For each format channels of 8 bits, then such as are as narrow as their fields already.
void PackRgb(Trial* trial, const RowOps& ops, int n, int variant) {
  const PixelFormat& format = kPixelFormats[variant % kPixelFormatCount];
  const bool narrowed = variant >= kPixelFormatCount;
  FieldShifts shifts{};
  const uint8_t* rgb[3];
  for (int c = 0; c < 3; ++c) {
    const int32_t size = int32_t(format.size[c]);
    shifts.right[c] = narrowed && size < 8 ? 0 : 8 - size;
    rgb[c] = trial->Source(size_t(n), narrowed && size < 8 ? uint8_t((1 << size) - 1) : 255);
  }
  const AlphaFill alpha = DrawAlpha(trial, format);
  const auto dst = trial->Written(size_t(n) * size_t(format.bytes));
  for (ptrdiff_t i = 0; i < n; ++i) {
    uint32_t word = 0;
    for (int c = 0; c < 3; ++c) {
      const uint32_t value = rgb[c][i];
      const int32_t right = shifts.right[c];
      word |= (right >= 0 ? value >> right : value << -right) << format.position[c];
    }
    PutWord(dst.expected + i * format.bytes, (word & alpha.keep) | alpha.bits, format.bytes);
  }
  ops.packRgb(dst.got, rgb, format, shifts, alpha, n);
}

// From each format to all of them: their channels are narrowed to 8 bits and widened again.
void RepackPixels(Trial* trial, const RowOps& ops, int n, int variant) {
  const PixelFormat& from = kPixelFormats[variant];
  const PixelFormat& to = trial->random().Pick(kPixelFormats);
  const uint8_t* const src = trial->Source(size_t(n) * size_t(from.bytes));
  const auto dst = trial->Written(size_t(n) * size_t(to.bytes));
  for (ptrdiff_t i = 0; i < n; ++i) {
    const uint8_t* const in = src + i * from.bytes;
    uint8_t* const out = dst.expected + i * to.bytes;
    const reference::Triple levels = Levels(in, from);
    uint64_t pixel = 0;
    for (int c = 0; c < 3; ++c) {
      pixel |= ((uint64_t(levels[size_t(c)]) << to.size[c]) >> 8) << to.position[c];
    }
    PutWord(out, uint32_t(pixel), to.bytes);
    if (from.alphaByte >= 0 && to.alphaByte >= 0) {
      out[to.alphaByte] = in[from.alphaByte];
    }
  }
  ops.repackPixels(dst.got, src, from, to, n);
}

void PutAlpha(Trial* trial, const RowOps& ops, int n, int variant) {
  const PixelFormat& format = kPixelFormats[kFirstWithAlpha + variant];
  const uint8_t* const alpha = trial->Source(size_t(n));
  const auto dst = trial->Changed(size_t(n) * size_t(format.bytes));
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.expected[i * format.bytes + format.alphaByte] = alpha[i];
  }
  ops.putAlpha(dst.got, alpha, format, n);
}

void Interleave(Trial* trial, const RowOps& ops, int n, int) {
  const uint8_t* const a = trial->Source(size_t(n));
  const uint8_t* const b = trial->Source(size_t(n));
  const auto dst = trial->Written(2 * size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.expected[2 * i] = a[i];
    dst.expected[2 * i + 1] = b[i];
  }
  ops.interleave(dst.got, a, b, n);
}

void Deinterleave(Trial* trial, const RowOps& ops, int n, int) {
  const uint8_t* const src = trial->Source(2 * size_t(n));
  const auto a = trial->Written(size_t(n));
  const auto b = trial->Written(size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    a.expected[i] = src[2 * i];
    b.expected[i] = src[2 * i + 1];
  }
  ops.deinterleave(a.got, b.got, src, n);
}

void SwapPairs(Trial* trial, const RowOps& ops, int n, int) {
  const uint8_t* const src = trial->Source(2 * size_t(n));
  const auto dst = trial->Written(2 * size_t(n));
  for (ptrdiff_t i = 0; i < 2 * ptrdiff_t{n}; ++i) {
    dst.expected[i] = src[i ^ 1];
  }
  ops.swapPairs(dst.got, src, n);
}

// Long rows, then long columns, of units of each size; pitches of either sign, with gaps.
// Variant 1: chroma comes first.
void SplitGroups(Trial* trial, const RowOps& ops, int n, int variant) {
  const bool lumaFirst = variant == 0;
  const uint8_t* const src = trial->Source(size_t(4) * size_t(n));
  const auto luma = trial->Written(size_t(2) * size_t(n));
  const auto first = trial->Written(size_t(n));
  const auto second = trial->Written(size_t(n));
  for (ptrdiff_t i = 0; i < n; ++i) {
    const uint8_t* const group = src + 4 * i;
    luma.expected[2 * i] = group[lumaFirst ? 0 : 1];
    luma.expected[2 * i + 1] = group[lumaFirst ? 2 : 3];
    first.expected[i] = group[lumaFirst ? 1 : 0];
    second.expected[i] = group[lumaFirst ? 3 : 2];
  }
  uint8_t* const chroma[2] = {first.got, second.got};
  ops.splitGroups(luma.got, chroma, src, lumaFirst, n);
}

void Transpose(Trial* trial, const RowOps& ops, int n, int variant) {
  const int unit = variant % 4 + 1;
  const int other = trial->random().Between(0, 40);
  const int columns = variant < 4 ? n : other;
  const int rows = variant < 4 ? other : n;
  const ptrdiff_t srcPitch = DrawPitch(trial, columns * unit);
  const ptrdiff_t dstPitch = DrawPitch(trial, rows * unit);
  const bool isEmpty = rows == 0 || columns == 0;
  const uint8_t* const src =
      trial->Source(isEmpty ? 0 : Extent(rows, srcPitch, columns * unit)) + FirstOf(rows, srcPitch);
  const auto dst = trial->Written(isEmpty ? 0 : Extent(columns, dstPitch, rows * unit));
  const ptrdiff_t first = FirstOf(columns, dstPitch);
  for (ptrdiff_t j = 0; j < rows; ++j) {
    for (ptrdiff_t i = 0; i < columns; ++i) {
      std::copy_n(src + j * srcPitch + i * unit, unit,
                  dst.expected + first + i * dstPitch + j * unit);
    }
  }
  ops.transpose(dst.got + first, dstPitch, src, srcPitch, unit, rows, columns);
}

void WriteStrided(Trial* trial, const RowOps& ops, int n, int variant) {
  constexpr ptrdiff_t kSteps[] = {1, -1, 2, -2, 3, -3, 4, -4, 131, -144};
  const ptrdiff_t step = kSteps[variant];
  const uint8_t* const src = trial->Source(size_t(n));
  const auto dst = trial->Written(Extent(n, step));
  const ptrdiff_t first = FirstOf(n, step);
  for (ptrdiff_t i = 0; i < n; ++i) {
    dst.expected[first + i * step] = src[i];
  }
  ops.writeStrided(dst.got + first, step, src, n);
}

void WritePixels(Trial* trial, const RowOps& ops, int n, int variant) {
  const int bytes = variant % 4 + 1;
  const ptrdiff_t steps[] = {bytes, -bytes, bytes + 1, bytes + 3, -bytes - 5, 131, -144};
  const ptrdiff_t step = steps[variant / 4];
  const uint8_t* const src = trial->Source(size_t(n) * size_t(bytes));
  const auto dst = trial->Written(Extent(n, step, bytes));
  const ptrdiff_t first = FirstOf(n, step);
  for (ptrdiff_t i = 0; i < n; ++i) {
    std::copy_n(src + i * bytes, bytes, dst.expected + first + i * step);
  }
  ops.writePixels(dst.got + first, step, src, bytes, n);
}

constexpr Operation kOperations[] = {
    {"ReadStrided", 4, ReadStrided},
    {"Gather", 3, Gather},
    {"GatherPixels", 12, GatherPixels},
    {"ReadPairs", 6, ReadPairs},
    {"BlendPairs", 6, BlendPairs},
    {"BlendColumns", 3, BlendColumns},
    {"BlendRows", 3, BlendRows},
    {"BlendPixelPairs", 24, BlendPixelPairs},
    {"BlendPixelRows", 5, BlendPixelRows},
    {"UnpackRgb", kPixelFormatCount, UnpackRgb},
    {"UnpackAlpha", kPixelFormatCount - kFirstWithAlpha, UnpackAlpha},
    {"GatherIndexed", 12, GatherIndexed},
    {"YuvToRgbWide", kAllToRgbCount, YuvToRgbWide},
    {"YuvToRgbCarry", kAllToRgbCount, YuvToRgbCarry},
    {"YuvToPixels", kYuvToPixelsCount, YuvToPixels},
    {"RgbToYuv", 12, RgbToYuv},
    {"PixelsToYuv", 3 * kPixelFormatCount, PixelsToYuv},
    {"PixelPairsToChroma", 3 * kPixelFormatCount, PixelPairsToChroma},
    {"MapLevels", 2, MapLevels},
    {"NarrowWithCarry", 4, NarrowWithCarry},
    {"PackRgb", 2 * kPixelFormatCount, PackRgb},
    {"RepackPixels", kPixelFormatCount, RepackPixels},
    {"PutAlpha", kPixelFormatCount - kFirstWithAlpha, PutAlpha},
    {"Interleave", 1, Interleave},
    {"Deinterleave", 1, Deinterleave},
    {"SwapPairs", 1, SwapPairs},
    {"SplitGroups", 2, SplitGroups},
    {"Transpose", 8, Transpose},
    {"WriteStrided", 10, WriteStrided},
    {"WritePixels", 28, WritePixels},
};

// A new operation is a new pointer in the table, and needs its line above. Planning has none, one
// has two, and there is the name.
static_assert(sizeof(RowOps) == (std::size(kOperations) + 1) * sizeof(void (*)()),
              "every operation has its test");

// ---- Trials -------------------------------------------------------------------------------------

class EveryRowOperation : public testing::TestWithParam<std::tuple<const RowOps*, Operation>> {};

TEST_P(EveryRowOperation, DoesWhatItsDescriptionSays) {
  const auto& [rows, operation] = GetParam();
  Arena arena;
  uint64_t trials = 0;
  for (int variant = 0; variant < operation.variants; ++variant) {
    for (int n = 0; n <= kLongest; n = NextLength(n)) {
      for (const Content content : {Content::kNoise, Content::kExtremes, Content::kRamp}) {
        for (const auto edge : {GuardedBuffer::Edge::kStart, GuardedBuffer::Edge::kEnd}) {
          for (int remainder = -1; remainder < 16; ++remainder) {
            if (++trials % KESTREL_ROW_STRIDE != 0) {
              continue;
            }
            // Each length meets the 16 alignments of both sides, pairs of them change with it.
            const Placing placing = {edge, remainder,
                                     remainder < 0 ? -1 : (7 * remainder + n + variant) % 16};
            Trial trial(&arena, trials, content, placing);
            operation.call(&trial, *rows, n, variant);
            ASSERT_EQ(trial.Difference(), "")
                << "variant " << variant << ", length " << n << ", content " << int(content)
                << ", alignments " << placing.srcRemainder << " and " << placing.dstRemainder;
            ASSERT_FALSE(testing::Test::HasFailure()) << "variant " << variant << ", length " << n;
          }
        }
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P(Rows, EveryRowOperation,
                         testing::Combine(testing::ValuesIn(AvailableRows()),
                                          testing::ValuesIn(kOperations)),
                         [](const auto& test) {
                           return NameOf(std::get<0>(test.param)) + "_" +
                                  std::get<1>(test.param).name;
                         });

}  // namespace
}  // namespace rows_tests
