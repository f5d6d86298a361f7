// Coefficients, gains, the table block of an engine, and colours against plain table reads.
#include "colour/conversion_tables.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <iterator>

#include "colour/vector_clamps.h"
#include "exact_support.h"

namespace kestrel::test {
namespace {

constexpr uint32_t kStandards[] = {CS_BT601_VIDEO, CS_BT601_FULL, CS_BT709_VIDEO, CS_BT709_FULL};

uint32_t StandardBits(uint32_t standard) {
  return (standard & 0x20000u ? FORMAT_BT709_VIDEO : 0u) |
         (standard & CS_FULL_RANGE ? FORMAT_BT601_FULL : 0u);
}

// ---- coefficients ----

TEST(Coefficients, OfYuvToRgb) {
  const struct {
    uint32_t standard;
    int32_t words[8];
  } rows[] = {{CS_BT601_FULL, {65536, 91881, 46802, 116130, 22554, 11760828, 8877496, 14864613}},
              {CS_BT709_FULL, {65536, 103206, 30677, 121609, 12275, 13210380, 5497894, 15565901}},
              {CS_BT709_VIDEO, {76605, 117952, 35062, 138982, 14031, 16323497, 5058226, 19015401}},
              {CS_BT601_VIDEO, {76605, 105048, 53510, 132796, 25788, 14671780, 8924535, 18223517}},
              {0, {76605, 105048, 53510, 132796, 25788, 14671780, 8924535, 18223517}},
              {0x30002, {76605, 105048, 53510, 132796, 25788, 14671780, 8924535, 18223517}}};
  for (const auto& row : rows) {
    const YuvToRgbCoeffs& c = YuvToRgbRow(row.standard);
    const int32_t words[8] = {c.y, c.vToR, c.vToG, c.uToB, c.uToG, c.rBias, c.gBias, c.bBias};
    for (int i = 0; i < 8; ++i) {
      EXPECT_EQ(words[i], row.words[i]) << std::hex << row.standard << " word " << i;
    }
  }
}

TEST(Coefficients, OfRgbToYuv) {
  const struct {
    uint32_t standard;
    int32_t words[10];
  } rows[] = {{CS_BT601_FULL, {19595, 38470, 7471, 11058, 21710, 32768, 32768, 27439, 5329, 0}},
              {CS_BT709_FULL, {13933, 46871, 4732, 7510, 25258, 32768, 32768, 29766, 3005, 0}},
              {CS_BT709_VIDEO, {11921, 40095, 4050, 6573, 22099, 28672, 28672, 26044, 2629, 0}},
              {CS_BT601_VIDEO, {16763, 32910, 6391, 9676, 18999, 28672, 28672, 24012, 4663, 0}},
              {0xFFFFFFFF, {16763, 32910, 6391, 9676, 18999, 28672, 28672, 24012, 4663, 0}}};
  for (const auto& row : rows) {
    const RgbToYuvCoeffs& c = RgbToYuvRow(row.standard);
    const int32_t words[10] = {c.rToY, c.gToY, c.bToY, c.rToU, c.gToU,
                               c.bToU, c.rToV, c.gToV, c.bToV, c.zero};
    for (int i = 0; i < 10; ++i) {
      EXPECT_EQ(words[i], row.words[i]) << std::hex << row.standard << " word " << i;
    }
  }
}

// ---- gains ----

int32_t Halved(int32_t parameter) {
  return parameter >= 0 ? parameter : parameter >> 1;
}

// The product formed byte by byte, only the lowest byte's part being rounded.
int32_t ByteWiseScale(int32_t value, int32_t parameter) {
  const int32_t m = 4 * (Halved(parameter) + 64);
  const int32_t magnitude = value < 0 ? -value : value;
  const int32_t b0 = magnitude & 255;
  const int32_t b1 = magnitude >> 8 & 255;
  const int32_t b2 = magnitude >> 16 & 255;
  const int32_t b3 = magnitude >> 24;
  const int32_t product = ((b0 * m + 128) >> 8) + b1 * m + b2 * m * 256 + b3 * m * 65536;
  return value < 0 ? -product : product;
}

TEST(ScaleByGain, RunsFromZeroThroughOneToThree) {
  const int32_t rows[][3] = {{100, 0, 100},
                             {100, 128, 300},
                             {100, -128, 0},
                             {100, 64, 200},
                             {100, -64, 50},
                             {100, -1, 98},
                             {100, -2, 98},
                             {100, -3, 97},
                             {-100, 128, -300},
                             {-100, -1, -98},
                             {1, 32, 2},
                             {-1, 32, -2},
                             {3, 32, 5},
                             {-3, 32, -5},
                             {1, 31, 1},
                             {0, 77, 0},
                             {65536, 1, 66560},
                             {76605, 32, 114908},
                             {-76605, 32, -114908},
                             {16777216, 64, 33554432},
                             {1, -64, 1},
                             {-1, -64, -1},
                             {1, -65, 0}};
  for (const auto& row : rows) {
    EXPECT_EQ(ScaleByGain(row[0], row[1]), row[2]) << row[0] << " by " << row[1];
  }
}

TEST(ScaleByGain, EqualsTheByteWiseProduct) {
  for (int32_t parameter = -128; parameter <= 128; ++parameter) {
    for (int32_t value = -70000; value <= 70000; value += 97) {
      ASSERT_EQ(ScaleByGain(value, parameter), ByteWiseScale(value, parameter))
          << value << " by " << parameter;
    }
    for (int32_t value = 1; value < 600000000; value = value * 3 + 5) {
      ASSERT_EQ(ScaleByGain(value, parameter), ByteWiseScale(value, parameter))
          << value << " by " << parameter;
      ASSERT_EQ(ScaleByGain(-value, parameter), ByteWiseScale(-value, parameter))
          << -value << " by " << parameter;
    }
  }
}

TEST(AdjustGain, AppliesSaturationToChromaFirstAndContrastToAll) {
  EXPECT_EQ(AdjustGain(65536, 0, 0, 0), 65536);
  EXPECT_EQ(AdjustGain(65536, 64, 128, 0), 131072);
  EXPECT_EQ(AdjustGain(65536, 0, 128, 1), 196608);
  EXPECT_EQ(AdjustGain(65536, 128, 128, 1), 589824);
  EXPECT_EQ(AdjustGain(65536, -128, 128, 1), 0);
  EXPECT_EQ(AdjustGain(-22554, 0, 32, 1), -33831);
  // 91881 * 65/64 = 93316.6.. -> 93317, and that * 63/64 = 91858.9.. -> 91859.
  EXPECT_EQ(AdjustGain(91881, -1, 1, 1), 91859);
}

TEST(AdjustOffset, KeepsTheChromaCentreAndPivotsContrastAbout128) {
  constexpr int32_t kCentre = 8388608;
  EXPECT_EQ(AdjustOffset(0, 0, 0, 91881), 0);
  EXPECT_EQ(AdjustOffset(1000, 0, 0, 0), 1000);
  EXPECT_EQ(AdjustOffset(1000, 0, 10, 91881), 1000 - 2 * 10 * 91881);
  EXPECT_EQ(AdjustOffset(1000, 0, -9, 91881), 1000 + 2 * 5 * 91881);
  EXPECT_EQ(AdjustOffset(kCentre, 77, 0, 0), kCentre);
  EXPECT_EQ(AdjustOffset(kCentre, -128, 0, 0), kCentre);
  EXPECT_EQ(AdjustOffset(0, 64, 0, 0), -kCentre);
  EXPECT_EQ(AdjustOffset(0, -128, 0, 0), kCentre);
  EXPECT_EQ(AdjustOffset(kCentre + 32, 1, 0, 0), kCentre + 33) << "half a step goes away from 0";
  EXPECT_EQ(AdjustOffset(kCentre - 32, 1, 0, 0), kCentre - 33);
  EXPECT_EQ(AdjustOffset(kCentre + 31, 1, 0, 0), kCentre + 31);
  EXPECT_EQ(AdjustOffset(kCentre + 32, -1, 0, 0), kCentre + 31);
  // Saturation first: 0 - 2*8*100 = -1600, then its distance from the pivot doubles.
  EXPECT_EQ(AdjustOffset(0, 64, 8, 100), -1600 - kCentre - 1600);
}

// ---- tables from YUV to RGB, built here from the coefficients alone ----

struct Adjustment {
  int32_t brightness, contrast, saturation;
};

int32_t Gain(int32_t coefficient, const Adjustment& a, bool chroma) {
  if (chroma) coefficient = ByteWiseScale(coefficient, a.saturation);
  return ByteWiseScale(coefficient, a.contrast);
}

int32_t Offset(int32_t offset, const Adjustment& a, int32_t coefficient) {
  offset -= 2 * Halved(a.saturation) * coefficient;
  const int64_t product = int64_t{offset - 8388608} * 4 * Halved(a.contrast);
  const int64_t magnitude = ((product < 0 ? -product : product) + 128) >> 8;
  return offset + static_cast<int32_t>(product < 0 ? -magnitude : magnitude);
}

struct RgbTables {
  int32_t size;
  std::vector<uint8_t> clamp;
  std::array<uint32_t, 256> y, u, v;
  // Unwrapped parts of the words, for sums that leave the clamp table.
  std::array<int64_t, 256> uHigh, uLow, vHigh, vLow;
  uint32_t shift[3];
  int32_t base[3];
  int32_t maximum[3];
};

RgbTables BuildRgbTables(uint32_t standard, const Adjustment& a, bool narrow) {
  const YuvToRgbCoeffs& c = YuvToRgbRow(standard);
  RgbTables t{};
  const int32_t yGain = Gain(c.y, a, false);
  const int32_t vr = Gain(c.vToR, a, true);
  const int32_t ug = Gain(-c.uToG, a, true);
  const int32_t vg = Gain(-c.vToG, a, true);
  const int32_t ub = Gain(c.uToB, a, true);
  const int32_t k = a.brightness * c.y;
  int32_t oR = Offset(k - c.rBias, a, c.vToR) + 32768;
  int32_t oG = Offset(k + c.gBias + 32768, a, -c.uToG - c.vToG);
  int32_t oB = Offset(k - c.bBias, a, c.uToB) + 32768;
  if (narrow) {
    t.size = 3552;
    oR += 64 << 19;
    oG += 288 << 18;
    oB += 64 << 19;
    for (int32_t i = 0; i < 160; ++i) t.clamp.push_back(uint8_t(std::clamp(i - 64, 0, 31)));
    for (int32_t i = 0; i < 320; ++i) t.clamp.push_back(uint8_t(std::clamp(i - 128, 0, 63)));
    for (int i = 0; i < 3; ++i) {
      t.shift[i] = i == 1 ? 2 : 3;
      t.base[i] = i == 1 ? 288 : 64;
      t.maximum[i] = i == 1 ? 63 : 31;
    }
  } else {
    t.size = 4352;
    oR += 512 << 16;
    oG += 512 << 16;
    oB += 512 << 16;
    for (int32_t i = 0; i < 1280; ++i) t.clamp.push_back(uint8_t(std::clamp(i - 512, 0, 255)));
    for (int i = 0; i < 3; ++i) {
      t.base[i] = 512;
      t.maximum[i] = 255;
    }
  }
  for (int32_t i = 0; i < 256; ++i) {
    t.uLow[i] = (i * ug) >> 12;
    t.uHigh[i] = (oB + i * ub) >> 12;
    t.vLow[i] = (oG + i * vg) >> 12;
    t.vHigh[i] = (oR + i * vr) >> 12;
    t.y[i] = static_cast<uint32_t>(i * yGain) << 4;
    t.u[i] = static_cast<uint32_t>(t.uHigh[i]) << 16 | (static_cast<uint32_t>(t.uLow[i]) & 0xFFFF);
    t.v[i] = static_cast<uint32_t>(t.vHigh[i]) << 16 | (static_cast<uint32_t>(t.vLow[i]) & 0xFFFF);
  }
  return t;
}

// The plain table reads of one pixel: R, G, B as they are stored. Sums wrap at 32 bits.
std::array<uint8_t, 3> ReadTables(const RgbTables& t, int y, int u, int v) {
  const uint32_t ty = t.y[y];
  const uint32_t tu = t.u[u];
  const uint32_t tv = t.v[v];
  return {t.clamp.at((tv + ty) >> (20 + t.shift[0])),
          t.clamp.at((ty + ((tu + tv) << 16)) >> (20 + t.shift[1])),
          t.clamp.at((tu + ty) >> (20 + t.shift[2]))};
}

// The same for engines whose sums may leave the table: they do not wrap, and colours saturate.
std::array<uint8_t, 3> SaturatedSums(const RgbTables& t, int y, int u, int v) {
  const int64_t ty = t.y[y];
  const int64_t sums[3] = {ty + t.vHigh[v] * 65536 + (t.vLow[v] & 0xFFFF),
                           ty + (t.uLow[u] + t.vLow[v]) * 65536,
                           ty + t.uHigh[u] * 65536 + (t.uLow[u] & 0xFFFF)};
  std::array<uint8_t, 3> rgb{};
  for (int i = 0; i < 3; ++i) {
    const int64_t index = (sums[i] >> (20 + t.shift[i])) - t.base[i];
    rgb[i] = static_cast<uint8_t>(std::clamp<int64_t>(index, 0, t.maximum[i]));
  }
  return rgb;
}

const Adjustment kAdjustments[] = {
    {0, 0, 0},     {20, 0, 0},  {-128, 0, 0}, {128, 0, 0},     {0, 25, 0},      {0, -57, 0},
    {0, 0, 40},    {0, 0, -75}, {9, -13, 21}, {-31, 30, -128}, {127, -1, -1},   {0, -128, 0},
    {50, -128, 9}, {0, 128, 0}, {0, 0, 128},  {128, 128, 128}, {-128, 128, 128}};

void ExpectRgbBlock(const EngineContext& context, const RgbTables& expected) {
  ASSERT_EQ(context.tableSize, static_cast<uint32_t>(expected.size));
  ASSERT_NE(context.table, nullptr);
  const uint32_t words = static_cast<uint32_t>(expected.size) / 4;
  EXPECT_EQ(context.tableOffsets[0], words - 512);
  EXPECT_EQ(context.tableOffsets[1], words - 256);
  EXPECT_EQ(context.tableOffsets[2], words - 768);
  const auto* bytes = static_cast<const uint8_t*>(context.table);
  EXPECT_EQ(memcmp(bytes, expected.clamp.data(), expected.clamp.size()), 0) << "clamp tables";
  const auto* table = static_cast<const uint32_t*>(context.table);
  for (int i = 0; i < 256; ++i) {
    ASSERT_EQ(table[words - 768 + i], expected.y[i]) << "Y " << i;
    ASSERT_EQ(table[words - 512 + i], expected.u[i]) << "U " << i;
    ASSERT_EQ(table[words - 256 + i], expected.v[i]) << "V " << i;
  }
}

TEST(TableBlock, OfYuvToRgbHoldsClampsAndWords) {
  for (uint32_t standard : kStandards) {
    for (uint32_t code :
         {FORMAT_XBGR8888, FORMAT_RGB888, FORMAT_BGR666, FORMAT_RGB565, FORMAT_BGR565}) {
      for (const Adjustment& a : kAdjustments) {
        SCOPED_TRACE(testing::Message()
                     << std::hex << standard << " " << code << std::dec << " " << a.brightness
                     << " " << a.contrast << " " << a.saturation);
        const Engine engine({code, 8, 8}, {FORMAT_NV21 | StandardBits(standard), 8, 8},
                            Param().Adjust(a.brightness, a.contrast, a.saturation));
        ASSERT_EQ(engine.result(), KESTREL_OK);
        ExpectRgbBlock(engine.context(), BuildRgbTables(standard, a, code >> 24 == 0x15));
      }
    }
  }
}

TEST(TableBlock, PlacesTheTablesAtTheEnd) {
  const Engine wide({FORMAT_RGB888, 8, 8}, {FORMAT_NV21, 8, 8});
  EXPECT_EQ(wide.context().tableSize, 4352u);
  EXPECT_EQ(wide.context().tableOffsets[0], 576u);
  EXPECT_EQ(wide.context().tableOffsets[1], 832u);
  EXPECT_EQ(wide.context().tableOffsets[2], 320u);
  const Engine narrow({FORMAT_RGB565, 8, 8}, {FORMAT_NV21, 8, 8});
  EXPECT_EQ(narrow.context().tableSize, 3552u);
  EXPECT_EQ(narrow.context().tableOffsets[0], 376u);
  EXPECT_EQ(narrow.context().tableOffsets[1], 632u);
  EXPECT_EQ(narrow.context().tableOffsets[2], 120u);
}

// Numbers worked out by hand from the video-range row of BT.601, for an engine without adjustment.
TEST(TableBlock, HoldsHandComputedWords) {
  const Engine engine({FORMAT_XBGR8888, 8, 8}, {FORMAT_NV21, 8, 8});
  const auto* table = static_cast<const uint32_t*>(engine.context().table);
  EXPECT_EQ(table[320 + 16], 16u * 76605 * 16);
  EXPECT_EQ(table[320 + 255], 255u * 76605 * 16);
  // U 0: low (0) >> 12; high (-18223517 + 32768 + 33554432) >> 12 = 3750.
  EXPECT_EQ(table[576], 3750u << 16);
  // U 128: low (-128 * 25788) >> 12 = -806 (-805.875 down); high (15363683 + 16997888) >> 12 =
  // 7900.
  EXPECT_EQ(table[576 + 128], 7900u << 16 | (0x10000u - 806));
  // V 128: low (8924535 + 32768 + 33554432 - 6849280) >> 12 = 8706;
  // high (-14671780 + 32768 + 33554432 + 13446144) >> 12 = 7900.
  EXPECT_EQ(table[832 + 128], 7900u << 16 | 8706u);
}

// Tables may be read only where no colour leaves them, at either end; where all stay well inside
// they must be.
TEST(TableBlock, IsReadWhereEveryColourStaysInside) {
  int read = 0, leftBelow = 0, leftAbove = 0;
  for (uint32_t code : {FORMAT_XBGR8888, FORMAT_RGB565}) {
    for (int adjustments = 0; adjustments < 9 * 9 * 9; ++adjustments) {
      const auto step = [&](int divisor) { return adjustments / divisor % 9 * 32 - 128; };
      const Engine engine({code, 8, 8}, {FORMAT_NV21 | FORMAT_BT601_FULL, 8, 8},
                          Param().Adjust(step(1), step(9), step(81)));
      ASSERT_EQ(engine.result(), KESTREL_OK);
      const YuvToRgbSums& s = engine.context().rgbSums;
      const int32_t gains[3][2] = {{0, s.vToR}, {s.uToG, s.vToG}, {s.uToB, 0}};
      // How far the nearest colour is from the ends of its channel's table, in levels.
      int64_t below = INT64_MAX;
      int64_t above = INT64_MAX;
      for (int channel = 0; channel < 3; ++channel) {
        const bool six = s.narrowing[channel] == 2;
        const int64_t first = six ? 160 * 4 : 0;
        const int64_t end = six ? 480 * 4 : 1280;
        for (int corner = 0; corner < 8; ++corner) {
          const auto component = [&](int bit) { return int64_t(corner >> bit & 1) * 255; };
          const int64_t sum = s.offset[channel] + component(0) * s.yGain +
                              component(1) * gains[channel][0] + component(2) * gains[channel][1];
          below = std::min(below, (sum >> 16) - first);
          above = std::min(above, end - 1 - (sum >> 16));
        }
      }
      const bool isRead = s.insideClampTable != 0;
      // A remainder that dithering carries and the carries of chroma words add up to 8 levels.
      EXPECT_FALSE(isRead && (below < 0 || above < 8)) << code << ", adjusted " << adjustments;
      EXPECT_TRUE(isRead || below < 12 || above < 12) << code << ", adjusted " << adjustments;
      read += isRead;
      leftBelow += below < 0 && above >= 12;
      leftAbove += above < 0 && below >= 12;
    }
  }
  EXPECT_GT(read, 0);
  EXPECT_GT(leftBelow, 0);
  EXPECT_GT(leftAbove, 0);
}

// Words of chroma are truncated: sums of them can be up to an eighth of a level lower.
TEST(TableBlock, IsNotReadWhereATruncatedSumWouldBeBeforeIt) {
  const std::array<int32_t, 2> brightnessAndContrast[] = {{-118, 80}, {-87, 101}, {-62, 123}};
  for (const auto& [brightness, contrast] : brightnessAndContrast) {
    const Engine engine({FORMAT_XBGR8888, 8, 8}, {FORMAT_NV21, 8, 8},
                        Param().Adjust(brightness, contrast, -128));
    const YuvToRgbSums& s = engine.context().rgbSums;
    ASSERT_EQ(s.uToB, 0);
    ASSERT_EQ(s.vToR, 0);
    const int32_t lowest = *std::min_element(std::begin(s.offset), std::end(s.offset));
    EXPECT_GE(lowest, 0);
    EXPECT_LT(lowest, 65536 / 8);
    EXPECT_EQ(s.insideClampTable, 0u);
  }
}

TEST(TableBlock, OfAGreySourceIgnoresContrastAndSaturationButNotBrightness) {
  for (uint32_t code : {FORMAT_XBGR8888, FORMAT_RGB565}) {
    const Engine grey({code, 8, 8}, {FORMAT_GRAY8, 8, 8}, Param().Adjust(17, 50, -50));
    ASSERT_EQ(grey.result(), KESTREL_OK);
    ExpectRgbBlock(grey.context(), BuildRgbTables(CS_BT601_VIDEO, {17, 0, 0}, code >> 24 == 0x15));
  }
}

TEST(TableBlock, IsAbsentForRgbToRgbAndForPlainYuvToYuv) {
  const Engine rgb({FORMAT_RGB565, 8, 8}, {FORMAT_RGB888, 8, 8}, Param().Adjust(1, 2, 3));
  EXPECT_EQ(rgb.context().table, nullptr);
  EXPECT_EQ(rgb.context().tableSize, 0u);
  const Engine yuv({FORMAT_NV21, 8, 8}, {FORMAT_I420, 8, 8});
  EXPECT_EQ(yuv.context().table, nullptr);
  EXPECT_EQ(yuv.context().tableSize, 0u);
}

// ---- tables from RGB to YUV ----

TEST(TableBlock, OfRgbToYuvHoldsEightTables) {
  for (uint32_t standard : kStandards) {
    SCOPED_TRACE(standard);
    const Engine engine({FORMAT_NV21 | StandardBits(standard), 8, 8}, {FORMAT_RGB888, 8, 8},
                        Param().Adjust(11, 22, 33));
    ASSERT_EQ(engine.context().tableSize, 8192u);
    const auto* table = static_cast<const int32_t*>(engine.context().table);
    const RgbToYuvCoeffs& c = RgbToYuvRow(standard);
    const int32_t foot = (standard & CS_VIDEO_RANGE) != 0 ? 1048576 : 0;
    for (int32_t i = 0; i < 256; ++i) {
      const int32_t words[8] = {i * c.rToY + foot, i * c.gToY,           i * c.bToY,  -i * c.rToU,
                                -i * c.gToU,       8388608 + i * c.rToV, -i * c.gToV, -i * c.bToV};
      for (int t = 0; t < 8; ++t) ASSERT_EQ(table[256 * t + i], words[t]) << t << " " << i;
    }
  }
}

// ---- level maps ----

struct LevelMap {
  int32_t lumaGain, lumaOffset, chromaGain, chromaOffset;
};

void ExpectLevels(const EngineContext& context, const LevelMap& m, const Adjustment& a) {
  ASSERT_EQ(context.tableSize, 512u);
  const auto* bytes = static_cast<const uint8_t*>(context.table);
  const int32_t lumaGain = Gain(m.lumaGain, a, false);
  const int32_t lumaOffset = Offset(m.lumaOffset + a.brightness * 65536, a, 0);
  const int32_t chromaGain = Gain(m.chromaGain, a, true);
  const int32_t chromaOffset = Offset(m.chromaOffset, a, m.chromaGain);
  for (int32_t i = 0; i < 256; ++i) {
    ASSERT_EQ(bytes[i], std::clamp((lumaOffset + 32768 + i * lumaGain) >> 16, 0, 255)) << i;
    ASSERT_EQ(bytes[256 + i], std::clamp((chromaOffset + 32768 + i * chromaGain) >> 16, 0, 255))
        << i;
  }
}

constexpr LevelMap kToVideo = {56066, 16 << 16, 57344, 1048576};
constexpr LevelMap kToFull = {76608, 1225728, 74901, -1198372};
constexpr LevelMap kSameRange = {65536, 0, 65536, 0};

TEST(LevelMaps, FollowTheChangeOfRangeAndTheAdjustments) {
  for (uint32_t from : kStandards) {
    for (uint32_t to : kStandards) {
      for (const Adjustment& a : kAdjustments) {
        const bool adjusted = a.brightness != 0 || a.contrast != 0 || a.saturation != 0;
        const bool sameRange = (from & 3) == (to & 3);
        if (sameRange && !adjusted) continue;
        SCOPED_TRACE(testing::Message()
                     << std::hex << from << " " << to << std::dec << " " << a.brightness << " "
                     << a.contrast << " " << a.saturation);
        const Engine engine({FORMAT_NV21 | StandardBits(to), 8, 8},
                            {FORMAT_I420 | StandardBits(from), 8, 8},
                            Param().Adjust(a.brightness, a.contrast, a.saturation));
        ASSERT_EQ(engine.result(), KESTREL_OK);
        ExpectLevels(engine.context(),
                     sameRange                     ? kSameRange
                     : (from & CS_FULL_RANGE) != 0 ? kToVideo
                                                   : kToFull,
                     a);
      }
    }
  }
}

TEST(LevelMaps, HoldHandComputedLevels) {
  const Engine widen({FORMAT_NV21 | FORMAT_BT601_FULL, 8, 8}, {FORMAT_NV21, 8, 8});
  const auto* map = static_cast<const uint8_t*>(widen.context().table);
  EXPECT_EQ(map[16], 37) << "16 does not become 0: the offset is added";
  EXPECT_EQ(map[235], 255);
  EXPECT_EQ(map[0], 19);
  EXPECT_EQ(map[256 + 128], 128);
  EXPECT_EQ(map[256 + 16], 0);
  EXPECT_EQ(map[256 + 240], 255);
  const Engine narrow({FORMAT_NV21, 8, 8}, {FORMAT_NV21 | FORMAT_BT601_FULL, 8, 8});
  map = static_cast<const uint8_t*>(narrow.context().table);
  EXPECT_EQ(map[0], 16);
  EXPECT_EQ(map[255], 234);
  EXPECT_EQ(map[256], 16);
  EXPECT_EQ(map[256 + 128], 128);
  EXPECT_EQ(map[256 + 255], 239);
}

TEST(Standards, OfOneRangeAreRewrittenToVideoOnlyWhenAMapIsBuilt) {
  const uint32_t from = FORMAT_I420 | FORMAT_BT601_FULL;
  const uint32_t to = FORMAT_NV21 | FORMAT_BT709_FULL;
  const Engine plain({to, 8, 8}, {from, 8, 8});
  EXPECT_EQ(plain.context().srcFormat.colourStandard, CS_BT601_FULL);
  EXPECT_EQ(plain.context().dstFormat.colourStandard, CS_BT709_FULL);
  const Engine adjusted({to, 8, 8}, {from, 8, 8}, Param().Adjust(1, 0, 0));
  EXPECT_EQ(adjusted.context().srcFormat.colourStandard, CS_BT601_VIDEO);
  EXPECT_EQ(adjusted.context().dstFormat.colourStandard, CS_BT709_VIDEO);
  const Engine ranged({FORMAT_NV21, 8, 8}, {from, 8, 8}, Param().Adjust(1, 0, 0));
  EXPECT_EQ(ranged.context().srcFormat.colourStandard, CS_BT601_FULL);
  EXPECT_EQ(ranged.context().dstFormat.colourStandard, CS_BT601_VIDEO);
}

// ---- colours ----

// Rows of one (u, v) pair each, every luma across: four-byte packed samples Y U V -.
struct ColourGrid {
  std::vector<std::array<uint8_t, 2>> chroma;
  Bytes source;

  explicit ColourGrid(int step) {
    std::vector<uint8_t> values;
    for (int i = 0; i < 255; i += step) values.push_back(uint8_t(i));
    values.push_back(255);
    for (uint8_t u : values) {
      for (uint8_t v : values) chroma.push_back({u, v});
    }
    source.resize(chroma.size() * 1024);
    for (size_t row = 0; row < chroma.size(); ++row) {
      for (size_t y = 0; y < 256; ++y) {
        uint8_t* pixel = &source[row * 1024 + y * 4];
        pixel[0] = uint8_t(y);
        pixel[1] = chroma[row][0];
        pixel[2] = chroma[row][1];
      }
    }
  }
  int32_t height() const { return static_cast<int32_t>(chroma.size()); }
};

// Converts the grid and compares each pixel with what `expected` says for (y, u, v).
template <typename Expected>
void ExpectColours(ColourGrid& grid, uint32_t dstCode, uint32_t standard, const MPPPARAM& param,
                   Expected expected) {
  const bool narrow = dstCode >> 24 == 0x15;
  const size_t pixelBytes = narrow ? 2 : 4;
  Bytes out(grid.chroma.size() * 256 * pixelBytes);
  const Engine engine({dstCode, 256, grid.height()},
                      {FORMAT_YUV_SPECIAL9 | StandardBits(standard), 256, grid.height()}, param);
  ASSERT_EQ(engine.result(), KESTREL_OK);
  ASSERT_EQ(Process(engine, OnePlane(out, narrow ? 512 : 1024), OnePlane(grid.source, 1024)),
            KESTREL_OK);
  for (size_t row = 0; row < grid.chroma.size(); ++row) {
    for (int y = 0; y < 256; ++y) {
      const uint8_t* pixel = &out[(row * 256 + y) * pixelBytes];
      std::array<uint8_t, 3> rgb;
      if (narrow) {
        const unsigned word = pixel[0] | pixel[1] << 8;
        rgb = {uint8_t(word >> 11), uint8_t(word >> 5 & 63), uint8_t(word & 31)};
      } else {
        rgb = {pixel[0], pixel[1], pixel[2]};
      }
      const std::array<uint8_t, 3> wanted = expected(y, grid.chroma[row][0], grid.chroma[row][1]);
      if (rgb != wanted) {
        FAIL() << "yuv " << y << " " << int(grid.chroma[row][0]) << " " << int(grid.chroma[row][1])
               << " gives " << int(rgb[0]) << " " << int(rgb[1]) << " " << int(rgb[2])
               << ", expected " << int(wanted[0]) << " " << int(wanted[1]) << " " << int(wanted[2]);
      }
    }
  }
}

TEST(Colours, OfPlainEnginesEqualTheTableReads) {
  ColourGrid grid(5);
  for (uint32_t standard : kStandards) {
    for (uint32_t code : {FORMAT_XBGR8888, FORMAT_RGB565}) {
      SCOPED_TRACE(testing::Message() << std::hex << standard << " " << code);
      const RgbTables tables = BuildRgbTables(standard, {0, 0, 0}, code == FORMAT_RGB565);
      ExpectColours(grid, code, standard, Param(),
                    [&](int y, int u, int v) { return ReadTables(tables, y, u, v); });
    }
  }
}

TEST(Colours, OfAPlainVideoRangeEngineEqualTheTableReadsForEveryInput) {
  ColourGrid grid(1);
  const RgbTables tables = BuildRgbTables(CS_BT601_VIDEO, {0, 0, 0}, false);
  ExpectColours(grid, FORMAT_XBGR8888, CS_BT601_VIDEO, Param(),
                [&](int y, int u, int v) { return ReadTables(tables, y, u, v); });
}

TEST(Colours, OfMildlyAdjustedEnginesEqualTheTableReads) {
  ColourGrid grid(15);
  for (uint32_t standard : kStandards) {
    for (const Adjustment& a : {Adjustment{128, 0, 0}, Adjustment{-128, 0, 0}, Adjustment{9, 12, 9},
                                Adjustment{-20, -70, 30}, Adjustment{30, -128, 30}}) {
      for (uint32_t code : {FORMAT_XBGR8888, FORMAT_RGB565}) {
        SCOPED_TRACE(testing::Message()
                     << std::hex << standard << " " << code << std::dec << " " << a.brightness
                     << " " << a.contrast << " " << a.saturation);
        const RgbTables tables = BuildRgbTables(standard, a, code == FORMAT_RGB565);
        ExpectColours(grid, code, standard, Param().Adjust(a.brightness, a.contrast, a.saturation),
                      [&](int y, int u, int v) { return ReadTables(tables, y, u, v); });
      }
    }
  }
}

TEST(Colours, OfStronglyAdjustedEnginesSaturate) {
  ColourGrid grid(15);
  for (uint32_t standard : kStandards) {
    for (const Adjustment& a : kAdjustments) {
      for (uint32_t code : {FORMAT_XBGR8888, FORMAT_RGB565}) {
        SCOPED_TRACE(testing::Message()
                     << std::hex << standard << " " << code << std::dec << " " << a.brightness
                     << " " << a.contrast << " " << a.saturation);
        const RgbTables tables = BuildRgbTables(standard, a, code == FORMAT_RGB565);
        ExpectColours(grid, code, standard, Param().Adjust(a.brightness, a.contrast, a.saturation),
                      [&](int y, int u, int v) { return SaturatedSums(tables, y, u, v); });
      }
    }
  }
}

// Converts one pixel between packed formats of one plane.
Bytes OnePixel(uint32_t dstCode, size_t dstBytes, uint32_t srcCode, Bytes source,
               const MPPPARAM& param = Param()) {
  const Engine engine({dstCode, 1, 1}, {srcCode, 1, 1}, param);
  Bytes out(dstBytes);
  EXPECT_EQ(Process(engine, OnePlane(out, 4), OnePlane(source, 4)), KESTREL_OK);
  return out;
}

TEST(Colours, OfKnownPixels) {
  const uint32_t full = FORMAT_YUV444 | FORMAT_BT601_FULL;
  EXPECT_EQ(OnePixel(FORMAT_BGR888, 3, full, {128, 128, 128}), (Bytes{128, 128, 128}));
  EXPECT_EQ(OnePixel(FORMAT_BGR888, 3, full, {255, 128, 128}), (Bytes{255, 255, 255}));
  EXPECT_EQ(OnePixel(FORMAT_BGR888, 3, full, {0, 128, 128}), (Bytes{0, 0, 0}));
  EXPECT_EQ(OnePixel(FORMAT_BGR888, 3, FORMAT_YUV444, {16, 128, 128}), (Bytes{0, 0, 0}));
  EXPECT_EQ(OnePixel(FORMAT_BGR888, 3, FORMAT_YUV444, {235, 128, 128}), (Bytes{255, 255, 255}));
  EXPECT_EQ(OnePixel(FORMAT_RGB565, 2, full, {255, 128, 128}), (Bytes{0xFF, 0xFF}));
  // 18-bit RGB comes from the 8-bit colour: 255 becomes 63 in each channel.
  EXPECT_EQ(OnePixel(FORMAT_RGB666, 3, full, {255, 128, 128}), (Bytes{0xFF, 0xFF, 0x03}));
  EXPECT_EQ(OnePixel(FORMAT_RGB666, 3, full, {7, 128, 128}), (Bytes{0x41, 0x10, 0x00}));
}

TEST(Colours, OfKnownRgbPixelsInYuv) {
  const uint32_t full = FORMAT_YUV444 | FORMAT_BT601_FULL;
  EXPECT_EQ(OnePixel(full, 3, FORMAT_RGB888, {255, 255, 255}), (Bytes{255, 128, 128}));
  EXPECT_EQ(OnePixel(full, 3, FORMAT_RGB888, {0, 0, 0}), (Bytes{0, 128, 128}));
  EXPECT_EQ(OnePixel(FORMAT_YUV444, 3, FORMAT_RGB888, {0, 0, 0}), (Bytes{16, 128, 128}));
  // The luma weights sum to 56064: (255 * 56064 + 1048576) >> 16 = 234. Those of both chroma
  // samples to -3: (8388608 - 255 * 3) >> 16 = 127.
  EXPECT_EQ(OnePixel(FORMAT_YUV444, 3, FORMAT_RGB888, {255, 255, 255}), (Bytes{234, 127, 127}));
  // 709: (255 * 56066 + 1048576) >> 16 = 234.
  EXPECT_EQ(OnePixel(FORMAT_YUV444 | FORMAT_BT709_VIDEO, 3, FORMAT_RGB888, {255, 255, 255})[0],
            234);
  // Red (bytes B G R): Y 255*19595 >> 16 = 76, U (8388608 - 255*11058) >> 16 = 84,
  // V (8388608 + 255*32768) >> 16 = 255. Adjustments do not act on RGB sources.
  EXPECT_EQ(OnePixel(full, 3, FORMAT_RGB888, {0, 0, 255}), (Bytes{76, 84, 255}));
  EXPECT_EQ(OnePixel(full, 3, FORMAT_RGB888, {0, 0, 255}, Param().Adjust(99, 99, 99)),
            (Bytes{76, 84, 255}));
}

TEST(Contrast, OfZeroGainMakesEveryOutput128WhateverTheBrightness) {
  for (int32_t brightness : {0, 50, -50, 128}) {
    for (uint32_t standard : kStandards) {
      const Param param = Param().Adjust(brightness, -128, 40);
      const uint32_t bits = StandardBits(standard);
      for (const Bytes& pixel : {Bytes{0, 0, 0}, Bytes{255, 255, 255}, Bytes{16, 240, 1}}) {
        EXPECT_EQ(OnePixel(FORMAT_BGR888, 3, FORMAT_YUV444 | bits, pixel, param),
                  (Bytes{128, 128, 128}));
        EXPECT_EQ(OnePixel(FORMAT_YUV444, 3, FORMAT_YUV444 | bits, pixel, param),
                  (Bytes{128, 128, 128}));
      }
    }
  }
}

TEST(Adjustments, DoNotActOnRgbToRgb) {
  EXPECT_EQ(OnePixel(FORMAT_RGB888, 3, FORMAT_BGR888, {10, 20, 30}, Param().Adjust(50, 50, 50)),
            (Bytes{30, 20, 10}));
}

TEST(Brightness, AddsLevelsToAGreySourceAndContrastDoesNot) {
  const uint32_t grey = FORMAT_GRAY8 | FORMAT_BT601_FULL;
  EXPECT_EQ(OnePixel(FORMAT_BGR888, 3, grey, {100}, Param().Adjust(20, 90, 90)),
            (Bytes{120, 120, 120}));
  EXPECT_EQ(OnePixel(FORMAT_BGR888, 3, grey, {100}, Param().Adjust(-120, 0, 0)), (Bytes{0, 0, 0}));
}

TEST(Contrast, ActsOnAGreySourceThatStaysYuv) {
  const uint32_t grey = FORMAT_GRAY8 | FORMAT_BT601_FULL;
  // Gain 2 about 128.
  EXPECT_EQ(OnePixel(FORMAT_YUV444 | FORMAT_BT601_FULL, 3, grey, {100}, Param().Adjust(0, 64, 0)),
            (Bytes{72, 128, 128}));
  // The grey family copies what is stored and never changes levels.
  EXPECT_EQ(OnePixel(grey, 1, grey, {100}, Param().Adjust(0, 64, 0)), (Bytes{100}));
}

TEST(YuvToYuv, ChangesRangeButNeverTheMatrix) {
  const Bytes pixel = {16, 60, 200};
  EXPECT_EQ(OnePixel(FORMAT_YUV444 | FORMAT_BT709_VIDEO, 3, FORMAT_YUV444, pixel), pixel);
  EXPECT_EQ(
      OnePixel(FORMAT_YUV444 | FORMAT_BT709_FULL, 3, FORMAT_YUV444 | FORMAT_BT601_FULL, pixel),
      pixel);
  EXPECT_EQ(OnePixel(FORMAT_YUV444 | FORMAT_BT709_FULL, 3, FORMAT_YUV444, pixel)[0], 37);
}

// ---- vector clamps ----

TEST(VectorClamps, BoundEachLane) {
  const KestrelU16x8 u =
      Bound_u16(KestrelU16x8{0, 1, 5, 9, 10, 40000, 65535, 7}, KestrelU16x8{1, 1, 6, 1, 1, 1, 1, 9},
                KestrelU16x8{9, 9, 9, 9, 9, 50000, 9, 8});
  const uint16_t uExpected[8] = {1, 1, 6, 9, 9, 40000, 9, 9};
  for (int i = 0; i < 8; ++i) EXPECT_EQ(u[i], uExpected[i]) << i;

  const KestrelS16x8 s = Bound_s16(KestrelS16x8{-32768, -5, 0, 5, 32767, -1, 3, 7},
                                   KestrelS16x8{-10, -10, -10, -10, -10, 0, 5, 9},
                                   KestrelS16x8{10, 10, 10, 10, 10, 10, 4, 8});
  const int16_t sExpected[8] = {-10, -5, 0, 5, 10, 0, 5, 9};
  for (int i = 0; i < 8; ++i) EXPECT_EQ(s[i], sExpected[i]) << i;

  const KestrelS32x4 w =
      Bound_s32(KestrelS32x4{INT32_MIN, -70000, 70000, 3}, KestrelS32x4{-65536, -80000, 0, 5},
                KestrelS32x4{65536, 80000, 65536, 4});
  const int32_t wExpected[4] = {-65536, -70000, 65536, 5};
  for (int i = 0; i < 4; ++i) EXPECT_EQ(w[i], wExpected[i]) << i;
}

}  // namespace
}  // namespace kestrel::test
