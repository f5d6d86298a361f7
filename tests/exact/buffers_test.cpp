// Buffer lengths, allocation of image planes, the plane dump, the time stamp, one-shot conversion.
#include "jni/bitmap_buffers.h"

#include <sys/time.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <map>
#include <string>

#include "exact_support.h"
#include "platform/tessel/tessel.h"
#include "tests/support/guarded_buffer.h"

// This program's own base library: it knows every block and its size, and can refuse one.
namespace {
std::map<void*, uint32_t> blocks;
uint32_t allocations;
bool poolWasNull = true;
constexpr uint32_t kNever = UINT32_MAX;
uint32_t failingAllocation = kNever;
}  // namespace

extern "C" void* MMemAlloc(void* pool, uint32_t size) {
  poolWasNull = poolWasNull && pool == nullptr;
  if (allocations++ == failingAllocation) return nullptr;
  void* block = malloc(size != 0 ? size : 1);
  if (block != nullptr) {
    memset(block, 0xCD, size);
    blocks[block] = size;
  }
  return block;
}

extern "C" void MMemFree(void* pool, void* block) {
  poolWasNull = poolWasNull && pool == nullptr;
  if (block == nullptr) return;
  EXPECT_EQ(blocks.erase(block), 1u) << "freed a block that is not one";
  free(block);
}

extern "C" void* MMemCpy(void* dst, const void* src, uint32_t size) {
  return memcpy(dst, src, size);
}
extern "C" void* MMemSet(void* dst, int32_t value, uint32_t size) {
  return memset(dst, value, size);
}

namespace kestrel::test {
namespace {

class Buffers : public testing::Test {
 protected:
  void SetUp() override {
    allocations = 0;
    failingAllocation = kNever;
    poolWasNull = true;
  }
  void TearDown() override {
    failingAllocation = kNever;
    EXPECT_TRUE(blocks.empty()) << "blocks left behind";
    EXPECT_TRUE(poolWasNull);
  }
};

// ---- lengths ----

TEST(BufferLength, OfEveryFormat) {
  struct Row {
    uint32_t code;
    uint32_t length;  // of 100 x 50, that is 112 x 64 when rounded up to 16
  };
  const Row rows[] = {
      {0x50000801, 112 * 64 + 112 * 32 * 2},
      {0x50000810, 112 * 64 + 64 * 56 * 2},
      {0x50001810, 112 * 64 + 64 * 56 * 2},
      {0x50000811, 112 * 64 + 32 * 56 * 2},
      {0x50000a11, 112 * 64 + 32 * 56 * 2},
      {0x50000800, 112 * 64 * 3},
      {0x50001800, 112 * 64 * 3},
      {0x64000000, 112 * 64},
      {0x64001000, 112 * 64},
      {0x70000002, 112 * 96},
      {0x70000003, 112 * 96},
      {0x70001002, 112 * 96},
      {0x70001003, 112 * 96},
      {0x17000777, 400 * 50},
      {0x17001777, 400 * 50},
      {0x37000777, 400 * 50},
      {0x37001777, 400 * 50},
      {0x15000454, 200 * 50},
      {0x15001454, 200 * 50},
      {0x50000410, 200 * 50},
      {0x50000610, 200 * 50},
      {0x16000555, 300 * 50},
      {0x16000777, 300 * 50},
      {0x16001555, 300 * 50},
      {0x16001777, 300 * 50},
      {0x44000000, 100 * 50},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(getBufferLength(row.code, 100, 50), row.length) << std::hex << row.code;
  }
}

TEST(BufferLength, RoundsRowsUpToWholeWords) {
  EXPECT_EQ(getBufferLength(FORMAT_RGB565, 3, 5), 8u * 5);
  EXPECT_EQ(getBufferLength(FORMAT_RGB888, 3, 5), 12u * 5);
  EXPECT_EQ(getBufferLength(FORMAT_RGB888, 5, 1), 16u);
  EXPECT_EQ(getBufferLength(FORMAT_INDEX8, 5, 2), 8u * 2);
  EXPECT_EQ(getBufferLength(FORMAT_XBGR8888, 3, 5), 12u * 5);
}

TEST(BufferLength, RoundsPlanarSidesUpTo16) {
  EXPECT_EQ(getBufferLength(FORMAT_NV21, 1, 1), 16u * 24);
  EXPECT_EQ(getBufferLength(FORMAT_NV21, 16, 16), 16u * 24);
  EXPECT_EQ(getBufferLength(FORMAT_NV21, 17, 16), 32u * 24);
  EXPECT_EQ(getBufferLength(FORMAT_GRAY8, 16, 17), 16u * 32);
}

TEST(BufferLength, OfFormatsThatAreNotListedIsZero) {
  for (uint32_t code : {0u, 0x50001801u, 0x50001811u, 0x50001a11u, 0x50000010u, 0x50001010u,
                        0x50000210u, 0x41000000u, 0x43000000u, 0x70000004u, 0x70002002u,
                        0x64002000u, 0x15000555u, 0xFFFFFFFFu}) {
    EXPECT_EQ(getBufferLength(code, 100, 50), 0u) << std::hex << code;
  }
}

TEST(BufferLength, OfNoSizeOrTooMuchIsZero) {
  for (uint32_t code : {FORMAT_NV21, FORMAT_RGB565, FORMAT_XBGR8888, FORMAT_GRAY8}) {
    EXPECT_EQ(getBufferLength(code, 0, 50), 0u);
    EXPECT_EQ(getBufferLength(code, 100, 0), 0u);
    EXPECT_EQ(getBufferLength(code, -100, 50), 0u);
    EXPECT_EQ(getBufferLength(code, -100, -50), 0u);
    EXPECT_EQ(getBufferLength(code, INT32_MIN, INT32_MAX), 0u);
    EXPECT_EQ(getBufferLength(code, INT32_MAX, INT32_MAX), 0u);
  }
}

TEST(BufferLength, ReachesTheGreatestSignedNumber) {
  EXPECT_EQ(getBufferLength(FORMAT_XBGR8888, 536870911, 1), 2147483644u);
  EXPECT_EQ(getBufferLength(FORMAT_XBGR8888, 536870912, 1), 0u);
  EXPECT_EQ(getBufferLength(FORMAT_XBGR8888, 32768, 16384), 0u);
  EXPECT_EQ(getBufferLength(FORMAT_GRAY8, 134217712, 16), 134217712u * 16);
  EXPECT_EQ(getBufferLength(FORMAT_GRAY8, 134217713, 16), 0u);
  for (uint32_t code : {FORMAT_NV21, FORMAT_RGB565, FORMAT_RGB888, FORMAT_INDEX8, FORMAT_I444}) {
    EXPECT_EQ(getBufferLength(code, INT32_MAX, 1), 0u) << std::hex << code;
    EXPECT_EQ(getBufferLength(code, 1, INT32_MAX), 0u) << std::hex << code;
  }
}

// ---- allocation ----

struct Allocated {
  uint32_t code;
  int32_t pitch[3];
  uint32_t size;
  int32_t plane1, plane2;  // offsets in the block, -1 for null
};

// For 100 x 50: rows of 112 and 64 lines after rounding up to 16.
const Allocated kAllocated[] = {
    {0x17000777, {400, 0, 0}, 400 * 50, -1, -1},
    {0x17001777, {400, 0, 0}, 400 * 50, -1, -1},
    {0x37000777, {400, 0, 0}, 400 * 50, -1, -1},
    {0x37001777, {400, 0, 0}, 400 * 50, -1, -1},
    {0x16000555, {300, 0, 0}, 300 * 50, -1, -1},
    {0x16001555, {300, 0, 0}, 300 * 50, -1, -1},
    {0x16000777, {300, 0, 0}, 300 * 50, -1, -1},
    {0x16001777, {300, 0, 0}, 300 * 50, -1, -1},
    {0x44000000, {100, 0, 0}, 100 * 50, -1, -1},
    {0x15000454, {200, 0, 0}, 200 * 50, -1, -1},
    {0x15001454, {200, 0, 0}, 200 * 50, -1, -1},
    {0x50000410, {200, 0, 0}, 200 * 50, -1, -1},
    {0x50000610, {200, 0, 0}, 200 * 50, -1, -1},
    {0x50001010, {200, 0, 0}, 200 * 50, -1, -1},
    {0x64000000, {112, 0, 0}, 112 * 64, -1, -1},
    {0x64001000, {112, 0, 0}, 112 * 64, -1, -1},
    {0x50000811, {112, 56, 56}, 112 * 64 + 56 * 32 * 2, 112 * 64, 112 * 64 + 56 * 32},
    {0x50000a11, {112, 56, 56}, 112 * 64 + 56 * 32 * 2, 112 * 64, 112 * 64 + 56 * 32},
    {0x50001811, {112, 56, 56}, 112 * 64 + 56 * 32 * 2, 112 * 64, 112 * 64 + 56 * 32},
    {0x50000810, {112, 56, 56}, 64 * 224, 112 * 64, 112 * 64 + 56 * 64},
    {0x50001810, {112, 56, 56}, 64 * 224, 112 * 64, 112 * 64 + 56 * 64},
    {0x50000801, {112, 112, 112}, 112 * 128, 112 * 64, 112 * 96},
    {0x50001801, {112, 112, 112}, 112 * 128, 112 * 64, 112 * 96},
    {0x50000800, {112, 112, 112}, 112 * 192, 112 * 64, 112 * 128},
    {0x50001800, {112, 112, 112}, 112 * 192, 112 * 64, 112 * 128},
    {0x70000002, {112, 112, 112}, 112 * 96, 112 * 64 + 1, 112 * 64},
    {0x70001002, {112, 112, 112}, 112 * 96, 112 * 64 + 1, 112 * 64},
    {0x70000003, {112, 112, 112}, 112 * 96, 112 * 64, 112 * 64 + 1},
    {0x70001003, {112, 112, 112}, 112 * 96, 112 * 64, 112 * 64 + 1},
};

MBITMAP Fresh(uint32_t code, int32_t width, int32_t height) {
  MBITMAP bitmap{};
  bitmap.format = code;
  bitmap.width = width;
  bitmap.height = height;
  return bitmap;
}

void ExpectPlane(const MBITMAP& bitmap, int plane, int32_t offset) {
  EXPECT_EQ(bitmap.plane[plane], offset < 0 ? nullptr : bitmap.plane[0] + offset) << plane;
}

TEST_F(Buffers, OfEveryFormat) {
  for (const Allocated& row : kAllocated) {
    SCOPED_TRACE(testing::Message() << std::hex << row.code);
    MBITMAP bitmap = Fresh(row.code, 100, 50);
    ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
    EXPECT_EQ(bitmap.format, row.code);
    EXPECT_EQ(bitmap.width, 100);
    EXPECT_EQ(bitmap.height, 50);
    for (int i = 0; i < 3; ++i) EXPECT_EQ(bitmap.pitch[i], row.pitch[i]) << i;
    ASSERT_EQ(blocks.count(bitmap.plane[0]), 1u);
    EXPECT_EQ(blocks[bitmap.plane[0]], row.size);
    ExpectPlane(bitmap, 1, row.plane1);
    ExpectPlane(bitmap, 2, row.plane2);
    EXPECT_EQ(MBitmapFree(&bitmap), KESTREL_OK);
    const MBITMAP cleared{};
    EXPECT_EQ(memcmp(&bitmap, &cleared, sizeof bitmap), 0);
  }
}

TEST_F(Buffers, OfOddSizesRoundTheirRows) {
  const struct {
    uint32_t code;
    int32_t pitch;
    uint32_t size;
  } rows[] = {{FORMAT_RGB565, 8, 8 * 5}, {FORMAT_RGB888, 12, 12 * 5},
              {FORMAT_INDEX8, 4, 4 * 5}, {FORMAT_XBGR8888, 12, 12 * 5},
              {FORMAT_UYVY, 8, 8 * 5},   {FORMAT_GRAY8, 16, 16 * 16}};
  for (const auto& row : rows) {
    MBITMAP bitmap = Fresh(row.code, 3, 5);
    ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
    EXPECT_EQ(bitmap.pitch[0], row.pitch) << std::hex << row.code;
    EXPECT_EQ(blocks[bitmap.plane[0]], row.size) << std::hex << row.code;
    MBitmapFree(&bitmap);
  }
}

TEST_F(Buffers, KeepThreeGivenPitches) {
  const struct {
    uint32_t code;
    uint32_t size;
    int32_t plane1, plane2;
  } rows[] = {{FORMAT_I420, 64 * 200 + 32 * 90 + 32 * 80, 64 * 200, 64 * 200 + 32 * 90},
              // V comes first: the U plane, in slot 2, is walked with pitch 1.
              {FORMAT_YV12, 64 * 200 + 32 * 90 + 32 * 90, 64 * 200, 64 * 200 + 32 * 90},
              {FORMAT_I422, 64 * (200 + 90 + 80), 64 * 200, 64 * 200 + 64 * 90},
              {FORMAT_I440, 64 * 200 + 32 * 90 + 32 * 80, 64 * 200, 64 * 200 + 32 * 90},
              {FORMAT_I444, 64 * (200 + 90 + 80), 64 * 200, 64 * 200 + 64 * 90},
              {FORMAT_NV12, 64 * 200 + 32 * 90, 64 * 200, 64 * 200 + 1},
              {FORMAT_NV21, 64 * 200 + 32 * 90, 64 * 200 + 1, 64 * 200}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.code);
    MBITMAP bitmap = Fresh(row.code, 100, 50);
    bitmap.pitch[0] = 200;
    bitmap.pitch[1] = 90;
    bitmap.pitch[2] = 80;
    ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
    EXPECT_EQ(bitmap.pitch[0], 200);
    EXPECT_EQ(bitmap.pitch[1], 90);
    EXPECT_EQ(bitmap.pitch[2], 80);
    EXPECT_EQ(blocks[bitmap.plane[0]], row.size);
    ExpectPlane(bitmap, 1, row.plane1);
    ExpectPlane(bitmap, 2, row.plane2);
    MBitmapFree(&bitmap);
  }
}

TEST_F(Buffers, OfPairsOfChromaHoldRowsOfTheLongerPitch) {
  for (const uint32_t code : {FORMAT_NV12, FORMAT_NV21}) {
    for (const int longer : {1, 2}) {
      MBITMAP bitmap = Fresh(code, 100, 50);
      bitmap.pitch[0] = bitmap.pitch[1] = bitmap.pitch[2] = 112;
      bitmap.pitch[longer] = 400;
      ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
      EXPECT_EQ(blocks[bitmap.plane[0]], 64u * 112 + 32 * 400) << std::hex << code;
      MBitmapFree(&bitmap);
    }
  }
}

TEST_F(Buffers, RecomputeThreePitchesWhenOneIsZero) {
  for (const Allocated& row : kAllocated) {
    if (row.pitch[1] == 0) continue;
    for (int zero = 0; zero < 3; ++zero) {
      MBITMAP bitmap = Fresh(row.code, 100, 50);
      for (int i = 0; i < 3; ++i) bitmap.pitch[i] = i == zero ? 0 : 999;
      ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
      for (int i = 0; i < 3; ++i) EXPECT_EQ(bitmap.pitch[i], row.pitch[i]);
      MBitmapFree(&bitmap);
    }
  }
}

TEST_F(Buffers, KeepAGivenPitchOfOnePlane) {
  MBITMAP bitmap = Fresh(FORMAT_XBGR8888, 100, 50);
  bitmap.pitch[0] = 512;
  ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
  EXPECT_EQ(bitmap.pitch[0], 512);
  EXPECT_EQ(bitmap.pitch[1], 0);
  EXPECT_EQ(blocks[bitmap.plane[0]], 512u * 50);
  EXPECT_EQ(bitmap.plane[1], nullptr);
  EXPECT_EQ(bitmap.plane[2], nullptr);
  MBitmapFree(&bitmap);
}

TEST_F(Buffers, KeepGivenChromaPitchesOfOnePlaneAndCountPlanesByThem) {
  MBITMAP bitmap = Fresh(FORMAT_XBGR8888, 100, 50);
  bitmap.pitch[1] = 7;
  bitmap.pitch[2] = 9;
  ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
  EXPECT_EQ(bitmap.pitch[0], 400);
  EXPECT_EQ(bitmap.pitch[1], 7);
  EXPECT_EQ(bitmap.pitch[2], 9);
  EXPECT_EQ(blocks[bitmap.plane[0]], 400u * 50) << "the block holds the one plane only";
  ExpectPlane(bitmap, 1, 400 * 50);
  ExpectPlane(bitmap, 2, 400 * 50 + 50 * 7);
  MBitmapFree(&bitmap);
}

TEST_F(Buffers, AllocatedAgainFreeTheEarlierBlock) {
  MBITMAP bitmap = Fresh(FORMAT_NV21, 100, 50);
  ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
  ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
  EXPECT_EQ(blocks.size(), 1u);
  EXPECT_EQ(blocks.count(bitmap.plane[0]), 1u);
  MBitmapFree(&bitmap);
}

void ExpectUnchangedFailure(MBITMAP bitmap, uint32_t code) {
  static uint8_t marker[3];
  const bool owned = bitmap.plane[0] != nullptr;
  bitmap.plane[1] = marker + 1;
  bitmap.plane[2] = marker + 2;
  const MBITMAP before = bitmap;
  const size_t blocksBefore = blocks.size();
  EXPECT_EQ(MBitmapAlloc(&bitmap), code);
  EXPECT_EQ(memcmp(&bitmap, &before, sizeof bitmap), 0);
  EXPECT_EQ(blocks.size(), blocksBefore);
  EXPECT_EQ(owned, bitmap.plane[0] != nullptr);
}

TEST_F(Buffers, RefuseSizesBelowOne) {
  for (int32_t bad : {0, -1, INT32_MIN}) {
    ExpectUnchangedFailure(Fresh(FORMAT_NV21, bad, 50), KESTREL_UNSUPPORTED);
    ExpectUnchangedFailure(Fresh(FORMAT_NV21, 100, bad), KESTREL_UNSUPPORTED);
    ExpectUnchangedFailure(Fresh(FORMAT_RGB565, bad, bad), KESTREL_UNSUPPORTED);
  }
}

TEST_F(Buffers, RefuseFormatsThatAreNotListed) {
  for (uint32_t code : {0u, 0x50000010u, 0x50000210u, 0x50000000u, 0x50001a11u, 0x50002811u,
                        0x70000004u, 0x70000008u, 0x70002002u, 0x64002000u, 0x41000000u,
                        0x43000000u, 0x37004777u, 0x15000333u, 0x50001410u}) {
    SCOPED_TRACE(testing::Message() << std::hex << code);
    ExpectUnchangedFailure(Fresh(code, 100, 50), KESTREL_UNSUPPORTED);
  }
}

TEST_F(Buffers, WithoutMemoryKeepTheirDescriptorAndBlock) {
  failingAllocation = allocations;
  ExpectUnchangedFailure(Fresh(FORMAT_NV21, 100, 50), KESTREL_OUT_OF_MEMORY);
  MBITMAP bitmap = Fresh(FORMAT_NV21, 100, 50);
  ASSERT_EQ(MBitmapAlloc(&bitmap), KESTREL_OK);
  failingAllocation = allocations;
  ExpectUnchangedFailure(bitmap, KESTREL_OUT_OF_MEMORY);
  MBitmapFree(&bitmap);
}

TEST_F(Buffers, ThatFitNoBlockOrHaveANegativePitchAnswerOutOfMemory) {
  for (uint32_t code :
       {FORMAT_NV21, FORMAT_I444, FORMAT_XBGR8888, FORMAT_RGB565, FORMAT_GRAY8, FORMAT_INDEX8}) {
    ExpectUnchangedFailure(Fresh(code, INT32_MAX, INT32_MAX), KESTREL_OUT_OF_MEMORY);
    MBITMAP bitmap = Fresh(code, 100, 50);
    for (int32_t& pitch : bitmap.pitch) pitch = -112;
    ExpectUnchangedFailure(bitmap, KESTREL_OUT_OF_MEMORY);
  }
  ExpectUnchangedFailure(Fresh(FORMAT_XBGR8888, 65536, 65536), KESTREL_OUT_OF_MEMORY);
  EXPECT_EQ(allocations, 0u) << "such sizes are never asked for";
}

TEST_F(Buffers, AreFreedAndClearedEvenWhenEmpty) {
  EXPECT_EQ(MBitmapFree(nullptr), KESTREL_BAD_ARGUMENT);
  MBITMAP bitmap = Fresh(FORMAT_NV21, 100, 50);
  EXPECT_EQ(MBitmapFree(&bitmap), KESTREL_OK);
  const MBITMAP cleared{};
  EXPECT_EQ(memcmp(&bitmap, &cleared, sizeof bitmap), 0);
}

// ---- dump ----

class Dump : public testing::Test {
 protected:
  void SetUp() override {
    path_ = testing::TempDir() + "kestrel_dump_" +
            testing::UnitTest::GetInstance()->current_test_info()->name();
  }
  void TearDown() override { remove(path_.c_str()); }

  Bytes Read() const {
    std::ifstream file(path_, std::ios::binary);
    return Bytes(std::istreambuf_iterator<char>(file), {});
  }
  Bytes Written(const MBITMAP& bitmap) const {
    dumpBitmap2(path_.c_str(), &bitmap);
    return Read();
  }

  std::string path_;
};

// Three planes of 16 x 16 whose bytes tell plane, row and column.
struct Sheet {
  Bytes bytes[3];
  MBITMAP bitmap;

  Sheet(uint32_t code, int32_t width, int32_t height, int32_t chromaPitch = 24)
      : bitmap(Fresh(code, width, height)) {
    for (int i = 0; i < 3; ++i) {
      bitmap.pitch[i] = i == 0 ? 28 : chromaPitch;
      bytes[i].resize(28 * 16);
      for (size_t at = 0; at < bytes[i].size(); ++at) {
        bytes[i][at] = static_cast<uint8_t>(85 * i + at % 251);
      }
      bitmap.plane[i] = bytes[i].data();
    }
  }
  void Append(Bytes* out, int plane, int32_t rows, int32_t rowBytes) const {
    for (int32_t row = 0; row < rows; ++row) {
      const uint8_t* start = bitmap.plane[plane] + row * bitmap.pitch[plane];
      out->insert(out->end(), start, start + rowBytes);
    }
  }
};

TEST_F(Dump, OfOnePlaneHoldsItsRowsWithoutPadding) {
  const struct {
    uint32_t code;
    int32_t pixelBytes;
  } rows[] = {{0x15000454, 2}, {0x15001454, 2}, {0x50000010, 2}, {0x50001010, 2}, {0x16000777, 3},
              {0x16001777, 3}, {0x50001000, 3}, {0x17000777, 4}, {0x17001777, 4}, {0x37000777, 4},
              {0x37001777, 4}, {0x37004777, 4}, {0x37005777, 4}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.code);
    const Sheet sheet(row.code, 5, 7, 0);
    Bytes expected;
    sheet.Append(&expected, 0, 7, 5 * row.pixelBytes);
    EXPECT_EQ(Written(sheet.bitmap), expected);
  }
}

TEST_F(Dump, OfPlanarImagesAddsHalvedChromaRoundedDown) {
  const struct {
    uint32_t code;
    int32_t rowBytes, rows;  // of 11 x 7
  } rows[] = {{0x50000811, 5, 3},  {0x50001811, 5, 3},  {0x50001a11, 5, 3},
              {0x50000810, 5, 7},  {0x50001810, 5, 7},  {0x50000801, 11, 3},
              {0x50001801, 11, 3}, {0x50000800, 11, 7}, {0x50001800, 11, 7}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.code);
    const Sheet sheet(row.code, 11, 7);
    Bytes expected;
    sheet.Append(&expected, 0, 7, 11);
    sheet.Append(&expected, 1, row.rows, row.rowBytes);
    sheet.Append(&expected, 2, row.rows, row.rowBytes);
    EXPECT_EQ(Written(sheet.bitmap), expected);
  }
}

TEST_F(Dump, OfPlanarImagesSkipsPlanesWithoutPitch) {
  for (int skipped = 1; skipped < 3; ++skipped) {
    Sheet sheet(0x50000811, 8, 8);
    sheet.bitmap.pitch[skipped] = 0;
    Bytes expected;
    sheet.Append(&expected, 0, 8, 8);
    sheet.Append(&expected, 3 - skipped, 4, 4);
    EXPECT_EQ(Written(sheet.bitmap), expected);
  }
}

TEST_F(Dump, LooksAtNothingBeyondTheRecord) {
  const Sheet sheet(0x50000811, 8, 8);
  testing_support::GuardedBuffer page(sizeof(MBITMAP));
  void* const last = page.Place(sizeof(MBITMAP), testing_support::GuardedBuffer::Edge::kEnd);
  memcpy(last, &sheet.bitmap, sizeof(MBITMAP));
  EXPECT_EQ(Written(*static_cast<const MBITMAP*>(last)), Written(sheet.bitmap));
}

TEST_F(Dump, OfNv12RoundsChromaRowsDownAndOfNv21Up) {
  const struct {
    uint32_t code;
    int plane;
    int32_t height, rows;
  } rows[] = {{0x70000003, 1, 7, 3}, {0x70001003, 1, 7, 3}, {0x70000002, 2, 7, 4},
              {0x70001002, 2, 7, 4}, {0x70000003, 1, 8, 4}, {0x70000002, 2, 8, 4}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << row.code << " " << row.height);
    const Sheet sheet(row.code, 11, row.height);
    Bytes expected;
    sheet.Append(&expected, 0, row.height, 11);
    sheet.Append(&expected, row.plane, row.rows, 12);
    EXPECT_EQ(Written(sheet.bitmap), expected);
  }
}

TEST_F(Dump, ReplacesAnEarlierFile) {
  std::ofstream(path_) << std::string(5000, 'x');
  const Sheet sheet(0x17000777, 2, 2, 0);
  EXPECT_EQ(Written(sheet.bitmap).size(), 16u);
}

TEST_F(Dump, ThatCannotBeOpenedIsSilent) {
  const Sheet sheet(0x17000777, 2, 2, 0);
  const std::string nowhere = testing::TempDir() + "kestrel_no_such_folder/file";
  dumpBitmap2(nowhere.c_str(), &sheet.bitmap);
  EXPECT_FALSE(std::ifstream(nowhere).good());
}

// ---- time ----

TEST(TimeStamp, IsTheWallClockInMilliseconds) {
  const auto now = [] {
    timeval time;
    gettimeofday(&time, nullptr);
    return static_cast<uint32_t>(static_cast<uint64_t>(time.tv_sec) * 1000 +
                                 static_cast<uint64_t>(time.tv_usec) / 1000);
  };
  const uint32_t before = now();
  const uint32_t stamp = getCurrentTimeStamp();
  const uint32_t after = now();
  EXPECT_LE(stamp - before, after - before);
}

// ---- one-shot conversion ----

class OneShot : public Buffers {
 protected:
  void TearDown() override {
    if (src_.plane[0] != nullptr) MBitmapFree(&src_);
    if (dst_.plane[0] != nullptr) MBitmapFree(&dst_);
    Buffers::TearDown();
  }
  void Make(uint32_t srcCode, int32_t srcWidth, int32_t srcHeight, uint32_t dstCode,
            int32_t dstWidth, int32_t dstHeight) {
    src_ = Fresh(srcCode, srcWidth, srcHeight);
    dst_ = Fresh(dstCode, dstWidth, dstHeight);
    ASSERT_EQ(MBitmapAlloc(&src_), KESTREL_OK);
    ASSERT_EQ(MBitmapAlloc(&dst_), KESTREL_OK);
    for (uint32_t i = 0; i < blocks[src_.plane[0]]; ++i)
      src_.plane[0][i] = uint8_t(i * 37 + i / 256);
  }

  MBITMAP src_{};
  MBITMAP dst_{};
};

TEST_F(OneShot, OfEqualFormatsAndSizesCopies) {
  Make(FORMAT_NV21, 64, 48, FORMAT_NV21, 64, 48);
  ASSERT_EQ(ConvertCS(&src_, &dst_), KESTREL_OK);
  EXPECT_EQ(memcmp(src_.plane[0], dst_.plane[0], 64 * 48 * 3 / 2), 0);

  MBitmapFree(&src_);
  MBitmapFree(&dst_);
  Make(FORMAT_BGRX8888, 21, 13, FORMAT_BGRX8888, 21, 13);
  ASSERT_EQ(ConvertCS(&src_, &dst_), KESTREL_OK);
  EXPECT_EQ(memcmp(src_.plane[0], dst_.plane[0], 21 * 13 * 4), 0);
}

TEST_F(OneShot, IsABilinearCroppedTiledEngine) {
  Make(FORMAT_BGRX8888, 40, 20, FORMAT_NV21, 24, 24);
  const MBITMAP srcBefore = src_;
  const MBITMAP dstBefore = dst_;
  ASSERT_EQ(ConvertCS(&src_, &dst_), KESTREL_OK);
  EXPECT_EQ(memcmp(&src_, &srcBefore, sizeof src_), 0);
  EXPECT_EQ(memcmp(&dst_, &dstBefore, sizeof dst_), 0);

  MBITMAP own = Fresh(FORMAT_NV21, 24, 24);
  ASSERT_EQ(MBitmapAlloc(&own), KESTREL_OK);
  {
    const Engine engine({FORMAT_NV21, 24, 24}, {FORMAT_BGRX8888, 40, 20},
                        Param().Bilinear().Band(5).Tiled().Aspect(MPP_ASPECT_CROP));
    ASSERT_EQ(engine.result(), KESTREL_OK);
    ASSERT_EQ(MPProcess(engine.handle(), own.plane, nullptr, own.pitch, src_.plane, src_.pitch),
              KESTREL_OK);
  }
  EXPECT_EQ(memcmp(own.plane[0], dst_.plane[0], blocks[own.plane[0]]), 0);
  MBitmapFree(&own);
}

TEST_F(OneShot, ScalesAndCropsByHandComputedLevels) {
  // Four grey columns of which the middle two are kept, doubled in both directions.
  Make(FORMAT_GRAY8, 4, 2, FORMAT_GRAY8, 4, 4);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 4; ++x) src_.plane[0][src_.pitch[0] * y + x] = uint8_t(40 * x);
  }
  ASSERT_EQ(ConvertCS(&src_, &dst_), KESTREL_OK);
  const uint8_t expected[4] = {30, 50, 70, 90};
  for (int y = 0; y < 4; ++y) {
    EXPECT_EQ(memcmp(dst_.plane[0] + dst_.pitch[0] * y, expected, 4), 0) << y;
  }
}

TEST_F(OneShot, HandsUpTheFirstError) {
  Make(FORMAT_NV21, 16, 16, FORMAT_RGB565, 16, 16);
  EXPECT_EQ(ConvertCS(nullptr, &dst_), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(ConvertCS(&src_, nullptr), KESTREL_BAD_ARGUMENT);

  MBITMAP bad = src_;
  bad.format = 0x60000000;
  EXPECT_EQ(ConvertCS(&bad, &dst_), KESTREL_UNSUPPORTED);
  bad = src_;
  bad.width = 0;
  EXPECT_EQ(ConvertCS(&bad, &dst_), KESTREL_BAD_ARGUMENT);
  bad = src_;
  bad.height = -16;
  EXPECT_EQ(ConvertCS(&bad, &dst_), KESTREL_BAD_ARGUMENT);
  bad = src_;
  bad.plane[0] = nullptr;
  EXPECT_EQ(ConvertCS(&bad, &dst_), KESTREL_BAD_ARGUMENT);
  bad = dst_;
  bad.format = 0x50000911;
  EXPECT_EQ(ConvertCS(&src_, &bad), KESTREL_UNSUPPORTED);
  bad = dst_;
  bad.plane[0] = nullptr;
  EXPECT_EQ(ConvertCS(&src_, &bad), KESTREL_BAD_ARGUMENT);
  EXPECT_EQ(blocks.size(), 2u) << "the engine is gone each time";
}

TEST_F(OneShot, AnswersOutOfMemoryForTheHandle) {
  Make(FORMAT_NV21, 16, 16, FORMAT_RGB565, 16, 16);
  failingAllocation = allocations;
  EXPECT_EQ(ConvertCS(&src_, &dst_), KESTREL_OUT_OF_MEMORY);
  EXPECT_EQ(src_.format, FORMAT_NV21);
  EXPECT_EQ(dst_.format, FORMAT_RGB565);
  EXPECT_EQ(blocks.size(), 2u);
}

// ---- engines without memory ----

using EngineMemory = Buffers;

TEST_F(EngineMemory, MissingForTheHandleClearsTheCallersRecords) {
  MPPFORMAT dst = {FORMAT_RGB565, 8, 8, nullptr};
  MPPFORMAT src = {FORMAT_NV21, 8, 8, nullptr};
  MPPPARAM param = Param().Tiled().Dither().Alpha(9);
  MPPHandle marker{};
  MPPHandle* handle = &marker;
  failingAllocation = 0;
  EXPECT_EQ(MPPCreate(&dst, &src, &param, &handle), KESTREL_OUT_OF_MEMORY);
  EXPECT_EQ(handle, nullptr);
  EXPECT_EQ(dst.format, 0u);
  EXPECT_EQ(src.format, 0u);
  EXPECT_EQ(param.dither, 0u);
  EXPECT_EQ(dst.width, 8);
  EXPECT_EQ(param.passMode, MPP_PASS_TILED);
  EXPECT_EQ(param.alpha, 9u);
}

TEST_F(EngineMemory, MissingForATableLeavesAnEngineThatWritesNothing) {
  // Handle, pass engine, context, table.
  failingAllocation = 3;
  {
    const Engine engine({FORMAT_XBGR8888, 8, 8}, {FORMAT_NV21, 8, 8});
    ASSERT_EQ(engine.result(), KESTREL_OK);
    EXPECT_EQ(engine.context().table, nullptr);
    Bytes luma(64, 90), chroma(32, 100), out(256, 0xEE);
    EXPECT_EQ(Process(engine, OnePlane(out, 32), VFirst(luma, 8, chroma, 8)), KESTREL_OK);
    EXPECT_EQ(out, Bytes(256, 0xEE));
  }
  EXPECT_EQ(allocations, 4u);
}

TEST_F(EngineMemory, MissingForAPassOrContextFailsCreationAndRestoresTheRecords) {
  for (uint32_t n : {1u, 2u, 4u, 5u, 7u, 8u}) {  // pass and context of three engines with tables
    SCOPED_TRACE(n);
    allocations = 0;
    failingAllocation = n;
    MPPFORMAT dst = {FORMAT_RGB565, 8, 8, nullptr};
    MPPFORMAT src = {FORMAT_NV21, 8, 8, nullptr};
    MPPPARAM param = Param().Tiled().Dither();
    MPPHandle marker{};
    MPPHandle* handle = &marker;
    EXPECT_EQ(MPPCreate(&dst, &src, &param, &handle), KESTREL_OUT_OF_MEMORY);
    EXPECT_EQ(handle, nullptr);
    EXPECT_EQ(dst.format, FORMAT_RGB565);
    EXPECT_EQ(src.format, FORMAT_NV21);
    EXPECT_EQ(param.dither, 1u);
    EXPECT_TRUE(blocks.empty());
  }
}

}  // namespace
}  // namespace kestrel::test
