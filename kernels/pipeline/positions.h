// Which source column and row a destination column and row read, and with which weights. Bilinear
// sampling is centre-aligned, nearest corner-aligned. Positions are 16.16 in 64 bits.
#ifndef KESTREL_KERNELS_PIPELINE_POSITIONS_H
#define KESTREL_KERNELS_PIPELINE_POSITIONS_H

#include "kernels/pipeline/job.h"

namespace kestrel {

// Two neighbouring source samples and the weight (0..65535) of the second.
struct Taps {
  int32_t first;
  int32_t second;
  uint16_t weight;
};

class ColumnPositions {
 public:
  explicit ColumnPositions(const Job& job);
  Taps At(int32_t x) const;
  // What At says of n columns; the last two only where they are given.
  void Read(int32_t x, int32_t n, int32_t* first, int32_t* second, uint16_t* weights) const;
  // Whether each of the n columns from x reads the source column after its predecessor's.
  bool Advance(int32_t x, int32_t n) const;

 private:
  // Whether nothing about the n columns from x is clamped.
  bool ArePlain(int32_t x, int32_t n) const;

  int64_t start_, step_;
  int32_t coveredLeft_, coveredLast_;  // destination columns whose sources are inside srcRect
  int32_t srcLeft_, srcLast_;
  int32_t readableLast_;
  int32_t left_;
  bool bilinear_, pairEdges_, noEdges_;
};

class RowPositions {
 public:
  explicit RowPositions(const Job& job);

  // Rows of a component with vertical factor `factor`.
  Taps At(int32_t r, uint32_t factor) const;

 private:
  int64_t start_, step_;
  int32_t srcTop_, srcBottom_;
  int32_t readableLast_;
  int32_t top_;
  bool bilinear_, sharedLowerLine_;
  // Positions in [plainFrom_, plainTo_[factor - 1]) need no clamping; for factors 1 and 2.
  int64_t plainFrom_, plainTo_[2];

  Taps Own(int32_t r, uint32_t factor) const;
};

// Inline, because a record this small is better never put in memory: reading it back would wait for
// the stores of the pixels before it.
inline int32_t ClampIndex(int64_t value, int32_t last) {
  return value < 0 ? 0 : value > last ? last : int32_t(value);
}

inline Taps ColumnPositions::At(int32_t x) const {
  // With pair edges both columns of a pair take the answer of the first.
  const int32_t tested = pairEdges_ ? x - ((x - left_) & 1) : x;
  int64_t column;
  uint16_t weight = 0;
  if (tested < coveredLeft_ && !noEdges_) {
    column = srcLeft_;
  } else if (tested >= coveredLast_ && !noEdges_) {
    column = srcLast_;
  } else {
    const int64_t position = start_ + step_ * x;
    column = position >> 16;
    if (bilinear_) weight = uint16_t(position & 0xFFFF);
    if (pairEdges_ || noEdges_) {
      column = column < srcLeft_ ? srcLeft_ : column > srcLast_ ? srcLast_ : column;
    }
  }
  return {ClampIndex(column, readableLast_), ClampIndex(column + 1, readableLast_), weight};
}

inline Taps RowPositions::Own(int32_t r, uint32_t factor) const {
  const int64_t position = start_ + step_ * r;
  if (factor <= 2 && position >= plainFrom_ && position < plainTo_[factor - 1]) {
    const int32_t plain = int32_t(position >> 16);
    const int shift = int(factor) - 1;
    return {plain >> shift, (plain + 1) >> shift,
            uint16_t(bilinear_ ? uint32_t(position) & 0xFFFF : 0)};
  }
  int64_t row = srcTop_;
  uint16_t weight = 0;
  // A 16.16 position against a whole row: this catches what lies above row 0 and nothing else, and
  // pictures have been cut by it ever since.
  if (position >= srcTop_) {
    row = position >> 16;
    if (bilinear_) weight = uint16_t(position & 0xFFFF);
  }
  const int32_t readable = int32_t(DivideByFactor(readableLast_, factor));
  const int64_t last = DivideByFactor(int64_t(srcBottom_) - 1, factor);
  // Rows count as unsigned: one above the image lies beyond the last.
  const int64_t sample = DivideByFactor(row, factor);
  if (row < 0 || sample >= last) {
    const int32_t clamped = ClampIndex(last, readable);
    return {clamped, clamped, 0};
  }
  return {ClampIndex(sample, readable), ClampIndex(DivideByFactor(row + 1, factor), readable),
          weight};
}

inline Taps RowPositions::At(int32_t r, uint32_t factor) const {
  Taps taps = Own(r, factor);
  const bool secondOfPair = sharedLowerLine_ && ((r - top_) & 1) != 0;
  if (secondOfPair && taps.weight != 0) {
    // The line below the pair's first row serves both rows.
    const int64_t below = int64_t(Own(r - 1, factor).first) + 1;
    const int64_t last = int64_t(srcBottom_) - 1;
    taps.second = ClampIndex(below < last ? below : last, readableLast_);
  }
  return taps;
}

}  // namespace kestrel

#endif
