// Pictures of every public format for the benchmarks, laid out as their callers would: rows and
// planes without padding, the first byte aligned.
#ifndef KESTREL_BENCHMARKS_COMMON_PICTURE_H
#define KESTREL_BENCHMARKS_COMMON_PICTURE_H

#include <cstddef>
#include <cstdint>
#include <memory>

#include "engine/postprocess.h"

namespace bench {

struct Size {
  int32_t width, height;

  Size Turned() const { return {height, width}; }
  int64_t Pixels() const { return int64_t(width) * height; }
};

inline bool operator==(Size a, Size b) {
  return a.width == b.width && a.height == b.height;
}

// A run of rows in memory: a plane, or the pairs of a semi-planar picture.
struct Block {
  uint8_t* start;
  int32_t pitch;
  int32_t rowBytes;
  int32_t rows;
};

struct Picture {
  Picture() = default;
  Picture(uint32_t publicFormat, Size pixels);

  // A part of this picture, in the same memory. The origin lies on a whole chroma sample.
  Picture Part(int32_t x, int32_t y, Size part) const;

  bool IsRgb() const { return desc.code == CODE_RGB; }
  bool IsSemiPlanar() const { return blockCount == 2; }
  // The planes follow each other without a gap, as some libraries require.
  bool IsContiguous() const;
  size_t ByteCount() const;

  // Component 0 Y, 1 U, 2 V; not for layouts with exchanged lumas.
  uint8_t* Sample(int component, int32_t column, int32_t row) const;
  // Samples of a component.
  Size SizeOf(int component) const;

  uint32_t format = 0;
  Size size = {0, 0};
  // As engines take them: slots Y or RGB, U, V, also for semi-planar pictures.
  uint8_t* plane[3] = {};
  int32_t pitch[3] = {};
  Block block[3] = {};
  int32_t blockCount = 0;

  FormatDesc desc = {};
  PlaneLayout layout = {};
  uint32_t factors[6] = {};  // horizontal Y U V, vertical Y U V

 private:
  std::shared_ptr<uint8_t> memory_;
};

}  // namespace bench

#endif
