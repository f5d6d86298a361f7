#include "tools/common/input_file.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstring>

#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

constexpr int64_t kMaxWholeFile = int64_t(1) << 30;

}  // namespace

InputFile::InputFile(const std::string& path) : path_(path) {
  struct stat status;
  if (stat(path.c_str(), &status) != 0) {
    throw ToolError(ExitCode::kBadInput, path + ": " + std::strerror(errno));
  }
  if (!S_ISREG(status.st_mode)) ThrowMalformed("not a regular file");
  file_.reset(std::fopen(path.c_str(), "rb"));
  if (!file_) throw ToolError(ExitCode::kBadInput, path + ": " + std::strerror(errno));
  size_ = status.st_size;
}

int64_t InputFile::Remaining() const {
  return size_ - ftello(file_.get());
}

void InputFile::Read(void* data, int64_t length) {
  if (std::fread(data, 1, size_t(length), file_.get()) != size_t(length)) {
    ThrowMalformed("the file ends too early");
  }
}

void InputFile::ReadPlanes(const Image& image) {
  for (size_t i = 0; i < image.planes.size(); ++i) {
    Read(image.Row(i, 0), image.planes[i].pitch * image.planes[i].rows);
  }
}

std::vector<uint8_t> InputFile::ReadAll() {
  if (size_ > kMaxWholeFile) ThrowMalformed("the file is too large");
  std::vector<uint8_t> bytes(static_cast<size_t>(size_));
  Read(bytes.data(), size_);
  return bytes;
}

void InputFile::ThrowMalformed(const std::string& what) const {
  throw ToolError(ExitCode::kBadInput, path_ + ": " + what);
}

}  // namespace kestrel::tools
