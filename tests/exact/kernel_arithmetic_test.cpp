// The arithmetic that some kernels have of their own: carried remainders and factors of 1/64.
#include <algorithm>

#include "exact_support.h"
#include "kernels/kernels.h"

namespace kestrel::test {
namespace {

constexpr uint32_t kFull = FORMAT_BT601_FULL;

// Calls a kernel or a dispatcher for the whole of an upright engine.
uint32_t Call(KernelFn* kernel, const Engine& engine, const Planes& dst, const Planes& src,
              const MRECT* rect = nullptr) {
  const MRECT& region = engine.context().dstRegion;
  return kernel(rect ? rect : &region, dst.pitch, src.pitch, dst.plane, src.plane,
                &engine.context());
}

// One field of each 16-bit pixel, in order of memory.
Bytes Fields(const Bytes& pixels, int position, int size) {
  Bytes fields(pixels.size() / 2);
  for (size_t i = 0; i < fields.size(); ++i) {
    const int word = pixels[2 * i] | pixels[2 * i + 1] << 8;
    fields[i] = uint8_t(word >> position & ((1 << size) - 1));
  }
  return fields;
}

Bytes LowFields(const Bytes& pixels) {
  return Fields(pixels, 0, 5);
}
Bytes MiddleFields(const Bytes& pixels) {
  return Fields(pixels, 5, 6);
}
Bytes HighFields(const Bytes& pixels) {
  return Fields(pixels, 11, 5);
}

// 0, 1, 0, 1, ...
Bytes Alternating(size_t count) {
  Bytes bytes(count);
  for (size_t i = 0; i < count; ++i) {
    bytes[i] = i % 2;
  }
  return bytes;
}

void ExpectCarriedFours(const Bytes& pixels) {
  EXPECT_EQ(LowFields(pixels), Alternating(pixels.size() / 2));
  EXPECT_EQ(MiddleFields(pixels), Bytes(pixels.size() / 2, 1));
  EXPECT_EQ(HighFields(pixels), Alternating(pixels.size() / 2));
}

// ---- carried remainders ----

// Rows of five pixels: a carry that began afresh would show 0, 0 at each row's start.
TEST(CarriedRemainders, RunAcrossTheEndsOfRows) {
  Bytes src(45, 4), dst(30);
  const Engine engine({FORMAT_RGB565, 5, 3}, {FORMAT_RGB888, 5, 3}, Param().Dither());
  KernelFn* const entries[] = {RGB888Fast_NORESAMPLE_R5G6B5_Dither, ANY_ANY_C_FAST_R5G6B5};
  for (auto* const entry : entries) {
    std::fill(dst.begin(), dst.end(), uint8_t{0});
    ASSERT_EQ(Call(entry, engine, OnePlane(dst, 10), OnePlane(src, 15)), KESTREL_OK);
    ExpectCarriedFours(dst);
  }
}

TEST(CarriedRemainders, StartAfreshWithEachCall) {
  Bytes src(45, 4), dst(30);
  const Engine engine({FORMAT_RGB565, 5, 3}, {FORMAT_RGB888, 5, 3}, Param().Dither());
  for (int32_t row = 0; row < 3; ++row) {
    const MRECT rect = {0, row, 5, row + 1};
    Planes start = OnePlane(dst, 10);
    start.plane[0] += 10 * row;
    ASSERT_EQ(Call(RGB888Fast_NORESAMPLE_R5G6B5_Dither, engine, start, OnePlane(src, 15), &rect),
              KESTREL_OK);
  }
  EXPECT_EQ(LowFields(dst), (Bytes{0, 1, 0, 1, 0, 0, 1, 0, 1, 0, 0, 1, 0, 1, 0}));
  EXPECT_EQ(MiddleFields(dst), Bytes(15, 1));
}

TEST(CarriedRemainders, AreNotCarriedWithoutDither) {
  Bytes src(45, 4), dst(30);
  const Engine engine({FORMAT_RGB565, 5, 3}, {FORMAT_RGB888, 5, 3});
  ASSERT_EQ(Call(ANY_ANY_C_FAST_R5G6B5, engine, OnePlane(dst, 10), OnePlane(src, 15)), KESTREL_OK);
  EXPECT_EQ(LowFields(dst), Bytes(15, 0));
  EXPECT_EQ(MiddleFields(dst), Bytes(15, 1));
}

// Bytes of blue, green and red. Blue sums to 258, 257 and 9: two fields of 31, which pass on 2 and
// 1. Green sums to 256, 255 and 10; red to 258, 257 and 7.
TEST(CarriedRemainders, ComeFromTheUnclampedSum) {
  Bytes src = {255, 255, 255, 255, 255, 255, 8, 7, 6}, dst(6);
  const Engine engine({FORMAT_RGB565, 3, 1}, {FORMAT_RGB888, 3, 1}, Param().Dither());
  ASSERT_EQ(Call(RGB888Fast_NORESAMPLE_R5G6B5_Dither, engine, OnePlane(dst, 6), OnePlane(src, 9)),
            KESTREL_OK);
  EXPECT_EQ(LowFields(dst), (Bytes{31, 31, 1}));
  EXPECT_EQ(MiddleFields(dst), (Bytes{63, 63, 2}));
  EXPECT_EQ(HighFields(dst), (Bytes{31, 31, 0}));
}

// Greys of full range are the same level in every channel.
TEST(CarriedRemainders, OfYuvKernels) {
  Bytes luma(15, 4), chroma(12, 128), u(6, 128), v(6, 128), dst(30);
  const Engine planar({FORMAT_RGB565, 5, 3}, {FORMAT_I420 | kFull, 5, 3}, Param().Dither().Pass(3));
  ASSERT_EQ(Call(YUV2RGBFast_NORESAMPLE_R5G6B5_4x4_Dither, planar, OnePlane(dst, 10),
                 ThreePlanes(luma, 5, u, v, 3)),
            KESTREL_OK);
  ExpectCarriedFours(dst);

  std::fill(dst.begin(), dst.end(), uint8_t{0});
  const Engine pairs({FORMAT_RGB565, 5, 3}, {FORMAT_NV21 | kFull, 5, 3}, Param().Dither().Pass(2));
  ASSERT_EQ(Call(NV21_To_RGB565_NoResample_2x2_Dither, pairs, OnePlane(dst, 10),
                 VFirst(luma, 5, chroma, 6)),
            KESTREL_OK);
  ExpectCarriedFours(dst);

  const Engine plain({FORMAT_RGB565, 5, 3}, {FORMAT_NV21 | kFull, 5, 3}, Param().Pass(2));
  ASSERT_EQ(Call(NV21_To_RGB565_NoResample_2x2_Dither, plain, OnePlane(dst, 10),
                 VFirst(luma, 5, chroma, 6)),
            KESTREL_OK);
  EXPECT_EQ(LowFields(dst), Bytes(15, 0)) << "the engine does not ask for dithering";
}

// Turned by 270 degrees the carry follows the source's rows, which are columns of the result from
// its last row upwards.
TEST(CarriedRemainders, FollowTheLoopOfATurnedJob) {
  Bytes luma(15, 4), chroma(12, 128), dst(30);
  const Engine engine({FORMAT_RGB565, 3, 5}, {FORMAT_NV21 | kFull, 5, 3},
                      Param().Dither().Pass(2).Transform(5));
  ASSERT_EQ(Process(engine, OnePlane(dst, 6), VFirst(luma, 5, chroma, 6)), KESTREL_OK);
  Bytes inLoopOrder;
  const Bytes fields = LowFields(dst);
  for (size_t column = 0; column < 3; ++column) {
    for (size_t row = 5; row-- > 0;) {
      inLoopOrder.push_back(fields[3 * row + column]);
    }
  }
  EXPECT_EQ(inLoopOrder, Alternating(15));
  EXPECT_EQ(MiddleFields(dst), Bytes(15, 1));
}

// Red of 433 twice, then 6. Clamped to 255 it passes on 2, 1 and 7; unclamped 4, 5 and one level.
TEST(CarriedRemainders, OfSaturatedPixels) {
  Bytes luma = {255, 255, 6, 6}, u(2, 128), v = {255, 128}, dst(8);
  const Engine engine({FORMAT_RGB565, 4, 1}, {FORMAT_I420 | kFull, 4, 1}, Param().Dither().Pass(3));
  const Planes source = ThreePlanes(luma, 4, u, v, 2);
  ASSERT_EQ(Call(YUV2RGBFast_NORESAMPLE_R5G6B5_4x4_Dither, engine, OnePlane(dst, 8), source),
            KESTREL_OK);
  EXPECT_EQ(HighFields(dst), (Bytes{31, 31, 0, 1}));
  ASSERT_EQ(Call(ANY_ANY_C_SLOW, engine, OnePlane(dst, 8), source), KESTREL_OK);
  EXPECT_EQ(HighFields(dst), (Bytes{31, 31, 1, 1}));
}

// ---- factors of 1/64 ----

TEST(SixBitMatrix, WhiteAndItsUnevenOffsets) {
  for (const Param& params :
       {Param().Alpha(77).Pass(3), Param().Alpha(77).Pass(3).Adjust(9, 9, 9)}) {
    Bytes luma(4, 255), chroma(2, 128), dst(16);
    const Planes source = VFirst(luma, 2, chroma, 2);
    const Engine rgba({FORMAT_XBGR8888, 2, 2}, {FORMAT_NV21 | kFull, 2, 2}, params);
    ASSERT_EQ(Call(NEC_NV21YCbCr601toBGR32_NoResize, rgba, OnePlane(dst, 8), source), KESTREL_OK);
    EXPECT_EQ(Bytes(dst.begin(), dst.begin() + 4), (Bytes{255, 254, 254, 77}));
    const Engine bgra({FORMAT_XRGB8888, 2, 2}, {FORMAT_NV21 | kFull, 2, 2}, params);
    ASSERT_EQ(Call(NEC_NV21YCbCr601toBGR32_NoResize, bgra, OnePlane(dst, 8), source), KESTREL_OK);
    EXPECT_EQ(Bytes(dst.end() - 4, dst.end()), (Bytes{254, 254, 255, 77}));
  }
}

// 128 becomes 128, 127, 127: fields 16, 31, 15. Never dithered.
TEST(SixBitMatrix, NarrowResultsAreTruncated) {
  Bytes luma(4, 128), chroma(2, 128), dst(8);
  const Engine engine({FORMAT_RGB565, 2, 2}, {FORMAT_NV21 | kFull, 2, 2}, Param().Pass(3).Dither());
  ASSERT_EQ(Call(NEC_NVtoRGB16_NoResize, engine, OnePlane(dst, 4), VFirst(luma, 2, chroma, 2)),
            KESTREL_OK);
  EXPECT_EQ(HighFields(dst), Bytes(4, 16));
  EXPECT_EQ(MiddleFields(dst), Bytes(4, 31));
  EXPECT_EQ(LowFields(dst), Bytes(4, 15));
}

// In lanes of 16 bits that wrap.
struct SixBitChroma {
  int16_t red, green, blue;
  SixBitChroma(int u, int v)
      : red(int16_t(11485 - 90 * v)),
        green(int16_t(8669 - 46 * v - 22 * u)),
        blue(int16_t(14516 - 113 * u)) {}
};

uint8_t SixBitChannel(int sum) {
  return uint8_t(std::clamp<int16_t>(int16_t(sum), 0, 16320) >> 6);
}

bool IsSixBitColour(const uint8_t* rgb, int y, const SixBitChroma& t) {
  return rgb[0] == SixBitChannel(64 * y - t.red) && rgb[1] == SixBitChannel(64 * y + t.green) &&
         rgb[2] == SixBitChannel(64 * y - t.blue);
}

// A plane of each y, with u along the rows and v down the columns.
TEST(SixBitMatrix, AllColoursOfI444) {
  Bytes luma(65536), u(65536), v(65536), dst(4 * 65536);
  for (size_t i = 0; i < 65536; ++i) {
    u[i] = uint8_t(i);
    v[i] = uint8_t(i >> 8);
  }
  const Engine engine({FORMAT_XBGR8888, 256, 256}, {FORMAT_I444 | kFull, 256, 256},
                      Param().Pass(3));
  for (int y = 0; y < 256; ++y) {
    std::fill(luma.begin(), luma.end(), uint8_t(y));
    ASSERT_EQ(Call(NEC_I444toBGR32_NoResize, engine, OnePlane(dst, 1024),
                   ThreePlanes(luma, 256, u, v, 256)),
              KESTREL_OK);
    for (size_t i = 0; i < 65536; ++i) {
      ASSERT_TRUE(IsSixBitColour(&dst[4 * i], y, SixBitChroma(u[i], v[i])))
          << y << ", " << int(u[i]) << ", " << int(v[i]);
    }
  }
}

// Each pair of chroma with four lumas at a time.
TEST(SixBitMatrix, AllColoursOfNv21) {
  Bytes luma(4 * 65536), chroma(2 * 65536), dst(16 * 65536);
  for (size_t i = 0; i < 65536; ++i) {
    chroma[2 * i] = uint8_t(i >> 8);  // V
    chroma[2 * i + 1] = uint8_t(i);
  }
  const Engine engine({FORMAT_XBGR8888, 512, 512}, {FORMAT_NV21 | kFull, 512, 512},
                      Param().Pass(3));
  for (int y = 0; y < 256; y += 4) {
    for (size_t i = 0; i < luma.size(); ++i) {
      luma[i] = uint8_t(size_t(y) + i % 2 + i / 512 % 2 * 2);
    }
    ASSERT_EQ(Call(NEC_NV21YCbCr601toBGR32_NoResize, engine, OnePlane(dst, 2048),
                   VFirst(luma, 512, chroma, 512)),
              KESTREL_OK);
    for (size_t i = 0; i < luma.size(); ++i) {
      const int u = int(i % 512 / 2);
      const int v = int(i / 1024);
      ASSERT_TRUE(IsSixBitColour(&dst[4 * i], luma[i], SixBitChroma(u, v)))
          << int(luma[i]) << ", " << u << ", " << v;
    }
  }
}

}  // namespace
}  // namespace kestrel::test
