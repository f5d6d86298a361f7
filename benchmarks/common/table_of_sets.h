// Times of benchmarks that are named case/set: one line for each case, one column for each
// instruction set, with how many times as fast as the scalar one it is. Of repetitions the fastest
// counts.
#ifndef KESTREL_BENCHMARKS_COMMON_TABLE_OF_SETS_H
#define KESTREL_BENCHMARKS_COMMON_TABLE_OF_SETS_H

#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdio>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "kernels/rows/rows.h"

namespace bench {

class TableOfSets : public benchmark::BenchmarkReporter {
 public:
  // Times are nanoseconds per item.
  TableOfSets(std::string title, std::vector<std::string> cases, const kestrel::RowOpsList& sets)
      : title_(std::move(title)), cases_(std::move(cases)), sets_(sets) {}

  bool ReportContext(const Context& context) override {
    PrintBasicContext(&GetErrorStream(), context);
    return true;
  }
  void ReportRuns(const std::vector<Run>& runs) override {
    for (const Run& run : runs) {
      if (run.run_type != Run::RT_Iteration || run.error_occurred) continue;
      const double nanoseconds = 1e9 / run.counters.at("items_per_second").value;
      const auto [entry, isNew] = times_.emplace(run.run_name.function_name, nanoseconds);
      if (!isNew) entry->second = std::min(entry->second, nanoseconds);
    }
  }
  void Finalize() override {
    std::printf("%-32s", title_.c_str());
    for (const kestrel::RowOps* const* ops = sets_.ops; *ops != nullptr; ++ops) {
      std::printf("  %16s", (*ops)->name);
    }
    std::printf("\n");
    for (const std::string& name : cases_) PrintLine(name);
  }

 private:
  // 0 when it was filtered out.
  double TimeOf(const std::string& name, const kestrel::RowOps& ops) const {
    const auto entry = times_.find(name + "/" + ops.name);
    return entry == times_.end() ? 0 : entry->second;
  }
  void PrintLine(const std::string& name) const {
    const double scalar = TimeOf(name, kestrel::kScalarRows);
    std::string line;
    bool hasRun = false;
    for (const kestrel::RowOps* const* ops = sets_.ops; *ops != nullptr; ++ops) {
      const double time = TimeOf(name, **ops);
      char text[40];
      std::snprintf(text, sizeof(text), "  %8.3f (%5.2f)", time, time > 0 ? scalar / time : 0);
      line += text;
      hasRun = hasRun || time > 0;
    }
    if (hasRun) std::printf("%-32s%s\n", name.c_str(), line.c_str());
  }

  std::string title_;
  std::vector<std::string> cases_;
  kestrel::RowOpsList sets_;
  std::map<std::string, double> times_;
};

}  // namespace bench

#endif
