#include "tests/jni/fake_jni.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <type_traits>

namespace fake_jni {
namespace {

// The two flavours of jni.h call these tables differently.
using EnvTable = std::remove_const_t<std::remove_pointer_t<decltype(JNIEnv::functions)>>;
using VmTable = std::remove_const_t<std::remove_pointer_t<decltype(JavaVM::functions)>>;

[[noreturn]] void UnexpectedCall() {
  std::fputs("a function of the virtual machine was called that the natives have no use for\n",
             stderr);
  std::abort();
}

template <typename Table>
void FillWithUnexpected(Table* table) {
  void (*const unexpected)() = UnexpectedCall;
  for (size_t at = 0; at + sizeof unexpected <= sizeof *table; at += sizeof unexpected) {
    std::memcpy(reinterpret_cast<char*>(table) + at, &unexpected, sizeof unexpected);
  }
}

constexpr char kConfigType[] = "Landroid/graphics/Bitmap$Config;";

struct Config {
  const char* name;
  int32_t format;
  uint32_t bytesPerPixel;
};

constexpr Config kConfigs[] = {
    {"ARGB_8888", ANDROID_BITMAP_FORMAT_RGBA_8888, 4},
    {"RGB_565", ANDROID_BITMAP_FORMAT_RGB_565, 2},
    {"ALPHA_8", ANDROID_BITMAP_FORMAT_A_8, 1},
};

}  // namespace

// What the tables point to.
struct Functions {
  static Machine& Of(JNIEnv* env) { return *static_cast<Machine::Env*>(env)->machine; }

  static jint JNICALL GetEnv(JavaVM* vm, void** env, jint version) {
    Machine& machine = *static_cast<Machine::Vm*>(vm)->machine;
    char hex[16];
    std::snprintf(hex, sizeof hex, "%#x", unsigned(version));
    machine.CallAllowedWhilePending(std::string("GetEnv ") + hex);
    if (machine.getEnvResult_ == JNI_OK) *env = machine.env();
    return machine.getEnvResult_;
  }

  static jclass JNICALL FindClass(JNIEnv* env, const char* name) {
    Machine& machine = Of(env);
    if (machine.Call(std::string("FindClass ") + name)) return nullptr;
    return static_cast<jclass>(machine.NewReference(machine.NewObject(name), true));
  }

  static jint JNICALL RegisterNatives(JNIEnv* env, jclass target, const JNINativeMethod* methods,
                                      jint count) {
    Machine& machine = Of(env);
    const bool fails =
        machine.Call("RegisterNatives " + machine.Deref(target).name + " " + std::to_string(count));
    for (jint i = 0; i < count; ++i) {
      machine.registered_.push_back({methods[i].name, methods[i].signature, methods[i].fnPtr});
    }
    return fails ? -1 : machine.registerResult_;
  }

  static jboolean JNICALL ExceptionCheck(JNIEnv* env) { return Of(env).pending_; }

  static void JNICALL DeleteLocalRef(JNIEnv* env, jobject reference) {
    Machine& machine = Of(env);
    if (reference == nullptr) return;
    Machine::Reference* found = machine.Find(reference);
    if (found == nullptr || found->deleted) {
      machine.Fault("a reference is deleted twice");
    } else if (!found->local) {
      machine.Fault("a reference of the caller is deleted");
    } else {
      found->deleted = true;
    }
  }

  static jfieldID JNICALL GetStaticFieldID(JNIEnv* env, jclass owner, const char* name,
                                           const char* type) {
    Machine& machine = Of(env);
    if (machine.Deref(owner).name != "android/graphics/Bitmap$Config") {
      machine.Fault("the field is looked for in " + machine.Deref(owner).name);
    }
    if (std::strcmp(type, kConfigType) != 0) machine.Fault(std::string("field type ") + type);
    if (machine.Call(std::string("GetStaticFieldID ") + name)) return nullptr;
    for (const Config& config : kConfigs) {
      if (std::strcmp(config.name, name) == 0) {
        return reinterpret_cast<jfieldID>(const_cast<Config*>(&config));
      }
    }
    machine.Fault(std::string("there is no field ") + name);
    return nullptr;
  }

  static jobject JNICALL GetStaticObjectField(JNIEnv* env, jclass owner, jfieldID field) {
    Machine& machine = Of(env);
    if (machine.Deref(owner).name != "android/graphics/Bitmap$Config") {
      machine.Fault("the field is read from " + machine.Deref(owner).name);
    }
    if (machine.Call("GetStaticObjectField")) return nullptr;
    const Config* config = reinterpret_cast<const Config*>(field);
    return machine.NewReference(machine.NewObject(config->name), true);
  }

  static jmethodID JNICALL GetStaticMethodID(JNIEnv* env, jclass owner, const char* name,
                                             const char* signature) {
    Machine& machine = Of(env);
    if (machine.Deref(owner).name != "android/graphics/Bitmap") {
      machine.Fault("the method is looked for in " + machine.Deref(owner).name);
    }
    if (machine.Call(std::string("GetStaticMethodID ") + name + " " + signature)) return nullptr;
    static char method;
    return reinterpret_cast<jmethodID>(&method);
  }

  static jobject JNICALL CallStaticObjectMethodV(JNIEnv* env, jclass owner, jmethodID,
                                                 va_list arguments) {
    Machine& machine = Of(env);
    if (machine.Deref(owner).name != "android/graphics/Bitmap") {
      machine.Fault("the method is called on " + machine.Deref(owner).name);
    }
    const jint width = va_arg(arguments, jint);
    const jint height = va_arg(arguments, jint);
    jobject argument = va_arg(arguments, jobject);
    const std::string name = argument == nullptr ? "null" : machine.Deref(argument).name;
    if (machine.Call("CallStaticObjectMethod " + std::to_string(width) + " " +
                     std::to_string(height) + " " + name)) {
      return nullptr;
    }
    for (const Config& config : kConfigs) {
      if (name != config.name) continue;
      Object* object = machine.NewObject("a new Bitmap");
      object->bitmap = machine.NewBitmap(
          uint32_t(width), uint32_t(height + machine.heightChange_),
          uint32_t(width) * config.bytesPerPixel + uint32_t(machine.strideChange_), config.format);
      if (machine.createdPixelsNull_) object->bitmap->pixels = nullptr;
      return machine.NewReference(object, true);
    }
    machine.pending_ = true;  // createBitmap throws without a configuration
    return nullptr;
  }

  static jbyteArray JNICALL NewByteArray(JNIEnv* env, jsize length) {
    Machine& machine = Of(env);
    if (machine.Call("NewByteArray " + std::to_string(length))) return nullptr;
    if (length < 0) {
      machine.Fault("an array of negative length is made");
      return nullptr;
    }
    Object* array = machine.NewObject("a new array");
    array->bytes.resize(size_t(length));
    return static_cast<jbyteArray>(machine.NewReference(array, true));
  }

  static jsize JNICALL GetArrayLength(JNIEnv* env, jarray array) {
    Machine& machine = Of(env);
    if (machine.pending_) machine.Fault("GetArrayLength while an exception is pending");
    return jsize(machine.Deref(array).bytes.size());
  }

  static void JNICALL SetByteArrayRegion(JNIEnv* env, jbyteArray array, jsize start, jsize length,
                                         const jbyte* from) {
    Machine& machine = Of(env);
    std::vector<uint8_t>& bytes = machine.Find(array)->object->bytes;
    if (machine.Call("SetByteArrayRegion " + std::to_string(start) + " " +
                     std::to_string(length))) {
      return;
    }
    if (start < 0 || length < 0 || size_t(start) + size_t(length) > bytes.size()) {
      machine.Fault("a region reaches beyond its array");
      machine.pending_ = true;
      return;
    }
    if (length > 0) std::memcpy(bytes.data() + start, from, size_t(length));
  }

  static jbyte* JNICALL GetByteArrayElements(JNIEnv* env, jbyteArray array, jboolean* isCopy) {
    Machine& machine = Of(env);
    if (isCopy != nullptr) machine.Fault("the copy flag is asked for");
    Object* object = machine.Find(array)->object;
    if (machine.Call("GetByteArrayElements")) return nullptr;
    const size_t size = object->bytes.size();
    auto memory = std::make_unique<testing_support::GuardedBuffer>(size);
    uint8_t* bytes = memory->Place(size, testing_support::GuardedBuffer::Edge::kEnd);
    if (size > 0) std::memcpy(bytes, object->bytes.data(), size);
    machine.elements_.push_back({object, std::move(memory), bytes});
    return reinterpret_cast<jbyte*>(bytes);
  }

  static void JNICALL ReleaseByteArrayElements(JNIEnv* env, jbyteArray array, jbyte* bytes,
                                               jint mode) {
    Machine& machine = Of(env);
    machine.CallAllowedWhilePending("ReleaseByteArrayElements " + std::to_string(mode));
    Object* object = machine.Find(array)->object;
    for (auto held = machine.elements_.begin(); held != machine.elements_.end(); ++held) {
      if (reinterpret_cast<jbyte*>(held->bytes) != bytes || held->array != object) continue;
      object->bytes.assign(held->bytes, held->bytes + object->bytes.size());
      machine.elements_.erase(held);
      return;
    }
    machine.Fault("elements are released that are not held");
  }

  static int BitmapCall(JNIEnv* env, jobject bitmap, const char* name, Bitmap** found) {
    Machine& machine = Of(env);
    if (bitmap == nullptr) {
      machine.CallAllowedWhilePending(std::string(name) + " null");
      return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
    }
    const bool pendingBefore = machine.pending_;
    *found = machine.Deref(bitmap).bitmap;
    machine.pending_ = false;  // the platform looks after an exception of its caller
    const bool fails = machine.Call(name);
    machine.pending_ = machine.pending_ || pendingBefore;
    return fails ? machine.bitmapFailure_ : ANDROID_BITMAP_RESULT_SUCCESS;
  }
};

Bitmap::Bitmap(uint32_t width, uint32_t height, uint32_t stride, int32_t format)
    : info{width, height, stride, format, 0},
      memory(size_t(stride) * height),
      pixels(memory.Place(size_t(stride) * height, testing_support::GuardedBuffer::Edge::kEnd)) {}

Machine::Machine() {
  static const EnvTable envTable = [] {
    EnvTable table;
    FillWithUnexpected(&table);
    table.FindClass = Functions::FindClass;
    table.RegisterNatives = Functions::RegisterNatives;
    table.ExceptionCheck = Functions::ExceptionCheck;
    table.DeleteLocalRef = Functions::DeleteLocalRef;
    table.GetStaticFieldID = Functions::GetStaticFieldID;
    table.GetStaticObjectField = Functions::GetStaticObjectField;
    table.GetStaticMethodID = Functions::GetStaticMethodID;
    table.CallStaticObjectMethodV = Functions::CallStaticObjectMethodV;
    table.NewByteArray = Functions::NewByteArray;
    table.GetArrayLength = Functions::GetArrayLength;
    table.SetByteArrayRegion = Functions::SetByteArrayRegion;
    table.GetByteArrayElements = Functions::GetByteArrayElements;
    table.ReleaseByteArrayElements = Functions::ReleaseByteArrayElements;
    return table;
  }();
  static const VmTable vmTable = [] {
    VmTable table;
    FillWithUnexpected(&table);
    table.GetEnv = Functions::GetEnv;
    return table;
  }();
  env_.functions = &envTable;
  env_.machine = this;
  vm_.functions = &vmTable;
  vm_.machine = this;
}

Machine::~Machine() = default;

jbyteArray Machine::ArrayArgument(std::vector<uint8_t> bytes) {
  Object* array = NewObject("the caller's array");
  array->bytes = std::move(bytes);
  return static_cast<jbyteArray>(NewReference(array, false));
}

jobject Machine::BitmapArgument(uint32_t width, uint32_t height, uint32_t stride, int32_t format) {
  Object* object = NewObject("the caller's Bitmap");
  object->bitmap = NewBitmap(width, height, stride, format);
  return NewReference(object, false);
}

const Object& Machine::Deref(jobject reference) {
  Reference* found = Find(reference);
  if (found == nullptr) UnexpectedCall();
  if (found->deleted) Fault("a deleted reference is used");
  return *found->object;
}

void Machine::FailNth(size_t n, Failure how) {
  failNth_ = n;
  failure_ = how;
}

size_t Machine::LocalReferences() const {
  size_t count = 0;
  for (const Reference& reference : references_) count += reference.local && !reference.deleted;
  return count;
}

int Machine::HeldLocks() const {
  int locks = 0;
  for (const auto& bitmap : bitmaps_) locks += bitmap->locks;
  return locks;
}

Object* Machine::NewObject(std::string name) {
  objects_.push_back({std::move(name), {}, nullptr});
  return &objects_.back();
}

jobject Machine::NewReference(Object* object, bool local) {
  references_.push_back({object, local});
  return reinterpret_cast<jobject>(&references_.back());
}

Machine::Reference* Machine::Find(jobject reference) {
  for (Reference& known : references_) {
    if (reinterpret_cast<jobject>(&known) == reference) return &known;
  }
  return nullptr;
}

Bitmap* Machine::NewBitmap(uint32_t width, uint32_t height, uint32_t stride, int32_t format) {
  bitmaps_.push_back(std::make_unique<Bitmap>(width, height, stride, format));
  return bitmaps_.back().get();
}

bool Machine::Call(std::string what) {
  if (pending_) Fault(what + " while an exception is pending");
  calls_.push_back(std::move(what));
  if (++failable_ != failNth_) return false;
  if (failure_ == Failure::kException) pending_ = true;
  return true;
}

}  // namespace fake_jni

using fake_jni::Bitmap;
using fake_jni::Functions;

int AndroidBitmap_getInfo(JNIEnv* env, jobject bitmap, AndroidBitmapInfo* info) {
  Bitmap* found = nullptr;
  const int result = Functions::BitmapCall(env, bitmap, "AndroidBitmap_getInfo", &found);
  if (result == ANDROID_BITMAP_RESULT_SUCCESS) {
    *info = found->info;
  } else {
    *info = {16, 16, 64, ANDROID_BITMAP_FORMAT_RGBA_8888, 0};  // means nothing
  }
  return result;
}

int AndroidBitmap_lockPixels(JNIEnv* env, jobject bitmap, void** address) {
  Bitmap* found = nullptr;
  const int result = Functions::BitmapCall(env, bitmap, "AndroidBitmap_lockPixels", &found);
  if (result != ANDROID_BITMAP_RESULT_SUCCESS) {
    *address = reinterpret_cast<void*>(1);  // means nothing, and says so when used
    return result;
  }
  ++found->locks;
  *address = found->pixels;
  return result;
}

int AndroidBitmap_unlockPixels(JNIEnv* env, jobject bitmap) {
  Bitmap* found = nullptr;
  const int result = Functions::BitmapCall(env, bitmap, "AndroidBitmap_unlockPixels", &found);
  // A failed unlock is no reason to leave the pixels locked: asking is all that a caller can do.
  if (found == nullptr) return result;
  if (found->locks == 0) return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  --found->locks;
  return result;
}
