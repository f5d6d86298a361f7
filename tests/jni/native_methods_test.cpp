// The natives in a virtual machine that fails on demand: what they call in which order, what they
// answer, and that nothing stays locked, held, referenced or allocated on any path.
#include "jni/native_methods.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <optional>
#include <string>
#include <vector>

#include "engine/format_codes.h"
#include "jni/bitmap_buffers.h"
#include "tests/jni/fake_jni.h"
#include "tests/support/tessel_double.h"

namespace {

using fake_jni::Bitmap;
using fake_jni::Failure;
using fake_jni::Machine;
using Calls = std::vector<std::string>;

constexpr uint32_t kNv21 = 0x70001002;
constexpr uint32_t kRgba = 0x37001777;
constexpr int32_t kFormatRgba = ANDROID_BITMAP_FORMAT_RGBA_8888;
constexpr char kEngineClass[] = "com/kestrel/dualcam/refocus/ImagePostProcessNativeEngine";

struct Size {
  int32_t width;
  int32_t height;
};

void PrintTo(const Size& size, std::ostream* out) {
  *out << size.width << " x " << size.height;
}

std::vector<uint8_t> Noise(size_t size) {
  std::vector<uint8_t> bytes(size);
  uint32_t state = 0x9E3779B9u + uint32_t(size);
  for (uint8_t& byte : bytes) {
    state = state * 1664525u + 1013904223u;
    byte = uint8_t(state >> 24);
  }
  return bytes;
}

size_t Nv21Length(Size size) {
  return size_t(size.width) * size_t(size.height) * 3 / 2;
}

// Native calls that a machine without the planned failures makes, each of them balanced.
class NativeMethods : public testing::Test {
 protected:
  void SetUp() override { tessel_double::Reset(); }
  void TearDown() override { EXPECT_EQ(tessel_double::LiveBlocks(), 0u); }

  static jobject NewBitmap(Machine* machine, Size size, uint32_t padding = 0,
                           int32_t format = kFormatRgba) {
    jobject bitmap = machine->BitmapArgument(uint32_t(size.width), uint32_t(size.height),
                                             uint32_t(size.width) * 4 + padding, format);
    Bitmap& fake = machine->BitmapOf(bitmap);
    const std::vector<uint8_t> noise = Noise(size_t(fake.info.stride) * fake.info.height);
    if (!noise.empty()) std::memcpy(fake.pixels, noise.data(), noise.size());
    return bitmap;
  }

  // After a native call: at most its result is still there.
  static void ExpectBalanced(const Machine& machine, jobject result) {
    EXPECT_EQ(machine.LocalReferences(), result != nullptr ? 1u : 0u);
    EXPECT_EQ(machine.HeldElements(), 0u);
    EXPECT_EQ(machine.HeldLocks(), 0);
    EXPECT_EQ(machine.faults(), Calls());
    EXPECT_EQ(tessel_double::LiveBlocks(), 0u);
    EXPECT_EQ(tessel_double::Faults(), Calls());
  }
};

// What the one-shot conversion makes of an image, with descriptors filled here.
class Converted {
 public:
  Converted(const MBITMAP& source, uint32_t format, Size size) {
    record_.format = format;
    record_.width = size.width;
    record_.height = size.height;
    EXPECT_EQ(MBitmapAlloc(&record_), 0u);
    std::memset(record_.plane[0], 0, getBufferLength(format, size.width, size.height));
    EXPECT_EQ(ConvertCS(&source, &record_), 0u);
  }
  ~Converted() { MBitmapFree(&record_); }
  Converted(const Converted&) = delete;
  Converted& operator=(const Converted&) = delete;

  const MBITMAP& record() const { return record_; }

 private:
  MBITMAP record_ = {};
};

MBITMAP Nv21Source(const std::vector<uint8_t>& bytes, Size size) {
  uint8_t* luma = const_cast<uint8_t*>(bytes.data());
  uint8_t* chroma = luma + size_t(size.width) * size_t(size.height);
  return {kNv21,
          size.width,
          size.height,
          {size.width, size.width, size.width},
          {luma, chroma + 1, chroma}};
}

// The bytes a conversion reads, with neutral chroma where an array ends early.
std::vector<uint8_t> Padded(std::vector<uint8_t> bytes, Size size) {
  bytes.resize(bytes.size() + size_t(size.width) * 2 + 16, 128);
  return bytes;
}

jobject ToBitmap(Machine* machine, jbyteArray data, Size from, Size to) {
  return JNI_ConvertCS2Bitmap(machine->env(), nullptr, data, from.width, from.height, to.width,
                              to.height);
}

// ---- Registration

using Registration = NativeMethods;

TEST_F(Registration, LoadsTheTableInItsOrder) {
  Machine machine;
  EXPECT_EQ(JNI_OnLoad(machine.vm(), nullptr), 0x10004);
  EXPECT_EQ(machine.calls(), (Calls{"GetEnv 0x10004", std::string("FindClass ") + kEngineClass,
                                    std::string("RegisterNatives ") + kEngineClass + " 2"}));
  ASSERT_EQ(machine.registered().size(), 2u);
  EXPECT_EQ(machine.registered()[0].name, "ConvertCS2Bitmap");
  EXPECT_EQ(machine.registered()[0].signature, "([BIIII)Landroid/graphics/Bitmap;");
  EXPECT_EQ(machine.registered()[0].function, reinterpret_cast<void*>(JNI_ConvertCS2Bitmap));
  EXPECT_EQ(machine.registered()[1].name, "ConvertCS2NV21");
  EXPECT_EQ(machine.registered()[1].signature, "(Landroid/graphics/Bitmap;)[B");
  EXPECT_EQ(machine.registered()[1].function, reinterpret_cast<void*>(JNI_ConvertCS2NV21));
  ExpectBalanced(machine, nullptr);
}

TEST_F(Registration, RefusesAMachineWithoutTheVersion) {
  for (const jint result : {JNI_EDETACHED, JNI_EVERSION, JNI_ERR}) {
    Machine machine;
    machine.SetGetEnvResult(result);
    EXPECT_EQ(JNI_OnLoad(machine.vm(), nullptr), -1);
    EXPECT_EQ(machine.calls(), Calls{"GetEnv 0x10004"});
    ExpectBalanced(machine, nullptr);
  }
}

TEST_F(Registration, RefusesWithoutTheClass) {
  for (const Failure how : {Failure::kQuiet, Failure::kException}) {
    Machine machine;
    machine.FailNth(1, how);
    EXPECT_EQ(JNI_OnLoad(machine.vm(), nullptr), -1);
    EXPECT_TRUE(machine.registered().empty());
    EXPECT_EQ(machine.ExceptionPending(), how == Failure::kException);
    ExpectBalanced(machine, nullptr);
  }
  Machine machine;
  machine.FailNth(1, Failure::kQuiet);
  EXPECT_EQ(register_kestrel_android_JniPP(machine.env()), -1);
}

TEST_F(Registration, RefusesWhenRegistrationFails) {
  for (const Failure how : {Failure::kQuiet, Failure::kException}) {
    Machine machine;
    machine.FailNth(2, how);
    EXPECT_EQ(JNI_OnLoad(machine.vm(), nullptr), -1);
    EXPECT_EQ(machine.ExceptionPending(), how == Failure::kException);
    ExpectBalanced(machine, nullptr);
  }
}

TEST_F(Registration, AnswersZeroUnlessTheResultIsNegative) {
  for (const jint result : {0, 1, -1, -5}) {
    Machine machine;
    machine.SetRegisterResult(result);
    EXPECT_EQ(register_kestrel_android_JniPP(machine.env()), result < 0 ? -1 : 0);
    ExpectBalanced(machine, nullptr);
  }
}

// ---- Bitmap to NV21

using ToNv21 = NativeMethods;

TEST_F(ToNv21, CallsInOrder) {
  Machine machine;
  jbyteArray array = JNI_ConvertCS2NV21(machine.env(), nullptr, NewBitmap(&machine, {64, 48}));
  ASSERT_NE(array, nullptr);
  EXPECT_EQ(machine.Deref(array).bytes.size(), 4608u);
  EXPECT_EQ(machine.calls(), (Calls{"AndroidBitmap_getInfo", "AndroidBitmap_lockPixels",
                                    "AndroidBitmap_unlockPixels", "NewByteArray 4608",
                                    "SetByteArrayRegion 0 3072", "SetByteArrayRegion 3072 1536"}));
  ExpectBalanced(machine, array);
}

// Each plane of the converted image as one run of bytes, whatever its pitch.
TEST_F(ToNv21, CopiesThePlanesAsRuns) {
  for (const Size size : {Size{64, 48},
                          {16, 2},
                          {15, 16},
                          {17, 16},
                          {100, 50},
                          {31, 33},
                          {1, 1},
                          {2, 1},
                          {1, 2},
                          {3, 3},
                          {7, 1},
                          {1, 7},
                          {639, 3}}) {
    for (const uint32_t padding : {0u, 4u, 36u}) {
      SCOPED_TRACE(testing::PrintToString(size) + " padding " + std::to_string(padding));
      Machine machine;
      jobject bitmap = NewBitmap(&machine, size, padding);
      Bitmap& fake = machine.BitmapOf(bitmap);
      const std::vector<uint8_t> before = Noise(size_t(fake.info.stride) * fake.info.height);

      jbyteArray array = JNI_ConvertCS2NV21(machine.env(), nullptr, bitmap);
      ASSERT_NE(array, nullptr);
      ExpectBalanced(machine, array);
      EXPECT_EQ(std::memcmp(fake.pixels, before.data(), before.size()), 0);

      const MBITMAP source = {kRgba,
                              size.width,
                              size.height,
                              {int32_t(fake.info.stride), 0, 0},
                              {fake.pixels, nullptr, nullptr}};
      const Converted nv21(source, kNv21, size);
      const size_t luma = size_t(size.width) * size_t(size.height);
      std::vector<uint8_t> expected(luma + luma / 2);
      std::memcpy(expected.data(), nv21.record().plane[0], luma);
      std::memcpy(expected.data() + luma, nv21.record().plane[2], luma / 2);
      EXPECT_EQ(machine.Deref(array).bytes, expected);
    }
  }
}

// Gaps between rows would otherwise show what the memory held before.
TEST_F(ToNv21, RowGapsAreZero) {
  Machine machine;
  jbyteArray array = JNI_ConvertCS2NV21(machine.env(), nullptr, NewBitmap(&machine, {20, 8}));
  ASSERT_NE(array, nullptr);
  const std::vector<uint8_t>& bytes = machine.Deref(array).bytes;
  ASSERT_EQ(bytes.size(), 240u);
  for (size_t i = 0; i < 160; ++i) {
    if (i % 32 >= 20) {
      EXPECT_EQ(bytes[i], 0) << i;
    }
  }
}

TEST_F(ToNv21, NoBitmapIsUnlockedAllTheSame) {
  Machine machine;
  EXPECT_EQ(JNI_ConvertCS2NV21(machine.env(), nullptr, nullptr), nullptr);
  EXPECT_EQ(machine.calls(), Calls{"AndroidBitmap_unlockPixels null"});
  ExpectBalanced(machine, nullptr);
  EXPECT_TRUE(tessel_double::Requests().empty());
}

TEST_F(ToNv21, OtherConfigurationsGiveNull) {
  for (const int32_t format : {ANDROID_BITMAP_FORMAT_NONE + 0, ANDROID_BITMAP_FORMAT_RGB_565 + 0,
                               ANDROID_BITMAP_FORMAT_A_8 + 0, 7, 9, -1}) {
    Machine machine;
    jobject bitmap = NewBitmap(&machine, {32, 32}, 0, format);
    EXPECT_EQ(JNI_ConvertCS2NV21(machine.env(), nullptr, bitmap), nullptr);
    EXPECT_EQ(machine.calls(), (Calls{"AndroidBitmap_getInfo", "AndroidBitmap_lockPixels",
                                      "AndroidBitmap_unlockPixels"}));
    ExpectBalanced(machine, nullptr);
    EXPECT_TRUE(tessel_double::Requests().empty());
  }
}

TEST_F(ToNv21, NoPixelsGiveNull) {
  Machine machine;
  jobject bitmap = NewBitmap(&machine, {32, 32});
  machine.BitmapOf(bitmap).pixels = nullptr;
  EXPECT_EQ(JNI_ConvertCS2NV21(machine.env(), nullptr, bitmap), nullptr);
  EXPECT_EQ(machine.calls().back(), "AndroidBitmap_unlockPixels");
  ExpectBalanced(machine, nullptr);
  EXPECT_TRUE(tessel_double::Requests().empty());
}

TEST_F(ToNv21, ImpossibleSizesGiveNull) {
  struct Claim {
    uint32_t width, height, stride;
  };
  for (const Claim claim : {Claim{0, 8, 32},
                            {8, 0, 32},
                            {0, 0, 0},
                            {0x80000000u, 1, 32},
                            {1, 0x80000000u, 32},
                            {0xFFFFFFFFu, 0xFFFFFFFFu, 32},
                            {0x7FFFFFFFu, 0x7FFFFFFFu, 32},
                            {8, 8, 0x80000000u},
                            {40000, 40000, 160000},
                            {0x7FFFFFFFu, 1, 32}}) {
    SCOPED_TRACE(claim.width);
    Machine machine;
    jobject bitmap = NewBitmap(&machine, {8, 8});
    machine.BitmapOf(bitmap).info = {claim.width, claim.height, claim.stride, kFormatRgba, 0};
    EXPECT_EQ(JNI_ConvertCS2NV21(machine.env(), nullptr, bitmap), nullptr);
    EXPECT_EQ(machine.calls().back(), "AndroidBitmap_unlockPixels");
    ExpectBalanced(machine, nullptr);
  }
}

// Every call fails once, with and without an exception, Bitmap functions with every code.
TEST_F(ToNv21, EveryCallFails) {
  size_t calls;
  {
    Machine machine;
    JNI_ConvertCS2NV21(machine.env(), nullptr, NewBitmap(&machine, {24, 10}));
    calls = machine.FailableCalls();
  }
  ASSERT_EQ(calls, 6u);
  for (size_t n = 1; n <= calls; ++n) {
    for (const int code : {-1, -2, -3}) {
      const Failure how = code == -2 || n > 3 ? Failure::kException : Failure::kQuiet;
      Machine machine;
      machine.FailNth(n, how);
      machine.SetBitmapFailure(code);
      jobject bitmap = NewBitmap(&machine, {24, 10});
      jbyteArray array = JNI_ConvertCS2NV21(machine.env(), nullptr, bitmap);
      SCOPED_TRACE(machine.calls().at(n - 1) + " " + std::to_string(code));
      // A failed unlock without an exception changes nothing.
      EXPECT_EQ(array != nullptr, n == 3 && how == Failure::kQuiet);
      EXPECT_EQ(machine.ExceptionPending(), how == Failure::kException);
      EXPECT_EQ(
          std::count(machine.calls().begin(), machine.calls().end(), "AndroidBitmap_unlockPixels"),
          1);
      ExpectBalanced(machine, array);
    }
  }
}

TEST_F(ToNv21, AnArrayThatIsNotMadeGivesNull) {
  Machine machine;
  machine.FailNth(4, Failure::kQuiet);
  EXPECT_EQ(JNI_ConvertCS2NV21(machine.env(), nullptr, NewBitmap(&machine, {24, 10})), nullptr);
  EXPECT_EQ(machine.calls().back(), "NewByteArray 360");
  ExpectBalanced(machine, nullptr);
}

// ---- NV21 to Bitmap

using FromNv21 = NativeMethods;

TEST_F(FromNv21, CallsInOrder) {
  Machine machine;
  jobject bitmap = ToBitmap(&machine, machine.ArrayArgument(Noise(4608)), {64, 48}, {32, 24});
  ASSERT_NE(bitmap, nullptr);
  EXPECT_EQ(machine.calls(), (Calls{"GetByteArrayElements", "FindClass android/graphics/Bitmap",
                                    "FindClass android/graphics/Bitmap$Config",
                                    "GetStaticFieldID ARGB_8888", "GetStaticObjectField",
                                    "GetStaticMethodID createBitmap "
                                    "(IILandroid/graphics/Bitmap$Config;)Landroid/graphics/Bitmap;",
                                    "CallStaticObjectMethod 32 24 ARGB_8888",
                                    "AndroidBitmap_getInfo", "AndroidBitmap_lockPixels",
                                    "AndroidBitmap_unlockPixels", "ReleaseByteArrayElements 0"}));
  ExpectBalanced(machine, bitmap);
}

struct Resize {
  Size from;
  Size to;
};

constexpr Resize kResizes[] = {
    {{64, 48}, {64, 48}}, {{64, 48}, {128, 96}}, {{64, 48}, {20, 15}}, {{64, 48}, {48, 64}},
    {{17, 9}, {17, 9}},   {{17, 9}, {40, 30}},   {{16, 9}, {33, 7}},   {{9, 16}, {5, 5}},
    {{1, 1}, {1, 1}},     {{1, 1}, {9, 4}},      {{2, 2}, {1, 1}},     {{1, 5}, {3, 3}},
    {{5, 1}, {3, 3}},     {{3, 3}, {64, 64}},
};

// What the conversion makes of the array, row by row, in Bitmaps of any stride; the array may end
// exactly where its length says. Pixels that a crop to nothing leaves undrawn are zero.
TEST_F(FromNv21, FillsTheBitmap) {
  for (const Resize& resize : kResizes) {
    for (const int stride : {0, 4, 60}) {
      SCOPED_TRACE(testing::PrintToString(resize.from) + " to " +
                   testing::PrintToString(resize.to) + " stride +" + std::to_string(stride));
      const std::vector<uint8_t> bytes = Noise(Nv21Length(resize.from));
      Machine machine;
      machine.SetCreatedStrideChange(stride);
      jbyteArray data = machine.ArrayArgument(bytes);
      jobject bitmap = ToBitmap(&machine, data, resize.from, resize.to);
      ASSERT_NE(bitmap, nullptr);
      ExpectBalanced(machine, bitmap);
      EXPECT_EQ(machine.Deref(data).bytes, bytes);

      const std::vector<uint8_t> padded = Padded(bytes, resize.from);
      const Converted rgba(Nv21Source(padded, resize.from), kRgba, resize.to);
      const Bitmap& fake = machine.BitmapOf(bitmap);
      ASSERT_EQ(fake.info.width, uint32_t(resize.to.width));
      ASSERT_EQ(fake.info.height, uint32_t(resize.to.height));
      ASSERT_EQ(fake.info.format, kFormatRgba);
      for (int32_t row = 0; row < resize.to.height; ++row) {
        ASSERT_EQ(std::memcmp(fake.pixels + size_t(row) * fake.info.stride,
                              rgba.record().plane[0] + row * rgba.record().pitch[0],
                              size_t(resize.to.width) * 4),
                  0)
            << "row " << row;
      }
    }
  }
}

// Bytes behind the picture do not matter.
TEST_F(FromNv21, TakesLongerArrays) {
  for (const size_t extra : {1u, 2u, 5u, 1000u}) {
    const Size size = {15, 9};
    std::vector<uint8_t> bytes = Noise(Nv21Length(size));
    bytes.resize(bytes.size() + extra, 128);
    const std::vector<uint8_t> padded = Padded(bytes, size);
    Machine machine;
    jobject bitmap = ToBitmap(&machine, machine.ArrayArgument(bytes), size, {15, 9});
    ASSERT_NE(bitmap, nullptr);
    ExpectBalanced(machine, bitmap);
    const Converted rgba(Nv21Source(padded, size), kRgba, size);
    EXPECT_EQ(std::memcmp(machine.BitmapOf(bitmap).pixels, rgba.record().plane[0], 15 * 4 * 9), 0);
  }
}

TEST_F(FromNv21, NoArrayGivesNull) {
  Machine machine;
  EXPECT_EQ(ToBitmap(&machine, nullptr, {64, 48}, {64, 48}), nullptr);
  EXPECT_TRUE(machine.calls().empty());
  ExpectBalanced(machine, nullptr);
}

TEST_F(FromNv21, ShortArraysGiveNull) {
  for (const Size size : {Size{64, 48}, {15, 9}, {1, 1}, {2, 1}, {3, 3}}) {
    for (const size_t length : {size_t{0}, Nv21Length(size) / 2, Nv21Length(size) - 1}) {
      Machine machine;
      EXPECT_EQ(ToBitmap(&machine, machine.ArrayArgument(Noise(length)), size, {8, 8}), nullptr);
      EXPECT_EQ(machine.calls(), (Calls{"GetByteArrayElements", "ReleaseByteArrayElements 0"}));
      ExpectBalanced(machine, nullptr);
    }
  }
}

TEST_F(FromNv21, ImpossibleSizesGiveNull) {
  constexpr int32_t kMost = INT32_MAX;
  constexpr int32_t kLeast = INT32_MIN;
  for (const Resize& resize :
       {Resize{{0, 8}, {8, 8}}, {{8, 0}, {8, 8}},           {{-1, 8}, {8, 8}},
        {{8, -1}, {8, 8}},      {{-8, -8}, {8, 8}},         {{kLeast, kLeast}, {8, 8}},
        {{kLeast, 1}, {8, 8}},  {{kMost, kMost}, {8, 8}},   {{kMost, 1}, {8, 8}},
        {{1, kMost}, {8, 8}},   {{65536, 65536}, {8, 8}},   {{46341, 46341}, {8, 8}},
        {{8, 8}, {0, 8}},       {{8, 8}, {8, 0}},           {{8, 8}, {-1, 8}},
        {{8, 8}, {8, -1}},      {{8, 8}, {kLeast, kLeast}}, {{8, 8}, {kMost, kMost}},
        {{8, 8}, {kMost, 1}},   {{8, 8}, {1, kMost}},       {{8, 8}, {32768, 16384}}}) {
    SCOPED_TRACE(testing::PrintToString(resize.from) + " to " + testing::PrintToString(resize.to));
    Machine machine;
    EXPECT_EQ(ToBitmap(&machine, machine.ArrayArgument(Noise(96)), resize.from, resize.to),
              nullptr);
    EXPECT_EQ(machine.calls(), (Calls{"GetByteArrayElements", "ReleaseByteArrayElements 0"}));
    ExpectBalanced(machine, nullptr);
    EXPECT_TRUE(tessel_double::Requests().empty());
  }
}

// Enlarging more than 65536 times fails in the conversion itself, when everything is allocated.
TEST_F(FromNv21, AFailedConversionGivesNull) {
  Machine machine;
  jbyteArray data = machine.ArrayArgument(Noise(96));
  EXPECT_EQ(ToBitmap(&machine, data, {1, 1}, {100000, 1}), nullptr);
  EXPECT_FALSE(tessel_double::Requests().empty());
  EXPECT_EQ(machine.calls(), (Calls{"GetByteArrayElements", "ReleaseByteArrayElements 0"}));
  ExpectBalanced(machine, nullptr);
}

TEST_F(FromNv21, NoElementsGiveNull) {
  for (const Failure how : {Failure::kQuiet, Failure::kException}) {
    Machine machine;
    machine.FailNth(1, how);
    EXPECT_EQ(ToBitmap(&machine, machine.ArrayArgument(Noise(96)), {8, 8}, {8, 8}), nullptr);
    // There is nothing to release; a virtual machine need not take a null.
    EXPECT_EQ(machine.calls(), Calls{"GetByteArrayElements"});
    EXPECT_EQ(machine.ExceptionPending(), how == Failure::kException);
    ExpectBalanced(machine, nullptr);
  }
}

TEST_F(FromNv21, EveryCallFails) {
  size_t calls;
  {
    Machine machine;
    ToBitmap(&machine, machine.ArrayArgument(Noise(96)), {8, 8}, {6, 6});
    calls = machine.FailableCalls();
  }
  ASSERT_EQ(calls, 10u);
  for (size_t n = 1; n <= calls; ++n) {
    for (const Failure how : {Failure::kQuiet, Failure::kException}) {
      for (const int code : {-1, -2, -3}) {
        Machine machine;
        machine.FailNth(n, how);
        machine.SetBitmapFailure(code);
        jobject bitmap = ToBitmap(&machine, machine.ArrayArgument(Noise(96)), {8, 8}, {6, 6});
        const std::string call = machine.calls().at(n - 1);
        SCOPED_TRACE(call + " " + std::to_string(code));
        // A new Bitmap that tells nothing of itself is returned as it is.
        const bool made = call.find("AndroidBitmap") == 0 && how == Failure::kQuiet;
        EXPECT_EQ(bitmap != nullptr, made);
        EXPECT_EQ(machine.ExceptionPending(), how == Failure::kException);
        EXPECT_EQ(std::count(machine.calls().begin(), machine.calls().end(),
                             "ReleaseByteArrayElements 0"),
                  call == "GetByteArrayElements" ? 0 : 1);
        ExpectBalanced(machine, bitmap);
      }
    }
  }
}

// ---- Memory

struct Job {
  const char* name;
  size_t atLeast;  // requests
  uint32_t table;  // bytes of a conversion table, whose lack a conversion does not report
  jobject (*run)(Machine*);
};

class MemoryFailure : public testing::TestWithParam<Job> {};

TEST_P(MemoryFailure, EveryRequestFails) {
  tessel_double::Reset();
  {
    Machine machine;
    ASSERT_NE(GetParam().run(&machine), nullptr);
  }
  const std::vector<uint32_t> requests = tessel_double::Requests();
  ASSERT_GT(requests.size(), GetParam().atLeast);
  for (size_t n = 1; n <= requests.size(); ++n) {
    SCOPED_TRACE("request " + std::to_string(n) + " of " + std::to_string(requests.size()));
    tessel_double::Reset();
    tessel_double::FailNth(n);
    Machine machine;
    jobject result = GetParam().run(&machine);
    EXPECT_EQ(result != nullptr, requests[n - 1] == GetParam().table);
    EXPECT_FALSE(machine.ExceptionPending());
    EXPECT_EQ(machine.LocalReferences(), result != nullptr ? 1u : 0u);
    EXPECT_EQ(machine.HeldElements(), 0u);
    EXPECT_EQ(machine.HeldLocks(), 0);
    EXPECT_EQ(machine.faults(), Calls());
    EXPECT_EQ(tessel_double::LiveBlocks(), 0u);
    EXPECT_EQ(tessel_double::Faults(), Calls());
  }
}

INSTANTIATE_TEST_SUITE_P(
    Jobs, MemoryFailure,
    testing::Values(
        Job{"ToNv21", 4, 8192,
            [](Machine* machine) -> jobject {
              jobject bitmap = machine->BitmapArgument(20, 10, 80, kFormatRgba);
              return JNI_ConvertCS2NV21(machine->env(), nullptr, bitmap);
            }},
        Job{"ToBitmap", 4, 4352,
            [](Machine* machine) {
              return ToBitmap(machine, machine->ArrayArgument(Noise(300)), {20, 10}, {40, 20});
            }},
        Job{"OddSizeToBitmap", 5, 4352,
            [](Machine* machine) {
              return ToBitmap(machine, machine->ArrayArgument(Noise(202)), {15, 9}, {15, 9});
            }}),
    [](const auto& job) { return std::string(job.param.name); });

// ---- Descriptor to Bitmap

class FromDescriptor : public NativeMethods {
 protected:
  // Height rows of this pitch.
  static MBITMAP Descriptor(std::vector<uint8_t>* bytes, uint32_t format, Size size,
                            int32_t pitch) {
    *bytes = Noise(size_t(pitch) * size_t(size.height));
    return {format, size.width, size.height, {pitch, 0, 0}, {bytes->data(), nullptr, nullptr}};
  }
};

TEST_F(FromDescriptor, NothingGivesNull) {
  Machine machine;
  EXPECT_EQ(_GetBitmapFromMBitmap(machine.env(), nullptr), nullptr);
  const MBITMAP empty = {kRgba, 8, 8, {32, 0, 0}, {nullptr, nullptr, nullptr}};
  EXPECT_EQ(_GetBitmapFromMBitmap(machine.env(), &empty), nullptr);
  EXPECT_TRUE(machine.calls().empty());
  ExpectBalanced(machine, nullptr);
}

TEST_F(FromDescriptor, OtherFormatsMakeNoBitmap) {
  for (const uint32_t format :
       {FORMAT_NV21, FORMAT_XRGB8888, FORMAT_XBGR8888, FORMAT_BGR565, FORMAT_GRAY8 | 0x1000u, 0u}) {
    Machine machine;
    std::vector<uint8_t> bytes;
    const MBITMAP descriptor = Descriptor(&bytes, format, {8, 8}, 32);
    EXPECT_EQ(_GetBitmapFromMBitmap(machine.env(), &descriptor), nullptr);
    EXPECT_EQ(machine.calls(), (Calls{"FindClass android/graphics/Bitmap",
                                      "FindClass android/graphics/Bitmap$Config"}));
    ExpectBalanced(machine, nullptr);
  }
}

struct Layout {
  uint32_t format;
  const char* config;
  int32_t bitmapFormat;
  int32_t bytesPerPixel;
};

constexpr Layout kLayouts[] = {
    {0x37000777, "ARGB_8888", 1, 4},
    {0x37001777, "ARGB_8888", 1, 4},
    {0x15000454, "RGB_565", 4, 2},
    {0x64000000, "ALPHA_8", 8, 1},
};

// Rows of any length on both sides; no byte beyond either is touched.
TEST_F(FromDescriptor, CopiesRows) {
  for (const Layout& layout : kLayouts) {
    for (const int32_t gap : {0, 4, 12}) {
      for (const int strideChange : {0, 4, 8, 12, 16}) {
        SCOPED_TRACE(layout.config + std::string(" gap ") + std::to_string(gap) + " stride +" +
                     std::to_string(strideChange));
        const Size size = {10, 6};
        const int32_t row = size.width * layout.bytesPerPixel;
        std::vector<uint8_t> bytes;
        const MBITMAP descriptor = Descriptor(&bytes, layout.format, size, row + gap);
        Machine machine;
        machine.SetCreatedStrideChange(strideChange);
        jobject bitmap = _GetBitmapFromMBitmap(machine.env(), &descriptor);
        ASSERT_NE(bitmap, nullptr);
        ExpectBalanced(machine, bitmap);
        EXPECT_EQ(machine.calls().at(2), std::string("GetStaticFieldID ") + layout.config);

        const Bitmap& fake = machine.BitmapOf(bitmap);
        EXPECT_EQ(fake.info.format, layout.bitmapFormat);
        for (int32_t y = 0; y < size.height; ++y) {
          for (int32_t x = 0; x < std::min(row + gap, int32_t(fake.info.stride)); ++x) {
            int32_t from = x;
            if (layout.format == 0x37000777 && x % 4 == 0) from = x + 2;
            if (layout.format == 0x37000777 && x % 4 == 2) from = x - 2;
            ASSERT_EQ(fake.pixels[y * int32_t(fake.info.stride) + x],
                      bytes[size_t(y * (row + gap) + from)])
                << x << ", " << y;
          }
          for (int32_t x = row + gap; x < int32_t(fake.info.stride); ++x) {
            ASSERT_EQ(fake.pixels[y * int32_t(fake.info.stride) + x], 0) << x << ", " << y;
          }
        }
      }
    }
  }
}

// A platform that gives less than was asked for is no reason to write beyond it.
TEST_F(FromDescriptor, StaysInsideSmallerBitmaps) {
  for (const Layout& layout : kLayouts) {
    for (const int rows : {0, -1, -5, 3}) {
      for (const int strideChange : {-4, -8, 0}) {
        std::vector<uint8_t> bytes;
        const MBITMAP descriptor =
            Descriptor(&bytes, layout.format, {10, 6}, 10 * layout.bytesPerPixel);
        Machine machine;
        machine.SetCreatedStrideChange(strideChange);
        machine.SetCreatedHeightChange(rows);
        jobject bitmap = _GetBitmapFromMBitmap(machine.env(), &descriptor);
        ASSERT_NE(bitmap, nullptr);
        ExpectBalanced(machine, bitmap);
      }
    }
  }
}

TEST_F(FromDescriptor, NullPixelsStayUntouchedAndAreUnlocked) {
  Machine machine;
  machine.SetCreatedPixelsNull();
  std::vector<uint8_t> bytes;
  const MBITMAP descriptor = Descriptor(&bytes, kRgba, {8, 8}, 32);
  jobject bitmap = _GetBitmapFromMBitmap(machine.env(), &descriptor);
  EXPECT_NE(bitmap, nullptr);
  EXPECT_EQ(machine.calls().back(), "AndroidBitmap_unlockPixels");
  ExpectBalanced(machine, bitmap);
}

// Pixels that could not be locked are not unlocked: the call would end somebody else's lock.
TEST_F(FromDescriptor, UnlocksOnlyWhatItLocked) {
  for (const size_t failing : {7u, 8u}) {
    Machine machine;
    machine.FailNth(failing, Failure::kQuiet);
    std::vector<uint8_t> bytes;
    const MBITMAP descriptor = Descriptor(&bytes, kRgba, {8, 8}, 32);
    jobject bitmap = _GetBitmapFromMBitmap(machine.env(), &descriptor);
    EXPECT_NE(bitmap, nullptr);
    EXPECT_EQ(machine.calls().size(), failing);
    EXPECT_EQ(machine.calls().back().find("AndroidBitmap_"), 0u);
    ExpectBalanced(machine, bitmap);
  }
}

}  // namespace
