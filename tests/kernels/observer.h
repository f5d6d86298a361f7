// Asks one dispatcher which kernel it runs. Programs that use it are linked so that every kernel of
// the table is started through here.
#ifndef KESTREL_TESTS_KERNELS_OBSERVER_H
#define KESTREL_TESTS_KERNELS_OBSERVER_H

#include "engine/postprocess.h"

namespace kernel_tests {

struct Observed {
  uint32_t answer;
  const char* kernel;  // the one that accepted; null when none did
  int accepted;        // kernels that accepted
};

// Calls `dispatcher` with these arguments.
Observed Observe(KernelFn* dispatcher, const MRECT* rect, const int32_t* dstPitches,
                 const int32_t* srcPitches, uint8_t* const* dstPlanes,
                 const uint8_t* const* srcPlanes, const EngineContext* context);

// A member of the chain and the kernel it runs; the last member has none.
struct Answer {
  const char* dispatcher;
  const char* kernel;
  const char* overwritten;  // a kernel that ran before for a member that answered 3 all the same
};

// Asks the members of the chain in turn, with a rectangle that holds no pixels.
Answer AskChain(const EngineContext* context);

}  // namespace kernel_tests

#endif
