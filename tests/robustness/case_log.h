// Numbered random cases. A crash prints the number of the case it happened in; the same case alone
// runs with KESTREL_CASE=<number>, more or fewer of them with KESTREL_CASES=<count>.
#ifndef KESTREL_TESTS_ROBUSTNESS_CASE_LOG_H
#define KESTREL_TESTS_ROBUSTNESS_CASE_LOG_H

#include <cstdint>
#include <functional>
#include <iterator>
#include <random>
#include <string>

namespace robustness {

// Runs body(number) for the wanted numbers and stops at the first fatal failure.
void ForEachCase(uint64_t defaultCount, const std::function<void(uint64_t)>& body);

// Adds what the case is to every message about it.
void DescribeCase(const std::string& text);

class Random {
 public:
  explicit Random(uint64_t seed) : engine_(seed * 2 + 1) {}

  uint32_t Bits() { return static_cast<uint32_t>(engine_()); }
  uint64_t Bits64() { return engine_(); }
  // Uniform in low..high, both included.
  int32_t Between(int32_t low, int32_t high) {
    const uint64_t range = static_cast<uint64_t>(static_cast<int64_t>(high) - low) + 1;
    return static_cast<int32_t>(low + static_cast<int64_t>(engine_() % range));
  }
  bool OneIn(int32_t n) { return Between(1, n) == 1; }
  template <typename Values>
  auto Pick(const Values& values) {
    return values[size_t(Between(0, int32_t(std::size(values)) - 1))];
  }

 private:
  std::mt19937_64 engine_;
};

}  // namespace robustness

#endif
