// Every dispatcher against the model of its decisions, over random engines of all formats.
#include <gtest/gtest.h>

#include <ostream>
#include <string>

#include "tests/kernels/kernel_case.h"
#include "tests/kernels/observer.h"
#include "tests/reference/chooser.h"

namespace kernel_tests {
namespace {

using differential::Case;
using differential::Random;

struct Dispatcher {
  const char* name;
  KernelFn* entry;
  const char* (*model)(const reference::Engine&);
};

void PrintTo(const Dispatcher& dispatcher, std::ostream* out) {
  *out << dispatcher.name;
}

constexpr Dispatcher kDispatchers[] = {
    {"YUV2YUV_Fast", YUV2YUV_Fast, reference::ChooseYuvToYuv},
    {"I420_To_I422_Fast", I420_To_I422_Fast, reference::ChooseI420ToI422},
    {"YUV_YUV_C_FAST", YUV_YUV_C_FAST, reference::ChoosePackedYuyv},
    {"Gray2Gray_C_FAST", Gray2Gray_C_FAST, reference::ChooseGrey},
};

constexpr int kEngines = 40 * KESTREL_KERNEL_JOBS;

class EveryDispatcher : public testing::TestWithParam<Dispatcher> {};

// Half of the engines are made to suit some kernel, the others are of any formats.
Case DrawEngine(Random* random, int number) {
  Case drawn;
  if (number % 2 == 0) {
    const int row = random->Between(0, kestrel::kernel_id::kCount - 1);
    drawn = DrawForKernel(random, kestrel::kKernels[row]);
  } else {
    drawn = differential::DrawCase(77, uint64_t(number));
    if (drawn.params.passMode == MPP_PASS_TILED) {
      drawn.params.passMode = uint32_t(random->Between(1, 4));
    }
  }
  return drawn;
}

TEST_P(EveryDispatcher, ChoosesAsTheModelDoes) {
  KernelBench bench;
  int taken = 0;
  int refused = 0;
  for (int i = 0; i < kEngines; ++i) {
    Random random(4242, uint64_t(i));
    Case drawn = DrawEngine(&random, i);
    reference::Engine model;
    if (BuildEngine(drawn.dst.record, drawn.src.record, drawn.params, drawn.params.passMode,
                    &model) != 0) {
      continue;
    }
    const EngineHandle handle = CreateEngine(drawn.dst.record, drawn.src.record, drawn.params);
    ASSERT_NE(handle, nullptr);
    DrawBand(&random, model, &drawn);
    if (!bench.Prepare(drawn, model)) {
      continue;
    }
    const Observed observed =
        bench.CallWith([](auto... arguments) { return Observe(GetParam().entry, arguments...); },
                       handle->pass[0]->context);
    const char* const expected = GetParam().model(model);
    ASSERT_STREQ(observed.kernel, expected) << bench.Describe();
    ASSERT_EQ(observed.answer, expected ? KESTREL_OK : KESTREL_UNSUPPORTED) << bench.Describe();
    ASSERT_EQ(observed.accepted, expected ? 1 : 0) << bench.Describe();
    if (expected) {
      ++taken;
      bench.CallModel(reference::QuirksOf(expected));
    } else {
      ++refused;
    }
    ASSERT_EQ(bench.Difference(), "") << bench.Describe();
  }
  EXPECT_GT(taken, kEngines / 100);
  EXPECT_GT(refused, kEngines / 4);
}

INSTANTIATE_TEST_SUITE_P(Dispatchers, EveryDispatcher, testing::ValuesIn(kDispatchers),
                         [](const testing::TestParamInfo<Dispatcher>& test) {
                           return std::string(test.param.name);
                         });

}  // namespace
}  // namespace kernel_tests
