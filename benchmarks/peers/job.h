// The jobs that users have, as one list.
#ifndef KESTREL_BENCHMARKS_PEERS_JOB_H
#define KESTREL_BENCHMARKS_PEERS_JOB_H

#include <cstdint>
#include <string>
#include <vector>

#include "benchmarks/common/picture.h"

namespace bench {

struct Adjustments {
  int32_t brightness = 0, contrast = 0, saturation = 0;

  bool Any() const { return brightness != 0 || contrast != 0 || saturation != 0; }
};

struct Job {
  std::string group;
  std::string name;  // group/what/size
  uint32_t srcFormat, dstFormat;
  Size src, dst;
  bool bilinear;
  uint32_t transform;  // as in MPPPARAM
  bool crop;
  Adjustments adjustments;
  bool withCreation;  // engines and the like are created and destroyed inside the timed region
  double target;      // wanted: time of the fastest peer / ours

  bool Scales() const { return !(UnturnedDst() == Shown()); }
  // The destination's size before the turn.
  Size UnturnedDst() const { return (transform & MPP_SWAP_XY) != 0 ? dst.Turned() : dst; }
  // The part of the source that is shown, and its origin.
  Size Shown() const;
  int32_t ShownX() const { return (src.width - Shown().width) / 2; }
  int32_t ShownY() const { return (src.height - Shown().height) / 2; }
};

std::vector<Job> AllJobs();

// "NV21" and so on; "NV21_video" for video range, full range goes unsaid.
std::string FormatName(uint32_t format);

}  // namespace bench

#endif
