// The command line of kestrel-convert.
#ifndef KESTREL_TOOLS_CONVERT_OPTIONS_H
#define KESTREL_TOOLS_CONVERT_OPTIONS_H

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "tools/common/formats.h"
#include "tools/common/image.h"
#include "tools/common/image_file.h"

namespace kestrel::tools {

struct Options {
  std::vector<std::string> inputs;
  std::string output;
  bool listFormats = false;
  bool printTimes = false;

  ReadOptions read;
  std::optional<Container> outputContainer;
  std::optional<Format> format;
  std::optional<uint32_t> outputStandard;
  int jpegQuality = 95;

  std::optional<Size> size;
  std::optional<Size> canvas;
  std::optional<Region> sourceRegion;
  std::optional<Region> destRegion;
  std::string onto;
  uint32_t background = 0;  // 0xRRGGBB

  bool bilinear = true;
  uint32_t transformCode = 0;
  bool fit = false;
  bool crop = false;
  int32_t brightness = 0;
  int32_t contrast = 0;
  int32_t saturation = 0;
  bool dither = false;
  std::optional<uint32_t> alpha;
  std::optional<uint32_t> passMode;
};

// False when help or the version was asked for and printed. Throws ToolError for a wrong command
// line.
bool ParseOptions(int argc, const char* const* argv, Options* options);

}  // namespace kestrel::tools

#endif
