// Makes engines use the row operations of a given instruction set instead of the one that their
// creation selects. Two files implement it: instruction_sets.cpp with every set that the CPU can
// run, and selected_set.cpp, for programs that see no more of the library than its exports, with
// nothing but the set that creation selects.
#ifndef KESTREL_TESTS_SUPPORT_INSTRUCTION_SETS_H
#define KESTREL_TESTS_SUPPORT_INSTRUCTION_SETS_H

#include <ostream>
#include <string>
#include <vector>

#include "engine/context.h"

namespace testing_support {

struct InstructionSet {
  std::string name;
  const KestrelRowOps* rows;  // null: as creation selects
};

inline void PrintTo(const InstructionSet& set, std::ostream* out) {
  *out << set.name;
}

// The fastest first.
const std::vector<InstructionSet>& InstructionSets();

// The set of a name, or all of them for no name; empty when there is none of that name.
inline std::vector<InstructionSet> InstructionSetsNamed(const std::string& name) {
  std::vector<InstructionSet> found;
  for (const InstructionSet& set : InstructionSets()) {
    if (name.empty() || set.name == name) {
      found.push_back(set);
    }
  }
  return found;
}

// Their names in one line.
inline std::string NamesOf(const std::vector<InstructionSet>& sets) {
  std::string names;
  for (const InstructionSet& set : sets) {
    names += (names.empty() ? "" : ", ") + set.name;
  }
  return names;
}

// In every pass of a new engine.
inline void ForceRows(MPPHandle* handle, const InstructionSet& set) {
  for (PassEngine* const pass : handle->pass) {
    if (pass && set.rows) {
      pass->context->rows = set.rows;
    }
  }
}

}  // namespace testing_support

#endif
