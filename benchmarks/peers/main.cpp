// Times the jobs that users have, for this library and for the others that they choose between, in
// one process and in turns: each round gives every contender one slice of time. Compare times
// within one run only.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <random>
#include <regex>
#include <string>
#include <vector>

#include "benchmarks/common/json.h"
#include "benchmarks/common/machine.h"
#include "benchmarks/common/stopwatch.h"
#include "benchmarks/peers/check.h"
#include "benchmarks/peers/contender.h"

namespace bench {
namespace {

struct Options {
  std::regex filter{""};
  int rounds = 9;
  double sliceNanoseconds = 2e6;
  std::string jsonPath;
  bool list = false;
};

struct Entry {
  const Contender* contender;
  Plan plan;           // without a call: the library has none for this job, or all are wrong
  std::string remark;  // why there is no call
  int repetitions = 0;
  std::vector<double> times;  // nanoseconds, one for each round

  bool Takes() const { return bool(plan.run); }
  double Time() const { return Median(times); }
};

struct Result {
  Job job;
  std::vector<Entry> entries;

  const Entry* Fastest(Role role) const {
    const Entry* fastest = nullptr;
    for (const Entry& entry : entries) {
      if (entry.contender->role != role || !entry.Takes()) continue;
      if (fastest == nullptr || entry.Time() < fastest->Time()) fastest = &entry;
    }
    return fastest;
  }
  // Time of the fastest peer / ours; 0 when there is none to compare.
  double Ratio() const {
    const Entry* ours = Fastest(Role::kOurs);
    const Entry* peer = Fastest(Role::kPeer);
    return ours == nullptr || peer == nullptr ? 0 : peer->Time() / ours->Time();
  }
};

// The memory that any contender has to write, at the speed of memcpy.
Contender MemcpyContender() {
  return {"memcpy", Role::kFloor, [](const Job&, const Picture&, const Picture& dst) {
            const Picture bytes(dst.format, dst.size);
            std::memset(bytes.block[0].start, 1, bytes.ByteCount());
            return std::vector<Plan>{{"bytes of the output", [bytes, dst] {
                                        std::memcpy(dst.block[0].start, bytes.block[0].start,
                                                    bytes.ByteCount());
                                      }}};
          }};
}

// Nanoseconds of a call, for choices rather than for results: the least of a few.
double BriefTime(const std::function<void()>& run) {
  constexpr double kBrief = 1e5;
  const double first = TimePerCall(1, run);
  const int repetitions = first < kBrief ? 10 : 1;
  return std::min({first, TimePerCall(repetitions, run), TimePerCall(repetitions, run)});
}

// The plan that gives the right picture in the least time.
Entry Enter(const Contender& contender, const Job& job, const Picture& src, const Picture& dst) {
  Entry entry = {&contender, {}, "no calls for this job", 0, {}};
  double least = 0;
  for (const Plan& plan : contender.plans(job, src, dst)) {
    std::memset(dst.block[0].start, 0x5A, dst.ByteCount());
    plan.run();
    if (contender.role != Role::kFloor) {
      const std::string wrong = WhatIsWrong(job, dst);
      if (!wrong.empty()) {
        if (!entry.Takes()) entry.remark = "disqualified: " + plan.description + ": " + wrong;
        continue;
      }
    }
    const double time = BriefTime(plan.run);
    if (!entry.Takes() || time < least) {
      entry.plan = plan;
      entry.remark.clear();
      least = time;
    }
  }
  return entry;
}

Result Measure(const Job& job, const std::vector<Contender>& contenders, const Options& options) {
  const Picture src(job.srcFormat, job.src);
  DrawWaves(src);
  const Picture dst(job.dstFormat, job.dst);
  Result result = {job, {}};
  for (const Contender& contender : contenders) {
    result.entries.push_back(Enter(contender, job, src, dst));
    Entry& entry = result.entries.back();
    if (!entry.Takes()) continue;
    const double time = BriefTime(entry.plan.run);
    entry.repetitions = std::max(1, int(std::ceil(options.sliceNanoseconds / time)));
  }
  // Each slice begins with an untimed call, and the turns change: what the contender before leaves
  // in the caches (memcpy writes around them) would cost whoever always follows it up to a third.
  std::mt19937 random(1);
  std::vector<Entry*> turns;
  for (Entry& entry : result.entries) {
    if (entry.Takes()) turns.push_back(&entry);
  }
  for (int round = 0; round < options.rounds; ++round) {
    std::shuffle(turns.begin(), turns.end(), random);
    for (Entry* entry : turns) {
      entry->plan.run();
      entry->times.push_back(TimePerCall(entry->repetitions, entry->plan.run));
    }
  }
  return result;
}

void Print(const Result& result) {
  std::printf("%s\n", result.job.name.c_str());
  for (const Entry& entry : result.entries) {
    if (!entry.Takes()) {
      std::printf("  %-16s %s\n", entry.contender->name.c_str(), entry.remark.c_str());
      continue;
    }
    std::printf("  %-16s %12.0f ns %8.3f ns/pixel %6d  %s\n", entry.contender->name.c_str(),
                entry.Time(), entry.Time() / double(result.job.dst.Pixels()), entry.repetitions,
                entry.plan.description.c_str());
  }
  const double ratio = result.Ratio();
  if (ratio > 0) {
    std::printf("  fastest peer (%s) / ours: %.2f, wanted %.2f%s\n",
                result.Fastest(Role::kPeer)->contender->name.c_str(), ratio, result.job.target,
                ratio < result.job.target ? "  MISSED" : "");
  }
  std::fflush(stdout);
}

void PrintSummary(const std::vector<Result>& results) {
  std::vector<const Result*> compared;
  double logarithms = 0;
  int missed = 0;
  for (const Result& result : results) {
    if (result.Fastest(Role::kOurs) == nullptr) {
      std::printf("NO RIGHT PICTURE OF OURS: %s\n", result.job.name.c_str());
    }
    if (result.Ratio() <= 0) continue;
    compared.push_back(&result);
    logarithms += std::log(result.Ratio());
    missed += result.Ratio() < result.job.target;
  }
  if (compared.empty()) return;
  std::sort(compared.begin(), compared.end(),
            [](const Result* a, const Result* b) { return a->Ratio() < b->Ratio(); });
  std::printf("\n%zu jobs, %zu with a peer\n", results.size(), compared.size());
  std::printf("geometric mean of fastest peer / ours: %.3f\n",
              std::exp(logarithms / double(compared.size())));
  std::printf("%d below what is wanted\nlowest ratios:\n", missed);
  for (size_t i = 0; i < std::min<size_t>(20, compared.size()); ++i) {
    std::printf("  %6.2f (wanted %.2f) %s\n", compared[i]->Ratio(), compared[i]->job.target,
                compared[i]->job.name.c_str());
  }
}

bool WriteJson(const std::vector<Result>& results, const Options& options) {
  Json json;
  json.Open('{').Key("context").Open('{');
  DescribeMachine(&json);
  json.Entry("libyuv", LibyuvVersion());
  json.Entry("swscale", SwscaleVersion());
  json.Entry("opencv", OpencvVersion());
  json.Entry("rounds", double(options.rounds));
  json.Entry("slice_ns", options.sliceNanoseconds);
  json.Close('}').Key("benchmarks").Open('[');
  for (const Result& result : results) {
    for (const Entry& entry : result.entries) {
      json.Open('{');
      json.Entry("name", result.job.name + "/" + entry.contender->name);
      json.Entry("job", result.job.name);
      json.Entry("contender", entry.contender->name);
      if (entry.Takes()) {
        json.Entry("iterations", double(entry.repetitions));
        json.Entry("cpu_time", entry.Time());
        json.Entry("time_unit", "ns");
        json.Entry("ns_per_pixel", entry.Time() / double(result.job.dst.Pixels()));
        json.Entry("calls", entry.plan.description);
      } else {
        json.Entry("error_message", entry.remark);
      }
      json.Close('}');
    }
  }
  json.Close(']').Key("jobs").Open('[');
  for (const Result& result : results) {
    const Entry* peer = result.Fastest(Role::kPeer);
    json.Open('{');
    json.Entry("name", result.job.name);
    json.Entry("group", result.job.group);
    json.Entry("destination",
               std::to_string(result.job.dst.width) + "x" + std::to_string(result.job.dst.height));
    json.Entry("target", result.job.target);
    json.Entry("ratio", result.Ratio());
    json.Entry("fastest_peer", peer == nullptr ? "" : peer->contender->name);
    json.Close('}');
  }
  json.Close(']').Close('}');
  return json.Write(options.jsonPath);
}

[[noreturn]] void Usage() {
  std::fprintf(stderr,
               "usage: peers [--filter REGEX] [--rounds N] [--json FILE] [--quick] [--list]\n"
               "  --filter  only jobs whose names contain a match\n"
               "  --rounds  slices of each contender, of which the median counts (default 9)\n"
               "  --json    writes all results to FILE\n"
               "  --quick   3 rounds of shorter slices: a look, not a measurement\n"
               "  --list    only names the jobs\n");
  std::exit(2);
}

Options ParseOptions(int argc, char** argv) {
  Options options;
  const auto value = [&](int* i) -> const char* {
    if (*i + 1 >= argc) Usage();
    return argv[++*i];
  };
  for (int i = 1; i < argc; ++i) {
    const std::string option = argv[i];
    if (option == "--filter") {
      try {
        options.filter = value(&i);
      } catch (const std::regex_error&) {
        Usage();
      }
    } else if (option == "--rounds") {
      options.rounds = std::atoi(value(&i));
    } else if (option == "--json") {
      options.jsonPath = value(&i);
    } else if (option == "--quick") {
      options.rounds = 3;
      options.sliceNanoseconds = 5e5;
    } else if (option == "--list") {
      options.list = true;
    } else {
      Usage();
    }
  }
  if (options.rounds < 1) Usage();
  return options;
}

int Main(int argc, char** argv) {
  const Options options = ParseOptions(argc, argv);
  std::vector<Contender> contenders;
  for (const auto& some : {KestrelContenders(),
                           LibyuvContenders(),
                           SwscaleContenders(),
                           OpencvContenders(),
                           {MemcpyContender()}}) {
    contenders.insert(contenders.end(), some.begin(), some.end());
  }
  std::printf("libyuv %s, swscale %s, opencv %s\n", LibyuvVersion().c_str(),
              SwscaleVersion().c_str(), OpencvVersion().c_str());
  std::vector<Result> results;
  for (const Job& job : AllJobs()) {
    if (!std::regex_search(job.name, options.filter)) continue;
    if (options.list) {
      std::printf("%s\n", job.name.c_str());
      continue;
    }
    results.push_back(Measure(job, contenders, options));
    Print(results.back());
    // The pictures of one job are not kept while the next is measured.
    for (Entry& entry : results.back().entries) {
      if (entry.Takes()) entry.plan.run = [] {};
    }
  }
  if (options.list) return 0;
  PrintSummary(results);
  const bool oursComplete = std::all_of(results.begin(), results.end(), [](const Result& result) {
    return result.Fastest(Role::kOurs) != nullptr;
  });
  if (!options.jsonPath.empty() && !WriteJson(results, options)) return 1;
  return oursComplete ? 0 : 1;
}

}  // namespace
}  // namespace bench

int main(int argc, char** argv) {
  try {
    return bench::Main(argc, argv);
  } catch (const std::exception& error) {
    std::fprintf(stderr, "peers: %s\n", error.what());
    return 1;
  }
}
