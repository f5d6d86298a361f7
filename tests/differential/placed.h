// Images of random cases in memory, between pages that nobody may touch.
#ifndef KESTREL_TESTS_DIFFERENTIAL_PLACED_H
#define KESTREL_TESTS_DIFFERENTIAL_PLACED_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>

#include "tests/differential/case.h"

namespace differential {

void FillContent(Random* random, Content content, uint8_t* bytes, size_t count);

// A block between guard pages and the bytes around it that are watched.
struct PlacedBlock {
  uint8_t* first;  // lowest address
  uint8_t* top;    // address of the top row
  uint8_t* watched;
  size_t watchedSize;
};

PlacedBlock Place(testing_support::GuardedBuffer* buffer, const Side& side, int index);

template <typename Byte>
void SetPlanes(const Side& side, const PlacedBlock* placed, Byte** planes, int32_t* pitches) {
  Byte* tops[3] = {nullptr, nullptr, nullptr};
  for (int i = 0; i < side.blocks.count; ++i) {
    tops[i] = placed[i].top;
  }
  SlotsOf<Byte>(side.format, tops, planes);
  if (side.nullSlot >= 0) {
    planes[side.nullSlot] = nullptr;
  }
  std::copy(side.pitches, side.pitches + 3, pitches);
}

// What differs between two images of one side, in words; empty when every watched byte is equal.
std::string Difference(const Side& side, const PlacedBlock* got, const PlacedBlock* expected);

}  // namespace differential

#endif
