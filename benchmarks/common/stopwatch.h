#ifndef KESTREL_BENCHMARKS_COMMON_STOPWATCH_H
#define KESTREL_BENCHMARKS_COMMON_STOPWATCH_H

#include <time.h>

#include <algorithm>
#include <vector>

namespace bench {

// CPU time of the whole process in nanoseconds: a contender that starts threads pays for them, and
// other programs on the machine cost nothing but the caches they dirty.
inline double CpuNanoseconds() {
  timespec now;
  clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &now);
  return double(now.tv_sec) * 1e9 + double(now.tv_nsec);
}

// CPU nanoseconds of one of `repetitions` calls.
template <typename Function>
double TimePerCall(int repetitions, const Function& function) {
  const double start = CpuNanoseconds();
  for (int i = 0; i < repetitions; ++i) function();
  return (CpuNanoseconds() - start) / repetitions;
}

inline double Median(std::vector<double> values) {
  const auto middle = values.begin() + long(values.size() / 2);
  std::nth_element(values.begin(), middle, values.end());
  return *middle;
}

}  // namespace bench

#endif
