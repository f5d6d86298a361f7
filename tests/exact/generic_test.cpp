// Small conversions worked out by hand: sampling, sample positions, layouts, alpha, error carry.
#include <algorithm>
#include <string>
#include <utility>

#include "exact_support.h"
#include "tests/support/formats.h"

namespace kestrel::test {
namespace {

constexpr uint32_t kGrey = FORMAT_GRAY8;
constexpr uint32_t kFullGrey = FORMAT_GRAY8 | FORMAT_BT601_FULL;

// Converts an image of one plane into another; rows without padding. What is not written stays
// 0xEE.
Bytes Convert(const Side& dst, int32_t dstPitch, const Side& src, int32_t srcPitch, Bytes source,
              const MPPPARAM& param = Param(), const MRECT* rect = nullptr) {
  const Engine engine(dst, src, param);
  EXPECT_EQ(engine.result(), KESTREL_OK);
  Bytes out(static_cast<size_t>(dstPitch * dst.height), 0xEE);
  EXPECT_EQ(Process(engine, OnePlane(out, dstPitch), OnePlane(source, srcPitch), rect), KESTREL_OK);
  return out;
}

Bytes ScaleGrey(int32_t dstWidth, int32_t dstHeight, int32_t srcWidth, int32_t srcHeight,
                const Bytes& source, const MPPPARAM& param) {
  return Convert({kGrey, dstWidth, dstHeight}, dstWidth, {kGrey, srcWidth, srcHeight}, srcWidth,
                 source, param);
}

// ---- sampling ----

TEST(Bilinear, DoublingStartsAndEndsOnTheEdgeSamples) {
  // Weights 1/4 and 3/4; each of the two stages truncates.
  EXPECT_EQ(ScaleGrey(4, 4, 2, 2, {0, 100, 200, 50}, Param().Bilinear()),
            (Bytes{0, 25, 75, 100,    //
                   50, 59, 78, 87,    //
                   150, 127, 84, 62,  //
                   200, 162, 87, 50}));
}

TEST(Bilinear, HalvingTakesTheMiddle) {
  // Positions .5 and 2.5.
  EXPECT_EQ(ScaleGrey(2, 1, 4, 1, {10, 21, 30, 41}, Param().Bilinear()), (Bytes{15, 35}));
  EXPECT_EQ(ScaleGrey(1, 2, 1, 4, {10, 21, 30, 41}, Param().Bilinear()), (Bytes{15, 35}));
}

TEST(Bilinear, TruncatesDownwardOnFallingSlopesToo) {
  // Step 21845: columns 0 and 1 lie left of what the source covers, columns 2 to 4 at 1/3, 2/3 and
  // 65535/65536 of the way, column 5 copies the last sample.
  EXPECT_EQ(ScaleGrey(6, 1, 2, 1, {200, 100}, Param().Bilinear()),
            (Bytes{200, 200, 166, 133, 100, 100}));
}

TEST(Nearest, TakesTheSampleAtTheTruncatedPosition) {
  // Step 28086: positions 0, .43, .86, 1.29, 1.71, 2.14 and the last column.
  EXPECT_EQ(ScaleGrey(7, 1, 3, 1, {1, 2, 3}, Param()), (Bytes{1, 1, 1, 2, 2, 3, 3}));
  // Step 104857: positions 0, 1.6, 3.2, 4.8, 6.4.
  EXPECT_EQ(ScaleGrey(5, 1, 8, 1, {0, 1, 2, 3, 4, 5, 6, 7}, Param()), (Bytes{0, 1, 3, 4, 6}));
  EXPECT_EQ(ScaleGrey(1, 5, 1, 8, {0, 1, 2, 3, 4, 5, 6, 7}, Param()), (Bytes{0, 1, 3, 4, 6}));
}

TEST(Nearest, ReadsASourceOriginAndWritesADestinationOrigin) {
  Bytes source(16), out(16, 0xEE);
  for (uint8_t i = 0; i < 16; ++i) source[i] = i;
  const Engine engine({kGrey, 2, 2}, {kGrey, 2, 2}, Param().SrcOrigin(1, 2).DstOrigin(2, 1));
  ASSERT_EQ(Process(engine, OnePlane(out, 4), OnePlane(source, 4)), KESTREL_OK);
  Bytes expected(16, 0xEE);
  expected[6] = 9;
  expected[7] = 10;
  expected[10] = 13;
  expected[11] = 14;
  EXPECT_EQ(out, expected);
}

// Columns outside the rectangle repeat its edge columns. Rows compare a position in 65536ths with
// the rectangle's top in whole pixels: only positions below it, those of row 0, take the top row.
TEST(SourceRectangle, LimitsColumnsFullyAndRowsOnlyAtTheBottom) {
  Bytes source(36);
  for (uint8_t i = 0; i < 36; ++i) source[i] = i;
  EXPECT_EQ(ScaleGrey(6, 6, 6, 6, source, Param().SrcRect(2, 2, 4, 4)),
            (Bytes{14, 14, 14, 15, 15, 15,  // position 0 is below 2: row 2
                   8,  8,  8,  9,  9,  9,   // row 1 although the rectangle starts at 2
                   14, 14, 14, 15, 15, 15,  //
                   20, 20, 20, 21, 21, 21,  // the last row of the rectangle,
                   20, 20, 20, 21, 21, 21,  // and on
                   20, 20, 20, 21, 21, 21}));
}

TEST(SourceRectangle, ItsLastRowIsInterpolatedWithItselfThoughMoreRowsFollow) {
  EXPECT_EQ(ScaleGrey(1, 8, 1, 4, {0, 100, 200, 250}, Param().Bilinear().SrcRect(0, 0, 1, 2)),
            (Bytes{0, 25, 75, 100, 100, 100, 100, 100}));
}

TEST(Crop, ReadsItsEdgeNeighboursFromOutsideTheWindow) {
  // 8 x 2 into 8 x 4: the window is columns 2 to 5, doubled; column 0 lies between columns 1 and 2.
  Bytes source = {0, 10, 20, 30, 40, 50, 60, 70, 0, 10, 20, 30, 40, 50, 60, 70};
  EXPECT_EQ(ScaleGrey(8, 4, 8, 2, source, Param().Bilinear().Aspect(MPP_ASPECT_CROP)),
            (Bytes{17, 22, 27, 32, 37, 42, 47, 52, 17, 22, 27, 32, 37, 42, 47, 52,
                   17, 22, 27, 32, 37, 42, 47, 52, 17, 22, 27, 32, 37, 42, 47, 52}));
}

TEST(FitAndCrop, WithANegativeSourceOriginRepeatsTheFirstColumn) {
  // Fitted to rows 47 to 52, then "cropped" to 800 source columns from column -80.
  Bytes source(640 * 48);
  for (size_t i = 0; i < source.size(); ++i) {
    source[i] = static_cast<uint8_t>(i % 640 == 0 ? 200 : i % 640 % 128);
  }
  Bytes out(10000, 0xEE);
  const Engine engine({kGrey, 100, 100}, {kGrey, 640, 48}, Param().Aspect(3));
  ASSERT_EQ(engine.pass().srcRegionX, -80);
  ASSERT_EQ(Process(engine, OnePlane(out, 100), OnePlane(source, 640)), KESTREL_OK);
  for (int32_t y = 0; y < 100; ++y) {
    for (int32_t x = 0; x < 100; ++x) {
      const int32_t column = (x * 419430 - (80 << 16)) >> 16;
      const int32_t expected = y < 47 || y >= 53 ? 0xEE : x < 13 ? 200 : column % 128;
      ASSERT_EQ(out[static_cast<size_t>(100 * y + x)], expected) << x << ", " << y;
    }
  }
}

TEST(Region, OfNoHeightWritesNothingAndAnswersOk) {
  const Engine engine({kGrey, 8, 8}, {kGrey, 8, 8});
  Bytes source(64, 1), out(64, 0xEE);
  const Planes dst = OnePlane(out, 8);
  const Planes src = OnePlane(source, 8);
  for (const MRECT& rect : {MRECT{0, 4, 8, 4}, MRECT{0, 5, 8, 4}, MRECT{4, 0, 4, 8},
                            MRECT{5, 0, 4, 8}, MRECT{0, 0, 0, 0}}) {
    EXPECT_EQ(ANY_ANY_C_SLOW(&rect, dst.pitch, src.pitch, dst.plane, src.plane, &engine.context()),
              KESTREL_OK);
    EXPECT_EQ(out, Bytes(64, 0xEE)) << testing::PrintToString(rect);
  }
  const MRECT rect = {2, 3, 4, 5};
  Planes start = dst;
  start.plane[0] += 3 * 8 + 2;
  EXPECT_EQ(ANY_ANY_C_SLOW(&rect, dst.pitch, src.pitch, start.plane, src.plane, &engine.context()),
            KESTREL_OK);
  EXPECT_EQ(std::count(out.begin(), out.end(), 1), 4);
  EXPECT_EQ(out[27], 1);
}

TEST(Planes, ThatAreNeededAndNullKeepTheGenericConverterFromWriting) {
  const Engine engine({FORMAT_I444, 2, 2}, {FORMAT_I444, 2, 2});
  Bytes a(4, 1), b(4, 2), c(4, 3), outA(4, 0xEE), outB(4, 0xEE), outC(4, 0xEE);
  const MRECT rect = {0, 0, 2, 2};
  for (int hole = 0; hole < 6; ++hole) {
    Planes src = ThreePlanes(a, 2, b, c, 2);
    Planes dst = ThreePlanes(outA, 2, outB, outC, 2);
    (hole < 3 ? src : dst).plane[hole % 3] = nullptr;
    EXPECT_EQ(ANY_ANY_C_SLOW(&rect, dst.pitch, src.pitch, dst.plane, src.plane, &engine.context()),
              KESTREL_OK);
    for (const Bytes* out : {&outA, &outB, &outC}) EXPECT_EQ(*out, Bytes(4, 0xEE)) << hole;
  }
}

TEST(Transforms, PlaceEveryPixel) {
  const Bytes source = {'a', 'b', 'c', 'd', 'e', 'f'};
  const struct {
    uint32_t code;
    int32_t width, height;
    const char* expected;
  } rows[] = {{0, 3, 2, "abcdef"}, {1, 2, 3, "adbecf"}, {2, 3, 2, "cbafed"}, {3, 2, 3, "daebfc"},
              {4, 3, 2, "defabc"}, {5, 2, 3, "cfbead"}, {6, 3, 2, "fedcba"}, {7, 2, 3, "fcebda"}};
  for (const auto& row : rows) {
    for (uint32_t mode : {1u, 2u, 3u, MPP_PASS_TILED}) {
      const Bytes out =
          ScaleGrey(row.width, row.height, 3, 2, source, Param().Transform(row.code).Pass(mode));
      EXPECT_EQ(std::string(out.begin(), out.end()), row.expected) << row.code << " " << mode;
    }
  }
}

// ---- RGB ----

TEST(Rgb, ChannelsNarrowerThanAByteAreFilledWithZerosBelow) {
  const Side dst = {FORMAT_BGR888, 1, 1};
  const Side src = {FORMAT_RGB565, 1, 1};
  EXPECT_EQ(Convert(dst, 3, src, 2, {0x00, 0xF8}), (Bytes{248, 0, 0}));
  EXPECT_EQ(Convert(dst, 3, src, 2, {0xE0, 0x07}), (Bytes{0, 252, 0}));
  EXPECT_EQ(Convert(dst, 3, src, 2, {0x1F, 0x00}), (Bytes{0, 0, 248}));
  EXPECT_EQ(Convert(dst, 3, src, 2, {0x21, 0x08}), (Bytes{8, 4, 8}));
  EXPECT_EQ(Convert(dst, 3, {FORMAT_BGR565, 1, 1}, 2, {0x00, 0xF8}), (Bytes{0, 0, 248}));
  EXPECT_EQ(Convert(dst, 3, {FORMAT_RGB666, 1, 1}, 3, {0xFF, 0xFF, 0x03}), (Bytes{252, 252, 252}));
  EXPECT_EQ(Convert(dst, 3, {FORMAT_BGR666, 1, 1}, 3, {0x3F, 0x00, 0x00}), (Bytes{252, 0, 0}));
}

TEST(Rgb, ValuesAreCutToNarrowerChannels) {
  const Side dst = {FORMAT_RGB565, 1, 1};
  const Side src = {FORMAT_BGR888, 1, 1};
  EXPECT_EQ(Convert(dst, 2, src, 3, {255, 255, 255}), (Bytes{0xFF, 0xFF}));
  EXPECT_EQ(Convert(dst, 2, src, 3, {7, 3, 7}), (Bytes{0, 0}));
  EXPECT_EQ(Convert(dst, 2, src, 3, {8, 4, 8}), (Bytes{0x21, 0x08}));
  EXPECT_EQ(Convert({FORMAT_BGR565, 1, 1}, 2, src, 3, {255, 0, 0}), (Bytes{0x1F, 0x00}));
  EXPECT_EQ(Convert({FORMAT_RGB666, 1, 1}, 3, src, 3, {4, 8, 12}), (Bytes{0x83, 0x10, 0x00}));
}

TEST(Rgb, ChannelsAreInterpolatedEach) {
  EXPECT_EQ(Convert({FORMAT_BGR888, 4, 1}, 12, {FORMAT_BGR888, 2, 1}, 6, {0, 100, 200, 100, 0, 50},
                    Param().Bilinear()),
            (Bytes{0, 100, 200, 25, 75, 162, 75, 25, 87, 100, 0, 50}));
}

TEST(Rgb, OfUnusualWidthsIsSafe) {
  // Channels of 16 bits: their top 8 bits are the value, and a channel without bits reads as 0.
  const Bytes out = Convert({FORMAT_BGR888, 1, 1}, 3, {0x17000FFF, 1, 1}, 4, {1, 0x22, 3, 0x44});
  EXPECT_EQ(out, (Bytes{0, 0x44, 0x22}));
  for (uint32_t code : {0x17000FFFu, 0x17001FFFu, 0x15000FFFu, 0x16000F0Fu, 0x35000777u,
                        0x15000000u, 0x37000FFFu}) {
    for (uint32_t other : {FORMAT_NV21, FORMAT_XBGR8888, FORMAT_RGB565, FORMAT_GRAY8, code}) {
      for (bool toCode : {false, true}) {
        const Engine engine({toCode ? code : other, 5, 3}, {toCode ? other : code, 3, 5},
                            Param().Bilinear());
        ASSERT_EQ(engine.result(), KESTREL_OK);
        Bytes a(5 * 4 * 5, 0x5A), b(5 * 4 * 5, 0xA5), c(64), d(64);
        const Planes dst = {{b.data(), d.data(), d.data() + 1}, {20, 8, 8}};
        const Planes src = {{a.data(), c.data(), c.data() + 1}, {20, 8, 8}};
        EXPECT_EQ(Process(engine, dst, src), KESTREL_OK);
      }
    }
  }
}

// ---- the spare byte ----

TEST(Alpha, IsTheEnginesForYuvAndGreySources) {
  const Param param = Param().Alpha(0xAB);
  EXPECT_EQ(Convert({FORMAT_XBGR8888, 2, 1}, 8, {kFullGrey, 2, 1}, 2, {5, 6}, param),
            (Bytes{5, 5, 5, 0xAB, 6, 6, 6, 0xAB}));
  EXPECT_EQ(Convert({FORMAT_XRGB8888, 1, 1}, 4, {FORMAT_YUV444 | FORMAT_BT601_FULL, 1, 1}, 3,
                    {9, 128, 128}, param),
            (Bytes{9, 9, 9, 0xAB}));
  EXPECT_EQ(Convert({FORMAT_XBGR8888, 1, 1}, 4, {kFullGrey, 1, 1}, 1, {5}), (Bytes{5, 5, 5, 0}));
  EXPECT_EQ(Convert({0x37004777, 1, 1}, 4, {kFullGrey, 1, 1}, 1, {5}, param),
            (Bytes{0xAB, 5, 5, 5}))
      << "the byte that no channel covers";
}

TEST(Alpha, IsTheFourthByteOfA32BitSource) {
  const Param param = Param().Alpha(0xAB);
  EXPECT_EQ(Convert({FORMAT_XRGB8888, 1, 1}, 4, {FORMAT_XBGR8888, 1, 1}, 4, {1, 2, 3, 4}, param),
            (Bytes{3, 2, 1, 4}));
  EXPECT_EQ(Convert({FORMAT_XBGR8888, 1, 1}, 4, {0x37004777, 1, 1}, 4, {1, 2, 3, 4}, param),
            (Bytes{4, 3, 2, 1}));
  EXPECT_EQ(Convert({0x37005777, 1, 1}, 4, {FORMAT_XBGR8888, 1, 1}, 4, {1, 2, 3, 4}, param),
            (Bytes{4, 1, 2, 3}));
  EXPECT_EQ(Convert({FORMAT_BGRX8888, 1, 1}, 4, {FORMAT_RGBX8888, 1, 1}, 4, {1, 2, 3, 4}, param),
            (Bytes{3, 2, 1, 4}));
}

TEST(Alpha, OfA32BitSourceIsNotInterpolated) {
  // Channel 1/4 and 3/4 between, the fourth byte from the pixel at the truncated position.
  const Bytes out = Convert({FORMAT_XBGR8888, 4, 1}, 16, {FORMAT_XBGR8888, 2, 1}, 8,
                            {0, 0, 0, 10, 100, 100, 100, 90}, Param().Bilinear());
  EXPECT_EQ(out, (Bytes{0, 0, 0, 10, 25, 25, 25, 10, 75, 75, 75, 10, 100, 100, 100, 90}));
}

TEST(Alpha, IsZeroForRgbSourcesWithoutOne) {
  const uint8_t palette[8] = {1, 2, 3, 99, 4, 5, 6, 99};
  const Param param = Param().Alpha(0xAB);
  const Side dst = {FORMAT_XBGR8888, 1, 1};
  EXPECT_EQ(Convert(dst, 4, {FORMAT_BGR888, 1, 1}, 3, {1, 2, 3}, param), (Bytes{1, 2, 3, 0}));
  EXPECT_EQ(Convert(dst, 4, {FORMAT_RGB565, 1, 1}, 2, {0xFF, 0xFF}, param),
            (Bytes{248, 252, 248, 0}));
  EXPECT_EQ(Convert(dst, 4, {FORMAT_RGB666, 1, 1}, 3, {0xFF, 0xFF, 3}, param),
            (Bytes{252, 252, 252, 0}));
  EXPECT_EQ(Convert(dst, 4, {FORMAT_INDEX1, 1, 1, palette}, 1, {0x80}, param), (Bytes{6, 5, 4, 0}));
}

// ---- palettes ----

const uint8_t kPalette[1024] = {10, 11, 12, 0, 20, 21, 22, 0, 30, 31, 32, 0, 40, 41, 42, 0};

TEST(Indexed, PixelsLieMostSignificantFirst) {
  const auto convert = [](uint32_t code, int32_t width, const Bytes& source) {
    const Bytes out = Convert({FORMAT_BGR888, width, 1}, width * 3, {code, width, 1, kPalette},
                              static_cast<int32_t>(source.size()), source);
    Bytes reds;
    for (size_t i = 0; i < out.size(); i += 3) {
      reds.push_back(out[i]);
      EXPECT_EQ(out[i + 1], out[i] - 1);
      EXPECT_EQ(out[i + 2], out[i] - 2);
    }
    return reds;
  };
  EXPECT_EQ(convert(FORMAT_INDEX1, 10, {0xB1, 0x40}),
            (Bytes{22, 12, 22, 22, 12, 12, 12, 22, 12, 22}));
  EXPECT_EQ(convert(FORMAT_INDEX4, 5, {0x01, 0x23, 0x10}), (Bytes{12, 22, 32, 42, 22}));
  EXPECT_EQ(convert(FORMAT_INDEX8, 3, {2, 0, 3}), (Bytes{32, 12, 42}));
}

TEST(Indexed, ColoursAreInterpolatedNotIndices) {
  uint8_t palette[1024] = {};
  palette[4 * 9] = 100;  // blue of entry 9
  EXPECT_EQ(Convert({FORMAT_RGB888, 4, 1}, 12, {FORMAT_INDEX8, 2, 1, palette}, 2, {0, 9},
                    Param().Bilinear()),
            (Bytes{0, 0, 0, 25, 0, 0, 75, 0, 0, 100, 0, 0}));
}

TEST(Indexed, WithoutAPaletteIsBlack) {
  for (uint32_t code : {FORMAT_INDEX1, FORMAT_INDEX4, FORMAT_INDEX8}) {
    EXPECT_EQ(Convert({FORMAT_RGB888, 2, 1}, 6, {code, 2, 1}, 2, {0xFF, 0xFF}), Bytes(6, 0));
  }
}

TEST(Indexed, DestinationsOfOneByteAreZeroedAndOfLessStayAsTheyAre) {
  for (uint32_t src : {FORMAT_RGB888, FORMAT_YUV444}) {
    EXPECT_EQ(Convert({FORMAT_INDEX8, 2, 2}, 3, {src, 2, 2}, 6, Bytes(12, 200)),
              (Bytes{0, 0, 0xEE, 0, 0, 0xEE}));
    EXPECT_EQ(Convert({FORMAT_INDEX4, 2, 2}, 2, {src, 2, 2}, 6, Bytes(12, 200)), Bytes(4, 0xEE));
    EXPECT_EQ(Convert({FORMAT_INDEX1, 2, 2}, 2, {src, 2, 2}, 6, Bytes(12, 200)), Bytes(4, 0xEE));
  }
}

// ---- YUV layouts ----

// A row of three-byte Y U V pixels with Y = 1, 2, .., U = 101, .., V = 201, ..
Bytes CountingRow(uint8_t width) {
  Bytes row;
  for (uint8_t i = 1; i <= width; ++i)
    row.insert(row.end(), {i, uint8_t(100 + i), uint8_t(200 + i)});
  return row;
}

TEST(PackedYuv, OneRowInEveryOrder) {
  const struct {
    uint32_t code;
    Bytes bytes;  // of two pixels
  } rows[] = {{FORMAT_YUYV, {1, 102, 2, 202}},
              {FORMAT_YVYU, {1, 202, 2, 102}},
              {FORMAT_UYVY, {102, 1, 202, 2}},
              {FORMAT_VYUY, {202, 1, 102, 2}},
              {FORMAT_YUYV_SWAPPED_LUMA, {2, 102, 1, 202}},
              {FORMAT_YVYU_SWAPPED_LUMA, {2, 202, 1, 102}},
              {FORMAT_UYVY_SWAPPED_LUMA, {102, 2, 202, 1}},
              {FORMAT_VYUY_SWAPPED_LUMA, {202, 2, 102, 1}},
              {FORMAT_YUV444, {1, 101, 201, 2, 102, 202}},
              {FORMAT_YVU444, {1, 201, 101, 2, 202, 102}},
              {FORMAT_UVY444, {101, 201, 1, 102, 202, 2}},
              {FORMAT_VUY444, {201, 101, 1, 202, 102, 2}},
              {FORMAT_YUV_SPECIAL8, {1, 0xEE, 102, 202}},
              {FORMAT_YUV_SPECIAL9, {1, 101, 201, 0xEE, 2, 102, 202, 0xEE}}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.code);
    const auto pitch = static_cast<int32_t>(row.bytes.size());
    EXPECT_EQ(Convert({row.code, 2, 1}, pitch, {FORMAT_YUV444, 2, 1}, 6, CountingRow(2)),
              row.bytes);
  }
}

TEST(PackedYuv, IsReadInEveryOrder) {
  const Side dst = {FORMAT_YUV444, 2, 1};
  const Bytes pair = {1, 50, 90, 2, 50, 90};
  const struct {
    uint32_t code;
    Bytes bytes;
  } rows[] = {{FORMAT_YUYV, {1, 50, 2, 90}},
              {FORMAT_YVYU, {1, 90, 2, 50}},
              {FORMAT_UYVY, {50, 1, 90, 2}},
              {FORMAT_VYUY, {90, 1, 50, 2}},
              {FORMAT_YUYV_SWAPPED_LUMA, {2, 50, 1, 90}},
              {FORMAT_YVYU_SWAPPED_LUMA, {2, 90, 1, 50}},
              {FORMAT_UYVY_SWAPPED_LUMA, {50, 2, 90, 1}},
              {FORMAT_VYUY_SWAPPED_LUMA, {90, 2, 50, 1}},
              {FORMAT_YUV444, {1, 50, 90, 2, 50, 90}},
              {FORMAT_YVU444, {1, 90, 50, 2, 90, 50}},
              {FORMAT_UVY444, {50, 90, 1, 50, 90, 2}},
              {FORMAT_VUY444, {90, 50, 1, 90, 50, 2}},
              {FORMAT_YUV_SPECIAL9, {1, 50, 90, 77, 2, 50, 90, 77}}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.code);
    EXPECT_EQ(Convert(dst, 6, {row.code, 2, 1}, static_cast<int32_t>(row.bytes.size()), row.bytes),
              pair);
  }
  // Byte 2 is both the odd luma and U.
  EXPECT_EQ(Convert(dst, 6, {FORMAT_YUV_SPECIAL8, 2, 1}, 4, {1, 77, 50, 90}),
            (Bytes{1, 50, 90, 50, 50, 90}));
}

TEST(PackedYuv, OfOddWidthLeavesTheMissingLumaAsItWas) {
  const Side src = {FORMAT_YUV444, 3, 1};
  EXPECT_EQ(Convert({FORMAT_YUYV, 3, 1}, 8, src, 9, CountingRow(3)),
            (Bytes{1, 102, 2, 202, 3, 103, 0xEE, 203}));
  EXPECT_EQ(Convert({FORMAT_UYVY, 3, 1}, 8, src, 9, CountingRow(3)),
            (Bytes{102, 1, 202, 2, 103, 3, 203, 0xEE}));
  EXPECT_EQ(Convert({FORMAT_YUYV_SWAPPED_LUMA, 3, 1}, 8, src, 9, CountingRow(3)),
            (Bytes{2, 102, 1, 202, 0xEE, 103, 3, 203}));
}

TEST(PackedYuv, ExchangedLumasAreThoseOfTheAbsoluteColumn) {
  // Drawn from column 1: column 1 is byte 0 of the first group, column 2 the later luma of the
  // next.
  const MRECT rect = {1, 0, 3, 1};
  EXPECT_EQ(Convert({FORMAT_YVYU_SWAPPED_LUMA, 4, 1}, 8, {FORMAT_YUV444, 4, 1}, 12, CountingRow(4),
                    Param(), &rect),
            (Bytes{2, 202, 0xEE, 102, 0xEE, 203, 3, 103}));
  // Read from column 1 on.
  EXPECT_EQ(Convert({kGrey, 2, 1}, 2, {FORMAT_YVYU_SWAPPED_LUMA, 2, 1}, 8,
                    {11, 0, 10, 0, 13, 0, 12, 0}, Param().SrcOrigin(1, 0)),
            (Bytes{11, 12}));
}

TEST(PackedYuv, ExchangedLumasStayExchangedUnderEveryTransform) {
  const uint32_t pairs[][2] = {{FORMAT_YUYV, FORMAT_YUYV_SWAPPED_LUMA},
                               {FORMAT_YVYU, FORMAT_YVYU_SWAPPED_LUMA},
                               {FORMAT_UYVY, FORMAT_UYVY_SWAPPED_LUMA},
                               {FORMAT_VYUY, FORMAT_VYUY_SWAPPED_LUMA}};
  for (const auto& pair : pairs) {
    for (uint32_t transform = 0; transform < 8; ++transform) {
      for (uint32_t mode : {1u, MPP_PASS_TILED}) {
        SCOPED_TRACE(testing::Message() << std::hex << pair[1] << " " << transform << " " << mode);
        const bool swapped = (transform & MPP_SWAP_XY) != 0;
        const Side src = {FORMAT_YUV444, swapped ? 2 : 4, swapped ? 4 : 2};
        const Param param = Param().Transform(transform).Pass(mode);
        const auto convert = [&](uint32_t code) {
          return Convert({code, 4, 2}, 8, src, src.width * 3, CountingRow(8), param);
        };
        Bytes plain = convert(pair[0]);
        const size_t luma = pair[0] == FORMAT_YUYV || pair[0] == FORMAT_YVYU ? 0 : 1;
        for (size_t i = luma; i < plain.size(); i += 4) std::swap(plain[i], plain[i + 2]);
        EXPECT_EQ(convert(pair[1]), plain);
      }
    }
  }
}

TEST(PackedYuv, ChromaColumnsOfYuyvAloneCountFromTheLeftEdge) {
  const MRECT rect = {1, 0, 4, 1};
  const Side src = {FORMAT_YUV444, 4, 1};
  // Column 2 still belongs to the first pair when the count starts at column 1.
  EXPECT_EQ(Convert({FORMAT_YUYV, 4, 1}, 8, src, 12, CountingRow(4), Param(), &rect),
            (Bytes{0xEE, 103, 2, 203, 3, 104, 4, 204}));
  EXPECT_EQ(Convert({FORMAT_YVYU, 4, 1}, 8, src, 12, CountingRow(4), Param(), &rect),
            (Bytes{0xEE, 202, 2, 102, 3, 204, 4, 104}));
  EXPECT_EQ(Convert({FORMAT_UYVY, 4, 1}, 8, src, 12, CountingRow(4), Param(), &rect),
            (Bytes{102, 0xEE, 202, 2, 104, 3, 204, 4}));
}

TEST(PlanarYuv, ChromaIsThatOfTheLastPixelOfItsBlock) {
  // 3 x 3 pixels of three bytes: U and V count the pixels.
  Bytes source;
  for (uint8_t i = 0; i < 9; ++i)
    source.insert(source.end(), {uint8_t(10 + i), i, uint8_t(100 + i)});
  const struct {
    uint32_t code;
    int32_t chromaWidth, chromaHeight;
    Bytes pixels;  // which pixel each chroma sample comes from
  } rows[] = {{FORMAT_I420, 2, 2, {4, 5, 7, 8}},
              {FORMAT_I422, 2, 3, {1, 2, 4, 5, 7, 8}},
              {FORMAT_I440, 3, 2, {3, 4, 5, 6, 7, 8}},
              {FORMAT_I444, 3, 3, {0, 1, 2, 3, 4, 5, 6, 7, 8}},
              {0x50000822, 1, 1, {8}},
              {0x50000821, 1, 2, {5, 8}}};
  for (const auto& row : rows) {
    for (bool vFirst : {false, true}) {
      SCOPED_TRACE(testing::Message() << std::hex << row.code << vFirst);
      const Engine engine({row.code | (vFirst ? 0x200u : 0u), 3, 3}, {FORMAT_YUV444, 3, 3});
      ASSERT_EQ(engine.result(), KESTREL_OK);
      Bytes luma(9), second(row.pixels.size()), third(row.pixels.size());
      ASSERT_EQ(Process(engine, ThreePlanes(luma, 3, second, third, row.chromaWidth),
                        OnePlane(source, 9)),
                KESTREL_OK);
      EXPECT_EQ(luma, (Bytes{10, 11, 12, 13, 14, 15, 16, 17, 18}));
      Bytes v;
      for (uint8_t pixel : row.pixels) v.push_back(uint8_t(100 + pixel));
      EXPECT_EQ(vFirst ? third : second, row.pixels);
      EXPECT_EQ(vFirst ? second : third, v);
    }
  }
}

TEST(SemiPlanarYuv, PairsAreVFirstOrUFirst) {
  Bytes source;
  for (uint8_t i = 0; i < 9; ++i)
    source.insert(source.end(), {uint8_t(10 + i), i, uint8_t(100 + i)});
  const struct {
    uint32_t code;
    bool vFirst;
    Bytes chroma;
  } rows[] = {{FORMAT_NV21, true, {104, 4, 105, 5, 107, 7, 108, 8}},
              {FORMAT_NV12, false, {4, 104, 5, 105, 7, 107, 8, 108}},
              {FORMAT_NV61, true, {101, 1, 102, 2, 104, 4, 105, 5, 107, 7, 108, 8}},
              {FORMAT_NV16, false, {1, 101, 2, 102, 4, 104, 5, 105, 7, 107, 8, 108}}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.code);
    Bytes luma(9), chroma(row.chroma.size());
    const Planes planes = row.vFirst ? VFirst(luma, 3, chroma, 4) : UFirst(luma, 3, chroma, 4);
    const Engine to({row.code, 3, 3}, {FORMAT_YUV444, 3, 3});
    ASSERT_EQ(Process(to, planes, OnePlane(source, 9)), KESTREL_OK);
    EXPECT_EQ(luma, (Bytes{10, 11, 12, 13, 14, 15, 16, 17, 18}));
    EXPECT_EQ(chroma, row.chroma);

    const Engine from({FORMAT_YUV444, 3, 3}, {row.code, 3, 3});
    Bytes back(27);
    ASSERT_EQ(Process(from, OnePlane(back, 9), planes), KESTREL_OK);
    for (size_t i = 0; i < 9; ++i) {
      const size_t chromaRow = row.chroma.size() == 8 ? i / 3 / 2 : i / 3;
      const size_t at = chromaRow * 4 + i % 3 / 2 * 2;
      EXPECT_EQ(back[3 * i], 10 + i);
      EXPECT_EQ(back[3 * i + 1], row.chroma[at + (row.vFirst ? 1 : 0)]);
      EXPECT_EQ(back[3 * i + 2], row.chroma[at + (row.vFirst ? 0 : 1)]);
    }
  }
}

TEST(YuvUpscaling, InterpolatesLumaOnlyAndRepeatsChroma) {
  const Engine engine({FORMAT_I420, 4, 4}, {FORMAT_I420, 2, 2}, Param().Bilinear());
  Bytes luma = {0, 100, 200, 50}, u = {7}, v = {9}, outLuma(16), outU(4), outV(4);
  ASSERT_EQ(Process(engine, ThreePlanes(outLuma, 4, outU, outV, 2), ThreePlanes(luma, 2, u, v, 1)),
            KESTREL_OK);
  EXPECT_EQ(outLuma, (Bytes{0, 25, 75, 100, 50, 59, 78, 87, 150, 127, 84, 62, 200, 162, 87, 50}));
  EXPECT_EQ(outU, Bytes(4, 7));
  EXPECT_EQ(outV, Bytes(4, 9));

  // Two chroma columns of a 4 x 1 image, doubled: chroma follows the truncated luma position.
  const Engine wide({FORMAT_YUV444, 8, 1}, {FORMAT_I422, 4, 1}, Param().Bilinear());
  Bytes luma4 = {0, 40, 80, 120}, u2 = {10, 20}, v2 = {30, 40}, out(24);
  ASSERT_EQ(Process(wide, OnePlane(out, 24), ThreePlanes(luma4, 4, u2, v2, 2)), KESTREL_OK);
  const Bytes expectedLuma = {0, 10, 30, 50, 70, 90, 110, 120};
  const Bytes expectedU = {10, 10, 10, 10, 10, 20, 20, 20};
  for (size_t i = 0; i < 8; ++i) {
    EXPECT_EQ(out[3 * i], expectedLuma[i]) << i;
    EXPECT_EQ(out[3 * i + 1], expectedU[i]) << i;
    EXPECT_EQ(out[3 * i + 2], expectedU[i] + 20) << i;
  }
}

TEST(Grey, HasNeutralChroma) {
  EXPECT_EQ(Convert({FORMAT_YUV444, 2, 1}, 6, {kGrey, 2, 1}, 2, {3, 200}),
            (Bytes{3, 128, 128, 200, 128, 128}));
  EXPECT_EQ(Convert({FORMAT_YUYV, 2, 1}, 4, {kGrey, 2, 1}, 2, {3, 200}), (Bytes{3, 128, 200, 128}));
}

TEST(RgbToPlanar, ChromaIsThatOfTheBottomRightPixel) {
  // Black but for one blue pixel at the bottom right (bytes B G R). BT.601 full range:
  // Y 255*7471 >> 16 = 29, U (8388608 + 255*32768) >> 16 = 255, V (8388608 - 255*5329) >> 16 = 107.
  Bytes source(12);
  source[9] = 255;
  const Engine engine({FORMAT_I420 | FORMAT_BT601_FULL, 2, 2}, {FORMAT_RGB888, 2, 2});
  Bytes luma(4), u(1), v(1);
  ASSERT_EQ(Process(engine, ThreePlanes(luma, 2, u, v, 1), OnePlane(source, 6)), KESTREL_OK);
  EXPECT_EQ(luma, (Bytes{0, 0, 0, 29}));
  EXPECT_EQ(u, Bytes{255});
  EXPECT_EQ(v, Bytes{107});
}

TEST(RangeChange, GoesThroughTheLevelMaps) {
  EXPECT_EQ(Convert({FORMAT_YUV444, 2, 1}, 6, {FORMAT_YUV444 | FORMAT_BT601_FULL, 2, 1}, 6,
                    {0, 0, 255, 255, 128, 128}),
            (Bytes{16, 16, 239, 234, 128, 128}));
  EXPECT_EQ(Convert({FORMAT_YUV444 | FORMAT_BT601_FULL, 2, 1}, 6, {FORMAT_YUV444, 2, 1}, 6,
                    {16, 16, 240, 235, 128, 128}),
            (Bytes{37, 0, 255, 255, 128, 128}));
}

// ---- error carry ----

// 16-bit words of an unscaled full-range grey image, drawn in the given rectangles.
std::vector<unsigned> Carry(int32_t width, int32_t height, const Bytes& grey, const MPPPARAM& param,
                            std::vector<MRECT> rects = {}, uint32_t code = FORMAT_RGB565) {
  const bool swapped = (param.transformCode & MPP_SWAP_XY) != 0;
  const int32_t srcWidth = swapped ? height : width;
  const Engine engine({code, width, height}, {kFullGrey, srcWidth, swapped ? width : height},
                      param);
  EXPECT_EQ(engine.result(), KESTREL_OK);
  Bytes source = grey;
  Bytes out(static_cast<size_t>(width * height * 2));
  if (rects.empty()) rects.push_back({0, 0, width, height});
  for (const MRECT& rect : rects) {
    EXPECT_EQ(Process(engine, OnePlane(out, width * 2), OnePlane(source, srcWidth), &rect),
              KESTREL_OK);
  }
  std::vector<unsigned> words;
  for (size_t i = 0; i < out.size(); i += 2) words.push_back(out[i] | unsigned{out[i + 1]} << 8);
  return words;
}

std::vector<unsigned> Words(const std::vector<unsigned>& five, const std::vector<unsigned>& six) {
  std::vector<unsigned> words;
  for (size_t i = 0; i < five.size(); ++i) words.push_back(five[i] << 11 | six[i] << 5 | five[i]);
  return words;
}

TEST(ErrorCarry, RunsAlongTheScanAndAcrossRowEnds) {
  // Level 101. Red and blue start with 3: 104 gives 13 rest 0, 101 gives 12 rest 5, 106 13 r 2,
  // 103 12 r 7, 108 13 r 4, 105 13 r 1, 102 12 r 6, 107 13 r 3, and again. Green starts with 1:
  // 102 gives 25 rest 2, 103 25 r 3, 104 26 r 0, 101 25 r 1.
  EXPECT_EQ(Carry(3, 3, Bytes(9, 101), Param().Dither()),
            Words({13, 12, 13, 12, 13, 13, 12, 13, 13}, {25, 25, 26, 25, 25, 25, 26, 25, 25}));
}

TEST(ErrorCarry, IsOffWithoutTheSwitch) {
  EXPECT_EQ(Carry(3, 1, Bytes(3, 103), Param()), Words({12, 12, 12}, {25, 25, 25}));
}

TEST(ErrorCarry, FollowsTheLoopOfASwappedJob) {
  // Loop rows are destination columns.
  EXPECT_EQ(Carry(3, 3, Bytes(9, 101), Param().Dither().Transform(1)),
            Words({13, 12, 12, 12, 13, 13, 13, 13, 13}, {25, 25, 26, 25, 25, 25, 26, 25, 25}));
}

TEST(ErrorCarry, StartsAfreshWithEachJob) {
  EXPECT_EQ(Carry(2, 2, Bytes(4, 101), Param().Dither(), {{0, 0, 2, 1}, {0, 1, 2, 2}}),
            Words({13, 12, 13, 12}, {25, 25, 25, 25}));
  // Bands of a swapped job are jobs of their own: rows 0 to 31, then 32 and 33.
  const std::vector<unsigned> words = Carry(1, 34, Bytes(34, 101), Param().Dither().Transform(1));
  const unsigned five[8] = {13, 12, 13, 12, 13, 13, 12, 13};
  const unsigned six[4] = {25, 25, 26, 25};
  for (size_t i = 0; i < 34; ++i) {
    const size_t at = i < 32 ? i : i - 32;
    EXPECT_EQ(words[i], five[at % 8] << 11 | six[at % 4] << 5 | five[at % 8]) << i;
  }
}

TEST(ErrorCarry, RestartsAtTheBandOf32RowsButNotInBandsOf64) {
  // Levels 100 with one 104 in row 3: from there on the alternation is turned round, until a new
  // job starts at row 32.
  Bytes grey(36, 100);
  grey[3] = 104;
  const auto low = Carry(1, 36, grey, Param().Dither().Transform(1).Band(5));
  const auto tall = Carry(1, 36, grey, Param().Dither().Transform(1).Band(4));
  // Rows 0 1 2: 103 -> 12 r 7, 107 -> 13 r 3, 103 -> 12 r 7; row 3: 111 -> 13 r 7; then 107 -> 13
  // r 3, 103 -> 12 r 7, ..: odd rows 12 from row 5 on.
  EXPECT_EQ(low[2] >> 11, 12u);
  EXPECT_EQ(low[3] >> 11, 13u);
  EXPECT_EQ(low[4] >> 11, 13u);
  EXPECT_EQ(low[5] >> 11, 12u);
  EXPECT_EQ(low[31] >> 11, 12u);
  EXPECT_EQ(tall[31] >> 11, 12u);
  EXPECT_EQ(low[32] >> 11, 12u) << "a job of its own";
  EXPECT_EQ(low[33] >> 11, 13u);
  EXPECT_EQ(tall[32] >> 11, 13u) << "the same job";
  EXPECT_EQ(tall[33] >> 11, 12u);
}

// In the generic converter: one kernel carries the remainders of 24-bit RGB at 1:1.
TEST(ErrorCarry, IsForYuvSourcesOnly) {
  Bytes source(9, 103);
  const Engine engine({FORMAT_RGB565, 3, 1}, {FORMAT_RGB888, 3, 1}, Param().Dither());
  Bytes pixels(6);
  const MRECT rect = {0, 0, 3, 1};
  const int32_t dstPitches[3] = {6, 0, 0};
  const int32_t srcPitches[3] = {9, 0, 0};
  uint8_t* const dstPlanes[3] = {pixels.data(), nullptr, nullptr};
  const uint8_t* const srcPlanes[3] = {source.data(), nullptr, nullptr};
  EXPECT_EQ(ANY_ANY_C_SLOW(&rect, dstPitches, srcPitches, dstPlanes, srcPlanes, &engine.context()),
            KESTREL_OK);
  EXPECT_EQ(pixels, (Bytes{0x2C, 0x63, 0x2C, 0x63, 0x2C, 0x63}));
}

TEST(ErrorCarry, UsesTheWidthOfEachChannelWhateverTheOrder) {
  EXPECT_EQ(Carry(3, 1, Bytes(3, 101), Param().Dither(), {}, FORMAT_BGR565),
            Words({13, 12, 13}, {25, 25, 26}));
}

// ---- mirrored chroma at odd sizes ----

TEST(MirroredChroma, OfOddWidthsFollowsTheMirroredWalk) {
  // Columns 2, 1, 0 are drawn in this order; the walk pairs its own columns 0 and 1.
  const Engine engine({FORMAT_I422, 3, 1}, {FORMAT_YUV444, 3, 1}, Param().Transform(2));
  Bytes source = CountingRow(3), luma(3), u(2), v(2);
  ASSERT_EQ(Process(engine, ThreePlanes(luma, 3, u, v, 2), OnePlane(source, 9)), KESTREL_OK);
  EXPECT_EQ(luma, (Bytes{3, 2, 1}));
  EXPECT_EQ(u, (Bytes{103, 102}));
  EXPECT_EQ(v, (Bytes{203, 202}));
}

TEST(MirroredChroma, ThatWouldLandBeforeColumnZeroIsDropped) {
  // Columns 1 and 0 of a mirrored width of 3: the walk calls them 1 and 2, of two chroma pairs, but
  // the start address is that of column 1, in the first pair. The second pair has no place.
  const Engine engine({FORMAT_I422, 3, 2}, {FORMAT_YUV444, 3, 2}, Param().Transform(2));
  Bytes source = CountingRow(6), luma(6, 0xEE), u(6, 0xEE), v(6, 0xEE);
  Planes dst = ThreePlanes(luma, 3, u, v, 2);
  dst.plane[1] += 2;  // two rows of two samples with a margin on both sides
  dst.plane[2] += 2;
  const MRECT rect = {0, 0, 2, 2};
  ASSERT_EQ(Process(engine, dst, OnePlane(source, 9), &rect), KESTREL_OK);
  EXPECT_EQ(luma, (Bytes{3, 2, 0xEE, 6, 5, 0xEE}));
  // Row 1's column -1 is not the end of row 0.
  EXPECT_EQ(u, (Bytes{0xEE, 0xEE, 102, 0xEE, 105, 0xEE}));
  EXPECT_EQ(v, (Bytes{0xEE, 0xEE, 202, 0xEE, 205, 0xEE}));
}

TEST(MirroredChroma, ThatWouldLandAboveRowZeroIsDropped) {
  const Engine engine({FORMAT_I440, 1, 3}, {FORMAT_YUV444, 1, 3}, Param().Transform(4));
  Bytes source = CountingRow(3), luma(3, 0xEE), u(4, 0xEE), v(4, 0xEE);
  Planes dst = ThreePlanes(luma, 1, u, v, 1);
  dst.plane[1] += 2;
  dst.plane[2] += 2;
  const MRECT rect = {0, 0, 1, 2};
  ASSERT_EQ(Process(engine, dst, OnePlane(source, 3), &rect), KESTREL_OK);
  EXPECT_EQ(luma, (Bytes{3, 2, 0xEE}));
  EXPECT_EQ(u, (Bytes{0xEE, 0xEE, 102, 0xEE}));
  EXPECT_EQ(v, (Bytes{0xEE, 0xEE, 202, 0xEE}));
}

// ---- pitches ----

// A mirrored region that begins above the plane ends there, in the middle of the walk.
TEST(NegativeOrigins, LeaveWhatLiesAbovePackedPlanesAlone) {
  constexpr int32_t kSide = 32;
  constexpr int32_t kPitch = 2 * kSide;
  constexpr size_t kAbove = size_t{kPitch} * kSide;
  Bytes source(size_t{kSide} * kSide * 4, 0x11);
  for (const uint32_t dst : testing_support::PublicCodes<testing_support::HasPackedPairs>()) {
    for (const uint32_t src : {FORMAT_RGB565, FORMAT_RGB888, FORMAT_XBGR8888, FORMAT_YUYV,
                               FORMAT_UYVY, FORMAT_YUV444, FORMAT_GRAY8}) {
      SCOPED_TRACE(testing::Message() << std::hex << src << " to " << dst);
      Bytes bytes(kAbove + size_t{kPitch} * (kSide - 2), 0xEE);
      const Planes plane = {{bytes.data() + kAbove, nullptr, nullptr}, {kPitch, 0, 0}};
      const Engine engine({dst, kSide, kSide}, {src, kSide, kSide},
                          Param().Transform(MPP_MIRROR_Y).DstOrigin(0, -2));
      ASSERT_EQ(Process(engine, plane, OnePlane(source, 4 * kSide)), KESTREL_OK);
      const auto isUntouched = [](uint8_t byte) { return byte == 0xEE; };
      const auto top = bytes.begin() + kAbove;
      EXPECT_TRUE(std::all_of(bytes.begin(), top, isUntouched));
      EXPECT_TRUE(std::none_of(top, bytes.end(), isUntouched));
    }
  }
}

TEST(NegativePitches, WalkTheImageUpward) {
  Bytes source = {1, 2, 3, 4, 5, 6}, out(6);
  const Engine engine({kGrey, 2, 3}, {kGrey, 2, 3});
  Planes src = OnePlane(source, -2);
  src.plane[0] += 4;
  ASSERT_EQ(Process(engine, OnePlane(out, 2), src), KESTREL_OK);
  EXPECT_EQ(out, (Bytes{5, 6, 3, 4, 1, 2}));
  Planes dst = OnePlane(out, -2);
  dst.plane[0] += 4;
  ASSERT_EQ(Process(engine, dst, OnePlane(source, 2)), KESTREL_OK);
  EXPECT_EQ(out, (Bytes{5, 6, 3, 4, 1, 2}));
}

TEST(Padding, IsNeverWritten) {
  for (uint32_t code : {FORMAT_XBGR8888, FORMAT_RGB888, FORMAT_RGB565, FORMAT_YUV444, kGrey}) {
    for (uint32_t mode : {1u, MPP_PASS_TILED}) {
      const int32_t bytes = code == FORMAT_XBGR8888 ? 4
                            : code == FORMAT_RGB565 ? 2
                            : code == kGrey         ? 1
                                                    : 3;
      const Bytes out = Convert({code, 37, 11}, 37 * bytes + 5, {kGrey, 18, 5}, 18, Bytes(90, 50),
                                Param().Bilinear().Pass(mode));
      for (int32_t y = 0; y < 11; ++y) {
        for (int32_t i = 0; i < 5; ++i) {
          ASSERT_EQ(out[static_cast<size_t>((37 * bytes + 5) * y + 37 * bytes + i)], 0xEE);
        }
      }
    }
  }
}

}  // namespace
}  // namespace kestrel::test
