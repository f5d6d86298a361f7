#include "kernels/table/kernel_row.h"

namespace kestrel {
namespace {

bool HasByteChannels(uint32_t layout, const uint32_t* sizes, const uint32_t* positions) {
  if ((layout & (kRgb24 | kRgb32)) == 0) return true;
  for (int i = 0; i < 3; ++i) {
    if (sizes[i] != 8 || positions[i] % 8 != 0) return false;
  }
  return true;
}

bool PairingHolds(Pairing pairing, uint32_t source, uint32_t destination, const EngineContext& c) {
  switch (pairing) {
    case Pairing::kSame:
      return source == destination;
    case Pairing::kDifferent:
      return source != destination;
    case Pairing::kOneIsI420:
      return (source == kI420) != (destination == kI420);
    case Pairing::k601Full:
      return YuvSide(c).colourStandard == CS_BT601_FULL &&
             HasByteChannels(source, c.srcChannelSize, c.srcChannelPos) &&
             HasByteChannels(destination, c.dstChannelSize, c.dstChannelPos);
    default:
      return true;
  }
}

bool ScaleHolds(Scale scale, const EngineContext& c) {
  const bool unit = c.unitStep != 0;
  const bool unitSteps = c.stepX == 0x10000 && c.stepY == 0x10000;
  const bool bilinear = c.bilinear != 0;
  switch (scale) {
    case Scale::kUnit:
      return unit;
    case Scale::kUnitSteps:
      return unitSteps;
    case Scale::kNotUnit:
      return !unit;
    case Scale::kNearest:
      return !unit && !bilinear;
    case Scale::kNotBilinear:
      return !bilinear;
    case Scale::kUnitOrNearest:
      return unitSteps || !bilinear;
    case Scale::kUnitOrBilinear:
      return unitSteps || bilinear;
    case Scale::kBilinear:
      return !unit && bilinear;
    case Scale::kBilinearFlag:
      return bilinear;
    default:
      return true;
  }
}

bool TransformHolds(Transform transform, const EngineContext& c) {
  const uint32_t code = c.params.transformCode;
  const uint32_t flags = (c.swapXY != 0 ? MPP_SWAP_XY : 0) | (c.mirrorX != 0 ? MPP_MIRROR_X : 0) |
                         (c.mirrorY != 0 ? MPP_MIRROR_Y : 0);
  switch (transform) {
    case Transform::kNone:
      return flags == 0;
    case Transform::kSwapXY:
      return flags == 1;
    case Transform::kMirrorX:
      return flags == 2;
    case Transform::kRotate90:
      return flags == 3;
    case Transform::kMirrorY:
      return flags == 4;
    case Transform::kRotate270:
      return flags == 5;
    case Transform::kRotate180:
      return flags == 6;
    case Transform::kRotate90MirrorY:
      return flags == 7;
    case Transform::kNoSwapNoMirrorX:
      return (flags & 3) == 0;
    case Transform::kSwapMirrorX:
      return (flags & 3) == 3;
    case Transform::kSwapMirrorY:
      return (flags & 5) == 5;
    case Transform::kCode0:
      return code == 0;
    case Transform::kCode3:
      return code == 3;
    case Transform::kCode5:
      return code == 5;
    case Transform::kCode3Or5:
      return code == 3 || code == 5;
    default:
      return true;
  }
}

bool BlockHolds(Block block, uint32_t mode) {
  switch (block) {
    case Block::k2x2:
      return mode == 2;
    case Block::k4x4:
      return mode == 3;
    case Block::k2x2Or4x4:
      return mode == 2 || mode == 3;
    default:
      return true;
  }
}

}  // namespace

uint32_t LayoutBit(const FormatDesc& format) {
  switch (format.code) {
    case CODE_RGB:
      switch (format.colourStandard) {
        case 16:
          return kRgb16;
        case 24:
          return kRgb24;
        case 32:
          return kRgb32;
        default:
          return 0;
      }
    case CODE_GRAY8:
      return kGrey;
    case CODE_I420:
      return kI420;
    case CODE_I440:
      return kI440;
    case CODE_I422:
      return kI422;
    case CODE_I444:
      return kI444;
    case CODE_YV12:
      return kYv12;
    case CODE_NV21:
      return kNv21;
    case CODE_NV12:
      return kNv12;
    case CODE_NV61:
      return kNv61;
    case CODE_YUYV:
      return kYuyv;
    case CODE_YUV444:
      return kYuv444;
    default:
      return 0;
  }
}

bool Accepts(const KernelRow& row, const EngineContext& engine) {
  const uint32_t source = engine.srcLayoutBit;
  const uint32_t destination = engine.dstLayoutBit;
  return (row.sources & source) != 0 && (row.destinations & destination) != 0 &&
         PairingHolds(row.pairing, source, destination, engine) && ScaleHolds(row.scale, engine) &&
         TransformHolds(row.transform, engine) && BlockHolds(row.block, engine.blockMode);
}

uint32_t RunKernel(const KernelRow& row, const MRECT* rect, const int32_t* dstPitches,
                   const int32_t* srcPitches, uint8_t* const* dstPlanes,
                   const uint8_t* const* srcPlanes, const EngineContext* context) {
  if (!IsComplete(rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context)) {
    return KESTREL_BAD_ARGUMENT;
  }
  if (!Accepts(row, *context)) return KESTREL_UNSUPPORTED;
  const Job job = {*rect, dstPitches, srcPitches, dstPlanes, srcPlanes, *context, row.quirks};
  if (LacksTable(job)) return KESTREL_UNSUPPORTED;
  RunPipeline(job);
  return KESTREL_OK;
}

}  // namespace kestrel
