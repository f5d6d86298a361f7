/* Clamps of the lanes of a 128-bit vector: max(min(x, high), low). */
#ifndef KESTREL_COLOUR_VECTOR_CLAMPS_H
#define KESTREL_COLOUR_VECTOR_CLAMPS_H

#include <stdint.h>

#include "engine/api.h"

#if defined(__ARM_NEON)
#include <arm_neon.h>
typedef uint16x8_t KestrelU16x8;
typedef int16x8_t KestrelS16x8;
typedef int32x4_t KestrelS32x4;
#else
typedef uint16_t KestrelU16x8 __attribute__((vector_size(16)));
typedef int16_t KestrelS16x8 __attribute__((vector_size(16)));
typedef int32_t KestrelS32x4 __attribute__((vector_size(16)));
#endif

KESTREL_BEGIN_C

KESTREL_API KestrelU16x8 Bound_u16(KestrelU16x8 x, KestrelU16x8 low, KestrelU16x8 high);
KESTREL_API KestrelS16x8 Bound_s16(KestrelS16x8 x, KestrelS16x8 low, KestrelS16x8 high);
KESTREL_API KestrelS32x4 Bound_s32(KestrelS32x4 x, KestrelS32x4 low, KestrelS32x4 high);

KESTREL_END_C

#endif
