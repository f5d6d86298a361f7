#include "tools/compare/metrics.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <limits>

#include "tools/common/formats.h"

namespace kestrel::tools {
namespace {

constexpr int32_t kWindow = 8;
constexpr int32_t kWindowStride = 4;

Channel Extract(const char* name, const uint8_t* origin, int64_t pitch, int64_t step, int32_t width,
                int32_t height) {
  Channel channel = {name, width, height, {}};
  channel.samples.reserve(size_t(width) * height);
  for (int32_t y = 0; y < height; ++y) {
    for (int32_t x = 0; x < width; ++x) {
      channel.samples.push_back(origin[pitch * y + step * x]);
    }
  }
  return channel;
}

// Empty unless the image has planes of Y, U and V.
std::vector<Channel> PlanarChannels(const Image& image) {
  const MPPFORMAT record = {image.format, image.width, image.height, nullptr};
  FormatDesc desc = {};
  PlaneLayout layout = {};
  uint32_t factors[6];
  MPParseFormat(&desc, &record);
  MPGetPlaneLayout(&desc, &layout);
  MPGetSubsampling(&desc, &layout, factors);
  if (!layout.isPlanar) return {};
  const bool vFirst = desc.code >= CODE_YV_ANY && desc.code <= CODE_YV24;
  const char* const names[3] = {"Y", vFirst ? "V" : "U", vFirst ? "U" : "V"};
  const EnginePlanes bound = BindPlanes(image);
  std::vector<Channel> channels;
  for (uint32_t i = 0; i < layout.planeCount; ++i) {
    const int32_t across = int32_t(factors[i]), down = int32_t(factors[3 + i]);
    channels.push_back(Extract(names[i], bound.plane[i], bound.pitch[i], layout.step[i],
                               (image.width + across - 1) / across,
                               (image.height + down - 1) / down));
  }
  std::sort(channels.begin() + 1, channels.end(),
            [](const Channel& a, const Channel& b) { return a.name < b.name; });
  return channels;
}

std::vector<Channel> RgbaChannels(const Image& rgba, bool withAlpha) {
  static constexpr const char* kNames[] = {"R", "G", "B", "A"};
  std::vector<Channel> channels;
  for (int i = 0; i < (withAlpha ? 4 : 3); ++i) {
    channels.push_back(
        Extract(kNames[i], rgba.Row(0, 0) + i, rgba.planes[0].pitch, 4, rgba.width, rgba.height));
  }
  return channels;
}

bool SameShape(const std::vector<Channel>& a, const std::vector<Channel>& b) {
  return !a.empty() && std::equal(a.begin(), a.end(), b.begin(), b.end(),
                                  [](const Channel& one, const Channel& other) {
                                    return one.width == other.width && one.height == other.height;
                                  });
}

// Positions of windows along one axis: the last one ends with the picture.
std::vector<int32_t> WindowStarts(int32_t length, int32_t window) {
  std::vector<int32_t> starts;
  for (int32_t at = 0; at + window < length; at += kWindowStride) starts.push_back(at);
  starts.push_back(length - window);
  return starts;
}

void Accumulate(const Channel& a, const Channel& b, ChannelDifference* difference) {
  for (size_t i = 0; i < a.samples.size(); ++i) {
    const int distance = std::abs(int(a.samples[i]) - int(b.samples[i]));
    difference->squares += distance * distance;
    difference->maximum = std::max(difference->maximum, distance);
  }
  difference->samples += double(a.samples.size());
  difference->ssimSum += MeanSsim(a, b);
  ++difference->frames;
}

}  // namespace

double PsnrOf(double squares, double samples) {
  if (squares == 0) return std::numeric_limits<double>::infinity();
  return 10 * std::log10(255.0 * 255.0 * samples / squares);
}

double ChannelDifference::Psnr() const {
  return PsnrOf(squares, samples);
}

double MeanSsim(const Channel& a, const Channel& b) {
  constexpr double kC1 = 0.01 * 255 * 0.01 * 255, kC2 = 0.03 * 255 * 0.03 * 255;
  const int32_t across = std::min(kWindow, a.width), down = std::min(kWindow, a.height);
  const double count = double(across) * down;
  const std::vector<int32_t> columns = WindowStarts(a.width, across);
  const std::vector<int32_t> rows = WindowStarts(a.height, down);
  double sum = 0;
  for (const int32_t top : rows) {
    for (const int32_t left : columns) {
      int64_t sumA = 0, sumB = 0, squaresA = 0, squaresB = 0, products = 0;
      for (int32_t y = top; y < top + down; ++y) {
        const size_t row = size_t(y) * a.width;
        for (int32_t x = left; x < left + across; ++x) {
          const int valueA = a.samples[row + x], valueB = b.samples[row + x];
          sumA += valueA;
          sumB += valueB;
          squaresA += valueA * valueA;
          squaresB += valueB * valueB;
          products += valueA * valueB;
        }
      }
      const double meanA = double(sumA) / count, meanB = double(sumB) / count;
      const double varianceA = double(squaresA) / count - meanA * meanA;
      const double varianceB = double(squaresB) / count - meanB * meanB;
      const double covariance = double(products) / count - meanA * meanB;
      sum += (2 * meanA * meanB + kC1) * (2 * covariance + kC2) /
             ((meanA * meanA + meanB * meanB + kC1) * (varianceA + varianceB + kC2));
    }
  }
  return sum / (double(columns.size()) * double(rows.size()));
}

void Comparison::AddFrame(const Image& a, const Image& b) {
  std::vector<Channel> channelsA, channelsB;
  const bool sameStandard =
      IsYuv(a.format) && IsYuv(b.format) && ((a.format ^ b.format) & FORMAT_STANDARD_MASK) == 0;
  if (sameStandard) {
    channelsA = PlanarChannels(a);
    channelsB = PlanarChannels(b);
  }
  if (!SameShape(channelsA, channelsB)) {
    const bool withAlpha = a.hasAlpha && b.hasAlpha;
    channelsA = RgbaChannels(toRgba_[0].Convert(a), withAlpha);
    channelsB = RgbaChannels(toRgba_[1].Convert(b), withAlpha);
  }
  if (channels_.empty()) {
    for (const Channel& channel : channelsA) channels_.push_back({channel.name});
  }
  for (size_t i = 0; i < channels_.size(); ++i) {
    Accumulate(channelsA[i], channelsB[i], &channels_[i]);
  }
}

ChannelDifference Comparison::Overall() const {
  ChannelDifference all = {"all"};
  for (const ChannelDifference& channel : channels_) {
    all.squares += channel.squares;
    all.samples += channel.samples;
    all.ssimSum += channel.ssimSum;
    all.frames += channel.frames;
    all.maximum = std::max(all.maximum, channel.maximum);
  }
  return all;
}

Image Comparison::DifferencePicture(const Image& a, const Image& b, int factor) {
  Image picture = toRgba_[0].Convert(a);
  const Image other = toRgba_[1].Convert(b);
  picture.hasAlpha = false;
  for (int32_t y = 0; y < picture.height; ++y) {
    uint8_t* row = picture.Row(0, y);
    const uint8_t* otherRow = other.Row(0, y);
    for (int64_t x = 0; x < int64_t(picture.width) * 4; ++x) {
      row[x] = uint8_t(std::min(255, factor * std::abs(int(row[x]) - int(otherRow[x]))));
    }
  }
  return picture;
}

}  // namespace kestrel::tools
