#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#include <string>
#include <vector>

#include "benchmarks/peers/composition.h"

namespace bench {
namespace {

constexpr uint32_t kRgba = FORMAT_XBGR8888;
constexpr uint32_t kRgb24 = FORMAT_RGB888;
constexpr uint32_t kRgb565 = FORMAT_RGB565;
constexpr uint32_t kNv21 = FORMAT_NV21;
constexpr uint32_t kNv12 = FORMAT_NV12;
constexpr uint32_t kI420 = FORMAT_I420;
constexpr uint32_t kYuyv = FORMAT_YUYV;

// Samples of a block that move together.
int ChannelsOf(const Picture& picture, int block) {
  return block > 0 ? picture.layout.step[1] : picture.layout.step[0];
}

cv::Mat BlockOf(const Picture& picture, int i) {
  const Block& block = picture.block[i];
  const int channels = ChannelsOf(picture, i);
  return {block.rows, block.rowBytes / channels, CV_8UC(channels), block.start,
          size_t(block.pitch)};
}

// A 4:2:0 picture as one image of 3/2 the height. Its planes must be contiguous.
cv::Mat Whole420(const Picture& picture) {
  CV_Assert(picture.IsContiguous());
  return {picture.size.height * 3 / 2, picture.size.width, CV_8UC1, picture.plane[0]};
}

void CopyBlocks(const Picture& s, const Picture& d) {
  for (int i = 0; i < s.blockCount; ++i) {
    cv::Mat to = BlockOf(d, i);
    BlockOf(s, i).copyTo(to);
  }
}

void CopyLuma(const Picture& s, const Picture& d) {
  cv::Mat to = BlockOf(d, 0);
  BlockOf(s, 0).copyTo(to);
}

template <int code>
void ConvertSemiPlanar(const Picture& s, const Picture& d) {
  cv::Mat to = BlockOf(d, 0);
  cv::cvtColorTwoPlane(BlockOf(s, 0), BlockOf(s, 1), to, code);
}

template <int code>
void ConvertPacked(const Picture& s, const Picture& d) {
  cv::Mat to = BlockOf(d, 0);
  cv::cvtColor(BlockOf(s, 0), to, code);
}

template <int code>
void ConvertFrom420(const Picture& s, const Picture& d) {
  cv::Mat to = BlockOf(d, 0);
  cv::cvtColor(Whole420(s), to, code);
}

template <int code>
void ConvertTo420(const Picture& s, const Picture& d) {
  cv::Mat to = Whole420(d);
  cv::cvtColor(BlockOf(s, 0), to, code);
}

void SplitPairs(const Picture& s, const Picture& d) {
  CopyLuma(s, d);
  cv::Mat to[2] = {BlockOf(d, 2), BlockOf(d, 1)};
  cv::split(BlockOf(s, 1), to);
}

void MergePairs(const Picture& s, const Picture& d) {
  CopyLuma(s, d);
  const cv::Mat from[2] = {BlockOf(s, 2), BlockOf(s, 1)};
  cv::Mat to = BlockOf(d, 1);
  cv::merge(from, 2, to);
}

void ExchangePairs(const Picture& s, const Picture& d) {
  CopyLuma(s, d);
  const cv::Mat from = BlockOf(s, 1);
  cv::Mat to = BlockOf(d, 1);
  cv::mixChannels(&from, 1, &to, 1, std::vector<int>{0, 1, 1, 0}.data(), 2);
}

struct Conversion {
  const char* name;
  uint32_t src, dst;
  bool colours;  // made for video range only
  void (*run)(const Picture& s, const Picture& d);
};

const Conversion kConversions[] = {
    {"cvtColorTwoPlane", kNv21, kRgba, true, ConvertSemiPlanar<cv::COLOR_YUV2RGBA_NV21>},
    {"cvtColorTwoPlane", kNv12, kRgba, true, ConvertSemiPlanar<cv::COLOR_YUV2RGBA_NV12>},
    {"cvtColorTwoPlane", kNv21, kRgb24, true, ConvertSemiPlanar<cv::COLOR_YUV2BGR_NV21>},
    {"cvtColor", kI420, kRgba, true, ConvertFrom420<cv::COLOR_YUV2RGBA_I420>},
    {"cvtColor", kYuyv, kRgba, true, ConvertPacked<cv::COLOR_YUV2RGBA_YUY2>},
    {"cvtColor", kRgba, kI420, true, ConvertTo420<cv::COLOR_RGBA2YUV_I420>},
    {"cvtColor", kRgba, kRgb565, false, ConvertPacked<cv::COLOR_RGBA2BGR565>},
    {"cvtColor", kRgb565, kRgba, false, ConvertPacked<cv::COLOR_BGR5652RGBA>},
    {"copyTo and split", kNv21, kI420, false, SplitPairs},
    {"copyTo and merge", kI420, kNv21, false, MergePairs},
    {"copyTo and mixChannels", kNv21, kNv12, false, ExchangePairs},
};

void Turn(const Picture& s, const Picture& d, uint32_t transform) {
  for (int i = 0; i < s.blockCount; ++i) {
    const cv::Mat from = BlockOf(s, i);
    cv::Mat to = BlockOf(d, i);
    switch (transform) {
      case MPP_MIRROR_X:
        cv::flip(from, to, 1);
        break;
      case MPP_MIRROR_Y:
        cv::flip(from, to, 0);
        break;
      case MPP_MIRROR_X | MPP_MIRROR_Y:
        cv::rotate(from, to, cv::ROTATE_180);
        break;
      case MPP_SWAP_XY | MPP_MIRROR_X:
        cv::rotate(from, to, cv::ROTATE_90_CLOCKWISE);
        break;
      default:
        cv::rotate(from, to, cv::ROTATE_90_COUNTERCLOCKWISE);
        break;
    }
  }
}

void Scale(const Picture& s, const Picture& d, int interpolation) {
  for (int i = 0; i < s.blockCount; ++i) {
    cv::Mat to = BlockOf(d, i);
    cv::resize(BlockOf(s, i), to, to.size(), 0, 0, interpolation);
  }
}

// Brightness, contrast and saturation are one affine map of R, G, B, A.
cv::Mat AdjustmentMatrix(const Adjustments& a) {
  const double saturation = 1 + a.saturation / 64.0;
  const double contrast = 1 + a.contrast / 64.0;
  const double luma[3] = {0.299, 0.587, 0.114};
  cv::Mat matrix = cv::Mat::zeros(4, 5, CV_32F);
  for (int row = 0; row < 3; ++row) {
    for (int column = 0; column < 3; ++column) {
      matrix.at<float>(row, column) =
          float(contrast * ((row == column ? saturation : 0) + (1 - saturation) * luma[column]));
    }
    matrix.at<float>(row, 4) = float((a.brightness - 128) * contrast + 128);
  }
  matrix.at<float>(3, 3) = 1;
  return matrix;
}

std::vector<Step> StepsFrom(uint32_t format, const Job& job) {
  const uint32_t layout = LayoutOf(format);
  std::vector<Step> steps;
  for (const Conversion& c : kConversions) {
    if (c.src != layout || (c.colours && IsFullRange(job))) continue;
    steps.push_back({c.name, InStandardOf(job, c.dst), false, false, 0, c.run});
  }
  steps.push_back({"copyTo", format, false, false, 0, CopyBlocks});
  if (layout != kYuyv && job.transform != 0) {
    steps.push_back({"rotate or flip", format, false, false, job.transform,
                     [transform = job.transform](const Picture& s, const Picture& d) {
                       Turn(s, d, transform);
                     }});
  }
  const bool mixesBits = layout == kRgb565 && job.bilinear;
  if (layout != kYuyv && !mixesBits && job.Scales()) {
    steps.push_back({"resize", format, true, false, 0,
                     [method = job.bilinear ? cv::INTER_LINEAR : cv::INTER_NEAREST](
                         const Picture& s, const Picture& d) { Scale(s, d, method); }});
  }
  if (layout == kRgba && job.adjustments.Any()) {
    steps.push_back(
        {"transform", format, false, true, 0,
         [matrix = AdjustmentMatrix(job.adjustments)](const Picture& s, const Picture& d) {
           cv::Mat to = BlockOf(d, 0);
           cv::transform(BlockOf(s, 0), to, matrix);
         }});
  }
  return steps;
}

}  // namespace

std::vector<Contender> OpencvContenders() {
  cv::setNumThreads(1);
  return {{"opencv", Role::kPeer, [](const Job& job, const Picture& src, const Picture& dst) {
             return Compose(StepsFrom, job, src, dst);
           }}};
}

std::string OpencvVersion() {
  return CV_VERSION;
}

}  // namespace bench
