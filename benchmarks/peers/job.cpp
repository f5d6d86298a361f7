#include "benchmarks/peers/job.h"

#include <cstdlib>

namespace bench {
namespace {

struct Frame {
  Size src, down, up, cropped;
};

// Cropped destinations have another aspect than the source; their margins lie on the 4 x 4 grid, so
// that every engine and every peer shows the same part.
constexpr Frame kFrames[] = {
    {{1920, 1080}, {1280, 720}, {2880, 1620}, {960, 960}},
    {{4000, 3000}, {1920, 1440}, {4800, 3600}, {1600, 800}},
};

constexpr Size kSmallFrames[] = {{64, 48}, {320, 240}, {16, 4000}, {4000, 16}};

enum Ranges { kFull = 1, kVideo = 2, kBothRanges = 3 };
enum Scale { kSame, kDown, kUp, kCropped };

constexpr uint32_t k90 = MPP_SWAP_XY | MPP_MIRROR_X;
constexpr uint32_t k180 = MPP_MIRROR_X | MPP_MIRROR_Y;
constexpr uint32_t k270 = MPP_SWAP_XY | MPP_MIRROR_Y;

struct Row {
  const char* group;
  uint32_t src, dst;
  int ranges;
  Scale scale;
  uint32_t transform;
  double target[2];  // for each of kFrames
};

constexpr uint32_t kRgba = FORMAT_XBGR8888;
constexpr uint32_t kRgb24 = FORMAT_RGB888;

constexpr Row kConversions[] = {
    {"to_RGBA", FORMAT_NV21, kRgba, kFull, kSame, 0, {1.2, 0.95}},
    {"to_RGBA", FORMAT_NV12, kRgba, kFull, kSame, 0, {1.2, 0.95}},
    {"to_RGBA", FORMAT_I420, kRgba, kFull, kSame, 0, {1.2, 0.95}},
    {"to_RGBA", FORMAT_NV21, kRgba, kVideo, kSame, 0, {0.75, 0.75}},
    {"to_RGBA", FORMAT_NV12, kRgba, kVideo, kSame, 0, {0.75, 0.75}},
    {"to_RGBA", FORMAT_I420, kRgba, kVideo, kSame, 0, {0.75, 0.75}},
    {"to_RGBA", FORMAT_YUYV, kRgba, kBothRanges, kSame, 0, {1.0, 1.0}},
    {"to_RGB24", FORMAT_NV21, kRgb24, kBothRanges, kSame, 0, {1.5, 1.5}},
    {"to_RGB565", FORMAT_NV21, FORMAT_RGB565, kBothRanges, kSame, 0, {2.5, 2.5}},
    {"from_RGBA", kRgba, FORMAT_NV21, kBothRanges, kSame, 0, {1.0, 1.0}},
    {"from_RGBA", kRgba, FORMAT_I420, kBothRanges, kSame, 0, {1.0, 1.0}},
    {"from_RGBA", kRgba, FORMAT_YUYV, kBothRanges, kSame, 0, {2.0, 2.0}},
    {"repack", FORMAT_NV21, FORMAT_I420, kFull, kSame, 0, {0.95, 0.95}},
    {"repack", FORMAT_I420, FORMAT_NV21, kFull, kSame, 0, {0.95, 0.95}},
    {"repack", FORMAT_NV21, FORMAT_NV12, kFull, kSame, 0, {0.95, 0.95}},
    {"repack", FORMAT_YUYV, FORMAT_I420, kFull, kSame, 0, {0.95, 0.95}},
    {"copy", FORMAT_NV21, FORMAT_NV21, kFull, kSame, 0, {0.95, 0.95}},
    {"copy", FORMAT_I420, FORMAT_I420, kFull, kSame, 0, {0.95, 0.95}},
    {"copy", FORMAT_YUYV, FORMAT_YUYV, kFull, kSame, 0, {0.95, 0.95}},
    {"copy", FORMAT_GRAY8, FORMAT_GRAY8, kFull, kSame, 0, {0.95, 0.95}},
    {"copy", kRgba, kRgba, kFull, kSame, 0, {0.95, 0.95}},
    {"copy", FORMAT_RGB565, FORMAT_RGB565, kFull, kSame, 0, {0.95, 0.95}},
    {"rotate_90", FORMAT_NV21, FORMAT_NV21, kFull, kSame, k90, {1.8, 1.8}},
    {"rotate_180", FORMAT_NV21, FORMAT_NV21, kFull, kSame, k180, {1.8, 1.8}},
    {"rotate_270", FORMAT_NV21, FORMAT_NV21, kFull, kSame, k270, {1.8, 1.8}},
    {"mirror_X", FORMAT_NV21, FORMAT_NV21, kFull, kSame, MPP_MIRROR_X, {1.0, 1.0}},
    {"mirror_Y", FORMAT_NV21, FORMAT_NV21, kFull, kSame, MPP_MIRROR_Y, {1.0, 1.0}},
    {"rotate_90", FORMAT_I420, FORMAT_I420, kFull, kSame, k90, {1.8, 1.8}},
    {"rotate_180", FORMAT_I420, FORMAT_I420, kFull, kSame, k180, {1.8, 1.8}},
    {"rotate_270", FORMAT_I420, FORMAT_I420, kFull, kSame, k270, {1.8, 1.8}},
    {"mirror_X", FORMAT_I420, FORMAT_I420, kFull, kSame, MPP_MIRROR_X, {1.0, 1.0}},
    {"mirror_Y", FORMAT_I420, FORMAT_I420, kFull, kSame, MPP_MIRROR_Y, {1.0, 1.0}},
    {"rotate_90", FORMAT_NV21, kRgba, kFull, kSame, k90, {2.0, 2.0}},
    {"rotate_180", FORMAT_NV21, kRgba, kFull, kSame, k180, {2.0, 2.0}},
    {"rotate_270", FORMAT_NV21, kRgba, kFull, kSame, k270, {2.0, 2.0}},
    {"mirror_X", FORMAT_NV21, kRgba, kFull, kSame, MPP_MIRROR_X, {1.0, 1.0}},
    {"mirror_Y", FORMAT_NV21, kRgba, kFull, kSame, MPP_MIRROR_Y, {1.0, 1.0}},
};

// Once bilinear and once nearest. The targets are those of bilinear; nearest is to reach 2.
constexpr double kNearestTarget = 2.0;
constexpr Row kResizes[] = {
    {"down", FORMAT_NV21, kRgba, kFull, kDown, 0, {4.0, 2.0}},
    {"down_rotate_90", FORMAT_NV21, kRgba, kFull, kDown, k90, {5.0, 2.0}},
    {"down_cropped", FORMAT_NV21, kRgba, kFull, kCropped, 0, {2.0, 2.0}},
    {"up", FORMAT_NV21, kRgba, kFull, kUp, 0, {2.0, 2.0}},
    {"up_rotate_90", FORMAT_NV21, kRgba, kFull, kUp, k90, {2.0, 2.0}},
    {"down", FORMAT_I420, FORMAT_I420, kFull, kDown, 0, {2.0, 2.0}},
    {"up", FORMAT_I420, FORMAT_I420, kFull, kUp, 0, {2.0, 2.0}},
    {"down", FORMAT_NV21, FORMAT_NV21, kFull, kDown, 0, {2.0, 2.0}},
    {"up", FORMAT_NV21, FORMAT_NV21, kFull, kUp, 0, {2.0, 2.0}},
    {"down", FORMAT_GRAY8, FORMAT_GRAY8, kFull, kDown, 0, {2.0, 2.0}},
    {"up", FORMAT_GRAY8, FORMAT_GRAY8, kFull, kUp, 0, {2.0, 2.0}},
    {"down", kRgba, kRgba, kFull, kDown, 0, {2.0, 2.0}},
    {"up", kRgba, kRgba, kFull, kUp, 0, {2.0, 2.0}},
    {"down", FORMAT_RGB565, FORMAT_RGB565, kFull, kDown, 0, {2.0, 2.0}},
    {"up", FORMAT_RGB565, FORMAT_RGB565, kFull, kUp, 0, {2.0, 2.0}},
    {"down", kRgba, FORMAT_NV21, kFull, kDown, 0, {2.0, 2.0}},
    {"up", kRgba, FORMAT_NV21, kFull, kUp, 0, {2.0, 2.0}},
};

constexpr Row kAdjusted[] = {
    {"adjusted", FORMAT_NV21, kRgba, kBothRanges, kSame, 0, {1.0, 1.0}},
};
constexpr Adjustments kAdjustments = {-6, 16, 16};

// For each of kSmallFrames; what is enlarged becomes twice as large.
constexpr Row kSmallJobs[] = {
    {"small", FORMAT_NV21, kRgba, kFull, kSame, 0, {1.0, 1.0}},
    {"small_rotate_90", FORMAT_NV21, kRgba, kFull, kSame, k90, {1.0, 1.0}},
    {"small_bilinear_up", FORMAT_NV21, kRgba, kFull, kUp, 0, {1.0, 1.0}},
    {"small", kRgba, FORMAT_NV21, kFull, kSame, 0, {1.0, 1.0}},
    {"small", FORMAT_NV21, FORMAT_I420, kFull, kSame, 0, {1.0, 1.0}},
};

bool IsYuv(uint32_t format) {
  return format >> 28 >= 5;
}

Size ScaledSize(const Frame& frame, Scale scale) {
  switch (scale) {
    case kDown:
      return frame.down;
    case kUp:
      return frame.up;
    case kCropped:
      return frame.cropped;
    default:
      return frame.src;
  }
}

Job MakeJob(const Row& row, const Frame& frame, uint32_t range, bool bilinear, double target) {
  Job job = {};
  job.group = row.group;
  job.srcFormat = row.src | (IsYuv(row.src) ? range : 0);
  job.dstFormat = row.dst | (IsYuv(row.dst) ? range : 0);
  job.src = frame.src;
  const Size scaled = ScaledSize(frame, row.scale);
  job.dst = (row.transform & MPP_SWAP_XY) != 0 ? scaled.Turned() : scaled;
  job.bilinear = bilinear;
  job.transform = row.transform;
  job.crop = row.scale == kCropped;
  job.target = target;
  return job;
}

void NameJob(Job* job) {
  job->name = job->group + "/" + FormatName(job->srcFormat) + "_to_" + FormatName(job->dstFormat) +
              "/" + std::to_string(job->src.width) + "x" + std::to_string(job->src.height);
}

void AddJob(Job job, std::vector<Job>* jobs) {
  NameJob(&job);
  jobs->push_back(job);
}

template <typename Change>
void AddRow(const Row& row, bool bilinear, const Change& change, std::vector<Job>* jobs) {
  for (size_t i = 0; i < std::size(kFrames); ++i) {
    for (const int range : {kFull, kVideo}) {
      if ((row.ranges & range) == 0) continue;
      Job job = MakeJob(row, kFrames[i], range == kFull ? FORMAT_BT601_FULL : FORMAT_BT601_VIDEO,
                        bilinear, row.target[i]);
      change(&job);
      AddJob(job, jobs);
    }
  }
}

}  // namespace

Size Job::Shown() const {
  if (!crop) return src;
  const Size wanted = UnturnedDst();
  const Size byWidth = {src.width, src.width * wanted.height / wanted.width};
  return byWidth.height <= src.height ? byWidth
                                      : Size{src.height * wanted.width / wanted.height, src.height};
}

std::vector<Job> AllJobs() {
  std::vector<Job> jobs;
  for (const Row& row : kConversions) {
    AddRow(
        row, false, [](Job*) {}, &jobs);
  }
  for (const Row& row : kAdjusted) {
    AddRow(
        row, false, [](Job* job) { job->adjustments = kAdjustments; }, &jobs);
  }
  for (const Row& row : kResizes) {
    AddRow(
        row, true, [](Job* job) { job->group = "bilinear_" + job->group; }, &jobs);
  }
  for (const Row& row : kResizes) {
    AddRow(
        row, false,
        [](Job* job) {
          job->group = "nearest_" + job->group;
          job->target = kNearestTarget;
        },
        &jobs);
  }
  for (const Row& row : kSmallJobs) {
    for (const Size& size : kSmallFrames) {
      const Frame frame = {size, size, {2 * size.width, 2 * size.height}, size};
      Job job = MakeJob(row, frame, FORMAT_BT601_FULL, row.scale != kSame, row.target[0]);
      job.withCreation = true;
      AddJob(job, &jobs);
    }
  }
  return jobs;
}

std::string FormatName(uint32_t format) {
  struct Name {
    uint32_t format;
    const char* name;
  };
  static constexpr Name kNames[] = {
      {FORMAT_NV21, "NV21"}, {FORMAT_NV12, "NV12"},     {FORMAT_I420, "I420"},
      {FORMAT_YUYV, "YUYV"}, {FORMAT_GRAY8, "grey"},    {kRgba, "RGBA"},
      {kRgb24, "RGB24"},     {FORMAT_RGB565, "RGB565"},
  };
  for (const Name& name : kNames) {
    if (format == name.format) return IsYuv(format) ? std::string(name.name) + "_video" : name.name;
    if (IsYuv(format) && format == (name.format | FORMAT_BT601_FULL)) return name.name;
  }
  std::abort();
}

}  // namespace bench
