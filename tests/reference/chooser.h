// Which kernel answers for an engine: the decisions of the family chain, on their own.
#ifndef KESTREL_TESTS_REFERENCE_CHOOSER_H
#define KESTREL_TESTS_REFERENCE_CHOOSER_H

#include "tests/reference/reference.h"

namespace reference {

// A kernel that a dispatcher runs; null when it declines. Some runs do not end the chain: the
// dispatcher answers 3 all the same, and the generic converter draws the rectangle once more.
struct Decision {
  const char* kernel = nullptr;
  bool ends = true;
};

// Each gives the name of the kernel that its dispatcher runs, or null when it declines.
const char* ChooseNeon(const Engine& engine);          // NEC_ALL
const char* ChooseRgb24(const Engine& engine);         // ANY_ANY_C_FAST_R8G8B8
const char* ChooseYuvToYuv(const Engine& engine);      // YUV2YUV_Fast
const char* ChooseRgb16(const Engine& engine);         // ANY_ANY_C_FAST_R5G6B5
const char* ChooseI420ToI422(const Engine& engine);    // I420_To_I422_Fast
const char* ChoosePackedYuyv(const Engine& engine);    // YUV_YUV_C_FAST
const char* ChooseYuyvAndRgb32(const Engine& engine);  // YUYV_RGB32_FAST
const char* ChooseRgb32(const Engine& engine);         // ANY_ANY_C_FAST_RGB32
const char* ChooseGrey(const Engine& engine);          // Gray2Gray_C_FAST

// YUV_RGB32_C_FAST; the only dispatcher that looks at the rectangle.
Decision ChooseYuvToRgb32(const Engine& engine, const Rect& loopRect);

// The member of the chain that answers, and its kernel; the generic converter has no kernel.
struct Choice {
  const char* dispatcher;
  const char* kernel;
  const char* overwritten = nullptr;  // a kernel that ran before without ending the chain
};

Choice Choose(const Engine& engine, const Rect& loopRect = Rect());

// Whether a kernel that is called by name takes the engine: the entry tests of the kernels that
// YUV2YUV_Fast asks in turn, of the last five of NEC_ALL and of the MCC members. `known` is false
// for all others.
bool Takes(const char* kernel, const Engine& engine, bool* known);

// What a kernel, told by its name, gives instead of the generic converter's bytes. Null: nothing.
Quirks QuirksOf(const char* kernel);

}  // namespace reference

#endif
