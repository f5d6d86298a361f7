// Errors that end a tool: one line for the user and an exit code.
#ifndef KESTREL_TOOLS_COMMON_TOOL_ERROR_H
#define KESTREL_TOOLS_COMMON_TOOL_ERROR_H

#include <functional>
#include <stdexcept>
#include <string>

namespace kestrel::tools {

enum class ExitCode : int {
  kSuccess = 0,
  kDifferent = 1,  // kestrel-compare: below the wanted quality
  kUsage = 2,
  kUnsupported = 3,
  kBadInput = 4,
  kCannotWrite = 5,
  kOutOfMemory = 6,
};

class ToolError : public std::runtime_error {
 public:
  ToolError(ExitCode code, const std::string& message) : std::runtime_error(message), code_(code) {}
  ExitCode code() const { return code_; }

 private:
  ExitCode code_;
};

// Runs the body of main. An error becomes the line "tool: message" on stderr and its exit code.
int RunTool(const char* tool, const std::function<ExitCode()>& body);

}  // namespace kestrel::tools

#endif
