// Checksums of a fixed list of conversions. The committed file was made by the plain model and must
// hold for the library on every CPU, with every instruction set.
#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <initializer_list>
#include <iterator>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "engine/postprocess.h"
#include "tests/differential/image.h"
#include "tests/differential/random.h"
#include "tests/reference/reference.h"
#include "tests/support/formats.h"
#include "tests/support/guarded_buffer.h"
#include "tests/support/instruction_sets.h"

namespace differential {
namespace {

using testing_support::GuardedBuffer;
using testing_support::InstructionSet;

struct NamedCode {
  std::string name;
  uint32_t code;
};

// The public formats by their names in small letters, and planar ones with chroma that no named
// format has.
const std::vector<NamedCode>& Formats() {
  static const auto* const formats = [] {
    auto* const list = new std::vector<NamedCode>;
    for (const testing_support::PublicFormat& format : testing_support::kPublicFormats) {
      std::string name = format.name;
      for (char& letter : name) {
        letter = char(std::tolower(letter));
      }
      list->push_back({name, format.code});
    }
    list->push_back({"planar_3x3", 0x50000822});
    list->push_back({"planar_4x1_v_first", 0x50000a30});
    return list;
  }();
  return *formats;
}

// The pairs that transforms, scales and adjustments are crossed with.
struct Pair {
  const char* src;
  const char* dst;
};
constexpr Pair kPairs[] = {{"nv21", "xbgr8888"}, {"xbgr8888", "nv21"}, {"i420", "i420"},
                           {"yuyv", "rgb565"},   {"rgb888", "i422"},   {"gray8", "yuyv"}};

struct GoldenJob {
  std::string name;
  MPPFORMAT dst;
  MPPFORMAT src;
  MPPPARAM params;
};

uint32_t CodeOf(const std::string& name) {
  for (const NamedCode& format : Formats()) {
    if (name == format.name) {
      return format.code;
    }
  }
  return 0;
}

MPPPARAM Params(uint32_t resample, uint32_t transform) {
  MPPPARAM params{};
  params.resampleFlags = resample;
  params.transformCode = transform;
  params.passMode = MPP_PASS_TILED;
  return params;
}

struct Size {
  int32_t width, height;
};

std::string Text(Size size) {
  return std::to_string(size.width) + "x" + std::to_string(size.height);
}

class List {
 public:
  // The name says everything that differs from a plain tiled conversion.
  void Add(const Pair& pair, Size srcSize, Size dstSize, const MPPPARAM& params,
           const std::string& what) {
    GoldenJob job{};
    job.name = std::string(pair.src) + "_" + Text(srcSize) + "_to_" + pair.dst + "_" +
               Text(dstSize) + (params.resampleFlags == MPP_BILINEAR ? "_bilinear" : "_nearest") +
               (params.transformCode ? "_transform" + std::to_string(params.transformCode) : "") +
               (what.empty() ? "" : "_" + what);
    job.dst = {CodeOf(pair.dst), dstSize.width, dstSize.height, nullptr};
    job.src = {CodeOf(pair.src), srcSize.width, srcSize.height, nullptr};
    job.params = params;
    jobs_.push_back(job);
  }

  GoldenJob& Last() { return jobs_.back(); }
  const std::vector<GoldenJob>& jobs() const { return jobs_; }

 private:
  std::vector<GoldenJob> jobs_;
};

void AddFormats(List* list) {
  for (const NamedCode& format : Formats()) {
    const char* const name = format.name.c_str();
    list->Add({name, "xbgr8888"}, {33, 17}, {33, 17}, Params(MPP_NEAREST, 0), "");
    list->Add({name, "nv21"}, {33, 17}, {40, 24}, Params(MPP_BILINEAR, 0), "");
    list->Add({"xbgr8888", name}, {33, 17}, {33, 17}, Params(MPP_NEAREST, 2), "");
    list->Add({"nv12", name}, {48, 32}, {33, 17}, Params(MPP_BILINEAR, 0), "");
  }
}

void AddTransforms(List* list) {
  for (const Pair& pair : kPairs) {
    for (uint32_t transform = 0; transform < 8; ++transform) {
      const bool swapped = transform & MPP_SWAP_XY;
      list->Add(pair, {64, 48}, swapped ? Size{48, 64} : Size{64, 48},
                Params(MPP_NEAREST, transform), "");
      list->Add(pair, {33, 17}, swapped ? Size{25, 47} : Size{47, 25},
                Params(MPP_BILINEAR, transform), "");
    }
  }
}

void AddScales(List* list) {
  constexpr Size kSizes[][2] = {
      {{33, 17}, {66, 34}}, {{64, 48}, {32, 24}}, {{33, 17}, {64, 48}}, {{64, 48}, {33, 17}}};
  for (const Pair& pair : kPairs) {
    for (const auto& size : kSizes) {
      for (uint32_t resample : {MPP_NEAREST, MPP_BILINEAR}) {
        list->Add(pair, size[0], size[1], Params(resample, 0), "");
      }
    }
  }
}

void AddColour(List* list) {
  const char* const standards[] = {"601video", "601full", "709video", "709full"};
  for (uint32_t standard = 0; standard < 4; ++standard) {
    list->Add({"nv21", "xbgr8888"}, {64, 48}, {64, 48}, Params(MPP_NEAREST, 0),
              standards[standard]);
    list->Last().src.format |= standard << 12;
    list->Add({"xbgr8888", "nv21"}, {64, 48}, {64, 48}, Params(MPP_NEAREST, 0),
              standards[standard]);
    list->Last().dst.format |= standard << 12;
    for (uint32_t other = 0; other < 4; ++other) {
      list->Add({"i420", "i420"}, {64, 48}, {64, 48}, Params(MPP_NEAREST, 0),
                std::string(standards[standard]) + "_to_" + standards[other]);
      list->Last().src.format |= standard << 12;
      list->Last().dst.format |= other << 12;
    }
  }
  constexpr int32_t kSettings[][3] = {{40, 0, 0},       {0, 30, 0},     {0, 0, 50},
                                      {-20, -60, -128}, {0, 128, 0},    {7, -128, 128},
                                      {128, 128, 128},  {-128, -64, 99}};
  for (const auto& setting : kSettings) {
    for (const Pair& pair : kPairs) {
      MPPPARAM params = Params(MPP_NEAREST, 0);
      params.brightness = setting[0];
      params.contrast = setting[1];
      params.saturation = setting[2];
      list->Add(pair, {33, 17}, {33, 17}, params,
                "adjusted" + std::to_string(setting[0]) + "," + std::to_string(setting[1]) + "," +
                    std::to_string(setting[2]));
    }
  }
}

void AddRest(List* list) {
  for (uint32_t mode : {1u, 2u, 3u, 4u, MPP_PASS_TILED}) {
    for (uint32_t aspect = 0; aspect < 4; ++aspect) {
      MPPPARAM params = Params(MPP_BILINEAR, 3);
      params.passMode = mode;
      params.aspectMode = aspect;
      list->Add({"i420", "i420"}, {64, 48}, {40, 72}, params,
                "mode" + std::to_string(mode) + "_aspect" + std::to_string(aspect));
    }
  }
  for (uint32_t transform = 0; transform < 8; ++transform) {
    MPPPARAM params = Params(MPP_BILINEAR, transform);
    params.dither = 1;
    params.bandSelector = transform & 2 ? 4 : 5;
    list->Add({"nv21", "rgb565"}, {64, 48}, {70, 71}, params, "dithered");
  }
  MPPPARAM params = Params(MPP_BILINEAR, 6);
  params.alpha = 200;
  params.srcOriginX = 3;
  params.srcOriginY = 5;
  params.dstOriginX = 7;
  params.dstOriginY = 1;
  params.srcRect = {6, 6, 30, 20};
  list->Add({"yv12", "xrgb8888"}, {33, 17}, {33, 17}, params, "inner_source");
  list->Add({"yv12", "xrgb8888"}, {33, 17}, {48, 20}, params, "inner_source");
}

// What cameras and galleries ask for most. BT.601 full range goes to kernels of its own.
void AddFrequent(List* list) {
  constexpr Size kSizes[][2] = {
      {{64, 48}, {64, 48}}, {{67, 35}, {67, 35}}, {{64, 48}, {80, 60}}, {{68, 38}, {51, 29}}};
  const auto add = [list, &kSizes](const Pair& pair, const char* what, uint32_t dither) {
    for (const auto& size : kSizes) {
      const bool isUnit = size[0].width == size[1].width;
      MPPPARAM params = Params(isUnit ? MPP_NEAREST : MPP_BILINEAR, 0);
      params.dither = dither;
      list->Add(pair, size[0], size[1], params, what);
      GoldenJob& job = list->Last();
      for (MPPFORMAT* const side : {&job.src, &job.dst}) {
        side->format |= testing_support::HasStandard(side->format) ? FORMAT_BT601_FULL : 0;
      }
    }
  };
  for (const char* const src : {"nv21", "i420", "nv12"}) {
    for (const char* const dst : {"xbgr8888", "bgr888", "rgb888", "rgb565"}) {
      add({src, dst}, "full_range", 0);
    }
  }
  add({"xbgr8888", "nv21"}, "full_range", 0);
  add({"xbgr8888", "i420"}, "full_range", 0);
  constexpr Pair kBetweenRgb[] = {
      {"rgb565", "xbgr8888"}, {"rgb565", "bgr888"},     {"rgb565", "bgr565"},
      {"bgr888", "xbgr8888"}, {"bgr888", "rgb565"},     {"xbgr8888", "bgr888"},
      {"xbgr8888", "rgb565"}, {"xbgr8888", "xrgb8888"}, {"bgr888", "rgb888"}};
  for (const Pair& pair : kBetweenRgb) {
    add(pair, "frequent", 0);
  }
  add({"i420", "rgb565"}, "full_range_dithered", 1);
  add({"rgb888", "rgb565"}, "frequent_dithered", 1);
}

uint32_t Crc32(uint32_t crc, const uint8_t* bytes, size_t count) {
  crc = ~crc;
  for (size_t i = 0; i < count; ++i) {
    crc ^= bytes[i];
    for (int bit = 0; bit < 8; ++bit) {
      crc = (crc >> 1) ^ (crc & 1 ? 0xEDB88320u : 0);
    }
  }
  return ~crc;
}

// An image in memory: blocks at addresses and pitches that are multiples of 16.
class Image {
 public:
  Image(const MPPFORMAT& record, int32_t width, int32_t height) {
    reference::DecodeFormat(record, &format_);
    blocks_ = BlocksOf(format_, width, height, false);
    uint8_t* tops[3] = {nullptr, nullptr, nullptr};
    for (int i = 0; i < blocks_.count; ++i) {
      pitches[i] = (blocks_.block[i].rowBytes + 15) / 16 * 16;
      memory_.push_back(std::make_unique<GuardedBuffer>(Size(i)));
      tops[i] = memory_[i]->begin();
    }
    if (blocks_.count == 2) {
      pitches[2] = pitches[1];
    }
    SlotsOf<uint8_t>(format_, tops, planes);
  }

  void Clear() {
    for (int i = 0; i < blocks_.count; ++i) {
      std::memset(memory_[i]->begin(), 0xA5, Size(i));
    }
  }

  // Soft gradients with a sprinkling of noise.
  void Draw() {
    Random random(33, format_.code);
    for (int i = 0; i < blocks_.count; ++i) {
      for (int32_t y = 0; y < blocks_.block[i].rows; ++y) {
        for (int32_t x = 0; x < pitches[i]; ++x) {
          const uint32_t noise = uint32_t(random.Next() & 31);
          memory_[i]->begin()[y * pitches[i] + x] =
              uint8_t(40 * i + x * 3 + y * 7 + (x * y) / 16 + int32_t(noise));
        }
      }
    }
  }

  uint32_t Checksum() const {
    uint32_t crc = 0;
    for (int i = 0; i < blocks_.count; ++i) {
      crc = Crc32(crc, memory_[i]->begin(), Size(i));
    }
    return crc;
  }

  uint8_t* planes[3] = {nullptr, nullptr, nullptr};
  int32_t pitches[3] = {0, 0, 0};

 private:
  size_t Size(int block) const {
    return size_t(pitches[block]) * size_t(blocks_.block[block].rows);
  }

  reference::Format format_;
  ImageBlocks blocks_;
  std::vector<std::unique_ptr<GuardedBuffer>> memory_;
};

uint32_t RunProduct(const reference::Job& job, const InstructionSet& set) {
  MPPFORMAT dst = job.dst;
  MPPFORMAT src = job.src;
  MPPPARAM params = job.params;
  MPPHandle* handle = nullptr;
  uint32_t code = MPPCreate(&dst, &src, &params, &handle);
  if (code == KESTREL_OK) {
    ForceRows(handle, set);
    code = MPProcess(handle, job.dstPlanes, nullptr, job.dstPitches, job.srcPlanes, job.srcPitches);
    MPPDestroy(handle);
  }
  return code;
}

// Of the library with a set, or of the plain model for none.
std::string LineOf(const GoldenJob& golden, const InstructionSet* set) {
  const MPPPARAM& params = golden.params;
  Image src(golden.src, params.srcOriginX + golden.src.width,
            params.srcOriginY + golden.src.height);
  Image dst(golden.dst, params.dstOriginX + golden.dst.width,
            params.dstOriginY + golden.dst.height);
  src.Draw();
  dst.Clear();
  uint8_t palette[1024];
  Random(7).Fill(palette, sizeof(palette));

  reference::Job job{};
  job.dst = golden.dst;
  job.src = golden.src;
  if (testing_support::IsIndexedCode(golden.src.format)) {
    job.src.palette = palette;
  }
  job.params = params;
  for (int i = 0; i < 3; ++i) {
    job.dstPlanes[i] = dst.planes[i];
    job.dstPitches[i] = dst.pitches[i];
    job.srcPlanes[i] = src.planes[i];
    job.srcPitches[i] = src.pitches[i];
  }
  const uint32_t code = set ? RunProduct(job, *set) : reference::Convert(job);
  char sum[40];
  if (code == KESTREL_OK) {
    std::snprintf(sum, sizeof(sum), " %08x\n", dst.Checksum());
  } else {
    std::snprintf(sum, sizeof(sum), " refused with %u\n", code);
  }
  return golden.name + sum;
}

// Prints the lines that differ. True when there are none.
bool SameLines(const std::string& got, const std::string& expected) {
  std::istringstream gotLines(got), expectedLines(expected);
  std::string gotLine, expectedLine;
  bool same = true;
  for (;;) {
    const bool more = bool(std::getline(gotLines, gotLine));
    const bool expectedMore = bool(std::getline(expectedLines, expectedLine));
    if (!more && !expectedMore) {
      return same;
    }
    if (!more || !expectedMore || gotLine != expectedLine) {
      std::printf("got      %s\nexpected %s\n", more ? gotLine.c_str() : "(nothing)",
                  expectedMore ? expectedLine.c_str() : "(nothing)");
      same = false;
    }
  }
}

std::string LinesOf(const List& list, const InstructionSet* set) {
  std::string lines;
  for (const GoldenJob& job : list.jobs()) {
    lines += LineOf(job, set);
  }
  return lines;
}

int Usage() {
  std::fprintf(stderr,
               "usage: golden [--rows NAME | --reference] [--file PATH]\n"
               "       golden --reference --file PATH --update\n"
               "Prints `name crc32` of every conversion, or compares them with a file, or rewrites "
               "it.\n--reference: the plain model instead of the library.\n"
               "--rows: with one instruction set only, of: %s\n",
               NamesOf(testing_support::InstructionSets()).c_str());
  return 2;
}

int Main(int argc, char** argv) {
  bool update = false;
  bool useReference = false;
  std::string path, rows;
  for (int i = 1; i < argc; ++i) {
    const std::string argument = argv[i];
    if (argument == "--update") {
      update = true;
    } else if (argument == "--reference") {
      useReference = true;
    } else if (argument == "--file" && i + 1 < argc) {
      path = argv[++i];
    } else if (argument == "--rows" && i + 1 < argc) {
      rows = argv[++i];
    } else {
      return Usage();
    }
  }
  const std::vector<InstructionSet> sets = testing_support::InstructionSetsNamed(rows);
  if (sets.empty() || (useReference && !rows.empty()) ||
      (update && (path.empty() || !useReference))) {
    return Usage();
  }
  List list;
  AddFormats(&list);
  AddTransforms(&list);
  AddScales(&list);
  AddColour(&list);
  AddRest(&list);
  AddFrequent(&list);
  if (path.empty()) {
    std::fputs(LinesOf(list, useReference ? nullptr : &sets[0]).c_str(), stdout);
    return 0;
  }
  if (update) {
    std::ofstream file(path, std::ios::binary);
    file << LinesOf(list, nullptr);
    return file.flush() ? 0 : 1;
  }
  std::ifstream file(path, std::ios::binary);
  const std::string expected((std::istreambuf_iterator<char>(file)),
                             std::istreambuf_iterator<char>());
  const auto agree = [&](const InstructionSet* set, const char* name) {
    if (expected.empty() || !SameLines(LinesOf(list, set), expected)) {
      std::printf("the checksums of %s differ from %s\n", name, path.c_str());
      return false;
    }
    std::printf("%zu checksums of %s agree\n", list.jobs().size(), name);
    return true;
  };
  if (useReference) {
    return agree(nullptr, "the plain model") ? 0 : 1;
  }
  bool allAgree = true;
  for (const InstructionSet& set : sets) {
    allAgree = agree(&set, set.name.c_str()) && allAgree;
  }
  return allAgree ? 0 : 1;
}

}  // namespace
}  // namespace differential

int main(int argc, char** argv) {
  return differential::Main(argc, argv);
}
