// An engine of the product with its lifetime.
#ifndef KESTREL_BENCHMARKS_COMMON_ENGINE_H
#define KESTREL_BENCHMARKS_COMMON_ENGINE_H

#include "benchmarks/common/picture.h"
#include "engine/postprocess.h"

namespace bench {

class Engine {
 public:
  Engine(MPPFORMAT dst, MPPFORMAT src, MPPPARAM params) {
    if (MPPCreate(&dst, &src, &params, &handle_) != KESTREL_OK) handle_ = nullptr;
  }
  Engine(const Engine&) = delete;
  Engine& operator=(const Engine&) = delete;
  ~Engine() {
    if (handle_ != nullptr) MPPDestroy(handle_);
  }

  bool IsAccepted() const { return handle_ != nullptr; }
  void Run(const Picture& src, const Picture& dst) const {
    MPProcess(handle_, dst.plane, nullptr, dst.pitch, src.plane, src.pitch);
  }

 private:
  MPPHandle* handle_ = nullptr;
};

}  // namespace bench

#endif
