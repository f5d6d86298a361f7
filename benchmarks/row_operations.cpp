// Every row operation of every instruction set that this CPU runs, on runs that stay in its caches:
// nanoseconds per pixel (or per sample, where the operation is about samples), and how many times
// as fast as the scalar operation. Compare within one run only: machines are noisy. Of repetitions
// (--benchmark_repetitions, --benchmark_enable_random_interleaving) the fastest counts.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include "benchmarks/common/table_of_sets.h"
#include "engine/postprocess.h"
#include "kernels/rows/rows.h"

namespace {

using kestrel::PairPlan;
using kestrel::PixelFormat;
using kestrel::RowOps;
using kestrel::YuvToRgbForm;

constexpr int kPixels = 1920;
constexpr int kPairs = 512;
constexpr int kSquare = 64;  // side of what is transposed

constexpr PixelFormat kRgba = {4, {8, 8, 8}, {0, 8, 16}, 3, true};
constexpr PixelFormat kBgra = {4, {8, 8, 8}, {16, 8, 0}, 3, true};
constexpr PixelFormat kRgb24 = {3, {8, 8, 8}, {0, 8, 16}, -1, true};
constexpr PixelFormat kRgb565 = {2, {5, 6, 5}, {11, 5, 0}, -1, false};
constexpr kestrel::FieldShifts kNoShifts = {{0, 0, 0}};
constexpr kestrel::FieldShifts kShifts565 = {{3, 2, 3}};
constexpr kestrel::AlphaFill kOpaque = {0x00FFFFFF, 0xFF000000};
constexpr kestrel::AlphaFill kKeepAll = {~0u, 0};

// The colours of a real engine.
class Colours {
 public:
  Colours(uint32_t dst, uint32_t src) {
    MPPFORMAT dstFormat = {dst, 16, 16, nullptr};
    MPPFORMAT srcFormat = {src, 16, 16, nullptr};
    MPPPARAM params = {};
    params.passMode = 1;
    if (MPPCreate(&dstFormat, &srcFormat, &params, &handle_) != KESTREL_OK) std::abort();
  }
  Colours(const Colours&) = delete;
  Colours& operator=(const Colours&) = delete;
  ~Colours() { MPPDestroy(handle_); }

  kestrel::YuvToRgb YuvToRgb(YuvToRgbForm form) const {
    const YuvToRgbSums& sums = context().rgbSums;
    const uint32_t* const words = static_cast<const uint32_t*>(context().table);
    const uint32_t* const offsets = context().tableOffsets;
    kestrel::YuvToRgb colour = {};
    colour.form = form;
    colour.table = {static_cast<const uint8_t*>(context().table),
                    words + offsets[2],
                    words + offsets[0],
                    words + offsets[1],
                    {}};
    colour.wide = {sums.yGain, sums.vToR, sums.vToG, sums.uToG, sums.uToB, {}, {}, {}, {}};
    for (int c = 0; c < 3; ++c) {
      colour.table.narrowing[c] = colour.wide.narrowing[c] = sums.narrowing[c];
      colour.wide.offset[c] = sums.offset[c];
      colour.wide.base[c] = sums.indexBase[c];
      colour.wide.maximum[c] = sums.maximum[c];
    }
    return colour;
  }
  kestrel::RgbToYuvTables RgbToYuv() const {
    return static_cast<kestrel::RgbToYuvTables>(context().table);
  }
  kestrel::LevelMap Levels() const {
    return {static_cast<const uint8_t*>(context().table), context().levelSums.gain[0],
            context().levelSums.offset[0]};
  }

 private:
  const EngineContext& context() const { return *handle_->pass[0]->context; }

  MPPHandle* handle_ = nullptr;
};

// What operations read and write. Buffers are larger than any run.
struct Runs {
  Runs() {
    uint32_t state = 1;
    const auto next = [&state] { return (state = state * 1664525u + 1013904223u) >> 8; };
    for (std::vector<uint8_t>* buffer : {&a, &b, &c, &pixels, &palette}) {
      buffer->resize(kBytes);
      std::generate(buffer->begin(), buffer->end(), [&next] { return uint8_t(next()); });
    }
    for (std::vector<uint8_t>& buffer : out) buffer.resize(kBytes);
    for (int i = 0; i < kPixels; ++i) {
      scaled.push_back(i * 3 / 2);
      scaledPixels.push_back(i * 3 / 2 * 4);
      nextPixels.push_back(scaledPixels.back() + 4);
      weights.push_back(uint16_t(next()));
    }
    // Each with its right neighbour.
    for (int i = 0; i < kPairs; ++i) neighbours.push_back(scaled[size_t(i)] + 1);
    plan.n = kPairs;
    plan.prepared = prepared.data();
    plan.first = scaled.data();
    plan.second = neighbours.data();
    plan.stride = 1;
    plan.weights = weights.data();
    plan.blends = blends.data();
    pixelPlan = plan;
    pixelPlan.n = 4 * kPixels;
    pixelPlan.unit = 4;
    pixelPlan.keptByte = 3;
    pixelPlan.prepared = preparedPixels.data();
    pixelPlan.first = scaledPixels.data();
    pixelPlan.second = nextPixels.data();
    pixelPlan.blends = pixelBlends.data();
    inChannels[0] = a.data();
    inChannels[1] = b.data();
    inChannels[2] = c.data();
    for (size_t i = 0; i < 3; ++i) outChannels[i] = out[i].data();
  }

  kestrel::PixelRows TwoRows(int bytesPerPixel) {
    return {out[0].data(), ptrdiff_t{kPixels} * bytesPerPixel, a.data(), kPixels, 2};
  }
  kestrel::ChromaRows SemiPlanarChroma() const {
    return {b.data() + 1, b.data(), 1, 2, kPixels, kPixels, 1};
  }
  kestrel::ChromaRows PlanarChroma() const {
    return {b.data(), c.data(), 1, 1, kPixels / 2, kPixels / 2, 1};
  }

  static constexpr size_t kBytes = 2 * 4 * kPixels + 64;
  std::vector<uint8_t> a, b, c, pixels, palette;
  std::vector<uint8_t> out[3];
  std::vector<int32_t> scaled, scaledPixels, nextPixels, neighbours;
  std::vector<uint16_t> weights;
  std::vector<uint8_t> prepared = std::vector<uint8_t>(PairPlan::kPreparedBytes * kPairs);
  std::vector<uint16_t> blends = std::vector<uint16_t>(kPairs);
  std::vector<uint8_t> preparedPixels =
      std::vector<uint8_t>(PairPlan::kPreparedBytes * 4 * kPixels);
  std::vector<uint16_t> pixelBlends = std::vector<uint16_t>(4 * kPixels);
  PairPlan plan = {}, pixelPlan = {};
  kestrel::Carry carry = {{7, 3, 7}, {0, 0, 0}};
  const uint8_t* inChannels[3];
  uint8_t* outChannels[3];

  const Colours fullToRgb{FORMAT_XBGR8888, FORMAT_NV21 | FORMAT_BT601_FULL};
  const Colours videoToRgb{FORMAT_XBGR8888, FORMAT_NV21 | FORMAT_BT601_VIDEO};
  const Colours videoTo565{FORMAT_RGB565, FORMAT_NV21 | FORMAT_BT601_VIDEO};
  const Colours rgbToVideo{FORMAT_NV21 | FORMAT_BT601_VIDEO, FORMAT_XBGR8888};
  const Colours fullToVideo{FORMAT_NV21 | FORMAT_BT601_VIDEO, FORMAT_NV21 | FORMAT_BT601_FULL};
};

struct Case {
  const char* name;
  int pixels;  // per call
  void (*call)(const RowOps& ops, Runs* r);
};

const Case kCases[] = {
    {"readStrided 2", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.readStrided(r->out[0].data(), r->a.data(), 2, kPixels);
     }},
    {"readStrided 4", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.readStrided(r->out[0].data(), r->a.data(), 4, kPixels);
     }},
    {"gather", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.gather(r->out[0].data(), r->a.data(), r->scaled.data(), kPixels);
     }},
    {"gatherPixels 3", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.gatherPixels(r->out[0].data(), r->pixels.data(), r->scaledPixels.data(), 3, kPixels);
     }},
    {"gatherPixels 4", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.gatherPixels(r->out[0].data(), r->pixels.data(), r->scaledPixels.data(), 4, kPixels);
     }},
    {"planPairs", kPairs, [](const RowOps& ops, Runs* r) { ops.planPairs(&r->plan); }},
    {"readPairs", kPairs,
     [](const RowOps& ops, Runs* r) { ops.readPairs(r->out[0].data(), r->a.data(), r->plan); }},
    {"blendPairs", kPairs,
     [](const RowOps& ops, Runs* r) { ops.blendPairs(r->out[0].data(), r->a.data(), r->plan); }},
    {"planPairs RGBA", kPixels, [](const RowOps& ops, Runs* r) { ops.planPairs(&r->pixelPlan); }},
    {"blendPairs RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.blendPairs(r->out[0].data(), r->pixels.data(), r->pixelPlan);
     }},
    {"blendColumns", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.blendColumns(r->out[0].data(), r->a.data(), r->b.data(), r->weights.data(), kPixels);
     }},
    {"blendRows", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.blendRows(r->out[0].data(), r->a.data(), r->b.data(), 21845, kPixels);
     }},
    {"blendPixelRows RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.blendPixelRows(r->out[0].data(), r->a.data(), r->b.data(), 21845, 3, kPixels);
     }},

    {"unpackRgb RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.unpackRgb(r->outChannels, r->pixels.data(), kRgba, kPixels);
     }},
    {"unpackRgb RGB24", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.unpackRgb(r->outChannels, r->pixels.data(), kRgb24, kPixels);
     }},
    {"unpackRgb RGB565", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.unpackRgb(r->outChannels, r->pixels.data(), kRgb565, kPixels);
     }},
    {"unpackAlpha RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.unpackAlpha(r->out[0].data(), r->pixels.data(), kRgba, kPixels);
     }},
    {"gatherIndexed 4", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.gatherIndexed(r->out[0].data(), r->a.data(), r->scaled.data(), 4, r->palette.data(),
                         kPixels);
     }},
    {"gatherIndexed 8", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.gatherIndexed(r->out[0].data(), r->a.data(), r->scaled.data(), 8, r->palette.data(),
                         kPixels);
     }},

    {"yuvToRgbWide", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToRgbWide(r->outChannels, r->a.data(), r->b.data(), r->c.data(),
                        r->videoToRgb.YuvToRgb(YuvToRgbForm::kWide).wide, kPixels);
     }},
    {"yuvToRgbCarry", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToRgbCarry(r->outChannels, r->a.data(), r->b.data(), r->c.data(),
                         r->videoTo565.YuvToRgb(YuvToRgbForm::kWide).wide, &r->carry, kPixels);
     }},
    {"yuvToPixels NV21 six bits RGBA", 2 * kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToPixels(r->TwoRows(4), r->SemiPlanarChroma(),
                       r->fullToRgb.YuvToRgb(YuvToRgbForm::kSixBits), kRgba, kOpaque, kPixels);
     }},
    {"yuvToPixels NV21 full RGBA", 2 * kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToPixels(r->TwoRows(4), r->SemiPlanarChroma(),
                       r->fullToRgb.YuvToRgb(YuvToRgbForm::kWholeLuma), kRgba, kOpaque, kPixels);
     }},
    {"yuvToPixels NV21 video RGBA", 2 * kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToPixels(r->TwoRows(4), r->SemiPlanarChroma(),
                       r->videoToRgb.YuvToRgb(YuvToRgbForm::kTable), kRgba, kOpaque, kPixels);
     }},
    {"yuvToPixels NV21 wide RGBA", 2 * kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToPixels(r->TwoRows(4), r->SemiPlanarChroma(),
                       r->videoToRgb.YuvToRgb(YuvToRgbForm::kWide), kRgba, kOpaque, kPixels);
     }},
    {"yuvToPixels I420 video RGBA", 2 * kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToPixels(r->TwoRows(4), r->PlanarChroma(),
                       r->videoToRgb.YuvToRgb(YuvToRgbForm::kTable), kRgba, kOpaque, kPixels);
     }},
    {"yuvToPixels NV21 video RGB24", 2 * kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToPixels(r->TwoRows(3), r->SemiPlanarChroma(),
                       r->videoToRgb.YuvToRgb(YuvToRgbForm::kTable), kRgb24, kKeepAll, kPixels);
     }},
    {"yuvToPixels NV21 video RGB565", 2 * kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.yuvToPixels(r->TwoRows(2), r->SemiPlanarChroma(),
                       r->videoTo565.YuvToRgb(YuvToRgbForm::kTable), kRgb565, kKeepAll, kPixels);
     }},
    {"rgbToYuv", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.rgbToYuv(r->out[0].data(), r->inChannels, r->rgbToVideo.RgbToYuv(), kPixels);
     }},
    {"pixelsToYuv RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.pixelsToYuv(r->out[0].data(), r->pixels.data(), kRgba, r->rgbToVideo.RgbToYuv(),
                       kPixels);
     }},
    {"pixelsToYuv RGB24", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.pixelsToYuv(r->out[0].data(), r->pixels.data(), kRgb24, r->rgbToVideo.RgbToYuv(),
                       kPixels);
     }},
    {"pixelsToYuv RGB565", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.pixelsToYuv(r->out[0].data(), r->pixels.data(), kRgb565, r->rgbToVideo.RgbToYuv(),
                       kPixels);
     }},
    {"pixelPairsToChroma RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.pixelPairsToChroma(r->out[0].data(), r->out[0].data() + 1, 2, r->pixels.data(), kRgba,
                              r->rgbToVideo.RgbToYuv(), kPixels / 2);
     }},
    {"mapLevels", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.mapLevels(r->out[0].data(), r->a.data(), r->fullToVideo.Levels(), kPixels);
     }},

    {"narrowWithCarry RGB565", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.narrowWithCarry(r->outChannels, r->inChannels, kShifts565, &r->carry, kPixels);
     }},
    {"packRgb RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.packRgb(r->out[0].data(), r->inChannels, kRgba, kNoShifts, kOpaque, kPixels);
     }},
    {"packRgb RGB24", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.packRgb(r->out[0].data(), r->inChannels, kRgb24, kNoShifts, kKeepAll, kPixels);
     }},
    {"packRgb RGB565", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.packRgb(r->out[0].data(), r->inChannels, kRgb565, kShifts565, kKeepAll, kPixels);
     }},
    {"repackPixels RGBA BGRA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.repackPixels(r->out[0].data(), r->pixels.data(), kRgba, kBgra, kPixels);
     }},
    {"repackPixels RGBA RGB24", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.repackPixels(r->out[0].data(), r->pixels.data(), kRgba, kRgb24, kPixels);
     }},
    {"repackPixels RGB24 RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.repackPixels(r->out[0].data(), r->pixels.data(), kRgb24, kRgba, kPixels);
     }},
    {"repackPixels RGBA RGB565", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.repackPixels(r->out[0].data(), r->pixels.data(), kRgba, kRgb565, kPixels);
     }},
    {"putAlpha RGBA", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.putAlpha(r->out[0].data(), r->a.data(), kRgba, kPixels);
     }},

    {"interleave", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.interleave(r->out[0].data(), r->a.data(), r->b.data(), kPixels);
     }},
    {"deinterleave", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.deinterleave(r->out[0].data(), r->out[1].data(), r->a.data(), kPixels);
     }},
    {"swapPairs", kPixels,
     [](const RowOps& ops, Runs* r) { ops.swapPairs(r->out[0].data(), r->a.data(), kPixels); }},
    {"transpose 1", kSquare* kSquare,
     [](const RowOps& ops, Runs* r) {
       ops.transpose(r->out[0].data(), kSquare, r->a.data(), kSquare, 1, kSquare, kSquare);
     }},
    {"transpose 2", kSquare* kSquare,
     [](const RowOps& ops, Runs* r) {
       ops.transpose(r->out[0].data(), ptrdiff_t{2} * kSquare, r->a.data(), ptrdiff_t{2} * kSquare,
                     2, kSquare, kSquare);
     }},
    {"transpose 3", kSquare* kSquare,
     [](const RowOps& ops, Runs* r) {
       ops.transpose(r->out[0].data(), ptrdiff_t{3} * kSquare, r->a.data(), ptrdiff_t{3} * kSquare,
                     3, kSquare, kSquare);
     }},
    // Half of a square: 64 by 64 words do not fit the buffers.
    {"transpose 4", kSquare* kSquare / 2,
     [](const RowOps& ops, Runs* r) {
       ops.transpose(r->out[0].data(), ptrdiff_t{2} * kSquare, r->a.data(), ptrdiff_t{4} * kSquare,
                     4, kSquare / 2, kSquare);
     }},
    {"writeStrided 2", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.writeStrided(r->out[0].data(), 2, r->a.data(), kPixels);
     }},
    {"writeStrided -1", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.writeStrided(r->out[0].data() + kPixels - 1, -1, r->a.data(), kPixels);
     }},
    {"writePixels -3", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.writePixels(r->out[0].data() + ptrdiff_t{3} * (kPixels - 1), -3, r->pixels.data(), 3,
                       kPixels);
     }},
    {"writePixels -4", kPixels,
     [](const RowOps& ops, Runs* r) {
       ops.writePixels(r->out[0].data() + ptrdiff_t{4} * (kPixels - 1), -4, r->pixels.data(), 4,
                       kPixels);
     }},
};

void Time(benchmark::State& state, const Case& c, const RowOps& ops, Runs* runs) {
  ops.planPairs(&runs->plan);
  ops.planPairs(&runs->pixelPlan);
  for ([[maybe_unused]] auto _ : state) {
    c.call(ops, runs);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(int64_t(state.iterations()) * c.pixels);
}

}  // namespace

int main(int argc, char** argv) {
  Runs runs;
  const kestrel::RowOpsList sets = kestrel::AvailableRowOps();
  for (const Case& c : kCases) {
    for (const RowOps* const* ops = sets.ops; *ops != nullptr; ++ops) {
      const std::string name = std::string(c.name) + "/" + (*ops)->name;
      benchmark::RegisterBenchmark(name.c_str(), Time, c, **ops, &runs);
    }
  }
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  std::vector<std::string> names;
  for (const Case& c : kCases) names.emplace_back(c.name);
  bench::TableOfSets table("nanoseconds per pixel", names, sets);
  benchmark::RunSpecifiedBenchmarks(&table);
  benchmark::Shutdown();
  return 0;
}
