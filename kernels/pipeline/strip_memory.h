// The memory that the columns of a strip need, on the stack: each job takes what it uses of it, and
// has as wide strips as fit. Wide ones read and write whole pages of a picture in turn.
#ifndef KESTREL_KERNELS_PIPELINE_STRIP_MEMORY_H
#define KESTREL_KERNELS_PIPELINE_STRIP_MEMORY_H

#include <stddef.h>
#include <stdint.h>

namespace kestrel {

class StripMemory {
 public:
  static constexpr size_t kSize = size_t{51} * 1024;

  // Without memory takings are only added up.
  explicit StripMemory(uint8_t* memory) : memory_(memory) {}

  // Memory for n elements, in cache lines of its own.
  template <typename T>
  T* Take(size_t n) {
    uint8_t* const taken = memory_ == nullptr ? nullptr : memory_ + taken_;
    taken_ += (n * sizeof(T) + kLine - 1) / kLine * kLine;
    return reinterpret_cast<T*>(taken);
  }
  size_t taken() const { return taken_; }

 private:
  static constexpr size_t kLine = 64;

  uint8_t* memory_;
  size_t taken_ = 0;
};

}  // namespace kestrel

#endif
