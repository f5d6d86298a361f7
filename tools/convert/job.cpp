#include "tools/convert/job.h"

#include <cstdio>
#include <cstring>

#include "tools/common/formats.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

Region Whole(Size size) {
  return {0, 0, size.width, size.height};
}

bool Contains(Size size, const Region& region) {
  return int64_t(region.x) + region.width <= size.width &&
         int64_t(region.y) + region.height <= size.height;
}

bool IsSame(const Region& a, const Region& b) {
  return a.x == b.x && a.y == b.y && a.width == b.width && a.height == b.height;
}

std::string RegionText(const Region& region) {
  return std::to_string(region.x) + "," + std::to_string(region.y) + "," +
         std::to_string(region.width) + "," + std::to_string(region.height);
}

[[noreturn]] void ThrowUnsupported(const std::string& message) {
  throw ToolError(ExitCode::kUnsupported, message);
}

std::string Summary(const std::string& input, const std::string& output, const Image& source,
                    const Image& result, int64_t frames, const ConversionTime& time) {
  char times[128];
  if (frames > 1) {
    std::snprintf(times, sizeof times, "%lld frames, %.3f ms (%.3f ms a frame), engine %.3f ms",
                  static_cast<long long>(frames), time.convertMs, time.convertMs / double(frames),
                  time.engineMs);
  } else {
    std::snprintf(times, sizeof times, "%.3f ms, engine %.3f ms", time.convertMs, time.engineMs);
  }
  return input + " -> " + output + ": " + SizeText(source.size()) + " " +
         FormatText(source.format) + " to " + SizeText(result.size()) + " " +
         FormatText(result.format) + ", " + times;
}

}  // namespace

Job::Job(const Options& options) : options_(options) {
  if (options.onto.empty()) return;
  const std::optional<FileType> type = TypeOfPath(options.onto);
  if (!type || (type->container != Container::kPng && type->container != Container::kJpeg)) {
    throw ToolError(ExitCode::kUsage, options.onto + ": --onto takes a PNG or JPEG");
  }
  onto_.emplace();
  OpenReader(options.onto, {})->ReadFrame(&*onto_);
}

Job::Geometry Job::PlanGeometry(const Image& source) const {
  Geometry geometry;
  geometry.source = options_.sourceRegion.value_or(Whole(source.size()));
  if (!Contains(source.size(), geometry.source)) {
    throw ToolError(ExitCode::kUsage, "the region " + RegionText(geometry.source) +
                                          " reaches beyond the input of " +
                                          SizeText(source.size()));
  }
  Size picture = {geometry.source.width, geometry.source.height};
  if ((options_.transformCode & MPP_SWAP_XY) != 0) std::swap(picture.width, picture.height);
  if (options_.size) picture = *options_.size;

  const bool isPlaced = options_.canvas || onto_;
  if (options_.destRegion && !isPlaced) {
    throw ToolError(ExitCode::kUsage, "--dest-region needs --canvas or --onto");
  }
  geometry.canvas = picture;
  if (isPlaced) geometry.canvas = onto_ ? onto_->size() : *options_.canvas;
  geometry.dest = isPlaced && !options_.size ? Whole(geometry.canvas) : Whole(picture);
  if (options_.destRegion) geometry.dest = *options_.destRegion;
  if (!Contains(geometry.canvas, geometry.dest)) {
    throw ToolError(ExitCode::kUsage, "the region " + RegionText(geometry.dest) +
                                          " reaches beyond the output of " +
                                          SizeText(geometry.canvas));
  }
  geometry.isCovered = !options_.fit && IsSame(geometry.dest, Whole(geometry.canvas));
  return geometry;
}

Format Job::ChooseFormat(const Image& source, const Output& output) const {
  Format format = {FORMAT_XBGR8888, false};
  if (output.container == Container::kY4m) {
    format.code = CanHold(Container::kY4m, source.format) ? source.format : FORMAT_I420;
  }
  if (output.format) format = *output.format;
  if (IsIndexed(format.code)) {
    ThrowUnsupported("indexed formats such as " + FormatText(format.code) + " are input only");
  }
  if (output.container == Container::kY4m && !CanHold(Container::kY4m, format.code)) {
    ThrowUnsupported("Y4M holds i420, i422, i440, i444, i411 and gray8, not " +
                     FormatText(format.code));
  }
  if (IsYuv(format.code)) {
    const uint32_t given = format.code & FORMAT_STANDARD_MASK;
    const uint32_t inherited =
        IsYuv(source.format) && given == 0 ? source.format & FORMAT_STANDARD_MASK : given;
    format.code = WithStandard(format.code, options_.outputStandard.value_or(inherited));
  } else if (options_.outputStandard) {
    ThrowUnsupported("an RGB output has no colour standard to choose");
  }
  format.hasAlpha = Is32BitRgb(format.code) && (source.hasAlpha || options_.alpha);
  return format;
}

MPPPARAM Job::Parameters(const Image& source, uint32_t format) const {
  const bool isFromYuv = IsYuv(source.format);
  if (!isFromYuv &&
      (options_.brightness != 0 || options_.contrast != 0 || options_.saturation != 0)) {
    ThrowUnsupported(
        "brightness, contrast and saturation act on YUV inputs only (a JPEG can be taken as "
        "YUV: --jpeg-yuv)");
  }
  if (options_.dither && !(isFromYuv && Is16BitRgb(format))) {
    ThrowUnsupported("--dither acts on 16-bit RGB made from YUV only");
  }
  if (options_.alpha && !(isFromYuv && Is32BitRgb(format))) {
    ThrowUnsupported("--alpha acts on 32-bit RGB made from YUV only");
  }
  const bool keepsAspect = options_.fit || options_.crop;
  MPPPARAM params = {};
  params.resampleFlags = options_.bilinear ? MPP_BILINEAR : MPP_NEAREST;
  params.transformCode = options_.transformCode;
  params.passMode = options_.passMode.value_or(keepsAspect ? 1 : MPP_PASS_TILED);
  params.aspectMode = options_.fit ? MPP_ASPECT_FIT : options_.crop ? MPP_ASPECT_CROP : 0;
  params.dither = options_.dither ? 1 : 0;
  params.brightness = options_.brightness;
  params.contrast = options_.contrast;
  params.saturation = options_.saturation;
  params.alpha = options_.alpha.value_or(255);
  return params;
}

void Job::FillBackground(Image* canvas) {
  const Size size = {8, 8};
  Image solid = MakeImage(FORMAT_XBGR8888, size);
  const uint8_t pixel[4] = {uint8_t(options_.background >> 16), uint8_t(options_.background >> 8),
                            uint8_t(options_.background), 255};
  for (int32_t y = 0; y < size.height; ++y) {
    for (int32_t x = 0; x < size.width; ++x)
      std::memcpy(solid.Row(0, y) + int64_t(4) * x, pixel, 4);
  }
  MPPPARAM params = {};
  params.passMode = MPP_PASS_TILED;
  background_.Convert(solid, Whole(size), canvas, Whole(canvas->size()), params);
}

// What lies under the picture, in the format of the output.
Image Job::PrepareCanvas(const Geometry& geometry, Format format) {
  Image canvas = MakeImage(format.code, geometry.canvas);
  canvas.hasAlpha = format.hasAlpha;
  if (onto_) {
    canvas.hasAlpha = onto_->hasAlpha && Is32BitRgb(format.code);
    MPPPARAM params = {};
    params.passMode = MPP_PASS_TILED;
    ontoConverter_.Convert(*onto_, Whole(onto_->size()), &canvas, Whole(canvas.size()), params);
  } else if (!geometry.isCovered) {
    FillBackground(&canvas);
  }
  return canvas;
}

// The picture in a format that the container can hold.
const Image& Job::Present(const Image& picture, Container container, Image* storage) {
  if (CanHold(container, picture.format)) return picture;
  *storage = toRgba_.Convert(picture);
  return *storage;
}

std::string Job::Run(const std::string& input, const Output& output, Progress* progress) {
  const std::unique_ptr<ImageReader> reader = OpenReader(input, options_.read);
  const WriteOptions writeOptions = {options_.jpegQuality, reader->FrameRate()};
  const bool isFilePerFrame = HasFrameNumber(output.path);
  const bool isSingle = output.container == Container::kPng || output.container == Container::kJpeg;
  std::unique_ptr<ImageWriter> writer;
  Image source, canvas, presented;
  ConversionTime total;
  int64_t frames = 0;
  for (; reader->ReadFrame(&source); ++frames) {
    if (frames > 0 && isSingle && !isFilePerFrame) {
      throw ToolError(ExitCode::kUsage,
                      input + ": has several frames: put {frame} into the output's name");
    }
    const Geometry geometry = PlanGeometry(source);
    const Format format = ChooseFormat(source, output);
    const MPPPARAM params = Parameters(source, format.code);
    // A canvas that every frame covers anew is kept.
    if (frames == 0 || !geometry.isCovered || onto_) canvas = PrepareCanvas(geometry, format);
    const ConversionTime time =
        converter_.Convert(source, geometry.source, &canvas, geometry.dest, params);
    total.engineMs += time.engineMs;
    total.convertMs += time.convertMs;

    if (!writer) {
      const std::string path = isFilePerFrame ? WithFrameNumber(output.path, frames) : output.path;
      writer = OpenWriter(path, output.container, writeOptions);
    }
    writer->WriteFrame(Present(canvas, output.container, &presented));
    if (isFilePerFrame) {
      writer->Commit();
      writer.reset();
    }
    if (progress != nullptr) progress->Show(frames + 1, reader->FrameCount());
  }
  if (writer) writer->Commit();
  return Summary(input, output.path, source, canvas, frames, total);
}

}  // namespace kestrel::tools
