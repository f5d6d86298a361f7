#include "tests/support/instruction_sets.h"

namespace testing_support {

const std::vector<InstructionSet>& InstructionSets() {
  static const auto* const sets = new std::vector<InstructionSet>{{"selected", nullptr}};
  return *sets;
}

}  // namespace testing_support
