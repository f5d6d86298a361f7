// Packed YUYV family.
#include "engine/postprocess.h"

extern "C" {

// Declines: it has no kernels yet.
uint32_t YUV_YUV_C_FAST(const MRECT*, const int32_t*, const int32_t*, uint8_t* const*,
                        const uint8_t* const*, const EngineContext*) {
  return KESTREL_UNSUPPORTED;
}

}  // extern "C"
