// The stack that kernels and dispatchers need when they are called directly, without the engine.
#include <gtest/gtest.h>

#include <string>

#include "tests/kernels/kernel_case.h"
#include "tests/stack/stack_meter.h"
#include "tests/support/instruction_sets.h"

namespace {

using differential::Case;
using differential::Random;
using kernel_tests::EngineHandle;
using testing_support::InstructionSet;

constexpr int kJobs = 3;  // of each kernel; dispatchers are asked with the first
constexpr int kMostDraws = 100000;

struct Dispatcher {
  const char* name;
  KernelFn* entry;
};
constexpr Dispatcher kDispatchers[] = {{"NEC_ALL", NEC_ALL},
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
                                       {"ANY_ANY_Bilinear_No_Table", ANY_ANY_Bilinear_No_Table}};

std::string PathOf(const EngineContext& context) {
  constexpr const char* kPaths[] = {"YUV to YUV", "YUV to RGB", "RGB to RGB", "RGB to YUV"};
  return kPaths[context.pathKind];
}

TEST(StackUse, EveryKernelAndDispatcher) {
  stack::Deepest deepest;
  kernel_tests::KernelBench bench;
  for (int id = 0; id < kestrel::kernel_id::kCount; ++id) {
    const kestrel::KernelRow& row = kestrel::kKernels[id];
    int jobs = 0;
    for (int draw = 0; jobs < kJobs; ++draw) {
      ASSERT_LT(draw, kMostDraws) << "too few engines suit " << row.name;
      Random random{uint64_t(id), uint64_t(draw)};
      Case drawn = kernel_tests::DrawForKernel(&random, row);
      const EngineHandle handle =
          kernel_tests::CreateEngine(drawn.dst.record, drawn.src.record, drawn.params);
      if (!handle || !Accepts(row, *handle->pass[0]->context)) continue;
      reference::Engine model;
      BuildEngine(drawn.dst.record, drawn.src.record, drawn.params, drawn.params.passMode, &model);
      kernel_tests::DrawBand(&random, model, &drawn);
      if (!bench.Prepare(drawn, model)) continue;
      ++jobs;
      const EngineContext* const context = handle->pass[0]->context;
      for (const InstructionSet& set : testing_support::InstructionSets()) {
        ForceRows(handle.get(), set);
        uint32_t code = 99;
        deepest.Measure("kernels, " + PathOf(*context) + ", " + set.name, row.name,
                        [&] { code = bench.Call(kestrel::kKernelEntries[id], context); });
        ASSERT_EQ(code, KESTREL_OK) << row.name;
        if (jobs > 1) continue;
        for (const Dispatcher& dispatcher : kDispatchers) {
          deepest.Measure(dispatcher.name, row.name,
                          [&] { bench.Call(dispatcher.entry, context); });
        }
      }
      ASSERT_FALSE(HasFailure());
    }
  }
}

}  // namespace
