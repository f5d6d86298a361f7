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

bool ColumnPositions::ArePlain(int32_t x, int32_t n) const {
  const int64_t left = (start_ + step_ * x) >> 16;
  const int64_t right = (start_ + step_ * (int64_t{x} + n - 1)) >> 16;
  const bool inside = noEdges_ ? left >= srcLeft_ && right <= srcLast_
                               : x >= coveredLeft_ && int64_t{x} + n <= coveredLast_;
  return !pairEdges_ && inside && left >= 0 && right < readableLast_;
}

void ColumnPositions::Read(int32_t x, int32_t n, int32_t* first, int32_t* second,
                           uint16_t* weights) const {
  constexpr int32_t kRun = 64;
  constexpr int64_t kLargestStep = INT32_MAX / (kRun + 1);
  for (int32_t from = 0; from < n; from += kRun) {
    const int32_t count = n - from < kRun ? n - from : kRun;
    if (step_ > kLargestStep || !ArePlain(x + from, count)) {
      for (int32_t i = from; i < from + count; ++i) {
        const Taps taps = At(x + i);
        first[i] = taps.first;
        if (second != nullptr) second[i] = taps.second;
        if (weights != nullptr) weights[i] = taps.weight;
      }
      continue;
    }
    // Positions from the run's first column on, which vectors have room for.
    const int64_t position = start_ + step_ * (x + from);
    const int32_t column = int32_t(position >> 16);
    const uint32_t fraction = uint32_t(position) & 0xFFFF;
    const uint32_t step = uint32_t(step_);
    for (int32_t i = 0; i < count; ++i) {
      first[from + i] = column + int32_t((fraction + uint32_t(i) * step) >> 16);
    }
    if (second != nullptr) {
      for (int32_t i = from; i < from + count; ++i) second[i] = first[i] + 1;
    }
    if (weights == nullptr) continue;
    for (int32_t i = 0; i < count; ++i) {
      weights[from + i] = bilinear_ ? uint16_t(fraction + uint32_t(i) * step) : uint16_t{0};
    }
  }
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
