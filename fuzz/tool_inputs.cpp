// What the command-line tools read: Y4M, raw, PNG and JPEG files, command lines, values of options.
// Everything malformed must end in the error that the tools report.
#include <sys/mman.h>
#include <unistd.h>

#include <new>

#include "fuzz/input.h"
#include "tools/common/command_line.h"
#include "tools/common/formats.h"
#include "tools/common/image_file.h"
#include "tools/common/tool_error.h"
#include "tools/convert/options.h"
#include "tools/convert/output_names.h"

namespace {

using fuzz::Input;
using fuzz::Require;
using kestrel::tools::Image;
using kestrel::tools::ImageReader;
using kestrel::tools::ReadOptions;
using kestrel::tools::Size;
using kestrel::tools::ToolError;

constexpr size_t kMostBytes = 1 << 16;

// A file in memory and its path.
class File {
 public:
  explicit File(const std::string& bytes) : handle_(memfd_create("input", 0)) {
    Require(handle_ >= 0 && write(handle_, bytes.data(), bytes.size()) == ssize_t(bytes.size()),
            "no file in memory");
    path_ = "/proc/self/fd/" + std::to_string(handle_);
  }
  ~File() { close(handle_); }
  File(const File&) = delete;
  File& operator=(const File&) = delete;

  const std::string& path() const { return path_; }

 private:
  int handle_;
  std::string path_;
};

// Reads every byte that the engine would be given.
void Touch(const Image& image) {
  const kestrel::tools::EnginePlanes bound = BindPlanes(image);
  Require(bound.plane[0] != nullptr, "a frame without pixels");
  volatile uint8_t sink = 0;
  for (size_t i = 0; i < image.planes.size(); ++i) {
    const kestrel::tools::StoredPlane& plane = image.planes[i];
    Require(plane.rows > 0 && plane.rowBytes > 0 && plane.pitch >= plane.rowBytes,
            "a plane of senseless size");
    for (int64_t row = 0; row < plane.rows; ++row) {
      sink = image.Row(i, row)[0];
      sink = image.Row(i, row)[plane.rowBytes - 1];
    }
  }
  (void)sink;
}

void ReadFrames(ImageReader* reader) {
  const int64_t promised = reader->FrameCount();
  Require(promised > 0, "a file without frames is opened");
  Require(!reader->FrameRate().empty(), "a film without a frame rate");
  Image image;
  int64_t frames = 0;
  while (frames < 8 && reader->ReadFrame(&image)) {
    ++frames;
    Touch(image);
  }
  Require(frames <= promised, "more frames than promised");
}

void ReadY4m(Input* input) {
  const File file(input->Text(kMostBytes));
  ReadFrames(kestrel::tools::OpenY4m(file.path()).get());
}

void ReadRaw(Input* input) {
  const auto& formats = kestrel::tools::AllFormats();
  const auto& format = formats[size_t(input->Between(0, int32_t(formats.size()) - 1))];
  uint32_t code = input->OneIn(8) ? input->Word() : format.code;
  ReadOptions options;
  if (!input->OneIn(16)) {
    options.size = Size{input->Between(1, 40), input->Between(1, 40)};
    if (input->OneIn(8)) options.size->width = int32_t(input->Word());
    if (input->OneIn(8)) options.size->height = int32_t(input->Word());
  }
  if (input->OneIn(4)) options.pitch = input->OneIn(4) ? int32_t(input->Word()) : input->Byte();
  if (input->OneIn(3)) {
    const size_t entries[] = {0, 7, 8, 64, 1024};
    options.palette = std::make_shared<const std::vector<uint8_t>>(input->Pick(entries), 1);
  }
  std::string bytes;
  if (options.size && input->OneIn(2)) {  // as many bytes as some frames take
    const auto planes = LayOutPlanes(code, *options.size, options.pitch);
    const int64_t frame = TotalBytes(planes);
    if (frame <= int64_t(kMostBytes)) bytes.assign(size_t(frame * input->Between(1, 3)), 'x');
  } else {
    bytes = input->Text(kMostBytes);
  }
  const File file(bytes);
  ReadFrames(OpenRaw(file.path(), {code, false}, options).get());
}

uint32_t BigEndian(const std::string& bytes, size_t at, size_t count) {
  uint32_t value = 0;
  for (size_t i = 0; i < count; ++i) value = value << 8 | uint8_t(bytes[at + i]);
  return value;
}

bool IsSmall(uint32_t width, uint32_t height) {
  return uint64_t(width) * height <= 1 << 20;
}

// Pictures of millions of pixels cost time and show nothing more.
void ReadPng(Input* input) {
  const std::string bytes = input->Text(kMostBytes);
  if (bytes.size() >= 24 && !IsSmall(BigEndian(bytes, 16, 4), BigEndian(bytes, 20, 4))) return;
  const File file(bytes);
  ReadFrames(kestrel::tools::OpenPng(file.path()).get());
}

void ReadJpeg(Input* input) {
  const bool asYuv = input->OneIn(2);
  const std::string bytes = input->Text(kMostBytes);
  for (size_t at = 0; at + 9 <= bytes.size(); ++at) {  // whatever may be a start of frame
    const bool isFrame = bytes[at] == '\xff' && (uint8_t(bytes[at + 1]) & 0xF0) == 0xC0;
    if (isFrame && !IsSmall(BigEndian(bytes, at + 5, 2), BigEndian(bytes, at + 7, 2))) return;
  }
  const File file(bytes);
  ReadFrames(kestrel::tools::OpenJpeg(file.path(), asYuv).get());
}

// Arguments are separated by line ends.
void ReadCommandLine(Input* input) {
  std::vector<std::string> words = {"kestrel-convert"};
  const std::string text = input->Text(4096);
  for (size_t at = 0; at < text.size() && words.size() < 64;) {
    const size_t end = std::min(text.find('\n', at), text.size());
    words.push_back(text.substr(at, end - at));
    at = end + 1;
  }
  std::vector<const char*> argv;
  argv.reserve(words.size() + 1);
  for (const std::string& word : words) argv.push_back(word.c_str());
  argv.push_back(nullptr);
  kestrel::tools::Options options;
  if (!ParseOptions(int(words.size()), argv.data(), &options) || options.listFormats) return;
  Require(!options.inputs.empty() && !options.output.empty(), "nothing to do is accepted");
  Require(options.jpegQuality >= 1 && options.jpegQuality <= 100, "an impossible quality");
  Require(options.brightness >= -128 && options.brightness <= 128, "an impossible brightness");
  Require(!(options.fit && options.crop), "both policies are accepted");
  Require(options.read.pitch >= 0, "a negative pitch is accepted");
  Require(NameOutputs(options).size() == options.inputs.size(), "an input has no output");
}

void ReadValues(Input* input) {
  const int32_t kind = input->Between(0, 4);
  const std::string text = input->Text(256);
  if (kind == 0) {
    const Size size = kestrel::tools::ParseSize(text);
    Require(SizeText(size) == text || text.find('0') != text.npos, "another size than written");
    Require(size.width >= 1 && size.height >= 1, "an empty size is accepted");
  } else if (kind == 1) {
    const kestrel::tools::Region region = kestrel::tools::ParseRegion(text);
    Require(region.x >= 0 && region.y >= 0 && region.width >= 1 && region.height >= 1,
            "an empty region is accepted");
  } else if (kind == 2) {
    const kestrel::tools::Format format = kestrel::tools::ParseFormat(text);
    Require(TotalBytes(LayOutPlanes(format.code, Size{1, 1})) > 0, "a format without bytes");
    Require(!kestrel::tools::FormatText(format.code).empty(), "a format without a name");
  } else if (kind == 3) {
    const uint32_t standard = kestrel::tools::ParseStandard(text);
    Require((standard & ~FORMAT_STANDARD_MASK) == 0, "a standard beyond its bits");
  } else {
    kestrel::tools::TypeOfPath(text);
    kestrel::tools::FindContainer(text);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  try {
    constexpr void (*kReaders[])(Input*) = {ReadY4m, ReadRaw,  ReadCommandLine,
                                            ReadPng, ReadJpeg, ReadValues};
    input.Pick(kReaders)(&input);
  } catch (const ToolError& error) {
    Require(error.what()[0] != '\0', "an error without a message");
    Require(error.code() != kestrel::tools::ExitCode::kSuccess, "an error that is a success");
  } catch (const std::bad_alloc&) {
    fuzz::Fail("so small an input takes all memory");
  } catch (const std::exception& error) {  // of the standard library; the tools print it
    Require(error.what()[0] != '\0', "an error without a message");
  }
  return 0;
}
