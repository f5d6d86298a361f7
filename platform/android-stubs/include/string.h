// The part of the device's string.h that the library uses.
#ifndef KESTREL_ANDROID_STUBS_STRING_H
#define KESTREL_ANDROID_STUBS_STRING_H

#include <stddef.h>

#ifdef __cplusplus
extern "C" {
#endif

void* memcpy(void* dst, const void* src, size_t size);
void* memmove(void* dst, const void* src, size_t size);
void* memset(void* dst, int value, size_t size);

#ifdef __cplusplus
}
#endif

#endif
