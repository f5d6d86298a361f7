// Memory between two pages that nobody may touch: one byte too far in either direction faults.
#ifndef KESTREL_TESTS_SUPPORT_GUARDED_BUFFER_H
#define KESTREL_TESTS_SUPPORT_GUARDED_BUFFER_H

#include <cstddef>
#include <cstdint>

namespace testing_support {

// One mapping that serves many blocks in turn: a block lies flush against the page before it or
// the page after it, so mapping costs nothing per block.
class GuardedBuffer {
 public:
  enum class Edge { kStart, kEnd };

  // Room for blocks of up to `capacity` bytes, whatever their alignment. Throws std::bad_alloc.
  explicit GuardedBuffer(std::size_t capacity);
  ~GuardedBuffer();
  GuardedBuffer(const GuardedBuffer&) = delete;
  GuardedBuffer& operator=(const GuardedBuffer&) = delete;

  // A block of `size` bytes that touches the given edge exactly.
  std::uint8_t* Place(std::size_t size, Edge edge);

  // A block whose address is `remainder` modulo `alignment` (a power of two up to the page size),
  // as near to the edge as that allows: at most alignment - 1 bytes away.
  std::uint8_t* Place(std::size_t size, Edge edge, std::size_t alignment, std::size_t remainder);

  // The bytes that may be touched.
  std::uint8_t* begin() const { return begin_; }
  std::uint8_t* end() const { return end_; }
  std::size_t capacity() const { return std::size_t(end_ - begin_); }

 private:
  void* mapping_;
  std::size_t mappingSize_;
  std::uint8_t* begin_;
  std::uint8_t* end_;
};

}  // namespace testing_support

#endif
