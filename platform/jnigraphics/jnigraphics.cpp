// Desktop stand-in for the device's Bitmap functions, over the android.graphics.Bitmap of the java
// folder: that class keeps the pixels, counts the locks and plans the failures.
#include <android/bitmap.h>

namespace {

// Numbers that Bitmap.onNativeCall knows.
enum Function : jint { kGetInfo, kLockPixels, kUnlockPixels };

// Unlocking works while an exception of the caller is pending, and keeps it; Java itself cannot be
// called then.
class CallersException {
 public:
  explicit CallersException(JNIEnv* env) : env_(env), exception_(env->ExceptionOccurred()) {
    if (exception_ != nullptr) env_->ExceptionClear();
  }
  ~CallersException() {
    if (exception_ == nullptr) return;
    if (env_->ExceptionCheck()) env_->ExceptionClear();
    env_->Throw(exception_);
    env_->DeleteLocalRef(exception_);
  }
  CallersException(const CallersException&) = delete;
  CallersException& operator=(const CallersException&) = delete;

 private:
  JNIEnv* env_;
  jthrowable exception_;
};

// The class of a Bitmap, and its fields by name.
class BitmapView {
 public:
  BitmapView(JNIEnv* env, jobject bitmap)
      : env_(env), bitmap_(bitmap), class_(env->GetObjectClass(bitmap)) {}
  ~BitmapView() { env_->DeleteLocalRef(class_); }
  BitmapView(const BitmapView&) = delete;
  BitmapView& operator=(const BitmapView&) = delete;

  int Call(Function function) {
    const jmethodID method = env_->GetMethodID(class_, "onNativeCall", "(I)I");
    if (method == nullptr) return ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
    const jint result = env_->CallIntMethod(bitmap_, method, jint(function));
    return env_->ExceptionCheck() ? ANDROID_BITMAP_RESULT_JNI_EXCEPTION : int(result);
  }

  jint Int(const char* name) {
    return env_->GetIntField(bitmap_, env_->GetFieldID(class_, name, "I"));
  }

  void* Pixels() {
    const jfieldID field = env_->GetFieldID(class_, "pixels", "Ljava/nio/ByteBuffer;");
    jobject buffer = env_->GetObjectField(bitmap_, field);
    void* address = env_->GetDirectBufferAddress(buffer);
    env_->DeleteLocalRef(buffer);
    return address;
  }

 private:
  JNIEnv* env_;
  jobject bitmap_;
  jclass class_;
};

}  // namespace

extern "C" {

int AndroidBitmap_getInfo(JNIEnv* env, jobject bitmap, AndroidBitmapInfo* info) {
  if (env == nullptr || bitmap == nullptr) return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  BitmapView view(env, bitmap);
  const int result = view.Call(kGetInfo);
  if (result != ANDROID_BITMAP_RESULT_SUCCESS || info == nullptr) return result;
  info->width = uint32_t(view.Int("width"));
  info->height = uint32_t(view.Int("height"));
  info->stride = uint32_t(view.Int("stride"));
  info->format = view.Int("format");
  info->flags = 0;
  return result;
}

int AndroidBitmap_lockPixels(JNIEnv* env, jobject bitmap, void** address) {
  if (env == nullptr || bitmap == nullptr) return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  BitmapView view(env, bitmap);
  const int result = view.Call(kLockPixels);
  if (result == ANDROID_BITMAP_RESULT_SUCCESS && address != nullptr) *address = view.Pixels();
  return result;
}

int AndroidBitmap_unlockPixels(JNIEnv* env, jobject bitmap) {
  if (env == nullptr || bitmap == nullptr) return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  const CallersException kept(env);
  return BitmapView(env, bitmap).Call(kUnlockPixels);
}

}  // extern "C"
