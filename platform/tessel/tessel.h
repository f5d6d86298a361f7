/* The base library's memory interface. On a device it is the system's libtessel.so; the desktop
 * build brings its own. The pool handle is null in all calls of this library. */
#ifndef KESTREL_PLATFORM_TESSEL_H
#define KESTREL_PLATFORM_TESSEL_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* A block of at least `size` bytes aligned for any type, or null. */
void* MMemAlloc(void* pool, uint32_t size);

/* Gives a block back. Null is accepted. */
void MMemFree(void* pool, void* block);

void* MMemCpy(void* dst, const void* src, uint32_t size);
void* MMemSet(void* dst, int32_t value, uint32_t size);

#ifdef __cplusplus
}
#endif

#endif
