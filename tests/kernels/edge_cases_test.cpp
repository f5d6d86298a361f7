// The places where decisions and samples of the planar, YUYV and grey kernels are easily wrong.
#include <gtest/gtest.h>

#include <algorithm>
#include <initializer_list>
#include <vector>

#include "kernels/table/kernels.h"
#include "tests/exact/exact_support.h"
#include "tests/kernels/observer.h"

namespace kernel_tests {
namespace {

using kestrel::test::Bytes;
using kestrel::test::Engine;
using kestrel::test::OnePlane;
using kestrel::test::Param;
using kestrel::test::Planes;
using kestrel::test::Process;
using kestrel::test::ThreePlanes;
using kestrel::test::VFirst;

constexpr uint32_t kYuvCodes[] = {
    FORMAT_YUYV, FORMAT_YUV444, FORMAT_I420, FORMAT_I422, FORMAT_I440,  FORMAT_I444,
    FORMAT_YV12, FORMAT_NV21,   FORMAT_NV12, FORMAT_NV61, FORMAT_GRAY8,
};

// Each byte its own value, as long as there are enough values.
Bytes Counting(size_t size, int start = 0) {
  Bytes bytes(size);
  for (size_t i = 0; i < size; ++i) {
    bytes[i] = uint8_t(size_t(start) + i);
  }
  return bytes;
}

// Asks one dispatcher with a rectangle that holds no pixels.
Observed Ask(KernelFn* dispatcher, const EngineContext& context) {
  uint8_t bytes[8] = {};
  uint8_t* const planes[3] = {bytes, bytes + 4, bytes + 5};
  const int32_t pitches[3] = {2, 2, 2};
  const MRECT nothing = {0, 0, 0, 0};
  return Observe(dispatcher, &nothing, pitches, pitches, planes, planes, &context);
}

TEST(PlanarEdgeCases, ChangedLevelsAreDeclinedWhateverTheFormats) {
  for (const uint32_t src : kYuvCodes) {
    for (const uint32_t dst : kYuvCodes) {
      for (const uint32_t mode : {1u, 2u, 3u}) {
        const Engine adjusted({dst, 16, 16}, {src, 16, 16}, Param().Pass(mode).Adjust(20, 0, 0));
        ASSERT_NE(adjusted.context().needsLevelTable, 0u);
        const Observed observed = Ask(YUV2YUV_Fast, adjusted.context());
        EXPECT_EQ(observed.answer, KESTREL_UNSUPPORTED);
        EXPECT_EQ(observed.kernel, nullptr);
      }
    }
  }
}

TEST(PlanarEdgeCases, PlanarCopiesIgnoreChangedLevels) {
  for (const uint32_t code : {FORMAT_I420, FORMAT_I422, FORMAT_I440, FORMAT_I444}) {
    const Engine engine({code, 4, 4}, {code, 4, 4}, Param().Adjust(20, 0, 0));
    EXPECT_STREQ(Ask(I420_To_I422_Fast, engine.context()).kernel,
                 "YUV_To_YUV_NOREAMPLE_ROTATE_Fast");
    Bytes srcY = Counting(16, 40), srcU = Counting(16, 60), srcV = Counting(16, 80);
    Bytes dstY(16), dstU(16), dstV(16);
    ASSERT_EQ(
        Process(engine, ThreePlanes(dstY, 4, dstU, dstV, 4), ThreePlanes(srcY, 4, srcU, srcV, 4)),
        KESTREL_OK);
    EXPECT_EQ(dstY, srcY) << code;
  }
}

TEST(PlanarEdgeCases, UprightNv21CopiesIn4x4BlocksGoToTheSinglePixelKernel) {
  const Engine engine({FORMAT_NV21, 16, 16}, {FORMAT_NV21, 16, 16}, Param().Pass(3));
  ASSERT_EQ(engine.context().blockMode, 3u);
  EXPECT_STREQ(Ask(YUV2YUV_Fast, engine.context()).kernel, "NV21toNV21Fast_NORESAMPLE_R0_1x1");
}

TEST(PlanarEdgeCases, TurnedI420In4x4BlocksIsNotLeftToTheLaterDispatcher) {
  const Engine engine({FORMAT_I420, 16, 16}, {FORMAT_I420, 16, 16}, Param().Pass(3).Transform(3));
  EXPECT_STREQ(Ask(YUV2YUV_Fast, engine.context()).kernel, "I420_NORESAMPLE_4x4_R90");
  EXPECT_EQ(Ask(I420_To_I422_Fast, engine.context()).answer, KESTREL_OK) << "it would take it too";
  EXPECT_STREQ(AskChain(&engine.context()).kernel, "I420_NORESAMPLE_4x4_R90");
}

TEST(PlanarEdgeCases, GreyBecomesNeutralChroma) {
  for (const uint32_t mode : {1u, 2u, 3u}) {
    for (uint32_t transform = 0; transform < 8; ++transform) {
      const Engine engine({FORMAT_NV21, 8, 8}, {FORMAT_GRAY8, 8, 8},
                          Param().Pass(mode).Transform(transform));
      Bytes src = Counting(64), luma(64), chroma(32, 7);
      ASSERT_EQ(Process(engine, VFirst(luma, 8, chroma, 8), OnePlane(src, 8)), KESTREL_OK);
      EXPECT_EQ(chroma, Bytes(32, 128)) << "mode " << mode << ", transform " << transform;
    }
  }
}

TEST(PlanarEdgeCases, ReducedChromaIsThatOfTheOddRowAndColumn) {
  const Engine engine({FORMAT_NV21, 4, 4}, {FORMAT_I444, 4, 4});
  ASSERT_STREQ(AskChain(&engine.context()).kernel, "YUVtoNV21Fast_NORESAMPLE_R0_1x1");
  Bytes srcY(16), srcU = Counting(16, 100), srcV = Counting(16, 200), luma(16), chroma(8);
  ASSERT_EQ(Process(engine, VFirst(luma, 4, chroma, 4), ThreePlanes(srcY, 4, srcU, srcV, 4)),
            KESTREL_OK);
  // Samples 5, 7, 13 and 15 of each plane, V before U.
  EXPECT_EQ(chroma, (Bytes{205, 105, 207, 107, 213, 113, 215, 115}));
}

TEST(PlanarEdgeCases, OneColumnAtAnOddPlaceWritesItsWholePair) {
  const Engine engine({FORMAT_NV21, 8, 2}, {FORMAT_I420, 8, 2});
  Bytes srcY = Counting(16), srcU = Counting(4, 100), srcV = Counting(4, 200);
  Bytes luma(16, 77), chroma(8, 77);
  const MRECT column = {3, 0, 4, 2};
  ASSERT_EQ(
      Process(engine, VFirst(luma, 8, chroma, 8), ThreePlanes(srcY, 8, srcU, srcV, 4), &column),
      KESTREL_OK);
  Bytes expectedLuma(16, 77);
  expectedLuma[3] = srcY[3];
  expectedLuma[11] = srcY[11];
  EXPECT_EQ(luma, expectedLuma);
  EXPECT_EQ(chroma, (Bytes{77, 77, 201, 101, 77, 77, 77, 77}));
}

TEST(YuyvEdgeCases, PairsTakeUFromTheirFirstPixelAndVFromTheirSecond) {
  const Engine engine({FORMAT_YUYV, 16, 2}, {FORMAT_I420, 8, 1});
  ASSERT_STREQ(AskChain(&engine.context()).kernel, "I420_To_YUYV_Fast");
  Bytes srcY = Counting(8), srcU = Counting(4, 100), srcV = Counting(4, 200);
  Bytes dst(64, 77);
  // Groups of this rectangle hold the columns 1 and 2, 3 and 4, ...: sources 0 and 1, 1 and 2, ...
  const MRECT rect = {1, 0, 9, 1};
  ASSERT_EQ(Process(engine, OnePlane(dst, 32), ThreePlanes(srcY, 8, srcU, srcV, 4), &rect),
            KESTREL_OK);
  for (int group = 0; group < 4; ++group) {
    const int first = (1 + 2 * group) / 2;
    const int second = (2 + 2 * group) / 2;
    EXPECT_EQ(dst[4 * group + 1], 100 + first / 2) << "U of group " << group;
    EXPECT_EQ(dst[4 * group + 3], 200 + second / 2) << "V of group " << group;
  }
  EXPECT_EQ(dst[4 * 1 + 1], 100) << "a group whose two pixels lie on different samples";
  EXPECT_EQ(dst[4 * 1 + 3], 201);
}

TEST(YuyvEdgeCases, ColumnsBeforeTheCoveredRectangleRepeatTheFirstOne) {
  const Engine engine({FORMAT_YUYV, 16, 2}, {FORMAT_I420, 8, 1}, Param().SrcRect(3, 0, 8, 1));
  const int32_t coveredLeft = engine.context().dstRect.left;
  ASSERT_GT(coveredLeft, 4);
  Bytes srcY = Counting(8), srcU = Counting(4, 100), srcV = Counting(4, 200), dst(64);
  ASSERT_EQ(Process(engine, OnePlane(dst, 32), ThreePlanes(srcY, 8, srcU, srcV, 4)), KESTREL_OK);
  for (int32_t x = 0; x < coveredLeft; ++x) {
    EXPECT_EQ(dst[size_t(2 * x)], srcY[3]) << "column " << x;
  }
}

TEST(YuyvEdgeCases, BilinearRequestsAreDeclined) {
  for (const uint32_t src :
       {FORMAT_RGB888, FORMAT_GRAY8, FORMAT_I420, FORMAT_I422, FORMAT_I440, FORMAT_I444}) {
    for (const uint32_t mode : {1u, 2u, 3u}) {
      for (uint32_t transform = 0; transform < 8; ++transform) {
        const Engine bilinear({FORMAT_YUYV, 16, 16}, {src, 12, 12},
                              Param().Bilinear().Pass(mode).Transform(transform));
        EXPECT_EQ(Ask(YUV_YUV_C_FAST, bilinear.context()).answer, KESTREL_UNSUPPORTED);
        const Engine nearest({FORMAT_YUYV, 16, 16}, {src, 12, 12},
                             Param().Pass(mode).Transform(transform));
        EXPECT_EQ(Ask(YUV_YUV_C_FAST, nearest.context()).answer, KESTREL_OK);
      }
    }
  }
}

TEST(YuyvEdgeCases, MirroredOrScaledYuyvIsDeclined) {
  const Engine mirrored({FORMAT_YUYV, 16, 16}, {FORMAT_YUYV, 16, 16},
                        Param().Pass(3).Transform(MPP_MIRROR_X));
  EXPECT_EQ(Ask(YUV_YUV_C_FAST, mirrored.context()).answer, KESTREL_UNSUPPORTED);
  for (uint32_t transform = 0; transform < 8; ++transform) {
    const Engine scaled({FORMAT_YUYV, 16, 16}, {FORMAT_YUYV, 8, 8},
                        Param().Pass(3).Transform(transform));
    EXPECT_EQ(Ask(YUV_YUV_C_FAST, scaled.context()).answer, KESTREL_UNSUPPORTED);
  }
  const Engine copied({FORMAT_YUYV, 16, 16}, {FORMAT_YUYV, 16, 16}, Param().Pass(3));
  EXPECT_STREQ(Ask(YUV_YUV_C_FAST, copied.context()).kernel, "YUYVtoYUYVFast_NORESAMPLE");
}

TEST(YuyvEdgeCases, RedInTheLowestByteIsDeclined) {
  const Engine redLowest({FORMAT_YUYV, 16, 16}, {FORMAT_BGR888, 16, 16});
  EXPECT_EQ(Ask(YUV_YUV_C_FAST, redLowest.context()).answer, KESTREL_UNSUPPORTED);
  for (const uint32_t code : {FORMAT_RGB888, FORMAT_RGB666, FORMAT_BGR666}) {
    const Engine other({FORMAT_YUYV, 16, 16}, {code, 16, 16});
    EXPECT_EQ(Ask(YUV_YUV_C_FAST, other.context()).answer, KESTREL_OK);
  }
}

TEST(GreyEdgeCases, SwappedCopiesComeOutTransposed) {
  for (const uint32_t mode : {1u, 2u, 3u}) {
    const Engine engine({FORMAT_GRAY8, 4, 6}, {FORMAT_GRAY8, 6, 4},
                        Param().Pass(mode).Transform(MPP_SWAP_XY));
    EXPECT_STREQ(AskChain(&engine.context()).kernel, "Gray2Gray_C_NORESAMPLE_FAST");
    Bytes src = Counting(24), dst(24);
    ASSERT_EQ(Process(engine, OnePlane(dst, 4), OnePlane(src, 6)), KESTREL_OK);
    for (int y = 0; y < 6; ++y) {
      for (int x = 0; x < 4; ++x) {
        EXPECT_EQ(dst[size_t(4 * y + x)], src[size_t(6 * x + y)]);
      }
    }
  }
}

// A picture whose lines are 0, 100, 200, 40, each of one value.
Bytes Lines(int32_t width) {
  Bytes lines;
  for (const int value : {0, 100, 200, 40}) {
    lines.insert(lines.end(), size_t(width), uint8_t(value));
  }
  return lines;
}

// The values of the lines of a picture that is 2 x 2 times as large.
Bytes EnlargedLines(uint32_t mode) {
  const Engine engine({FORMAT_GRAY8, 8, 8}, {FORMAT_GRAY8, 4, 4}, Param().Bilinear().Pass(mode));
  Bytes src = Lines(4), dst(64);
  EXPECT_EQ(Process(engine, OnePlane(dst, 8), OnePlane(src, 4)), KESTREL_OK);
  Bytes values;
  for (size_t y = 0; y < 8; ++y) {
    EXPECT_EQ(Bytes(dst.begin() + long(8 * y), dst.begin() + long(8 * y + 8)),
              Bytes(8, dst[8 * y]));
    values.push_back(dst[8 * y]);
  }
  return values;
}

TEST(GreyEdgeCases, TheSecondRowOfAPairBlendsTowardTheLineBelowTheFirst) {
  const Engine engine({FORMAT_GRAY8, 8, 8}, {FORMAT_GRAY8, 4, 4}, Param().Bilinear().Pass(2));
  ASSERT_STREQ(AskChain(&engine.context()).kernel, "Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST");
  // Positions -0.25, 0.25 | 0.75, 1.25 | 1.75, 2.25 | 2.75, 3.25. The rows at 1.25 and 2.25 lie on
  // the line below the first row of their pair, so they are blended with that very line.
  const Bytes paired = {0, 25, 75, 100, 175, 200, 80, 40};
  EXPECT_EQ(EnlargedLines(2), paired);
  EXPECT_EQ(EnlargedLines(3), paired);
  EXPECT_EQ(EnlargedLines(1), (Bytes{0, 25, 75, 125, 175, 160, 80, 40})) << "row by row";
}

TEST(GreyEdgeCases, BilinearRowsPastTheBottomRepeatTheLastLine) {
  for (const uint32_t mode : {1u, 2u, 3u}) {
    const Engine engine({FORMAT_GRAY8, 8, 8}, {FORMAT_GRAY8, 4, 4},
                        Param().Bilinear().Pass(mode).SrcRect(0, 0, 4, 2));
    Bytes src = Lines(4), dst(64);
    ASSERT_EQ(Process(engine, OnePlane(dst, 8), OnePlane(src, 4)), KESTREL_OK);
    for (size_t y = 3; y < 8; ++y) {  // positions from 1.25 on
      EXPECT_EQ(dst[8 * y], 100) << "mode " << mode << ", row " << y;
    }
  }
}

TEST(GreyEdgeCases, NearestColumnsOutsideTheCoveredRectangleRepeatTheEdge) {
  const Engine engine({FORMAT_GRAY8, 16, 2}, {FORMAT_GRAY8, 8, 1}, Param().SrcRect(2, 0, 6, 1));
  ASSERT_STREQ(AskChain(&engine.context()).kernel, "Gray_To_Gray_Nearest_Fast");
  const MRECT covered = engine.context().dstRect;
  ASSERT_GT(covered.left, 0);
  ASSERT_LT(covered.right, 16);
  Bytes src = Counting(8), dst(32);
  ASSERT_EQ(Process(engine, OnePlane(dst, 16), OnePlane(src, 8)), KESTREL_OK);
  for (int32_t x = 0; x < 16; ++x) {
    const int expected = x < covered.left ? 2 : x >= covered.right - 1 ? 5 : x / 2;
    EXPECT_EQ(dst[size_t(x)], expected) << "column " << x;
  }
}

TEST(GreyEdgeCases, LumaOfPlanarYuvIsTakenByBilinear2x2EnginesOnly) {
  for (const uint32_t code : {FORMAT_I420, FORMAT_I422, FORMAT_I440, FORMAT_I444}) {
    const Engine engine({FORMAT_GRAY8, 8, 8}, {code, 4, 4}, Param().Bilinear().Pass(2));
    EXPECT_STREQ(Ask(Gray2Gray_C_FAST, engine.context()).kernel,
                 "Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST");
    Bytes srcY = Lines(4), someU(16, 1), someV(16, 2), otherU(16, 250), otherV(16, 99);
    Bytes dst(64), again(64);
    ASSERT_EQ(Process(engine, OnePlane(dst, 8), ThreePlanes(srcY, 4, someU, someV, 4)), KESTREL_OK);
    ASSERT_EQ(Process(engine, OnePlane(again, 8), ThreePlanes(srcY, 4, otherU, otherV, 4)),
              KESTREL_OK);
    EXPECT_EQ(dst, again);
    EXPECT_EQ(dst[8 * 3], 100) << "not the blend of single rows";

    const Engine nearest({FORMAT_GRAY8, 8, 8}, {code, 4, 4}, Param().Pass(2));
    EXPECT_EQ(Ask(Gray2Gray_C_FAST, nearest.context()).answer, KESTREL_UNSUPPORTED);
    for (const uint32_t mode : {1u, 3u}) {
      const Engine other({FORMAT_GRAY8, 8, 8}, {code, 4, 4}, Param().Bilinear().Pass(mode));
      EXPECT_EQ(Ask(Gray2Gray_C_FAST, other.context()).answer, KESTREL_UNSUPPORTED);
    }
  }
}

// An engine that was bilinear before its aspect policy made it 1:1 is bilinear still.
TEST(GreyEdgeCases, LumaOfPlanarYuvIsTakenAtUnitScaleToo) {
  const Engine engine({FORMAT_GRAY8, 4, 4}, {FORMAT_I420, 6, 4},
                      Param().Bilinear().Pass(2).Aspect(MPP_ASPECT_CROP));
  ASSERT_NE(engine.context().unitStep, 0u);
  ASSERT_NE(engine.context().bilinear, 0u);
  EXPECT_STREQ(Ask(Gray2Gray_C_FAST, engine.context()).kernel,
               "Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST");
}

// A suffix that names blocks promises nothing about the rectangle.
TEST(PlanarEdgeCases, TheFirstKernelOfTheListTakesEveryBlockMode) {
  for (const uint32_t mode : {1u, 2u, 3u}) {
    const Engine engine({FORMAT_I420, 5, 3}, {FORMAT_I422, 5, 3}, Param().Pass(mode));
    EXPECT_STREQ(Ask(YUV2YUV_Fast, engine.context()).kernel, "I422_TO_I420_NORESAMPLE_4x4");
  }
}

}  // namespace
}  // namespace kernel_tests
