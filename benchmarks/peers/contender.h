// Who takes part: this library and the others of the field, each from its own file.
#ifndef KESTREL_BENCHMARKS_PEERS_CONTENDER_H
#define KESTREL_BENCHMARKS_PEERS_CONTENDER_H

#include <functional>
#include <string>
#include <vector>

#include "benchmarks/common/picture.h"
#include "benchmarks/peers/job.h"

namespace bench {

// One way to do a job. Everything that `run` needs is allocated before, except the engines and
// contexts of jobs with creation.
struct Plan {
  std::string description;
  std::function<void()> run;
};

enum class Role {
  kOurs,   // the figure that ratios are made of
  kOther,  // shown, and neither ours nor a peer
  kPeer,
  kFloor,  // moves bytes without making the picture
};

struct Contender {
  std::string name;
  Role role;
  // The ways to do the job, of which the fastest that gives the right picture is timed; none when
  // the library has no calls for it. src is the whole source picture.
  std::function<std::vector<Plan>(const Job& job, const Picture& src, const Picture& dst)> plans;
};

// Empty where a peer is missing from this build.
std::vector<Contender> KestrelContenders();
std::vector<Contender> LibyuvContenders();
std::vector<Contender> SwscaleContenders();
std::vector<Contender> OpencvContenders();

// Name and version of each peer, "missing" where it is not in this build.
std::string LibyuvVersion();
std::string SwscaleVersion();
std::string OpencvVersion();

}  // namespace bench

#endif
