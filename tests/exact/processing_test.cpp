// Running engines: arguments, tiling, clipping, bands, start addresses, plane bindings, the chain.
#include <array>
#include <cstring>

#include "recorder.h"

namespace kestrel::test {
Recorder recorder;
}  // namespace kestrel::test

extern "C" uint32_t __wrap_ANY_ANY_Bilinear_No_Table(const MRECT* rect, const int32_t* dstPitches,
                                                     const int32_t* srcPitches,
                                                     uint8_t* const* dstPlanes,
                                                     const uint8_t* const* srcPlanes,
                                                     const EngineContext* context) {
  kestrel::test::Job job{};
  job.rect = *rect;
  for (int i = 0; i < 3; ++i) {
    job.dstPitch[i] = dstPitches[i];
    job.srcPitch[i] = srcPitches[i];
    job.dst[i] = dstPlanes[i];
    job.src[i] = srcPlanes[i];
  }
  job.context = context;
  kestrel::test::recorder.jobs.push_back(job);
  if (!kestrel::test::recorder.convert) return KESTREL_OK;
  return __real_ANY_ANY_Bilinear_No_Table(rect, dstPitches, srcPitches, dstPlanes, srcPlanes,
                                          context);
}

#define STAND_IN(name)                                                                            \
  extern "C" KernelFn __real_##name;                                                              \
  extern "C" uint32_t __wrap_##name(                                                              \
      const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,                    \
      uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes, const EngineContext* context) { \
    kestrel::test::Recorder& r = kestrel::test::recorder;                                         \
    if (!r.standInForFamilies) {                                                                  \
      return __real_##name(rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);          \
    }                                                                                             \
    r.offers.push_back(#name);                                                                    \
    for (const void* argument :                                                                   \
         {static_cast<const void*>(rect), static_cast<const void*>(dstPitches),                   \
          static_cast<const void*>(srcPitches), static_cast<const void*>(dstPlanes),              \
          static_cast<const void*>(srcPlanes), static_cast<const void*>(context)}) {              \
      r.arguments.push_back(argument);                                                            \
    }                                                                                             \
    return r.accepts == #name ? KESTREL_OK : r.declineCode;                                       \
  }

STAND_IN(NEC_ALL)
STAND_IN(ANY_ANY_C_FAST_R8G8B8)
STAND_IN(YUV2YUV_Fast)
STAND_IN(ANY_ANY_C_FAST_R5G6B5)
STAND_IN(I420_To_I422_Fast)
STAND_IN(YUV_YUV_C_FAST)
STAND_IN(YUV_RGB32_C_FAST)
STAND_IN(YUYV_RGB32_FAST)
STAND_IN(ANY_ANY_C_FAST_RGB32)
STAND_IN(Gray2Gray_C_FAST)
STAND_IN(ANY_ANY_C_SLOW)

namespace kestrel::test {
namespace {

constexpr uint32_t kGrey = FORMAT_GRAY8;
constexpr uint32_t kRgba = FORMAT_XBGR8888;
constexpr uint32_t kRgb565 = FORMAT_RGB565;

// ---- the chain ----

using Chain = ProcessingTest;

const std::vector<std::string> kChain = {"NEC_ALL",
                                         "ANY_ANY_C_FAST_R8G8B8",
                                         "YUV2YUV_Fast",
                                         "ANY_ANY_C_FAST_R5G6B5",
                                         "I420_To_I422_Fast",
                                         "YUV_YUV_C_FAST",
                                         "YUV_RGB32_C_FAST",
                                         "YUYV_RGB32_FAST",
                                         "ANY_ANY_C_FAST_RGB32",
                                         "Gray2Gray_C_FAST",
                                         "ANY_ANY_C_SLOW"};

// The stand-ins never look into their arguments, so addresses of any object will do.
uint32_t RunChain(const Planes& dst, const Planes& src, const MRECT& rect,
                  const EngineContext& context) {
  return __real_ANY_ANY_Bilinear_No_Table(&rect, dst.pitch, src.pitch, dst.plane, src.plane,
                                          &context);
}

TEST_F(Chain, OffersAJobInAFixedOrderAndEndsWithTheGenericConverter) {
  recorder.standInForFamilies = true;
  const Engine engine({kGrey, 8, 8}, {kGrey, 8, 8});
  Bytes bytes(64);
  const Planes planes = OnePlane(bytes, 8);
  for (uint32_t code : {KESTREL_UNSUPPORTED, KESTREL_BAD_ARGUMENT, 77u}) {
    recorder.offers.clear();
    recorder.declineCode = code;
    EXPECT_EQ(RunChain(planes, planes, {0, 0, 8, 8}, engine.context()), KESTREL_OK);
    EXPECT_EQ(recorder.offers, kChain);
  }
}

TEST_F(Chain, StopsAtTheFirstMemberThatAccepts) {
  recorder.standInForFamilies = true;
  const Engine engine({kGrey, 8, 8}, {kGrey, 8, 8});
  Bytes bytes(64);
  const Planes planes = OnePlane(bytes, 8);
  for (size_t i = 0; i < kChain.size(); ++i) {
    recorder.offers.clear();
    recorder.accepts = kChain[i];
    EXPECT_EQ(RunChain(planes, planes, {0, 0, 8, 8}, engine.context()), KESTREL_OK);
    EXPECT_EQ(recorder.offers, std::vector<std::string>(kChain.begin(), kChain.begin() + i + 1));
  }
}

TEST_F(Chain, PassesItsSixArgumentsUnchanged) {
  recorder.standInForFamilies = true;
  const Engine engine({kGrey, 8, 8}, {kGrey, 8, 8});
  Bytes bytes(64);
  const Planes dst = OnePlane(bytes, 8);
  const Planes src = OnePlane(bytes, 8);
  const MRECT rect = {0, 0, 8, 8};
  RunChain(dst, src, rect, engine.context());
  ASSERT_EQ(recorder.arguments.size(), 6 * kChain.size());
  for (size_t i = 6; i < recorder.arguments.size(); ++i) {
    EXPECT_EQ(recorder.arguments[i], recorder.arguments[i % 6]);
  }
  EXPECT_EQ(recorder.arguments[1], dst.pitch);
  EXPECT_EQ(recorder.arguments[2], src.pitch);
  EXPECT_EQ(recorder.arguments[3], static_cast<const void*>(dst.plane));
  EXPECT_EQ(recorder.arguments[4], static_cast<const void*>(src.plane));
  EXPECT_EQ(recorder.arguments[5], &engine.context());
}

// ---- arguments ----

using Arguments = ProcessingTest;

TEST_F(Arguments, OfProcessMustNotBeNull) {
  for (uint32_t mode : {1u, MPP_PASS_TILED}) {
    const Engine engine({kGrey, 8, 8}, {kGrey, 8, 8}, Param().Pass(mode));
    Bytes from(64, 7), to(64, 9);
    Planes src = OnePlane(from, 8);
    Planes dst = OnePlane(to, 8);
    MPPHandle* handle = engine.handle();
    EXPECT_EQ(MPProcess(nullptr, dst.plane, nullptr, dst.pitch, src.plane, src.pitch),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, nullptr, nullptr, dst.pitch, src.plane, src.pitch),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, dst.plane, nullptr, nullptr, src.plane, src.pitch),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, dst.plane, nullptr, dst.pitch, nullptr, src.pitch),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, dst.plane, nullptr, dst.pitch, src.plane, nullptr),
              KESTREL_BAD_ARGUMENT);
    Planes none = {};
    EXPECT_EQ(Process(engine, none, src), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(Process(engine, dst, none), KESTREL_BAD_ARGUMENT);
    EXPECT_TRUE(recorder.jobs.empty());
    EXPECT_EQ(to, Bytes(64, 9));
    EXPECT_EQ(Process(engine, dst, src), KESTREL_OK);
    EXPECT_EQ(to, from);
    recorder.jobs.clear();
  }
}

TEST_F(Arguments, OfOnePassMustNotBeNull) {
  const Engine engine({kGrey, 8, 8}, {kGrey, 8, 8});
  Bytes from(64, 7), to(64, 9);
  const Planes src = OnePlane(from, 8);
  const Planes dst = OnePlane(to, 8);
  PassEngine* pass = &engine.pass();
  EXPECT_EQ(MPProcessRect(nullptr, dst.plane, nullptr, dst.pitch, src.plane, src.pitch),
            KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPProcessRect(pass, nullptr, nullptr, dst.pitch, src.plane, src.pitch),
            KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPProcessRect(pass, dst.plane, nullptr, nullptr, src.plane, src.pitch),
            KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPProcessRect(pass, dst.plane, nullptr, dst.pitch, nullptr, src.pitch),
            KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPProcessRect(pass, dst.plane, nullptr, dst.pitch, src.plane, nullptr),
            KESTREL_BAD_ARGUMENT);
  EXPECT_TRUE(recorder.jobs.empty());
  EXPECT_EQ(MPProcessRect(pass, dst.plane, nullptr, dst.pitch, src.plane, src.pitch), KESTREL_OK);
  EXPECT_EQ(to, from);
}

TEST_F(Arguments, ANeededPlaneThatIsNullLeavesEveryPlaneUntouched) {
  const Engine engine({FORMAT_NV21, 8, 8}, {FORMAT_I420, 8, 8});
  Bytes luma(64, 1), u(16, 2), v(16, 3), outLuma(64, 9), outChroma(32, 9);
  const Planes src = ThreePlanes(luma, 8, u, v, 4);
  const Planes dst = VFirst(outLuma, 8, outChroma, 8);
  for (int side = 0; side < 2; ++side) {
    for (int slot = 1; slot < 3; ++slot) {
      Planes holedDst = dst;
      Planes holedSrc = src;
      (side == 0 ? holedDst : holedSrc).plane[slot] = nullptr;
      EXPECT_EQ(Process(engine, holedDst, holedSrc), KESTREL_OK);
      EXPECT_EQ(outLuma, Bytes(64, 9)) << side << slot;
      EXPECT_EQ(outChroma, Bytes(32, 9)) << side << slot;
    }
  }
  EXPECT_EQ(Process(engine, dst, src), KESTREL_OK);
  EXPECT_EQ(outLuma, luma);
}

TEST_F(Arguments, ThatPutAJobBeyondAllImagesAreRefusedByThePassAndDrawNothing) {
  recorder.convert = false;
  Bytes bytes(64);
  const Planes good = OnePlane(bytes, 8);
  const int32_t far = (1 << 24) + 1;

  const Engine farRegion({kGrey, 8, 8}, {kGrey, 8, 8}, Param().DstOrigin(far, 0));
  ASSERT_EQ(farRegion.result(), KESTREL_OK);
  EXPECT_EQ(
      MPProcessRect(&farRegion.pass(), good.plane, nullptr, good.pitch, good.plane, good.pitch),
      KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(Process(farRegion, good, good), KESTREL_OK) << "results of passes are not handed up";

  const Engine engine({kGrey, 8, 8}, {kGrey, 8, 8});
  const MRECT farRect = {0, far, 8, far + 8};
  EXPECT_EQ(MPProcessRect(&engine.pass(), good.plane, &farRect, good.pitch, good.plane, good.pitch),
            KESTREL_BAD_ARGUMENT);

  Planes huge = good;
  for (int32_t pitch : {INT32_MAX, INT32_MIN, 1 << 30}) {
    huge.pitch[0] = pitch;
    EXPECT_EQ(
        MPProcessRect(&engine.pass(), huge.plane, nullptr, huge.pitch, good.plane, good.pitch),
        KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(
        MPProcessRect(&engine.pass(), good.plane, nullptr, good.pitch, huge.plane, huge.pitch),
        KESTREL_BAD_ARGUMENT);
  }
  EXPECT_TRUE(recorder.Drawn().empty());
}

// ---- tiling ----

struct Tile {
  int pass;  // 1, 2 or 3
  MRECT rect;
  bool operator==(const Tile& other) const { return pass == other.pass && rect == other.rect; }
};

void PrintTo(const Tile& tile, std::ostream* out) {
  *out << "pass " << tile.pass << " ";
  PrintTo(tile.rect, out);
}

// The pieces that a tiled engine of unmirrored, unswapped jobs draws, in order.
std::vector<Tile> Tiles(const Engine& engine, const Planes& dst, const Planes& src,
                        const MRECT* rect) {
  recorder.jobs.clear();
  EXPECT_EQ(Process(engine, dst, src, rect), KESTREL_OK);
  std::vector<Tile> tiles;
  for (const Job& job : recorder.Drawn()) {
    int pass = 0;
    for (int i = 0; i < 3; ++i) {
      if (engine.handle()->pass[i] != nullptr && job.context == &engine.context(i)) pass = i + 1;
    }
    tiles.push_back({pass, job.rect});
  }
  return tiles;
}

class Tiling : public ProcessingTest {
 protected:
  static constexpr int32_t kWidth = 64;
  static constexpr int32_t kHeight = 32;

  void SetUp() override {
    ProcessingTest::SetUp();
    recorder.convert = false;
  }
  std::vector<Tile> Cut(const MRECT& rect) { return Tiles(engine_, dst_, src_, &rect); }

  Engine engine_{{kRgba, kWidth, kHeight}, {kGrey, kWidth, kHeight}, Param().Tiled()};
  alignas(4) uint8_t from_[kWidth * kHeight + 8] = {};
  alignas(4) uint8_t to_[kWidth * kHeight * 4 + 8] = {};
  Planes src_ = {{from_, nullptr, nullptr}, {kWidth, 0, 0}};
  Planes dst_ = {{to_, nullptr, nullptr}, {kWidth * 4, 0, 0}};
};

TEST_F(Tiling, OfARegionOnTheCoarseGridIsOneBlockOfTheThirdPass) {
  EXPECT_EQ(Tiles(engine_, dst_, src_, nullptr), (std::vector<Tile>{{3, {0, 0, 64, 32}}}));
  EXPECT_EQ(Cut({16, 8, 48, 24}), (std::vector<Tile>{{3, {16, 8, 48, 24}}}));
  EXPECT_EQ(Cut({16, 8, 32, 16}), (std::vector<Tile>{{3, {16, 8, 32, 16}}}));
}

TEST_F(Tiling, OfARaggedRectangleHasStripsTopBottomLeftRight) {
  EXPECT_EQ(Cut({5, 3, 60, 30}), (std::vector<Tile>{{3, {16, 8, 48, 24}},
                                                    {1, {5, 3, 60, 8}},
                                                    {1, {5, 24, 60, 30}},
                                                    {1, {5, 8, 16, 24}},
                                                    {1, {48, 8, 60, 24}}}));
  EXPECT_EQ(Cut({0, 0, 64, 20}), (std::vector<Tile>{{3, {0, 0, 64, 16}}, {1, {0, 16, 64, 20}}}));
  EXPECT_EQ(Cut({1, 0, 64, 32}), (std::vector<Tile>{{3, {16, 0, 64, 32}}, {1, {1, 0, 16, 32}}}));
  EXPECT_EQ(Cut({0, 0, 63, 32}), (std::vector<Tile>{{3, {0, 0, 48, 32}}, {1, {48, 0, 63, 32}}}));
  EXPECT_EQ(Cut({0, 1, 64, 32}), (std::vector<Tile>{{3, {0, 8, 64, 32}}, {1, {0, 1, 64, 8}}}));
}

TEST_F(Tiling, OfARectangleNarrowerThanACellIsAllFirstPass) {
  // Columns 5 to 10: the inner block would run from 16 to 0 and collapses to column 0.
  EXPECT_EQ(Cut({5, 0, 10, 32}), (std::vector<Tile>{{1, {5, 0, 10, 32}}}));
  EXPECT_EQ(Cut({5, 1, 10, 30}),
            (std::vector<Tile>{{1, {5, 1, 10, 8}}, {1, {5, 24, 10, 30}}, {1, {5, 8, 10, 24}}}));
  // From 20 to 30 it would run from 32 to 16, and both side strips cover nothing but their part.
  EXPECT_EQ(Cut({20, 8, 30, 16}), (std::vector<Tile>{{1, {20, 8, 30, 16}}}));
  EXPECT_EQ(Cut({20, 9, 30, 15}), (std::vector<Tile>{{1, {20, 9, 30, 15}}}));
}

TEST_F(Tiling, OfARectangleLowerThanACellIsAllFirstPass) {
  EXPECT_EQ(Cut({0, 1, 64, 7}), (std::vector<Tile>{{1, {0, 1, 64, 7}}}));
  EXPECT_EQ(Cut({3, 9, 61, 15}), (std::vector<Tile>{{1, {3, 9, 61, 15}}}));
}

TEST_F(Tiling, OfAnInnerBlockWithoutAreaIsAllFirstPass) {
  EXPECT_EQ(Cut({0, 5, 64, 12}), (std::vector<Tile>{{1, {0, 5, 64, 8}}, {1, {0, 8, 64, 12}}}));
  EXPECT_EQ(Cut({10, 0, 20, 32}), (std::vector<Tile>{{1, {10, 0, 16, 32}}, {1, {16, 0, 20, 32}}}));
}

TEST_F(Tiling, TakesTheFineGridWhenAFirstPlaneIsNotInWholeWords) {
  const std::vector<Tile> fine = {{2, {6, 4, 60, 30}}, {1, {5, 3, 60, 4}}, {1, {5, 4, 6, 30}}};
  const MRECT rect = {5, 3, 60, 30};
  for (int32_t off = 1; off < 4; ++off) {
    SCOPED_TRACE(off);
    Planes dst = dst_;
    Planes src = src_;
    dst.pitch[0] += off;
    EXPECT_EQ(Tiles(engine_, dst, src, &rect), fine);
    dst = dst_;
    dst.plane[0] += off;
    EXPECT_EQ(Tiles(engine_, dst, src, &rect), fine);
    dst = dst_;
    src.pitch[0] -= off;
    EXPECT_EQ(Tiles(engine_, dst, src, &rect), fine);
    src = src_;
    src.plane[0] += off;
    EXPECT_EQ(Tiles(engine_, dst, src, &rect), fine);
  }
  EXPECT_EQ(Cut(rect)[0], (Tile{3, {16, 8, 48, 24}}));
}

TEST_F(Tiling, OnTheFineGridRoundsToEvenEdges) {
  src_.pitch[0] = 63;
  EXPECT_EQ(Tiles(engine_, dst_, src_, nullptr), (std::vector<Tile>{{2, {0, 0, 64, 32}}}));
  EXPECT_EQ(Cut({1, 1, 5, 5}), (std::vector<Tile>{{2, {2, 2, 4, 4}},
                                                  {1, {1, 1, 5, 2}},
                                                  {1, {1, 4, 5, 5}},
                                                  {1, {1, 2, 2, 4}},
                                                  {1, {4, 2, 5, 4}}}));
  EXPECT_EQ(Cut({1, 0, 2, 8}), (std::vector<Tile>{{1, {1, 0, 2, 8}}}));
  EXPECT_EQ(Cut({1, 0, 3, 8}), (std::vector<Tile>{{1, {1, 0, 2, 8}}, {1, {2, 0, 3, 8}}}));
  EXPECT_EQ(Cut({2, 3, 9, 4}), (std::vector<Tile>{{1, {2, 3, 9, 4}}}));
}

TEST_F(Tiling, LooksAtNeitherChromaAddressesNorChromaPitches) {
  const Engine engine({FORMAT_NV21, 64, 32}, {FORMAT_I420, 64, 32}, Param().Tiled());
  Planes dst = {{to_, to_ + 65, to_ + 64}, {64, 66, 67}};
  Planes src = {{from_, from_ + 1, from_ + 3}, {64, 33, 35}};
  EXPECT_EQ(Tiles(engine, dst, src, nullptr), (std::vector<Tile>{{3, {0, 0, 64, 32}}}));
}

TEST_F(Tiling, TakesNegativePitchesInWholeWordsForTheCoarseGrid) {
  Planes dst = dst_;
  dst.plane[0] += dst.pitch[0] * (kHeight - 1);
  dst.pitch[0] = -dst.pitch[0];
  EXPECT_EQ(Tiles(engine_, dst, src_, nullptr), (std::vector<Tile>{{3, {0, 0, 64, 32}}}));
  dst.pitch[0] += 1;
  EXPECT_EQ(Tiles(engine_, dst, src_, nullptr), (std::vector<Tile>{{2, {0, 0, 64, 32}}}));
}

TEST_F(Tiling, OfMirroredJobsNeedsRegionSidesInFoursForTheCoarseGrid) {
  const struct {
    int32_t width, height;
    uint32_t transform;
    int pass;
  } rows[] = {{64, 32, 2, 3}, {64, 32, 4, 3}, {64, 32, 6, 3}, {62, 32, 2, 2}, {62, 32, 4, 2},
              {64, 30, 2, 2}, {64, 30, 4, 2}, {64, 30, 6, 2}, {62, 30, 0, 3}, {62, 30, 1, 3},
              {6, 32, 2, 2},  {60, 28, 6, 3}, {62, 32, 3, 2}, {64, 30, 5, 2}, {32, 64, 1, 3}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.width << "x" << row.height << " " << row.transform);
    const Engine engine({kGrey, row.width, row.height}, {kGrey, 64, 32},
                        Param().Tiled().Transform(row.transform));
    const Planes dst = {{to_, nullptr, nullptr}, {64, 0, 0}};
    const std::vector<Tile> tiles = Tiles(engine, dst, src_, nullptr);
    ASSERT_FALSE(tiles.empty());
    EXPECT_EQ(tiles[0].pass, row.pass);
  }
}

TEST_F(Tiling, OfNegativeEdgesDrawsFromTheOriginOn) {
  EXPECT_EQ(Cut({-5, 0, 64, 32}), (std::vector<Tile>{{3, {0, 0, 64, 32}}}));
  EXPECT_EQ(Cut({-20, -9, 64, 32}), (std::vector<Tile>{{3, {0, 0, 64, 32}}}));
  EXPECT_EQ(Cut({-5, -5, 40, 20}),
            (std::vector<Tile>{{3, {0, 0, 32, 16}}, {1, {0, 16, 40, 20}}, {1, {32, 0, 40, 16}}}));
  EXPECT_EQ(Cut({-64, -32, 0, 0}), std::vector<Tile>{});
  EXPECT_EQ(Cut({-64, -32, -20, -9}), std::vector<Tile>{});
}

TEST_F(Tiling, FormsTheGridBeforeClippingToTheRegion) {
  const Engine engine({kRgba, 32, 16}, {kGrey, 32, 16}, Param().Tiled().DstOrigin(8, 4));
  // The null rectangle is the region: inner block (16, 8) to (32, 16).
  EXPECT_EQ(Tiles(engine, dst_, src_, nullptr), (std::vector<Tile>{{3, {16, 8, 32, 16}},
                                                                   {1, {8, 4, 40, 8}},
                                                                   {1, {8, 16, 40, 20}},
                                                                   {1, {8, 8, 16, 16}},
                                                                   {1, {32, 8, 40, 16}}}));
  // A rectangle around the region: one block, clipped as a whole.
  const MRECT around = {0, 0, 64, 32};
  EXPECT_EQ(Tiles(engine, dst_, src_, &around), (std::vector<Tile>{{3, {8, 4, 40, 20}}}));
}

TEST_F(Tiling, OfEmptyAndInvertedRectanglesDrawsNothing) {
  for (const MRECT& rect :
       {MRECT{0, 0, 0, 0}, MRECT{20, 4, 20, 30}, MRECT{4, 20, 40, 20}, MRECT{40, 4, 8, 30},
        MRECT{4, 30, 60, 2}, MRECT{60, 30, 4, 2}, MRECT{64, 32, 0, 0},
        MRECT{INT32_MAX, INT32_MAX, INT32_MIN, INT32_MIN}}) {
    EXPECT_EQ(Cut(rect), std::vector<Tile>{}) << testing::PrintToString(rect);
  }
}

// The same plan seen in the bytes: each pass writes an alpha of its own.
TEST_F(Tiling, WritesEveryPixelOfTheRectangleOnceAndNoOther) {
  recorder.convert = true;
  const Engine first({kRgba, 64, 32}, {kGrey, 64, 32}, Param().Tiled().Alpha(1));
  const Engine second({kRgba, 64, 32}, {kGrey, 64, 32}, Param().Tiled().Alpha(2));
  const Engine third({kRgba, 64, 32}, {kGrey, 64, 32}, Param().Tiled().Alpha(3));
  MPPHandle mixed = {MPP_PASS_TILED,
                     {first.handle()->pass[0], second.handle()->pass[1], third.handle()->pass[2]}};
  const struct {
    int32_t dstPitch;
    MRECT rect, inner;
    uint8_t innerPass;
  } rows[] = {
      {256, {0, 0, 64, 32}, {0, 0, 64, 32}, 3},   {256, {5, 3, 60, 30}, {16, 8, 48, 24}, 3},
      {256, {5, 0, 10, 32}, {0, 0, 0, 0}, 1},     {256, {17, 9, 64, 32}, {32, 16, 64, 32}, 3},
      {258, {5, 3, 60, 30}, {6, 4, 60, 30}, 2},   {258, {5, 3, 61, 31}, {6, 4, 60, 30}, 2},
      {256, {-5, -5, 64, 32}, {0, 0, 64, 32}, 3}, {256, {0, 5, 64, 12}, {0, 0, 0, 0}, 1}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::PrintToString(row.rect));
    alignas(4) uint8_t bytes[258 * 32] = {};
    const Planes dst = {{bytes, nullptr, nullptr}, {row.dstPitch, 0, 0}};
    ASSERT_EQ(MPProcess(&mixed, dst.plane, &row.rect, dst.pitch, src_.plane, src_.pitch),
              KESTREL_OK);
    const auto inside = [](const MRECT& r, int32_t x, int32_t y) {
      return x >= r.left && x < r.right && y >= r.top && y < r.bottom;
    };
    for (int32_t y = 0; y < 32; ++y) {
      for (int32_t x = 0; x < 64; ++x) {
        const uint8_t expected = !inside(row.rect, x, y)   ? uint8_t{0}
                                 : inside(row.inner, x, y) ? row.innerPass
                                                           : uint8_t{1};
        ASSERT_EQ(bytes[y * row.dstPitch + 4 * x + 3], expected) << x << ", " << y;
      }
    }
  }
}

// ---- one pass over one rectangle ----

class OnePass : public Tiling {
 protected:
  std::vector<Tile> Run(const Engine& engine, const MRECT* rect) {
    recorder.jobs.clear();
    EXPECT_EQ(MPProcessRect(&engine.pass(), dst_.plane, rect, dst_.pitch, src_.plane, src_.pitch),
              KESTREL_OK);
    std::vector<Tile> tiles;
    for (const Job& job : recorder.Drawn()) tiles.push_back({1, job.rect});
    return tiles;
  }
};

TEST_F(OnePass, WithoutARectangleDrawsTheRegionInOneJob) {
  const Engine engine({kRgba, 32, 16}, {kGrey, 32, 16}, Param().DstOrigin(8, 4));
  EXPECT_EQ(Run(engine, nullptr), (std::vector<Tile>{{1, {8, 4, 40, 20}}}));
  EXPECT_EQ(Tiles(engine, dst_, src_, nullptr), (std::vector<Tile>{{1, {8, 4, 40, 20}}}));
}

TEST_F(OnePass, ClipsLeftAndTopToTheRegionAndMeasuresSizesFromThere) {
  const Engine engine({kRgba, 32, 16}, {kGrey, 32, 16}, Param().DstOrigin(8, 4));
  const MRECT rows[][2] = {
      {{0, 0, 100, 100}, {8, 4, 40, 20}},
      {{10, 6, 20, 9}, {10, 6, 20, 9}},
      {{20, 10, 100, 100}, {20, 10, 52, 26}},  // past the region's own right and bottom
      {{39, 19, 100, 100}, {39, 19, 71, 35}},
      {{60, 30, 62, 31}, {60, 30, 62, 31}},
      {{-50, 5, 12, 8}, {8, 5, 12, 8}},
      {{9, -50, 12, 8}, {9, 4, 12, 8}},
      {{INT32_MIN, INT32_MIN, INT32_MAX, INT32_MAX}, {8, 4, 40, 20}}};
  for (const auto& row : rows) {
    EXPECT_EQ(Run(engine, &row[0]), (std::vector<Tile>{{1, row[1]}}));
    EXPECT_EQ(Tiles(engine, dst_, src_, &row[0]), (std::vector<Tile>{{1, row[1]}}));
  }
}

TEST_F(OnePass, NeverDispatchesAWorkingRectangleWhoseBottomIsNotPositive) {
  for (uint32_t transform : {0u, 1u}) {
    const Engine engine({kRgba, 32, 32}, {kGrey, 32, 32}, Param().Transform(transform));
    for (const MRECT& rect : {MRECT{0, -5, 10, 0}, MRECT{0, -5, 10, -1}, MRECT{0, 0, 10, 0},
                              MRECT{0, 0, 10, INT32_MIN}}) {
      Run(engine, &rect);
      EXPECT_TRUE(recorder.jobs.empty()) << testing::PrintToString(rect);
    }
  }
}

TEST_F(OnePass, DrawsNothingForAnInvertedRectangle) {
  for (uint32_t transform = 0; transform < 8; ++transform) {
    const Engine engine({kRgba, 32, 32}, {kGrey, 32, 32}, Param().Transform(transform));
    recorder.convert = true;
    const Bytes before(to_, to_ + sizeof to_);
    for (const MRECT& rect : {MRECT{20, 4, 10, 8}, MRECT{4, 20, 10, 8}, MRECT{20, 20, 10, 8},
                              MRECT{4, 4, 4, 8}, MRECT{4, 8, 8, 8}}) {
      Run(engine, &rect);
      EXPECT_EQ(Bytes(to_, to_ + sizeof to_), before) << testing::PrintToString(rect);
    }
  }
}

// ---- bands ----

struct BandCase {
  uint32_t transform, selector;
  MRECT rect;
  std::vector<std::array<int32_t, 2>> rows;  // top and bottom of each band
};

TEST_F(OnePass, OfASwappedJobRunsInBands) {
  recorder.convert = false;
  std::vector<uint8_t> big(256 * 256);
  const Planes dst = {{big.data(), nullptr, nullptr}, {256, 0, 0}};
  const Planes src = {{big.data(), nullptr, nullptr}, {128, 0, 0}};
  const BandCase rows[] = {
      {1, 0, {0, 0, 16, 100}, {{0, 32}, {32, 64}, {64, 96}, {96, 100}}},
      {1, 0, {0, 0, 16, 32}, {{0, 32}}},
      {1, 0, {0, 0, 16, 31}, {{0, 31}}},
      {1, 0, {0, 0, 16, 33}, {{0, 32}, {32, 33}}},
      {1, 0, {0, 0, 16, 64}, {{0, 32}, {32, 64}}},
      {1, 0, {0, 0, 16, 65}, {{0, 32}, {32, 64}, {64, 65}}},
      {1, 0, {0, 0, 16, 96}, {{0, 32}, {32, 64}, {64, 96}}},
      {1, 0, {3, 10, 16, 60}, {{10, 42}, {42, 60}}},
      {1, 5, {0, 0, 16, 100}, {{0, 32}, {32, 64}, {64, 96}, {96, 100}}},
      {1, 3, {0, 0, 16, 40}, {{0, 32}, {32, 40}}},
      {1, 4, {0, 0, 16, 100}, {{0, 64}, {64, 100}}},
      {1, 4, {0, 0, 16, 64}, {{0, 64}}},
      {1, 4, {0, 0, 16, 128}, {{0, 64}, {64, 128}}},
      {1, 4, {5, 7, 16, 72}, {{7, 71}, {71, 72}}},
      {0, 0, {0, 0, 16, 100}, {{0, 100}}},
      {6, 4, {0, 0, 16, 100}, {{0, 100}}},
  };
  for (const BandCase& row : rows) {
    SCOPED_TRACE(testing::Message() << row.transform << " " << row.selector << " "
                                    << testing::PrintToString(row.rect));
    const Engine engine({kRgb565, 128, 128}, {kGrey, 128, 128},
                        Param().Transform(row.transform).Band(row.selector));
    recorder.jobs.clear();
    EXPECT_EQ(MPProcessRect(&engine.pass(), dst.plane, &row.rect, dst.pitch, src.plane, src.pitch),
              KESTREL_OK);
    ASSERT_EQ(recorder.jobs.size(), row.rows.size());
    for (size_t i = 0; i < row.rows.size(); ++i) {
      MRECT band = {row.rect.left, row.rows[i][0], row.rect.right, row.rows[i][1]};
      EXPECT_EQ(recorder.jobs[i].dst[0], big.data() + 256 * (row.transform == 6 ? 99 : band.top) +
                                             2 * (row.transform == 6 ? 15 : band.left));
      if (row.transform == 6) band = {112, 28, 128, 128};
      if ((row.transform & 1) != 0) MSwapRect(&band);
      EXPECT_EQ(recorder.jobs[i].rect, band);
    }
  }
}

// What cannot differ is not cut: the kernel walks it as it likes.
TEST_F(OnePass, OfASwappedJobIsCutOnlyWhereThatShows) {
  recorder.convert = false;
  std::vector<uint8_t> big(512 * 256);
  const Planes dst = {{big.data(), big.data() + 1, big.data() + 2}, {512, 512, 512}};
  const Planes src = {{big.data(), nullptr, nullptr}, {512, 0, 0}};
  const struct {
    uint32_t format, source, transform;
    int32_t height, top, bottom, sourceWidth;
    size_t jobs;
  } rows[] = {
      {kGrey, kGrey, 1, 100, 0, 100, 100, 1},
      {FORMAT_NV21, kGrey, 3, 100, 0, 100, 50, 1},
      {FORMAT_YUYV, kGrey, 5, 100, 2, 100, 100, 1},
      {FORMAT_I420, kGrey, 7, 100, 0, 98, 50, 1},
      {kRgba, kGrey, 7, 100, 0, 100, 100, 1},
      {kRgb565, kGrey, 7, 100, 0, 100, 50, 1},
      {FORMAT_NV21, kGrey, 1, 100, 0, 99, 100, 4},
      {FORMAT_NV21, kGrey, 1, 100, 1, 99, 100, 4},
      {FORMAT_NV21, kGrey, 3, 101, 0, 100, 100, 1},
      {FORMAT_NV21, kGrey, 5, 101, 0, 100, 100, 4},
      {FORMAT_I444 | 0x33, kGrey, 1, 100, 0, 100, 100, 4},
      {FORMAT_I444 | 0x30, kGrey, 1, 100, 0, 100, 100, 4},
      {kRgb565, kGrey, 1, 100, 0, 100, 100, 4},
      {kRgb565, kRgba, 1, 100, 0, 100, 100, 1},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.format << std::dec << ", " << row.transform
                                    << ", " << row.top << " to " << row.bottom);
    const Engine engine({row.format, 128, row.height}, {row.source, row.sourceWidth, 128},
                        Param().Transform(row.transform));
    const MRECT rect = {0, row.top, 16, row.bottom};
    recorder.jobs.clear();
    EXPECT_EQ(MPProcessRect(&engine.pass(), dst.plane, &rect, dst.pitch, src.plane, src.pitch),
              KESTREL_OK);
    EXPECT_EQ(recorder.jobs.size(), row.jobs);
  }
}

TEST_F(OnePass, MirrorsEachBandInsideTheRegionAndThenTransposes) {
  recorder.convert = false;
  std::vector<uint8_t> big(128 * 64);
  const Planes dst = {{big.data(), nullptr, nullptr}, {128, 0, 0}};
  const Planes src = {{big.data(), nullptr, nullptr}, {64, 0, 0}};
  // A region of 20 x 40 at (10, 20), drawn from row 22 to 58 in bands of 32 and 4 rows.
  const MRECT rect = {12, 22, 25, 58};
  const struct {
    uint32_t transform;
    MRECT first, second;
    int32_t firstX, firstY, secondX, secondY;
    int32_t pitch;
  } rows[] = {{1, {22, 12, 54, 25}, {54, 12, 58, 25}, 12, 22, 12, 54, 128},
              {3, {22, 15, 54, 28}, {54, 15, 58, 28}, 24, 22, 24, 54, 128},
              {5, {26, 12, 58, 25}, {22, 12, 26, 25}, 12, 53, 12, 57, -128},
              {7, {26, 15, 58, 28}, {22, 15, 26, 28}, 24, 53, 24, 57, -128}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.transform);
    const Engine engine({kRgb565, 20, 40}, {kGrey, 40, 20},
                        Param().Transform(row.transform).DstOrigin(10, 20));
    recorder.jobs.clear();
    EXPECT_EQ(Process(engine, dst, src, &rect), KESTREL_OK);
    ASSERT_EQ(recorder.jobs.size(), 2u);
    EXPECT_EQ(recorder.jobs[0].rect, row.first);
    EXPECT_EQ(recorder.jobs[1].rect, row.second);
    EXPECT_EQ(recorder.jobs[0].dst[0], big.data() + 128 * row.firstY + 2 * row.firstX);
    EXPECT_EQ(recorder.jobs[1].dst[0], big.data() + 128 * row.secondY + 2 * row.secondX);
    for (const Job& job : recorder.jobs) {
      EXPECT_EQ(job.dstPitch[0], row.pitch);
      EXPECT_EQ(job.srcPitch[0], 64);
      EXPECT_EQ(job.src[0], big.data());
    }
  }
}

// ---- bindings and start addresses ----

TEST(ClampRect, BringsEachEdgeIntoTheBounds) {
  const MRECT bounds = {10, 20, 30, 40};
  const MRECT rows[][2] = {
      {{12, 22, 28, 38}, {12, 22, 28, 38}}, {{0, 0, 99, 99}, {10, 20, 30, 40}},
      {{0, 0, 5, 5}, {10, 20, 10, 20}},     {{50, 50, 60, 60}, {30, 40, 30, 40}},
      {{28, 38, 12, 22}, {28, 38, 12, 22}}, {{99, 99, 0, 0}, {30, 40, 10, 20}}};
  for (const auto& row : rows) {
    MRECT rect = row[0];
    MClampRect(&rect, &bounds);
    EXPECT_EQ(rect, row[1]);
  }
}

TEST(BindPlanes, OfThreePlanesTakesThemAndExchangesTheChromaOfVFirstCodes) {
  uint8_t bytes[3];
  const uint8_t* const planes[3] = {bytes, bytes + 1, bytes + 2};
  const int32_t pitches[3] = {11, 22, 33};
  for (uint32_t code : {768u, 769u, 770u, 771u, 772u, 1024u, 1025u, 1026u, 1027u, 1028u, CODE_NV21,
                        CODE_NV12, CODE_NV61, CODE_NV16}) {
    SCOPED_TRACE(code);
    PlaneLayout binding{};
    binding.code = code;
    binding.planeCount = 3;
    MPBindPlanes(&binding, planes, pitches);
    const int u = code >= 768 && code <= 772 ? 2 : 1;
    EXPECT_EQ(binding.plane[0], bytes);
    EXPECT_EQ(binding.plane[1], bytes + u);
    EXPECT_EQ(binding.plane[2], bytes + 3 - u);
    for (int i = 0; i < 3; ++i) EXPECT_EQ(binding.pitch[i], pitches[i]) << "pitches stay";
  }
}

TEST(BindPlanes, OfOnePlaneAddsTheSampleOffsetsAndRepeatsThePitch) {
  uint8_t bytes[4];
  const uint8_t* const planes[3] = {bytes, nullptr, nullptr};
  const int32_t pitches[3] = {-11, 22, 33};
  PlaneLayout binding{};
  binding.code = 515;
  binding.planeCount = 1;
  binding.yOffset = 1;
  binding.uOffset = 2;
  binding.vOffset = 0;
  MPBindPlanes(&binding, planes, pitches);
  EXPECT_EQ(binding.plane[0], bytes + 1);
  EXPECT_EQ(binding.plane[1], bytes + 2);
  EXPECT_EQ(binding.plane[2], bytes);
  for (int32_t pitch : binding.pitch) EXPECT_EQ(pitch, -11);
}

TEST(BindPlanes, OfAnyOtherPlaneCountChangesNothing) {
  uint8_t bytes[3];
  const uint8_t* const planes[3] = {bytes, bytes + 1, bytes + 2};
  const int32_t pitches[3] = {11, 22, 33};
  for (uint32_t count : {0u, 2u, 4u, ~0u}) {
    PlaneLayout binding{};
    binding.code = 1025;
    binding.planeCount = count;
    binding.pitch[0] = 5;
    const PlaneLayout before = binding;
    MPBindPlanes(&binding, planes, pitches);
    EXPECT_EQ(memcmp(&binding, &before, sizeof before), 0);
  }
}

TEST_F(OnePass, BindsTheCallersPlanesOfTheLatestRun) {
  const Engine engine({FORMAT_YV12, 8, 8}, {FORMAT_YVYU, 8, 8});
  uint8_t bytes[1024] = {};
  const Planes dst = {{bytes, bytes + 100, bytes + 200}, {8, 5, 6}};
  const Planes src = {{bytes + 512, nullptr, nullptr}, {16, 1, 2}};
  ASSERT_EQ(Process(engine, dst, src), KESTREL_OK);
  EXPECT_EQ(engine.pass().dstLayout.plane[1], bytes + 200);
  EXPECT_EQ(engine.pass().dstLayout.plane[2], bytes + 100);
  EXPECT_EQ(engine.pass().srcLayout.plane[1], bytes + 515);
  EXPECT_EQ(engine.pass().srcLayout.pitch[2], 16);
  ASSERT_EQ(recorder.jobs.size(), 1u);
  const Job& job = recorder.jobs[0];
  const uint8_t* const expectedSrc[3] = {bytes + 512, bytes + 515, bytes + 513};
  const uint8_t* const expectedDst[3] = {bytes, bytes + 200, bytes + 100};
  const int32_t dstPitch[3] = {8, 5, 6};
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(job.src[i], expectedSrc[i]);
    EXPECT_EQ(job.srcPitch[i], 16);
    EXPECT_EQ(job.dst[i], expectedDst[i]);
    EXPECT_EQ(job.dstPitch[i], dstPitch[i]);
  }
}

struct StartCase {
  const char* name;
  uint32_t code;
  uint32_t transform;
  MRECT mapped;
  int32_t start[3];  // from the planes given, in bytes
};

void PrintTo(const StartCase& c, std::ostream* out) {
  *out << c.name;
}

class StartAddresses : public ProcessingTest, public testing::WithParamInterface<StartCase> {};

// A region of 20 x 10 at (4, 6) in an image with pitches 100, 50 and 40; the job is the rectangle
// (7, 9) to (13, 11). All mirroring happens inside the region; the addresses are those of the pixel
// that is drawn first.
TEST_P(StartAddresses, AreThoseOfThePixelDrawnFirst) {
  const StartCase& c = GetParam();
  const bool swapped = (c.transform & MPP_SWAP_XY) != 0;
  const Engine engine({c.code, 20, 10}, {kGrey, swapped ? 10 : 20, swapped ? 20 : 10},
                      Param().Transform(c.transform).DstOrigin(4, 6));
  ASSERT_EQ(engine.result(), KESTREL_OK);
  static uint8_t bytes[16384];
  const uint8_t* const planes[3] = {bytes, bytes + 4096, bytes + 8192};
  const int32_t pitches[3] = {100, 50, 40};
  MPBindPlanes(&engine.pass().dstLayout, planes, pitches);
  int32_t copied[3];
  memcpy(copied, engine.pass().dstLayout.pitch, sizeof copied);
  MRECT rect = {7, 9, 13, 11};
  uint8_t* starts[3] = {};
  MPMapDstRect(&engine.pass(), copied, &rect, starts);
  EXPECT_EQ(rect, c.mapped);
  const bool onePlane = engine.pass().dstLayout.planeCount == 1;
  const bool vFirst = c.code == FORMAT_YV12;
  for (int i = 0; i < 3; ++i) {
    const int32_t pitch = onePlane ? 100 : pitches[i];
    EXPECT_EQ(copied[i], (c.transform & MPP_MIRROR_Y) != 0 ? -pitch : pitch);
    const int slot = vFirst && i != 0 ? 3 - i : i;
    EXPECT_EQ(starts[i] - planes[onePlane ? 0 : slot], c.start[i]) << "plane " << i;
  }
}

INSTANTIATE_TEST_SUITE_P(
    Layouts, StartAddresses,
    testing::Values(StartCase{"I420", FORMAT_I420, 0, {7, 9, 13, 11}, {907, 203, 163}},
                    StartCase{"I420MirrorX", FORMAT_I420, 2, {15, 9, 21, 11}, {912, 206, 166}},
                    StartCase{"I420MirrorY", FORMAT_I420, 4, {7, 11, 13, 13}, {1007, 253, 203}},
                    StartCase{"I420Turned", FORMAT_I420, 6, {15, 11, 21, 13}, {1012, 256, 206}},
                    StartCase{"I420Swapped", FORMAT_I420, 1, {7, 9, 13, 11}, {907, 203, 163}},
                    StartCase{"YV12", FORMAT_YV12, 0, {7, 9, 13, 11}, {907, 203, 163}},
                    StartCase{"I422MirrorX", FORMAT_I422, 2, {15, 9, 21, 11}, {912, 456, 366}},
                    StartCase{"I422Swapped", FORMAT_I422, 1, {7, 9, 13, 11}, {907, 453, 363}},
                    StartCase{"NV21", FORMAT_NV21, 0, {7, 9, 13, 11}, {907, 206, 166}},
                    StartCase{"NV12Turned", FORMAT_NV12, 6, {15, 11, 21, 13}, {1012, 262, 212}},
                    StartCase{"Rgba", FORMAT_XBGR8888, 0, {7, 9, 13, 11}, {928, 928, 928}},
                    StartCase{"RgbaMirrorX", FORMAT_XBGR8888, 2, {15, 9, 21, 11}, {948, 948, 948}},
                    StartCase{
                        "Rgb24Turned", FORMAT_RGB888, 6, {15, 11, 21, 13}, {1036, 1036, 1036}},
                    StartCase{"Yuyv", FORMAT_YUYV, 0, {7, 9, 13, 11}, {914, 913, 915}},
                    StartCase{"VyuyMirrorX", FORMAT_VYUY, 2, {15, 9, 21, 11}, {925, 926, 924}},
                    StartCase{"Special9", FORMAT_YUV_SPECIAL9, 0, {7, 9, 13, 11}, {928, 929, 930}}),
    [](const auto& row) { return std::string(row.param.name); });

TEST(StartAddress, OfANullFirstPlaneIsNotComputedThoughTheRectangleIsMirrored) {
  const Engine engine({FORMAT_I420, 20, 10}, {kGrey, 20, 10}, Param().Transform(6).DstOrigin(4, 6));
  const uint8_t* const planes[3] = {};
  const int32_t pitches[3] = {100, 50, 40};
  MPBindPlanes(&engine.pass().dstLayout, planes, pitches);
  int32_t copied[3] = {100, 50, 40};
  MRECT rect = {7, 9, 13, 11};
  uint8_t* starts[3] = {};
  MPMapDstRect(&engine.pass(), copied, &rect, starts);
  EXPECT_EQ(rect, (MRECT{15, 11, 21, 13}));
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(copied[i], pitches[i]);
    EXPECT_EQ(starts[i], nullptr);
  }
}

TEST(StartAddress, ComputationStopsAtTheFirstNullPlane) {
  const Engine engine({FORMAT_I420, 20, 10}, {kGrey, 20, 10}, Param().Transform(4));
  uint8_t bytes[4096];
  const uint8_t* const planes[3] = {bytes, nullptr, bytes + 2048};
  const int32_t pitches[3] = {100, 50, 40};
  MPBindPlanes(&engine.pass().dstLayout, planes, pitches);
  int32_t copied[3] = {100, 50, 40};
  MRECT rect = {0, 0, 20, 10};
  uint8_t* starts[3] = {};
  MPMapDstRect(&engine.pass(), copied, &rect, starts);
  EXPECT_EQ(starts[0], bytes + 900);
  EXPECT_EQ(copied[0], -100);
  EXPECT_EQ(copied[1], 50);
  EXPECT_EQ(copied[2], 40);
  EXPECT_EQ(starts[1], nullptr);
  EXPECT_EQ(starts[2], nullptr);
}

// ---- addresses that point at a pixel inside the image ----

struct OriginCase {
  const char* name;
  uint32_t code;
  int32_t moved[3];  // image origin minus the address given, for pixel (10, 6)
};

void PrintTo(const OriginCase& c, std::ostream* out) {
  *out << c.name;
}

class OriginAddresses : public ProcessingTest, public testing::WithParamInterface<OriginCase> {};

// The whole pixel's bytes count for each plane's columns, so a plane of two-byte chroma pairs is
// moved by half of what its samples take.
TEST_P(OriginAddresses, AreMovedBackByRowsAndWholePixels) {
  const OriginCase& c = GetParam();
  recorder.convert = false;
  const Engine engine({c.code, 64, 32}, {kGrey, 64, 32});
  ASSERT_EQ(engine.result(), KESTREL_OK);
  static uint8_t bytes[65536];
  static uint8_t from[64 * 32];
  const Planes src = {{from, nullptr, nullptr}, {64, 0, 0}};
  const Planes dst = {{bytes + 20000, bytes + 40000, bytes + 60000}, {300, 70, 90}};
  const MRECT origin = {10, 6, -77, 99};
  ASSERT_EQ(
      MPProcessEx(engine.handle(), dst.plane, &origin, nullptr, dst.pitch, src.plane, src.pitch),
      KESTREL_OK);
  ASSERT_EQ(recorder.jobs.size(), 1u);
  const PlaneLayout& bound = engine.pass().dstLayout;
  const uint32_t offsets[3] = {bound.yOffset, bound.uOffset, bound.vOffset};
  for (int i = 0; i < 3; ++i) {
    const bool onePlane = bound.planeCount == 1;
    const uint8_t* given = dst.plane[onePlane ? 0 : i] + (onePlane ? offsets[i] : 0);
    EXPECT_EQ(bound.plane[i] - given, c.moved[i]) << "plane " << i;
  }
}

INSTANTIATE_TEST_SUITE_P(
    Layouts, OriginAddresses,
    testing::Values(OriginCase{"Grey", FORMAT_GRAY8, {-1810, -1810, -1810}},
                    OriginCase{"Rgba", FORMAT_XBGR8888, {-1840, -1840, -1840}},
                    OriginCase{"Rgb24", FORMAT_RGB888, {-1830, -1830, -1830}},
                    OriginCase{"Rgb565", FORMAT_RGB565, {-1820, -1820, -1820}},
                    OriginCase{"Yuyv", FORMAT_YUYV, {-1820, -1820, -1820}},
                    OriginCase{"I420", FORMAT_I420, {-1810, -215, -275}},
                    OriginCase{"I422", FORMAT_I422, {-1810, -425, -545}},
                    OriginCase{"I444", FORMAT_I444, {-1810, -430, -550}},
                    OriginCase{"NV21", FORMAT_NV21, {-1810, -215, -275}},
                    OriginCase{"NV16", FORMAT_NV16, {-1810, -425, -545}},
                    OriginCase{"Special8", FORMAT_YUV_SPECIAL8, {-1820, -1820, -1820}},
                    OriginCase{"Special9", FORMAT_YUV_SPECIAL9, {-1810, -1810, -1810}}),
    [](const auto& row) { return std::string(row.param.name); });

using Origin = ProcessingTest;

TEST_F(Origin, OfZeroLeavesAddressesAlone) {
  const Engine engine({FORMAT_NV21, 8, 8}, {FORMAT_NV21, 8, 8}, Param().Tiled());
  Bytes luma(64, 5), chroma(32, 6), outLuma(64), outChroma(32);
  const Planes src = VFirst(luma, 8, chroma, 8);
  const Planes dst = VFirst(outLuma, 8, outChroma, 8);
  const MRECT origin = {0, 0, 0, 0};
  ASSERT_EQ(
      MPProcessEx(engine.handle(), dst.plane, &origin, nullptr, dst.pitch, src.plane, src.pitch),
      KESTREL_OK);
  for (int i = 0; i < 3; ++i) EXPECT_EQ(engine.pass().dstLayout.plane[i], dst.plane[i]);
  EXPECT_EQ(outLuma, luma);
  EXPECT_EQ(outChroma, chroma);
}

TEST_F(Origin, LetsAWindowOfAnImageBeDrawnThroughItsOwnAddress) {
  const Engine engine({kRgba, 8, 8}, {kGrey | FORMAT_BT601_FULL, 8, 8}, Param().Tiled());
  Bytes from(64, 5), window(4 * 4 * 4);
  const Planes src = OnePlane(from, 8);
  const Planes dst = OnePlane(window, 16);
  const MRECT rect = {3, 2, 7, 6};
  ASSERT_EQ(MPProcessEx(engine.handle(), dst.plane, &rect, &rect, dst.pitch, src.plane, src.pitch),
            KESTREL_OK);
  for (size_t i = 0; i < window.size(); i += 4) EXPECT_EQ(window[i], 5) << i;
}

TEST_F(Origin, MustBeGivenAndNotNegative) {
  const Engine engine({kGrey, 8, 8}, {kGrey, 8, 8});
  Bytes from(64, 7), to(64, 9);
  const Planes src = OnePlane(from, 8);
  const Planes dst = OnePlane(to, 8);
  MPPHandle* handle = engine.handle();
  const MRECT zero = {};
  const MRECT negativeLeft = {-1, 0, 8, 8};
  const MRECT negativeTop = {0, -1, 8, 8};
  const auto run = [&](MPPHandle* h, uint8_t* const* dstPlanes, const MRECT* origin,
                       const int32_t* dstPitches, const uint8_t* const* srcPlanes,
                       const int32_t* srcPitches) {
    return MPProcessEx(h, dstPlanes, origin, nullptr, dstPitches, srcPlanes, srcPitches);
  };
  EXPECT_EQ(run(handle, dst.plane, nullptr, dst.pitch, src.plane, src.pitch), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(run(handle, dst.plane, &negativeLeft, dst.pitch, src.plane, src.pitch),
            KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(run(handle, dst.plane, &negativeTop, dst.pitch, src.plane, src.pitch),
            KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(run(nullptr, dst.plane, &zero, dst.pitch, src.plane, src.pitch), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(run(handle, nullptr, &zero, dst.pitch, src.plane, src.pitch), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(run(handle, dst.plane, &zero, nullptr, src.plane, src.pitch), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(run(handle, dst.plane, &zero, dst.pitch, nullptr, src.pitch), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(run(handle, dst.plane, &zero, dst.pitch, src.plane, nullptr), KESTREL_BAD_ARGUMENT);
  EXPECT_TRUE(recorder.jobs.empty());
  EXPECT_EQ(to, Bytes(64, 9));
}

}  // namespace
}  // namespace kestrel::test
