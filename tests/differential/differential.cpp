// Random conversions through the public interface, every byte compared with the plain model, for
// every instruction set that the CPU can run.
#include <algorithm>
#include <csignal>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <initializer_list>
#include <memory>
#include <string>
#include <vector>

#include "engine/postprocess.h"
#include "tests/differential/case.h"
#include "tests/differential/placed.h"
#include "tests/reference/reference.h"
#include "tests/support/guarded_buffer.h"
#include "tests/support/instruction_sets.h"

namespace differential {
namespace {

using testing_support::GuardedBuffer;
using testing_support::InstructionSet;

constexpr size_t kCapacity = size_t{1} << 22;

// What a crash handler can still say.
volatile std::sig_atomic_t crashInModel = 0;
uint64_t currentSeed = 0;
uint64_t currentNumber = 0;
const char* currentRows = "";
const char* currentLengths = "";  // as an option

extern "C" void ReportCrash(int signalNumber) {
  char line[200];
  const int length =
      std::snprintf(line, sizeof(line),
                    "signal %d in the %s; reproduce with: differential --seed %llu "
                    "--first %llu --cases 1 --verbose%s --rows '%s'\n",
                    signalNumber, crashInModel ? "model" : "library",
                    static_cast<unsigned long long>(currentSeed),
                    static_cast<unsigned long long>(currentNumber), currentLengths, currentRows);
  std::fwrite(line, 1, size_t(length), stderr);
  std::signal(signalNumber, SIG_DFL);  // the faulting instruction runs again and ends the program
}

class Bench {
 public:
  Bench() : palette_(1024) {
    for (int i = 0; i < 3; ++i) {
      source_[i] = std::make_unique<GuardedBuffer>(kCapacity);
      product_[i] = std::make_unique<GuardedBuffer>(kCapacity);
      model_[i] = std::make_unique<GuardedBuffer>(kCapacity);
    }
  }

  // Empty when model and product agree with each of the sets, otherwise what differs. The last
  // one that ran is currentRows.
  std::string Run(const Case& drawn, const std::vector<InstructionSet>& sets) {
    Random random(drawn.seed ^ 0x5bd1e995, drawn.number);
    PlacedBlock source[3] = {}, product[3] = {}, model[3] = {};
    for (int i = 0; i < drawn.src.blocks.count; ++i) {
      source[i] = Place(source_[i].get(), drawn.src, i);
      FillContent(&random, drawn.content, source[i].watched, source[i].watchedSize);
    }
    for (int i = 0; i < drawn.dst.blocks.count; ++i) {
      product[i] = Place(product_[i].get(), drawn.dst, i);
      model[i] = Place(model_[i].get(), drawn.dst, i);
      random.Fill(product[i].watched, product[i].watchedSize);
      std::memcpy(model[i].watched, product[i].watched, product[i].watchedSize);
    }

    reference::Job job{};
    job.dst = drawn.dst.record;
    job.src = drawn.src.record;
    if (job.src.palette) {
      const size_t size = size_t{4} << drawn.src.format.bitsPerPixel;
      uint8_t* const palette = palette_.Place(size, GuardedBuffer::Edge::kEnd);
      random.Fill(palette, size);
      job.src.palette = palette;
    }
    job.params = drawn.params;
    job.hasRect = drawn.hasRect;
    job.rect = drawn.rect;
    SetPlanes(drawn.src, source, job.srcPlanes, job.srcPitches);
    SetPlanes(drawn.dst, model, job.dstPlanes, job.dstPitches);
    crashInModel = 1;
    const uint32_t expectedCode = reference::Convert(job);
    crashInModel = 0;
    for (int i = 0; i < drawn.dst.blocks.count; ++i) {
      if (std::memcmp(model[i].watched, product[i].watched, product[i].watchedSize) != 0) {
        ++drew_;
        break;
      }
    }

    refused_ += expectedCode != KESTREL_OK;

    std::vector<uint8_t> before[3];
    for (int i = 0; i < drawn.dst.blocks.count; ++i) {
      before[i].assign(product[i].watched, product[i].watched + product[i].watchedSize);
    }
    uint8_t* productPlanes[3];
    SetPlanes(drawn.dst, product, productPlanes, job.dstPitches);
    for (const InstructionSet& set : sets) {
      currentRows = set.name.c_str();
      for (int i = 0; i < drawn.dst.blocks.count; ++i) {
        std::copy(before[i].begin(), before[i].end(), product[i].watched);
      }
      bool recordsKept = false;
      const uint32_t code = RunProduct(job, productPlanes, set, &recordsKept);
      if (code != expectedCode) {
        return "code " + std::to_string(code) + ", expected " + std::to_string(expectedCode);
      }
      if (!recordsKept) {
        return "the records of the caller have changed";
      }
      std::string difference = Difference(drawn.dst, product, model);
      if (!difference.empty()) {
        return difference;
      }
    }
    return "";
  }

  uint64_t refused() const { return refused_; }
  uint64_t drew() const { return drew_; }

 private:
  static uint32_t RunProduct(const reference::Job& job, uint8_t* const* planes,
                             const InstructionSet& set, bool* recordsKept) {
    MPPFORMAT dst = job.dst;
    MPPFORMAT src = job.src;
    MPPPARAM params = job.params;
    MPPHandle* handle = nullptr;
    uint32_t code = MPPCreate(&dst, &src, &params, &handle);
    *recordsKept = dst.format == job.dst.format && src.format == job.src.format &&
                   std::memcmp(&params, &job.params, sizeof(params)) == 0;
    if (code == KESTREL_OK) {
      ForceRows(handle, set);
      code = MPProcess(handle, planes, job.hasRect ? &job.rect : nullptr, job.dstPitches,
                       job.srcPlanes, job.srcPitches);
      MPPDestroy(handle);
    }
    return code;
  }

  std::unique_ptr<GuardedBuffer> source_[3], product_[3], model_[3];
  GuardedBuffer palette_;
  uint64_t refused_ = 0;
  uint64_t drew_ = 0;
};

struct Options {
  uint64_t cases = 2000;
  uint64_t seed = 1;
  uint64_t first = 0;
  uint64_t failures = 1;
  bool verbose = false;
  Lengths lengths = Lengths::kUsual;
  std::string rows;  // none: all of them
};

int Usage() {
  std::fprintf(stderr,
               "usage: differential [--cases N] [--seed S] [--first K] [--failures F] [--verbose] "
               "[--long] [--rows NAME]\n"
               "Runs the cases K..K+N-1 of seed S and stops after F failures.\n"
               "--long: of wide and of tall pictures.\n"
               "--rows: with one instruction set only, of: %s\n",
               NamesOf(testing_support::InstructionSets()).c_str());
  return 2;
}

bool ParseOptions(int argc, char** argv, Options* options) {
  for (int i = 1; i < argc; ++i) {
    const std::string name = argv[i];
    if (name == "--verbose") {
      options->verbose = true;
      continue;
    }
    if (name == "--long") {
      options->lengths = Lengths::kLong;
      continue;
    }
    if (name == "--rows" && i + 1 < argc) {
      options->rows = argv[++i];
      continue;
    }
    uint64_t* const target = name == "--cases"      ? &options->cases
                             : name == "--seed"     ? &options->seed
                             : name == "--first"    ? &options->first
                             : name == "--failures" ? &options->failures
                                                    : nullptr;
    if (!target || i + 1 == argc) {
      return false;
    }
    char* end = nullptr;
    *target = std::strtoull(argv[++i], &end, 10);
    if (*end != '\0' || end == argv[i]) {
      return false;
    }
  }
  return true;
}

int RunCases(const Options& options) {
  for (int signalNumber : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT}) {
    std::signal(signalNumber, ReportCrash);
  }
  const std::vector<InstructionSet> sets = testing_support::InstructionSetsNamed(options.rows);
  if (sets.empty()) {
    return Usage();
  }
  Bench bench;
  uint64_t failures = 0;
  currentSeed = options.seed;
  if (options.lengths == Lengths::kLong) {
    currentLengths = " --long";
  }
  for (uint64_t i = 0; i < options.cases && failures < options.failures; ++i) {
    currentNumber = options.first + i;
    const Case drawn = DrawCase(options.seed, currentNumber, options.lengths);
    if (options.verbose) {
      std::fprintf(stderr, "%s", Describe(drawn).c_str());
    }
    const std::string difference = bench.Run(drawn, sets);
    if (!difference.empty()) {
      ++failures;
      std::printf(
          "MISMATCH in %s  %s\n  reproduce with: differential --seed %llu --first %llu --cases "
          "1%s --rows '%s'\n",
          Describe(drawn).c_str(), difference.c_str(),
          static_cast<unsigned long long>(options.seed),
          static_cast<unsigned long long>(currentNumber), currentLengths, currentRows);
      std::fflush(stdout);  // the next case may crash
    }
  }
  if (failures != 0) {
    return 1;
  }
  std::printf(
      "%llu cases of seed %llu: %llu wrote pixels, %llu were refused, all bytes equal with "
      "each of: %s\n",
      static_cast<unsigned long long>(options.cases), static_cast<unsigned long long>(options.seed),
      static_cast<unsigned long long>(bench.drew()),
      static_cast<unsigned long long>(bench.refused()), NamesOf(sets).c_str());
  if (options.cases >= 1000 && bench.drew() < options.cases / 2) {
    std::printf("too few of the cases wrote anything: they no longer test what they should\n");
    return 1;
  }
  return 0;
}

}  // namespace
}  // namespace differential

int main(int argc, char** argv) {
  differential::Options options;
  if (!differential::ParseOptions(argc, argv, &options)) {
    return differential::Usage();
  }
  return differential::RunCases(options);
}
