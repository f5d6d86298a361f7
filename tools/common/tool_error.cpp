#include "tools/common/tool_error.h"

#include <cstdio>
#include <new>

namespace kestrel::tools {

int RunTool(const char* tool, const std::function<ExitCode()>& body) {
  try {
    return int(body());
  } catch (const ToolError& error) {
    std::fprintf(stderr, "%s: %s\n", tool, error.what());
    return int(error.code());
  } catch (const std::bad_alloc&) {
    std::fprintf(stderr, "%s: out of memory\n", tool);
    return int(ExitCode::kOutOfMemory);
  } catch (const std::exception& error) {
    std::fprintf(stderr, "%s: %s\n", tool, error.what());
    return int(ExitCode::kBadInput);
  }
}

}  // namespace kestrel::tools
