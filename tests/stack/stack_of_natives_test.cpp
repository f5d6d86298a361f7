// The stack that the Java natives need, frames of the fake virtual machine included.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "jni/bitmap_buffers.h"
#include "jni/native_methods.h"
#include "tests/jni/fake_jni.h"
#include "tests/stack/stack_meter.h"

namespace {

TEST(StackUse, JavaNatives) {
  constexpr int32_t kWidth = 640;
  constexpr int32_t kHeight = 480;
  fake_jni::Machine machine;
  stack::Deepest deepest;
  jint version = 0;
  deepest.Measure("JNI_OnLoad", "", [&] { version = JNI_OnLoad(machine.vm(), nullptr); });
  EXPECT_GT(version, 0);

  const jobject bitmap =
      machine.BitmapArgument(kWidth, kHeight, kWidth * 4, ANDROID_BITMAP_FORMAT_RGBA_8888);
  memset(machine.BitmapOf(bitmap).pixels, 0x55, size_t{kWidth} * kHeight * 4);
  jbyteArray array = nullptr;
  deepest.Measure("ConvertCS2NV21", "",
                  [&] { array = JNI_ConvertCS2NV21(machine.env(), nullptr, bitmap); });
  EXPECT_NE(array, nullptr);

  const jbyteArray data =
      machine.ArrayArgument(std::vector<uint8_t>(size_t{kWidth} * kHeight * 3 / 2, 0x55));
  jobject made = nullptr;
  deepest.Measure("ConvertCS2Bitmap", "", [&] {
    made = JNI_ConvertCS2Bitmap(machine.env(), nullptr, data, kWidth, kHeight, 300, 500);
  });
  EXPECT_NE(made, nullptr);
}

}  // namespace
