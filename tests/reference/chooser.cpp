// The decisions as ordered lists: the first line that fits a job is the kernel that runs it.
#include "tests/reference/chooser.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <forward_list>
#include <initializer_list>
#include <iterator>
#include <utility>

namespace reference {
namespace {

bool IsAmong(uint32_t code, std::initializer_list<uint32_t> codes) {
  return std::find(codes.begin(), codes.end(), code) != codes.end();
}

bool IsPlanar(uint32_t code) {
  return IsAmong(code, {CODE_I420, CODE_I440, CODE_I422, CODE_I444});
}

bool IsPlanarOrGrey(uint32_t code) {
  return code == CODE_GRAY8 || IsPlanar(code);
}

bool IsPairs(uint32_t code) {
  return IsAmong(code, {CODE_NV21, CODE_NV12});
}

bool IsHalved(uint32_t code) {  // one chroma axis of two
  return IsAmong(code, {CODE_I440, CODE_I422});
}

using Formats = bool (*)(uint32_t src, uint32_t dst);

bool BetweenI420And422(uint32_t src, uint32_t dst) {
  return (IsHalved(src) && dst == CODE_I420) || (src == CODE_I420 && IsHalved(dst));
}
bool SamePlanar420Or422(uint32_t src, uint32_t dst) {
  return src == dst && IsAmong(src, {CODE_I420, CODE_I440, CODE_I422, CODE_YV12});
}
bool SamePlanar(uint32_t src, uint32_t dst) {
  return src == dst && (IsPlanar(src) || src == CODE_YV12);
}
bool Same420(uint32_t src, uint32_t dst) {
  return src == dst && IsAmong(src, {CODE_I420, CODE_YV12});
}
bool Nv21ToI420(uint32_t src, uint32_t dst) {
  return src == CODE_NV21 && dst == CODE_I420;
}
bool YuyvToI420(uint32_t src, uint32_t dst) {
  return src == CODE_YUYV && dst == CODE_I420;
}
bool PairsToI444(uint32_t src, uint32_t dst) {
  return IsPairs(src) && dst == CODE_I444;
}
bool PairsToYuv444(uint32_t src, uint32_t dst) {
  return IsPairs(src) && dst == CODE_YUV444;
}
bool Yuv444ToPairs(uint32_t src, uint32_t dst) {
  return src == CODE_YUV444 && IsPairs(dst);
}
bool SamePairs(uint32_t src, uint32_t dst) {
  return IsPairs(src) && src == dst;
}
bool OtherPairs(uint32_t src, uint32_t dst) {
  return IsPairs(src) && IsPairs(dst) && src != dst;
}
bool PlanarToPairs(uint32_t src, uint32_t dst) {
  return IsPlanarOrGrey(src) && IsPairs(dst);
}
bool Nv61ToI420(uint32_t src, uint32_t dst) {
  return src == CODE_NV61 && dst == CODE_I420;
}
bool Nv61ToNv21(uint32_t src, uint32_t dst) {
  return src == CODE_NV61 && dst == CODE_NV21;
}
bool BetweenI420AndYv12(uint32_t src, uint32_t dst) {
  return (src == CODE_I420 && dst == CODE_YV12) || (src == CODE_YV12 && dst == CODE_I420);
}
bool Nv61ToNv61(uint32_t src, uint32_t dst) {
  return src == CODE_NV61 && dst == CODE_NV61;
}
bool PlanarToNv61(uint32_t src, uint32_t dst) {
  return IsPlanarOrGrey(src) && dst == CODE_NV61;
}
bool YuyvToYuyv(uint32_t src, uint32_t dst) {
  return src == CODE_YUYV && dst == CODE_YUYV;
}

using Test = bool (*)(const Engine& e);

bool Unit(const Engine& e) {
  return IsUnitScale(e);
}
bool Nearest(const Engine& e) {
  return !IsUnitScale(e) && !e.bilinear;
}
bool Bilinear(const Engine& e) {
  return !IsUnitScale(e) && e.bilinear;
}
bool NotBilinear(const Engine& e) {
  return !e.bilinear;
}

bool HasFlags(const Engine& e, bool swapXY, bool mirrorX, bool mirrorY) {
  return e.swapXY == swapXY && e.mirrorX == mirrorX && e.mirrorY == mirrorY;
}

bool R0(const Engine& e) {
  return HasFlags(e, false, false, false);
}
bool SwapXY(const Engine& e) {
  return HasFlags(e, true, false, false);
}
bool HFlip(const Engine& e) {
  return HasFlags(e, false, true, false);
}
bool R90(const Engine& e) {
  return HasFlags(e, true, true, false);
}
bool VFlip(const Engine& e) {
  return HasFlags(e, false, false, true);
}
bool R270(const Engine& e) {
  return HasFlags(e, true, false, true);
}
bool R180(const Engine& e) {
  return HasFlags(e, false, true, true);
}
bool NoSwapNoMirrorX(const Engine& e) {
  return !e.swapXY && !e.mirrorX;
}
bool SwapMirrorY(const Engine& e) {
  return e.swapXY && e.mirrorY;
}
bool Code0(const Engine& e) {
  return e.transformCode == 0;
}
bool Code3Or5(const Engine& e) {
  return e.transformCode == 3 || e.transformCode == 5;
}

bool AnyBlock(const Engine&) {
  return true;
}
bool Block2x2(const Engine& e) {
  return e.blockMode == 2;
}
bool Block4x4(const Engine& e) {
  return e.blockMode == 3;
}
bool Block2x2Or4x4(const Engine& e) {
  return e.blockMode == 2 || e.blockMode == 3;
}

struct Line {
  const char* kernel;
  Formats formats;
  Test scale;
  Test transform;
  Test block;
};

constexpr Line kYuvToYuv[] = {
    {"I422_TO_I420_NORESAMPLE_4x4", BetweenI420And422, Unit, NoSwapNoMirrorX, AnyBlock},
    {"I422_TO_I420_NORESAMPLE", BetweenI420And422, Unit, NoSwapNoMirrorX, AnyBlock},
    {"YUV_TO_YUV_NORESAMPLE_NO_4x4", SamePlanar420Or422, Unit, R0, Block4x4},
    {"YUV_TO_YUV_NORESAMPLE_NO_1x1", SamePlanar, Unit, R0, AnyBlock},
    {"I420_NORESAMPLE_4x4_R90", Same420, Unit, R90, Block4x4},
    {"NV21VtoI420Fast_NORESAMPLE_R270_4x4", Nv21ToI420, Unit, SwapMirrorY, Block4x4},
    {"NV21VtoI420Fast_NORESAMPLE_R270_2x2", Nv21ToI420, Unit, SwapMirrorY, Block2x2},
    {"NV21toI420Fast_NORESAMPLE_R0_4x4", Nv21ToI420, Unit, R0, Block4x4},
    {"NV21toI420Fast_Nearest_RESAMPLE_R0_4x4", Nv21ToI420, NotBilinear, R0, Block4x4},
    {"NV21toI420Fast_Nearest_RESAMPLE_R0_1x1", Nv21ToI420, Nearest, R0, AnyBlock},
    {"YUYVtoI420Fast_NORESAMPLE_R0_4x4", YuyvToI420, Unit, R0, Block4x4},
    {"NVXYtoI444_Fast_NORESAMPLE_R0_4x4", PairsToI444, Unit, R0, Block4x4},
    {"NVXYtoYUV_Fast_NORESAMPLE_R0_4x4", PairsToYuv444, Unit, R0, Block4x4},
    {"YUVtoNVXY_Fast_NORESAMPLE_R0_4x4", Yuv444ToPairs, Unit, R0, Block4x4},
    {"NV21toNV21Fast_NORESAMPLE_R90_4x4", SamePairs, Unit, R90, Block4x4},
    {"NV21toNV21Fast_NORESAMPLE_R180_4x4", SamePairs, Unit, R180, Block4x4},
    {"NV21toNV21Fast_NORESAMPLE_R270_4x4", SamePairs, Unit, R270, Block4x4},
    {"NV21toNV21Fast_NORESAMPLE_H_Flip_4x4", SamePairs, Unit, HFlip, Block4x4},
    {"NV21toNV21Fast_NORESAMPLE_H_Flip_2x2", SamePairs, Unit, HFlip, Block2x2},
    {"NV21toNV21Fast_NORESAMPLE_V_Flip_4x4", SamePairs, Unit, VFlip, Block4x4},
    {"NV12_TO_NV12_NORESAMPLE_Rotate", SamePairs, Unit, Code3Or5, AnyBlock},
    {"NV12_TO_NV12_NORESAMPLE_Rotate180", SamePairs, Unit, R180, AnyBlock},
    {"NV21toNV21Fast_NORESAMPLE_R0_1x1", SamePairs, Unit, R0, AnyBlock},
    {"NV21toNV21Fast_N_RESAMPLE_R0_4x4", SamePairs, Nearest, R0, Block4x4},
    {"NV12_To_NV12_Fast_R90_2x2", SamePairs, Nearest, R90, Block2x2Or4x4},
    {"NV21_To_NV21_REAMPLE_NOROTATE_BILINEAR_Fast_2x2", SamePairs, Bilinear, R0, Block4x4},
    {"NV21_To_NV21_REAMPLE_NOROTATE_BILINEAR_Fast", SamePairs, Bilinear, R0, AnyBlock},
    {"NV12_To_NV12_Fast_Bilinear_R90_2x2", SamePairs, Bilinear, R90, Block2x2Or4x4},
    {"NV12_TO_NV21_NORESAMPLE_4x4", OtherPairs, Unit, R0, Block4x4},
    {"NV12_TO_NV21_NORESAMPLE", OtherPairs, Unit, R0, AnyBlock},
    {"NV12_TO_NV21_NORESAMPLE_R180_4x4", OtherPairs, Unit, R180, Block4x4},
    {"NV12_TO_NV21_NORESAMPLE_R180", OtherPairs, Unit, R180, AnyBlock},
    {"NV12_TO_NV21_NORESAMPLE_Rotate", OtherPairs, Unit, Code3Or5, AnyBlock},
    {"YUVtoNV21Fast_NORESAMPLE_R90_4x4", PlanarToPairs, Unit, R90, Block4x4},
    {"YUVtoNV21Fast_NORESAMPLE_R180_4x4", PlanarToPairs, Unit, R180, Block4x4},
    {"YUVtoNV21Fast_NORESAMPLE_R270_4x4", PlanarToPairs, Unit, R270, Block4x4},
    {"YUVtoNV21Fast_NORESAMPLE_R0_4x4", PlanarToPairs, Unit, Code0, Block4x4},
    {"YUVtoNV21Fast_NORESAMPLE_H_Flip_4x4", PlanarToPairs, Unit, HFlip, Block4x4},
    {"YUVtoNV21Fast_NORESAMPLE_V_Flip_4x4", PlanarToPairs, Unit, VFlip, Block4x4},
    {"YUVtoNV21Fast_NORESAMPLE_SwapXY_4x4", PlanarToPairs, Unit, SwapXY, Block4x4},
    {"YUVtoNV21Fast_NORESAMPLE_R0_1x1", PlanarToPairs, Unit, R0, AnyBlock},
    {"YUV422toI420Fast_NORESAMPLE_R0_4x4", Nv61ToI420, Unit, R0, Block4x4},
    {"YUV422SP_TO_NV21_NORESAMPLE_4x4", Nv61ToNv21, Unit, R0, Block4x4},
    {"I420_Bewteen_YV12_NORESAMPLE_4x4", BetweenI420AndYv12, Unit, R0, Block4x4},
    {"YUV422toYUV422Fast_NORESAMPLE_R90_4x4", Nv61ToNv61, Unit, R90, Block4x4},
    {"YUV422toYUV422Fast_NORESAMPLE_R180_4x4", Nv61ToNv61, Unit, R180, Block4x4},
    {"YUV422toYUV422Fast_NORESAMPLE_R270_4x4", Nv61ToNv61, Unit, R270, Block4x4},
    {"YUV422toYUV422Fast_NORESAMPLE_H_Flip_4x4", Nv61ToNv61, Unit, HFlip, Block4x4},
    {"YUV422toYUV422Fast_NORESAMPLE_V_Flip_4x4", Nv61ToNv61, Unit, VFlip, Block4x4},
    {"YUV422toYUV422Fast_N_RESAMPLE_R0_4x4", Nv61ToNv61, Nearest, R0, Block4x4},
    {"YUVtoYUV422Fast_NORESAMPLE_R90_4x4", PlanarToNv61, Unit, R90, Block4x4},
    {"YUVtoYUV422Fast_NORESAMPLE_R180_4x4", PlanarToNv61, Unit, R180, Block4x4},
    {"YUVtoYUV422Fast_NORESAMPLE_R270_4x4", PlanarToNv61, Unit, R270, Block4x4},
    {"YUVtoYUV422Fast_NORESAMPLE_R0_4x4", PlanarToNv61, Unit, R0, Block4x4},
    {"YUVtoYUV422Fast_NORESAMPLE_H_Flip_4x4", PlanarToNv61, Unit, HFlip, Block4x4},
    {"YUVtoYUV422Fast_NORESAMPLE_V_Flip_4x4", PlanarToNv61, Unit, VFlip, Block4x4},
    {"YUVtoYUV422Fast_NORESAMPLE_SwapXY_4x4", PlanarToNv61, Unit, SwapXY, Block4x4},
    {"YUYVtoYUYVFast_N_RESAMPLE_R0_4x4", YuyvToYuyv, Nearest, R0, Block2x2},
};

bool I420ToI420(uint32_t src, uint32_t dst) {
  return src == CODE_I420 && dst == CODE_I420;
}
bool I420ToNv12(uint32_t src, uint32_t dst) {
  return src == CODE_I420 && dst == CODE_NV12;
}
bool I420ToNv21Formats(uint32_t src, uint32_t dst) {
  return src == CODE_I420 && dst == CODE_NV21;
}
bool NotUnit(const Engine& e) {
  return !IsUnitScale(e);
}
bool Code3(const Engine& e) {
  return e.transformCode == 3;
}
bool Code5(const Engine& e) {
  return e.transformCode == 5;
}

constexpr Line kMcc[] = {
    {"MCC_I420_Bilinear_90", I420ToI420, Bilinear, Code3, AnyBlock},
    {"MCC_I420_Bilinear_270", I420ToI420, Bilinear, Code5, Block4x4},
    {"MCC_I420_Bilinear", I420ToI420, Bilinear, Code0, Block4x4},
    {"MCC_I420_NV12_Resample_270", I420ToNv12, NotUnit, Code5, Block4x4},
    {"MCC_I420_NV12_Resample_90", I420ToNv12, NotUnit, Code3, AnyBlock},
    {"MCC_I420_NV12_Resample", I420ToNv12, NotUnit, Code0, Block4x4},
    {"MCC_I420_NV12_NoResample", I420ToNv12, Unit, Code0, Block4x4},
    {"MCC_I420_NV21_NoResampleRotate", I420ToNv21Formats, Unit, Code0, Block4x4},
};

bool Fits(const Line& line, const Engine& engine) {
  return line.formats(engine.src.code, engine.dst.code) && line.scale(engine) &&
         line.transform(engine) && line.block(engine);
}

// One layout resampled into itself: nearest in 4x4 blocks, bilinear in 2x2 blocks.
const char* Resampler(const Engine& e, const char* nearest, const char* bilinear) {
  if (!R0(e)) {
    return nullptr;
  }
  if (e.blockMode == 3) {
    return e.bilinear ? nullptr : nearest;
  }
  return e.blockMode == 2 && e.bilinear ? bilinear : nullptr;
}

// Names of the kinds of sources that YUYV is made of.
struct Kind {
  const char* longPrefix;
  const char* shortPrefix;
};

// Transform suffixes of YUYV members; mirrorY alone is not told apart from no transform.
const char* YuyvSuffix(const Engine& e) {
  if (e.swapXY) {
    return e.mirrorX ? "R90" : e.mirrorY ? "R270" : "SXY";
  }
  return !e.mirrorX ? nullptr : e.mirrorY ? "R180" : "MLR";
}

// Names are put together; this keeps each one for good.
const char* Kept(const char* start, const char* middle, const char* end = "") {
  struct Name {
    char text[80];
  };
  static std::forward_list<Name> names;
  Name name;
  std::snprintf(name.text, sizeof(name.text), "%s%s%s", start, middle, end);
  for (const Name& known : names) {
    if (std::strcmp(known.text, name.text) == 0) {
      return known.text;
    }
  }
  names.push_front(name);
  return names.front().text;
}

const char* ToYuyv(const Engine& e, const Kind& kind) {
  const bool isBlocked = e.blockMode == 2 || e.blockMode == 3;
  const char* const longName = kind.longPrefix;
  const char* const shortName = kind.shortPrefix;
  const char* const suffix = YuyvSuffix(e);
  if (IsUnitScale(e)) {
    if (!isBlocked) {
      return Kept(longName, "_NOREAMPLE_ROTATE_Fast");
    }
    if (suffix) {
      if (e.src.code == CODE_I420 && e.blockMode == 3 && e.swapXY && e.mirrorX) {
        return "I420toYUYVFast_NORESAMPLE_90";
      }
      return Kept(longName, "_Fast_NORESAMPLE_2x2_", suffix);
    }
    return e.blockMode == 3 ? Kept(shortName, "_NORESAMPLE")
                            : Kept(longName, "_Fast_NORESAMPLE_2x2");
  }
  if (e.bilinear) {
    return nullptr;
  }
  if (!isBlocked) {
    return Kept(longName, "_Fast");
  }
  if (suffix) {
    return Kept(longName, "_Fast_2x2_", suffix);
  }
  return e.blockMode == 3 && !e.mirrorY ? Kept(shortName, "_RESAMPLE")
                                        : Kept(longName, "_Fast_2x2");
}

const char* YuyvToYuyv(const Engine& e) {
  if (!IsUnitScale(e) || e.blockMode != 3) {
    return nullptr;
  }
  if (e.swapXY && e.mirrorX) {
    return "YUYVtoYUYVFast_NORESAMPLE_90";
  }
  if (!e.swapXY && e.mirrorX && e.mirrorY) {
    return "YUYVtoYUYVFast_NORESAMPLE_180";
  }
  if (e.swapXY && e.mirrorY) {
    return "YUYVtoYUYVFast_NORESAMPLE_270";
  }
  return R0(e) ? "YUYVtoYUYVFast_NORESAMPLE" : nullptr;
}

const char* I420ToNv21(const Engine& e) {
  if (e.src.code != CODE_I420 || e.dst.code != CODE_NV21 || !R0(e)) {
    return nullptr;
  }
  if (!e.changesLevels) {
    return e.bilinear ? nullptr : "I420_To_NV21_Fast";
  }
  if (IsUnitScale(e)) {
    return "YUV2NV21_LookupTable_R0";
  }
  return e.bilinear ? "YUV2NV21_LookupTable_BILINEAR_NOROTATE_Fast"
                    : "YUV2NV21_LookupTable_Nearest_RESAMPLE_R0_1x1";
}

// What follows is asked of RGB sides; YUV layouts have a depth too, but no decision rests on it.
bool IsRgbOf(const Format& format, uint32_t bitsPerPixel) {
  return format.IsRgb() && format.bitsPerPixel == bitsPerPixel;
}

bool HasPositions(const Format& format, uint32_t red, uint32_t green, uint32_t blue) {
  return format.maskPosition[kRed] == red && format.maskPosition[kGreen] == green &&
         format.maskPosition[kBlue] == blue;
}

bool RedIsLowest(const Format& format) {  // 24 and 32 bits
  return HasPositions(format, 0, 8, 16);
}

bool BlueIsLowest(const Format& format) {  // 24 and 32 bits
  return HasPositions(format, 16, 8, 0);
}

bool IsBgr565(const Format& format) {
  return HasPositions(format, 0, 5, 11);
}

bool HasByteChannels(const Format& format) {
  return format.maskSize[kRed] == 8 && format.maskSize[kGreen] == 8 && format.maskSize[kBlue] == 8;
}

const char* PlanarToRgb16(const Engine& e) {
  const bool blocked = e.blockMode == 3;
  if (IsBgr565(e.dst)) {
    if (!IsUnitScale(e)) {
      return e.bilinear ? "YUV2RGBFast_B5G6R5" : "YUV2RGBFast_B5G6R5_Nearest";
    }
    if (!blocked) {
      return "YUV2RGBFast_NORESAMPLE_B5G6R5";
    }
    return e.dither ? nullptr : "YUV2RGBFast_NORESAMPLE_B5G6R5_4x4";
  }
  if (IsUnitScale(e)) {
    return !blocked   ? "YUV2RGBFast_NORESAMPLE_R5G6B5"
           : e.dither ? "YUV2RGBFast_NORESAMPLE_R5G6B5_4x4_Dither"
                      : "YUV2RGBFast_NORESAMPLE_R5G6B5_4x4";
  }
  if (e.bilinear) {
    return e.dither                    ? "YUV2RGBFast_R5G6B5"
           : e.blockMode == 2 && R0(e) ? "YUV2RGBFast_R5G6B5_NODither_2x2"
                                       : "YUV2RGBFast_R5G6B5_NODither";
  }
  if (e.dither) {
    return nullptr;
  }
  return blocked && R0(e) ? "YUV2RGBFast_R5G6B5_Nearest_2x2" : "YUV2RGBFast_R5G6B5_Nearest";
}

const char* Nv21ToRgb16(const Engine& e) {
  constexpr const char* kNearest = "NV21_TO_RGBFast_R5G6B5_Nearest";
  if (IsBgr565(e.dst)) {
    return nullptr;
  }
  if (IsUnitScale(e)) {
    if (e.mirrorX && !e.swapXY) {
      return kNearest;
    }
    if (!e.mirrorX && !e.swapXY && (!e.dither || e.blockMode == 2)) {
      return e.blockMode != 2 ? "NV21_To_RGB565_NoResample_1x1"
             : e.dither       ? "NV21_To_RGB565_NoResample_2x2_Dither"
                              : "NV21_To_RGB565_NoResample_2x2";
    }
    if (e.swapXY && e.mirrorX && e.mirrorY) {
      return e.dither ? kNearest : "NV21_To_RGB565_NoResample_1x1_R90AndVertical";
    }
    if (e.swapXY && e.mirrorY) {
      switch (e.blockMode) {
        case 3:
          return e.dither ? kNearest : "NV21_To_RGB565_NoResample_4x4_R270";
        case 2:
          return e.dither ? "NV21_To_RGB565_NoResample_2x2_R270_Dither"
                          : "NV21_To_RGB565_NoResample_2x2_R270";
        default:
          return kNearest;
      }
    }
  }
  if (e.stepX != 0x10000 && e.stepY != 0x10000 && !e.mirrorX && !e.swapXY && !e.bilinear &&
      !e.dither) {
    return kNearest;
  }
  return e.stepX == e.stepY ? kNearest : nullptr;
}

const char* Nv12ToRgb16(const Engine& e) {
  if (IsBgr565(e.dst) || e.mirrorX || e.swapXY || e.bilinear || e.dither) {
    return nullptr;
  }
  if (IsUnitScale(e)) {
    return e.blockMode == 2 ? "NV21_TO_RGBFast_R5G6B5_NoResample_2x2"
                            : "NV21_TO_RGBFast_R5G6B5_NoResample";
  }
  return e.blockMode == 2 ? "NV21_TO_RGBFast_R5G6B5_Nearest_2x2" : "NV21_TO_RGBFast_R5G6B5_Nearest";
}

const char* Rgb16ToRgb16(const Engine& e) {
  if (IsBgr565(e.src) != IsBgr565(e.dst)) {
    return nullptr;
  }
  const bool isBgr = IsBgr565(e.src);
  if (IsUnitScale(e)) {
    if (isBgr) {
      return nullptr;
    }
    return R90(e) && e.blockMode != 1 ? "RGB2RGBFast_NORESAMPLE_R5G6B5_2x2_R90"
                                      : "RGB2RGBFast_NORESAMPLE_R5G6B5";
  }
  if (e.bilinear) {
    return e.blockMode == 2 ? "RGB2RGBFast_R5G6B5_BILINAR_RESIZE_2x2"
           : isBgr          ? nullptr
                            : "RGB2RGBFast_R5G6B5";
  }
  return e.blockMode == 3 && R0(e) ? "RGB2RGBFast_R5G6B5_N_RESIZE_4x4"
                                   : "RGB2RGBFast_R5G6B5_N_Resize";
}

const char* Rgb16ToYuv(const Engine& e) {
  const bool blocked = e.blockMode == 3;
  const bool copied = IsUnitScale(e) && R0(e);
  if (e.dst.code == CODE_YUYV) {
    if (!copied) {
      return nullptr;
    }
    if (IsBgr565(e.src)) {
      return blocked ? "BGR2YUYVFast_NORESAMPLE_NOROTATE_B5G6R5_4x4"
                     : "BGR2YUYVFast_NORESAMPLE_B5G6R5";
    }
    return blocked ? "RGB2YUYVFast_NORESAMPLE_NOROTATE_R5G6B5_4x4"
                   : "RGB2YUYVFast_NORESAMPLE_R5G6B5";
  }
  if (IsBgr565(e.src)) {
    return nullptr;
  }
  if (e.dst.code == CODE_NV12) {
    return !copied   ? nullptr
           : blocked ? "RGB2NV12Fast_NORESAMPLE_NOROTATE_R5G6B5_4x4"
                     : "RGB2NV12Fast_NORESAMPLE_R5G6B5";
  }
  if (!IsPlanar(e.dst.code)) {
    return nullptr;
  }
  if (!IsUnitScale(e)) {
    return e.bilinear ? "RGB2YUVFast_R5G6B5" : nullptr;
  }
  if (R0(e) && e.dst.code == CODE_I420 && e.blockMode != 1) {
    return blocked ? "RGB2YUVFast_NORESAMPLE_NOROTATE_R5G6B5_4x4"
                   : "RGB2YUVFast_NORESAMPLE_NOROTATE_R5G6B5_2x2";
  }
  return "RGB2YUVFast_NORESAMPLE_R5G6B5";
}

const char* Rgb24ToRgb16(const Engine& e) {
  const bool blocked = e.blockMode == 3;
  if (RedIsLowest(e.src)) {
    if (Nearest(e) && blocked) {
      return IsBgr565(e.dst) ? "RGB888Fast_R5G6B5_Resample_4x4" : "BGR888Fast_R5G6B5_Resample_4x4";
    }
    return Bilinear(e) && e.blockMode == 2 && IsBgr565(e.dst)
               ? "RGB888Fast_R5G6B5_Resample_BILINEAR_2x2"
               : nullptr;
  }
  if (IsBgr565(e.dst)) {
    return nullptr;
  }
  if (IsUnitScale(e)) {
    return !R0(e)     ? nullptr
           : e.dither ? "RGB888Fast_NORESAMPLE_R5G6B5_Dither"
                      : "RGB888Fast_NORESAMPLE_R5G6B5";
  }
  if (e.bilinear) {
    return e.blockMode == 2 ? "RGB888Fast_R5G6B5_Resample_BILINEAR_2x2"
                            : "RGB888Fast_R5G6B5_Resample_BILINEAR_1x1";
  }
  return R0(e)     ? "RGB888Fast_R5G6B5"
         : blocked ? "RGB888Fast_R5G6B5_Resample_4x4"
                   : "RGB888Fast_R5G6B5_Resample";
}

const char* Rgb24ToRgb24(const Engine& e) {
  const bool blocked = e.blockMode == 3;
  if (RedIsLowest(e.src) != RedIsLowest(e.dst)) {
    return RedIsLowest(e.src) && BlueIsLowest(e.dst) && Nearest(e) && blocked
               ? "BGR2RGBFast_RGB888_N_RESIZE_4x4"
               : nullptr;
  }
  const bool isBgr = RedIsLowest(e.src);
  if (IsUnitScale(e)) {
    return isBgr ? nullptr : "RGB2RGBFast_NORESAMPLE";
  }
  if (e.bilinear) {
    return e.blockMode == 2 ? "RGB2RGBFast_RGB888_N_RESIZE_2x2" : isBgr ? nullptr : "RGB2RGBFast";
  }
  if (!blocked) {
    return "RGB2RGBFast_RGB888_N_RESIZE";
  }
  if (isBgr || e.mirrorX) {
    return "RGB2RGBFast_RGB888_N_RESIZE_4x4";
  }
  if (e.swapXY) {
    return e.mirrorY ? "RGB2RGBFast_RGB888_N_RESIZE_4x4_R270"
                     : "RGB2RGBFast_RGB888_N_RESIZE_4x4_SwapXY";
  }
  return e.mirrorY ? "RGB2RGBFast_RGB888_N_RESIZE_4x4_VERTICAL"
                   : "RGB2RGBFast_RGB888_N_RESIZE_4x4_R0";
}

const char* PlanarToRgb24(const Engine& e) {
  if (RedIsLowest(e.dst)) {
    return IsUnitScale(e) ? "YUV2RGBFast_NORESAMPLE_B8G8R8"
           : e.bilinear   ? "YUV2RGBFast_B8G8R8"
                          : "YUV2RGBFast_B8G8R8_Nearest";
  }
  return IsUnitScale(e) ? "YUV2RGBFast_NORESAMPLE"
         : e.bilinear   ? "YUV2RGBFast"
                        : "YUV2RGBFast_R8G8B8_Nearest";
}

const char* Rgb24ToPlanar(const Engine& e) {
  if (RedIsLowest(e.src)) {
    return nullptr;
  }
  if (!IsUnitScale(e)) {
    return e.bilinear ? "RGB2YUVFast" : nullptr;
  }
  return R0(e) && e.blockMode == 3 && e.dst.code == CODE_I420
             ? "RGB2YUVFast_NORESAMPLE_NOROTATE_R8G8B8_4x4"
             : "RGB2YUVFast_NORESAMPLE";
}

const char* Rgb24ToRgb32(const Engine& e) {
  constexpr const char* kBilinear2x2 = "RGB2RGBFast_RGB24_TO_RGB32__BILINEARN_RESIZE_2x2";
  if (IsUnitScale(e)) {
    if (R0(e)) {
      return "RGB2RGBFast_RGB24_To_RGB32_NO_NO_AlphaSpecial";
    }
    return !R90(e)            ? nullptr
           : e.blockMode == 2 ? kBilinear2x2
                              : "RGB2RGBFast_RGB24_TO_RGB32__NoResample";
  }
  if (e.bilinear) {
    return e.blockMode == 2 && R90(e) ? kBilinear2x2
                                      : "RGB2RGBFast_RGB24_TO_RGB32__BILINEARN_RESIZE_1x1";
  }
  return RedIsLowest(e.dst) && RedIsLowest(e.src) && e.blockMode == 3
             ? "RGB2RGBFast_BGR24_TO_BGR32_N_RESIZE_4x4"
             : nullptr;
}

const char* Rgb32ToRgb24(const Engine& e) {
  if (e.bilinear) {
    return !BlueIsLowest(e.dst) || !BlueIsLowest(e.src) ? nullptr
           : e.blockMode != 1                           ? "RGB2RGBFast_RGB32_TO_RGB24_N_RESIZE_2x2"
                                                        : "RGB2RGBFast_RGB32_TO_RGB24_N_RESIZE_1x1";
  }
  return RedIsLowest(e.dst) && RedIsLowest(e.src) && e.blockMode == 3
             ? "RGB2RGBFast_BGR32_TO_BGR24_N_RESIZE_4x4"
             : nullptr;
}

const char* Rgb32ToRgb32(const Engine& e) {
  if (e.bilinear) {
    return !BlueIsLowest(e.dst) || !BlueIsLowest(e.src) ? nullptr
           : e.blockMode != 1 ? "RGB2RGBFast_RGB32_TO_RGB32__BILINEARN_RESIZE_4x4"
                              : "RGB2RGBFast_RGB32_TO_RGB32__BILINEARN_RESIZE_1x1";
  }
  const uint32_t* const from = e.src.maskPosition;
  if (!HasPositions(e.dst, from[kRed], from[kGreen], from[kBlue])) {
    return nullptr;
  }
  if (!RedIsLowest(e.dst)) {
    return "RGB2RGBFast_RGB32_N_RESIZE";
  }
  return e.blockMode != 3 ? "RGB2RGBFast_BGR32_N_RESIZE_1x1"
         : R0(e)          ? "RGB2RGBFast_BGR32_N_RESIZE_4x4_R0"
                          : "RGB2RGBFast_BGR32_N_RESIZE_4x4";
}

const char* PairsToRgb32(const Engine& e) {
  if (!R0(e)) {
    return nullptr;
  }
  if (!IsUnitScale(e)) {
    return e.stepX != e.stepY && BlueIsLowest(e.dst) && e.bilinear ? "NV21toRGB32_Fast_BilNear"
                                                                   : nullptr;
  }
  const bool blocked = e.blockMode != 1;
  if (BlueIsLowest(e.dst)) {
    return blocked ? "NV12_TO_RGB32Fast_NORESAMPLE_4x4" : "NV12_TO_RGB32Fast_NORESAMPLE";
  }
  if (RedIsLowest(e.dst)) {
    return blocked ? "NV21_TO_RGB32Fast_NORESAMPLE_4x4" : "NV21_TO_RGB32Fast_NORESAMPLE";
  }
  return nullptr;
}

const char* SubsampledToBgr32(const Engine& e) {
  const bool isI420 = e.src.code == CODE_I420;
  const bool blocked = e.blockMode == 3 && R0(e);
  if (IsUnitScale(e)) {
    return blocked && isI420 ? "I420toBGR32_Fast_NORESAMPLE" : "I420toBGR32_Any_Fast_1x1";
  }
  return e.bilinear          ? "I420toBGR32_Fast_BilNear"
         : blocked && isI420 ? "I420toBGR32_Fast_4x4"
                             : "I420toBGR32_Any_Fast_1x1";
}

bool IsMultipleOf8(const Rect& rect) {
  return rect.left % 8 == 0 && rect.top % 8 == 0 && rect.right % 8 == 0 && rect.bottom % 8 == 0;
}

Decision Ends(const char* kernel) {
  return {kernel, true};
}

Decision GoesOn(const char* kernel) {
  return {kernel, false};
}

// 4:2:0 and 4:2:2 to all 32-bit layouts but the one with red in the lowest byte.
Decision SubsampledToRgb32(const Engine& e, const Rect& loopRect) {
  const bool isI420 = e.src.code == CODE_I420;
  const bool blocked = e.blockMode == 3;
  const bool turned = e.mirrorX && e.swapXY;
  if (IsUnitScale(e)) {
    if (turned && blocked && isI420) {
      return GoesOn("I420toRGB32_Fast_NORESAMPLE_90");
    }
    if (R0(e) && blocked && isI420) {
      return Ends(IsMultipleOf8(loopRect) ? "I420toRGB32_Fast_NORESAMPLE"
                                          : "I420toRGB32_Any_Fast_1x1");
    }
    return GoesOn(R0(e) && isI420 ? "I420toRGB32_Fast_NORESAMPLE_1x1" : "I420toRGB32_Any_Fast_1x1");
  }
  if (turned) {
    return GoesOn(e.bilinear || !isI420 ? "I420toRGB32_Fast_BilNear"
                  : blocked             ? "I420toRGB32_Fast_90"
                                        : "I420toRGB32_Fast_90_1x1");
  }
  if (!R0(e)) {
    return GoesOn(e.bilinear ? "I420toRGB32_Fast_BilNear" : "I420toRGB32_Any_Fast_1x1");
  }
  if (!isI420) {
    return Ends("I420toRGB32_Fast_BilNear");
  }
  if (e.bilinear) {
    return Ends(e.passMode == 3 ? "I420toRGB32_R0_Fast_BilNear_4x4" : "I420toRGB32_Fast_BilNear");
  }
  return Ends(blocked ? "I420toRGB32_Fast" : "I420toRGB32_Fast_1x1");
}

const char* Nv21ToBgr32(const Engine& e) {
  if (!RedIsLowest(e.dst)) {
    return nullptr;
  }
  if (R90(e)) {
    return e.bilinear ? "NV21toBGR32_Fast_BilNear_R90" : "NV21toBGR32_Fast_NoResize_R90_2x2";
  }
  return e.bilinear && R0(e) ? "NV21toBGR32_Fast_BilNear" : nullptr;
}

const char* Yv12ToRgb32(const Engine& e) {
  if (RedIsLowest(e.dst) || !IsUnitScale(e)) {
    return nullptr;
  }
  return !R0(e)            ? "I420toRGB32_Any_Fast_1x1"
         : e.passMode == 3 ? "YV12toRGB32_Fast_NORESAMPLE_4x4"
                           : "YV12toRGB32_Fast_NORESAMPLE_1x1";
}

const char* Rgb32ToYuyv(const Engine& e) {
  if (!IsUnitScale(e) || e.blockMode != 3 || HasPositions(e.src, 24, 16, 8) ||
      HasPositions(e.src, 8, 16, 24)) {
    return nullptr;
  }
  if (RedIsLowest(e.src)) {
    return e.swapXY || e.mirrorY ? nullptr
           : e.mirrorX           ? "BGR32toYUYV_Fast_NORESAMPLE_HFlip"
                                 : "BGR32toYUYV_Fast_NORESAMPLE";
  }
  if (e.mirrorX && e.swapXY) {
    return "RGB32toYUYV_Fast_NORESAMPLE_90";
  }
  return R180(e)   ? "RGB32toYUYV_Fast_NORESAMPLE_180"
         : R270(e) ? "RGB32toYUYV_Fast_NORESAMPLE_270"
         : R0(e)   ? "RGB32toYUYV_Fast_NORESAMPLE"
                   : nullptr;
}

const char* YuyvToRgb32(const Engine& e) {
  if (!IsUnitScale(e) || HasPositions(e.dst, 24, 16, 8) || HasPositions(e.dst, 8, 16, 24)) {
    return nullptr;
  }
  if (RedIsLowest(e.dst)) {
    return "YUYVtoBGR32_Fast_NORESAMPLE";
  }
  return R0(e) && e.blockMode == 3 ? "YUYVtoRGB32_Fast_NORESAMPLE" : nullptr;
}

// A pair of formats of the vector kernels, and what runs at 1:1 and when blended; null: nothing.
struct VectorLine {
  uint32_t src;  // codes; CODE_RGB together with a depth
  uint32_t srcBits;
  uint32_t dst;
  uint32_t dstBits;
  const char* unit;
  const char* bilinear;
};

constexpr VectorLine kVectorLines[] = {
    {CODE_RGB, 32, CODE_NV21, 0, "NEC_BGR32toNVXX_NoResize", "NEC_BGR32toNV21_Fast_BilNear"},
    {CODE_RGB, 32, CODE_NV12, 0, "NEC_BGR32toNVXX_NoResize", nullptr},
    {CODE_RGB, 24, CODE_NV21, 0, "NEC_BGR24toNVXX_NoResize", nullptr},
    {CODE_RGB, 24, CODE_NV12, 0, "NEC_BGR24toNVXX_NoResize", nullptr},
    {CODE_RGB, 32, CODE_I420, 0, "NEC_BGR32toI420_NoResize", "NEC_BGR32toI420_BilNear"},
    {CODE_RGB, 32, CODE_I422, 0, "NEC_BGR32toI422H_NoResize", nullptr},
    {CODE_RGB, 32, CODE_I440, 0, "NEC_BGR32toI422V_NoResize", nullptr},
    {CODE_RGB, 32, CODE_I444, 0, "NEC_BGR32toI444_NoResize", nullptr},
    {CODE_RGB, 32, CODE_YUV444, 0, "NEC_BGR32toYUV_NoResize", nullptr},
    {CODE_NV21, 0, CODE_I420, 0, nullptr, "NEC_NV21toI420_Fast_BilNear"},
    {CODE_I420, 0, CODE_NV21, 0, nullptr, "NEC_I4XXtoNV21_Fast_BilNear"},
    {CODE_I422, 0, CODE_NV21, 0, nullptr, "NEC_I4XXtoNV21_Fast_BilNear"},
    {CODE_NV21, 0, CODE_RGB, 32, "NEC_NV21YCbCr601toBGR32_NoResize",
     "NEC_NV21toBGR32_Fast_BilNear"},
    {CODE_NV12, 0, CODE_RGB, 32, "NEC_NV21YCbCr601toBGR32_NoResize",
     "NEC_NV21toBGR32_Fast_BilNear"},
    {CODE_NV21, 0, CODE_RGB, 24, "NEC_NV21toRGB24_NoResize", "NEC_NV21toBGR24_Fast_BilNear"},
    {CODE_NV12, 0, CODE_RGB, 24, "NEC_NV12toRGB24_NoResize", nullptr},
    {CODE_I420, 0, CODE_RGB, 32, "NEC_I420toBGR32_NoResize", "NEC_I420toBGR32_BilNear"},
    {CODE_I422, 0, CODE_RGB, 32, "NEC_I422HtoBGR32_NoResize", "NEC_I422HtoBGR32_BilNear"},
    {CODE_I440, 0, CODE_RGB, 32, "NEC_I422VtoBGR32_NoResize", "NEC_I422VtoBGR32_BilNear"},
    {CODE_I444, 0, CODE_RGB, 32, "NEC_I444toBGR32_NoResize", "NEC_I444toBGR32_BilNear"},
    {CODE_YUV444, 0, CODE_RGB, 32, "NEC_YUVtoBGR32_NoResize", nullptr},
    {CODE_YUYV, 0, CODE_RGB, 32, "NEC_YUYVtoBGR32_NoResize", nullptr},
    // Asked last, each on its own; no other line has their formats.
    {CODE_I420, 0, CODE_RGB, 24, "NEC_I420toBGR24_NoResize", nullptr},
    {CODE_I422, 0, CODE_RGB, 24, "NEC_I422HtoBGR24_NoResize", nullptr},
    {CODE_I440, 0, CODE_RGB, 24, "NEC_I422VtoBGR24_NoResize", nullptr},
    {CODE_I444, 0, CODE_RGB, 24, "NEC_I444toBGR24_NoResize", nullptr},
    {CODE_RGB, 24, CODE_I420, 0, "NEC_BGR24toI420_NoResize", nullptr},
};
constexpr int kAskedLast = 5;

// The standard that vector kernels know, on the YUV side: the source when there are two.
bool IsFull601(const Engine& e) {
  return (e.src.IsRgb() ? e.dst : e.src).standard == CS_BT601_FULL;
}

bool Fits(const VectorLine& line, const Engine& e) {
  const auto fits = [](const Format& format, uint32_t code, uint32_t bits) {
    return format.code == code &&
           (code != CODE_RGB || (format.bitsPerPixel == bits && HasByteChannels(format)));
  };
  return fits(e.src, line.src, line.srcBits) && fits(e.dst, line.dst, line.dstBits) &&
         e.blockMode == 3 && Code0(e) && IsFull601(e);
}

}  // namespace

const char* ChooseNeon(const Engine& e) {
  for (const VectorLine& line : kVectorLines) {
    if (Fits(line, e)) {
      return IsUnitScale(e) ? line.unit : e.bilinear ? line.bilinear : nullptr;
    }
  }
  if (e.blockMode != 3 || !IsFull601(e)) {
    return nullptr;
  }
  const bool fromPairs = IsPairs(e.src.code);
  if (fromPairs && Code0(e) && Unit(e) && IsRgbOf(e.dst, 16)) {
    return HasPositions(e.dst, 11, 5, 0) ? "NEC_NVtoRGB16_NoResize"
           : IsBgr565(e.dst)             ? "NEC_NVtoBGR16_NoResize"
                                         : nullptr;
  }
  return e.src.code == CODE_NV21 && Code3(e) && Bilinear(e) && IsRgbOf(e.dst, 32) &&
                 HasByteChannels(e.dst)
             ? "NEC_NV21toBGR32_Fast_BilNear_R90"
             : nullptr;
}

const char* ChooseRgb24(const Engine& e) {
  if (IsRgbOf(e.dst, 24)) {
    if (IsPlanar(e.src.code)) {
      return PlanarToRgb24(e);
    }
    if (IsRgbOf(e.src, 24)) {
      return Rgb24ToRgb24(e);
    }
    if (IsRgbOf(e.src, 32)) {
      return BlueIsLowest(e.src) && BlueIsLowest(e.dst) && Unit(e)
                 ? "RGB2RGBFast_RGB32_TO_RGB24_NORESAMPLE"
                 : nullptr;
    }
    return e.src.code == CODE_NV21 && !RedIsLowest(e.dst) && Unit(e) && !e.mirrorX && !e.swapXY &&
                   !e.dither
               ? "NV21_To_RGB888_NoResample_1x1"
               : nullptr;
  }
  return IsRgbOf(e.src, 24) && IsPlanar(e.dst.code) ? Rgb24ToPlanar(e) : nullptr;
}

const char* ChooseYuvToYuv(const Engine& engine) {
  if (engine.changesLevels || engine.path != ColourPath::kYuvToYuv) {
    return nullptr;
  }
  for (const Line& line : kYuvToYuv) {
    if (Fits(line, engine)) {
      return line.kernel;
    }
  }
  return nullptr;
}

const char* ChooseRgb16(const Engine& e) {
  if (IsRgbOf(e.dst, 16)) {
    return IsPlanar(e.src.code)      ? PlanarToRgb16(e)
           : e.src.code == CODE_NV21 ? Nv21ToRgb16(e)
           : e.src.code == CODE_NV12 ? Nv12ToRgb16(e)
           : IsRgbOf(e.src, 16)      ? Rgb16ToRgb16(e)
           : IsRgbOf(e.src, 24)      ? Rgb24ToRgb16(e)
                                     : nullptr;
  }
  return IsRgbOf(e.src, 16) ? Rgb16ToYuv(e) : nullptr;
}

const char* ChooseI420ToI422(const Engine& e) {
  if (e.path != ColourPath::kYuvToYuv) {
    return nullptr;
  }
  const uint32_t src = e.src.code;
  const uint32_t dst = e.dst.code;
  const bool unit = IsUnitScale(e);
  if (src == CODE_I420 && IsHalved(dst)) {
    if (unit) {
      return e.mirrorX && e.swapXY ? "I420_To_I422_Fast_NORESAMPLE_90" : nullptr;
    }
    return !e.bilinear && ((e.mirrorX && e.swapXY) || R0(e)) ? "I420_To_I422_Fast_90" : nullptr;
  }
  if (src != dst || !IsPlanar(src)) {
    return nullptr;
  }
  if (unit) {
    return "YUV_To_YUV_NOREAMPLE_ROTATE_Fast";
  }
  switch (src) {
    case CODE_I420:
      return Resampler(e, "I420_To_I420_REAMPLE_NOROTATE_Fast",
                       "I420_To_I420_REAMPLE_NOROTATE_BILINEAR_Fast");
    case CODE_I422:
      return Resampler(e, "I422H_To_I422H_REAMPLE_NOROTATE_Fast",
                       "I422H_To_I422H_REAMPLE_NOROTATE_BILINEAR_Fast");
    case CODE_I440:
      return Resampler(e, "I422V_To_I422V_REAMPLE_NOROTATE_Fast",
                       "I422V_To_I422V_REAMPLE_BILINEAR_NOROTATE_Fast");
    default:
      return Resampler(e, "I444_To_I444_REAMPLE_NOROTATE_Fast", nullptr);
  }
}

const char* ChoosePackedYuyv(const Engine& e) {
  if (e.path == ColourPath::kRgbToYuv) {
    const bool redIsLowest = e.src.maskPosition[kRed] == 0 && e.src.maskPosition[kGreen] == 8 &&
                             e.src.maskPosition[kBlue] == 16;
    const bool fits = e.src.bitsPerPixel == 24 && e.dst.code == CODE_YUYV && !redIsLowest;
    return fits ? ToYuyv(e, {"RGB24_To_YUYV", "RGB24toYUYVFast"}) : nullptr;
  }
  if (e.path != ColourPath::kYuvToYuv) {
    return nullptr;
  }
  if (e.dst.code == CODE_YUYV) {
    if (e.src.IsGrey()) {
      return ToYuyv(e, {"Gray_To_YUYV", "GraytoYUYVFast"});
    }
    if (IsPlanar(e.src.code)) {
      return ToYuyv(e, {"I420_To_YUYV", "I420toYUYVFast"});
    }
    if (e.src.code == CODE_YUYV) {
      return YuyvToYuyv(e);
    }
  }
  return I420ToNv21(e);
}

Decision ChooseYuvToRgb32(const Engine& e, const Rect& loopRect) {
  if (!IsRgbOf(e.dst, 32)) {
    return {};
  }
  switch (e.src.code) {
    case CODE_I420:
    case CODE_I440:
    case CODE_I422:
      return RedIsLowest(e.dst) ? Ends(SubsampledToBgr32(e)) : SubsampledToRgb32(e, loopRect);
    case CODE_GRAY8:
      return Ends(RedIsLowest(e.dst) ? "GreytoBGR32_Fast_BilNear" : nullptr);
    case CODE_NV21:
      return Ends(Nv21ToBgr32(e));
    case CODE_YV12:
      return Ends(Yv12ToRgb32(e));
    case CODE_I444:
      return Ends(!e.bilinear && R0(e) && RedIsLowest(e.dst) ? "I444toRGB32_Any_Fast_1x1"
                                                             : nullptr);
    default:
      break;
  }
  const bool isResized = IsRgbOf(e.src, 32) && e.passMode == 3 && Nearest(e);
  return Ends(isResized && !(RedIsLowest(e.src) && RedIsLowest(e.dst))
                  ? "RGB2RGBFast_RGBA_N_RESIZE_4x4"
                  : nullptr);
}

const char* ChooseYuyvAndRgb32(const Engine& e) {
  if (e.src.code == CODE_YUYV && IsRgbOf(e.dst, 32)) {
    return YuyvToRgb32(e);
  }
  if (!IsRgbOf(e.src, 32)) {
    return nullptr;
  }
  if (e.dst.code == CODE_YUYV) {
    return Rgb32ToYuyv(e);
  }
  if (!IsPairs(e.dst.code) || BlueIsLowest(e.src) || !Unit(e) || !R0(e)) {
    return nullptr;
  }
  if (e.dst.code == CODE_NV12) {
    return e.blockMode == 3 ? "RGB32toNV12_Fast_NORESAMPLE_4x4" : "RGB32toNV12_Fast_NORESAMPLE";
  }
  return e.blockMode == 3 ? "RGB32toNV21_Fast_NORESAMPLE_4x4" : "RGB32toNV21_Fast_NORESAMPLE";
}

const char* ChooseRgb32(const Engine& e) {
  if (IsRgbOf(e.src, 32)) {
    return IsRgbOf(e.dst, 24) ? Rgb32ToRgb24(e) : IsRgbOf(e.dst, 32) ? Rgb32ToRgb32(e) : nullptr;
  }
  if (!IsRgbOf(e.dst, 32)) {
    return nullptr;
  }
  if (IsRgbOf(e.src, 24)) {
    return Rgb24ToRgb32(e);
  }
  if (IsPairs(e.src.code)) {
    return PairsToRgb32(e);
  }
  if (e.src.code != CODE_I444 || !R0(e)) {
    return nullptr;
  }
  return IsUnitScale(e)                     ? "I444_TO_RGB32Fast_NORESAMPLE"
         : e.bilinear && RedIsLowest(e.dst) ? "I444toBGR32_Fast_BilNear"
                                            : nullptr;
}

const char* ChooseGrey(const Engine& e) {
  if (e.path != ColourPath::kYuvToYuv || e.dst.code != CODE_GRAY8) {
    return nullptr;
  }
  const bool upright = !e.mirrorX && !e.swapXY;
  constexpr const char* kTwoRows = "Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST";
  if (e.src.code != CODE_GRAY8) {
    return IsPlanar(e.src.code) && e.bilinear && upright && e.blockMode == 2 ? kTwoRows : nullptr;
  }
  if (IsUnitScale(e)) {
    return "Gray2Gray_C_NORESAMPLE_FAST";
  }
  if (e.bilinear) {
    return upright && e.blockMode == 3   ? "Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_4X4_FAST"
           : upright && e.blockMode == 2 ? kTwoRows
                                         : "Gray_To_Gray_BILINEAR_Fast";
  }
  return upright && e.blockMode == 3 ? "Gray2Gray_C_RESAMPLE_NOROTATE_FAST"
                                     : "Gray_To_Gray_Nearest_Fast";
}

Choice Choose(const Engine& engine, const Rect& loopRect) {
  struct Member {
    const char* dispatcher;
    const char* (*choose)(const Engine&);  // null: the one that looks at the rectangle
  };
  constexpr Member kChain[] = {
      {"NEC_ALL", ChooseNeon},
      {"ANY_ANY_C_FAST_R8G8B8", ChooseRgb24},
      {"YUV2YUV_Fast", ChooseYuvToYuv},
      {"ANY_ANY_C_FAST_R5G6B5", ChooseRgb16},
      {"I420_To_I422_Fast", ChooseI420ToI422},
      {"YUV_YUV_C_FAST", ChoosePackedYuyv},
      {"YUV_RGB32_C_FAST", nullptr},
      {"YUYV_RGB32_FAST", ChooseYuyvAndRgb32},
      {"ANY_ANY_C_FAST_RGB32", ChooseRgb32},
      {"Gray2Gray_C_FAST", ChooseGrey},
  };
  const char* overwritten = nullptr;
  for (const Member& member : kChain) {
    const Decision decision =
        member.choose ? Ends(member.choose(engine)) : ChooseYuvToRgb32(engine, loopRect);
    if (decision.kernel && decision.ends) {
      return {member.dispatcher, decision.kernel, overwritten};
    }
    if (decision.kernel) {
      overwritten = decision.kernel;
    }
  }
  return {"ANY_ANY_C_SLOW", nullptr, overwritten};
}

bool Takes(const char* kernel, const Engine& engine, bool* known) {
  *known = true;
  const auto isNamed = [kernel](const Line& line) { return std::strcmp(line.kernel, kernel) == 0; };
  for (auto line = std::end(kVectorLines) - kAskedLast; line != std::end(kVectorLines); ++line) {
    if (std::strcmp(line->unit, kernel) == 0) {
      return Fits(*line, engine) && Unit(engine);
    }
  }
  for (const auto& [begin, end] : {std::pair(std::begin(kYuvToYuv), std::end(kYuvToYuv)),
                                   std::pair(std::begin(kMcc), std::end(kMcc))}) {
    const Line* const line = std::find_if(begin, end, isNamed);
    if (line != end) {
      return Fits(*line, engine);
    }
  }
  *known = false;
  return false;
}

}  // namespace reference
