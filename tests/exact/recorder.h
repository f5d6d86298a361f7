// Stands between the engine and the chain of kernel families: the program is linked so that calls
// of the chain and of its members arrive here first.
#ifndef KESTREL_TESTS_EXACT_RECORDER_H
#define KESTREL_TESTS_EXACT_RECORDER_H

#include <string>
#include <vector>

#include "exact_support.h"

namespace kestrel::test {

// One job as the chain receives it.
struct Job {
  MRECT rect;
  int32_t dstPitch[3];
  int32_t srcPitch[3];
  uint8_t* dst[3];
  const uint8_t* src[3];
  const EngineContext* context;

  bool empty() const { return rect.left >= rect.right || rect.top >= rect.bottom; }
};

struct Recorder {
  std::vector<Job> jobs;               // handed to the chain
  bool convert = true;                 // also run the real chain
  bool standInForFamilies = false;     // members of the chain are only noted, and answer as told
  std::vector<std::string> offers;     // members in the order they were called
  std::vector<const void*> arguments;  // six for each offer
  std::string accepts;                 // the member that answers 0
  uint32_t declineCode = KESTREL_UNSUPPORTED;

  // Jobs that cover at least one pixel.
  std::vector<Job> Drawn() const {
    std::vector<Job> drawn;
    for (const Job& job : jobs) {
      if (!job.empty()) drawn.push_back(job);
    }
    return drawn;
  }
};

// The recorder of the running test, cleared by ProcessingTest.
extern Recorder recorder;

class ProcessingTest : public testing::Test {
 protected:
  void SetUp() override { recorder = Recorder(); }
  void TearDown() override { recorder = Recorder(); }
};

}  // namespace kestrel::test

extern "C" KernelFn __real_ANY_ANY_Bilinear_No_Table;

#endif
