// Planning of regions: what a rectangle of one side needs or covers on the other.
#include <array>

#include "recorder.h"

namespace kestrel::test {
namespace {

struct AlignCase {
  int32_t dst[2], src[2];
  uint32_t transform;
  bool bilinear;
  int32_t dstOrigin[2], srcOrigin[2];
  MRECT dstRect, srcRect;
};

Param ParamOf(const AlignCase& c) {
  Param param;
  param.Transform(c.transform).DstOrigin(c.dstOrigin[0], c.dstOrigin[1]);
  param.SrcOrigin(c.srcOrigin[0], c.srcOrigin[1]);
  if (c.bilinear) param.Bilinear();
  return param;
}

void PrintTo(const AlignCase& c, std::ostream* out) {
  *out << "transform " << c.transform << (c.bilinear ? " bilinear " : " nearest ");
  PrintTo(c.dstRect, out);
  PrintTo(c.srcRect, out);
}

constexpr uint32_t kGrey = FORMAT_GRAY8;

// Bilinear needs two pixels more at the right and below, and the half-step shift of its samples.
TEST(Align, OfADestinationRectangleGivesTheSourcePixelsItNeeds) {
  // clang-format off
  const AlignCase rows[] = {
    {{60, 40}, {90, 80}, 0, false, {0, 0}, {0, 0}, {10, 4, 30, 20}, {15, 8, 44, 39}},
    {{60, 40}, {90, 80}, 0, true, {0, 0}, {0, 0}, {10, 4, 30, 20}, {15, 8, 46, 41}},
    {{40, 60}, {90, 80}, 1, false, {0, 0}, {0, 0}, {10, 4, 30, 20}, {6, 20, 29, 59}},
    {{40, 60}, {90, 80}, 1, true, {0, 0}, {0, 0}, {10, 4, 30, 20}, {6, 20, 31, 61}},
    {{60, 40}, {90, 80}, 2, false, {0, 0}, {0, 0}, {10, 4, 30, 20}, {45, 8, 74, 39}},
    {{60, 40}, {90, 80}, 2, true, {0, 0}, {0, 0}, {10, 4, 30, 20}, {45, 8, 76, 41}},
    {{40, 60}, {90, 80}, 3, false, {0, 0}, {0, 0}, {10, 4, 30, 20}, {6, 20, 29, 59}},
    {{40, 60}, {90, 80}, 3, true, {0, 0}, {0, 0}, {10, 4, 30, 20}, {6, 20, 31, 61}},
    {{60, 40}, {90, 80}, 4, false, {0, 0}, {0, 0}, {10, 4, 30, 20}, {15, 40, 44, 71}},
    {{60, 40}, {90, 80}, 4, true, {0, 0}, {0, 0}, {10, 4, 30, 20}, {15, 40, 46, 73}},
    {{40, 60}, {90, 80}, 5, false, {0, 0}, {0, 0}, {10, 4, 30, 20}, {60, 20, 83, 59}},
    {{40, 60}, {90, 80}, 5, true, {0, 0}, {0, 0}, {10, 4, 30, 20}, {60, 20, 85, 61}},
    {{60, 40}, {90, 80}, 6, false, {0, 0}, {0, 0}, {10, 4, 30, 20}, {45, 40, 74, 71}},
    {{60, 40}, {90, 80}, 6, true, {0, 0}, {0, 0}, {10, 4, 30, 20}, {45, 40, 76, 73}},
    {{40, 60}, {90, 80}, 7, false, {0, 0}, {0, 0}, {10, 4, 30, 20}, {60, 20, 83, 59}},
    {{40, 60}, {90, 80}, 7, true, {0, 0}, {0, 0}, {10, 4, 30, 20}, {60, 20, 85, 61}},
    {{60, 40}, {90, 80}, 0, false, {8, 2}, {5, 3}, {10, 4, 30, 20}, {10, 7, 37, 38}},
    {{40, 60}, {90, 80}, 1, false, {8, 2}, {5, 3}, {10, 4, 30, 20}, {10, 19, 22, 58}},
    {{40, 60}, {90, 80}, 3, false, {8, 2}, {5, 3}, {10, 4, 30, 20}, {10, 35, 22, 74}},
    {{60, 40}, {90, 80}, 4, false, {8, 2}, {5, 3}, {10, 4, 30, 20}, {10, 55, 37, 86}},
    {{60, 40}, {30, 20}, 0, true, {0, 0}, {0, 0}, {0, 0, 60, 40}, {0, 0, 30, 20}},
    {{60, 40}, {30, 20}, 0, false, {0, 0}, {0, 0}, {0, 0, 60, 40}, {0, 0, 30, 20}},
    {{60, 40}, {30, 20}, 0, true, {0, 0}, {0, 0}, {1, 1, 2, 2}, {0, 0, 3, 3}},
    {{60, 40}, {30, 20}, 0, false, {0, 0}, {0, 0}, {0, 0, 0, 0}, {0, 0, 0, 0}},
    {{60, 40}, {30, 20}, 0, true, {0, 0}, {0, 0}, {0, 0, 0, 0}, {0, 0, 2, 2}},
    {{1, 1}, {65536, 65536}, 0, false, {0, 0}, {0, 0}, {0, 0, 1, 1}, {0, 0, 1, 1}},
    {{1, 1}, {65536, 65536}, 0, false, {0, 0}, {0, 0}, {0, 0, 100, 100}, {0, 0, 65536, 65536}},
    {{1, 1}, {65536, 65536}, 0, true, {0, 0}, {0, 0}, {0, 0, 2, 2}, {32767, 32767, 65536, 65536}},
  };
  // clang-format on
  for (const AlignCase& c : rows) {
    SCOPED_TRACE(testing::PrintToString(c));
    const Engine engine({kGrey, c.dst[0], c.dst[1]}, {kGrey, c.src[0], c.src[1]}, ParamOf(c));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    MRECT given = c.dstRect;
    MRECT answer = {};
    EXPECT_EQ(MPPAlign(engine.handle(), &given, &answer), KESTREL_OK);
    EXPECT_EQ(given, c.dstRect);
    EXPECT_EQ(answer, c.srcRect);
  }
}

// The last column and row count as covered one early, unless the rectangle reaches the full size.
TEST(Align, OfASourceRectangleGivesTheDestinationPixelsItCovers) {
  // clang-format off
  const AlignCase rows[] = {
    {{60, 40}, {90, 80}, 0, false, {0, 0}, {0, 0}, {6, 4, 20, 25}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 0, true, {0, 0}, {0, 0}, {5, 3, 20, 25}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 1, false, {0, 0}, {0, 0}, {4, 6, 25, 20}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 1, true, {0, 0}, {0, 0}, {3, 5, 25, 20}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 2, false, {0, 0}, {0, 0}, {40, 4, 54, 25}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 2, true, {0, 0}, {0, 0}, {39, 3, 54, 25}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 3, false, {0, 0}, {0, 0}, {15, 6, 36, 20}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 3, true, {0, 0}, {0, 0}, {14, 5, 36, 20}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 4, false, {0, 0}, {0, 0}, {6, 15, 20, 36}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 4, true, {0, 0}, {0, 0}, {5, 14, 20, 36}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 5, false, {0, 0}, {0, 0}, {4, 40, 25, 54}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 5, true, {0, 0}, {0, 0}, {3, 39, 25, 54}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 6, false, {0, 0}, {0, 0}, {40, 15, 54, 36}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 6, true, {0, 0}, {0, 0}, {39, 14, 54, 36}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 7, false, {0, 0}, {0, 0}, {15, 40, 36, 54}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 7, true, {0, 0}, {0, 0}, {14, 39, 36, 54}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 0, false, {8, 2}, {5, 3}, {10, 4, 25, 26}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 1, false, {8, 2}, {5, 3}, {4, 10, 26, 25}, {9, 8, 30, 50}},
    {{40, 60}, {90, 80}, 3, false, {8, 2}, {5, 3}, {21, 10, 42, 25}, {9, 8, 30, 50}},
    {{60, 40}, {90, 80}, 6, false, {8, 2}, {5, 3}, {58, 21, 68, 42}, {9, 8, 30, 50}},
    {{60, 40}, {30, 20}, 0, true, {0, 0}, {0, 0}, {0, 0, 60, 40}, {0, 0, 30, 20}},
    {{60, 40}, {30, 20}, 0, false, {0, 0}, {0, 0}, {0, 0, 57, 37}, {0, 0, 29, 19}},
    {{60, 40}, {30, 20}, 0, true, {0, 0}, {0, 0}, {2, 2, 57, 37}, {1, 1, 29, 19}},
    {{60, 40}, {90, 80}, 0, false, {0, 0}, {0, 0}, {0, 0, 60, 40}, {0, 0, 90, 80}},
    {{40, 60}, {90, 80}, 1, false, {0, 0}, {0, 0}, {0, 0, 40, 60}, {0, 0, 90, 80}},
    {{60, 40}, {90, 80}, 0, true, {0, 0}, {0, 0}, {0, 0, 59, 39}, {0, 0, 89, 79}},
    {{60, 40}, {90, 80}, 0, false, {0, 0}, {0, 0}, {0, 0, 6, 4}, {-30, -20, 9, 8}},
    {{1, 1}, {65536, 65536}, 0, false, {0, 0}, {0, 0}, {0, 0, 1, 1}, {0, 0, 65536, 65536}},
    {{1, 1}, {65536, 65536}, 0, false, {0, 0}, {0, 0}, {0, 0, 1, 1}, {4, 4, 65535, 65535}},
  };
  // clang-format on
  for (const AlignCase& c : rows) {
    SCOPED_TRACE(testing::PrintToString(c));
    const Engine engine({kGrey, c.dst[0], c.dst[1]}, {kGrey, c.src[0], c.src[1]}, ParamOf(c));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    MRECT given = c.srcRect;
    MRECT answer = {};
    EXPECT_EQ(MPPAlign(engine.handle(), &answer, &given), KESTREL_OK);
    EXPECT_EQ(given, c.srcRect);
    EXPECT_EQ(answer, c.dstRect);
  }
}

TEST(Align, LimitsTheSourceToTheGivenSourceRectangle) {
  const Engine engine({kGrey, 60, 40}, {kGrey, 90, 80}, Param().SrcRect(20, 10, 40, 30));
  MRECT given = {0, 0, 60, 40};
  MRECT answer = {};
  EXPECT_EQ(MPPAlign(engine.handle(), &given, &answer), KESTREL_OK);
  EXPECT_EQ(answer, (MRECT{20, 10, 40, 30}));
}

TEST(Align, FollowsTheFirstEngineOfATiledHandle) {
  const Engine engine({kGrey, 90, 100}, {kGrey, 64, 47},
                      Param().Tiled().Transform(1).Aspect(MPP_ASPECT_FIT));
  MRECT given = {9, 0, 81, 100};
  MRECT answer = {};
  EXPECT_EQ(MPPAlign(engine.handle(), &given, &answer), KESTREL_OK);
  EXPECT_EQ(given, (MRECT{9, 0, 81, 100}));
  EXPECT_EQ(answer, (MRECT{0, 5, 58, 47}));
}

TEST(Align, NeedsOneRectangleThatIsAllZero) {
  const Engine engine({kGrey, 60, 40}, {kGrey, 90, 80});
  for (int32_t MRECT::*const edge : {&MRECT::left, &MRECT::top, &MRECT::right, &MRECT::bottom}) {
    MRECT dst = {1, 2, 3, 4};
    MRECT src = {};
    src.*edge = 5;
    const MRECT srcBefore = src;
    EXPECT_EQ(MPPAlign(engine.handle(), &dst, &src), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(dst, (MRECT{1, 2, 3, 4}));
    EXPECT_EQ(src, srcBefore);
  }
}

// The farthest pixel times the greatest step just fits 64 bits; sanitizers watch.
TEST(Align, OfTheFarthestPixelAtTheGreatestStep) {
  const Engine engine({kGrey, 1, 1}, {kGrey, INT32_MAX, INT32_MAX});
  MRECT dst = {INT32_MIN, INT32_MIN, INT32_MIN, INT32_MIN};
  MRECT src = {};
  EXPECT_EQ(MPPAlign(engine.handle(), &dst, &src), KESTREL_OK);
  EXPECT_EQ(src, (MRECT{0, 0, 0, 0}));
  dst = {INT32_MAX, INT32_MAX, INT32_MAX, INT32_MAX};
  src = {};
  EXPECT_EQ(MPPAlign(engine.handle(), &dst, &src), KESTREL_OK);
  EXPECT_EQ(src.right, INT32_MAX);
  EXPECT_EQ(src.bottom, INT32_MAX);
}

TEST(Align, NeedsAllArguments) {
  const Engine engine({kGrey, 60, 40}, {kGrey, 90, 80});
  MRECT dst = {1, 2, 3, 4};
  MRECT src = {};
  EXPECT_EQ(MPPAlign(nullptr, &dst, &src), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPPAlign(engine.handle(), nullptr, &src), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPPAlign(engine.handle(), &dst, nullptr), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(src, MRECT{});
}

}  // namespace
}  // namespace kestrel::test
