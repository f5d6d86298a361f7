// Image files: one reader and one writer interface over PNG, JPEG, Y4M and raw planes.
#ifndef KESTREL_TOOLS_COMMON_IMAGE_FILE_H
#define KESTREL_TOOLS_COMMON_IMAGE_FILE_H

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "tools/common/formats.h"
#include "tools/common/image.h"

namespace kestrel::tools {

enum class Container { kPng, kJpeg, kY4m, kRaw };

const char* ContainerName(Container container);

// "png", "jpeg", "y4m" or "raw".
std::optional<Container> FindContainer(const std::string& name);

// What the end of a file name says: png, jpg, jpeg, y4m; raw, yuv, rgb, bin or the name of a pixel
// format for raw planes.
struct FileType {
  Container container = Container::kRaw;
  std::optional<Format> format;
};
std::optional<FileType> TypeOfPath(const std::string& path);

// How inputs are to be read.
struct ReadOptions {
  std::optional<Container> container;                   // else by file name
  std::optional<Format> format;                         // raw planes; else by file name
  std::optional<Size> size;                             // raw planes
  int64_t pitch = 0;                                    // raw planes; 0 = rows without padding
  std::shared_ptr<const std::vector<uint8_t>> palette;  // raw planes of an indexed format
  bool jpegAsYuv = false;                               // the planes of a JPEG, not RGBA
  std::optional<uint32_t> standard;                     // colour standard of YUV inputs
};

class ImageReader {
 public:
  virtual ~ImageReader() = default;
  // The next frame; false after the last one.
  virtual bool ReadFrame(Image* image) = 0;
  virtual int64_t FrameCount() const { return 1; }
  virtual std::string FrameRate() const { return "25:1"; }
};

class ImageWriter {
 public:
  virtual ~ImageWriter() = default;
  virtual void WriteFrame(const Image& image) = 0;
  // The file appears under its name only now.
  virtual void Commit() = 0;
};

struct WriteOptions {
  int jpegQuality = 95;
  std::string frameRate = "25:1";
};

// Opens a file, or makes a picture when the name is pattern:WxH.
std::unique_ptr<ImageReader> OpenReader(const std::string& path, const ReadOptions& options);
std::unique_ptr<ImageWriter> OpenWriter(const std::string& path, Container container,
                                        const WriteOptions& options);

// True when the container can hold images of that pixel format without conversion.
bool CanHold(Container container, uint32_t format);

// The readers and writers of each container. The path appears in messages.
std::unique_ptr<ImageReader> OpenPng(const std::string& path);
std::unique_ptr<ImageReader> OpenJpeg(const std::string& path, bool asYuv);
std::unique_ptr<ImageReader> OpenY4m(const std::string& path);
std::unique_ptr<ImageReader> OpenRaw(const std::string& path, Format format,
                                     const ReadOptions& options);
std::unique_ptr<ImageReader> OpenPattern(Size size);
std::unique_ptr<ImageWriter> CreatePng(const std::string& path);
std::unique_ptr<ImageWriter> CreateJpeg(const std::string& path, int quality);
std::unique_ptr<ImageWriter> CreateY4m(const std::string& path, const std::string& frameRate);
std::unique_ptr<ImageWriter> CreateRaw(const std::string& path);
bool CanY4mHold(uint32_t format);

}  // namespace kestrel::tools

#endif
