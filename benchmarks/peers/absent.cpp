// Stands in for the peers that this machine lacks; the build says which.
#include "benchmarks/peers/contender.h"

namespace bench {

#ifdef KESTREL_WITHOUT_LIBYUV
std::vector<Contender> LibyuvContenders() {
  return {};
}
std::string LibyuvVersion() {
  return "missing";
}
#endif
#ifdef KESTREL_WITHOUT_SWSCALE
std::vector<Contender> SwscaleContenders() {
  return {};
}
std::string SwscaleVersion() {
  return "missing";
}
#endif
#ifdef KESTREL_WITHOUT_OPENCV
std::vector<Contender> OpencvContenders() {
  return {};
}
std::string OpencvVersion() {
  return "missing";
}
#endif

}  // namespace bench
