// The kernel table: every exported kernel is one line of kernels/<family>/kernels.def.
//
//   KERNEL(name, sources, destinations, pairing, scale, transform, block, quirks)
//
// says what the kernel accepts; what it writes is what the pipeline gives for the job, changed by
// the quirks it names. The columns' vocabulary is below.
#ifndef KESTREL_KERNELS_TABLE_KERNEL_ROW_H
#define KESTREL_KERNELS_TABLE_KERNEL_ROW_H

#include "engine/engine_internal.h"
#include "kernels/pipeline/pipeline.h"

namespace kestrel {

// Sets of layouts.
enum FormatSet : uint32_t {
  kRgb16 = 1u << 0,
  kRgb24 = 1u << 1,
  kRgb32 = 1u << 2,
  kGrey = 1u << 3,
  kI420 = 1u << 4,
  kI440 = 1u << 5,
  kI422 = 1u << 6,
  kI444 = 1u << 7,
  kYv12 = 1u << 8,
  kNv21 = 1u << 9,
  kNv12 = 1u << 10,
  kNv61 = 1u << 11,
  kYuyv = 1u << 12,
  kYuv444 = 1u << 13,
  kI420Or422 = kI420 | kI440 | kI422,
  kPlanar = kI420 | kI440 | kI422 | kI444,
  kSemiPlanar = kNv21 | kNv12,
  kYuv = kPlanar | kSemiPlanar | kGrey | kYv12 | kNv61 | kYuyv | kYuv444,
  kAnyLayout = ~0u,
};

// The side whose colour standard rules a conversion: the source, unless that is RGB.
inline const FormatDesc& YuvSide(const EngineContext& c) {
  return c.srcFormat.code == CODE_RGB ? c.dstFormat : c.srcFormat;
}

// How the two sides must relate.
enum class Pairing : uint8_t {
  kAny,
  kSame,
  kDifferent,
  kOneIsI420,
  k601Full,  // YUV samples are BT.601 full range; 24- and 32-bit pixels have channels of whole
             // bytes
};

enum class Scale : uint8_t {
  kAny,
  kUnit,       // unitStep
  kUnitSteps,  // both steps are 0x10000
  kNotUnit,    // unitStep is clear
  kNearest,    // neither unitStep nor bilinear
  kNotBilinear,
  kUnitOrNearest,   // 1:1 by its steps, whatever bilinear says, or not bilinear
  kUnitOrBilinear,  // 1:1 by its steps, or bilinear
  kBilinear,        // bilinear, and unitStep is clear
  kBilinearFlag,    // bilinear, also where a crop ended at 1:1
};

// Tests of the three transform flags, or of the whole code, whose high bits flags do not see.
enum class Transform : uint8_t {
  kAny,
  kNone,
  kSwapXY,
  kMirrorX,
  kRotate90,
  kMirrorY,
  kRotate270,
  kRotate180,
  kRotate90MirrorY,
  kNoSwapNoMirrorX,
  kSwapMirrorX,  // mirrorY is not looked at
  kSwapMirrorY,  // mirrorX is not looked at
  kCode0,
  kCode3,
  kCode5,
  kCode3Or5,
};

enum class Block : uint8_t { kAny, k2x2, k4x4, k2x2Or4x4 };

struct KernelRow {
  const char* name;
  uint32_t sources;
  uint32_t destinations;
  Pairing pairing;
  Scale scale;
  Transform transform;
  Block block;
  uint32_t quirks;
};

// The entry test.
bool Accepts(const KernelRow& row, const EngineContext& engine);

// Runs one line of the table: KESTREL_OK, or KESTREL_UNSUPPORTED with nothing written.
uint32_t RunKernel(const KernelRow& row, const MRECT* rect, const int32_t* dstPitches,
                   const int32_t* srcPitches, uint8_t* const* dstPlanes,
                   const uint8_t* const* srcPlanes, const EngineContext* context);

}  // namespace kestrel

#endif
