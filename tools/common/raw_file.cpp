// Raw planes: rows of each plane one after the other, planes one after the other, frame after
// frame.
#include "tools/common/atomic_file.h"
#include "tools/common/image_file.h"
#include "tools/common/input_file.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

size_t PaletteBytes(uint32_t format) {
  return format == FORMAT_INDEX1 ? 2 * 4 : format == FORMAT_INDEX4 ? 16 * 4 : 256 * 4;
}

class RawReader : public ImageReader {
 public:
  RawReader(const std::string& path, Format format, const ReadOptions& options)
      : file_(path), format_(format), options_(options) {
    if (!options.size) throw ToolError(ExitCode::kUsage, path + ": raw planes need --input-size");
    if (IsIndexed(format.code)) CheckPalette();
    const int64_t frameBytes = TotalBytes(LayOutPlanes(format.code, *options.size, options.pitch));
    if (file_.size() == 0 || file_.size() % frameBytes != 0) {
      file_.ThrowMalformed("holds " + std::to_string(file_.size()) + " bytes, but frames of " +
                           SizeText(*options.size) + " " + FormatText(format.code) + " take " +
                           std::to_string(frameBytes));
    }
    frames_ = file_.size() / frameBytes;
  }

  bool ReadFrame(Image* image) override {
    if (file_.Remaining() == 0) return false;
    *image = MakeImage(format_.code, *options_.size, options_.pitch);
    image->hasAlpha = format_.hasAlpha;
    image->palette = options_.palette;
    file_.ReadPlanes(*image);
    return true;
  }
  int64_t FrameCount() const override { return frames_; }

 private:
  void CheckPalette() const {
    const size_t needed = PaletteBytes(format_.code);
    if (!options_.palette) {
      throw ToolError(ExitCode::kUsage, file_.path() + ": an indexed input needs --palette");
    }
    if (options_.palette->size() < needed) {
      throw ToolError(ExitCode::kBadInput, "the palette holds " +
                                               std::to_string(options_.palette->size()) +
                                               " bytes, but " + FormatText(format_.code) +
                                               " needs " + std::to_string(needed));
    }
  }

  InputFile file_;
  Format format_;
  ReadOptions options_;
  int64_t frames_ = 0;
};

class RawWriter : public ImageWriter {
 public:
  explicit RawWriter(const std::string& path) : file_(path) {}

  void WriteFrame(const Image& image) override {
    for (size_t i = 0; i < image.planes.size(); ++i) {
      for (int64_t y = 0; y < image.planes[i].rows; ++y) {
        file_.Write(image.Row(i, y), image.planes[i].rowBytes);
      }
    }
  }
  void Commit() override { file_.Commit(); }

 private:
  AtomicFile file_;
};

}  // namespace

std::unique_ptr<ImageReader> OpenRaw(const std::string& path, Format format,
                                     const ReadOptions& options) {
  return std::make_unique<RawReader>(path, format, options);
}

std::unique_ptr<ImageWriter> CreateRaw(const std::string& path) {
  return std::make_unique<RawWriter>(path);
}

}  // namespace kestrel::tools
