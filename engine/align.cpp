// MPPAlign: which source pixels a destination rectangle needs, and the other way round.
#include "engine/engine_internal.h"

namespace kestrel {
namespace {

bool IsZero(const MRECT& rect) {
  return rect.left == 0 && rect.top == 0 && rect.right == 0 && rect.bottom == 0;
}

void Move(MRECT* rect, int64_t x, int64_t y) {
  rect->left = SaturateToInt32(rect->left + x);
  rect->top = SaturateToInt32(rect->top + y);
  rect->right = SaturateToInt32(rect->right + x);
  rect->bottom = SaturateToInt32(rect->bottom + y);
}

// Mirrors happen inside the absolute region although the rectangle is relative to it by then:
// planners that work with regions away from the origin are written for it.
void Transform(uint32_t code, const MRECT& region, MRECT* rect) {
  if ((code & MPP_MIRROR_Y) != 0) FlipUpDownRect(&region, rect);
  if ((code & MPP_MIRROR_X) != 0) MFlipLeftRightRect(&region, rect);
  if ((code & MPP_SWAP_XY) != 0) MSwapRect(rect);
}

void UndoTransform(uint32_t code, const MRECT& region, MRECT* rect) {
  if ((code & MPP_SWAP_XY) != 0) MSwapRect(rect);
  if ((code & MPP_MIRROR_Y) != 0) FlipUpDownRect(&region, rect);
  if ((code & MPP_MIRROR_X) != 0) MFlipLeftRightRect(&region, rect);
}

MRECT SourceOf(const PassEngine& e, const MRECT& dst) {
  const bool bilinear = (e.resampleMode & MPP_BILINEAR) != 0;
  const int64_t offsetX = bilinear ? int64_t(e.stepX >> 1) - 32768 : 0;
  const int64_t offsetY = bilinear ? int64_t(e.stepY >> 1) - 32768 : 0;
  const int64_t extra = bilinear ? 3 : 1;
  // A pixel of 31 bits and sign times a step of 32 bits just fits 64.
  const auto position = [](int64_t pixel, uint32_t step, int64_t offset) {
    return (SaturateToInt32(pixel) * int64_t(step) + offset) >> 16;
  };
  const auto clamp = [](int64_t value) { return SaturateToInt32(value < 0 ? 0 : value); };
  MRECT src = {clamp(position(dst.left, e.stepX, offsetX)),
               clamp(position(dst.top, e.stepY, offsetY)),
               clamp(position(int64_t(dst.right) - 1, e.stepX, offsetX) + extra),
               clamp(position(int64_t(dst.bottom) - 1, e.stepY, offsetY) + extra)};
  if (src.top < e.srcRect.top) src.top = e.srcRect.top;
  if (src.left < e.srcRect.left) src.left = e.srcRect.left;
  if (src.right > e.srcRect.right) src.right = e.srcRect.right;
  if (src.bottom > e.srcRect.bottom) src.bottom = e.srcRect.bottom;
  return src;
}

// First destination pixel at or after a source position.
int64_t FirstPixel(int64_t source, uint32_t step, int64_t offset) {
  const int64_t numerator = source * 65536 + offset;
  return (numerator < 0 ? 0 : numerator) / int64_t(step);
}

// One past the destination pixel of the last source pixel. One less is taken of the source edge
// except at the full size, so that the last destination pixel of a picture is always covered.
int64_t PastLastPixel(int32_t edge, int32_t fullSize, uint32_t step, int64_t offset,
                      int32_t limit) {
  const int64_t last = int64_t(edge) - (edge == fullSize ? 0 : 1);
  const int64_t past = FirstPixel(last, step, offset) + 1;
  return past > limit ? limit : past;
}

MRECT DestinationOf(const PassEngine& e, uint32_t code, const MRECT& src) {
  const bool swap = (code & MPP_SWAP_XY) != 0;
  const bool bilinear = (e.resampleMode & MPP_BILINEAR) != 0;
  const uint32_t stepX = swap ? e.stepY : e.stepX;
  const uint32_t stepY = swap ? e.stepX : e.stepY;
  const int32_t width = swap ? e.srcRegionHeight : e.srcRegionWidth;
  const int32_t height = swap ? e.srcRegionWidth : e.srcRegionHeight;
  const int64_t offsetX = bilinear ? 32768 - int64_t(stepX >> 1) : 0;
  const int64_t offsetY = bilinear ? 32768 - int64_t(stepY >> 1) : 0;
  return {SaturateToInt32(FirstPixel(src.left, stepX, offsetX)),
          SaturateToInt32(FirstPixel(src.top, stepY, offsetY)),
          SaturateToInt32(PastLastPixel(src.right, width, stepX, offsetX, e.dstRegionWidth)),
          SaturateToInt32(PastLastPixel(src.bottom, height, stepY, offsetY, e.dstRegionHeight))};
}

// Seen from the source, a quarter turn goes the other way round.
uint32_t InverseTransform(uint32_t code) {
  switch (code) {
    case MPP_SWAP_XY | MPP_MIRROR_Y:
      return MPP_SWAP_XY | MPP_MIRROR_X;
    case MPP_SWAP_XY | MPP_MIRROR_X:
      return MPP_SWAP_XY | MPP_MIRROR_Y;
    default:
      return code;
  }
}

MRECT Region(int32_t x, int32_t y, int32_t width, int32_t height) {
  return {x, y, SaturateToInt32(int64_t(x) + width), SaturateToInt32(int64_t(y) + height)};
}

}  // namespace
}  // namespace kestrel

using namespace kestrel;

extern "C" uint32_t MPPAlign(MPPHandle* handle, MRECT* dstRect, MRECT* srcRect) {
  if (handle == nullptr || dstRect == nullptr || srcRect == nullptr) return KESTREL_BAD_ARGUMENT;
  const PassEngine& e = *handle->pass[0];
  if (IsZero(*srcRect)) {
    const MRECT region = Region(e.dstOriginX, e.dstOriginY, e.dstRegionWidth, e.dstRegionHeight);
    Move(dstRect, -int64_t(e.dstOriginX), -int64_t(e.dstOriginY));
    Transform(e.transformCode, region, dstRect);
    *srcRect = SourceOf(e, *dstRect);
    UndoTransform(e.transformCode, region, dstRect);
  } else if (IsZero(*dstRect)) {
    const uint32_t code = InverseTransform(e.transformCode);
    const MRECT region = Region(e.srcOriginX, e.srcOriginY, e.srcRegionWidth, e.srcRegionHeight);
    Move(srcRect, -int64_t(e.srcOriginX), -int64_t(e.srcOriginY));
    Transform(code, region, srcRect);
    *dstRect = DestinationOf(e, code, *srcRect);
    UndoTransform(code, region, srcRect);
  } else {
    return KESTREL_BAD_ARGUMENT;
  }
  Move(srcRect, e.srcOriginX, e.srcOriginY);
  Move(dstRect, e.dstOriginX, e.dstOriginY);
  return KESTREL_OK;
}
