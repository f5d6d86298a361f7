// Runs one conversion job a number of times, for scripts/count-instructions.
//
//   run_job                 lists the jobs: name, output pixels, most instructions per output pixel
//                           that 32-bit ARM should need (0 where no figure is set)
//   run_job NAME RUNS       then prints the memory map, which tells where each library was loaded
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "benchmarks/common/engine.h"
#include "benchmarks/common/picture.h"

namespace {

using bench::Picture;
using bench::Size;

constexpr uint32_t kRotate90 = MPP_SWAP_XY | MPP_MIRROR_X;
constexpr uint32_t kRgba = FORMAT_XBGR8888;
constexpr uint32_t kFull = FORMAT_BT601_FULL;
constexpr uint32_t kVideo = FORMAT_BT601_VIDEO;

constexpr Size kSource = {1920, 1080};
constexpr Size kSmaller = {1280, 720};

struct Job {
  const char* name;
  double aim;
  uint32_t src;
  uint32_t dst;
  uint32_t transform = 0;
  bool scaled = false;    // bilinear, to kSmaller
  bool adjusted = false;  // contrast and saturation, beyond what the clamp tables hold

  Size DstSize() const {
    const Size size = scaled ? kSmaller : kSource;
    return (transform & MPP_SWAP_XY) != 0 ? size.Turned() : size;
  }
};

constexpr Job kJobs[] = {
    {"NV21_full_to_RGBA", 3.4, FORMAT_NV21 | kFull, kRgba},
    {"NV21_video_to_RGBA", 6, FORMAT_NV21 | kVideo, kRgba},
    {"NV21_adjusted_to_RGBA", 0, FORMAT_NV21 | kVideo, kRgba, 0, false, true},
    {"NV21_full_to_RGBA_R90", 5, FORMAT_NV21 | kFull, kRgba, kRotate90},
    {"NV21_full_to_RGBA_mirrored", 0, FORMAT_NV21 | kFull, kRgba, MPP_MIRROR_X},
    {"NV21_full_to_RGBA_720p", 10, FORMAT_NV21 | kFull, kRgba, 0, true},
    {"NV21_video_to_RGBA_720p", 10, FORMAT_NV21 | kVideo, kRgba, 0, true},
    {"NV21_full_to_RGBA_720p_R90", 11, FORMAT_NV21 | kFull, kRgba, kRotate90, true},
    {"NV21_video_to_RGBA_720p_R90", 11, FORMAT_NV21 | kVideo, kRgba, kRotate90, true},
    {"NV21_full_to_RGB24", 0, FORMAT_NV21 | kFull, FORMAT_BGR888},
    {"NV21_full_to_RGB565", 0, FORMAT_NV21 | kFull, FORMAT_RGB565},
    {"NV12_full_to_RGBA", 0, FORMAT_NV12 | kFull, kRgba},
    {"I420_full_to_RGBA", 0, FORMAT_I420 | kFull, kRgba},
    {"RGBA_to_NV21_full", 3, kRgba, FORMAT_NV21 | kFull},
    {"RGBA_to_NV21_video", 3, kRgba, FORMAT_NV21 | kVideo},
    {"RGBA_to_I420_full", 0, kRgba, FORMAT_I420 | kFull},
    {"RGBA_R90", 0, kRgba, kRgba, kRotate90},
    {"RGB24_R90", 0, FORMAT_BGR888, FORMAT_BGR888, kRotate90},
    {"RGBA_720p", 0, kRgba, kRgba, 0, true},
    {"NV21_copy", 0, FORMAT_NV21 | kFull, FORMAT_NV21 | kFull},
    {"NV21_R90", 1, FORMAT_NV21 | kFull, FORMAT_NV21 | kFull, kRotate90},
    {"NV21_to_I420", 0, FORMAT_NV21 | kFull, FORMAT_I420 | kFull},
    {"NV21_full_to_video", 0, FORMAT_NV21 | kFull, FORMAT_NV21 | kVideo},
    {"I420_720p", 8, FORMAT_I420 | kFull, FORMAT_I420 | kFull, 0, true},
};

template <typename Function>
void ForEachByte(const Picture& picture, Function function) {
  for (int i = 0; i < picture.blockCount; ++i) {
    const bench::Block& block = picture.block[i];
    for (int32_t row = 0; row < block.rows; ++row) {
      uint8_t* const start = block.start + ptrdiff_t(row) * block.pitch;
      for (int32_t column = 0; column < block.rowBytes; ++column) function(&start[column]);
    }
  }
}

// Noise into the source; and what no source byte becomes everywhere into the destination.
bool Run(const Job& job, int runs) {
  const Picture src(job.src, kSource);
  const Picture dst(job.dst, job.DstSize());
  uint32_t state = 1;
  ForEachByte(src, [&state](uint8_t* byte) {
    *byte = uint8_t((state = state * 1664525u + 1013904223u) >> 24);
  });
  constexpr uint8_t kUntouched = 0x5A;
  ForEachByte(dst, [](uint8_t* byte) { *byte = kUntouched; });

  MPPPARAM params = {};
  params.resampleFlags = job.scaled ? MPP_BILINEAR : MPP_NEAREST;
  params.transformCode = job.transform;
  params.passMode = MPP_PASS_TILED;
  params.alpha = 255;
  if (job.adjusted) params.contrast = params.saturation = 64;
  const bench::Engine engine({job.dst, dst.size.width, dst.size.height, nullptr},
                             {job.src, kSource.width, kSource.height, nullptr}, params);
  if (!engine.IsAccepted()) {
    std::fprintf(stderr, "run_job: %s is refused\n", job.name);
    return false;
  }
  for (int i = 0; i < runs; ++i) engine.Run(src, dst);

  int64_t untouched = 0;
  ForEachByte(dst, [&untouched](const uint8_t* byte) { untouched += *byte == kUntouched ? 1 : 0; });
  if (runs > 0 && untouched > int64_t(dst.ByteCount()) / 16) {
    std::fprintf(stderr, "run_job: %s has not drawn its whole destination\n", job.name);
    return false;
  }
  return true;
}

bool PrintMemoryMap() {
  std::FILE* const maps = std::fopen("/proc/self/maps", "r");
  if (maps == nullptr) {
    std::perror("/proc/self/maps");
    return false;
  }
  char line[512];
  while (std::fgets(line, sizeof(line), maps) != nullptr) std::fputs(line, stdout);
  return std::fclose(maps) == 0;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc == 1) {
    for (const Job& job : kJobs) {
      std::printf("%s %lld %g\n", job.name, static_cast<long long>(job.DstSize().Pixels()),
                  job.aim);
    }
    return 0;
  }
  if (argc != 3) {
    std::fputs("usage: run_job [NAME RUNS]\n", stderr);
    return 2;
  }
  for (const Job& job : kJobs) {
    if (std::strcmp(job.name, argv[1]) == 0) {
      return Run(job, std::atoi(argv[2])) && PrintMemoryMap() ? 0 : 1;
    }
  }
  std::fprintf(stderr, "run_job: there is no job %s\n", argv[1]);
  return 1;
}
