// One call of a row operation, its runs of samples each between pages that nobody may touch.
#ifndef KESTREL_TESTS_ROWS_TRIAL_H
#define KESTREL_TESTS_ROWS_TRIAL_H

#include <array>
#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "tests/differential/random.h"
#include "tests/support/guarded_buffer.h"

namespace rows_tests {

enum class Content { kNoise, kExtremes, kRamp };

// Where runs lie: `remainder` bytes after a multiple of 16, or flush against the page when
// negative.
struct Placing {
  testing_support::GuardedBuffer::Edge edge;
  int srcRemainder;
  int dstRemainder;
};

// Memory for all trials of a test.
class Arena {
 public:
  Arena();

 private:
  friend class Trial;
  static constexpr size_t kSlots = 8;
  using Buffer = std::unique_ptr<testing_support::GuardedBuffer>;
  std::array<Buffer, kSlots> sources_, destinations_;
  std::array<std::vector<uint8_t>, kSlots> expected_;
};

class Trial {
 public:
  Trial(Arena* arena, uint64_t seed, Content content, const Placing& placing);

  differential::Random& random() { return random_; }

  // A source of so many bytes, each with no other bits than those of the mask.
  const uint8_t* Source(size_t size, uint8_t mask = 255);

  // A source of given numbers.
  template <typename T>
  const T* Source(const std::vector<T>& values) {
    uint8_t* const bytes = PlaceSource(values.size() * sizeof(T), sizeof(T));
    if (!values.empty()) {
      std::memcpy(bytes, values.data(), values.size() * sizeof(T));
    }
    return reinterpret_cast<const T*>(bytes);
  }

  // What the operation writes to, and what it should be afterwards: the two are equal before.
  struct Destination {
    uint8_t* got;
    uint8_t* expected;
  };
  Destination Written(size_t size);

  // The same, filled as sources are: for operations whose destination is a source too.
  Destination Changed(size_t size, uint8_t mask = 255);

  // The first byte that is not as expected, within destinations and around them; empty: none.
  std::string Difference() const;

 private:
  struct Watched {
    const uint8_t* begin;
    size_t size;
    ptrdiff_t before;  // bytes in front of the destination
  };

  uint8_t* PlaceSource(size_t size, int unit);
  void Fill(uint8_t* bytes, size_t size, uint8_t mask);
  uint8_t* Place(testing_support::GuardedBuffer* buffer, size_t size, int remainder) const;

  Arena* arena_;
  Content content_;
  Placing placing_;
  differential::Random random_;
  size_t sources_ = 0;
  std::vector<Watched> watched_;
};

}  // namespace rows_tests

#endif
