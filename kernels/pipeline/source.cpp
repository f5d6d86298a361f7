#include "kernels/pipeline/source.h"

#include <string.h>

namespace kestrel {
namespace {

// Indexed pixels become entries of their palette, and those are like other pixels.
constexpr PixelFormat kPaletteEntry = {4, {8, 8, 8}, {16, 8, 0}, -1, true};

bool HasSwappedLuma(uint32_t code) {
  return code >= CODE_YVYU_SWAPPED_LUMA && code <= CODE_VYUY_SWAPPED_LUMA;
}

}  // namespace

void SampleColumns::Finish(int count) {
  n = count;
  const int32_t first = offset[0];
  const int32_t last = offset[n - 1];
  AskFor(first < last ? first : last, (first < last ? last : first) + step);
  contiguous = true;
  for (int i = 1; i < n && contiguous; ++i) contiguous = offset[i] - offset[i - 1] == step;
}

void SampleColumns::FinishSamples(int count) {
  const int32_t bytes = int32_t(step);
  if (bytes != 1) {
    for (int i = 0; i < count; ++i) offset[i] *= bytes;
  }
  Finish(count);
}

void SampleColumns::SetAll(int64_t sample, int count) {
  n = count;
  contiguous = true;
  Set(0, sample);
  AskFor(offset[0], offset[0] + n * int64_t{step});
}

void SampleColumns::AskFor(int32_t from, int64_t to) {
  askFrom = from;
  askTo = to - from < wide ? int32_t(to) + kCacheLine - 1 : from;
}

void SampleColumns::Plan(const RowOps& rows) const {
  if (contiguous || plan == nullptr) return;
  plan->n = n / 2;
  plan->first = offset;
  plan->second = offset + 1;
  plan->stride = 2;
  plan->weights = nullptr;
  rows.planPairs(plan);
}

void SampleColumns::PlanApart(int32_t apart, const RowOps& rows) const {
  plan->apart = apart;
  PlanWith(nullptr, nullptr, rows);
}

void SampleColumns::PlanPixels(const int32_t* second, const uint16_t* weights,
                               const PixelFormat& format, const RowOps& rows) const {
  plan->unit = format.bytes;
  plan->keptByte = format.alphaByte;
  PlanWith(second, weights, rows);
}

void SampleColumns::PlanWith(const int32_t* second, const uint16_t* weights,
                             const RowOps& rows) const {
  plan->n = n * plan->unit;
  plan->first = offset;
  plan->second = second;
  plan->stride = 1;
  plan->weights = weights;
  rows.planPairs(plan);
}

Source::Source(const Job& job)
    : job_(job),
      rows_(job.rows()),
      columnPositions_(job),
      rowPositions_(job),
      palette_(job.engine.srcFormat.palette),
      pixels_(palette_ != nullptr ? kPaletteEntry
                                  : DescribePixels(job.engine.srcFormat, job.engine.srcChannelSize,
                                                   job.engine.srcChannelPos)),
      swappedLuma_(HasSwappedLuma(job.engine.srcFormat.code)),
      wantsAlpha_(pixels_.alphaByte >= 0 && job.engine.pathKind == PATH_RGB_TO_RGB) {
  const PlaneLayout& layout = job.engine.srcLayout;
  // Indexed pixels are addressed by column: several share a byte.
  const bool isRgb = layout.code == CODE_RGB;
  first_.step = second_.step = palette_ != nullptr ? 1 : isRgb ? pixels_.bytes : layout.step[0];
  chromaU_.step = chromaV_.step = layout.step[1];
  first_.plan = &firstPlan_;
  chromaU_.plan = second_.plan = &chromaPlan_;
  constexpr int64_t kAhead = 6;  // rows of the destination
  const auto quarterRow = [&job](int plane) {
    const int64_t pitch = job.srcPitches[plane];
    return int32_t((pitch < 0 ? -pitch : pitch) / 4);
  };
  first_.wide = second_.wide = quarterRow(0);
  chromaU_.wide = quarterRow(1);
  chromaV_.wide = quarterRow(2);
  for (int chroma = 0; chroma < 2; ++chroma) {
    const int64_t factor = chroma != 0 ? job.engine.srcSubsample[4] : 1;
    const int64_t ahead = kAhead * job.engine.stepY / (factor * 65536);
    rowsAhead_[chroma] = ahead < 2 ? 2 : int32_t(ahead);
    endOfAsking_[chroma] = int32_t(job.engine.srcReadBottom / factor) - rowsAhead_[chroma];
  }
}

int Source::ChromaOf(int columns) const {
  const EngineContext& c = job_.engine;
  if (c.pathKind == PATH_YUV_TO_RGB) return columns;
  const bool hasChroma = c.pathKind == PATH_YUV_TO_YUV && c.dstLayout.code != CODE_GRAY8;
  // A strip may begin and end within samples of chroma.
  return !hasChroma ? 0 : c.dstSubsample[1] >= 2 ? columns / 2 + 2 : columns;
}

void Source::TakeMemory(StripMemory* memory, int columns) {
  const auto blocks = [](int n) {
    constexpr size_t kBlock = PairPlan::kBlock;
    return (size_t(n) + kBlock - 1) / kBlock * kBlock;
  };
  const auto takePlan = [=](int n) {
    return memory->Take<uint8_t>(PairPlan::kPreparedBytes * blocks(n));
  };
  // n columns in each of some pieces, which follow each other.
  const auto takePieces = [=](auto& pieces, size_t n) {
    uint8_t* const all = memory->Take<uint8_t>(n * (sizeof(pieces) / sizeof(pieces[0])));
    size_t i = 0;
    for (uint8_t*& piece : pieces) piece = all == nullptr ? nullptr : all + n * i++;
  };
  const EngineContext& c = job_.engine;
  const size_t n = size_t(columns);
  const bool blends = c.bilinear != 0 && !job_.has(kNearestOnly);
  const bool isRgb = c.srcLayout.code == CODE_RGB;
  first_.offset = memory->Take<int32_t>(n);
  if (blends) {
    second_.offset = memory->Take<int32_t>(n);
    weights_ = memory->Take<uint16_t>(n);
  }
  if (isRgb) {
    takePieces(channels_, n);
    if (blends || !BlendsPixels()) {
      for (Line& line : lines_) takePieces(line.samples, n);
    }
    if (blends) takePieces(blended_, n);
    const int bytes = pixels_.bytes;
    packed_ = memory->Take<uint8_t>(n * size_t(blends && palette_ != nullptr ? 2 * bytes : bytes));
    if (bytes == 2) {
      firstPlan_.prepared = takePlan(columns);
      if (blends) chromaPlan_.prepared = takePlan(columns);
    } else if (blends && BlendsPixels()) {
      if (palette_ == nullptr) firstPlan_.prepared = takePlan(bytes * columns);
      firstPlan_.blends = memory->Take<uint16_t>(blocks(bytes * columns));
    }
    return;
  }
  firstPlan_.prepared = takePlan(blends ? columns : columns / 2);
  for (Line& line : lines_) line.samples[0] = memory->Take<uint8_t>(n);
  if (blends) {
    firstPlan_.blends = memory->Take<uint16_t>(blocks(columns));
    blended_[0] = memory->Take<uint8_t>(n);
  }
  const int chroma = ChromaOf(columns);
  const bool toPixels = c.pathKind == PATH_YUV_TO_RGB;
  if (c.srcLayout.code == CODE_GRAY8) {
    u_ = v_ = memory->Take<uint8_t>(size_t(chroma));
    if (u_ != nullptr) memset(u_, 128, size_t(chroma));
    return;
  }
  chromaU_.offset = memory->Take<int32_t>(size_t(chroma));
  if (job_.has(kPairChroma)) chromaV_.offset = memory->Take<int32_t>(size_t(chroma));
  chromaPlan_.prepared = takePlan(chroma);
  if (toPixels) packed_ = memory->Take<uint8_t>(2 * n);
  if (!toPixels || c.dither != 0 || job_.has(kClampedCarry)) {
    u_ = memory->Take<uint8_t>(size_t(chroma));
    v_ = memory->Take<uint8_t>(size_t(chroma));
  }
}

void Source::SelectColumns(int32_t x, int n) {
  interpolates_ = false;
  lines_[0].row = lines_[1].row = gatheredRow_ = -1;
  // Side by side: the first column says it all, and the strip may be of any width.
  if (palette_ == nullptr && !swappedLuma_ && columnPositions_.Advance(x, n)) {
    first_.SetAll(columnPositions_.At(x).first, n);
    return;
  }
  columnPositions_.Read(x, n, first_.offset, second_.offset, weights_);
  if (swappedLuma_) {
    for (int i = 0; i < n; ++i) first_.offset[i] ^= 1;
    for (int i = 0; second_.offset != nullptr && i < n; ++i) second_.offset[i] ^= 1;
  }
  if (weights_ != nullptr) {
    uint16_t any = 0;
    for (int i = 0; i < n; ++i) any |= weights_[i];
    interpolates_ = any != 0;
  }
  first_.FinishSamples(n);
  if (interpolates_) second_.FinishSamples(n);
  if (job_.engine.srcLayout.code == CODE_RGB) {
    // Pixels are gathered whole; those of two bytes are pairs of them.
    if (interpolates_ && palette_ != nullptr) {
      for (int i = 0; i < pixels_.bytes * n; ++i) {
        firstPlan_.blends[i] = weights_[i / pixels_.bytes];
      }
      return;
    }
    if (interpolates_ && BlendsPixels()) {
      return first_.PlanPixels(second_.offset, weights_, pixels_, rows_);
    }
    if (pixels_.bytes != 2) return;
    if (!first_.contiguous) first_.PlanApart(1, rows_);
    if (interpolates_ && !second_.contiguous) second_.PlanApart(1, rows_);
    return;
  }
  if (!interpolates_) {
    first_.Plan(rows_);
  } else {
    first_.PlanWith(second_.offset, weights_, rows_);
  }
}

void Source::SelectChroma(int32_t x, const int32_t* uColumns, const int32_t* vColumns, int n) {
  if (job_.engine.srcLayout.code == CODE_GRAY8) return;
  sharesColumns_ = uColumns == vColumns;
  const auto select = [=](SampleColumns* chroma, const int32_t* columns) {
    for (int i = 0; i < n; ++i) {
      chroma->Set(i, ChromaColumn(x + (columns != nullptr ? columns[i] : i)));
    }
    chroma->Finish(n);
    chroma->Plan(rows_);
  };
  select(&chromaU_, uColumns);
  if (!sharesColumns_) select(&chromaV_, vColumns);
}

void Source::SelectChromaPairs(int32_t x, const int32_t* columns, int n) {
  for (int i = 0; i < n; ++i) chromaU_.Set(i, ChromaColumn(x + columns[i]));
  chromaU_.Finish(n);
  if (!chromaU_.contiguous) chromaU_.PlanApart(1, rows_);
}

const uint8_t* Source::ChromaPairs(int32_t r, uint8_t* into) {
  const int32_t row = rowPositions_.At(r, job_.engine.srcSubsample[4]).first;
  const uint8_t* const pairs = RowToRead(chromaPairs(), row, chromaU_);
  if (chromaU_.contiguous) return pairs + chromaU_.offset[0];
  rows_.readPairs(into, pairs, chromaPlan_);
  return into;
}

void Source::SelectPixelChroma(int32_t x, int n) {
  const PlaneLayout& layout = job_.engine.srcLayout;
  const uint32_t factor = job_.engine.srcSubsample[1];
  phase_ = shift_ = 0;
  chromaCount_ = n;
  lastChroma_.row = -1;
  if (layout.code == CODE_GRAY8) return;
  const ptrdiff_t vFromU = job_.srcPlanes[2] - job_.srcPlanes[1];
  if (factor <= 2 && columnPositions_.Advance(x, n)) {
    const int32_t column = columnPositions_.At(x).first;
    shift_ = int(factor) - 1;
    phase_ = column & shift_;
    chromaCount_ = ((n - 1 + phase_) >> shift_) + 1;
    chromaU_.offset[0] = int32_t((column >> shift_) * chromaU_.step);
    const bool inPlace = chromaU_.step == 1 || chromaPairs() != 0;
    pixelChroma_ = inPlace ? PixelChromaRead::kInPlace : PixelChromaRead::kStrided;
    return;
  }
  columnPositions_.Read(x, n, chromaU_.offset, nullptr, nullptr);
  if (factor == 2) {
    for (int i = 0; i < n; ++i) chromaU_.offset[i] >>= 1;
  } else if (factor > 2) {
    for (int i = 0; i < n; ++i) chromaU_.offset[i] /= int32_t(factor);
  }
  // Samples of both components in one group of bytes: one plan reads them in turn.
  const bool grouped =
      vFromU < chromaU_.step && -vFromU < chromaU_.step && job_.srcPitches[1] == job_.srcPitches[2];
  if (grouped) {
    pixelChroma_ = PixelChromaRead::kPairs;
    chromaU_.FinishSamples(n);
    chromaU_.PlanApart(int32_t(vFromU), rows_);
  } else {
    pixelChroma_ = PixelChromaRead::kGathered;
    chromaU_.FinishSamples(n);
    chromaU_.Plan(rows_);
  }
}

PixelChroma Source::ReadChroma(int32_t row, uint8_t* into) {
  if (pixelChroma_ == PixelChromaRead::kGrey) return {{u_, v_, 0, 1, 0, 0, 0}};
  const uint8_t* const u = RowStart(1, row);
  const uint8_t* const v = RowStart(2, row);
  const int32_t start = chromaU_.offset[0];
  uint8_t* const second = into + chromaCount_;
  switch (pixelChroma_) {
    case PixelChromaRead::kInPlace:
      return {{u + start, v + start, shift_, int32_t(chromaU_.step), job_.srcPitches[1],
               job_.srcPitches[2], job_.engine.srcSubsample[4] == 2 ? 1 : 0},
              phase_};
    case PixelChromaRead::kStrided:
      // In packed 4:2:2 every other byte is chroma: U and V in turn.
      if (chromaU_.step == 4 && (v - u == 2 || u - v == 2)) {
        rows_.readStrided(into, (u < v ? u : v) + start, 2, 2 * chromaCount_);
        return {{into + (u < v ? 0 : 1), into + (u < v ? 1 : 0), shift_, 2, 0, 0, 0}, phase_};
      }
      rows_.readStrided(into, u + start, chromaU_.step, chromaCount_);
      rows_.readStrided(second, v + start, chromaU_.step, chromaCount_);
      return {{into, second, shift_, 1, 0, 0, 0}, phase_};
    case PixelChromaRead::kPairs:
      rows_.readPairs(into, RowToRead(1, row, chromaU_), chromaPlan_);
      return {{into, into + 1, 0, 2, 0, 0, 0}};
    default:
      return {{ReadSamples(into, RowToRead(1, row, chromaU_), chromaU_),
               ReadSamples(second, RowToRead(2, row, chromaU_), chromaU_), 0, 1, 0, 0, 0}};
  }
}

int Source::RowsInPlace(int32_t r, int most) const {
  const uint32_t factor = job_.engine.srcSubsample[4];
  if (most < 2 || factor > 2 || job_.engine.stepY != 0x10000 || LumaInPlace(r) == nullptr ||
      pixelChroma_ != PixelChromaRead::kInPlace) {
    return 1;
  }
  const int32_t first = SourceRow(r, 1);
  // The second row of a chroma row comes alone, so that pairs can follow.
  if (factor == 2 && first % 2 != 0) return 1;
  // Rows advance by one at most: when the last is where it should be, so are all between.
  int n = most;
  const int32_t inside = job_.engine.srcRect.bottom - first;
  if (inside < n) n = inside;
  if (n < 2) return 1;
  const int32_t last = r + n - 1;
  const bool inTurn =
      SourceRow(last, 1) - first == n - 1 &&
      SourceRow(last, factor) - SourceRow(r, factor) == int32_t(uint32_t(n - 1) / factor);
  return inTurn ? n : 1;
}

bool Source::PixelsLieInPlace(int32_t x, int32_t n) const {
  const PlaneLayout& layout = job_.engine.srcLayout;
  return layout.code != CODE_GRAY8 && job_.engine.stepY == 0x10000 &&
         job_.engine.srcSubsample[1] <= 2 && (chromaU_.step == 1 || chromaPairs() != 0) &&
         LumaLiesInPlace(x, n);
}

const uint8_t* Source::FindGroups(int32_t r) const {
  if (chromaU_.step != 4 || first_.step != 2 || !first_.contiguous || phase_ != 0 ||
      first_.n != 2 * chromaCount_ || job_.engine.stepY != 0x10000 ||
      job_.engine.srcSubsample[4] != 1) {
    return nullptr;
  }
  const int32_t row = SourceRow(r, 1);
  const uint8_t* const y = RowStart(0, row) + first_.offset[0];
  const uint8_t* const u = RowStart(1, row) + chromaU_.offset[0];
  const uint8_t* const v = RowStart(2, row) + chromaU_.offset[0];
  const uint8_t* const chroma = u < v ? u : v;
  const bool inTurn = (u - v == 2 || v - u == 2) && (y - chroma == 1 || chroma - y == 1);
  return !inTurn ? nullptr : y < chroma ? y : chroma;
}

PixelChroma Source::ReadGroups(const uint8_t* groups, int32_t r, uint8_t* luma,
                               uint8_t* pairs) const {
  const int32_t row = SourceRow(r, 1);
  const bool lumaFirst = groups == RowStart(0, row) + first_.offset[0];
  const bool uFirst = RowStart(1, row) < RowStart(2, row);
  rows_.deinterleave(lumaFirst ? luma : pairs, lumaFirst ? pairs : luma, groups, first_.n);
  return {{pairs + (uFirst ? 0 : 1), pairs + (uFirst ? 1 : 0), shift_, 2, 0, 0, 0}};
}

bool Source::LumaLiesInPlace(int32_t x, int32_t n) const {
  const bool packedYuv = job_.engine.srcLayout.code != CODE_RGB && first_.step != 1;
  return !packedYuv && LumaAdvances(x, n);
}

bool Source::ChromaLiesInPlace(int32_t firstX, int32_t lastX, int32_t n) const {
  // Then from block to block the source advances by one sample at most.
  return columnPositions_.Advance(firstX, lastX - firstX + 1) &&
         ChromaColumn(lastX) - ChromaColumn(firstX) == n - 1;
}

int32_t Source::ChromaColumn(int32_t x) const {
  return columnPositions_.At(x).first / int32_t(job_.engine.srcSubsample[1]);
}

int Source::chromaPairs() const {
  const ptrdiff_t apart = job_.srcPlanes[2] - job_.srcPlanes[1];
  const bool pairs =
      chromaU_.step == 2 && (apart == 1 || apart == -1) && job_.srcPitches[1] == job_.srcPitches[2];
  return !pairs ? 0 : apart == 1 ? 1 : 2;
}

const uint8_t* Source::LumaAt(int32_t x, int32_t row) const {
  return RowStart(0, row) + columnPositions_.At(x).first * first_.step;
}

const uint8_t* Source::ChromaAt(int plane, int32_t x, int32_t row) const {
  return RowStart(plane, row) + ChromaColumn(x) * chromaU_.step;
}

const uint8_t* Source::LumaInPlace(int32_t r) const {
  if (!first_.contiguous || first_.step != 1 || interpolates_) return nullptr;
  const Taps taps = rowPositions_.At(r, 1);
  if (taps.weight != 0 && taps.first != taps.second) return nullptr;
  return RowStart(0, taps.first) + first_.offset[0];
}

const uint8_t* Source::ReadSamples(uint8_t* buffer, const uint8_t* row,
                                   const SampleColumns& columns) const {
  if (!columns.contiguous && columns.plan == nullptr) {
    rows_.gather(buffer, row, columns.offset, columns.n);
    return buffer;
  }
  if (!columns.contiguous) {
    rows_.readPairs(buffer, row, *columns.plan);
    if (columns.n % 2 != 0) buffer[columns.n - 1] = row[columns.offset[columns.n - 1]];
    return buffer;
  }
  const uint8_t* start = row + columns.offset[0];
  if (columns.step == 1) return start;
  rows_.readStrided(buffer, start, columns.step, columns.n);
  return buffer;
}

void Source::ReadChannels(uint8_t* const rgb[3], const uint8_t* row, const SampleColumns& columns) {
  const uint8_t* pixels = row + columns.offset[0];
  if (!columns.contiguous) {
    Gather(packed_, row, columns);
    gatheredRow_ = -1;
    pixels = packed_;
  }
  rows_.unpackRgb(rgb, pixels, pixels_, columns.n);
}

void Source::Gather(uint8_t* into, const uint8_t* row, const SampleColumns& columns) const {
  if (palette_ != nullptr) {
    rows_.gatherIndexed(into, row, columns.offset, job_.engine.srcFormat.colourStandard, palette_,
                        columns.n);
  } else if (pixels_.bytes == 2) {
    rows_.readPairs(into, row, *columns.plan);
  } else {
    rows_.gatherPixels(into, row, columns.offset, pixels_.bytes, columns.n);
  }
}

void Source::FillLumaLine(Line* line, int32_t row) {
  const uint8_t* start = RowToRead(0, row, first_);
  if (interpolates_) {
    rows_.blendPairs(line->samples[0], start, firstPlan_);
    line->channel[0] = line->samples[0];
  } else {
    line->channel[0] = ReadSamples(line->samples[0], start, first_);
  }
}

// Pixels that have fields within bytes.
void Source::FillRgbLine(Line* line, int32_t row) {
  const uint8_t* start = RowToRead(0, row, first_);
  uint8_t* const rgb[3] = {line->samples[0], line->samples[1], line->samples[2]};
  ReadChannels(rgb, start, first_);
  for (int c = 0; c < 3; ++c) line->channel[c] = rgb[c];
  if (wantsAlpha_) {
    // Alpha is never interpolated. (What is not in place was gathered just now.)
    const uint8_t* const pixels = first_.contiguous ? start + first_.offset[0] : packed_;
    rows_.unpackAlpha(line->samples[3], pixels, pixels_, first_.n);
  }
  if (!interpolates_) return;
  uint8_t* const second[3] = {channels_[0], channels_[1], channels_[2]};
  ReadChannels(second, start, second_);
  for (int c = 0; c < 3; ++c) rows_.blendColumns(rgb[c], rgb[c], second[c], weights_, first_.n);
}

template <void (Source::*kFill)(Source::Line*, int32_t)>
Source::Lines Source::FetchLines(int32_t r) {
  const Taps taps = rowPositions_.At(r, 1);
  const auto refill = [this](Line* line, int32_t row) {
    (this->*kFill)(line, row);
    line->row = row;
  };
  Line* a = &lines_[0];
  Line* b = &lines_[1];
  if (a->row != taps.first) {
    a = &lines_[1];
    b = &lines_[0];
    if (a->row != taps.first) {
      // The line that the second tap is about to use must survive fetching the first.
      if (a->row == taps.second) {
        a = &lines_[0];
        b = &lines_[1];
      }
      refill(a, taps.first);
    }
  }
  if (taps.weight == 0 || taps.first == taps.second) return {a, a, 0};
  if (b->row != taps.second) refill(b, taps.second);
  return {a, b, taps.weight};
}

const uint8_t* Source::Luma(int32_t r, uint8_t* into) {
  // Rows that are neither blended nor used again.
  const bool once = into != nullptr && job_.engine.stepY >= 0x10000 && !interpolates_;
  if (once && !BlendsRows(r)) {
    return ReadSamples(into, RowToRead(0, SourceRow(r, 1), first_), first_);
  }
  const Lines lines = FetchLines<&Source::FillLumaLine>(r);
  if (lines.weight == 0) return lines.first->channel[0];
  uint8_t* const blended = into != nullptr ? into : blended_[0];
  rows_.blendRows(blended, lines.first->channel[0], lines.second->channel[0], lines.weight,
                  first_.n);
  return blended;
}

const uint8_t* Source::Chroma(int plane, int32_t r, const SampleColumns& columns, uint8_t* buffer) {
  if (job_.engine.srcLayout.code == CODE_GRAY8) return buffer;
  const int32_t row = rowPositions_.At(r, job_.engine.srcSubsample[4]).first;
  return ReadSamples(buffer, RowToRead(plane, row, columns), columns);
}

const uint8_t* Source::U(int32_t r) {
  return Chroma(1, r, chromaU_, u_);
}

const uint8_t* Source::V(int32_t r) {
  return Chroma(2, r, sharesColumns_ ? chromaU_ : chromaV_, v_);
}

void Source::FillPixelLine(Line* line, int32_t row) {
  const uint8_t* const start = RowToRead(0, row, first_);
  uint8_t* const pixels = line->samples[0];
  line->channel[0] = pixels;
  if (interpolates_ && palette_ != nullptr) {
    const int bytes = pixels_.bytes * first_.n;
    uint8_t* const second = packed_ + bytes;
    Gather(packed_, start, first_);
    Gather(second, start, second_);
    rows_.blendColumns(pixels, packed_, second, firstPlan_.blends, bytes);
  } else if (interpolates_) {
    rows_.blendPairs(pixels, start, firstPlan_);
  } else if (PixelsAreInPlace()) {
    line->channel[0] = start + first_.offset[0];
  } else {
    Gather(pixels, start, first_);
  }
}

bool Source::HasPixels(int32_t r) const {
  return BlendsPixels() || !(interpolates_ || BlendsRows(r));
}

bool Source::BlendsRows(int32_t r) const {
  const Taps taps = rowPositions_.At(r, 1);
  return taps.weight != 0 && taps.first != taps.second;
}

const uint8_t* Source::Pixels(int32_t r, uint8_t* into) {
  if (!HasPixels(r)) return nullptr;
  if (interpolates_ || BlendsRows(r)) {
    const Lines lines = FetchLines<&Source::FillPixelLine>(r);
    if (lines.weight == 0) return lines.first->channel[0];
    uint8_t* const blended = into != nullptr ? into : blended_[0];
    const uint8_t* const a = lines.first->channel[0];
    const uint8_t* const b = lines.second->channel[0];
    if (pixels_.bytes == 4) {
      rows_.blendPixelRows(blended, a, b, lines.weight, pixels_.alphaByte, first_.n);
    } else {
      rows_.blendRows(blended, a, b, lines.weight, pixels_.bytes * first_.n);
    }
    return blended;
  }
  const int32_t row = SourceRow(r, 1);
  if (into == nullptr && row == gatheredRow_) return packed_;
  const uint8_t* const start = RowToRead(0, row, first_);
  if (PixelsAreInPlace()) return start + first_.offset[0];
  if (into == nullptr) gatheredRow_ = row;
  uint8_t* const gathered = into != nullptr ? into : packed_;
  Gather(gathered, start, first_);
  return gathered;
}

int Source::RowsAlike(int32_t r, int most) const {
  const uint32_t factor = job_.engine.srcSubsample[4];
  if (BlendsRows(r)) return 1;
  const int32_t row = SourceRow(r, 1);
  const int32_t chroma = SourceRow(r, factor);
  int n = 1;
  for (; n < most; ++n) {
    const bool alike =
        !BlendsRows(r + n) && SourceRow(r + n, 1) == row && SourceRow(r + n, factor) == chroma;
    if (!alike) break;
  }
  return n;
}

RgbRun Source::Rgb(int32_t r) {
  if (BlendsPixels()) {
    const uint8_t* const pixels = Pixels(r);
    rows_.unpackRgb(channels_, pixels, pixels_, first_.n);
    if (wantsAlpha_) rows_.unpackAlpha(channels_[3], pixels, pixels_, first_.n);
    return {{channels_[0], channels_[1], channels_[2]}, wantsAlpha_ ? channels_[3] : nullptr};
  }
  const Lines lines = FetchLines<&Source::FillRgbLine>(r);
  const uint8_t* const* const first = lines.first->channel;
  const uint8_t* const* const second = lines.second->channel;
  RgbRun run = {{first[0], first[1], first[2]}, wantsAlpha_ ? lines.first->samples[3] : nullptr};
  if (lines.weight == 0) return run;
  for (int c = 0; c < 3; ++c) {
    rows_.blendRows(blended_[c], first[c], second[c], lines.weight, first_.n);
    run.channel[c] = blended_[c];
  }
  return run;
}

}  // namespace kestrel
