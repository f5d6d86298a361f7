// What the command lines of the tools share.
#ifndef KESTREL_TOOLS_COMMON_COMMAND_LINE_H
#define KESTREL_TOOLS_COMMON_COMMAND_LINE_H

#include <CLI/CLI.hpp>
#include <cstdint>
#include <string>

#include "tools/common/image.h"
#include "tools/common/image_file.h"

namespace kestrel::tools {

// These throw ToolError with kUsage.
Size ParseSize(const std::string& text);      // WxH
Region ParseRegion(const std::string& text);  // X,Y,W,H
Format ParseFormat(const std::string& text);
uint32_t ParseStandard(const std::string& text);

void AddReadOptions(CLI::App* app, ReadOptions* options);

// The line that ends --help: exit codes.
std::string ExitCodeHelp();

// False when the user asked for help or the version, which is then printed. Throws ToolError with
// kUsage for a wrong command line.
bool ParseCommandLine(CLI::App* app, int argc, const char* const* argv);

}  // namespace kestrel::tools

#endif
