// What the engine's own files share, and what lower layers implement for it.
#ifndef KESTREL_ENGINE_ENGINE_INTERNAL_H
#define KESTREL_ENGINE_ENGINE_INTERNAL_H

#include "engine/postprocess.h"

extern "C" {

// Builds one pass engine. On failure *outEngine is untouched and nothing stays allocated.
uint32_t MPPBuildEngine(const MPPFORMAT* dstFormat, const MPPFORMAT* srcFormat,
                        const MPPPARAM* params, PassEngine** outEngine);

// Runs one pass engine over one rectangle (null = its whole destination region).
// KESTREL_BAD_ARGUMENT, with nothing written, for a null argument or a job beyond the limits below.
uint32_t MPProcessRect(PassEngine* engine, uint8_t* const* dstPlanes, const MRECT* dstRect,
                       const int32_t* dstPitches, const uint8_t* const* srcPlanes,
                       const int32_t* srcPitches);

// Clamps each edge of rect into bounds.
void MClampRect(MRECT* rect, const MRECT* bounds);

// Loads a binding from the caller's arrays.
void MPBindPlanes(PlaneLayout* binding, const uint8_t* const* planes, const int32_t* pitches);

// Computes the start addresses of a job, negates the copied pitches when mirrorY, and mirrors rect
// inside the destination region.
void MPMapDstRect(const PassEngine* engine, int32_t* dstPitches, MRECT* rect,
                  uint8_t** dstPlaneStarts);

// Implemented by colour/: fills table, tableSize, tableOffsets and rgbSums. Leaves table null when
// it cannot be allocated or none is needed. `like` is null, or an engine of the same formats and
// adjustments, whose table is copied.
void BuildConversionTables(const EngineContext* like, EngineContext* context);

}  // extern "C"

namespace kestrel {

// Images with a coordinate beyond this, or planes spanning 2 GiB, are refused rather than walked:
// every address computation then fits pointers of 32 bits, and a nonsense size cannot be believed.
constexpr int64_t kMaxCoordinate = 1 << 24;
constexpr int64_t kMaxPlaneSpan = INT32_MAX;

// Implemented by kernels/table/: the bit of a layout in the sets that say what kernels take; 0 for
// one that no kernel is made for.
uint32_t LayoutBit(const FormatDesc& format);

// Implemented by kernels/rows/: the row operations for this CPU.
const ::KestrelRowOps* SelectRowOps();

// Whether a kernel call has all six arguments.
inline bool IsComplete(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                       uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                       const EngineContext* context) {
  return rect != nullptr && dstPitches != nullptr && srcPitches != nullptr &&
         dstPlanes != nullptr && srcPlanes != nullptr && context != nullptr;
}

inline int32_t SaturateToInt32(int64_t value) {
  return value > INT32_MAX ? INT32_MAX : value < INT32_MIN ? INT32_MIN : int32_t(value);
}

}  // namespace kestrel

#endif
