// Random numbers that are the same on every machine: case k of seed s is the same job everywhere.
#ifndef KESTREL_TESTS_DIFFERENTIAL_RANDOM_H
#define KESTREL_TESTS_DIFFERENTIAL_RANDOM_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <iterator>

namespace differential {

class Random {
 public:
  explicit Random(uint64_t seed, uint64_t stream = 0)
      : state_(seed * 0x9E3779B97F4A7C15u ^ (stream + 1) * 0xD1B54A32D192ED03u) {
    Next();
  }

  uint64_t Next() {
    state_ += 0x9E3779B97F4A7C15u;
    uint64_t z = state_;
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9u;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBu;
    return z ^ (z >> 31);
  }

  // low..high, both included.
  int32_t Between(int32_t low, int32_t high) {
    return low + int32_t(Next() % uint64_t(int64_t(high) - low + 1));
  }

  bool Percent(int32_t chance) { return Between(1, 100) <= chance; }

  template <typename Choices>
  const auto& Pick(const Choices& choices) {
    return choices[size_t(Between(0, int32_t(std::size(choices)) - 1))];
  }

  void Fill(uint8_t* bytes, size_t count) {
    while (count >= 8) {
      const uint64_t value = Next();
      for (int i = 0; i < 8; ++i) {
        bytes[i] = uint8_t(value >> (8 * i));
      }
      bytes += 8;
      count -= 8;
    }
    const uint64_t value = Next();
    for (size_t i = 0; i < count; ++i) {
      bytes[i] = uint8_t(value >> (8 * i));
    }
  }

 private:
  uint64_t state_;
};

}  // namespace differential

#endif
