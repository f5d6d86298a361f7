#include "tests/rows/trial.h"

#include <algorithm>

namespace rows_tests {
namespace {

using testing_support::GuardedBuffer;

constexpr size_t kCapacity = size_t{1} << 16;
constexpr ptrdiff_t kMargin = 64;  // as far as one vector reaches

}  // namespace

Arena::Arena() {
  for (size_t i = 0; i < kSlots; ++i) {
    sources_[i] = std::make_unique<GuardedBuffer>(kCapacity);
    destinations_[i] = std::make_unique<GuardedBuffer>(kCapacity);
  }
}

Trial::Trial(Arena* arena, uint64_t seed, Content content, const Placing& placing)
    : arena_(arena), content_(content), placing_(placing), random_(seed) {}

uint8_t* Trial::Place(GuardedBuffer* buffer, size_t size, int remainder) const {
  return remainder < 0 ? buffer->Place(size, placing_.edge)
                       : buffer->Place(size, placing_.edge, 16, size_t(remainder) % 16);
}

uint8_t* Trial::PlaceSource(size_t size, int unit) {
  // Sources differ in alignment among themselves too.
  const int remainder =
      placing_.srcRemainder < 0 ? -1 : (placing_.srcRemainder + 5 * int(sources_)) * unit;
  return Place(arena_->sources_.at(sources_++).get(), size, remainder);
}

void Trial::Fill(uint8_t* bytes, size_t size, uint8_t mask) {
  switch (content_) {
    case Content::kNoise:
      random_.Fill(bytes, size);
      break;
    case Content::kExtremes:
      random_.Fill(bytes, size);
      std::transform(bytes, bytes + size, bytes,
                     [](uint8_t byte) { return uint8_t(byte & 1 ? 255 : 0); });
      break;
    case Content::kRamp: {
      const int start = random_.Between(0, 255);
      const int rise = random_.Between(-3, 3);
      for (size_t i = 0; i < size; ++i) {
        bytes[i] = uint8_t(start + rise * int(i));
      }
      break;
    }
  }
  if (mask != 255) {
    std::transform(bytes, bytes + size, bytes, [mask](uint8_t byte) { return byte & mask; });
  }
}

const uint8_t* Trial::Source(size_t size, uint8_t mask) {
  uint8_t* const bytes = PlaceSource(size, 1);
  Fill(bytes, size, mask);
  return bytes;
}

Trial::Destination Trial::Written(size_t size) {
  const size_t slot = watched_.size();
  GuardedBuffer* const buffer = arena_->destinations_.at(slot).get();
  const int remainder = placing_.dstRemainder < 0 ? -1 : placing_.dstRemainder + 3 * int(slot);
  uint8_t* const got = Place(buffer, size, remainder);
  uint8_t* const begin = got - std::min(kMargin, got - buffer->begin());
  uint8_t* const end = got + size + std::min(kMargin, buffer->end() - (got + size));
  random_.Fill(begin, size_t(end - begin));
  arena_->expected_[slot].assign(begin, end);
  watched_.push_back({begin, size_t(end - begin), got - begin});
  return {got, arena_->expected_[slot].data() + (got - begin)};
}

Trial::Destination Trial::Changed(size_t size, uint8_t mask) {
  const Destination destination = Written(size);
  Fill(destination.got, size, mask);
  std::copy_n(destination.got, size, destination.expected);
  return destination;
}

std::string Trial::Difference() const {
  for (size_t slot = 0; slot < watched_.size(); ++slot) {
    const Watched& watched = watched_[slot];
    const uint8_t* const expected = arena_->expected_[slot].data();
    if (std::memcmp(watched.begin, expected, watched.size) != 0) {
      const auto [got, wanted] =
          std::mismatch(watched.begin, watched.begin + watched.size, expected);
      return "destination " + std::to_string(slot) + ", byte " +
             std::to_string(got - watched.begin - watched.before) + ": " + std::to_string(*got) +
             " instead of " + std::to_string(*wanted);
    }
  }
  return "";
}

}  // namespace rows_tests
