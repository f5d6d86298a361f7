// Breaks the rule of one thread for one handle, so that ThreadSanitizer has a race to report: the
// proof that it would see one inside the library.
#include <atomic>
#include <thread>

#include "engine/postprocess.h"

int main() {
  constexpr int32_t kSide = 64;
  constexpr int32_t kPitches[3] = {kSide, 0, 0};
  MPPFORMAT dst = {FORMAT_GRAY8, kSide, kSide, nullptr};
  MPPFORMAT src = dst;
  MPPPARAM params = {};
  MPPHandle* handle = nullptr;
  if (MPPCreate(&dst, &src, &params, &handle) != KESTREL_OK) return 2;
  static const uint8_t source[kSide * kSide] = {};
  std::atomic<int> waiting{2};
  const auto run = [&] {
    static thread_local uint8_t own[kSide * kSide];
    uint8_t* const planes[3] = {own, nullptr, nullptr};
    const uint8_t* const sources[3] = {source, nullptr, nullptr};
    --waiting;
    while (waiting > 0) std::this_thread::yield();
    for (int i = 0; i < 100; ++i) MPProcess(handle, planes, nullptr, kPitches, sources, kPitches);
  };
  std::thread other(run);
  run();
  other.join();
  MPPDestroy(handle);
  return 0;
}
