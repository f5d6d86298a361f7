#include "kernels/pipeline/arranged_samples.h"

namespace kestrel {
namespace {

// Samples of chroma for n pixels, and rows of it for some rows.
int SamplesOf(const PixelChroma& chroma, int n) {
  return ((n - 1 + chroma.phase) >> chroma.rows.shift) + 1;
}
int RowsOf(const ChromaRows& chroma, int rows) {
  return ((rows - 1) >> chroma.rowShift) + 1;
}

// The planes that chroma is in: U and V, or one of pairs, which is named by what it begins with.
struct ChromaPlanes {
  explicit ChromaPlanes(const ChromaRows& chroma)
      : count(chroma.step == 2 ? 1 : 2),
        unit(chroma.step),
        start{chroma.step == 2 && chroma.v < chroma.u ? chroma.v : chroma.u, chroma.v},
        pitch{chroma.uPitch, chroma.vPitch} {}
  int count, unit;
  const uint8_t* start[2];
  ptrdiff_t pitch[2];
};

// The same in new memory, with planes `apart` bytes from each other.
ChromaRows Moved(const ChromaRows& chroma, const uint8_t* start, ptrdiff_t apart) {
  const bool pairs = chroma.step == 2;
  ChromaRows moved = chroma;
  moved.u = start + (pairs && chroma.v < chroma.u ? 1 : 0);
  moved.v = start + (!pairs ? apart : chroma.u < chroma.v ? 1 : 0);
  return moved;
}

}  // namespace

void ArrangedSamples::BeginTurned(int n, int most, bool backwards) {
  n_ = n;
  most_ = most;
  backwards_ = backwards;
  count_ = 0;
}

void ArrangedSamples::Append(const SampleRows& in) {
  chroma_ = in.chroma;
  const auto turn = [this](uint8_t* block, int most, int done, const uint8_t* samples,
                           ptrdiff_t pitch, int unit, int rows, int columns) {
    const int at = backwards_ ? most - done - rows : done;
    const uint8_t* const first = backwards_ ? samples + (rows - 1) * pitch : samples;
    rows_.transpose(block + ptrdiff_t{at} * unit, ptrdiff_t{most} * unit, first,
                    backwards_ ? -pitch : pitch, unit, rows, columns);
  };
  turn(memory_, most_, count_, in.y, in.yPitch, 1, in.rows, n_);
  const ChromaPlanes planes(chroma_.rows);
  const int samples = SamplesOf(chroma_, n_);
  uint8_t* block = memory_ + ptrdiff_t{n_} * most_;
  for (int i = 0; i < planes.count; ++i) {
    turn(block, chromaMost(), count_ >> chroma_.rows.rowShift, planes.start[i], planes.pitch[i],
         planes.unit, RowsOf(chroma_.rows, in.rows), samples);
    block += ptrdiff_t{samples} * chromaMost();
  }
  count_ += in.rows;
}

SampleRows ArrangedSamples::turned() const {
  const int samples = SamplesOf(chroma_, n_);
  const int step = chroma_.rows.step;
  const ptrdiff_t pitch = ptrdiff_t{chromaMost()} * step;
  const int first = backwards_ ? chromaMost() - RowsOf(chroma_.rows, count_) : 0;
  const uint8_t* const block = memory_ + ptrdiff_t{n_} * most_ + ptrdiff_t{first} * step;
  ChromaRows chroma = Moved(chroma_.rows, block, samples * pitch);
  chroma.shift = chroma_.rows.rowShift;
  chroma.rowShift = chroma_.rows.shift;
  chroma.uPitch = chroma.vPitch = pitch;
  return {memory_ + (backwards_ ? most_ - count_ : 0), most_, n_, {chroma, 0, chroma_.phase}};
}

SampleRows ArrangedSamples::Mirror(const SampleRows& in, int n) {
  const auto mirror = [this](uint8_t* to, const uint8_t* from, ptrdiff_t pitch, int unit, int rows,
                             int count) {
    const ptrdiff_t size = ptrdiff_t{count} * unit;
    for (int i = 0; i < rows; ++i) {
      rows_.writePixels(to + i * size + size - unit, -unit, from + i * pitch, unit, count);
    }
  };
  mirror(memory_, in.y, in.yPitch, 1, in.rows, n);
  const ChromaPlanes planes(in.chroma.rows);
  const int samples = SamplesOf(in.chroma, n);
  const int rows = RowsOf(in.chroma.rows, in.rows);
  uint8_t* const block = memory_ + ptrdiff_t{in.rows} * n;
  for (int i = 0; i < planes.count; ++i) {
    mirror(block + ptrdiff_t{i} * rows * samples, planes.start[i], planes.pitch[i], planes.unit,
           rows, samples);
  }
  ChromaRows chroma = Moved(in.chroma.rows, block, ptrdiff_t{rows} * samples);
  chroma.uPitch = chroma.vPitch = ptrdiff_t{samples} * planes.unit;
  return {memory_, n, in.rows, {chroma, (n + in.chroma.phase) & chroma.shift, 0}};
}

}  // namespace kestrel
