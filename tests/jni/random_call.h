// One call of a Java native, drawn from bytes: Bitmaps, arrays and sizes of any kind, in a virtual
// machine and on a base library that fail at any call.
#ifndef KESTREL_TESTS_JNI_RANDOM_CALL_H
#define KESTREL_TESTS_JNI_RANDOM_CALL_H

#include "fuzz/input.h"

namespace fake_jni {

struct Called {
  bool toNv21;  // ConvertCS2NV21, or else ConvertCS2Bitmap
  bool hasResult;
  bool hasException;
};

// Ends the program when anything stays locked, held, referenced or allocated, or when a call is
// made while an exception is pending.
Called CallNative(fuzz::Input* input);

}  // namespace fake_jni

#endif
