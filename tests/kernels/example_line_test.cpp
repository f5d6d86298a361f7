// A new kernel is one table line when its stages exist: here is one that the product does not have,
// I444 mirrored into NV21 at 1:1.
#include <gtest/gtest.h>

#include "kernels/table/kernels.h"

namespace {

using namespace kestrel;

constexpr KernelRow kExample = {
    "I444toNV21_Example_H_Flip", kI444,       kNv21, Pairing::kAny, Scale::kUnit,
    Transform::kMirrorX,         Block::kAny, kExact};

struct Example {
  explicit Example(uint32_t transform) {
    MPPFORMAT dst = {FORMAT_NV21, 4, 2, nullptr};
    MPPFORMAT src = {FORMAT_I444, 4, 2, nullptr};
    MPPPARAM params = {};
    params.transformCode = transform;
    EXPECT_EQ(MPPCreate(&dst, &src, &params, &handle), KESTREL_OK);
  }
  ~Example() { MPPDestroy(handle); }
  Example(const Example&) = delete;
  Example& operator=(const Example&) = delete;

  // The whole picture, mirrored: the walk starts at the last column.
  uint32_t Run() {
    const MRECT rect = {0, 0, 4, 2};
    uint8_t* const starts[3] = {pixels + 3, pixels + 8 + 2 + 1, pixels + 8 + 2};
    const uint8_t* const planes[3] = {y, u, v};
    const int32_t dstPitches[3] = {4, 4, 4};
    const int32_t srcPitches[3] = {4, 4, 4};
    return RunKernel(kExample, &rect, dstPitches, srcPitches, starts, planes,
                     handle->pass[0]->context);
  }

  MPPHandle* handle = nullptr;
  const uint8_t y[8] = {1, 2, 3, 4, 5, 6, 7, 8};
  const uint8_t u[8] = {11, 12, 13, 14, 15, 16, 17, 18};
  const uint8_t v[8] = {21, 22, 23, 24, 25, 26, 27, 28};
  uint8_t pixels[12] = {};
};

TEST(ExampleLine, ConvertsWithoutALoopOfItsOwn) {
  Example example(MPP_MIRROR_X);
  ASSERT_EQ(example.Run(), KESTREL_OK);
  // Chroma of the last pixel of each block in the order of the walk.
  const uint8_t expected[12] = {4, 3, 2, 1, 8, 7, 6, 5, 28, 18, 26, 16};
  for (int i = 0; i < 12; ++i) EXPECT_EQ(example.pixels[i], expected[i]) << i;
}

TEST(ExampleLine, DeclinesOtherEngines) {
  Example example(0);
  EXPECT_EQ(example.Run(), KESTREL_UNSUPPORTED);
  for (const uint8_t byte : example.pixels) EXPECT_EQ(byte, 0);
}

}  // namespace
