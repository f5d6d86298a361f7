#include "kernels/pipeline/job.h"

namespace kestrel {
namespace {

bool HasPlanes(const PlaneLayout& layout, const uint8_t* const* planes) {
  if (layout.planeCount != 3) return planes[0] != nullptr;
  return planes[0] != nullptr && planes[1] != nullptr && planes[2] != nullptr;
}

// Indexed pixels smaller than a byte are never written.
bool HasPixels(const FormatDesc& destination) {
  return destination.code != CODE_RGB || destination.colourStandard >= 8;
}

}  // namespace

bool IsDrawable(const Job& job) {
  const EngineContext& c = job.engine;
  return HasPixels(c.dstFormat) && job.rect.left < job.rect.right &&
         job.rect.top < job.rect.bottom && c.srcReadRight > 0 && c.srcReadBottom > 0 &&
         HasPlanes(c.dstLayout, job.dstStarts) && HasPlanes(c.srcLayout, job.srcPlanes) &&
         !LacksTable(job);
}

bool LacksTable(const Job& job) {
  const uint32_t path = job.engine.pathKind;
  const bool reads = (path == PATH_YUV_TO_RGB && !job.has(kSixBitMatrix)) ||
                     path == PATH_RGB_TO_YUV || job.mapsLevels();
  return reads && job.engine.table == nullptr;
}

PixelFormat DescribePixels(const FormatDesc& format, const uint32_t* sizes,
                           const uint32_t* positions) {
  PixelFormat pixels;
  pixels.bytes = int32_t(format.colourStandard / 8);
  pixels.wholeBytes = true;
  int32_t positionSum = 0;
  for (int i = 0; i < 3; ++i) {
    pixels.size[i] = sizes[i];
    pixels.position[i] = positions[i];
    positionSum += int32_t(positions[i]);
    // A code can name fields beyond the pixel: they are zero, not the next pixel's bytes.
    const bool isByte =
        sizes[i] == 8 && positions[i] % 8 == 0 && int64_t{positions[i]} / 8 < pixels.bytes;
    if (!isByte) pixels.wholeBytes = false;
  }
  // The byte left over by channels of 8 bits. Other layouts get what the same sum says, or none.
  const int32_t alphaByte = (48 - positionSum) / 8;
  const bool inside = pixels.bytes == 4 && alphaByte >= 0 && alphaByte < 4;
  pixels.alphaByte = inside ? alphaByte : -1;
  return pixels;
}

}  // namespace kestrel
