// kestrel-compare: how far two images are apart.
#include <cstdio>
#include <memory>
#include <optional>
#include <string>

#include "tools/common/command_line.h"
#include "tools/common/image_file.h"
#include "tools/common/tool_error.h"
#include "tools/compare/metrics.h"

namespace kestrel::tools {
namespace {

struct Options {
  std::string paths[2];
  ReadOptions read;
  std::string difference;
  int amplify = 8;
  std::optional<double> minPsnr;
};

bool ParseOptions(int argc, const char* const* argv, Options* options) {
  CLI::App app("Compares two images: PSNR, SSIM and greatest difference of each channel",
               "kestrel-compare");
  app.footer(
      "Planar YUV images of one kind are compared in Y, U and V, all others in R, G and B. Frames\n"
      "of Y4M and raw files are compared one by one and summed up.\n" +
      ExitCodeHelp() + "\nExit code 1: the PSNR of all channels is below --min-psnr.");
  app.add_option("A", options->paths[0], "PNG, JPEG, Y4M or raw planes")->required();
  app.add_option("B", options->paths[1], "PNG, JPEG, Y4M or raw planes")->required();
  app.add_option("--difference", options->difference,
                 "Write a picture of the RGB differences of the first frame (PNG or JPEG)")
      ->type_name("FILE");
  app.add_option("--amplify", options->amplify, "Factor for the difference picture")
      ->check(CLI::Range(1, 255))
      ->capture_default_str();
  app.add_option("--min-psnr", options->minPsnr, "Least PSNR in dB for success")->type_name("DB");
  AddReadOptions(&app, &options->read);
  return ParseCommandLine(&app, argc, argv);
}

void WriteDifference(const std::string& path, const Image& picture) {
  const std::optional<FileType> type = TypeOfPath(path);
  if (!type || !CanHold(type->container, picture.format)) {
    throw ToolError(ExitCode::kUsage, path + ": the difference picture is a PNG or JPEG");
  }
  const std::unique_ptr<ImageWriter> writer = OpenWriter(path, type->container, {});
  writer->WriteFrame(picture);
  writer->Commit();
}

void PrintLine(const ChannelDifference& difference) {
  std::printf("%-7s  %8.3f  %8.6f  %7d\n", difference.name.c_str(), difference.Psnr(),
              difference.Ssim(), difference.maximum);
}

ExitCode Compare(int argc, const char* const* argv) {
  Options options;
  if (!ParseOptions(argc, argv, &options)) return ExitCode::kSuccess;
  const std::unique_ptr<ImageReader> readers[2] = {OpenReader(options.paths[0], options.read),
                                                   OpenReader(options.paths[1], options.read)};
  Comparison comparison;
  Image images[2];
  for (bool isFirst = true;; isFirst = false) {
    const bool hasFrame = readers[0]->ReadFrame(&images[0]);
    if (hasFrame != readers[1]->ReadFrame(&images[1])) {
      throw ToolError(ExitCode::kUnsupported, "the inputs differ in their number of frames");
    }
    if (!hasFrame) break;
    if (images[0].width != images[1].width || images[0].height != images[1].height) {
      throw ToolError(ExitCode::kUnsupported,
                      "the inputs differ in size: " + SizeText(images[0].size()) + " and " +
                          SizeText(images[1].size()));
    }
    comparison.AddFrame(images[0], images[1]);
    if (isFirst && !options.difference.empty()) {
      WriteDifference(options.difference,
                      comparison.DifferencePicture(images[0], images[1], options.amplify));
    }
  }
  std::printf("%-7s  %8s  %8s  %7s\n", "channel", "PSNR dB", "SSIM", "maximum");
  for (const ChannelDifference& channel : comparison.channels()) PrintLine(channel);
  const ChannelDifference overall = comparison.Overall();
  PrintLine(overall);
  if (options.minPsnr && overall.Psnr() < *options.minPsnr) return ExitCode::kDifferent;
  return ExitCode::kSuccess;
}

}  // namespace
}  // namespace kestrel::tools

int main(int argc, char** argv) {
  return kestrel::tools::RunTool("kestrel-compare",
                                 [&] { return kestrel::tools::Compare(argc, argv); });
}
