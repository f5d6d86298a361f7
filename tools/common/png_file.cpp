// PNG through libpng's simplified interface, always 8 bits a channel.
#include <png.h>

#include <cstring>

#include "tools/common/atomic_file.h"
#include "tools/common/image_file.h"
#include "tools/common/input_file.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

// One byte of deflate stream stands for at most 1032 bytes.
constexpr int64_t kMaxExpansion = 1032;

struct PngImage : png_image {
  PngImage() : png_image() { version = PNG_IMAGE_VERSION; }
  ~PngImage() { png_image_free(this); }
};

class PngReader : public ImageReader {
 public:
  explicit PngReader(const std::string& path) : file_(path) {}

  bool ReadFrame(Image* image) override {
    if (done_) return false;
    done_ = true;
    PngImage png;
    if (!png_image_begin_read_from_stdio(&png, file_.stream())) file_.ThrowMalformed(png.message);
    const Size size = {int32_t(png.width), int32_t(png.height)};
    if ((int64_t(size.width) + 7) / 8 * size.height / kMaxExpansion > file_.size()) {
      file_.ThrowMalformed("too small for a picture of " + SizeText(size));
    }
    *image = MakeImage(FORMAT_XBGR8888, size);
    image->hasAlpha = (png.format & PNG_FORMAT_FLAG_ALPHA) != 0;
    png.format = PNG_FORMAT_RGBA;
    if (!png_image_finish_read(&png, nullptr, image->Row(0, 0), int32_t(image->planes[0].pitch),
                               nullptr)) {
      file_.ThrowMalformed(png.message);
    }
    return true;
  }

 private:
  InputFile file_;
  bool done_ = false;
};

class PngWriter : public ImageWriter {
 public:
  explicit PngWriter(const std::string& path) : file_(path) {}

  void WriteFrame(const Image& image) override {
    PngImage png;
    png.width = uint32_t(image.width);
    png.height = uint32_t(image.height);
    png.format = image.hasAlpha ? PNG_FORMAT_RGBA : PNG_FORMAT_RGB;
    const std::vector<uint8_t> rgb = image.hasAlpha ? std::vector<uint8_t>() : DropSpare(image);
    const uint8_t* pixels = image.hasAlpha ? image.Row(0, 0) : rgb.data();
    if (!png_image_write_to_stdio(&png, file_.stream(), 0, pixels, 0, nullptr)) {
      file_.ThrowCannotWrite(png.message);
    }
  }
  void Commit() override { file_.Commit(); }

 private:
  static std::vector<uint8_t> DropSpare(const Image& image) {
    std::vector<uint8_t> rgb(size_t(image.width) * image.height * 3);
    uint8_t* to = rgb.data();
    for (int32_t y = 0; y < image.height; ++y) {
      const uint8_t* from = image.Row(0, y);
      for (int32_t x = 0; x < image.width; ++x, to += 3, from += 4) std::memcpy(to, from, 3);
    }
    return rgb;
  }

  AtomicFile file_;
};

}  // namespace

std::unique_ptr<ImageReader> OpenPng(const std::string& path) {
  return std::make_unique<PngReader>(path);
}

std::unique_ptr<ImageWriter> CreatePng(const std::string& path) {
  return std::make_unique<PngWriter>(path);
}

}  // namespace kestrel::tools
