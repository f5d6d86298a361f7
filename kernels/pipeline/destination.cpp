#include "kernels/pipeline/destination.h"

#include <string.h>

#include "kernels/pipeline/overlap.h"

namespace kestrel {
namespace {

bool ExchangesLuma(uint32_t code) {
  return code >= CODE_YVYU_SWAPPED_LUMA && code <= CODE_VYUY_SWAPPED_LUMA;
}

int32_t RoundUpToEven(int32_t value) {
  return value + (value & 1);
}

}  // namespace

int PlaneWriter::Room(int64_t column, int64_t row, int n, int most) const {
  if (inPlace()) return most;
  int room = RunsOf(n);
  if (tiles_ && Fits(column, row, n)) room -= count_;
  return room < most ? room : most;
}

void PlaneWriter::Prefetch(int64_t column, int64_t row, int n, int runs) const {
  const ptrdiff_t bytes = ptrdiff_t{n} * unit_;
  const ptrdiff_t pitch = plane_.rowStep < 0 ? -plane_.rowStep : plane_.rowStep;
  if (tiles_ || pitch < 2 * bytes) return;
  for (int i = 0; i < runs; ++i) {
    const uint8_t* const a = plane_.At(column, row + i);
    const uint8_t* const leftmost = plane_.columnStep < 0 ? a + plane_.columnStep * (n - 1) : a;
    for (ptrdiff_t k = 0; k < bytes; k += 64) __builtin_prefetch(leftmost + k, 1);
  }
}

uint8_t* PlaneWriter::Start(int64_t column, int64_t row, int n, int runs, int copies) {
  started_ = runs;
  copies_ = copies;
  if (tiles_ && count_ > 0) return buffer_ + ptrdiff_t{count_} * n_ * unit_;
  column_ = column;
  row_ = row;
  n_ = n;
  return inPlace() && copies == 1 ? plane_.At(column, row) : buffer_;
}

void PlaneWriter::Finish() {
  if (tiles_) {
    count_ += started_;
    return;
  }
  if (inPlace() && copies_ == 1) return;
  const ptrdiff_t pitch = copies_ == 1 ? ptrdiff_t{n_} * unit_ : 0;
  for (int i = 0; i < started_ * copies_; ++i) {
    rows_.writePixels(plane_.At(column_, row_ + i), plane_.columnStep, buffer_ + i * pitch, unit_,
                      n_);
  }
}

void PlaneWriter::Write(int64_t column, int64_t row, const uint8_t* bytes, int n) {
  if (tiles_) {
    memcpy(Start(column, row, n), bytes, size_t(n));
    Finish();
  } else {
    rows_.writeStrided(plane_.At(column, row), plane_.columnStep, bytes, n);
  }
}

void PlaneWriter::WriteTransposed(int64_t column, int64_t row, const uint8_t* units,
                                  ptrdiff_t pitch, int n, int runs) {
  if (plane_.rowStep == unit_) {
    rows_.transpose(plane_.At(column, row), plane_.columnStep, units, pitch, unit_, runs, n);
  } else if (plane_.rowStep == -unit_) {
    rows_.transpose(plane_.At(column, row + runs - 1), plane_.columnStep,
                    units + (runs - 1) * pitch, -pitch, unit_, runs, n);
  } else {
    // Samples of a packed image: they do not lie side by side.
    for (int i = 0; i < runs; ++i) {
      rows_.writePixels(plane_.At(column, row + i), plane_.columnStep, units + i * pitch, unit_, n);
    }
  }
}

void PlaneWriter::WriteBlock(int64_t column, int64_t row, const uint8_t* units, ptrdiff_t pitch,
                             int n, int runs) {
  if (tiles_) {
    WriteTransposed(column, row, units, pitch, n, runs);
    return;
  }
  const size_t bytes = size_t(n) * size_t(unit_);
  if (plane_.columnStep == unit_ && pitch == plane_.rowStep && pitch == ptrdiff_t(bytes)) {
    CopyAscending(plane_.At(column, row), units, bytes * size_t(runs));
    return;
  }
  for (int i = 0; i < runs; ++i) {
    uint8_t* const start = plane_.At(column, row + i);
    if (plane_.columnStep == unit_) {
      CopyAscending(start, units + i * pitch, bytes);
    } else {
      rows_.writePixels(start, plane_.columnStep, units + i * pitch, unit_, n);
    }
  }
}

void PlaneWriter::Flush() {
  if (count_ == 0) return;
  WriteTransposed(column_, row_, buffer_, ptrdiff_t(n_) * unit_, n_, count_);
  count_ = 0;
}

Destination::Destination(const Job& job)
    : job_(job),
      rows_(job.rows()),
      engine_(job.engine),
      pixels_(DescribePixels(job.engine.dstFormat, job.engine.dstChannelSize,
                             job.engine.dstChannelPos)),
      hasChroma_(job.engine.dstLayout.code != CODE_RGB && job.engine.dstLayout.code != CODE_GRAY8),
      exchange_(!ExchangesLuma(job.engine.dstLayout.code) ? LumaExchange::kNone
                : job.engine.swapXY != 0                  ? LumaExchange::kRows
                                                          : LumaExchange::kColumns),
      tiles_(engine_.swapXY != 0 && exchange_ == LumaExchange::kNone),
      planes_{Plane(0), Plane(1), Plane(2)},
      chromaPairs_(FirstOfPairs()),
      writers_{
          {planes_[0], engine_.dstLayout.code == CODE_RGB ? pixels_.bytes : 1, tiles_, rows_},
          {planes_[chromaPairs_ == 0 ? 1 : chromaPairs_], chromaPairs_ == 0 ? 1 : 2, tiles_, rows_},
          {planes_[2], 1, tiles_, rows_}},
      order_(OrderOfPixels()) {
  if (pixels_.alphaByte >= 0 && engine_.pathKind == PATH_YUV_TO_RGB) {
    const int shift = 8 * pixels_.alphaByte;
    alphaFill_ = {~(0xFFu << shift), engine_.alpha << shift};
  }
  if (job.has(kPairChroma)) {
    // A mirrored walk meets the pixel that is first in memory last.
    const bool firstInMemoryIsLast = engine_.mirrorX != 0;
    bool& u = engine_.swapXY != 0 ? uOfLastRow_ : uOfLastColumn_;
    bool& v = engine_.swapXY != 0 ? vOfLastRow_ : vOfLastColumn_;
    u = firstInMemoryIsLast;
    v = !firstInMemoryIsLast;
  }
  for (int c = 0; c < 3; ++c) {
    const int32_t bits = int32_t(pixels_.size[c]);
    fullShifts_.right[c] = 8 - bits;
    narrowedShifts_.right[c] = bits > 8 ? 8 - bits : 0;
  }
}

int Destination::BufferSize(int columns) const {
  // Of a run of up to four bytes for each column. (Pixels that are dithered are gathered in tiles
  // whatever their order.)
  constexpr int kRun = 4 * kWidestStrip;
  static_assert(ArrangedSamples::kTurnedSize >= kRun && ArrangedSamples::kMirroredSize >= kRun,
                "arranged samples leave room for a run");
  switch (order_) {
    case Order::kTurned:
    case Order::kTurnedBackwards:
      return ArrangedSamples::kTurnedSize;
    case Order::kMirrored:
      return ArrangedSamples::kMirroredSize;
    default:
      if (tiles_) return kTileSize;
      if (!AllInPlace()) return kRun;
      // Runs that are in place need none, unless one is copied to several rows.
      return engine_.stepY < 0x10000 && !hasChroma_ ? columns * writers_[0].unit() : 0;
  }
}

void Destination::TakeMemory(StripMemory* memory, int columns) {
  if (hasChroma_) {
    uColumns_ = vColumns_ = memory->Take<int32_t>(size_t(columns));
    if (uOfLastColumn_ != vOfLastColumn_) vColumns_ = memory->Take<int32_t>(size_t(columns));
  }
  const int size = BufferSize(columns);
  buffer_ = memory->Take<uint8_t>(size_t(size));
  if (buffer_ == nullptr) return;
  if (!hasChroma_) return writers_[0].SetBuffer(buffer_, size);
  // Half for luma, half for chroma.
  const int half = size / 2;
  const int quarter = size / 4;
  uint8_t* const chroma = buffer_ + half;
  writers_[0].SetBuffer(buffer_, half);
  writers_[1].SetBuffer(chroma, chromaPairs_ != 0 ? half : quarter);
  writers_[2].SetBuffer(chroma + quarter, quarter);
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
  DestinationPlane plane;
  PlaneAxis& across = swap ? plane.rows : plane.columns;
  PlaneAxis& down = swap ? plane.columns : plane.rows;
  across.origin = DivideByFactor(startX, c.dstPlaneFactors[3 + i]);
  across.direction = mirrorX ? -1 : 1;
  down.origin = DivideByFactor(startY, c.dstPlaneFactors[6 + i]);
  down.direction = mirrorY ? -1 : 1;
  if (i == 0 && exchange_ != LumaExchange::kNone) {
    // A row of pairs ends with the pair that holds its last pixel.
    const int64_t width = int64_t(swap ? r.bottom : r.right) - left;
    const int64_t right = mirrorX ? startX + 1 : startX + width;
    across.limit = RoundUpToEven(right > c.dstImageRight ? int32_t(right) : c.dstImageRight);
  }
  plane.start = job_.dstStarts[i];
  plane.columnStep = swap ? job_.dstPitches[i] : c.dstLayout.step[i];
  plane.rowStep = swap ? c.dstLayout.step[i] : job_.dstPitches[i];
  return plane;
}

int Destination::FirstOfPairs() const {
  const ptrdiff_t apart = planes_[2].start - planes_[1].start;
  const bool pairs = engine_.dstLayout.planeCount == 3 && (apart == 1 || apart == -1) &&
                     engine_.dstPlaneFactors[1] == 2 && planes_[1].rowStep == planes_[2].rowStep &&
                     planes_[1].columnStep == planes_[2].columnStep;
  return !pairs ? 0 : apart == 1 ? 1 : 2;
}

Destination::Order Destination::OrderOfPixels() const {
  const ptrdiff_t unit = pixels_.bytes;
  if (engine_.pathKind != PATH_YUV_TO_RGB) return Order::kWalk;
  if (engine_.swapXY == 0) return planes_[0].columnStep == -unit ? Order::kMirrored : Order::kWalk;
  return planes_[0].rowStep == unit    ? Order::kTurned
         : planes_[0].rowStep == -unit ? Order::kTurnedBackwards
                                       : Order::kWalk;
}

int64_t Destination::ChromaColumn(int32_t x) const {
  const uint32_t factor = engine_.dstSubsample[1];
  const int32_t left = job_.rect.left;
  // YUYV pairs its columns from the job's left edge, all other layouts from the region's origin.
  if (engine_.dstLayout.code == CODE_YUYV) return DivideByFactor(int64_t(x) - left, factor);
  return DivideByFactor(x, factor) - DivideByFactor(left, factor);
}

// The last loop column of the job whose chroma goes to a column of the plane.
int32_t Destination::LastXOfChroma(int64_t column) const {
  const int64_t factor = engine_.dstSubsample[1];
  const int64_t left = job_.rect.left;
  const int64_t next = engine_.dstLayout.code == CODE_YUYV
                           ? left + (column + 1) * factor
                           : (DivideByFactor(left, engine_.dstSubsample[1]) + column + 1) * factor;
  return int32_t(next < job_.rect.right ? next : job_.rect.right) - 1;
}

Destination::PlaneRun Destination::LumaRun() const {
  int64_t first = 0;
  int64_t end = int64_t(job_.rect.right) - job_.rect.left;
  planes_[0].columns.Clip(&first, &end);
  return {first, int32_t(end - first), int32_t(int64_t(job_.rect.left) + first),
          int32_t(int64_t(job_.rect.left) + end - 1)};
}

Destination::PlaneRun Destination::ChromaRun() const {
  int64_t first = 0;
  int64_t end = ChromaColumn(job_.rect.right - 1) + 1;
  planes_[1].columns.Clip(&first, &end);
  return {first, int(end - first), LastXOfChroma(first), LastXOfChroma(end - 1)};
}

// Rows advance after each row whose successor starts a new block.
int64_t Destination::ChromaRow(int32_t r) const {
  return BlockOfRow(r) - BlockOfRow(job_.rect.top);
}

// r / vertical factor, rounded down.
int64_t Destination::BlockOfRow(int64_t r) const {
  const uint32_t factor = engine_.dstSubsample[4];
  return DivideByFactor(r < 0 ? r - int64_t(factor) + 1 : r, factor);
}

bool Destination::WritesChroma(int32_t r, bool ofLastRow) const {
  // A block of rows ends before the next multiple of the factor, or with the job.
  const uint32_t factor = engine_.dstSubsample[4];
  const int32_t next = ofLastRow ? r + 1 : r;
  const bool isMultiple = factor <= 2 ? (next & int32_t(factor - 1)) == 0
                                      : BlockOfRow(next) != BlockOfRow(int64_t{next} - 1);
  const bool decides = isMultiple || r == (ofLastRow ? job_.rect.bottom - 1 : job_.rect.top);
  return decides && planes_[1].rows.Contains(ChromaRow(r));
}

bool Destination::AllInPlace() const {
  const int writers = !hasChroma_ ? 1 : chromaPairs_ != 0 ? 2 : 3;
  for (int i = 0; i < writers; ++i) {
    if (!writers_[i].inPlace()) return false;
  }
  return true;
}

void Destination::SelectColumns(int32_t x, int n) {
  x_ = x;
  n_ = n;
  const int64_t column = int64_t(x) - job_.rect.left;
  int64_t firstInside = column;
  int64_t endInside = column + n;
  planes_[0].columns.Clip(&firstInside, &endInside);
  firstPixel_ = int(firstInside - column);
  pixelEnd_ = int(endInside - column);
  chromaCount_ = 0;
  if (!hasChroma_) return;
  int first = 0;
  for (int i = 0; i < n; ++i) {
    const int64_t chroma = ChromaColumn(x + i);
    if (i + 1 < n && ChromaColumn(x + i + 1) == chroma) continue;
    if (planes_[1].columns.Contains(chroma)) {
      if (chromaCount_ == 0) firstChroma_ = chroma;
      uColumns_[chromaCount_] = uOfLastColumn_ ? i : first;
      if (vColumns_ != uColumns_) vColumns_[chromaCount_] = vOfLastColumn_ ? i : first;
      ++chromaCount_;
    }
    first = i + 1;
  }
  writesGroups_ = firstPixel_ == 0 && pixelEnd_ == n_ &&
                  AreGroups(int64_t(x_) - job_.rect.left, n_, firstChroma_, chromaCount_);
}

// Whether samples of packed 4:2:2 or 4:4:4 begin in the same group and end in the same.
bool Destination::AreGroups(int64_t lumaColumn, int lumaCount, int64_t chromaColumn,
                            int chromaCount) const {
  const PlaneLayout& layout = engine_.dstLayout;
  if (layout.isPacked == 0 || planes_[0].columnStep != layout.step[0] ||
      exchange_ == LumaExchange::kRows || chromaCount <= 0) {
    return false;
  }
  // Luma is exchanged between columns of even and odd number.
  if (exchange_ == LumaExchange::kColumns && (lumaColumn + job_.rect.left) % 2 != 0) return false;
  const uint8_t* const group = planes_[0].At(lumaColumn, 0) - layout.yOffset;
  if (planes_[1].At(chromaColumn, 0) != group + layout.uOffset ||
      planes_[2].At(chromaColumn, 0) != group + layout.vOffset) {
    return false;
  }
  if (layout.step[0] >= 3) return lumaCount == chromaCount;
  return layout.step[0] == 2 && lumaCount == 2 * chromaCount && layout.yOffset < 2 &&
         (layout.uOffset ^ layout.vOffset) == 2 && ((layout.uOffset ^ layout.yOffset) & 1) == 1;
}

uint8_t* Destination::GroupsAt(const PlaneRun& luma, const PlaneRun& chroma, int32_t r) const {
  if (!AreGroups(luma.column, luma.n, chroma.column, chroma.n)) return nullptr;
  return planes_[0].At(luma.column, int64_t(r) - job_.rect.top) - engine_.dstLayout.yOffset;
}

// All writers store together and in order: in one packed layout a chroma sample takes the place of
// a luma sample, and must come after it.
void Destination::Flush() {
  for (PlaneWriter& writer : writers_) writer.Flush();
}

void Destination::MakeRoom(int writer, int64_t column, int64_t row, int n, int runs) {
  if (writers_[writer].tiles() && !writers_[writer].Fits(column, row, n, runs)) Flush();
}

void Destination::PutLuma(int32_t r, const uint8_t* luma) {
  const DestinationPlane& plane = planes_[0];
  const int64_t row = int64_t(exchange_ == LumaExchange::kRows ? r ^ 1 : r) - job_.rect.top;
  const int n = pixelEnd_ - firstPixel_;
  if (!plane.rows.Contains(row)) return;
  if (writesGroups_) {
    heldLuma_ = luma;
    return;
  }
  if (exchange_ == LumaExchange::kColumns) {
    const auto put = [&](int i) {
      const int64_t column = int64_t((x_ + i) ^ 1) - job_.rect.left;
      if (plane.columns.Contains(column)) *plane.At(column, row) = luma[i];
    };
    int i = 0;
    if (x_ % 2 != 0) put(i++);
    const int exchanged = (n_ - i) & ~1;
    const int64_t first = int64_t(x_) + i - job_.rect.left;
    if (exchanged > 0 && plane.columns.Contains(first) &&
        plane.columns.Contains(first + exchanged - 1)) {
      rows_.swapPairs(buffer_, luma + i, exchanged / 2);
      rows_.writeStrided(plane.At(first, row), plane.columnStep, buffer_, exchanged);
      i += exchanged;
    }
    for (; i < n_; ++i) put(i);
    return;
  }
  if (n <= 0) return;
  const int64_t column = int64_t(x_) + firstPixel_ - job_.rect.left;
  MakeRoom(0, column, row, n);
  writers_[0].Write(column, row, luma + firstPixel_, n);
}

void Destination::PutChromaPlane(int plane, int32_t r, const uint8_t* samples) {
  if (samples == nullptr) return;
  const int64_t row = ChromaRow(r);
  MakeRoom(plane, firstChroma_, row, chromaCount_);
  writers_[plane].Write(firstChroma_, row, samples, chromaCount_);
}

uint8_t* Destination::StartChromaPairs(int32_t r) {
  const int64_t row = ChromaRow(r);
  MakeRoom(1, firstChroma_, row, chromaCount_);
  return writers_[1].Start(firstChroma_, row, chromaCount_);
}

void Destination::WriteGroups(int32_t r, const uint8_t* y, const uint8_t* u, const uint8_t* v) {
  const PlaneLayout& layout = engine_.dstLayout;
  uint8_t* const group =
      planes_[0].At(int64_t(x_) - job_.rect.left, int64_t(r) - job_.rect.top) - layout.yOffset;
  if (layout.step[0] >= 3) {
    // Like pixels of three bytes, which may lie a spare byte apart.
    const uint8_t* const channels[3] = {y, u, v};
    const PixelFormat format = {
        3, {8, 8, 8}, {8 * layout.yOffset, 8 * layout.uOffset, 8 * layout.vOffset}, -1, true};
    uint8_t* const pixels = hasSpareByte() ? buffer_ : group;
    rows_.packRgb(pixels, channels, format, {}, {~0u, 0}, n_);
    if (pixels != group) rows_.writePixels(group, layout.step[0], pixels, 3, n_);
    return;
  }
  const bool uFirst = layout.uOffset < layout.vOffset;
  rows_.interleave(buffer_, uFirst ? u : v, uFirst ? v : u, chromaCount_);
  if (exchange_ != LumaExchange::kNone) {
    uint8_t* const exchanged = buffer_ + n_;
    rows_.swapPairs(exchanged, y, n_ / 2);
    y = exchanged;
  }
  const bool lumaFirst = layout.yOffset == 0;
  rows_.interleave(group, lumaFirst ? y : buffer_, lumaFirst ? buffer_ : y, n_);
}

void Destination::PutChroma(int32_t r, const uint8_t* u, const uint8_t* v) {
  if (chromaCount_ == 0) return;
  if (writesGroups_) {
    if (heldLuma_ != nullptr) WriteGroups(r, heldLuma_, u, v);
    heldLuma_ = nullptr;
    return;
  }
  if (chromaPairs_ == 0) {
    PutChromaPlane(1, r, u);
    PutChromaPlane(2, r, v);
  } else if (u != nullptr) {
    uint8_t* const pairs = StartChromaPairs(r);
    rows_.interleave(pairs, chromaPairs_ == 1 ? u : v, chromaPairs_ == 1 ? v : u, chromaCount_);
    FinishChromaPairs();
  }
}

int Destination::RoomForRows(int32_t r, int most) const {
  const int64_t row = int64_t(r) - job_.rect.top;
  const int n = pixelEnd_ - firstPixel_;
  int64_t first = row;
  int64_t end = row + most;
  planes_[0].rows.Clip(&first, &end);
  if (n <= 0 || first > row || end - row < 2) return 1;
  if (order_ != Order::kWalk) return int(end - row);
  const int64_t column = int64_t(x_) + firstPixel_ - job_.rect.left;
  return writers_[0].Room(column, row, n, int(end - row));
}

Destination::PixelRun Destination::PlacePixels(int32_t r, int rows) const {
  const DestinationPlane& plane = planes_[0];
  const int64_t row = int64_t(r) - job_.rect.top;
  const int n = pixelEnd_ - firstPixel_;
  if (!IsInside(row, rows)) return {nullptr, 0, 0, 0};
  const int64_t column = int64_t(x_) + firstPixel_ - job_.rect.left;
  if (order_ == Order::kMirrored) {
    return {plane.At(column + n - 1, row), plane.rowStep, firstPixel_, n};
  }
  const int64_t leftmost = order_ == Order::kTurnedBackwards ? row + rows - 1 : row;
  return {plane.At(column, leftmost), plane.columnStep, firstPixel_, n};
}

Destination::PixelRun Destination::StartPixels(int32_t r, int rows, int copies) {
  const int64_t row = int64_t(r) - job_.rect.top;
  const int n = pixelEnd_ - firstPixel_;
  const int written = rows * copies;
  if (!IsInside(row, written)) return {nullptr, 0, 0, 0};
  const int64_t column = int64_t(x_) + firstPixel_ - job_.rect.left;
  MakeRoom(0, column, row, n, rows);
  writers_[0].Prefetch(column, row + written, n, written);
  uint8_t* const pixels = writers_[0].Start(column, row, n, rows, copies);
  return {pixels, writers_[0].startedPitch(), firstPixel_, n};
}

void Destination::PutRgb(int32_t r, const uint8_t* const rgb[3], const uint8_t* alpha,
                         bool narrowed) {
  const PixelRun run = StartPixels(r, 1);
  if (run.pixels == nullptr) return;
  const uint8_t* const first[3] = {rgb[0] + run.first, rgb[1] + run.first, rgb[2] + run.first};
  rows_.packRgb(run.pixels, first, pixels_, narrowed ? narrowedShifts_ : fullShifts_, alphaFill_,
                run.n);
  if (alpha != nullptr && pixels_.alphaByte >= 0) {
    rows_.putAlpha(run.pixels, alpha + run.first, pixels_, run.n);
  }
  FinishPixels();
}

}  // namespace kestrel
