// The table as a list, and as numbers: kernel_id::<name> is the line of a kernel in kKernels.
#ifndef KESTREL_KERNELS_TABLE_KERNELS_H
#define KESTREL_KERNELS_TABLE_KERNELS_H

#include "kernels/kernels.h"
#include "kernels/table/kernel_row.h"

namespace kestrel {

namespace kernel_id {
enum : int {
#define KERNEL(name, ...) name,
#include "kernels/all_kernels.def"
#undef KERNEL
  kCount
};
}  // namespace kernel_id

extern const KernelRow kKernels[kernel_id::kCount];
extern KernelFn* const kKernelEntries[kernel_id::kCount];

}  // namespace kestrel

#endif
