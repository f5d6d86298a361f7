#include "tools/convert/options.h"

#include <charconv>

#include "tools/common/command_line.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

constexpr char kFooter[] =
    "The output is written under its name only when complete. With several inputs OUTPUT is a\n"
    "directory, or a name with {name} for the input's name; {frame} makes one file of each frame\n"
    "of a Y4M or raw input. PNG and JPEG hold RGBA: a picture in another --format is converted\n"
    "to that format first and from there to RGBA, so that it can be looked at. An input named\n"
    "pattern:WxH is a generated test picture.\n"
    "--rotate comes first and turns clockwise; --mirror then acts on the rotated picture.\n"
    "Sizes and regions of the output are those of the rotated picture.\n";

uint32_t ParseColour(const std::string& text) {
  uint32_t colour = 0;
  const char* end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data(), end, colour, 16);
  if (text.size() != 6 || error != std::errc() || stop != end) {
    throw ToolError(ExitCode::kUsage, "'" + text + "' is not a colour such as ff8000");
  }
  return colour;
}

// Clockwise angle to transform code.
uint32_t RotationCode(int degrees) {
  switch (degrees) {
    case 90:
      return MPP_SWAP_XY | MPP_MIRROR_X;
    case 180:
      return MPP_MIRROR_X | MPP_MIRROR_Y;
    case 270:
      return MPP_SWAP_XY | MPP_MIRROR_Y;
    default:
      return 0;
  }
}

void AddOutputOptions(CLI::App* app, Options* options) {
  const char* group = "Output";
  app->add_option_function<std::string>(
         "--output-container",
         [options](const std::string& text) { options->outputContainer = FindContainer(text); },
         "png, jpeg, y4m or raw; else by file name")
      ->check(CLI::IsMember({"png", "jpeg", "y4m", "raw"}))
      ->group(group);
  app->add_option_function<std::string>(
         "--format", [options](const std::string& text) { options->format = ParseFormat(text); },
         "Pixel format: a name or 0x code; else by file name (frame.nv21), rgba for PNG and JPEG, "
         "the input's own or i420 for Y4M")
      ->type_name("NAME")
      ->group(group);
  app->add_option_function<std::string>(
         "--output-standard",
         [options](const std::string& text) { options->outputStandard = ParseStandard(text); },
         "Colour standard of a YUV output; else that of a YUV input, else bt601-video")
      ->type_name("NAME")
      ->group(group);
  app->add_option("--quality", options->jpegQuality, "Quality of a JPEG")
      ->check(CLI::Range(1, 100))
      ->capture_default_str()
      ->group(group);
  app->add_flag("--dither", options->dither,
                "Carry rounding errors along, for 16-bit RGB made from YUV")
      ->group(group);
  app->add_option("--alpha", options->alpha,
                  "Fourth byte of 32-bit RGB made from YUV or grey (default 255)")
      ->check(CLI::Range(0, 255))
      ->type_name("N")
      ->group(group);
  app->add_flag("--time", options->printTimes, "Print how long each conversion took")->group(group);
}

void AddGeometryOptions(CLI::App* app, Options* options) {
  const char* group = "Geometry";
  app->add_option_function<std::string>(
         "--size", [options](const std::string& text) { options->size = ParseSize(text); },
         "Size of the picture; else that of the input")
      ->type_name("WxH")
      ->group(group);
  app->add_option_function<std::string>(
         "--filter", [options](const std::string& text) { options->bilinear = text != "nearest"; },
         "nearest or bilinear (default)")
      ->check(CLI::IsMember({"nearest", "bilinear"}))
      ->group(group);
  app->add_option_function<std::string>(
         "--rotate",
         [options](const std::string& text) {
           options->transformCode ^= RotationCode(std::stoi(text));
         },
         "0, 90, 180 or 270 degrees clockwise")
      ->check(CLI::IsMember({"0", "90", "180", "270"}))
      ->group(group);
  app->add_option_function<std::string>(
         "--mirror",
         [options](const std::string& text) {
           if (text.find('x') != text.npos) options->transformCode ^= MPP_MIRROR_X;
           if (text.find('y') != text.npos) options->transformCode ^= MPP_MIRROR_Y;
         },
         "x exchanges left and right, y top and bottom, xy both")
      ->check(CLI::IsMember({"x", "y", "xy"}))
      ->group(group);
  CLI::Option* fit = app->add_flag("--fit", options->fit,
                                   "Keep the aspect ratio: leave margins in the background colour");
  CLI::Option* crop =
      app->add_flag("--crop", options->crop, "Keep the aspect ratio: cut the input, centred");
  fit->group(group)->excludes(crop);
  crop->group(group);
  app->add_option_function<std::string>(
         "--source-region",
         [options](const std::string& text) { options->sourceRegion = ParseRegion(text); },
         "Part of the input to take")
      ->type_name("X,Y,W,H")
      ->group(group);
  CLI::Option* canvas =
      app->add_option_function<std::string>(
             "--canvas", [options](const std::string& text) { options->canvas = ParseSize(text); },
             "Size of the output when the picture fills only a part of it")
          ->type_name("WxH")
          ->group(group);
  CLI::Option* onto =
      app->add_option("--onto", options->onto, "Draw over a copy of this PNG or JPEG")
          ->type_name("FILE")
          ->group(group);
  onto->excludes(canvas);
  CLI::Option* region =
      app->add_option_function<std::string>(
             "--dest-region",
             [options](const std::string& text) { options->destRegion = ParseRegion(text); },
             "Where the picture lies in --canvas or --onto (default: all of it)")
          ->type_name("X,Y,W,H")
          ->group(group);
  region->excludes("--size");
  app->add_option_function<std::string>(
         "--background",
         [options](const std::string& text) { options->background = ParseColour(text); },
         "Colour of what the picture does not cover (default 000000)")
      ->type_name("RRGGBB")
      ->group(group);
  app->add_option_function<std::string>(
         "--block-mode",
         [options](const std::string& text) {
           options->passMode = text == "tiled" ? MPP_PASS_TILED : uint32_t(std::stoul(text));
         },
         "tiled (default), 1, 2, 3 or 4: how the engine cuts the picture into blocks. The "
         "engines of a tiled job round the margins of --fit and --crop differently, which shows "
         "as seams, so 1 is the default there")
      ->check(CLI::IsMember({"tiled", "1", "2", "3", "4"}))
      ->group(group);
}

void AddAdjustments(CLI::App* app, Options* options) {
  const auto add = [app](const char* name, int32_t* value, const char* what) {
    app->add_option(name, *value, what)
        ->check(CLI::Range(-128, 128))
        ->type_name("N")
        ->group("Adjustments of YUV inputs, -128 to 128");
  };
  add("--brightness", &options->brightness, "0 leaves it");
  add("--contrast", &options->contrast, "0 leaves it, -128 is flat grey");
  add("--saturation", &options->saturation, "0 leaves it, -128 is colourless");
}

}  // namespace

bool ParseOptions(int argc, const char* const* argv, Options* options) {
  CLI::App app("Converts pictures and frames: pixel format, size, rotation, crop, adjustments",
               "kestrel-convert");
  app.footer(std::string(kFooter) + ExitCodeHelp());
  app.add_option("INPUT", options->inputs, "PNG, JPEG, Y4M or raw planes");
  app.add_option("-o,--output", options->output, "PNG, JPEG, Y4M or raw planes")
      ->type_name("OUTPUT");
  app.add_flag("--list-formats", options->listFormats,
               "List pixel formats: name, code, bytes in memory");
  AddReadOptions(&app, &options->read);
  AddOutputOptions(&app, options);
  AddGeometryOptions(&app, options);
  AddAdjustments(&app, options);
  if (!ParseCommandLine(&app, argc, argv)) return false;
  if (options->listFormats) return true;
  if (options->inputs.empty()) throw ToolError(ExitCode::kUsage, "no input (--help explains)");
  if (options->output.empty()) {
    throw ToolError(ExitCode::kUsage, "no output: -o OUTPUT (--help explains)");
  }
  return true;
}

}  // namespace kestrel::tools
