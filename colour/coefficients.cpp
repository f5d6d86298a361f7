#include "colour/conversion_tables.h"

namespace kestrel {
namespace {

// The video-range rows are 0.4 % stronger than the textbook expansions; pictures of every release
// were tuned with them.
constexpr YuvToRgbCoeffs kYuvToRgb601Full = {65536, 91881,    46802,   116130,
                                             22554, 11760828, 8877496, 14864613};
constexpr YuvToRgbCoeffs kYuvToRgb709Full = {65536, 103206,   30677,   121609,
                                             12275, 13210380, 5497894, 15565901};
constexpr YuvToRgbCoeffs kYuvToRgb709Video = {76605, 117952,   35062,   138982,
                                              14031, 16323497, 5058226, 19015401};
constexpr YuvToRgbCoeffs kYuvToRgb601Video = {76605, 105048,   53510,   132796,
                                              25788, 14671780, 8924535, 18223517};

constexpr RgbToYuvCoeffs kRgbToYuv601Full = {19595, 38470, 7471,  11058, 21710,
                                             32768, 32768, 27439, 5329,  0};
constexpr RgbToYuvCoeffs kRgbToYuv709Full = {13933, 46871, 4732,  7510, 25258,
                                             32768, 32768, 29766, 3005, 0};
constexpr RgbToYuvCoeffs kRgbToYuv709Video = {11921, 40095, 4050,  6573, 22099,
                                              28672, 28672, 26044, 2629, 0};
constexpr RgbToYuvCoeffs kRgbToYuv601Video = {16763, 32910, 6391,  9676, 18999,
                                              28672, 28672, 24012, 4663, 0};

}  // namespace

const YuvToRgbCoeffs& YuvToRgbRow(uint32_t colourStandard) {
  switch (colourStandard) {
    case CS_BT601_FULL:
      return kYuvToRgb601Full;
    case CS_BT709_FULL:
      return kYuvToRgb709Full;
    case CS_BT709_VIDEO:
      return kYuvToRgb709Video;
    default:
      return kYuvToRgb601Video;
  }
}

const RgbToYuvCoeffs& RgbToYuvRow(uint32_t colourStandard) {
  switch (colourStandard) {
    case CS_BT601_FULL:
      return kRgbToYuv601Full;
    case CS_BT709_FULL:
      return kRgbToYuv709Full;
    case CS_BT709_VIDEO:
      return kRgbToYuv709Video;
    default:
      return kRgbToYuv601Video;
  }
}

}  // namespace kestrel
