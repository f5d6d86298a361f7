// 24-bit RGB family.
#include "engine/postprocess.h"

extern "C" {

// Declines: it has no kernels yet.
uint32_t ANY_ANY_C_FAST_R8G8B8(const MRECT*, const int32_t*, const int32_t*, uint8_t* const*,
                               const uint8_t* const*, const EngineContext*) {
  return KESTREL_UNSUPPORTED;
}

}  // extern "C"
