// The part of the device's stdio.h that the library uses.
#ifndef KESTREL_ANDROID_STUBS_STDIO_H
#define KESTREL_ANDROID_STUBS_STDIO_H

#include <stddef.h>

#ifdef __cplusplus
extern "C" {
#endif

typedef struct __sFILE FILE;

FILE* fopen(const char* path, const char* mode);
size_t fwrite(const void* data, size_t size, size_t count, FILE* file);
int fclose(FILE* file);

#ifdef __cplusplus
}
#endif

#endif
