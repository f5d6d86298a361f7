// Measures of how far two images are apart.
#ifndef KESTREL_TOOLS_COMPARE_METRICS_H
#define KESTREL_TOOLS_COMPARE_METRICS_H

#include <cstdint>
#include <string>
#include <vector>

#include "tools/common/converter.h"
#include "tools/common/image.h"

namespace kestrel::tools {

// The samples of one channel, without padding.
struct Channel {
  std::string name;
  int32_t width = 0;
  int32_t height = 0;
  std::vector<uint8_t> samples;
};

// Sums over frames.
struct ChannelDifference {
  std::string name;
  double squares = 0;
  double samples = 0;
  double ssimSum = 0;  // of one value a frame
  int64_t frames = 0;
  int maximum = 0;

  double Psnr() const;
  double Ssim() const { return ssimSum / double(frames); }
};

double PsnrOf(double squares, double samples);

// Mean structural similarity over windows of 8x8 samples, 4 apart.
double MeanSsim(const Channel& a, const Channel& b);

// Compares images of equal size. Planar images of the same subsampling and colour standard are
// compared in Y, U, V, all others as RGB, with alpha when both have it.
class Comparison {
 public:
  void AddFrame(const Image& a, const Image& b);

  const std::vector<ChannelDifference>& channels() const { return channels_; }
  ChannelDifference Overall() const;

  // The absolute RGB differences times a factor.
  Image DifferencePicture(const Image& a, const Image& b, int factor);

 private:
  std::vector<ChannelDifference> channels_;
  RgbaConverter toRgba_[2];
};

}  // namespace kestrel::tools

#endif
