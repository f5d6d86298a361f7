#include "benchmarks/peers/check.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <vector>

namespace bench {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr double kRounding = 6;
constexpr double kDisplacement = 2;
constexpr double kShareInside = 0.99;
// Of large pictures some rows are looked at, odd and even ones.
constexpr int64_t kLargePixels = 4000000;
constexpr int32_t kRowStep = 5;

// base + across * cos(pi u) + down * cos(pi v), for u and v from 0 to 1 over the source picture.
struct Wave {
  double base, across, down;
};

Wave Mix(const Wave (&waves)[3], const double (&factors)[3], double offset) {
  Wave sum = {offset, 0, 0};
  for (int i = 0; i < 3; ++i) {
    sum.base += factors[i] * waves[i].base;
    sum.across += factors[i] * waves[i].across;
    sum.down += factors[i] * waves[i].down;
  }
  return sum;
}

// What brightness, contrast and saturation are defined as, on full-range R, G, B.
void Adjust(const Adjustments& a, Wave (&rgb)[3]) {
  const double saturation = 1 + a.saturation / 64.0;
  const double contrast = 1 + a.contrast / 64.0;
  const double luma[3] = {0.299, 0.587, 0.114};
  const Wave before[3] = {rgb[0], rgb[1], rgb[2]};
  for (int c = 0; c < 3; ++c) {
    double factors[3];
    for (int i = 0; i < 3; ++i) {
      factors[i] = contrast * ((i == c ? saturation : 0) + (1 - saturation) * luma[i]);
    }
    rgb[c] = Mix(before, factors, (a.brightness - 128) * contrast + 128);
  }
}

// The waves of R, G, B or of Y, U, V, as stored in a format of BT.601.
void WavesOf(const Picture& picture, const Adjustments& adjustments, Wave (&waves)[3]) {
  Wave rgb[3] = {{128, 60, 0}, {128, 0, 60}, {128, 40, -40}};
  Adjust(adjustments, rgb);
  std::copy(rgb, rgb + 3, waves);
  if (picture.IsRgb()) return;
  const bool full = picture.desc.colourStandard == CS_BT601_FULL;
  const double luma = full ? 1 : 219 / 255.0;
  const double chroma = full ? 1 : 224 / 255.0;
  waves[0] = Mix(rgb, {0.299 * luma, 0.587 * luma, 0.114 * luma}, full ? 0 : 16);
  waves[1] = Mix(rgb, {-0.168736 * chroma, -0.331264 * chroma, 0.5 * chroma}, 128);
  waves[2] = Mix(rgb, {0.5 * chroma, -0.418688 * chroma, -0.081312 * chroma}, 128);
}

std::vector<double> CosineOf(int32_t samples, bool mirrored, double first, double length) {
  std::vector<double> cosine(static_cast<size_t>(samples));
  for (int32_t i = 0; i < samples; ++i) {
    const double place = (i + 0.5) / samples;
    cosine[size_t(i)] = std::cos(kPi * (first + length * (mirrored ? 1 - place : place)));
  }
  return cosine;
}

double Amplitude(const Wave (&waves)[3]) {
  double greatest = 0;
  for (const Wave& wave : waves) {
    greatest = std::max({greatest, std::fabs(wave.across), std::fabs(wave.down)});
  }
  return greatest;
}

struct Packed {
  int bytes;
  uint32_t size[3], position[3];
};

Packed PackedOf(const Picture& picture) {
  const auto& masks = picture.desc.layout.rgb;
  const uint32_t byChannel[3] = {masks.redMask, masks.greenMask, masks.blueMask};
  Packed packed = {picture.layout.step[0], {}, {}};
  for (int c = 0; c < 3; ++c) {
    packed.size[c] = MGetMaskSize(byChannel[c]);
    packed.position[c] = MGetMaskPos(byChannel[c]);
  }
  return packed;
}

uint32_t ReadPixel(const uint8_t* pixel, int bytes) {
  uint32_t word = 0;
  for (int i = 0; i < bytes; ++i) word |= uint32_t(pixel[i]) << 8 * i;
  return word;
}

int Components(const Picture& picture) {
  return picture.desc.code == CODE_GRAY8 ? 1 : 3;
}

struct Error {
  const char* what;
  double tolerance;
  double sum = 0;
  int64_t outside = 0, samples = 0;

  void Add(double difference) {
    difference = std::fabs(difference);
    sum += difference;
    outside += difference > tolerance;
    ++samples;
  }
  std::string Verdict() const {
    const double inside = 1 - double(outside) / double(samples);
    const double mean = sum / double(samples);
    if (inside >= kShareInside && mean <= tolerance / 2) return "";
    char text[120];
    std::snprintf(text, sizeof(text), "%s off by %.1f levels on average, %.1f %% by more than %.1f",
                  what, mean, 100 * (1 - inside), tolerance);
    return text;
  }
};

}  // namespace

void DrawWaves(const Picture& picture) {
  Wave waves[3];
  WavesOf(picture, {}, waves);
  if (picture.IsRgb()) {
    const Packed packed = PackedOf(picture);
    const std::vector<double> across = CosineOf(picture.size.width, false, 0, 1);
    const std::vector<double> down = CosineOf(picture.size.height, false, 0, 1);
    for (int32_t y = 0; y < picture.size.height; ++y) {
      uint8_t* pixel = picture.plane[0] + ptrdiff_t(y) * picture.pitch[0];
      for (int32_t x = 0; x < picture.size.width; ++x, pixel += packed.bytes) {
        uint32_t word = packed.bytes == 4 ? 0xFF000000 : 0;
        for (int c = 0; c < 3; ++c) {
          const double value =
              waves[c].base + waves[c].across * across[size_t(x)] + waves[c].down * down[size_t(y)];
          word |= uint32_t(std::lround(value)) >> (8 - packed.size[c]) << packed.position[c];
        }
        for (int i = 0; i < packed.bytes; ++i) pixel[i] = uint8_t(word >> 8 * i);
      }
    }
    return;
  }
  for (int c = 0; c < Components(picture); ++c) {
    const Size samples = picture.SizeOf(c);
    const std::vector<double> across = CosineOf(samples.width, false, 0, 1);
    const std::vector<double> down = CosineOf(samples.height, false, 0, 1);
    for (int32_t y = 0; y < samples.height; ++y) {
      for (int32_t x = 0; x < samples.width; ++x) {
        const double value =
            waves[c].base + waves[c].across * across[size_t(x)] + waves[c].down * down[size_t(y)];
        *picture.Sample(c, x, y) = uint8_t(std::lround(value));
      }
    }
  }
}

std::string WhatIsWrong(const Job& job, const Picture& dst) {
  const bool swap = (job.transform & MPP_SWAP_XY) != 0;
  const bool mirrorX = (job.transform & MPP_MIRROR_X) != 0;
  const bool mirrorY = (job.transform & MPP_MIRROR_Y) != 0;
  const Size shown = job.Shown();
  const double width = double(shown.width) / job.src.width;
  const double height = double(shown.height) / job.src.height;
  const double left = double(job.ShownX()) / job.src.width;
  const double top = double(job.ShownY()) / job.src.height;
  // Turned pictures are compared along the source's axes; the destination's are mirrored first.
  const Size unturned = job.UnturnedDst();
  const Size coarser = {std::min(unturned.width, shown.width),
                        std::min(unturned.height, shown.height)};
  Wave waves[3];
  WavesOf(dst, job.adjustments, waves);
  // A channel of RGB moves with the chroma, which has waves in both directions.
  const double change =
      kPi * kDisplacement * Amplitude(waves) * (width / coarser.width + height / coarser.height);
  const Packed packed = dst.IsRgb() ? PackedOf(dst) : Packed{};
  const int32_t rowStep = dst.size.Pixels() > kLargePixels ? kRowStep : 1;
  static constexpr const char* kNames[2][3] = {{"Y", "U", "V"}, {"R", "G", "B"}};
  for (int c = 0; c < Components(dst); ++c) {
    const Size samples = dst.IsRgb() ? dst.size : dst.SizeOf(c);
    const std::vector<double> byColumn = swap ? CosineOf(samples.width, mirrorX, top, height)
                                              : CosineOf(samples.width, mirrorX, left, width);
    const std::vector<double> byRow = swap ? CosineOf(samples.height, mirrorY, left, width)
                                           : CosineOf(samples.height, mirrorY, top, height);
    const double onColumn = swap ? waves[c].down : waves[c].across;
    const double onRow = swap ? waves[c].across : waves[c].down;
    // Bits that a narrow channel lacks are taken as half set.
    const double quantum = dst.IsRgb() ? (1 << (8 - packed.size[c])) - 1 : 0;
    Error error = {kNames[dst.IsRgb()][c], kRounding + quantum + change};
    for (int32_t y = 0; y < samples.height; y += rowStep) {
      for (int32_t x = 0; x < samples.width; ++x) {
        double value;
        if (dst.IsRgb()) {
          const uint32_t word =
              ReadPixel(dst.plane[0] + ptrdiff_t(y) * dst.pitch[0] + ptrdiff_t(x) * packed.bytes,
                        packed.bytes);
          const uint32_t field = word >> packed.position[c] & ((1u << packed.size[c]) - 1);
          value = (field << (8 - packed.size[c])) + quantum / 2;
        } else {
          value = *dst.Sample(c, x, y);
        }
        const double exact =
            waves[c].base + onColumn * byColumn[size_t(x)] + onRow * byRow[size_t(y)];
        error.Add(value - std::clamp(exact, 0.0, 255.0));
      }
    }
    std::string verdict = error.Verdict();
    if (!verdict.empty()) return verdict;
  }
  if (packed.bytes == 4) {
    Error error = {"alpha", kRounding};
    for (int32_t y = 0; y < dst.size.height; y += rowStep) {
      const uint8_t* row = dst.plane[0] + ptrdiff_t(y) * dst.pitch[0];
      for (int32_t x = 0; x < dst.size.width; ++x) error.Add(255 - row[4 * x + 3]);
    }
    return error.Verdict();
  }
  return "";
}

}  // namespace bench
