// Every kernel of the table through its exported entry: what it accepts equals the model on every
// byte, what it refuses is refused before anything is written. The instruction sets that the CPU
// can run take turns.
#include <gtest/gtest.h>

#include "tests/kernels/kernel_case.h"
#include "tests/reference/chooser.h"
#include "tests/support/instruction_sets.h"

namespace kernel_tests {
namespace {

using differential::Case;
using differential::Random;

constexpr int kJobs = KESTREL_KERNEL_JOBS;
constexpr int kRefusals = kJobs / 4 + 1;
constexpr uint32_t kRgb = kestrel::kRgb16 | kestrel::kRgb24 | kestrel::kRgb32;

// Engines are cheap, but a kernel whose engines are never met is not tested.
constexpr int kMostDraws = 2000 * kJobs;

// Gives the engine of a job the instruction set whose turn it is, and says which.
std::string TakeTurn(MPPHandle* handle, int job) {
  const auto& sets = testing_support::InstructionSets();
  const auto& set = sets[size_t(job) % sets.size()];
  ForceRows(handle, set);
  return set.name + ": ";
}

class EveryKernel : public testing::TestWithParam<int> {
 protected:
  const kestrel::KernelRow& row() const { return kestrel::kKernels[GetParam()]; }
  KernelFn* entry() const { return kestrel::kKernelEntries[GetParam()]; }

  // Whether the kernel takes the engine; its line of the table must say what the model says.
  bool Takes(const EngineHandle& handle, const reference::Engine& model) const {
    const bool takes = kestrel::Accepts(row(), *handle->pass[0]->context);
    bool isKnown = false;
    const bool shouldTake = reference::Takes(row().name, model, &isKnown);
    if (isKnown) {
      EXPECT_EQ(takes, shouldTake);
    }
    return takes;
  }

  // Both readings of the engine of a case; null when creation refuses.
  static EngineHandle Build(const Case& drawn, reference::Engine* model) {
    EngineHandle handle = CreateEngine(drawn.dst.record, drawn.src.record, drawn.params);
    const uint32_t code =
        BuildEngine(drawn.dst.record, drawn.src.record, drawn.params, drawn.params.passMode, model);
    EXPECT_EQ(code == 0, handle != nullptr);
    return handle;
  }
};

TEST_P(EveryKernel, GivesTheBytesOfTheModel) {
  KernelBench bench;
  const reference::Quirks quirks = reference::QuirksOf(row().name);
  int jobs = 0;
  int drew = 0;
  for (int draw = 0; jobs < kJobs; ++draw) {
    ASSERT_LT(draw, kMostDraws) << "too few engines suit " << row().name;
    Random random{uint64_t(GetParam()), uint64_t(draw)};
    Case drawn = DrawForKernel(&random, row());
    drawn.seed = uint64_t(GetParam());
    drawn.number = uint64_t(draw);
    reference::Engine model;
    const EngineHandle handle = Build(drawn, &model);
    if (!handle || !Takes(handle, model)) {
      continue;
    }
    DrawBand(&random, model, &drawn);
    if (!bench.Prepare(drawn, model)) {
      continue;
    }
    const std::string set = TakeTurn(handle.get(), jobs++);
    ASSERT_EQ(bench.Call(entry(), handle->pass[0]->context), KESTREL_OK) << set << bench.Describe();
    drew += bench.Difference().empty() ? 0 : 1;
    bench.CallModel(quirks);
    ASSERT_EQ(bench.Difference(), "") << set << bench.Describe();
  }
  EXPECT_GT(drew, kJobs / 2);
}

TEST_P(EveryKernel, RefusesBeforeWriting) {
  KernelBench bench;
  int refusals = 0;
  for (int draw = 0; refusals < kRefusals; ++draw) {
    ASSERT_LT(draw, kMostDraws) << "too few engines are refused by " << row().name;
    Random random{uint64_t(GetParam()) + 1000, uint64_t(draw)};
    // Engines of this kernel and of others; most differ in one respect only.
    const int other =
        random.Percent(50) ? GetParam() : random.Between(0, kestrel::kernel_id::kCount - 1);
    Case drawn = DrawForKernel(&random, kestrel::kKernels[other]);
    reference::Engine model;
    const EngineHandle handle = Build(drawn, &model);
    if (!handle || Takes(handle, model)) {
      continue;
    }
    DrawBand(&random, model, &drawn);
    if (!bench.Prepare(drawn, model)) {
      continue;
    }
    TakeTurn(handle.get(), refusals++);
    ASSERT_EQ(bench.Call(entry(), handle->pass[0]->context), KESTREL_UNSUPPORTED)
        << bench.Describe();
    ASSERT_EQ(bench.Difference(), "") << "written although refused: " << bench.Describe();
  }
}

TEST_P(EveryKernel, DrawsNothingIntoAnEmptyRectangle) {
  KernelBench bench;
  for (int draw = 0; draw < kMostDraws; ++draw) {
    Random random{uint64_t(GetParam()) + 2000, uint64_t(draw)};
    Case drawn = DrawForKernel(&random, row());
    reference::Engine model;
    const EngineHandle handle = Build(drawn, &model);
    if (!handle || !Takes(handle, model)) {
      continue;
    }
    DrawBand(&random, model, &drawn);
    if (!bench.Prepare(drawn, model)) {
      continue;
    }
    bench.CollapseCalls();
    ASSERT_EQ(bench.Call(entry(), handle->pass[0]->context), KESTREL_OK);
    ASSERT_EQ(bench.Difference(), "");
    return;
  }
  FAIL() << "no engine suits " << row().name;
}

// A departure that no job shows would not be tested by comparing jobs.
TEST_P(EveryKernel, DepartsVisibly) {
  constexpr bool reference::Quirks::*kFlags[] = {
      &reference::Quirks::storedLevels,  &reference::Quirks::chromaOfPairs,
      &reference::Quirks::edgesOfPairs,  &reference::Quirks::sharedLowerLine,
      &reference::Quirks::noEdgeColumns, &reference::Quirks::sixBitMatrix,
      &reference::Quirks::noDither,      &reference::Quirks::nearestOnly,
      &reference::Quirks::clampedCarry,  &reference::Quirks::carriesAlways};
  const reference::Quirks quirks = reference::QuirksOf(row().name);
  const bool isGrey = row().sources == kestrel::kGrey;  // the same chroma everywhere
  const bool isRgb = (row().sources & kRgb) != 0;       // has no levels to change
  for (bool reference::Quirks::*const flag : kFlags) {
    reference::Quirks without = quirks;
    without.*flag = false;
    bool isVisible = !(quirks.*flag) || (isGrey && flag == &reference::Quirks::chromaOfPairs) ||
                     (isRgb && flag == &reference::Quirks::storedLevels);
    KernelBench bench;
    for (int draw = 0; draw < 400000 && !isVisible; ++draw) {
      Random random{uint64_t(GetParam()) + 3000, uint64_t(draw)};
      Case drawn = DrawForKernel(&random, row());
      reference::Engine model;
      const EngineHandle handle = Build(drawn, &model);
      if (!handle || !Takes(handle, model)) {
        continue;
      }
      DrawBand(&random, model, &drawn);
      if (bench.Prepare(drawn, model)) {
        bench.Call(entry(), handle->pass[0]->context);
        bench.CallModel(without);
        isVisible = !bench.Difference().empty();
      }
    }
    EXPECT_TRUE(isVisible) << row().name;
  }
}

// The table and the model name the same departures from the generic converter.
TEST_P(EveryKernel, DepartsWhereItsLineSays) {
  const reference::Quirks quirks = reference::QuirksOf(row().name);
  const auto has = [this](uint32_t quirk) { return (row().quirks & quirk) != 0; };
  EXPECT_EQ(has(kestrel::kPairChroma), quirks.chromaOfPairs);
  EXPECT_EQ(has(kestrel::kPairEdges), quirks.edgesOfPairs);
  EXPECT_EQ(has(kestrel::kSharedLowerLine), quirks.sharedLowerLine);
  EXPECT_EQ(has(kestrel::kNoEdgeColumns), quirks.noEdgeColumns);
  EXPECT_EQ(has(kestrel::kSixBitMatrix), quirks.sixBitMatrix);
  EXPECT_EQ(has(kestrel::kNearestOnly), quirks.nearestOnly);
  EXPECT_EQ(has(kestrel::kClampedCarry), quirks.clampedCarry);
  EXPECT_EQ(has(kestrel::kClampedCarry) && !has(kestrel::kCarryIfAsked), quirks.carriesAlways);
  EXPECT_EQ(has(kestrel::kNoDither) && !has(kestrel::kSixBitMatrix), quirks.noDither);
  const bool hasLevels = ((row().sources | row().destinations) & kRgb) == 0;
  if (hasLevels) {
    EXPECT_EQ(has(kestrel::kNoLevelMap), quirks.storedLevels);
  }
}

INSTANTIATE_TEST_SUITE_P(Kernels, EveryKernel, testing::Range(0, int(kestrel::kernel_id::kCount)),
                         [](const testing::TestParamInfo<int>& test) {
                           return std::string(kestrel::kKernels[test.param].name);
                         });

}  // namespace
}  // namespace kernel_tests
