// Every allocation of every creation path fails once: the answer, the caller's records and the
// balance of blocks must be those that the interface promises.
#include <gtest/gtest.h>

#include <cstring>
#include <ostream>
#include <string>
#include <tuple>
#include <vector>

#include "engine/postprocess.h"
#include "jni/bitmap_buffers.h"
#include "platform/tessel/tessel.h"
#include "tests/robustness/test_image.h"
#include "tests/support/tessel_double.h"

namespace robustness {
namespace {

TEST(TesselDouble, NoticesMisuse) {
  tessel_double::Reset();
  const size_t liveBefore = tessel_double::LiveBlocks();
  int pool = 0;
  uint8_t* block = static_cast<uint8_t*>(MMemAlloc(&pool, 10));
  ASSERT_NE(block, nullptr);
  EXPECT_EQ(tessel_double::Faults().size(), 1u) << "a pool handle";
  EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore + 1);
  const bool hasMargins = tessel_double::HasMargins();
  if (hasMargins) block[10] ^= 1;
  MMemFree(nullptr, block);
  EXPECT_EQ(tessel_double::Faults().size(), hasMargins ? 2u : 1u) << "a byte beside the block";
  MMemFree(nullptr, &pool);
  EXPECT_EQ(tessel_double::Faults().size(), hasMargins ? 3u : 2u) << "a foreign block";
  EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore);

  tessel_double::Reset();
  tessel_double::FailNth(2);
  void* first = MMemAlloc(nullptr, 1);
  EXPECT_NE(first, nullptr);
  EXPECT_EQ(MMemAlloc(nullptr, 1), nullptr);
  MMemFree(nullptr, first);
  EXPECT_TRUE(tessel_double::Faults().empty());
}

struct Job {
  const char* name;
  uint32_t dstCode;
  uint32_t srcCode;
  int32_t brightness;
  uint32_t tableSize;  // 0: such an engine needs no conversion table
};

constexpr Job kJobs[] = {
    {"YuvToYuv", FORMAT_I420, FORMAT_NV21, 0, 0},
    {"YuvToYuvOtherRange", FORMAT_I420 | FORMAT_BT601_FULL, FORMAT_NV21, 0, 512},
    {"YuvToYuvBrighter", FORMAT_YUYV, FORMAT_GRAY8, 9, 512},
    {"YuvToRgb32", FORMAT_BGRX8888, FORMAT_NV21, 0, 4352},
    {"YuvToRgb18", FORMAT_RGB666, FORMAT_I444, 0, 4352},
    {"YuvToRgb16", FORMAT_RGB565, FORMAT_YUYV, 0, 3552},
    {"RgbToRgb", FORMAT_BGR888, FORMAT_RGBX8888, 0, 0},
    {"RgbToYuv", FORMAT_NV21, FORMAT_BGRX8888, 0, 8192},
};

void PrintTo(const Job& job, std::ostream* out) {
  *out << job.name;
}

// The jobs that the one-shot conversion can make (it has no adjustments); all, or those with
// tables.
std::vector<Job> OneShotJobs(bool withTablesOnly) {
  std::vector<Job> jobs;
  for (const Job& job : kJobs) {
    if (job.brightness == 0 && (job.tableSize != 0 || !withTablesOnly)) jobs.push_back(job);
  }
  return jobs;
}

enum class Step { kHandle, kEngine, kContext, kTable };

class AllocationFailure : public testing::TestWithParam<std::tuple<Job, uint32_t>> {
 protected:
  static constexpr int32_t kWidth = 36;
  static constexpr int32_t kHeight = 20;

  AllocationFailure() : job_(std::get<0>(GetParam())), passMode_(std::get<1>(GetParam())) {}

  void SetUp() override {
    ResetRecords();
    liveBefore_ = tessel_double::LiveBlocks();
  }

  void ResetRecords() {
    dst_ = {job_.dstCode, kWidth, kHeight, nullptr};
    src_ = {job_.srcCode, 24, 26, nullptr};
    params_ = {};
    params_.resampleFlags = MPP_BILINEAR;
    params_.transformCode = MPP_MIRROR_Y;
    params_.passMode = passMode_;
    params_.dither = 7;
    params_.brightness = job_.brightness;
    tessel_double::Reset();
  }

  size_t Passes() const { return passMode_ == MPP_PASS_TILED ? 3 : 1; }
  size_t RequestsPerPass() const { return job_.tableSize != 0 ? 3 : 2; }
  Step StepOf(size_t n) const {  // n counts from 1
    return n == 1 ? Step::kHandle : static_cast<Step>(1 + (n - 2) % RequestsPerPass());
  }

  uint32_t Create() {
    handle_ = reinterpret_cast<MPPHandle*>(this);  // must be overwritten in every case
    return MPPCreate(&dst_, &src_, &params_, &handle_);
  }

  void ExpectRecordsRestored() {
    EXPECT_EQ(dst_.format, job_.dstCode);
    EXPECT_EQ(src_.format, job_.srcCode);
    EXPECT_EQ(params_.dither, 7u);
    EXPECT_EQ(params_.passMode, passMode_);
    EXPECT_EQ(dst_.width, kWidth);
    EXPECT_EQ(src_.height, 26);
  }

  void ExpectNothingLeft() {
    EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore_);
    for (const std::string& fault : tessel_double::Faults()) ADD_FAILURE() << fault;
  }

  TestImage MakeDestination() const {
    ImageShape shape;
    EXPECT_TRUE(ShapeOf(job_.dstCode, &shape));
    TestImage image(shape, kWidth, kHeight, nullptr, true);
    image.Fill(2);
    return image;
  }

  uint32_t Process(TestImage* destination) {
    ImageShape shape;
    EXPECT_TRUE(ShapeOf(job_.srcCode, &shape));
    TestImage source(shape, 24, 26, nullptr, true);
    source.Fill(1);
    return MPProcess(handle_, destination->planes(), nullptr, destination->pitches(),
                     source.constPlanes(), source.pitches());
  }

  Job job_;
  uint32_t passMode_;
  MPPFORMAT dst_{};
  MPPFORMAT src_{};
  MPPPARAM params_{};
  MPPHandle* handle_ = nullptr;
  size_t liveBefore_ = 0;
};

TEST_P(AllocationFailure, RequestsAreHandleThenEngineContextAndTableOfEachPass) {
  ASSERT_EQ(Create(), KESTREL_OK);
  const std::vector<uint32_t> requests = tessel_double::Requests();
  ASSERT_EQ(requests.size(), 1 + Passes() * RequestsPerPass());
  for (size_t n = 1; n <= requests.size(); ++n) {
    if (StepOf(n) == Step::kTable) {
      EXPECT_EQ(requests[n - 1], job_.tableSize);
    }
  }
  for (size_t i = 0; i < 3; ++i) {
    ASSERT_EQ(handle_->pass[i] != nullptr, i < Passes());
    if (i >= Passes()) continue;
    EXPECT_EQ(handle_->pass[i]->context->table != nullptr, job_.tableSize != 0);
    EXPECT_EQ(handle_->pass[i]->context->tableSize, job_.tableSize);
  }
  EXPECT_GT(tessel_double::LiveBlocks(), liveBefore_);

  TestImage destination = MakeDestination();
  const size_t created = tessel_double::Requests().size();
  EXPECT_EQ(Process(&destination), KESTREL_OK);
  EXPECT_TRUE(destination.Changed());
  EXPECT_EQ(tessel_double::Requests().size(), created) << "processing must not allocate";

  EXPECT_EQ(MPPDestroy(handle_), KESTREL_OK);
  ExpectRecordsRestored();
  ExpectNothingLeft();
}

TEST_P(AllocationFailure, EachRequestFailsOnce) {
  ASSERT_EQ(Create(), KESTREL_OK);
  TestImage whole = MakeDestination();
  ASSERT_EQ(Process(&whole), KESTREL_OK);
  ASSERT_EQ(MPPDestroy(handle_), KESTREL_OK);
  TestImage untouched = MakeDestination();

  for (size_t n = 1; n <= 1 + Passes() * RequestsPerPass(); ++n) {
    SCOPED_TRACE("request " + std::to_string(n));
    ResetRecords();
    tessel_double::FailNth(n);
    const uint32_t code = Create();
    ASSERT_GE(tessel_double::Requests().size(), n);
    if (StepOf(n) == Step::kTable) {
      ASSERT_EQ(code, KESTREL_OK);
      const size_t pass = (n - 2) / RequestsPerPass();
      for (size_t i = 0; i < Passes(); ++i) {
        EXPECT_EQ(handle_->pass[i]->context->table == nullptr, i == pass);
      }
      // The pass without a table writes nothing, the others what they always write.
      TestImage partial = MakeDestination();
      EXPECT_EQ(Process(&partial), KESTREL_OK);
      const std::vector<uint8_t> bytes = partial.Bytes();
      const std::vector<uint8_t> done = whole.Bytes();
      const std::vector<uint8_t> old = untouched.Bytes();
      for (size_t i = 0; i < bytes.size(); ++i) {
        ASSERT_TRUE(bytes[i] == done[i] || bytes[i] == old[i]) << "byte " << i;
      }
      if (Passes() == 1) {
        EXPECT_FALSE(partial.Changed());
      }
      EXPECT_EQ(MPPDestroy(handle_), KESTREL_OK);
      ExpectRecordsRestored();
    } else {
      EXPECT_EQ(code, KESTREL_OUT_OF_MEMORY);
      EXPECT_EQ(handle_, nullptr);
      if (StepOf(n) == Step::kHandle) {
        EXPECT_EQ(dst_.format, 0u);
        EXPECT_EQ(src_.format, 0u);
        EXPECT_EQ(params_.dither, 0u);
      } else {
        ExpectRecordsRestored();
      }
    }
    ExpectNothingLeft();
  }
}

TEST_P(AllocationFailure, EnginesWithoutAnyTableWriteNothing) {
  if (job_.tableSize == 0) {
    // Nothing to fail: such an engine is complete without a table.
    ASSERT_EQ(Create(), KESTREL_OK);
    EXPECT_EQ(handle_->pass[0]->context->table, nullptr);
    EXPECT_EQ(MPPDestroy(handle_), KESTREL_OK);
    return;
  }
  tessel_double::FailSize(job_.tableSize);
  ASSERT_EQ(Create(), KESTREL_OK);
  for (size_t i = 0; i < Passes(); ++i) {
    EXPECT_EQ(handle_->pass[i]->context->table, nullptr);
  }
  TestImage destination = MakeDestination();
  EXPECT_EQ(Process(&destination), KESTREL_OK);
  EXPECT_FALSE(destination.Changed());
  EXPECT_EQ(MPPDestroy(handle_), KESTREL_OK);
  ExpectRecordsRestored();
  ExpectNothingLeft();
}

TEST_P(AllocationFailure, OtherFailuresRestoreTheRecordsToo) {
  src_.format = 0x20000000;
  EXPECT_EQ(Create(), KESTREL_UNSUPPORTED);
  EXPECT_EQ(handle_, nullptr);
  EXPECT_EQ(src_.format, 0x20000000u);
  src_.format = job_.srcCode;
  ExpectRecordsRestored();
  ExpectNothingLeft();

  ResetRecords();
  src_.width = 1;
  dst_.width = 65537;  // a step of 0 is noticed last, when everything has been allocated
  EXPECT_EQ(Create(), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(handle_, nullptr);
  dst_.width = kWidth;
  ExpectRecordsRestored();
  ExpectNothingLeft();
}

INSTANTIATE_TEST_SUITE_P(Paths, AllocationFailure,
                         testing::Combine(testing::ValuesIn(kJobs),
                                          testing::Values(1u, 3u, MPP_PASS_TILED)),
                         [](const testing::TestParamInfo<AllocationFailure::ParamType>& param) {
                           return std::string(std::get<0>(param.param).name) +
                                  (std::get<1>(param.param) == MPP_PASS_TILED
                                       ? "Tiled"
                                       : "Mode" + std::to_string(std::get<1>(param.param)));
                         });

MBITMAP Descriptor(uint32_t code, int32_t width, int32_t height, TestImage& image) {
  MBITMAP bitmap = {code, width, height, {}, {}};
  for (int i = 0; i < 3; ++i) {
    bitmap.pitch[i] = image.pitches()[i];
    bitmap.plane[i] = image.planes()[i];
  }
  return bitmap;
}

class OneShotFailure : public testing::TestWithParam<Job> {};

TEST_P(OneShotFailure, EachRequestFailsOnce) {
  const Job job = GetParam();
  ImageShape dstShape;
  ImageShape srcShape;
  ASSERT_TRUE(ShapeOf(job.dstCode, &dstShape));
  ASSERT_TRUE(ShapeOf(job.srcCode, &srcShape));
  TestImage source(srcShape, 24, 26, nullptr, true);
  TestImage destination(dstShape, 36, 20, nullptr, true);
  source.Fill(1);
  MBITMAP src = Descriptor(job.srcCode, 24, 26, source);
  MBITMAP dst = Descriptor(job.dstCode, 36, 20, destination);
  const MBITMAP srcBefore = src;
  const MBITMAP dstBefore = dst;
  const size_t liveBefore = tessel_double::LiveBlocks();

  tessel_double::Reset();
  destination.Fill(2);
  ASSERT_EQ(ConvertCS(&src, &dst), KESTREL_OK);
  EXPECT_TRUE(destination.Changed());
  const size_t requests = tessel_double::Requests().size();
  const size_t perPass = job.tableSize != 0 ? 3 : 2;
  ASSERT_EQ(requests, 1 + 3 * perPass);

  for (size_t n = 1; n <= requests; ++n) {
    SCOPED_TRACE("request " + std::to_string(n));
    tessel_double::Reset();
    tessel_double::FailNth(n);
    destination.Fill(2);
    const bool isTable = n > 1 && (n - 2) % perPass == 2;
    EXPECT_EQ(ConvertCS(&src, &dst), isTable ? KESTREL_OK : KESTREL_OUT_OF_MEMORY);
    if (!isTable) {
      EXPECT_FALSE(destination.Changed());
    }
    EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore);
    for (const std::string& fault : tessel_double::Faults()) ADD_FAILURE() << fault;
  }
  EXPECT_EQ(memcmp(&src, &srcBefore, sizeof src), 0);
  EXPECT_EQ(memcmp(&dst, &dstBefore, sizeof dst), 0);
}

class OneShotWithoutTables : public testing::TestWithParam<Job> {};

TEST_P(OneShotWithoutTables, NothingIsWritten) {
  const Job job = GetParam();
  ImageShape dstShape;
  ImageShape srcShape;
  ASSERT_TRUE(ShapeOf(job.dstCode, &dstShape));
  ASSERT_TRUE(ShapeOf(job.srcCode, &srcShape));
  TestImage source(srcShape, 24, 26, nullptr, true);
  TestImage destination(dstShape, 36, 20, nullptr, true);
  destination.Fill(2);
  MBITMAP src = Descriptor(job.srcCode, 24, 26, source);
  MBITMAP dst = Descriptor(job.dstCode, 36, 20, destination);
  tessel_double::Reset();
  tessel_double::FailSize(job.tableSize);
  EXPECT_EQ(ConvertCS(&src, &dst), KESTREL_OK);
  EXPECT_FALSE(destination.Changed());
}

std::string JobName(const testing::TestParamInfo<Job>& param) {
  return param.param.name;
}
INSTANTIATE_TEST_SUITE_P(Paths, OneShotFailure, testing::ValuesIn(OneShotJobs(false)), JobName);
INSTANTIATE_TEST_SUITE_P(Paths, OneShotWithoutTables, testing::ValuesIn(OneShotJobs(true)),
                         JobName);

class BufferFailure : public testing::TestWithParam<uint32_t> {};

TEST_P(BufferFailure, DescriptorKeepsItsPlanes) {
  const size_t liveBefore = tessel_double::LiveBlocks();
  tessel_double::Reset();
  tessel_double::FailNth(1);
  MBITMAP bitmap = {GetParam(), 30, 20, {}, {}};
  MBITMAP before = bitmap;
  EXPECT_EQ(MBitmapAlloc(&bitmap), KESTREL_OUT_OF_MEMORY);
  EXPECT_EQ(memcmp(&bitmap, &before, sizeof bitmap), 0);
  EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore);

  tessel_double::Reset();
  ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
  EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore + 1);
  before = bitmap;
  before.width = bitmap.width = 34;
  tessel_double::FailAbove(1);
  EXPECT_EQ(MBitmapAlloc(&bitmap), KESTREL_OUT_OF_MEMORY);
  EXPECT_EQ(memcmp(&bitmap, &before, sizeof bitmap), 0);
  memset(bitmap.plane[0], 0x11, static_cast<size_t>(bitmap.pitch[0]) * 20);  // still allocated

  tessel_double::Reset();
  EXPECT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);  // takes a new block and gives the old one back
  EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore + 1);
  EXPECT_EQ(tessel_double::Requests().size(), 1u);
  EXPECT_EQ(tessel_double::LiveBytes(), tessel_double::Requests()[0]);
  EXPECT_EQ(MBitmapFree(&bitmap), KESTREL_OK);
  EXPECT_EQ(tessel_double::LiveBlocks(), liveBefore);
  const MBITMAP cleared = {};
  EXPECT_EQ(memcmp(&bitmap, &cleared, sizeof bitmap), 0);
  EXPECT_EQ(MBitmapFree(&bitmap), KESTREL_OK) << "a cleared descriptor owns nothing";
  for (const std::string& fault : tessel_double::Faults()) ADD_FAILURE() << fault;
}

INSTANTIATE_TEST_SUITE_P(Formats, BufferFailure,
                         testing::Values(0x17000777u, 0x37001777u, 0x16000555u, 0x44000000u,
                                         0x15000454u, 0x50001010u, 0x64000000u, 0x50000811u,
                                         0x50000a11u, 0x50000810u, 0x50000801u, 0x50000800u,
                                         0x70000002u, 0x70001003u));

}  // namespace
}  // namespace robustness
