#include "tools/common/command_line.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstdio>

#include "tools/common/input_file.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

template <size_t kCount>
bool ParseNumbers(const std::string& text, char separator, std::array<int32_t, kCount>* numbers) {
  const char* at = text.data();
  const char* end = at + text.size();
  for (size_t i = 0; i < kCount; ++i) {
    if (i > 0 && (at == end || *at++ != separator)) return false;
    const auto [stop, error] = std::from_chars(at, end, (*numbers)[i]);
    if (error != std::errc() || stop == at) return false;
    at = stop;
  }
  return at == end;
}

[[noreturn]] void ThrowUsage(const std::string& message) {
  throw ToolError(ExitCode::kUsage, message);
}

}  // namespace

Size ParseSize(const std::string& text) {
  std::array<int32_t, 2> n;
  if (!ParseNumbers(text, 'x', &n) || n[0] < 1 || n[1] < 1) {
    ThrowUsage("'" + text + "' is not a size such as 640x480");
  }
  return {n[0], n[1]};
}

Region ParseRegion(const std::string& text) {
  std::array<int32_t, 4> n;
  if (!ParseNumbers(text, ',', &n) || n[0] < 0 || n[1] < 0 || n[2] < 1 || n[3] < 1) {
    ThrowUsage("'" + text + "' is not a region X,Y,W,H such as 10,20,640,480");
  }
  return {n[0], n[1], n[2], n[3]};
}

Format ParseFormat(const std::string& text) {
  const std::optional<Format> format = FindFormat(text);
  if (!format) {
    throw ToolError(ExitCode::kUnsupported,
                    "unknown pixel format '" + text + "' (kestrel-convert --list-formats)");
  }
  return *format;
}

uint32_t ParseStandard(const std::string& text) {
  const std::optional<uint32_t> standard = FindStandard(text);
  if (!standard) {
    ThrowUsage("'" + text + "' is not bt601-video, bt601-full, bt709-video or bt709-full");
  }
  return *standard;
}

void AddReadOptions(CLI::App* app, ReadOptions* options) {
  const char* group = "Inputs";
  app->add_option_function<std::string>(
         "--input-container",
         [options](const std::string& text) { options->container = FindContainer(text); },
         "png, jpeg, y4m or raw; else by file name")
      ->check(CLI::IsMember({"png", "jpeg", "y4m", "raw"}))
      ->group(group);
  app->add_option_function<std::string>(
         "--input-format",
         [options](const std::string& text) { options->format = ParseFormat(text); },
         "Pixel format of raw planes: a name or 0x code; else by file name (photo.nv21)")
      ->type_name("NAME")
      ->group(group);
  app->add_option_function<std::string>(
         "--input-size", [options](const std::string& text) { options->size = ParseSize(text); },
         "Size of raw planes")
      ->type_name("WxH")
      ->group(group);
  app->add_option("--input-pitch", options->pitch,
                  "Bytes of a row of raw planes, chroma rows in proportion; else without padding")
      ->check(CLI::Range(int64_t(1), int64_t(INT32_MAX)))
      ->type_name("BYTES")
      ->group(group);
  app->add_option_function<std::string>(
         "--palette",
         [options](const std::string& path) {
           options->palette =
               std::make_shared<const std::vector<uint8_t>>(InputFile(path).ReadAll());
         },
         "Palette of an indexed input: 4 bytes B G R x for each of 2, 16 or 256 colours")
      ->type_name("FILE")
      ->group(group);
  app->add_option_function<std::string>(
         "--input-standard",
         [options](const std::string& text) { options->standard = ParseStandard(text); },
         "Colour standard of a YUV input: bt601-video (default), bt601-full, bt709-video or "
         "bt709-full; JPEG planes are bt601-full, Y4M says its range")
      ->type_name("NAME")
      ->group(group);
  app->add_flag("--jpeg-yuv", options->jpegAsYuv,
                "Take JPEG inputs as the YUV planes they hold, without conversion to RGBA")
      ->group(group);
}

std::string ExitCodeHelp() {
  return "Exit codes: 0 done, 2 wrong command line, 3 unsupported, 4 unreadable or malformed "
         "input,\n5 cannot write, 6 out of memory.";
}

bool ParseCommandLine(CLI::App* app, int argc, const char* const* argv) {
  app->set_version_flag("--version", app->get_name() + " " KESTREL_TOOLS_VERSION);
  try {
    app->parse(argc, argv);
    return true;
  } catch (const CLI::ParseError& error) {
    if (error.get_exit_code() == int(CLI::ExitCodes::Success)) {
      app->exit(error);
      return false;
    }
    std::string line = error.what();
    std::replace(line.begin(), line.end(), '\n', ' ');
    ThrowUsage(line + " (--help explains)");
  }
}

}  // namespace kestrel::tools
