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
  explicit ColumnPositions(const EngineContext& engine);
  Taps At(int32_t x) const;

 private:
  int64_t start_, step_;
  int32_t coveredLeft_, coveredLast_;  // destination columns whose sources are inside srcRect
  int32_t srcLeft_, srcLast_;
  int32_t readableLast_;
  bool bilinear_;
};

class RowPositions {
 public:
  explicit RowPositions(const EngineContext& engine);

  // Rows of a component with vertical factor `factor`.
  Taps At(int32_t r, uint32_t factor) const;

 private:
  int64_t start_, step_;
  int32_t srcTop_, srcBottom_;
  int32_t readableLast_;
  bool bilinear_;
};

}  // namespace kestrel

#endif
