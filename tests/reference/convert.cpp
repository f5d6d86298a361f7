// The generic converter: any layout to any layout, one pixel at a time.
#include <algorithm>
#include <cstdint>
#include <initializer_list>
#include <unordered_map>

#include "tests/reference/reference.h"

namespace reference {
namespace {

// A place in the source along one axis: a sample, its neighbour and the neighbour's weight / 65536.
struct Place {
  int64_t index;
  int64_t next;
  int64_t weight;
};

// Bilinear sampling is centre-aligned, nearest corner-aligned.
int64_t Position(bool bilinear, int64_t origin, int64_t step, int64_t distance) {
  return bilinear ? origin * 65536 - 32768 - step / 2 + step * (distance + 1)
                  : origin * 65536 + step * distance;
}

class Source {
 public:
  Source(const Engine& engine, const Rect& loop, const int32_t* pitches,
         const uint8_t* const* planes, const Quirks& quirks)
      : engine_(engine),
        loop_(loop),
        format_(engine.src),
        pitches_(pitches),
        planes_(planes),
        quirks_(quirks),
        blends_(engine.bilinear && !quirks.nearestOnly) {}

  Place Row(int64_t loopRow) const {
    Place place = OwnRow(loopRow);
    if (quirks_.sharedLowerLine && (loopRow - loop_.top) % 2 == 1) {
      const int64_t last = engine_.srcRect.bottom - 1;
      place.next = std::min(OwnRow(loopRow - 1).index + 1, last);
      if (place.index >= last) {
        place.weight = 0;
      }
    }
    return Limited(place, engine_.srcReadBottom);
  }

  Place Column(int64_t loopColumn) const {
    const int64_t position =
        Position(blends_, engine_.srcOriginX, engine_.stepX, loopColumn - engine_.loopOriginX);
    const int64_t first = engine_.srcRect.left;
    const int64_t last = engine_.srcRect.right - 1;
    const int64_t tested =
        quirks_.edgesOfPairs ? loopColumn - (loopColumn - loop_.left) % 2 : loopColumn;
    Place place;
    if (!quirks_.noEdgeColumns && tested < engine_.coveredRect.left) {
      place = {first, first, 0};
    } else if (!quirks_.noEdgeColumns && tested >= engine_.coveredRect.right - 1) {
      place = {last, last, 0};
    } else {
      place = {position >> 16, (position >> 16) + 1, position & 0xFFFF};
      if (quirks_.edgesOfPairs || quirks_.noEdgeColumns) {
        place.index = std::clamp(place.index, first, last);
      }
    }
    return Limited(place, engine_.srcReadRight);
  }

  Triple Pixel(const Place& column, const Place& row) const {
    return format_.IsRgb() ? RgbPixel(column, row) : YuvPixel(column, row);
  }

  // The byte of a 32-bit pixel that the masks leave over.
  // -1 when the pixel has no such byte: then the destination's is not written either.
  int32_t SpareByte(const Place& column, const Place& row) const {
    const int32_t byte = format_.SpareByte();
    if (byte < 0 || byte > 3) {
      return -1;
    }
    return uint8_t(PixelWord(column.index, row.index) >> (8 * byte));
  }

 private:
  Place OwnRow(int64_t loopRow) const {
    const int64_t position = Position(engine_.bilinear, engine_.srcOriginY, engine_.stepY,
                                      loopRow - engine_.loopOriginY);
    const int64_t last = engine_.srcRect.bottom - 1;
    Place place;
    // A 16.16 position against a whole row number: it tells positions above row 0 and nothing else.
    if (position < engine_.srcRect.top) {
      place = {engine_.srcRect.top, engine_.srcRect.top + 1, 0};
    } else {
      place = {position >> 16, (position >> 16) + 1, position & 0xFFFF};
    }
    // Row numbers are unsigned where they are compared: one above the image ends in its last row.
    if (int64_t{uint32_t(place.index)} >= last) {
      place.index = last;
      place.next = last;
    }
    return place;
  }

  // Nothing outside the image is read, whatever the rules above say.
  static Place Limited(Place place, int64_t end) {
    place.index = std::clamp<int64_t>(place.index, 0, end - 1);
    place.next = std::clamp<int64_t>(place.next, 0, end - 1);
    return place;
  }

  int64_t Sample(int component, int64_t column, int64_t row) const {
    column /= format_.horizontal[component];
    row /= format_.vertical[component];
    if (component == kY && format_.HasSwappedLuma()) {
      column ^= 1;
    }
    return planes_[component][row * pitches_[component] + column * format_.step[component]];
  }

  Triple YuvPixel(const Place& column, const Place& row) const {
    Triple yuv;
    yuv[kY] = Interpolated(column, row, [this](int64_t x, int64_t y) { return Sample(kY, x, y); });
    for (int component : {kU, kV}) {
      yuv[component] = format_.IsGrey() ? 128 : Sample(component, column.index, row.index);
    }
    return yuv;
  }

  Triple RgbPixel(const Place& column, const Place& row) const {
    Triple rgb;
    for (int channel : {kRed, kGreen, kBlue}) {
      rgb[channel] = Interpolated(column, row, [this, channel](int64_t x, int64_t y) {
        return format_.palette ? PaletteChannel(channel, x, y) : MaskedChannel(channel, x, y);
      });
    }
    return rgb;
  }

  int64_t PaletteChannel(int channel, int64_t column, int64_t row) const {
    const int64_t bits = format_.bitsPerPixel;
    const int64_t perByte = 8 / bits;
    const int64_t byte = planes_[0][row * pitches_[0] + column / perByte];
    const int64_t fromRight = perByte - 1 - column % perByte;  // leftmost pixel in the top bits
    const int64_t entry = (byte >> (bits * fromRight)) & ((1 << bits) - 1);
    return format_.palette[4 * entry + 2 - channel];
  }

  // The top 8 bits of a channel, narrow channels filled with zeros.
  int64_t MaskedChannel(int channel, int64_t column, int64_t row) const {
    const uint32_t size = format_.maskSize[channel];
    if (size == 0) {
      return 0;
    }
    const uint32_t word = PixelWord(column, row) >> format_.maskPosition[channel];
    return uint32_t(word << (32 - size)) >> 24;
  }

  uint32_t PixelWord(int64_t column, int64_t row) const {
    const uint8_t* bytes = planes_[0] + row * pitches_[0] + column * format_.step[0];
    uint32_t word = 0;
    for (uint32_t i = 0; i < format_.bitsPerPixel / 8; ++i) {
      word |= uint32_t{bytes[i]} << (8 * i);
    }
    return word;
  }

  // Two stages, each truncated; a neighbour of weight 0 is not looked at.
  template <typename SampleAt>
  int64_t Interpolated(const Place& column, const Place& row, SampleAt sampleAt) const {
    if (!blends_) {
      return sampleAt(column.index, row.index);
    }
    const auto along = [&](int64_t y) {
      const int64_t a = sampleAt(column.index, y);
      return column.weight == 0 ? a : Mixed(a, sampleAt(column.next, y), column.weight);
    };
    const int64_t top = along(row.index);
    return row.weight == 0 ? top : Mixed(top, along(row.next), row.weight);
  }

  static int64_t Mixed(int64_t a, int64_t b, int64_t weight) {
    return (a * 65536 + weight * (b - a)) >> 16;
  }

  const Engine& engine_;
  const Rect loop_;
  const Format& format_;
  const int32_t* pitches_;
  const uint8_t* const* planes_;
  const Quirks quirks_;
  const bool blends_;
};

class Destination {
 public:
  Destination(const Engine& engine, const Rect& loop, const int32_t* pitches,
              uint8_t* const* starts, const Quirks& quirks)
      : engine_(engine),
        format_(engine.dst),
        loop_(loop),
        pitches_(pitches),
        starts_(starts),
        quirks_(quirks) {
    // Where in the image the job starts: undo the exchange of axes, then the mirroring.
    Rect image = loop;
    if (engine.swapXY) {
      image = {loop.top, loop.left, loop.bottom, loop.right};
    }
    const Rect& region = engine.dstRegion;
    if (engine.mirrorX) {
      firstX_ = region.left + region.right - image.left - 1;
      imageRight_ = firstX_ + 1;
    } else {
      firstX_ = image.left;
      imageRight_ = image.right;
    }
    firstY_ = engine.mirrorY ? region.top + region.bottom - image.top - 1 : image.top;
  }

  bool StartsInside() const { return firstX_ >= 0 && firstY_ >= 0; }

  void Begin(int64_t loopRow) { loopRow_ = loopRow; }

  // A plane moves on to its next row after the last row of its blocks.
  void End() {
    for (int i = 0; i < 3; ++i) {
      rowsDone_[i] += (loopRow_ + 1) % LoopVertical(i) == 0 ? 1 : 0;
    }
  }

  void WriteRgb(int64_t loopColumn, const Triple& rgb, bool narrowed, int spare) {
    uint32_t word = 0;
    for (int c = 0; c < 3; ++c) {
      const int size = int(format_.maskSize[c]);
      const uint32_t value = uint32_t(rgb[c]);
      const uint32_t field = size > 8   ? value << (size - 8)
                             : narrowed ? value
                                        : value >> (8 - size);
      word |= field << format_.maskPosition[c];
    }
    const uint32_t byteCount = format_.bitsPerPixel / 8;
    if (spare >= 0) {
      const int32_t byte = format_.SpareByte();
      if (byte >= 0 && byte <= 3) {
        word = (word & ~(uint32_t{255} << (8 * byte))) | (uint32_t(spare) << (8 * byte));
      }
    }
    uint8_t* const pixel = At(0, loopColumn - loop_.left, loopRow_ - loop_.top);
    for (uint32_t i = 0; pixel && i < byteCount; ++i) {
      pixel[i] = uint8_t(word >> (8 * i));
    }
  }

  void WriteYuv(int64_t loopColumn, const Triple& yuv) {
    Store(LumaAt(loopColumn), yuv[kY]);
    if (format_.IsGrey()) {
      return;
    }
    for (int i : {kU, kV}) {
      const int64_t factor = engine_.swapXY ? format_.vertical[i] : format_.horizontal[i];
      const int64_t along = format_.code == CODE_YUYV ? (loopColumn - loop_.left) / factor
                                                      : loopColumn / factor - loop_.left / factor;
      uint8_t* const address = At(i, along, rowsDone_[i]);
      if (!quirks_.chromaOfPairs || GivesChroma(i, address, ImageColumn(loopColumn))) {
        Store(address, yuv[i]);
      }
    }
  }

 private:
  int64_t LoopVertical(int plane) const {
    return engine_.swapXY ? format_.horizontal[plane] : format_.vertical[plane];
  }

  int64_t ImageColumn(int64_t loopColumn) const {
    const int64_t dx = engine_.swapXY ? loopRow_ - loop_.top : loopColumn - loop_.left;
    return firstX_ + (engine_.mirrorX ? -dx : dx);
  }

  // Among the pixels that share a group the first in memory gives U, the last gives V.
  bool GivesChroma(int component, const uint8_t* address, int64_t imageColumn) {
    const auto [known, isNew] = chromaColumns_.try_emplace(address, imageColumn);
    if (!isNew && (component == kU ? imageColumn > known->second : imageColumn < known->second)) {
      return false;
    }
    known->second = imageColumn;
    return true;
  }

  uint8_t* LumaAt(int64_t loopColumn) {
    if (!format_.HasSwappedLuma()) {
      return At(kY, loopColumn - loop_.left, rowsDone_[kY]);
    }
    // The two lumas of a pair change places along the true rows of the image.
    const int64_t across = loopColumn - loop_.left;
    const int64_t along = rowsDone_[kY];
    const int64_t dx =
        engine_.swapXY ? along + (loopRow_ % 2 == 0 ? 1 : -1) : (loopColumn ^ 1) - loop_.left;
    const int64_t column = firstX_ + (engine_.mirrorX ? -dx : dx);
    const int64_t groupsEnd = (std::max(engine_.dstImageRight, imageRight_) + 1) / 2 * 2;
    if (column >= groupsEnd) {
      return nullptr;
    }
    return engine_.swapXY ? At(kY, across, dx) : At(kY, dx, along);
  }

  // Address of the sample that lies so many loop columns and rows after the first one of a plane;
  // null when it lies before the first column or row of the plane.
  uint8_t* At(int plane, int64_t loopColumns, int64_t loopRows) const {
    const int64_t dx = engine_.swapXY ? loopRows : loopColumns;
    const int64_t dy = engine_.swapXY ? loopColumns : loopRows;
    const int64_t columns = engine_.mirrorX ? -dx : dx;
    const int64_t rows = engine_.mirrorY ? -dy : dy;
    if (firstX_ / format_.horizontal[plane] + columns < 0 ||
        firstY_ / format_.vertical[plane] + rows < 0) {
      return nullptr;
    }
    // The pitch handed in is already negated under mirrorY.
    return starts_[plane] + columns * format_.step[plane] + dy * pitches_[plane];
  }

  static void Store(uint8_t* address, int64_t value) {
    if (address) {
      *address = uint8_t(value);
    }
  }

  const Engine& engine_;
  const Format& format_;
  const Rect loop_;
  const int32_t* pitches_;
  uint8_t* const* starts_;
  const Quirks quirks_;
  // Image column that each sample came from.
  std::unordered_map<const uint8_t*, int64_t> chromaColumns_;
  int64_t firstX_;  // image coordinates of the first pixel
  int64_t firstY_;
  int64_t imageRight_;
  int64_t loopRow_ = 0;
  int64_t rowsDone_[3] = {0, 0, 0};
};

}  // namespace

void ConvertLoopRect(const Engine& engine, const Rect& loopRect, const int32_t* dstPitches,
                     const int32_t* srcPitches, uint8_t* const* dstStarts,
                     const uint8_t* const* srcPlanes, const Quirks& quirks) {
  if (loopRect.IsEmpty() || engine.sourceIsEmpty || engine.srcReadRight < 1 ||
      engine.srcReadBottom < 1) {
    return;
  }
  const Source source(engine, loopRect, srcPitches, srcPlanes, quirks);
  Destination destination(engine, loopRect, dstPitches, dstStarts, quirks);
  const bool changesLevels = engine.changesLevels && !quirks.storedLevels;
  if (!destination.StartsInside()) {
    return;
  }
  const bool toRgb16 = engine.dst.IsRgb() && engine.dst.bitsPerPixel == 16;
  const bool carriesClamped =
      toRgb16 && quirks.clampedCarry && (quirks.carriesAlways || engine.dither);
  ClampedCarry clampedCarry(engine.dst);
  YuvToRgb::Carry carry = engine.yuvToRgb.StartCarry(engine.dither && !quirks.noDither);
  const bool narrowed =
      carriesClamped || (engine.path == ColourPath::kYuvToRgb && toRgb16 && !quirks.sixBitMatrix);

  for (int64_t y = loopRect.top; y < loopRect.bottom; ++y) {
    const Place row = source.Row(y);
    destination.Begin(y);
    for (int64_t x = loopRect.left; x < loopRect.right; ++x) {
      const Place column = source.Column(x);
      Triple pixel = source.Pixel(column, row);
      switch (engine.path) {
        case ColourPath::kYuvToYuv:
          destination.WriteYuv(x, changesLevels ? engine.levels.Convert(pixel) : pixel);
          break;
        case ColourPath::kRgbToYuv:
          destination.WriteYuv(x, RgbToYuv(pixel, engine.dst.standard));
          break;
        case ColourPath::kYuvToRgb:
          pixel = quirks.sixBitMatrix ? SixBitYuvToRgb(pixel)
                  : carriesClamped    ? clampedCarry.Narrow(engine.yuvToRgb.ConvertTo8Bits(pixel))
                                      : engine.yuvToRgb.Convert(pixel, &carry);
          destination.WriteRgb(x, pixel, narrowed,
                               engine.dst.bitsPerPixel == 32 ? engine.alpha : -1);
          break;
        case ColourPath::kRgbToRgb: {
          if (carriesClamped) {
            pixel = clampedCarry.Narrow(pixel);
          }
          const bool copiesSpare = engine.dst.bitsPerPixel == 32 && engine.src.bitsPerPixel == 32;
          destination.WriteRgb(x, pixel, narrowed,
                               copiesSpare ? source.SpareByte(column, row) : -1);
          break;
        }
      }
    }
    destination.End();
  }
}

}  // namespace reference
