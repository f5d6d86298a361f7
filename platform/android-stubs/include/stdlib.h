// The part of the device's stdlib.h that the compiler's own headers of vector instructions mention.
// Nothing of it is called.
#ifndef KESTREL_ANDROID_STUBS_STDLIB_H
#define KESTREL_ANDROID_STUBS_STDLIB_H

#include <stddef.h>

#ifdef __cplusplus
extern "C" {
#endif

void* malloc(size_t size);
void free(void* memory);
int posix_memalign(void** memory, size_t alignment, size_t size);

#ifdef __cplusplus
}
#endif

#endif
