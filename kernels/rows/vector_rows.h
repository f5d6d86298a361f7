// Row operations on vectors, for any instruction set: the file that includes this has included
// vector_x86.h or vector_neon.h before. In an unnamed namespace, as those are.
#ifndef KESTREL_KERNELS_ROWS_VECTOR_ROWS_H
#define KESTREL_KERNELS_ROWS_VECTOR_ROWS_H

#include <string.h>

#include "kernels/rows/rows_scalar.h"

namespace kestrel {
namespace {

// ---- Runs of any length
// Part of a run with room for a whole vector of units.
struct Units {
  const uint8_t* start;
  int unit;
  const uint8_t* At(int i) const { return start + ptrdiff_t{i} * unit; }
};
class Rest {
 public:
  Rest(const Units& source, int i, int n) {
    memcpy(bytes_, source.At(i), size_t(n - i) * size_t(source.unit));
  }
  const uint8_t* bytes() const { return bytes_; }

 private:
  uint8_t bytes_[8 * kBytes] = {};
};

// Calls block(destinations, sources...) for each kBytes units of a run; the last ones go through
// copies, so that nothing beyond the run is touched.
template <int kDstUnit, int kDsts, typename Block, typename... Sources>
inline void ForRun(uint8_t* const (&dst)[kDsts], int n, const Block& block, Sources... sources) {
  uint8_t* at[kDsts];
  int i = 0;
  for (; i + kBytes <= n; i += kBytes) {
    for (int d = 0; d < kDsts; ++d) at[d] = dst[d] + i * kDstUnit;
    block(at, sources.At(i)...);
  }
  if (i == n) return;
  uint8_t rest[kDsts][kDstUnit * kBytes];
  for (int d = 0; d < kDsts; ++d) at[d] = rest[d];
  block(at, Rest(sources, i, n).bytes()...);
  for (int d = 0; d < kDsts; ++d) {
    memcpy(dst[d] + i * kDstUnit, rest[d], size_t(n - i) * kDstUnit);
  }
}

// ---- Resampling
inline Words Blend(Words a, Words b, Words weights) {
  const Words difference = b - a;
  // Weights are unsigned: one of 0.5 and more counts as itself less one.
  return a + MultiplyHigh(difference, weights) + (difference & ShiftRight<15>(weights));
}

void BlendColumns(uint8_t* dst, const uint8_t* a, const uint8_t* b, const uint16_t* weights,
                  int n) {
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* inA, const uint8_t* inB, const uint8_t* inWeights) {
        const WordsPair first = Widen(LoadBytes(inA));
        const WordsPair second = Widen(LoadBytes(inB));
        const WordsPair w = LoadPixelWords(inWeights);
        StoreBytes(out[0], Narrow(Blend(first.low, second.low, w.low),
                                  Blend(first.high, second.high, w.high)));
      },
      Units{a, 1}, Units{b, 1}, Units{reinterpret_cast<const uint8_t*>(weights), 2});
}

void BlendRows(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight, int n) {
  const Words w = SetWords(int(weight));
  const bool fromSecond = weight >= 32768;
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, n,
      [=](uint8_t* const* out, const uint8_t* inA, const uint8_t* inB) {
        const WordsPair first = Widen(LoadBytes(inA));
        const WordsPair second = Widen(LoadBytes(inB));
        const WordsPair& base = fromSecond ? second : first;
        StoreBytes(out[0], Narrow(base.low + MultiplyHigh(second.low - first.low, w),
                                  base.high + MultiplyHigh(second.high - first.high, w)));
      },
      Units{a, 1}, Units{b, 1});
}

constexpr int kGroup = 4;  // pairs that share a window
constexpr int kNoWindow = -1;

void PlanPairs(PairPlan* plan) {
  const int n = plan->n;
  if (n == 0) return;
  int32_t lowest = INT32_MAX;
  int32_t end = 0;
  for (int i = 0; i < n; ++i) {
    const int32_t offsets[2] = {plan->first[i * plan->stride], plan->second[i * plan->stride]};
    for (const int32_t offset : offsets) {
      if (offset < lowest) lowest = offset;
      if (offset >= end) end = offset + 1;
    }
  }
  const int groups = (n + kWords - 1) / kWords * (kWords / kGroup);
  for (int g = 0; g < groups; ++g) {
    int32_t offsets[2 * kGroup];
    int32_t window = INT32_MAX;
    int32_t last = 0;
    for (int i = 0; i < kGroup; ++i) {
      const int pair = g * kGroup + i < n ? g * kGroup + i : n - 1;
      offsets[2 * i] = plan->first[pair * plan->stride];
      offsets[2 * i + 1] = plan->second[pair * plan->stride];
      for (int k = 2 * i; k < 2 * i + 2; ++k) {
        if (offsets[k] < window) window = offsets[k];
        if (offsets[k] > last) last = offsets[k];
      }
    }
    // No window reaches beyond the bytes that the run reads anyway.
    if (window > end - 16) window = end - 16;
    const bool fits = window >= lowest && last - window < 16;
    plan->window[g] = fits ? window : kNoWindow;
    for (int k = 0; k < 2 * kGroup; ++k) {
      plan->shuffle[g][k] = uint8_t(fits ? offsets[k] - window : 0);
    }
  }
}

inline bool HasWindows(const PairPlan& plan, int i) {
  int32_t windows = 0;
  for (int g = i / kGroup; g < (i + kWords) / kGroup; ++g) windows |= plan.window[g];
  return windows >= 0;
}

// Calls block(i, pairs) for each kWords pairs that have windows, other(i, end) for all others and
// for those that do not fill a vector.
template <typename Block, typename Other>
inline void ForPairs(const uint8_t* src, const PairPlan& plan, const Block& block,
                     const Other& other) {
  int i = 0;
  for (; i + kWords <= plan.n; i += kWords) {
    if (HasWindows(plan, i)) {
      block(i, GatherPairs(src, plan.window + i / kGroup, plan.shuffle + i / kGroup));
    } else {
      other(i, i + kWords);
    }
  }
  other(i, plan.n);
}

void ReadPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan) {
  ForPairs(
      src, plan, [=](int i, Words pairs) { StoreWords(dst + 2 * i, pairs); },
      [=, &plan](int i, int end) { scalar::ReadSomePairs(dst, src, plan, i, end); });
}

void BlendPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan) {
  ForPairs(
      src, plan,
      [=, &plan](int i, Words pairs) {
        StoreHalf(dst + i, Blend(pairs & SetWords(0xFF), ShiftRightUnsigned<8>(pairs),
                                 LoadWords(plan.weights + i)));
      },
      [=, &plan](int i, int end) { scalar::BlendSomePairs(dst, src, plan, i, end); });
}

// ---- Packed pixels
// Which of the layouts that vectors know a format is.
struct PixelShape {
  explicit PixelShape(const PixelFormat& format) {
    const uint32_t* at = format.position;
    const uint32_t* size = format.size;
    blueFirst = at[0] > at[2];
    alphaFirst = format.alphaByte == 0;
    const uint32_t lowest = blueFirst ? at[2] : at[0];
    const uint32_t highest = blueFirst ? at[0] : at[2];
    const bool bytesInTurn = format.wholeBytes && at[1] == lowest + 8 && highest == at[1] + 8 &&
                             lowest == (alphaFirst ? 8 : 0);
    const bool is565 =
        size[0] == 5 && size[1] == 6 && size[2] == 5 && lowest == 0 && at[1] == 5 && highest == 11;
    if (format.bytes == 4 || format.bytes == 3) {
      bytes = bytesInTurn ? format.bytes : 0;
    } else {
      bytes = format.bytes == 2 && is565 ? 2 : 0;
    }
  }
  int bytes;  // 0: none of them
  bool blueFirst, alphaFirst;
};

// Pixels of 5, 6 and 5 bits from channels whose fields are in the top bits, or in the lowest.
inline Words Pack565(Words low, Words green, Words high) {
  return ShiftRightUnsigned<3>(low) | ShiftLeft<3>(green & SetWords(0xFC)) |
         ShiftLeft<8>(high & SetWords(0xF8));
}
inline Words PackFields565(Words low, Words green, Words high) {
  return low | ShiftLeft<5>(green) | ShiftLeft<11>(high);
}

inline void StorePixels(uint8_t* dst, const PixelShape& shape, Bytes r, Bytes g, Bytes b,
                        Bytes alpha) {
  const Bytes low = shape.blueFirst ? b : r;
  const Bytes high = shape.blueFirst ? r : b;
  if (shape.bytes == 4) {
    if (shape.alphaFirst) {
      Store4(dst, alpha, low, g, high);
    } else {
      Store4(dst, low, g, high, alpha);
    }
  } else if (shape.bytes == 3) {
    Store3(dst, low, g, high);
  } else {
    const WordsPair l = Widen(low);
    const WordsPair m = Widen(g);
    const WordsPair h = Widen(high);
    StorePixelWords(dst, {Pack565(l.low, m.low, h.low), Pack565(l.high, m.high, h.high)});
  }
}

inline uint8_t AlphaOf(const PixelShape& shape, AlphaFill alpha) {
  return uint8_t(shape.alphaFirst ? alpha.bits : alpha.bits >> 24);
}

void PackRgb(uint8_t* dst, const uint8_t* const rgb[3], const PixelFormat& format,
             const FieldShifts& shifts, AlphaFill alpha, int n) {
  const PixelShape shape(format);
  const Bytes fill = SetBytes(AlphaOf(shape, alpha));
  uint8_t* const dsts[] = {dst};
  const Units r = {rgb[0], 1};
  const Units g = {rgb[1], 1};
  const Units b = {rgb[2], 1};
  const auto store = [&](uint8_t* const* out, const uint8_t* inR, const uint8_t* inG,
                         const uint8_t* inB) {
    StorePixels(out[0], shape, LoadBytes(inR), LoadBytes(inG), LoadBytes(inB), fill);
  };
  if (shape.bytes == 4) return ForRun<4>(dsts, n, store, r, g, b);
  if (shape.bytes == 3) return ForRun<3>(dsts, n, store, r, g, b);
  if (shape.bytes == 2 && shifts.right[0] == 3) return ForRun<2>(dsts, n, store, r, g, b);
  if (shape.bytes != 2 || shifts.right[0] != 0) {
    return scalar::PackRgb(dst, rgb, format, shifts, alpha, n);
  }
  ForRun<2>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* inLow, const uint8_t* inG, const uint8_t* inHigh) {
        const WordsPair l = Widen(LoadBytes(inLow));
        const WordsPair m = Widen(LoadBytes(inG));
        const WordsPair h = Widen(LoadBytes(inHigh));
        StorePixelWords(
            out[0], {PackFields565(l.low, m.low, h.low), PackFields565(l.high, m.high, h.high)});
      },
      shape.blueFirst ? b : r, g, shape.blueFirst ? r : b);
}

// The bytes of kBytes pixels' channels.
struct PixelBytes {
  Bytes r, g, b, alpha;
};
inline PixelBytes LoadPixels(const uint8_t* src, const PixelShape& shape) {
  Bytes low, middle, high;
  Bytes alpha = SetBytes(0);
  if (shape.bytes == 4) {
    Bytes channels[4];
    Load4(src, channels);
    low = shape.alphaFirst ? channels[1] : channels[0];
    middle = shape.alphaFirst ? channels[2] : channels[1];
    high = shape.alphaFirst ? channels[3] : channels[2];
    alpha = shape.alphaFirst ? channels[0] : channels[3];
  } else if (shape.bytes == 3) {
    Bytes channels[3];
    Load3(src, channels);
    low = channels[0];
    middle = channels[1];
    high = channels[2];
  } else {
    const WordsPair w = LoadPixelWords(src);
    const Words five = SetWords(0xF8);
    const Words six = SetWords(0xFC);
    low = Narrow(ShiftLeft<3>(w.low) & five, ShiftLeft<3>(w.high) & five);
    middle = Narrow(ShiftRightUnsigned<3>(w.low) & six, ShiftRightUnsigned<3>(w.high) & six);
    high = Narrow(ShiftRightUnsigned<8>(w.low) & five, ShiftRightUnsigned<8>(w.high) & five);
  }
  return {shape.blueFirst ? high : low, middle, shape.blueFirst ? low : high, alpha};
}

void UnpackRgb(uint8_t* const rgb[3], const uint8_t* src, const PixelFormat& format, int n) {
  const PixelShape shape(format);
  if (shape.bytes == 0) return scalar::UnpackRgb(rgb, src, format, n);
  uint8_t* const dsts[] = {rgb[0], rgb[1], rgb[2]};
  ForRun<1>(
      dsts, n,
      [&](uint8_t* const* out, const uint8_t* in) {
        const PixelBytes pixels = LoadPixels(in, shape);
        StoreBytes(out[0], pixels.r);
        StoreBytes(out[1], pixels.g);
        StoreBytes(out[2], pixels.b);
      },
      Units{src, shape.bytes});
}

void RepackPixels(uint8_t* dst, const uint8_t* src, const PixelFormat& from, const PixelFormat& to,
                  int n) {
  const PixelShape in(from);
  const PixelShape out(to);
  if (in.bytes == 0 || out.bytes == 0) return scalar::RepackPixels(dst, src, from, to, n);
  uint8_t* const dsts[] = {dst};
  const auto repack = [&](uint8_t* const* pixelsOut, const uint8_t* pixelsIn) {
    const PixelBytes pixels = LoadPixels(pixelsIn, in);
    StorePixels(pixelsOut[0], out, pixels.r, pixels.g, pixels.b, pixels.alpha);
  };
  const Units pixels = {src, in.bytes};
  if (out.bytes == 4) {
    ForRun<4>(dsts, n, repack, pixels);
  } else if (out.bytes == 3) {
    ForRun<3>(dsts, n, repack, pixels);
  } else {
    ForRun<2>(dsts, n, repack, pixels);
  }
}

void UnpackAlpha(uint8_t* alpha, const uint8_t* src, const PixelFormat& format, int n) {
  if (format.bytes != 4) return scalar::UnpackAlpha(alpha, src, format, n);
  const int byte = format.alphaByte;
  uint8_t* const dsts[] = {alpha};
  ForRun<1>(
      dsts, n,
      [=](uint8_t* const* out, const uint8_t* in) {
        Bytes channels[4];
        Load4(in, channels);
        StoreBytes(out[0], channels[byte]);
      },
      Units{src, 4});
}

// ---- YUV to RGB
// floor((offset + c * gain) / 4096) of words c, modulo 65536: a sum with four fractional bits.
class ChromaWord {
 public:
  ChromaWord(int32_t gain, int32_t offset)
      : high_(SetWords(gain >> 12)),
        low_(SetWords(gain & 4095)),
        offset_(SetWords(offset >> 12)),
        carry_(PrepareCarry(SetWords((offset & 4095) << 4))) {}
  // times16: 16 * c.
  Words Of(Words c, Words times16) const {
    const Product low = Multiply(times16, low_);
    return c * high_ + low.high + offset_ - CarryOf(low.low, carry_);
  }

 private:
  Words high_, low_, offset_, carry_;
};

// What chroma adds to luma, as words of pixels or of chroma samples.
template <YuvToRgbForm kForm>
struct ChromaTerms {
  static constexpr int kCount = kForm == YuvToRgbForm::kTable ? 5 : 3;
  // R, G, B; then what carries into R and B.
  Words term[kCount];
};

template <YuvToRgbForm kForm>
class ColourStage {
 public:
  explicit ColourStage(const YuvToRgbWide& s)
      : red_(s.vToR, s.offset[0] - Base(s, 0)),
        greenV_(s.vToG, s.offset[1]),
        greenU_(s.uToG, 0),
        blue_(s.uToB, s.offset[2] - Base(s, 2)),
        greenBase_(SetWords(Base(s, 1) >> 12)),
        lumaWhole_(SetWords(s.yGain >> 12)),
        lumaPart_(SetWords(s.yGain << 4 & 0xFFFF)) {}

  ChromaTerms<kForm> Terms(Words u, Words v) const {
    if constexpr (kForm == YuvToRgbForm::kSixBits) {
      return {{ShiftRight<6>(v * SetWords(90) - SetWords(11485)),
               ShiftRight<6>(SetWords(8669) - v * SetWords(46) - u * SetWords(22)),
               ShiftRight<6>(u * SetWords(113) - SetWords(14516))}};
    } else {
      const Words u16 = ShiftLeft<4>(u);
      const Words v16 = ShiftLeft<4>(v);
      const Words red = red_.Of(v, v16);
      const Words blue = blue_.Of(u, u16);
      const Words greenV = greenV_.Of(v, v16);
      const Words greenU = greenU_.Of(u, u16);
      const Words green = greenU + greenV - greenBase_;
      if constexpr (kForm == YuvToRgbForm::kWholeLuma) {
        return {{ShiftRight<4>(red), ShiftRight<4>(green), ShiftRight<4>(blue)}};
      } else {
        // The low halves of the words of V and U are what G takes of them.
        return {{red, green, blue, PrepareCarry(greenV), PrepareCarry(greenU)}};
      }
    }
  }

  struct Rgb {
    Words channel[3];
  };
  Rgb Add(Words y, const ChromaTerms<kForm>& terms) const {
    const Words* t = terms.term;
    if constexpr (kForm == YuvToRgbForm::kTable) {
      const Product part = Multiply(y, lumaPart_);
      const Words luma = y * lumaWhole_ + part.high;
      return {{ShiftRight<4>(luma + t[0] - CarryOf(part.low, t[3])), ShiftRight<4>(luma + t[1]),
               ShiftRight<4>(luma + t[2] - CarryOf(part.low, t[4]))}};
    } else {
      return {{y + t[0], y + t[1], y + t[2]}};
    }
  }

 private:
  // Where value 0 of a channel lies in the clamp table, as part of its offset.
  static int32_t Base(const YuvToRgbWide& s, int c) { return s.base[c] << (s.narrowing[c] + 16); }

  ChromaWord red_, greenV_, greenU_, blue_;
  Words greenBase_, lumaWhole_, lumaPart_;
};

template <YuvToRgbForm kForm, bool kHalf>
class PixelConverter {
 public:
  PixelConverter(const ChromaRows& chroma, const YuvToRgb& colour, const PixelShape& shape,
                 uint8_t alpha)
      : stage_(colour.wide),
        shape_(shape),
        alpha_(SetBytes(alpha)),
        unit_(shape.bytes),
        step_(chroma.step),
        uFirst_(chroma.u < chroma.v) {}

  // Rows that share chroma, one or two.
  struct Lines {
    uint8_t* dst;
    ptrdiff_t dstPitch;
    const uint8_t* y;
    ptrdiff_t yPitch;
    const uint8_t* u;
    const uint8_t* v;
    int count;
  };

  void Convert(const Lines& lines, int n) const {
    int i = 0;
    for (; i + kBytes <= n; i += kBytes) ConvertVector(At(lines, i));
    if (i == n) return;
    // The last vector reaches back over pixels that are done already, unless it would tear a pair.
    const int last = n - kBytes;
    if (last >= 0 && (!kHalf || last % 2 == 0)) {
      ConvertVector(At(lines, last));
    } else {
      ConvertRest(At(lines, i), n - i);
    }
  }

 private:
  Lines At(const Lines& lines, int i) const {
    const ptrdiff_t sample = ptrdiff_t{kHalf ? i / 2 : i} * step_;
    return {lines.dst + ptrdiff_t{i} * unit_,
            lines.dstPitch,
            lines.y + i,
            lines.yPitch,
            lines.u + sample,
            lines.v + sample,
            lines.count};
  }

  void ConvertRest(const Lines& lines, int n) const {
    uint8_t y[2][kBytes] = {};
    uint8_t chroma[2][2 * kBytes] = {};
    uint8_t pixels[2][4 * kBytes];
    for (int row = 0; row < lines.count; ++row) {
      memcpy(y[row], lines.y + row * lines.yPitch, size_t(n));
    }
    const size_t samples = size_t(kHalf ? (n + 1) / 2 : n);
    Lines rest = {pixels[0], sizeof(pixels[0]), y[0],       sizeof(y[0]),
                  chroma[0], chroma[1],         lines.count};
    if (step_ == 1) {
      memcpy(chroma[0], lines.u, samples);
      memcpy(chroma[1], lines.v, samples);
    } else {
      memcpy(chroma, uFirst_ ? lines.u : lines.v, 2 * samples);
      rest.u = chroma[0] + (uFirst_ ? 0 : 1);
      rest.v = chroma[0] + (uFirst_ ? 1 : 0);
    }
    ConvertVector(rest);
    for (int row = 0; row < lines.count; ++row) {
      memcpy(lines.dst + row * lines.dstPitch, pixels[row], size_t(n) * size_t(unit_));
    }
  }

  void ConvertVector(const Lines& lines) const {
    ChromaTerms<kForm> low, high;
    LoadTerms(lines.u, lines.v, &low, &high);
    ConvertLine(lines.dst, lines.y, low, high);
    if (lines.count == 2) {
      ConvertLine(lines.dst + lines.dstPitch, lines.y + lines.yPitch, low, high);
    }
  }

  void ConvertLine(uint8_t* dst, const uint8_t* y, const ChromaTerms<kForm>& low,
                   const ChromaTerms<kForm>& high) const {
    const WordsPair luma = Widen(LoadBytes(y));
    const auto a = stage_.Add(luma.low, low);
    const auto b = stage_.Add(luma.high, high);
    StorePixels(dst, shape_, Narrow(a.channel[0], b.channel[0]), Narrow(a.channel[1], b.channel[1]),
                Narrow(a.channel[2], b.channel[2]), alpha_);
  }

  void LoadTerms(const uint8_t* inU, const uint8_t* inV, ChromaTerms<kForm>* low,
                 ChromaTerms<kForm>* high) const {
    const uint8_t* const pairs = uFirst_ ? inU : inV;
    if constexpr (kHalf) {
      Words u, v;
      if (step_ == 1) {
        u = LoadHalf(inU);
        v = LoadHalf(inV);
      } else {
        const Words both = LoadWords(pairs);
        const Words first = both & SetWords(0xFF);
        const Words second = ShiftRightUnsigned<8>(both);
        u = uFirst_ ? first : second;
        v = uFirst_ ? second : first;
      }
      const ChromaTerms<kForm> terms = stage_.Terms(u, v);
      for (int k = 0; k < ChromaTerms<kForm>::kCount; ++k) {
        const WordsPair twice = Double(terms.term[k]);
        low->term[k] = twice.low;
        high->term[k] = twice.high;
      }
    } else {
      Bytes first, second;
      if (step_ == 1) {
        first = LoadBytes(inU);
        second = LoadBytes(inV);
      } else {
        Load2(pairs, &first, &second);
      }
      const bool exchanged = step_ != 1 && !uFirst_;
      const WordsPair u = Widen(exchanged ? second : first);
      const WordsPair v = Widen(exchanged ? first : second);
      *low = stage_.Terms(u.low, v.low);
      *high = stage_.Terms(u.high, v.high);
    }
  }

  const ColourStage<kForm> stage_;
  const PixelShape shape_;
  const Bytes alpha_;
  const int unit_;
  const int step_;
  const bool uFirst_;
};

template <YuvToRgbForm kForm, bool kHalf>
void ConvertRows(const PixelRows& rows, const ChromaRows& chroma, const YuvToRgb& colour,
                 const PixelShape& shape, uint8_t alpha, int n) {
  const PixelConverter<kForm, kHalf> converter(chroma, colour, shape, alpha);
  const int share = 1 << chroma.rowShift;
  for (int row = 0; row < rows.rows; row += share) {
    const int chromaRow = row >> chroma.rowShift;
    const int count = rows.rows - row < share ? 1 : share;
    converter.Convert(
        {rows.dst + row * rows.dstPitch, rows.dstPitch, rows.y + row * rows.yPitch, rows.yPitch,
         chroma.u + chromaRow * chroma.uPitch, chroma.v + chromaRow * chroma.vPitch, count},
        n);
  }
}

template <YuvToRgbForm kForm>
void ConvertYuv(const PixelRows& rows, const ChromaRows& chroma, const YuvToRgb& colour,
                const PixelShape& shape, uint8_t alpha, int n) {
  if (chroma.shift != 0) {
    ConvertRows<kForm, true>(rows, chroma, colour, shape, alpha, n);
  } else {
    ConvertRows<kForm, false>(rows, chroma, colour, shape, alpha, n);
  }
}

void YuvToPixels(const PixelRows& rows, const ChromaRows& chroma, const YuvToRgb& colour,
                 const PixelFormat& format, AlphaFill alpha, int n) {
  const PixelShape shape(format);
  const uint8_t fill = AlphaOf(shape, alpha);
  if (shape.bytes == 0) return scalar::YuvToPixels(rows, chroma, colour, format, alpha, n);
  switch (colour.form) {
    case YuvToRgbForm::kTable:
      return ConvertYuv<YuvToRgbForm::kTable>(rows, chroma, colour, shape, fill, n);
    case YuvToRgbForm::kWholeLuma:
      return ConvertYuv<YuvToRgbForm::kWholeLuma>(rows, chroma, colour, shape, fill, n);
    case YuvToRgbForm::kSixBits:
      return ConvertYuv<YuvToRgbForm::kSixBits>(rows, chroma, colour, shape, fill, n);
    default:
      return scalar::YuvToPixels(rows, chroma, colour, format, alpha, n);
  }
}

// ---- RGB to YUV, levels
// The tables are straight lines.
WeightedSum SumOf(RgbToYuvTables tables) {
  int32_t weights[3];
  int32_t offset = 0;
  for (int c = 0; c < 3; ++c) {
    weights[c] = tables[c][1] - tables[c][0];
    offset += tables[c][0];
  }
  return WeightedSum(weights, offset);
}

void RgbToYuv(uint8_t* dst, const uint8_t* const rgb[3], RgbToYuvTables tables, int n) {
  const WeightedSum sum = SumOf(tables);
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, n,
      [&](uint8_t* const* out, const uint8_t* r, const uint8_t* g, const uint8_t* b) {
        StoreBytes(out[0], sum.Of(LoadBytes(r), LoadBytes(g), LoadBytes(b)));
      },
      Units{rgb[0], 1}, Units{rgb[1], 1}, Units{rgb[2], 1});
}

template <bool kSeconds>
void SomePixelsToYuv(uint8_t* dst, const uint8_t* src, const PixelFormat& format,
                     RgbToYuvTables tables, int n) {
  const PixelShape shape(format);
  const WeightedSum sum = SumOf(tables);
  const int unit = kSeconds ? 2 * shape.bytes : shape.bytes;
  uint8_t* const dsts[] = {dst};
  if (shape.bytes == 4) {
    const PixelSum pixels(sum, shape.blueFirst, shape.alphaFirst);
    ForRun<1>(
        dsts, n,
        [&](uint8_t* const* out, const uint8_t* in) {
          StoreBytes(out[0], pixels.Of<kSeconds>(in));
        },
        Units{src, unit});
    return;
  }
  ForRun<1>(
      dsts, n,
      [&](uint8_t* const* out, const uint8_t* in) {
        PixelBytes pixels = LoadPixels(in, shape);
        if (kSeconds) {
          const PixelBytes more = LoadPixels(in + kBytes * shape.bytes, shape);
          pixels = {Seconds(pixels.r, more.r), Seconds(pixels.g, more.g), Seconds(pixels.b, more.b),
                    pixels.alpha};
        }
        StoreBytes(out[0], sum.Of(pixels.r, pixels.g, pixels.b));
      },
      Units{src, unit});
}

void PixelsToYuv(uint8_t* dst, const uint8_t* src, const PixelFormat& format, RgbToYuvTables tables,
                 int n) {
  if (PixelShape(format).bytes == 0) return scalar::PixelsToYuv(dst, src, format, tables, n);
  SomePixelsToYuv<false>(dst, src, format, tables, n);
}

void PixelPairsToYuv(uint8_t* dst, const uint8_t* src, const PixelFormat& format,
                     RgbToYuvTables tables, int n) {
  if (PixelShape(format).bytes == 0) return scalar::PixelPairsToYuv(dst, src, format, tables, n);
  SomePixelsToYuv<true>(dst, src, format, tables, n);
}

void MapLevels(uint8_t* dst, const uint8_t* src, const LevelMap& levels, int n) {
  const Words whole = SetWords(levels.gain >> 16);
  const Words part = SetWords(levels.gain & 0xFFFF);
  const Words offset = SetWords(levels.offset >> 16);
  const Words carry = PrepareCarry(SetWords(levels.offset & 0xFFFF));
  const auto map = [=](Words level) {
    const Product product = Multiply(level, part);
    return level * whole + product.high + offset - CarryOf(product.low, carry);
  };
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, n,
      [&](uint8_t* const* out, const uint8_t* in) {
        const WordsPair level = Widen(LoadBytes(in));
        StoreBytes(out[0], Narrow(map(level.low), map(level.high)));
      },
      Units{src, 1});
}

// ---- Order of bytes
void ReadStrided(uint8_t* dst, const uint8_t* src, ptrdiff_t step, int n) {
  int i = 0;
  // A vector reads on to the sample after its last.
  if (step == 2) {
    for (; i + kBytes < n; i += kBytes) {
      Bytes first, second;
      Load2(src + 2 * i, &first, &second);
      StoreBytes(dst + i, first);
    }
  } else if (step == 4) {
    for (; i + kBytes < n; i += kBytes) {
      Bytes channels[4];
      Load4(src + 4 * i, channels);
      StoreBytes(dst + i, channels[0]);
    }
  }
  scalar::ReadStrided(dst + i, src + i * step, step, n - i);
}

void Interleave(uint8_t* dst, const uint8_t* a, const uint8_t* b, int n) {
  uint8_t* const dsts[] = {dst};
  ForRun<2>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* inA, const uint8_t* inB) {
        Store2(out[0], LoadBytes(inA), LoadBytes(inB));
      },
      Units{a, 1}, Units{b, 1});
}

void Deinterleave(uint8_t* a, uint8_t* b, const uint8_t* src, int n) {
  uint8_t* const dsts[] = {a, b};
  ForRun<1>(
      dsts, n,
      [](uint8_t* const* out, const uint8_t* in) {
        Bytes first, second;
        Load2(in, &first, &second);
        StoreBytes(out[0], first);
        StoreBytes(out[1], second);
      },
      Units{src, 2});
}

void SwapPairs(uint8_t* dst, const uint8_t* src, int n) {
  uint8_t* const dsts[] = {dst};
  ForRun<1>(
      dsts, 2 * n,
      [](uint8_t* const* out, const uint8_t* in) {
        StoreBytes(out[0], SwapNeighbours(LoadBytes(in)));
      },
      Units{src, 1});
}

template <int kUnit>
int WriteReversed(uint8_t* dst, const uint8_t* src, int n) {
  constexpr int kUnits = kBytes / kUnit;
  int i = 0;
  for (; i + kUnits <= n; i += kUnits) {
    StoreReversed<kUnit>(dst - ptrdiff_t{i + kUnits - 1} * kUnit, src + i * kUnit);
  }
  return i;
}

void WritePixels(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int bytes, int n) {
  int i = 0;
  if (step == -bytes) {
    i = bytes == 1   ? WriteReversed<1>(dst, src, n)
        : bytes == 2 ? WriteReversed<2>(dst, src, n)
        : bytes == 4 ? WriteReversed<4>(dst, src, n)
                     : 0;
  }
  scalar::WritePixels(dst + i * step, step, src + ptrdiff_t{i} * bytes, bytes, n - i);
}

void WriteStrided(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int n) {
  if (step == 1) {
    memcpy(dst, src, size_t(n));
  } else {
    WritePixels(dst, step, src, 1, n);
  }
}

constexpr RowOps VectorRows(const char* name) {
  return {name,
          ReadStrided,
          scalar::Gather,
          scalar::GatherPixels,
          PlanPairs,
          ReadPairs,
          BlendPairs,
          BlendColumns,
          BlendRows,
          UnpackRgb,
          UnpackAlpha,
          scalar::UnpackIndexed,
          scalar::YuvToRgbByWideSums,
          scalar::YuvToRgbCarry,
          YuvToPixels,
          RgbToYuv,
          PixelsToYuv,
          PixelPairsToYuv,
          MapLevels,
          scalar::NarrowWithCarry,
          PackRgb,
          RepackPixels,
          scalar::PutAlpha,
          Interleave,
          Deinterleave,
          SwapPairs,
          scalar::Transpose,
          WriteStrided,
          WritePixels};
}

}  // namespace
}  // namespace kestrel

#endif
