// Finds the ways to do a job with a library whose calls each do a part of it.
#ifndef KESTREL_BENCHMARKS_PEERS_COMPOSITION_H
#define KESTREL_BENCHMARKS_PEERS_COMPOSITION_H

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "benchmarks/peers/contender.h"

namespace bench {

// What remains to be done to a picture.
struct Pending {
  bool scale;
  bool adjust;
  uint32_t turn;  // transform code

  bool None() const { return !scale && !adjust && turn == 0; }
};

// One call, or a few that belong together, and what it does.
struct Step {
  std::string name;
  uint32_t dstFormat;
  bool scales;
  bool adjusts;
  uint32_t turns;  // transform code
  std::function<void(const Picture& src, const Picture& dst)> run;
};

// The steps that can be applied to a picture of `format`, whether useful or not.
using Toolbox = std::function<std::vector<Step>(uint32_t format, const Job& job)>;

// All sequences of a few steps that do the job, with their intermediate pictures. None goes through
// a layout with less chroma than both ends have: that would be less work for a lesser picture.
std::vector<Plan> Compose(const Toolbox& toolbox, const Job& job, const Picture& src,
                          const Picture& dst);

// Layout of a format: the code without its colour standard.
inline uint32_t LayoutOf(uint32_t format) {
  return format >> 28 >= 5 ? format & ~FORMAT_STANDARD_MASK : format;
}

// A layout in the colour standard that the YUV pictures of a job have.
uint32_t InStandardOf(const Job& job, uint32_t layout);

inline bool IsFullRange(const Job& job) {
  return InStandardOf(job, FORMAT_NV21) != FORMAT_NV21;
}

}  // namespace bench

#endif
