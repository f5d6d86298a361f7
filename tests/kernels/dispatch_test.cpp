// Every dispatcher against the model of its decisions, over random engines of all formats.
#include <gtest/gtest.h>

#include <ostream>
#include <set>
#include <string>

#include "tests/kernels/kernel_case.h"
#include "tests/kernels/observer.h"
#include "tests/reference/chooser.h"
#include "tests/support/instruction_sets.h"

namespace kernel_tests {
namespace {

using differential::Case;
using differential::Random;

// The numbers of a family's kernels.
struct Family {
  const int* kernels;
  int count;

  template <int size>
  constexpr explicit Family(const int (&numbers)[size]) : kernels(numbers), count(size) {}
};

struct Dispatcher {
  const char* name;
  KernelFn* entry;
  const char* (*model)(const reference::Engine&);  // null: the one that looks at the rectangle
  Family family;
  size_t kernels;  // that it ever runs
};

void PrintTo(const Dispatcher& dispatcher, std::ostream* out) {
  *out << dispatcher.name;
}

#define KERNEL(name, ...) kestrel::kernel_id::name,
constexpr int kVector[] = {
#include "kernels/neon/kernels.def"
};
constexpr int kRgb24[] = {
#include "kernels/rgb24/kernels.def"
};
constexpr int kPlanarYuv[] = {
#include "kernels/planar_yuv/kernels.def"
};
constexpr int kRgb565[] = {
#include "kernels/rgb565/kernels.def"
};
constexpr int kYuyv[] = {
#include "kernels/yuyv/kernels.def"
};
constexpr int kRgb32[] = {
#include "kernels/rgb32/kernels.def"
};
constexpr int kGrey[] = {
#include "kernels/grey/kernels.def"
};
#undef KERNEL

constexpr Dispatcher kDispatchers[] = {
    {"NEC_ALL", NEC_ALL, reference::ChooseNeon, Family(kVector), 34},
    {"ANY_ANY_C_FAST_R8G8B8", ANY_ANY_C_FAST_R8G8B8, reference::ChooseRgb24, Family(kRgb24), 21},
    {"YUV2YUV_Fast", YUV2YUV_Fast, reference::ChooseYuvToYuv, Family(kPlanarYuv), 57},
    {"ANY_ANY_C_FAST_R5G6B5", ANY_ANY_C_FAST_R5G6B5, reference::ChooseRgb16, Family(kRgb565), 47},
    {"I420_To_I422_Fast", I420_To_I422_Fast, reference::ChooseI420ToI422, Family(kPlanarYuv), 10},
    {"YUV_YUV_C_FAST", YUV_YUV_C_FAST, reference::ChoosePackedYuyv, Family(kYuyv), 57},
    {"YUV_RGB32_C_FAST", YUV_RGB32_C_FAST, nullptr, Family(kRgb32), 22},
    {"YUYV_RGB32_FAST", YUYV_RGB32_FAST, reference::ChooseYuyvAndRgb32, Family(kRgb32), 12},
    {"ANY_ANY_C_FAST_RGB32", ANY_ANY_C_FAST_RGB32, reference::ChooseRgb32, Family(kRgb32), 21},
    {"Gray2Gray_C_FAST", Gray2Gray_C_FAST, reference::ChooseGrey, Family(kGrey), 6},
};

constexpr int kEngines = 40 * KESTREL_KERNEL_JOBS;
constexpr int kMostEngines = 1000000;  // until every kernel has been met

class EveryDispatcher : public testing::TestWithParam<Dispatcher> {};

// Half of the engines are made to suit some kernel of the family, the others are made for any
// kernel or of any formats.
Case DrawEngine(Random* random, const Family& family, int number) {
  if (number % 2 == 0) {
    return DrawForKernel(random,
                         kestrel::kKernels[family.kernels[random->Between(0, family.count - 1)]]);
  }
  if (number % 4 == 1) {
    return DrawForKernel(random,
                         kestrel::kKernels[random->Between(0, kestrel::kernel_id::kCount - 1)]);
  }
  Case drawn = differential::DrawCase(77, uint64_t(number));
  if (drawn.params.passMode == MPP_PASS_TILED) {
    drawn.params.passMode = uint32_t(random->Between(1, 4));
  }
  return drawn;
}

reference::Decision Expected(const reference::Engine& model, const reference::Rect& loopRect) {
  const Dispatcher& dispatcher = EveryDispatcher::GetParam();
  return dispatcher.model ? reference::Decision{dispatcher.model(model), true}
                          : reference::ChooseYuvToRgb32(model, loopRect);
}

TEST_P(EveryDispatcher, ChoosesAsTheModelDoes) {
  KernelBench bench;
  int taken = 0;
  int refused = 0;
  int goneOn = 0;
  std::set<std::string> kernels;
  const auto hasMetAll = [&kernels] { return kernels.size() >= GetParam().kernels; };
  for (int i = 0; i < kEngines || (i < kMostEngines && !hasMetAll()); ++i) {
    Random random(4242, uint64_t(i));
    Case drawn = DrawEngine(&random, GetParam().family, i);
    reference::Engine model;
    if (BuildEngine(drawn.dst.record, drawn.src.record, drawn.params, drawn.params.passMode,
                    &model) != 0) {
      continue;
    }
    const EngineHandle handle = CreateEngine(drawn.dst.record, drawn.src.record, drawn.params);
    ASSERT_NE(handle, nullptr);
    const auto& sets = testing_support::InstructionSets();
    ForceRows(handle.get(), sets[size_t(i) % sets.size()]);
    DrawBand(&random, model, &drawn);
    if (!bench.Prepare(drawn, model)) {
      continue;
    }
    reference::Rect loopRect;
    const auto observe = [&loopRect](const MRECT* rect, auto... others) {
      loopRect = {rect->left, rect->top, rect->right, rect->bottom};
      return Observe(GetParam().entry, rect, others...);
    };
    const Observed observed = bench.CallWith(observe, handle->pass[0]->context);
    const reference::Decision expected = Expected(model, loopRect);
    const bool runs = expected.kernel != nullptr;
    const bool answersOk = runs && expected.ends;
    ASSERT_STREQ(observed.kernel, expected.kernel) << bench.Describe();
    ASSERT_EQ(observed.answer, answersOk ? KESTREL_OK : KESTREL_UNSUPPORTED) << bench.Describe();
    ASSERT_EQ(observed.accepted, runs ? 1 : 0) << bench.Describe();
    if (runs) {
      ++taken;
      kernels.insert(expected.kernel);
      goneOn += expected.ends ? 0 : 1;
      bench.CallModel(reference::QuirksOf(expected.kernel));
    } else {
      ++refused;
    }
    ASSERT_EQ(bench.Difference(), "") << bench.Describe();
  }
  EXPECT_GT(taken, kEngines / 100);
  EXPECT_GT(refused, kEngines / 4);
  EXPECT_EQ(kernels.size(), GetParam().kernels) << "one of its kernels was never met";
  if (!GetParam().model) {
    EXPECT_GT(goneOn, kEngines / 1000) << "too few kernels ran without ending the chain";
  }
}

INSTANTIATE_TEST_SUITE_P(Dispatchers, EveryDispatcher, testing::ValuesIn(kDispatchers),
                         [](const testing::TestParamInfo<Dispatcher>& test) {
                           return std::string(test.param.name);
                         });

}  // namespace
}  // namespace kernel_tests
