// The one-shot conversion: a throw-away tiled engine, bilinear, the source cut to the destination's
// aspect.
#include "engine/postprocess.h"
#include "jni/bitmap_buffers.h"

extern "C" uint32_t ConvertCS(const MBITMAP* src, const MBITMAP* dst) {
  if (src == nullptr || dst == nullptr) return KESTREL_BAD_ARGUMENT;
  MPPFORMAT dstFormat = {dst->format, dst->width, dst->height, nullptr};
  MPPFORMAT srcFormat = {src->format, src->width, src->height, nullptr};
  MPPPARAM params = {};
  params.resampleFlags = MPP_BILINEAR;
  params.bandSelector = 5;
  params.passMode = MPP_PASS_TILED;
  params.aspectMode = MPP_ASPECT_CROP;
  MPPHandle* handle;
  uint32_t result = MPPCreate(&dstFormat, &srcFormat, &params, &handle);
  if (result != KESTREL_OK) return result;
  const MRECT rect = {0, 0, dst->width, dst->height};
  const uint8_t* const srcPlanes[3] = {src->plane[0], src->plane[1], src->plane[2]};
  result = MPProcess(handle, dst->plane, &rect, dst->pitch, srcPlanes, src->pitch);
  MPPDestroy(handle);
  return result;
}
