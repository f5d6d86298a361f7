// The generic converter: last member of the chain, takes every job.
#include "kernels/pipeline/pipeline.h"

extern "C" uint32_t ANY_ANY_C_SLOW(const MRECT* rect, const int32_t* dstPitches,
                                   const int32_t* srcPitches, uint8_t* const* dstPlanes,
                                   const uint8_t* const* srcPlanes, const EngineContext* context) {
  if (!kestrel::IsComplete(rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context)) {
    return KESTREL_BAD_ARGUMENT;
  }
  kestrel::RunPipeline({*rect, dstPitches, srcPitches, dstPlanes, srcPlanes, *context});
  return KESTREL_OK;
}
