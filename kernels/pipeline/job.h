// One kernel call, widened: pitches and positions as 64-bit numbers, planes as the walk sees them.
#ifndef KESTREL_KERNELS_PIPELINE_JOB_H
#define KESTREL_KERNELS_PIPELINE_JOB_H

#include <stddef.h>

#include "engine/engine_internal.h"
#include "kernels/rows/rows.h"

namespace kestrel {

// Columns of a strip: any job has memory for kStrip of them, and none uses more than kWidestStrip.
constexpr int kStrip = 512;
constexpr int kWidestStrip = 2048;

// Where a kernel's bytes differ, on purpose, from what the generic converter gives.
enum Quirk : uint32_t {
  kExact = 0,
  kNoLevelMap = 1u << 0,       // copies stored values although the engine changes levels
  kPairChroma = 1u << 1,       // YUYV: U of the pixel that is first in memory, V of the other
  kPairEdges = 1u << 2,        // the edge test is made for pairs of columns, not for each
  kSharedLowerLine = 1u << 3,  // a pair's second row blends toward the line after the first row
  kNoEdgeColumns = 1u << 4,    // columns outside dstRect are sampled like any other
  kClampedCarry = 1u << 5,     // always dithers, by what the clamped 8-bit channels lose
  kCarryIfAsked = 1u << 6,     // with clamped carry: only where the engine dithers
  kNoDither = 1u << 7,         // truncates although the engine dithers
  kNearestOnly = 1u << 8,      // never blends; columns corner-aligned, rows as the engine says
  kSixBitMatrix = 1u << 9,     // YUV to RGB by factors of 6 fractional bits, never adjusted
  kYuyvPairs = kPairChroma | kNoLevelMap,
};

struct Job {
  MRECT rect;  // loop orientation
  const int32_t* dstPitches;
  const int32_t* srcPitches;
  uint8_t* const* dstStarts;
  const uint8_t* const* srcPlanes;
  const EngineContext& engine;
  uint32_t quirks = kExact;

  const RowOps& rows() const { return *engine.rows; }
  bool has(Quirk quirk) const { return (quirks & quirk) != 0; }
  bool mapsLevels() const {
    return engine.pathKind == PATH_YUV_TO_YUV && engine.needsLevelTable != 0 && !has(kNoLevelMap);
  }
};

// value / factor, truncating. Subsampling factors are nearly always 1 or 2, and a division for
// every row of a narrow job would cost more than its pixels. (Compilers would make one division of
// `value / 2` and the last case.)
inline int64_t DivideByFactor(int64_t value, uint32_t factor) {
  return factor <= 1   ? value
         : factor == 2 ? (value + (value < 0 ? 1 : 0)) >> 1
                       : value / int32_t(factor);
}

// Whether a job can be drawn at all: its planes and table exist, and there is something to read.
bool IsDrawable(const Job& job);

// Whether the job reads a conversion table that the engine does not have.
bool LacksTable(const Job& job);

// How the bytes of a masked RGB side make channels.
PixelFormat DescribePixels(const FormatDesc& format, const uint32_t* sizes,
                           const uint32_t* positions);

}  // namespace kestrel

#endif
