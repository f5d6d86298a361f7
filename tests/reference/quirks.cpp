// What a kernel gives instead of the generic converter's bytes, told by its name.
#include <string_view>

#include "tests/reference/chooser.h"

namespace reference {
namespace {

bool StartsWith(std::string_view name, std::string_view start) {
  return name.substr(0, start.size()) == start;
}

bool Contains(std::string_view name, std::string_view part) {
  return name.find(part) != std::string_view::npos;
}

}  // namespace

Quirks QuirksOf(const char* kernel) {
  Quirks quirks;
  if (!kernel) {
    return quirks;
  }
  const std::string_view name = kernel;
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
  if (StartsWith(name, "NEC_")) {
    for (const char* rgb : {"toBGR32", "toBGR24", "toRGB24", "toRGB16", "toBGR16"}) {
      quirks.sixBitMatrix |= Contains(name, rgb);
    }
    quirks.storedLevels =
        name == "NEC_NV21toI420_Fast_BilNear" || name == "NEC_I4XXtoNV21_Fast_BilNear";
    return quirks;
  }
  if (name == "NV21_TO_RGBFast_R5G6B5_Nearest") {
    quirks.nearestOnly = true;
    quirks.noDither = true;
  }
  for (const char* ditherer :
       {"RGB888Fast_NORESAMPLE_R5G6B5_Dither", "YUV2RGBFast_NORESAMPLE_R5G6B5_4x4_Dither",
        "NV21_To_RGB565_NoResample_2x2_R270_Dither"}) {
    quirks.clampedCarry |= name == ditherer;
    quirks.carriesAlways |= name == ditherer;
  }
  quirks.clampedCarry |= name == "NV21_To_RGB565_NoResample_2x2_Dither";
  for (const char* start : {"RGB24_To_YUYV", "RGB24toYUYV", "Gray_To_YUYV", "GraytoYUYV",
                            "I420_To_YUYV", "I420toYUYV"}) {
    if (StartsWith(name, start)) {
      quirks.chromaOfPairs = true;
      quirks.storedLevels = true;
      quirks.edgesOfPairs = !Contains(name, "NORESAMPLE") && !Contains(name, "NOREAMPLE");
    }
  }
  return quirks;
}

}  // namespace reference
