// Every kernel of the table over all lengths of both directions and some that are cut into strips,
// and the generic converter over all pairs of formats, with every instruction set. The planes are
// tight, and lie flush against the page before them, flush against the page after them, and at odd
// addresses. All bytes must be those of the model. Random jobs of kernels are elsewhere; this walk
// leaves no length, edge, pair or set to chance.
#include <algorithm>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <string>

#include "tests/kernels/kernel_case.h"
#include "tests/reference/chooser.h"
#include "tests/support/formats.h"
#include "tests/support/instruction_sets.h"

namespace kernel_tests {
namespace {

using differential::Case;
using differential::Random;
using differential::Side;
using testing_support::GuardedBuffer;
using testing_support::InstructionSet;

constexpr int kLongest = 70;
constexpr int kStripLengths[] = {130, 514};  // more than a strip, upright or turned by a quarter
constexpr int kMostDraws = 100000;           // until an engine suits a kernel

// Of the generic converter: a pair of formats meets every so many lengths, the next pair those
// beside, and one of these.
constexpr int kPairStride = 24;
constexpr int kPairLongLengths[] = {130, 514, 1030, 2060};

enum class Place { kStart, kEnd, kOdd, kCount };

struct Options {
  int crossings = 3;  // lengths in the other direction that each length is met with
  std::string kernel;
};

// What a crash handler can still say.
struct {
  const char* kernel = "";
  const char* set = "the model";
  const Case* drawn = nullptr;
} current;

void Report(const std::string& what) {
  std::printf("FAULT in %s with %s: %s\n%s  reproduce with: kernel_walk --kernel %s\n",
              current.kernel, current.set, what.c_str(),
              current.drawn ? Describe(*current.drawn).c_str() : "", current.kernel);
  std::fflush(stdout);
}

extern "C" void ReportCrash(int signalNumber) {
  std::signal(signalNumber, SIG_DFL);  // the faulting instruction runs again and ends the program
  Report("signal " + std::to_string(signalNumber));
}

// The side that is walked becomes width x height in the order of the walk; a job at 1:1 has both
// sides alike.
void Resize(int width, int height, bool ofSource, Case* drawn) {
  const bool swaps = (drawn->params.transformCode & MPP_SWAP_XY) != 0;
  MPPFORMAT& dst = drawn->dst.record;
  MPPFORMAT& src = drawn->src.record;
  const bool isUnit = src.width == (swaps ? dst.height : dst.width) &&
                      src.height == (swaps ? dst.width : dst.height);
  if (isUnit || ofSource) {
    src.width = width;
    src.height = height;
  }
  if (isUnit || !ofSource) {
    dst.width = swaps ? height : width;
    dst.height = swaps ? width : height;
  }
}

void PlaceAt(Place place, Random* random, Side* side) {
  for (int i = 0; i < side->blocks.count; ++i) {
    const int32_t bytes = side->blocks.block[i].rowBytes;
    const bool isUpsideDown = side->pitches[i] < 0;
    if (place == Place::kOdd) {
      const int32_t pitch = bytes + random->Between(0, 40);
      side->pitches[i] = isUpsideDown ? -pitch : pitch;
      side->placement[i] = {
          random->Percent(50) ? GuardedBuffer::Edge::kStart : GuardedBuffer::Edge::kEnd, 64,
          uint32_t(random->Between(0, 31)) * 2 + 1};
    } else {
      side->pitches[i] = isUpsideDown ? -bytes : bytes;
      side->placement[i] = {
          place == Place::kStart ? GuardedBuffer::Edge::kStart : GuardedBuffer::Edge::kEnd, 1, 0};
    }
  }
  if (side->blocks.count == 2) {
    side->pitches[2] = side->pitches[1];
  }
}

struct Pair {
  uint32_t src;
  uint32_t dst;
};

class Walk {
 public:
  Walk(int id, KernelBench* bench) : id_(id), row_(RowOf(id)), bench_(*bench) {}

  // False when something is wrong, which is then reported.
  bool Run(int crossings) {
    for (int length = 1; length <= kLongest; ++length) {
      for (int crossing = 0; crossing < crossings; ++crossing) {
        if (!RunCrossing(length, Other(crossing, crossings))) {
          return false;
        }
      }
    }
    for (const int length : kStripLengths) {
      for (int crossing = 0; crossing < crossings; ++crossing) {
        if (!RunCrossing(length, random_.Between(33, 40))) {  // whole tiles
          return false;
        }
      }
    }
    return true;
  }

  // The same of the generic converter for all pairs of formats.
  bool RunPairs(int crossings) {
    constexpr auto kCodes = testing_support::PublicCodes();
    for (const uint32_t src : kCodes) {
      for (const uint32_t dst : kCodes) {
        pair_ = {src, dst};
        if (!RunPair(crossings)) {
          return false;
        }
        ++pairs_;
      }
    }
    return true;
  }

  int pairs() const { return pairs_; }
  uint64_t calls() const { return calls_; }
  uint64_t pictures() const { return pictures_; }

 private:
  bool RunPair(int crossings) {
    for (int crossing = 0; crossing < crossings; ++crossing) {
      for (int length = 1 + pairs_ % kPairStride; length <= kLongest; length += kPairStride) {
        if (!RunCrossing(length, Other(crossing, crossings))) {
          return false;
        }
      }
      const int turn = pairs_ + crossing;
      const int length = kPairLongLengths[size_t(turn) % std::size(kPairLongLengths)];
      if (!RunSize(length, random_.Between(1, 9), turn % 8 < 4)) {
        return false;
      }
    }
    return true;
  }

  // A short one first, which is quick; all of them when there are as many crossings.
  int Other(int crossing, int crossings) {
    if (crossings == kLongest) {
      return crossing + 1;
    }
    return crossing == 0 ? random_.Between(2, 9) : crossing == 1 ? 1 : random_.Between(3, kLongest);
  }

  bool RunCrossing(int length, int other) {
    for (const bool ofSource : {false, true}) {
      if (!RunSize(length, other, ofSource) || !RunSize(other, length, ofSource)) {
        return false;
      }
    }
    return true;
  }

  bool RunSize(int width, int height, bool ofSource) {
    Case drawn;
    reference::Engine model;
    EngineHandle handle;
    if (!Draw(width, height, ofSource, &drawn, &model, &handle)) {
      Report("no engine of " + std::to_string(width) + " x " + std::to_string(height) + " suits");
      return false;
    }
    for (int place = 0; place < int(Place::kCount); ++place) {
      PlaceAt(Place(place), &random_, &drawn.dst);
      PlaceAt(Place(place), &random_, &drawn.src);
      if (!RunPicture(drawn, model, handle.get())) {
        return false;
      }
    }
    return true;
  }

  // An engine that the kernel accepts, for the whole of an image without margins.
  bool Draw(int width, int height, bool ofSource, Case* drawn, reference::Engine* model,
            EngineHandle* handle) {
    for (int draw = 0; draw < kMostDraws; ++draw) {
      *drawn = DrawForKernel(&random_, row_);
      if (id_ == kGenericConverter) {
        drawn->src.record.format = WithStandard(pair_.src);
        drawn->dst.record.format = WithStandard(pair_.dst);
        bench_.SupplyPalette(&drawn->src.record);
      }
      MPPPARAM& params = drawn->params;
      params.srcRect = {};
      params.srcOriginX = params.srcOriginY = params.dstOriginX = params.dstOriginY = 0;
      params.aspectMode = 0;
      Resize(width, height, ofSource, drawn);
      *handle = CreateEngine(drawn->dst.record, drawn->src.record, params);
      if (!*handle || !Takes(id_, *(*handle)->pass[0]->context)) {
        continue;
      }
      *model = {};
      BuildEngine(drawn->dst.record, drawn->src.record, params, params.passMode, model);
      drawn->seed = uint64_t(id_);
      drawn->number = ++number_;
      DrawBand(&random_, *model, drawn);
      drawn->rect = {0, 0, drawn->dst.record.width, drawn->dst.record.height};
      DrawSide(&random_, drawn->dst.record.width, drawn->dst.record.height, &drawn->dst);
      drawn->dst.nullSlot = -1;
      return true;
    }
    return false;
  }

  uint32_t WithStandard(uint32_t code) {
    return testing_support::HasStandard(code) ? code | uint32_t(random_.Between(0, 3)) << 12 : code;
  }

  bool RunPicture(const Case& drawn, const reference::Engine& model, MPPHandle* handle) {
    current = {row_.name, "the model", &drawn};
    if (!bench_.Prepare(drawn, model)) {
      Report("there is nothing to draw");
      return false;
    }
    bench_.CallModel(reference::QuirksOf(row_.name));
    ++pictures_;
    for (const InstructionSet& set : testing_support::InstructionSets()) {
      current.set = set.name.c_str();
      bench_.Restore();
      ForceRows(handle, set);
      const uint32_t code = bench_.Call(EntryOf(id_), handle->pass[0]->context);
      const std::string difference =
          code == KESTREL_OK ? bench_.Difference() : "the kernel answers " + std::to_string(code);
      if (!difference.empty()) {
        Report(difference);
        return false;
      }
      ++calls_;
    }
    current.drawn = nullptr;
    return true;
  }

  const int id_;
  const kestrel::KernelRow& row_;
  KernelBench& bench_;
  Random random_{uint64_t(id_), 4000};
  Pair pair_ = {};
  int pairs_ = 0;
  uint64_t number_ = 0;
  uint64_t calls_ = 0;
  uint64_t pictures_ = 0;
};

bool ParseOptions(int argc, char** argv, Options* options) {
  for (int i = 1; i + 1 < argc; i += 2) {
    if (std::strcmp(argv[i], "--kernel") == 0) {
      options->kernel = argv[i + 1];
    } else if (std::strcmp(argv[i], "--crossings") == 0) {
      char* end = nullptr;
      options->crossings = int(std::strtol(argv[i + 1], &end, 10));
      if (*end != '\0') {
        return false;
      }
    } else {
      return false;
    }
  }
  return argc % 2 == 1 && options->crossings >= 1 && options->crossings <= kLongest;
}

int RunAll(const Options& options) {
  for (const int signalNumber : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT}) {
    std::signal(signalNumber, ReportCrash);
  }
  KernelBench bench;
  int kernels = 0;
  int pairs = 0;
  uint64_t pictures = 0;
  uint64_t calls = 0;
  for (int id = 0; id < kCallableCount; ++id) {
    if (!options.kernel.empty() && options.kernel != RowOf(id).name) {
      continue;
    }
    current.kernel = RowOf(id).name;
    Walk walk(id, &bench);
    const bool isGeneric = id == kGenericConverter;
    if (!(isGeneric ? walk.RunPairs(options.crossings) : walk.Run(options.crossings))) {
      return 1;
    }
    kernels += isGeneric ? 0 : 1;
    pairs += walk.pairs();
    pictures += walk.pictures();
    calls += walk.calls();
  }
  std::printf(
      "%d kernels, all lengths from 1 to %d with %d others each, %d pairs of formats of the "
      "generic "
      "converter: %llu pictures, %llu calls, all bytes equal with each of: %s\n",
      kernels, kLongest, options.crossings, pairs, static_cast<unsigned long long>(pictures),
      static_cast<unsigned long long>(calls), NamesOf(testing_support::InstructionSets()).c_str());
  return pictures > 0 ? 0 : 1;
}

}  // namespace
}  // namespace kernel_tests

int main(int argc, char** argv) {
  kernel_tests::Options options;
  if (!kernel_tests::ParseOptions(argc, argv, &options)) {
    std::fprintf(stderr,
                 "usage: kernel_walk [--crossings N] [--kernel NAME]\n"
                 "N: how many lengths of the other direction each length is met with, up to 70,\n"
                 "which is every size.\n");
    return 2;
  }
  return kernel_tests::RunAll(options);
}
