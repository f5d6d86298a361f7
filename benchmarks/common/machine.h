// What a figure depends on besides the code. Says nothing about whose machine it is.
#ifndef KESTREL_BENCHMARKS_COMMON_MACHINE_H
#define KESTREL_BENCHMARKS_COMMON_MACHINE_H

#include <fstream>
#include <string>
#include <thread>

#include "benchmarks/common/json.h"

namespace bench {

inline std::string CpuModel() {
  std::ifstream info("/proc/cpuinfo");
  std::string line;
  while (std::getline(info, line)) {
    const size_t colon = line.find(": ");
    if (line.rfind("model name", 0) == 0 && colon != std::string::npos) {
      return line.substr(colon + 2);
    }
  }
  return "unknown";
}

inline void DescribeMachine(Json* json) {
  json->Entry("cpu", CpuModel());
  json->Entry("cores", double(std::thread::hardware_concurrency()));
#ifdef __clang__
  json->Entry("compiler", "clang " __clang_version__);
#else
  json->Entry("compiler", "gcc " __VERSION__);
#endif
}

}  // namespace bench

#endif
