// What must hold between runs of engines, whatever the bytes are: tiling, regions, order, reuse and
// threads change nothing, transforms only move pixels.
//
// Four stated behaviours break such equalities and are kept out of the cases that would meet them:
//   - dithering carries its remainder from pixel to pixel and starts afresh in each dispatched
//   piece;
//   - a mirrored walk of an odd size meets the blocks of a subsampled destination out of phase, so
//     another pixel gives a block its chroma, and packed 4:2:2 with exchanged lumas pairs by the
//     walk's coordinate;
//   - a chroma sample is the last written pixel of its block, so a cut through a block shows;
//   - some kernels give bytes of their own (docs/kernels.md), and which kernel runs depends on the
//   block mode.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <iterator>
#include <string>
#include <thread>
#include <vector>

#include "engine/postprocess.h"
#include "tests/robustness/case_log.h"
#include "tests/robustness/test_image.h"

namespace robustness {
namespace {

// Destination layouts whose blocks divide the tiling grids (2 x 2 and 16 x 8): every listed one.
// Left out: indexed destinations, which are not drawn, and one whose chroma overwrites lumas.
constexpr bool HasWholeBlocks(uint32_t code) {
  return !testing_support::IsIndexedCode(code) && code != FORMAT_YUV_SPECIAL8;
}

constexpr auto kDestinations = [] {
  constexpr auto kListed = testing_support::PublicCodes<HasWholeBlocks>();
  constexpr uint32_t kOthers[] = {FORMAT_I420 | FORMAT_BT601_FULL, FORMAT_GRAY8 | FORMAT_BT601_FULL,
                                  FORMAT_NV21 | FORMAT_BT709_FULL};
  std::array<uint32_t, kListed.size() + std::size(kOthers)> codes{};
  size_t at = 0;
  for (const uint32_t code : kListed) {
    codes[at++] = code;
  }
  for (const uint32_t code : kOthers) {
    codes[at++] = code;
  }
  return codes;
}();

ImageShape Shape(uint32_t code) {
  ImageShape shape;
  EXPECT_TRUE(ShapeOf(code, &shape)) << code;
  return shape;
}

bool IsSubsampled(const ImageShape& shape) {
  return shape.plane[0].width > 1 ||
         (shape.planes > 1 && (shape.plane[1].width > 1 || shape.plane[1].height > 1));
}

// Every destination here may be cut at even coordinates without cutting a block.
Span Aligned(const Span& span) {
  const auto even = [](int64_t value) { return value & ~int64_t{1}; };
  return {even(span.left), even(span.top), even(span.right), even(span.bottom)};
}

bool IsPlanar(uint32_t code) {
  const uint32_t layout = code & ~FORMAT_STANDARD_MASK;
  return layout == FORMAT_I420 || layout == FORMAT_I422 || layout == FORMAT_I440 ||
         layout == FORMAT_I444;
}

// Pairs that have kernels with bytes of their own.
bool MeetsOwnBytes(uint32_t dst, uint32_t src, bool adjusts) {
  const bool grey = src >> 28 == 6;
  if ((dst & ~FORMAT_STANDARD_MASK) == FORMAT_YUYV) {
    return grey || IsPlanar(src) || src >> 24 == 0x16;
  }
  if (dst >> 28 == 6) return grey || IsPlanar(src);
  const bool changesRange = ((dst ^ src) & FORMAT_BT601_FULL) != 0;
  return IsPlanar(dst) && IsPlanar(src) && (adjusts || changesRange);
}

class Engine {
 public:
  Engine(uint32_t dstCode, int32_t dstWidth, int32_t dstHeight, uint32_t srcCode, int32_t srcWidth,
         int32_t srcHeight, MPPPARAM params) {
    static const std::vector<uint8_t> palette = [] {
      std::vector<uint8_t> bytes(256 * 4);
      Random random(77);
      for (uint8_t& byte : bytes) byte = static_cast<uint8_t>(random.Bits());
      return bytes;
    }();
    MPPFORMAT dst = {dstCode, dstWidth, dstHeight, nullptr};
    MPPFORMAT src = {srcCode, srcWidth, srcHeight, palette.data()};
    EXPECT_EQ(MPPCreate(&dst, &src, &params, &handle_), KESTREL_OK);
  }
  ~Engine() { MPPDestroy(handle_); }
  Engine(const Engine&) = delete;
  Engine& operator=(const Engine&) = delete;

  void Run(TestImage* to, TestImage* from, const MRECT* rect = nullptr) const {
    ASSERT_EQ(
        MPProcess(handle_, to->planes(), rect, to->pitches(), from->constPlanes(), from->pitches()),
        KESTREL_OK);
  }

 private:
  MPPHandle* handle_ = nullptr;
};

// One random job: formats, sizes, places in the images, parameters.
struct EngineJob {
  uint32_t dstCode = 0;
  uint32_t srcCode = 0;
  int32_t dstWidth = 0;
  int32_t dstHeight = 0;
  int32_t srcWidth = 0;
  int32_t srcHeight = 0;
  MPPPARAM params = {};

  explicit EngineJob(Random* random) {
    dstCode = random->Pick(kDestinations);
    srcCode = random->Pick(kListedCodes);
    dstWidth = random->Between(1, 80);
    dstHeight = random->Between(1, 80);
    srcWidth = random->OneIn(3) ? dstWidth : random->Between(1, 80);
    srcHeight = random->OneIn(3) ? dstHeight : random->Between(1, 80);
    params.resampleFlags = random->OneIn(2) ? MPP_BILINEAR : MPP_NEAREST;
    params.transformCode = static_cast<uint32_t>(random->Between(0, 7));
    params.bandSelector = static_cast<uint32_t>(random->Between(0, 5));
    params.passMode = static_cast<uint32_t>(random->Between(1, 4));
    if (random->OneIn(3)) {
      params.brightness = random->Between(-128, 128);
      params.contrast = random->Between(-128, 128);
      params.saturation = random->Between(-128, 128);
    }
    const bool adjusts = params.brightness != 0 || params.contrast != 0 || params.saturation != 0;
    while (MeetsOwnBytes(dstCode, srcCode, adjusts)) srcCode = random->Pick(kListedCodes);
    params.srcOriginX = random->OneIn(2) ? random->Between(0, 9) : 0;
    params.srcOriginY = random->OneIn(2) ? random->Between(0, 9) : 0;
    params.dstOriginX = random->OneIn(2) ? random->Between(0, 9) : 0;
    params.dstOriginY = random->OneIn(2) ? random->Between(0, 9) : 0;
    params.alpha = random->Bits() % 300;
    if (IsSubsampled(Shape(dstCode))) {
      params.dstOriginX &= ~1;
      params.dstOriginY &= ~1;
      if (params.transformCode != 0) {
        dstWidth += dstWidth & 1;
        dstHeight += dstHeight & 1;
      }
    }
  }

  Span Region() const {
    return {params.dstOriginX, params.dstOriginY, params.dstOriginX + dstWidth,
            params.dstOriginY + dstHeight};
  }
  Engine MakeEngine() const {
    return Engine(dstCode, dstWidth, dstHeight, srcCode, srcWidth, srcHeight, params);
  }
  TestImage MakeDestination(Random* random) const {
    const ImageShape shape = Shape(dstCode);
    int32_t pitches[3];
    const int64_t width = params.dstOriginX + dstWidth + random->Between(0, 3);
    for (int i = 0; i < shape.planes; ++i) {
      const int32_t row = static_cast<int32_t>(TestImage::RowBytes(shape, i, width));
      pitches[i] = random->OneIn(2) ? (row + 3) / 4 * 4 : row + random->Between(0, 5);
      if (random->OneIn(6)) pitches[i] = -pitches[i];
    }
    TestImage image(shape, width, params.dstOriginY + dstHeight + random->Between(0, 3), pitches,
                    true);
    image.FillConstant(0x5A);
    return image;
  }
  TestImage MakeSource(uint64_t seed) const {
    TestImage image(Shape(srcCode), params.srcOriginX + srcWidth, params.srcOriginY + srcHeight,
                    nullptr, true);
    image.Fill(seed);
    return image;
  }
  std::string Describe() const {
    char text[200];
    snprintf(text, sizeof text, "%08x %dx%d from %08x %dx%d, transform %u, mode %u, bilinear %u",
             dstCode, dstWidth, dstHeight, srcCode, srcWidth, srcHeight, params.transformCode,
             params.passMode, params.resampleFlags);
    return text;
  }
};

MRECT ToRect(const Span& span) {
  return {static_cast<int32_t>(span.left), static_cast<int32_t>(span.top),
          static_cast<int32_t>(span.right), static_cast<int32_t>(span.bottom)};
}

// A rectangle inside the region whose edges cut no block: at even coordinates (a region's own edges
// may be odd, nothing lies beyond them).
Span Part(Random* random, const EngineJob& job) {
  const Span region = job.Region();
  const auto between = [random](int64_t low, int64_t high) {
    return random->Between(static_cast<int32_t>(low), static_cast<int32_t>(high));
  };
  Span part;
  part.left = between(region.left, region.right - 1);
  part.top = between(region.top, region.bottom - 1);
  part.right = between(part.left + 1, region.right);
  part.bottom = between(part.top + 1, region.bottom);
  if (!IsSubsampled(Shape(job.dstCode))) return part;
  Span aligned = Aligned(part);
  aligned.right = std::min(std::max(aligned.right, aligned.left + 2), region.right);
  aligned.bottom = std::min(std::max(aligned.bottom, aligned.top + 2), region.bottom);
  if (part.right == region.right) aligned.right = region.right;
  if (part.bottom == region.bottom) aligned.bottom = region.bottom;
  return aligned;
}

TEST(EngineProperties, TiledEqualsUntiled) {
  ForEachCase(6000, [](uint64_t number) {
    Random random(number);
    EngineJob job(&random);
    DescribeCase(job.Describe());
    TestImage source = job.MakeSource(number);
    Random sameImage(number);
    TestImage plain = job.MakeDestination(&sameImage);
    job.MakeEngine().Run(&plain, &source);
    if (job.dstWidth * job.dstHeight > 16) {
      ASSERT_TRUE(plain.Changed());
    }

    job.params.passMode = MPP_PASS_TILED;
    sameImage = Random(number);
    TestImage tiled = job.MakeDestination(&sameImage);
    job.MakeEngine().Run(&tiled, &source);
    ASSERT_EQ(tiled.Bytes(), plain.Bytes());
  });
}

TEST(EngineProperties, BlockModesAreOnlyHints) {
  ForEachCase(2000, [](uint64_t number) {
    Random random(number);
    EngineJob job(&random);
    DescribeCase(job.Describe());
    TestImage source = job.MakeSource(number);
    std::vector<uint8_t> first;
    for (const uint32_t mode : {1u, 2u, 3u, 4u}) {
      job.params.passMode = mode;
      Random sameImage(number);
      TestImage image = job.MakeDestination(&sameImage);
      job.MakeEngine().Run(&image, &source);
      if (mode == 1) first = image.Bytes();
      ASSERT_EQ(image.Bytes(), first) << mode;
    }
  });
}

TEST(EngineProperties, APartEqualsTheSamePartOfTheWhole) {
  ForEachCase(6000, [](uint64_t number) {
    Random random(number);
    EngineJob job(&random);
    if (random.OneIn(2)) job.params.passMode = MPP_PASS_TILED;
    DescribeCase(job.Describe());
    TestImage source = job.MakeSource(number);
    const Engine engine(job.dstCode, job.dstWidth, job.dstHeight, job.srcCode, job.srcWidth,
                        job.srcHeight, job.params);
    TestImage whole = job.MakeDestination(&random);
    engine.Run(&whole, &source);
    const Span part = Part(&random, job);
    const MRECT rect = ToRect(part);
    TestImage cut = job.MakeDestination(&random);
    engine.Run(&cut, &source, &rect);
    ASSERT_EQ(cut.Bytes(part), whole.Bytes(part))
        << rect.left << " " << rect.top << " " << rect.right << " " << rect.bottom;
    ASSERT_EQ(cut.ChangeOutside(part, 0), "");
  });
}

TEST(EngineProperties, PartsInAnyOrderMakeTheWhole) {
  ForEachCase(2000, [](uint64_t number) {
    Random random(number);
    EngineJob job(&random);
    if (random.OneIn(2)) job.params.passMode = MPP_PASS_TILED;
    DescribeCase(job.Describe());
    TestImage source = job.MakeSource(number);
    const Engine engine(job.dstCode, job.dstWidth, job.dstHeight, job.srcCode, job.srcWidth,
                        job.srcHeight, job.params);
    Random sameImage(number);
    TestImage whole = job.MakeDestination(&sameImage);
    engine.Run(&whole, &source);

    // Quarters around an inner point of the region, in random order.
    const Span region = job.Region();
    const Span part = Part(&random, job);
    std::vector<MRECT> quarters;
    for (const Span& quarter : {Span{region.left, region.top, part.left, part.top},
                                Span{part.left, region.top, region.right, part.top},
                                Span{region.left, part.top, part.left, region.bottom},
                                Span{part.left, part.top, region.right, region.bottom}}) {
      quarters.push_back(ToRect(quarter));
    }
    for (size_t i = quarters.size(); i > 1; --i) {
      std::swap(quarters[i - 1],
                quarters[static_cast<size_t>(random.Between(0, static_cast<int32_t>(i) - 1))]);
    }
    sameImage = Random(number);
    TestImage assembled = job.MakeDestination(&sameImage);
    for (const MRECT& rect : quarters) engine.Run(&assembled, &source, &rect);
    ASSERT_EQ(assembled.Bytes(), whole.Bytes());
  });
}

TEST(EngineProperties, NoRectangleIsTheWholeRegion) {
  ForEachCase(3000, [](uint64_t number) {
    Random random(number);
    EngineJob job(&random);
    // Here dithering and odd sizes are welcome: both calls make the same pieces.
    job.params.dither = random.Bits() & 1;
    job.dstWidth -= random.Between(0, 1) & (job.dstWidth > 1);
    job.dstHeight -= random.Between(0, 1) & (job.dstHeight > 1);
    if (random.OneIn(2)) job.params.passMode = MPP_PASS_TILED;
    DescribeCase(job.Describe());
    TestImage source = job.MakeSource(number);
    const Engine engine(job.dstCode, job.dstWidth, job.dstHeight, job.srcCode, job.srcWidth,
                        job.srcHeight, job.params);
    Random sameImage(number);
    TestImage implied = job.MakeDestination(&sameImage);
    engine.Run(&implied, &source);
    sameImage = Random(number);
    TestImage stated = job.MakeDestination(&sameImage);
    const MRECT rect = ToRect(job.Region());
    engine.Run(&stated, &source, &rect);
    ASSERT_EQ(stated.Bytes(), implied.Bytes());
  });
}

TEST(EngineProperties, AHandleGivesTheSameBytesEveryTime) {
  ForEachCase(300, [](uint64_t number) {
    Random random(number);
    EngineJob job(&random);
    job.params.dither = 1;  // the carry must not survive a run
    if (random.OneIn(2)) job.params.passMode = MPP_PASS_TILED;
    DescribeCase(job.Describe());
    TestImage source = job.MakeSource(number);
    TestImage other = job.MakeSource(~number);
    const Engine engine(job.dstCode, job.dstWidth, job.dstHeight, job.srcCode, job.srcWidth,
                        job.srcHeight, job.params);
    Random sameImage(number);
    TestImage image = job.MakeDestination(&sameImage);
    engine.Run(&image, &source);
    const std::vector<uint8_t> first = image.Bytes();
    for (int repeat = 0; repeat < 10; ++repeat) {
      TestImage elsewhere = job.MakeDestination(&random);
      engine.Run(&elsewhere, &other);  // another binding, other pitches and bytes in between
      sameImage = Random(number);
      TestImage again = job.MakeDestination(&sameImage);
      engine.Run(&again, &source);
      ASSERT_EQ(again.Bytes(), first);
    }
  });
}

TEST(EngineProperties, ThreadsWithTheirOwnHandlesShareASource) {
  ForEachCase(60, [](uint64_t number) {
    Random random(number);
    EngineJob job(&random);
    job.dstWidth += 100;
    job.dstHeight += 100;
    if (random.OneIn(2)) job.params.passMode = MPP_PASS_TILED;
    DescribeCase(job.Describe());
    TestImage source = job.MakeSource(number);
    Random sameImage(number);
    TestImage alone = job.MakeDestination(&sameImage);
    job.MakeEngine().Run(&alone, &source);
    const std::vector<uint8_t> expected = alone.Bytes();

    std::vector<uint8_t> results[2];
    std::vector<std::thread> threads;
    for (std::vector<uint8_t>& result : results) {
      threads.emplace_back([&job, &source, &result, number] {
        Random own(number);
        TestImage image = job.MakeDestination(&own);
        for (int repeat = 0; repeat < 5; ++repeat) job.MakeEngine().Run(&image, &source);
        result = image.Bytes();
      });
    }
    for (std::thread& thread : threads) thread.join();
    for (const std::vector<uint8_t>& result : results) ASSERT_EQ(result, expected);
  });
}

// ---- Transforms ----

MPPPARAM Transform(uint32_t code, uint32_t passMode) {
  MPPPARAM params = {};
  params.transformCode = code;
  params.passMode = passMode;
  return params;
}

// Where the pixel (x, y) of a transformed image of width x height comes from.
void SourceOf(uint32_t transform, int64_t width, int64_t height, int64_t x, int64_t y,
              int64_t* column, int64_t* row) {
  const int64_t u = (transform & MPP_MIRROR_X) != 0 ? width - 1 - x : x;
  const int64_t v = (transform & MPP_MIRROR_Y) != 0 ? height - 1 - y : y;
  *column = (transform & MPP_SWAP_XY) != 0 ? v : u;
  *row = (transform & MPP_SWAP_XY) != 0 ? u : v;
}

TEST(EngineProperties, TransformsMovePixels) {
  for (const uint32_t code : {FORMAT_XBGR8888, FORMAT_BGR888, FORMAT_GRAY8}) {
    const int64_t pixel = TestImage::RowBytes(Shape(code), 0, 1);
    for (uint32_t transform = 0; transform < 8; ++transform) {
      for (const uint32_t passMode : {1u, 2u, 3u, MPP_PASS_TILED}) {
        for (const uint32_t resample : {MPP_NEAREST, MPP_BILINEAR}) {
          ForEachCase(12, [&](uint64_t number) {
            Random random(number);
            const int32_t width = random.Between(1, 75);
            const int32_t height = random.Between(1, 75);
            const bool swaps = (transform & MPP_SWAP_XY) != 0;
            const int32_t srcWidth = swaps ? height : width;
            const int32_t srcHeight = swaps ? width : height;
            MPPPARAM params = Transform(transform, passMode);
            params.resampleFlags = resample;
            params.srcOriginX = random.Between(0, 5);
            params.srcOriginY = random.Between(0, 5);
            params.dstOriginX = random.Between(0, 5);
            params.dstOriginY = random.Between(0, 5);
            TestImage from(Shape(code), params.srcOriginX + srcWidth, params.srcOriginY + srcHeight,
                           nullptr, true);
            from.Fill(number);
            TestImage to(Shape(code), params.dstOriginX + width, params.dstOriginY + height,
                         nullptr, true);
            to.FillConstant(0x5A);
            Engine(code, width, height, code, srcWidth, srcHeight, params).Run(&to, &from);

            const std::vector<uint8_t> source = from.Bytes();
            std::vector<uint8_t> expected(to.Bytes().size(), 0x5A);
            for (int64_t y = 0; y < height; ++y) {
              for (int64_t x = 0; x < width; ++x) {
                int64_t column;
                int64_t row;
                SourceOf(transform, width, height, x, y, &column, &row);
                const int64_t from_at =
                    ((params.srcOriginY + row) * from.width() + params.srcOriginX + column) * pixel;
                const int64_t to_at =
                    ((params.dstOriginY + y) * to.width() + params.dstOriginX + x) * pixel;
                std::copy_n(&source[static_cast<size_t>(from_at)], pixel,
                            &expected[static_cast<size_t>(to_at)]);
              }
            }
            ASSERT_EQ(to.Bytes(), expected)
                << std::hex << code << " transform " << transform << " pass mode " << passMode
                << std::dec << " size " << width << " x " << height;
          });
        }
      }
    }
  }
}

TEST(EngineProperties, ATransformAndItsInverseGiveTheOriginal) {
  constexpr uint32_t kInverse[8] = {0, 1, 2, 5, 4, 3, 6, 7};
  for (const uint32_t code : kDestinations) {
    const ImageShape shape = Shape(code);
    const bool subsampled = IsSubsampled(shape);
    // Turning 4:2:2 or 4:4:0 loses chroma: its blocks are not square.
    const bool square = shape.planes == 1 ? shape.plane[0].width == 1
                                          : shape.plane[1].width == shape.plane[1].height;
    for (uint32_t transform = 0; transform < 8; ++transform) {
      const bool swaps = (transform & MPP_SWAP_XY) != 0;
      if (swaps && !square) continue;
      for (const uint32_t passMode : {1u, MPP_PASS_TILED}) {
        ForEachCase(4, [&](uint64_t number) {
          Random random(number);
          // Even sizes where a block has several pixels: mirrored odd sizes lose chroma of an edge.
          const int32_t width = random.Between(1, 40) * (subsampled ? 2 : 1);
          const int32_t height = random.Between(1, 40) * (subsampled ? 2 : 1);
          const int32_t turnedWidth = swaps ? height : width;
          const int32_t turnedHeight = swaps ? width : height;
          const auto image = [&shape](int32_t w, int32_t h) {
            TestImage made(shape, w, h, nullptr, true);
            made.FillConstant(0);
            return made;
          };
          TestImage random_bytes = image(width, height);
          random_bytes.Fill(number);
          // Spare bits of a pixel are not carried along; the first copy clears them.
          TestImage original = image(width, height);
          Engine(code, width, height, code, width, height, Transform(0, passMode))
              .Run(&original, &random_bytes);
          TestImage turned = image(turnedWidth, turnedHeight);
          Engine(code, turnedWidth, turnedHeight, code, width, height,
                 Transform(transform, passMode))
              .Run(&turned, &original);
          TestImage back = image(width, height);
          Engine(code, width, height, code, turnedWidth, turnedHeight,
                 Transform(kInverse[transform], passMode))
              .Run(&back, &turned);
          ASSERT_TRUE(original.Changed());
          ASSERT_EQ(back.Bytes(), original.Bytes())
              << std::hex << code << " transform " << transform << " pass mode " << passMode;
        });
      }
    }
  }
}

}  // namespace
}  // namespace robustness
