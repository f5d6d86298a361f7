#include "kernels/pipeline/positions.h"

namespace kestrel {
namespace {

// Position of destination coordinate 0.
int64_t Start(int32_t srcOrigin, int32_t dstOrigin, uint32_t step, bool bilinear) {
  const int64_t origin = int64_t(srcOrigin) * 65536 - int64_t(step) * dstOrigin;
  return bilinear ? origin + int64_t(step) - int64_t(step / 2) - 32768 : origin;
}

}  // namespace

ColumnPositions::ColumnPositions(const Job& job)
    : start_(Start(job.engine.srcOriginX, job.engine.dstOriginX, job.engine.stepX,
                   job.engine.bilinear != 0)),
      step_(job.engine.stepX),
      coveredLeft_(job.engine.dstRect.left),
      coveredLast_(SaturateToInt32(int64_t(job.engine.dstRect.right) - 1)),
      srcLeft_(job.engine.srcRect.left),
      srcLast_(SaturateToInt32(int64_t(job.engine.srcRect.right) - 1)),
      readableLast_(job.engine.srcReadRight - 1),
      left_(job.rect.left),
      bilinear_(job.engine.bilinear != 0),
      pairEdges_(job.has(kPairEdges)),
      noEdges_(job.has(kNoEdgeColumns)) {}

RowPositions::RowPositions(const Job& job)
    : start_(Start(job.engine.srcOriginY, job.engine.dstOriginY, job.engine.stepY,
                   job.engine.bilinear != 0)),
      step_(job.engine.stepY),
      srcTop_(job.engine.srcRect.top),
      srcBottom_(job.engine.srcRect.bottom),
      readableLast_(job.engine.srcReadBottom - 1),
      top_(job.rect.top),
      bilinear_(job.engine.bilinear != 0),
      sharedLowerLine_(job.has(kSharedLowerLine)) {}

}  // namespace kestrel
