// Format decoding, engine creation and region planning with any words a caller could pass.
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "engine/postprocess.h"

namespace {

// The records as they lie in the input; the palette is never followed by creation.
struct Input {
  uint32_t dstFormat, srcFormat;
  int32_t dstWidth, dstHeight, srcWidth, srcHeight;
  MPPPARAM params;
  MRECT planned;
};

void Require(bool holds) {
  if (!holds) abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in = {};
  memcpy(&in, data, size < sizeof(in) ? size : sizeof(in));
  MPPFORMAT dst = {in.dstFormat, in.dstWidth, in.dstHeight, nullptr};
  MPPFORMAT src = {in.srcFormat, in.srcWidth, in.srcHeight, nullptr};
  const MPPPARAM given = in.params;
  MPPHandle* handle = nullptr;
  const uint32_t code = MPPCreate(&dst, &src, &in.params, &handle);
  Require((code == KESTREL_OK) == (handle != nullptr));
  Require(dst.format == in.dstFormat && src.format == in.srcFormat);
  Require(memcmp(&given, &in.params, sizeof(given)) == 0);
  if (handle == nullptr) return 0;
  const EngineContext& engine = *handle->pass[0]->context;
  Require(engine.stepX != 0 && engine.stepY != 0);
  Require(engine.blockMode >= 1 && engine.blockMode <= 4);
  Require(engine.alpha <= 255);
  MRECT rect = in.planned;
  MRECT answer = {0, 0, 0, 0};
  Require(MPPAlign(handle, &rect, &answer) == KESTREL_OK);
  rect = in.planned;
  answer = {0, 0, 0, 0};
  MPPAlign(handle, &answer, &rect);
  MPPDestroy(handle);
  return 0;
}
