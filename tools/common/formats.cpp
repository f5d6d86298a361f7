#include "tools/common/formats.h"

#include <charconv>
#include <cstdio>

namespace kestrel::tools {

const std::vector<FormatName>& AllFormats() {
  static const std::vector<FormatName> formats = {
      {"rgb565", FORMAT_RGB565, "bits GGGBBBBB RRRRRGGG"},
      {"bgr565", FORMAT_BGR565, "bits GGGRRRRR BBBBBGGG"},
      {"rgb666", FORMAT_RGB666, "bits GGBBBBBB RRRRGGGG 000000RR"},
      {"bgr666", FORMAT_BGR666, "bits GGRRRRRR BBBBGGGG 000000BB"},
      {"rgb888", FORMAT_RGB888, "B G R"},
      {"bgr888", FORMAT_BGR888, "R G B"},
      {"xrgb8888", FORMAT_XRGB8888, "B G R x"},
      {"xbgr8888", FORMAT_XBGR8888, "R G B x"},
      {"rgbx8888", FORMAT_RGBX8888, "B G R x (treated as xrgb8888)"},
      {"bgrx8888", FORMAT_BGRX8888, "R G B x (treated as xbgr8888)"},
      {"bgra", FORMAT_XRGB8888, "B G R A", true},
      {"rgba", FORMAT_XBGR8888, "R G B A", true},
      {"index1", FORMAT_INDEX1, "8 pixels a byte, leftmost in the top bit; palette; input only"},
      {"index4", FORMAT_INDEX4, "2 pixels a byte, leftmost in the top bits; palette; input only"},
      {"index8", FORMAT_INDEX8, "1 pixel a byte; palette; input only"},
      {"yuyv", FORMAT_YUYV, "Y0 U Y1 V"},
      {"yvyu", FORMAT_YVYU, "Y0 V Y1 U"},
      {"uyvy", FORMAT_UYVY, "U Y0 V Y1"},
      {"vyuy", FORMAT_VYUY, "V Y0 U Y1"},
      {"yuyv-swapped", FORMAT_YUYV_SWAPPED_LUMA, "Y1 U Y0 V"},
      {"yvyu-swapped", FORMAT_YVYU_SWAPPED_LUMA, "Y1 V Y0 U"},
      {"uyvy-swapped", FORMAT_UYVY_SWAPPED_LUMA, "U Y1 V Y0"},
      {"vyuy-swapped", FORMAT_VYUY_SWAPPED_LUMA, "V Y1 U Y0"},
      {"yuv444", FORMAT_YUV444, "Y U V"},
      {"yvu444", FORMAT_YVU444, "Y V U"},
      {"uvy444", FORMAT_UVY444, "U V Y"},
      {"vuy444", FORMAT_VUY444, "V U Y"},
      {"i420", FORMAT_I420, "Y plane, U plane 1/2 x 1/2, V plane 1/2 x 1/2"},
      {"i422", FORMAT_I422, "Y plane, U plane 1/2 wide, V plane 1/2 wide"},
      {"i440", FORMAT_I440, "Y plane, U plane 1/2 high, V plane 1/2 high"},
      {"i444", FORMAT_I444, "Y plane, U plane, V plane"},
      {"i411", kFormatI411, "Y plane, U plane 1/4 wide, V plane 1/4 wide"},
      {"yv12", FORMAT_YV12, "Y plane, V plane 1/2 x 1/2, U plane 1/2 x 1/2"},
      {"yv16", FORMAT_YV16, "Y plane, V plane 1/2 wide, U plane 1/2 wide"},
      {"yv440", FORMAT_YV440, "Y plane, V plane 1/2 high, U plane 1/2 high"},
      {"yv24", FORMAT_YV24, "Y plane, V plane, U plane"},
      {"gray8", FORMAT_GRAY8, "Y plane"},
      {"nv21", FORMAT_NV21, "Y plane, plane of V U pairs 1/2 x 1/2"},
      {"nv12", FORMAT_NV12, "Y plane, plane of U V pairs 1/2 x 1/2"},
      {"nv61", FORMAT_NV61, "Y plane, plane of V U pairs 1/2 wide"},
      {"nv16", FORMAT_NV16, "Y plane, plane of U V pairs 1/2 wide"},
      {"yuv-special8", FORMAT_YUV_SPECIAL8,
       "Y0 - U V for two pixels; U stands for the second luma"},
      {"yuv-special9", FORMAT_YUV_SPECIAL9, "Y U V -"},
  };
  return formats;
}

namespace {

bool IsKnownCode(uint32_t code) {
  const MPPFORMAT record = {code, 1, 1, nullptr};
  FormatDesc desc = {};
  return MPParseFormat(&desc, &record) == KESTREL_OK;
}

}  // namespace

std::optional<Format> FindFormat(std::string_view text) {
  for (const FormatName& format : AllFormats()) {
    if (text == format.name) return Format{format.code, format.hasAlpha};
  }
  if (text.size() < 3 || text.substr(0, 2) != "0x") return std::nullopt;
  uint32_t code = 0;
  const char* end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data() + 2, end, code, 16);
  if (error != std::errc() || stop != end || !IsKnownCode(code)) return std::nullopt;
  return Format{code, false};
}

std::string FormatText(uint32_t code) {
  const uint32_t plain = IsYuv(code) ? code & ~FORMAT_STANDARD_MASK : code;
  for (const FormatName& format : AllFormats()) {
    if (format.code == plain) return format.name;
  }
  char number[16];
  std::snprintf(number, sizeof number, "0x%08x", code);
  return number;
}

bool IsYuv(uint32_t code) {
  return code >> 28 >= 5;
}
bool IsIndexed(uint32_t code) {
  return code >> 28 == 4;
}

bool Is32BitRgb(uint32_t code) {
  return (code >> 28 == 1 || code >> 28 == 3) && (code >> 24 & 15) == 7;
}

bool Is16BitRgb(uint32_t code) {
  return code >> 24 == 0x15;
}

uint32_t WithStandard(uint32_t code, uint32_t standard) {
  return (code & ~FORMAT_STANDARD_MASK) | standard;
}

std::optional<uint32_t> FindStandard(std::string_view text) {
  if (text == "bt601-video") return FORMAT_BT601_VIDEO;
  if (text == "bt601-full") return FORMAT_BT601_FULL;
  if (text == "bt709-video") return FORMAT_BT709_VIDEO;
  if (text == "bt709-full") return FORMAT_BT709_FULL;
  return std::nullopt;
}

}  // namespace kestrel::tools
