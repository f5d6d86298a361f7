// The weights of RGB to YUV, as vectors use them.
#ifndef KESTREL_KERNELS_ROWS_WEIGHTS_H
#define KESTREL_KERNELS_ROWS_WEIGHTS_H

#include "kernels/rows/rows.h"

namespace kestrel {

// Which weights are negative: those of luma none, those of chroma all but the first or the last.
enum class Signs { kAllPositive, kFirstPositive, kLastPositive };

// Of the two components of chroma.
constexpr bool AreOpposite(Signs a, Signs b) {
  return a != Signs::kAllPositive && b != Signs::kAllPositive && a != b;
}

// channel = (offset + sum of weight * channel) >> 16.
struct Weights {
  int32_t of[3];
  int32_t offset;

  // In the order of a pixel's bytes. The tables are straight lines.
  Weights(RgbToYuvTables tables, bool blueFirst) : offset(0) {
    for (int c = 0; c < 3; ++c) {
      of[blueFirst ? 2 - c : c] = tables[c][1] - tables[c][0];
      offset += tables[c][0];
    }
  }
  Signs signs() const {
    return of[1] >= 0   ? Signs::kAllPositive
           : of[0] >= 0 ? Signs::kFirstPositive
                        : Signs::kLastPositive;
  }
};

}  // namespace kestrel

#endif
