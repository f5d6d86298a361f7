// Every kernel of the tables and the generic converter through its exported entry, with engines
// that it may and may not accept. What it accepts equals the model on every byte, what it refuses
// is not written.
#include "fuzz/input.h"
#include "fuzz/jobs.h"
#include "tests/kernels/kernel_case.h"
#include "tests/reference/chooser.h"
#include "tests/support/formats.h"
#include "tests/support/instruction_sets.h"

namespace {

using differential::Case;
using fuzz::Fail;
using fuzz::Input;

struct LayoutCode {
  uint32_t layout;  // one bit of kestrel::FormatSet
  uint32_t code;
};

constexpr LayoutCode kCodes[] = {
    {kestrel::kRgb16, FORMAT_RGB565},   {kestrel::kRgb16, FORMAT_BGR565},
    {kestrel::kRgb32, FORMAT_XRGB8888}, {kestrel::kRgb32, FORMAT_XBGR8888},
    {kestrel::kRgb32, FORMAT_BGRX8888}, {kestrel::kRgb24, FORMAT_RGB888},
    {kestrel::kRgb24, FORMAT_BGR888},   {kestrel::kRgb24, FORMAT_RGB666},
    {kestrel::kGrey, FORMAT_GRAY8},     {kestrel::kI420, FORMAT_I420},
    {kestrel::kI440, FORMAT_I440},      {kestrel::kI422, FORMAT_I422},
    {kestrel::kI444, FORMAT_I444},      {kestrel::kYv12, FORMAT_YV12},
    {kestrel::kNv21, FORMAT_NV21},      {kestrel::kNv12, FORMAT_NV12},
    {kestrel::kNv61, FORMAT_NV61},      {kestrel::kYuyv, FORMAT_YUYV},
    {kestrel::kYuv444, FORMAT_YUV444},
};

// A code of one of the layouts of a row; sometimes anything.
uint32_t DrawCodeOf(Input* input, uint32_t layouts) {
  if (input->OneIn(8)) return fuzz::DrawFormat(input);
  uint32_t fitting[std::size(kCodes)];
  int32_t count = 0;
  for (const LayoutCode& candidate : kCodes) {
    if ((candidate.layout & layouts) != 0) fitting[count++] = candidate.code;
  }
  const uint32_t code = fitting[input->Between(0, count - 1)];
  return testing_support::HasStandard(code) ? code | uint32_t(input->Between(0, 3)) << 12 : code;
}

// Pixels a side: few, or enough for what is done in strips and tiles.
int32_t DrawKernelLength(Input* input) {
  const int32_t kind = input->Between(1, 80);
  if (kind <= 70) return kind;
  return kind <= 77 ? input->Between(71, 300) : input->Between(301, 1200);
}

// The transform that a row asks for more often than chance would have it.
uint32_t DrawTransform(Input* input, kestrel::Transform wanted, uint32_t drawn) {
  constexpr uint32_t kCodesOf[] = {0, 1, 2, 3, 4, 5, 6, 7};
  if (wanted == kestrel::Transform::kAny || input->OneIn(4)) return drawn;
  return input->Pick(kCodesOf);
}

void DrawFormats(Input* input, const kestrel::KernelRow& row, Case* drawn) {
  MPPFORMAT& src = drawn->src.record;
  MPPFORMAT& dst = drawn->dst.record;
  if (row.sources == kestrel::kAnyLayout) {
    src.format = fuzz::DrawFormat(input);
    dst.format = fuzz::DrawFormat(input);
    return;
  }
  src.format = DrawCodeOf(input, row.sources);
  dst.format = row.pairing == kestrel::Pairing::kSame && !input->OneIn(8)
                   ? src.format
                   : DrawCodeOf(input, row.destinations);
}

Case DrawCall(Input* input, const kestrel::KernelRow& row) {
  Case drawn = {};
  DrawFormats(input, row, &drawn);
  MPPPARAM& params = drawn.params;
  params = fuzz::DrawParams(input);
  params.transformCode = DrawTransform(input, row.transform, params.transformCode);
  // One pass: kernels are handed the engine of a pass, whose mode is its own.
  if (params.passMode == MPP_PASS_TILED) params.passMode = uint32_t(input->Between(1, 4));
  MPPFORMAT& src = drawn.src.record;
  MPPFORMAT& dst = drawn.dst.record;
  src.width = DrawKernelLength(input);
  src.height = DrawKernelLength(input);
  const bool swaps = (params.transformCode & MPP_SWAP_XY) != 0;
  const bool isUnit = row.scale == kestrel::Scale::kUnit ||
                      row.scale == kestrel::Scale::kUnitSteps || input->OneIn(3);
  dst.width = isUnit ? (swaps ? src.height : src.width) : DrawKernelLength(input);
  dst.height = isUnit ? (swaps ? src.width : src.height) : DrawKernelLength(input);
  if (input->OneIn(4)) {
    MRECT& rect = params.srcRect;
    rect.left = input->Between(0, 20);
    rect.top = input->Between(0, 20);
    rect.right = rect.left + input->Between(1, 70);
    rect.bottom = rect.top + input->Between(1, 70);
  }
  return drawn;
}

// The band: the region of the engine, a part of it, or something that reaches beyond.
void DrawBand(Input* input, const reference::Rect& region, Case* drawn) {
  drawn->hasRect = true;
  drawn->rect = {int32_t(region.left), int32_t(region.top), int32_t(region.right),
                 int32_t(region.bottom)};
  if (region.IsEmpty() || !input->OneIn(2)) return;
  const int32_t beyond = input->OneIn(4) ? 5 : 0;
  MRECT& rect = drawn->rect;
  const MRECT whole = rect;
  rect.left = input->Between(whole.left - beyond, whole.right - 1);
  rect.top = input->Between(whole.top - beyond, whole.bottom - 1);
  rect.right = input->Between(rect.left + 1, whole.right + beyond);
  rect.bottom = input->Between(rect.top + 1, whole.bottom + beyond);
}

bool IsNear(int32_t origin) {
  return origin >= -64 && origin <= 64;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static kernel_tests::KernelBench bench;
  Input input(data, size);
  const int id = input.Between(0, kernel_tests::kCallableCount - 1);
  const kestrel::KernelRow& row = kernel_tests::RowOf(id);
  // The engine of this kernel, or of another.
  const int other = input.OneIn(8) ? input.Between(0, kestrel::kernel_id::kCount - 1) : id;
  fuzz::Job job;
  Case& drawn = job.drawn;
  drawn = DrawCall(&input, kernel_tests::RowOf(other));
  bench.SupplyPalette(&drawn.src.record);
  const MPPPARAM& params = drawn.params;
  if (!IsNear(params.srcOriginX) || !IsNear(params.srcOriginY) || !IsNear(params.dstOriginX) ||
      !IsNear(params.dstOriginY)) {
    return 0;  // processing looks after these before it calls a kernel
  }
  reference::Engine model;
  const kernel_tests::EngineHandle handle =
      kernel_tests::CreateEngine(drawn.dst.record, drawn.src.record, params);
  const uint32_t code =
      reference::BuildEngine(drawn.dst.record, drawn.src.record, params, params.passMode, &model);
  fuzz::Require((code == KESTREL_OK) == (handle != nullptr), "creation and model disagree");
  if (!handle) return 0;

  DrawBand(&input, model.dstRegion, &drawn);
  fuzz::DrawImages(&input, &job);
  if (!job.hasImages || job.drawsNothing) return 0;
  drawn.dst.nullSlot = drawn.src.nullSlot = -1;
  if (!bench.Prepare(drawn, model)) return 0;

  const EngineContext& context = *handle->pass[0]->context;
  const auto& sets = testing_support::InstructionSets();
  const testing_support::InstructionSet& set =
      sets[size_t(input.Between(0, int32_t(sets.size()) - 1))];
  ForceRows(handle.get(), set);
  const bool takes = kernel_tests::Takes(id, context);
  bool isKnown = false;
  const bool shouldTake = reference::Takes(row.name, model, &isKnown);
  const std::string where = std::string(row.name) + " with " + set.name + ": ";
  if (isKnown && takes != shouldTake) Fail(where + "the table and the model disagree");
  const uint32_t answer = bench.Call(kernel_tests::EntryOf(id), &context);
  if (answer != (takes ? KESTREL_OK : KESTREL_UNSUPPORTED)) {
    Fail(where + "answers " + std::to_string(answer) + " to " + bench.Describe());
  }
  if (takes) bench.CallModel(reference::QuirksOf(row.name));
  const std::string difference = bench.Difference();
  if (!difference.empty()) Fail(where + difference + "\n" + bench.Describe());
  return 0;
}
