// Row operations with SSE4.1.
#include "kernels/rows/vector_x86.h"
// The vectors come first: what follows is written in terms of them.
#include "kernels/rows/vector_rows.h"

namespace kestrel {

const RowOps kSse41Rows = VectorRows("SSE4.1");

}  // namespace kestrel
