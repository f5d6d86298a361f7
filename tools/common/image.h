// An image in memory as the tools hold it, in any pixel format.
#ifndef KESTREL_TOOLS_COMMON_IMAGE_H
#define KESTREL_TOOLS_COMMON_IMAGE_H

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "engine/postprocess.h"

namespace kestrel::tools {

struct Size {
  int32_t width = 0;
  int32_t height = 0;
};

struct Region {
  int32_t x = 0;
  int32_t y = 0;
  int32_t width = 0;
  int32_t height = 0;
};

std::string SizeText(Size size);

// A plane as it lies in memory and in raw files: semi-planar images have two, others one or three.
struct StoredPlane {
  int64_t offset = 0;
  int64_t pitch = 0;
  int64_t rowBytes = 0;
  int64_t rows = 0;
};

struct Image {
  uint32_t format = 0;
  int32_t width = 0;
  int32_t height = 0;
  bool hasAlpha = false;  // the spare byte of 32-bit RGB means opacity
  std::vector<StoredPlane> planes;
  std::unique_ptr<uint8_t[]> bytes;
  std::shared_ptr<const std::vector<uint8_t>> palette;  // indexed formats only

  uint8_t* Row(size_t plane, int64_t row) const {
    return bytes.get() + planes[plane].offset + planes[plane].pitch * row;
  }
  Size size() const { return {width, height}; }
};

// Where the planes of an image lie one behind the other, each row padded to `pitch` bytes (0 = no
// padding; chroma rows in proportion). Throws for unknown formats and for sizes beyond the limits
// of the tools: 16777216 pixels a side, 1 GiB an image.
std::vector<StoredPlane> LayOutPlanes(uint32_t format, Size size, int64_t pitch = 0);

// Bytes of all planes together.
int64_t TotalBytes(const std::vector<StoredPlane>& planes);

// An image with its bytes cleared.
Image MakeImage(uint32_t format, Size size, int64_t pitch = 0);

// Makes an image narrower or lower in place, its rows staying where they are.
void TrimImage(Image* image, Size size);

// Plane addresses and pitches in the order of the engine's slots.
struct EnginePlanes {
  uint8_t* plane[3] = {};
  int32_t pitch[3] = {};
};
EnginePlanes BindPlanes(const Image& image);

}  // namespace kestrel::tools

#endif
