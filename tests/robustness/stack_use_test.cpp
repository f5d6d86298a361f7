// Camera threads have small stacks: no call may need more than 64 KiB. Each call runs on a painted
// stack, and the deepest byte that lost its paint tells how much was used.
#include <gtest/gtest.h>
#include <pthread.h>
#include <sys/mman.h>

#include <algorithm>
#include <cctype>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "engine/postprocess.h"
#include "jni/bitmap_buffers.h"
#include "tests/robustness/test_image.h"
#include "tests/support/instruction_sets.h"

namespace robustness {
namespace {

constexpr size_t kStackSize = 256 << 10;
constexpr size_t kLimit = 64 << 10;
constexpr uint8_t kPaint = 0xE7;

struct Call {
  const std::function<void()>* body;
  uintptr_t top;  // about where the body's own frames begin
};

void* Enter(void* argument) {
  Call* call = static_cast<Call*>(argument);
  call->top = reinterpret_cast<uintptr_t>(&call);
  (*call->body)();
  return nullptr;
}

size_t StackUse(const std::function<void()>& body) {
  void* stack = mmap(nullptr, kStackSize, PROT_READ | PROT_WRITE,
                     MAP_PRIVATE | MAP_ANONYMOUS | MAP_STACK, -1, 0);
  if (stack == MAP_FAILED) {
    ADD_FAILURE() << "no memory for a stack";
    return SIZE_MAX;
  }
  memset(stack, kPaint, kStackSize);
  pthread_attr_t attributes;
  pthread_attr_init(&attributes);
  pthread_attr_setstack(&attributes, stack, kStackSize);
  Call call = {&body, 0};
  pthread_t thread;
  if (pthread_create(&thread, &attributes, Enter, &call) != 0) {
    ADD_FAILURE() << "no thread";
    return SIZE_MAX;
  }
  pthread_join(thread, nullptr);
  pthread_attr_destroy(&attributes);
  const uint8_t* bytes = static_cast<const uint8_t*>(stack);
  const uint8_t* deepest =
      std::find_if(bytes, bytes + kStackSize, [](uint8_t byte) { return byte != kPaint; });
  const size_t used = call.top - reinterpret_cast<uintptr_t>(deepest);
  munmap(stack, kStackSize);
  return used;
}

TEST(StackUse, TheMeasureWorks) {
  const size_t nothing = StackUse([] {});
  EXPECT_LT(nothing, 4096u);
  const size_t some = StackUse([] {
    volatile uint8_t bytes[40000];
    for (volatile uint8_t& byte : bytes) byte = 1;
  });
  EXPECT_GE(some, 40000u);
  EXPECT_LT(some, 48000u);
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
  return code >> 28 >= 5 ? code | standard : code;
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

  // Creates an engine, forces a set upon it and uses it.
  void Run(const testing_support::InstructionSet& set) {
    MPPHandle* handle = nullptr;
    if (MPPCreate(&dst_, &src_, &params_, &handle) != KESTREL_OK) return;
    ForceRows(handle, set);
    MPProcess(handle, to_->planes(), nullptr, to_->pitches(), from_->constPlanes(),
              from_->pitches());
    MPPDestroy(handle);
  }

 private:
  static std::unique_ptr<TestImage> Image(const MPPFORMAT& format) {
    ImageShape shape;
    EXPECT_TRUE(ShapeOf(format.format, &shape));
    return std::make_unique<TestImage>(shape, format.width, format.height, nullptr, true);
  }

  MPPFORMAT dst_, src_;
  MPPPARAM params_{};
  std::unique_ptr<TestImage> to_, from_;
};

class StackUseOf : public testing::TestWithParam<testing_support::InstructionSet> {};

TEST_P(StackUseOf, EveryPairOfFormats) {
  Job(kKinds[0], FORMAT_NV21, FORMAT_RGB565).Run(GetParam());  // binds the library's imports
  size_t worst = 0;
  for (const uint32_t dstCode : kListedCodes) {
    for (const uint32_t srcCode : kListedCodes) {
      std::vector<Job> jobs;
      for (const Kind& kind : kKinds) {
        jobs.emplace_back(kind, dstCode, srcCode);
      }
      const size_t used = StackUse([&jobs] {
        for (Job& job : jobs) job.Run(GetParam());
      });
      ASSERT_LT(used, kLimit) << std::hex << dstCode << " from " << srcCode;
      worst = std::max(worst, used);
    }
  }
  EXPECT_GT(worst, 100u);
  RecordProperty("deepest_stack_bytes", static_cast<int>(worst));
  printf("deepest stack: %zu bytes\n", worst);
}

INSTANTIATE_TEST_SUITE_P(Rows, StackUseOf, testing::ValuesIn(testing_support::InstructionSets()),
                         [](const auto& test) {
                           std::string name = test.param.name;
                           std::replace_if(
                               name.begin(), name.end(),
                               [](unsigned char letter) { return std::isalnum(letter) == 0; }, '_');
                           return name;
                         });

TEST(StackUse, OneShot) {
  MBITMAP src = {FORMAT_XBGR8888, 640, 480, {}, {}};
  MBITMAP dst = {FORMAT_NV21, 300, 500, {}, {}};
  ASSERT_EQ(MBitmapAlloc(&src), KESTREL_OK);
  ASSERT_EQ(MBitmapAlloc(&dst), KESTREL_OK);
  memset(src.plane[0], 0x55, static_cast<size_t>(src.pitch[0]) * 480);
  uint32_t code = 99;
  const auto job = [&] { code = ConvertCS(&src, &dst); };
  job();
  ASSERT_EQ(code, KESTREL_OK);
  EXPECT_LT(StackUse(job), kLimit);
  MBitmapFree(&src);
  MBitmapFree(&dst);
}

}  // namespace
}  // namespace robustness
