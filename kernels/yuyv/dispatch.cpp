// Packed YUYV family: YUYV from 24-bit RGB, grey, planar YUV and YUYV, and I420 to NV21.
#include "kernels/table/kernels.h"

using namespace kestrel;

namespace {

constexpr int kDeclined = -1;

// Transforms as this family tells them apart. A vertical mirror alone is walked like none.
enum class Turn { kR90, kR180, kR270, kMirror, kSwap, kNone };

Turn TurnOf(const EngineContext& c) {
  const bool mirrorX = c.mirrorX != 0;
  const bool mirrorY = c.mirrorY != 0;
  if (c.swapXY != 0) return mirrorX ? Turn::kR90 : mirrorY ? Turn::kR270 : Turn::kSwap;
  if (mirrorX) return mirrorY ? Turn::kR180 : Turn::kMirror;
  return Turn::kNone;
}

// The members that make YUYV from one kind of source; block members by turn, in Turn's order.
struct Members {
  int unitBlocked[5], unitBlockedPlain2x2, unitBlockedPlain4x4, unitOther;
  int scaledBlocked[5], scaledBlockedPlain, scaledPlain4x4, scaledOther;
};

#define KESTREL_YUYV_MEMBERS(full, brief)                                                   \
  {                                                                                         \
    {kernel_id::full##_Fast_NORESAMPLE_2x2_R90, kernel_id::full##_Fast_NORESAMPLE_2x2_R180, \
     kernel_id::full##_Fast_NORESAMPLE_2x2_R270, kernel_id::full##_Fast_NORESAMPLE_2x2_MLR, \
     kernel_id::full##_Fast_NORESAMPLE_2x2_SXY},                                            \
        kernel_id::full##_Fast_NORESAMPLE_2x2, kernel_id::brief##_NORESAMPLE,               \
        kernel_id::full##_NOREAMPLE_ROTATE_Fast,                                            \
        {kernel_id::full##_Fast_2x2_R90, kernel_id::full##_Fast_2x2_R180,                   \
         kernel_id::full##_Fast_2x2_R270, kernel_id::full##_Fast_2x2_MLR,                   \
         kernel_id::full##_Fast_2x2_SXY},                                                   \
        kernel_id::full##_Fast_2x2, kernel_id::brief##_RESAMPLE, kernel_id::full##_Fast     \
  }

constexpr Members kFromRgb24 = KESTREL_YUYV_MEMBERS(RGB24_To_YUYV, RGB24toYUYVFast);
constexpr Members kFromGrey = KESTREL_YUYV_MEMBERS(Gray_To_YUYV, GraytoYUYVFast);
constexpr Members kFromPlanar = KESTREL_YUYV_MEMBERS(I420_To_YUYV, I420toYUYVFast);

#undef KESTREL_YUYV_MEMBERS

int ChooseMember(const Members& m, const EngineContext& c) {
  const bool unit = c.stepX == 0x10000 && c.stepY == 0x10000;
  const bool blocked = c.blockMode == 2 || c.blockMode == 3;
  const Turn turn = TurnOf(c);
  if (unit) {
    if (!blocked) return m.unitOther;
    if (turn != Turn::kNone) return m.unitBlocked[int(turn)];
    return c.blockMode == 3 ? m.unitBlockedPlain4x4 : m.unitBlockedPlain2x2;
  }
  if (c.bilinear != 0) return kDeclined;
  if (turn == Turn::kNone && c.blockMode == 3 && c.mirrorY == 0) return m.scaledPlain4x4;
  if (!blocked) return m.scaledOther;
  return turn == Turn::kNone ? m.scaledBlockedPlain : m.scaledBlocked[int(turn)];
}

int ChooseYuyvCopy(const EngineContext& c) {
  if (c.stepX != 0x10000 || c.stepY != 0x10000 || c.blockMode != 3) return kDeclined;
  switch (TurnOf(c)) {
    case Turn::kR90:
      return kernel_id::YUYVtoYUYVFast_NORESAMPLE_90;
    case Turn::kR180:
      return kernel_id::YUYVtoYUYVFast_NORESAMPLE_180;
    case Turn::kR270:
      return kernel_id::YUYVtoYUYVFast_NORESAMPLE_270;
    case Turn::kNone:
      return c.mirrorY == 0 ? kernel_id::YUYVtoYUYVFast_NORESAMPLE : kDeclined;
    default:
      return kDeclined;
  }
}

int ChooseI420ToNv21(const EngineContext& c) {
  if (c.srcFormat.code != CODE_I420 || c.dstFormat.code != CODE_NV21) return kDeclined;
  if (c.swapXY != 0 || c.mirrorX != 0 || c.mirrorY != 0) return kDeclined;
  if (c.needsLevelTable == 0) return c.bilinear != 0 ? kDeclined : kernel_id::I420_To_NV21_Fast;
  if (c.stepX == 0x10000 && c.stepY == 0x10000) return kernel_id::YUV2NV21_LookupTable_R0;
  return c.bilinear != 0 ? kernel_id::YUV2NV21_LookupTable_BILINEAR_NOROTATE_Fast
                         : kernel_id::YUV2NV21_LookupTable_Nearest_RESAMPLE_R0_1x1;
}

int ChooseFromYuv(const EngineContext& c) {
  const uint32_t source = c.srcFormat.code;
  if (c.dstFormat.code != CODE_YUYV) return ChooseI420ToNv21(c);
  if (source == CODE_GRAY8) return ChooseMember(kFromGrey, c);
  if (source == CODE_YUYV) return ChooseYuyvCopy(c);
  if (source < CODE_I420 || source > CODE_I444) return kDeclined;
  const bool unit = c.stepX == 0x10000 && c.stepY == 0x10000;
  if (unit && source == CODE_I420 && c.blockMode == 3 && TurnOf(c) == Turn::kR90) {
    return kernel_id::I420toYUYVFast_NORESAMPLE_90;
  }
  return ChooseMember(kFromPlanar, c);
}

int ChooseFromRgb(const EngineContext& c) {
  const bool rgb24 = c.srcFormat.code == CODE_RGB && c.srcFormat.colourStandard == 24;
  const uint32_t* position = c.srcChannelPos;
  const bool redLowest = position[0] == 0 && position[1] == 8 && position[2] == 16;
  if (!rgb24 || redLowest || c.dstFormat.code != CODE_YUYV) return kDeclined;
  return ChooseMember(kFromRgb24, c);
}

}  // namespace

extern "C" uint32_t YUV_YUV_C_FAST(const MRECT* rect, const int32_t* dstPitches,
                                   const int32_t* srcPitches, uint8_t* const* dstPlanes,
                                   const uint8_t* const* srcPlanes, const EngineContext* context) {
  if (context == nullptr) return KESTREL_BAD_ARGUMENT;
  const int id = context->pathKind == PATH_RGB_TO_YUV   ? ChooseFromRgb(*context)
                 : context->pathKind == PATH_YUV_TO_YUV ? ChooseFromYuv(*context)
                                                        : kDeclined;
  if (id == kDeclined) return KESTREL_UNSUPPORTED;
  return RunKernel(kKernels[id], rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);
}
