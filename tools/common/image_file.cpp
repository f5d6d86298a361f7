#include "tools/common/image_file.h"

#include <cctype>
#include <filesystem>

#include "tools/common/command_line.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

constexpr char kPatternPrefix[] = "pattern:";

// Gives the frames of a YUV input the colour standard that the user states.
class RestandardisedReader : public ImageReader {
 public:
  RestandardisedReader(std::unique_ptr<ImageReader> reader, std::string path, uint32_t standard)
      : reader_(std::move(reader)), path_(std::move(path)), standard_(standard) {}

  bool ReadFrame(Image* image) override {
    if (!reader_->ReadFrame(image)) return false;
    if (!IsYuv(image->format)) {
      throw ToolError(ExitCode::kUnsupported,
                      path_ + ": an RGB input has no colour standard to state");
    }
    image->format = WithStandard(image->format, standard_);
    return true;
  }
  int64_t FrameCount() const override { return reader_->FrameCount(); }
  std::string FrameRate() const override { return reader_->FrameRate(); }

 private:
  std::unique_ptr<ImageReader> reader_;
  std::string path_;
  uint32_t standard_;
};

std::unique_ptr<ImageReader> OpenByContainer(const std::string& path, const ReadOptions& options) {
  if (path.rfind(kPatternPrefix, 0) == 0) {
    return OpenPattern(ParseSize(path.substr(sizeof kPatternPrefix - 1)));
  }
  const std::optional<FileType> type = TypeOfPath(path);
  if (!options.container && !type && !options.format) {
    throw ToolError(ExitCode::kUsage,
                    path + ": the name does not say what it holds (--input-container)");
  }
  Container container = Container::kRaw;
  if (options.container) {
    container = *options.container;
  } else if (type) {
    container = type->container;
  }
  switch (container) {
    case Container::kPng:
      return OpenPng(path);
    case Container::kJpeg:
      return OpenJpeg(path, options.jpegAsYuv);
    case Container::kY4m:
      return OpenY4m(path);
    case Container::kRaw:
      break;
  }
  std::optional<Format> format = options.format;
  if (!format && type) format = type->format;
  if (!format) throw ToolError(ExitCode::kUsage, path + ": raw planes need --input-format");
  return OpenRaw(path, *format, options);
}

}  // namespace

const char* ContainerName(Container container) {
  switch (container) {
    case Container::kPng:
      return "png";
    case Container::kJpeg:
      return "jpeg";
    case Container::kY4m:
      return "y4m";
    case Container::kRaw:
      break;
  }
  return "raw";
}

std::optional<Container> FindContainer(const std::string& name) {
  for (Container container :
       {Container::kPng, Container::kJpeg, Container::kY4m, Container::kRaw}) {
    if (name == ContainerName(container)) return container;
  }
  return std::nullopt;
}

std::optional<FileType> TypeOfPath(const std::string& path) {
  std::string extension = std::filesystem::path(path).extension().string();
  if (extension.empty()) return std::nullopt;
  extension.erase(0, 1);
  for (char& letter : extension) letter = char(std::tolower(static_cast<unsigned char>(letter)));
  if (extension == "jpg") return FileType{Container::kJpeg, {}};
  if (const std::optional<Container> container = FindContainer(extension)) {
    return FileType{*container, {}};
  }
  if (extension == "yuv" || extension == "rgb" || extension == "bin") {
    return FileType{Container::kRaw, {}};
  }
  if (const std::optional<Format> format = FindFormat(extension)) {
    return FileType{Container::kRaw, format};
  }
  return std::nullopt;
}

std::unique_ptr<ImageReader> OpenReader(const std::string& path, const ReadOptions& options) {
  std::unique_ptr<ImageReader> reader = OpenByContainer(path, options);
  if (!options.standard) return reader;
  return std::make_unique<RestandardisedReader>(std::move(reader), path, *options.standard);
}

std::unique_ptr<ImageWriter> OpenWriter(const std::string& path, Container container,
                                        const WriteOptions& options) {
  switch (container) {
    case Container::kPng:
      return CreatePng(path);
    case Container::kJpeg:
      return CreateJpeg(path, options.jpegQuality);
    case Container::kY4m:
      return CreateY4m(path, options.frameRate);
    case Container::kRaw:
      break;
  }
  return CreateRaw(path);
}

bool CanHold(Container container, uint32_t format) {
  switch (container) {
    case Container::kPng:
    case Container::kJpeg:
      return format == FORMAT_XBGR8888;
    case Container::kY4m:
      return CanY4mHold(format);
    case Container::kRaw:
      break;
  }
  return true;
}

}  // namespace kestrel::tools
