#include "tools/convert/progress.h"

#include <unistd.h>

#include <algorithm>
#include <cstdio>

namespace kestrel::tools {

Progress::Progress(std::string unit)
    : unit_(std::move(unit)), isTerminal_(isatty(STDERR_FILENO) != 0) {}

void Progress::Clear() {
  if (!isShown_) return;
  isShown_ = false;
  lastPercent_ = -1;
  std::fputs("\r\x1b[K", stderr);
}

void Progress::Show(int64_t done, int64_t total) {
  if (!isTerminal_ || total < 2) return;
  const int64_t percent = std::min<int64_t>(100, done * 100 / total);
  if (percent == lastPercent_) return;
  lastPercent_ = percent;
  isShown_ = true;
  const std::string bar(size_t(percent * 40 / 100), '#');
  std::fprintf(stderr, "\r[%-40s] %3lld%% of %lld %s", bar.c_str(), static_cast<long long>(percent),
               static_cast<long long>(total), unit_.c_str());
  std::fflush(stderr);
}

}  // namespace kestrel::tools
