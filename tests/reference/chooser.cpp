// The decisions as ordered lists: the first line that fits a job is the kernel that runs it.
#include "tests/reference/chooser.h"

#include <algorithm>
#include <cstring>
#include <initializer_list>
#include <iterator>
#include <set>
#include <string>

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
const char* Kept(const std::string& name) {
  static std::set<std::string> names;
  return names.insert(name).first->c_str();
}

const char* ToYuyv(const Engine& e, const Kind& kind) {
  const bool isBlocked = e.blockMode == 2 || e.blockMode == 3;
  const std::string longName = kind.longPrefix;
  const std::string shortName = kind.shortPrefix;
  const char* const suffix = YuyvSuffix(e);
  if (IsUnitScale(e)) {
    if (!isBlocked) {
      return Kept(longName + "_NOREAMPLE_ROTATE_Fast");
    }
    if (suffix) {
      if (e.src.code == CODE_I420 && e.blockMode == 3 && e.swapXY && e.mirrorX) {
        return "I420toYUYVFast_NORESAMPLE_90";
      }
      return Kept(longName + "_Fast_NORESAMPLE_2x2_" + suffix);
    }
    return Kept(e.blockMode == 3 ? shortName + "_NORESAMPLE" : longName + "_Fast_NORESAMPLE_2x2");
  }
  if (e.bilinear) {
    return nullptr;
  }
  if (!isBlocked) {
    return Kept(longName + "_Fast");
  }
  if (suffix) {
    return Kept(longName + "_Fast_2x2_" + suffix);
  }
  return Kept(e.blockMode == 3 && !e.mirrorY ? shortName + "_RESAMPLE" : longName + "_Fast_2x2");
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

bool StartsWith(const std::string& name, const char* start) {
  return name.compare(0, std::strlen(start), start) == 0;
}

bool Contains(const std::string& name, const char* part) {
  return name.find(part) != std::string::npos;
}

}  // namespace

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

Choice Choose(const Engine& engine) {
  struct Member {
    const char* dispatcher;
    const char* (*choose)(const Engine&);
  };
  constexpr Member kChain[] = {
      {"YUV2YUV_Fast", ChooseYuvToYuv},
      {"I420_To_I422_Fast", ChooseI420ToI422},
      {"YUV_YUV_C_FAST", ChoosePackedYuyv},
      {"Gray2Gray_C_FAST", ChooseGrey},
  };
  for (const Member& member : kChain) {
    if (const char* const kernel = member.choose(engine)) {
      return {member.dispatcher, kernel};
    }
  }
  return {"ANY_ANY_C_SLOW", nullptr};
}

bool Takes(const char* kernel, const Engine& engine, bool* known) {
  const auto isNamed = [kernel](const Line& line) { return std::strcmp(line.kernel, kernel) == 0; };
  const Line* line = std::find_if(std::begin(kYuvToYuv), std::end(kYuvToYuv), isNamed);
  if (line == std::end(kYuvToYuv)) {
    line = std::find_if(std::begin(kMcc), std::end(kMcc), isNamed);
    if (line == std::end(kMcc)) {
      *known = false;
      return false;
    }
  }
  *known = true;
  return Fits(*line, engine);
}

Quirks QuirksOf(const char* kernel) {
  Quirks quirks;
  if (!kernel) {
    return quirks;
  }
  const std::string name = kernel;
  // I420_To_I422_Fast never looks at levels.
  for (const char* copier :
       {"I420_To_I422_Fast_NORESAMPLE_90", "I420_To_I422_Fast_90",
        "I420_To_I420_REAMPLE_NOROTATE_Fast", "I420_To_I420_REAMPLE_NOROTATE_BILINEAR_Fast",
        "I422H_To_I422H_REAMPLE_NOROTATE_Fast", "I422H_To_I422H_REAMPLE_NOROTATE_BILINEAR_Fast",
        "I422V_To_I422V_REAMPLE_NOROTATE_Fast", "I422V_To_I422V_REAMPLE_BILINEAR_NOROTATE_Fast",
        "I444_To_I444_REAMPLE_NOROTATE_Fast", "YUV_To_YUV_NOREAMPLE_ROTATE_Fast"}) {
    quirks.storedLevels |= name == copier;
  }
  if (StartsWith(name, "Gray2Gray") || StartsWith(name, "Gray_To_Gray")) {
    quirks.storedLevels = true;
    quirks.sharedLowerLine = Contains(name, "RESAMPLE_BILINEAR_NOROTATE");
    quirks.noEdgeColumns = name == "Gray2Gray_C_RESAMPLE_NOROTATE_FAST";
    return quirks;
  }
  if (name == "I420_To_YUYV_Fast_NORESAMPLE_90" || name == "I420_To_YUYV_Fast_90") {
    quirks.chromaOfPairs = true;  // of the planar family, which leaves levels to the engine
    return quirks;
  }
  for (const char* kind : {"RGB24", "Gray", "I420"}) {
    if (StartsWith(name, (std::string(kind) + "_To_YUYV").c_str()) ||
        StartsWith(name, (std::string(kind) + "toYUYV").c_str())) {
      quirks.chromaOfPairs = true;
      quirks.storedLevels = true;
      quirks.edgesOfPairs = !Contains(name, "NORESAMPLE") && !Contains(name, "NOREAMPLE");
    }
  }
  return quirks;
}

}  // namespace reference
