#include "engine/postprocess.h"

namespace {

// Sums wrap instead of overflowing: rectangles come from callers.
int32_t Reflect(int32_t low, int32_t high, int32_t position) {
  return int32_t(uint32_t(low) + uint32_t(high) - uint32_t(position));
}

}  // namespace

extern "C" {

void RectCopy(MRECT* dst, const MRECT* src) {
  if (dst != nullptr && src != nullptr) *dst = *src;
}

void MSwapRect(MRECT* rect) {
  if (rect != nullptr) *rect = {rect->top, rect->left, rect->bottom, rect->right};
}

void FlipUpDownRect(const MRECT* frame, MRECT* rect) {
  if (frame == nullptr || rect == nullptr) return;
  const int32_t top = Reflect(frame->top, frame->bottom, rect->bottom);
  rect->bottom = Reflect(frame->top, frame->bottom, rect->top);
  rect->top = top;
}

void MFlipLeftRightRect(const MRECT* frame, MRECT* rect) {
  if (frame == nullptr || rect == nullptr) return;
  const int32_t left = Reflect(frame->left, frame->right, rect->right);
  rect->right = Reflect(frame->left, frame->right, rect->left);
  rect->left = left;
}

}  // extern "C"
