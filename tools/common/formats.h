// Names of the pixel formats on the command line.
#ifndef KESTREL_TOOLS_COMMON_FORMATS_H
#define KESTREL_TOOLS_COMMON_FORMATS_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "engine/postprocess.h"

namespace kestrel::tools {

// Planar 4:1:1, which Y4M files and JPEG pictures can hold.
constexpr uint32_t kFormatI411 = 0x50000830u;

struct FormatName {
  const char* name;
  uint32_t code;
  const char* memory;     // bytes in memory, lowest address first
  bool hasAlpha = false;  // the fourth byte is alpha rather than spare
};

const std::vector<FormatName>& AllFormats();

struct Format {
  uint32_t code = 0;
  bool hasAlpha = false;
};

// A format by its name or by its code (0x...); nothing when the library does not know it.
std::optional<Format> FindFormat(std::string_view text);

// The name of a code whatever its colour standard, or its number.
std::string FormatText(uint32_t code);

bool IsYuv(uint32_t code);
bool IsIndexed(uint32_t code);
bool Is32BitRgb(uint32_t code);
bool Is16BitRgb(uint32_t code);

// A YUV code with the given colour standard (one of FORMAT_BT601_VIDEO ...).
uint32_t WithStandard(uint32_t code, uint32_t standard);

std::optional<uint32_t> FindStandard(std::string_view text);

}  // namespace kestrel::tools

#endif
