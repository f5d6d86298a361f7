// Calls that no sane program makes. The answer is an error code or nothing done: never a crash,
// never a byte outside the caller's rectangle, never a block left behind.
#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "engine/postprocess.h"
#include "jni/bitmap_buffers.h"
#include "tests/robustness/case_log.h"
#include "tests/robustness/test_image.h"
#include "tests/support/tessel_double.h"

namespace robustness {
namespace {

constexpr int32_t kBeyond = 1 << 25;  // larger than any coordinate that an engine believes

class Hostile : public testing::Test {
 protected:
  void SetUp() override {
    tessel_double::Reset();
    tessel_double::FailAbove(1 << 28);
    liveBefore_ = tessel_double::LiveBlocks();
  }
  void TearDown() override {
    EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore_);
    for (const std::string& fault : tessel_double::Faults()) ADD_FAILURE() << fault;
  }

 private:
  size_t liveBefore_ = 0;
};

// ---- Format codes ----

uint32_t Parse(uint32_t code) {
  FormatDesc desc = {};
  const MPPFORMAT record = {code, 5, 7, nullptr};
  return MPParseFormat(&desc, &record);
}

uint32_t ExpectedParse(uint32_t code) {
  ImageShape shape;
  return ShapeOf(code, &shape) ? KESTREL_OK : KESTREL_UNSUPPORTED;
}

TEST_F(Hostile, EveryCodeOfEveryFamilyIsKnownOrRefused) {
  // All families, storage classes and sixteen low bits, with the bits between clear.
  for (uint32_t top = 0; top < 256; ++top) {
    for (uint32_t low = 0; low < 65536; ++low) {
      const uint32_t code = top << 24 | low;
      if (Parse(code) != ExpectedParse(code)) {
        ASSERT_EQ(Parse(code), ExpectedParse(code)) << code;
      }
    }
  }
  Random random(1);
  for (int i = 0; i < 1000000; ++i) {
    const uint32_t code = random.Bits();
    ASSERT_EQ(Parse(code), ExpectedParse(code)) << code;
  }
}

TEST_F(Hostile, ADecodedCodeAlwaysHasALayout) {
  Random random(2);
  for (int i = 0; i < 300000; ++i) {
    const uint32_t code = random.Bits();
    FormatDesc desc = {};
    const MPPFORMAT record = {code, 5, 7, nullptr};
    if (MPParseFormat(&desc, &record) != KESTREL_OK) continue;
    PlaneLayout layout = {};
    uint32_t factors[6] = {};
    const uint32_t bits = MPGetPlaneLayout(&desc, &layout);
    EXPECT_EQ(bits, layout.bitsPerPixel);
    EXPECT_GE(bits, 1u) << code;
    EXPECT_LE(bits, 32u) << code;
    ASSERT_EQ(MPGetSubsampling(&desc, &layout, factors), KESTREL_OK) << code;
    for (const uint32_t factor : factors) ASSERT_TRUE(factor >= 1 && factor <= 16) << code;
    for (const int32_t step : layout.step) ASSERT_TRUE(step >= 1 && step <= 4) << code;
    ASSERT_TRUE(layout.planeCount == 1 || layout.planeCount == 3) << code;
  }
}

TEST_F(Hostile, UnknownInternalCodesHaveNoLayout) {
  for (const uint32_t code : {0u, 16u, 17u, 255u, 257u, 511u, 516u, 532u, 575u, 582u, 639u, 641u,
                              767u, 773u, 1029u, 0x70000001u, 0x70000006u, 0x7000000Au, UINT_MAX}) {
    FormatDesc desc = {};
    desc.code = code;
    PlaneLayout layout = {};
    uint32_t factors[6] = {};
    EXPECT_EQ(MPGetPlaneLayout(&desc, &layout), 0u) << code;
    EXPECT_EQ(desc.code, 0u) << code;
    desc.code = code;
    EXPECT_EQ(MPGetSubsampling(&desc, &layout, factors), KESTREL_UNSUPPORTED) << code;
  }
}

// A code of some family: listed, built from random fields, or garbage.
uint32_t AnyCode(Random* random) {
  switch (random->Between(0, 9)) {
    case 0:  // RGB of any channel widths
      return (random->OneIn(2) ? 0x10000000u : 0x30000000u) |
             static_cast<uint32_t>(random->Between(5, 7)) << 24 | (random->Bits() & 0x1FFF);
    case 1:  // planar of any subsampling
      return 0x50000800 | (random->Bits() & 0x32FF);
    case 2:
      return random->Bits();
    case 3:  // a listed code with one bit wrong
      return random->Pick(kListedCodes) ^ (1u << random->Between(0, 31));
    default: {
      const uint32_t code = random->Pick(kListedCodes);
      return code >= 0x50000000 ? code | (random->Bits() & FORMAT_STANDARD_MASK) : code;
    }
  }
}

TEST_F(Hostile, CreationAcceptsExactlyTheKnownPairs) {
  ForEachCase(40000, [](uint64_t number) {
    Random random(number);
    const uint32_t dstCode = AnyCode(&random);
    const uint32_t srcCode = AnyCode(&random);
    MPPFORMAT dst = {dstCode, random.Between(1, 9), random.Between(1, 9), nullptr};
    MPPFORMAT src = {srcCode, random.Between(1, 9), random.Between(1, 9), nullptr};
    MPPPARAM params = {};
    params.passMode = random.OneIn(4) ? MPP_PASS_TILED : random.Bits();
    params.dither = random.Bits();
    const uint32_t dither = params.dither;
    MPPHandle* handle = reinterpret_cast<MPPHandle*>(&params);
    const uint32_t expected = std::max(ExpectedParse(dstCode), ExpectedParse(srcCode));
    EXPECT_EQ(MPPCreate(&dst, &src, &params, &handle), expected)
        << std::hex << dstCode << " from " << srcCode;
    EXPECT_EQ(handle != nullptr, expected == KESTREL_OK);
    EXPECT_EQ(dst.format, dstCode);
    EXPECT_EQ(src.format, srcCode);
    EXPECT_EQ(params.dither, dither);
    if (expected == KESTREL_OK) {
      EXPECT_EQ(MPPDestroy(handle), KESTREL_OK);
    }
  });
}

// ---- Random jobs ----

// An edge of a rectangle: near the images or far beyond what an engine believes, never between, so
// that what lies within belief can be given real memory.
int32_t AnyEdge(Random* random) {
  constexpr int32_t kFar[] = {INT_MIN,     INT_MIN + 1, INT_MIN + 16, -kBeyond, kBeyond,
                              kBeyond + 3, INT_MAX - 8, INT_MAX - 1,  INT_MAX};
  return random->OneIn(3) ? random->Pick(kFar) : random->Between(-70, 90);
}

MRECT AnyRect(Random* random) {
  return {AnyEdge(random), AnyEdge(random), AnyEdge(random), AnyEdge(random)};
}

int32_t AnyOrigin(Random* random) {
  switch (random->Between(0, 11)) {
    case 0:
      return AnyEdge(random);
    case 1:
      return random->Between(-40, -1);
    case 2:
    case 3:
      return random->Between(1, 20);
    default:
      return 0;
  }
}

int32_t AnyAdjustment(Random* random) {
  constexpr int32_t kValues[] = {INT_MIN, -129, -128, -1, 1, 127, 128, 129, INT_MAX};
  switch (random->Between(0, 3)) {
    case 0:
      return random->Pick(kValues);
    case 1:
      return random->Between(-128, 128);
    default:
      return 0;
  }
}

uint32_t AnyWord(Random* random, uint32_t usualCount) {
  return random->OneIn(6) ? random->Bits() : random->Bits() % usualCount;
}

MPPPARAM AnyParams(Random* random) {
  constexpr uint32_t kPassModes[] = {0, 1, 2, 3, 4, 256, 256, 256, 257, 0x100000, UINT_MAX};
  MPPPARAM params = {};
  params.resampleFlags = AnyWord(random, 4);
  params.transformCode = AnyWord(random, 8);
  params.bandSelector = AnyWord(random, 6);
  params.passMode = random->Pick(kPassModes);
  params.aspectMode = AnyWord(random, 4);
  params.dither = AnyWord(random, 2);
  params.brightness = AnyAdjustment(random);
  params.contrast = AnyAdjustment(random);
  params.saturation = AnyAdjustment(random);
  params.srcOriginX = AnyOrigin(random);
  params.srcOriginY = AnyOrigin(random);
  params.dstOriginX = AnyOrigin(random);
  params.dstOriginY = AnyOrigin(random);
  if (random->OneIn(3)) {
    params.srcRect = AnyRect(random);
  } else if (random->OneIn(3)) {
    params.srcRect.left = random->Between(0, 30);
    params.srcRect.top = random->Between(0, 30);
    params.srcRect.right = params.srcRect.left + random->Between(1, 30);
    params.srcRect.bottom = params.srcRect.top + random->Between(1, 30);
  }
  params.alpha = random->Bits();
  return params;
}

// Nothing larger is met in these jobs, except sizes and edges that no engine believes.
constexpr int64_t kBelief = 4096;

// The size that a caller's statements give an image on one axis, as far as it can be believed.
int64_t StatedSize(int64_t origin, int64_t size, int64_t edge) {
  int64_t stated = 1;
  if (origin + size <= kBelief) stated = std::max(stated, origin + size);
  if (edge <= kBelief) stated = std::max(stated, edge);
  // An image too large to be believed is given its first pixels only: nothing may touch the rest.
  return std::max(stated, std::min<int64_t>(size, 64));
}

// Pitches for an image of a stated size; far ones only where no row but the first may be reached.
void ChoosePitches(Random* random, const ImageShape& shape, int64_t width, int32_t* pitches) {
  constexpr int32_t kFar[] = {INT_MIN, INT_MIN + 1, INT_MAX, -INT_MAX};
  const int32_t kind = random->Between(0, 11);
  const int32_t padding = random->Between(0, 9);
  for (int i = 0; i < shape.planes; ++i) {
    const int32_t rowBytes = static_cast<int32_t>(TestImage::RowBytes(shape, i, width));
    switch (kind) {
      case 0:
        pitches[i] = random->Pick(kFar);
        break;
      case 1:
        pitches[i] = random->Between(-rowBytes - 3, rowBytes + 3);  // rows overlap
        break;
      case 2:
      case 3:
        pitches[i] = -rowBytes - padding;
        break;
      case 4:
        pitches[i] = (rowBytes + 3) / 4 * 4;  // what the coarse grid of a tiled engine asks for
        break;
      default:
        pitches[i] = rowBytes + padding;
        break;
    }
  }
}

struct HostileJob {
  MPPFORMAT dst = {};
  MPPFORMAT src = {};
  MPPPARAM params = {};
  bool hasRect = false;
  MRECT rect = {};
  Span allowed = {};  // pixels that the job may change
  std::unique_ptr<TestImage> dstImage;
  std::unique_ptr<TestImage> srcImage;
  GuardedBlock palette;
};

HostileJob MakeJob(uint64_t number) {
  Random random(number);
  HostileJob job;
  ImageShape dstShape;
  ImageShape srcShape;
  do {
    job.dst.format = AnyCode(&random);
  } while (!ShapeOf(job.dst.format, &dstShape));
  do {
    job.src.format = AnyCode(&random);
  } while (!ShapeOf(job.src.format, &srcShape));
  job.dst.width = random.Between(1, 48);
  job.dst.height = random.Between(1, 48);
  job.src.width = random.Between(1, 48);
  job.src.height = random.Between(1, 48);
  job.params = AnyParams(&random);
  if (srcShape.paletteEntries != 0 && !random.OneIn(4)) {
    job.palette = GuardedBlock(static_cast<size_t>(srcShape.paletteEntries) * 4, random.OneIn(2));
    job.src.palette = job.palette.data();
  }

  const int64_t originX = job.params.dstOriginX;
  const int64_t originY = job.params.dstOriginY;
  job.allowed = {originX, originY, originX + job.dst.width, originY + job.dst.height};
  if (random.OneIn(2)) {
    job.hasRect = true;
    job.rect = AnyRect(&random);
    job.allowed.left = std::max<int64_t>(job.rect.left, originX);
    job.allowed.top = std::max<int64_t>(job.rect.top, originY);
    // A tiled engine takes the rectangle's right and bottom as they are, in strips; a single one
    // goes no further than the region's size from where it starts.
    const bool tiled = job.params.passMode == MPP_PASS_TILED;
    job.allowed.right = tiled ? job.rect.right
                              : std::min<int64_t>(job.rect.right, job.allowed.left + job.dst.width);
    job.allowed.bottom = tiled
                             ? job.rect.bottom
                             : std::min<int64_t>(job.rect.bottom, job.allowed.top + job.dst.height);
  }

  const bool hasSrcRect = (job.params.srcRect.left | job.params.srcRect.top |
                           job.params.srcRect.right | job.params.srcRect.bottom) != 0;
  const int64_t srcWidth =
      StatedSize(job.params.srcOriginX, job.src.width, hasSrcRect ? job.params.srcRect.right : 0);
  const int64_t srcHeight =
      StatedSize(job.params.srcOriginY, job.src.height, hasSrcRect ? job.params.srcRect.bottom : 0);
  // Of a rectangle that ends far away a tiled engine draws a strip up to its grid, then one region.
  const auto drawnEnd = [](int64_t start, int64_t end, int32_t size) {
    return end > kBelief ? start + 16 + size : end;
  };
  const int64_t dstWidth = StatedSize(originX, job.dst.width,
                                      drawnEnd(job.allowed.left, job.allowed.right, job.dst.width));
  const int64_t dstHeight = StatedSize(
      originY, job.dst.height, drawnEnd(job.allowed.top, job.allowed.bottom, job.dst.height));
  int32_t dstPitches[3] = {};
  int32_t srcPitches[3] = {};
  ChoosePitches(&random, dstShape, dstWidth, dstPitches);
  ChoosePitches(&random, srcShape, srcWidth, srcPitches);
  job.dstImage =
      std::make_unique<TestImage>(dstShape, dstWidth, dstHeight, dstPitches, random.OneIn(2));
  job.srcImage =
      std::make_unique<TestImage>(srcShape, srcWidth, srcHeight, srcPitches, random.OneIn(2));
  job.dstImage->Fill(number);
  job.srcImage->Fill(~number);

  const MPPPARAM& p = job.params;
  char text[400];
  snprintf(text, sizeof text,
           "%08x %dx%d at %d,%d from %08x %dx%d at %d,%d, transform %x, mode %x, bilinear %x, "
           "aspect %x, source rectangle %d %d %d %d, rectangle %d: %d %d %d %d, pitches %d from %d",
           job.dst.format, job.dst.width, job.dst.height, p.dstOriginX, p.dstOriginY,
           job.src.format, job.src.width, job.src.height, p.srcOriginX, p.srcOriginY,
           p.transformCode, p.passMode, p.resampleFlags, p.aspectMode, p.srcRect.left,
           p.srcRect.top, p.srcRect.right, p.srcRect.bottom, job.hasRect, job.rect.left,
           job.rect.top, job.rect.right, job.rect.bottom, dstPitches[0], srcPitches[0]);
  DescribeCase(text);
  return job;
}

// Blocks beside the rectangle that may change: a mirrored walk meets subsampled blocks out of phase
// when a size is odd, and exchanged lumas of an odd start belong to the neighbouring pair.
int64_t SlackBlocks(const HostileJob& job) {
  const bool mirrors = (job.params.transformCode & (MPP_MIRROR_X | MPP_MIRROR_Y)) != 0;
  return mirrors || job.dstImage->shape().swapsLuma ? 1 : 0;
}

TEST_F(Hostile, RandomJobsStayInsideTheirRectangles) {
  uint64_t drawn = 0;
  uint64_t run = 0;
  ForEachCase(30000, [&](uint64_t number) {
    HostileJob job = MakeJob(number);
    MPPHandle* handle = nullptr;
    const uint32_t code = MPPCreate(&job.dst, &job.src, &job.params, &handle);
    ASSERT_EQ(code, KESTREL_OK);  // all sizes are ordinary
    TestImage& image = *job.dstImage;
    // Entries that a layout does not use are not looked at.
    if (image.shape().planes == 1) {
      image.planes()[1] = image.planes()[2] = reinterpret_cast<uint8_t*>(uintptr_t{1});
      image.pitches()[1] = image.pitches()[2] = INT_MIN;
    }
    if (job.srcImage->shape().planes == 1) {
      job.srcImage->planes()[1] = nullptr;
      job.srcImage->planes()[2] = reinterpret_cast<uint8_t*>(UINTPTR_MAX);
      job.srcImage->pitches()[1] = job.srcImage->pitches()[2] = INT_MAX;
    }
    for (int repeat = 0; repeat < 2; ++repeat) {
      EXPECT_EQ(MPProcess(handle, image.planes(), job.hasRect ? &job.rect : nullptr,
                          image.pitches(), job.srcImage->constPlanes(), job.srcImage->pitches()),
                KESTREL_OK);
    }
    const std::string outside = image.ChangeOutside(job.allowed, SlackBlocks(job));
    EXPECT_EQ(outside, "");
    EXPECT_FALSE(job.srcImage->Changed());
    MPPDestroy(handle);
    ++run;
    drawn += image.Changed();
  });
  // Many jobs are absurd and draw nothing, but if few draw the cases above show little.
  if (run > 1000) {
    EXPECT_GT(drawn, run / 4);
  }
}

TEST_F(Hostile, AMissingPlaneMeansNothingIsWritten) {
  uint64_t checked = 0;
  uint64_t run = 0;
  ForEachCase(10000, [&](uint64_t number) {
    HostileJob job = MakeJob(number + (uint64_t{1} << 32));
    Random random(number);
    TestImage& dst = *job.dstImage;
    TestImage& src = *job.srcImage;
    const int slot = random.Between(1, 2);
    bool needed = false;
    if (dst.shape().planes > 1 && (random.OneIn(2) || src.shape().planes == 1)) {
      dst.planes()[slot] = nullptr;
      needed = true;
    } else if (src.shape().planes > 1) {
      src.planes()[slot] = nullptr;
      needed = !dst.shape().isGrey;  // a grey picture needs no chroma
    }
    MPPHandle* handle = nullptr;
    ASSERT_EQ(MPPCreate(&job.dst, &job.src, &job.params, &handle), KESTREL_OK);
    EXPECT_EQ(MPProcess(handle, dst.planes(), job.hasRect ? &job.rect : nullptr, dst.pitches(),
                        src.constPlanes(), src.pitches()),
              KESTREL_OK);
    if (needed) {
      EXPECT_FALSE(dst.Changed()) << std::hex << job.dst.format << job.src.format;
    }
    MPPDestroy(handle);
    checked += needed;
    ++run;
  });
  if (run > 1000) {
    EXPECT_GT(checked, run / 4);
  }
}

TEST_F(Hostile, FarPitchesAreRefused) {
  // More than one row at a pitch of this kind leaves every address space of 2 GiB.
  constexpr int32_t kFar[] = {INT_MIN,     INT_MIN + 1, -INT_MAX,   INT_MAX,
                              INT_MAX - 1, 1 << 30,     -(1 << 30), 0x7FFFFFF0};
  for (const uint32_t dstCode : kListedCodes) {
    for (const uint32_t srcCode : {FORMAT_NV21, FORMAT_XBGR8888, FORMAT_I420, FORMAT_YUYV}) {
      for (const uint32_t passMode : {1u, MPP_PASS_TILED}) {
        for (const int32_t pitch : kFar) {
          ImageShape dstShape;
          ImageShape srcShape;
          ASSERT_TRUE(ShapeOf(dstCode, &dstShape));
          ASSERT_TRUE(ShapeOf(srcCode, &srcShape));
          MPPFORMAT dst = {dstCode, 20, 64, nullptr};
          MPPFORMAT src = {srcCode, 20, 64, nullptr};
          MPPPARAM params = {};
          params.passMode = passMode;
          MPPHandle* handle = nullptr;
          ASSERT_EQ(MPPCreate(&dst, &src, &params, &handle), KESTREL_OK);
          const int32_t far[3] = {pitch, pitch, pitch};
          {
            TestImage to(dstShape, 20, 64, far, true);
            TestImage from(srcShape, 20, 64, nullptr, true);
            to.Fill(1);
            MPProcess(handle, to.planes(), nullptr, to.pitches(), from.constPlanes(),
                      from.pitches());
            EXPECT_FALSE(to.Changed()) << std::hex << dstCode << " pitch " << pitch;
          }
          {
            TestImage to(dstShape, 20, 64, nullptr, true);
            TestImage from(srcShape, 20, 64, far, true);
            to.Fill(1);
            MPProcess(handle, to.planes(), nullptr, to.pitches(), from.constPlanes(),
                      from.pitches());
            EXPECT_FALSE(to.Changed()) << std::hex << srcCode << " pitch " << pitch;
          }
          MPPDestroy(handle);
        }
      }
    }
  }
}

// ---- Sizes and steps ----

uint64_t Step(int64_t source, int64_t destination) {
  return std::min<uint64_t>(
      65536 * static_cast<uint64_t>(source) / static_cast<uint64_t>(destination), UINT32_MAX);
}

TEST_F(Hostile, SizesAndSteps) {
  constexpr int32_t kSizes[] = {INT_MIN, -kBeyond, -1,    0,       1,           2,      33,
                                65535,   65536,    65537, kBeyond, INT_MAX - 1, INT_MAX};
  static constexpr int64_t kLargest = 1 << 24;
  ForEachCase(20000, [&](uint64_t number) {
    Random random(number);
    const uint32_t dstCode = random.Pick(kListedCodes);
    const uint32_t srcCode = random.Pick(kListedCodes);
    MPPFORMAT dst = {dstCode, random.Pick(kSizes), random.Pick(kSizes), nullptr};
    MPPFORMAT src = {srcCode, random.Pick(kSizes), random.Pick(kSizes), nullptr};
    MPPPARAM params = {};
    params.resampleFlags = AnyWord(&random, 3);
    params.transformCode = random.Bits() % 8;
    params.passMode = random.OneIn(2) ? MPP_PASS_TILED : 1;
    char text[200];
    snprintf(text, sizeof text, "%08x %dx%d from %08x %dx%d, transform %u, mode %u, bilinear %x",
             dstCode, dst.width, dst.height, srcCode, src.width, src.height, params.transformCode,
             params.passMode, params.resampleFlags);
    DescribeCase(text);
    MPPHandle* handle = nullptr;
    const uint32_t code = MPPCreate(&dst, &src, &params, &handle);
    ASSERT_EQ(handle != nullptr, code == KESTREL_OK);

    if (std::min({dst.width, dst.height, src.width, src.height}) < 1) {
      ASSERT_EQ(code, KESTREL_BAD_ARGUMENT);
      return;
    }
    const bool swaps = (params.transformCode & MPP_SWAP_XY) != 0;
    const uint64_t stepX = Step(src.width, swaps ? dst.height : dst.width);
    const uint64_t stepY = Step(src.height, swaps ? dst.width : dst.height);
    const bool believable = std::max({dst.width, dst.height, src.width, src.height}) <= kLargest;
    if (stepX == 0 || stepY == 0) {
      ASSERT_EQ(code, KESTREL_BAD_ARGUMENT);
      return;
    }
    if (believable) {
      ASSERT_EQ(code, KESTREL_OK);
    }
    if (code != KESTREL_OK) return;
    EXPECT_EQ(handle->pass[0]->stepX, stepX);
    EXPECT_EQ(handle->pass[0]->stepY, stepY);

    ImageShape dstShape;
    ImageShape srcShape;
    ASSERT_TRUE(ShapeOf(dstCode, &dstShape));
    ASSERT_TRUE(ShapeOf(srcCode, &srcShape));
    // Sizes beyond belief get memory for a few pixels, which must do; merely large ones get all.
    const auto given = [](int32_t size) { return size <= kLargest ? size : 8; };
    constexpr int64_t kAffordable = 1 << 18;
    if (TestImage::MemoryBytes(dstShape, given(dst.width), given(dst.height), nullptr) <=
            kAffordable &&
        TestImage::MemoryBytes(srcShape, given(src.width), given(src.height), nullptr) <=
            kAffordable) {
      TestImage to(dstShape, given(dst.width), given(dst.height), nullptr, random.OneIn(2));
      TestImage from(srcShape, given(src.width), given(src.height), nullptr, random.OneIn(2));
      to.Fill(number);
      MPProcess(handle, to.planes(), nullptr, to.pitches(), from.constPlanes(), from.pitches());
      if (!believable) {
        EXPECT_FALSE(to.Changed());
      }
      EXPECT_EQ(to.ChangeOutside({0, 0, to.width(), to.height()}, 1), "");
    }
    MPPDestroy(handle);
  });
}

// ---- Region planning and planes that start inside the image ----

TEST_F(Hostile, PlanningAnyRectangles) {
  ForEachCase(30000, [](uint64_t number) {
    Random random(number);
    MPPFORMAT dst = {random.Pick(kListedCodes), random.Between(1, 50), random.Between(1, 50),
                     nullptr};
    MPPFORMAT src = {random.Pick(kListedCodes), random.Between(1, 50), random.Between(1, 50),
                     nullptr};
    MPPPARAM params = AnyParams(&random);
    MPPHandle* handle = nullptr;
    ASSERT_EQ(MPPCreate(&dst, &src, &params, &handle), KESTREL_OK);
    MRECT dstRect = random.OneIn(2) ? MRECT{} : AnyRect(&random);
    MRECT srcRect = random.OneIn(2) ? MRECT{} : AnyRect(&random);
    const MRECT zero = {};
    const bool planned =
        memcmp(&dstRect, &zero, sizeof zero) == 0 || memcmp(&srcRect, &zero, sizeof zero) == 0;
    EXPECT_EQ(MPPAlign(handle, &dstRect, &srcRect), planned ? KESTREL_OK : KESTREL_BAD_ARGUMENT);
    MPPDestroy(handle);
  });
}

TEST_F(Hostile, OriginsOfPartialPlanes) {
  ForEachCase(10000, [](uint64_t number) {
    HostileJob job = MakeJob(number + (uint64_t{2} << 32));
    Random random(number);
    TestImage& image = *job.dstImage;
    MPPHandle* handle = nullptr;
    ASSERT_EQ(MPPCreate(&job.dst, &job.src, &job.params, &handle), KESTREL_OK);
    MRECT origin = AnyRect(&random);
    const bool far = origin.left >= kBeyond || origin.top >= kBeyond;
    const bool negative = origin.left < 0 || origin.top < 0;
    if (!far && !negative) origin.left = origin.top = 0;  // the planes below start at the image
    const uint32_t code =
        MPProcessEx(handle, image.planes(), &origin, job.hasRect ? &job.rect : nullptr,
                    image.pitches(), job.srcImage->constPlanes(), job.srcImage->pitches());
    if (negative) {
      EXPECT_EQ(code, KESTREL_BAD_ARGUMENT);
      EXPECT_FALSE(image.Changed());
    } else if (far) {
      EXPECT_FALSE(image.Changed());
    } else {
      EXPECT_EQ(code, KESTREL_OK);
      EXPECT_EQ(image.ChangeOutside(job.allowed, SlackBlocks(job)), "");
    }
    MPPDestroy(handle);
  });
}

// ---- Null arguments ----

class HostileNull : public Hostile {
 protected:
  void SetUp() override {
    Hostile::SetUp();
    MPPFORMAT dst = {FORMAT_XBGR8888, 8, 8, nullptr};
    MPPFORMAT src = {FORMAT_NV21, 8, 8, nullptr};
    for (const uint32_t passMode : {1u, MPP_PASS_TILED}) {
      MPPPARAM params = {};
      params.passMode = passMode;
      ASSERT_EQ(MPPCreate(&dst, &src, &params, &handles_[passMode == MPP_PASS_TILED]), KESTREL_OK);
    }
    ASSERT_TRUE(ShapeOf(FORMAT_XBGR8888, &dstShape_));
    ASSERT_TRUE(ShapeOf(FORMAT_NV21, &srcShape_));
    to_ = std::make_unique<TestImage>(dstShape_, 8, 8, nullptr, true);
    from_ = std::make_unique<TestImage>(srcShape_, 8, 8, nullptr, true);
    to_->Fill(1);
  }
  void TearDown() override {
    for (MPPHandle* handle : handles_) MPPDestroy(handle);
    Hostile::TearDown();
  }

  MPPHandle* handles_[2] = {};
  ImageShape dstShape_;
  ImageShape srcShape_;
  std::unique_ptr<TestImage> to_;
  std::unique_ptr<TestImage> from_;
};

TEST_F(HostileNull, Creation) {
  for (int missing = 0; missing < 4; ++missing) {
    MPPFORMAT dst = {FORMAT_XBGR8888, 8, 8, nullptr};
    MPPFORMAT src = {FORMAT_NV21, 8, 8, nullptr};
    MPPPARAM params = {};
    params.dither = 1;
    MPPHandle* handle = reinterpret_cast<MPPHandle*>(this);
    EXPECT_EQ(MPPCreate(missing == 0 ? nullptr : &dst, missing == 1 ? nullptr : &src,
                        missing == 2 ? nullptr : &params, missing == 3 ? nullptr : &handle),
              KESTREL_BAD_ARGUMENT);
    if (missing != 3) {
      EXPECT_EQ(handle, nullptr);
    }
    EXPECT_EQ(dst.format, FORMAT_XBGR8888);
    EXPECT_EQ(src.format, FORMAT_NV21);
    EXPECT_EQ(params.dither, 1u);
  }
  EXPECT_EQ(MPPCreate(nullptr, nullptr, nullptr, nullptr), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(MPPDestroy(nullptr), KESTREL_OK);
  EXPECT_EQ(PostProcessGetVersionInfo(), nullptr);
}

TEST_F(HostileNull, Processing) {
  uint8_t* const noPlanes[3] = {};
  const uint8_t* const noSource[3] = {};
  const MRECT origin = {};
  for (MPPHandle* handle : handles_) {
    uint8_t** dst = to_->planes();
    const int32_t* dstPitches = to_->pitches();
    const uint8_t* const* src = from_->constPlanes();
    const int32_t* srcPitches = from_->pitches();
    EXPECT_EQ(MPProcess(nullptr, dst, nullptr, dstPitches, src, srcPitches), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, nullptr, nullptr, dstPitches, src, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, dst, nullptr, nullptr, src, srcPitches), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, dst, nullptr, dstPitches, nullptr, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, dst, nullptr, dstPitches, src, nullptr), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, noPlanes, nullptr, dstPitches, src, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcess(handle, dst, nullptr, dstPitches, noSource, srcPitches),
              KESTREL_BAD_ARGUMENT);

    EXPECT_EQ(MPProcessEx(nullptr, dst, &origin, nullptr, dstPitches, src, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcessEx(handle, nullptr, &origin, nullptr, dstPitches, src, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcessEx(handle, dst, nullptr, nullptr, dstPitches, src, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcessEx(handle, dst, &origin, nullptr, nullptr, src, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcessEx(handle, dst, &origin, nullptr, dstPitches, nullptr, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcessEx(handle, dst, &origin, nullptr, dstPitches, src, nullptr),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcessEx(handle, noPlanes, &origin, nullptr, dstPitches, src, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPProcessEx(handle, dst, &origin, nullptr, dstPitches, noSource, srcPitches),
              KESTREL_BAD_ARGUMENT);
    EXPECT_FALSE(to_->Changed());

    MRECT a = {};
    MRECT b = {1, 1, 2, 2};
    EXPECT_EQ(MPPAlign(nullptr, &a, &b), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPPAlign(handle, nullptr, &b), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(MPPAlign(handle, &a, nullptr), KESTREL_BAD_ARGUMENT);

    // The same call with everything in place draws.
    EXPECT_EQ(MPProcess(handle, dst, nullptr, dstPitches, src, srcPitches), KESTREL_OK);
    EXPECT_TRUE(to_->Changed());
    to_->Fill(1);
  }
}

// The call is made in a child process, so that each crash is reported on its own.
void ExpectNoCrash(const char* name, const std::function<void()>& call) {
  SCOPED_TRACE(name);
  EXPECT_EXIT(
      {
        call();
        _exit(0);
      },
      testing::ExitedWithCode(0), "")
      << name;
}

TEST_F(HostileNull, FormatAndRectangleHelpers) {
  FormatDesc desc = {};
  PlaneLayout layout = {};
  uint32_t factors[6] = {};
  MRECT rect = {1, 2, 3, 4};
  const MPPFORMAT record = {FORMAT_NV21, 4, 4, nullptr};
  ASSERT_EQ(MPParseFormat(&desc, &record), KESTREL_OK);
  ExpectNoCrash("MPParseFormat without descriptor", [&] { MPParseFormat(nullptr, &record); });
  ExpectNoCrash("MPParseFormat without record", [&] { MPParseFormat(&desc, nullptr); });
  ExpectNoCrash("MPGetPlaneLayout without descriptor", [&] { MPGetPlaneLayout(nullptr, &layout); });
  ExpectNoCrash("MPGetPlaneLayout without layout", [&] { MPGetPlaneLayout(&desc, nullptr); });
  ExpectNoCrash("MPGetSubsampling without descriptor",
                [&] { MPGetSubsampling(nullptr, &layout, factors); });
  ExpectNoCrash("MPGetSubsampling without layout",
                [&] { MPGetSubsampling(&desc, nullptr, factors); });
  ExpectNoCrash("MPGetSubsampling without factors",
                [&] { MPGetSubsampling(&desc, &layout, nullptr); });
  ExpectNoCrash("RectCopy to null", [&] { RectCopy(nullptr, &rect); });
  ExpectNoCrash("RectCopy from null", [&] { RectCopy(&rect, nullptr); });
  ExpectNoCrash("MSwapRect", [] { MSwapRect(nullptr); });
  ExpectNoCrash("FlipUpDownRect without frame", [&] { FlipUpDownRect(nullptr, &rect); });
  ExpectNoCrash("FlipUpDownRect without rectangle", [&] { FlipUpDownRect(&rect, nullptr); });
  ExpectNoCrash("MFlipLeftRightRect without frame", [&] { MFlipLeftRightRect(nullptr, &rect); });
  ExpectNoCrash("MFlipLeftRightRect without rectangle",
                [&] { MFlipLeftRightRect(&rect, nullptr); });
}

TEST_F(HostileNull, BuffersAndOneShot) {
  MBITMAP bitmap = {FORMAT_NV21, 4, 4, {4, 4, 4}, {}};
  EXPECT_EQ(ConvertCS(nullptr, &bitmap), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(ConvertCS(&bitmap, nullptr), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(ConvertCS(&bitmap, &bitmap), KESTREL_BAD_ARGUMENT) << "no planes";
  EXPECT_EQ(MBitmapFree(nullptr), KESTREL_BAD_ARGUMENT);
  ExpectNoCrash("MBitmapAlloc", [] {
    if (MBitmapAlloc(nullptr) == KESTREL_OK) abort();
  });
  ExpectNoCrash("dumpBitmap2 without path", [&] { dumpBitmap2(nullptr, &bitmap); });
  ExpectNoCrash("dumpBitmap2 without descriptor", [] { dumpBitmap2("/dev/null", nullptr); });
  ExpectNoCrash("dumpBitmap2 without planes", [&] { dumpBitmap2("/dev/null", &bitmap); });
  ExpectNoCrash("dumpBitmap2 into no folder",
                [&] { dumpBitmap2("/nonexistent/folder/file", &bitmap); });
}

struct Kernel {
  const char* name;
  KernelFn* run;
};

constexpr Kernel kKernels[] = {
    {"NEC_ALL", NEC_ALL},
    {"ANY_ANY_C_FAST_R8G8B8", ANY_ANY_C_FAST_R8G8B8},
    {"YUV2YUV_Fast", YUV2YUV_Fast},
    {"ANY_ANY_C_FAST_R5G6B5", ANY_ANY_C_FAST_R5G6B5},
    {"I420_To_I422_Fast", I420_To_I422_Fast},
    {"YUV_YUV_C_FAST", YUV_YUV_C_FAST},
    {"YUV_RGB32_C_FAST", YUV_RGB32_C_FAST},
    {"YUYV_RGB32_FAST", YUYV_RGB32_FAST},
    {"ANY_ANY_C_FAST_RGB32", ANY_ANY_C_FAST_RGB32},
    {"Gray2Gray_C_FAST", Gray2Gray_C_FAST},
    {"ANY_ANY_C_SLOW", ANY_ANY_C_SLOW},
    {"ANY_ANY_Bilinear_No_Table", ANY_ANY_Bilinear_No_Table},
};

TEST_F(HostileNull, KernelsAndTheChain) {
  const MRECT rect = {0, 0, 8, 8};
  for (const Kernel& kernel : kKernels) {
    for (int missing = 0; missing < 7; ++missing) {
      const std::string name = std::string(kernel.name) + " without argument " +
                               (missing == 6 ? "1 to 6" : std::to_string(missing + 1));
      const auto given = [missing](int argument) { return missing != argument && missing != 6; };
      ExpectNoCrash(name.c_str(), [&] {
        kernel.run(given(0) ? &rect : nullptr, given(1) ? to_->pitches() : nullptr,
                   given(2) ? from_->pitches() : nullptr, given(3) ? to_->planes() : nullptr,
                   given(4) ? from_->constPlanes() : nullptr,
                   given(5) ? handles_[0]->pass[0]->context : nullptr);
        if (to_->Changed()) abort();
      });
    }
  }
}

// ---- Buffers ----

TEST_F(Hostile, BufferLengthsAndAllocation) {
  constexpr int32_t kSizes[] = {INT_MIN, -1,      0,           1,       7,      16,
                                4000,    kBeyond, INT_MAX - 1, INT_MAX, 1 << 16};
  constexpr int32_t kPitches[] = {INT_MIN, -64, -1, 0, 0, 0, 1, 16, 8192, INT_MAX};
  ForEachCase(20000, [&](uint64_t number) {
    Random random(number);
    MBITMAP bitmap = {AnyCode(&random),
                      random.Pick(kSizes),
                      random.Pick(kSizes),
                      {random.Pick(kPitches), random.Pick(kPitches), random.Pick(kPitches)},
                      {}};
    const uint32_t length = getBufferLength(bitmap.format, bitmap.width, bitmap.height);
    EXPECT_LE(length, static_cast<uint32_t>(INT32_MAX));
    const bool empty = bitmap.width < 1 || bitmap.height < 1;
    if (empty) {
      EXPECT_EQ(length, 0u);
    }
    if (ExpectedParse(bitmap.format) != KESTREL_OK) {
      EXPECT_EQ(length, 0u) << bitmap.format;
    }

    const MBITMAP before = bitmap;
    const uint32_t code = MBitmapAlloc(&bitmap);
    if (code == KESTREL_OK) {
      EXPECT_FALSE(empty);
      EXPECT_EQ(ExpectedParse(bitmap.format), KESTREL_OK);
      EXPECT_EQ(MBitmapFree(&bitmap), KESTREL_OK);
    } else {
      EXPECT_TRUE(code == KESTREL_UNSUPPORTED || code == KESTREL_OUT_OF_MEMORY) << code;
      if (empty) {
        EXPECT_EQ(code, KESTREL_UNSUPPORTED);
      }
      EXPECT_EQ(memcmp(&bitmap, &before, sizeof bitmap), 0);
    }
  });
}

TEST_F(Hostile, AllocatedPlanesHoldTheImage) {
  // A block that was handed out is large enough for a conversion into it, whatever the pitches.
  constexpr int32_t kPitches[] = {0, 0, 0, 256, 300};
  uint64_t converted = 0;
  uint64_t run = 0;
  ForEachCase(5000, [&](uint64_t number) {
    ++run;
    Random random(number);
    const uint32_t code = AnyCode(&random);
    const int32_t pitch = random.Pick(kPitches);
    MBITMAP bitmap = {
        code, random.Between(1, 60), random.Between(1, 60), {pitch, pitch, pitch}, {}};
    if (MBitmapAlloc(&bitmap) != KESTREL_OK) return;
    ImageShape grey;
    ASSERT_TRUE(ShapeOf(FORMAT_GRAY8, &grey));
    TestImage source(grey, 13, 11, nullptr, true);
    const MBITMAP src = {FORMAT_GRAY8, 13, 11, {13, 0, 0}, {source.planes()[0], nullptr, nullptr}};
    EXPECT_EQ(ConvertCS(&src, &bitmap), KESTREL_OK);
    EXPECT_EQ(ConvertCS(&bitmap, &src), KESTREL_OK);
    EXPECT_EQ(MBitmapFree(&bitmap), KESTREL_OK);  // notices bytes written beside the block
    ++converted;
  });
  if (run > 1000) {
    EXPECT_GT(converted, run / 10);
  }
}

TEST_F(Hostile, OneShotWithSillyDescriptors) {
  uint8_t bytes[64] = {};
  const MBITMAP good = {FORMAT_GRAY8, 4, 4, {4, 0, 0}, {bytes, nullptr, nullptr}};
  for (const int32_t size : {INT_MIN, -4, 0}) {
    MBITMAP bad = good;
    bad.width = size;
    EXPECT_EQ(ConvertCS(&good, &bad), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(ConvertCS(&bad, &good), KESTREL_BAD_ARGUMENT);
    bad = good;
    bad.height = size;
    EXPECT_EQ(ConvertCS(&good, &bad), KESTREL_BAD_ARGUMENT);
    EXPECT_EQ(ConvertCS(&bad, &good), KESTREL_BAD_ARGUMENT);
  }
  MBITMAP bad = good;
  bad.format = 0x60000000;
  EXPECT_EQ(ConvertCS(&good, &bad), KESTREL_UNSUPPORTED);
  EXPECT_EQ(ConvertCS(&bad, &good), KESTREL_UNSUPPORTED);
  bad = good;
  bad.plane[0] = nullptr;
  EXPECT_EQ(ConvertCS(&good, &bad), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(ConvertCS(&bad, &good), KESTREL_BAD_ARGUMENT);
  for (const int32_t pitch : {INT_MIN, INT_MAX, -INT_MAX}) {
    uint8_t target[64] = {};
    MBITMAP far = good;
    far.pitch[0] = pitch;
    far.plane[0] = target;
    ConvertCS(&far, &good);
    bytes[0] = 9;
    ConvertCS(&good, &far);
    for (const uint8_t byte : target) EXPECT_EQ(byte, 0);
  }
}

TEST_F(Hostile, DumpsOfSillyDescriptors) {
  const std::string path = testing::TempDir() + "kestrel_hostile_dump";
  ForEachCase(300, [&](uint64_t number) {
    Random random(number);
    constexpr int32_t kEmpty[] = {INT_MIN, -7, -1, 0};
    uint8_t bytes[256] = {};
    MBITMAP bitmap = {AnyCode(&random), 4, 4, {16, 16, 16}, {bytes, bytes, bytes}};
    (random.OneIn(2) ? bitmap.width : bitmap.height) = random.Pick(kEmpty);
    dumpBitmap2(path.c_str(), &bitmap);
    FILE* file = fopen(path.c_str(), "rb");
    ASSERT_NE(file, nullptr);
    fseek(file, 0, SEEK_END);
    EXPECT_EQ(ftell(file), 0);
    fclose(file);
  });
  remove(path.c_str());
}

}  // namespace
}  // namespace robustness
