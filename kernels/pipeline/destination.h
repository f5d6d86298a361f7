// Writing: where the pixels of the job rectangle go, in loop orientation. Transforms are only
// address arithmetic: a mirror is a negative step, a quarter turn exchanges step and pitch.
#ifndef KESTREL_KERNELS_PIPELINE_DESTINATION_H
#define KESTREL_KERNELS_PIPELINE_DESTINATION_H

#include "kernels/pipeline/arranged_samples.h"

namespace kestrel {

// One axis of a destination plane: sample k of the walk has coordinate origin + direction * k. The
// walk of a mirrored subsampled plane can be out of phase with its start and then leave the plane
// by one sample; such samples are dropped.
struct PlaneAxis {
  int64_t origin = 0;
  int32_t direction = 1;
  int64_t limit = kNoLimit;

  static constexpr int64_t kNoLimit = int64_t{1} << 40;  // sums with coordinates do not overflow

  bool Contains(int64_t k) const {
    const int64_t coordinate = origin + direction * k;
    return coordinate >= 0 && coordinate < limit;
  }
  // Takes off what is outside at both ends of samples [*first, *end); leaves an empty run between
  // them when that is all.
  void Clip(int64_t* first, int64_t* end) const {
    const int64_t inside = direction > 0 ? -origin : origin - limit + 1;
    if (*first < inside) *first = inside < *end ? inside : *end;
    if (*end > inside + limit) *end = inside + limit > *first ? inside + limit : *first;
  }
};

struct DestinationPlane {
  uint8_t* start = nullptr;
  ptrdiff_t columnStep = 0;  // bytes from one loop column's sample to the next
  ptrdiff_t rowStep = 0;
  PlaneAxis columns, rows;

  uint8_t* At(int64_t column, int64_t row) const {
    return start + columnStep * ptrdiff_t(column) + rowStep * ptrdiff_t(row);
  }
};

// Writes runs of packed units into one plane. Runs of a quarter turn would each touch as many
// destination rows as they have units; a tile gathers several on the stack and stores it
// transposed, so that both sides stream.
class PlaneWriter {
 public:
  // The plane is not copied.
  PlaneWriter(const DestinationPlane& plane, int unit, bool tiles, const RowOps& rows)
      : plane_(plane), rows_(rows), unit_(unit), tiles_(tiles) {}
  // For the tile; or for a run at least that is not in place, or is copied.
  void SetBuffer(uint8_t* buffer, int bytes) {
    buffer_ = buffer;
    bufferSize_ = bytes;
  }
  bool tiles() const { return tiles_; }
  int unit() const { return unit_; }
  ptrdiff_t rowStep() const { return plane_.rowStep; }
  uint8_t* At(int64_t column, int64_t row) const { return plane_.At(column, row); }
  // Whether runs lie in memory as they are packed; Start then gives the destination itself.
  bool inPlace() const { return !tiles_ && plane_.columnStep == unit_; }
  // Whether runs can join the tile as it stands.
  bool Fits(int64_t column, int64_t row, int n, int runs = 1) const {
    return count_ == 0 ||
           (count_ + runs <= RunsOf(n) && column == column_ && n == n_ && row == row_ + count_);
  }

  // How many runs of n units the buffer holds.
  int RunsOf(int n) const { return bufferSize_ / (n * unit_); }
  // How many of `most` runs of n units one Start can be for.
  int Room(int64_t column, int64_t row, int n, int most) const;
  // Memory for some runs of n units; they are written by the Finish that follows. For `copies` of
  // one run, which go to as many rows, not in tiles.
  uint8_t* Start(int64_t column, int64_t row, int n, int runs = 1, int copies = 1);
  // Asks for the memory of runs that are to be written soon. Where a strip is narrower than the
  // picture nothing else would: its rows are far apart.
  void Prefetch(int64_t column, int64_t row, int n, int runs) const;
  ptrdiff_t startedPitch() const { return inPlace() ? plane_.rowStep : ptrdiff_t{n_} * unit_; }
  void Finish();
  // The same for bytes that exist already.
  void Write(int64_t column, int64_t row, const uint8_t* bytes, int n);
  // A block of whole runs that lie in memory as they will be written, `pitch` bytes apart.
  void WriteBlock(int64_t column, int64_t row, const uint8_t* units, ptrdiff_t pitch, int n,
                  int runs);
  // Stores what the tile holds.
  void Flush();

 private:
  // Stores runs across the destination's rows.
  void WriteTransposed(int64_t column, int64_t row, const uint8_t* units, ptrdiff_t pitch, int n,
                       int runs);

  const DestinationPlane& plane_;
  const RowOps& rows_;
  int unit_;
  bool tiles_;
  uint8_t* buffer_ = nullptr;
  int bufferSize_ = 0;
  int64_t column_ = 0, row_ = 0;  // of the tile's first run, or of the run that was started
  int n_ = 0;
  int started_ = 0;  // runs
  int copies_ = 1;
  int count_ = 0;  // runs in the tile
};

class Destination {
 public:
  // Memory for samples or pixels of the strip's columns [first, first + n).
  struct PixelRun {
    uint8_t* pixels;
    ptrdiff_t pitch;
    int first, n;
  };

  // Of samples or small pixels, which are turned in blocks: what is done for each row of a block
  // costs as much as many pixels, and in the destination its columns are to fill cache lines.
  static constexpr int kTileColumns = 192;
  static constexpr int kTileRows = 64;
  static constexpr int kTileSize = 2 * kTileColumns * kTileRows;  // bytes: with as many of chroma

  explicit Destination(const Job& job);

  // Loop columns that may be selected at once.
  int widestStrip() const {
    if (engine_.swapXY == 0) return kWidestStrip;
    if (order_ != Order::kWalk) return ArrangedSamples::kTurnedColumns;
    return writers_[0].unit() <= 2 ? kTileColumns : kTileColumns / 2;
  }
  // Before anything is selected: takes the memory for strips of some columns.
  void TakeMemory(StripMemory* memory, int columns);
  // Selects loop columns [x, x + n).
  void SelectColumns(int32_t x, int n);

  // YUV. Chroma is overwritten by every pixel of its block: only the last one in loop order counts,
  // so chroma is taken at uColumns() and vColumns() of the strip and in the rows that WritesU and
  // WritesV name.
  // (With pair chroma the two differ.)
  bool hasChroma() const { return hasChroma_; }
  bool WritesU(int32_t r) const { return WritesChroma(r, uOfLastRow_); }
  bool WritesV(int32_t r) const { return WritesChroma(r, vOfLastRow_); }
  const int32_t* uColumns() const { return uColumns_; }
  const int32_t* vColumns() const { return vColumns_; }
  int chromaCount() const { return chromaCount_; }
  // (Where groups are written whole, luma is kept until the row's chroma comes.)
  void PutLuma(int32_t r, const uint8_t* luma);
  // Memory for a row of luma, for the strip columns that it says; not where luma is exchanged.
  PixelRun StartLuma(int32_t r) { return StartPixels(r, 1); }
  void FinishLuma() { writers_[0].Finish(); }
  // Memory for a row of pairs of chroma, for all of the strip's; where chromaPairs() is not 0.
  uint8_t* StartChromaPairs(int32_t r);
  void FinishChromaPairs() { writers_[1].Finish(); }
  // Either may be null.
  void PutChroma(int32_t r, const uint8_t* u, const uint8_t* v);

  // Where whole planes are copied: samples [column, column + n) of plane 0, or of chroma plane 1 or
  // 2, or (with chroma pairs) of the pairs as plane 1, and the loop columns that decide the first
  // and the last of them. Rows and columns count samples of the plane.
  struct PlaneRun {
    int64_t column;
    int n;
    int32_t firstX, lastX;
  };
  PlaneRun LumaRun() const;
  PlaneRun ChromaRun() const;
  // Whether a group has a byte that is no sample and is never written.
  bool hasSpareByte() const { return engine_.dstLayout.step[0] == 4; }
  // Where the first group of a row of packed 4:2:2 or 4:4:4 begins; null unless the runs are whole
  // groups.
  uint8_t* GroupsAt(const PlaneRun& luma, const PlaneRun& chroma, int32_t r) const;
  bool ContainsLumaRow(int32_t r) const {
    return planes_[0].rows.Contains(int64_t(r) - job_.rect.top);
  }
  int64_t ChromaRow(int32_t r) const;
  // 1 or 2 when chroma lies in pairs: the component that comes first.
  int chromaPairs() const { return chromaPairs_; }
  bool exchangesLuma() const { return exchange_ != LumaExchange::kNone; }
  PlaneWriter& writer(int plane) { return writers_[plane]; }
  // Whether runs of every plane lie in memory as they are packed.
  bool AllInPlace() const;
  // Whether the strip's rows of packed 4:2:2 or 4:4:4 are written as groups of two pixels or one.
  bool writesGroups() const { return writesGroups_; }

  // RGB. Memory for the pixels of some rows; null when they are outside the image. With `copies`
  // those of one row are for as many, if the pixels' order is that of the walk.
  PixelRun StartPixels(int32_t r, int rows, int copies = 1);
  // Where the pixels of YUV have another order than the walk they are written as they lie, from
  // samples in that order.
  enum class Order { kWalk, kMirrored, kTurned, kTurnedBackwards };
  Order pixelOrder() const { return order_; }
  // The destination's memory for some rows of the strip: the first pixel in that order, and the
  // pitch of its rows. (`first` and `n` still count columns of the strip.)
  PixelRun PlacePixels(int32_t r, int rows) const;
  // For samples in that order.
  uint8_t* arrangingMemory() { return buffer_; }
  // How many of `most` rows from r on one StartPixels can be for.
  int RoomForRows(int32_t r, int most) const;
  void FinishPixels() { writers_[0].Finish(); }
  const PixelFormat& pixelFormat() const { return pixels_; }
  AlphaFill alphaFill() const { return alphaFill_; }

  // `narrowed`: the channels are as wide as their fields already. `alpha` is null unless the
  // source has one.
  void PutRgb(int32_t r, const uint8_t* const rgb[3], const uint8_t* alpha, bool narrowed);

  // Stores what is still gathered; after the last row of the selected columns.
  void Flush();

 private:
  enum class LumaExchange { kNone, kColumns, kRows };

  DestinationPlane Plane(int i) const;
  int BufferSize(int columns) const;
  int FirstOfPairs() const;
  Order OrderOfPixels() const;
  bool IsInside(int64_t row, int rows) const {
    return pixelEnd_ > firstPixel_ && planes_[0].rows.Contains(row) &&
           planes_[0].rows.Contains(row + rows - 1);
  }
  int64_t ChromaColumn(int32_t x) const;
  int32_t LastXOfChroma(int64_t column) const;
  int64_t BlockOfRow(int64_t r) const;
  bool WritesChroma(int32_t r, bool ofLastRow) const;
  bool AreGroups(int64_t lumaColumn, int lumaCount, int64_t chromaColumn, int chromaCount) const;
  void MakeRoom(int writer, int64_t column, int64_t row, int n, int runs = 1);
  void PutChromaPlane(int plane, int32_t r, const uint8_t* samples);
  void WriteGroups(int32_t r, const uint8_t* y, const uint8_t* u, const uint8_t* v);

  const Job& job_;
  const RowOps& rows_;
  const EngineContext& engine_;
  PixelFormat pixels_;
  FieldShifts narrowedShifts_, fullShifts_;
  AlphaFill alphaFill_ = {~0u, 0};  // the engine's alpha, for sources that have none
  bool hasChroma_;
  LumaExchange exchange_;
  bool tiles_;
  // In the order in which they depend on each other: nothing of this is made twice or copied, which
  // small jobs would notice.
  DestinationPlane planes_[3];
  int chromaPairs_;  // 1 or 2: the plane that begins each pair of a semi-planar image
  PlaneWriter writers_[3];
  Order order_;
  // Which pixel of a chroma block gives U and V: its last in loop order, or with pair chroma one
  // its first and the other its last, by their order in memory.
  bool uOfLastColumn_ = true, vOfLastColumn_ = true;
  bool uOfLastRow_ = true, vOfLastRow_ = true;

  int32_t x_ = 0;
  int n_ = 0;
  bool writesGroups_ = false;
  const uint8_t* heldLuma_ = nullptr;
  int chromaCount_ = 0;
  int64_t firstChroma_ = 0;                            // plane column of the first chroma sample
  int32_t *uColumns_ = nullptr, *vColumns_ = nullptr;  // columns of the strip
  int firstPixel_ = 0, pixelEnd_ = 0;  // columns of the strip that are inside plane 0
  // Of all writers (planes of YUV share it), or of samples that are arranged.
  uint8_t* buffer_ = nullptr;
};

}  // namespace kestrel

#endif
