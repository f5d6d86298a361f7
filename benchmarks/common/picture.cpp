#include "benchmarks/common/picture.h"

#include <cstdlib>
#include <new>
#include <stdexcept>

namespace bench {
namespace {

constexpr size_t kAlignment = 64;

int32_t DivideUp(int32_t value, int32_t divisor) {
  return (value + divisor - 1) / divisor;
}

size_t RoundUp(size_t value) {
  return (value + kAlignment - 1) / kAlignment * kAlignment;
}

std::shared_ptr<uint8_t> Allocate(size_t bytes) {
  void* memory = std::aligned_alloc(kAlignment, RoundUp(bytes));
  if (memory == nullptr) throw std::bad_alloc();
  return {static_cast<uint8_t*>(memory), std::free};
}

bool IsVFirst(uint32_t code) {
  return code == CODE_NV21 || code == CODE_NV61;
}

}  // namespace

Picture::Picture(uint32_t publicFormat, Size pixels) : format(publicFormat), size(pixels) {
  const MPPFORMAT record = {format, size.width, size.height, nullptr};
  if (MPParseFormat(&desc, &record) != KESTREL_OK || MPGetPlaneLayout(&desc, &layout) == 0 ||
      MPGetSubsampling(&desc, &layout, factors) != KESTREL_OK) {
    throw std::invalid_argument("unknown format");
  }
  const Size chroma = SizeOf(1);
  const bool semiPlanar = layout.planeCount == 3 && layout.step[1] == 2;
  blockCount = layout.planeCount == 1 ? 1 : semiPlanar ? 2 : 3;
  int32_t rowBytes[3] = {};
  if (IsRgb()) {
    rowBytes[0] = DivideUp(size.width * int32_t(layout.bitsPerPixel), 8);
  } else if (layout.planeCount == 1 && desc.code != CODE_GRAY8) {
    rowBytes[0] = chroma.width * layout.step[1];
  } else {
    rowBytes[0] = size.width;
    rowBytes[1] = rowBytes[2] = chroma.width * layout.step[1];
  }
  size_t bytes = 0;
  for (int i = 0; i < blockCount; ++i) {
    block[i] = {nullptr, rowBytes[i], rowBytes[i], i == 0 ? size.height : chroma.height};
    bytes += size_t(rowBytes[i]) * size_t(block[i].rows);
  }
  memory_ = Allocate(bytes);
  uint8_t* next = memory_.get();
  for (int i = 0; i < blockCount; ++i) {
    block[i].start = next;
    next += size_t(block[i].pitch) * size_t(block[i].rows);
    plane[i] = block[i].start;
    pitch[i] = block[i].pitch;
  }
  if (IsSemiPlanar()) {
    plane[1] = block[1].start + (IsVFirst(desc.code) ? 1 : 0);
    plane[2] = block[1].start + (IsVFirst(desc.code) ? 0 : 1);
    pitch[2] = pitch[1];
  }
}

Picture Picture::Part(int32_t x, int32_t y, Size part) const {
  Picture result = *this;
  result.size = part;
  for (int i = 0; i < 3; ++i) {
    if (plane[i] == nullptr) continue;
    // The columns of one-plane pictures are those of their chroma groups: 1 for RGB and grey.
    const int component = layout.planeCount == 1 ? 1 : i;
    result.plane[i] += ptrdiff_t(y) / int32_t(factors[3 + i]) * pitch[i] +
                       ptrdiff_t(x) / int32_t(factors[component]) * layout.step[component];
  }
  const Size chroma = result.SizeOf(1);
  for (int i = 0; i < blockCount; ++i) {
    Block& b = result.block[i];
    b.start = IsSemiPlanar() && i == 1 && IsVFirst(desc.code) ? result.plane[2] : result.plane[i];
    b.rows = i == 0 ? part.height : chroma.height;
    const int component = layout.planeCount == 1 ? 1 : i;
    b.rowBytes = result.SizeOf(component).width * layout.step[component];
  }
  return result;
}

bool Picture::IsContiguous() const {
  for (int i = 0; i < blockCount; ++i) {
    if (block[i].pitch != block[i].rowBytes) return false;
    if (i > 0 && block[i].start !=
                     block[i - 1].start + size_t(block[i - 1].pitch) * size_t(block[i - 1].rows)) {
      return false;
    }
  }
  return true;
}

size_t Picture::ByteCount() const {
  size_t bytes = 0;
  for (int i = 0; i < blockCount; ++i) bytes += size_t(block[i].rowBytes) * size_t(block[i].rows);
  return bytes;
}

uint8_t* Picture::Sample(int component, int32_t column, int32_t row) const {
  const uint32_t offsets[3] = {layout.yOffset, layout.uOffset, layout.vOffset};
  const int slot = layout.planeCount == 3 ? component : 0;
  return plane[slot] + ptrdiff_t(row) * pitch[slot] + ptrdiff_t(column) * layout.step[component] +
         offsets[component];
}

Size Picture::SizeOf(int component) const {
  return {DivideUp(size.width, int32_t(factors[component])),
          DivideUp(size.height, int32_t(factors[3 + component]))};
}

}  // namespace bench
