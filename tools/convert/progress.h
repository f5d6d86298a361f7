// A progress bar on stderr, shown only when that is a terminal.
#ifndef KESTREL_TOOLS_CONVERT_PROGRESS_H
#define KESTREL_TOOLS_CONVERT_PROGRESS_H

#include <cstdint>
#include <string>

namespace kestrel::tools {

class Progress {
 public:
  explicit Progress(std::string unit);
  ~Progress() { Clear(); }
  // Fewer than two steps show nothing.
  void Show(int64_t done, int64_t total);
  // Takes the bar away until the next Show.
  void Clear();

 private:
  std::string unit_;
  bool isTerminal_;
  bool isShown_ = false;
  int64_t lastPercent_ = -1;
};

}  // namespace kestrel::tools

#endif
