#include "tools/convert/output_names.h"

#include <cstdio>
#include <filesystem>
#include <set>

#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

constexpr char kName[] = "{name}";
constexpr char kFrame[] = "{frame}";

std::string Replace(std::string text, const std::string& what, const std::string& with) {
  for (size_t at = 0; (at = text.find(what, at)) != text.npos; at += with.size()) {
    text.replace(at, what.size(), with);
  }
  return text;
}

std::string StemOf(const std::string& input) {
  const std::string stem = std::filesystem::path(input).stem().string();
  return Replace(stem, ":", "-");
}

// The extension for files in a directory.
std::string ExtensionFor(const Options& options) {
  if (!options.outputContainer) {
    throw ToolError(ExitCode::kUsage,
                    "a directory as output needs --output-container to say what to write");
  }
  if (*options.outputContainer != Container::kRaw) return ContainerName(*options.outputContainer);
  if (!options.format) throw ToolError(ExitCode::kUsage, "raw output needs --format");
  return FormatText(options.format->code);
}

std::string PathFor(const Options& options, const std::string& input) {
  const std::string& output = options.output;
  if (output.back() == '/' || std::filesystem::is_directory(output)) {
    return (std::filesystem::path(output) / (StemOf(input) + "." + ExtensionFor(options))).string();
  }
  return Replace(output, kName, StemOf(input));
}

Output OutputFor(const Options& options, const std::string& input) {
  Output output;
  output.path = PathFor(options, input);
  const std::optional<FileType> type = TypeOfPath(output.path);
  if (!options.outputContainer && !type && !options.format) {
    throw ToolError(ExitCode::kUsage, output.path +
                                          ": the name does not say what to write "
                                          "(--output-container)");
  }
  if (options.outputContainer) {
    output.container = *options.outputContainer;
  } else if (type) {
    output.container = type->container;
  }
  output.format = options.format;
  if (output.container == Container::kRaw && type && type->format) {
    if (output.format && output.format->code != type->format->code) {
      throw ToolError(ExitCode::kUsage, output.path + ": the name contradicts --format " +
                                            FormatText(output.format->code));
    }
    if (!output.format) output.format = type->format;
  }
  if (output.container == Container::kRaw && !output.format) {
    throw ToolError(ExitCode::kUsage, output.path + ": raw output needs --format");
  }
  return output;
}

}  // namespace

std::vector<Output> NameOutputs(const Options& options) {
  std::vector<Output> outputs;
  std::set<std::string> paths;
  for (const std::string& input : options.inputs) {
    outputs.push_back(OutputFor(options, input));
    if (!paths.insert(outputs.back().path).second) {
      throw ToolError(ExitCode::kUsage, "several inputs would be written to " +
                                            outputs.back().path +
                                            ": use a directory, or {name} in the output's name");
    }
  }
  return outputs;
}

bool HasFrameNumber(const std::string& path) {
  return path.find(kFrame) != path.npos;
}

std::string WithFrameNumber(const std::string& path, int64_t frame) {
  char number[24];
  std::snprintf(number, sizeof number, "%05lld", static_cast<long long>(frame));
  return Replace(path, kFrame, number);
}

}  // namespace kestrel::tools
