// The places where decisions and samples of the kernel families are easily wrong.
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
using kestrel::test::Side;
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
Observed Ask(KernelFn* dispatcher, const EngineContext& context,
             const MRECT& nothing = {0, 0, 0, 0}) {
  uint8_t bytes[8] = {};
  uint8_t* const planes[3] = {bytes, bytes + 4, bytes + 5};
  const int32_t pitches[3] = {2, 2, 2};
  return Observe(dispatcher, &nothing, pitches, pitches, planes, planes, &context);
}

void ExpectDeclined(KernelFn* dispatcher, const EngineContext& context) {
  const Observed observed = Ask(dispatcher, context);
  EXPECT_EQ(observed.answer, KESTREL_UNSUPPORTED);
  EXPECT_EQ(observed.kernel, nullptr) << "ran before it answered";
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

// Strips of packed 4:2:2 are wide where rows are groups of luma and chroma. Whoever calls kernels
// can give each of the planes that point into them a pitch of its own, and rows are not groups
// then.
TEST(PackedEdgeCases, PlanesWithPitchesOfTheirOwnGiveThePixelsOfNarrowPieces) {
  constexpr int32_t kWidth = 3000, kHeight = 4, kPiece = 500;
  const Engine engine({FORMAT_XBGR8888, kWidth, kHeight}, {FORMAT_YUYV, kWidth, kHeight});
  const PlaneLayout& layout = engine.context().srcLayout;
  Bytes src = Counting(size_t{kHeight} * (2 * kWidth + 16));
  const uint8_t* const from[3] = {src.data() + layout.yOffset, src.data() + layout.uOffset,
                                  src.data() + layout.vOffset};
  const int32_t fromPitch[3] = {2 * kWidth, 2 * kWidth + 8, 2 * kWidth + 16};
  const int32_t toPitch[3] = {4 * kWidth, 0, 0};
  Bytes whole(size_t{4} * kWidth * kHeight), pieces(whole.size());
  const auto convert = [&](Bytes* dst, int32_t left, int32_t right) {
    uint8_t* const to[3] = {dst->data() + ptrdiff_t{4} * left, nullptr, nullptr};
    const MRECT rect = {left, 0, right, kHeight};
    EXPECT_EQ(ANY_ANY_C_SLOW(&rect, toPitch, fromPitch, to, from, &engine.context()), KESTREL_OK);
  };
  convert(&whole, 0, kWidth);
  for (int32_t x = 0; x < kWidth; x += kPiece) convert(&pieces, x, x + kPiece);
  EXPECT_EQ(whole, pieces);
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

TEST(GreyEdgeCases, TheSecondRowOfAPairDoesSoWhereItsOwnLineCannotBeRead) {
  const Engine engine({FORMAT_GRAY8, 8, 4}, {FORMAT_GRAY8, 8, 10}, Param().Bilinear().Pass(2));
  ASSERT_STREQ(AskChain(&engine.context()).kernel, "Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST");
  // Positions 0.75 and 3.25, of which the latter reads line 2 instead: the last one that it may.
  EngineContext context = engine.context();
  context.srcReadBottom = 3;
  Bytes src(24), dst(16);
  for (size_t i = 0; i < src.size(); ++i) src[i] = uint8_t(100 * (i / 8));
  const MRECT rows = {0, 0, 8, 2};
  const Planes to = OnePlane(dst, 8), from = OnePlane(src, 8);
  ASSERT_EQ(Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST(&rows, to.pitch, from.pitch, to.plane,
                                                        from.plane, &context),
            KESTREL_OK);
  EXPECT_EQ(dst[0], 75);
  EXPECT_EQ(dst[8], 175) << "three quarters of line 2, one of line 1";
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

constexpr uint32_t kPlanarCodes[] = {FORMAT_I420, FORMAT_I422, FORMAT_I440, FORMAT_I444};
constexpr uint32_t kModes[] = {1, 2, 3};

TEST(Rgb16EdgeCases, DitheredPlanarYuvIsNotBlockedIntoBgr565) {
  for (const uint32_t src : kPlanarCodes) {
    const Engine dithered({FORMAT_BGR565, 16, 16}, {src, 16, 16}, Param().Pass(3).Dither());
    ExpectDeclined(ANY_ANY_C_FAST_R5G6B5, dithered.context());
    const Engine plain({FORMAT_BGR565, 16, 16}, {src, 16, 16}, Param().Pass(3));
    EXPECT_STREQ(Ask(ANY_ANY_C_FAST_R5G6B5, plain.context()).kernel,
                 "YUV2RGBFast_NORESAMPLE_B5G6R5_4x4");
    const Engine unaligned({FORMAT_BGR565, 16, 16}, {src, 16, 16}, Param().Dither());
    EXPECT_STREQ(Ask(ANY_ANY_C_FAST_R5G6B5, unaligned.context()).kernel,
                 "YUV2RGBFast_NORESAMPLE_B5G6R5");
  }
}

TEST(Rgb16EdgeCases, Nv21TurnedBy270WithoutBlocksGoesToTheCatchAll) {
  const auto kernelOf = [](uint32_t mode) {
    const Engine engine({FORMAT_RGB565, 16, 16}, {FORMAT_NV21, 16, 16},
                        Param().Pass(mode).Transform(5));
    return Ask(ANY_ANY_C_FAST_R5G6B5, engine.context()).kernel;
  };
  EXPECT_STREQ(kernelOf(1), "NV21_TO_RGBFast_R5G6B5_Nearest");
  EXPECT_STREQ(kernelOf(2), "NV21_To_RGB565_NoResample_2x2_R270");
  EXPECT_STREQ(kernelOf(3), "NV21_To_RGB565_NoResample_4x4_R270");
}

// One step of 1.0 is not 1:1, and keeps the catch-all from equal steps.
TEST(Rgb16EdgeCases, TheCatchAllOfNv21WantsEqualStepsOrTwoOtherThanOne) {
  const auto answerOf = [](int32_t width, int32_t height, const Param& param) {
    const Engine engine({FORMAT_RGB565, 16, 16}, {FORMAT_NV21, width, height}, param);
    return Ask(ANY_ANY_C_FAST_R5G6B5, engine.context()).answer;
  };
  EXPECT_EQ(answerOf(24, 12, Param()), KESTREL_OK);
  EXPECT_EQ(answerOf(16, 12, Param()), KESTREL_UNSUPPORTED);
  EXPECT_EQ(answerOf(24, 16, Param()), KESTREL_UNSUPPORTED);
  EXPECT_EQ(answerOf(24, 12, Param().Bilinear()), KESTREL_UNSUPPORTED);
  EXPECT_EQ(answerOf(24, 24, Param().Bilinear().Dither().Transform(3)), KESTREL_OK);
}

TEST(Rgb16EdgeCases, The565OrdersAreNotConvertedIntoEachOther) {
  for (const uint32_t mode : kModes) {
    for (uint32_t transform = 0; transform < 8; ++transform) {
      for (const int32_t size : {16, 24}) {
        for (const bool bilinear : {false, true}) {
          Param param = Param().Pass(mode).Transform(transform);
          param.resampleFlags = bilinear ? MPP_BILINEAR : MPP_NEAREST;
          ExpectDeclined(
              ANY_ANY_C_FAST_R5G6B5,
              Engine({FORMAT_BGR565, 16, 16}, {FORMAT_RGB565, size, size}, param).context());
          ExpectDeclined(
              ANY_ANY_C_FAST_R5G6B5,
              Engine({FORMAT_RGB565, 16, 16}, {FORMAT_BGR565, size, size}, param).context());
        }
      }
    }
  }
  const Engine engine({FORMAT_BGR565, 2, 1}, {FORMAT_RGB565, 2, 1});
  Bytes src = {0x00, 0xF8, 0x1F, 0x00}, dst(4);  // red, blue
  ASSERT_EQ(Process(engine, OnePlane(dst, 4), OnePlane(src, 4)), KESTREL_OK);
  EXPECT_EQ(dst, (Bytes{0x1F, 0x00, 0x00, 0xF8}));
}

// Bitmaps of Android, in both codes for them.
TEST(Rgb32EdgeCases, ABitmapBecomesNv21InTheFamilyThatItsBlocksAllow) {
  for (const uint32_t src : {FORMAT_XBGR8888, FORMAT_BGRX8888}) {
    const Engine unaligned({FORMAT_NV21 | FORMAT_BT601_FULL, 16, 16}, {src, 16, 16});
    EXPECT_STREQ(AskChain(&unaligned.context()).kernel, "RGB32toNV21_Fast_NORESAMPLE");
    const Engine blocked({FORMAT_NV21 | FORMAT_BT601_FULL, 16, 16}, {src, 16, 16}, Param().Pass(3));
    EXPECT_STREQ(AskChain(&blocked.context()).kernel, "NEC_BGR32toNVXX_NoResize");
    EXPECT_STREQ(Ask(YUYV_RGB32_FAST, blocked.context()).kernel, "RGB32toNV21_Fast_NORESAMPLE_4x4")
        << "it comes too late";
    const Engine video({FORMAT_NV21, 16, 16}, {src, 16, 16}, Param().Pass(3));
    EXPECT_STREQ(AskChain(&video.context()).kernel, "RGB32toNV21_Fast_NORESAMPLE_4x4");
  }
}

TEST(Rgb32EdgeCases, SemiPlanarYuvScaledByEqualStepsIsDeclined) {
  for (const uint32_t src : {FORMAT_NV21, FORMAT_NV12}) {
    for (const uint32_t mode : kModes) {
      const Engine equal({FORMAT_XRGB8888, 16, 16}, {src, 24, 24}, Param().Bilinear().Pass(mode));
      ExpectDeclined(ANY_ANY_C_FAST_RGB32, equal.context());
      const Engine nearest({FORMAT_XRGB8888, 16, 16}, {src, 24, 24}, Param().Pass(mode));
      ExpectDeclined(ANY_ANY_C_FAST_RGB32, nearest.context());
      const Engine other({FORMAT_XRGB8888, 16, 16}, {src, 24, 20}, Param().Bilinear().Pass(mode));
      EXPECT_STREQ(Ask(ANY_ANY_C_FAST_RGB32, other.context()).kernel, "NV21toRGB32_Fast_BilNear");
    }
  }
}

TEST(Rgb32EdgeCases, AnotherPlaceOfBlueIsDeclined) {
  constexpr uint32_t kBlueHighest = 0x170017F7;  // green is 16 bits wide
  for (const uint32_t mode : kModes) {
    const Engine engine({FORMAT_XBGR8888, 16, 16}, {kBlueHighest, 24, 24}, Param().Pass(mode));
    const uint32_t* const positions = engine.context().srcChannelPos;
    ASSERT_EQ(std::vector<uint32_t>(positions, positions + 3), (std::vector<uint32_t>{0, 8, 24}));
    ExpectDeclined(ANY_ANY_C_FAST_RGB32, engine.context());
    const Engine same({FORMAT_XBGR8888, 16, 16}, {FORMAT_XBGR8888, 24, 24}, Param().Pass(mode));
    EXPECT_EQ(Ask(ANY_ANY_C_FAST_RGB32, same.context()).answer, KESTREL_OK);
  }
}

TEST(Rgb32EdgeCases, TransformedYuyvIsTakenIntoBgr32Only) {
  for (const uint32_t mode : kModes) {
    for (uint32_t transform = 0; transform < 8; ++transform) {
      const Param param = Param().Pass(mode).Transform(transform);
      const Engine engine({FORMAT_XBGR8888, 16, 16}, {FORMAT_YUYV, 16, 16}, param);
      EXPECT_STREQ(Ask(YUYV_RGB32_FAST, engine.context()).kernel, "YUYVtoBGR32_Fast_NORESAMPLE");
      const Engine other({FORMAT_XRGB8888, 16, 16}, {FORMAT_YUYV, 16, 16}, param);
      const bool isTaken = mode == 3 && transform == 0;
      EXPECT_EQ(Ask(YUYV_RGB32_FAST, other.context()).answer,
                isTaken ? KESTREL_OK : KESTREL_UNSUPPORTED);
    }
  }
}

TEST(Rgb32EdgeCases, MirroredYuyvComesOutMirrored) {
  const Engine engine({FORMAT_XBGR8888, 4, 1}, {FORMAT_YUYV, 4, 1},
                      Param().Transform(MPP_MIRROR_X));
  ASSERT_STREQ(AskChain(&engine.context()).kernel, "YUYVtoBGR32_Fast_NORESAMPLE");
  Bytes src = {50, 128, 80, 128, 110, 128, 140, 128}, dst(16);
  ASSERT_EQ(Process(engine, OnePlane(dst, 16), OnePlane(src, 8)), KESTREL_OK);
  const Engine upright({FORMAT_XBGR8888, 4, 1}, {FORMAT_YUYV, 4, 1});
  Bytes again(16);
  ASSERT_EQ(Process(upright, OnePlane(again, 16), OnePlane(src, 8)), KESTREL_OK);
  for (size_t x = 0; x < 4; ++x) {
    EXPECT_TRUE(std::equal(&dst[4 * x], &dst[4 * x] + 4, &again[4 * (3 - x)])) << "column " << x;
    EXPECT_GT(again[4 * x], x == 0 ? 0 : again[4 * (x - 1)]) << "brighter from column to column";
  }
}

// The dispatcher draws and answers 3 all the same; the chain goes on to the generic converter.
TEST(Rgb32EdgeCases, APictureOfI420IsDrawnTwice) {
  const Engine engine({FORMAT_XRGB8888, 4, 4}, {FORMAT_I420, 4, 4}, Param().Alpha(9));
  const Answer answer = AskChain(&engine.context());
  EXPECT_STREQ(answer.dispatcher, "ANY_ANY_C_SLOW");
  EXPECT_STREQ(answer.overwritten, "I420toRGB32_Fast_NORESAMPLE_1x1");

  Bytes srcY = Counting(16, 60), srcU = Counting(4, 100), srcV = Counting(4, 140);
  const Planes src = ThreePlanes(srcY, 4, srcU, srcV, 2);
  Bytes whole(64);
  ASSERT_EQ(Process(engine, OnePlane(whole, 16), src), KESTREL_OK);

  const auto draw = [&](KernelFn* dispatcher, Bytes* picture) {
    uint8_t* const starts[3] = {picture->data(), picture->data(), picture->data()};
    const int32_t pitches[3] = {16, 16, 16};
    const MRECT rect = {0, 0, 4, 4};
    return Observe(dispatcher, &rect, pitches, src.pitch, starts, src.plane, &engine.context());
  };
  Bytes first(64), second(64);
  const Observed observed = draw(YUV_RGB32_C_FAST, &first);
  EXPECT_EQ(observed.answer, KESTREL_UNSUPPORTED);
  EXPECT_STREQ(observed.kernel, "I420toRGB32_Fast_NORESAMPLE_1x1");
  EXPECT_EQ(draw(ANY_ANY_C_SLOW, &second).answer, KESTREL_OK);
  EXPECT_EQ(first, whole) << "both draw the same picture";
  EXPECT_EQ(second, whole);
  EXPECT_EQ(whole[3], 9);
}

// Rectangles off the grid of 8 x 8 go to the kernel that takes any; both end the chain.
TEST(Rgb32EdgeCases, BlockedI420LooksAtTheRectangle) {
  const Engine engine({FORMAT_XRGB8888, 64, 64}, {FORMAT_I420, 64, 64}, Param().Pass(3));
  const auto kernelOf = [&engine](const MRECT& rect) {
    const Observed observed = Ask(YUV_RGB32_C_FAST, engine.context(), rect);
    EXPECT_EQ(observed.answer, KESTREL_OK);
    return observed.kernel;
  };
  EXPECT_STREQ(kernelOf({8, 16, 8, 24}), "I420toRGB32_Fast_NORESAMPLE");
  EXPECT_STREQ(kernelOf({4, 16, 4, 24}), "I420toRGB32_Any_Fast_1x1");
  EXPECT_STREQ(kernelOf({8, 20, 8, 24}), "I420toRGB32_Any_Fast_1x1");
  EXPECT_STREQ(kernelOf({16, 16, 12, 24}), "I420toRGB32_Any_Fast_1x1");
  EXPECT_STREQ(kernelOf({8, 16, 8, 12}), "I420toRGB32_Any_Fast_1x1");
}

// What was asked for, not what came of it: mode 4 is asked for and becomes block mode 3.
TEST(Rgb32EdgeCases, TheBlended4x4KernelWantsPassModeThree) {
  const auto kernelOf = [](uint32_t mode) {
    const Engine engine({FORMAT_XRGB8888, 16, 16}, {FORMAT_I420, 24, 24},
                        Param().Bilinear().Pass(mode));
    EXPECT_EQ(engine.context().blockMode, mode == 4 ? 3 : mode);
    return AskChain(&engine.context()).kernel;
  };
  EXPECT_STREQ(kernelOf(3), "I420toRGB32_R0_Fast_BilNear_4x4");
  EXPECT_STREQ(kernelOf(4), "I420toRGB32_Fast_BilNear");
  EXPECT_STREQ(kernelOf(2), "I420toRGB32_Fast_BilNear");
}

TEST(Rgb24EdgeCases, BlocksOf2x2HaveNoKernelOfTheirOwnIntoI420) {
  const auto kernelOf = [](uint32_t mode) {
    const Engine engine({FORMAT_I420, 16, 16}, {FORMAT_RGB888, 16, 16}, Param().Pass(mode));
    return AskChain(&engine.context()).kernel;
  };
  EXPECT_STREQ(kernelOf(2), "RGB2YUVFast_NORESAMPLE");
  EXPECT_STREQ(kernelOf(1), "RGB2YUVFast_NORESAMPLE");
  EXPECT_STREQ(kernelOf(3), "RGB2YUVFast_NORESAMPLE_NOROTATE_R8G8B8_4x4");
}

TEST(Rgb24EdgeCases, MirroredResizesGoToTheGeneral4x4Kernel) {
  constexpr const char* kByTransform[] = {
      "RGB2RGBFast_RGB888_N_RESIZE_4x4_R0",       "RGB2RGBFast_RGB888_N_RESIZE_4x4_SwapXY",
      "RGB2RGBFast_RGB888_N_RESIZE_4x4",          "RGB2RGBFast_RGB888_N_RESIZE_4x4",
      "RGB2RGBFast_RGB888_N_RESIZE_4x4_VERTICAL", "RGB2RGBFast_RGB888_N_RESIZE_4x4_R270",
      "RGB2RGBFast_RGB888_N_RESIZE_4x4",          "RGB2RGBFast_RGB888_N_RESIZE_4x4"};
  for (uint32_t transform = 0; transform < 8; ++transform) {
    const Engine engine({FORMAT_RGB888, 16, 16}, {FORMAT_RGB888, 24, 24},
                        Param().Pass(3).Transform(transform));
    EXPECT_STREQ(AskChain(&engine.context()).kernel, kByTransform[transform]) << transform;
  }
}

// No engine dithers 24 bits; its context is made to.
TEST(Rgb24EdgeCases, DitheredNv21IsDeclined) {
  const Engine engine({FORMAT_RGB888, 16, 16}, {FORMAT_NV21, 16, 16}, Param().Dither());
  EXPECT_EQ(engine.context().dither, 0u);
  EXPECT_STREQ(Ask(ANY_ANY_C_FAST_R8G8B8, engine.context()).kernel,
               "NV21_To_RGB888_NoResample_1x1");
  engine.context().dither = 1;
  ExpectDeclined(ANY_ANY_C_FAST_R8G8B8, engine.context());
}

TEST(Rgb24EdgeCases, ResizedRgb32IsDeclined) {
  for (const uint32_t mode : kModes) {
    for (uint32_t transform = 0; transform < 8; ++transform) {
      const Param param = Param().Pass(mode).Transform(transform);
      const Engine copied({FORMAT_RGB888, 16, 16}, {FORMAT_XRGB8888, 16, 16}, param);
      EXPECT_STREQ(Ask(ANY_ANY_C_FAST_R8G8B8, copied.context()).kernel,
                   "RGB2RGBFast_RGB32_TO_RGB24_NORESAMPLE");
      const Engine nearest({FORMAT_RGB888, 16, 16}, {FORMAT_XRGB8888, 24, 16}, param);
      ExpectDeclined(ANY_ANY_C_FAST_R8G8B8, nearest.context());
      const Engine blended({FORMAT_RGB888, 16, 16}, {FORMAT_XRGB8888, 16, 24},
                           Param(param).Bilinear());
      ExpectDeclined(ANY_ANY_C_FAST_R8G8B8, blended.context());
    }
  }
}

constexpr uint32_t kAllCodes[] = {
    FORMAT_RGB565, FORMAT_BGR565, FORMAT_RGB888, FORMAT_BGR888, FORMAT_XRGB8888, FORMAT_XBGR8888,
    FORMAT_YUYV,   FORMAT_YUV444, FORMAT_I420,   FORMAT_I422,   FORMAT_I440,     FORMAT_I444,
    FORMAT_YV12,   FORMAT_NV21,   FORMAT_NV12,   FORMAT_NV61,   FORMAT_GRAY8,
};

TEST(VectorEdgeCases, OnlyFullRange601SourcesAreTaken) {
  int taken = 0;
  for (const uint32_t standard :
       {FORMAT_BT601_VIDEO, FORMAT_BT601_FULL, FORMAT_BT709_VIDEO, FORMAT_BT709_FULL}) {
    for (const uint32_t dst : kAllCodes) {
      for (const uint32_t mode : kModes) {
        for (uint32_t transform = 0; transform < 8; ++transform) {
          for (const int32_t size : {16, 24}) {
            const Engine engine({dst, 16, 16}, {FORMAT_NV21 | standard, size, size},
                                Param().Bilinear().Pass(mode).Transform(transform));
            if (standard != FORMAT_BT601_FULL) {
              ExpectDeclined(NEC_ALL, engine.context());
            } else {
              taken += Ask(NEC_ALL, engine.context()).answer == KESTREL_OK ? 1 : 0;
            }
          }
        }
      }
    }
  }
  // 1:1 into 2 layouts of each depth, blended into 24 and 32 bits and I420, turned into 32 bits.
  EXPECT_EQ(taken, 3 * 2 + 2 * 2 + 1 + 2);
  const Engine video({FORMAT_XBGR8888, 16, 16}, {FORMAT_NV21, 16, 16}, Param().Pass(3));
  EXPECT_STREQ(AskChain(&video.context()).kernel, "NV21_TO_RGB32Fast_NORESAMPLE_4x4");
}

TEST(VectorEdgeCases, BlocksOf2x2AreDeclined) {
  for (const uint32_t dst : {FORMAT_XRGB8888, FORMAT_XBGR8888}) {
    for (const uint32_t mode : kModes) {
      const Engine engine({dst, 16, 16}, {FORMAT_NV21 | FORMAT_BT601_FULL, 16, 16},
                          Param().Pass(mode));
      EXPECT_STREQ(Ask(NEC_ALL, engine.context()).kernel,
                   mode == 3 ? "NEC_NV21YCbCr601toBGR32_NoResize" : nullptr);
    }
  }
}

TEST(VectorEdgeCases, OfTheTurnsOnlyABlended90IsTaken) {
  for (uint32_t transform = 1; transform < 8; ++transform) {
    const Param param = Param().Pass(3).Transform(transform);
    const Side dst = {FORMAT_XBGR8888, 16, 16};
    const Engine blended(dst, {FORMAT_NV21 | FORMAT_BT601_FULL, 24, 24}, Param(param).Bilinear());
    if (transform == 3) {
      EXPECT_STREQ(Ask(NEC_ALL, blended.context()).kernel, "NEC_NV21toBGR32_Fast_BilNear_R90");
    } else {
      ExpectDeclined(NEC_ALL, blended.context());
    }
    for (const int32_t size : {16, 24}) {  // 1:1, nearest
      const Engine other(dst, {FORMAT_NV21 | FORMAT_BT601_FULL, size, size}, param);
      ExpectDeclined(NEC_ALL, other.context());
    }
    const Engine nv12(dst, {FORMAT_NV12 | FORMAT_BT601_FULL, 24, 24}, Param(param).Bilinear());
    ExpectDeclined(NEC_ALL, nv12.context());
  }
}

// No flag sees the fourth bit of a transform code; this family looks at the whole code.
TEST(VectorEdgeCases, CodesBeyondTheFlagsAreDeclined) {
  for (const uint32_t dst : kAllCodes) {
    for (const int32_t size : {16, 24}) {
      for (const uint32_t code : {0u, 3u}) {
        const Engine engine({dst, 16, 16}, {FORMAT_NV21 | FORMAT_BT601_FULL, size, size},
                            Param().Bilinear().Pass(3).Transform(8 | code));
        ASSERT_EQ(engine.context().swapXY != 0, code == 3);
        ExpectDeclined(NEC_ALL, engine.context());
      }
    }
  }
}

// Creation has turned both standards of such an engine into video range.
TEST(VectorEdgeCases, AdjustedFullRangeYuvIsDeclined) {
  const Side dst = {FORMAT_I420 | FORMAT_BT601_FULL, 16, 16};
  const Side src = {FORMAT_NV21 | FORMAT_BT601_FULL, 24, 24};
  const Engine plain(dst, src, Param().Bilinear().Pass(3));
  EXPECT_STREQ(Ask(NEC_ALL, plain.context()).kernel, "NEC_NV21toI420_Fast_BilNear");
  const Engine adjusted(dst, src, Param().Bilinear().Pass(3).Adjust(10, 0, 0));
  ExpectDeclined(NEC_ALL, adjusted.context());
  const Engine narrowed({FORMAT_I420, 16, 16}, src, Param().Bilinear().Pass(3).Adjust(10, 0, 0));
  EXPECT_STREQ(Ask(NEC_ALL, narrowed.context()).kernel, "NEC_NV21toI420_Fast_BilNear");
}

}  // namespace
}  // namespace kernel_tests
