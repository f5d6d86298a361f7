// The model itself against results worked out by hand, so that it can be trusted as a judge.
#include "tests/reference/reference.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

namespace reference {
namespace {

using Bytes = std::vector<uint8_t>;

// ---- Formats ------------------------------------------------------------------------------------

Format Decoded(uint32_t code) {
  Format format;
  EXPECT_EQ(DecodeFormat({code, 4, 4, nullptr}, &format), 0u);
  return format;
}

uint32_t DecodeCode(uint32_t code) {
  Format format;
  return DecodeFormat({code, 4, 4, nullptr}, &format);
}

TEST(ReferenceFormat, StandardBitsLeaveTheLayoutAlone) {
  const Format format = Decoded(0x70001002);
  EXPECT_EQ(format.code, CODE_NV21);
  EXPECT_EQ(format.standard, CS_BT601_FULL);
  EXPECT_EQ(format.step[kU], 2);
  EXPECT_EQ(format.vertical[kV], 2);
}

TEST(ReferenceFormat, UnlistedPlanarCodesTakeTheirFactorsFromTheCode) {
  EXPECT_EQ(Decoded(0x50000822).code, CODE_I_ANY);
  EXPECT_EQ(Decoded(0x50000822).horizontal[kU], 3);
  EXPECT_EQ(Decoded(0x50000a30).code, CODE_YV_ANY);
  EXPECT_EQ(Decoded(0x50000a30).horizontal[kV], 4);
  EXPECT_EQ(Decoded(0x50004811).code, CODE_I_ANY);  // only bits 12 and 13 are set aside
}

TEST(ReferenceFormat, UnknownCodesAreRefused) {
  for (uint32_t code : {0u, 0x14000343u, 0x42000000u, 0x50000020u, 0x50000910u, 0x60000000u,
                        0x65000000u, 0x70000001u, 0x70000006u, 0x80000000u}) {
    EXPECT_EQ(DecodeCode(code), 3u) << std::hex << code;
  }
}

TEST(ReferenceFormat, MaskPositions) {
  EXPECT_EQ(Decoded(FORMAT_RGB565).maskPosition[kRed], 11u);
  EXPECT_EQ(Decoded(FORMAT_BGR565).maskPosition[kRed], 0u);
  EXPECT_EQ(Decoded(FORMAT_BGR666).maskPosition[kBlue], 12u);
  EXPECT_EQ(Decoded(FORMAT_RGBX8888).maskPosition[kRed], 24u);
  EXPECT_EQ(Decoded(FORMAT_RGBX8888).SpareByte(), 0);
  EXPECT_EQ(Decoded(FORMAT_XBGR8888).SpareByte(), 3);
}

// ---- Colour -------------------------------------------------------------------------------------

Triple ToRgb(uint32_t source, uint32_t destination, Triple yuv, Adjustments adjustments = {}) {
  const YuvToRgb converter(Decoded(source), Decoded(destination), adjustments);
  YuvToRgb::Carry carry = converter.StartCarry(false);
  return converter.Convert(yuv, &carry);
}

constexpr uint32_t kFull = FORMAT_I444 | FORMAT_BT601_FULL;
constexpr uint32_t kVideo = FORMAT_I444 | FORMAT_BT601_VIDEO;

TEST(ReferenceColour, ScalingRoundsHalfAwayFromZero) {
  EXPECT_EQ(Scale(100, 0), 100);
  EXPECT_EQ(Scale(1, -64), 1);  // 0.5
  EXPECT_EQ(Scale(-1, -64), -1);
  EXPECT_EQ(Scale(65536, -128), 0);
  EXPECT_EQ(Scale(65536, 128), 3 * 65536);
  EXPECT_EQ(Scale(64, -1), 63);  // -1 halves to -1
}

TEST(ReferenceColour, GreysKeepTheirLevel) {
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB888, {128, 128, 128}), (Triple{128, 128, 128}));
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB888, {255, 128, 128}), (Triple{255, 255, 255}));
  EXPECT_EQ(ToRgb(kVideo, FORMAT_RGB888, {16, 128, 128}), (Triple{0, 0, 0}));
  EXPECT_EQ(ToRgb(kVideo, FORMAT_RGB888, {235, 128, 128}), (Triple{255, 255, 255}));
}

// R = 100 + 1.40199 * 72 = 200.9; G = 100 - 0.71414 * 72 - 0.34415 * -28 = 58.2; B = 50.4;
// rounded to the nearest level.
TEST(ReferenceColour, ColoursFollowTheCoefficients) {
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB888, {100, 100, 200}), (Triple{201, 58, 50}));
}

TEST(ReferenceColour, NarrowChannelsGetTheirOwnRange) {
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB565, {255, 128, 128}), (Triple{31, 63, 31}));
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB565, {130, 128, 128}), (Triple{16, 32, 16}));
  EXPECT_EQ(ToRgb(kFull, 0x15000343, {130, 128, 128}), (Triple{8, 16, 8}));
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB666, {130, 128, 128}), (Triple{130, 130, 130}));
}

TEST(ReferenceColour, NoContrastLeavesTheMiddleGrey) {
  for (int64_t y : {0, 77, 255}) {
    EXPECT_EQ(ToRgb(kFull, FORMAT_RGB888, {y, 3, 250}, {50, -128, 128}), (Triple{128, 128, 128}));
  }
}

// Gain 3 about 128: 0 becomes -256, 255 becomes 509, 100 becomes 44 - but green 45, since its
// rounding half is tripled with it.
TEST(ReferenceColour, StrongContrastSaturates) {
  const Adjustments strong{0, 128, 0};
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB888, {0, 128, 128}, strong), (Triple{0, 0, 0}));
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB888, {255, 128, 128}, strong), (Triple{255, 255, 255}));
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB888, {100, 128, 128}, strong), (Triple{44, 45, 44}));
  EXPECT_EQ(ToRgb(kFull, FORMAT_RGB888, {128, 0, 255}, {0, 128, 128}), (Triple{255, 0, 0}));
}

TEST(ReferenceColour, GreySourcesTakeBrightnessOnly) {
  EXPECT_EQ(ToRgb(FORMAT_GRAY8 | FORMAT_BT601_FULL, FORMAT_RGB888, {100, 128, 128}, {20, 99, 99}),
            (Triple{120, 120, 120}));
}

// 130 is 16 * 8 + 2: from 3 the remainders run 5, 7, 9 - the third pixel is one level up.
TEST(ReferenceColour, DitherCarriesRemainders) {
  const YuvToRgb converter(Decoded(kFull), Decoded(FORMAT_RGB565), {});
  YuvToRgb::Carry carry = converter.StartCarry(true);
  const Triple grey{130, 128, 128};
  EXPECT_EQ(converter.Convert(grey, &carry), (Triple{16, 32, 16}));
  EXPECT_EQ(converter.Convert(grey, &carry), (Triple{16, 33, 16}));
  EXPECT_EQ(converter.Convert(grey, &carry), (Triple{17, 32, 17}));
}

TEST(ReferenceColour, ValuesOf8BitsForNarrowChannels) {
  const YuvToRgb converter(Decoded(kFull), Decoded(FORMAT_RGB565), {});
  EXPECT_EQ(converter.ConvertTo8Bits({130, 128, 128}), (Triple{130, 130, 130}));
  EXPECT_EQ(converter.ConvertTo8Bits({250, 128, 255}), (Triple{255, 159, 250}));  // red is 428
}

// Of 4 and 4 bits narrowed to 5 and 6: the sums run 7, 11, 7, 11 and 5, 5, 5, 5.
TEST(ReferenceColour, ClampedCarryOfSmallValues) {
  ClampedCarry carry(Decoded(FORMAT_RGB565));
  const Triple four{4, 4, 4};
  EXPECT_EQ(carry.Narrow(four), (Triple{0, 1, 0}));
  EXPECT_EQ(carry.Narrow(four), (Triple{1, 1, 1}));
  EXPECT_EQ(carry.Narrow(four), (Triple{0, 1, 0}));
  EXPECT_EQ(carry.Narrow(four), (Triple{1, 1, 1}));
}

// 255 + 3 is 31 of 5 bits and leaves 2, 255 + 1 is 63 of 6 bits and leaves 0.
TEST(ReferenceColour, ClampedCarryKeepsTheRemainderOfTheUnclampedSum) {
  ClampedCarry carry(Decoded(FORMAT_BGR565));
  EXPECT_EQ(carry.Narrow({255, 255, 255}), (Triple{31, 63, 31}));
  EXPECT_EQ(carry.Narrow({5, 3, 6}), (Triple{0, 0, 1}));
  EXPECT_EQ(carry.Narrow({1, 1, 0}), (Triple{1, 1, 0}));
}

TEST(ReferenceColour, SixBitMatrix) {
  EXPECT_EQ(SixBitYuvToRgb({255, 128, 128}), (Triple{255, 254, 254}));
  EXPECT_EQ(SixBitYuvToRgb({128, 128, 128}), (Triple{128, 127, 127}));
  EXPECT_EQ(SixBitYuvToRgb({0, 128, 128}), (Triple{0, 0, 0}));
  EXPECT_EQ(SixBitYuvToRgb({100, 138, 148}), (Triple{128, 81, 116}));
  EXPECT_EQ(SixBitYuvToRgb({255, 0, 255}), (Triple{255, 207, 28}));
}

TEST(ReferenceColour, RgbToYuvTruncates) {
  EXPECT_EQ(RgbToYuv({255, 255, 255}, CS_BT601_FULL), (Triple{255, 128, 128}));
  EXPECT_EQ(RgbToYuv({0, 0, 0}, CS_BT601_FULL), (Triple{0, 128, 128}));
  EXPECT_EQ(RgbToYuv({255, 255, 255}, CS_BT601_VIDEO)[kY], 234);
  EXPECT_EQ(RgbToYuv({0, 0, 0}, CS_BT601_VIDEO)[kY], 16);
  // Y 76.245, U 128 - 43.03, V 128 + 127.5
  EXPECT_EQ(RgbToYuv({255, 0, 0}, CS_BT601_FULL), (Triple{76, 84, 255}));
}

TEST(ReferenceColour, LevelsOfRangesAndAdjustments) {
  const LevelChange toFull(CS_BT601_VIDEO, CS_BT709_FULL, {});
  EXPECT_EQ(toFull.Convert({16, 128, 128}), (Triple{37, 128, 128}));
  EXPECT_EQ(toFull.Convert({235, 16, 240}), (Triple{255, 0, 255}));
  const LevelChange toVideo(CS_BT601_FULL, CS_BT601_VIDEO, {});
  EXPECT_EQ(toVideo.Convert({0, 0, 255}), (Triple{16, 16, 239}));
  const LevelChange contrast(CS_BT601_FULL, CS_BT601_FULL, {0, 64, 0});
  EXPECT_EQ(contrast.Convert({100, 100, 200}), (Triple{72, 72, 255}));
  const LevelChange saturation(CS_BT601_FULL, CS_BT601_FULL, {0, 0, 64});
  EXPECT_EQ(saturation.Convert({100, 128, 100}), (Triple{100, 128, 72}));
}

// ---- Creation -----------------------------------------------------------------------------------

MPPPARAM Params(uint32_t resample, uint32_t transform, uint32_t passMode, uint32_t aspect = 0) {
  MPPPARAM params{};
  params.resampleFlags = resample;
  params.transformCode = transform;
  params.passMode = passMode;
  params.aspectMode = aspect;
  return params;
}

Engine Built(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params) {
  Engine engine;
  EXPECT_EQ(BuildEngine(dst, src, params, params.passMode, &engine), 0u);
  return engine;
}

TEST(ReferenceCreation, CropKeepsTheMiddleAndTheStepOfTheOtherAxis) {
  const Engine engine = Built({FORMAT_I420, 480, 480, nullptr}, {FORMAT_I420, 640, 480, nullptr},
                              Params(MPP_BILINEAR, 0, 3, MPP_ASPECT_CROP));
  EXPECT_EQ(engine.srcOriginX, 80);
  EXPECT_EQ(engine.stepX, 0x10000);
  EXPECT_TRUE(engine.bilinear);       // settled before the crop
  EXPECT_EQ(engine.srcRect.left, 0);  // so is the source rectangle
  EXPECT_EQ(engine.srcRect.right, 640);
}

TEST(ReferenceCreation, FitRoundsItsMarginUpToWholeBlocks) {
  const MPPFORMAT dst = {FORMAT_I420, 60, 60, nullptr};
  const MPPFORMAT src = {FORMAT_I420, 100, 50, nullptr};
  const Engine plain = Built(dst, src, Params(0, 0, 1, MPP_ASPECT_FIT));
  EXPECT_EQ(plain.dstRegion.top, 15);
  EXPECT_EQ(plain.dstRegion.bottom, 45);
  EXPECT_EQ(plain.stepY, plain.stepX);
  const Engine blocks = Built(dst, src, Params(0, 0, 3, MPP_ASPECT_FIT));
  EXPECT_EQ(blocks.dstRegion.top, 16);
  EXPECT_EQ(blocks.dstRegion.bottom, 44);
  const Engine turned = Built(dst, src, Params(0, MPP_SWAP_XY, 1, MPP_ASPECT_FIT));
  EXPECT_EQ(turned.dstRegion.left, 15);
  EXPECT_EQ(turned.dstRegion.top, 0);
}

TEST(ReferenceCreation, CoveredRectangleAtUnitStepStartsOnePixelLate) {
  const Engine engine = Built({FORMAT_GRAY8, 7, 5, nullptr}, {FORMAT_GRAY8, 7, 5, nullptr},
                              Params(MPP_BILINEAR, 0, 1));
  EXPECT_FALSE(engine.bilinear);
  EXPECT_EQ(engine.coveredRect.left, 1);
  EXPECT_EQ(engine.coveredRect.right, 8);
  EXPECT_EQ(engine.coveredRect.bottom, 6);
}

TEST(ReferenceCreation, RefusesEmptySizesAndZeroSteps) {
  Engine engine;
  const MPPPARAM params = Params(0, 0, 1);
  EXPECT_EQ(
      BuildEngine({FORMAT_GRAY8, 0, 5, nullptr}, {FORMAT_GRAY8, 7, 5, nullptr}, params, 1, &engine),
      2u);
  EXPECT_EQ(BuildEngine({FORMAT_GRAY8, 65537, 5, nullptr}, {FORMAT_GRAY8, 1, 5, nullptr}, params, 1,
                        &engine),
            2u);
  EXPECT_EQ(
      BuildEngine({FORMAT_GRAY8, 7, 5, nullptr}, {0x60000000, 7, 5, nullptr}, params, 1, &engine),
      3u);
}

// ---- Pixels -------------------------------------------------------------------------------------

constexpr uint8_t kUntouched = 0xEE;

// A job whose planes are tightly packed.
class Picture {
 public:
  Picture(uint32_t dstCode, int32_t dstWidth, int32_t dstHeight, uint32_t srcCode, int32_t srcWidth,
          int32_t srcHeight)
      : job{} {
    job.dst = {dstCode, dstWidth, dstHeight, nullptr};
    job.src = {srcCode, srcWidth, srcHeight, nullptr};
    job.params = Params(MPP_NEAREST, 0, 1);
  }

  Picture& Source(int slot, int32_t pitch, const Bytes& bytes) {
    source_[slot] = bytes;
    job.srcPlanes[slot] = source_[slot].data();
    job.srcPitches[slot] = pitch;
    return *this;
  }

  Picture& Destination(int slot, int32_t pitch, size_t size) {
    destination_[slot].assign(size, kUntouched);
    job.dstPlanes[slot] = destination_[slot].data();
    job.dstPitches[slot] = pitch;
    return *this;
  }

  Picture& Rectangle(int32_t left, int32_t top, int32_t right, int32_t bottom) {
    job.hasRect = true;
    job.rect = {left, top, right, bottom};
    return *this;
  }

  const Bytes& Run(int slot = 0) {
    EXPECT_EQ(Convert(job), 0u);
    return destination_[slot];
  }

  const Bytes& Plane(int slot) const { return destination_[slot]; }

  Job job;

 private:
  Bytes source_[3];
  Bytes destination_[3];
};

Picture Greys(int32_t dstWidth, int32_t dstHeight, int32_t srcWidth, int32_t srcHeight,
              const Bytes& bytes) {
  Picture picture(FORMAT_GRAY8, dstWidth, dstHeight, FORMAT_GRAY8, srcWidth, srcHeight);
  picture.Source(0, srcWidth, bytes);
  picture.Destination(0, dstWidth, size_t(dstWidth) * size_t(dstHeight));
  return picture;
}

TEST(ReferenceSampling, NearestIsAlignedToCorners) {
  EXPECT_EQ(Greys(4, 1, 2, 1, {0, 100}).Run(), (Bytes{0, 0, 100, 100}));
  EXPECT_EQ(Greys(2, 1, 3, 1, {10, 20, 30}).Run(), (Bytes{10, 20}));
}

// Positions -0.25, 0.25, 0.75, 1.25: the ends are copies.
TEST(ReferenceSampling, BilinearIsAlignedToCentres) {
  Picture picture = Greys(4, 1, 2, 1, {0, 100});
  picture.job.params.resampleFlags = MPP_BILINEAR;
  EXPECT_EQ(picture.Run(), (Bytes{0, 25, 75, 100}));
}

// At (0.25, 0.25): 0..101 gives 25, 50..255 gives 101, between them 25 + 19.
TEST(ReferenceSampling, BilinearTruncatesTwice) {
  Picture picture = Greys(4, 4, 2, 2, {0, 101, 50, 255});
  picture.job.params.resampleFlags = MPP_BILINEAR;
  EXPECT_EQ(picture.Run()[5], 44);
}

TEST(ReferenceSampling, OnlyLumaIsInterpolated) {
  Picture picture(FORMAT_I444, 4, 1, FORMAT_I444, 2, 1);
  for (int slot = 0; slot < 3; ++slot) {
    picture.Source(slot, 2, {0, 100}).Destination(slot, 4, 4);
  }
  picture.job.params.resampleFlags = MPP_BILINEAR;
  EXPECT_EQ(picture.Run(0), (Bytes{0, 25, 75, 100}));
  EXPECT_EQ(picture.Plane(1), (Bytes{0, 0, 0, 100}));
}

// Columns as nearest sampling has them, rows at the positions of bilinear sampling: -0.25, 0.25,
// 0.75, 1.25.
TEST(ReferenceSampling, NearestOfABilinearEngine) {
  Picture picture = Greys(4, 4, 2, 2, {0, 50, 100, 150});
  picture.job.params.resampleFlags = MPP_BILINEAR;
  Engine engine;
  ASSERT_EQ(BuildEngine(picture.job.dst, picture.job.src, picture.job.params, 1, &engine), 0u);
  KernelCall call;
  ASSERT_TRUE(PrepareCall(engine, picture.job, engine.dstRegion, &call));
  Quirks quirks;
  quirks.nearestOnly = true;
  ConvertLoopRect(engine, call.loopRect, call.dstPitches, call.srcPitches, call.dstStarts,
                  call.srcPlanes, quirks);
  EXPECT_EQ(picture.Plane(0),
            (Bytes{0, 0, 50, 50, 0, 0, 50, 50, 0, 0, 50, 50, 100, 100, 150, 150}));
}

TEST(ReferenceSampling, SourceRectangleEdgesRepeat) {
  Picture picture = Greys(5, 1, 5, 1, {10, 20, 30, 40, 50});
  picture.job.params.srcRect = {1, 0, 4, 1};
  EXPECT_EQ(picture.Run(), (Bytes{20, 20, 30, 40, 40}));
}

TEST(ReferenceSampling, ExchangedLumasOfAPair) {
  Picture picture(FORMAT_GRAY8, 3, 1, FORMAT_YUYV_SWAPPED_LUMA, 3, 1);
  picture.Source(0, 8, {10, 1, 20, 2, 30, 3, 40, 4}).Destination(0, 3, 3);
  EXPECT_EQ(picture.Run(), (Bytes{20, 10, 40}));
}

TEST(ReferenceSampling, PaletteLeftmostPixelInTheTopBits) {
  Bytes palette(64, 0);
  const Bytes entries = {1, 2, 3, 0, 4, 5, 6, 0};  // B G R x
  std::copy(entries.begin(), entries.end(), palette.begin() + 4 * 6);
  Picture picture(FORMAT_BGR888, 3, 1, FORMAT_INDEX4, 3, 1);
  picture.job.src.palette = palette.data();
  picture.Source(0, 2, {0x67, 0x70}).Destination(0, 9, 9);
  EXPECT_EQ(picture.Run(), (Bytes{3, 2, 1, 6, 5, 4, 6, 5, 4}));
}

TEST(ReferenceSampling, NarrowChannelsAreFilledWithZeros) {
  Picture picture(FORMAT_BGR888, 2, 1, FORMAT_RGB565, 2, 1);
  picture.Source(0, 4, {0x00, 0xF8, 0xFF, 0xFF}).Destination(0, 6, 6);
  EXPECT_EQ(picture.Run(), (Bytes{248, 0, 0, 248, 252, 248}));
}

TEST(ReferenceWriting, NarrowChannelsAreTruncated) {
  Picture picture(FORMAT_RGB565, 2, 1, FORMAT_RGB888, 2, 1);
  picture.Source(0, 6, {255, 255, 255, 7, 3, 7}).Destination(0, 4, 4);
  EXPECT_EQ(picture.Run(), (Bytes{0xFF, 0xFF, 0x00, 0x00}));
}

TEST(ReferenceWriting, SpareByte) {
  Picture fromGrey(FORMAT_XRGB8888, 1, 1, FORMAT_GRAY8 | FORMAT_BT601_FULL, 1, 1);
  fromGrey.job.params.alpha = 0xFFFFFFFFu;
  fromGrey.Source(0, 1, {9}).Destination(0, 4, 4);
  EXPECT_EQ(fromGrey.Run(), (Bytes{9, 9, 9, 255}));
  Picture from32(FORMAT_XBGR8888, 1, 1, FORMAT_XRGB8888, 1, 1);
  from32.Source(0, 4, {1, 2, 3, 77}).Destination(0, 4, 4);
  EXPECT_EQ(from32.Run(), (Bytes{3, 2, 1, 77}));
  Picture from24(FORMAT_XBGR8888, 1, 1, FORMAT_RGB888, 1, 1);
  from24.job.params.alpha = 50;
  from24.Source(0, 3, {1, 2, 3}).Destination(0, 4, 4);
  EXPECT_EQ(from24.Run(), (Bytes{3, 2, 1, 0}));
}

// Red, red / red, white: chroma is that of the white pixel.
TEST(ReferenceWriting, LastPixelOfABlockGivesTheChroma) {
  Picture picture(FORMAT_I420 | FORMAT_BT601_FULL, 2, 2, FORMAT_BGR888, 2, 2);
  picture.Source(0, 6, {255, 0, 0, 255, 0, 0, 255, 0, 0, 255, 255, 255});
  picture.Destination(0, 2, 4).Destination(1, 1, 1).Destination(2, 1, 1);
  EXPECT_EQ(picture.Run(0), (Bytes{76, 76, 76, 255}));
  EXPECT_EQ(picture.Plane(1), (Bytes{128}));
  EXPECT_EQ(picture.Plane(2), (Bytes{128}));
}

Picture FromI444(uint32_t dstCode, int32_t width) {
  Picture picture(dstCode, width, 1, FORMAT_I444, width, 1);
  Bytes y, u, v;
  for (int32_t i = 0; i < width; ++i) {
    y.push_back(uint8_t(10 + i));
    u.push_back(uint8_t(20 + i));
    v.push_back(uint8_t(30 + i));
  }
  picture.Source(0, width, y).Source(1, width, u).Source(2, width, v);
  return picture;
}

// YUYV made by its own kernels takes U from the first pixel of a pair.
TEST(ReferenceWriting, OddPackedRowKeepsItsLastLuma) {
  EXPECT_EQ(FromI444(FORMAT_YUYV, 3).Destination(0, 8, 8).Run(),
            (Bytes{10, 20, 11, 31, 12, 22, kUntouched, 32}));
  EXPECT_EQ(FromI444(FORMAT_YUYV_SWAPPED_LUMA, 3).Destination(0, 8, 8).Run(),
            (Bytes{11, 21, 10, 31, kUntouched, 22, 12, 32}));
}

// From an odd left edge YUYV counts its groups from that edge, the other orders from the image's.
TEST(ReferenceWriting, PackedGroupsFromAnOddColumn) {
  EXPECT_EQ(FromI444(FORMAT_YUYV, 4).Destination(0, 8, 8).Rectangle(1, 0, 3, 1).Run(),
            (Bytes{kUntouched, 21, 11, 32, 12, kUntouched, kUntouched, kUntouched}));
  EXPECT_EQ(FromI444(FORMAT_YVYU, 4).Destination(0, 8, 8).Rectangle(1, 0, 3, 1).Run(),
            (Bytes{kUntouched, 31, 11, 21, 12, 32, kUntouched, 22}));
}

TEST(ReferenceWriting, ChromaOverwritesTheOddLumaOfTheSpecialLayout) {
  EXPECT_EQ(FromI444(FORMAT_YUV_SPECIAL8, 2).Destination(0, 4, 4).Run(),
            (Bytes{10, kUntouched, 21, 31}));
}

TEST(ReferenceWriting, VFirstPlanesExchangeAddressesButNotPitches) {
  Picture picture(FORMAT_YV24, 2, 2, FORMAT_I444, 2, 2);
  picture.Source(0, 2, {1, 2, 3, 4}).Source(1, 2, {5, 6, 7, 8}).Source(2, 2, {9, 10, 11, 12});
  picture.Destination(0, 2, 4).Destination(1, 3, 6).Destination(2, 4, 6);
  picture.Run();
  EXPECT_EQ(picture.Plane(2), (Bytes{5, 6, kUntouched, 7, 8, kUntouched}));
  EXPECT_EQ(picture.Plane(1), (Bytes{9, 10, kUntouched, kUntouched, 11, 12}));
}

TEST(ReferenceMirroring, OddChromaPhaseAndDroppedColumns) {
  Picture whole = FromI444(FORMAT_I422, 3);
  whole.job.params.transformCode = MPP_MIRROR_X;
  whole.Destination(0, 3, 3).Destination(1, 2, 2).Destination(2, 2, 2);
  EXPECT_EQ(whole.Run(0), (Bytes{12, 11, 10}));
  EXPECT_EQ(whole.Plane(1), (Bytes{22, 21}));

  // Columns 0 and 1 start in chroma column 0; the second one would land in column -1.
  Picture part = FromI444(FORMAT_I422, 3);
  part.job.params.transformCode = MPP_MIRROR_X;
  part.Destination(0, 3, 3).Destination(1, 2, 2).Destination(2, 2, 2).Rectangle(0, 0, 2, 1);
  EXPECT_EQ(part.Run(0), (Bytes{12, 11, kUntouched}));
  EXPECT_EQ(part.Plane(1), (Bytes{21, kUntouched}));
}

TEST(ReferenceMirroring, EveryTransform) {
  const Bytes source = {1, 2, 3, 4, 5, 6};  // 3 x 2
  const Bytes expected[8] = {{1, 2, 3, 4, 5, 6}, {1, 4, 2, 5, 3, 6}, {3, 2, 1, 6, 5, 4},
                             {4, 1, 5, 2, 6, 3}, {4, 5, 6, 1, 2, 3}, {3, 6, 2, 5, 1, 4},
                             {6, 5, 4, 3, 2, 1}, {6, 3, 5, 2, 4, 1}};
  for (uint32_t transform = 0; transform < 8; ++transform) {
    const bool swapped = transform & MPP_SWAP_XY;
    Picture picture = Greys(swapped ? 2 : 3, swapped ? 3 : 2, 3, 2, source);
    picture.job.params.transformCode = transform;
    EXPECT_EQ(picture.Run(), expected[transform]) << transform;
  }
}

// ---- Rectangles ---------------------------------------------------------------------------------

TEST(ReferenceRectangles, RightLimitIsMeasuredFromTheClippedLeft) {
  Picture picture = Greys(4, 1, 4, 1, {1, 2, 3, 4});
  picture.Destination(0, 9, 9).Rectangle(2, 0, 9, 1);
  const uint8_t u = kUntouched;
  EXPECT_EQ(picture.Run(), (Bytes{u, u, 3, 4, 4, 4, u, u, u}));
  Picture raised = Greys(4, 1, 4, 1, {1, 2, 3, 4});
  EXPECT_EQ(raised.Rectangle(-5, -5, 2, 1).Run(), (Bytes{1, 2, u, u}));
}

TEST(ReferenceRectangles, NothingForEmptyAndInvertedOnes) {
  for (uint32_t mode : {1u, MPP_PASS_TILED}) {
    for (const MRECT& rect : {MRECT{2, 0, 2, 1}, MRECT{3, 0, 1, 1}, MRECT{0, 1, 4, 0},
                              MRECT{0, -3, 4, 0}, MRECT{4, 0, 4, 1}}) {
      Picture picture = Greys(4, 1, 4, 1, {1, 2, 3, 4});
      picture.job.params.passMode = mode;
      EXPECT_EQ(picture.Rectangle(rect.left, rect.top, rect.right, rect.bottom).Run(),
                Bytes(4, kUntouched));
    }
  }
}

// Nearest: bilinear grey engines of 2x2 and 4x4 blocks blend their rows in pairs.
TEST(ReferenceRectangles, TilesCoverTheRectangleOnce) {
  Bytes source(50 * 30);
  for (size_t i = 0; i < source.size(); ++i) {
    source[i] = uint8_t(i * 37 >> 3);
  }
  for (uint32_t transform = 0; transform < 8; ++transform) {
    const bool swapped = transform & MPP_SWAP_XY;
    const auto convert = [&](uint32_t mode) {
      Picture picture = Greys(swapped ? 41 : 67, swapped ? 67 : 41, 50, 30, source);
      picture.job.params = Params(MPP_NEAREST, transform, mode);
      return picture.Rectangle(3, 1, 40, 39).Run();
    };
    EXPECT_EQ(convert(1), convert(MPP_PASS_TILED)) << transform;
  }
}

// 31 pixels leave the carry at 3 + 1 + 0: a 32nd remainder of 4 overflows only when it lasts
// beyond the band of 32 rows.
TEST(ReferenceBands, DitherStartsAfreshInEachBand) {
  const auto pixel32 = [](uint32_t bandSelector) {
    Bytes source(40, 128);
    source[0] = 129;
    source[32] = 132;
    Picture picture(FORMAT_RGB565, 1, 40, FORMAT_GRAY8 | FORMAT_BT601_FULL, 40, 1);
    picture.job.params.transformCode = MPP_SWAP_XY;
    picture.job.params.dither = 1;
    picture.job.params.bandSelector = bandSelector;
    const Bytes& result = picture.Source(0, 40, source).Destination(0, 2, 80).Run();
    return result[64] & 31;
  };
  EXPECT_EQ(pixel32(0), 16);
  EXPECT_EQ(pixel32(4), 17);
}

TEST(ReferencePlanes, NothingIsWrittenWhenOneIsMissing) {
  Picture picture = FromI444(FORMAT_I420, 2);
  picture.Destination(0, 2, 2).Destination(1, 1, 1);
  EXPECT_EQ(picture.Run(0), Bytes(2, kUntouched));
  picture.job.srcPlanes[0] = nullptr;
  EXPECT_EQ(Convert(picture.job), 2u);
}

}  // namespace
}  // namespace reference
