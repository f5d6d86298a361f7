// Every pair of public formats at every kind of scale and turn, so that no pair is left on a cliff:
// nanoseconds of CPU time per destination pixel, the worst ten, and the worst against the median of
// its class (pairs of one scale and turn).
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "benchmarks/common/engine.h"
#include "benchmarks/common/json.h"
#include "benchmarks/common/machine.h"
#include "benchmarks/common/picture.h"
#include "benchmarks/common/stopwatch.h"
#include "tests/support/formats.h"

namespace bench {
namespace {

using testing_support::kPublicFormats;
using testing_support::PublicFormat;

constexpr Size kSource = {640, 480};
constexpr Size kReduced = {480, 360};

constexpr size_t kPaletteBytes = 1024;
constexpr double kSliceNanoseconds = 2e5;

struct Scale {
  const char* name;
  Size dst;
  uint32_t resample;
};

constexpr Scale kScales[] = {
    {"1:1", kSource, MPP_NEAREST},
    {"bilinear down", kReduced, MPP_BILINEAR},
    {"nearest down", kReduced, MPP_NEAREST},
};

struct Turn {
  const char* name;
  uint32_t transform;
};

constexpr Turn kTurns[] = {
    {"as is", 0},
    {"90 degrees", MPP_SWAP_XY | MPP_MIRROR_X},
    {"mirrored", MPP_MIRROR_X},
};

struct Options {
  int rounds = 9;
  std::string jsonPath;
  std::string csvPath;
};

struct Pair {
  const char* src;
  const char* dst;
  double nanoseconds;  // per destination pixel
};

struct Class {
  const char* scale;
  const char* turn;
  std::vector<Pair> pairs;  // slowest first

  double MedianNanoseconds() const {
    std::vector<double> all;
    for (const Pair& pair : pairs) all.push_back(pair.nanoseconds);
    return Median(all);
  }
  double WorstRatio() const { return pairs.front().nanoseconds / MedianNanoseconds(); }
};

uint32_t InFullRange(uint32_t format) {
  return testing_support::HasStandard(format) ? format | FORMAT_BT601_FULL : format;
}

void FillWithNoise(uint8_t* bytes, size_t count) {
  uint32_t state = 1;
  for (size_t i = 0; i < count; ++i) {
    state = state * 1664525u + 1013904223u;
    bytes[i] = uint8_t(state >> 24);
  }
}

class Pairs {
 public:
  explicit Pairs(int rounds) : rounds_(rounds), palette_(kPaletteBytes) {
    FillWithNoise(palette_.data(), palette_.size());
    for (const PublicFormat& format : kPublicFormats) {
      sources_.emplace_back(InFullRange(format.code), kSource);
      FillWithNoise(sources_.back().block[0].start, sources_.back().ByteCount());
    }
  }

  // Every round times every pair, so that a slow moment of the machine is not one pair's.
  Class Measure(const Scale& scale, const Turn& turn) const {
    const bool swap = (turn.transform & MPP_SWAP_XY) != 0;
    const Size size = swap ? scale.dst.Turned() : scale.dst;
    Class result = {scale.name, turn.name, {}};
    std::vector<std::vector<double>> times;
    for (int round = 0; round < rounds_; ++round) {
      size_t pair = 0;
      for (const PublicFormat& format : kPublicFormats) {
        const Picture dst(InFullRange(format.code), size);
        FillWithNoise(dst.block[0].start, dst.ByteCount());
        for (size_t i = 0; i < sources_.size(); ++i) {
          const double time = Time(sources_[i], dst, scale, turn.transform);
          if (time < 0) continue;
          if (round == 0) {
            result.pairs.push_back({kPublicFormats[i].name, format.name, 0});
            times.emplace_back();
          }
          times[pair++].push_back(time / double(size.Pixels()));
        }
      }
    }
    for (size_t i = 0; i < times.size(); ++i) result.pairs[i].nanoseconds = Median(times[i]);
    std::sort(result.pairs.begin(), result.pairs.end(),
              [](const Pair& a, const Pair& b) { return a.nanoseconds > b.nanoseconds; });
    return result;
  }

 private:
  // Nanoseconds of one run; below 0 when the pair is not accepted.
  double Time(const Picture& src, const Picture& dst, const Scale& scale,
              uint32_t transform) const {
    MPPPARAM params = {};
    params.resampleFlags = scale.resample;
    params.transformCode = transform;
    params.passMode = MPP_PASS_TILED;
    params.alpha = 255;
    const Engine engine({dst.format, dst.size.width, dst.size.height, nullptr},
                        {src.format, src.size.width, src.size.height, palette_.data()}, params);
    if (!engine.IsAccepted()) return -1;
    const auto run = [&] { engine.Run(src, dst); };
    const int repetitions = 1 + int(kSliceNanoseconds / TimePerCall(1, run));
    return TimePerCall(repetitions, run);
  }

  int rounds_;
  std::vector<uint8_t> palette_;
  std::vector<Picture> sources_;
};

void Print(const std::vector<Class>& classes) {
  struct Place {
    const Class* of;
    const Pair* pair;
  };
  std::vector<Place> places;
  std::printf("%-14s %-11s %6s %12s %12s %6s\n", "scale", "turn", "pairs", "median ns/px",
              "worst ns/px", "ratio");
  for (const Class& c : classes) {
    std::printf("%-14s %-11s %6zu %12.3f %12.3f %6.2f  %s to %s\n", c.scale, c.turn, c.pairs.size(),
                c.MedianNanoseconds(), c.pairs.front().nanoseconds, c.WorstRatio(),
                c.pairs.front().src, c.pairs.front().dst);
    for (const Pair& pair : c.pairs) places.push_back({&c, &pair});
  }
  std::sort(places.begin(), places.end(), [](const Place& a, const Place& b) {
    return a.pair->nanoseconds > b.pair->nanoseconds;
  });
  std::printf("\nworst ten of all:\n");
  for (size_t i = 0; i < std::min<size_t>(10, places.size()); ++i) {
    std::printf("%8.3f ns/px  %s to %s, %s, %s\n", places[i].pair->nanoseconds, places[i].pair->src,
                places[i].pair->dst, places[i].of->scale, places[i].of->turn);
  }
}

bool WriteJson(const std::vector<Class>& classes, const Options& options) {
  Json json;
  json.Open('{').Key("context").Open('{');
  DescribeMachine(&json);
  json.Entry("rounds", double(options.rounds));
  json.Close('}').Key("formats").Open('[');
  for (const PublicFormat& format : kPublicFormats) json.Value(format.name);
  json.Close(']').Key("classes").Open('[');
  for (const Class& c : classes) {
    json.Open('{');
    json.Entry("scale", c.scale).Entry("turn", c.turn);
    json.Entry("median_ns_per_pixel", c.MedianNanoseconds()).Entry("worst_ratio", c.WorstRatio());
    json.Key("pairs").Open('[');
    for (const Pair& pair : c.pairs) {
      json.Open('{').Entry("src", pair.src).Entry("dst", pair.dst);
      json.Entry("ns_per_pixel", pair.nanoseconds).Close('}');
    }
    json.Close(']').Close('}');
  }
  json.Close(']').Close('}');
  return json.Write(options.jsonPath);
}

bool WriteCsv(const std::vector<Class>& classes, const std::string& path) {
  std::FILE* file = std::fopen(path.c_str(), "w");
  if (file == nullptr) {
    std::perror(path.c_str());
    return false;
  }
  std::fprintf(file, "scale,turn,source,destination,ns_per_pixel\n");
  for (const Class& c : classes) {
    for (const Pair& pair : c.pairs) {
      std::fprintf(file, "%s,%s,%s,%s,%.4f\n", c.scale, c.turn, pair.src, pair.dst,
                   pair.nanoseconds);
    }
  }
  if (std::fclose(file) == 0) return true;
  std::perror(path.c_str());
  return false;
}

[[noreturn]] void Usage() {
  std::fprintf(stderr, "usage: all_pairs [--rounds N] [--json FILE] [--csv FILE] [--quick]\n");
  std::exit(2);
}

Options ParseOptions(int argc, char** argv) {
  Options options;
  for (int i = 1; i < argc; ++i) {
    const bool hasValue = i + 1 < argc;
    if (std::strcmp(argv[i], "--quick") == 0) {
      options.rounds = 1;
    } else if (std::strcmp(argv[i], "--rounds") == 0 && hasValue) {
      options.rounds = std::atoi(argv[++i]);
    } else if (std::strcmp(argv[i], "--json") == 0 && hasValue) {
      options.jsonPath = argv[++i];
    } else if (std::strcmp(argv[i], "--csv") == 0 && hasValue) {
      options.csvPath = argv[++i];
    } else {
      Usage();
    }
  }
  if (options.rounds < 1) Usage();
  return options;
}

int Main(int argc, char** argv) {
  const Options options = ParseOptions(argc, argv);
  const Pairs pairs(options.rounds);
  std::vector<Class> classes;
  for (const Scale& scale : kScales) {
    for (const Turn& turn : kTurns) classes.push_back(pairs.Measure(scale, turn));
  }
  Print(classes);
  bool written = options.jsonPath.empty() || WriteJson(classes, options);
  if (!options.csvPath.empty()) written = WriteCsv(classes, options.csvPath) && written;
  return written ? 0 : 1;
}

}  // namespace
}  // namespace bench

int main(int argc, char** argv) {
  return bench::Main(argc, argv);
}
