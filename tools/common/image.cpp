#include "tools/common/image.h"

#include "tools/common/formats.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

constexpr int32_t kMaxSide = 1 << 24;
constexpr int64_t kMaxImageBytes = int64_t(1) << 30;

int64_t DivideUp(int64_t value, int64_t divisor) {
  return (value + divisor - 1) / divisor;
}

[[noreturn]] void ThrowTooLarge(Size size) {
  throw ToolError(ExitCode::kUnsupported, "an image of " + SizeText(size) + " is too large");
}

}  // namespace

std::string SizeText(Size size) {
  return std::to_string(size.width) + "x" + std::to_string(size.height);
}

std::vector<StoredPlane> LayOutPlanes(uint32_t format, Size size, int64_t pitch) {
  const MPPFORMAT record = {format, size.width, size.height, nullptr};
  FormatDesc desc = {};
  PlaneLayout layout = {};
  uint32_t factors[6];
  if (MPParseFormat(&desc, &record) != KESTREL_OK || MPGetPlaneLayout(&desc, &layout) == 0 ||
      MPGetSubsampling(&desc, &layout, factors) != KESTREL_OK) {
    throw ToolError(ExitCode::kUnsupported, "unknown pixel format " + FormatText(format));
  }
  if (size.width < 1 || size.height < 1) {
    throw ToolError(ExitCode::kUsage, "an image of " + SizeText(size) + " has no pixels");
  }
  if (size.width > kMaxSide || size.height > kMaxSide) ThrowTooLarge(size);

  const int64_t chromaStep = layout.step[1], across = factors[1], down = factors[4];
  const bool isYuv = desc.code != CODE_RGB;
  int64_t lumaBytes = size.width;
  if (!isYuv) {
    lumaBytes = DivideUp(int64_t(size.width) * desc.colourStandard, 8);
  } else if (layout.isPacked) {
    lumaBytes = DivideUp(size.width, across) * chromaStep;
  }
  if (pitch == 0) pitch = lumaBytes;
  if (pitch < lumaBytes || pitch > INT32_MAX) {
    throw ToolError(ExitCode::kUsage, "a pitch of " + std::to_string(pitch) +
                                          " does not fit rows of " + std::to_string(lumaBytes) +
                                          " bytes");
  }

  std::vector<StoredPlane> planes = {{0, pitch, lumaBytes, size.height}};
  if (layout.planeCount == 3) {
    const StoredPlane chroma = {0, DivideUp(pitch, across) * chromaStep,
                                DivideUp(size.width, across) * chromaStep,
                                DivideUp(size.height, down)};
    planes.insert(planes.end(), chromaStep == 2 ? 1 : 2, chroma);
  }
  int64_t end = 0;
  for (StoredPlane& plane : planes) {
    plane.offset = end;
    end += plane.pitch * plane.rows;
    if (end > kMaxImageBytes) ThrowTooLarge(size);
  }
  return planes;
}

int64_t TotalBytes(const std::vector<StoredPlane>& planes) {
  return planes.back().offset + planes.back().pitch * planes.back().rows;
}

Image MakeImage(uint32_t format, Size size, int64_t pitch) {
  Image image;
  image.format = format;
  image.width = size.width;
  image.height = size.height;
  image.planes = LayOutPlanes(format, size, pitch);
  image.bytes = std::make_unique<uint8_t[]>(size_t(TotalBytes(image.planes)));
  return image;
}

void TrimImage(Image* image, Size size) {
  const std::vector<StoredPlane> smaller = LayOutPlanes(image->format, size);
  for (size_t i = 0; i < smaller.size(); ++i) {
    image->planes[i].rowBytes = smaller[i].rowBytes;
    image->planes[i].rows = smaller[i].rows;
  }
  image->width = size.width;
  image->height = size.height;
}

EnginePlanes BindPlanes(const Image& image) {
  EnginePlanes bound;
  for (size_t i = 0; i < image.planes.size(); ++i) {
    bound.plane[i] = image.Row(i, 0);
    bound.pitch[i] = int32_t(image.planes[i].pitch);
  }
  if (image.planes.size() == 2) {  // slot 1 is U and slot 2 is V, whichever comes first
    const uint32_t code = image.format & ~FORMAT_STANDARD_MASK;
    const bool vFirst = code == FORMAT_NV21 || code == FORMAT_NV61;
    uint8_t* chroma = bound.plane[1];
    bound.plane[1] = chroma + (vFirst ? 1 : 0);
    bound.plane[2] = chroma + (vFirst ? 0 : 1);
    bound.pitch[2] = bound.pitch[1];
  }
  return bound;
}

}  // namespace kestrel::tools
