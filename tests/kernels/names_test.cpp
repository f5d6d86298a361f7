// Names of kernels say what they take. Where a name and its line in the table disagree the name is
// older than the decision, and stays: callers know it. Each such place is listed with its reason.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <initializer_list>
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

constexpr const char* kOneToOneIsNearest = "1:1 is nearest as well";
constexpr const char* kBlended = "chosen for blended jobs";
constexpr const char* kBoth2x2And4x4 = "4x4 engines are made of 2x2 blocks too";
constexpr const char* kNoBlocks = "takes any rectangle";
constexpr const char* kPassMode = "its dispatcher looks at the pass mode that was asked for";

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
    {"NV21toI420Fast_Nearest_RESAMPLE_R0_4x4", "scale", kOneToOneIsNearest},
    {"NV12_To_NV12_Fast_R90_2x2", "block", kBoth2x2And4x4},
    {"NV12_To_NV12_Fast_Bilinear_R90_2x2", "block", kBoth2x2And4x4},
    {"NV21_To_NV21_REAMPLE_NOROTATE_BILINEAR_Fast_2x2", "block", "chosen for 4x4 engines"},
    {"YUVtoNV21Fast_NORESAMPLE_R0_4x4", "transform", "looks at the whole transform code"},
    {"YUYVtoYUYVFast_N_RESAMPLE_R0_4x4", "block", "chosen for 2x2 engines"},
    {"I420_To_I422_Fast_90", "transform", "its dispatcher has looked at the transform"},
    {"YUV_To_YUV_NOREAMPLE_ROTATE_Fast_4x4", "block", kNoBlocks},
    {"I420_To_I420_REAMPLE_NOROTATE_BILINEAR_Fast_4x4", "block", kNoBlocks},
    {"I420_To_YUYV_Fast_*90", "transform", "looks at the whole transform code"},
    {"MCC_I420_*90", "transform", "looks at the whole transform code"},
    {"MCC_I420_*270", "transform", "looks at the whole transform code"},
    {"MCC_I420_NV21_NoResampleRotate", "transform", "does not rotate"},
    {"Gray2Gray_C_RESAMPLE_NOROTATE_FAST", "transform", "mirrorY is a matter of pitches"},
    {"Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_*", "transform", "mirrorY is a matter of pitches"},
    {"Gray2Gray_C_RESAMPLE_BILINEAR_NOROTATE_FAST", "source", "also takes the luma of planar YUV"},
    {"Gray2Gray_C_NORESAMPLE_FAST_4x4", "block", kNoBlocks},
    {"RGB24_To_YUYV_Fast_*2x2*", "block", "pairs of columns: any rectangle will do"},
    {"Gray_To_YUYV_Fast_*2x2*", "block", "pairs of columns: any rectangle will do"},
    {"I420_To_YUYV_Fast_*2x2*", "block", "pairs of columns: any rectangle will do"},
    {"RGB24_To_YUYV_Fast_*2x2_*", "transform", kAnyAtUnitScale},
    {"Gray_To_YUYV_Fast_*2x2_*", "transform", kAnyAtUnitScale},
    {"I420_To_YUYV_Fast_*2x2_*", "transform", kAnyAtUnitScale},
    {"I420toYUYVFast_NORESAMPLE_90", "transform", kAnyAtUnitScale},
    {"I420_To_YUYV_*", "source", "reads any subsampling of planar YUV"},
    {"I420toYUYVFast*", "source", "reads any subsampling of planar YUV"},
    {"YUV2NV21_LookupTable_R0_4x4", "block", kNoBlocks},

    {"NEC_NV21YCbCr601toBGR32_NoResize", "source", kBothOrders},
    {"NEC_NV21toBGR32_Fast_BilNear", "source", kBothOrders},
    {"NEC_NV21toBGR32_Fast_BilNear_R90", "transform", "looks at the whole transform code"},

    {"RGB2RGBFast_RGB888_N_RESIZE_2x2", "scale", kBlended},
    {"RGB2RGBFast_RGB888_N_RESIZE_4x4_R90", "block", kNoBlocks},
    {"RGB2RGBFast_RGB888_N_RESIZE_4x4_R180", "block", kNoBlocks},
    {"RGB2RGBFast_RGB888_N_RESIZE_4x4_HORIZONTAL", "block", kNoBlocks},
    {"RGB2YUVFast_NORESAMPLE_NOROTATE_R8G8B8_2x2", "block", kNoBlocks},

    {"NV21_TO_RGBFast_*", "source", kBothOrders},
    {"NV21_TO_RGBFast_R5G6B5_Nearest", "scale", "the catch-all, also of blended and 1:1 jobs"},
    {"YUV2RGBFast_R5G6B5_Nearest_2x2", "block", "chosen for 4x4 engines"},
    {"RGB2RGBFast_NORESAMPLE_R5G6B5_2x2_R90", "block", kBoth2x2And4x4},
    {"RGB888Fast_R5G6B5", "scale", "chosen for nearest jobs without a transform"},
    {"NV21_To_RGB565_NoResample_4x4", "block", kNoBlocks},

    {"I420toBGR32_Any_Fast_1x1", "source", "reads 4:2:2 as well"},
    {"I420toRGB32_Any_Fast_1x1", "source", "reads 4:2:2 and V-first planes as well"},
    {"I420toBGR32_Fast_BilNear", "source", "blends 4:2:2 as well"},
    {"I420toRGB32_Fast_BilNear", "source", "blends 4:2:2 as well"},
    {"I420toRGB32_Fast_BilNear", "scale", "also chosen for nearest jobs of 4:2:2"},
    {"I420toRGB32_R0_Fast_BilNear_4x4", "block", kPassMode},
    {"YV12toRGB32_Fast_NORESAMPLE_4x4", "block", kPassMode},
    {"RGB2RGBFast_RGBA_N_RESIZE_4x4", "block", kPassMode},
    {"GreytoBGR32_Fast_BilNear", "scale", "chosen for grey at any scale"},
    {"NV21toBGR32_Fast_NoResize_R90_2x2", "scale", "chosen for all turns without blending"},
    {"NV21toBGR32_Fast_NoResize_R90_2x2", "block", kNoBlocks},
    {"I422HtoBGR32_Fast_4x4", "block", kNoBlocks},
    {"RGB2RGBFast_RGB24_TO_RGB32__BILINEARN_RESIZE_2x2", "scale", "also chosen for turns at 1:1"},
    {"RGB2RGBFast_RGB32_TO_RGB24_N_RESIZE_*", "scale", kBlended},
    {"RGB2RGBFast_RGB32_TO_RGB24_N_RESIZE_2x2", "block", kBoth2x2And4x4},
    {"RGB2RGBFast_RGB32_TO_RGB32__BILINEARN_RESIZE_4x4", "block", "also chosen for 2x2 engines"},
    {"RGB2RGBFast_BGR32_TO_BGR24_N_RESIZE_4x4", "scale", kOneToOneIsNearest},
    {"RGB2RGBFast_BGR32_N_RESIZE_*", "scale", kOneToOneIsNearest},
    {"RGB2RGBFast_RGB32_N_RESIZE", "scale", kOneToOneIsNearest},
    {"NV*_TO_RGB32Fast_NORESAMPLE*", "source",
     "the name tells the order of channels, not of chroma"},
    {"NV*_TO_RGB32Fast_NORESAMPLE_4x4", "block", "also chosen for 2x2 engines"},
    {"NV21toRGB32_Fast_BilNear", "source", kBothOrders},
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
    {"NV21YCbCr601", kestrel::kNv21},
    {"NV21", kestrel::kNv21},
    {"NV12", kestrel::kNv12},
    {"NVXY", kestrel::kSemiPlanar},
    {"YUV422SP", kestrel::kNv61},
    {"YUV422", kestrel::kNv61},
    {"YUYV", kestrel::kYuyv},
    {"NVXX", kestrel::kSemiPlanar},
    {"NV", kestrel::kSemiPlanar},
    {"I4XX", kestrel::kI420 | kestrel::kI422},
    {"RGB565", kestrel::kRgb16},
    {"RGB16", kestrel::kRgb16},
    {"BGR16", kestrel::kRgb16},
    {"RGB888", kestrel::kRgb24},
    {"BGR888", kestrel::kRgb24},
    {"RGB24", kestrel::kRgb24},
    {"BGR24", kestrel::kRgb24},
    {"RGB32", kestrel::kRgb32},
    {"BGR32", kestrel::kRgb32},
    {"RGBA", kestrel::kRgb32},
    {"Gray", kestrel::kGrey},
    {"Grey", kestrel::kGrey},
    {"YUV", kestrel::kPlanar | kestrel::kYv12 | kestrel::kGrey | kestrel::kYuv444},
};

// RGB by itself: what a channel order later in the name says, or else 24 bits.
constexpr Word kRgb16Order = {"RGB", kestrel::kRgb16};
constexpr Word kRgb24Order = {"RGB", kestrel::kRgb24};

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

bool Contains(const std::string& name, const char* part) {
  return name.find(part) != std::string::npos;
}

const Word* OrderOf(const std::string& name) {
  return Contains(name, "R5G6B5") || Contains(name, "B5G6R5") ? &kRgb16Order : &kRgb24Order;
}

const Word* TakeOffWord(std::string* name) {
  for (const Word& word : kWords) {
    if (TakeOff(name, {word.text})) {
      return &word;
    }
  }
  return TakeOff(name, {"RGB", "BGR"}) ? OrderOf(*name) : nullptr;
}

bool FormatsAgree(const Word& word, uint32_t layouts) {
  const bool isAnyYuv = std::strcmp(word.text, "YUV") == 0;
  return isAnyYuv ? layouts != 0 && (layouts & ~word.layouts) == 0 : layouts == word.layouts;
}

bool EndsWith(const std::string& name, const char* end) {
  const size_t length = std::strlen(end);
  return name.size() >= length && name.compare(name.size() - length, length, end) == 0;
}

bool ContainsOneOf(const std::string& name, std::initializer_list<const char*> parts) {
  return std::any_of(parts.begin(), parts.end(),
                     [&name](const char* part) { return Contains(name, part); });
}

bool StartsWithOneOf(const std::string& name, std::initializer_list<const char*> starts) {
  return std::any_of(starts.begin(), starts.end(), [&name](const char* start) {
    return name.compare(0, std::strlen(start), start) == 0;
  });
}

bool ScaleAgrees(const std::string& name, Scale scale) {
  if (ContainsOneOf(name, {"NORESAMPLE", "NOREAMPLE", "NoResample", "NoResize", "NO_NO"})) {
    return scale == Scale::kUnit || scale == Scale::kUnitSteps;
  }
  if (ContainsOneOf(name, {"BILINEAR", "Bilinear", "BILINAR", "BilNear"})) {
    return scale == Scale::kBilinear || scale == Scale::kBilinearFlag;
  }
  if (StartsWithOneOf(name, {"MCC_"}) && Contains(name, "Resample")) {
    return scale == Scale::kNotUnit;
  }
  if (ContainsOneOf(name, {"RESAMPLE", "REAMPLE", "Nearest", "Resample", "N_RESIZE", "N_Resize"})) {
    return scale == Scale::kNearest;
  }
  // The RGB families blend where they do not say how they scale.
  return !StartsWithOneOf(name, {"YUV2RGB", "RGB2YUV", "RGB2RGB", "RGB888"}) ||
         scale == Scale::kBilinear;
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
  if (Contains(name, "R90AndVertical")) {
    return transform == Transform::kRotate90MirrorY;
  }
  if (Contains(name, "R90")) {
    return transform == Transform::kRotate90;
  }
  if (EndsWith(name, "_90") || EndsWith(name, "_90_1x1")) {
    return transform == Transform::kSwapMirrorX;
  }
  if (Contains(name, "Rotate")) {
    return transform == Transform::kCode3Or5;
  }
  if (Contains(name, "ROTATE")) {
    return transform == Transform::kAny;
  }
  if (ContainsOneOf(name, {"H_Flip", "HFlip", "MLR", "HORIZONTAL"})) {
    return transform == Transform::kMirrorX;
  }
  if (Contains(name, "V_Flip") || EndsWith(name, "_VERTICAL")) {
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
  TakeOff(&rest, {"MCC_", "NEC_"});
  // These say it twice, and more exactly the second time.
  if (StartsWithOneOf(rest, {"RGB2RGBFast_RGB", "RGB2RGBFast_BGR", "BGR2RGBFast_RGB"})) {
    TakeOff(&rest, {"RGB2RGBFast_", "BGR2RGBFast_"});
  }
  const Word* const source = TakeOffWord(&rest);
  if (!source) {
    return {"formats"};
  }
  TakeOff(&rest, {"_TO_", "_To_", "to", "2", "_Bewteen_", "_"});
  const Word* destination = TakeOffWord(&rest);
  if (!destination) {  // a channel order, or one layout: into itself
    const bool isOrder = Contains(rest, "R5G6B5") && Contains(name, "888");
    destination = isOrder ? &kRgb16Order : source;
  }
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

TEST(KernelNames, AreUniqueAndAll317) {
  std::set<std::string> names;
  for (const KernelRow& row : kestrel::kKernels) {
    names.insert(row.name);
  }
  EXPECT_EQ(names.size(), 317u);
  EXPECT_EQ(int(names.size()), int(kestrel::kernel_id::kCount));
}

}  // namespace
}  // namespace kernel_tests
