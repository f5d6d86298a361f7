// Camera threads have small stacks: no call may need more than 64 KiB.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "colour/vector_clamps.h"
#include "engine/postprocess.h"
#include "jni/bitmap_buffers.h"
#include "tests/robustness/test_image.h"
#include "tests/stack/stack_meter.h"
#include "tests/support/instruction_sets.h"

namespace {

using robustness::ImageShape;
using robustness::kListedCodes;
using robustness::TestImage;
using stack::Deepest;

TEST(StackUse, TheMeasureWorks) {
  const size_t nothing = stack::UseOf([] {});
  EXPECT_LT(nothing, 4096u);
  const size_t some = stack::UseOf([] {
    volatile uint8_t bytes[40000];
    for (volatile uint8_t& byte : bytes) byte = 1;
  });
  EXPECT_GE(some, 40000u);
  EXPECT_LT(some, 48000u);
  EXPECT_LT(stack::UseOf([] {}), 4096u);  // painted again
}

// Jobs that kernels are made for and others. Wider than any strip; the enlarged ones keep filtered
// rows as well.
struct Kind {
  int32_t srcWidth;
  int32_t srcHeight;
  uint32_t transform;
  uint32_t resample;
  uint32_t dither;
  int32_t contrast;
  uint32_t standard;
};
constexpr int32_t kWidth = 1300;
constexpr int32_t kHeight = 14;
constexpr Kind kKinds[] = {{1100, 12, 0, MPP_BILINEAR, 1, 40, FORMAT_BT601_VIDEO},
                           {1100, 12, 3, MPP_BILINEAR, 1, 40, FORMAT_BT601_VIDEO},
                           {1100, 12, 6, MPP_BILINEAR, 1, 40, FORMAT_BT601_VIDEO},
                           {1100, 12, 0, MPP_BILINEAR, 0, 0, FORMAT_BT601_FULL},
                           {1100, 12, 5, MPP_BILINEAR, 0, 0, FORMAT_BT601_FULL},
                           {kWidth, kHeight, 0, MPP_NEAREST, 0, 0, FORMAT_BT601_FULL},
                           {kWidth, kHeight, 3, MPP_NEAREST, 0, 0, FORMAT_BT601_FULL}};

uint32_t WithStandard(uint32_t code, uint32_t standard) {
  return testing_support::HasStandard(code) ? code | standard : code;
}

// A job of one kind with its images.
class Job {
 public:
  Job(const Kind& kind, uint32_t dstCode, uint32_t srcCode) {
    static const std::vector<uint8_t> palette(1024, 3);
    const bool swaps = (kind.transform & MPP_SWAP_XY) != 0;
    dst_ = {WithStandard(dstCode, kind.standard), swaps ? kHeight : kWidth,
            swaps ? kWidth : kHeight, nullptr};
    src_ = {WithStandard(srcCode, kind.standard), kind.srcWidth, kind.srcHeight, palette.data()};
    params_.resampleFlags = kind.resample;
    params_.transformCode = kind.transform;
    params_.bandSelector = 4;
    params_.passMode = MPP_PASS_TILED;
    params_.dither = kind.dither;
    params_.contrast = kind.contrast;
    to_ = Image(dst_);
    from_ = Image(src_);
  }

  bool Create(const testing_support::InstructionSet& set) {
    if (MPPCreate(&dst_, &src_, &params_, &handle_) != KESTREL_OK) return false;
    ForceRows(handle_, set);
    return true;
  }
  void Plan() {
    MRECT dstRect = {0, 0, dst_.width, dst_.height};
    MRECT srcRect = {};
    MPPAlign(handle_, &dstRect, &srcRect);
  }
  void Process() {
    MPProcess(handle_, to_->planes(), nullptr, to_->pitches(), from_->constPlanes(),
              from_->pitches());
  }
  void ProcessEx() {
    constexpr MRECT kOrigin = {0, 0, 0, 0};
    MPProcessEx(handle_, to_->planes(), &kOrigin, nullptr, to_->pitches(), from_->constPlanes(),
                from_->pitches());
  }
  void Destroy() {
    MPPDestroy(handle_);
    handle_ = nullptr;
  }
  uint32_t pathKind() const { return handle_->pass[0]->context->pathKind; }

 private:
  static std::unique_ptr<TestImage> Image(const MPPFORMAT& format) {
    ImageShape shape;
    EXPECT_TRUE(ShapeOf(format.format, &shape));
    return std::make_unique<TestImage>(shape, format.width, format.height, nullptr, true);
  }

  MPPFORMAT dst_, src_;
  MPPPARAM params_{};
  MPPHandle* handle_ = nullptr;
  std::unique_ptr<TestImage> to_, from_;
};

class StackUseOf : public testing::TestWithParam<testing_support::InstructionSet> {};

TEST_P(StackUseOf, EveryPairOfFormats) {
  constexpr const char* kPaths[] = {"YUV to YUV", "YUV to RGB", "RGB to RGB", "RGB to YUV"};
  Job first(kKinds[0], FORMAT_NV21, FORMAT_RGB565);  // binds the library's imports
  ASSERT_TRUE(first.Create(GetParam()));
  first.Process();
  first.Destroy();
  Deepest deepest;
  size_t drawn = 0;
  for (const uint32_t dstCode : kListedCodes) {
    for (const uint32_t srcCode : kListedCodes) {
      char pair[40];
      snprintf(pair, sizeof pair, "%08x from %08x", dstCode, srcCode);
      std::vector<Job> jobs;
      for (const Kind& kind : kKinds) {
        jobs.emplace_back(kind, dstCode, srcCode);
      }
      bool created = true;
      const auto measure = [&](const std::string& kind, const std::function<void(Job&)>& step) {
        deepest.Measure(kind, pair,
                        [&jobs, &step] { std::for_each(jobs.begin(), jobs.end(), step); });
      };
      measure("MPPCreate", [&](Job& job) { created &= job.Create(GetParam()); });
      if (created) {
        const std::string path = kPaths[jobs.front().pathKind()];
        measure("MPPAlign", [](Job& job) { job.Plan(); });
        measure("MPProcess, " + path, [](Job& job) { job.Process(); });
        deepest.Measure("MPProcessEx, " + path, pair, [&jobs] { jobs.front().ProcessEx(); });
        ++drawn;
      }
      measure("MPPDestroy", [](Job& job) { job.Destroy(); });
      ASSERT_FALSE(HasFailure());
    }
  }
  EXPECT_GT(drawn, 1000u);
}

INSTANTIATE_TEST_SUITE_P(Rows, StackUseOf, testing::ValuesIn(testing_support::InstructionSets()),
                         [](const auto& test) {
                           std::string name = test.param.name;
                           std::replace_if(
                               name.begin(), name.end(),
                               [](unsigned char letter) { return std::isalnum(letter) == 0; }, '_');
                           return name;
                         });

TEST(StackUse, BuffersAndOneShot) {
  MBITMAP src = {FORMAT_XBGR8888, 640, 480, {}, {}};
  MBITMAP dst = {FORMAT_NV21, 300, 500, {}, {}};
  uint32_t code = 99;
  const auto allocate = [&] { code = MBitmapAlloc(&src) | MBitmapAlloc(&dst); };
  const auto convert = [&] { code = ConvertCS(&src, &dst); };
  const auto release = [&] { code = MBitmapFree(&src) | MBitmapFree(&dst); };
  const auto others = [&] {
    code = getBufferLength(FORMAT_NV21, 300, 500) > 0 ? KESTREL_OK : 99;
    getCurrentTimeStamp();
  };
  Deepest deepest;
  deepest.Measure("MBitmapAlloc", "", allocate);
  ASSERT_EQ(code, KESTREL_OK);
  memset(src.plane[0], 0x55, static_cast<size_t>(src.pitch[0]) * 480);
  convert();  // binds the library's imports
  deepest.Measure("ConvertCS", "", convert);
  ASSERT_EQ(code, KESTREL_OK);
  deepest.Measure("dumpBitmap2", "", [&] { dumpBitmap2("/dev/null", &dst); });
  deepest.Measure("getBufferLength, getCurrentTimeStamp", "", others);
  ASSERT_EQ(code, KESTREL_OK);
  deepest.Measure("MBitmapFree", "", release);
  ASSERT_EQ(code, KESTREL_OK);
}

TEST(StackUse, Helpers) {
  Deepest deepest;
  for (const uint32_t code : kListedCodes) {
    const MPPFORMAT record = {code, 64, 64, nullptr};
    deepest.Measure("MPParseFormat, MPGetPlaneLayout, MPGetSubsampling", "", [&record] {
      FormatDesc desc = {};
      PlaneLayout layout = {};
      uint32_t factors[6];
      MPParseFormat(&desc, &record);
      MPGetPlaneLayout(&desc, &layout);
      MPGetSubsampling(&desc, &layout, factors);
    });
  }
  deepest.Measure("rectangles, masks, clamps", "", [] {
    const MRECT frame = {0, 0, 64, 48};
    MRECT rect = {};
    RectCopy(&rect, &frame);
    MSwapRect(&rect);
    FlipUpDownRect(&frame, &rect);
    MFlipLeftRightRect(&frame, &rect);
    MGetMaskPos(MGetMaskSize(0xF8));
    PostProcessGetVersionInfo();
    NEC_DebugWin32();
    Bound_u16(KestrelU16x8{}, KestrelU16x8{}, KestrelU16x8{});
    Bound_s16(KestrelS16x8{}, KestrelS16x8{}, KestrelS16x8{});
    Bound_s32(KestrelS32x4{}, KestrelS32x4{}, KestrelS32x4{});
  });
}

}  // namespace
