#include "kernels/table/kernels.h"

namespace kestrel {

const KernelRow kKernels[] = {
#define KERNEL(name, sources, destinations, pairing, scale, transform, block, quirks)         \
  {#name,        sources, destinations, Pairing::pairing, Scale::scale, Transform::transform, \
   Block::block, quirks},
#include "kernels/all_kernels.def"
#undef KERNEL
};

KernelFn* const kKernelEntries[] = {
#define KERNEL(name, ...) ::name,
#include "kernels/all_kernels.def"
#undef KERNEL
};

}  // namespace kestrel

extern "C" {

#define KERNEL(name, ...)                                                                    \
  uint32_t name(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,     \
                uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,                  \
                const EngineContext* context) {                                              \
    return kestrel::RunKernel(kestrel::kKernels[kestrel::kernel_id::name], rect, dstPitches, \
                              srcPitches, dstPlanes, srcPlanes, context);                    \
  }
#include "kernels/all_kernels.def"
#undef KERNEL

}  // extern "C"
