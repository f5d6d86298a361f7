// MPPAlign with any rectangles, and MPProcessEx, which must draw what MPProcess draws when it is
// given the address of any pixel instead of the image's.
#include <cstring>

#include "fuzz/jobs.h"
#include "tests/support/instruction_sets.h"

namespace {

using fuzz::Fail;
using fuzz::Input;
using fuzz::Require;

constexpr int32_t kFarthest = 16777216;

bool IsZero(const MRECT& rect) {
  return (rect.left | rect.top | rect.right | rect.bottom) == 0;
}

bool IsSame(const MRECT& a, const MRECT& b) {
  return std::memcmp(&a, &b, sizeof(a)) == 0;
}

void Plan(Input* input, MPPHandle* handle) {
  const MRECT dst = input->OneIn(2) ? MRECT{} : fuzz::DrawRect(input);
  const MRECT src = input->OneIn(2) ? MRECT{} : fuzz::DrawRect(input);
  MRECT first[2] = {dst, src};
  const uint32_t code = MPPAlign(handle, &first[0], &first[1]);
  Require(code == (IsZero(dst) || IsZero(src) ? KESTREL_OK : KESTREL_BAD_ARGUMENT),
          "planning takes exactly one rectangle");
  if (code != KESTREL_OK) {
    Require(IsSame(first[0], dst) && IsSame(first[1], src), "a refusal writes rectangles");
  }
  MRECT second[2] = {dst, src};
  Require(MPPAlign(handle, &second[0], &second[1]) == code &&
              std::memcmp(first, second, sizeof(first)) == 0,
          "planning depends on something besides its arguments");
}

// How far MPProcessEx takes a plane to be away from the image, by the helpers of the interface.
int64_t OffsetOf(const MPPFORMAT& record, const MRECT& origin, int plane, int32_t pitch) {
  FormatDesc desc = {};
  PlaneLayout layout = {};
  uint32_t factors[6] = {};
  if (MPParseFormat(&desc, &record) != KESTREL_OK) Fail("an engine has an unknown format");
  const int64_t unit = MPGetPlaneLayout(&desc, &layout) >> 3;
  Require(MPGetSubsampling(&desc, &layout, factors) == KESTREL_OK, "a format has no factors");
  const int64_t column = origin.left / int32_t(factors[plane]);
  const int64_t row = origin.top / int32_t(factors[3 + plane]);
  return row * pitch + unit * column;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static fuzz::Images images;
  Input input(data, size);
  const int32_t plans = input.Between(0, 3);
  MRECT origin = fuzz::DrawRect(&input);
  if (input.OneIn(2)) {
    origin.left &= 127;
    origin.top &= 127;
  }
  const fuzz::Job job = fuzz::DrawJob(&input);
  if (job.farDstPitch != 0) origin.top = 0;  // there is no such address
  reference::Job call = {};
  call.dst = job.drawn.dst.record;
  call.src = job.drawn.src.record;
  call.params = job.drawn.params;
  if (job.hasImages) {
    images.Prepare(job);
    call = images.JobOnProduct();
  }
  MPPHandle* handle = nullptr;
  if (MPPCreate(&call.dst, &call.src, &call.params, &handle) != KESTREL_OK) return 0;
  const auto& sets = testing_support::InstructionSets();
  ForceRows(handle, sets[size_t(input.Between(0, int32_t(sets.size()) - 1))]);
  for (int32_t i = 0; i <= plans; ++i) Plan(&input, handle);
  if (!job.hasImages) {
    MPPDestroy(handle);
    return 0;
  }

  const MRECT* const rect = call.hasRect ? &call.rect : nullptr;
  const uint32_t expected =
      MPProcess(handle, call.dstPlanes, rect, call.dstPitches, call.srcPlanes, call.srcPitches);
  images.ExpectProduct();
  images.RestoreProduct();
  const bool isRefused =
      origin.left < 0 || origin.top < 0 || origin.left > kFarthest || origin.top > kFarthest;
  uint8_t* moved[3] = {nullptr, nullptr, nullptr};
  for (int i = 0; i < 3; ++i) {
    if (call.dstPlanes[i] == nullptr) continue;
    const int64_t offset = isRefused ? 0 : OffsetOf(call.dst, origin, i, call.dstPitches[i]);
    moved[i] = reinterpret_cast<uint8_t*>(reinterpret_cast<uintptr_t>(call.dstPlanes[i]) +
                                          uintptr_t(offset));
  }
  const uint32_t code =
      MPProcessEx(handle, moved, &origin, rect, call.dstPitches, call.srcPlanes, call.srcPitches);
  MPPDestroy(handle);
  if (isRefused) {
    Require(code == KESTREL_BAD_ARGUMENT, "an impossible origin is taken");
    Require(images.ProductUnchanged(), "a refusal writes pixels");
    return 0;
  }
  if (code != expected) Fail("other code for the same job\n" + differential::Describe(job.drawn));
  const std::string difference = images.Difference();
  if (!difference.empty()) Fail(difference + "\n" + differential::Describe(job.drawn));
  return 0;
}
