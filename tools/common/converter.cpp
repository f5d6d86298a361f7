#include "tools/common/converter.h"

#include <chrono>
#include <cstring>

#include "tools/common/formats.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

using Clock = std::chrono::steady_clock;

double MsSince(Clock::time_point start) {
  return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

bool Same(const MPPFORMAT& a, const MPPFORMAT& b) {
  return a.format == b.format && a.width == b.width && a.height == b.height &&
         a.palette == b.palette;
}

void Check(uint32_t result, const Image& src, const Image& dst) {
  if (result == KESTREL_OK) return;
  if (result == KESTREL_OUT_OF_MEMORY) throw std::bad_alloc();
  const char* reason = result == KESTREL_BAD_ARGUMENT ? ": the scale is too extreme" : "";
  throw ToolError(ExitCode::kUnsupported,
                  "cannot convert " + SizeText(src.size()) + " " + FormatText(src.format) + " to " +
                      SizeText(dst.size()) + " " + FormatText(dst.format) + reason);
}

}  // namespace

ConversionTime Converter::Convert(const Image& src, const Region& srcRegion, Image* dst,
                                  const Region& dstRegion, MPPPARAM params) {
  params.srcOriginX = srcRegion.x;
  params.srcOriginY = srcRegion.y;
  params.dstOriginX = dstRegion.x;
  params.dstOriginY = dstRegion.y;
  const uint8_t* palette = src.palette ? src.palette->data() : nullptr;
  MPPFORMAT dstRecord = {dst->format, dstRegion.width, dstRegion.height, nullptr};
  MPPFORMAT srcRecord = {src.format, srcRegion.width, srcRegion.height, palette};

  ConversionTime time;
  if (!handle_ || !Same(dstRecord, dstRecord_) || !Same(srcRecord, srcRecord_) ||
      std::memcmp(&params, &params_, sizeof params) != 0) {
    const Clock::time_point start = Clock::now();
    MPPHandle* handle = nullptr;
    Check(MPPCreate(&dstRecord, &srcRecord, &params, &handle), src, *dst);
    handle_.reset(handle);
    time.engineMs = MsSince(start);
    dstRecord_ = dstRecord;
    srcRecord_ = srcRecord;
    params_ = params;
    palette_ = src.palette;
  }

  const EnginePlanes to = BindPlanes(*dst);
  const EnginePlanes from = BindPlanes(src);
  const Clock::time_point start = Clock::now();
  Check(MPProcess(handle_.get(), to.plane, nullptr, to.pitch, from.plane, from.pitch), src, *dst);
  time.convertMs = MsSince(start);
  return time;
}

Image RgbaConverter::Convert(const Image& src) {
  Image rgba = MakeImage(FORMAT_XBGR8888, src.size());
  rgba.hasAlpha = src.hasAlpha;
  MPPPARAM params = {};
  params.passMode = MPP_PASS_TILED;
  params.alpha = 255;
  const Region whole = {0, 0, src.width, src.height};
  converter_.Convert(src, whole, &rgba, whole, params);
  return rgba;
}

}  // namespace kestrel::tools
