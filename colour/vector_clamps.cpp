#include "colour/vector_clamps.h"

#if defined(__ARM_NEON)

extern "C" {

KestrelU16x8 Bound_u16(KestrelU16x8 x, KestrelU16x8 low, KestrelU16x8 high) {
  return vmaxq_u16(vminq_u16(x, high), low);
}

KestrelS16x8 Bound_s16(KestrelS16x8 x, KestrelS16x8 low, KestrelS16x8 high) {
  return vmaxq_s16(vminq_s16(x, high), low);
}

KestrelS32x4 Bound_s32(KestrelS32x4 x, KestrelS32x4 low, KestrelS32x4 high) {
  return vmaxq_s32(vminq_s32(x, high), low);
}

}  // extern "C"

#else

namespace {

template <typename Vector>
Vector Bound(Vector x, Vector low, Vector high) {
  x = x < high ? x : high;
  return x > low ? x : low;
}

}  // namespace

extern "C" {

KestrelU16x8 Bound_u16(KestrelU16x8 x, KestrelU16x8 low, KestrelU16x8 high) {
  return Bound(x, low, high);
}

KestrelS16x8 Bound_s16(KestrelS16x8 x, KestrelS16x8 low, KestrelS16x8 high) {
  return Bound(x, low, high);
}

KestrelS32x4 Bound_s32(KestrelS32x4 x, KestrelS32x4 low, KestrelS32x4 high) {
  return Bound(x, low, high);
}

}  // extern "C"

#endif
