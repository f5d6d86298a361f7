// Creation and processing with any words a caller could pass, on planes that are exactly as large
// as those words say. Every instruction set must give the bytes of the reference converter, or
// where that has no answer all the same bytes.
#include <cstring>

#include "fuzz/jobs.h"
#include "tests/support/instruction_sets.h"

namespace {

using fuzz::Fail;
using fuzz::Images;
using fuzz::Job;
using testing_support::InstructionSet;

[[noreturn]] void FailIn(const Job& job, const InstructionSet& set, const std::string& what) {
  Fail(set.name + ": " + what + "\n" + differential::Describe(job.drawn));
}

// A new engine, as the set asks for. Null when creation refuses.
MPPHandle* Create(const reference::Job& job, const InstructionSet& set, uint32_t* code) {
  MPPFORMAT dst = job.dst;
  MPPFORMAT src = job.src;
  MPPPARAM params = job.params;
  MPPHandle* handle = nullptr;
  *code = MPPCreate(&dst, &src, &params, &handle);
  fuzz::Require((*code == KESTREL_OK) == (handle != nullptr), "a handle belongs to success only");
  fuzz::Require(dst.format == job.dst.format && src.format == job.src.format &&
                    std::memcmp(&params, &job.params, sizeof(params)) == 0,
                "the records of the caller have changed");
  if (handle != nullptr) ForceRows(handle, set);
  return handle;
}

uint32_t Process(MPPHandle* handle, const reference::Job& job) {
  return MPProcess(handle, job.dstPlanes, job.hasRect ? &job.rect : nullptr, job.dstPitches,
                   job.srcPlanes, job.srcPitches);
}

void RunWithoutImages(const Job& job) {
  reference::Job records = {};
  records.dst = job.drawn.dst.record;
  records.src = job.drawn.src.record;
  records.params = job.drawn.params;
  uint32_t code = 0;
  MPPDestroy(Create(records, {"as created", nullptr}, &code));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static Images images;
  fuzz::Input input(data, size);
  const Job job = fuzz::DrawJob(&input);
  if (!job.hasImages) {
    RunWithoutImages(job);
    return 0;
  }
  images.Prepare(job);
  const reference::Job call = images.JobOnProduct();
  uint32_t expected = KESTREL_OK;
  if (job.isModelled) expected = reference::Convert(images.JobOnModel());
  const bool lacksFirst = call.dstPlanes[0] == nullptr || call.srcPlanes[0] == nullptr;
  bool isFirst = true;
  for (const InstructionSet& set : testing_support::InstructionSets()) {
    images.RestoreProduct();
    uint32_t code = 0;
    MPPHandle* const handle = Create(call, set, &code);
    if (handle != nullptr) {
      code = Process(handle, call);
      const bool wrote = !images.ProductUnchanged();
      if (lacksFirst && code != KESTREL_BAD_ARGUMENT) FailIn(job, set, "a missing plane is taken");
      if ((lacksFirst || job.drawsNothing) && wrote) FailIn(job, set, "something is drawn");
      const uint32_t again = Process(handle, call);  // an engine is there for many frames
      if (again != code) FailIn(job, set, "the second run has another result");
      MPPDestroy(handle);
    }
    if (!images.SourceUnchanged()) FailIn(job, set, "the source is written");
    if (!job.isModelled && isFirst) {
      images.ExpectProduct();
      expected = code;
    }
    isFirst = false;
    if (code != expected) {
      FailIn(job, set, "code " + std::to_string(code) + ", expected " + std::to_string(expected));
    }
    const std::string difference = images.Difference();
    if (!difference.empty()) FailIn(job, set, difference);
  }
  return 0;
}
