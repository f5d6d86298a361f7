#include "tests/differential/placed.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace differential {
namespace {

using testing_support::GuardedBuffer;

constexpr ptrdiff_t kMargin = 64;  // bytes around a block that must stay as they were

std::string Bytes(const uint8_t* bytes, ptrdiff_t count) {
  std::string text;
  char hex[4];
  for (ptrdiff_t i = 0; i < count; ++i) {
    std::snprintf(hex, sizeof(hex), " %02x", bytes[i]);
    text += hex;
  }
  return text;
}

}  // namespace

void FillContent(Random* random, Content content, uint8_t* bytes, size_t count) {
  constexpr uint8_t kExtremes[] = {0, 0, 255, 255, 16, 128, 235, 240};
  if (content == Content::kNoise) {
    random->Fill(bytes, count);
  } else if (content == Content::kExtremes) {
    random->Fill(bytes, count);
    for (size_t i = 0; i < count; ++i) {
      bytes[i] = kExtremes[bytes[i] & 7];
    }
  } else {
    const uint32_t slope = uint32_t(random->Between(1, 9));
    const uint32_t start = uint32_t(random->Between(0, 255));
    for (size_t i = 0; i < count; ++i) {
      bytes[i] = uint8_t(start + i * slope / 3);
    }
  }
}

PlacedBlock Place(GuardedBuffer* buffer, const Side& side, int index) {
  const Block& block = side.blocks.block[index];
  const Placement& placement = side.placement[index];
  const int32_t pitch = side.pitches[index];
  const size_t size = SizeOf(block, pitch);
  PlacedBlock placed;
  placed.first = buffer->Place(size, placement.edge, placement.alignment, placement.remainder);
  placed.top = pitch < 0 ? placed.first + ptrdiff_t(-pitch) * (block.rows - 1) : placed.first;
  placed.watched = placed.first - std::min(kMargin, placed.first - buffer->begin());
  const uint8_t* const end = placed.first + size;
  placed.watchedSize =
      size_t(end - placed.watched) + size_t(std::min(kMargin, buffer->end() - end));
  return placed;
}

std::string Difference(const Side& side, const PlacedBlock* gotBlocks,
                       const PlacedBlock* expectedBlocks) {
  for (int i = 0; i < side.blocks.count; ++i) {
    const uint8_t* const got = gotBlocks[i].watched;
    const uint8_t* const expected = expectedBlocks[i].watched;
    const size_t size = gotBlocks[i].watchedSize;
    if (std::memcmp(got, expected, size) == 0) {
      continue;
    }
    const ptrdiff_t at = std::mismatch(got, got + size, expected).first - got;
    const ptrdiff_t offset = (got + at) - gotBlocks[i].first;
    const ptrdiff_t pitch = std::abs(side.pitches[i]);
    const ptrdiff_t count = std::min<ptrdiff_t>(16, ptrdiff_t(size) - at);
    return "block " + std::to_string(i) + ", byte " + std::to_string(offset) + " (line " +
           std::to_string(offset / pitch) + " in memory, byte " + std::to_string(offset % pitch) +
           ")\n    got     " + Bytes(got + at, count) + "\n    expected" +
           Bytes(expected + at, count);
  }
  return std::string();
}

}  // namespace differential
