// Desktop stand-in for the device's base library: plain heap memory.
#include "platform/tessel/tessel.h"

#include <stdlib.h>
#include <string.h>

void* MMemAlloc(void* /*pool*/, uint32_t size) {
  return malloc(size != 0 ? size : 1);
}

void MMemFree(void* /*pool*/, void* block) {
  free(block);
}

void* MMemCpy(void* dst, const void* src, uint32_t size) {
  return memcpy(dst, src, size);
}

void* MMemSet(void* dst, int32_t value, uint32_t size) {
  return memset(dst, value, size);
}
