#include "tests/kernels/kernel_case.h"

#include <algorithm>
#include <cstring>

#include "tests/support/formats.h"

namespace kernel_tests {
namespace {

using differential::Case;
using differential::Content;
using differential::Random;
using testing_support::GuardedBuffer;

struct PublicCode {
  uint32_t layout;  // one bit of kestrel::FormatSet
  uint32_t code;
};

constexpr uint32_t kRgb = kestrel::kRgb16 | kestrel::kRgb24 | kestrel::kRgb32;

// RGB in all channel orders, and in layouts without a name: narrower, wider and shifted fields.
constexpr PublicCode kCodes[] = {
    {kestrel::kRgb16, FORMAT_RGB565},   {kestrel::kRgb16, FORMAT_BGR565},
    {kestrel::kRgb16, 0x15000444},      {kestrel::kRgb16, 0x35001454},
    {kestrel::kRgb32, FORMAT_XRGB8888}, {kestrel::kRgb32, FORMAT_XBGR8888},
    {kestrel::kRgb32, FORMAT_RGBX8888}, {kestrel::kRgb32, FORMAT_BGRX8888},
    {kestrel::kRgb32, 0x37010777},      {kestrel::kRgb32, 0x37011777},
    {kestrel::kRgb32, 0x17001999},      {kestrel::kRgb24, FORMAT_RGB888},
    {kestrel::kRgb24, FORMAT_BGR888},   {kestrel::kRgb24, FORMAT_RGB666},
    {kestrel::kRgb24, FORMAT_BGR666},   {kestrel::kRgb24, 0x16000565},
    {kestrel::kRgb24, 0x36001676},      {kestrel::kGrey, FORMAT_GRAY8},
    {kestrel::kI420, FORMAT_I420},      {kestrel::kI440, FORMAT_I440},
    {kestrel::kI422, FORMAT_I422},      {kestrel::kI444, FORMAT_I444},
    {kestrel::kYv12, FORMAT_YV12},      {kestrel::kNv21, FORMAT_NV21},
    {kestrel::kNv12, FORMAT_NV12},      {kestrel::kNv61, FORMAT_NV61},
    {kestrel::kYuyv, FORMAT_YUYV},      {kestrel::kYuv444, FORMAT_YUV444},
};

uint32_t DrawStandard(Random* random) {
  return uint32_t(random->Between(0, 3)) << 12;
}

PublicCode DrawCode(Random* random, uint32_t layouts) {
  PublicCode code;
  do {
    code = random->Pick(kCodes);
  } while ((code.layout & layouts) == 0);
  if ((code.layout & kRgb) == 0 && random->Percent(60)) {
    code.code |= DrawStandard(random);
  }
  return code;
}

void DrawFormats(Random* random, const kestrel::KernelRow& row, Case* drawn) {
  PublicCode src = DrawCode(random, row.sources);
  const bool same = row.pairing == kestrel::Pairing::kSame;
  PublicCode dst = DrawCode(random, same ? src.layout : row.destinations);
  if (row.pairing == kestrel::Pairing::k601Full && random->Percent(80)) {
    PublicCode* const yuv = (src.layout & kRgb) != 0 ? &dst : &src;
    yuv->code = (yuv->code & ~FORMAT_STANDARD_MASK) | FORMAT_BT601_FULL;
  }
  if (same && (src.layout & kRgb) == 0) {
    dst.code = (src.code & ~FORMAT_STANDARD_MASK) | DrawStandard(random);
  } else if (src.layout == dst.layout && random->Percent(40)) {
    dst = src;
  }
  drawn->src.record.format = src.code;
  drawn->dst.record.format = dst.code;
}

uint32_t DrawTransform(Random* random, kestrel::Transform wanted) {
  using kestrel::Transform;
  if (random->Percent(50)) {
    switch (wanted) {
      case Transform::kNone:
      case Transform::kCode0:
        return 0;
      case Transform::kRotate90:
      case Transform::kCode3:
        return 3;
      case Transform::kRotate270:
      case Transform::kCode5:
        return 5;
      case Transform::kRotate90MirrorY:
        return 7;
      default:
        break;
    }
  }
  // No flag sees the fourth bit, tests of the whole code do.
  return uint32_t(random->Between(0, 7)) | (random->Percent(8) ? 8 : 0);
}

uint32_t DrawPassMode(Random* random, kestrel::Block wanted) {
  if (wanted == kestrel::Block::k4x4 && random->Percent(50)) {
    return 3;
  }
  return uint32_t(random->Between(1, 4));
}

int32_t DrawAdjustment(Random* random) {
  constexpr int32_t kExtremes[] = {-128, 0, 128};
  return random->Percent(40) ? random->Pick(kExtremes) : random->Between(-128, 128);
}

int32_t DrawLength(Random* random) {
  return random->Between(1, random->Percent(60) ? 20 : 70);
}

// What is drawn for rows that take 1:1 and something else.
kestrel::Scale DrawScale(Random* random, kestrel::Scale scale) {
  using kestrel::Scale;
  const bool unit = random->Percent(50);
  switch (scale) {
    case Scale::kUnitSteps:
      return Scale::kUnit;
    case Scale::kUnitOrNearest:
      return unit ? Scale::kUnit : Scale::kNearest;
    case Scale::kUnitOrBilinear:
      return unit ? Scale::kUnit : Scale::kBilinear;
    default:
      return scale;
  }
}

void DrawSizes(Random* random, kestrel::Scale scale, Case* drawn) {
  MPPFORMAT& src = drawn->src.record;
  src.width = DrawLength(random);
  src.height = DrawLength(random);
  int32_t width = src.width;
  int32_t height = src.height;
  const bool takesUnit = scale == kestrel::Scale::kUnit;
  const int32_t kind = random->Between(1, 100);
  if (takesUnit && kind <= 10 && height > 1) {  // 1:1 after cropping, and bilinear all the same
    height = random->Between(1, height - 1);
    drawn->params.aspectMode = MPP_ASPECT_CROP;
    drawn->params.resampleFlags = MPP_BILINEAR;
  } else if (!takesUnit && kind <= 15) {
    width *= 2;
    height *= 2;
  } else if (!takesUnit && kind <= 25) {  // scaled on one axis
    height = DrawLength(random);
  } else if (!takesUnit && kind <= 90) {
    width = DrawLength(random);
    height = DrawLength(random);
  }
  const bool swaps = (drawn->params.transformCode & MPP_SWAP_XY) != 0;
  drawn->dst.record.width = swaps ? height : width;
  drawn->dst.record.height = swaps ? width : height;
}

// start..end inside [low, high), at least one pixel.
void DrawInside(Random* random, int32_t low, int32_t high, int32_t* start, int32_t* end) {
  *start = random->Between(low, high - 1);
  *end = random->Between(*start + 1, high);
}

constexpr kestrel::KernelRow kAnything = {
    "ANY_ANY_C_SLOW",     kestrel::kAnyLayout,      kestrel::kAnyLayout,  kestrel::Pairing::kAny,
    kestrel::Scale::kAny, kestrel::Transform::kAny, kestrel::Block::kAny, 0};

}  // namespace

const kestrel::KernelRow& RowOf(int id) {
  return id == kGenericConverter ? kAnything : kestrel::kKernels[id];
}

KernelFn* EntryOf(int id) {
  return id == kGenericConverter ? ANY_ANY_C_SLOW : kestrel::kKernelEntries[id];
}

bool Takes(int id, const EngineContext& engine) {
  return id == kGenericConverter || kestrel::Accepts(kestrel::kKernels[id], engine);
}

EngineHandle CreateEngine(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params) {
  MPPFORMAT dstRecord = dst;
  MPPFORMAT srcRecord = src;
  MPPPARAM record = params;
  MPPHandle* handle = nullptr;
  MPPCreate(&dstRecord, &srcRecord, &record, &handle);
  return EngineHandle(handle);
}

Case DrawForKernel(Random* random, const kestrel::KernelRow& row) {
  Case drawn{};
  DrawFormats(random, row, &drawn);
  MPPPARAM& params = drawn.params;
  const kestrel::Scale scale = DrawScale(random, row.scale);
  const bool mayBlend = scale != kestrel::Scale::kNearest && scale != kestrel::Scale::kNotBilinear;
  params.resampleFlags = mayBlend && random->Percent(85) ? MPP_BILINEAR : MPP_NEAREST;
  params.transformCode = DrawTransform(random, row.transform);
  params.passMode = DrawPassMode(random, row.block);
  params.bandSelector = uint32_t(random->Between(0, 5));
  params.aspectMode = random->Percent(80) ? 0 : uint32_t(random->Between(1, 2));
  params.dither = random->Percent(50) ? uint32_t(random->Between(1, 3)) : 0;
  params.alpha = random->Percent(80) ? uint32_t(random->Between(0, 255)) : uint32_t(random->Next());
  if (random->Percent((row.destinations & kRgb) != 0 ? 40 : 20)) {
    params.brightness = DrawAdjustment(random);
    params.contrast = DrawAdjustment(random);
    params.saturation = DrawAdjustment(random);
  }
  DrawSizes(random, scale, &drawn);
  if (random->Percent(50)) {
    params.srcOriginX = random->Between(0, 5);
    params.srcOriginY = random->Between(0, 5);
    params.dstOriginX = random->Between(0, 5);
    params.dstOriginY = random->Between(0, 5);
  }
  if (random->Percent(30)) {
    int32_t right = params.srcOriginX + drawn.src.record.width;
    int32_t bottom = params.srcOriginY + drawn.src.record.height;
    if (random->Percent(15)) {
      right += random->Between(0, 5);
      bottom += random->Between(0, 5);
    }
    DrawInside(random, params.srcOriginX, right, &params.srcRect.left, &params.srcRect.right);
    DrawInside(random, params.srcOriginY, bottom, &params.srcRect.top, &params.srcRect.bottom);
  }
  return drawn;
}

void DrawBand(Random* random, const reference::Engine& engine, Case* drawn) {
  const MPPPARAM& params = drawn->params;
  const reference::Rect& region = engine.dstRegion;
  MRECT& rect = drawn->rect;
  rect = {int32_t(region.left), int32_t(region.top), int32_t(region.right), int32_t(region.bottom)};
  const int32_t kind = random->Between(1, 100);
  if (kind > 40 && !region.IsEmpty()) {
    const int32_t beyond = kind > 85 ? 5 : 0;
    MRECT part;
    DrawInside(random, rect.left - beyond, rect.right + beyond, &part.left, &part.right);
    DrawInside(random, rect.top - beyond, rect.bottom + beyond, &part.top, &part.bottom);
    if (kind > 80 && kind <= 85) {  // one column
      part.right = part.left + 1;
    }
    rect = part;
  }
  constexpr Content kContents[] = {Content::kNoise, Content::kNoise, Content::kExtremes,
                                   Content::kSmooth};
  drawn->content = random->Pick(kContents);
  const int32_t dstRight = params.dstOriginX + drawn->dst.record.width;
  const int32_t dstBottom = params.dstOriginY + drawn->dst.record.height;
  DrawSide(random, std::max(dstRight, rect.right), std::max(dstBottom, rect.bottom), &drawn->dst);
  DrawSide(random, params.srcOriginX + drawn->src.record.width,
           params.srcOriginY + drawn->src.record.height, &drawn->src);
  drawn->dst.nullSlot = -1;
  drawn->src.nullSlot = -1;
}

KernelBench::KernelBench() {
  constexpr size_t kCapacity = size_t{1} << 22;
  for (int i = 0; i < 3; ++i) {
    source_[i] = std::make_unique<GuardedBuffer>(kCapacity);
    got_[i] = std::make_unique<GuardedBuffer>(kCapacity);
    expected_[i] = std::make_unique<GuardedBuffer>(kCapacity);
  }
}

void KernelBench::SupplyPalette(MPPFORMAT* src) {
  reference::Format format;
  if (testing_support::IsIndexedCode(src->format) && DecodeFormat(*src, &format) == KESTREL_OK) {
    const size_t size = size_t{4} << format.bitsPerPixel;
    uint8_t* const entries = palette_.Place(size, GuardedBuffer::Edge::kEnd);
    Random(src->format).Fill(entries, size);
    src->palette = entries;
  }
}

bool KernelBench::Prepare(const Case& drawn, const reference::Engine& engine) {
  case_ = drawn;
  engine_ = &engine;
  Random random(drawn.seed, drawn.number);
  for (int i = 0; i < drawn.src.blocks.count; ++i) {
    sourceBlocks_[i] = Place(source_[i].get(), drawn.src, i);
    FillContent(&random, drawn.content, sourceBlocks_[i].watched, sourceBlocks_[i].watchedSize);
  }
  for (int i = 0; i < drawn.dst.blocks.count; ++i) {
    gotBlocks_[i] = Place(got_[i].get(), drawn.dst, i);
    expectedBlocks_[i] = Place(expected_[i].get(), drawn.dst, i);
    random.Fill(gotBlocks_[i].watched, gotBlocks_[i].watchedSize);
    std::memcpy(expectedBlocks_[i].watched, gotBlocks_[i].watched, gotBlocks_[i].watchedSize);
    before_[i].assign(gotBlocks_[i].watched, gotBlocks_[i].watched + gotBlocks_[i].watchedSize);
  }
  reference::KernelCall call;
  // Processing stops before its kernels when cropping has left nothing of the source.
  return !engine.sourceIsEmpty && Bind(gotBlocks_, &call);
}

void KernelBench::Restore() {
  for (int i = 0; i < case_.dst.blocks.count; ++i) {
    std::memcpy(gotBlocks_[i].watched, before_[i].data(), before_[i].size());
  }
}

bool KernelBench::Bind(const differential::PlacedBlock* dst, reference::KernelCall* call) const {
  reference::Job job{};
  SetPlanes(case_.src, sourceBlocks_, job.srcPlanes, job.srcPitches);
  SetPlanes(case_.dst, dst, job.dstPlanes, job.dstPitches);
  const MRECT& rect = case_.rect;
  return PrepareCall(*engine_, job, {rect.left, rect.top, rect.right, rect.bottom}, call);
}

void KernelBench::CallModel(const reference::Quirks& quirks) {
  reference::KernelCall call;
  Bind(expectedBlocks_, &call);
  ConvertLoopRect(*engine_, call.loopRect, call.dstPitches, call.srcPitches, call.dstStarts,
                  call.srcPlanes, quirks);
}

std::string KernelBench::Difference() const {
  return differential::Difference(case_.dst, gotBlocks_, expectedBlocks_);
}

std::string KernelBench::Describe() const {
  const MRECT& rect = case_.rect;
  return differential::Describe(case_) + "  band (" + std::to_string(rect.left) + ", " +
         std::to_string(rect.top) + ", " + std::to_string(rect.right) + ", " +
         std::to_string(rect.bottom) + ")";
}

}  // namespace kernel_tests
