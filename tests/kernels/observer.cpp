#include "tests/kernels/observer.h"

#include "kernels/table/kernel_row.h"

// The linker sends calls of kestrel::RunKernel here.
#define KESTREL_RUN_KERNEL(prefix) \
  prefix##_ZN7kestrel9RunKernelERKNS_9KernelRowEPK5MRECTPKiS7_PKPhPKPKhPK13EngineContext

extern "C" uint32_t KESTREL_RUN_KERNEL(__real_)(const kestrel::KernelRow& row, const MRECT* rect,
                                                const int32_t* dstPitches,
                                                const int32_t* srcPitches,
                                                uint8_t* const* dstPlanes,
                                                const uint8_t* const* srcPlanes,
                                                const EngineContext* context);

namespace {

const char* lastAccepted = nullptr;
int acceptedCount = 0;

}  // namespace

extern "C" uint32_t KESTREL_RUN_KERNEL(__wrap_)(const kestrel::KernelRow& row, const MRECT* rect,
                                                const int32_t* dstPitches,
                                                const int32_t* srcPitches,
                                                uint8_t* const* dstPlanes,
                                                const uint8_t* const* srcPlanes,
                                                const EngineContext* context) {
  const uint32_t answer =
      KESTREL_RUN_KERNEL(__real_)(row, rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);
  if (answer == KESTREL_OK) {
    lastAccepted = row.name;
    ++acceptedCount;
  }
  return answer;
}

namespace kernel_tests {

Observed Observe(KernelFn* dispatcher, const MRECT* rect, const int32_t* dstPitches,
                 const int32_t* srcPitches, uint8_t* const* dstPlanes,
                 const uint8_t* const* srcPlanes, const EngineContext* context) {
  lastAccepted = nullptr;
  acceptedCount = 0;
  const uint32_t answer = dispatcher(rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);
  return {answer, lastAccepted, acceptedCount};
}

Answer AskChain(const EngineContext* context) {
  struct Member {
    const char* name;
    KernelFn* entry;
  };
#define KESTREL_EXPORT(name) {#name, name},
  constexpr Member kChain[] = {
#include "kernels/exports.def"
  };
#undef KESTREL_EXPORT
  uint8_t bytes[64] = {};
  uint8_t* const dstPlanes[3] = {bytes, bytes + 16, bytes + 17};
  const uint8_t* const srcPlanes[3] = {bytes + 32, bytes + 48, bytes + 49};
  const int32_t pitches[3] = {4, 4, 4};
  const MRECT nothing = {0, 0, 0, 0};
  const char* overwritten = nullptr;
  for (const Member& member : kChain) {
    const Observed observed =
        Observe(member.entry, &nothing, pitches, pitches, dstPlanes, srcPlanes, context);
    if (observed.answer == KESTREL_OK) {
      return {member.name, observed.kernel, overwritten};
    }
    if (observed.kernel) {
      overwritten = observed.kernel;
    }
  }
  return {nullptr, nullptr, overwritten};
}

}  // namespace kernel_tests
