// A plain model of the whole road from engine creation to converted pixels: one pixel at a time,
// 64-bit integers, divisions instead of shifts, nothing shared with the product but the records of
// its public interface. Slow on purpose; the product must produce the same bytes.
//
// It models pictures, not hostile calls: planes must be as large as formats, sizes, origins and
// rectangles say, and a source rectangle must not be empty.
#ifndef KESTREL_TESTS_REFERENCE_REFERENCE_H
#define KESTREL_TESTS_REFERENCE_REFERENCE_H

#include <cstdint>

#include "engine/records.h"
#include "tests/reference/colour.h"
#include "tests/reference/format.h"

namespace reference {

struct Rect {
  int64_t left = 0, top = 0, right = 0, bottom = 0;
  bool IsEmpty() const { return left >= right || top >= bottom; }
};

// One conversion: what a caller hands to creation and to processing.
struct Job {
  MPPFORMAT dst;
  MPPFORMAT src;
  MPPPARAM params;
  bool hasRect;
  MRECT rect;
  uint8_t* dstPlanes[3];
  int32_t dstPitches[3];
  const uint8_t* srcPlanes[3];
  int32_t srcPitches[3];
};

// Creates, runs and forgets an engine. Returns the code of creation, or else that of processing.
uint32_t Convert(const Job& job);

enum class ColourPath { kYuvToYuv, kYuvToRgb, kRgbToRgb, kRgbToYuv };

// What creation decides for one pass. "Loop" coordinates are those that conversion walks:
// mirrored inside the destination region, and transposed when the axes are exchanged.
struct Engine {
  Format dst;
  Format src;
  uint32_t passMode = 1;  // as asked for; blockMode is what came of it
  uint32_t blockMode = 1;
  uint32_t transformCode = 0;
  ColourPath path = ColourPath::kYuvToYuv;
  bool swapXY = false;
  bool mirrorX = false;
  bool mirrorY = false;
  bool bilinear = false;
  bool dither = false;
  bool tallBands = false;
  uint8_t alpha = 0;
  int64_t stepX = 0;  // 16.16 source pixels per loop column
  int64_t stepY = 0;
  int64_t srcOriginX = 0;  // after the aspect policy
  int64_t srcOriginY = 0;
  int64_t loopOriginX = 0;  // of the destination region, in loop coordinates
  int64_t loopOriginY = 0;
  bool sourceIsEmpty = false;  // the aspect policy left nothing of the source
  Rect dstRegion;              // image coordinates
  Rect srcRect;
  Rect coveredRect;          // loop coordinates: what srcRect covers
  int64_t srcReadRight = 0;  // samples are read from 0 up to these limits
  int64_t srcReadBottom = 0;
  int64_t dstImageRight = 0;  // the destination image reaches at least to here
  bool changesLevels = false;
  YuvToRgb yuvToRgb;
  LevelChange levels;
};

inline bool IsUnitScale(const Engine& engine) {
  return engine.stepX == 0x10000 && engine.stepY == 0x10000;
}

// Creation of one pass engine. passMode is that of the pass: 1, 2 and 3 in a tiled handle.
uint32_t BuildEngine(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params,
                     uint32_t passMode, Engine* engine);

// What some kernels give on purpose instead of the generic converter's bytes.
struct Quirks {
  bool storedLevels = false;     // levels stay as stored although the engine changes them
  bool chromaOfPairs = false;    // YUYV: U of the pixel that is first in memory, V of the other
  bool edgesOfPairs = false;     // edge columns are told by the first column of each pair
  bool sharedLowerLine = false;  // rows in pairs, blended toward the line below the first one's
  bool noEdgeColumns = false;    // columns outside the covered rectangle are sampled like others
  bool sixBitMatrix = false;     // YUV to RGB by SixBitYuvToRgb, without dithering
  bool noDither = false;         // narrow channels are truncated although the engine dithers
  bool nearestOnly = false;      // no blending, columns aligned to corners; rows of the engine
  bool clampedCarry = false;     // dithers by ClampedCarry, also RGB to RGB
  bool carriesAlways = false;    // ... although the engine does not dither
};

// The generic converter on its own, or changed by quirks, under the contract that all conversion
// kernels have: a loop rectangle, destination pitches negated when mirrorY, addresses of the first
// pixel of the job in each destination plane and of the image origin in each source plane (planes
// already bound: channel addresses of one-plane formats, U before V).
void ConvertLoopRect(const Engine& engine, const Rect& loopRect, const int32_t* dstPitches,
                     const int32_t* srcPitches, uint8_t* const* dstStarts,
                     const uint8_t* const* srcPlanes, const Quirks& quirks = Quirks());

// The arguments of the call that draws one band (a rectangle of the image) with one kernel.
struct KernelCall {
  Rect loopRect;
  int32_t dstPitches[3];
  int32_t srcPitches[3];
  uint8_t* dstStarts[3];
  const uint8_t* srcPlanes[3];
};

// False when there is nothing to call: an empty band, a missing plane, a start before the image.
bool PrepareCall(const Engine& engine, const Job& job, const Rect& band, KernelCall* call);

}  // namespace reference

#endif
