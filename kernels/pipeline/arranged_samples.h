// Luma and chroma of a block of pixels, turned by a quarter or mirrored before they are converted:
// they are fewer bytes than the pixels that they become, and those can then be written in long runs
// that lie in the destination as they are made.
#ifndef KESTREL_KERNELS_PIPELINE_ARRANGED_SAMPLES_H
#define KESTREL_KERNELS_PIPELINE_ARRANGED_SAMPLES_H

#include "kernels/pipeline/source.h"

namespace kestrel {

class ArrangedSamples {
 public:
  // A block of pixels to be turned, when each may have its own samples of chroma. Twice as many
  // rows can be turned where four pixels share them.
  // Preparing a row of a block costs as much as many pixels, and wide blocks have fewer rows; but
  // long vectors want long rows of what was turned, and fewer of them at once in the caches.
#ifdef __x86_64__
  static constexpr int kTurnedColumns = 128;
  static constexpr int kTurnedRows = 64;
#else
  static constexpr int kTurnedColumns = 256;
  static constexpr int kTurnedRows = 48;
#endif
  // Pixels to be mirrored at once.
  static constexpr int kMirrored = 4096;
  // Bytes. (A run may begin and end in the middle of a sample of chroma.)
  static constexpr int kTurnedSize = 3 * kTurnedColumns * kTurnedRows + 2 * kTurnedColumns;
  static constexpr int kMirroredSize = 3 * kMirrored + 2 * kMirrored / 16;

  ArrangedSamples(const RowOps& rows, uint8_t* memory) : rows_(rows), memory_(memory) {}

  // Begins to collect rows of n pixels, at most `most` of them, each of which becomes a column: the
  // first row the leftmost one, or the rightmost when `backwards`.
  void BeginTurned(int n, int most, bool backwards);
  // Rows that share chroma are the only ones of their block; backwards they are one, or an even
  // number. All rows of a block have chroma of the same layout.
  void Append(const SampleRows& in);
  int count() const {
    return count_;
  }
  // What was collected: n rows of count() pixels.
  SampleRows turned() const;

  // n pixels of each row, in the reverse order.
  SampleRows Mirror(const SampleRows& in, int n);

 private:
  // Of chroma, in the block: samples of a row.
  int chromaMost() const {
    return most_ >> chroma_.rows.rowShift;
  }

  const RowOps& rows_;
  uint8_t* memory_;
  int n_ = 0, most_ = 0, count_ = 0;
  bool backwards_ = false;
  PixelChroma chroma_ = {};  // of the rows that were collected
};

}  // namespace kestrel

#endif
