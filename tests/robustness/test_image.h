// Images for hostile calls: planes of exactly the stated size between pages that cannot be touched,
// with a copy of what they held, so that every access beside a plane crashes and every write beside
// the allowed pixels is found.
#ifndef KESTREL_TESTS_ROBUSTNESS_TEST_IMAGE_H
#define KESTREL_TESTS_ROBUSTNESS_TEST_IMAGE_H

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "tests/support/formats.h"
#include "tests/support/guarded_buffer.h"

namespace robustness {

// How pixels lie in one plane: a block of width x height pixels takes `bytes` bytes of one row.
struct PlaneShape {
  int32_t width;
  int32_t height;
  int32_t bytes;
};

// What a public format code says about memory. `planes` counts separate planes: semi-planar has
// two.
struct ImageShape {
  int planes;
  PlaneShape plane[3];
  bool semiPlanar;
  bool uFirst;     // of a semi-planar image
  bool vFirst;     // planar: entry 1 is V. Its rows are walked with the pitch of entry 2
  bool swapsLuma;  // packed 4:2:2 with the two lumas of a pair exchanged
  bool isGrey;
  int paletteEntries;  // indexed only
};

// False for a code that no engine accepts.
bool ShapeOf(uint32_t code, ImageShape* shape);

inline constexpr auto kListedCodes = testing_support::PublicCodes();

// A block of its own guarded memory, flush with the page before or after it.
class GuardedBlock {
 public:
  GuardedBlock() = default;
  GuardedBlock(size_t size, bool atEnd);

  uint8_t* data() const { return data_; }
  size_t size() const { return size_; }

 private:
  std::unique_ptr<testing_support::GuardedBuffer> buffer_;
  uint8_t* data_ = nullptr;
  size_t size_ = 0;
};

// A rectangle that may be larger than 32 bits can say.
struct Span {
  int64_t left;
  int64_t top;
  int64_t right;
  int64_t bottom;
};

class TestImage {
 public:
  // Pitches are per memory plane; with null they are the row's bytes. A plane whose rows would span
  // 2 GiB gets memory for its first row only: no engine may walk it.
  TestImage(const ImageShape& shape, int64_t width, int64_t height, const int32_t* pitches,
            bool atEnd);

  // Bytes of one row of a memory plane.
  static int64_t RowBytes(const ImageShape& shape, int plane, int64_t width);
  // Bytes that all planes span with the given pitches (null = the row's bytes).
  static int64_t MemoryBytes(const ImageShape& shape, int64_t width, int64_t height,
                             const int32_t* pitches);

  // Random bytes everywhere, remembered for the comparisons below.
  void Fill(uint64_t seed);
  void FillConstant(uint8_t value);

  // Three entries each, as the engine takes them.
  uint8_t** planes() { return slots_; }
  const uint8_t* const* constPlanes() const { return slots_; }
  int32_t* pitches() { return slotPitches_; }
  const ImageShape& shape() const { return shape_; }
  int64_t width() const { return width_; }
  int64_t height() const { return height_; }

  bool Changed() const;
  // Empty, or where the first byte lies that changed although no pixel of `allowed` touches its
  // block, even with `slackBlocks` more blocks on each side of subsampled planes.
  std::string ChangeOutside(const Span& allowed, int64_t slackBlocks) const;

  // The bytes of all rows without padding, restricted to the blocks of a rectangle (block-aligned).
  std::vector<uint8_t> Bytes(const Span& pixels) const;
  std::vector<uint8_t> Bytes() const { return Bytes({0, 0, width_, height_}); }

 private:
  struct Plane {
    GuardedBlock memory;
    std::vector<uint8_t> before;
    int64_t origin = 0;  // offset of row 0 in memory
    int64_t pitch = 0;
    int64_t columns = 0;  // in blocks
    int64_t rows = 0;
  };
  void Remember();

  ImageShape shape_;
  int64_t width_;
  int64_t height_;
  std::vector<Plane> memory_;
  uint8_t* slots_[3] = {};
  int32_t slotPitches_[3] = {};
};

}  // namespace robustness

#endif
