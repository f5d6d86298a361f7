#include "tests/differential/image.h"

#include <cstdlib>

namespace differential {
namespace {

int32_t DivideUp(int32_t value, int32_t divisor) {
  return (value + divisor - 1) / divisor;
}

}  // namespace

bool IsSemiPlanar(const reference::Format& format) {
  return format.planeCount == 3 && format.step[1] == 2;
}

ImageBlocks BlocksOf(const reference::Format& format, int32_t width, int32_t height,
                     bool splitChroma) {
  using reference::kU;
  ImageBlocks blocks{};
  blocks.count = 1;
  blocks.block[0].rows = height;
  if (format.IsRgb()) {
    const int32_t bits = int32_t(format.bitsPerPixel);
    blocks.block[0].rowBytes = DivideUp(width * bits, 8);
    return blocks;
  }
  if (format.planeCount == 1) {
    const int32_t group = format.horizontal[kU];
    blocks.block[0].rowBytes = format.IsGrey() ? width : DivideUp(width, group) * format.step[kU];
    return blocks;
  }
  blocks.block[0].rowBytes = width;
  Block chroma = {DivideUp(width, format.horizontal[kU]) * format.step[kU],
                  DivideUp(height, format.vertical[kU])};
  if (IsSemiPlanar(format) && splitChroma) {
    --chroma.rowBytes;  // ends with its last sample
  }
  blocks.count = IsSemiPlanar(format) && !splitChroma ? 2 : 3;
  for (int32_t i = 1; i < blocks.count; ++i) {
    blocks.block[i] = chroma;
  }
  return blocks;
}

size_t SizeOf(const Block& block, int32_t pitch) {
  return size_t(std::abs(pitch)) * size_t(block.rows - 1) + size_t(block.rowBytes);
}

}  // namespace differential
