// The chooser's answers for a grid of engines: which member of the chain and which kernel run.
// Compares them with the model and with the committed list; --update rewrites the list.
#include <cstdio>
#include <cstring>
#include <fstream>
#include <initializer_list>
#include <iterator>
#include <map>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "engine/postprocess.h"
#include "tests/kernels/observer.h"
#include "tests/reference/chooser.h"
#include "tests/support/formats.h"

namespace kernel_tests {
namespace {

using testing_support::HasStandard;
using testing_support::PublicFormat;

// The public formats, and planar ones with chroma that no named format has.
const std::vector<PublicFormat>& Formats() {
  static const auto* const formats = [] {
    auto* const list = new std::vector<PublicFormat>(std::begin(testing_support::kPublicFormats),
                                                     std::end(testing_support::kPublicFormats));
    list->push_back({"I_ANY", 0x50000822});
    list->push_back({"YV_ANY", 0x50000a22});
    return list;
  }();
  return *formats;
}

struct Scale {
  const char* name;
  uint32_t resample;
  int32_t width;  // of the source in loop orientation; the destination has 32 x 32
  int32_t height;
};

constexpr Scale kScales[] = {
    {"1:1", MPP_BILINEAR, 32, 32},
    {"nearest", MPP_NEAREST, 48, 40},
    {"bilinear", MPP_BILINEAR, 48, 40},
    {"bilinear-equal", MPP_BILINEAR, 48, 48},
};

// Standards of source and destination.
struct Standards {
  char letter;
  uint32_t src;
  uint32_t dst;
};

constexpr Standards kStandards[] = {
    {'v', FORMAT_BT601_VIDEO, FORMAT_BT601_VIDEO},
    {'f', FORMAT_BT601_FULL, FORMAT_BT601_FULL},
    {'r', FORMAT_BT601_FULL, FORMAT_BT601_VIDEO},
};

struct FreeEngine {
  void operator()(MPPHandle* handle) const { MPPDestroy(handle); }
};

class Grid {
 public:
  // The list as text; empty when the chain and the model disagree.
  std::string Write() {
    Groups sources;
    for (const PublicFormat& src : Formats()) {
      Groups destinations;
      for (const PublicFormat& dst : Formats()) {
        Add(LinesOf(src, dst), dst.name, &destinations);
      }
      std::string lines;
      for (const auto& [ofPair, names] : destinations) {
        lines += Prefixed(names + " ", ofPair);
      }
      Add(lines, src.name, &sources);
    }
    std::string lines;
    for (const auto& [ofSource, names] : sources) {
      lines += Prefixed(names + " ", ofSource);
    }
    if (disagreements_ != 0) {
      return std::string();
    }
    std::string text =
        "# Which kernel answers, for every pair of formats. Written by tests/kernels/chooser.cpp.\n"
        "#   sources destinations scales settings : kernels\n"
        "# settings: standards of both sides (v video range, f full range, r from full to video\n"
        "# range), a adjusted, d dithered. kernels: for transform codes 0 to 7 the kernels of\n"
        "# block modes 1,2,3,4; one number when all four are the same, *n for n equal codes.\n"
        "# \"over\": what a kernel has drawn before is drawn once more.\n";
    for (size_t i = 0; i < names_.size(); ++i) {
      text += std::to_string(i) + " = " + names_[i] + "\n";
    }
    return text + lines;
  }

  uint64_t engines() const { return engines_; }

 private:
  using Cells = std::string;

  // Texts, and the names of all that have the same one.
  using Groups = std::vector<std::pair<std::string, std::string>>;

  static void Add(const std::string& text, const std::string& name, Groups* groups) {
    for (auto& group : *groups) {
      if (group.first == text) {
        group.second += "," + name;
        return;
      }
    }
    groups->emplace_back(text, name);
  }

  static std::string Prefixed(const std::string& prefix, const std::string& lines) {
    std::string text;
    std::istringstream in(lines);
    for (std::string line; std::getline(in, line);) {
      text += prefix + line + "\n";
    }
    return text;
  }

  std::string LinesOf(const PublicFormat& src, const PublicFormat& dst) {
    const bool hasLevels = HasStandard(src.code) && HasStandard(dst.code);
    const bool hasStandard = HasStandard(src.code) || HasStandard(dst.code);
    const bool mayDither = dst.code >> 24 == 0x15;
    bool touched = false;
    Groups scales;
    for (const Scale& scale : kScales) {
      Groups groups;
      for (const Standards& standards : kStandards) {
        if ((standards.letter == 'r' && !hasLevels) || (standards.letter == 'f' && !hasStandard)) {
          continue;
        }
        for (int settings = 0; settings < (mayDither ? 4 : 2); ++settings) {
          const bool adjusted = (settings & 1) != 0;
          const bool dithered = (settings & 2) != 0;
          const Cells cells = CellsOf(src, dst, scale, standards, adjusted, dithered);
          touched |= cells != "0*8";
          std::string label(1, standards.letter);
          label += adjusted ? "a" : "";
          label += dithered ? "d" : "";
          Add(cells, label, &groups);
        }
      }
      std::string lines;
      for (const auto& [cells, labels] : groups) {
        lines.append(labels).append(" : ").append(cells).append("\n");
      }
      Add(lines, scale.name, &scales);
    }
    std::string lines;
    for (const auto& [ofScale, names] : scales) {
      lines += Prefixed(names + " ", ofScale);
    }
    return touched ? lines : "always 0\n";
  }

  Cells CellsOf(const PublicFormat& src, const PublicFormat& dst, const Scale& scale,
                const Standards& standards, bool adjusted, bool dithered) {
    std::vector<std::string> codes;
    for (uint32_t transform = 0; transform < 8; ++transform) {
      int modes[4];
      for (uint32_t mode = 1; mode <= 4; ++mode) {
        MPPPARAM params{};
        params.resampleFlags = scale.resample;
        params.transformCode = transform;
        params.passMode = mode;
        params.brightness = adjusted ? 10 : 0;
        params.dither = dithered ? 1 : 0;
        const MPPFORMAT dstRecord = {dst.code | (HasStandard(dst.code) ? standards.dst : 0), 32, 32,
                                     nullptr};
        const MPPFORMAT srcRecord = {src.code | (HasStandard(src.code) ? standards.src : 0),
                                     scale.width, scale.height,
                                     testing_support::IsIndexedCode(src.code) ? palette_ : nullptr};
        modes[mode - 1] = AnswerOf(dstRecord, srcRecord, params);
      }
      const bool same = modes[0] == modes[1] && modes[1] == modes[2] && modes[2] == modes[3];
      std::string code = std::to_string(modes[0]);
      for (int i = 1; i < 4 && !same; ++i) {
        code += "," + std::to_string(modes[i]);
      }
      codes.push_back(code);
    }
    Cells cells;
    for (size_t i = 0; i < codes.size();) {
      size_t end = i;
      while (end < codes.size() && codes[end] == codes[i]) {
        ++end;
      }
      cells += (i == 0 ? "" : " ") + codes[i] + (end - i > 1 ? "*" + std::to_string(end - i) : "");
      i = end;
    }
    return cells;
  }

  int AnswerOf(MPPFORMAT dst, MPPFORMAT src, MPPPARAM params) {
    ++engines_;
    reference::Engine model;
    const uint32_t code = reference::BuildEngine(dst, src, params, params.passMode, &model);
    const reference::Choice choice = reference::Choose(model);
    MPPHandle* handle = nullptr;
    const uint32_t created = MPPCreate(&dst, &src, &params, &handle);
    if (created != code || created != KESTREL_OK) {
      Disagree(dst, src, params, "creation", std::to_string(created), std::to_string(code));
      return -1;
    }
    const std::unique_ptr<MPPHandle, FreeEngine> engine(handle);
    const Answer answer = AskChain(engine->pass[0]->context);
    const std::string got = NameOf(answer);
    const std::string expected = NameOf(choice);
    if (got != expected) {
      Disagree(dst, src, params, "choice", got, expected);
    }
    return NumberOf(got);
  }

  template <typename Answering>
  static std::string NameOf(const Answering& answering) {
    std::string name = answering.dispatcher;
    name += answering.kernel ? std::string(" ") + answering.kernel : "";
    return name + (answering.overwritten ? std::string(" over ") + answering.overwritten : "");
  }

  int NumberOf(const std::string& name) {
    const auto [known, isNew] = numbers_.try_emplace(name, int(names_.size()));
    if (isNew) {
      names_.push_back(name);
    }
    return known->second;
  }

  void Disagree(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params,
                const char* what, const std::string& got, const std::string& expected) {
    if (++disagreements_ <= 20) {
      std::printf(
          "%s: %s, expected %s\n  0x%08x %dx%d to 0x%08x %dx%d, resample %u, transform %u, "
          "block mode %u, brightness %d, dither %u\n",
          what, got.c_str(), expected.c_str(), src.format, src.width, src.height, dst.format,
          dst.width, dst.height, params.resampleFlags, params.transformCode, params.passMode,
          params.brightness, params.dither);
    }
  }

  const uint8_t palette_[1024] = {};
  std::vector<std::string> names_{"ANY_ANY_C_SLOW"};
  std::map<std::string, int> numbers_{{"ANY_ANY_C_SLOW", 0}};
  uint64_t engines_ = 0;
  uint64_t disagreements_ = 0;
};

std::string Read(const char* path) {
  std::ifstream file(path, std::ios::binary);
  std::ostringstream text;
  text << file.rdbuf();
  return text.str();
}

int Run(const char* path, bool update) {
  Grid grid;
  const std::string text = grid.Write();
  if (text.empty()) {
    std::printf("the chain and the model disagree\n");
    return 1;
  }
  if (update) {
    std::ofstream(path, std::ios::binary) << text;
    std::printf("%llu engines, %zu bytes written\n",
                static_cast<unsigned long long>(grid.engines()), text.size());
    return 0;
  }
  std::istringstream got(text);
  std::istringstream committed(Read(path));
  std::string gotLine, committedLine;
  for (int number = 1;; ++number) {
    const bool hasGot = bool(std::getline(got, gotLine));
    const bool hasCommitted = bool(std::getline(committed, committedLine));
    if (!hasGot && !hasCommitted) {
      break;
    }
    if (hasGot != hasCommitted || gotLine != committedLine) {
      std::printf("line %d\n  got       %s\n  committed %s\n", number,
                  hasGot ? gotLine.c_str() : "(end)",
                  hasCommitted ? committedLine.c_str() : "(end)");
      return 1;
    }
  }
  std::printf("%llu engines choose as committed and as the model says\n",
              static_cast<unsigned long long>(grid.engines()));
  return 0;
}

}  // namespace
}  // namespace kernel_tests

int main(int argc, char** argv) {
  const char* path = nullptr;
  bool update = false;
  for (int i = 1; i < argc; ++i) {
    if (std::strcmp(argv[i], "--update") == 0) {
      update = true;
    } else if (std::strcmp(argv[i], "--file") == 0 && i + 1 < argc) {
      path = argv[++i];
    } else {
      path = nullptr;
      break;
    }
  }
  if (!path) {
    std::fprintf(stderr, "usage: chooser --file chooser.txt [--update]\n");
    return 2;
  }
  return kernel_tests::Run(path, update);
}
