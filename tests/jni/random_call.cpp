#include "tests/jni/random_call.h"

#include <algorithm>
#include <cstring>
#include <vector>

#include "jni/native_methods.h"
#include "tests/jni/fake_jni.h"
#include "tests/support/tessel_double.h"

namespace fake_jni {
namespace {

using fuzz::Input;
using fuzz::Require;

constexpr uint32_t kMostBytes = 1u << 18;

// A side as Java hands it over.
jint DrawSide(Input* input) {
  const int32_t kind = input->Between(0, 15);
  if (kind == 15) return jint(input->Word());
  if (kind == 14) return input->Between(-2, 0);
  if (kind == 13) return input->Between(1, 400);
  return input->Between(1, 40);
}

void PlanFailures(Input* input, Machine* machine) {
  if (input->OneIn(3)) {
    const size_t calls = size_t(input->Between(1, 16));
    const Failure how = input->OneIn(2) ? Failure::kException : Failure::kQuiet;
    machine->FailNth(machine->FailableCalls() + calls, how);
  }
  machine->SetBitmapFailure(-input->Between(1, 4));
  if (input->OneIn(4)) machine->SetCreatedStrideChange(input->Between(-4, 64));
  if (input->OneIn(4)) machine->SetCreatedHeightChange(input->Between(-1, 3));
  if (input->OneIn(8)) machine->SetCreatedPixelsNull();
  tessel_double::Reset();
  tessel_double::FailAbove(kMostBytes);
  if (input->OneIn(4)) tessel_double::FailNth(size_t(input->Between(1, 16)));
}

std::vector<uint8_t> DrawBytes(Input* input, size_t size) {
  std::vector<uint8_t> bytes(size);
  const uint32_t seed = input->Byte();
  for (size_t i = 0; i < size; ++i) bytes[i] = uint8_t((i * 7 + seed) * (seed | 1));
  return bytes;
}

// The caller's Bitmap: as the platform makes them, padded, of another configuration, recycled, or
// described as larger than any that exists.
jobject DrawBitmap(Input* input, Machine* machine) {
  if (input->OneIn(32)) return nullptr;
  const uint32_t width = uint32_t(input->Between(0, 60));
  const uint32_t height = uint32_t(input->Between(0, 60));
  const uint32_t padding = input->OneIn(3) ? uint32_t(input->Between(0, 37)) : 0;
  constexpr int32_t kFormats[] = {ANDROID_BITMAP_FORMAT_RGB_565, 7, ANDROID_BITMAP_FORMAT_A_8,
                                  ANDROID_BITMAP_FORMAT_NONE,    9, -1};
  const int32_t format = input->OneIn(8) ? input->Pick(kFormats) : ANDROID_BITMAP_FORMAT_RGBA_8888;
  jobject reference = machine->BitmapArgument(width, height, width * 4 + padding, format);
  Bitmap& bitmap = machine->BitmapOf(reference);
  const std::vector<uint8_t> bytes = DrawBytes(input, size_t(bitmap.info.stride) * height);
  if (!bytes.empty()) std::memcpy(bitmap.pixels, bytes.data(), bytes.size());
  if (input->OneIn(16)) bitmap.pixels = nullptr;
  if (input->OneIn(16)) {  // too large for an array: nothing of it may be read
    bitmap.info.width = 65536 + (input->Word() & 0x7FFFFFFF);
    bitmap.info.height = 65536 + (input->Word() & 0x7FFFFFFF);
    bitmap.info.stride = input->Word();
  }
  return reference;
}

void RequireBalanced(const Machine& machine, size_t references) {
  Require(machine.HeldElements() == 0, "elements of an array stay held");
  Require(machine.HeldLocks() == 0, "pixels stay locked");
  Require(machine.LocalReferences() == references, "references are left behind");
  if (!machine.faults().empty()) fuzz::Fail(machine.faults().front());
  Require(tessel_double::LiveBlocks() == 0, "memory is left behind");
  Require(tessel_double::Faults().empty(), "memory is misused");
}

// An exception says that there is no result.
void RequireNoResultOfAFailure(const Machine& machine, jobject result) {
  Require(!(machine.ExceptionPending() && result != nullptr),
          "a result is given although an exception is pending");
}

bool ToNv21(Input* input, Machine* machine) {
  jobject bitmap = DrawBitmap(input, machine);
  const jbyteArray array = JNI_ConvertCS2NV21(machine->env(), nullptr, bitmap);
  RequireNoResultOfAFailure(*machine, array);
  RequireBalanced(*machine, array != nullptr ? 1 : 0);
  if (array == nullptr) return false;
  const AndroidBitmapInfo& info = machine->BitmapOf(bitmap).info;
  const size_t luma = size_t(info.width) * info.height;
  Require(machine->Deref(array).bytes.size() == luma + luma / 2, "an array of another length");
  return true;
}

bool ToBitmap(Input* input, Machine* machine) {
  const jint width = DrawSide(input);
  const jint height = DrawSide(input);
  const jint dstWidth = DrawSide(input);
  const jint dstHeight = DrawSide(input);
  const int64_t luma = width < 1 || height < 1 ? 0 : int64_t(width) * height;
  int64_t length = std::min<int64_t>(luma + luma / 2, kMostBytes);
  if (input->OneIn(3)) length += input->Between(-40, 40);
  if (input->OneIn(16)) length = input->Between(0, 255);
  const jbyteArray data =
      input->OneIn(32)
          ? nullptr
          : machine->ArrayArgument(DrawBytes(input, size_t(std::max<int64_t>(length, 0))));
  const jobject bitmap =
      JNI_ConvertCS2Bitmap(machine->env(), nullptr, data, width, height, dstWidth, dstHeight);
  RequireNoResultOfAFailure(*machine, bitmap);
  RequireBalanced(*machine, bitmap != nullptr ? 1 : 0);
  return bitmap != nullptr;
}

}  // namespace

Called CallNative(Input* input) {
  Machine machine;  // what one call leaves pending is for its caller to clear
  Called called = {};
  called.toNv21 = input->OneIn(2);
  PlanFailures(input, &machine);
  called.hasResult = called.toNv21 ? ToNv21(input, &machine) : ToBitmap(input, &machine);
  called.hasException = machine.ExceptionPending();
  return called;
}

}  // namespace fake_jni
