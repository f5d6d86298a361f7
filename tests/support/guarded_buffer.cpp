#include "tests/support/guarded_buffer.h"

#include <sys/mman.h>
#include <unistd.h>

#include <new>
#include <stdexcept>

namespace testing_support {

GuardedBuffer::GuardedBuffer(std::size_t capacity) {
  const std::size_t page = std::size_t(sysconf(_SC_PAGESIZE));
  const std::size_t usable = (capacity + 2 * page - 1) / page * page;  // room to shift by alignment
  mappingSize_ = usable + 2 * page;
  mapping_ = mmap(nullptr, mappingSize_, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (mapping_ == MAP_FAILED) {
    throw std::bad_alloc();
  }
  begin_ = static_cast<std::uint8_t*>(mapping_) + page;
  end_ = begin_ + usable;
  if (mprotect(begin_, usable, PROT_READ | PROT_WRITE) != 0) {
    munmap(mapping_, mappingSize_);
    throw std::bad_alloc();
  }
}

GuardedBuffer::~GuardedBuffer() {
  munmap(mapping_, mappingSize_);
}

std::uint8_t* GuardedBuffer::Place(std::size_t size, Edge edge) {
  return Place(size, edge, 1, 0);
}

std::uint8_t* GuardedBuffer::Place(std::size_t size, Edge edge, std::size_t alignment,
                                   std::size_t remainder) {
  if (size + alignment - 1 > capacity()) {
    throw std::length_error("block larger than the guarded buffer");
  }
  if (edge == Edge::kStart) {
    return begin_ + remainder % alignment;  // begin_ is page-aligned
  }
  std::uint8_t* const flush = end_ - size;
  return flush - (reinterpret_cast<std::uintptr_t>(flush) - remainder) % alignment;
}

}  // namespace testing_support
