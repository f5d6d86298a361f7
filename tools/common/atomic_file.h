// An output file that appears under its name only when it is complete.
#ifndef KESTREL_TOOLS_COMMON_ATOMIC_FILE_H
#define KESTREL_TOOLS_COMMON_ATOMIC_FILE_H

#include <cstdint>
#include <cstdio>
#include <string>

namespace kestrel::tools {

// Writes to a temporary file beside the target. Without Commit nothing is left behind, also when
// the process is interrupted. One at a time.
class AtomicFile {
 public:
  explicit AtomicFile(const std::string& path);
  ~AtomicFile();
  AtomicFile(const AtomicFile&) = delete;
  AtomicFile& operator=(const AtomicFile&) = delete;

  FILE* stream() const { return file_; }
  void Write(const void* data, int64_t length);
  void Commit();

  [[noreturn]] void ThrowCannotWrite(const std::string& why) const;

 private:
  std::string path_;    // as the user wrote it
  std::string target_;  // symbolic links resolved
  std::string temporary_;
  FILE* file_ = nullptr;
};

}  // namespace kestrel::tools

#endif
