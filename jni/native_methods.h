// The two Java natives and what registers them. Internal: Java reaches them through JNI_OnLoad.
#ifndef KESTREL_JNI_NATIVE_METHODS_H
#define KESTREL_JNI_NATIVE_METHODS_H

#include <jni.h>

#include "engine/api.h"
#include "engine/records.h"

extern "C" {

// Registers the natives. Returns 0, or -1 when the class is missing or registration fails.
jint register_kestrel_android_JniPP(JNIEnv* env);

// An RGBA_8888 Bitmap as an NV21 array of the same size; null on any failure.
jbyteArray JNI_ConvertCS2NV21(JNIEnv* env, jobject thiz, jobject bitmap);

// An NV21 array as a new ARGB_8888 Bitmap of the requested size; null on any failure.
jobject JNI_ConvertCS2Bitmap(JNIEnv* env, jobject thiz, jbyteArray data, jint srcWidth,
                             jint srcHeight, jint dstWidth, jint dstHeight);

// A new Bitmap with a copy of a descriptor's pixels; null when none can be made.
jobject _GetBitmapFromMBitmap(JNIEnv* env, const MBITMAP* descriptor);

KESTREL_API JNIEXPORT jint JNICALL JNI_OnLoad(JavaVM* vm, void* reserved);

}  // extern "C"

#endif
