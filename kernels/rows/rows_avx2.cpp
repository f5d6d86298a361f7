// Row operations with AVX2.
#include "kernels/rows/vector_x86.h"
// The vectors come first: what follows is written in terms of them.
#include "kernels/rows/vector_rows.h"

namespace kestrel {

const RowOps kAvx2Rows = VectorRows("AVX2");

}  // namespace kestrel
