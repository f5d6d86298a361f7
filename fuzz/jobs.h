// Conversion jobs from the bytes of a fuzzer, and the memory that they run on.
#ifndef KESTREL_FUZZ_JOBS_H
#define KESTREL_FUZZ_JOBS_H

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "engine/postprocess.h"
#include "fuzz/input.h"
#include "tests/differential/case.h"
#include "tests/differential/placed.h"
#include "tests/reference/reference.h"
#include "tests/support/guarded_buffer.h"

namespace fuzz {

// Listed codes, codes made of fields, codes with one bit wrong and any word.
uint32_t DrawFormat(Input* input);

// Every word of the record; values that callers use are met most often. The source rectangle is
// left zero.
MPPPARAM DrawParams(Input* input);

// Pixels a side: small, sometimes hundreds or a thousand, seldom any word.
int32_t DrawLength(Input* input);

// Anything; often near the images of jobs.
MRECT DrawRect(Input* input);

// Blocks, pitches and places of a side whose record is set and whose image is that large. False
// when the image takes more memory than jobs have.
bool DrawSide(Input* input, int64_t imageWidth, int64_t imageHeight, differential::Side* side);

struct Job {
  differential::Case drawn = {};
  bool hasImages = false;  // otherwise there is no memory to run it on, only to create its engine
  bool drawsNothing = false;  // as the library promises for what lies too far away
  bool isModelled = false;    // the reference converter says what comes out
  // Taken for the pitch of the first plane when not 0: rows so far apart that no memory holds two.
  int32_t farDstPitch = 0;
  int32_t farSrcPitch = 0;
};

Job DrawJob(Input* input);

// What DrawJob decides last: images for a case whose records, parameters and rectangle are set.
void DrawImages(Input* input, Job* job);

// The memory of a job. Destinations can be drawn on again and again.
class Images {
 public:
  Images();

  // Fills sources, palette and destinations with bytes that the job determines.
  void Prepare(const Job& job);

  // The job on the destination that products draw on, or on the one of the model.
  reference::Job JobOnProduct() const { return Bind(product_); }
  reference::Job JobOnModel() const { return Bind(model_); }

  // Where the blocks of the job lie.
  const differential::PlacedBlock* source() const { return source_; }
  const differential::PlacedBlock* product() const { return product_; }
  const differential::PlacedBlock* model() const { return model_; }

  // Puts the bytes of Prepare back.
  void RestoreProduct();

  bool ProductUnchanged() const;
  bool SourceUnchanged() const;
  // Empty when both destinations are equal.
  std::string Difference() const;
  // Makes the other destination the expectation of the runs to come.
  void ExpectProduct();

 private:
  using Buffer = std::unique_ptr<testing_support::GuardedBuffer>;

  reference::Job Bind(const differential::PlacedBlock* dst) const;

  Buffer sourceMemory_[3], productMemory_[3], modelMemory_[3];
  testing_support::GuardedBuffer paletteMemory_;
  differential::PlacedBlock source_[3] = {}, product_[3] = {}, model_[3] = {};
  std::vector<uint8_t> before_[3], sourceBefore_[3];
  const uint8_t* palette_ = nullptr;
  Job job_;
};

}  // namespace fuzz

#endif
