#include "kernels/pipeline/pipeline.h"

#include <string.h>

#include "kernels/pipeline/destination.h"
#include "kernels/pipeline/overlap.h"
#include "kernels/pipeline/source.h"

namespace kestrel {
namespace {

// The convert stage between one Source and one Destination.
class Pipeline {
 public:
  explicit Pipeline(const Job& job)
      : job_(job),
        rows_(job.rows()),
        engine_(job.engine),
        source_(job),
        destination_(job),
        stripWidth_(ShareMemory()),
        arranged_(rows_, destination_.arrangingMemory()),
        clampedCarry_(job.has(kClampedCarry) && (engine_.dither != 0 || !job.has(kCarryIfAsked))),
        dithers_(clampedCarry_ || (engine_.dither != 0 && engine_.pathKind == PATH_YUV_TO_RGB &&
                                   !job.has(kNoDither))) {
    keepsPixels_ = KeepsPixels();
    readsPairs_ = engine_.pathKind == PATH_YUV_TO_YUV && source_.chromaPairs() != 0 &&
                  destination_.hasChroma() && !job_.has(kPairChroma);
    PrepareCarry();
    PrepareSums();
  }

  void Run() {
    if (dithers_) {
      // The remainder travels along whole rows, from the end of one to the start of the next.
      for (int32_t r = job_.rect.top; r < job_.rect.bottom; ++r) {
        for (int32_t x = job_.rect.left; x < job_.rect.right; x += stripWidth_) {
          if (r == job_.rect.top || StripWidth(job_.rect.left) < Width()) SelectColumns(x);
          ConvertRows(r);
        }
      }
    } else {
      if (CopyGroups()) return;
      CopyPlanes();
      if (lumaDone_ && chromaDone_) return;
      if (ConvertRgbInPlace()) return;
      if (ConvertYuvByRows()) return;
      if (RgbLiesInPlace()) stripWidth_ = Width();
      for (int32_t x = job_.rect.left; x < job_.rect.right; x += stripWidth_) {
        SelectColumns(x);
        for (int32_t r = job_.rect.top; r < job_.rect.bottom;) r += ConvertRows(r);
        destination_.Flush();
      }
    }
    destination_.Flush();
  }

 private:
  using PlaneRun = Destination::PlaneRun;
  using PixelOrder = Destination::Order;

  // Samples of short rows that are converted at once, or of groups that are taken apart.
  static constexpr int kCollected = 2048;

  // Where a loop row of a plane is on both sides.
  struct PlaneRow {
    int32_t source;
    int64_t destination;
  };

  // Shares out the memory, for strips as wide as the job or, where that is too wide, for strips of
  // about the same width.
  int32_t ShareMemory() {
    const int32_t width = Width();
    int32_t columns = destination_.widestStrip();
    if (width <= columns) columns = width;
    if (columns > kStrip) {
      columns = WholeVectors(columns);
      while (MemoryFor(columns) > StripMemory::kSize) columns -= 64;
      const int32_t strips = (width + columns - 1) / columns;
      columns = WholeVectors((width + strips - 1) / strips);
    }
    StripMemory memory(stripMemory_);
    TakeMemory(&memory, columns);
    return columns;
  }
  static int32_t WholeVectors(int32_t columns) { return (columns + 63) & ~63; }
  size_t MemoryFor(int32_t columns) {
    StripMemory counted(nullptr);
    TakeMemory(&counted, columns);
    return counted.taken();
  }
  void TakeMemory(StripMemory* memory, int32_t columns) {
    source_.TakeMemory(memory, columns);
    destination_.TakeMemory(memory, columns);
    // Chroma of RGB is made of channels that are picked.
    const bool makesChroma =
        engine_.pathKind == PATH_RGB_TO_YUV || engine_.pathKind == PATH_YUV_TO_YUV;
    const ptrdiff_t run = columns > kStrip ? columns : kStrip;
    const ptrdiff_t runs = makesChroma ? 6 : 3;
    constexpr ptrdiff_t kLeast = ptrdiff_t{3} * kCollected;
    static_assert(kLeast >= ptrdiff_t{4} * kStrip, "as many pixels may be kept there");
    constexpr size_t kNarrow = kStrip;
    constexpr size_t kTurned = ArrangedSamples::kTurnedColumns;
    constexpr size_t kTile = Destination::kTileColumns;
    // For a column no job takes more than 58 bytes besides, and none that turns YUV more than 32.
    static_assert(
        StripMemory::kSize >= ArrangedSamples::kTurnedSize + kLeast + 32 * kTurned &&
            StripMemory::kSize >= ArrangedSamples::kMirroredSize + kLeast + 58 * kNarrow &&
            StripMemory::kSize >= Destination::kTileSize + kLeast + 58 * kTile,
        "there is room for the narrowest strips");
    memory_ = memory->Take<uint8_t>(size_t(runs * run > kLeast ? runs * run : kLeast));
    if (memory_ == nullptr) return;
    for (int c = 0; c < 3; ++c) channels_[c] = memory_ + c * run;
    luma_ = memory_ + 3 * run;
    u_ = memory_ + 4 * run;
    v_ = memory_ + 5 * run;
  }

  int32_t Width() const { return job_.rect.right - job_.rect.left; }
  int StripWidth(int32_t x) const {
    const int32_t rest = job_.rect.right - x;
    return rest < stripWidth_ ? rest : stripWidth_;
  }

  void PrepareSums() {
    if (engine_.pathKind != PATH_YUV_TO_RGB) return;
    const YuvToRgbSums& s = engine_.rgbSums;
    const uint32_t* words = static_cast<const uint32_t*>(engine_.table);
    colour_.form = job_.has(kSixBitMatrix)   ? YuvToRgbForm::kSixBits
                   : s.insideClampTable == 0 ? YuvToRgbForm::kWide
                   : s.yGain == 65536        ? YuvToRgbForm::kWholeLuma
                                             : YuvToRgbForm::kTable;
    YuvToRgbTable& table = colour_.table;
    YuvToRgbWide& wide = colour_.wide;
    wide = {s.yGain, s.vToR, s.vToG, s.uToG, s.uToB, {}, {}, {}, {}};
    table.clamp = static_cast<const uint8_t*>(engine_.table);
    table.u = words + engine_.tableOffsets[0];
    table.v = words + engine_.tableOffsets[1];
    table.y = words + engine_.tableOffsets[2];
    for (int c = 0; c < 3; ++c) {
      table.narrowing[c] = wide.narrowing[c] = s.narrowing[c];
      wide.offset[c] = s.offset[c];
      wide.base[c] = s.indexBase[c];
      wide.maximum[c] = s.maximum[c];
      if (clampedCarry_) {
        wide.narrowing[c] = 0;
        wide.base[c] = s.indexBase[c] << s.narrowing[c];
        wide.maximum[c] = 255;
      }
    }
  }

  void PrepareCarry() {
    for (int c = 0; c < 3; ++c) {
      const int32_t bits = int32_t(engine_.dstChannelSize[c]);
      carryShifts_.right[c] = bits < 8 ? 8 - bits : 0;
      carry_.mask[c] = (1 << carryShifts_.right[c]) - 1;
      carry_.remainder[c] = carry_.mask[c] >> 1;
    }
  }

  void SelectColumns(int32_t x) {
    n_ = StripWidth(x);
    source_.SelectColumns(x, n_);
    destination_.SelectColumns(x, n_);
    if (engine_.pathKind == PATH_YUV_TO_RGB && dithers_) {
      source_.SelectChroma(x, nullptr, nullptr, n_);
    } else if (engine_.pathKind == PATH_YUV_TO_RGB) {
      source_.SelectPixelChroma(x, n_);
    } else if (readsPairs_) {
      source_.SelectChromaPairs(x, destination_.uColumns(), destination_.chromaCount());
    } else if (engine_.pathKind == PATH_YUV_TO_YUV) {
      source_.SelectChroma(x, destination_.uColumns(), destination_.vColumns(),
                           destination_.chromaCount());
    } else {
      const int n = destination_.chromaCount();
      uStep_ = CommonStep(destination_.uColumns(), n);
      vStep_ = CommonStep(destination_.vColumns(), n);
      deciding_ = FindDeciding(destination_.uColumns(), n);
      const int step = deciding_.step;
      chromaOfSeconds_ = !job_.has(kPairChroma) && step >= 1 && step <= 2 &&
                         (n == 0 || destination_.uColumns()[deciding_.first] + 1 >= step);
    }
  }

  // YUV at 1:1 becomes pixels in the order of the picture's rows, because strips would read and
  // write a large picture in short pieces, far apart; selecting columns costs nothing there. Where
  // pixels are in place on both sides rows need no buffer and no strips. False where that is not
  // so, and in quarter turns.
  bool ConvertYuvByRows() {
    PlaneWriter& writer = destination_.writer(0);
    if (engine_.pathKind != PATH_YUV_TO_RGB || writer.tiles() || engine_.srcSubsample[1] > 2 ||
        !source_.LumaAdvances(job_.rect.left, Width())) {
      return false;
    }
    const bool inPlace = source_.PixelsLieInPlace(job_.rect.left, Width());
    if (writer.inPlace() && (inPlace || HasGroups())) stripWidth_ = inPlace ? Width() : kCollected;
    mostRows_ = !inPlace           ? 1
                : writer.inPlace() ? INT32_MAX
                : destination_.pixelOrder() == PixelOrder::kMirrored
                    ? ArrangedSamples::kMirrored / stripWidth_
                    : writer.RunsOf(stripWidth_);
    for (int32_t r = job_.rect.top; r < job_.rect.bottom;) {
      int rows = 0;
      for (int32_t x = job_.rect.left; x < job_.rect.right; x += stripWidth_) {
        SelectColumns(x);
        rows = ConvertRows(r);  // the same for all strips
      }
      r += rows;
    }
    return true;
  }

  // Whether all rows of all strips are of whole groups of packed 4:2:2, if strips are of an even
  // width. (Nothing is read but groups then, and strips may be wider than their memory.)
  bool HasGroups() {
    const bool oneImage =
        source_.pitch(1) == source_.pitch(0) && source_.pitch(2) == source_.pitch(0);
    if (Width() % 2 != 0 || !oneImage) return false;
    SelectColumns(job_.rect.left);
    return source_.Groups(job_.rect.top) != nullptr;
  }

  static int CommonStep(const int32_t* columns, int n) {
    const int step = n > 1 ? columns[1] - columns[0] : 1;
    for (int k = 1; k < n; ++k) {
      if (columns[k] - columns[k - 1] != step) return 0;
    }
    return step;
  }

  // Columns that decide chroma, [first, first + n) of them with a common step. Before and after
  // those one may be alone: a block that a picture of an odd width, or one that is mirrored, has
  // half of.
  struct Deciding {
    int first, n, step;
  };
  static Deciding FindDeciding(const int32_t* columns, int n) {
    const bool firstIsAlone = n > 1 && columns[0] == 0 && columns[1] == 2;
    const bool lastIsAlone =
        n > 2 && columns[n - 1] - columns[n - 2] == 1 && columns[n - 2] - columns[n - 3] == 2;
    const int first = firstIsAlone ? 1 : 0;
    const int count = n - first - (lastIsAlone ? 1 : 0);
    return {first, count, CommonStep(columns + first, count)};
  }

  // Stored values at 1:1: planes whose samples correspond one to one on the two sides are copied,
  // or their chroma interleaved or taken apart, in rows as wide as the job.
  void CopyPlanes() {
    const bool unit = engine_.stepX == 0x10000 && engine_.stepY == 0x10000;
    const bool keepsYuv = engine_.pathKind == PATH_YUV_TO_YUV && engine_.dstLayout.isPacked == 0 &&
                          !destination_.exchangesLuma();
    if (!unit || !(keepsYuv || keepsPixels_)) return;
    if (job_.mapsLevels() && !destination_.AllInPlace()) return;
    const PlaneRun luma = destination_.LumaRun();
    if (luma.n > 0) {
      if (source_.LumaLiesInPlace(luma.firstX, luma.n)) {
        CopyPlane(0, luma);
      } else if (TakeGroupsApart(luma)) {
        lumaDone_ = chromaDone_ = true;
        return;
      } else if (!ReadPackedLuma(luma)) {
        return;
      }
    }
    // Chroma never comes before luma: one packed layout has both in the same byte.
    lumaDone_ = true;
    chromaDone_ = !destination_.hasChroma();
    // The block about column 0 is wider than the others.
    if (!chromaDone_ && job_.rect.left >= 0) chromaDone_ = CopyChroma(destination_.ChromaRun());
  }

  // Packed 4:2:2 or 4:4:4 to the same layout, untransformed: groups are copied whole.
  bool CopyGroups() {
    const bool unit = engine_.stepX == 0x10000 && engine_.stepY == 0x10000;
    if (!unit || engine_.pathKind != PATH_YUV_TO_YUV || job_.mapsLevels() ||
        engine_.srcLayout.code != engine_.dstLayout.code || job_.rect.left < 0 ||
        engine_.swapXY != 0 || destination_.hasSpareByte()) {
      return false;
    }
    const PlaneRun luma = destination_.LumaRun();
    if (luma.n <= 0 || !destination_.hasChroma()) return false;
    const PlaneRun chroma = destination_.ChromaRun();
    // The last pixel of a group decides its chroma.
    const int32_t pixels = int32_t(engine_.dstSubsample[1]);
    const bool inPhase = chroma.n > 0 && chroma.firstX == luma.firstX + pixels - 1 &&
                         source_.LumaAdvances(luma.firstX, luma.n) &&
                         source_.ColumnOf(luma.firstX) % pixels == 0;
    if (!inPhase || destination_.GroupsAt(luma, chroma, job_.rect.top) == nullptr) return false;
    for (int32_t r = job_.rect.top; r < job_.rect.bottom; ++r) {
      if (!destination_.ContainsLumaRow(r)) continue;
      const uint8_t* const from =
          source_.LumaAt(luma.firstX, source_.SourceRow(r, 1)) - engine_.srcLayout.yOffset;
      CopyAscending(destination_.GroupsAt(luma, chroma, r), from,
                    size_t(engine_.dstLayout.step[0]) * size_t(luma.n));
    }
    return true;
  }

  // Whether rows of RGB to RGB need no buffer, and so no strips.
  bool RgbLiesInPlace() {
    const bool unit = engine_.stepX == 0x10000 && engine_.stepY == 0x10000;
    return unit && engine_.pathKind == PATH_RGB_TO_RGB && destination_.writer(0).inPlace() &&
           source_.LumaLiesInPlace(job_.rect.left, Width());
  }

  // Whether pixels of RGB keep every bit.
  bool KeepsPixels() const {
    const PixelFormat& from = source_.pixelFormat();
    const PixelFormat& to = destination_.pixelFormat();
    const bool rgb = engine_.pathKind == PATH_RGB_TO_RGB && !clampedCarry_;
    if (!rgb || from.bytes != to.bytes) return false;
    uint32_t bits = from.alphaByte >= 0 ? 8 : 0;
    for (int c = 0; c < 3; ++c) {
      const bool same = from.size[c] == to.size[c] && from.position[c] == to.position[c];
      if (!same || from.size[c] > 8) return false;  // channels have 8 bits
      bits += from.size[c];
    }
    return bits == 8 * uint32_t(from.bytes);
  }

  bool CopyChroma(const PlaneRun& run) {
    if (run.n <= 0) return true;
    if (engine_.srcSubsample[1] != engine_.dstSubsample[1] ||
        engine_.srcLayout.code == CODE_GRAY8 ||
        !source_.ChromaLiesInPlace(run.firstX, run.lastX, run.n)) {
      return false;
    }
    const int from = source_.chromaPairs();
    const int to = destination_.chromaPairs();
    const bool packed = from == 0 && engine_.srcLayout.step[1] != 1;
    if (from == to && !packed) {
      CopyPlane(from == 0 ? 1 : from, run);
      if (from == 0) CopyPlane(2, run);
      return true;
    }
    if (job_.mapsLevels() || !destination_.AllInPlace()) return false;
    if (!packed) {
      ForBlocks(
          1, [&](const PlaneRow& first, int rows) { RearrangeChroma(run, first, rows, from, to); });
      return true;
    }
    for (int32_t r = job_.rect.top; r < job_.rect.bottom; ++r) {
      PlaneRow row;
      if (LocateRow(1, r, &row)) ReadPackedChroma(run, row, to);
    }
    return true;
  }

  // Packed 4:2:2 becomes planes of half as many columns of chroma, luma and chroma of a row at
  // once.
  bool TakeGroupsApart(const PlaneRun& luma) {
    const PlaneLayout& from = engine_.srcLayout;
    // (In one packed layout samples of chroma stand where luma of other pixels is.)
    const bool areGroups = from.step[0] == 2 && from.step[1] == 4 &&
                           (from.uOffset ^ from.vOffset) == 2 &&
                           ((from.uOffset ^ from.yOffset) & 1) == 1;
    if (!areGroups || job_.mapsLevels() || job_.rect.left < 0 || engine_.dstSubsample[1] != 2 ||
        !destination_.hasChroma() || !destination_.AllInPlace()) {
      return false;
    }
    const PlaneRun chroma = destination_.ChromaRun();
    const bool inPhase =
        chroma.n > 0 && luma.n == 2 * chroma.n && chroma.firstX == luma.firstX + 1 &&
        source_.LumaAdvances(luma.firstX, luma.n) && source_.ColumnOf(luma.firstX) % 2 == 0;
    if (!inPhase) return false;
    const bool lumaFirst = from.yOffset == 0;
    const int pairs = from.uOffset < from.vOffset ? 1 : 2;
    for (int32_t r = job_.rect.top; r < job_.rect.bottom; ++r) {
      PlaneRow row, chromaRow;
      const bool hasLuma = LocateRow(0, r, &row);
      const bool hasChroma = LocateRow(1, r, &chromaRow);
      const uint8_t* const groups = source_.LumaAt(luma.firstX, row.source) - from.yOffset;
      uint8_t* const y =
          hasLuma ? destination_.writer(0).Start(luma.column, row.destination, luma.n) : nullptr;
      if (!hasChroma) {
        if (hasLuma) rows_.readStrided(y, groups + from.yOffset, 2, luma.n);
        continue;
      }
      if (hasLuma && destination_.chromaPairs() == 0) {
        const auto start = [&](int plane) {
          return destination_.writer(plane).Start(chroma.column, chromaRow.destination, chroma.n);
        };
        uint8_t* const components[2] = {start(pairs), start(3 - pairs)};
        rows_.splitGroups(y, components, groups, lumaFirst, chroma.n);
        continue;
      }
      for (int i = 0; i < luma.n; i += kStrip) {
        const int n = luma.n - i < kStrip ? luma.n - i : kStrip;
        uint8_t* const samples = hasLuma ? y + i : luma_;
        rows_.deinterleave(lumaFirst ? samples : u_, lumaFirst ? u_ : samples,
                           groups + ptrdiff_t{2} * i, n);
        CopyPairs(chroma.column + i / 2, chromaRow.destination, u_, pairs, n / 2);
      }
    }
    return true;
  }

  // Pairs of chroma (1: U first, 2: V first) as the destination has them.
  void CopyPairs(int64_t column, int64_t row, const uint8_t* samples, int pairs, int n) {
    uint8_t* const first = destination_.writer(1).Start(column, row, n);
    const int to = destination_.chromaPairs();
    if (to == pairs) {
      memcpy(first, samples, size_t{2} * size_t(n));
    } else if (to != 0) {
      rows_.swapPairs(first, samples, n);
    } else {
      uint8_t* const second = destination_.writer(2).Start(column, row, n);
      rows_.deinterleave(pairs == 1 ? first : second, pairs == 1 ? second : first, samples, n);
    }
  }

  // Samples of a packed image become rows of a plane.
  bool ReadPackedLuma(const PlaneRun& run) {
    if (job_.mapsLevels() || !destination_.AllInPlace() ||
        !source_.LumaAdvances(run.firstX, run.n)) {
      return false;
    }
    for (int32_t r = job_.rect.top; r < job_.rect.bottom; ++r) {
      PlaneRow row;
      if (!LocateRow(0, r, &row)) continue;
      rows_.readStrided(destination_.writer(0).Start(run.column, row.destination, run.n),
                        source_.LumaAt(run.firstX, row.source), engine_.srcLayout.step[0], run.n);
    }
    return true;
  }

  void ReadPackedChroma(const PlaneRun& run, const PlaneRow& row, int to) {
    const ptrdiff_t step = engine_.srcLayout.step[1];
    const uint8_t* const u = source_.ChromaAt(1, run.firstX, row.source);
    const uint8_t* const v = source_.ChromaAt(2, run.firstX, row.source);
    uint8_t* const samples = destination_.writer(1).Start(run.column, row.destination, run.n);
    if (to == 0) {
      rows_.readStrided(samples, u, step, run.n);
      rows_.readStrided(destination_.writer(2).Start(run.column, row.destination, run.n), v, step,
                        run.n);
      return;
    }
    for (int i = 0; i < run.n; i += kStrip) {
      const int n = run.n - i < kStrip ? run.n - i : kStrip;
      rows_.readStrided(u_, u + step * i, step, n);
      rows_.readStrided(v_, v + step * i, step, n);
      rows_.interleave(samples + ptrdiff_t{2} * i, to == 1 ? u_ : v_, to == 1 ? v_ : u_, n);
    }
  }

  // Rows without gaps between them, on both sides, are one long row.
  void RearrangeChroma(const PlaneRun& run, const PlaneRow& first, int rows, int from, int to) {
    const bool unbroken =
        source_.pitch(1) == ptrdiff_t{run.n} * (from != 0 ? 2 : 1) &&
        source_.pitch(2) == source_.pitch(1) &&
        destination_.writer(1).rowStep() == ptrdiff_t{run.n} * (to != 0 ? 2 : 1) &&
        (to != 0 || destination_.writer(2).rowStep() == run.n) && run.n <= INT32_MAX / 4 / rows;
    const int n = unbroken ? run.n * rows : run.n;
    for (int i = 0; i < (unbroken ? 1 : rows); ++i) {
      const PlaneRow row = {first.source + i, first.destination + i};
      uint8_t* const a = destination_.writer(1).Start(run.column, row.destination, run.n);
      const uint8_t* const pairs = source_.ChromaAt(from, run.firstX, row.source);
      if (from != 0 && to != 0) {
        rows_.swapPairs(a, pairs, n);
      } else if (to == 0) {
        uint8_t* const b = destination_.writer(2).Start(run.column, row.destination, run.n);
        rows_.deinterleave(from == 1 ? a : b, from == 1 ? b : a, pairs, n);
      } else {
        rows_.interleave(a, source_.ChromaAt(to, run.firstX, row.source),
                         source_.ChromaAt(3 - to, run.firstX, row.source), n);
      }
    }
  }

  // False for rows that write nothing to the plane.
  bool LocateRow(int plane, int32_t r, PlaneRow* row) const {
    if (plane == 0) {
      *row = {source_.SourceRow(r, 1), int64_t(r) - job_.rect.top};
      return destination_.ContainsLumaRow(r);
    }
    *row = {source_.SourceRow(r, engine_.srcSubsample[4]), destination_.ChromaRow(r)};
    return destination_.WritesU(r);
  }

  void CopyPlane(int plane, const PlaneRun& run) {
    ForBlocks(plane, [&](const PlaneRow& first, int rows) { WriteBlock(plane, run, first, rows); });
  }

  // Calls call(first, rows) for rows of a plane that follow each other on both sides.
  template <typename Call>
  void ForBlocks(int plane, const Call& call) const {
    PlaneRow first = {0, 0}, last = {0, 0};
    int32_t top = job_.rect.top;
    int32_t bottom = job_.rect.bottom;
    while (top < bottom && !LocateRow(plane, top, &first)) ++top;
    if (top == bottom) return;
    while (!LocateRow(plane, bottom - 1, &last)) --bottom;
    // From one row to the next the source advances by one at most: when the ends are as far apart
    // on both sides, so is every row between them. (Rows above the image read one further down, and
    // with those the ends never are.)
    const bool sameRows = plane == 0 || engine_.srcSubsample[4] == engine_.dstSubsample[4];
    if (sameRows && last.source - first.source == last.destination - first.destination) {
      call(first, int(last.source - first.source) + 1);
      return;
    }
    int count = 0;
    for (int32_t r = top; r < bottom; ++r) {
      PlaneRow row;
      if (!LocateRow(plane, r, &row)) continue;
      const bool follows =
          row.source == first.source + count && row.destination == first.destination + count;
      if (count > 0 && !follows) {
        call(first, count);
        count = 0;
      }
      if (count == 0) first = row;
      ++count;
    }
    if (count > 0) call(first, count);
  }

  void WriteBlock(int plane, const PlaneRun& run, const PlaneRow& first, int rows) {
    const uint8_t* start = plane == 0 ? source_.LumaAt(run.firstX, first.source)
                                      : source_.ChromaAt(plane, run.firstX, first.source);
    // Chroma pairs are written as plane 1, whichever comes first.
    PlaneWriter& writer = destination_.writer(plane == 2 && pairsWriter() ? 1 : plane);
    if (job_.mapsLevels()) {
      const LevelMap levels = LevelsOf(plane == 0 ? 0 : 1);
      for (int i = 0; i < rows; ++i) {
        uint8_t* const row = writer.Start(run.column, first.destination + i, run.n);
        rows_.mapLevels(row, start + i * source_.pitch(plane), levels, run.n * writer.unit());
      }
      return;
    }
    writer.WriteBlock(run.column, first.destination, start, source_.pitch(plane), run.n, rows);
  }
  bool pairsWriter() const { return destination_.chromaPairs() != 0; }

  // The number of rows done, from r on.
  int ConvertRows(int32_t r) {
    switch (engine_.pathKind) {
      case PATH_YUV_TO_YUV:
        YuvToYuv(r);
        return 1;
      case PATH_YUV_TO_RGB:
        if (!dithers_) return YuvToRgb(r);
        YuvToRgbDithered(r);
        return 1;
      case PATH_RGB_TO_RGB:
        return RgbToRgb(r);
      default:
        RgbToYuv(r);
        return 1;
    }
  }

  LevelMap LevelsOf(int kind) const {
    return {static_cast<const uint8_t*>(engine_.table) + ptrdiff_t{256} * kind,
            engine_.levelSums.gain[kind], engine_.levelSums.offset[kind]};
  }

  const uint8_t* MapLevels(uint8_t* buffer, const uint8_t* run, int kind, int n) const {
    if (!job_.mapsLevels()) return run;
    rows_.mapLevels(buffer, run, LevelsOf(kind), n);
    return buffer;
  }

  void YuvToYuv(int32_t r) {
    if (!lumaDone_) PutLuma(r);
    const int n = destination_.chromaCount();
    if (n == 0 || chromaDone_) return;
    if (readsPairs_) {
      if (destination_.WritesU(r)) PutPairs(r, n);
      return;
    }
    const uint8_t* u =
        destination_.WritesU(r) ? MapLevels(channels_[1], source_.U(r), 1, n) : nullptr;
    const uint8_t* v =
        destination_.WritesV(r) ? MapLevels(channels_[2], source_.V(r), 1, n) : nullptr;
    destination_.PutChroma(r, u, v);
  }

  // Where nothing else has to be done to it luma is read into the destination.
  void PutLuma(int32_t r) {
    const bool plain = !job_.mapsLevels() && !destination_.exchangesLuma() &&
                       !destination_.writesGroups() && destination_.writer(0).inPlace();
    if (!plain) {
      return destination_.PutLuma(r, MapLevels(channels_[0], source_.Luma(r), 0, n_));
    }
    const Destination::PixelRun run = destination_.StartLuma(r);
    if (run.pixels == nullptr) return;
    const uint8_t* const luma = source_.Luma(r, run.n == n_ ? run.pixels : nullptr);
    if (luma != run.pixels) memcpy(run.pixels, luma + run.first, size_t(run.n));
    destination_.FinishLuma();
  }

  // Chroma of a row, both components at once.
  void PutPairs(int32_t r, int n) {
    const int from = source_.chromaPairs();
    const int to = destination_.chromaPairs();
    if (to == 0) {
      const uint8_t* const pairs = source_.ChromaPairs(r, channels_[1]);
      rows_.deinterleave(from == 1 ? u_ : v_, from == 1 ? v_ : u_, pairs, n);
      destination_.PutChroma(r, MapLevels(u_, u_, 1, n), MapLevels(v_, v_, 1, n));
      return;
    }
    uint8_t* const out = destination_.StartChromaPairs(r);
    const uint8_t* const pairs = source_.ChromaPairs(r, from == to ? out : channels_[1]);
    if (from != to) {
      rows_.swapPairs(out, pairs, n);
    } else if (pairs != out) {
      memcpy(out, pairs, size_t{2} * size_t(n));
    }
    MapLevels(out, out, 1, 2 * n);
    destination_.FinishChromaPairs();
  }

  void YuvToRgbDithered(int32_t r) {
    uint8_t* const rgb[3] = {channels_[0], channels_[1], channels_[2]};
    const uint8_t* y = source_.Luma(r);
    const uint8_t* u = source_.U(r);
    const uint8_t* v = source_.V(r);
    if (clampedCarry_) {
      rows_.yuvToRgbWide(rgb, y, u, v, colour_.wide, n_);
      rows_.narrowWithCarry(rgb, rgb, carryShifts_, &carry_, n_);
    } else {
      rows_.yuvToRgbCarry(rgb, y, u, v, colour_.wide, &carry_, n_);
    }
    destination_.PutRgb(r, rgb, nullptr, engine_.dstFormat.colourStandard == 16);
  }

  // The number of rows done: rows that are in place on both sides are converted at once, and short
  // ones that are not are collected, because preparing to convert costs as much as many pixels.
  int YuvToRgb(int32_t r) {
    const int32_t rest = job_.rect.bottom - r;
    int most = destination_.RoomForRows(r, rest < mostRows_ ? rest : mostRows_);
    switch (destination_.pixelOrder()) {
      case PixelOrder::kTurned:
      case PixelOrder::kTurnedBackwards:
        return TurnRows(r, most);
      case PixelOrder::kMirrored: {
        if (most > ArrangedSamples::kMirrored / n_) most = ArrangedSamples::kMirrored / n_;
        const SampleRows rows = ReadRows(r, most);
        const Destination::PixelRun run = destination_.PlacePixels(r, rows.rows);
        if (run.pixels != nullptr) {
          ConvertPixels(run, arranged_.Mirror(FromColumn(rows, run.first), run.n), run.n);
        }
        return rows.rows;
      }
      default: {
        if (const int copies = Copies(r, most); copies > 1) {
          const SampleRows row = ReadRows(r, 1);
          const Destination::PixelRun run = destination_.StartPixels(r, 1, copies);
          if (run.pixels != nullptr) {
            ConvertPixels(run, FromColumn(row, run.first), run.n);
            destination_.FinishPixels();
          }
          return copies;
        }
        const SampleRows rows = ReadRows(r, most);
        const Destination::PixelRun run = destination_.StartPixels(r, rows.rows);
        if (run.pixels != nullptr) {
          ConvertPixels(run, FromColumn(rows, run.first), run.n);
          destination_.FinishPixels();
        }
        return rows.rows;
      }
    }
  }

  // How many of `most` rows from r on are the same pixels, where it pays to make them once. Copies
  // are made of what is in the cache, never of the destination, whose memory may be slow to read.
  int Copies(int32_t r, int most) const {
    constexpr int kWide = 128;  // narrower rows are rather collected
    const bool enlarges = engine_.stepY < 0x10000 && n_ >= kWide && engine_.swapXY == 0;
    return enlarges ? source_.RowsAlike(r, most) : 1;
  }

  // Up to `most` rows from r on.
  SampleRows ReadRows(int32_t r, int most) {
    const uint8_t* const y = source_.LumaInPlace(r);
    if (y != nullptr && source_.ChromaIsInPlace()) {
      const int rows = source_.RowsInPlace(r, most);
      return {y, source_.pitch(0), rows, source_.ChromaOfPixels(r)};
    }
    if (most >= 2 && kCollected / n_ >= 2) return CollectRows(r, most);
    if (const uint8_t* const groups = source_.Groups(r); groups != nullptr) {
      return {memory_, 0, 1, source_.ReadGroups(groups, r, memory_, memory_ + kCollected)};
    }
    return {y != nullptr ? y : source_.Luma(r), 0, 1, source_.ChromaOfPixels(r)};
  }

  SampleRows CollectRows(int32_t r, int most) {
    const int rows = kCollected / n_ < most ? kCollected / n_ : most;
    SampleRows collected = {memory_, n_, rows, {}};
    for (int i = 0; i < rows; ++i) {
      uint8_t* const into = memory_ + ptrdiff_t{i} * n_;
      PixelChroma row;
      if (const uint8_t* const groups = source_.Groups(r + i); groups != nullptr) {
        row = source_.ReadGroups(groups, r + i, into, CollectedChroma(i));
        row.rows.uPitch = row.rows.vPitch = ptrdiff_t{2} * n_;
      } else {
        const uint8_t* const luma = source_.Luma(r + i, into);
        if (luma != into) memcpy(into, luma, size_t(n_));
        if (i > 0 && source_.MakesChromaPairs()) {
          source_.MakeChromaPairs(r + i, CollectedChroma(i));
          continue;
        }
        row = CollectChroma(r + i, i);
      }
      if (i == 0) collected.chroma = row;
    }
    return collected;
  }

  // Quarter turns, a block of rows at a time.
  int TurnRows(int32_t r, int most) {
    constexpr int kRows = ArrangedSamples::kTurnedRows;
    const bool backwards = destination_.pixelOrder() == PixelOrder::kTurnedBackwards;
    const int shared = RowsSharingChroma(r, most < 2 * kRows ? most : 2 * kRows);
    if (shared > 1) {
      arranged_.BeginTurned(n_, 2 * kRows, backwards);
      SampleRows rows = ReadRows(r, shared);
      if (backwards) rows.rows &= ~1;
      arranged_.Append(rows);
    } else {
      arranged_.BeginTurned(n_, kRows, backwards);
      if (most > kRows) most = kRows;
      const bool mayShare = shared == 1;
      do {
        const int32_t next = r + arranged_.count();
        arranged_.Append(CollectRows(next, mayShare ? 1 : most - arranged_.count()));
      } while (arranged_.count() < most &&
               (!mayShare || RowsSharingChroma(r + arranged_.count(), 2) < 2));
    }
    const Destination::PixelRun run = destination_.PlacePixels(r, arranged_.count());
    if (run.pixels != nullptr) {
      SampleRows turned = arranged_.turned();
      turned = FromRow(turned, run.first);
      turned.rows = run.n;
      ConvertPixels(run, turned, arranged_.count());
    }
    return arranged_.count();
  }

  // How many of `most` rows from r on are in place, four pixels to a sample of chroma; 1 when it is
  // not even this one, 0 when none is.
  int RowsSharingChroma(int32_t r, int most) const {
    const bool inPlace = source_.ChromaIsInPlace() && engine_.srcSubsample[1] == 2 &&
                         engine_.srcSubsample[4] == 2 && engine_.stepY == 0x10000;
    return inPlace ? source_.RowsInPlace(r, most) : 0;
  }

  // What is left of rows from a column or row on.
  static SampleRows FromColumn(SampleRows rows, int i) {
    ChromaRows& chroma = rows.chroma.rows;
    const int column = i + rows.chroma.phase;
    rows.y += i;
    chroma.u += ptrdiff_t{column >> chroma.shift} * chroma.step;
    chroma.v += ptrdiff_t{column >> chroma.shift} * chroma.step;
    rows.chroma.phase = column & chroma.shift;
    return rows;
  }
  static SampleRows FromRow(SampleRows rows, int i) {
    ChromaRows& chroma = rows.chroma.rows;
    const int row = i + rows.chroma.rowPhase;
    rows.y += i * rows.yPitch;
    rows.rows -= i;
    chroma.u += (row >> chroma.rowShift) * chroma.uPitch;
    chroma.v += (row >> chroma.rowShift) * chroma.vPitch;
    rows.chroma.rowPhase = row & chroma.rowShift;
    return rows;
  }

  uint8_t* CollectedChroma(int i) { return &memory_[kCollected + ptrdiff_t{i} * 2 * n_]; }

  // Chroma of a row as row i of those collected.
  PixelChroma CollectChroma(int32_t r, int i) {
    uint8_t* const into = CollectedChroma(i);
    PixelChroma chroma = source_.ChromaOfPixels(r, into);
    ChromaRows& rows = chroma.rows;
    if (source_.ChromaIsGrey()) return chroma;
    const size_t samples = size_t(source_.chromaCount());
    const bool isThere = rows.u == into || rows.v == into;
    if (rows.step == 2) {
      const uint8_t* const pairs = rows.u < rows.v ? rows.u : rows.v;
      if (!isThere) memcpy(into, pairs, 2 * samples);
      rows.u = into + (rows.u - pairs);
      rows.v = into + (rows.v - pairs);
    } else if (!isThere) {
      memcpy(into, rows.u, samples);
      memcpy(into + samples, rows.v, samples);
      rows.u = into;
      rows.v = into + samples;
    }
    rows.uPitch = rows.vPitch = ptrdiff_t{2} * n_;
    rows.rowShift = 0;
    return chroma;
  }

  void ConvertPixels(const Destination::PixelRun& run, const SampleRows& rows, int n) {
    // Rows may begin with the second of two pixels that share a sample, and columns likewise.
    for (int row = 0; row < rows.rows;) {
      SampleRows line = FromRow(rows, row);
      if (line.chroma.rowPhase != 0) line.rows = 1;
      for (int i = 0; i < n;) {
        const SampleRows part = FromColumn(line, i);
        const int count = part.chroma.phase != 0 ? 1 : n - i;
        uint8_t* const pixels =
            run.pixels + row * run.pitch + ptrdiff_t{i} * destination_.pixelFormat().bytes;
        rows_.yuvToPixels({pixels, run.pitch, part.y, part.yPitch, part.rows}, part.chroma.rows,
                          colour_, destination_.pixelFormat(), destination_.alphaFill(), count);
        i += count;
      }
      row += line.rows;
    }
  }

  // The number of rows done.
  int RgbToRgb(int32_t r) {
    if (!clampedCarry_ && source_.HasPixels(r)) {
      const int copies = Copies(r, destination_.RoomForRows(r, job_.rect.bottom - r));
      const Destination::PixelRun to = destination_.StartPixels(r, 1, copies);
      if (to.pixels == nullptr) return 1;
      const PixelFormat& from = source_.pixelFormat();
      uint8_t* const into = keepsPixels_ && to.n == n_ ? to.pixels : nullptr;
      const uint8_t* const first = source_.Pixels(r, into) + ptrdiff_t{to.first} * from.bytes;
      if (!keepsPixels_) {
        RepackAscending(to.pixels, first, to.n);
      } else if (first != into) {
        CopyAscending(to.pixels, first, size_t(to.n) * size_t(from.bytes));
      }
      destination_.FinishPixels();
      return copies;
    }
    RgbRun run = source_.Rgb(r);
    if (clampedCarry_) {
      uint8_t* const rgb[3] = {channels_[0], channels_[1], channels_[2]};
      rows_.narrowWithCarry(rgb, run.channel, carryShifts_, &carry_, n_);
      for (int c = 0; c < 3; ++c) run.channel[c] = rgb[c];
    }
    destination_.PutRgb(r, run.channel, run.alpha, clampedCarry_);
    return 1;
  }

  // Rows may be converted where they are: in ascending order of pixels then, several at once where
  // none is written before it is read.
  void RepackAscending(uint8_t* dst, const uint8_t* src, int n) {
    const PixelFormat& from = source_.pixelFormat();
    const PixelFormat& to = destination_.pixelFormat();
    if (!Overlap(dst, size_t(n) * size_t(to.bytes), src, size_t(n) * size_t(from.bytes))) {
      return rows_.repackPixels(dst, src, from, to, n);
    }
    const int most = dst <= src && to.bytes <= from.bytes ? kStrip : 1;
    for (int i = 0; i < n; i += most) {
      const int count = n - i < most ? n - i : most;
      memcpy(memory_, src + ptrdiff_t{i} * from.bytes, size_t(count) * size_t(from.bytes));
      rows_.repackPixels(dst + ptrdiff_t{i} * to.bytes, memory_, from, to, count);
    }
  }

  void RgbToYuv(int32_t r) {
    const bool fromPixels = chromaOfSeconds_ && !source_.hasFields() &&
                            (!destination_.exchangesLuma() || destination_.writesGroups());
    const uint8_t* const pixels = fromPixels ? source_.Pixels(r) : nullptr;
    if (pixels != nullptr) return PixelsToYuv(r, pixels);
    const RgbRun run = source_.Rgb(r);
    const auto tables = static_cast<RgbToYuvTables>(engine_.table);
    rows_.rgbToYuv(luma_, run.channel, tables, n_);
    destination_.PutLuma(r, luma_);
    const int n = destination_.chromaCount();
    if (n == 0) return;
    // Only the pixels that decide a block's chroma are converted.
    const bool writesU = destination_.WritesU(r);
    const bool writesV = destination_.WritesV(r);
    if (writesU) Chroma(u_, run, destination_.uColumns(), uStep_, tables + 3, n);
    if (writesV) Chroma(v_, run, destination_.vColumns(), vStep_, tables + 5, n);
    destination_.PutChroma(r, writesU ? u_ : nullptr, writesV ? v_ : nullptr);
  }

  // The usual case: both components of each pixel, or of the second of each pair of pixels.
  void PixelsToYuv(int32_t r, const uint8_t* pixels) {
    const PixelFormat& format = source_.pixelFormat();
    if (destination_.writesGroups()) {
      rows_.pixelsToYuv(luma_, pixels, format, yuvTables(), n_);
      destination_.PutLuma(r, luma_);
    }
    const Destination::PixelRun run =
        destination_.writesGroups() ? Destination::PixelRun() : destination_.StartLuma(r);
    if (run.pixels != nullptr) {
      rows_.pixelsToYuv(run.pixels, pixels + ptrdiff_t{run.first} * format.bytes, format,
                        yuvTables(), run.n);
      destination_.FinishLuma();
    }
    const int n = destination_.chromaCount();
    if (n == 0 || !destination_.WritesU(r)) return;
    const auto convert = [&](int i, int step, int count) {
      const uint8_t* const from = pixels + ptrdiff_t{destination_.uColumns()[i]} * format.bytes;
      PixelsToChroma(u_ + i, v_ + i, 1, from, step, count);
    };
    const int afterLast = deciding_.first + deciding_.n;
    if (deciding_.first != 0) convert(0, 1, 1);
    convert(deciding_.first, deciding_.step, deciding_.n);
    if (afterLast < n) convert(afterLast, 1, 1);
    destination_.PutChroma(r, u_, v_);
  }

  RgbToYuvTables yuvTables() const { return static_cast<RgbToYuvTables>(engine_.table); }

  // Chroma of every pixel from `first` on, or of every other one (`step` 2).
  void PixelsToChroma(uint8_t* u, uint8_t* v, int sampleStep, const uint8_t* first, int step,
                      int n) {
    const PixelFormat& format = source_.pixelFormat();
    if (step == 2) {
      rows_.pixelPairsToChroma(u, v, sampleStep, first - format.bytes, format, yuvTables(), n);
    } else {
      rows_.pixelsToYuv(u, first, format, yuvTables() + 3, n);
      rows_.pixelsToYuv(v, first, format, yuvTables() + 5, n);
    }
  }

  // Pixels of RGB that are in place on both sides, or become whole groups of packed 4:2:2, become
  // YUV in rows as wide as the job: strips would read a large picture in short pieces, far apart.
  // False where they are not in place.
  bool ConvertRgbInPlace() {
    const bool unit = engine_.stepX == 0x10000 && engine_.stepY == 0x10000;
    if (!unit || engine_.pathKind != PATH_RGB_TO_YUV || job_.has(kPairChroma) ||
        destination_.exchangesLuma() || job_.rect.left < 0 || source_.hasFields()) {
      return false;
    }
    const PlaneRun luma = destination_.LumaRun();
    if (luma.n <= 0 || !source_.LumaLiesInPlace(luma.firstX, luma.n)) return false;
    PlaneRun chroma = {0, 0, 0, 0};
    int step = 0;
    if (destination_.hasChroma()) {
      chroma = destination_.ChromaRun();
      step = int(engine_.dstSubsample[1]);
      const bool inTurn = chroma.n > 0 && step <= 2 && chroma.firstX >= luma.firstX + step - 1 &&
                          chroma.lastX - chroma.firstX == (chroma.n - 1) * step &&
                          chroma.lastX <= luma.lastX;
      if (!inTurn) return false;
    }
    const bool groups = step == 2 && luma.n == 2 * chroma.n && chroma.firstX == luma.firstX + 1 &&
                        destination_.GroupsAt(luma, chroma, job_.rect.top) != nullptr;
    if (!groups && !destination_.AllInPlace()) return false;
    // Of source row 0.
    const uint8_t* const lumaPixels = source_.LumaAt(luma.firstX, 0);
    const uint8_t* const chromaPixels =
        chroma.n > 0 ? source_.LumaAt(chroma.firstX, 0) : lumaPixels;
    int32_t nextLuma = job_.rect.top;
    for (int32_t r = job_.rect.top; r < job_.rect.bottom; ++r) {
      const int32_t row = source_.SourceRow(r, 1);
      if (groups) {
        if (!destination_.ContainsLumaRow(r)) continue;
        ConvertToGroups(destination_.GroupsAt(luma, chroma, r), lumaPixels + source_.pitch(0) * row,
                        luma.n);
        continue;
      }
      if (r == nextLuma) {
        nextLuma += ConvertLumaInPlace(r, lumaPixels + source_.pitch(0) * row, luma);
      }
      if (chroma.n > 0 && destination_.WritesU(r)) {
        ConvertChromaInPlace(r, chromaPixels + source_.pitch(0) * row, chroma, step);
      }
    }
    return true;
  }

  // The number of rows done: short ones without gaps between them are one.
  int ConvertLumaInPlace(int32_t r, const uint8_t* pixels, const PlaneRun& run) {
    constexpr int kShort = 1024;
    if (!destination_.ContainsLumaRow(r)) return 1;
    PlaneWriter& writer = destination_.writer(0);
    int rows = 1;
    if (run.n < kShort && source_.pitch(0) == ptrdiff_t{run.n} * source_.pixelFormat().bytes &&
        writer.rowStep() == run.n) {
      const int32_t rest = job_.rect.bottom - r;
      const int most = rest < 2 * kShort / run.n ? rest : 2 * kShort / run.n;
      const int32_t last = r + most - 1;
      const bool inTurn = destination_.ContainsLumaRow(last) &&
                          source_.SourceRow(last, 1) - source_.SourceRow(r, 1) == most - 1;
      if (inTurn) rows = most;
    }
    rows_.pixelsToYuv(writer.At(run.column, int64_t(r) - job_.rect.top), pixels,
                      source_.pixelFormat(), yuvTables(), run.n * rows);
    return rows;
  }

  // An even number of pixels.
  void ConvertToGroups(uint8_t* groups, const uint8_t* pixels, int n) {
    const PlaneLayout& to = engine_.dstLayout;
    const int uFirst = to.uOffset < to.vOffset ? 1 : 0;
    const bool lumaFirst = to.yOffset == 0;
    for (int i = 0; i < n; i += kStrip) {
      const int count = n - i < kStrip ? n - i : kStrip;
      const uint8_t* const from = pixels + ptrdiff_t{i} * source_.pixelFormat().bytes;
      rows_.pixelsToYuv(luma_, from, source_.pixelFormat(), yuvTables(), count);
      rows_.pixelPairsToChroma(u_ + 1 - uFirst, u_ + uFirst, 2, from, source_.pixelFormat(),
                               yuvTables(), count / 2);
      rows_.interleave(groups + ptrdiff_t{2} * i, lumaFirst ? luma_ : u_, lumaFirst ? u_ : luma_,
                       count);
    }
  }

  void ConvertChromaInPlace(int32_t r, const uint8_t* first, const PlaneRun& run, int step) {
    const int64_t row = destination_.ChromaRow(r);
    uint8_t* const samples = destination_.writer(1).At(run.column, row);
    if (!pairsWriter()) {
      PixelsToChroma(samples, destination_.writer(2).At(run.column, row), 1, first, step, run.n);
      return;
    }
    const bool uFirst = destination_.chromaPairs() == 1;
    if (step == 2) {
      PixelsToChroma(samples + (uFirst ? 0 : 1), samples + (uFirst ? 1 : 0), 2, first, step, run.n);
      return;
    }
    for (int i = 0; i < run.n; i += kStrip) {
      const int n = run.n - i < kStrip ? run.n - i : kStrip;
      PixelsToChroma(u_, v_, 1, first + ptrdiff_t{i} * source_.pixelFormat().bytes, step, n);
      rows_.interleave(samples + ptrdiff_t{2} * i, uFirst ? u_ : v_, uFirst ? v_ : u_, n);
    }
  }

  void Chroma(uint8_t* samples, const RgbRun& run, const int32_t* columns, int step,
              RgbToYuvTables tables, int n) {
    for (int c = 0; c < 3; ++c) {
      if (step != 0) {
        rows_.readStrided(channels_[c], run.channel[c] + columns[0], step, n);
      } else {
        rows_.gather(channels_[c], run.channel[c], columns, n);
      }
    }
    const uint8_t* const picked[3] = {channels_[0], channels_[1], channels_[2]};
    rows_.rgbToYuv(samples, picked, tables, n);
  }

  const Job& job_;
  const RowOps& rows_;
  const EngineContext& engine_;
  Source source_;
  Destination destination_;
  // Runs of samples; or those of short rows, luma and then chroma; or kStrip pixels.
  uint8_t* memory_ = nullptr;
  uint8_t* channels_[3] = {};
  uint8_t *luma_ = nullptr, *u_ = nullptr, *v_ = nullptr;
  int32_t stripWidth_;
  ArrangedSamples arranged_;
  kestrel::YuvToRgb colour_ = {};
  Carry carry_ = {};
  FieldShifts carryShifts_ = {};
  int32_t mostRows_ = INT32_MAX;  // to convert at once
  int n_ = 0;
  // From each column of the strip that decides chroma to the next; 0 when it varies.
  int uStep_ = 0, vStep_ = 0;
  Deciding deciding_ = {0, 0, 0};
  bool chromaOfSeconds_ = false;  // every pixel, or the second of each two, decides
  bool clampedCarry_, dithers_;
  bool keepsPixels_;  // RGB to RGB of the same format
  bool readsPairs_;   // YUV to YUV from pairs of chroma, both components from the same pixel
  bool lumaDone_ = false, chromaDone_ = false;  // by CopyPlanes
  alignas(64) uint8_t stripMemory_[StripMemory::kSize];
};

static_assert(sizeof(Pipeline) < size_t{53} * 1024, "camera threads have small stacks");

}  // namespace

void RunPipeline(const Job& job) {
  if (!IsDrawable(job)) return;
  Pipeline pipeline(job);
  pipeline.Run();
}

}  // namespace kestrel
