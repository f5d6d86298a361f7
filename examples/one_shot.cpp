// The one-shot conversion: a 320x240 I420 image, cropped to a square and scaled to 200x200 RGBA.
// Writes the picture as one_shot.ppm.
#include <cstdint>
#include <fstream>
#include <iostream>

#include "engine/format_codes.h"
#include "jni/bitmap_buffers.h"

namespace {

// A bitmap whose planes belong to it.
struct Bitmap : MBITMAP {
  Bitmap(uint32_t code, int32_t columns, int32_t rows) : MBITMAP{} {
    format = code;
    width = columns;
    height = rows;
  }
  Bitmap(const Bitmap&) = delete;
  Bitmap& operator=(const Bitmap&) = delete;
  ~Bitmap() { MBitmapFree(this); }
};

// A disc of changing colour on a dark ground.
void Draw(const Bitmap& image) {
  for (int32_t y = 0; y < image.height; ++y) {
    for (int32_t x = 0; x < image.width; ++x) {
      const int32_t dx = x - image.width / 2, dy = y - image.height / 2;
      image.plane[0][y * image.pitch[0] + x] = dx * dx + dy * dy < 100 * 100 ? 160 : 40;
    }
  }
  for (int32_t y = 0; y < image.height / 2; ++y) {
    for (int32_t x = 0; x < image.width / 2; ++x) {
      image.plane[1][y * image.pitch[1] + x] = static_cast<uint8_t>(48 + x);
      image.plane[2][y * image.pitch[2] + x] = static_cast<uint8_t>(48 + y);
    }
  }
}

bool WritePpm(const char* path, const Bitmap& image) {
  std::ofstream file(path, std::ios::binary);
  file << "P6\n" << image.width << ' ' << image.height << "\n255\n";
  for (int32_t y = 0; y < image.height; ++y) {
    for (int32_t x = 0; x < image.width; ++x) {
      const uint8_t* pixel = image.plane[0] + y * image.pitch[0] + 4 * x;
      file.write(reinterpret_cast<const char*>(pixel), 3);
    }
  }
  return file.flush().good();
}

}  // namespace

int main() {
  Bitmap src(FORMAT_I420, 320, 240);
  Bitmap dst(FORMAT_XBGR8888, 200, 200);
  if (MBitmapAlloc(&src) != KESTREL_OK || MBitmapAlloc(&dst) != KESTREL_OK) {
    std::cerr << "no memory for the images\n";
    return 1;
  }
  Draw(src);
  if (const uint32_t result = ConvertCS(&src, &dst); result != KESTREL_OK) {
    std::cerr << "ConvertCS answers " << result << '\n';
    return 1;
  }
  if (!WritePpm("one_shot.ppm", dst)) {
    std::cerr << "one_shot.ppm cannot be written\n";
    return 1;
  }
  std::cout << "one_shot.ppm: 320x240 I420 cropped to a square, as 200x200 RGBA\n";
  return 0;
}
