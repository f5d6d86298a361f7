// Planar and semi-planar YUV family.
#include "engine/postprocess.h"

extern "C" {

// Declines: it has no kernels yet.
uint32_t YUV2YUV_Fast(const MRECT*, const int32_t*, const int32_t*, uint8_t* const*,
                      const uint8_t* const*, const EngineContext*) {
  return KESTREL_UNSUPPORTED;
}

// Declines: it has no kernels yet.
uint32_t I420_To_I422_Fast(const MRECT*, const int32_t*, const int32_t*, uint8_t* const*,
                           const uint8_t* const*, const EngineContext*) {
  return KESTREL_UNSUPPORTED;
}

}  // extern "C"
