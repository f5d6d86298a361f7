#include "kernels/pipeline/pipeline.h"

#include "kernels/pipeline/destination.h"
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
        dithers_(engine_.dither != 0 && engine_.pathKind == PATH_YUV_TO_RGB) {
    PrepareSums();
  }

  void Run() {
    if (dithers_) {
      // The remainder travels along whole rows, from the end of one to the start of the next.
      for (int32_t r = job_.rect.top; r < job_.rect.bottom; ++r) {
        for (int32_t x = job_.rect.left; x < job_.rect.right; x += kStrip) {
          if (r == job_.rect.top || StripWidth(job_.rect.left) < Width()) SelectColumns(x);
          ConvertRow(r);
        }
      }
    } else {
      for (int32_t x = job_.rect.left; x < job_.rect.right; x += kStrip) {
        SelectColumns(x);
        for (int32_t r = job_.rect.top; r < job_.rect.bottom; ++r) ConvertRow(r);
      }
    }
  }

 private:
  int32_t Width() const { return job_.rect.right - job_.rect.left; }
  int StripWidth(int32_t x) const {
    const int32_t rest = job_.rect.right - x;
    return rest < kStrip ? rest : kStrip;
  }

  void PrepareSums() {
    if (engine_.pathKind != PATH_YUV_TO_RGB) return;
    const YuvToRgbSums& s = engine_.rgbSums;
    const uint32_t* words = static_cast<const uint32_t*>(engine_.table);
    wide_ = {s.yGain, s.vToR, s.vToG, s.uToG, s.uToB, {}, {}, {}, {}};
    table_.clamp = static_cast<const uint8_t*>(engine_.table);
    table_.u = words + engine_.tableOffsets[0];
    table_.v = words + engine_.tableOffsets[1];
    table_.y = words + engine_.tableOffsets[2];
    for (int c = 0; c < 3; ++c) {
      table_.narrowing[c] = wide_.narrowing[c] = s.narrowing[c];
      wide_.offset[c] = s.offset[c];
      wide_.base[c] = s.indexBase[c];
      wide_.maximum[c] = s.maximum[c];
      const uint32_t bits = engine_.dstChannelSize[c];
      carry_.mask[c] = bits < 8 ? (1 << (8 - bits)) - 1 : 0;
      carry_.remainder[c] = carry_.mask[c] >> 1;
    }
  }

  void SelectColumns(int32_t x) {
    n_ = StripWidth(x);
    source_.SelectColumns(x, n_);
    destination_.SelectColumns(x, n_);
    if (engine_.pathKind == PATH_YUV_TO_RGB) {
      for (int i = 0; i < n_; ++i) columns_[i] = x + i;
      source_.SelectChroma(columns_, n_);
    } else if (engine_.pathKind == PATH_YUV_TO_YUV) {
      source_.SelectChroma(destination_.chromaColumns(), destination_.chromaCount());
    } else {
      for (int k = 0; k < destination_.chromaCount(); ++k) {
        columns_[k] = destination_.chromaColumns()[k] - x;
      }
    }
  }

  void ConvertRow(int32_t r) {
    switch (engine_.pathKind) {
      case PATH_YUV_TO_YUV:
        return YuvToYuv(r);
      case PATH_YUV_TO_RGB:
        return YuvToRgb(r);
      case PATH_RGB_TO_RGB:
        return RgbToRgb(r);
      default:
        return RgbToYuv(r);
    }
  }

  bool WantsChroma(int32_t r) const {
    return destination_.hasChroma() && destination_.chromaCount() > 0 &&
           destination_.WritesChroma(r);
  }

  const uint8_t* MapLevels(uint8_t* buffer, const uint8_t* run, int map, int n) {
    if (engine_.needsLevelTable == 0) return run;
    rows_.mapLevels(buffer, run, static_cast<const uint8_t*>(engine_.table) + 256 * map, n);
    return buffer;
  }

  void YuvToYuv(int32_t r) {
    destination_.PutLuma(r, MapLevels(channels_[0], source_.Luma(r), 0, n_));
    if (!WantsChroma(r)) return;
    const uint8_t *u, *v;
    source_.Chroma(r, &u, &v);
    const int n = destination_.chromaCount();
    destination_.PutChroma(r, MapLevels(channels_[1], u, 1, n), MapLevels(channels_[2], v, 1, n));
  }

  void YuvToRgb(int32_t r) {
    uint8_t* const rgb[3] = {channels_[0], channels_[1], channels_[2]};
    const uint8_t* y = source_.Luma(r);
    const uint8_t *u, *v;
    source_.Chroma(r, &u, &v);
    if (dithers_) {
      rows_.yuvToRgbCarry(rgb, y, u, v, wide_, &carry_, n_);
    } else if (engine_.rgbSums.insideClampTable == 0) {
      rows_.yuvToRgbWide(rgb, y, u, v, wide_, n_);
    } else {
      YuvToRgbByTable(rgb, y, u, v);
    }
    destination_.PutRgb(r, rgb, nullptr, engine_.dstFormat.colourStandard == 16);
  }

  void YuvToRgbByTable(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u,
                       const uint8_t* v) {
    rows_.yuvToRgb(rgb, y, u, v, table_, n_);
  }

  void RgbToRgb(int32_t r) {
    const RgbRun run = source_.Rgb(r);
    destination_.PutRgb(r, run.channel, run.alpha, false);
  }

  void RgbToYuv(int32_t r) {
    const RgbRun run = source_.Rgb(r);
    const auto tables = static_cast<RgbToYuvTables>(engine_.table);
    rows_.rgbToLuma(luma_, run.channel, tables, n_);
    destination_.PutLuma(r, luma_);
    if (!WantsChroma(r)) return;
    // Only the last pixel of each block decides.
    const int n = destination_.chromaCount();
    for (int c = 0; c < 3; ++c) rows_.gather(channels_[c], run.channel[c], columns_, n);
    const uint8_t* const last[3] = {channels_[0], channels_[1], channels_[2]};
    rows_.rgbToChroma(u_, v_, last, tables, n);
    destination_.PutChroma(r, u_, v_);
  }

  const Job& job_;
  const RowOps& rows_;
  const EngineContext& engine_;
  Source source_;
  Destination destination_;
  bool dithers_;
  YuvToRgbTable table_ = {};
  YuvToRgbWide wide_ = {};
  Carry carry_ = {};
  int n_ = 0;
  int32_t columns_[kStrip];  // chroma: loop columns, or columns of the strip
  uint8_t channels_[3][kStrip];
  uint8_t luma_[kStrip], u_[kStrip], v_[kStrip];
};

static_assert(sizeof(Pipeline) < 40 * 1024, "camera threads have small stacks");

}  // namespace

void RunPipeline(const Job& job) {
  if (!IsDrawable(job)) return;
  Pipeline pipeline(job);
  pipeline.Run();
}

}  // namespace kestrel
