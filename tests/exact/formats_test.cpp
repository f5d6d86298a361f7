// Public codes, what they decode to, plane layouts, subsampling, channel masks and rectangles.
#include <array>
#include <cstring>
#include <vector>

#include "exact_support.h"
#include "tests/support/formats.h"

namespace kestrel::test {
namespace {

// Decodes a code on its own. Words that decoding does not write keep the marker.
constexpr uint32_t kUnwritten = 0xA5A5A5A5u;

struct Decoded {
  uint32_t result;
  FormatDesc desc;
};

Decoded Decode(uint32_t code, const uint8_t* palette = nullptr) {
  Decoded decoded{};
  for (uint32_t& word : decoded.desc.layout.subsample) word = kUnwritten;
  const MPPFORMAT record = {code, 123, 45, palette};
  decoded.result = MPParseFormat(&decoded.desc, &record);
  return decoded;
}

struct Standard {
  uint32_t bits;
  uint32_t code;
};
constexpr Standard kStandards[] = {{FORMAT_BT601_VIDEO, CS_BT601_VIDEO},
                                   {FORMAT_BT601_FULL, CS_BT601_FULL},
                                   {FORMAT_BT709_VIDEO, CS_BT709_VIDEO},
                                   {FORMAT_BT709_FULL, CS_BT709_FULL}};

struct RgbCode {
  uint32_t code;
  uint32_t bitsPerPixel;
  uint32_t red;
  uint32_t green;
  uint32_t blue;
};

void PrintTo(const RgbCode& c, std::ostream* out) {
  *out << "0x" << std::hex << c.code;
}

class RgbCodes : public testing::TestWithParam<RgbCode> {};

TEST_P(RgbCodes, DecodeToMasksAndDepth) {
  const RgbCode& expected = GetParam();
  const Decoded decoded = Decode(expected.code);
  EXPECT_EQ(decoded.result, KESTREL_OK);
  EXPECT_EQ(decoded.desc.code, 256u);
  EXPECT_EQ(decoded.desc.width, 123);
  EXPECT_EQ(decoded.desc.height, 45);
  EXPECT_EQ(decoded.desc.colourStandard, expected.bitsPerPixel);
  EXPECT_EQ(decoded.desc.layout.rgb.redMask, expected.red);
  EXPECT_EQ(decoded.desc.layout.rgb.greenMask, expected.green);
  EXPECT_EQ(decoded.desc.layout.rgb.blueMask, expected.blue);
  EXPECT_EQ(decoded.desc.palette, nullptr);
}

INSTANTIATE_TEST_SUITE_P(Named, RgbCodes,
                         testing::Values(RgbCode{0x15000454, 16, 0xF800, 0x07E0, 0x001F},
                                         RgbCode{0x15001454, 16, 0x001F, 0x07E0, 0xF800},
                                         RgbCode{0x16000555, 24, 0x3F000, 0xFC0, 0x3F},
                                         RgbCode{0x16001555, 24, 0x3F, 0xFC0, 0x3F000},
                                         RgbCode{0x16000777, 24, 0xFF0000, 0xFF00, 0xFF},
                                         RgbCode{0x16001777, 24, 0xFF, 0xFF00, 0xFF0000},
                                         RgbCode{0x17000777, 32, 0xFF0000, 0xFF00, 0xFF},
                                         RgbCode{0x17001777, 32, 0xFF, 0xFF00, 0xFF0000},
                                         RgbCode{0x37000777, 32, 0xFF000000, 0xFF0000, 0xFF00},
                                         RgbCode{0x37001777, 32, 0xFF00, 0xFF0000, 0xFF000000}));

// Any channel widths are taken; a channel that starts beyond the pixel word has no bits.
INSTANTIATE_TEST_SUITE_P(OddWidths, RgbCodes,
                         testing::Values(RgbCode{0x15000333, 16, 0x0F00, 0x00F0, 0x000F},
                                         RgbCode{0x15000000, 16, 0x4, 0x2, 0x1},
                                         RgbCode{0x15001000, 16, 0x1, 0x2, 0x4},
                                         RgbCode{0x15000123, 16, 0x180, 0x70, 0x0F},
                                         RgbCode{0x15001123, 16, 0x3, 0x1C, 0x1E0},
                                         RgbCode{0x17000FFF, 32, 0, 0xFFFF0000, 0xFFFF},
                                         RgbCode{0x17001FFF, 32, 0xFFFF, 0xFFFF0000, 0},
                                         RgbCode{0x17000FF7, 32, 0xFF000000, 0xFFFF00, 0xFF},
                                         RgbCode{0x17001FFF & ~0x8u, 32, 0xFFFF, 0xFFFF0000, 0}));

// Family 3 packs the channels against the top of the pixel; more bits than the pixel has leave the
// lowest channel without any.
INSTANTIATE_TEST_SUITE_P(SpareBitsLow, RgbCodes,
                         testing::Values(RgbCode{0x35000454, 16, 0xF800, 0x07E0, 0x001F},
                                         RgbCode{0x35001454, 16, 0x001F, 0x07E0, 0xF800},
                                         RgbCode{0x35000444, 16, 0xF800, 0x07C0, 0x003E},
                                         RgbCode{0x36000555, 24, 0xFC0000, 0x3F000, 0xFC0},
                                         RgbCode{0x36001555, 24, 0xFC0, 0x3F000, 0xFC0000},
                                         RgbCode{0x36000777, 24, 0xFF0000, 0xFF00, 0xFF},
                                         RgbCode{0x35000777, 16, 0xFF00, 0xFF, 0},
                                         RgbCode{0x35001777, 16, 0, 0xFF, 0xFF00},
                                         RgbCode{0x35000FFF, 16, 0xFFFF, 0, 0}));

// Bits that mean nothing for RGB are not looked at.
INSTANTIATE_TEST_SUITE_P(UnusedBits, RgbCodes,
                         testing::Values(RgbCode{0x15002454, 16, 0xF800, 0x07E0, 0x001F},
                                         RgbCode{0x17FF6777, 32, 0xFF0000, 0xFF00, 0xFF},
                                         RgbCode{0x37004777, 32, 0xFF000000, 0xFF0000, 0xFF00},
                                         RgbCode{0x37005777, 32, 0xFF00, 0xFF0000, 0xFF000000}));

TEST(IndexedCodes, CarryDepthAndPalette) {
  static const uint8_t palette[8] = {};
  const struct {
    uint32_t code, bits;
  } rows[] = {{0x41000000, 1}, {0x43000000, 4}, {0x44000000, 8}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.bits);
    const Decoded decoded = Decode(row.code, palette);
    EXPECT_EQ(decoded.result, KESTREL_OK);
    EXPECT_EQ(decoded.desc.code, 256u);
    EXPECT_EQ(decoded.desc.width, 123);
    EXPECT_EQ(decoded.desc.height, 45);
    EXPECT_EQ(decoded.desc.colourStandard, row.bits);
    EXPECT_EQ(decoded.desc.palette, palette);
    EXPECT_EQ(decoded.desc.layout.rgb.paletteWord,
              static_cast<uint32_t>(reinterpret_cast<uintptr_t>(palette)));
  }
}

TEST(RgbCodesWithPalette, IgnoreIt) {
  static const uint8_t palette[8] = {};
  for (uint32_t code : {FORMAT_RGB565, FORMAT_XRGB8888, FORMAT_I420, FORMAT_NV21, FORMAT_GRAY8}) {
    EXPECT_EQ(Decode(code, palette).desc.palette, nullptr) << std::hex << code;
  }
}

struct YuvCode {
  uint32_t code;
  uint32_t internal;
  uint32_t horizontal;
  uint32_t vertical;
};

void PrintTo(const YuvCode& c, std::ostream* out) {
  *out << "0x" << std::hex << c.code;
}

class YuvCodes : public testing::TestWithParam<YuvCode> {};

TEST_P(YuvCodes, DecodeToLayoutSubsamplingAndEveryStandard) {
  for (const Standard& standard : kStandards) {
    SCOPED_TRACE(standard.code);
    const Decoded decoded = Decode(GetParam().code | standard.bits);
    EXPECT_EQ(decoded.result, KESTREL_OK);
    EXPECT_EQ(decoded.desc.code, GetParam().internal);
    EXPECT_EQ(decoded.desc.width, 123);
    EXPECT_EQ(decoded.desc.height, 45);
    EXPECT_EQ(decoded.desc.colourStandard, standard.code);
    EXPECT_EQ(decoded.desc.palette, nullptr);
    const uint32_t h = GetParam().horizontal;
    const uint32_t v = GetParam().vertical;
    const uint32_t expected[6] = {1, h, h, 1, v, v};
    for (int i = 0; i < 6; ++i) EXPECT_EQ(decoded.desc.layout.subsample[i], expected[i]) << i;
  }
}

INSTANTIATE_TEST_SUITE_P(
    Packed, YuvCodes,
    testing::Values(YuvCode{0x50000010, 513, 2, 1}, YuvCode{0x50000210, 512, 2, 1},
                    YuvCode{0x50000410, 514, 2, 1}, YuvCode{0x50000610, 515, 2, 1},
                    YuvCode{0x50000110, 529, 2, 1}, YuvCode{0x50000310, 528, 2, 1},
                    YuvCode{0x50000510, 530, 2, 1}, YuvCode{0x50000710, 531, 2, 1},
                    YuvCode{0x50000000, 576, 1, 1}, YuvCode{0x50000200, 577, 1, 1},
                    YuvCode{0x50000400, 578, 1, 1}, YuvCode{0x50000600, 579, 1, 1}));

INSTANTIATE_TEST_SUITE_P(
    Planar, YuvCodes,
    testing::Values(YuvCode{0x50000811, 1025, 2, 2}, YuvCode{0x50000810, 1027, 2, 1},
                    YuvCode{0x50000801, 1026, 1, 2}, YuvCode{0x50000800, 1028, 1, 1},
                    YuvCode{0x50000a11, 769, 2, 2}, YuvCode{0x50000a01, 770, 1, 2},
                    YuvCode{0x50000a10, 771, 2, 1}, YuvCode{0x50000a00, 772, 1, 1}));

// A planar code that is not listed takes its subsampling from the low bits, 1 to 16 each way.
// Bits above the standard do not hinder it.
INSTANTIATE_TEST_SUITE_P(
    AnyPlanar, YuvCodes,
    testing::Values(YuvCode{0x50000822, 1024, 3, 3}, YuvCode{0x50000a22, 768, 3, 3},
                    YuvCode{0x50000831, 1024, 4, 2}, YuvCode{0x50000813, 1024, 2, 4},
                    YuvCode{0x50000aff, 768, 16, 16}, YuvCode{0x50004811, 1024, 2, 2},
                    YuvCode{0x50004a11, 768, 2, 2}, YuvCode{0x5f000800, 1024, 1, 1}));

INSTANTIATE_TEST_SUITE_P(SemiPlanar, YuvCodes,
                         testing::Values(YuvCode{0x70000002, 0x70000002, 2, 2},
                                         YuvCode{0x70000003, 0x70000003, 2, 2},
                                         YuvCode{0x70000004, 0x70000004, 2, 1},
                                         YuvCode{0x70000005, 0x70000005, 2, 1}));

TEST(SemiPlanarCodes, WithAStandardDifferFromThePlainOnlyInIt) {
  Decoded plain = Decode(0x70000002);
  const Decoded full = Decode(0x70001002);
  EXPECT_EQ(full.result, KESTREL_OK);
  EXPECT_EQ(full.desc.colourStandard, 0x10002u);
  plain.desc.colourStandard = 0x10002;
  EXPECT_EQ(memcmp(&plain.desc, &full.desc, sizeof(FormatDesc)), 0);
}

TEST(SpecialCodes, SetOnlyTheInternalCodeAndStandard) {
  for (uint32_t code : {0x70000008u, 0x70000009u}) {
    for (const Standard& standard : kStandards) {
      const Decoded decoded = Decode(code | standard.bits);
      EXPECT_EQ(decoded.result, KESTREL_OK);
      EXPECT_EQ(decoded.desc.code, code);
      EXPECT_EQ(decoded.desc.width, 123);
      EXPECT_EQ(decoded.desc.height, 45);
      EXPECT_EQ(decoded.desc.colourStandard, standard.code);
      for (uint32_t word : decoded.desc.layout.subsample) EXPECT_EQ(word, kUnwritten);
    }
  }
}

TEST(GreyCodes, NeedClassFour) {
  for (const Standard& standard : kStandards) {
    const Decoded decoded = Decode(FORMAT_GRAY8 | standard.bits);
    EXPECT_EQ(decoded.result, KESTREL_OK);
    EXPECT_EQ(decoded.desc.code, 640u);
    EXPECT_EQ(decoded.desc.colourStandard, standard.code);
  }
  EXPECT_EQ(Decode(0x64000811).result, KESTREL_OK) << "only bits 24 to 27 decide";
}

TEST(GreyCodes, OfAnotherClassAreRefusedWithTheirDescriptorFilled) {
  for (uint32_t code : {0x60000000u, 0x65000000u, 0x63000000u, 0x6f000000u}) {
    SCOPED_TRACE(code);
    const Decoded decoded = Decode(code | FORMAT_BT709_VIDEO);
    EXPECT_EQ(decoded.result, KESTREL_UNSUPPORTED);
    EXPECT_EQ(decoded.desc.code, 640u);
    EXPECT_EQ(decoded.desc.width, 123);
    EXPECT_EQ(decoded.desc.height, 45);
    EXPECT_EQ(decoded.desc.colourStandard, 0x20001u);
  }
}

TEST(UnknownCodes, AreRefused) {
  std::vector<uint32_t> codes = {
      // RGB of a storage class other than 16, 24 and 32 bits
      0x10000454, 0x14000454, 0x18000777, 0x1f000777, 0x30000777, 0x34000777, 0x38000777,
      // indexed codes must match whole
      0x40000000, 0x42000000, 0x45000000, 0x41000001, 0x43001000, 0x44001000, 0x44000777,
      // packed YUV with a subsampling that is not listed, planar with packed order bits
      0x50000011, 0x50000001, 0x50000020, 0x50000100, 0x50000300, 0x50000500, 0x50000700,
      0x50000911, 0x50000c11, 0x50000d11, 0x50000b11, 0x50000e00, 0x50000f22, 0x50004010,
      // semi-planar codes beside the known ones
      0x70000000, 0x70000001, 0x70000006, 0x70000007, 0x7000000a, 0x7000000f, 0x70000012,
      0x70004002, 0x71000002, 0x7f000003};
  for (uint32_t family : {0x0u, 0x2u, 0x8u, 0x9u, 0xau, 0xbu, 0xcu, 0xdu, 0xeu, 0xfu}) {
    for (uint32_t rest : {0u, 0x5000454u, 0x7000777u, 0x4000000u, 0x811u, 0x2u}) {
      codes.push_back(family << 28 | rest);
    }
  }
  for (uint32_t code : codes) {
    EXPECT_EQ(Decode(code).result, KESTREL_UNSUPPORTED) << std::hex << code;
    EXPECT_EQ(Decode(code).desc.width, 123) << "size is copied first";
  }
}

// ---- plane layouts ----

enum class Kind { kRgb, kPacked, kPlanar };

struct LayoutRow {
  uint32_t code;
  Kind kind;
  uint32_t planeCount;
  int32_t lumaStep;
  int32_t chromaStep;
  uint32_t offsets[3];
  uint32_t horizontal;
  uint32_t vertical;
  uint32_t bitsPerPixel;
};

constexpr LayoutRow kLayouts[] = {
    {512, Kind::kPacked, 1, 2, 4, {0, 3, 1}, 2, 1, 16},
    {513, Kind::kPacked, 1, 2, 4, {0, 1, 3}, 2, 1, 16},
    {514, Kind::kPacked, 1, 2, 4, {1, 0, 2}, 2, 1, 16},
    {515, Kind::kPacked, 1, 2, 4, {1, 2, 0}, 2, 1, 16},
    {528, Kind::kPacked, 1, 2, 4, {0, 3, 1}, 2, 1, 16},
    {529, Kind::kPacked, 1, 2, 4, {0, 1, 3}, 2, 1, 16},
    {530, Kind::kPacked, 1, 2, 4, {1, 0, 2}, 2, 1, 16},
    {531, Kind::kPacked, 1, 2, 4, {1, 2, 0}, 2, 1, 16},
    {576, Kind::kPacked, 1, 3, 3, {0, 1, 2}, 1, 1, 24},
    {577, Kind::kPacked, 1, 3, 3, {0, 2, 1}, 1, 1, 24},
    {578, Kind::kPacked, 1, 3, 3, {2, 0, 1}, 1, 1, 24},
    {579, Kind::kPacked, 1, 3, 3, {2, 1, 0}, 1, 1, 24},
    {580, Kind::kPacked, 1, 3, 3, {1, 0, 2}, 1, 1, 24},
    {581, Kind::kPacked, 1, 3, 3, {1, 2, 0}, 1, 1, 24},
    {640, Kind::kPlanar, 1, 1, 1, {0, 0, 0}, 1, 1, 8},
    {769, Kind::kPlanar, 3, 1, 1, {0, 0, 0}, 2, 2, 8},
    {770, Kind::kPlanar, 3, 1, 1, {0, 0, 0}, 1, 2, 8},
    {771, Kind::kPlanar, 3, 1, 1, {0, 0, 0}, 2, 1, 8},
    {772, Kind::kPlanar, 3, 1, 1, {0, 0, 0}, 1, 1, 8},
    {1025, Kind::kPlanar, 3, 1, 1, {0, 0, 0}, 2, 2, 8},
    {1026, Kind::kPlanar, 3, 1, 1, {0, 0, 0}, 1, 2, 8},
    {1027, Kind::kPlanar, 3, 1, 1, {0, 0, 0}, 2, 1, 8},
    {1028, Kind::kPlanar, 3, 1, 1, {0, 0, 0}, 1, 1, 8},
    {0x70000002, Kind::kPlanar, 3, 1, 2, {0, 0, 0}, 2, 2, 8},
    {0x70000003, Kind::kPlanar, 3, 1, 2, {0, 0, 0}, 2, 2, 8},
    {0x70000004, Kind::kPlanar, 3, 1, 2, {0, 0, 0}, 2, 1, 8},
    {0x70000005, Kind::kPlanar, 3, 1, 2, {0, 0, 0}, 2, 1, 8},
    {0x70000008, Kind::kPacked, 1, 2, 4, {0, 2, 3}, 2, 1, 16},
    {0x70000009, Kind::kPacked, 1, 4, 4, {0, 1, 2}, 1, 1, 8},
};

struct Laid {
  FormatDesc desc{};
  PlaneLayout layout{};
  uint32_t bits = 0;
  uint32_t subsamplingResult = 0;
  std::array<uint32_t, 6> factors{};
};

Laid LayOut(const FormatDesc& desc) {
  Laid laid;
  laid.desc = desc;
  laid.bits = MPGetPlaneLayout(&laid.desc, &laid.layout);
  laid.subsamplingResult = MPGetSubsampling(&laid.desc, &laid.layout, laid.factors.data());
  return laid;
}

Laid LayOut(uint32_t code) {
  FormatDesc desc{};
  desc.code = code;
  return LayOut(desc);
}

void ExpectLayout(const Laid& laid, const LayoutRow& row) {
  EXPECT_EQ(laid.bits, row.bitsPerPixel);
  EXPECT_EQ(laid.desc.code, row.code);
  EXPECT_EQ(laid.layout.code, row.code);
  EXPECT_EQ(laid.layout.bitsPerPixel, row.bitsPerPixel);
  EXPECT_EQ(laid.layout.isPacked, row.kind == Kind::kPacked ? 1u : 0u);
  EXPECT_EQ(laid.layout.isPlanar, row.kind == Kind::kPlanar ? 1u : 0u);
  EXPECT_EQ(laid.subsamplingResult, KESTREL_OK);
  EXPECT_EQ(laid.layout.planeCount, row.planeCount);
  EXPECT_EQ(laid.layout.step[0], row.lumaStep);
  EXPECT_EQ(laid.layout.step[1], row.chromaStep);
  EXPECT_EQ(laid.layout.step[2], row.chromaStep);
  EXPECT_EQ(laid.layout.yOffset, row.offsets[0]);
  EXPECT_EQ(laid.layout.uOffset, row.offsets[1]);
  EXPECT_EQ(laid.layout.vOffset, row.offsets[2]);
  const uint32_t h = row.horizontal;
  const uint32_t v = row.vertical;
  EXPECT_EQ(laid.factors, (std::array<uint32_t, 6>{1, h, h, 1, v, v}));
}

TEST(PlaneLayouts, OfEveryInternalYuvCode) {
  for (const LayoutRow& row : kLayouts) {
    SCOPED_TRACE(row.code);
    ExpectLayout(LayOut(row.code), row);
  }
}

TEST(PlaneLayouts, OfPlanarCodesWithOpenSubsamplingTakeAllSixFactorsFromTheDescriptor) {
  for (uint32_t code : {768u, 1024u}) {
    SCOPED_TRACE(code);
    FormatDesc desc{};
    desc.code = code;
    const std::array<uint32_t, 6> factors = {2, 3, 4, 5, 6, 7};
    for (int i = 0; i < 6; ++i) desc.layout.subsample[i] = factors[i];
    const Laid laid = LayOut(desc);
    EXPECT_EQ(laid.factors, factors);
    EXPECT_EQ(laid.subsamplingResult, KESTREL_OK);
    EXPECT_EQ(laid.bits, 8u);
    EXPECT_EQ(laid.layout.planeCount, 3u);
    EXPECT_EQ(laid.layout.isPlanar, 1u);
    EXPECT_EQ(laid.layout.isPacked, 0u);
    for (int32_t step : laid.layout.step) EXPECT_EQ(step, 1);
    EXPECT_EQ(laid.layout.yOffset, 0u);
    EXPECT_EQ(laid.layout.uOffset, 0u);
    EXPECT_EQ(laid.layout.vOffset, 0u);
  }
}

TEST(PlaneLayouts, OfRgbStepByWholeBytes) {
  const struct {
    uint32_t bits;
    int32_t step;
  } rows[] = {{1, 1}, {4, 1}, {8, 1}, {16, 2}, {24, 3}, {32, 4}};
  for (const auto& row : rows) {
    FormatDesc desc{};
    desc.code = 256;
    desc.colourStandard = row.bits;
    ExpectLayout(LayOut(desc), {256, Kind::kRgb, 1, row.step, row.step, {0, 0, 0}, 1, 1, row.bits});
  }
}

TEST(PlaneLayouts, OfOlderRgbCodesRewriteDepthAndMasks) {
  const struct {
    uint32_t code, bits, red, green, blue;
  } rows[] = {{1, 24, 0xFF0000, 0xFF00, 0xFF}, {2, 24, 0xFF, 0xFF00, 0xFF0000},
              {3, 24, 0x3F000, 0xFC0, 0x3F},   {4, 24, 0x3F, 0xFC0, 0x3F000},
              {5, 16, 0xF800, 0x7E0, 0x1F},    {6, 16, 0x1F, 0x7E0, 0xF800}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.code);
    FormatDesc desc{};
    desc.code = row.code;
    desc.colourStandard = 77;
    const Laid laid = LayOut(desc);
    const auto step = static_cast<int32_t>(row.bits / 8);
    ExpectLayout(laid, {256, Kind::kRgb, 1, step, step, {0, 0, 0}, 1, 1, row.bits});
    EXPECT_EQ(laid.desc.colourStandard, row.bits);
    EXPECT_EQ(laid.desc.layout.rgb.redMask, row.red);
    EXPECT_EQ(laid.desc.layout.rgb.greenMask, row.green);
    EXPECT_EQ(laid.desc.layout.rgb.blueMask, row.blue);
  }
}

TEST(PlaneLayouts, OfTheOlderOpenRgbCodeKeepDepthAndMasks) {
  FormatDesc desc{};
  desc.code = 259;
  desc.colourStandard = 32;
  desc.layout.rgb.redMask = 0xFF;
  desc.layout.rgb.greenMask = 0xFF00;
  desc.layout.rgb.blueMask = 0xFF0000;
  const Laid laid = LayOut(desc);
  ExpectLayout(laid, {256, Kind::kRgb, 1, 4, 4, {0, 0, 0}, 1, 1, 32});
  EXPECT_EQ(laid.desc.colourStandard, 32u);
  EXPECT_EQ(laid.desc.layout.rgb.redMask, 0xFFu);
  EXPECT_EQ(laid.desc.layout.rgb.blueMask, 0xFF0000u);
}

TEST(PlaneLayouts, OfOlderYuvCodesAreThoseOfTheirSuccessors) {
  const uint32_t pairs[][2] = {{7, 512},   {11, 512},  {8, 513},   {12, 513},  {9, 514},
                               {14, 514},  {10, 515},  {13, 515},  {15, 1025}, {18, 640},
                               {19, 1026}, {20, 1027}, {21, 1028}, {39, 769}};
  for (const auto& pair : pairs) {
    SCOPED_TRACE(pair[0]);
    bool found = false;
    for (const LayoutRow& row : kLayouts) {
      if (row.code != pair[1]) continue;
      found = true;
      ExpectLayout(LayOut(pair[0]), row);
    }
    EXPECT_TRUE(found);
  }
}

TEST(PlaneLayouts, OfUnknownCodesHaveNoBits) {
  for (uint32_t code :
       {0u,   16u,     17u,         22u,         38u,         40u,        255u,  257u,
        258u, 260u,    511u,        516u,        527u,        532u,       575u,  582u,
        639u, 641u,    767u,        773u,        1023u,       1029u,      4096u, 9999u,
        ~0u,  0x1025u, 0x70000001u, 0x70000006u, 0x70000007u, 0x7000000au}) {
    SCOPED_TRACE(code);
    const Laid fresh = LayOut(code);
    EXPECT_EQ(fresh.bits, 0u);
    EXPECT_EQ(fresh.desc.code, 0u) << "takes the code of the layout, 0 in a fresh one";
    EXPECT_EQ(fresh.subsamplingResult, KESTREL_UNSUPPORTED);

    FormatDesc desc{};
    desc.code = code;
    PlaneLayout layout{};
    layout.code = 1025;
    EXPECT_EQ(MPGetPlaneLayout(&desc, &layout), 0u);
    EXPECT_EQ(desc.code, 1025u);
  }
}

TEST(PlaneLayouts, OfEveryPublicCodeExist) {
  constexpr auto kListed = testing_support::PublicCodes();
  std::vector<uint32_t> codes(kListed.begin(), kListed.end());
  codes.push_back(0x50000822u);
  for (const uint32_t code : codes) {
    SCOPED_TRACE(code);
    const Decoded decoded = Decode(code);
    ASSERT_EQ(decoded.result, KESTREL_OK);
    const Laid laid = LayOut(decoded.desc);
    EXPECT_NE(laid.bits, 0u);
    EXPECT_EQ(laid.desc.code, decoded.desc.code);
    EXPECT_EQ(laid.subsamplingResult, KESTREL_OK);
  }
}

// ---- masks and rectangles ----

TEST(Masks, SizeCountsSetBits) {
  EXPECT_EQ(MGetMaskSize(0), 0u);
  EXPECT_EQ(MGetMaskSize(1), 1u);
  EXPECT_EQ(MGetMaskSize(0xF800), 5u);
  EXPECT_EQ(MGetMaskSize(0x07E0), 6u);
  EXPECT_EQ(MGetMaskSize(0x80000001), 2u);
  EXPECT_EQ(MGetMaskSize(0xFFFFFFFF), 32u);
}

TEST(Masks, PositionIsTheLowestSetBit) {
  EXPECT_EQ(MGetMaskPos(0), 0u);
  EXPECT_EQ(MGetMaskPos(1), 0u);
  EXPECT_EQ(MGetMaskPos(0xF800), 11u);
  EXPECT_EQ(MGetMaskPos(0x07E0), 5u);
  EXPECT_EQ(MGetMaskPos(0xFF0000), 16u);
  EXPECT_EQ(MGetMaskPos(0x80000000), 31u);
  for (uint32_t bit = 0; bit < 32; ++bit) EXPECT_EQ(MGetMaskPos(~0u << bit), bit);
}

TEST(Rectangles, AreCopiedWhole) {
  const MRECT source = {-1, 2, INT32_MAX, INT32_MIN};
  MRECT copy = {};
  RectCopy(&copy, &source);
  EXPECT_EQ(copy, source);
}

TEST(Rectangles, SwapExchangesAxesAndTwiceRestores) {
  MRECT rect = {1, 2, 3, 4};
  MSwapRect(&rect);
  EXPECT_EQ(rect, (MRECT{2, 1, 4, 3}));
  MSwapRect(&rect);
  EXPECT_EQ(rect, (MRECT{1, 2, 3, 4}));
}

TEST(Rectangles, FlipUpDownInsideAFrame) {
  const MRECT frame = {7, 0, 9, 10};
  MRECT rect = {0, 2, 5, 4};
  FlipUpDownRect(&frame, &rect);
  EXPECT_EQ(rect, (MRECT{0, 6, 5, 8}));

  const MRECT lowFrame = {0, -20, 0, -4};
  rect = {1, -20, 2, -18};
  FlipUpDownRect(&lowFrame, &rect);
  EXPECT_EQ(rect, (MRECT{1, -6, 2, -4}));
}

TEST(Rectangles, FlipLeftRightInsideAFrame) {
  const MRECT frame = {10, 3, 30, 4};
  MRECT rect = {12, 2, 15, 4};
  MFlipLeftRightRect(&frame, &rect);
  EXPECT_EQ(rect, (MRECT{25, 2, 28, 4}));
  MFlipLeftRightRect(&frame, &rect);
  EXPECT_EQ(rect, (MRECT{12, 2, 15, 4}));
}

}  // namespace
}  // namespace kestrel::test
