// The Java face: Bitmaps to NV21 arrays and back. Every failure is a null result; exceptions that
// the virtual machine raised stay pending for the Java caller.
#include "jni/native_methods.h"

#include <android/bitmap.h>

#include "engine/format_codes.h"
#include "jni/bitmap_buffers.h"
#include "platform/tessel/tessel.h"

namespace kestrel {
namespace {

constexpr char kEngineClass[] = "com/kestrel/dualcam/refocus/ImagePostProcessNativeEngine";
constexpr uint32_t kNv21 = FORMAT_NV21 | FORMAT_BT601_FULL;
constexpr uint32_t kBitmapRgba = FORMAT_BGRX8888;  // the bridge's label of RGBA_8888

// Unlocks on every way out, also where locking failed or there is no Bitmap: the platform answers
// such a call with an error that means nothing here.
class UnlockedAtExit {
 public:
  UnlockedAtExit(JNIEnv* env, jobject bitmap) : env_(env), bitmap_(bitmap) {}
  ~UnlockedAtExit() { AndroidBitmap_unlockPixels(env_, bitmap_); }
  UnlockedAtExit(const UnlockedAtExit&) = delete;
  UnlockedAtExit& operator=(const UnlockedAtExit&) = delete;

 private:
  JNIEnv* env_;
  jobject bitmap_;
};

// A descriptor whose planes came from MBitmapAlloc, all zero at first.
class OwnedBitmap {
 public:
  OwnedBitmap() = default;
  ~OwnedBitmap() { MBitmapFree(&record_); }
  OwnedBitmap(const OwnedBitmap&) = delete;
  OwnedBitmap& operator=(const OwnedBitmap&) = delete;

  bool Allocate(uint32_t format, int32_t width, int32_t height) {
    record_.format = format;
    record_.width = width;
    record_.height = height;
    if (MBitmapAlloc(&record_) != KESTREL_OK) return false;
    // A conversion leaves gaps between rows as they are, and all of it where its crop or its table
    // comes to nothing. What the memory held before is not for Java.
    MMemSet(record_.plane[0], 0, getBufferLength(format, width, height));
    return true;
  }
  const MBITMAP& record() const { return record_; }

 private:
  MBITMAP record_ = {};
};

// Elements of a Java array, released (copied back) at the end.
class ArrayElements {
 public:
  ArrayElements(JNIEnv* env, jbyteArray array)
      : env_(env), array_(array), bytes_(env->GetByteArrayElements(array, nullptr)) {}
  ~ArrayElements() {
    if (bytes_ != nullptr) env_->ReleaseByteArrayElements(array_, bytes_, 0);
  }
  ArrayElements(const ArrayElements&) = delete;
  ArrayElements& operator=(const ArrayElements&) = delete;

  const uint8_t* bytes() const { return reinterpret_cast<const uint8_t*>(bytes_); }

 private:
  JNIEnv* env_;
  jbyteArray array_;
  jbyte* bytes_;
};

// A block of the base library, or nothing.
class Block {
 public:
  Block() = default;
  ~Block() { MMemFree(nullptr, bytes_); }
  Block(const Block&) = delete;
  Block& operator=(const Block&) = delete;

  uint8_t* Allocate(uint32_t size) {
    bytes_ = static_cast<uint8_t*>(MMemAlloc(nullptr, size));
    return bytes_;
  }

 private:
  uint8_t* bytes_ = nullptr;
};

class LocalRef {
 public:
  LocalRef(JNIEnv* env, jobject object) : env_(env), object_(object) {}
  ~LocalRef() {
    if (object_ != nullptr) env_->DeleteLocalRef(object_);
  }
  LocalRef(const LocalRef&) = delete;
  LocalRef& operator=(const LocalRef&) = delete;

  jobject get() const { return object_; }
  jclass asClass() const { return static_cast<jclass>(object_); }

 private:
  JNIEnv* env_;
  jobject object_;
};

// Bytes of an NV21 array of a size; 0 when there is no such array.
int64_t Nv21Length(int64_t width, int64_t height) {
  if (width < 1 || height < 1) return 0;
  const int64_t luma = width * height;
  const int64_t length = luma + luma / 2;  // three times the luma might not fit
  return length > INT32_MAX ? 0 : length;
}

// Converts the locked pixels of an RGBA_8888 Bitmap.
bool ConvertPixels(JNIEnv* env, jobject bitmap, OwnedBitmap* nv21) {
  const UnlockedAtExit unlocked(env, bitmap);
  AndroidBitmapInfo info;
  void* pixels = nullptr;
  if (bitmap == nullptr || AndroidBitmap_getInfo(env, bitmap, &info) < 0 ||
      AndroidBitmap_lockPixels(env, bitmap, &pixels) < 0) {
    return false;
  }
  if (info.format != ANDROID_BITMAP_FORMAT_RGBA_8888 || pixels == nullptr ||
      info.width > INT32_MAX || info.height > INT32_MAX || info.stride > INT32_MAX) {
    return false;
  }
  const int32_t width = int32_t(info.width);
  const int32_t height = int32_t(info.height);
  const MBITMAP source = {kBitmapRgba,
                          width,
                          height,
                          {int32_t(info.stride), 0, 0},
                          {static_cast<uint8_t*>(pixels), nullptr, nullptr}};
  return nv21->Allocate(kNv21, width, height) && ConvertCS(&source, &nv21->record()) == KESTREL_OK;
}

jbyteArray ToArray(JNIEnv* env, const MBITMAP& nv21) {
  const int32_t length = int32_t(Nv21Length(nv21.width, nv21.height));
  if (length == 0) return nullptr;
  jbyteArray array = env->NewByteArray(length);
  if (array == nullptr) return nullptr;
  // Both planes are copied as one run of bytes: rows lie as Java expects them for widths that are
  // multiples of 16, and callers with other widths undo the padding themselves.
  const int32_t luma = nv21.width * nv21.height;
  env->SetByteArrayRegion(array, 0, luma, reinterpret_cast<const jbyte*>(nv21.plane[0]));
  if (!env->ExceptionCheck()) {
    env->SetByteArrayRegion(array, luma, luma / 2, reinterpret_cast<const jbyte*>(nv21.plane[2]));
  }
  if (env->ExceptionCheck()) {
    env->DeleteLocalRef(array);
    return nullptr;
  }
  return array;
}

// Java arrays of odd-sized pictures end before the last chroma pairs of their layout do.
int64_t BytesRead(int64_t width, int64_t height) {
  const int64_t chromaRows = (height + 1) / 2;
  return width * height + (chromaRows - 1) * width + (width + 1) / 2 * 2;
}

MBITMAP DescribeNv21(const uint8_t* bytes, int32_t width, int32_t height) {
  uint8_t* const luma = const_cast<uint8_t*>(bytes);
  uint8_t* const chroma = luma + int64_t(width) * height;
  return {kNv21, width, height, {width, width, width}, {luma, chroma + 1, chroma}};
}

const char* ConfigName(uint32_t format) {
  switch (format) {
    case FORMAT_RGBX8888:
    case FORMAT_BGRX8888:
      return "ARGB_8888";
    case FORMAT_GRAY8:
      return "ALPHA_8";
    case FORMAT_RGB565:
      return "RGB_565";
    default:
      return nullptr;
  }
}

jobject CreateBitmap(JNIEnv* env, const MBITMAP& descriptor) {
  const LocalRef bitmapClass(env, env->FindClass("android/graphics/Bitmap"));
  if (bitmapClass.get() == nullptr) return nullptr;
  const LocalRef configClass(env, env->FindClass("android/graphics/Bitmap$Config"));
  if (configClass.get() == nullptr) return nullptr;
  const char* name = ConfigName(descriptor.format);
  if (name == nullptr) return nullptr;
  const jfieldID field =
      env->GetStaticFieldID(configClass.asClass(), name, "Landroid/graphics/Bitmap$Config;");
  if (field == nullptr) return nullptr;
  const LocalRef config(env, env->GetStaticObjectField(configClass.asClass(), field));
  if (config.get() == nullptr) return nullptr;
  const jmethodID create =
      env->GetStaticMethodID(bitmapClass.asClass(), "createBitmap",
                             "(IILandroid/graphics/Bitmap$Config;)Landroid/graphics/Bitmap;");
  if (create == nullptr) return nullptr;
  jobject bitmap = env->CallStaticObjectMethod(bitmapClass.asClass(), create, descriptor.width,
                                               descriptor.height, config.get());
  if (!env->ExceptionCheck()) return bitmap;
  if (bitmap != nullptr) env->DeleteLocalRef(bitmap);
  return nullptr;
}

void CopyRow(uint8_t* dst, const uint8_t* src, int64_t bytes, bool exchangesChannels) {
  if (!exchangesChannels) {
    MMemCpy(dst, src, uint32_t(bytes));
    return;
  }
  for (int64_t i = 0; i + 4 <= bytes; i += 4) {
    dst[i] = src[i + 2];
    dst[i + 1] = src[i + 1];
    dst[i + 2] = src[i];
    dst[i + 3] = src[i + 3];
  }
}

// Rows of equal length are one block, padding included. Otherwise each row is copied as far as both
// sides reach.
void CopyPixels(uint8_t* pixels, const AndroidBitmapInfo& info, const MBITMAP& descriptor) {
  const bool exchanges = descriptor.format == FORMAT_RGBX8888;
  const int64_t pitch = descriptor.pitch[0];
  const int64_t stride = info.stride;
  const int64_t rows =
      descriptor.height < int64_t(info.height) ? descriptor.height : int64_t(info.height);
  const int64_t bytes = pitch < stride ? pitch : stride;
  for (int64_t row = 0; row < rows; ++row) {
    CopyRow(pixels + row * stride, descriptor.plane[0] + row * pitch, bytes, exchanges);
  }
}

}  // namespace
}  // namespace kestrel

using namespace kestrel;

extern "C" {

jobject _GetBitmapFromMBitmap(JNIEnv* env, const MBITMAP* descriptor) {
  if (descriptor == nullptr || descriptor->plane[0] == nullptr) return nullptr;
  jobject bitmap = CreateBitmap(env, *descriptor);
  if (bitmap == nullptr) return nullptr;
  AndroidBitmapInfo info;
  void* pixels = nullptr;
  if (AndroidBitmap_getInfo(env, bitmap, &info) == ANDROID_BITMAP_RESULT_SUCCESS &&
      AndroidBitmap_lockPixels(env, bitmap, &pixels) == ANDROID_BITMAP_RESULT_SUCCESS) {
    if (pixels != nullptr) CopyPixels(static_cast<uint8_t*>(pixels), info, *descriptor);
    AndroidBitmap_unlockPixels(env, bitmap);
  }
  if (!env->ExceptionCheck()) return bitmap;
  env->DeleteLocalRef(bitmap);
  return nullptr;
}

jbyteArray JNI_ConvertCS2NV21(JNIEnv* env, jobject /*thiz*/, jobject bitmap) {
  getCurrentTimeStamp();
  OwnedBitmap nv21;
  // The pixels are unlocked before an array is made: no call may follow an exception it raises.
  if (!ConvertPixels(env, bitmap, &nv21) || env->ExceptionCheck()) return nullptr;
  return ToArray(env, nv21.record());
}

jobject JNI_ConvertCS2Bitmap(JNIEnv* env, jobject /*thiz*/, jbyteArray data, jint srcWidth,
                             jint srcHeight, jint dstWidth, jint dstHeight) {
  getCurrentTimeStamp();
  if (data == nullptr) return nullptr;
  const ArrayElements elements(env, data);
  if (elements.bytes() == nullptr) return nullptr;
  const int64_t available = env->GetArrayLength(data);
  const int64_t length = Nv21Length(srcWidth, srcHeight);
  if (length == 0 || available < length) return nullptr;

  Block padded;
  const uint8_t* bytes = elements.bytes();
  const int64_t read = BytesRead(srcWidth, srcHeight);
  if (read > available) {
    uint8_t* copy = read > INT32_MAX ? nullptr : padded.Allocate(uint32_t(read));
    if (copy == nullptr) return nullptr;
    MMemCpy(copy, bytes, uint32_t(available));
    MMemSet(copy + available, 128, uint32_t(read - available));  // no colour
    bytes = copy;
  }
  const MBITMAP source = DescribeNv21(bytes, srcWidth, srcHeight);
  OwnedBitmap destination;
  if (!destination.Allocate(kBitmapRgba, dstWidth, dstHeight) ||
      ConvertCS(&source, &destination.record()) != KESTREL_OK) {
    return nullptr;
  }
  return _GetBitmapFromMBitmap(env, &destination.record());
}

jint register_kestrel_android_JniPP(JNIEnv* env) {
  // The JDK's jni.h has plain char pointers here, Android's constant ones.
  const JNINativeMethod methods[] = {
      {const_cast<char*>("ConvertCS2Bitmap"),
       const_cast<char*>("([BIIII)Landroid/graphics/Bitmap;"),
       reinterpret_cast<void*>(JNI_ConvertCS2Bitmap)},
      {const_cast<char*>("ConvertCS2NV21"), const_cast<char*>("(Landroid/graphics/Bitmap;)[B"),
       reinterpret_cast<void*>(JNI_ConvertCS2NV21)},
  };
  const LocalRef engine(env, env->FindClass(kEngineClass));
  if (engine.get() == nullptr) return -1;
  return env->RegisterNatives(engine.asClass(), methods, 2) < 0 ? -1 : 0;
}

jint JNI_OnLoad(JavaVM* vm, void* /*reserved*/) {
  JNIEnv* env = nullptr;
  if (vm->GetEnv(reinterpret_cast<void**>(&env), JNI_VERSION_1_4) != JNI_OK) return -1;
  return register_kestrel_android_JniPP(env) == 0 ? JNI_VERSION_1_4 : -1;
}

}  // extern "C"
