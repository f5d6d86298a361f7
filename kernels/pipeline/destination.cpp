#include "kernels/pipeline/destination.h"

namespace kestrel {
namespace {

bool ExchangesLuma(uint32_t code) {
  return code >= CODE_YVYU_SWAPPED_LUMA && code <= CODE_VYUY_SWAPPED_LUMA;
}

int32_t RoundUpToEven(int32_t value) {
  return value + (value & 1);
}

}  // namespace

Destination::Destination(const Job& job)
    : job_(job),
      rows_(job.rows()),
      engine_(job.engine),
      pixels_(DescribePixels(job.engine.dstFormat, job.engine.dstChannelSize,
                             job.engine.dstChannelPos)),
      hasChroma_(job.engine.dstLayout.code != CODE_RGB && job.engine.dstLayout.code != CODE_GRAY8),
      writesPixels_(pixels_.bytes > 0),
      exchange_(!ExchangesLuma(job.engine.dstLayout.code) ? LumaExchange::kNone
                : job.engine.swapXY != 0                  ? LumaExchange::kRows
                                                          : LumaExchange::kColumns) {
  if (pixels_.alphaByte >= 0 && engine_.pathKind == PATH_YUV_TO_RGB) {
    const int shift = 8 * pixels_.alphaByte;
    alphaFill_ = {~(0xFFu << shift), engine_.alpha << shift};
  }
  for (int i = 0; i < 3; ++i) planes_[i] = Plane(i);
  for (int c = 0; c < 3; ++c) {
    const int32_t bits = int32_t(pixels_.size[c]);
    fullShifts_.right[c] = 8 - bits;
    narrowedShifts_.right[c] = bits > 8 ? 8 - bits : 0;
  }
}

// The kernel contract gives start addresses only; where they lie in the plane follows from the job
// rectangle, mirrored back inside the destination region.
DestinationPlane Destination::Plane(int i) const {
  const EngineContext& c = engine_;
  const bool swap = c.swapXY != 0;
  const MRECT& region = c.dstRegion;
  // The job rectangle with the swap undone.
  const MRECT& r = job_.rect;
  const int64_t left = swap ? r.top : r.left;
  const int64_t top = swap ? r.left : r.top;
  const bool mirrorX = c.mirrorX != 0;
  const bool mirrorY = c.mirrorY != 0;
  const int64_t startX = mirrorX ? int64_t(region.left) + region.right - left - 1 : left;
  const int64_t startY = mirrorY ? int64_t(region.top) + region.bottom - top - 1 : top;
  PlaneAxis across = {startX / int32_t(c.dstPlaneFactors[3 + i]), mirrorX ? -1 : 1, INT64_MAX};
  const PlaneAxis down = {startY / int32_t(c.dstPlaneFactors[6 + i]), mirrorY ? -1 : 1, INT64_MAX};
  if (i == 0 && exchange_ != LumaExchange::kNone) {
    // A row of pairs ends with the pair that holds its last pixel.
    const int64_t width = int64_t(swap ? r.bottom : r.right) - left;
    const int64_t right = mirrorX ? startX + 1 : startX + width;
    across.limit = RoundUpToEven(right > c.dstImageRight ? int32_t(right) : c.dstImageRight);
  }
  DestinationPlane plane;
  plane.start = job_.dstStarts[i];
  plane.columnStep = c.dstLayout.step[i];
  plane.rowStep = job_.dstPitches[i];
  plane.columns = across;
  plane.rows = down;
  if (swap) {
    plane.columnStep = job_.dstPitches[i];
    plane.rowStep = c.dstLayout.step[i];
    plane.columns = down;
    plane.rows = across;
  }
  return plane;
}

int64_t Destination::ChromaColumn(int32_t x) const {
  const int32_t factor = int32_t(engine_.dstSubsample[1]);
  const int32_t left = job_.rect.left;
  // YUYV pairs its columns from the job's left edge, all other layouts from the region's origin.
  if (engine_.dstLayout.code == CODE_YUYV) return (int64_t(x) - left) / factor;
  return int64_t(x / factor) - left / factor;
}

// Rows advance after each row whose successor starts a new block.
int64_t Destination::ChromaRow(int32_t r) const {
  const int64_t factor = engine_.dstSubsample[4];
  const auto blocksBefore = [factor](int64_t row) {
    return row / factor - (row % factor < 0 ? 1 : 0);
  };
  return blocksBefore(r) - blocksBefore(job_.rect.top);
}

bool Destination::WritesChroma(int32_t r) const {
  const int32_t factor = int32_t(engine_.dstSubsample[4]);
  const bool lastOfBlock = (r + 1) % factor == 0 || r == job_.rect.bottom - 1;
  return lastOfBlock && planes_[1].rows.Contains(ChromaRow(r));
}

void Destination::SelectColumns(int32_t x, int n) {
  x_ = x;
  n_ = n;
  firstPixel_ = 0;
  pixelEnd_ = n;
  while (firstPixel_ < n &&
         !planes_[0].columns.Contains(int64_t(x) + firstPixel_ - job_.rect.left)) {
    ++firstPixel_;
  }
  while (pixelEnd_ > firstPixel_ &&
         !planes_[0].columns.Contains(int64_t(x) + pixelEnd_ - 1 - job_.rect.left)) {
    --pixelEnd_;
  }
  chromaCount_ = 0;
  if (!hasChroma_) return;
  for (int i = 0; i < n; ++i) {
    const int64_t column = ChromaColumn(x + i);
    const bool last = i + 1 == n || ChromaColumn(x + i + 1) != column;
    if (!last || !planes_[1].columns.Contains(column)) continue;
    if (chromaCount_ == 0) firstChroma_ = column;
    chromaColumns_[chromaCount_++] = x + i;
  }
}

void Destination::PutLuma(int32_t r, const uint8_t* luma) {
  const DestinationPlane& plane = planes_[0];
  const int64_t row = int64_t(exchange_ == LumaExchange::kRows ? r ^ 1 : r) - job_.rect.top;
  if (!plane.rows.Contains(row)) return;
  if (exchange_ == LumaExchange::kColumns) {
    for (int i = 0; i < n_; ++i) {
      const int64_t column = int64_t((x_ + i) ^ 1) - job_.rect.left;
      if (plane.columns.Contains(column)) *plane.At(column, row) = luma[i];
    }
    return;
  }
  const int64_t first = int64_t(x_) + firstPixel_ - job_.rect.left;
  rows_.writeStrided(plane.At(first, row), plane.columnStep, luma + firstPixel_,
                     pixelEnd_ - firstPixel_);
}

void Destination::PutChroma(int32_t r, const uint8_t* u, const uint8_t* v) {
  if (chromaCount_ == 0) return;
  const int64_t row = ChromaRow(r);
  rows_.writeStrided(planes_[1].At(firstChroma_, row), planes_[1].columnStep, u, chromaCount_);
  rows_.writeStrided(planes_[2].At(firstChroma_, row), planes_[2].columnStep, v, chromaCount_);
}

void Destination::PutRgb(int32_t r, const uint8_t* const rgb[3], const uint8_t* alpha,
                         bool narrowed) {
  const DestinationPlane& plane = planes_[0];
  const int64_t row = int64_t(r) - job_.rect.top;
  const int n = pixelEnd_ - firstPixel_;
  if (!writesPixels_ || n <= 0 || !plane.rows.Contains(row)) return;
  const uint8_t* const first[3] = {rgb[0] + firstPixel_, rgb[1] + firstPixel_,
                                   rgb[2] + firstPixel_};
  uint8_t* const start = plane.At(int64_t(x_) + firstPixel_ - job_.rect.left, row);
  const bool direct = plane.columnStep == pixels_.bytes;
  uint8_t* const pixels = direct ? start : packed_;
  rows_.packRgb(pixels, first, pixels_, narrowed ? narrowedShifts_ : fullShifts_, alphaFill_, n);
  if (alpha != nullptr && pixels_.alphaByte >= 0) {
    rows_.putAlpha(pixels, alpha + firstPixel_, pixels_, n);
  }
  if (!direct) rows_.writePixels(start, plane.columnStep, packed_, pixels_.bytes, n);
}

}  // namespace kestrel
