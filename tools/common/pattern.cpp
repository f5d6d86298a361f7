// A generated picture: colour bars, gradients, rings of growing fineness, and a letter F that shows
// which way up it is.
#include <cmath>

#include "tools/common/image_file.h"

namespace kestrel::tools {
namespace {

struct Colour {
  uint8_t r, g, b;
};

constexpr Colour kBars[] = {{255, 255, 255}, {255, 255, 0}, {0, 255, 255}, {0, 255, 0},
                            {255, 0, 255},   {255, 0, 0},   {0, 0, 255},   {0, 0, 0}};

uint8_t Level(double value) {
  return uint8_t(std::lround(255 * value));
}

bool IsLetter(double x, double y) {
  if (x < 0.06 || y < 0.22 || x > 0.16 || y > 0.48) return false;
  return x < 0.085 || y < 0.265 || (y > 0.325 && y < 0.37 && x < 0.14);
}

// x and y run from 0 to 1 over the picture.
Colour ColourAt(double x, double y, double aspect) {
  if (y < 0.15) return kBars[int(x * 8)];
  if (IsLetter(x, y)) return {255, 255, 255};
  const double dx = (x - 0.5) * aspect, dy = y - 0.575, distance = std::sqrt(dx * dx + dy * dy);
  if (distance < 0.375) {
    const uint8_t ring = Level(0.5 + 0.5 * std::cos(900 * distance * distance));
    return {ring, ring, ring};
  }
  return {Level(x), Level(y), Level(1 - (x + y) / 2)};
}

class PatternReader : public ImageReader {
 public:
  explicit PatternReader(Size size) : size_(size) {}

  bool ReadFrame(Image* image) override {
    if (done_) return false;
    done_ = true;
    *image = MakeImage(FORMAT_XBGR8888, size_);
    const double aspect = double(size_.width) / size_.height;
    for (int32_t y = 0; y < size_.height; ++y) {
      uint8_t* pixel = image->Row(0, y);
      for (int32_t x = 0; x < size_.width; ++x, pixel += 4) {
        const Colour colour = ColourAt((x + 0.5) / size_.width, (y + 0.5) / size_.height, aspect);
        pixel[0] = colour.r;
        pixel[1] = colour.g;
        pixel[2] = colour.b;
        pixel[3] = 255;
      }
    }
    return true;
  }

 private:
  Size size_;
  bool done_ = false;
};

}  // namespace

std::unique_ptr<ImageReader> OpenPattern(Size size) {
  return std::make_unique<PatternReader>(size);
}

}  // namespace kestrel::tools
