// What an engine decides at creation: steps, flags, block mode, aspect policy, rectangles, fields.
#include <array>
#include <cstring>
#include <memory>
#include <vector>

#include "exact_support.h"

namespace kestrel::test {
namespace {

constexpr uint32_t kGrey = FORMAT_GRAY8;
constexpr Side kGrey32x16 = {kGrey, 32, 16};

// ---- steps ----

struct StepCase {
  int32_t dstWidth, dstHeight, srcWidth, srcHeight;
  uint32_t transform;
  uint32_t stepX, stepY, invStepX, invStepY;
};

void PrintTo(const StepCase& c, std::ostream* out) {
  *out << c.dstWidth << "x" << c.dstHeight << " from " << c.srcWidth << "x" << c.srcHeight;
}

class Steps : public testing::TestWithParam<StepCase> {};

TEST_P(Steps, AreSourcePixelsPerDestinationPixelTruncated) {
  const StepCase& c = GetParam();
  const Engine engine({FORMAT_GRAY8, c.dstWidth, c.dstHeight},
                      {FORMAT_GRAY8, c.srcWidth, c.srcHeight}, Param().Transform(c.transform));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.context().stepX, c.stepX);
  EXPECT_EQ(engine.context().stepY, c.stepY);
  EXPECT_EQ(engine.context().invStepX, c.invStepX);
  EXPECT_EQ(engine.context().invStepY, c.invStepY);
}

INSTANTIATE_TEST_SUITE_P(Plain, Steps,
                         testing::Values(StepCase{640, 480, 1280, 720, 0, 131072, 98304, 32768,
                                                  43690},
                                         StepCase{7, 5, 3, 11, 0, 28086, 144179, 152917, 29789},
                                         StepCase{3, 3, 2, 1, 0, 43690, 21845, 98304, 196608}));

INSTANTIATE_TEST_SUITE_P(
    SwappedExchangeTheDestinationSides, Steps,
    testing::Values(StepCase{480, 640, 1280, 720, 1, 131072, 98304, 32768, 43690},
                    StepCase{480, 640, 1280, 720, 3, 131072, 98304, 32768, 43690},
                    StepCase{480, 640, 1280, 720, 5, 131072, 98304, 32768, 43690},
                    StepCase{480, 640, 1280, 720, 7, 131072, 98304, 32768, 43690},
                    StepCase{640, 480, 1280, 720, 6, 131072, 98304, 32768, 43690}));

INSTANTIATE_TEST_SUITE_P(
    SaturateAt32Bits, Steps,
    testing::Values(StepCase{1, 1, 65535, 65535, 0, 0xFFFF0000, 0xFFFF0000, 1, 1},
                    StepCase{1, 1, 65536, 65536, 0, 0xFFFFFFFF, 0xFFFFFFFF, 1, 1},
                    StepCase{1, 1, 65537, 16777216, 0, 0xFFFFFFFF, 0xFFFFFFFF, 0, 0},
                    StepCase{65536, 4, 1, 4, 0, 1, 65536, 0xFFFFFFFF, 65536}));

TEST(Creation, FailsWhenAStepBecomesZero) {
  EXPECT_EQ(Engine({FORMAT_GRAY8, 65537, 4}, {FORMAT_GRAY8, 1, 4}).result(), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(Engine({FORMAT_GRAY8, 4, 65537}, {FORMAT_GRAY8, 4, 1}).result(), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(Engine({FORMAT_GRAY8, 65536, 4}, {FORMAT_GRAY8, 1, 4}).result(), KESTREL_OK);
}

TEST(Creation, JudgesZeroStepsAfterTheAspectPolicy) {
  const Side dst = {FORMAT_GRAY8, 65537, 65537};
  const Side src = {FORMAT_GRAY8, 1, 65537};
  const Engine fit(dst, src, Param().Aspect(MPP_ASPECT_FIT));
  ASSERT_EQ(fit.result(), KESTREL_OK);
  EXPECT_EQ(fit.context().stepX, 65536u);
  EXPECT_EQ(fit.pass().dstRegionWidth, 1);
  EXPECT_EQ(fit.pass().dstRegionX, 32768);
  EXPECT_EQ(Engine(dst, src, Param().Aspect(MPP_ASPECT_CROP)).result(), KESTREL_BAD_ARGUMENT);
}

TEST(Creation, FailsForSizesBelowOne) {
  for (int32_t bad : {0, -1, -640, INT32_MIN}) {
    SCOPED_TRACE(bad);
    EXPECT_EQ(Engine({FORMAT_GRAY8, bad, 8}, kGrey32x16).result(), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(Engine({FORMAT_GRAY8, 8, bad}, kGrey32x16).result(), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(Engine(kGrey32x16, {FORMAT_GRAY8, bad, 8}).result(), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(Engine(kGrey32x16, {FORMAT_GRAY8, 8, bad}).result(), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(Engine({FORMAT_GRAY8, bad, bad}, {FORMAT_GRAY8, bad, bad}).result(),
              KESTREL_BAD_ARGUMENT);
  }
}

TEST(Creation, FailsForNullArguments) {
  MPPFORMAT dst = {FORMAT_GRAY8, 8, 8, nullptr};
  MPPFORMAT src = dst;
  MPPPARAM param = Param();
  MPPHandle marker{};
  MPPHandle* handle = &marker;
  EXPECT_EQ(MPPCreate(nullptr, &src, &param, &handle), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(handle, nullptr);
  handle = &marker;
  EXPECT_EQ(MPPCreate(&dst, nullptr, &param, &handle), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(handle, nullptr);
  handle = &marker;
  EXPECT_EQ(MPPCreate(&dst, &src, nullptr, &handle), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(handle, nullptr);
  EXPECT_EQ(MPPCreate(&dst, &src, &param, nullptr), KESTREL_BAD_ARGUMENT);

  PassEngine* engine = nullptr;
  EXPECT_EQ(MPPBuildEngine(nullptr, &src, &param, &engine), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPPBuildEngine(&dst, nullptr, &param, &engine), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPPBuildEngine(&dst, &src, nullptr, &engine), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(engine, nullptr);
}

TEST(Destruction, AcceptsNull) {
  EXPECT_EQ(MPPDestroy(nullptr), KESTREL_OK);
}

TEST(Destruction, AnswersOkForAHandle) {
  MPPFORMAT dst = {FORMAT_GRAY8, 8, 8, nullptr};
  MPPFORMAT src = dst;
  MPPPARAM param = Param().Tiled();
  MPPHandle* handle = nullptr;
  ASSERT_EQ(MPPCreate(&dst, &src, &param, &handle), KESTREL_OK);
  EXPECT_EQ(MPPDestroy(handle), KESTREL_OK);
}

TEST(VersionInfo, IsNull) {
  EXPECT_EQ(PostProcessGetVersionInfo(), nullptr);
}

// ---- formats ----

TEST(Creation, FailsForUnknownFormatsOnEitherSide) {
  for (uint32_t bad : {0u, 0x60000000u, 0x65000000u, 0x14000454u, 0x50000911u, 0x70000006u}) {
    EXPECT_EQ(Engine({bad, 8, 8}, kGrey32x16).result(), KESTREL_UNSUPPORTED) << std::hex << bad;
    EXPECT_EQ(Engine(kGrey32x16, {bad, 8, 8}).result(), KESTREL_UNSUPPORTED) << std::hex << bad;
  }
}

TEST(Creation, AnswersBadSizeBeforeUnknownFormat) {
  EXPECT_EQ(Engine({0, 0, 8}, kGrey32x16).result(), KESTREL_BAD_ARGUMENT);
}

struct Records {
  MPPFORMAT dst;
  MPPFORMAT src;
  MPPPARAM param;
  MPPHandle* handle = nullptr;

  Records(uint32_t dstCode, uint32_t srcCode, const MPPPARAM& p)
      : dst{dstCode, 16, 16, nullptr}, src{srcCode, 16, 16, nullptr}, param(p) {}
  Records(const Records&) = delete;
  Records& operator=(const Records&) = delete;
  ~Records() { MPPDestroy(handle); }
  uint32_t Create() { return MPPCreate(&dst, &src, &param, &handle); }
};

TEST(SpareLowRgbCodes, AreBuiltAsSpareHighAndRestoredInTheRecords) {
  const uint32_t pairs[][2] = {{FORMAT_RGBX8888, FORMAT_XRGB8888},
                               {FORMAT_BGRX8888, FORMAT_XBGR8888}};
  for (const auto& from : pairs) {
    for (const auto& to : pairs) {
      Records given(to[0], from[0], Param().Bilinear().Tiled());
      Records plain(to[1], from[1], Param().Bilinear().Tiled());
      ASSERT_EQ(given.Create(), KESTREL_OK);
      ASSERT_EQ(plain.Create(), KESTREL_OK);
      EXPECT_EQ(given.dst.format, to[0]);
      EXPECT_EQ(given.src.format, from[0]);
      for (int i = 0; i < 3; ++i) {
        const EngineContext& a = *given.handle->pass[i]->context;
        const EngineContext& b = *plain.handle->pass[i]->context;
        EXPECT_EQ(memcmp(&a.dstFormat, &b.dstFormat, sizeof a.dstFormat), 0);
        EXPECT_EQ(memcmp(&a.srcFormat, &b.srcFormat, sizeof a.srcFormat), 0);
        EXPECT_EQ(memcmp(a.srcChannelPos, b.srcChannelPos, sizeof a.srcChannelPos), 0);
        EXPECT_EQ(memcmp(a.dstChannelPos, b.dstChannelPos, sizeof a.dstChannelPos), 0);
        EXPECT_EQ(a.blockMode, b.blockMode);
      }
    }
  }
  Records bitmap(FORMAT_BGRX8888, FORMAT_BGRX8888, Param());
  ASSERT_EQ(bitmap.Create(), KESTREL_OK);
  const EngineContext& context = *bitmap.handle->pass[0]->context;
  EXPECT_EQ(context.srcFormat.layout.rgb.redMask, 0xFFu);
  EXPECT_EQ(context.dstFormat.layout.rgb.blueMask, 0xFF0000u);
}

TEST(SpareLowRgbCodes, ThatDifferInAnyOtherBitKeepTheirMasks) {
  const Engine engine({0x37004777, 8, 8}, {0x37005777, 8, 8});
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.context().dstFormat.layout.rgb.redMask, 0xFF000000u);
  EXPECT_EQ(engine.context().srcFormat.layout.rgb.redMask, 0xFF00u);
}

TEST(CallersRecords, AreRestoredWhenCreationFails) {
  for (uint32_t passMode : {1u, MPP_PASS_TILED}) {
    Records records(FORMAT_BGRX8888, 0x60000000, Param().Pass(passMode).Dither());
    MPPHandle marker{};
    records.handle = &marker;
    EXPECT_EQ(records.Create(), KESTREL_UNSUPPORTED);
    EXPECT_EQ(records.handle, nullptr);
    EXPECT_EQ(records.dst.format, FORMAT_BGRX8888);
    EXPECT_EQ(records.src.format, 0x60000000u);
    EXPECT_EQ(records.param.dither, 1u);
    EXPECT_EQ(records.param.passMode, passMode);
  }
}

TEST(CallersRecords, AreRestoredWhenCreationSucceeds) {
  const MPPPARAM given = Param().Tiled().Bilinear().Dither().Adjust(1000, -1000, 7).Alpha(999);
  Records records(FORMAT_RGBX8888, FORMAT_BGRX8888, given);
  ASSERT_EQ(records.Create(), KESTREL_OK);
  EXPECT_EQ(records.dst.format, FORMAT_RGBX8888);
  EXPECT_EQ(records.src.format, FORMAT_BGRX8888);
  EXPECT_EQ(memcmp(&records.param, &given, sizeof given), 0);
}

// ---- dither, alpha, adjustments ----

TEST(Dither, IsKeptForFamilyOne16BitCodesOnly) {
  const struct {
    uint32_t code, kept;
  } rows[] = {{FORMAT_RGB565, 5},   {FORMAT_BGR565, 5}, {0x15000333, 5},
              {0x35000454, 0},      {FORMAT_RGB888, 0}, {FORMAT_XRGB8888, 0},
              {FORMAT_BGRX8888, 0}, {FORMAT_NV21, 0},   {FORMAT_GRAY8, 0}};
  for (const auto& row : rows) {
    MPPPARAM param = Param();
    param.dither = 5;
    const Engine engine({row.code, 8, 8}, {FORMAT_NV21, 8, 8}, param);
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.context().dither, row.kept) << std::hex << row.code;
    EXPECT_EQ(engine.pass().dither, row.kept);
  }
}

TEST(Alpha, IsLimitedTo255AsUnsigned) {
  const uint32_t rows[][2] = {{0, 0},     {1, 1},     {254, 254},        {255, 255},
                              {256, 255}, {~0u, 255}, {0x80000000u, 255}};
  for (const auto& row : rows) {
    const Engine engine({FORMAT_XBGR8888, 8, 8}, kGrey32x16, Param().Alpha(row[0]));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.context().alpha, row[1]);
    EXPECT_EQ(engine.pass().alpha, row[1]);
  }
}

TEST(Adjustments, AreClamped) {
  const int32_t rows[][2] = {{0, 0},       {128, 128},       {129, 128},        {-128, -128},
                             {-129, -128}, {INT32_MAX, 128}, {INT32_MIN, -128}, {-5, -5}};
  for (const auto& row : rows) {
    const Engine engine({FORMAT_XBGR8888, 8, 8}, {FORMAT_NV21, 8, 8},
                        Param().Adjust(row[0], row[0], row[0]));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.context().params.brightness, row[1]);
    EXPECT_EQ(engine.context().params.contrast, row[1]);
    EXPECT_EQ(engine.context().params.saturation, row[1]);
  }
}

// ---- flags ----

struct Flags {
  uint32_t bilinear, unitStep, halfStep, noDownscale, xEnlarge, yEnlarge;
};

void ExpectFlags(const EngineContext& context, const Flags& flags) {
  EXPECT_EQ(context.bilinear != 0, flags.bilinear != 0);
  EXPECT_EQ(context.unitStep != 0, flags.unitStep != 0);
  EXPECT_EQ(context.halfStep != 0, flags.halfStep != 0);
  EXPECT_EQ(context.noDownscale != 0, flags.noDownscale != 0);
  EXPECT_EQ(context.xEnlarge != 0, flags.xEnlarge != 0);
  EXPECT_EQ(context.yEnlarge != 0, flags.yEnlarge != 0);
}

TEST(Flags, FollowTheSteps) {
  const struct {
    int32_t width, height;  // of the destination of a 32 x 16 source
    uint32_t resample;
    Flags flags;
  } rows[] = {
      {32, 16, 0, {0, 1, 0, 1, 0, 0}},   {32, 16, 2, {0, 1, 0, 1, 0, 0}},
      {64, 32, 0, {0, 0, 1, 1, 0, 0}},   {64, 32, 2, {1, 0, 1, 1, 1, 1}},
      {64, 16, 2, {1, 0, 0, 1, 1, 0}},   {32, 32, 2, {1, 0, 0, 1, 0, 1}},
      {16, 8, 2, {1, 0, 0, 0, 0, 0}},    {16, 32, 2, {1, 0, 0, 0, 0, 1}},
      {64, 15, 2, {1, 0, 0, 0, 1, 0}},   {33, 16, 2, {1, 0, 0, 1, 1, 0}},
      {64, 32, 1, {0, 0, 1, 1, 0, 0}},   {64, 32, 3, {0, 0, 1, 1, 0, 0}},
      {64, 32, ~0u, {0, 0, 1, 1, 0, 0}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.width << " x " << row.height << ", " << row.resample);
    MPPPARAM param = Param();
    param.resampleFlags = row.resample;
    const Engine engine({FORMAT_GRAY8, row.width, row.height}, kGrey32x16, param);
    ASSERT_EQ(engine.result(), KESTREL_OK);
    ExpectFlags(engine.context(), row.flags);
    EXPECT_EQ(engine.pass().resampleMode, row.resample);
  }
}

TEST(Flags, ForInterpolatedChannelsAreSetForRgbSourcesOnly) {
  const struct {
    uint32_t code;
    uint32_t expected;
  } rows[] = {{FORMAT_RGB565, 1}, {FORMAT_XBGR8888, 1}, {FORMAT_INDEX8, 1},
              {FORMAT_NV21, 0},   {FORMAT_GRAY8, 0},    {FORMAT_YUYV, 0}};
  static const uint8_t palette[1024] = {};
  for (const auto& row : rows) {
    for (bool bilinear : {false, true}) {
      Param param;
      if (bilinear) param.Bilinear();
      const Engine engine({FORMAT_XBGR8888, 12, 12}, {row.code, 8, 8, palette}, param);
      ASSERT_EQ(engine.result(), KESTREL_OK);
      for (uint32_t word : engine.context().srcRgbBilinear) {
        EXPECT_EQ(word, bilinear ? row.expected : 0u) << std::hex << row.code;
      }
    }
  }
}

TEST(BandSelector, SetsTallBandsAndBandCode) {
  const uint32_t rows[][3] = {{0, 0, 0}, {1, 0, 0}, {2, 0, 1},         {3, 0, 3},
                              {4, 1, 5}, {5, 0, 0}, {0xFFFFFFFF, 0, 0}};
  for (const auto& row : rows) {
    const Engine engine(kGrey32x16, kGrey32x16, Param().Band(row[0]));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.context().tallBands, row[1]) << row[0];
    EXPECT_EQ(engine.context().bandCode, row[2]) << row[0];
    EXPECT_EQ(engine.pass().bandSelector, row[0]);
  }
}

TEST(TransformCode, IsKeptWholeAndAsThreeFlags) {
  for (uint32_t code : {0u, 1u, 2u, 3u, 4u, 5u, 6u, 7u, 8u, 11u, 0xFFFFFFF8u, 0xFFFFFFFFu}) {
    SCOPED_TRACE(code);
    const Engine engine(kGrey32x16, kGrey32x16, Param().Transform(code));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    for (const auto& [swapXY, mirrorX, mirrorY] :
         {std::array{engine.context().swapXY, engine.context().mirrorX, engine.context().mirrorY},
          std::array{engine.pass().swapXY, engine.pass().mirrorX, engine.pass().mirrorY}}) {
      EXPECT_EQ(swapXY, code & 1);
      EXPECT_EQ(mirrorX, code & 2);
      EXPECT_EQ(mirrorY, code & 4);
    }
    EXPECT_EQ(engine.pass().transformCode, code);
  }
}

TEST(PathKind, FollowsWhichSidesAreRgb) {
  static const uint8_t palette[1024] = {};
  const struct {
    uint32_t dst, src, kind;
  } rows[] = {{FORMAT_NV21, FORMAT_I420, 0},     {FORMAT_GRAY8, FORMAT_YUYV, 0},
              {FORMAT_RGB565, FORMAT_NV12, 1},   {FORMAT_XBGR8888, FORMAT_GRAY8, 1},
              {FORMAT_RGB888, FORMAT_RGB565, 2}, {FORMAT_XRGB8888, FORMAT_INDEX4, 2},
              {FORMAT_NV21, FORMAT_XBGR8888, 3}, {FORMAT_GRAY8, FORMAT_INDEX1, 3}};
  for (const auto& row : rows) {
    const Engine engine({row.dst, 8, 8}, {row.src, 8, 8, palette});
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.context().pathKind, row.kind) << std::hex << row.dst << " " << row.src;
  }
}

TEST(WideRgbOut, IsClearedForYuvTo16BitRgbOnly) {
  const struct {
    uint32_t dst, src, expected;
  } rows[] = {{FORMAT_RGB565, FORMAT_NV21, 0},   {FORMAT_BGR565, FORMAT_GRAY8, 0},
              {FORMAT_RGB565, FORMAT_RGB888, 1}, {FORMAT_RGB888, FORMAT_NV21, 1},
              {FORMAT_NV21, FORMAT_RGB565, 1},   {FORMAT_NV21, FORMAT_NV12, 1}};
  for (const auto& row : rows) {
    const Engine engine({row.dst, 8, 8}, {row.src, 8, 8});
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.context().wideRgbOut, row.expected) << std::hex << row.dst << " " << row.src;
    EXPECT_EQ(engine.context().tableEnabled, 1u);
  }
}

TEST(NeedsLevelTable, ForYuvToYuvWithAnAdjustmentOrAChangeOfRange) {
  const uint32_t i420 = FORMAT_I420;
  const struct {
    uint32_t dst, src;
    int32_t adjust[3];
    uint32_t expected;
  } rows[] = {
      {i420, i420, {0, 0, 0}, 0},
      {i420, i420, {1, 0, 0}, 1},
      {i420, i420, {0, -1, 0}, 1},
      {i420, i420, {0, 0, 1}, 1},
      {i420 | FORMAT_BT601_FULL, i420, {0, 0, 0}, 1},
      {i420, i420 | FORMAT_BT709_FULL, {0, 0, 0}, 1},
      {i420 | FORMAT_BT709_VIDEO, i420, {0, 0, 0}, 0},
      {i420 | FORMAT_BT709_FULL, i420 | FORMAT_BT601_FULL, {0, 0, 0}, 0},
      {FORMAT_GRAY8 | FORMAT_BT601_FULL, FORMAT_GRAY8, {0, 0, 0}, 1},
      {FORMAT_RGB888, i420 | FORMAT_BT601_FULL, {1, 1, 1}, 0},
      {i420 | FORMAT_BT601_FULL, FORMAT_RGB888, {1, 1, 1}, 0},
      {FORMAT_RGB565, FORMAT_RGB888, {1, 1, 1}, 0},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.dst << " " << row.src);
    const Engine engine({row.dst, 8, 8}, {row.src, 8, 8},
                        Param().Adjust(row.adjust[0], row.adjust[1], row.adjust[2]));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.context().needsLevelTable, row.expected);
  }
}

// ---- block mode ----

struct BlockCase {
  const char* name;
  uint32_t dst, src;
  int32_t dstWidth, dstHeight;  // from 16 x 16
  uint32_t transform;
  bool bilinear;
  uint32_t passMode;
  uint32_t blockMode;
  uint32_t fast;
  int32_t brightness;
};

void PrintTo(const BlockCase& c, std::ostream* out) {
  *out << c.name;
}

class BlockMode : public testing::TestWithParam<BlockCase> {};

TEST_P(BlockMode, IsSettledAtCreation) {
  const BlockCase& c = GetParam();
  static const uint8_t palette[1024] = {};
  Param param;
  param.Pass(c.passMode).Transform(c.transform).Adjust(c.brightness, 0, 0);
  if (c.bilinear) param.Bilinear();
  const Engine engine({c.dst, c.dstWidth, c.dstHeight}, {c.src, 16, 16, palette}, param);
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.context().blockMode, c.blockMode);
  EXPECT_EQ(engine.context().i420Fast4x4 != 0, c.fast != 0);
  EXPECT_EQ(engine.handle()->passMode, c.passMode);
  EXPECT_EQ(engine.handle()->pass[1], nullptr);
  EXPECT_EQ(engine.handle()->pass[2], nullptr);
}

constexpr uint32_t kI420 = FORMAT_I420;
constexpr uint32_t kNv21 = FORMAT_NV21;

std::string BlockCaseName(const testing::TestParamInfo<BlockCase>& info) {
  return info.param.name;
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(Rules, BlockMode, testing::Values(
    BlockCase{"given1", kNv21, kI420, 24, 24, 0, true, 1, 1, 0, 0},
    BlockCase{"given2", kNv21, kI420, 24, 24, 0, true, 2, 2, 0, 0},
    BlockCase{"given3", kNv21, kI420, 24, 24, 0, true, 3, 3, 0, 0},
    BlockCase{"given0", kNv21, kI420, 24, 24, 0, true, 0, 1, 0, 0},
    BlockCase{"given5", kNv21, kI420, 24, 24, 0, true, 5, 1, 0, 0},
    BlockCase{"given255", kNv21, kI420, 24, 24, 0, true, 255, 1, 0, 0},
    BlockCase{"given257", kNv21, kI420, 24, 24, 0, true, 257, 1, 0, 0},
    BlockCase{"givenMinus1", kNv21, kI420, 24, 24, 0, true, ~0u, 1, 0, 0},
    BlockCase{"openPlanarSource", kNv21, 0x50000822, 24, 24, 0, true, 3, 1, 0, 0},
    BlockCase{"openPlanarDestination", 0x50000a22, kI420, 24, 24, 0, true, 2, 1, 0, 0},
    BlockCase{"palette", FORMAT_RGB888, FORMAT_INDEX8, 24, 24, 0, true, 3, 1, 0, 0},
    BlockCase{"special", kI420, kI420, 24, 24, 0, true, 4, 4, 1, 0},
    BlockCase{"special90", kI420, kI420, 24, 24, 3, true, 4, 4, 1, 0},
    BlockCase{"special270", kI420, kI420, 24, 24, 5, true, 4, 4, 1, 0},
    BlockCase{"special180", kI420, kI420, 24, 24, 6, true, 4, 3, 0, 0},
    BlockCase{"specialTransposed", kI420, kI420, 24, 24, 1, true, 4, 3, 0, 0},
    BlockCase{"specialMirrored", kI420, kI420, 24, 24, 2, true, 4, 3, 0, 0},
    BlockCase{"specialUpperTransformBits", kI420, kI420, 24, 24, 8, true, 4, 3, 0, 0},
    BlockCase{"specialUpperTransformBits90", kI420, kI420, 24, 24, 11, true, 4, 3, 0, 0},
    BlockCase{"specialNearest", kI420, kI420, 24, 24, 0, false, 4, 3, 0, 0},
    BlockCase{"specialOtherSource", kI420, FORMAT_YV12, 24, 24, 0, true, 4, 3, 0, 0},
    BlockCase{"specialOtherDestination", kNv21, kI420, 24, 24, 0, true, 4, 3, 0, 0},
    BlockCase{"specialAdjusted", kI420, kI420, 24, 24, 0, true, 4, 4, 1, 9},
    BlockCase{"unit1", kI420, kI420, 16, 16, 0, true, 1, 1, 0, 0},
    BlockCase{"unit2", kI420, kI420, 16, 16, 0, true, 2, 2, 0, 0},
    BlockCase{"unit3", kI420, kI420, 16, 16, 0, true, 3, 3, 0, 0},
    BlockCase{"unit4", kI420, kI420, 16, 16, 0, true, 4, 3, 0, 0},
    BlockCase{"unit2Levels", kI420, kI420, 16, 16, 0, true, 2, 2, 0, 9},
    BlockCase{"unit3Levels", kI420, kI420, 16, 16, 0, true, 3, 2, 0, 9},
    BlockCase{"unit4Levels", kI420, kI420, 16, 16, 0, true, 4, 2, 0, 9},
    BlockCase{"unit3Rgb", FORMAT_RGB888, kI420, 16, 16, 0, true, 3, 3, 0, 9},
    BlockCase{"scaled3Levels", kI420, kI420, 24, 24, 0, true, 3, 3, 0, 9},
    BlockCase{"half3Levels", kI420, kI420, 32, 32, 0, true, 3, 3, 0, 9}),
    BlockCaseName);
// clang-format on

TEST(BlockMode, OfAnIndexedSourceWithoutPaletteIsKept) {
  const Engine engine({FORMAT_RGB888, 24, 24}, {FORMAT_INDEX8, 16, 16}, Param().Pass(3));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.context().blockMode, 3u);
}

TEST(BlockMode, SpecialIsTakenBackWhenACropEndsAtUnitSteps) {
  const Engine engine({FORMAT_I420, 480, 480}, {FORMAT_I420, 640, 480},
                      Param().Pass(4).Bilinear().Aspect(MPP_ASPECT_CROP));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.context().blockMode, 3u);
  EXPECT_EQ(engine.context().i420Fast4x4, 0u);
}

// ---- geometry ----

struct Geometry {
  const char* name;
  int32_t dst[2], src[2];
  uint32_t aspect, mode, transform;
  int32_t dstOrigin[2], srcOrigin[2];
  MRECT srcRectGiven;
  uint32_t step[2], invStep[2];
  int32_t srcRegion[4], dstRegion[4];  // x, y, width, height
  MRECT srcRect, dstRect;
};

class Placement : public testing::TestWithParam<Geometry> {};

TEST_P(Placement, OfRegionsAndRectangles) {
  const Geometry& g = GetParam();
  Param param;
  param.Aspect(g.aspect).Pass(g.mode).Transform(g.transform);
  param.DstOrigin(g.dstOrigin[0], g.dstOrigin[1]).SrcOrigin(g.srcOrigin[0], g.srcOrigin[1]);
  param.srcRect = g.srcRectGiven;
  const Engine engine({kGrey, g.dst[0], g.dst[1]}, {kGrey, g.src[0], g.src[1]}, param);
  ASSERT_EQ(engine.result(), KESTREL_OK);
  const EngineContext& context = engine.context();
  const PassEngine& pass = engine.pass();
  EXPECT_EQ(context.stepX, g.step[0]);
  EXPECT_EQ(context.stepY, g.step[1]);
  EXPECT_EQ(context.invStepX, g.invStep[0]);
  EXPECT_EQ(context.invStepY, g.invStep[1]);
  EXPECT_EQ(pass.srcRegionX, g.srcRegion[0]);
  EXPECT_EQ(pass.srcRegionY, g.srcRegion[1]);
  EXPECT_EQ(pass.srcRegionWidth, g.srcRegion[2]);
  EXPECT_EQ(pass.srcRegionHeight, g.srcRegion[3]);
  EXPECT_EQ(pass.dstRegionX, g.dstRegion[0]);
  EXPECT_EQ(pass.dstRegionY, g.dstRegion[1]);
  EXPECT_EQ(pass.dstRegionWidth, g.dstRegion[2]);
  EXPECT_EQ(pass.dstRegionHeight, g.dstRegion[3]);
  EXPECT_EQ(context.srcOriginX, g.srcRegion[0]);
  EXPECT_EQ(context.srcOriginY, g.srcRegion[1]);
  const bool swapped = (g.transform & MPP_SWAP_XY) != 0;
  EXPECT_EQ(context.dstOriginX, g.dstRegion[swapped ? 1 : 0]);
  EXPECT_EQ(context.dstOriginY, g.dstRegion[swapped ? 0 : 1]);
  EXPECT_EQ(context.srcRect, g.srcRect);
  EXPECT_EQ(context.dstRect, g.dstRect);

  EXPECT_EQ(pass.stepX, context.stepX);
  EXPECT_EQ(pass.stepY, context.stepY);
  EXPECT_EQ(pass.invStepX, context.invStepX);
  EXPECT_EQ(pass.invStepY, context.invStepY);
  EXPECT_EQ(pass.dstOriginX, context.dstOriginX);
  EXPECT_EQ(pass.dstOriginY, context.dstOriginY);
  EXPECT_EQ(pass.srcOriginX, context.srcOriginX);
  EXPECT_EQ(pass.srcOriginY, context.srcOriginY);
  EXPECT_EQ(pass.srcRect, context.srcRect);
  EXPECT_EQ(pass.dstRect, context.dstRect);
}

void PrintTo(const Geometry& g, std::ostream* out) {
  *out << g.name;
}

std::string GeometryName(const testing::TestParamInfo<Geometry>& info) {
  return info.param.name;
}

// clang-format off
// The rectangle that the source region covers is measured from sample centres, so an unscaled job
// covers everything one to the right and below its origin.
INSTANTIATE_TEST_SUITE_P(WithoutPolicy, Placement, testing::Values(
    Geometry{"unscaled", {31, 17}, {31, 17}, 0, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {65536, 65536}, {65536, 65536}, {0, 0, 31, 17}, {0, 0, 31, 17},
        {0, 0, 31, 17}, {1, 1, 32, 18}},
    Geometry{"unscaledWithOrigins", {31, 17}, {31, 17}, 0, 1, 0, {100, 50}, {7, 9}, {0, 0, 0, 0},
        {65536, 65536}, {65536, 65536}, {7, 9, 31, 17}, {100, 50, 31, 17},
        {7, 9, 38, 26}, {101, 51, 132, 68}},
    Geometry{"unscaledSwapped", {17, 31}, {31, 17}, 0, 1, 1, {100, 50}, {7, 9}, {0, 0, 0, 0},
        {65536, 65536}, {65536, 65536}, {7, 9, 31, 17}, {100, 50, 17, 31},
        {7, 9, 38, 26}, {51, 101, 82, 118}},
    Geometry{"unscaledMirrored", {31, 17}, {31, 17}, 0, 1, 6, {100, 50}, {7, 9}, {0, 0, 0, 0},
        {65536, 65536}, {65536, 65536}, {7, 9, 31, 17}, {100, 50, 31, 17},
        {7, 9, 38, 26}, {101, 51, 132, 68}},
    Geometry{"equalStepsIgnorePolicy", {20, 10}, {10, 5}, 3, 3, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {32768, 32768}, {131072, 131072}, {0, 0, 10, 5}, {0, 0, 20, 10},
        {0, 0, 10, 5}, {1, 1, 20, 10}},
    Geometry{"halved", {640, 480}, {1280, 720}, 0, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {131072, 98304}, {32768, 43690}, {0, 0, 1280, 720}, {0, 0, 640, 480},
        {0, 0, 1280, 720}, {0, 0, 641, 481}},
    Geometry{"truncatedSteps", {7, 5}, {3, 11}, 0, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {28086, 144179}, {152917, 29789}, {0, 0, 3, 11}, {0, 0, 7, 5},
        {0, 0, 3, 11}, {1, 0, 7, 6}},
    Geometry{"saturatedStep", {1, 1}, {65536, 65535}, 0, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {4294967295, 4294901760}, {1, 1}, {0, 0, 65536, 65535}, {0, 0, 1, 1},
        {0, 0, 65536, 65535}, {0, 0, 2, 2}},
    Geometry{"smallestStep", {65536, 4}, {1, 4}, 0, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {1, 65536}, {4294967295, 65536}, {0, 0, 1, 4}, {0, 0, 65536, 4},
        {0, 0, 1, 4}, {32768, 1, 32769, 5}},
    Geometry{"givenSourceRectangle", {32, 32}, {64, 16}, 0, 1, 0, {0, 0}, {8, 4}, {10, 6, 40, 12},
        {131072, 32768}, {32768, 131072}, {8, 4, 64, 16}, {0, 0, 32, 32},
        {10, 6, 40, 12}, {1, 5, 17, 16}},
    Geometry{"truncatesTowardZero", {16, 16}, {64, 64}, 0, 1, 0, {0, 0}, {32, 32}, {0, 10, 90, 90},
        {262144, 262144}, {16384, 16384}, {32, 32, 64, 64}, {0, 0, 16, 16},
        {0, 10, 90, 90}, {-7, -4, 15, 15}},
    Geometry{"givenByOneWord", {16, 16}, {16, 16}, 0, 1, 0, {0, 0}, {2, 2}, {0, 0, 0, 5},
        {65536, 65536}, {65536, 65536}, {2, 2, 16, 16}, {0, 0, 16, 16},
        {0, 0, 0, 5}, {-1, -1, -1, 4}}),
    GeometryName);

// The fitted length is rounded down to the block, its margin up.
INSTANTIATE_TEST_SUITE_P(Fit, Placement, testing::Values(
    Geometry{"wideMode1", {100, 100}, {64, 47}, 1, 1, 0, {3, 5}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {3, 19, 100, 72},
        {0, 0, 64, 47}, {4, 20, 103, 93}},
    Geometry{"wideMode2", {100, 100}, {64, 47}, 1, 2, 0, {3, 5}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {3, 19, 100, 72},
        {0, 0, 64, 47}, {4, 20, 103, 93}},
    Geometry{"wideMode3", {100, 100}, {64, 47}, 1, 3, 0, {3, 5}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {3, 21, 100, 68},
        {0, 0, 64, 47}, {4, 22, 103, 95}},
    Geometry{"wideMode4", {100, 100}, {64, 47}, 1, 4, 0, {3, 5}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {3, 21, 100, 68},
        {0, 0, 64, 47}, {4, 22, 103, 95}},
    Geometry{"tallMode1", {100, 100}, {47, 64}, 1, 1, 0, {3, 5}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 47, 64}, {17, 5, 72, 100},
        {0, 0, 47, 64}, {18, 6, 91, 105}},
    Geometry{"tallMode2", {100, 100}, {47, 64}, 1, 2, 0, {3, 5}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 47, 64}, {17, 5, 72, 100},
        {0, 0, 47, 64}, {18, 6, 91, 105}},
    Geometry{"tallMode3", {100, 100}, {47, 64}, 1, 3, 0, {3, 5}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 47, 64}, {19, 5, 68, 100},
        {0, 0, 47, 64}, {20, 6, 93, 105}},
    Geometry{"swappedMode1", {90, 100}, {64, 47}, 1, 1, 1, {10, 20}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {19, 20, 72, 100},
        {0, 0, 64, 47}, {21, 20, 120, 93}},
    Geometry{"swappedMode2", {90, 100}, {64, 47}, 1, 2, 1, {10, 20}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {20, 20, 70, 100},
        {0, 0, 64, 47}, {21, 21, 120, 94}},
    Geometry{"swappedMode3", {90, 100}, {64, 47}, 1, 3, 1, {10, 20}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {22, 20, 66, 100},
        {0, 0, 64, 47}, {21, 23, 120, 96}},
    Geometry{"swapped3", {90, 100}, {64, 47}, 1, 3, 3, {10, 20}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {22, 20, 66, 100},
        {0, 0, 64, 47}, {21, 23, 120, 96}},
    Geometry{"swapped5", {90, 100}, {64, 47}, 1, 3, 5, {10, 20}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {22, 20, 66, 100},
        {0, 0, 64, 47}, {21, 23, 120, 96}},
    Geometry{"swapped7", {90, 100}, {64, 47}, 1, 3, 7, {10, 20}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {22, 20, 66, 100},
        {0, 0, 64, 47}, {21, 23, 120, 96}},
    Geometry{"squareOfFourThirds", {480, 480}, {640, 480}, 1, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {87381, 87381}, {49152, 49152}, {0, 0, 640, 480}, {0, 60, 480, 360},
        {0, 0, 640, 480}, {0, 60, 481, 421}},
    Geometry{"emptiedMode1", {100, 100}, {640, 2}, 1, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {419430, 419430}, {10240, 10240}, {0, 0, 640, 2}, {0, 50, 100, 0},
        {0, 0, 640, 2}, {0, 50, 101, 51}},
    Geometry{"emptiedMode3", {100, 100}, {640, 2}, 1, 3, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {419430, 419430}, {10240, 10240}, {0, 0, 640, 2}, {0, 52, 100, -4},
        {0, 0, 640, 2}, {0, 52, 101, 53}}),
    GeometryName);

// The kept length is rounded down to the block, and so is its margin. The source rectangle stays
// that of the whole region: edge neighbours come from outside the window.
INSTANTIATE_TEST_SUITE_P(Crop, Placement, testing::Values(
    Geometry{"wideMode1", {100, 100}, {64, 47}, 2, 1, 0, {0, 0}, {3, 5}, {0, 0, 0, 0},
        {30801, 30801}, {139438, 139438}, {12, 5, 46, 47}, {0, 0, 100, 100},
        {3, 5, 67, 52}, {-17, 1, 117, 100}},
    Geometry{"wideMode2", {100, 100}, {64, 47}, 2, 2, 0, {0, 0}, {3, 5}, {0, 0, 0, 0},
        {30801, 30801}, {139438, 139438}, {11, 5, 48, 47}, {0, 0, 100, 100},
        {3, 5, 67, 52}, {-15, 1, 119, 100}},
    Geometry{"wideMode3", {100, 100}, {64, 47}, 2, 3, 0, {0, 0}, {3, 5}, {0, 0, 0, 0},
        {30801, 30801}, {139438, 139438}, {11, 5, 48, 47}, {0, 0, 100, 100},
        {3, 5, 67, 52}, {-15, 1, 119, 100}},
    Geometry{"tallMode1", {100, 100}, {47, 64}, 2, 1, 0, {0, 0}, {3, 5}, {0, 0, 0, 0},
        {30801, 30801}, {139438, 139438}, {3, 14, 47, 46}, {0, 0, 100, 100},
        {3, 5, 50, 69}, {1, -17, 100, 117}},
    Geometry{"tallMode2", {100, 100}, {47, 64}, 2, 2, 0, {0, 0}, {3, 5}, {0, 0, 0, 0},
        {30801, 30801}, {139438, 139438}, {3, 13, 47, 48}, {0, 0, 100, 100},
        {3, 5, 50, 69}, {1, -15, 100, 119}},
    Geometry{"tallMode3", {100, 100}, {47, 64}, 2, 3, 0, {0, 0}, {3, 5}, {0, 0, 0, 0},
        {30801, 30801}, {139438, 139438}, {3, 13, 47, 48}, {0, 0, 100, 100},
        {3, 5, 50, 69}, {1, -15, 100, 119}},
    Geometry{"swappedMode1", {300, 600}, {640, 481}, 2, 1, 1, {0, 0}, {4, 6}, {0, 0, 0, 0},
        {69905, 69905}, {61440, 61440}, {4, 87, 640, 319}, {0, 0, 300, 600},
        {4, 6, 644, 487}, {0, -74, 601, 376}},
    Geometry{"swappedMode2", {300, 600}, {640, 481}, 2, 2, 1, {0, 0}, {4, 6}, {0, 0, 0, 0},
        {69905, 69905}, {61440, 61440}, {4, 86, 640, 321}, {0, 0, 300, 600},
        {4, 6, 644, 487}, {0, -74, 601, 376}},
    Geometry{"swappedMode3", {300, 600}, {640, 481}, 2, 3, 1, {0, 0}, {4, 6}, {0, 0, 0, 0},
        {69905, 69905}, {61440, 61440}, {4, 86, 640, 321}, {0, 0, 300, 600},
        {4, 6, 644, 487}, {0, -74, 601, 376}},
    Geometry{"squareOfFourThirds", {480, 480}, {640, 480}, 2, 3, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {65536, 65536}, {65536, 65536}, {80, 0, 480, 480}, {0, 0, 480, 480},
        {0, 0, 640, 480}, {-79, 1, 561, 481}},
    Geometry{"squareEnlarged", {960, 960}, {640, 480}, 2, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {32768, 32768}, {131072, 131072}, {80, 0, 480, 480}, {0, 0, 960, 960},
        {0, 0, 640, 480}, {-158, 1, 1120, 960}}),
    GeometryName);

// With both bits the crop works on the fitted size, on its width branch because the steps are equal
// by then. It can widen the source beyond its region; the rounding of such margins is downward.
INSTANTIATE_TEST_SUITE_P(FitThenCrop, Placement, testing::Values(
    Geometry{"wideMode1", {100, 100}, {64, 47}, 3, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {0, 14, 100, 72},
        {0, 0, 64, 47}, {1, 15, 100, 88}},
    Geometry{"wideMode2", {100, 100}, {64, 47}, 3, 2, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {0, 0, 64, 47}, {0, 14, 100, 72},
        {0, 0, 64, 47}, {1, 15, 100, 88}},
    Geometry{"wideMode3", {100, 100}, {64, 47}, 3, 3, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {41943, 41943}, {102400, 102400}, {-4, 0, 72, 47}, {0, 16, 100, 68},
        {0, 0, 64, 47}, {7, 17, 106, 90}},
    Geometry{"flatMode1", {100, 100}, {641, 50}, 3, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {420085, 420085}, {10224, 10224}, {-96, 0, 833, 50}, {0, 47, 100, 6},
        {0, 0, 641, 50}, {15, 47, 116, 56}},
    Geometry{"flatMode2", {100, 100}, {641, 50}, 3, 2, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {420085, 420085}, {10224, 10224}, {-304, 0, 1249, 50}, {0, 48, 100, 4},
        {0, 0, 641, 50}, {48, 48, 148, 57}},
    Geometry{"flatMode3", {100, 100}, {641, 50}, 3, 3, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {420085, 420085}, {10224, 10224}, {-304, 0, 1249, 50}, {0, 48, 100, 4},
        {0, 0, 641, 50}, {48, 48, 148, 57}},
    Geometry{"tallMode1", {100, 100}, {48, 640}, 3, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {419430, 419430}, {10240, 10240}, {5, 0, 38, 640}, {47, 0, 6, 100},
        {0, 0, 48, 640}, {47, 0, 55, 101}},
    Geometry{"tallMode2", {100, 100}, {48, 640}, 3, 2, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {419430, 419430}, {10240, 10240}, {12, 0, 24, 640}, {48, 0, 4, 100},
        {0, 0, 48, 640}, {47, 0, 55, 101}},
    Geometry{"tallMode3", {100, 100}, {48, 640}, 3, 3, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {419430, 419430}, {10240, 10240}, {12, 0, 24, 640}, {48, 0, 4, 100},
        {0, 0, 48, 640}, {47, 0, 55, 101}},
    Geometry{"otherBitsAreIgnored", {100, 100}, {64, 47}, 4, 1, 0, {0, 0}, {0, 0}, {0, 0, 0, 0},
        {41943, 30801}, {102400, 139438}, {0, 0, 64, 47}, {0, 0, 100, 100},
        {0, 0, 64, 47}, {1, 1, 100, 100}}),
    GeometryName);

// clang-format on

TEST(Fit, InTheSpecialBlockModeRoundsNothing) {
  const Engine engine({FORMAT_I420, 100, 100}, {FORMAT_I420, 64, 47},
                      Param().Bilinear().Pass(4).Aspect(MPP_ASPECT_FIT));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.context().blockMode, 4u);
  EXPECT_EQ(engine.pass().dstRegionY, 14);
  EXPECT_EQ(engine.pass().dstRegionHeight, 72);
}

// ---- flags that the aspect policy leaves or makes true ----

TEST(Crop, ThatEndsAtUnitStepsStaysBilinearAndKeepsTheEarlierDownscaleFlag) {
  const Engine engine({kGrey, 480, 480}, {kGrey, 640, 480},
                      Param().Bilinear().Aspect(MPP_ASPECT_CROP));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  ExpectFlags(engine.context(), {1, 1, 0, 0, 0, 0});
}

TEST(Crop, ThatEndsAtHalfStepsSetsTheFlag) {
  const Engine engine({kGrey, 960, 960}, {kGrey, 640, 480},
                      Param().Bilinear().Aspect(MPP_ASPECT_CROP));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  ExpectFlags(engine.context(), {1, 0, 1, 1, 1, 1});
}

TEST(Fit, ThatEndsAtUnitStepsStaysBilinear) {
  const Engine engine({kGrey, 640, 960}, {kGrey, 640, 480},
                      Param().Bilinear().Aspect(MPP_ASPECT_FIT));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.pass().dstRegionHeight, 480);
  ExpectFlags(engine.context(), {1, 1, 0, 1, 0, 0});
}

TEST(Fit, ThatShrinksOneAxisKeepsTheEarlierDownscaleFlag) {
  const Engine engine({kGrey, 64, 8}, {kGrey, 16, 16}, Param().Bilinear().Aspect(MPP_ASPECT_FIT));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.context().stepX, 131072u);
  ExpectFlags(engine.context(), {1, 0, 0, 0, 0, 0});
}

TEST(AspectPolicy, ThatEmptiesARegionLeavesAnEngineThatDrawsNothing) {
  for (uint32_t aspect : {MPP_ASPECT_FIT, MPP_ASPECT_FIT | MPP_ASPECT_CROP}) {
    for (uint32_t mode : {1u, 2u, 3u, MPP_PASS_TILED}) {
      SCOPED_TRACE(testing::Message() << aspect << " " << mode);
      const Engine engine({kGrey, 100, 100}, {kGrey, 640, 2}, Param().Aspect(aspect).Pass(mode));
      ASSERT_EQ(engine.result(), KESTREL_OK);
      EXPECT_LE(engine.pass().dstRegionHeight, 0);
      Bytes src(640 * 2, 1);
      Bytes dst(100 * 100, 9);
      EXPECT_EQ(Process(engine, OnePlane(dst, 100), OnePlane(src, 640)), KESTREL_OK);
      EXPECT_EQ(dst, Bytes(100 * 100, 9));
    }
  }
}

// ---- layouts, factors and channels ----

TEST(Layouts, OfTheDestinationStepBackwardsWhenMirrored) {
  for (uint32_t code = 0; code < 8; ++code) {
    SCOPED_TRACE(code);
    const Engine engine({FORMAT_NV21, 16, 16}, {FORMAT_YUYV, 16, 16}, Param().Transform(code));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    const int32_t sign = (code & MPP_MIRROR_X) != 0 ? -1 : 1;
    for (const PlaneLayout* layout : {&engine.context().dstLayout, &engine.pass().dstLayout}) {
      EXPECT_EQ(layout->step[0], sign);
      EXPECT_EQ(layout->step[1], 2 * sign);
      EXPECT_EQ(layout->step[2], 2 * sign);
      EXPECT_EQ(layout->code, CODE_NV21);
      EXPECT_EQ(layout->planeCount, 3u);
    }
    EXPECT_EQ(engine.context().srcLayout.step[0], 2);
    EXPECT_EQ(engine.context().srcLayout.step[1], 4);
    EXPECT_EQ(engine.pass().srcLayout.code, CODE_YUYV);
  }
}

TEST(Factors, OfTheDestinationAreExchangedWhenSwapped) {
  for (uint32_t code = 0; code < 8; ++code) {
    SCOPED_TRACE(code);
    const Engine engine({FORMAT_I422, 16, 16}, {FORMAT_I440, 16, 16}, Param().Transform(code));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    const bool swapped = (code & MPP_SWAP_XY) != 0;
    const std::array<uint32_t, 6> across = {1, 2, 2, 1, 1, 1};
    const std::array<uint32_t, 6> down = {1, 1, 1, 1, 2, 2};
    const std::array<uint32_t, 6>& expected = swapped ? down : across;
    for (int i = 0; i < 6; ++i) {
      EXPECT_EQ(engine.context().dstSubsample[i], expected[i]) << i;
      EXPECT_EQ(engine.context().srcSubsample[i], down[i]) << i;
    }
  }
}

TEST(DstPlaneFactors, AreThoseBeforeMirroringAndSwapping) {
  for (uint32_t code = 0; code < 8; ++code) {
    const Engine engine({FORMAT_NV61, 16, 16}, {FORMAT_I420, 16, 16}, Param().Transform(code));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    const std::array<uint32_t, 9> expected = {1, 2, 2, 1, 2, 2, 1, 1, 1};
    for (int i = 0; i < 9; ++i) {
      EXPECT_EQ(engine.context().dstPlaneFactors[i], expected[i]) << code << " " << i;
      EXPECT_EQ(engine.pass().dstPlaneFactors[i], expected[i]) << code << " " << i;
    }
  }
}

TEST(Channels, HoldSizesAndPositionsOfRedGreenBlue) {
  const Engine engine({FORMAT_BGR565, 8, 8}, {FORMAT_RGB666, 8, 8});
  ASSERT_EQ(engine.result(), KESTREL_OK);
  const EngineContext& context = engine.context();
  const uint32_t dstSize[3] = {5, 6, 5};
  const uint32_t dstPos[3] = {0, 5, 11};
  const uint32_t srcSize[3] = {6, 6, 6};
  const uint32_t srcPos[3] = {12, 6, 0};
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(context.dstChannelSize[i], dstSize[i]);
    EXPECT_EQ(context.dstChannelPos[i], dstPos[i]);
    EXPECT_EQ(context.srcChannelSize[i], srcSize[i]);
    EXPECT_EQ(context.srcChannelPos[i], srcPos[i]);
  }
}

TEST(Formats, AreKeptWithTheirGivenSizes) {
  const Engine engine({FORMAT_NV21 | FORMAT_BT709_FULL, 40, 20}, {FORMAT_RGB565, 16, 8},
                      Param().Transform(1));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.context().dstFormat.code, CODE_NV21);
  EXPECT_EQ(engine.context().dstFormat.width, 40);
  EXPECT_EQ(engine.context().dstFormat.height, 20);
  EXPECT_EQ(engine.context().dstFormat.colourStandard, CS_BT709_FULL);
  EXPECT_EQ(engine.context().srcFormat.code, CODE_RGB);
  EXPECT_EQ(engine.context().srcFormat.width, 16);
  EXPECT_EQ(engine.context().srcFormat.height, 8);
  EXPECT_EQ(engine.context().srcFormat.colourStandard, 16u);
}

// ---- tiled handles ----

TEST(TiledHandle, HoldsThreeEnginesThatDifferInBlockMode) {
  const Engine engine({FORMAT_NV21, 40, 24}, {FORMAT_I420, 16, 8}, Param().Tiled().Bilinear());
  ASSERT_EQ(engine.result(), KESTREL_OK);
  EXPECT_EQ(engine.handle()->passMode, 256u);
  for (int i = 0; i < 3; ++i) {
    ASSERT_NE(engine.handle()->pass[i], nullptr);
    EXPECT_EQ(engine.context(i).blockMode, static_cast<uint32_t>(i + 1));
    EXPECT_EQ(engine.context(i).params.passMode, static_cast<uint32_t>(i + 1));
    EXPECT_EQ(engine.context(i).stepX, engine.context(0).stepX);
    EXPECT_EQ(engine.context(i).dstRect, engine.context(0).dstRect);
    EXPECT_EQ(engine.context(i).i420Fast4x4, 0u);
  }
}

TEST(TiledHandle, HasMarginsThatDifferByEngine) {
  const Engine fit({kGrey, 90, 100}, {kGrey, 64, 47},
                   Param().Tiled().Transform(1).Aspect(MPP_ASPECT_FIT).DstOrigin(10, 20));
  ASSERT_EQ(fit.result(), KESTREL_OK);
  const int32_t x[3] = {19, 20, 22};
  const int32_t width[3] = {72, 70, 66};
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(fit.pass(i).dstRegionX, x[i]);
    EXPECT_EQ(fit.pass(i).dstRegionWidth, width[i]);
    EXPECT_EQ(fit.pass(i).dstRegionY, 20);
    EXPECT_EQ(fit.pass(i).dstRegionHeight, 100);
  }
  const Engine crop({kGrey, 100, 100}, {kGrey, 64, 47},
                    Param().Tiled().Aspect(MPP_ASPECT_CROP).SrcOrigin(3, 5));
  ASSERT_EQ(crop.result(), KESTREL_OK);
  const int32_t srcX[3] = {12, 11, 11};
  for (int i = 0; i < 3; ++i) EXPECT_EQ(crop.pass(i).srcRegionX, srcX[i]);
}

TEST(PassMode, GivenIsKeptInTheHandle) {
  for (uint32_t mode : {0u, 1u, 2u, 3u, 4u, 7u, ~0u}) {
    const Engine engine(kGrey32x16, kGrey32x16, Param().Pass(mode));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.handle()->passMode, mode);
    EXPECT_NE(engine.handle()->pass[0], nullptr);
  }
}

TEST(OneEngine, IsBuiltByTheBuilderAsByTheHandle) {
  const MPPFORMAT dst = {FORMAT_NV21, 40, 24, nullptr};
  const MPPFORMAT src = {FORMAT_XBGR8888, 16, 8, nullptr};
  const MPPPARAM param = Param().Pass(3).Bilinear();
  PassEngine* built = nullptr;
  ASSERT_EQ(MPPBuildEngine(&dst, &src, &param, &built), KESTREL_OK);
  MPPHandle own = {3, {built, nullptr, nullptr}};
  const Engine engine({FORMAT_NV21, 40, 24}, {FORMAT_XBGR8888, 16, 8}, param);
  EXPECT_EQ(built->context->blockMode, engine.context().blockMode);
  EXPECT_EQ(built->stepX, engine.pass().stepX);
  EXPECT_EQ(built->context->tableSize, engine.context().tableSize);
  Bytes bytes(16 * 8 * 4, 77);
  Bytes luma(40 * 24), chroma(40 * 12), luma2(40 * 24), chroma2(40 * 12);
  const Planes in = OnePlane(bytes, 64);
  const Planes out = VFirst(luma, 40, chroma, 40);
  EXPECT_EQ(MPProcess(&own, out.plane, nullptr, out.pitch, in.plane, in.pitch), KESTREL_OK);
  EXPECT_EQ(Process(engine, VFirst(luma2, 40, chroma2, 40), in), KESTREL_OK);
  EXPECT_EQ(luma, luma2);
  EXPECT_EQ(chroma, chroma2);

  // A handle of the library's own frees the engine with it.
  MPPFORMAT plain = {FORMAT_GRAY8, 8, 8, nullptr};
  MPPFORMAT other = plain;
  MPPPARAM plainParam = Param();
  MPPHandle* handle = nullptr;
  ASSERT_EQ(MPPCreate(&plain, &other, &plainParam, &handle), KESTREL_OK);
  handle->pass[1] = built;
  EXPECT_EQ(MPPDestroy(handle), KESTREL_OK);
}

}  // namespace
}  // namespace kestrel::test
