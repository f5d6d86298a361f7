#include "fuzz/jobs.h"

#include <climits>
#include <cstdlib>
#include <cstring>
#include <iterator>

#include "tests/support/formats.h"

namespace fuzz {
namespace {

using differential::Block;
using differential::Case;
using differential::Content;
using differential::PlacedBlock;
using differential::Random;
using differential::Side;
using testing_support::GuardedBuffer;

constexpr size_t kCapacity = size_t{1} << 22;
constexpr int32_t kLongest = 4800;
constexpr int64_t kMostPixels = int64_t{kLongest} * 25;
constexpr int64_t kFarthest = 16777216;  // regions that start beyond are not drawn

// The plainest first, of which zeros are made, then the others.
constexpr uint32_t kPlainest[] = {FORMAT_NV21, FORMAT_XBGR8888, FORMAT_I420};

constexpr bool IsNotPlainest(uint32_t code) {
  return code != kPlainest[0] && code != kPlainest[1] && code != kPlainest[2];
}

uint32_t DrawListed(Input* input) {
  constexpr auto kOthers = testing_support::PublicCodes<IsNotPlainest>();
  constexpr size_t kPlain = std::size(kPlainest);
  const auto place = size_t(input->Between(0, int32_t(kPlain + kOthers.size()) - 1));
  return place < kPlain ? kPlainest[place] : kOthers[place - kPlain];
}

int32_t DrawAdjustment(Input* input) {
  switch (input->Between(0, 3)) {
    case 0:
      return 0;
    case 1:
      return int32_t(input->Word());
    default:
      return input->Between(-128, 128);
  }
}

int32_t DrawOrigin(Input* input) {
  switch (input->Between(0, 31)) {
    case 29:
      return -input->Between(1, 40);
    case 30:
      return int32_t(input->Word());
    default:
      return 0;
    case 24:
    case 25:
    case 26:
    case 27:
    case 28:
      return input->Between(1, 20);
  }
}

// A word that has `usual` values with a meaning.
uint32_t DrawWord(Input* input, uint32_t usual) {
  return input->OneIn(16) ? input->Word() : input->Byte() % usual;
}

bool IsGiven(const MRECT& rect) {
  return (rect.left | rect.top | rect.right | rect.bottom) != 0;
}

bool IsEmpty(const MRECT& rect) {
  return rect.left >= rect.right || rect.top >= rect.bottom;
}

// start..end inside low..high, at least one pixel.
void DrawInside(Input* input, int32_t low, int32_t high, int32_t* start, int32_t* end) {
  *start = input->Between(low, high - 1);
  *end = input->Between(*start + 1, high);
}

void DrawSourceRect(Input* input, const MPPFORMAT& src, MPPPARAM* params) {
  MRECT& rect = params->srcRect;
  const int64_t right = int64_t(params->srcOriginX) + src.width;
  const int64_t bottom = int64_t(params->srcOriginY) + src.height;
  const int32_t left = std::max(params->srcOriginX, 0);
  const int32_t top = std::max(params->srcOriginY, 0);
  const int32_t kind = input->Between(0, 7);
  if (kind == 7) {
    rect = DrawRect(input);
  } else if (kind >= 5 && right > left && bottom > top && right < kFarthest && bottom < kFarthest) {
    const int32_t beyond = kind == 6 ? 6 : 0;
    DrawInside(input, left, int32_t(right) + beyond, &rect.left, &rect.right);
    DrawInside(input, top, int32_t(bottom) + beyond, &rect.top, &rect.bottom);
  }
}

void DrawSizes(Input* input, const MPPPARAM& params, MPPFORMAT* dst, MPPFORMAT* src) {
  src->width = DrawLength(input);
  src->height = DrawLength(input);
  int32_t width = src->width;
  int32_t height = src->height;
  switch (input->Between(0, 5)) {
    case 0:
    case 1:
      break;
    case 2:
      width = int32_t(uint32_t(width) * 2);
      height = int32_t(uint32_t(height) * 2);
      break;
    case 3:
      width = DrawLength(input);
      break;
    default:
      width = DrawLength(input);
      height = DrawLength(input);
      break;
  }
  const bool swaps = (params.transformCode & MPP_SWAP_XY) != 0;
  dst->width = swaps ? height : width;
  dst->height = swaps ? width : height;
}

// Rows of this pitch span 2 GiB or more, or one alone does.
int32_t FarPitch(Input* input, int64_t rows) {
  const int64_t least = (int64_t{1} << 31) / (rows - 1) + 1;
  if (least > INT32_MAX || input->OneIn(4)) return INT32_MIN;
  const int32_t pitch = int32_t(least + input->Byte());
  return input->OneIn(2) ? -pitch : pitch;
}

}  // namespace

uint32_t DrawFormat(Input* input) {
  const uint32_t standard = uint32_t(input->Between(0, 3)) << 12;
  const int32_t kind = input->Between(0, 31);
  if (kind == 31) return input->Word();
  if (kind == 30) return DrawListed(input) ^ 1u << input->Between(0, 31);
  if (kind >= 28) {
    return 0x50000800u | standard | (input->OneIn(2) ? 0x200u : 0u) |
           (uint32_t(input->Byte()) & 0x33u);
  }
  if (kind >= 25) {
    return (input->OneIn(2) ? 0x30000000u : 0x10000000u) | uint32_t(input->Between(5, 7)) << 24 |
           (input->Word() & 0x1FFFu);
  }
  const uint32_t code = DrawListed(input);
  return testing_support::HasStandard(code) ? code | standard : code;
}

MPPPARAM DrawParams(Input* input) {
  constexpr uint32_t kPassModes[] = {MPP_PASS_TILED, 1, 2, 3, 4, 0, MPP_PASS_TILED};
  MPPPARAM params = {};
  params.resampleFlags = input->OneIn(2) ? DrawWord(input, 4) : MPP_BILINEAR;
  params.transformCode = input->OneIn(2) ? DrawWord(input, 16) : 0;
  params.bandSelector = DrawWord(input, 6);
  params.passMode = input->OneIn(16) ? input->Word() : input->Pick(kPassModes);
  params.aspectMode = input->OneIn(4) ? DrawWord(input, 5) : 0;
  params.dither = input->OneIn(4) ? DrawWord(input, 3) : 0;
  if (input->OneIn(3)) {
    params.brightness = DrawAdjustment(input);
    params.contrast = DrawAdjustment(input);
    params.saturation = DrawAdjustment(input);
  }
  params.srcOriginX = DrawOrigin(input);
  params.srcOriginY = DrawOrigin(input);
  params.dstOriginX = DrawOrigin(input);
  params.dstOriginY = DrawOrigin(input);
  params.alpha = input->OneIn(4) ? input->Word() : input->Byte();
  return params;
}

int32_t DrawLength(Input* input) {
  const int32_t kind = input->Between(0, 63);
  if (kind == 63) return int32_t(input->Word());
  if (kind == 62) return input->Between(301, 1200);       // more than a strip of a row
  if (kind == 61) return input->Between(1201, kLongest);  // more than the widest strip
  if (kind >= 60) return input->Between(1, 300);
  return input->Between(1, kind < 40 ? 20 : 70);
}

MRECT DrawRect(Input* input) {
  MRECT rect = {};
  for (int32_t* edge : {&rect.left, &rect.top, &rect.right, &rect.bottom}) {
    *edge = input->OneIn(16) ? int32_t(input->Word()) : input->Between(-70, 90);
  }
  return rect;
}

bool DrawSide(Input* input, int64_t imageWidth, int64_t imageHeight, Side* side) {
  side->nullSlot = -1;
  side->isKnown = reference::DecodeFormat(side->record, &side->format) == 0;
  imageWidth = std::max<int64_t>(imageWidth, 1);
  imageHeight = std::max<int64_t>(imageHeight, 1);
  if (imageWidth > kMostPixels || imageHeight > kMostPixels ||
      imageWidth * imageHeight > kMostPixels) {
    return false;
  }
  side->blocks = differential::ImageBlocks{1, {{1, 1}, {0, 0}, {0, 0}}};
  if (side->isKnown) {
    side->blocks = differential::BlocksOf(side->format, int32_t(imageWidth), int32_t(imageHeight),
                                          input->OneIn(10));
  }
  for (int i = 0; i < side->blocks.count; ++i) {
    const Block& block = side->blocks.block[i];
    const int32_t kind = input->Byte();
    int32_t pitch = block.rowBytes;  // tight
    if ((kind & 3) == 1) pitch = (pitch + 3) / 4 * 4;
    if ((kind & 3) == 2) pitch = (pitch + 15) / 16 * 16 + 16 * (kind >> 7);
    if ((kind & 3) == 3) pitch += kind >> 3 & 15;
    if (SizeOf(block, pitch) > kCapacity / 2) pitch = block.rowBytes;
    side->pitches[i] = (kind & 4) != 0 ? -pitch : pitch;
    const int32_t place = input->Byte();
    side->placement[i] = {
        (place & 1) != 0 ? GuardedBuffer::Edge::kStart : GuardedBuffer::Edge::kEnd,
        1u << (place >> 1 & 7) % 6, uint32_t(place >> 4)};
  }
  if (side->blocks.count == 2) side->pitches[2] = side->pitches[1];
  return true;
}

void DrawImages(Input* input, Job* job) {
  Case& drawn = job->drawn;
  const MPPPARAM& params = drawn.params;
  drawn.content = Content(input->Between(0, 2));
  drawn.seed = input->Byte();
  drawn.number = 0;
  job->farSrcPitch = job->farDstPitch = 0;  // this may be drawn anew, for other sizes

  int64_t dstRight = int64_t(params.dstOriginX) + drawn.dst.record.width;
  int64_t dstBottom = int64_t(params.dstOriginY) + drawn.dst.record.height;
  if (drawn.hasRect) {
    dstRight = std::max<int64_t>(dstRight, drawn.rect.right);
    dstBottom = std::max<int64_t>(dstBottom, drawn.rect.bottom);
  }
  int64_t srcRight = int64_t(params.srcOriginX) + drawn.src.record.width;
  int64_t srcBottom = int64_t(params.srcOriginY) + drawn.src.record.height;
  const bool isFar = params.dstOriginX > kFarthest || params.dstOriginY > kFarthest ||
                     params.srcOriginX > kFarthest || params.srcOriginY > kFarthest;
  if (isFar) dstRight = dstBottom = srcRight = srcBottom = 1;

  job->hasImages = DrawSide(input, dstRight, dstBottom, &drawn.dst) &&
                   DrawSide(input, srcRight, srcBottom, &drawn.src);
  if (!job->hasImages) return;
  job->drawsNothing = isFar;

  const bool isGrey = drawn.dst.isKnown && drawn.dst.format.IsGrey();
  if (input->OneIn(32)) drawn.dst.nullSlot = input->Between(0, 2);
  if (input->OneIn(32)) drawn.src.nullSlot = input->Between(0, 2);
  // Whether grey output needs chroma planes is nobody's promise.
  job->isModelled = !isFar && !(IsGiven(params.srcRect) && IsEmpty(params.srcRect)) &&
                    !(isGrey && drawn.src.nullSlot > 0) && drawn.dst.nullSlot != 0 &&
                    drawn.src.nullSlot != 0;
  if (input->OneIn(48) && srcBottom > 1) {
    job->farSrcPitch = FarPitch(input, srcBottom);
    drawn.src.blocks.block[0].rows = 1;
  }
  if (input->OneIn(64)) {
    job->farDstPitch = INT32_MIN;
    drawn.dst.blocks.block[0].rows = 1;
  }
  if (job->farSrcPitch != 0 || job->farDstPitch != 0) {
    job->drawsNothing = true;
    job->isModelled = false;
  }
}

Job DrawJob(Input* input) {
  static const uint8_t kSomePalette[4] = {0, 0, 0, 0};
  Job job;
  Case& drawn = job.drawn;
  drawn.dst.record.format = DrawFormat(input);
  drawn.src.record.format = input->OneIn(6) ? drawn.dst.record.format : DrawFormat(input);
  if (testing_support::IsIndexedCode(drawn.src.record.format) && !input->OneIn(16)) {
    drawn.src.record.palette = kSomePalette;
  }
  drawn.params = DrawParams(input);
  DrawSizes(input, drawn.params, &drawn.dst.record, &drawn.src.record);
  DrawSourceRect(input, drawn.src.record, &drawn.params);
  drawn.hasRect = input->OneIn(2);
  if (drawn.hasRect) drawn.rect = DrawRect(input);
  DrawImages(input, &job);
  return job;
}

Images::Images() : paletteMemory_(1024) {
  for (int i = 0; i < 3; ++i) {
    sourceMemory_[i] = std::make_unique<GuardedBuffer>(kCapacity);
    productMemory_[i] = std::make_unique<GuardedBuffer>(kCapacity);
    modelMemory_[i] = std::make_unique<GuardedBuffer>(kCapacity);
  }
}

void Images::Prepare(const Job& job) {
  job_ = job;
  const Case& drawn = job_.drawn;
  Random random(drawn.seed, drawn.number);
  for (int i = 0; i < drawn.src.blocks.count; ++i) {
    source_[i] = Place(sourceMemory_[i].get(), drawn.src, i);
    FillContent(&random, drawn.content, source_[i].watched, source_[i].watchedSize);
    sourceBefore_[i].assign(source_[i].watched, source_[i].watched + source_[i].watchedSize);
  }
  for (int i = 0; i < drawn.dst.blocks.count; ++i) {
    product_[i] = Place(productMemory_[i].get(), drawn.dst, i);
    model_[i] = Place(modelMemory_[i].get(), drawn.dst, i);
    random.Fill(product_[i].watched, product_[i].watchedSize);
    std::memcpy(model_[i].watched, product_[i].watched, product_[i].watchedSize);
    before_[i].assign(product_[i].watched, product_[i].watched + product_[i].watchedSize);
  }
  palette_ = nullptr;
  if (drawn.src.record.palette != nullptr && drawn.src.isKnown) {
    const size_t size = size_t{4} << drawn.src.format.bitsPerPixel;
    uint8_t* const palette = paletteMemory_.Place(size, GuardedBuffer::Edge::kEnd);
    random.Fill(palette, size);
    palette_ = palette;
  }
}

reference::Job Images::Bind(const PlacedBlock* dst) const {
  const Case& drawn = job_.drawn;
  reference::Job call = {};
  call.dst = drawn.dst.record;
  call.src = drawn.src.record;
  call.src.palette = palette_;
  call.params = drawn.params;
  call.hasRect = drawn.hasRect;
  call.rect = drawn.rect;
  SetPlanes(drawn.src, source_, call.srcPlanes, call.srcPitches);
  SetPlanes(drawn.dst, dst, call.dstPlanes, call.dstPitches);
  if (job_.farSrcPitch != 0) call.srcPitches[0] = job_.farSrcPitch;
  if (job_.farDstPitch != 0) call.dstPitches[0] = job_.farDstPitch;
  return call;
}

void Images::RestoreProduct() {
  for (int i = 0; i < job_.drawn.dst.blocks.count; ++i) {
    std::memcpy(product_[i].watched, before_[i].data(), before_[i].size());
  }
}

bool Images::ProductUnchanged() const {
  for (int i = 0; i < job_.drawn.dst.blocks.count; ++i) {
    if (std::memcmp(product_[i].watched, before_[i].data(), before_[i].size()) != 0) return false;
  }
  return true;
}

bool Images::SourceUnchanged() const {
  for (int i = 0; i < job_.drawn.src.blocks.count; ++i) {
    if (std::memcmp(source_[i].watched, sourceBefore_[i].data(), sourceBefore_[i].size()) != 0) {
      return false;
    }
  }
  return true;
}

std::string Images::Difference() const {
  return differential::Difference(job_.drawn.dst, product_, model_);
}

void Images::ExpectProduct() {
  for (int i = 0; i < job_.drawn.dst.blocks.count; ++i) {
    std::memcpy(model_[i].watched, product_[i].watched, product_[i].watchedSize);
  }
}

}  // namespace fuzz
