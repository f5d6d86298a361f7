// Which kernel answers for an engine: the decisions of the family chain, on their own.
#ifndef KESTREL_TESTS_REFERENCE_CHOOSER_H
#define KESTREL_TESTS_REFERENCE_CHOOSER_H

#include "tests/reference/reference.h"

namespace reference {

// Each gives the name of the kernel that its dispatcher runs, or null when it declines.
const char* ChooseYuvToYuv(const Engine& engine);    // YUV2YUV_Fast
const char* ChooseI420ToI422(const Engine& engine);  // I420_To_I422_Fast
const char* ChoosePackedYuyv(const Engine& engine);  // YUV_YUV_C_FAST
const char* ChooseGrey(const Engine& engine);        // Gray2Gray_C_FAST

// The member of the chain that answers, and its kernel; the generic converter has no kernel.
struct Choice {
  const char* dispatcher;
  const char* kernel;
};

Choice Choose(const Engine& engine);

// Whether a kernel that is called by name takes the engine: the entry tests of the kernels that
// YUV2YUV_Fast asks in turn and of the MCC members. `known` is false for all others.
bool Takes(const char* kernel, const Engine& engine, bool* known);

// What a kernel, told by its name, gives instead of the generic converter's bytes. Null: nothing.
Quirks QuirksOf(const char* kernel);

}  // namespace reference

#endif
