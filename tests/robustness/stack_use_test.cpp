// Camera threads have small stacks: no call may need more than 64 KiB. Each call runs on a painted
// stack, and the deepest byte that lost its paint tells how much was used.
#include <gtest/gtest.h>
#include <pthread.h>
#include <sys/mman.h>

#include <algorithm>
#include <cstring>
#include <functional>
#include <memory>
#include <vector>

#include "engine/postprocess.h"
#include "jni/bitmap_buffers.h"
#include "tests/robustness/test_image.h"

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

TEST(StackUse, EveryPairOfFormats) {
  // Wider than any strip, a little enlarged, so that filtered rows are kept as well.
  constexpr int32_t kWidth = 1300;
  constexpr int32_t kHeight = 14;
  constexpr int32_t kSrcWidth = 1100;
  constexpr int32_t kSrcHeight = 12;
  static const std::vector<uint8_t> palette(1024, 3);
  size_t worst = 0;
  for (const uint32_t dstCode : kListedCodes) {
    for (const uint32_t srcCode : kListedCodes) {
      ImageShape dstShape;
      ImageShape srcShape;
      ASSERT_TRUE(ShapeOf(dstCode, &dstShape));
      ASSERT_TRUE(ShapeOf(srcCode, &srcShape));
      for (const uint32_t transform : {0u, 3u, 6u}) {
        const bool swaps = (transform & MPP_SWAP_XY) != 0;
        MPPFORMAT dst = {dstCode, swaps ? kHeight : kWidth, swaps ? kWidth : kHeight, nullptr};
        MPPFORMAT src = {srcCode, kSrcWidth, kSrcHeight, palette.data()};
        MPPPARAM params = {};
        params.resampleFlags = MPP_BILINEAR;
        params.transformCode = transform;
        params.bandSelector = 4;
        params.passMode = MPP_PASS_TILED;
        params.dither = 1;
        params.contrast = 40;
        TestImage to(dstShape, dst.width, dst.height, nullptr, true);
        TestImage from(srcShape, kSrcWidth, kSrcHeight, nullptr, true);
        const auto job = [&] {
          MPPHandle* handle = nullptr;
          if (MPPCreate(&dst, &src, &params, &handle) != KESTREL_OK) return;
          MPProcess(handle, to.planes(), nullptr, to.pitches(), from.constPlanes(), from.pitches());
          MPPDestroy(handle);
        };
        if (worst == 0) job();  // the first call also binds the library's imports
        const size_t used = StackUse(job);
        ASSERT_LT(used, kLimit) << std::hex << dstCode << " from " << srcCode << " transform "
                                << transform;
        worst = std::max(worst, used);
      }
    }
  }
  EXPECT_GT(worst, 100u);
  RecordProperty("deepest_stack_bytes", static_cast<int>(worst));
  printf("deepest stack: %zu bytes\n", worst);
}

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
