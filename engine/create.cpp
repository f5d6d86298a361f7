// Engine creation: every decision that does not depend on plane addresses is taken here, once.
#include <string.h>

#include "engine/engine_internal.h"
#include "platform/tessel/tessel.h"

namespace kestrel {
namespace {

template <typename T>
T* AllocateZeroed() {
  void* block = MMemAlloc(nullptr, sizeof(T));
  if (block != nullptr) MMemSet(block, 0, sizeof(T));
  return static_cast<T*>(block);
}

// 65536 x numerator / denominator, cut to an unsigned word. 0, which creation refuses, when a size
// is not positive.
uint32_t Step(int64_t numerator, int64_t denominator) {
  if (numerator <= 0 || denominator <= 0) return 0;
  if (numerator == denominator) return 0x10000;
  const double step = 65536.0 * double(numerator) / double(denominator);
  return step >= 4294967295.0 ? UINT32_MAX : uint32_t(step);
}

int32_t ClampAdjustment(int32_t value) {
  return value < -128 ? -128 : value > 128 ? 128 : value;
}

int64_t RoundDown(int64_t value, int64_t multiple) {
  const int64_t rest = value % multiple;
  return value - (rest < 0 ? rest + multiple : rest);
}

int64_t RoundUp(int64_t value, int64_t multiple) {
  return -RoundDown(-value, multiple);
}

bool IsZero(const MRECT& rect) {
  return rect.left == 0 && rect.top == 0 && rect.right == 0 && rect.bottom == 0;
}

// One axis of the geometry, in loop orientation: the destination's axes are exchanged when swapXY.
struct Axis {
  int64_t srcOrigin, srcLength;
  int64_t dstOrigin, dstLength;
  uint32_t step, inverseStep;

  void SetSteps() {
    step = Step(srcLength, dstLength);
    inverseStep = Step(dstLength, srcLength);
  }
  void TakeSteps(const Axis& other) {
    step = other.step;
    inverseStep = other.inverseStep;
  }
};

// Shrinks `axis` of the destination so that its scale becomes that of `other`, centred. The margin
// is rounded up to the block grid, so the picture never grows past the region.
void FitAxis(Axis* axis, const Axis& other, int64_t grid) {
  const int64_t length = RoundDown(other.dstLength * axis->srcLength / other.srcLength, grid);
  const int64_t margin = RoundUp((axis->dstLength - length + 1) >> 1, grid);
  axis->dstOrigin += margin;
  axis->dstLength -= 2 * margin;
  axis->TakeSteps(other);
}

// Cuts `axis` of the source so that its scale becomes that of `other`, centred. The margin is
// rounded down to the block grid, so no more than needed is lost.
void CropAxis(Axis* axis, const Axis& other, int64_t grid) {
  if (other.dstLength == 0) return;  // an emptied region draws nothing
  const int64_t kept = RoundDown(axis->dstLength * other.srcLength / other.dstLength, grid);
  const int64_t margin = RoundDown((axis->srcLength - kept + 1) >> 1, grid);
  axis->srcOrigin += margin;
  axis->srcLength -= 2 * margin;
  axis->TakeSteps(other);
}

void ApplyAspectPolicy(uint32_t aspectMode, uint32_t blockMode, Axis* x, Axis* y) {
  if (x->step == y->step) return;
  const int64_t grid = blockMode == 2 ? 2 : blockMode == 3 ? 4 : 1;
  if ((aspectMode & MPP_ASPECT_FIT) != 0) {
    if (x->step <= y->step) {
      FitAxis(x, *y, grid);
    } else {
      FitAxis(y, *x, grid);
    }
  }
  // After a fit the steps are equal, and a crop asked for as well cuts the width.
  if ((aspectMode & MPP_ASPECT_CROP) != 0) {
    if (x->step < y->step) {
      CropAxis(y, *x, grid);
    } else {
      CropAxis(x, *y, grid);
    }
  }
}

uint32_t ChooseBlockMode(const EngineContext& c) {
  const uint32_t src = c.srcFormat.code;
  const uint32_t dst = c.dstFormat.code;
  if (c.params.passMode < 2 || c.params.passMode > 4) return 1;
  const bool oddSubsampling =
      src == CODE_YV_ANY || src == CODE_I_ANY || dst == CODE_YV_ANY || dst == CODE_I_ANY;
  if (oddSubsampling || c.srcFormat.palette != nullptr) return 1;
  return c.params.passMode;
}

bool IsKnownStandard(uint32_t colourStandard) {
  return colourStandard == CS_BT601_FULL || colourStandard == CS_BT709_VIDEO ||
         colourStandard == CS_BT709_FULL;
}

void DescribeChannels(const FormatDesc& format, uint32_t* sizes, uint32_t* positions) {
  const auto& masks = format.layout.rgb;
  const uint32_t byChannel[3] = {masks.redMask, masks.greenMask, masks.blueMask};
  // The mask words of an indexed format are never written: no channel has bits.
  for (int i = 0; i < 3; ++i) {
    sizes[i] = MGetMaskSize(byChannel[i]);
    positions[i] = MGetMaskPos(byChannel[i]);
  }
}

// First destination column (or row) whose centre-aligned position reaches `source`.
int32_t Covered(int32_t source, int32_t srcOrigin, uint32_t step, int32_t dstOrigin) {
  const int64_t centre = int64_t(step >> 1) + 32768;
  const int64_t position = (int64_t(source) - srcOrigin) * 65536 + centre;
  // The step of most engines, which needs no division.
  const int64_t steps = step == 0x10000 ? position / 0x10000 : position / int64_t(step);
  return SaturateToInt32(steps + dstOrigin);
}

struct GeometryOf {
  Axis x, y;
};

GeometryOf InitialGeometry(const EngineContext& c, const MPPFORMAT& dst, const MPPFORMAT& src) {
  GeometryOf g;
  g.x = {c.params.srcOriginX, src.width, c.params.dstOriginX, dst.width, 0, 0};
  g.y = {c.params.srcOriginY, src.height, c.params.dstOriginY, dst.height, 0, 0};
  if (c.swapXY != 0) {
    g.x.dstOrigin = c.params.dstOriginY;
    g.x.dstLength = dst.height;
    g.y.dstOrigin = c.params.dstOriginX;
    g.y.dstLength = dst.width;
  }
  g.x.SetSteps();
  g.y.SetSteps();
  return g;
}

void CopySteps(const GeometryOf& g, EngineContext* c) {
  c->stepX = g.x.step;
  c->stepY = g.y.step;
  c->invStepX = g.x.inverseStep;
  c->invStepY = g.y.inverseStep;
}

bool BothSteps(const EngineContext& c, uint32_t step) {
  return c.stepX == step && c.stepY == step;
}

void SetScaleFlags(EngineContext* c) {
  c->bilinear = c->params.resampleFlags == MPP_BILINEAR && !BothSteps(*c, 0x10000);
  if (c->srcFormat.code == CODE_RGB) c->srcRgbBilinear[0] = c->srcRgbBilinear[1] = c->bilinear;
  switch (c->params.bandSelector) {
    case 4:
      c->tallBands = 1;
      c->bandCode = 5;
      break;
    case 3:
      c->bandCode = 3;
      break;
    case 2:
      c->bandCode = 1;
      break;
    default:
      break;
  }
  // Taken before the aspect policy, and kept when it changes the steps: kernels are chosen by them.
  c->noDownscale = c->stepX <= 0x10000 && c->stepY <= 0x10000;
  c->halfStep = BothSteps(*c, 0x8000);
  c->unitStep = BothSteps(*c, 0x10000);
}

uint32_t DescribeLayouts(EngineContext* c) {
  MPGetPlaneLayout(&c->srcFormat, &c->srcLayout);
  MPGetPlaneLayout(&c->dstFormat, &c->dstLayout);
  if (c->dstFormat.code == CODE_RGB) {
    DescribeChannels(c->dstFormat, c->dstChannelSize, c->dstChannelPos);
  }
  if (c->srcFormat.code == CODE_RGB) {
    DescribeChannels(c->srcFormat, c->srcChannelSize, c->srcChannelPos);
  }
  const uint32_t result = MPGetSubsampling(&c->srcFormat, &c->srcLayout, c->srcSubsample);
  if (result != KESTREL_OK) return result;
  return MPGetSubsampling(&c->dstFormat, &c->dstLayout, c->dstSubsample);
}

void SetPath(EngineContext* c) {
  const bool fromRgb = c->srcFormat.code == CODE_RGB;
  const bool toRgb = c->dstFormat.code == CODE_RGB;
  c->pathKind = fromRgb ? (toRgb ? PATH_RGB_TO_RGB : PATH_RGB_TO_YUV)
                        : (toRgb ? PATH_YUV_TO_RGB : PATH_YUV_TO_YUV);
  if (!fromRgb && !IsKnownStandard(c->srcFormat.colourStandard)) {
    c->srcFormat.colourStandard = CS_BT601_VIDEO;
  }
  if (!toRgb && !IsKnownStandard(c->dstFormat.colourStandard)) {
    c->dstFormat.colourStandard = CS_BT601_VIDEO;
  }
  if (c->pathKind == PATH_YUV_TO_RGB && c->dstFormat.colourStandard == 16) c->wideRgbOut = 0;
  if (c->pathKind == PATH_YUV_TO_YUV) {
    const MPPPARAM& p = c->params;
    const uint32_t differ = (c->srcFormat.colourStandard ^ c->dstFormat.colourStandard) & 3;
    c->needsLevelTable = p.brightness != 0 || p.contrast != 0 || p.saturation != 0 || differ != 0;
  }
}

void SetBlockMode(EngineContext* c) {
  c->blockMode = ChooseBlockMode(*c);
  if (c->blockMode != 4) return;
  const uint32_t transform = c->params.transformCode;
  const bool special = c->bilinear != 0 && c->srcFormat.code == CODE_I420 &&
                       c->dstFormat.code == CODE_I420 &&
                       (transform == 0 || transform == 3 || transform == 5);
  if (special) {
    c->i420Fast4x4 = 1;
  } else {
    c->blockMode = 3;
  }
}

void SettleUnitScale(EngineContext* c) {
  if (BothSteps(*c, 0x8000)) {
    c->halfStep = 1;
  } else if (BothSteps(*c, 0x10000)) {
    c->i420Fast4x4 = 0;
    c->unitStep = 1;
    if (c->blockMode == 4) c->blockMode = 3;
    if (c->blockMode == 3 && c->needsLevelTable != 0) c->blockMode = 2;
  }
}

MRECT SourceRect(const MPPPARAM& p, const MPPFORMAT& src) {
  if (!IsZero(p.srcRect)) return p.srcRect;
  return {p.srcOriginX, p.srcOriginY, SaturateToInt32(int64_t(p.srcOriginX) + src.width),
          SaturateToInt32(int64_t(p.srcOriginY) + src.height)};
}

// Mirrors and swaps the destination's layout, so that kernels walk it in loop orientation.
void OrientDestination(EngineContext* c) {
  if (c->mirrorX != 0) {
    for (int32_t& step : c->dstLayout.step) step = -step;
  }
  if (c->swapXY != 0) {
    for (int i = 0; i < 3; ++i) {
      const uint32_t horizontal = c->dstSubsample[i];
      c->dstSubsample[i] = c->dstSubsample[3 + i];
      c->dstSubsample[3 + i] = horizontal;
    }
  }
}

void FillPassEngine(const GeometryOf& g, PassEngine* e) {
  EngineContext* const c = e->context;
  e->srcRegionX = c->srcOriginX;
  e->srcRegionY = c->srcOriginY;
  e->srcRegionWidth = SaturateToInt32(g.x.srcLength);
  e->srcRegionHeight = SaturateToInt32(g.y.srcLength);
  const Axis& across = c->swapXY != 0 ? g.y : g.x;
  const Axis& down = c->swapXY != 0 ? g.x : g.y;
  e->dstRegionX = SaturateToInt32(across.dstOrigin);
  e->dstRegionY = SaturateToInt32(down.dstOrigin);
  e->dstRegionWidth = SaturateToInt32(across.dstLength);
  e->dstRegionHeight = SaturateToInt32(down.dstLength);
  c->dstRegion = {e->dstRegionX, e->dstRegionY,
                  SaturateToInt32(int64_t(e->dstRegionX) + e->dstRegionWidth),
                  SaturateToInt32(int64_t(e->dstRegionY) + e->dstRegionHeight)};
  e->bandSelector = c->params.bandSelector;
  e->transformCode = c->params.transformCode;
  e->resampleMode = c->params.resampleFlags;
  e->srcLayout = c->srcLayout;
  e->dstLayout = c->dstLayout;
  memcpy(e->dstPlaneFactors, c->dstPlaneFactors, sizeof(e->dstPlaneFactors));
  e->swapXY = c->swapXY;
  e->mirrorX = c->mirrorX;
  e->mirrorY = c->mirrorY;
  e->stepX = c->stepX;
  e->stepY = c->stepY;
  e->invStepX = c->invStepX;
  e->invStepY = c->invStepY;
  e->dstOriginX = c->dstOriginX;
  e->dstOriginY = c->dstOriginY;
  e->srcOriginX = c->srcOriginX;
  e->srcOriginY = c->srcOriginY;
  e->srcRect = c->srcRect;
  e->dstRect = c->dstRect;
  e->dither = c->dither;
  e->alpha = c->alpha;
}

// The order of the decisions matters: several flags are taken before a later step changes what they
// were derived from, and kernels rely on that. These come first, and do not depend on the pass
// mode.
uint32_t Describe(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params,
                  GeometryOf* geometry, EngineContext* c) {
  c->params = params;
  c->rows = SelectRowOps();
  c->tableEnabled = 1;
  c->dither = params.dither;
  c->alpha = params.alpha < 255 ? params.alpha : 255;
  uint32_t result = MPParseFormat(&c->dstFormat, &dst);
  if (result != KESTREL_OK) return result;
  result = MPParseFormat(&c->srcFormat, &src);
  if (result != KESTREL_OK) return result;

  c->wideRgbOut = 1;
  c->swapXY = params.transformCode & MPP_SWAP_XY;
  c->mirrorX = params.transformCode & MPP_MIRROR_X;
  c->mirrorY = params.transformCode & MPP_MIRROR_Y;
  *geometry = InitialGeometry(*c, dst, src);
  CopySteps(*geometry, c);
  c->params.brightness = ClampAdjustment(params.brightness);
  c->params.contrast = ClampAdjustment(params.contrast);
  c->params.saturation = ClampAdjustment(params.saturation);
  SetScaleFlags(c);
  result = DescribeLayouts(c);
  if (result != KESTREL_OK) return result;

  c->srcRect = SourceRect(params, src);
  c->srcReadRight = SaturateToInt32(int64_t(params.srcOriginX) + src.width);
  c->srcReadBottom = SaturateToInt32(int64_t(params.srcOriginY) + src.height);
  c->dstImageRight = SaturateToInt32(int64_t(params.dstOriginX) + dst.width);
  for (int i = 0; i < 3; ++i) {
    c->dstPlaneFactors[i] = uint32_t(c->dstLayout.step[i]);
    c->dstPlaneFactors[3 + i] = c->dstSubsample[i];
    c->dstPlaneFactors[6 + i] = c->dstSubsample[3 + i];
  }
  SetPath(c);
  c->srcLayoutBit = LayoutBit(c->srcFormat);
  c->dstLayoutBit = LayoutBit(c->dstFormat);
  const bool negative = dst.width < 0 || dst.height < 0 || src.width < 0 || src.height < 0;
  return negative ? KESTREL_BAD_ARGUMENT : KESTREL_OK;
}

// `like` is null, or the context of another pass mode.
uint32_t Decide(GeometryOf geometry, const EngineContext* like, PassEngine* e) {
  EngineContext* const c = e->context;
  SetBlockMode(c);
  ApplyAspectPolicy(c->params.aspectMode, c->blockMode, &geometry.x, &geometry.y);
  CopySteps(geometry, c);
  if (c->stepX == 0 || c->stepY == 0) return KESTREL_BAD_ARGUMENT;
  c->srcOriginX = SaturateToInt32(geometry.x.srcOrigin);
  c->srcOriginY = SaturateToInt32(geometry.y.srcOrigin);
  c->dstOriginX = SaturateToInt32(geometry.x.dstOrigin);
  c->dstOriginY = SaturateToInt32(geometry.y.dstOrigin);

  BuildConversionTables(like, c);
  SettleUnitScale(c);
  OrientDestination(c);
  c->dstRect.left = Covered(c->srcRect.left, c->srcOriginX, c->stepX, c->dstOriginX);
  c->dstRect.top = Covered(c->srcRect.top, c->srcOriginY, c->stepY, c->dstOriginY);
  c->dstRect.right =
      SaturateToInt32(1 + int64_t(Covered(SaturateToInt32(int64_t(c->srcRect.right) - 1),
                                          c->srcOriginX, c->stepX, c->dstOriginX)));
  c->dstRect.bottom =
      SaturateToInt32(1 + int64_t(Covered(SaturateToInt32(int64_t(c->srcRect.bottom) - 1),
                                          c->srcOriginY, c->stepY, c->dstOriginY)));
  if (c->bilinear != 0) {
    c->xEnlarge = c->stepX < 0x10000;
    c->yEnlarge = c->stepY < 0x10000;
  }
  FillPassEngine(geometry, e);
  return KESTREL_OK;
}

// RGBX and BGRX are built as XRGB and XBGR: their spare byte is in the high byte in practice.
uint32_t BuiltAs(uint32_t format) {
  switch (format) {
    case FORMAT_BGRX8888:
      return FORMAT_XBGR8888;
    case FORMAT_RGBX8888:
      return FORMAT_XRGB8888;
    default:
      return format;
  }
}

void FreePass(PassEngine* engine) {
  if (engine == nullptr) return;
  if (engine->context->table != nullptr) MMemFree(nullptr, engine->context->table);
  MMemFree(nullptr, engine->context);
  MMemFree(nullptr, engine);
}

PassEngine* AllocatePass() {
  PassEngine* engine = AllocateZeroed<PassEngine>();
  if (engine == nullptr) return nullptr;
  engine->context = AllocateZeroed<EngineContext>();
  if (engine->context != nullptr) return engine;
  MMemFree(nullptr, engine);
  return nullptr;
}

// Builds `count` passes: one of the pass mode given, or those of pass modes 1, 2 and so on. On
// failure passes[] has those that are to be freed.
uint32_t BuildPasses(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params,
                     PassEngine** passes, uint32_t count) {
  if (dst.width == 0 || dst.height == 0 || src.width == 0 || src.height == 0) {
    return KESTREL_BAD_ARGUMENT;
  }
  EngineContext described;
  GeometryOf geometry;
  for (uint32_t i = 0; i < count; ++i) {
    passes[i] = AllocatePass();
    if (passes[i] == nullptr) return KESTREL_OUT_OF_MEMORY;
    EngineContext* const c = passes[i]->context;
    if (i == 0) {
      const uint32_t result = Describe(dst, src, params, &geometry, c);
      if (result != KESTREL_OK) return result;
      described = *c;
    } else {
      *c = described;
    }
    if (count > 1) c->params.passMode = i + 1;
    const uint32_t result = Decide(geometry, i > 0 ? passes[0]->context : nullptr, passes[i]);
    if (result != KESTREL_OK) return result;
  }
  return KESTREL_OK;
}

}  // namespace
}  // namespace kestrel

using namespace kestrel;

extern "C" {

uint32_t MPPBuildEngine(const MPPFORMAT* dstFormat, const MPPFORMAT* srcFormat,
                        const MPPPARAM* params, PassEngine** outEngine) {
  if (dstFormat == nullptr || srcFormat == nullptr || params == nullptr || outEngine == nullptr) {
    return KESTREL_BAD_ARGUMENT;
  }
  PassEngine* engine = nullptr;
  const uint32_t result = BuildPasses(*dstFormat, *srcFormat, *params, &engine, 1);
  if (result == KESTREL_OK) {
    *outEngine = engine;
  } else {
    FreePass(engine);
  }
  return result;
}

uint32_t MPPCreate(MPPFORMAT* dstFormat, MPPFORMAT* srcFormat, MPPPARAM* params,
                   MPPHandle** outHandle) {
  if (outHandle == nullptr) return KESTREL_BAD_ARGUMENT;
  *outHandle = nullptr;
  if (dstFormat == nullptr || srcFormat == nullptr || params == nullptr) {
    return KESTREL_BAD_ARGUMENT;
  }
  MPPHandle* handle = AllocateZeroed<MPPHandle>();
  if (handle == nullptr) {
    // Callers recognise this failure by their cleared records.
    dstFormat->format = 0;
    srcFormat->format = 0;
    params->dither = 0;
    return KESTREL_OUT_OF_MEMORY;
  }
  handle->passMode = params->passMode;
  const uint32_t dstCode = dstFormat->format;
  const uint32_t srcCode = srcFormat->format;
  const uint32_t dither = params->dither;
  dstFormat->format = BuiltAs(dstCode);
  srcFormat->format = BuiltAs(srcCode);
  if ((dstFormat->format & 0xFF000000u) != 0x15000000u) params->dither = 0;

  const uint32_t count = params->passMode == MPP_PASS_TILED ? 3 : 1;
  const uint32_t result = BuildPasses(*dstFormat, *srcFormat, *params, handle->pass, count);
  dstFormat->format = dstCode;
  srcFormat->format = srcCode;
  params->dither = dither;
  if (result != KESTREL_OK) {
    MPPDestroy(handle);
    return result;
  }
  *outHandle = handle;
  return KESTREL_OK;
}

uint32_t MPPDestroy(MPPHandle* handle) {
  if (handle == nullptr) return KESTREL_OK;
  for (PassEngine* engine : handle->pass) FreePass(engine);
  MMemFree(nullptr, handle);
  return KESTREL_OK;
}

const void* PostProcessGetVersionInfo(void) {
  return nullptr;
}

}  // extern "C"
