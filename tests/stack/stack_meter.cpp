#include "tests/stack/stack_meter.h"

#include <gtest/gtest.h>
#include <pthread.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstring>

namespace stack {
namespace {

constexpr size_t kStackSize = 256 << 10;
constexpr uint8_t kPaint = 0xE7;

// One stack for all calls, made when it is first needed.
uint8_t* Stack() {
  static uint8_t* const stack = []() -> uint8_t* {
    const size_t page = size_t(sysconf(_SC_PAGESIZE));
    void* const memory = mmap(nullptr, page + kStackSize, PROT_READ | PROT_WRITE,
                              MAP_PRIVATE | MAP_ANONYMOUS | MAP_STACK, -1, 0);
    if (memory == MAP_FAILED || mprotect(memory, page, PROT_NONE) != 0) return nullptr;
    uint8_t* const first = static_cast<uint8_t*>(memory) + page;
    memset(first, kPaint, kStackSize);
    return first;
  }();
  return stack;
}

struct Call {
  const std::function<void()>* body;
  uintptr_t top;  // about where the body's own frames begin
};

void* Enter(void* argument) {
  Call* call = static_cast<Call*>(argument);
  call->top = reinterpret_cast<uintptr_t>(&call);
  (*call->body)();
  return nullptr;
}

}  // namespace

size_t UseOf(const std::function<void()>& body) {
  uint8_t* const stack = Stack();
  if (stack == nullptr) {
    ADD_FAILURE() << "no memory for a stack";
    return SIZE_MAX;
  }
  pthread_attr_t attributes;
  pthread_attr_init(&attributes);
  Call call = {&body, 0};
  pthread_t thread;
  const bool runs = pthread_attr_setstack(&attributes, stack, kStackSize) == 0 &&
                    pthread_create(&thread, &attributes, Enter, &call) == 0;
  pthread_attr_destroy(&attributes);
  if (!runs) {
    ADD_FAILURE() << "no thread";
    return SIZE_MAX;
  }
  pthread_join(thread, nullptr);
  uint8_t* const end = stack + kStackSize;
  uint8_t* const deepest = std::find_if(stack, end, [](uint8_t byte) { return byte != kPaint; });
  memset(deepest, kPaint, size_t(end - deepest));
  return call.top - reinterpret_cast<uintptr_t>(deepest);
}

size_t Deepest::Measure(const std::string& kind, const std::string& which,
                        const std::function<void()>& call) {
  const size_t bytes = UseOf(call);
  EXPECT_LT(bytes, kLimit) << kind << ": " << which;
  Use& use = kinds_[kind];
  ++use.calls;
  if (bytes > use.bytes) {
    use.bytes = bytes;
    use.which = which;
  }
  return bytes;
}

Deepest::~Deepest() {
  for (const auto& [kind, use] : kinds_) {
    printf("%6zu bytes of stack at most: %s (%d calls; %s)\n", use.bytes, kind.c_str(), use.calls,
           use.which.c_str());
  }
}

}  // namespace stack
