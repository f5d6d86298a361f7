// Names of kernels say what they take. Where a name and its line in the table disagree the name is
// older than the decision, and stays: callers know it. Each such place is listed with its reason.
#include <gtest/gtest.h>

#include <cstring>
#include <set>
#include <string>

#include "kernels/table/kernels.h"

namespace kernel_tests {
namespace {

using kestrel::Block;
using kestrel::KernelRow;
using kestrel::Scale;
using kestrel::Transform;

struct Exception {
  const char* kernel;  // a whole name, or the start of several names before an asterisk
  const char* column;
  const char* reason;
};

constexpr const char* kAnyAtUnitScale =
    "walks any transform; its suffix is the one it is chosen for";
constexpr const char* kBothOrders = "the order of chroma in a pair is a matter of addresses";
constexpr const char* kBothWays = "converts in either direction";

constexpr Exception kExceptions[] = {
    {"I422_TO_I420_NORESAMPLE*", "source", kBothWays},
    {"I422_TO_I420_NORESAMPLE*", "destination", kBothWays},
    {"I422_TO_I420_NORESAMPLE_4x4", "block", "takes any rectangle: it is asked before its sibling"},
    {"I420_NORESAMPLE_4x4_R90", "source", "V-first planes are turned in the same way"},
    {"I420_NORESAMPLE_4x4_R90", "destination", "V-first planes are turned in the same way"},
    {"I420_Bewteen_YV12_NORESAMPLE_4x4", "source", kBothWays},
    {"I420_Bewteen_YV12_NORESAMPLE_4x4", "destination", kBothWays},
    {"NV21VtoI420Fast_NORESAMPLE_R270_*", "transform", "mirrorX is left to the sign of the step"},
    {"NV21toNV21Fast_*", "source", kBothOrders},
    {"NV21toNV21Fast_*", "destination", kBothOrders},
    {"NV12_TO_NV12_*", "source", kBothOrders},
    {"NV12_TO_NV12_*", "destination", kBothOrders},
    {"NV12_To_NV12_*", "source", kBothOrders},
    {"NV12_To_NV12_*", "destination", kBothOrders},
    {"NV21_To_NV21_*", "source", kBothOrders},
    {"NV21_To_NV21_*", "destination", kBothOrders},
    {"NV12_TO_NV21_*", "source", kBothWays},
    {"NV12_TO_NV21_*", "destination", kBothWays},
    {"YUVtoNV21Fast_*", "destination", kBothOrders},
    {"NV21toI420Fast_Nearest_RESAMPLE_R0_4x4", "scale", "1:1 is nearest as well"},
    {"NV12_To_NV12_Fast_R90_2x2", "block", "rows of 4x4 engines are made of 2x2 blocks too"},
    {"NV12_To_NV12_Fast_Bilinear_R90_2x2", "block",
     "rows of 4x4 engines are made of 2x2 blocks too"},
    {"NV21_To_NV21_REAMPLE_NOROTATE_BILINEAR_Fast_2x2", "block", "chosen for 4x4 engines"},
    {"YUVtoNV21Fast_NORESAMPLE_R0_4x4", "transform", "looks at the whole transform code"},
    {"YUYVtoYUYVFast_N_RESAMPLE_R0_4x4", "block", "chosen for 2x2 engines"},
    {"I420_To_I422_Fast_90", "transform", "its dispatcher has looked at the transform"},
    {"YUV_To_YUV_NOREAMPLE_ROTATE_Fast_4x4", "block", "takes any rectangle"},
    {"I420_To_I420_REAMPLE_NOROTATE_BILINEAR_Fast_4x4", "block", "takes any rectangle"},
    {"I420_To_YUYV_Fast_*90", "transform", "looks at the whole transform code"},
    {"MCC_I420_*90", "transform", "looks at the whole transform code"},
    {"MCC_I420_*270", "transform", "looks at the whole transform code"},
    {"MCC_I420_NV21_NoResampleRotate", "transform", "does not rotate"},
    {"Gray2Gray_C_RESAMPLE_NOROTATE_FAST", "transform", "mirrorY is a matter of pitches"},
    {"Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_*", "transform", "mirrorY is a matter of pitches"},
    {"Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST", "source", "also takes the luma of planar YUV"},
    {"Gray2Gray_C_NORESAMPLE_FAST_4x4", "block", "takes any rectangle"},
    {"RGB24_To_YUYV_Fast_*2x2*", "block", "pairs of columns: any rectangle will do"},
    {"Gray_To_YUYV_Fast_*2x2*", "block", "pairs of columns: any rectangle will do"},
    {"I420_To_YUYV_Fast_*2x2*", "block", "pairs of columns: any rectangle will do"},
    {"RGB24_To_YUYV_Fast_*2x2_*", "transform", kAnyAtUnitScale},
    {"Gray_To_YUYV_Fast_*2x2_*", "transform", kAnyAtUnitScale},
    {"I420_To_YUYV_Fast_*2x2_*", "transform", kAnyAtUnitScale},
    {"I420toYUYVFast_NORESAMPLE_90", "transform", kAnyAtUnitScale},
    {"I420_To_YUYV_*", "source", "reads any subsampling of planar YUV"},
    {"I420toYUYVFast*", "source", "reads any subsampling of planar YUV"},
    {"YUV2NV21_LookupTable_R0_4x4", "block", "takes any rectangle"},
};

// An asterisk of the pattern stands for any characters.
bool Fits(const char* name, const char* pattern) {
  if (*pattern == '*') {
    return Fits(name, pattern + 1) || (*name != '\0' && Fits(name + 1, pattern));
  }
  return *name == *pattern && (*name == '\0' || Fits(name + 1, pattern + 1));
}

// Sets of layouts that words of names mean.
struct Word {
  const char* text;
  uint32_t layouts;
};

constexpr Word kWords[] = {
    {"I420", kestrel::kI420},
    {"I422H", kestrel::kI422},
    {"I422V", kestrel::kI440},
    {"I422", kestrel::kI440 | kestrel::kI422},
    {"I444", kestrel::kI444},
    {"YV12", kestrel::kYv12},
    {"NV21V", kestrel::kNv21},
    {"NV21", kestrel::kNv21},
    {"NV12", kestrel::kNv12},
    {"NVXY", kestrel::kSemiPlanar},
    {"YUV422SP", kestrel::kNv61},
    {"YUV422", kestrel::kNv61},
    {"YUYV", kestrel::kYuyv},
    {"RGB24", kestrel::kRgb24},
    {"Gray", kestrel::kGrey},
    {"YUV", kestrel::kPlanar | kestrel::kYv12 | kestrel::kGrey | kestrel::kYuv444},
};

// Takes the first of these that the name begins with off its front.
template <size_t n>
const char* TakeOff(std::string* name, const char* const (&starts)[n]) {
  for (const char* start : starts) {
    if (name->compare(0, std::strlen(start), start) == 0) {
      name->erase(0, std::strlen(start));
      return start;
    }
  }
  return nullptr;
}

const Word* TakeOffWord(std::string* name) {
  for (const Word& word : kWords) {
    if (TakeOff(name, {word.text})) {
      return &word;
    }
  }
  return nullptr;
}

bool FormatsAgree(const Word& word, uint32_t layouts) {
  const bool isAnyYuv = std::strcmp(word.text, "YUV") == 0;
  return isAnyYuv ? layouts != 0 && (layouts & ~word.layouts) == 0 : layouts == word.layouts;
}

bool Contains(const std::string& name, const char* part) {
  return name.find(part) != std::string::npos;
}

bool EndsWith(const std::string& name, const char* end) {
  const size_t length = std::strlen(end);
  return name.size() >= length && name.compare(name.size() - length, length, end) == 0;
}

bool ScaleAgrees(const std::string& name, Scale scale) {
  if (Contains(name, "NORESAMPLE") || Contains(name, "NOREAMPLE") || Contains(name, "NoResample")) {
    return scale == Scale::kUnit || scale == Scale::kUnitSteps;
  }
  if (Contains(name, "BILINEAR") || Contains(name, "Bilinear")) {
    return scale == Scale::kBilinear || scale == Scale::kBilinearFlag;
  }
  if (Contains(name, "Resample")) {
    return scale == Scale::kNotUnit;
  }
  if (Contains(name, "RESAMPLE") || Contains(name, "REAMPLE") || Contains(name, "Nearest")) {
    return scale == Scale::kNearest;
  }
  return true;
}

bool BlockAgrees(const std::string& name, Block block) {
  if (Contains(name, "4x4") || Contains(name, "4X4")) {
    return block == Block::k4x4;
  }
  if (Contains(name, "2x2")) {
    return block == Block::k2x2;
  }
  return !Contains(name, "1x1") || block == Block::kAny;
}

bool TransformAgrees(const std::string& name, Transform transform) {
  if (Contains(name, "R0") || Contains(name, "NOROTATE")) {
    return transform == Transform::kNone;
  }
  if (Contains(name, "Rotate180") || Contains(name, "R180") || EndsWith(name, "_180")) {
    return transform == Transform::kRotate180;
  }
  if (Contains(name, "R270") || EndsWith(name, "_270")) {
    return transform == Transform::kRotate270;
  }
  if (Contains(name, "R90")) {
    return transform == Transform::kRotate90;
  }
  if (EndsWith(name, "_90")) {
    return transform == Transform::kSwapMirrorX;
  }
  if (Contains(name, "Rotate")) {
    return transform == Transform::kCode3Or5;
  }
  if (Contains(name, "ROTATE")) {
    return transform == Transform::kAny;
  }
  if (Contains(name, "H_Flip") || Contains(name, "MLR")) {
    return transform == Transform::kMirrorX;
  }
  if (Contains(name, "V_Flip")) {
    return transform == Transform::kMirrorY;
  }
  if (Contains(name, "SwapXY") || Contains(name, "SXY")) {
    return transform == Transform::kSwapXY;
  }
  return true;
}

// The columns that a name disagrees with.
std::set<std::string> Disagreements(const KernelRow& row) {
  const std::string name = row.name;
  std::set<std::string> columns;
  std::string rest = name;
  TakeOff(&rest, {"MCC_"});
  const Word* const source = TakeOffWord(&rest);
  if (!source) {
    return {"formats"};
  }
  TakeOff(&rest, {"_TO_", "_To_", "to", "2", "_Bewteen_", "_"});
  const Word* const named = TakeOffWord(&rest);
  const Word* const destination = named ? named : source;  // one layout: into itself
  if (!FormatsAgree(*source, row.sources)) {
    columns.insert("source");
  }
  if (!FormatsAgree(*destination, row.destinations)) {
    columns.insert("destination");
  }
  if (!ScaleAgrees(name, row.scale)) {
    columns.insert("scale");
  }
  if (!BlockAgrees(name, row.block)) {
    columns.insert("block");
  }
  if (!TransformAgrees(name, row.transform)) {
    columns.insert("transform");
  }
  return columns;
}

TEST(KernelNames, AgreeWithTheTableButForTheListedExceptions) {
  std::set<const Exception*> used;
  for (const KernelRow& row : kestrel::kKernels) {
    for (const std::string& column : Disagreements(row)) {
      bool isListed = false;
      for (const Exception& exception : kExceptions) {
        if (column == exception.column && Fits(row.name, exception.kernel)) {
          isListed = true;
          used.insert(&exception);
        }
      }
      EXPECT_TRUE(isListed) << row.name << " disagrees with its column: " << column;
    }
  }
  for (const Exception& exception : kExceptions) {
    EXPECT_EQ(used.count(&exception), 1u)
        << exception.kernel << " agrees with its column: " << exception.column;
    EXPECT_GT(std::strlen(exception.reason), 5u);
  }
}

TEST(KernelNames, AreUniqueAndAll151) {
  std::set<std::string> names;
  for (const KernelRow& row : kestrel::kKernels) {
    names.insert(row.name);
  }
  EXPECT_EQ(names.size(), 151u);
  EXPECT_EQ(int(names.size()), int(kestrel::kernel_id::kCount));
}

}  // namespace
}  // namespace kernel_tests
