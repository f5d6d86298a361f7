// Random calls of one kernel: an engine that may suit it, a band, images between guard pages.
#ifndef KESTREL_TESTS_KERNELS_KERNEL_CASE_H
#define KESTREL_TESTS_KERNELS_KERNEL_CASE_H

#include <memory>
#include <string>
#include <vector>

#include "engine/postprocess.h"
#include "kernels/table/kernels.h"
#include "tests/differential/case.h"
#include "tests/differential/placed.h"
#include "tests/reference/reference.h"

namespace kernel_tests {

// What can be called by its name: the kernels of the table, and after them the generic converter,
// whose row stands for everything.
constexpr int kGenericConverter = kestrel::kernel_id::kCount;
constexpr int kCallableCount = kGenericConverter + 1;
const kestrel::KernelRow& RowOf(int id);
KernelFn* EntryOf(int id);
bool Takes(int id, const EngineContext& engine);

struct FreeEngine {
  void operator()(MPPHandle* handle) const { MPPDestroy(handle); }
};
using EngineHandle = std::unique_ptr<MPPHandle, FreeEngine>;

// Null when creation refuses.
EngineHandle CreateEngine(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params);

// Formats of the row, its scale and any transform, block mode, origins and adjustments; most of
// what is drawn here is not accepted by the row, which is for the caller to find out.
differential::Case DrawForKernel(differential::Random* random, const kestrel::KernelRow& row);

// The band and the images of a case whose engine is known.
void DrawBand(differential::Random* random, const reference::Engine& engine,
              differential::Case* drawn);

// Runs one kernel and the model on equal images.
class KernelBench {
 public:
  KernelBench();

  // Gives a source with a palette its entries, which stay until the next ones.
  void SupplyPalette(MPPFORMAT* src);

  // Fills the images. False when the band of the case is nothing that a kernel is called for.
  bool Prepare(const differential::Case& drawn, const reference::Engine& engine);

  // Puts what kernels draw on back to what Prepare filled it with.
  void Restore();

  // From now on kernels are called for rectangles without pixels.
  void CollapseCalls() { collapsed_ = true; }

  // Calls something that takes the arguments of a kernel on one set of images.
  template <typename Callee>
  auto CallWith(Callee callee, const EngineContext* context) {
    reference::KernelCall call;
    Bind(gotBlocks_, &call);
    const reference::Rect& loop = call.loopRect;
    const MRECT rect = {int32_t(loop.left), int32_t(loop.top),
                        int32_t(collapsed_ ? loop.left : loop.right), int32_t(loop.bottom)};
    return callee(&rect, call.dstPitches, call.srcPitches, call.dstStarts, call.srcPlanes, context);
  }

  uint32_t Call(KernelFn* kernel, const EngineContext* context) {
    return CallWith(kernel, context);
  }

  // Converts the other set with the model.
  void CallModel(const reference::Quirks& quirks);

  // Where the blocks of the case lie: the source, what kernels draw on, what the model draws on.
  const differential::PlacedBlock* sourceBlocks() const { return sourceBlocks_; }
  const differential::PlacedBlock* gotBlocks() const { return gotBlocks_; }
  const differential::PlacedBlock* expectedBlocks() const { return expectedBlocks_; }

  // What differs between the two sets; empty when nothing does.
  std::string Difference() const;

  // The engine of the case in two lines or so, and what was called.
  std::string Describe() const;

 private:
  using Buffer = std::unique_ptr<testing_support::GuardedBuffer>;

  bool Bind(const differential::PlacedBlock* dst, reference::KernelCall* call) const;

  Buffer source_[3], got_[3], expected_[3];
  testing_support::GuardedBuffer palette_{1024};
  differential::PlacedBlock sourceBlocks_[3] = {}, gotBlocks_[3] = {}, expectedBlocks_[3] = {};
  std::vector<uint8_t> before_[3];
  differential::Case case_{};
  const reference::Engine* engine_ = nullptr;
  bool collapsed_ = false;
};

}  // namespace kernel_tests

#endif
