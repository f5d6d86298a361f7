// Read, resample, convert, write: every conversion is one pass through this pipeline.
#ifndef KESTREL_KERNELS_PIPELINE_PIPELINE_H
#define KESTREL_KERNELS_PIPELINE_PIPELINE_H

#include "kernels/pipeline/job.h"

namespace kestrel {

// Converts the job's rectangle, for any pair of formats, sampling and transform. A job that cannot
// be drawn writes nothing.
void RunPipeline(const Job& job);

}  // namespace kestrel

#endif
