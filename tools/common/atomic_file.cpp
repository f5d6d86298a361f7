#include "tools/common/atomic_file.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <filesystem>

#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

// The temporary file of the moment, for the signal handler.
char gTemporary[PATH_MAX];

void RemoveTemporaryAndDie(int signal) {
  if (gTemporary[0] != 0) unlink(gTemporary);
  raise(signal);  // the handler was reset on entry: this ends the process
}

void CatchInterrupts() {
  static const bool once = [] {
    struct sigaction action = {};
    action.sa_handler = RemoveTemporaryAndDie;
    action.sa_flags = static_cast<int>(SA_RESETHAND | SA_NODEFER);
    for (int signal : {SIGINT, SIGTERM, SIGHUP}) {
      struct sigaction current = {};
      sigaction(signal, nullptr, &current);
      if (current.sa_handler != SIG_IGN) sigaction(signal, &action, nullptr);
    }
    return true;
  }();
  static_cast<void>(once);
}

mode_t UsualMode() {
  const mode_t mask = umask(0);
  umask(mask);
  return 0666 & ~mask;
}

}  // namespace

AtomicFile::AtomicFile(const std::string& path) : path_(path), target_(path) {
  std::error_code error;
  const std::filesystem::path resolved = std::filesystem::canonical(path, error);
  mode_t mode = UsualMode();
  if (!error) {
    target_ = resolved.string();
    struct stat status;
    if (stat(target_.c_str(), &status) != 0) ThrowCannotWrite(std::strerror(errno));
    if (!S_ISREG(status.st_mode)) ThrowCannotWrite("not a regular file");
    mode = status.st_mode & 07777;
  }
  temporary_ = target_ + ".XXXXXX";
  if (temporary_.size() >= sizeof gTemporary) ThrowCannotWrite(std::strerror(ENAMETOOLONG));
  CatchInterrupts();
  const int descriptor = mkstemp(temporary_.data());
  if (descriptor < 0) ThrowCannotWrite(std::strerror(errno));
  std::memcpy(gTemporary, temporary_.c_str(), temporary_.size() + 1);
  fchmod(descriptor, mode);
  file_ = fdopen(descriptor, "wb");
  if (file_ == nullptr) {
    close(descriptor);
    unlink(temporary_.c_str());
    ThrowCannotWrite(std::strerror(errno));
  }
}

AtomicFile::~AtomicFile() {
  if (file_ != nullptr) std::fclose(file_);
  if (!temporary_.empty()) unlink(temporary_.c_str());
  gTemporary[0] = 0;
}

void AtomicFile::Write(const void* data, int64_t length) {
  if (std::fwrite(data, 1, size_t(length), file_) != size_t(length)) {
    ThrowCannotWrite(std::strerror(errno));
  }
}

void AtomicFile::Commit() {
  const bool failed = std::ferror(file_) != 0;
  const bool closed = std::fclose(file_) == 0;
  file_ = nullptr;
  if (failed || !closed) ThrowCannotWrite(std::strerror(errno));
  if (std::rename(temporary_.c_str(), target_.c_str()) != 0) {
    ThrowCannotWrite(std::strerror(errno));
  }
  temporary_.clear();
}

void AtomicFile::ThrowCannotWrite(const std::string& why) const {
  throw ToolError(ExitCode::kCannotWrite, path_ + ": cannot write: " + why);
}

}  // namespace kestrel::tools
