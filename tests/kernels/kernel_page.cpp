// Writes docs/kernels.md from the kernel table, or compares it: kernel_page FILE [--update].
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>

#include "kernels/table/kernels.h"

namespace {

using namespace kestrel;

struct SetName {
  uint32_t bit;
  const char* name;
};

constexpr SetName kFormats[] = {
    {kRgb16, "16-bit RGB"}, {kRgb24, "24-bit RGB"}, {kRgb32, "32-bit RGB"}, {kGrey, "grey"},
    {kI420, "I420"},        {kI440, "I440"},        {kI422, "I422"},        {kI444, "I444"},
    {kYv12, "YV12"},        {kNv21, "NV21"},        {kNv12, "NV12"},        {kNv61, "NV61"},
    {kYuyv, "YUYV"},        {kYuv444, "YUV444"},
};

constexpr SetName kQuirks[] = {
    {kNoLevelMap, "levels never changed"},
    {kPairChroma, "U of a pair's first pixel, V of its second"},
    {kPairEdges, "edge columns tested in pairs"},
    {kSharedLowerLine, "rows of a pair share the lower line"},
    {kNoEdgeColumns, "no edge columns"},
    {kClampedCarry, "dithers from clamped channels"},
    {kCarryIfAsked, "if asked"},
    {kNoDither, "never dithered"},
    {kNearestOnly, "always nearest"},
    {kSixBitMatrix, "6-bit matrix, never adjusted"},
};

template <size_t kSize>
std::string Names(const SetName (&names)[kSize], uint32_t set) {
  std::string text;
  for (const SetName& name : names) {
    if ((set & name.bit) != 0) text += (text.empty() ? "" : ", ") + std::string(name.name);
  }
  return text;
}

const char* Text(Pairing pairing) {
  switch (pairing) {
    case Pairing::kSame:
      return " (same on both sides)";
    case Pairing::kDifferent:
      return " (different on the two sides)";
    case Pairing::kOneIsI420:
      return " (exactly one side I420)";
    case Pairing::k601Full:
      return " (BT.601 full range; 24- and 32-bit RGB of 8-bit channels)";
    default:
      return "";
  }
}

const char* Text(Scale scale) {
  switch (scale) {
    case Scale::kUnit:
      return "1:1";
    case Scale::kUnitSteps:
      return "1:1 (by its steps)";
    case Scale::kNotUnit:
      return "scaled";
    case Scale::kNearest:
      return "nearest";
    case Scale::kNotBilinear:
      return "1:1 or nearest";
    case Scale::kUnitOrNearest:
      return "1:1 (by its steps) or nearest";
    case Scale::kUnitOrBilinear:
      return "1:1 (by its steps) or bilinear";
    case Scale::kBilinear:
      return "bilinear";
    case Scale::kBilinearFlag:
      return "bilinear, also at 1:1";
    default:
      return "any";
  }
}

const char* Text(Transform transform) {
  switch (transform) {
    case Transform::kNone:
      return "none";
    case Transform::kSwapXY:
      return "swap";
    case Transform::kMirrorX:
      return "mirror X";
    case Transform::kRotate90:
      return "90 degrees";
    case Transform::kMirrorY:
      return "mirror Y";
    case Transform::kRotate270:
      return "270 degrees";
    case Transform::kRotate180:
      return "180 degrees";
    case Transform::kRotate90MirrorY:
      return "90 degrees and mirror Y";
    case Transform::kNoSwapNoMirrorX:
      return "none or mirror Y";
    case Transform::kSwapMirrorX:
      return "swap and mirror X";
    case Transform::kSwapMirrorY:
      return "swap and mirror Y";
    case Transform::kCode0:
      return "code 0";
    case Transform::kCode3:
      return "code 3";
    case Transform::kCode5:
      return "code 5";
    case Transform::kCode3Or5:
      return "code 3 or 5";
    default:
      return "any";
  }
}

const char* Text(Block block) {
  switch (block) {
    case Block::k2x2:
      return "2";
    case Block::k4x4:
      return "3";
    case Block::k2x2Or4x4:
      return "2 or 3";
    default:
      return "any";
  }
}

std::string Page() {
  std::ostringstream page;
  page
      << "# Exported kernels\n\n"
         "Generated from the kernel tables (`kernels/<family>/kernels.def`); do not edit by hand:\n"
         "`kernel_page docs/kernels.md --update` rewrites it.\n\n"
         "A kernel answers 3 and writes nothing for an engine it does not accept. What it writes "
         "is\n"
         "what the generic converter gives for the same job, except where the last column says\n"
         "otherwise. [How to add a kernel](adding-a-kernel.md).\n\n"
         "| Kernel | Source | Destination | Scale | Transform | Block mode | Differs |\n"
         "| --- | --- | --- | --- | --- | --- | --- |\n";
  for (const KernelRow& row : kKernels) {
    page << "| `" << row.name << "` | " << Names(kFormats, row.sources) << " | "
         << Names(kFormats, row.destinations) << Text(row.pairing) << " | " << Text(row.scale)
         << " | " << Text(row.transform) << " | " << Text(row.block) << " | "
         << Names(kQuirks, row.quirks) << " |\n";
  }
  return page.str();
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 2) {
    std::cerr << "usage: kernel_page FILE [--update]\n";
    return 2;
  }
  if (argc > 2 && std::strcmp(argv[2], "--update") == 0) {
    std::ofstream(argv[1]) << Page();
    return 0;
  }
  std::ifstream file(argv[1]);
  std::ostringstream stored;
  stored << file.rdbuf();
  if (stored.str() == Page()) {
    std::cout << kernel_id::kCount << " kernels, the page agrees\n";
    return 0;
  }
  std::cout << "the page differs from the kernel table: kernel_page " << argv[1] << " --update\n";
  return 1;
}
