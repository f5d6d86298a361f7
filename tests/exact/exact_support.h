// What the exact tests share: engines that free themselves, images in memory, readable failures.
#ifndef KESTREL_TESTS_EXACT_EXACT_SUPPORT_H
#define KESTREL_TESTS_EXACT_EXACT_SUPPORT_H

#include <gtest/gtest.h>

#include <cstdint>
#include <ostream>
#include <vector>

#include "engine/engine_internal.h"
#include "engine/postprocess.h"

inline bool operator==(const MRECT& a, const MRECT& b) {
  return a.left == b.left && a.top == b.top && a.right == b.right && a.bottom == b.bottom;
}

inline void PrintTo(const MRECT& rect, std::ostream* out) {
  *out << "(" << rect.left << ", " << rect.top << ", " << rect.right << ", " << rect.bottom << ")";
}

namespace kestrel::test {

using Bytes = std::vector<uint8_t>;

// A parameter record, zero but for what is chained on.
struct Param : MPPPARAM {
  Param() : MPPPARAM{} { passMode = 1; }
  Param& Bilinear() { return resampleFlags = MPP_BILINEAR, *this; }
  Param& Transform(uint32_t code) { return transformCode = code, *this; }
  Param& Band(uint32_t selector) { return bandSelector = selector, *this; }
  Param& Pass(uint32_t mode) { return passMode = mode, *this; }
  Param& Tiled() { return Pass(MPP_PASS_TILED); }
  Param& Aspect(uint32_t mode) { return aspectMode = mode, *this; }
  Param& Dither() { return dither = 1, *this; }
  Param& Alpha(uint32_t value) { return alpha = value, *this; }
  Param& Adjust(int32_t newBrightness, int32_t newContrast, int32_t newSaturation) {
    return brightness = newBrightness, contrast = newContrast, saturation = newSaturation, *this;
  }
  Param& SrcOrigin(int32_t x, int32_t y) { return srcOriginX = x, srcOriginY = y, *this; }
  Param& DstOrigin(int32_t x, int32_t y) { return dstOriginX = x, dstOriginY = y, *this; }
  Param& SrcRect(int32_t left, int32_t top, int32_t right, int32_t bottom) {
    return srcRect = {left, top, right, bottom}, *this;
  }
};

// One side of an engine.
struct Side {
  uint32_t code;
  int32_t width;
  int32_t height;
  const uint8_t* palette = nullptr;
};

// An engine that frees itself.
class Engine {
 public:
  Engine(const Side& dst, const Side& src, const MPPPARAM& param = Param()) {
    MPPFORMAT dstFormat = {dst.code, dst.width, dst.height, dst.palette};
    MPPFORMAT srcFormat = {src.code, src.width, src.height, src.palette};
    MPPPARAM ownParam = param;
    result_ = MPPCreate(&dstFormat, &srcFormat, &ownParam, &handle_);
  }
  Engine(const Engine&) = delete;
  Engine& operator=(const Engine&) = delete;
  ~Engine() { MPPDestroy(handle_); }

  uint32_t result() const { return result_; }
  MPPHandle* handle() const { return handle_; }
  PassEngine& pass(int index = 0) const { return *handle_->pass[index]; }
  EngineContext& context(int index = 0) const { return *pass(index).context; }

 private:
  uint32_t result_;
  MPPHandle* handle_ = nullptr;
};

// The planes of one image as the calls take them.
struct Planes {
  uint8_t* plane[3];
  int32_t pitch[3];
};

inline Planes OnePlane(Bytes& bytes, int32_t pitch) {
  return {{bytes.data(), nullptr, nullptr}, {pitch, 0, 0}};
}

inline Planes ThreePlanes(Bytes& first, int32_t firstPitch, Bytes& second, Bytes& third,
                          int32_t chromaPitch) {
  return {{first.data(), second.data(), third.data()}, {firstPitch, chromaPitch, chromaPitch}};
}

// A luma plane and a plane of chroma pairs; the first chroma sample of a pair is V or U.
inline Planes VFirst(Bytes& luma, int32_t lumaPitch, Bytes& chroma, int32_t chromaPitch) {
  return {{luma.data(), chroma.data() + 1, chroma.data()}, {lumaPitch, chromaPitch, chromaPitch}};
}
inline Planes UFirst(Bytes& luma, int32_t lumaPitch, Bytes& chroma, int32_t chromaPitch) {
  return {{luma.data(), chroma.data(), chroma.data() + 1}, {lumaPitch, chromaPitch, chromaPitch}};
}

inline uint32_t Process(const Engine& engine, const Planes& dst, const Planes& src,
                        const MRECT* rect = nullptr) {
  return MPProcess(engine.handle(), dst.plane, rect, dst.pitch, src.plane, src.pitch);
}

}  // namespace kestrel::test

#endif
