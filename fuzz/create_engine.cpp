// Format decoding, engine creation and region planning with any words a caller could pass, and with
// memory that may run out at any request.
#include <cstdint>
#include <cstring>

#include "engine/postprocess.h"
#include "fuzz/input.h"
#include "tests/reference/reference.h"
#include "tests/support/tessel_double.h"

namespace {

using fuzz::Require;

// The records as they lie in the input; the palette is never followed by creation.
struct Records {
  uint32_t dstFormat, srcFormat;
  int32_t dstWidth, dstHeight, srcWidth, srcHeight;
  MPPPARAM params;
  MRECT planned;
};

void Decode(const MPPFORMAT& record) {
  reference::Format model;
  const bool isKnown = reference::DecodeFormat(record, &model) == KESTREL_OK;
  FormatDesc desc = {};
  const uint32_t code = MPParseFormat(&desc, &record);
  Require(code == (isKnown ? KESTREL_OK : KESTREL_UNSUPPORTED), "decoding and model disagree");
  if (!isKnown) return;
  PlaneLayout layout = {};
  uint32_t factors[6] = {};
  const uint32_t bits = MPGetPlaneLayout(&desc, &layout);
  Require(bits >= 1 && bits <= 32 && bits == layout.bitsPerPixel, "a format without bits");
  Require(MPGetSubsampling(&desc, &layout, factors) == KESTREL_OK, "a format without factors");
  Require(desc.code == model.code && int32_t(layout.planeCount) == model.planeCount,
          "another layout than that of the model");
  for (int i = 0; i < 3; ++i) {
    Require(layout.step[i] == model.step[i], "another step than that of the model");
    Require(
        int32_t(factors[i]) == model.horizontal[i] && int32_t(factors[3 + i]) == model.vertical[i],
        "other factors than those of the model");
  }
}

// What creation answers when memory does not run out.
uint32_t ModelOfCreation(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params) {
  reference::Engine model;
  return reference::BuildEngine(dst, src, params, params.passMode, &model);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Records in = {};
  const size_t taken = size < sizeof(in) ? size : sizeof(in);
  std::memcpy(&in, data, taken);
  fuzz::Input input(data + taken, size - taken);
  const uint32_t failing = input.Byte() % 16;  // 0: no request fails
  MPPFORMAT dst = {in.dstFormat, in.dstWidth, in.dstHeight, nullptr};
  MPPFORMAT src = {in.srcFormat, in.srcWidth, in.srcHeight, nullptr};
  Decode(dst);
  Decode(src);

  tessel_double::Reset();
  tessel_double::FailNth(failing);
  const MPPPARAM given = in.params;
  MPPHandle* handle = nullptr;
  const uint32_t code = MPPCreate(&dst, &src, &in.params, &handle);
  Require((code == KESTREL_OK) == (handle != nullptr), "a handle belongs to success only");
  const size_t requests = tessel_double::Requests().size();
  const bool ranOut = failing != 0 && requests >= failing;
  if (!ranOut) {
    Require(code == ModelOfCreation(dst, src, given), "creation and model disagree");
  }
  if (!(ranOut && failing == 1)) {  // without memory for the handle the records stay changed
    Require(dst.format == in.dstFormat && src.format == in.srcFormat,
            "the formats of the caller have changed");
    Require(std::memcmp(&given, &in.params, sizeof(given)) == 0,
            "the parameters of the caller have changed");
  }
  if (handle != nullptr) {
    for (const PassEngine* pass : handle->pass) {
      if (pass == nullptr) continue;
      const EngineContext& engine = *pass->context;
      Require(engine.stepX != 0 && engine.stepY != 0, "a step of 0");
      Require(engine.blockMode >= 1 && engine.blockMode <= 4, "an unknown block mode");
      Require(engine.alpha <= 255, "an alpha above 255");
    }
    MRECT rect = in.planned;
    MRECT answer = {0, 0, 0, 0};
    Require(MPPAlign(handle, &rect, &answer) == KESTREL_OK, "planning refuses a rectangle");
    rect = in.planned;
    answer = {0, 0, 0, 0};
    MPPAlign(handle, &answer, &rect);
    MPPDestroy(handle);
  }
  Require(tessel_double::LiveBlocks() == 0, "memory is left behind");
  Require(tessel_double::Faults().empty(), "memory is misused");
  return 0;
}
