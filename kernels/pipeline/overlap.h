// Runs of bytes that share memory: what is first in memory is processed first.
#ifndef KESTREL_KERNELS_PIPELINE_OVERLAP_H
#define KESTREL_KERNELS_PIPELINE_OVERLAP_H

#include <stddef.h>
#include <stdint.h>
#include <string.h>

namespace kestrel {

inline bool Overlap(const uint8_t* a, size_t aBytes, const uint8_t* b, size_t bBytes) {
  const auto first = reinterpret_cast<uintptr_t>(a);
  const auto second = reinterpret_cast<uintptr_t>(b);
  return first < second + bBytes && second < first + aBytes;
}

// In ascending order, so that a run that is copied onto itself a little further on repeats its
// beginning.
inline void CopyAscending(uint8_t* dst, const uint8_t* src, size_t n) {
  if (!Overlap(dst, n, src, n)) {
    memcpy(dst, src, n);
    return;
  }
  for (size_t i = 0; i < n; ++i) dst[i] = src[i];
}

}  // namespace kestrel

#endif
