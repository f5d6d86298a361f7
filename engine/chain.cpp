// The family chain: the first dispatcher that answers 0 has done the job.
#include "engine/engine_internal.h"

namespace {

constexpr KernelFn* kFamilies[] = {
    NEC_ALL,
    ANY_ANY_C_FAST_R8G8B8,
    YUV2YUV_Fast,
    ANY_ANY_C_FAST_R5G6B5,
    I420_To_I422_Fast,
    YUV_YUV_C_FAST,
    YUV_RGB32_C_FAST,
    YUYV_RGB32_FAST,
    ANY_ANY_C_FAST_RGB32,
    Gray2Gray_C_FAST,
};

}  // namespace

extern "C" uint32_t ANY_ANY_Bilinear_No_Table(const MRECT* rect, const int32_t* dstPitches,
                                              const int32_t* srcPitches, uint8_t* const* dstPlanes,
                                              const uint8_t* const* srcPlanes,
                                              const EngineContext* context) {
  if (!kestrel::IsComplete(rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context)) {
    return KESTREL_BAD_ARGUMENT;
  }
  for (KernelFn* family : kFamilies) {
    if (family(rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context) == KESTREL_OK) {
      return KESTREL_OK;
    }
  }
  ANY_ANY_C_SLOW(rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);
  return KESTREL_OK;
}
