// The Java natives in a virtual machine that fails at any call, with Bitmaps, arrays and sizes of
// any kind: nothing may stay locked, held, referenced or allocated.
#include "tests/jni/random_call.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  fuzz::Input input(data, size);
  for (int32_t calls = input.Between(1, 4); calls > 0; --calls) fake_jni::CallNative(&input);
  return 0;
}
