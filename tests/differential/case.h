// Numbered random conversion jobs: formats, geometry, parameters and where in memory planes lie.
#ifndef KESTREL_TESTS_DIFFERENTIAL_CASE_H
#define KESTREL_TESTS_DIFFERENTIAL_CASE_H

#include <cstdint>
#include <string>

#include "engine/records.h"
#include "tests/differential/image.h"
#include "tests/differential/random.h"
#include "tests/support/guarded_buffer.h"

namespace differential {

// Where a block lies: flush against one of the inaccessible pages, or near it at an alignment.
struct Placement {
  testing_support::GuardedBuffer::Edge edge;
  uint32_t alignment;
  uint32_t remainder;
};

struct Side {
  MPPFORMAT record;
  reference::Format format;  // valid when isKnown
  bool isKnown;
  ImageBlocks blocks;
  int32_t pitches[3];  // as handed in; negative: bottom row first
  Placement placement[3];
  int32_t nullSlot;  // slot whose plane address is withheld, or -1
};

enum class Content { kNoise, kExtremes, kSmooth };

struct Case {
  uint64_t seed;
  uint64_t number;
  Side dst;
  Side src;
  MPPPARAM params;
  bool hasRect;
  MRECT rect;
  Content content;
};

// Formats, pitches and places of a side whose record is set and whose image is that large.
void DrawSide(Random* random, int32_t imageWidth, int32_t imageHeight, Side* side);

// Pictures of a few dozen pixels on each side; or long ones, whose rows do not fit the buffers that
// rows are converted in, and which are narrow so that many can be made.
enum class Lengths { kUsual, kLong };

// Case `number` of `seed`, the same on every machine. A palette is only a non-null address here:
// whoever runs the case supplies the entries.
Case DrawCase(uint64_t seed, uint64_t number, Lengths lengths = Lengths::kUsual);

// Everything about a case, for people.
std::string Describe(const Case& drawn);

}  // namespace differential

#endif
