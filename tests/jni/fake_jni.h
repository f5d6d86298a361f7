// A Java virtual machine of a few functions, for tests of the natives: it logs what is called,
// fails where it is told to, and notices what a real one would punish or miss. Bitmaps and the
// AndroidBitmap functions are part of it. Whatever it hands out lies flush against a page that
// nobody may touch.
#ifndef KESTREL_TESTS_JNI_FAKE_JNI_H
#define KESTREL_TESTS_JNI_FAKE_JNI_H

#include <android/bitmap.h>
#include <jni.h>

#include <cstddef>
#include <cstdint>
#include <list>
#include <memory>
#include <string>
#include <vector>

#include "tests/support/guarded_buffer.h"

namespace fake_jni {

// How a planned failure looks.
enum class Failure {
  kQuiet,      // the failing result alone
  kException,  // the failing result, and an exception is pending
};

struct Bitmap {
  Bitmap(uint32_t width, uint32_t height, uint32_t stride, int32_t format);

  AndroidBitmapInfo info;
  testing_support::GuardedBuffer memory;
  uint8_t* pixels;  // null: lockPixels succeeds with a null address
  int locks = 0;
};

struct Object {
  std::string name;
  std::vector<uint8_t> bytes;  // of an array
  Bitmap* bitmap = nullptr;
};

struct RegisteredMethod {
  std::string name;
  std::string signature;
  void* function;
};

class Machine {
 public:
  Machine();
  ~Machine();
  Machine(const Machine&) = delete;
  Machine& operator=(const Machine&) = delete;

  JNIEnv* env() { return &env_; }
  JavaVM* vm() { return &vm_; }

  // Arguments of a native call: references of the caller, not to be deleted.
  jbyteArray ArrayArgument(std::vector<uint8_t> bytes);
  jobject BitmapArgument(uint32_t width, uint32_t height, uint32_t stride, int32_t format);

  const Object& Deref(jobject reference);
  Bitmap& BitmapOf(jobject reference) { return *Deref(reference).bitmap; }

  // Plans, valid until changed.
  void FailNth(size_t n, Failure how);  // the n-th call that can fail, counted from 1; 0 = none
  void SetBitmapFailure(int code) { bitmapFailure_ = code; }  // of AndroidBitmap functions
  void SetGetEnvResult(jint result) { getEnvResult_ = result; }
  void SetRegisterResult(jint result) { registerResult_ = result; }
  void SetCreatedStrideChange(int bytes) { strideChange_ = bytes; }
  void SetCreatedHeightChange(int rows) { heightChange_ = rows; }
  void SetCreatedPixelsNull() { createdPixelsNull_ = true; }

  // Calls that can fail, so far.
  size_t FailableCalls() const { return failable_; }
  // What was called, with its arguments. Checks of exceptions and deletions of references are left
  // out: they may stand anywhere.
  const std::vector<std::string>& calls() const { return calls_; }
  const std::vector<RegisteredMethod>& registered() const { return registered_; }

  // What a real machine would crash on, warn of, or leak silently.
  const std::vector<std::string>& faults() const { return faults_; }
  bool ExceptionPending() const { return pending_; }
  size_t LocalReferences() const;
  size_t HeldElements() const { return elements_.size(); }
  int HeldLocks() const;

 private:
  friend struct Functions;

  struct Reference {
    Object* object;
    bool local;
    bool deleted = false;
  };
  struct Elements {
    Object* array;
    std::unique_ptr<testing_support::GuardedBuffer> memory;
    uint8_t* bytes;
  };
  struct Env : JNIEnv {
    Machine* machine;
  };
  struct Vm : JavaVM {
    Machine* machine;
  };

  Object* NewObject(std::string name);
  jobject NewReference(Object* object, bool local);
  Reference* Find(jobject reference);
  Bitmap* NewBitmap(uint32_t width, uint32_t height, uint32_t stride, int32_t format);

  // Starts a call. True when it is planned to fail; an exception is then pending if planned so.
  bool Call(std::string what);
  void CallAllowedWhilePending(std::string what) { calls_.push_back(std::move(what)); }
  void Fault(std::string what) { faults_.push_back(std::move(what)); }

  Env env_;
  Vm vm_;
  std::list<Object> objects_;
  std::list<Reference> references_;
  std::list<std::unique_ptr<Bitmap>> bitmaps_;
  std::list<Elements> elements_;
  std::vector<RegisteredMethod> registered_;
  std::vector<std::string> calls_;
  std::vector<std::string> faults_;
  bool pending_ = false;
  size_t failable_ = 0;
  size_t failNth_ = 0;
  Failure failure_ = Failure::kQuiet;
  int bitmapFailure_ = ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  jint getEnvResult_ = JNI_OK;
  jint registerResult_ = JNI_OK;
  int strideChange_ = 0;
  int heightChange_ = 0;
  bool createdPixelsNull_ = false;
};

}  // namespace fake_jni

#endif
