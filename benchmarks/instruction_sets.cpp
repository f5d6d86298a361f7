// Whole jobs of 1920x1080 with the row operations of every instruction set that this CPU runs:
// nanoseconds per destination pixel, and how many times as fast as with the scalar ones. Compare
// within one run only: machines are noisy. (--benchmark_repetitions=9 and
// --benchmark_enable_random_interleaving=true give all the same conditions.)
//
// Compilers turn much of the scalar operations into SSE2. What single operations would take shows
// in a build with -DCMAKE_CXX_FLAGS=-fno-tree-vectorize.
#include <benchmark/benchmark.h>

#include <cstring>
#include <string>
#include <vector>

#include "benchmarks/common/picture.h"
#include "benchmarks/common/table_of_sets.h"
#include "engine/context.h"
#include "engine/postprocess.h"

namespace bench {
namespace {

constexpr Size kSource = {1920, 1080};
constexpr Size kReduced = {1280, 720};
constexpr uint32_t kNv21 = FORMAT_NV21 | FORMAT_BT601_FULL;
constexpr uint32_t kQuarterTurn = MPP_SWAP_XY | MPP_MIRROR_X;

struct Case {
  const char* name;
  uint32_t src, dst;
  Size size;  // before a turn
  uint32_t transform;
};

constexpr Case kCases[] = {
    {"NV21 to RGBA", kNv21, FORMAT_XBGR8888, kSource, 0},
    {"NV21 video range to RGBA", FORMAT_NV21, FORMAT_XBGR8888, kSource, 0},
    {"RGBA to NV21", FORMAT_XBGR8888, kNv21, kSource, 0},
    {"RGBA to NV21 video range", FORMAT_XBGR8888, FORMAT_NV21, kSource, 0},
    {"NV21 to RGBA 1280x720", kNv21, FORMAT_XBGR8888, kReduced, 0},
    {"NV21 to RGBA 1280x720, turned", kNv21, FORMAT_XBGR8888, kReduced, kQuarterTurn},
    {"RGBA turned", FORMAT_XBGR8888, FORMAT_XBGR8888, kSource, kQuarterTurn},
};

void Time(benchmark::State& state, const Case& c, const kestrel::RowOps& rows) {
  const bool turns = (c.transform & MPP_SWAP_XY) != 0;
  const Picture src(c.src, kSource);
  const Picture dst(c.dst, turns ? c.size.Turned() : c.size);
  for (int i = 0; i < src.blockCount; ++i) {
    const Block& block = src.block[i];
    for (int32_t row = 0; row < block.rows; ++row) {
      uint8_t* const start = block.start + ptrdiff_t{block.pitch} * row;
      for (int32_t k = 0; k < block.rowBytes; ++k) start[k] = uint8_t((row * 7 + k * 5) >> 3);
    }
  }
  MPPFORMAT dstFormat = {c.dst, dst.size.width, dst.size.height, nullptr};
  MPPFORMAT srcFormat = {c.src, src.size.width, src.size.height, nullptr};
  MPPPARAM params = {};
  params.resampleFlags = MPP_BILINEAR;
  params.transformCode = c.transform;
  params.passMode = MPP_PASS_TILED;
  MPPHandle* handle = nullptr;
  if (MPPCreate(&dstFormat, &srcFormat, &params, &handle) != KESTREL_OK) {
    state.SkipWithError("creation failed");
    return;
  }
  for (PassEngine* const pass : handle->pass) {
    if (pass != nullptr) pass->context->rows = &rows;
  }
  for ([[maybe_unused]] auto _ : state) {
    MPProcess(handle, dst.plane, nullptr, dst.pitch, src.plane, src.pitch);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(int64_t(state.iterations()) * dst.size.Pixels());
  MPPDestroy(handle);
}

}  // namespace
}  // namespace bench

int main(int argc, char** argv) {
  const kestrel::RowOpsList sets = kestrel::AvailableRowOps();
  std::vector<std::string> names;
  for (const bench::Case& c : bench::kCases) {
    names.emplace_back(c.name);
    for (const kestrel::RowOps* const* rows = sets.ops; *rows != nullptr; ++rows) {
      const std::string name = std::string(c.name) + "/" + (*rows)->name;
      benchmark::RegisterBenchmark(name.c_str(), bench::Time, c, **rows);
    }
  }
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  bench::TableOfSets table("nanoseconds per pixel", names, sets);
  benchmark::RunSpecifiedBenchmarks(&table);
  benchmark::Shutdown();
  return 0;
}
