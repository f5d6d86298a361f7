// Row operations with AVX-512 (F, BW, DQ, VL, VBMI and VNNI).
#include "kernels/rows/vector_x86.h"
// The vectors come first: what follows is written in terms of them.
#include "kernels/rows/vector_rows.h"

namespace kestrel {

const RowOps kAvx512Rows = VectorRows("AVX-512");

}  // namespace kestrel
