#include <libyuv.h>

#include <cmath>
#include <string>
#include <vector>

#include "benchmarks/peers/composition.h"

namespace bench {
namespace {

constexpr uint32_t kRgba = FORMAT_XBGR8888;
constexpr uint32_t kBgra = FORMAT_XRGB8888;  // the library's "ARGB"
constexpr uint32_t kRgb24 = FORMAT_RGB888;
constexpr uint32_t kRgb565 = FORMAT_RGB565;
constexpr uint32_t kNv21 = FORMAT_NV21;
constexpr uint32_t kNv12 = FORMAT_NV12;
constexpr uint32_t kI420 = FORMAT_I420;
constexpr uint32_t kI422 = FORMAT_I422;
constexpr uint32_t kYuyv = FORMAT_YUYV;
constexpr uint32_t kGrey = FORMAT_GRAY8;

bool IsFull(const Picture& yuv) {
  return (yuv.format & FORMAT_STANDARD_MASK) == FORMAT_BT601_FULL;
}

// Factors for U and V in their places, and exchanged. With them exchanged the library's BGRA
// becomes RGBA.
const libyuv::YuvConstants* Plain(const Picture& yuv) {
  return IsFull(yuv) ? &libyuv::kYuvJPEGConstants : &libyuv::kYuvI601Constants;
}
const libyuv::YuvConstants* Exchanged(const Picture& yuv) {
  return IsFull(yuv) ? &libyuv::kYvuJPEGConstants : &libyuv::kYvuI601Constants;
}

// How the library takes pictures: address and pitch, one plane after the other.
#define PLANE(p, i) (p).plane[i], (p).pitch[i]
#define PAIRS(p) (p).block[1].start, (p).block[1].pitch
#define YUV_PLANES(p) PLANE(p, 0), PLANE(p, 1), PLANE(p, 2)
#define YVU_PLANES(p) PLANE(p, 0), PLANE(p, 2), PLANE(p, 1)
#define SEMI_PLANES(p) PLANE(p, 0), PAIRS(p)

enum Ranges { kFull = 1, kVideo = 2, kAnyRange = 3 };

// A height below 0 turns the picture upside down on the way.
struct Conversion {
  const char* name;
  uint32_t src, dst;
  int ranges;
  void (*run)(const Picture& s, const Picture& d, int width, int height);
};

const Conversion kConversions[] = {
    {"NV12ToARGBMatrix", kNv21, kRgba, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV12ToARGBMatrix(SEMI_PLANES(s), PLANE(d, 0), Exchanged(s), width, height);
     }},
    {"NV21ToARGBMatrix", kNv21, kBgra, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV21ToARGBMatrix(SEMI_PLANES(s), PLANE(d, 0), Plain(s), width, height);
     }},
    {"NV21ToARGBMatrix", kNv12, kRgba, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV21ToARGBMatrix(SEMI_PLANES(s), PLANE(d, 0), Exchanged(s), width, height);
     }},
    {"I420ToARGBMatrix", kI420, kRgba, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::I420ToARGBMatrix(YVU_PLANES(s), PLANE(d, 0), Exchanged(s), width, height);
     }},
    {"I422ToARGBMatrix", kI422, kRgba, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::I422ToARGBMatrix(YVU_PLANES(s), PLANE(d, 0), Exchanged(s), width, height);
     }},
    {"YUY2ToARGB", kYuyv, kBgra, kVideo,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::YUY2ToARGB(PLANE(s, 0), PLANE(d, 0), width, height);
     }},
    {"NV21ToRGB24Matrix", kNv21, kRgb24, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV21ToRGB24Matrix(SEMI_PLANES(s), PLANE(d, 0), Plain(s), width, height);
     }},
    {"NV12ToRGB565Matrix", kNv12, kRgb565, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV12ToRGB565Matrix(SEMI_PLANES(s), PLANE(d, 0), Plain(s), width, height);
     }},
    {"I420ToRGB565Matrix", kI420, kRgb565, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::I420ToRGB565Matrix(YUV_PLANES(s), PLANE(d, 0), Plain(s), width, height);
     }},
    {"ARGBToRGB565", kBgra, kRgb565, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ARGBToRGB565(PLANE(s, 0), PLANE(d, 0), width, height);
     }},
    {"RGB565ToARGB", kRgb565, kBgra, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::RGB565ToARGB(PLANE(s, 0), PLANE(d, 0), width, height);
     }},
    {"ARGBToABGR", kBgra, kRgba, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ARGBToABGR(PLANE(s, 0), PLANE(d, 0), width, height);
     }},
    {"ABGRToARGB", kRgba, kBgra, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ABGRToARGB(PLANE(s, 0), PLANE(d, 0), width, height);
     }},
    {"ABGRToNV21", kRgba, kNv21, kVideo,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ABGRToNV21(PLANE(s, 0), SEMI_PLANES(d), width, height);
     }},
    {"ABGRToI420", kRgba, kI420, kVideo,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ABGRToI420(PLANE(s, 0), YUV_PLANES(d), width, height);
     }},
    {"ABGRToJ420", kRgba, kI420, kFull,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ABGRToJ420(PLANE(s, 0), YUV_PLANES(d), width, height);
     }},
    {"ABGRToJ422", kRgba, kI422, kFull,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ABGRToJ422(PLANE(s, 0), YUV_PLANES(d), width, height);
     }},
    {"ARGBToYUY2", kBgra, kYuyv, kVideo,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ARGBToYUY2(PLANE(s, 0), PLANE(d, 0), width, height);
     }},
    {"I422ToYUY2", kI422, kYuyv, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::I422ToYUY2(YUV_PLANES(s), PLANE(d, 0), width, height);
     }},
    {"I420ToYUY2", kI420, kYuyv, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::I420ToYUY2(YUV_PLANES(s), PLANE(d, 0), width, height);
     }},
    {"YUY2ToI422", kYuyv, kI422, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::YUY2ToI422(PLANE(s, 0), YUV_PLANES(d), width, height);
     }},
    {"YUY2ToI420", kYuyv, kI420, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::YUY2ToI420(PLANE(s, 0), YUV_PLANES(d), width, height);
     }},
    {"NV21ToI420", kNv21, kI420, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV21ToI420(SEMI_PLANES(s), YUV_PLANES(d), width, height);
     }},
    {"I420ToNV21", kI420, kNv21, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::I420ToNV21(YUV_PLANES(s), SEMI_PLANES(d), width, height);
     }},
    {"NV21ToNV12", kNv21, kNv12, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV21ToNV12(SEMI_PLANES(s), SEMI_PLANES(d), width, height);
     }},
    {"NV21Copy", kNv21, kNv21, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV21Copy(SEMI_PLANES(s), SEMI_PLANES(d), width, height);
     }},
    {"I420Copy", kI420, kI420, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::I420Copy(YUV_PLANES(s), YUV_PLANES(d), width, height);
     }},
    {"ARGBCopy", kRgba, kRgba, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ARGBCopy(PLANE(s, 0), PLANE(d, 0), width, height);
     }},
};

// One-plane pictures are copied as rows of bytes.
void CopyRows(const Picture& s, const Picture& d) {
  libyuv::CopyPlane(PLANE(s, 0), PLANE(d, 0), s.block[0].rowBytes, s.size.height);
}

struct Turn {
  const char* name;
  uint32_t src, dst;
  void (*run)(const Picture& s, const Picture& d, libyuv::RotationMode mode);
};

const Turn kRotations[] = {
    {"I420Rotate", kI420, kI420,
     [](const Picture& s, const Picture& d, libyuv::RotationMode mode) {
       libyuv::I420Rotate(YUV_PLANES(s), YUV_PLANES(d), s.size.width, s.size.height, mode);
     }},
    {"NV12ToI420Rotate", kNv21, kI420,
     [](const Picture& s, const Picture& d, libyuv::RotationMode mode) {
       libyuv::NV12ToI420Rotate(SEMI_PLANES(s), YVU_PLANES(d), s.size.width, s.size.height, mode);
     }},
    {"ARGBRotate", kRgba, kRgba,
     [](const Picture& s, const Picture& d, libyuv::RotationMode mode) {
       libyuv::ARGBRotate(PLANE(s, 0), PLANE(d, 0), s.size.width, s.size.height, mode);
     }},
};

// Heights below 0 as above: a turn by 180 degrees.
const Conversion kMirrors[] = {
    {"I420Mirror", kI420, kI420, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::I420Mirror(YUV_PLANES(s), YUV_PLANES(d), width, height);
     }},
    {"NV12Mirror", kNv21, kNv21, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::NV12Mirror(SEMI_PLANES(s), SEMI_PLANES(d), width, height);
     }},
    {"ARGBMirror", kRgba, kRgba, kAnyRange,
     [](const Picture& s, const Picture& d, int width, int height) {
       libyuv::ARGBMirror(PLANE(s, 0), PLANE(d, 0), width, height);
     }},
};

struct Scaler {
  const char* name;
  uint32_t format;
  void (*run)(const Picture& s, const Picture& d, libyuv::FilterMode filter);
};

void ScaleArgb(const Picture& s, const Picture& d, libyuv::FilterMode filter) {
  libyuv::ARGBScale(PLANE(s, 0), s.size.width, s.size.height, PLANE(d, 0), d.size.width,
                    d.size.height, filter);
}

void ScaleLuma(const Picture& s, const Picture& d, libyuv::FilterMode filter) {
  libyuv::ScalePlane(PLANE(s, 0), s.size.width, s.size.height, PLANE(d, 0), d.size.width,
                     d.size.height, filter);
}

const Scaler kScalers[] = {
    {"I420Scale", kI420,
     [](const Picture& s, const Picture& d, libyuv::FilterMode filter) {
       libyuv::I420Scale(YUV_PLANES(s), s.size.width, s.size.height, YUV_PLANES(d), d.size.width,
                         d.size.height, filter);
     }},
    {"ScalePlane and UVScale", kNv21,
     [](const Picture& s, const Picture& d, libyuv::FilterMode filter) {
       ScaleLuma(s, d, filter);
       const Size from = s.SizeOf(1);
       const Size to = d.SizeOf(1);
       libyuv::UVScale(PAIRS(s), from.width, from.height, PAIRS(d), to.width, to.height, filter);
     }},
    {"ScalePlane", kGrey, ScaleLuma},
    {"ARGBScale", kRgba, ScaleArgb},
    {"ARGBScale", kBgra, ScaleArgb},
};

#undef PLANE
#undef PAIRS
#undef YUV_PLANES
#undef YVU_PLANES
#undef SEMI_PLANES

// Saturation by a matrix of six fractional bits, then brightness and contrast by a table, on RGBA.
class Adjuster {
 public:
  explicit Adjuster(const Adjustments& a) {
    const double saturation = 1 + a.saturation / 64.0;
    const double contrast = 1 + a.contrast / 64.0;
    const double luma[3] = {0.299, 0.587, 0.114};
    for (int row = 0; row < 3; ++row) {
      for (int column = 0; column < 3; ++column) {
        const double factor = (row == column ? saturation : 0) + (1 - saturation) * luma[column];
        matrix_[row * 4 + column] = int8_t(std::lround(factor * 64));
      }
    }
    matrix_[15] = 64;
    for (int value = 0; value < 256; ++value) {
      const double level = (value + a.brightness - 128) * contrast + 128;
      const uint8_t clamped = uint8_t(std::lround(level < 0 ? 0 : level > 255 ? 255 : level));
      for (int channel = 0; channel < 3; ++channel) table_[value * 4 + channel] = clamped;
      table_[value * 4 + 3] = uint8_t(value);
    }
  }

  void Run(const Picture& s, const Picture& d) const {
    libyuv::ARGBColorMatrix(s.plane[0], s.pitch[0], d.plane[0], d.pitch[0], matrix_, s.size.width,
                            s.size.height);
    libyuv::ARGBColorTable(d.plane[0], d.pitch[0], table_, 0, 0, s.size.width, s.size.height);
  }

 private:
  int8_t matrix_[16] = {};
  uint8_t table_[1024] = {};
};

void AddConversions(uint32_t layout, const Job& job, std::vector<Step>* steps) {
  const int range = IsFullRange(job) ? kFull : kVideo;
  for (const Conversion& c : kConversions) {
    if (c.src != layout || (c.ranges & range) == 0) continue;
    const auto run = c.run;
    const uint32_t format = InStandardOf(job, c.dst);
    steps->push_back({c.name, format, false, false, 0, [run](const Picture& s, const Picture& d) {
                        run(s, d, s.size.width, s.size.height);
                      }});
    steps->push_back(
        {std::string(c.name) + " upside down", format, false, false, MPP_MIRROR_Y,
         [run](const Picture& s, const Picture& d) { run(s, d, s.size.width, -s.size.height); }});
  }
}

void AddTurns(uint32_t layout, const Job& job, std::vector<Step>* steps) {
  struct Angle {
    uint32_t transform;
    libyuv::RotationMode mode;
  };
  constexpr Angle kAngles[] = {{MPP_SWAP_XY | MPP_MIRROR_X, libyuv::kRotate90},
                               {MPP_MIRROR_X | MPP_MIRROR_Y, libyuv::kRotate180},
                               {MPP_SWAP_XY | MPP_MIRROR_Y, libyuv::kRotate270}};
  for (const Turn& turn : kRotations) {
    if (turn.src != layout) continue;
    for (const Angle& angle : kAngles) {
      steps->push_back({turn.name, InStandardOf(job, turn.dst), false, false, angle.transform,
                        [run = turn.run, mode = angle.mode](const Picture& s, const Picture& d) {
                          run(s, d, mode);
                        }});
    }
  }
  for (const Conversion& mirror : kMirrors) {
    if (mirror.src != layout) continue;
    const auto run = mirror.run;
    const uint32_t format = InStandardOf(job, mirror.dst);
    steps->push_back(
        {mirror.name, format, false, false, MPP_MIRROR_X,
         [run](const Picture& s, const Picture& d) { run(s, d, s.size.width, s.size.height); }});
    steps->push_back({std::string(mirror.name) + " upside down", format, false, false,
                      MPP_MIRROR_X | MPP_MIRROR_Y, [run](const Picture& s, const Picture& d) {
                        run(s, d, s.size.width, -s.size.height);
                      }});
  }
}

std::vector<Step> StepsFrom(uint32_t format, const Job& job) {
  const uint32_t layout = LayoutOf(format);
  std::vector<Step> steps;
  AddConversions(layout, job, &steps);
  AddTurns(layout, job, &steps);
  for (const Scaler& scaler : kScalers) {
    if (scaler.format != layout) continue;
    const libyuv::FilterMode filter = job.bilinear ? libyuv::kFilterBilinear : libyuv::kFilterNone;
    steps.push_back(
        {scaler.name, format, true, false, 0,
         [run = scaler.run, filter](const Picture& s, const Picture& d) { run(s, d, filter); }});
  }
  if (layout == kYuyv || layout == kGrey || layout == kRgb565) {
    steps.push_back({"CopyPlane", format, false, false, 0, CopyRows});
  }
  if (layout == kRgba && job.adjustments.Any()) {
    steps.push_back({"ARGBColorMatrix and ARGBColorTable", format, false, true, 0,
                     [adjuster = Adjuster(job.adjustments)](const Picture& s, const Picture& d) {
                       adjuster.Run(s, d);
                     }});
  }
  return steps;
}

}  // namespace

std::vector<Contender> LibyuvContenders() {
  return {{"libyuv", Role::kPeer, [](const Job& job, const Picture& src, const Picture& dst) {
             return Compose(StepsFrom, job, src, dst);
           }}};
}

std::string LibyuvVersion() {
  return std::to_string(LIBYUV_VERSION);
}

}  // namespace bench
