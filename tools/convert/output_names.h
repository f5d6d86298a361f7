// Names of output files.
#ifndef KESTREL_TOOLS_CONVERT_OUTPUT_NAMES_H
#define KESTREL_TOOLS_CONVERT_OUTPUT_NAMES_H

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "tools/common/image_file.h"
#include "tools/convert/options.h"

namespace kestrel::tools {

// What is to be written. The format is missing when neither an option nor the file name says it.
struct Output {
  std::string path;  // may hold {frame}
  Container container = Container::kRaw;
  std::optional<Format> format;
};

// One output for each input. Throws ToolError with kUsage when names are missing or meet.
std::vector<Output> NameOutputs(const Options& options);

bool HasFrameNumber(const std::string& path);
std::string WithFrameNumber(const std::string& path, int64_t frame);

}  // namespace kestrel::tools

#endif
