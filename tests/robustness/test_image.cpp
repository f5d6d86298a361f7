#include "tests/robustness/test_image.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <utility>

namespace robustness {
namespace {

int64_t CeilDiv(int64_t value, int64_t divisor) {
  return (value + divisor - 1) / divisor;
}

int64_t PlaneSpan(int64_t rowBytes, int64_t rows, int64_t pitch) {
  return std::abs(pitch) * (rows - 1) + rowBytes;
}

}  // namespace

bool ShapeOf(uint32_t code, ImageShape* shape) {
  *shape = ImageShape{};
  const uint32_t family = code >> 28;
  const uint32_t storage = (code >> 24) & 15;
  const uint32_t layout = code & ~0x3000u;
  const auto onePlane = [shape](int32_t width, int32_t bytes) {
    shape->planes = 1;
    shape->plane[0] = {width, 1, bytes};
    return true;
  };
  const auto withChroma = [shape](int planes, int32_t width, int32_t height, int32_t bytes) {
    shape->planes = planes;
    shape->plane[0] = {1, 1, 1};
    shape->plane[1] = shape->plane[2] = {width, height, bytes};
    return true;
  };
  switch (family) {
    case 1:
    case 3:
      return storage >= 5 && storage <= 7 && onePlane(1, static_cast<int32_t>(storage) - 3);
    case 4:
      if (code == 0x41000000) return shape->paletteEntries = 2, onePlane(8, 1);
      if (code == 0x43000000) return shape->paletteEntries = 16, onePlane(2, 1);
      if (code == 0x44000000) return shape->paletteEntries = 256, onePlane(1, 1);
      return false;
    case 5:
      switch (layout) {
        case 0x50000110:
        case 0x50000310:
        case 0x50000510:
        case 0x50000710:
          shape->swapsLuma = true;
          return onePlane(2, 4);
        case 0x50000010:
        case 0x50000210:
        case 0x50000410:
        case 0x50000610:
          return onePlane(2, 4);
        case 0x50000000:
        case 0x50000200:
        case 0x50000400:
        case 0x50000600:
          return onePlane(1, 3);
        default:
          break;
      }
      if ((code & 0xD00) != 0x800) return false;
      shape->vFirst = (code & 0x200) != 0;
      return withChroma(3, static_cast<int32_t>((code >> 4) & 15) + 1,
                        static_cast<int32_t>(code & 15) + 1, 1);
    case 6:
      shape->isGrey = true;
      return storage == 4 && onePlane(1, 1);
    case 7:
      shape->semiPlanar = layout >= 0x70000002 && layout <= 0x70000005;
      shape->uFirst = (layout & 1) != 0;
      if (layout == 0x70000002 || layout == 0x70000003) return withChroma(2, 2, 2, 2);
      if (layout == 0x70000004 || layout == 0x70000005) return withChroma(2, 2, 1, 2);
      if (layout == 0x70000008) return onePlane(2, 4);
      if (layout == 0x70000009) return onePlane(1, 4);
      return false;
    default:
      return false;
  }
}

GuardedBlock::GuardedBlock(size_t size, bool atEnd)
    : buffer_(std::make_unique<testing_support::GuardedBuffer>(size)),
      data_(buffer_->Place(size, atEnd ? testing_support::GuardedBuffer::Edge::kEnd
                                       : testing_support::GuardedBuffer::Edge::kStart)),
      size_(size) {}

int64_t TestImage::RowBytes(const ImageShape& shape, int plane, int64_t width) {
  return CeilDiv(width, shape.plane[plane].width) * shape.plane[plane].bytes;
}

int64_t TestImage::MemoryBytes(const ImageShape& shape, int64_t width, int64_t height,
                               const int32_t* pitches) {
  int64_t bytes = 0;
  for (int i = 0; i < shape.planes; ++i) {
    const int64_t rowBytes = RowBytes(shape, i, width);
    bytes += PlaneSpan(rowBytes, CeilDiv(height, shape.plane[i].height),
                       pitches != nullptr ? pitches[i] : rowBytes);
  }
  return bytes;
}

TestImage::TestImage(const ImageShape& shape, int64_t width, int64_t height, const int32_t* pitches,
                     bool atEnd)
    : shape_(shape), width_(width), height_(height), memory_(static_cast<size_t>(shape.planes)) {
  for (int i = 0; i < shape.planes; ++i) {
    Plane& plane = memory_[static_cast<size_t>(i)];
    const int64_t rowBytes = RowBytes(shape, i, width);
    plane.columns = CeilDiv(width, shape.plane[i].width);
    plane.rows = CeilDiv(height, shape.plane[i].height);
    plane.pitch = pitches != nullptr ? pitches[i] : rowBytes;
    int64_t bytes = PlaneSpan(rowBytes, plane.rows, plane.pitch);
    if (bytes > INT32_MAX) {
      plane.rows = 1;
      bytes = rowBytes;
    }
    if (plane.pitch < 0) plane.origin = -plane.pitch * (plane.rows - 1);
    plane.memory = GuardedBlock(static_cast<size_t>(bytes), atEnd);
    slots_[i] = plane.memory.data() + plane.origin;
    slotPitches_[i] = static_cast<int32_t>(plane.pitch);
  }
  if (shape.semiPlanar) {
    uint8_t* chroma = slots_[1];
    slots_[1] = chroma + (shape.uFirst ? 0 : 1);
    slots_[2] = chroma + (shape.uFirst ? 1 : 0);
    slotPitches_[2] = slotPitches_[1];
  }
  // Binding exchanges the two addresses of these layouts and leaves the pitches where they are.
  if (shape.vFirst) std::swap(slotPitches_[1], slotPitches_[2]);
  Remember();
}

void TestImage::Fill(uint64_t seed) {
  uint64_t state = seed * 0x9E3779B97F4A7C15u + 1;
  for (Plane& plane : memory_) {
    for (size_t i = 0; i < plane.memory.size(); ++i) {
      state ^= state << 13;
      state ^= state >> 7;
      state ^= state << 17;
      plane.memory.data()[i] = static_cast<uint8_t>(state >> 32);
    }
  }
  Remember();
}

void TestImage::FillConstant(uint8_t value) {
  for (Plane& plane : memory_) memset(plane.memory.data(), value, plane.memory.size());
  Remember();
}

void TestImage::Remember() {
  for (Plane& plane : memory_) {
    plane.before.assign(plane.memory.data(), plane.memory.data() + plane.memory.size());
  }
}

bool TestImage::Changed() const {
  return std::any_of(memory_.begin(), memory_.end(), [](const Plane& plane) {
    return memcmp(plane.memory.data(), plane.before.data(), plane.before.size()) != 0;
  });
}

std::string TestImage::ChangeOutside(const Span& allowed, int64_t slackBlocks) const {
  for (size_t i = 0; i < memory_.size(); ++i) {
    const Plane& plane = memory_[i];
    const PlaneShape& block = shape_.plane[i];
    const Span inside = {std::max<int64_t>(allowed.left, 0), std::max<int64_t>(allowed.top, 0),
                         std::min(allowed.right, width_), std::min(allowed.bottom, height_)};
    std::vector<bool> mayChange(plane.before.size());
    if (inside.left < inside.right && inside.top < inside.bottom) {
      const int64_t slackX = block.width > 1 ? slackBlocks : 0;
      const int64_t slackY = block.height > 1 ? slackBlocks : 0;
      const int64_t left = std::max<int64_t>(inside.left / block.width - slackX, 0);
      const int64_t right = std::min((inside.right - 1) / block.width + 1 + slackX, plane.columns);
      const int64_t top = std::max<int64_t>(inside.top / block.height - slackY, 0);
      const int64_t bottom = std::min((inside.bottom - 1) / block.height + 1 + slackY, plane.rows);
      for (int64_t row = top; row < bottom; ++row) {
        const int64_t start = plane.origin + plane.pitch * row;
        std::fill(mayChange.begin() + static_cast<ptrdiff_t>(start + left * block.bytes),
                  mayChange.begin() + static_cast<ptrdiff_t>(start + right * block.bytes), true);
      }
    }
    for (size_t byte = 0; byte < plane.before.size(); ++byte) {
      if (plane.memory.data()[byte] != plane.before[byte] && !mayChange[byte]) {
        return "plane " + std::to_string(i) + ": byte " +
               std::to_string(static_cast<int64_t>(byte) - plane.origin) +
               " from the origin changed (pitch " + std::to_string(plane.pitch) + ")";
      }
    }
  }
  return "";
}

std::vector<uint8_t> TestImage::Bytes(const Span& pixels) const {
  std::vector<uint8_t> bytes;
  for (size_t i = 0; i < memory_.size(); ++i) {
    const Plane& plane = memory_[i];
    const PlaneShape& block = shape_.plane[i];
    for (int64_t row = pixels.top / block.height; row < CeilDiv(pixels.bottom, block.height);
         ++row) {
      const uint8_t* start = plane.memory.data() + plane.origin + plane.pitch * row;
      bytes.insert(bytes.end(), start + pixels.left / block.width * block.bytes,
                   start + CeilDiv(pixels.right, block.width) * block.bytes);
    }
  }
  return bytes;
}

}  // namespace robustness
