#include "tests/support/instruction_sets.h"

#include "kernels/rows/rows.h"

namespace testing_support {

const std::vector<InstructionSet>& InstructionSets() {
  static const auto* const sets = [] {
    auto* const list = new std::vector<InstructionSet>;
    const kestrel::RowOpsList available = kestrel::AvailableRowOps();
    for (const kestrel::RowOps* const* rows = available.ops; *rows; ++rows) {
      list->push_back({(*rows)->name, *rows});
    }
    return list;
  }();
  return *sets;
}

}  // namespace testing_support
