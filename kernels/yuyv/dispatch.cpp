// Packed YUYV family: YUYV from 24-bit RGB, grey, planar YUV and YUYV, and I420 to NV21.
#include "kernels/table/choice.h"

using namespace kestrel;

namespace {

namespace id = kestrel::kernel_id;

// Transforms as this family tells them apart. A vertical mirror alone is walked like none.
enum class Turn { kR90, kR180, kR270, kMirror, kSwap, kNone };

Turn TurnOf(const Question& q) {
  if (q.swap) return q.mirrorX ? Turn::kR90 : q.mirrorY ? Turn::kR270 : Turn::kSwap;
  if (q.mirrorX) return q.mirrorY ? Turn::kR180 : Turn::kMirror;
  return Turn::kNone;
}

// The members that make YUYV from one kind of source; block members by turn, in Turn's order.
struct Members {
  int unitBlocked[5], unitBlockedPlain2x2, unitBlockedPlain4x4, unitOther;
  int scaledBlocked[5], scaledBlockedPlain, scaledPlain4x4, scaledOther;
};

#define KESTREL_YUYV_MEMBERS(full, brief)                                                         \
  {                                                                                               \
    {id::full##_Fast_NORESAMPLE_2x2_R90, id::full##_Fast_NORESAMPLE_2x2_R180,                     \
     id::full##_Fast_NORESAMPLE_2x2_R270, id::full##_Fast_NORESAMPLE_2x2_MLR,                     \
     id::full##_Fast_NORESAMPLE_2x2_SXY},                                                         \
        id::full##_Fast_NORESAMPLE_2x2, id::brief##_NORESAMPLE, id::full##_NOREAMPLE_ROTATE_Fast, \
        {id::full##_Fast_2x2_R90, id::full##_Fast_2x2_R180, id::full##_Fast_2x2_R270,             \
         id::full##_Fast_2x2_MLR, id::full##_Fast_2x2_SXY},                                       \
        id::full##_Fast_2x2, id::brief##_RESAMPLE, id::full##_Fast                                \
  }

constexpr Members kFromRgb24 = KESTREL_YUYV_MEMBERS(RGB24_To_YUYV, RGB24toYUYVFast);
constexpr Members kFromGrey = KESTREL_YUYV_MEMBERS(Gray_To_YUYV, GraytoYUYVFast);
constexpr Members kFromPlanar = KESTREL_YUYV_MEMBERS(I420_To_YUYV, I420toYUYVFast);

#undef KESTREL_YUYV_MEMBERS

int ChooseMember(const Members& m, const Question& q) {
  const Turn turn = TurnOf(q);
  if (q.unit) {
    if (!q.blocked()) return m.unitOther;
    if (turn != Turn::kNone) return m.unitBlocked[int(turn)];
    return q.blockMode == 3 ? m.unitBlockedPlain4x4 : m.unitBlockedPlain2x2;
  }
  if (q.bilinear) return kDeclined;
  if (q.untransformed() && q.blockMode == 3) return m.scaledPlain4x4;
  if (!q.blocked()) return m.scaledOther;
  return turn == Turn::kNone ? m.scaledBlockedPlain : m.scaledBlocked[int(turn)];
}

int ChooseYuyvCopy(const Question& q) {
  if (!q.unit || q.blockMode != 3) return kDeclined;
  switch (TurnOf(q)) {
    case Turn::kR90:
      return id::YUYVtoYUYVFast_NORESAMPLE_90;
    case Turn::kR180:
      return id::YUYVtoYUYVFast_NORESAMPLE_180;
    case Turn::kR270:
      return id::YUYVtoYUYVFast_NORESAMPLE_270;
    case Turn::kNone:
      return q.mirrorY ? kDeclined : id::YUYVtoYUYVFast_NORESAMPLE;
    default:
      return kDeclined;
  }
}

int ChooseI420ToNv21(const Question& q) {
  if (!q.untransformed()) return kDeclined;
  if (q.engine.needsLevelTable == 0) return q.bilinear ? kDeclined : id::I420_To_NV21_Fast;
  if (q.unit) return id::YUV2NV21_LookupTable_R0;
  return q.bilinear ? id::YUV2NV21_LookupTable_BILINEAR_NOROTATE_Fast
                    : id::YUV2NV21_LookupTable_Nearest_RESAMPLE_R0_1x1;
}

int ChooseYuyv(const Question& q) {
  if (q.fromTo(kI420, kNv21)) return ChooseI420ToNv21(q);
  if (!q.to(kYuyv)) return kDeclined;
  if (q.from(kRgb24)) return q.sourceOrder == kRgbBytes ? kDeclined : ChooseMember(kFromRgb24, q);
  if (q.from(kGrey)) return ChooseMember(kFromGrey, q);
  if (q.from(kYuyv)) return ChooseYuyvCopy(q);
  if (!q.from(kPlanar)) return kDeclined;
  if (q.unit && q.from(kI420) && q.blockMode == 3 && TurnOf(q) == Turn::kR90) {
    return id::I420toYUYVFast_NORESAMPLE_90;
  }
  return ChooseMember(kFromPlanar, q);
}

}  // namespace

extern "C" uint32_t YUV_YUV_C_FAST(const MRECT* rect, const int32_t* dstPitches,
                                   const int32_t* srcPitches, uint8_t* const* dstPlanes,
                                   const uint8_t* const* srcPlanes, const EngineContext* context) {
  return Dispatch({kRgb24 | kGrey | kPlanar | kYuyv, kYuyv | kNv21}, ChooseYuyv, rect, dstPitches,
                  srcPitches, dstPlanes, srcPlanes, context);
}
