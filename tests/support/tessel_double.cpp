#include "tests/support/tessel_double.h"

#include <cstdlib>
#include <cstring>
#include <map>
#include <mutex>

#include "platform/tessel/tessel.h"

#if defined(__SANITIZE_ADDRESS__)
#define TESSEL_DOUBLE_ASAN 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define TESSEL_DOUBLE_ASAN 1
#endif
#endif

namespace {

#ifdef TESSEL_DOUBLE_ASAN
constexpr size_t kMargin = 0;
#else
constexpr size_t kMargin = 64;  // a multiple of every alignment that malloc promises
#endif
constexpr uint8_t kMarginByte = 0xC7;
constexpr uint8_t kFreshByte = 0xA5;  // memory of the base library is not zeroed
constexpr uint8_t kFreedByte = 0xDD;

struct State {
  std::mutex mutex;
  std::map<void*, uint32_t> live;
  std::vector<uint32_t> requests;
  std::vector<std::string> faults;
  size_t failNth = 0;
  uint32_t failAbove = UINT32_MAX;
  bool failsSize = false;
  uint32_t failSize = 0;
};

State& GetState() {
  static State* state = new State;  // outlives every user
  return *state;
}

bool MarginIntact(const uint8_t* margin) {
  for (size_t i = 0; i < kMargin; ++i) {
    if (margin[i] != kMarginByte) return false;
  }
  return true;
}

}  // namespace

namespace tessel_double {

void Reset() {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  state.requests.clear();
  state.faults.clear();
  state.failNth = 0;
  state.failAbove = UINT32_MAX;
  state.failsSize = false;
}

void FailNth(size_t n) {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  state.failNth = n;
}

void FailAbove(uint32_t bytes) {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  state.failAbove = bytes;
}

void FailSize(uint32_t bytes) {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  state.failsSize = true;
  state.failSize = bytes;
}

size_t LiveBlocks() {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  return state.live.size();
}

size_t LiveBytes() {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  size_t bytes = 0;
  for (const auto& block : state.live) bytes += block.second;
  return bytes;
}

std::vector<uint32_t> Requests() {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  return state.requests;
}

std::vector<std::string> Faults() {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  return state.faults;
}

bool HasMargins() {
  return kMargin != 0;
}

}  // namespace tessel_double

void* MMemAlloc(void* pool, uint32_t size) {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  if (pool != nullptr) state.faults.push_back("MMemAlloc with a pool handle");
  state.requests.push_back(size);
  if (state.requests.size() == state.failNth || size > state.failAbove ||
      (state.failsSize && size == state.failSize)) {
    return nullptr;
  }
  uint8_t* memory = static_cast<uint8_t*>(malloc(size + 2 * kMargin + (size == 0)));
  if (memory == nullptr) return nullptr;
  memset(memory, kMarginByte, kMargin);
  memset(memory + kMargin, kFreshByte, size);
  memset(memory + kMargin + size, kMarginByte, kMargin);
  state.live[memory + kMargin] = size;
  return memory + kMargin;
}

void MMemFree(void* pool, void* block) {
  State& state = GetState();
  std::lock_guard<std::mutex> lock(state.mutex);
  if (pool != nullptr) state.faults.push_back("MMemFree with a pool handle");
  if (block == nullptr) return;
  const auto found = state.live.find(block);
  if (found == state.live.end()) {
    state.faults.push_back("MMemFree of a block that is not alive");
    return;
  }
  const uint32_t size = found->second;
  state.live.erase(found);
  uint8_t* memory = static_cast<uint8_t*>(block) - kMargin;
  if (!MarginIntact(memory) || !MarginIntact(memory + kMargin + size)) {
    state.faults.push_back("bytes beside a block of " + std::to_string(size) + " were written");
  }
  memset(block, kFreedByte, size);
  free(memory);
}

void* MMemCpy(void* dst, const void* src, uint32_t size) {
  return memcpy(dst, src, size);
}

void* MMemSet(void* dst, int32_t value, uint32_t size) {
  return memset(dst, value, size);
}
