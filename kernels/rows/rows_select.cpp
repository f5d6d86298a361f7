// Which row operations an engine uses.
#include "engine/engine_internal.h"
#include "kernels/rows/rows.h"

namespace kestrel {

RowOpsList AvailableRowOps() {
  RowOpsList list = {};
  int n = 0;
#if defined(__x86_64__)
  // The compiler's own library asks the CPU once, when it is loaded: asking takes microseconds
  // where the CPU is a virtual one.
  if (__builtin_cpu_supports("avx2")) list.ops[n++] = &kAvx2Rows;
  if (__builtin_cpu_supports("sse4.1")) list.ops[n++] = &kSse41Rows;
#elif defined(__ARM_NEON)
  list.ops[n++] = &kNeonRows;
#endif
  list.ops[n] = &kScalarRows;
  return list;
}

const RowOps* SelectRowOps() {
  return AvailableRowOps().ops[0];
}

}  // namespace kestrel
