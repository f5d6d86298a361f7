// Which row operations engines use: the first ones available, and each engine its own.
#include <array>
#include <cstring>
#include <set>
#include <string>
#include <vector>

#include "kernels/rows/rows.h"
#include "tests/exact/exact_support.h"
#include "tests/support/instruction_sets.h"

namespace kestrel::test {
namespace {

constexpr int32_t kWidth = 70;
constexpr int32_t kHeight = 6;

// A grey picture as RGB, by whole pixels; tiled, so that there are three passes.
struct Grey {
  Grey() : engine({FORMAT_XBGR8888, kWidth, kHeight}, {FORMAT_GRAY8, kWidth, kHeight}, Tiled()) {
    for (size_t i = 0; i < source.size(); ++i) {
      source[i] = uint8_t(3 * i + 1);
    }
  }
  static Param Tiled() { return Param().Tiled().Bilinear(); }

  const Bytes& Draw() {
    std::fill(drawn.begin(), drawn.end(), uint8_t{0xA5});
    EXPECT_EQ(Process(engine, OnePlane(drawn, 4 * kWidth), OnePlane(source, kWidth)), KESTREL_OK);
    return drawn;
  }

  Engine engine;
  Bytes source = Bytes(size_t{kWidth} * kHeight);
  Bytes drawn = Bytes(size_t{4} * kWidth * kHeight);
};

TEST(InstructionSets, TheListEndsWithTheScalarOne) {
  const RowOpsList list = AvailableRowOps();
  int count = 0;
  std::set<std::string> names;
  while (list.ops[count] != nullptr) {
    ASSERT_LT(count, kMostRowOps);
    names.insert(list.ops[count]->name);
    ++count;
  }
  ASSERT_GE(count, 1);
  EXPECT_EQ(list.ops[count - 1], &kScalarRows);
  EXPECT_EQ(names.size(), size_t(count));
}

// By the compiler's own question. A set left out of the list would go untested everywhere.
TEST(InstructionSets, TheListHasEverySetOfTheCpu) {
  std::vector<const RowOps*> expected;
#if defined(__x86_64__)
  if (__builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512dq") &&
      __builtin_cpu_supports("avx512bw") && __builtin_cpu_supports("avx512vl") &&
      __builtin_cpu_supports("avx512vbmi") && __builtin_cpu_supports("avx512vnni")) {
    expected.push_back(&kAvx512Rows);
  }
  if (__builtin_cpu_supports("avx2")) {
    expected.push_back(&kAvx2Rows);
  }
  if (__builtin_cpu_supports("sse4.1")) {
    expected.push_back(&kSse41Rows);
  }
#elif defined(__ARM_NEON)
  expected.push_back(&kNeonRows);
#endif
  expected.push_back(&kScalarRows);
  std::vector<const RowOps*> listed;
  const RowOpsList list = AvailableRowOps();
  for (int i = 0; list.ops[i] != nullptr; ++i) {
    listed.push_back(list.ops[i]);
  }
  EXPECT_EQ(listed, expected);
}

TEST(InstructionSets, NoOperationIsMissing) {
  for (const testing_support::InstructionSet& set : testing_support::InstructionSets()) {
    constexpr size_t kOperations = sizeof(RowOps) / sizeof(void (*)());
    std::array<void (*)(), kOperations> table;
    std::memcpy(table.data(), set.rows, sizeof(RowOps));
    for (size_t i = 0; i < kOperations; ++i) {
      EXPECT_NE(table[i], nullptr) << set.name << ", entry " << i;
    }
  }
}

TEST(InstructionSets, CreationSelectsTheFirstOne) {
  const Grey tiled;
  for (int pass = 0; pass < 3; ++pass) {
    EXPECT_EQ(tiled.engine.context(pass).rows, AvailableRowOps().ops[0]);
  }
  const Engine untiled({FORMAT_NV21, 8, 8}, {FORMAT_RGB565, 8, 8});
  EXPECT_EQ(untiled.context().rows, AvailableRowOps().ops[0]);
}

// Sets that fill all pixels that they should convert, in every way that leads to RGB.
template <uint8_t kValue>
RowOps Filling() {
  RowOps rows = kScalarRows;
  rows.yuvToPixels = [](const PixelRows& pixels, const ChromaRows&, const YuvToRgb&,
                        const PixelFormat& format, AlphaFill, int n) {
    for (int row = 0; row < pixels.rows; ++row) {
      memset(pixels.dst + row * pixels.dstPitch, kValue, size_t(n) * size_t(format.bytes));
    }
  };
  rows.packRgb = [](uint8_t* dst, const uint8_t* const[3], const PixelFormat& format,
                    const FieldShifts&, AlphaFill,
                    int n) { memset(dst, kValue, size_t(n) * size_t(format.bytes)); };
  return rows;
}

// Engines made before and after others change their sets, used in turns.
TEST(InstructionSets, EnginesKeepTheirOwn) {
  static const RowOps ones = Filling<1>();
  static const RowOps twos = Filling<2>();
  Grey first, second, third;
  const Bytes expected = third.Draw();
  testing_support::ForceRows(first.engine.handle(), {"ones", &ones});
  testing_support::ForceRows(second.engine.handle(), {"twos", &twos});
  Grey fourth;
  for (int round = 0; round < 3; ++round) {
    EXPECT_EQ(first.Draw(), Bytes(expected.size(), 1));
    EXPECT_EQ(third.Draw(), expected);
    EXPECT_EQ(second.Draw(), Bytes(expected.size(), 2));
    EXPECT_EQ(fourth.Draw(), expected);
  }
}

TEST(InstructionSets, EverySetDrawsTheSame) {
  Grey selected;
  const Bytes expected = selected.Draw();
  EXPECT_NE(expected, Bytes(expected.size(), 0xA5));
  std::vector<Grey> engines(testing_support::InstructionSets().size());
  for (size_t i = 0; i < engines.size(); ++i) {
    testing_support::ForceRows(engines[i].engine.handle(), testing_support::InstructionSets()[i]);
  }
  for (int round = 0; round < 2; ++round) {
    for (Grey& engine : engines) {
      EXPECT_EQ(engine.Draw(), expected);
    }
  }
}

}  // namespace
}  // namespace kestrel::test
