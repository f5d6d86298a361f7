/* The part of Android's Bitmap interface that desktop builds need, with the values of the device.
 * Android builds use the header of the NDK instead. */
#ifndef KESTREL_PLATFORM_ANDROID_BITMAP_H
#define KESTREL_PLATFORM_ANDROID_BITMAP_H

#include <jni.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

enum {
  ANDROID_BITMAP_RESULT_SUCCESS = 0,
  ANDROID_BITMAP_RESULT_BAD_PARAMETER = -1,
  ANDROID_BITMAP_RESULT_JNI_EXCEPTION = -2, /* an exception may be pending */
  ANDROID_BITMAP_RESULT_ALLOCATION_FAILED = -3,
};

enum AndroidBitmapFormat {
  ANDROID_BITMAP_FORMAT_NONE = 0,
  ANDROID_BITMAP_FORMAT_RGBA_8888 = 1, /* bytes R G B A */
  ANDROID_BITMAP_FORMAT_RGB_565 = 4,
  ANDROID_BITMAP_FORMAT_A_8 = 8,
};

typedef struct {
  uint32_t width;
  uint32_t height;
  uint32_t stride; /* bytes from one row to the next */
  int32_t format;  /* AndroidBitmapFormat */
  uint32_t flags;
} AndroidBitmapInfo;

/* Describes a Bitmap. On failure `info` means nothing. */
int AndroidBitmap_getInfo(JNIEnv* env, jobject bitmap, AndroidBitmapInfo* info);

/* The address of the pixels, which stay where they are until a matching unlock. On failure nothing
 * is locked and the address means nothing. */
int AndroidBitmap_lockPixels(JNIEnv* env, jobject bitmap, void** address);

/* Ends one successful lock. */
int AndroidBitmap_unlockPixels(JNIEnv* env, jobject bitmap);

#ifdef __cplusplus
}
#endif

#endif
