// Random calls of both Java natives, by number: nothing may crash, stay locked, held, referenced or
// allocated, and no call of the virtual machine may follow an exception.
#include <csignal>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "tests/differential/random.h"
#include "tests/jni/random_call.h"

namespace {

struct Options {
  uint64_t calls = 20000;
  uint64_t seed = 1;
  uint64_t first = 0;
};

// What a crash handler can still say.
uint64_t currentSeed = 0;
uint64_t currentCall = 0;

extern "C" void ReportCrash(int signalNumber) {
  std::fprintf(stderr,
               "signal %d; reproduce with: hostile_natives --seed %llu --first %llu --calls 1\n",
               signalNumber, static_cast<unsigned long long>(currentSeed),
               static_cast<unsigned long long>(currentCall));
  std::signal(signalNumber, SIG_DFL);  // the faulting instruction runs again and ends the program
}

bool ParseOptions(int argc, char** argv, Options* options) {
  for (int i = 1; i + 1 < argc; i += 2) {
    uint64_t* const target = std::strcmp(argv[i], "--calls") == 0   ? &options->calls
                             : std::strcmp(argv[i], "--seed") == 0  ? &options->seed
                             : std::strcmp(argv[i], "--first") == 0 ? &options->first
                                                                    : nullptr;
    char* end = nullptr;
    if (target) *target = std::strtoull(argv[i + 1], &end, 10);
    if (!target || end == argv[i + 1] || *end != '\0') return false;
  }
  return argc % 2 == 1 && options->calls > 0;
}

struct Count {
  uint64_t calls = 0, results = 0, exceptions = 0;
};

// False when there were too few results or refusals for the calls to mean anything.
bool Print(const char* name, const Count& count) {
  const uint64_t nulls = count.calls - count.results - count.exceptions;
  std::printf(
      "%s: %llu calls, %llu results, %llu times null, %llu exceptions\n", name,
      static_cast<unsigned long long>(count.calls), static_cast<unsigned long long>(count.results),
      static_cast<unsigned long long>(nulls), static_cast<unsigned long long>(count.exceptions));
  return count.results > count.calls / 10 && nulls > count.calls / 10 &&
         count.exceptions > count.calls / 100;
}

}  // namespace

int main(int argc, char** argv) {
  Options options;
  if (!ParseOptions(argc, argv, &options)) {
    std::fprintf(stderr,
                 "usage: hostile_natives [--calls N] [--seed S] [--first K]\n"
                 "Makes the calls K..K+N-1 of seed S.\n");
    return 2;
  }
  for (const int signalNumber : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT}) {
    std::signal(signalNumber, ReportCrash);
  }
  currentSeed = options.seed;
  Count toBitmap, toNv21;
  for (uint64_t i = 0; i < options.calls; ++i) {
    currentCall = options.first + i;
    uint8_t bytes[96];
    differential::Random(options.seed, currentCall).Fill(bytes, sizeof(bytes));
    fuzz::Input input(bytes, sizeof(bytes));
    const fake_jni::Called called = fake_jni::CallNative(&input);
    Count* const count = called.toNv21 ? &toNv21 : &toBitmap;
    ++count->calls;
    count->results += called.hasResult ? 1 : 0;
    count->exceptions += called.hasException ? 1 : 0;
  }
  const bool isVaried =
      int(Print("ConvertCS2Bitmap", toBitmap)) + int(Print("ConvertCS2NV21", toNv21)) == 2;
  if (options.calls >= 1000 && !isVaried) {
    std::printf(
        "too few results, refusals or exceptions: the calls no longer test what they "
        "should\n");
    return 1;
  }
  return 0;
}
