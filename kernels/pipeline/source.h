// Reading: the pixels of one strip of a row, resampled, as one byte per channel.
#ifndef KESTREL_KERNELS_PIPELINE_SOURCE_H
#define KESTREL_KERNELS_PIPELINE_SOURCE_H

#include "kernels/pipeline/job.h"
#include "kernels/pipeline/positions.h"
#include "kernels/pipeline/strip_memory.h"

namespace kestrel {

constexpr int kCacheLine = 64;

// Where one component of each strip column lies in a source row. Computed once per strip, used for
// all its rows.
struct SampleColumns {
  int n = 0;
  ptrdiff_t step = 1;         // bytes between neighbouring samples of the row
  bool contiguous = false;    // offsets rise by exactly `step`
  int32_t* offset = nullptr;  // bytes from the start of the row
  // The bytes of a row that are asked for before it is read. A strip much narrower than the picture
  // is read in short pieces that lie far apart, which no CPU foresees; in others it is none.
  int32_t askFrom = 0, askTo = 0;
  int32_t wide = 0;          // bytes of a row that the CPU finds by itself
  PairPlan* plan = nullptr;  // unless contiguous: how they are read, if there is room for that

  void Set(int i, int64_t sample) const { offset[i] = int32_t(sample * step); }
  void Finish(int count);
  // The same for samples that `offset` has the numbers of.
  void FinishSamples(int count);
  // All of n samples, side by side from one on.
  void SetAll(int64_t sample, int count);
  void AskFor(int32_t from, int64_t to);
  void Plan(const RowOps& rows) const;
  // Pairs of each column's sample and another, with weights or null.
  void PlanWith(const int32_t* second, const uint16_t* weights, const RowOps& rows) const;
  // Of each column's pixel and another, byte by byte, but for alpha.
  void PlanPixels(const int32_t* second, const uint16_t* weights, const PixelFormat& format,
                  const RowOps& rows) const;
  // Pairs of each column's sample and the one so many bytes after it.
  void PlanApart(int32_t apart, const RowOps& rows) const;
};

// A run of channel values; points into the strip's buffers or straight into the source.
struct RgbRun {
  const uint8_t* channel[3];
  const uint8_t* alpha;  // null unless the source has an alpha byte
};

// Chroma for the pixels of a strip: pixel i has sample (i + phase) >> rows.shift, and row j has row
// (j + rowPhase) >> rows.rowShift of them.
struct PixelChroma {
  ChromaRows rows;
  int phase = 0;
  int rowPhase = 0;
};

// Rows of luma and their chroma, to become pixels.
struct SampleRows {
  const uint8_t* y;
  ptrdiff_t yPitch;
  int rows;
  PixelChroma chroma;
};

class Source {
 public:
  explicit Source(const Job& job);
  // Before anything is selected: takes the memory for strips of some columns.
  void TakeMemory(StripMemory* memory, int columns);

  // Selects loop columns [x, x + n) for Luma and Rgb.
  void SelectColumns(int32_t x, int n);
  // Selects the loop columns whose U and V are wanted, relative to x; null for the first n.
  void SelectChroma(int32_t x, const int32_t* uColumns, const int32_t* vColumns, int n);
  // The same of both components at once, for ChromaPairs; where chromaPairs() is not 0.
  void SelectChromaPairs(int32_t x, const int32_t* columns, int n);

  // Selects the chroma of loop columns [x, x + n), for ChromaOfPixels.
  void SelectPixelChroma(int32_t x, int n);

  // For copying whole planes. Whether the luma of n loop columns from x lies side by side in a
  // source row, and the chroma of n loop columns that are a block apart, from the first to the
  // last.
  bool LumaLiesInPlace(int32_t x, int32_t n) const;
  // Whether n loop columns from x read one source column after the other.
  bool LumaAdvances(int32_t x, int32_t n) const {
    return palette_ == nullptr && !swappedLuma_ && columnPositions_.Advance(x, n);
  }
  bool ChromaLiesInPlace(int32_t firstX, int32_t lastX, int32_t n) const;
  // 1 or 2 when chroma lies in pairs: the component that comes first.
  int chromaPairs() const;
  int32_t ColumnOf(int32_t x) const { return columnPositions_.At(x).first; }
  const uint8_t* LumaAt(int32_t x, int32_t row) const;
  const uint8_t* ChromaAt(int plane, int32_t x, int32_t row) const;
  int32_t SourceRow(int32_t r, uint32_t factor) const { return rowPositions_.At(r, factor).first; }
  ptrdiff_t pitch(int plane) const { return job_.srcPitches[plane]; }

  // Runs for loop row r: valid until the next call of the same function. What is not in place is
  // made in `into` where that is given.
  const uint8_t* Luma(int32_t r, uint8_t* into = nullptr);
  const uint8_t* U(int32_t r);
  const uint8_t* V(int32_t r);
  // Pairs in the source's order; made in `into` when they are not in place.
  const uint8_t* ChromaPairs(int32_t r, uint8_t* into);
  RgbRun Rgb(int32_t r);
  // The strip's packed pixels. Null unless HasPixels: where they are blended and have fields within
  // bytes. What is not in place is made in `into` where that is given.
  const uint8_t* Pixels(int32_t r, uint8_t* into = nullptr);
  bool HasPixels(int32_t r) const;
  // How many of `most` rows from r on read what this one reads, if it blends nothing.
  int RowsAlike(int32_t r, int most) const;
  const PixelFormat& pixelFormat() const { return pixels_; }
  // Whether taking channels out of pixels costs so much that it is better done once for all three
  // components of YUV.
  bool hasFields() const { return !pixels_.wholeBytes && pixels_.bytes != 2; }
  // Valid until the next call; an enlarged picture uses what was read for several rows.
  PixelChroma ChromaOfPixels(int32_t r) {
    const int32_t row = rowPositions_.At(r, job_.engine.srcSubsample[4]).first;
    if (row != lastChroma_.row) lastChroma_ = {row, ReadChroma(row, packed_)};
    return lastChroma_.chroma;
  }
  // What is not in place is made in `into`, two bytes for each of chromaCount().
  PixelChroma ChromaOfPixels(int32_t r, uint8_t* into) {
    return ReadChroma(rowPositions_.At(r, job_.engine.srcSubsample[4]).first, into);
  }
  // Whether chroma is made as pairs, and how, when nothing else about it is wanted.
  bool MakesChromaPairs() const { return pixelChroma_ == PixelChromaRead::kPairs; }
  void MakeChromaPairs(int32_t r, uint8_t* into) {
    const int32_t row = rowPositions_.At(r, job_.engine.srcSubsample[4]).first;
    rows_.readPairs(into, RowToRead(1, row, chromaU_), chromaPlan_);
  }
  int chromaCount() const { return chromaCount_; }
  bool ChromaIsGrey() const { return pixelChroma_ == PixelChromaRead::kGrey; }
  // Where the luma of the strip lies in the source as it is wanted; null when it does not.
  const uint8_t* LumaInPlace(int32_t r) const;
  bool ChromaIsInPlace() const { return pixelChroma_ == PixelChromaRead::kInPlace; }
  // How many of `most` rows from r on are in place, luma and chroma, each row below its
  // predecessor, so that they can be converted at once. 1 when it is only this one, or not even it.
  int RowsInPlace(int32_t r, int most) const;
  // Whether luma and chroma of n loop columns from x are in place, so that a strip may be as wide.
  bool PixelsLieInPlace(int32_t x, int32_t n) const;
  // Where a row of the strip begins that consists of whole groups of packed 4:2:2; null when it
  // does not, or not untransformed.
  const uint8_t* Groups(int32_t r) const {
    return pixelChroma_ == PixelChromaRead::kStrided ? FindGroups(r) : nullptr;
  }
  // Takes such a row apart, into luma and pairs of chroma.
  PixelChroma ReadGroups(const uint8_t* groups, int32_t r, uint8_t* luma, uint8_t* pairs) const;

 private:
  // The two source lines, already filtered horizontally, that rows are blended from. An enlarged
  // picture uses each line for several rows.
  struct Line {
    int32_t row;
    const uint8_t* channel[3];  // into `samples`, or into the source
    uint8_t* samples[4];        // channels and alpha, or packed pixels, in one piece
  };

  const uint8_t* RowStart(int plane, int32_t row) const {
    return job_.srcPlanes[plane] + ptrdiff_t(job_.srcPitches[plane]) * row;
  }
  // The same for a row whose samples are about to be read; asks for those of a later one.
  const uint8_t* RowToRead(int plane, int32_t row, const SampleColumns& columns) const {
    const uint8_t* const start = RowStart(plane, row);
    const int chroma = plane != 0 ? 1 : 0;
    if (columns.askFrom < columns.askTo && row < endOfAsking_[chroma]) {
      const uint8_t* const later = start + ptrdiff_t{job_.srcPitches[plane]} * rowsAhead_[chroma];
      for (int32_t i = columns.askFrom; i < columns.askTo; i += 2 * kCacheLine) {
        __builtin_prefetch(later + i);
        __builtin_prefetch(later + i + kCacheLine);
      }
    }
    return start;
  }
  const uint8_t* ReadSamples(uint8_t* buffer, const uint8_t* row,
                             const SampleColumns& columns) const;
  void ReadChannels(uint8_t* const rgb[3], const uint8_t* row, const SampleColumns& columns);
  const uint8_t* FindGroups(int32_t r) const;
  PixelChroma ReadChroma(int32_t row, uint8_t* into);
  // The strip's pixels of a row, side by side.
  void Gather(uint8_t* into, const uint8_t* row, const SampleColumns& columns) const;
  int32_t ChromaColumn(int32_t x) const;
  // Whether pixels are blended as they are, without taking their channels apart.
  bool BlendsPixels() const { return pixels_.wholeBytes; }
  bool PixelsAreInPlace() const { return palette_ == nullptr && first_.contiguous; }
  // Samples of chroma that a strip may have.
  int ChromaOf(int columns) const;
  const uint8_t* Chroma(int plane, int32_t r, const SampleColumns& columns, uint8_t* buffer);
  // Whether a loop row is between two source rows.
  bool BlendsRows(int32_t r) const;
  void FillLumaLine(Line* line, int32_t row);
  void FillRgbLine(Line* line, int32_t row);
  void FillPixelLine(Line* line, int32_t row);
  // Both lines of a loop row, or the same one twice when only the first counts.
  struct Lines {
    const Line* first;
    const Line* second;
    uint32_t weight;  // of the second
  };
  template <void (Source::*kFill)(Line*, int32_t)>
  Lines FetchLines(int32_t r);

  const Job& job_;
  const RowOps& rows_;
  ColumnPositions columnPositions_;
  RowPositions rowPositions_;
  const uint8_t* palette_;
  PixelFormat pixels_;  // or entries of the palette
  bool swappedLuma_;
  bool wantsAlpha_;            // it is copied to the destination
  bool interpolates_ = false;  // some column of the strip has a weight
  // For luma or pixels, and for chroma.
  int32_t rowsAhead_[2], endOfAsking_[2];

  // How chroma of pixels is had: the same for every pixel, or lying in the source side by side, or
  // in both components' samples with a step, or with both in one plan of pairs, or one by one.
  enum class PixelChromaRead { kGrey, kInPlace, kStrided, kPairs, kGathered };

  SampleColumns first_, second_, chromaU_, chromaV_;
  PairPlan firstPlan_, chromaPlan_;  // pixels of two bytes: of both taps
  bool sharesColumns_ = false;       // U and V
  uint16_t* weights_ = nullptr;
  PixelChromaRead pixelChroma_ = PixelChromaRead::kGrey;
  int chromaCount_ = 0, phase_ = 0, shift_ = 0;
  struct {
    int32_t row;
    PixelChroma chroma;
  } lastChroma_ = {-1, {}};
  Line lines_[2];
  uint8_t* channels_[4] = {};  // of second taps, or those and alpha of pixels
  uint8_t* packed_ = nullptr;  // gathered pixels, or pairs of chroma samples
  int32_t gatheredRow_ = -1;   // whose pixels `packed_` has for Pixels; -1: none's
  uint8_t* blended_[4] = {};   // channels, or packed pixels, in one piece
  uint8_t *u_ = nullptr, *v_ = nullptr;
};

}  // namespace kestrel

#endif
