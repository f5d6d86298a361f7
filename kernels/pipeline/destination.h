// Writing: where the pixels of the job rectangle go, in loop orientation. Transforms are only
// address arithmetic: a mirror is a negative step, a quarter turn exchanges step and pitch.
#ifndef KESTREL_KERNELS_PIPELINE_DESTINATION_H
#define KESTREL_KERNELS_PIPELINE_DESTINATION_H

#include "kernels/pipeline/job.h"

namespace kestrel {

// One axis of a destination plane: sample k of the walk has coordinate origin + direction * k. The
// walk of a mirrored subsampled plane can be out of phase with its start and then leave the plane
// by one sample; such samples are dropped.
struct PlaneAxis {
  int64_t origin = 0;
  int32_t direction = 1;
  int64_t limit = INT64_MAX;

  bool Contains(int64_t k) const {
    const int64_t coordinate = origin + direction * k;
    return coordinate >= 0 && coordinate < limit;
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

class Destination {
 public:
  explicit Destination(const Job& job);

  // Selects loop columns [x, x + n), n <= kStrip.
  void SelectColumns(int32_t x, int n);

  // YUV. Chroma is overwritten by every pixel of its block: only the last one in loop order counts,
  // so chroma is taken at ChromaColumns() and in the rows that WritesChroma() names.
  bool hasChroma() const { return hasChroma_; }
  bool WritesChroma(int32_t r) const;
  const int32_t* chromaColumns() const { return chromaColumns_; }
  int chromaCount() const { return chromaCount_; }
  void PutLuma(int32_t r, const uint8_t* luma);
  void PutChroma(int32_t r, const uint8_t* u, const uint8_t* v);

  // RGB. `narrowed`: the channels are as wide as their fields already. `alpha` is null unless the
  // source has one.
  void PutRgb(int32_t r, const uint8_t* const rgb[3], const uint8_t* alpha, bool narrowed);

 private:
  enum class LumaExchange { kNone, kColumns, kRows };

  DestinationPlane Plane(int i) const;
  int64_t ChromaColumn(int32_t x) const;
  int64_t ChromaRow(int32_t r) const;

  const Job& job_;
  const RowOps& rows_;
  const EngineContext& engine_;
  DestinationPlane planes_[3];
  PixelFormat pixels_;
  FieldShifts narrowedShifts_, fullShifts_;
  AlphaFill alphaFill_ = {~0u, 0};  // the engine's alpha, for sources that have none
  bool hasChroma_;
  bool writesPixels_;
  LumaExchange exchange_;

  int32_t x_ = 0;
  int n_ = 0;
  int chromaCount_ = 0;
  int64_t firstChroma_ = 0;            // plane column of the first chroma sample
  int32_t chromaColumns_[kStrip];      // loop columns
  int firstPixel_ = 0, pixelEnd_ = 0;  // columns of the strip that are inside plane 0
  uint8_t packed_[4 * kStrip];
};

}  // namespace kestrel

#endif
