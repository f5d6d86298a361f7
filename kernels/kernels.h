/*
 * The exported kernels, for callers that have a job for one particular kernel. All take the six
 * arguments of the kernel contract (engine/context.h) and answer KESTREL_OK, or KESTREL_UNSUPPORTED
 * with nothing written when the engine is not one they accept. docs/kernels.md lists what each
 * accepts. MPProcess chooses among them by itself.
 */
#ifndef KESTREL_KERNELS_KERNELS_H
#define KESTREL_KERNELS_KERNELS_H

#include "engine/api.h"
#include "engine/context.h"

KESTREL_BEGIN_C

#define KERNEL(name, ...) KESTREL_API KernelFn name;
#include "kernels/all_kernels.def"
#undef KERNEL

KESTREL_END_C

#endif
