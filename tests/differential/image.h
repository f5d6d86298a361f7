// How many bytes the planes of an image take, and where slots, components and pitches meet.
#ifndef KESTREL_TESTS_DIFFERENTIAL_IMAGE_H
#define KESTREL_TESTS_DIFFERENTIAL_IMAGE_H

#include <cstddef>
#include <cstdint>

#include "tests/reference/format.h"

namespace differential {

// One block of memory that holds a plane, or both chroma components of a semi-planar image.
struct Block {
  int32_t rowBytes;  // least pitch
  int32_t rows;
};

// The blocks of an image: one, two (semi-planar) or three. Block i has pitch i.
struct ImageBlocks {
  int32_t count;
  Block block[3];
};

bool IsSemiPlanar(const reference::Format& format);

// Blocks for an image of width x height pixels; partial chroma blocks and packed pairs are whole.
// splitChroma: the U and the V samples of a semi-planar image in blocks of their own, still every
// second byte.
ImageBlocks BlocksOf(const reference::Format& format, int32_t width, int32_t height,
                     bool splitChroma);

// Bytes from the first to the last byte in use of a block.
size_t SizeOf(const Block& block, int32_t pitch);

// The plane array of a caller, from the addresses of the top rows of the blocks; absent ones null.
template <typename Byte>
void SlotsOf(const reference::Format& format, Byte* const* blocks, Byte** slots) {
  slots[0] = blocks[0];
  slots[1] = nullptr;
  slots[2] = nullptr;
  if (IsSemiPlanar(format) && blocks[2] == nullptr) {
    const bool vFirst = format.code == CODE_NV21 || format.code == CODE_NV61;
    slots[1] = blocks[1] + (vFirst ? 1 : 0);
    slots[2] = blocks[1] + (vFirst ? 0 : 1);
  } else if (format.planeCount == 3) {
    // V-first layouts take V in slot 1, but the pitch of U stays in entry 1.
    const bool vFirst = format.HasVPlaneFirst();
    slots[1] = blocks[vFirst ? 2 : 1];
    slots[2] = blocks[vFirst ? 1 : 2];
  }
}

}  // namespace differential

#endif
