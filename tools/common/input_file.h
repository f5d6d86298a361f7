// A regular file opened for reading.
#ifndef KESTREL_TOOLS_COMMON_INPUT_FILE_H
#define KESTREL_TOOLS_COMMON_INPUT_FILE_H

#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "tools/common/image.h"

namespace kestrel::tools {

class InputFile {
 public:
  explicit InputFile(const std::string& path);

  const std::string& path() const { return path_; }
  int64_t size() const { return size_; }
  int64_t Remaining() const;
  FILE* stream() const { return file_.get(); }

  // Throws when the file ends before.
  void Read(void* data, int64_t length);
  // The rows of all planes, padding included.
  void ReadPlanes(const Image& image);
  std::vector<uint8_t> ReadAll();

  [[noreturn]] void ThrowMalformed(const std::string& what) const;

 private:
  struct Closer {
    void operator()(FILE* file) const { std::fclose(file); }
  };
  std::string path_;
  std::unique_ptr<FILE, Closer> file_;
  int64_t size_ = 0;
};

}  // namespace kestrel::tools

#endif
