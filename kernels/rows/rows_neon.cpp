// Row operations with NEON.
#include "kernels/rows/vector_neon.h"
// The vectors come first: what follows is written in terms of them.
#include "kernels/rows/vector_rows.h"

namespace kestrel {

const RowOps kNeonRows = VectorRows("NEON");

}  // namespace kestrel
