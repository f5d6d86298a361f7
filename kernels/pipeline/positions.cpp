#include "kernels/pipeline/positions.h"

namespace kestrel {
namespace {

// Position of destination coordinate 0.
int64_t Start(int32_t srcOrigin, int32_t dstOrigin, uint32_t step, bool bilinear) {
  const int64_t origin = int64_t(srcOrigin) * 65536 - int64_t(step) * dstOrigin;
  return bilinear ? origin + int64_t(step) - int64_t(step / 2) - 32768 : origin;
}

int32_t Clamp(int64_t value, int32_t last) {
  return value < 0 ? 0 : value > last ? last : int32_t(value);
}

}  // namespace

ColumnPositions::ColumnPositions(const EngineContext& engine)
    : start_(Start(engine.srcOriginX, engine.dstOriginX, engine.stepX, engine.bilinear != 0)),
      step_(engine.stepX),
      coveredLeft_(engine.dstRect.left),
      coveredLast_(SaturateToInt32(int64_t(engine.dstRect.right) - 1)),
      srcLeft_(engine.srcRect.left),
      srcLast_(SaturateToInt32(int64_t(engine.srcRect.right) - 1)),
      readableLast_(engine.srcReadRight - 1),
      bilinear_(engine.bilinear != 0) {}

Taps ColumnPositions::At(int32_t x) const {
  int64_t column;
  uint16_t weight = 0;
  if (x < coveredLeft_) {
    column = srcLeft_;
  } else if (x >= coveredLast_) {
    column = srcLast_;
  } else {
    const int64_t position = start_ + step_ * x;
    column = position >> 16;
    if (bilinear_) weight = uint16_t(position & 0xFFFF);
  }
  return {Clamp(column, readableLast_), Clamp(column + 1, readableLast_), weight};
}

RowPositions::RowPositions(const EngineContext& engine)
    : start_(Start(engine.srcOriginY, engine.dstOriginY, engine.stepY, engine.bilinear != 0)),
      step_(engine.stepY),
      srcTop_(engine.srcRect.top),
      srcBottom_(engine.srcRect.bottom),
      readableLast_(engine.srcReadBottom - 1),
      bilinear_(engine.bilinear != 0) {}

Taps RowPositions::At(int32_t r, uint32_t factor) const {
  const int64_t position = start_ + step_ * r;
  int64_t row = srcTop_;
  uint16_t weight = 0;
  // A 16.16 position against a whole row: this catches what lies above row 0 and nothing else, and
  // pictures have been cut by it ever since.
  if (position >= srcTop_) {
    row = position >> 16;
    if (bilinear_) weight = uint16_t(position & 0xFFFF);
  }
  const int32_t readable = readableLast_ / int32_t(factor);
  const int64_t last = (int64_t(srcBottom_) - 1) / int32_t(factor);
  // Rows count as unsigned: one above the image lies beyond the last.
  const int64_t sample = row / int32_t(factor);
  if (row < 0 || sample >= last) {
    const int32_t clamped = Clamp(last, readable);
    return {clamped, clamped, weight};
  }
  return {Clamp(sample, readable), Clamp((row + 1) / int32_t(factor), readable), weight};
}

}  // namespace kestrel
