// Y4M: a text header, then frames of planar YUV, each behind a text line.
#include <charconv>
#include <string_view>

#include "tools/common/atomic_file.h"
#include "tools/common/image_file.h"
#include "tools/common/input_file.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

constexpr size_t kMaxLine = 1024;
constexpr std::string_view kMagic = "YUV4MPEG2";
constexpr std::string_view kFrame = "FRAME";

struct Chroma {
  std::string_view tag;
  uint32_t format;
};
// The first tag of a format is the one that is written.
constexpr Chroma kChromas[] = {
    {"420jpeg", FORMAT_I420},  {"420", FORMAT_I420}, {"420mpeg2", FORMAT_I420},
    {"420paldv", FORMAT_I420}, {"422", FORMAT_I422}, {"440", FORMAT_I440},
    {"444", FORMAT_I444},      {"411", kFormatI411}, {"mono", FORMAT_GRAY8},
};

class Y4mReader : public ImageReader {
 public:
  explicit Y4mReader(const std::string& path) : file_(path) {
    const std::string header = ReadLine();
    std::string_view rest = header;
    if (NextWord(&rest) != kMagic) file_.ThrowMalformed("not a Y4M file");
    std::string_view chroma = kChromas[0].tag;
    bool isFullRange = false;
    while (!rest.empty()) {
      const std::string_view word = NextWord(&rest);
      if (word.empty()) continue;
      const std::string_view value = word.substr(1);
      switch (word[0]) {
        case 'W':
          size_.width = ParseSide(value);
          break;
        case 'H':
          size_.height = ParseSide(value);
          break;
        case 'C':
          chroma = value;
          break;
        case 'F':
          if (IsRatio(value)) frameRate_ = value;
          break;
        case 'X':
          if (value == "COLORRANGE=FULL") isFullRange = true;
          break;
        default:
          break;
      }
    }
    if (size_.width == 0 || size_.height == 0) file_.ThrowMalformed("the header gives no size");
    format_ = FormatOf(chroma) | (isFullRange ? FORMAT_BT601_FULL : FORMAT_BT601_VIDEO);
    frameBytes_ = TotalBytes(LayOutPlanes(format_, size_));
    frames_ = file_.Remaining() / (frameBytes_ + int64_t(kFrame.size()) + 1);
    if (frames_ == 0) file_.ThrowMalformed("holds no complete frame");
  }

  bool ReadFrame(Image* image) override {
    if (file_.Remaining() == 0) return false;
    const std::string line = ReadLine();
    std::string_view rest = line;
    if (NextWord(&rest) != kFrame) file_.ThrowMalformed("a frame does not start with FRAME");
    if (file_.Remaining() < frameBytes_) file_.ThrowMalformed("the last frame is cut off");
    *image = MakeImage(format_, size_);
    file_.ReadPlanes(*image);
    return true;
  }
  int64_t FrameCount() const override { return frames_; }
  std::string FrameRate() const override { return frameRate_; }

 private:
  std::string ReadLine() {
    std::string line;
    for (int letter; (letter = std::fgetc(file_.stream())) != '\n';) {
      if (letter == EOF || line.size() == kMaxLine) file_.ThrowMalformed("not a Y4M file");
      line += char(letter);
    }
    return line;
  }

  static std::string_view NextWord(std::string_view* rest) {
    const size_t end = std::min(rest->find(' '), rest->size());
    const std::string_view word = rest->substr(0, end);
    rest->remove_prefix(std::min(end + 1, rest->size()));
    return word;
  }

  int32_t ParseSide(std::string_view text) const {
    int32_t side = 0;
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, side);
    if (error != std::errc() || stop != end || side < 1) {
      file_.ThrowMalformed("the header gives a senseless size");
    }
    return side;
  }

  static bool IsRatio(std::string_view text) {
    return !text.empty() && text.find_first_not_of("0123456789:") == std::string_view::npos;
  }

  uint32_t FormatOf(std::string_view tag) const {
    for (const Chroma& chroma : kChromas) {
      if (chroma.tag == tag) return chroma.format;
    }
    throw ToolError(ExitCode::kUnsupported,
                    file_.path() + ": Y4M chroma '" + std::string(tag) + "' is not supported");
  }

  InputFile file_;
  Size size_;
  uint32_t format_ = 0;
  int64_t frameBytes_ = 0;
  int64_t frames_ = 0;
  std::string frameRate_ = "25:1";
};

class Y4mWriter : public ImageWriter {
 public:
  Y4mWriter(const std::string& path, std::string frameRate)
      : file_(path), frameRate_(std::move(frameRate)) {}

  void WriteFrame(const Image& image) override {
    if (!hasHeader_) WriteText(Header(image));
    hasHeader_ = true;
    WriteText(std::string(kFrame) + "\n");
    for (size_t i = 0; i < image.planes.size(); ++i) {
      for (int64_t y = 0; y < image.planes[i].rows; ++y) {
        file_.Write(image.Row(i, y), image.planes[i].rowBytes);
      }
    }
  }
  void Commit() override { file_.Commit(); }

 private:
  std::string Header(const Image& image) const {
    const uint32_t layout = image.format & ~FORMAT_STANDARD_MASK;
    std::string_view tag;
    for (const Chroma& chroma : kChromas) {
      if (tag.empty() && chroma.format == layout) tag = chroma.tag;
    }
    const bool isFullRange = (image.format & FORMAT_BT601_FULL) != 0;
    return std::string(kMagic) + " W" + std::to_string(image.width) + " H" +
           std::to_string(image.height) + " F" + frameRate_ + " Ip A1:1 C" + std::string(tag) +
           " XCOLORRANGE=" + (isFullRange ? "FULL" : "LIMITED") + "\n";
  }

  void WriteText(const std::string& text) { file_.Write(text.data(), int64_t(text.size())); }

  AtomicFile file_;
  std::string frameRate_;
  bool hasHeader_ = false;
};

}  // namespace

bool CanY4mHold(uint32_t format) {
  for (const Chroma& chroma : kChromas) {
    if (IsYuv(format) && chroma.format == (format & ~FORMAT_STANDARD_MASK)) return true;
  }
  return false;
}

std::unique_ptr<ImageReader> OpenY4m(const std::string& path) {
  return std::make_unique<Y4mReader>(path);
}

std::unique_ptr<ImageWriter> CreateY4m(const std::string& path, const std::string& frameRate) {
  return std::make_unique<Y4mWriter>(path, frameRate);
}

}  // namespace kestrel::tools
