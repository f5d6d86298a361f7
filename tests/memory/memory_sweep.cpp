// Conversions for a watcher of uninitialised memory: MemorySanitizer, or valgrind around an
// ordinary build. Sources have values in their pixels only, not between rows nor around planes;
// destinations have none before a run. Afterwards exactly the bytes that the plain model writes
// must have values, and the model's values. That finds pixels left out, bytes written too much,
// reads beside a row that reach the picture, and reads of tables or buffers that nobody has filled.
//
// No GoogleTest and no streams: MemorySanitizer takes what libraries built without it write for
// uninitialised.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "engine/postprocess.h"
#include "fuzz/jobs.h"
#include "jni/bitmap_buffers.h"
#include "tests/kernels/kernel_case.h"
#include "tests/memory/watch.h"
#include "tests/reference/chooser.h"
#include "tests/support/formats.h"
#include "tests/support/instruction_sets.h"

namespace {

using differential::Block;
using differential::Case;
using differential::PlacedBlock;
using differential::Random;
using differential::Side;
using kernel_tests::CreateEngine;
using kernel_tests::EngineHandle;
using testing_support::InstructionSet;
using testing_support::InstructionSets;

constexpr size_t kMostWatched = size_t{1} << 19;
constexpr int kMostDraws = 100000;

// Not the formats with bytes beside the pixels, nor the indexed ones, which are sources only.
constexpr bool IsFullyDrawn(uint32_t code) {
  return !testing_support::IsSpecialCode(code) && !testing_support::IsIndexedCode(code);
}

constexpr auto kSources = testing_support::PublicCodes();
constexpr auto kDestinations = testing_support::PublicCodes<IsFullyDrawn>();

struct Options {
  int kernelJobs = 36;
  int cases = 12000;
  int pictures = 3;  // of every pair of formats
  int wide = 8;      // of every pair of some formats
  int share = 0;
  int shares = 1;
};

struct Where {
  const char* what;
  const char* set;
  const Case& drawn;
};

// Plain numbers: strings would be filled by a library that MemorySanitizer does not see into.
[[noreturn]] void Fail(const Where& where, const char* fault) {
  const Case& drawn = where.drawn;
  const MPPPARAM& params = drawn.params;
  std::printf("FAULT: %s, %s: %s\n", where.what, where.set, fault);
  std::printf(
      "case %d of seed %d: %08x %d x %d from %08x %d x %d, pass mode %u, transform %u, "
      "resample %u, aspect %u, dither %u\n",
      int(drawn.number), int(drawn.seed), drawn.dst.record.format, drawn.dst.record.width,
      drawn.dst.record.height, drawn.src.record.format, drawn.src.record.width,
      drawn.src.record.height, params.passMode, params.transformCode, params.resampleFlags,
      params.aspectMode, params.dither);
  std::printf("origins %d,%d from %d,%d, %s rectangle %d,%d,%d,%d, source rectangle %d,%d,%d,%d\n",
              params.dstOriginX, params.dstOriginY, params.srcOriginX, params.srcOriginY,
              drawn.hasRect ? "a" : "no", drawn.rect.left, drawn.rect.top, drawn.rect.right,
              drawn.rect.bottom, params.srcRect.left, params.srcRect.top, params.srcRect.right,
              params.srcRect.bottom);
  std::fflush(stdout);
  std::abort();
}

// ---- What has a value ----

void UndefineBlocks(const Side& side, const PlacedBlock* placed) {
  for (int i = 0; i < side.blocks.count; ++i) {
    watch::Undefine(placed[i].watched, placed[i].watchedSize);
  }
}

// Takes everything but the pixels of a source away. UndefineBlocks lets the next job write there.
void KeepPixelsOnly(const Side& side, const PlacedBlock* placed) {
  for (int i = 0; i < side.blocks.count; ++i) {
    const Block& block = side.blocks.block[i];
    const size_t pitch = size_t(std::abs(side.pitches[i]));
    const uint8_t* const first = placed[i].first;
    const uint8_t* const end = first + SizeOf(block, side.pitches[i]);
    watch::Forbid(placed[i].watched, size_t(first - placed[i].watched));
    watch::Forbid(end, size_t(placed[i].watched + placed[i].watchedSize - end));
    for (int32_t row = 0; row + 1 < block.rows; ++row) {
      watch::Undefine(first + pitch * size_t(row) + block.rowBytes, pitch - size_t(block.rowBytes));
    }
  }
}

// Null, or how two destinations differ: in what has a value, or in a value.
const char* Compare(const Side& side, const PlacedBlock* got, const PlacedBlock* expected) {
  static uint8_t gotMap[kMostWatched], expectedMap[kMostWatched];
  for (int i = 0; i < side.blocks.count; ++i) {
    const size_t size = std::min(got[i].watchedSize, kMostWatched);
    watch::ReadMap(got[i].watched, size, gotMap);
    watch::ReadMap(expected[i].watched, size, expectedMap);
    for (size_t at = 0; at < size; ++at) {
      if ((gotMap[at] != 0) != (expectedMap[at] != 0)) {
        return gotMap[at] != 0 ? "a byte has no value that should have one"
                               : "a byte has a value that should have none";
      }
      if (gotMap[at] == 0 && got[i].watched[at] != expected[i].watched[at]) {
        return "a byte has another value than that of the model";
      }
    }
  }
  return nullptr;
}

// Whether every pixel of an image without margins has a value. The half of a packed pair beyond an
// odd width belongs to no pixel.
bool IsComplete(const Side& side, const uint8_t* const* tops, const int32_t* pitches) {
  const reference::Format& format = side.format;
  const bool isPacked = format.planeCount == 1 && !format.IsRgb() && !format.IsGrey();
  const int32_t group = isPacked ? format.horizontal[reference::kU] : 1;
  const int32_t width = side.record.width - side.record.width % group;
  if (width == 0) {
    return true;
  }
  const differential::ImageBlocks blocks =
      differential::BlocksOf(format, width, side.record.height, side.blocks.count == 3);
  const bool isSplit = differential::IsSemiPlanar(format) && blocks.count == 3;
  for (int i = 0; i < blocks.count; ++i) {
    const ptrdiff_t step = isSplit && i > 0 ? 2 : 1;
    const ptrdiff_t part = step == 2 ? 1 : blocks.block[i].rowBytes;
    for (int32_t row = 0; row < blocks.block[i].rows; ++row) {
      const uint8_t* const pixels = tops[i] + ptrdiff_t(pitches[i]) * row;
      for (ptrdiff_t at = 0; at < blocks.block[i].rowBytes; at += part * step) {
        if (watch::FirstUndefined(pixels + at, size_t(part)) >= 0) {
          return false;
        }
      }
    }
  }
  return true;
}

// ---- Kernels of the tables, and the generic converter ----

// The next job that a kernel accepts, from `*draw` on. False after too many that it does not.
bool DrawAccepted(int id, int* draw, kernel_tests::KernelBench* bench, Case* drawn,
                  reference::Engine* model, EngineHandle* handle) {
  const kestrel::KernelRow& row = kernel_tests::RowOf(id);
  for (const int end = *draw + kMostDraws; *draw < end;) {
    Random random{uint64_t(id), uint64_t(*draw)};
    *drawn = kernel_tests::DrawForKernel(&random, row);
    drawn->seed = uint64_t(id);
    drawn->number = uint64_t((*draw)++);
    *handle = CreateEngine(drawn->dst.record, drawn->src.record, drawn->params);
    if (!*handle || !kernel_tests::Takes(id, *(*handle)->pass[0]->context)) {
      continue;
    }
    BuildEngine(drawn->dst.record, drawn->src.record, drawn->params, drawn->params.passMode, model);
    kernel_tests::DrawBand(&random, *model, drawn);
    if (bench->Prepare(*drawn, *model)) {
      return true;
    }
  }
  return false;
}

int RunKernels(const Options& options) {
  static kernel_tests::KernelBench bench;
  int calls = 0;
  for (int id = options.share; id < kernel_tests::kCallableCount; id += options.shares) {
    const kestrel::KernelRow& row = kernel_tests::RowOf(id);
    int draw = 0;
    for (int job = 0; job < options.kernelJobs; ++job) {
      Case drawn{};
      reference::Engine model;
      EngineHandle handle;
      if (!DrawAccepted(id, &draw, &bench, &drawn, &model, &handle)) {
        Fail({row.name, "no set", drawn}, "too few engines suit the kernel");
      }
      KeepPixelsOnly(drawn.src, bench.sourceBlocks());
      UndefineBlocks(drawn.dst, bench.expectedBlocks());
      bench.CallModel(reference::QuirksOf(row.name));
      for (const InstructionSet& set : InstructionSets()) {
        const Where where = {row.name, set.name.c_str(), drawn};
        UndefineBlocks(drawn.dst, bench.gotBlocks());
        ForceRows(handle.get(), set);
        if (bench.Call(kernel_tests::EntryOf(id), handle->pass[0]->context) != KESTREL_OK) {
          Fail(where, "the job is refused");
        }
        const char* const fault = Compare(drawn.dst, bench.gotBlocks(), bench.expectedBlocks());
        if (fault) {
          Fail(where, fault);
        }
        ++calls;
      }
      UndefineBlocks(drawn.src, bench.sourceBlocks());
    }
  }
  return calls;
}

// ---- Engines ----

// The road of a caller: creation, planning, processing through both entry points, destruction.
uint32_t RunEngine(const reference::Job& job, const InstructionSet& set, bool throughEx) {
  MPPFORMAT dst = job.dst;
  MPPFORMAT src = job.src;
  MPPPARAM params = job.params;
  MPPHandle* handle = nullptr;
  uint32_t code = MPPCreate(&dst, &src, &params, &handle);
  if (code != KESTREL_OK) {
    return code;
  }
  ForceRows(handle, set);
  MRECT dstRect = job.rect;
  MRECT srcRect = {};
  if (job.hasRect && MPPAlign(handle, &dstRect, &srcRect) == KESTREL_OK &&
      watch::FirstUndefined(&srcRect, sizeof(srcRect)) >= 0) {
    std::printf("FAULT: MPPAlign answers with a rectangle without a value\n");
    std::abort();
  }
  const MRECT* const rect = job.hasRect ? &job.rect : nullptr;
  constexpr MRECT kOrigin = {0, 0, 0, 0};
  code = throughEx ? MPProcessEx(handle, job.dstPlanes, &kOrigin, rect, job.dstPitches,
                                 job.srcPlanes, job.srcPitches)
                   : MPProcess(handle, job.dstPlanes, rect, job.dstPitches, job.srcPlanes,
                               job.srcPitches);
  MPPDestroy(handle);
  return code;
}

// One case with every set; `isWhole`: it draws the whole of an image without margins.
int RunCase(const Case& drawn, bool isWhole, const char* what) {
  static fuzz::Images images;
  fuzz::Job job;
  job.drawn = drawn;
  images.Prepare(job);
  KeepPixelsOnly(drawn.src, images.source());
  UndefineBlocks(drawn.dst, images.model());
  const uint32_t expected = reference::Convert(images.JobOnModel());
  int runs = 0;
  for (const InstructionSet& set : InstructionSets()) {
    const Where where = {what, set.name.c_str(), drawn};
    UndefineBlocks(drawn.dst, images.product());
    if (RunEngine(images.JobOnProduct(), set, drawn.number % 4 == 3) != expected) {
      Fail(where, "another code than that of the model");
    }
    const char* const fault = Compare(drawn.dst, images.product(), images.model());
    if (fault) {
      Fail(where, fault);
    }
    if (isWhole && expected == KESTREL_OK) {
      const uint8_t* tops[3] = {};
      for (int i = 0; i < drawn.dst.blocks.count; ++i) {
        tops[i] = images.product()[i].top;
      }
      if (!IsComplete(drawn.dst, tops, drawn.dst.pitches)) {
        Fail(where, "a pixel is left out");
      }
    }
    ++runs;
  }
  UndefineBlocks(drawn.src, images.source());
  return runs;
}

int RunCases(const Options& options) {
  int runs = 0;
  for (int number = options.share; number < options.cases; number += options.shares) {
    runs += RunCase(differential::DrawCase(7, uint64_t(number)), false, "a random case");
  }
  return runs;
}

// Every pair of formats, whole and upright; all sides from 1 to 70 are met.
Case DrawPicture(uint32_t dstCode, uint32_t srcCode, int number) {
  static const uint8_t kSomePalette[4] = {0, 0, 0, 0};
  Random random(8, uint64_t(number));
  Case drawn{};
  drawn.seed = 8;
  drawn.number = uint64_t(number);
  drawn.dst.record = {dstCode, 1 + number % 70, random.Between(1, 70), nullptr};
  drawn.src.record = {srcCode, random.Between(1, 70), 1 + number / 70 % 70, nullptr};
  if (random.Percent(40)) {
    drawn.src.record.width = drawn.dst.record.width;
    drawn.src.record.height = drawn.dst.record.height;
  }
  if (testing_support::IsIndexedCode(srcCode)) {
    drawn.src.record.palette = kSomePalette;
  }
  constexpr uint32_t kPassModes[] = {MPP_PASS_TILED, MPP_PASS_TILED, 1, 2, 3, 4};
  drawn.params.passMode = random.Pick(kPassModes);
  drawn.params.resampleFlags = random.Percent(60) ? MPP_BILINEAR : MPP_NEAREST;
  drawn.params.dither = random.Percent(30);
  drawn.params.contrast = random.Percent(30) ? random.Between(-128, 128) : 0;
  DrawSide(&random, drawn.dst.record.width, drawn.dst.record.height, &drawn.dst);
  DrawSide(&random, drawn.src.record.width, drawn.src.record.height, &drawn.src);
  drawn.dst.nullSlot = drawn.src.nullSlot = -1;
  return drawn;
}

int RunPictures(const Options& options) {
  int runs = 0;
  int number = 0;
  for (int round = 0; round < options.pictures; ++round) {
    for (const uint32_t dstCode : kDestinations) {
      for (const uint32_t srcCode : kSources) {
        if (++number % options.shares == options.share) {
          runs += RunCase(DrawPicture(dstCode, srcCode, number), true, "a whole picture");
        }
      }
    }
  }
  return runs;
}

// ---- Wide pictures ----

// One format of every way of reading and writing rows.
constexpr uint32_t kWideFormats[] = {FORMAT_RGB565, FORMAT_RGB888, FORMAT_XBGR8888,
                                     FORMAT_INDEX8, FORMAT_YUYV,   FORMAT_UYVY_SWAPPED_LUMA,
                                     FORMAT_YUV444, FORMAT_I420,   FORMAT_I422,
                                     FORMAT_GRAY8,  FORMAT_NV21};

// Rows farther apart than they are long, half of them upside down.
void SpreadRows(Random* random, Side* side) {
  for (int i = 0; i < side->blocks.count; ++i) {
    const int32_t pitch = side->blocks.block[i].rowBytes + random->Between(1, 90);
    side->pitches[i] = random->Percent(50) ? pitch : -pitch;
  }
  if (side->blocks.count == 2) {
    side->pitches[2] = side->pitches[1];
  }
}

// Pictures that are wider, or after a turn taller, than any buffer of a row, most of them enlarged.
// The rounds of a pair are the ways of scaling and the widths.
Case DrawWide(uint32_t dstCode, uint32_t srcCode, int round, int number) {
  static const uint8_t kSomePalette[4] = {0, 0, 0, 0};
  Random random(10, uint64_t(number));
  Case drawn{};
  drawn.seed = 10;
  drawn.number = uint64_t(number);
  MPPPARAM& params = drawn.params;
  params.passMode = random.Percent(50) ? MPP_PASS_TILED : uint32_t(random.Between(1, 4));
  params.resampleFlags = round % 2 == 0 ? MPP_BILINEAR : MPP_NEAREST;
  params.transformCode = random.Percent(50) ? 0 : uint32_t(random.Between(0, 7));
  params.dither = random.Percent(30);
  const int32_t width = (round / 2 % 2 == 0 ? 2100 : 4200) + random.Between(0, 3);
  const int32_t height = random.Between(2, 5);
  const int32_t kind = random.Between(1, 10);
  int32_t srcWidth = random.Between(width / 8, width - 1);
  int32_t srcHeight = random.Between(1, height);
  if (kind <= 2) {  // doubled
    srcWidth = (width + 1) / 2;
    srcHeight = (height + 1) / 2;
  } else if (kind == 3) {  // reduced
    srcWidth = random.Between(width, width + 500);
    srcHeight = height + 2;
  }
  const bool swaps = (params.transformCode & MPP_SWAP_XY) != 0;
  drawn.dst.record = {dstCode, swaps ? height : width, swaps ? width : height, nullptr};
  drawn.src.record = {srcCode, srcWidth, srcHeight, nullptr};
  if (testing_support::IsIndexedCode(srcCode)) {
    drawn.src.record.palette = kSomePalette;
  }
  drawn.hasRect = random.Percent(30);
  if (drawn.hasRect) {
    const int32_t left = swaps ? 0 : random.Between(1, 9);
    const int32_t top = swaps ? random.Between(1, 9) : 0;
    drawn.rect = {left, top, drawn.dst.record.width, drawn.dst.record.height};
  }
  for (Side* const side : {&drawn.dst, &drawn.src}) {
    DrawSide(&random, side->record.width, side->record.height, side);
    side->nullSlot = -1;
    if (random.Percent(75)) {
      SpreadRows(&random, side);
    }
  }
  return drawn;
}

int RunWide(const Options& options) {
  int runs = 0;
  int number = 0;
  for (int round = 0; round < options.wide; ++round) {
    for (const uint32_t dstCode : kWideFormats) {
      for (const uint32_t srcCode : kWideFormats) {
        // Pairs begin with different rounds: few rounds have them all as well.
        const int turn = round + number;
        if (IsFullyDrawn(dstCode) && ++number % options.shares == options.share) {
          const Case drawn = DrawWide(dstCode, srcCode, turn, number);
          // A mirrored walk meets blocks of pixels out of phase, and leaves parts of them out.
          const bool isWhole = !drawn.hasRect && drawn.params.transformCode == 0;
          runs += RunCase(drawn, isWhole, "a wide picture");
        }
      }
    }
  }
  return runs;
}

// ---- Buffers and the one-shot conversion ----

// A buffer of the library, and where its pixels are. False when the format cannot be allocated.
struct Buffer {
  MBITMAP bitmap = {};
  Side side = {};
  uint8_t* tops[3] = {};
  int32_t pitches[3] = {};

  bool Allocate(uint32_t format, int32_t width, int32_t height) {
    bitmap.format = format;
    bitmap.width = width;
    bitmap.height = height;
    if (MBitmapAlloc(&bitmap) != KESTREL_OK) {
      return false;
    }
    side.record = {format, width, height, nullptr};
    reference::DecodeFormat(side.record, &side.format);
    side.blocks = differential::BlocksOf(side.format, width, height, false);
    for (int i = 0; i < side.blocks.count; ++i) {
      const int slot = side.blocks.count == 3 && side.format.HasVPlaneFirst() && i > 0 ? 3 - i : i;
      tops[i] = side.blocks.count == 2 && i == 1 ? std::min(bitmap.plane[1], bitmap.plane[2])
                                                 : bitmap.plane[slot];
      pitches[i] = bitmap.pitch[slot];
    }
    return true;
  }

  void Fill(Random* random) {
    for (int i = 0; i < side.blocks.count; ++i) {
      for (int32_t row = 0; row < side.blocks.block[i].rows; ++row) {
        random->Fill(tops[i] + ptrdiff_t(pitches[i]) * row, size_t(side.blocks.block[i].rowBytes));
      }
    }
  }
};

// Whether an image could be converted into another, which is then whole.
bool RunOneShot(uint32_t dstCode, uint32_t srcCode, int number) {
  Random random(9, uint64_t(number));
  Buffer from, to;
  bool converts = false;
  if (from.Allocate(srcCode, random.Between(1, 70), random.Between(1, 70)) &&
      to.Allocate(dstCode, random.Between(1, 70), random.Between(1, 70))) {
    from.Fill(&random);
    const MBITMAP& src = from.bitmap;
    const MBITMAP& dst = to.bitmap;
    // The source is cut to the shape of the destination, in steps of up to four pixels: of long and
    // narrow shapes nothing may be left.
    const bool isLeft =
        src.height * dst.width >= 4 * dst.height && src.width * dst.height >= 4 * dst.width;
    converts = ConvertCS(&src, &dst) == KESTREL_OK && isLeft;
    if (converts && !IsComplete(to.side, to.tops, to.pitches)) {
      Case drawn{};
      drawn.dst = to.side;
      drawn.src = from.side;
      Fail({"ConvertCS", "as created", drawn}, "a pixel is left out");
    }
    dumpBitmap2("/dev/null", &src);
  }
  MBitmapFree(&from.bitmap);
  MBitmapFree(&to.bitmap);
  return converts;
}

int RunOneShots(const Options& options) {
  int runs = 0;
  int number = 0;
  for (const uint32_t dstCode : kDestinations) {
    for (const uint32_t srcCode : kSources) {
      if (++number % options.shares == options.share) {
        runs += RunOneShot(dstCode, srcCode, number) ? 1 : 0;
      }
    }
  }
  return runs;
}

// ---- The watcher itself ----

// A sample without a value must arrive as one: otherwise nothing above could fail. All sets copy.
void RequireThatTheWatcherSees() {
  constexpr int32_t kSide = 40;
  static uint8_t from[kSide * kSide], to[kSide * kSide];
  std::memset(from, 1, sizeof(from));
  const MPPFORMAT record = {FORMAT_GRAY8, kSide, kSide, nullptr};
  constexpr int32_t kPitches[3] = {kSide, 0, 0};
  for (const InstructionSet& set : InstructionSets()) {
    for (int at = 0; at < kSide * kSide; at += 123) {
      MPPPARAM params = {};
      params.transformCode = at % 2 == 0 ? 0 : MPP_MIRROR_X | MPP_MIRROR_Y;
      const EngineHandle handle = CreateEngine(record, record, params);
      ForceRows(handle.get(), set);
      watch::Undefine(from + at, 1);
      uint8_t* const toPlanes[3] = {to, nullptr, nullptr};
      const uint8_t* const fromPlanes[3] = {from, nullptr, nullptr};
      MPProcess(handle.get(), toPlanes, nullptr, kPitches, fromPlanes, kPitches);
      const int arrived = at % 2 == 0 ? at : kSide * kSide - 1 - at;
      if (watch::FirstUndefined(to, sizeof(to)) != arrived ||
          watch::FirstUndefined(to + arrived + 1, sizeof(to) - size_t(arrived) - 1) >= 0) {
        Fail({"a copy", set.name.c_str(), {}}, "the watcher lost a sample without a value");
      }
      from[at] = 1;
    }
  }
}

bool ParseNumber(const char* text, int* number) {
  char* end = nullptr;
  const auto value = std::strtol(text, &end, 10);
  *number = int(value);
  return end != text && *end == '\0' && value >= 0 && value <= 1000000;
}

bool ParseOptions(int argc, char** argv, Options* options) {
  for (int i = 1; i + 1 < argc; i += 2) {
    int* const target = std::strcmp(argv[i], "--kernel-jobs") == 0 ? &options->kernelJobs
                        : std::strcmp(argv[i], "--cases") == 0     ? &options->cases
                        : std::strcmp(argv[i], "--pictures") == 0  ? &options->pictures
                        : std::strcmp(argv[i], "--wide") == 0      ? &options->wide
                        : std::strcmp(argv[i], "--share") == 0     ? &options->share
                        : std::strcmp(argv[i], "--shares") == 0    ? &options->shares
                                                                   : nullptr;
    if (!target || !ParseNumber(argv[i + 1], target)) {
      return false;
    }
  }
  return argc % 2 == 1 && options->share < options->shares;
}

}  // namespace

int main(int argc, char** argv) {
  Options options;
  if (!ParseOptions(argc, argv, &options)) {
    std::fprintf(stderr,
                 "usage: memory_sweep [--kernel-jobs N] [--cases N] [--pictures N] [--wide N] "
                 "[--share I --shares N]\n"
                 "N jobs of every kernel, N random cases, N pictures of every pair of formats, N\n"
                 "wide ones of every pair of some formats; of all these the I-th (from 0) of N\n"
                 "shares.\n");
    return 2;
  }
  if (!watch::Watcher()) {
    std::fprintf(stderr,
                 "memory_sweep: nobody watches; run it under valgrind, or build it with "
                 "MemorySanitizer\n");
    return 2;
  }
  RequireThatTheWatcherSees();
  const int kernels = RunKernels(options);
  const int cases = RunCases(options);
  const int pictures = RunPictures(options);
  const int wide = RunWide(options);
  const int oneShots = RunOneShots(options);
  std::printf(
      "%s, share %d of %d, %zu instruction sets: %d calls of kernels, %d random cases, "
      "%d whole pictures, %d wide ones, %d one-shot conversions\n",
      watch::Watcher(), options.share, options.shares, InstructionSets().size(), kernels, cases,
      pictures, wide, oneShots);
  return 0;
}
