#include "tests/robustness/case_log.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <unistd.h>

#include <algorithm>
#include <cinttypes>
#include <cstdio>
#include <cstdlib>

// Sanitizers end a program by abort, so that the case of a report is printed like that of a crash.
extern "C" const char* __asan_default_options() {
  return "abort_on_error=1";
}
extern "C" const char* __ubsan_default_options() {
  return "abort_on_error=1:print_stacktrace=1";
}

namespace robustness {
namespace {

constexpr int kFatalSignals[] = {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT, SIGINT, SIGTERM};
struct sigaction previousActions[NSIG];
uint64_t currentNumber;
char currentCase[512];  // kept ready, since a signal handler cannot make it
volatile sig_atomic_t currentLength = 0;

void SetCase(uint64_t number, const char* text) {
  currentNumber = number;
  const int length =
      snprintf(currentCase, sizeof currentCase, "in KESTREL_CASE=%" PRIu64 " %s\n", number, text);
  currentLength = std::min(length, static_cast<int>(sizeof currentCase) - 1);
}

// Says where we are, then lets the fault happen again under the handler that was there before. A
// program that hangs tells its case when it is interrupted.
void ReportCase(int signal) {
  constexpr char kStopped[] = "stopped ";
  if (write(STDERR_FILENO, kStopped, sizeof kStopped - 1) < 0 ||
      write(STDERR_FILENO, currentCase, static_cast<size_t>(currentLength)) < 0) {
    _exit(1);
  }
  sigaction(signal, &previousActions[signal], nullptr);
  if (signal == SIGINT || signal == SIGTERM) raise(signal);
}

class CaseListener : public testing::EmptyTestEventListener {
  void OnTestPartResult(const testing::TestPartResult& result) override {
    if (result.failed()) fputs(currentCase, stdout);
  }
};

uint64_t FromEnvironment(const char* name, uint64_t otherwise) {
  const char* text = getenv(name);
  return text != nullptr ? strtoull(text, nullptr, 10) : otherwise;
}

}  // namespace

void ForEachCase(uint64_t defaultCount, const std::function<void(uint64_t)>& body) {
  struct sigaction action = {};
  action.sa_handler = ReportCase;
  for (const int signal : kFatalSignals) sigaction(signal, &action, &previousActions[signal]);
  CaseListener listener;
  testing::TestEventListeners& listeners = testing::UnitTest::GetInstance()->listeners();
  listeners.Append(&listener);

  const bool single = getenv("KESTREL_CASE") != nullptr;
  const uint64_t first = FromEnvironment("KESTREL_CASE", 0);
  const uint64_t count = single ? 1 : FromEnvironment("KESTREL_CASES", defaultCount);
  for (uint64_t number = first; number < first + count; ++number) {
    SetCase(number, "");
    body(number);
    if (testing::Test::HasFatalFailure()) break;
  }

  listeners.Release(&listener);
  for (const int signal : kFatalSignals) sigaction(signal, &previousActions[signal], nullptr);
}

void DescribeCase(const std::string& text) {
  SetCase(currentNumber, text.c_str());
}

}  // namespace robustness
