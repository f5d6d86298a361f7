// Running an engine: tiling, bands, binding of planes and mapping of rectangles.
#include <stddef.h>

#include "engine/engine_internal.h"

namespace kestrel {
namespace {

MRECT WholeRegion(const PassEngine& engine) {
  return {engine.dstRegionX, engine.dstRegionY,
          SaturateToInt32(int64_t(engine.dstRegionX) + engine.dstRegionWidth),
          SaturateToInt32(int64_t(engine.dstRegionY) + engine.dstRegionHeight)};
}

// Left and top are raised to the region. Right and bottom are limited by the region's size measured
// from there, not by its edge: callers pass rectangles of images larger than the region.
MRECT ClipToRegion(const PassEngine& engine, const MRECT& rect) {
  MRECT clipped = rect;
  if (clipped.left < engine.dstRegionX) clipped.left = engine.dstRegionX;
  if (clipped.top < engine.dstRegionY) clipped.top = engine.dstRegionY;
  const int32_t right = SaturateToInt32(int64_t(clipped.left) + engine.dstRegionWidth);
  const int32_t bottom = SaturateToInt32(int64_t(clipped.top) + engine.dstRegionHeight);
  if (clipped.right > right) clipped.right = right;
  if (clipped.bottom > bottom) clipped.bottom = bottom;
  return clipped;
}

bool IsEmpty(const MRECT& rect) {
  return rect.left >= rect.right || rect.top >= rect.bottom;
}

// Whether rows 0..lastRow of every bound plane can be addressed. A pitch that would need 2 GiB
// cannot be true, and INT32_MIN has no opposite for mirrored jobs.
bool CanAddress(const PlaneLayout& binding, int64_t lastRow) {
  for (const int64_t pitch : binding.pitch) {  // all the same where there is one plane
    const int64_t magnitude = pitch < 0 ? -pitch : pitch;
    // At least one byte of the last row belongs to the plane as well.
    if (magnitude > INT32_MAX || magnitude * lastRow >= kMaxPlaneSpan) return false;
  }
  return true;
}

bool IsWithinLimits(const PassEngine& engine, const MRECT& rect) {
  const EngineContext& c = *engine.context;
  if (rect.left < -kMaxCoordinate || rect.top < -kMaxCoordinate || rect.right > kMaxCoordinate ||
      rect.bottom > kMaxCoordinate || c.srcReadRight > kMaxCoordinate ||
      c.srcReadBottom > kMaxCoordinate) {
    return false;
  }
  return CanAddress(engine.dstLayout, int64_t(rect.bottom) - 1) &&
         CanAddress(engine.srcLayout, int64_t(c.srcReadBottom) - 1);
}

// Factors are nearly always 1 or 2, and a small job would notice the divisions.
int64_t SampleOf(uint32_t pixel, uint32_t factor) {
  return factor == 1 ? pixel : factor == 2 ? pixel >> 1 : pixel / factor;
}

// The pixel that a walk starts from.
int32_t StartColumn(const PassEngine& engine, const MRECT& rect) {
  return engine.mirrorX != 0 ? rect.right - 1 : rect.left;
}
int32_t StartRow(const PassEngine& engine, const MRECT& rect) {
  return engine.mirrorY != 0 ? rect.bottom - 1 : rect.top;
}

void DispatchBand(const PassEngine& engine, const MRECT& band) {
  // No plane has a sample there to start from.
  if (StartColumn(engine, band) < 0 || StartRow(engine, band) < 0) return;
  MRECT rect = band;
  int32_t pitches[3] = {engine.dstLayout.pitch[0], engine.dstLayout.pitch[1],
                        engine.dstLayout.pitch[2]};
  uint8_t* starts[3] = {nullptr, nullptr, nullptr};
  MPMapDstRect(&engine, pitches, &rect, starts);
  if (engine.swapXY != 0) MSwapRect(&rect);
  ANY_ANY_Bilinear_No_Table(&rect, pitches, engine.srcLayout.pitch, starts, engine.srcLayout.plane,
                            engine.context);
}

// Quarter turns are cut into bands, which show where remainders are carried, where chroma shares
// samples across a border, and in what begins anew with every odd row. Pixels that carry nothing,
// and YUV whose bands begin and end with a block of chroma, show none of that: they may come as one
// piece, whose kernel knows best how to walk it.
bool BandsShow(const PassEngine& engine, const MRECT& rect) {
  const EngineContext& c = *engine.context;
  const bool evenRows = (int64_t(rect.bottom) - rect.top) % 2 == 0;
  if (!evenRows || rect.left < 0 || rect.top < 0) return true;
  if (c.dstFormat.code != CODE_RGB) {
    // (Upside down an odd number of rows begins within a block.)
    const bool inPhase = c.mirrorY == 0 || (int64_t(c.dstRegion.top) + c.dstRegion.bottom) % 2 == 0;
    return rect.top % 2 != 0 || !inPhase || c.dstSubsample[1] > 2 || c.dstSubsample[4] > 2;
  }
  const uint32_t* bits = c.dstChannelSize;
  const bool wholeBytes = bits[0] == 8 && bits[1] == 8 && bits[2] == 8;
  // At the same size some kernels for YUV always carry.
  const bool mayCarry =
      c.pathKind == PATH_YUV_TO_RGB && c.stepX == 0x10000 && c.stepY == 0x10000 && !wholeBytes;
  return c.dither != 0 || mayCarry;
}

template <int kGrid>
int32_t RoundUpTowardZero(int32_t value) {
  return SaturateToInt32((int64_t(value) + kGrid - 1) / kGrid * kGrid);
}

template <int kGrid>
int32_t RoundDownTowardZero(int32_t value) {
  return value / kGrid * kGrid;
}

// The part of a rectangle that lies on a grid.
template <int kColumns, int kRows>
MRECT InnerBlock(const MRECT& outer) {
  return {RoundUpTowardZero<kColumns>(outer.left), RoundUpTowardZero<kRows>(outer.top),
          RoundDownTowardZero<kColumns>(outer.right), RoundDownTowardZero<kRows>(outer.bottom)};
}

struct PlaneArrays {
  uint8_t* const* dstPlanes;
  const int32_t* dstPitches;
  const uint8_t* const* srcPlanes;
  const int32_t* srcPitches;

  bool IsComplete() const {
    return dstPlanes != nullptr && dstPitches != nullptr && srcPlanes != nullptr &&
           srcPitches != nullptr;
  }
  // Only the first plane of each side is looked at: chroma kernels cope with any address.
  bool AreWordAligned() const {
    return dstPitches[0] % 4 == 0 && srcPitches[0] % 4 == 0 &&
           reinterpret_cast<uintptr_t>(dstPlanes[0]) % 4 == 0 &&
           reinterpret_cast<uintptr_t>(srcPlanes[0]) % 4 == 0;
  }
  void Run(PassEngine* engine, const MRECT* rect) const {
    MPProcessRect(engine, dstPlanes, rect, dstPitches, srcPlanes, srcPitches);
  }
};

// The inner block of a tiled run goes to a block kernel's engine, the strips around it to the pass
// 1 engine, which takes any rectangle.
void RunTiled(const MPPHandle& handle, const MRECT& outer, const PlaneArrays& arrays) {
  if (IsEmpty(outer)) return;
  PassEngine* const ragged = handle.pass[0];
  const PassEngine& blocks = *handle.pass[2];
  const bool mirrorKeepsGrid = (blocks.mirrorX == 0 && blocks.mirrorY == 0) ||
                               (blocks.dstRegionWidth % 4 == 0 && blocks.dstRegionHeight % 4 == 0);
  const bool wide = arrays.AreWordAligned() && mirrorKeepsGrid;
  MRECT inner = wide ? InnerBlock<16, 8>(outer) : InnerBlock<2, 2>(outer);

  const bool collapsed = inner.left > inner.right || inner.top > inner.bottom;
  if (inner.left > inner.right) inner.left = inner.right;
  if (inner.top > inner.bottom) inner.top = inner.bottom;
  if (!collapsed && !IsEmpty(inner)) arrays.Run(handle.pass[wide ? 2 : 1], &inner);

  const struct {
    bool differs;
    MRECT rect;
  } strips[] = {
      {inner.top != outer.top, {outer.left, outer.top, outer.right, inner.top}},
      {inner.bottom != outer.bottom, {outer.left, inner.bottom, outer.right, outer.bottom}},
      {inner.left != outer.left, {outer.left, inner.top, inner.left, inner.bottom}},
      {inner.right != outer.right, {inner.right, inner.top, outer.right, inner.bottom}},
  };
  for (const auto& strip : strips) {
    if (!strip.differs) continue;
    MRECT rect = strip.rect;
    MClampRect(&rect, &outer);
    if (!IsEmpty(rect)) arrays.Run(ragged, &rect);
  }
}

void ClampEdge(int32_t* edge, int32_t low, int32_t high) {
  if (*edge < low) {
    *edge = low;
  } else if (*edge > high) {
    *edge = high;
  }
}

}  // namespace
}  // namespace kestrel

using namespace kestrel;

extern "C" {

void MClampRect(MRECT* rect, const MRECT* bounds) {
  ClampEdge(&rect->left, bounds->left, bounds->right);
  ClampEdge(&rect->right, bounds->left, bounds->right);
  ClampEdge(&rect->top, bounds->top, bounds->bottom);
  ClampEdge(&rect->bottom, bounds->top, bounds->bottom);
}

void MPBindPlanes(PlaneLayout* binding, const uint8_t* const* planes, const int32_t* pitches) {
  if (binding->planeCount == 3) {
    const bool vFirst = binding->code >= CODE_YV_ANY && binding->code <= CODE_YV24;
    for (int i = 0; i < 3; ++i) {
      const int slot = vFirst && i > 0 ? 3 - i : i;
      binding->pitch[i] = pitches[i];
      binding->plane[i] = const_cast<uint8_t*>(planes[slot]);
    }
  } else if (binding->planeCount == 1) {
    const uint32_t offsets[3] = {binding->yOffset, binding->uOffset, binding->vOffset};
    for (int i = 0; i < 3; ++i) {
      binding->pitch[i] = pitches[0];
      binding->plane[i] =
          planes[0] == nullptr ? nullptr : const_cast<uint8_t*>(planes[0]) + offsets[i];
    }
  }
}

void MPMapDstRect(const PassEngine* engine, int32_t* dstPitches, MRECT* rect,
                  uint8_t** dstPlaneStarts) {
  const PlaneLayout& binding = engine->dstLayout;
  const uint32_t* factors = engine->dstPlaneFactors;
  const uint32_t x = uint32_t(StartColumn(*engine, *rect));
  const uint32_t y = uint32_t(StartRow(*engine, *rect));
  for (int i = 0; i < 3 && binding.plane[i] != nullptr; ++i) {
    const int64_t column = SampleOf(x, factors[3 + i]);
    const int64_t row = SampleOf(y, factors[6 + i]);
    const int64_t offset = dstPitches[i] * row + int64_t(factors[i]) * column;
    dstPlaneStarts[i] = binding.plane[i] + ptrdiff_t(offset);
    if (engine->mirrorY != 0) dstPitches[i] = -dstPitches[i];
  }
  const MRECT region = WholeRegion(*engine);
  if (engine->mirrorY != 0) FlipUpDownRect(&region, rect);
  if (engine->mirrorX != 0) MFlipLeftRightRect(&region, rect);
}

uint32_t MPProcessRect(PassEngine* engine, uint8_t* const* dstPlanes, const MRECT* dstRect,
                       const int32_t* dstPitches, const uint8_t* const* srcPlanes,
                       const int32_t* srcPitches) {
  if (engine == nullptr || dstPlanes == nullptr || dstPitches == nullptr || srcPlanes == nullptr ||
      srcPitches == nullptr) {
    return KESTREL_BAD_ARGUMENT;
  }
  const MRECT rect = dstRect == nullptr ? WholeRegion(*engine) : ClipToRegion(*engine, *dstRect);
  MPBindPlanes(&engine->srcLayout, srcPlanes, srcPitches);
  MPBindPlanes(&engine->dstLayout, dstPlanes, dstPitches);
  if (!IsWithinLimits(*engine, rect)) return KESTREL_BAD_ARGUMENT;
  // A crop rounded to blocks can leave nothing of a small source.
  const bool nothingToRead = engine->srcRegionWidth <= 0 || engine->srcRegionHeight <= 0;
  if (IsEmpty(rect) || nothingToRead) return KESTREL_OK;

  // The last dispatched bottom starts at 0, not at the rectangle's top: a rectangle that ends at or
  // above row 0 draws nothing.
  int32_t done = 0;
  int32_t top = rect.top;
  if (engine->swapXY != 0 && BandsShow(*engine, rect)) {
    const int32_t band = engine->bandSelector == 4 ? 64 : 32;
    for (; int64_t(rect.bottom) - top > band; top += band) {
      done = top + band;
      DispatchBand(*engine, {rect.left, top, rect.right, done});
    }
  }
  if (done < rect.bottom) DispatchBand(*engine, {rect.left, top, rect.right, rect.bottom});
  return KESTREL_OK;
}

uint32_t MPProcess(MPPHandle* handle, uint8_t* const* dstPlanes, const MRECT* dstRect,
                   const int32_t* dstPitches, const uint8_t* const* srcPlanes,
                   const int32_t* srcPitches) {
  const PlaneArrays arrays = {dstPlanes, dstPitches, srcPlanes, srcPitches};
  if (handle == nullptr || !arrays.IsComplete() || dstPlanes[0] == nullptr ||
      srcPlanes[0] == nullptr) {
    return KESTREL_BAD_ARGUMENT;
  }
  if (handle->passMode == MPP_PASS_TILED) {
    RunTiled(*handle, dstRect != nullptr ? *dstRect : WholeRegion(*handle->pass[0]), arrays);
  } else {
    arrays.Run(handle->pass[0], dstRect);
  }
  return KESTREL_OK;
}

uint32_t MPProcessEx(MPPHandle* handle, uint8_t* const* dstPlanes, const MRECT* originRect,
                     const MRECT* dstRect, const int32_t* dstPitches,
                     const uint8_t* const* srcPlanes, const int32_t* srcPitches) {
  if (handle == nullptr || originRect == nullptr || dstPlanes == nullptr || dstPitches == nullptr ||
      originRect->left < 0 || originRect->top < 0 || originRect->left > kMaxCoordinate ||
      originRect->top > kMaxCoordinate) {
    return KESTREL_BAD_ARGUMENT;
  }
  const PassEngine& engine = *handle->pass[0];
  const uint32_t* factors = engine.dstPlaneFactors;
  const uint32_t planes = engine.dstLayout.planeCount;
  const int64_t unit = engine.dstLayout.bitsPerPixel >> 3;
  uint8_t* converted[3] = {nullptr, nullptr, nullptr};
  for (uint32_t i = 0; i < 3 && i < planes; ++i) {
    const int64_t column = SampleOf(uint32_t(originRect->left), factors[3 + i]);
    const int64_t row = SampleOf(uint32_t(originRect->top), factors[6 + i]);
    const int64_t offset = dstPitches[i] * row + unit * column;
    if (dstPlanes[i] != nullptr) converted[i] = dstPlanes[i] - ptrdiff_t(offset);
  }
  return MPProcess(handle, converted, dstRect, dstPitches, srcPlanes, srcPitches);
}

}  // extern "C"
