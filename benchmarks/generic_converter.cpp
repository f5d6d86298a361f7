// The generic converter by itself, against the tests' per-pixel reference converter on the same
// job, in one process. Compare items per second within one run only: machines are noisy.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <string>
#include <vector>

#include "engine/postprocess.h"
#include "tests/reference/reference.h"

namespace {

struct Picture {
  Picture(uint32_t format, int32_t width, int32_t height) : record{format, width, height, nullptr} {
    const bool packed = format >> 28 == 1;
    const size_t luma = size_t(width) * size_t(height) * (packed ? 4 : 1);
    bytes.resize(packed ? luma : luma * 2 + 64);
    uint32_t state = 1;
    for (uint8_t& byte : bytes) byte = uint8_t((state = state * 1664525u + 1013904223u) >> 24);
    plane[0] = bytes.data();
    if (packed) {
      pitch[0] = width * 4;
    } else if (format == FORMAT_I420) {
      pitch[0] = width;
      pitch[1] = pitch[2] = width / 2;
      plane[1] = plane[0] + luma;
      plane[2] = plane[1] + luma / 4;
    } else {
      pitch[0] = pitch[1] = pitch[2] = width;
      plane[2] = plane[0] + luma;
      plane[1] = plane[2] + 1;
    }
  }

  MPPFORMAT record;
  std::vector<uint8_t> bytes;
  uint8_t* plane[3] = {};
  int32_t pitch[3] = {};
};

struct Case {
  const char* name;
  uint32_t src;
  uint32_t dst;
  int32_t dstWidth, dstHeight;
  uint32_t resample, transform;
};

constexpr Case kCases[] = {
    {"NV21_to_RGBA", FORMAT_NV21, FORMAT_XBGR8888, 1920, 1080, MPP_NEAREST, 0},
    {"NV21_to_RGBA_R90", FORMAT_NV21, FORMAT_XBGR8888, 1080, 1920, MPP_NEAREST, 3},
    {"NV21_to_RGBA_720p_bilinear", FORMAT_NV21, FORMAT_XBGR8888, 1280, 720, MPP_BILINEAR, 0},
    {"RGBA_to_NV21", FORMAT_XBGR8888, FORMAT_NV21, 1920, 1080, MPP_NEAREST, 0},
    {"NV21_to_I420", FORMAT_NV21, FORMAT_I420, 1920, 1080, MPP_NEAREST, 0},
};

MPPPARAM Parameters(const Case& c) {
  MPPPARAM params = {};
  params.resampleFlags = c.resample;
  params.transformCode = c.transform;
  params.passMode = 1;
  return params;
}

void RunGeneric(benchmark::State& state, const Case& c) {
  Picture src(c.src, 1920, 1080);
  Picture dst(c.dst, c.dstWidth, c.dstHeight);
  MPPPARAM params = Parameters(c);
  MPPHandle* handle = nullptr;
  if (MPPCreate(&dst.record, &src.record, &params, &handle) != KESTREL_OK) {
    state.SkipWithError("creation failed");
    return;
  }
  // Straight to the last member of the chain, whatever the families before it would take.
  const EngineContext& engine = *handle->pass[0]->context;
  const bool swap = engine.swapXY != 0;
  const MRECT rect = {0, 0, swap ? c.dstHeight : c.dstWidth, swap ? c.dstWidth : c.dstHeight};
  uint8_t* starts[3] = {dst.plane[0], dst.plane[1], dst.plane[2]};
  if (engine.mirrorX != 0) starts[0] += 4 * (c.dstWidth - 1);
  for (auto _ : state) {
    ANY_ANY_C_SLOW(&rect, dst.pitch, src.pitch, starts, src.plane, &engine);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(int64_t(state.iterations()) * c.dstWidth * c.dstHeight);
  MPPDestroy(handle);
}

void RunReference(benchmark::State& state, const Case& c) {
  Picture src(c.src, 1920, 1080);
  Picture dst(c.dst, c.dstWidth, c.dstHeight);
  reference::Job job = {};
  job.dst = dst.record;
  job.src = src.record;
  job.params = Parameters(c);
  for (int i = 0; i < 3; ++i) {
    job.dstPlanes[i] = dst.plane[i];
    job.dstPitches[i] = dst.pitch[i];
    job.srcPlanes[i] = src.plane[i];
    job.srcPitches[i] = src.pitch[i];
  }
  for (auto _ : state) {
    reference::Convert(job);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(int64_t(state.iterations()) * c.dstWidth * c.dstHeight);
}

}  // namespace

int main(int argc, char** argv) {
  for (const Case& c : kCases) {
    const std::string name = c.name;
    benchmark::RegisterBenchmark((name + "/generic").c_str(), RunGeneric, c)
        ->Unit(benchmark::kMillisecond);
    benchmark::RegisterBenchmark((name + "/per_pixel").c_str(), RunReference, c)
        ->Unit(benchmark::kMillisecond);
  }
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
