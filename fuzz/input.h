// Numbers drawn from the bytes of a fuzzer. After the last byte everything drawn is zero or the
// first choice, so that the shorter an input is, the plainer is what it stands for.
#ifndef KESTREL_FUZZ_INPUT_H
#define KESTREL_FUZZ_INPUT_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <iterator>
#include <string>

namespace fuzz {

class Input {
 public:
  Input(const uint8_t* data, size_t size) : at_(data), end_(data + size) {}

  uint8_t Byte() { return at_ < end_ ? *at_++ : 0; }

  uint32_t Word() {
    uint32_t word = 0;
    for (int i = 0; i < 4; ++i) word |= uint32_t(Byte()) << (8 * i);
    return word;
  }

  uint64_t LongWord() {
    const uint64_t low = Word();
    return low | uint64_t(Word()) << 32;
  }

  // low..high, both included. Small ranges take one byte.
  int32_t Between(int32_t low, int32_t high) {
    const uint64_t span = uint64_t(int64_t(high) - low + 1);
    return int32_t(low + int64_t((span <= 256 ? Byte() : Word()) % span));
  }

  // True once in n, never after the last byte.
  bool OneIn(int32_t n) { return Between(0, n - 1) == n - 1; }

  template <typename Choices>
  const auto& Pick(const Choices& choices) {
    return choices[size_t(Between(0, int32_t(std::size(choices)) - 1))];
  }

  size_t size() const { return size_t(end_ - at_); }

  // Up to `most` of the bytes that are left.
  std::string Text(size_t most) {
    const size_t length = std::min(most, size());
    std::string text(reinterpret_cast<const char*>(at_), length);
    at_ += length;
    return text;
  }

 private:
  const uint8_t* at_;
  const uint8_t* end_;
};

// Ends the program, which is how a fuzzer learns of a fault.
[[noreturn]] inline void Fail(const std::string& what) {
  std::fprintf(stderr, "FAULT: %s\n", what.c_str());
  std::abort();
}

inline void Require(bool holds, const char* what) {
  if (!holds) Fail(what);
}

}  // namespace fuzz

#endif
