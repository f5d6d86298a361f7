#include "kernels/pipeline/positions.h"

namespace kestrel {
namespace {

// Position of destination coordinate 0.
int64_t Start(int32_t srcOrigin, int32_t dstOrigin, uint32_t step, bool bilinear) {
  const int64_t origin = int64_t(srcOrigin) * 65536 - int64_t(step) * dstOrigin;
  return bilinear ? origin + int64_t(step) - int64_t(step / 2) - 32768 : origin;
}

bool BlendsNeighbours(const Job& job) {
  return job.engine.bilinear != 0 && !job.has(kNearestOnly);
}

}  // namespace

ColumnPositions::ColumnPositions(const Job& job)
    : start_(Start(job.engine.srcOriginX, job.engine.dstOriginX, job.engine.stepX,
                   BlendsNeighbours(job))),
      step_(job.engine.stepX),
      coveredLeft_(job.engine.dstRect.left),
      coveredLast_(SaturateToInt32(int64_t(job.engine.dstRect.right) - 1)),
      srcLeft_(job.engine.srcRect.left),
      srcLast_(SaturateToInt32(int64_t(job.engine.srcRect.right) - 1)),
      readableLast_(job.engine.srcReadRight - 1),
      left_(job.rect.left),
      bilinear_(BlendsNeighbours(job)),
      pairEdges_(job.has(kPairEdges)),
      noEdges_(job.has(kNoEdgeColumns)) {}

bool ColumnPositions::Advance(int32_t x, int32_t n) const {
  if (step_ != 0x10000 || pairEdges_) return false;
  // Left of the covered columns, on them, and right of them positions rise by no more than one from
  // column to column: when the ends of such a part are as far apart as they should be, so is
  // everything between them.
  const int64_t end = int64_t(x) + n;
  const int64_t cuts[] = {coveredLeft_, coveredLast_, end};
  int64_t first = x;
  for (const int64_t cut : cuts) {
    const int64_t last = (cut < end ? cut : end) - 1;
    if (last < first) continue;
    if (first > x && At(int32_t(first)).first - At(int32_t(first - 1)).first != 1) return false;
    if (At(int32_t(last)).first - At(int32_t(first)).first != last - first) return false;
    first = last + 1;
  }
  return true;
}

RowPositions::RowPositions(const Job& job)
    : start_(Start(job.engine.srcOriginY, job.engine.dstOriginY, job.engine.stepY,
                   job.engine.bilinear != 0)),
      step_(job.engine.stepY),
      srcTop_(job.engine.srcRect.top),
      srcBottom_(job.engine.srcRect.bottom),
      readableLast_(job.engine.srcReadBottom - 1),
      top_(job.rect.top),
      bilinear_(BlendsNeighbours(job)),
      sharedLowerLine_(job.has(kSharedLowerLine)),
      plainFrom_(srcTop_ > 0 ? srcTop_ : 0) {
  for (int shift = 0; shift < 2; ++shift) {
    // Rows whose sample, and whose successor's, are above the last one and readable.
    const int64_t last = (int64_t(srcBottom_) - 1) >> shift;
    const int64_t readable = readableLast_ >> shift;
    plainTo_[shift] = (last < readable ? last : readable) * (int64_t{65536} << shift);
  }
}

}  // namespace kestrel
