// Which row operations an engine uses.
#include "engine/engine_internal.h"
#include "kernels/rows/rows.h"

#if defined(__x86_64__)
#include <cpuid.h>
#endif

namespace kestrel {
namespace {

#if defined(__x86_64__)

// Bits of CPUID and of XGETBV.
constexpr uint32_t kLeaf1Sse41 = 1u << 19;
constexpr uint32_t kLeaf1SystemSavesState = 1u << 27;
constexpr uint32_t kLeaf1Avx = 1u << 28;
constexpr uint32_t kLeaf7Avx2 = 1u << 5;
constexpr uint32_t kLeaf7Avx512 = 1u << 16 | 1u << 17 | 1u << 30 | 1u << 31;  // F, DQ, BW and VL
constexpr uint32_t kLeaf7VbmiAndVnni = 1u << 1 | 1u << 11;                    // in ECX
constexpr uint32_t kStateOfSseAndAvx = 6;
constexpr uint32_t kStateOfAvx512 = 0xE6;

struct CpuFeatures {
  bool sse41, avx2, avx512;
};

// Takes microseconds where the CPU is a virtual one, because these instructions are emulated.
CpuFeatures AskCpu() {
  uint32_t a, b, c, d;
  CpuFeatures found = {false, false, false};
  __cpuid(1, a, b, c, d);
  found.sse41 = (c & kLeaf1Sse41) != 0;
  constexpr uint32_t kWide = kLeaf1SystemSavesState | kLeaf1Avx;
  if ((c & kWide) != kWide) return found;
  uint32_t state, high;
  __asm__("xgetbv" : "=a"(state), "=d"(high) : "c"(0));
  if ((state & kStateOfSseAndAvx) != kStateOfSseAndAvx) return found;
  // A CPU with AVX has this leaf: the one that describes the state is a later one.
  __cpuid_count(7, 0, a, b, c, d);
  found.avx2 = (b & kLeaf7Avx2) != 0;
  found.avx512 = (state & kStateOfAvx512) == kStateOfAvx512 && (b & kLeaf7Avx512) == kLeaf7Avx512 &&
                 (c & kLeaf7VbmiAndVnni) == kLeaf7VbmiAndVnni;
  return found;
}

#endif

}  // namespace

RowOpsList AvailableRowOps() {
  RowOpsList list = {};
  int n = 0;
#if defined(__x86_64__)
  const CpuFeatures features = AskCpu();
  if (features.avx512) list.ops[n++] = &kAvx512Rows;
  if (features.avx2) list.ops[n++] = &kAvx2Rows;
  if (features.sse41) list.ops[n++] = &kSse41Rows;
#elif defined(__ARM_NEON)
  list.ops[n++] = &kNeonRows;
#endif
  list.ops[n] = &kScalarRows;
  return list;
}

#if defined(KESTREL_LOADER_MAY_SELECT) && defined(__GLIBC__)

// The loader asks, once: it takes one of these functions for SelectRowOps and keeps its address
// among those of all functions, which nobody can write afterwards. So an engine costs no question
// although the library keeps no state. Loaders of other C libraries do not all choose functions.
extern "C" decltype(SelectRowOps)* KestrelResolveSelectRowOps() {
  const CpuFeatures features = AskCpu();
  if (features.avx512) return [] { return &kAvx512Rows; };
  if (features.avx2) return [] { return &kAvx2Rows; };
  if (features.sse41) return [] { return &kSse41Rows; };
  return [] { return &kScalarRows; };
}

__attribute__((ifunc("KestrelResolveSelectRowOps"))) const RowOps* SelectRowOps();

#else

const RowOps* SelectRowOps() {
  return AvailableRowOps().ops[0];
}

#endif

}  // namespace kestrel
