// What docs/errors-and-threads.md promises to threads: engines of their own, created, run and
// destroyed at any time, on sources that all of them read; the one-shot conversion; one frame cut
// into parts. The results are those of one thread, and ThreadSanitizer sees no race.
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "engine/postprocess.h"
#include "jni/bitmap_buffers.h"
#include "tests/robustness/case_log.h"
#include "tests/robustness/test_image.h"
#include "tests/support/instruction_sets.h"

namespace {

using robustness::ImageShape;
using robustness::kListedCodes;
using robustness::Random;
using robustness::TestImage;
using testing_support::InstructionSet;

constexpr int kThreads = 8;
constexpr int kRounds = 3;

// Runs body(thread) on all threads, which start at once, and returns what they complain about.
std::vector<std::string> OnThreads(const std::function<std::string(int)>& body) {
  std::atomic<int> waiting{kThreads};
  std::vector<std::string> complaints(kThreads);
  std::vector<std::thread> threads;
  threads.reserve(kThreads);
  for (int thread = 0; thread < kThreads; ++thread) {
    threads.emplace_back([&waiting, &complaints, &body, thread] {
      --waiting;
      while (waiting > 0) std::this_thread::yield();
      complaints[size_t(thread)] = body(thread);
    });
  }
  for (std::thread& thread : threads) thread.join();
  complaints.erase(std::remove(complaints.begin(), complaints.end(), ""), complaints.end());
  return complaints;
}

ImageShape Shape(uint32_t code) {
  ImageShape shape;
  EXPECT_TRUE(ShapeOf(code, &shape)) << code;
  return shape;
}

// A conversion and what it gives. All threads read the same source.
class Job {
 public:
  explicit Job(uint64_t number) {
    Random random(number);
    dst_.format = random.Pick(kListedCodes);
    while (testing_support::IsIndexedCode(dst_.format)) dst_.format = random.Pick(kListedCodes);
    src_.format = random.Pick(kListedCodes);
    dst_.width = random.Between(1, 200);
    dst_.height = random.Between(1, 100);
    src_.width = random.OneIn(3) ? dst_.width : random.Between(1, 200);
    src_.height = random.OneIn(3) ? dst_.height : random.Between(1, 100);
    static const std::vector<uint8_t> palette(1024, 0x3C);
    src_.palette = palette.data();
    params_.resampleFlags = random.OneIn(2) ? MPP_BILINEAR : MPP_NEAREST;
    params_.transformCode = random.OneIn(2) ? uint32_t(random.Between(0, 7)) : 0;
    params_.passMode = random.OneIn(2) ? MPP_PASS_TILED : uint32_t(random.Between(1, 4));
    params_.dither = random.OneIn(3);
    if (random.OneIn(3)) params_.contrast = random.Between(-128, 128);
    source_ =
        std::make_unique<TestImage>(Shape(src_.format), src_.width, src_.height, nullptr, true);
    source_->Fill(number);
    TestImage image = Destination();
    isDrawn_ = Draw(&image, testing_support::InstructionSets().back()) && image.Changed();
    expected_ = image.Bytes();
  }

  bool isDrawn() const { return isDrawn_; }

  // The whole life of an engine, forced to a set. Empty when the picture is the expected one.
  std::string Run(const InstructionSet& set) const {
    TestImage image = Destination();
    if (!Draw(&image, set)) return "an engine is refused: " + Describe();
    return image.Bytes() == expected_ ? "" : "other bytes with " + set.name + ": " + Describe();
  }

 private:
  TestImage Destination() const {
    TestImage image(Shape(dst_.format), dst_.width, dst_.height, nullptr, true);
    image.FillConstant(0x5A);
    return image;
  }

  bool Draw(TestImage* image, const InstructionSet& set) const {
    MPPFORMAT dst = dst_;
    MPPFORMAT src = src_;
    MPPPARAM params = params_;
    MPPHandle* handle = nullptr;
    if (MPPCreate(&dst, &src, &params, &handle) != KESTREL_OK) return false;
    ForceRows(handle, set);
    MRECT dstRect = {0, 0, dst_.width, dst_.height};
    MRECT srcRect = {};
    MPPAlign(handle, &dstRect, &srcRect);
    const uint32_t code = MPProcess(handle, image->planes(), nullptr, image->pitches(),
                                    source_->constPlanes(), source_->pitches());
    MPPDestroy(handle);
    return code == KESTREL_OK;
  }

  std::string Describe() const {
    char text[120];
    snprintf(text, sizeof(text), "%08x %d x %d from %08x %d x %d, transform %u, pass mode %u",
             dst_.format, dst_.width, dst_.height, src_.format, src_.width, src_.height,
             params_.transformCode, params_.passMode);
    return text;
  }

  MPPFORMAT dst_ = {};
  MPPFORMAT src_ = {};
  MPPPARAM params_ = {};
  std::unique_ptr<TestImage> source_;
  std::vector<uint8_t> expected_;
  bool isDrawn_ = false;
};

TEST(Threads, EnginesOfTheirOwnShareSources) {
  constexpr size_t kJobs = 150;
  std::vector<Job> jobs;
  size_t drawn = 0;
  for (uint64_t number = 0; number < kJobs; ++number) {
    jobs.emplace_back(number);
    drawn += jobs.back().isDrawn() ? 1 : 0;
  }
  EXPECT_GT(drawn, kJobs * 9 / 10);
  const auto& sets = testing_support::InstructionSets();
  const std::vector<std::string> complaints = OnThreads([&](int thread) {
    for (size_t i = 0; i < kJobs * kRounds; ++i) {
      // Neighbours meet in the same jobs with different sets, and in different ones.
      const Job& job = jobs[(i + size_t(thread / 4) * 37) % kJobs];
      std::string complaint = job.Run(sets[(i + size_t(thread)) % sets.size()]);
      if (!complaint.empty()) return complaint;
    }
    return std::string();
  });
  EXPECT_EQ(complaints, std::vector<std::string>());
}

// An image of the library's own.
class Buffer {
 public:
  Buffer(uint32_t format, int32_t width, int32_t height) {
    bitmap_.format = format;
    bitmap_.width = width;
    bitmap_.height = height;
    size_ = MBitmapAlloc(&bitmap_) == KESTREL_OK ? getBufferLength(format, width, height) : 0;
    if (size_ > 0) memset(bitmap_.plane[0], 0, size_);
  }
  ~Buffer() { MBitmapFree(&bitmap_); }
  Buffer(const Buffer&) = delete;
  Buffer& operator=(const Buffer&) = delete;

  const MBITMAP* bitmap() const { return &bitmap_; }
  uint8_t* bytes() { return bitmap_.plane[0]; }
  size_t size() const { return size_; }
  bool operator==(const Buffer& other) const {
    return size_ == other.size_ && memcmp(bitmap_.plane[0], other.bitmap_.plane[0], size_) == 0;
  }

 private:
  MBITMAP bitmap_ = {};
  size_t size_;
};

TEST(Threads, OneShotConversionsShareASource) {
  Buffer source(FORMAT_NV21 | FORMAT_BT601_FULL, 160, 120);
  ASSERT_GT(source.size(), 0u);
  Random random(5);
  for (size_t i = 0; i < source.size(); ++i) source.bytes()[i] = uint8_t(random.Bits());
  constexpr uint32_t kFormats[] = {FORMAT_XBGR8888, FORMAT_RGB565, FORMAT_I420, FORMAT_NV21};
  std::vector<std::unique_ptr<Buffer>> expected;
  for (const uint32_t format : kFormats) {
    expected.push_back(std::make_unique<Buffer>(format, 100, 90));
    ASSERT_GT(expected.back()->size(), 0u);
    ASSERT_EQ(ConvertCS(source.bitmap(), expected.back()->bitmap()), KESTREL_OK);
  }
  const std::vector<std::string> complaints = OnThreads([&](int thread) {
    for (int i = 0; i < 30 * kRounds; ++i) {
      const size_t which = size_t(i + thread / 2) % std::size(kFormats);
      Buffer got(kFormats[which], 100, 90);
      if (ConvertCS(source.bitmap(), got.bitmap()) != KESTREL_OK) return std::string("refused");
      if (!(got == *expected[which])) return "other bytes in format " + std::to_string(which);
      getCurrentTimeStamp();
    }
    return std::string();
  });
  EXPECT_EQ(complaints, std::vector<std::string>());
}

// Equal engines, each on its share of the rows of one destination.
TEST(Threads, PartsOfOneFrame) {
  constexpr int32_t kWidth = 200;
  constexpr int32_t kRows = 16;
  constexpr int32_t kHeight = kRows * kThreads;
  for (const uint32_t dstCode : {FORMAT_XBGR8888, FORMAT_RGB565, FORMAT_NV21, FORMAT_I420}) {
    for (const uint32_t srcCode : {FORMAT_NV21, FORMAT_XBGR8888, FORMAT_I420}) {
      TestImage source(Shape(srcCode), 160, 100, nullptr, true);
      source.Fill(srcCode);
      TestImage alone(Shape(dstCode), kWidth, kHeight, nullptr, true);
      TestImage shared(Shape(dstCode), kWidth, kHeight, nullptr, true);
      alone.FillConstant(0x5A);
      shared.FillConstant(0x5A);
      const auto draw = [&](TestImage* image, const MRECT* part) {
        MPPFORMAT dst = {dstCode, kWidth, kHeight, nullptr};
        MPPFORMAT src = {srcCode, 160, 100, nullptr};
        MPPPARAM params = {};
        params.resampleFlags = MPP_BILINEAR;
        params.passMode = MPP_PASS_TILED;
        MPPHandle* handle = nullptr;
        if (MPPCreate(&dst, &src, &params, &handle) != KESTREL_OK) return std::string("refused");
        MPProcess(handle, image->planes(), part, image->pitches(), source.constPlanes(),
                  source.pitches());
        MPPDestroy(handle);
        return std::string();
      };
      ASSERT_EQ(draw(&alone, nullptr), "");
      ASSERT_TRUE(alone.Changed());
      const std::vector<std::string> complaints = OnThreads([&](int thread) {
        const MRECT part = {0, kRows * thread, kWidth, kRows * (thread + 1)};
        return draw(&shared, &part);
      });
      EXPECT_EQ(complaints, std::vector<std::string>());
      EXPECT_EQ(shared.Bytes(), alone.Bytes()) << std::hex << dstCode << " from " << srcCode;
    }
  }
}

}  // namespace
