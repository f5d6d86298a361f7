// Java's view of the base library for tests.
#include <jni.h>

#include <string>

#include "tests/support/tessel_double.h"

extern "C" {

JNIEXPORT void JNICALL Java_kestrel_tests_TesselDouble_reset(JNIEnv*, jclass) {
  tessel_double::Reset();
}

JNIEXPORT void JNICALL Java_kestrel_tests_TesselDouble_failRequest(JNIEnv*, jclass, jint n) {
  tessel_double::FailNth(size_t(n));
}

JNIEXPORT jint JNICALL Java_kestrel_tests_TesselDouble_requests(JNIEnv*, jclass) {
  return jint(tessel_double::Requests().size());
}

JNIEXPORT jint JNICALL Java_kestrel_tests_TesselDouble_requestedBytes(JNIEnv*, jclass, jint n) {
  return jint(tessel_double::Requests().at(size_t(n) - 1));
}

JNIEXPORT jint JNICALL Java_kestrel_tests_TesselDouble_liveBlocks(JNIEnv*, jclass) {
  return jint(tessel_double::LiveBlocks());
}

JNIEXPORT jstring JNICALL Java_kestrel_tests_TesselDouble_faults(JNIEnv* env, jclass) {
  std::string lines;
  for (const std::string& fault : tessel_double::Faults()) lines += fault + "\n";
  return env->NewStringUTF(lines.c_str());
}

}  // extern "C"
