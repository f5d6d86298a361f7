// One kernel call, widened: pitches and positions as 64-bit numbers, planes as the walk sees them.
#ifndef KESTREL_KERNELS_PIPELINE_JOB_H
#define KESTREL_KERNELS_PIPELINE_JOB_H

#include <stddef.h>

#include "engine/engine_internal.h"
#include "kernels/rows/rows.h"

namespace kestrel {

// Pixels of a row that are handled at once. Everything a strip needs lives on the stack and stays
// in the first-level cache.
constexpr int kStrip = 512;

struct Job {
  MRECT rect;  // loop orientation
  const int32_t* dstPitches;
  const int32_t* srcPitches;
  uint8_t* const* dstStarts;
  const uint8_t* const* srcPlanes;
  const EngineContext& engine;

  const RowOps& rows() const { return *engine.rows; }
};

// Whether a job can be drawn at all: its planes and table exist, and there is something to read.
bool IsDrawable(const Job& job);

// How the bytes of a masked RGB side make channels.
PixelFormat DescribePixels(const FormatDesc& format, const uint32_t* sizes,
                           const uint32_t* positions);

}  // namespace kestrel

#endif
