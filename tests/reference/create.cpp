// Creation: steps, aspect policy, block rounding and the covered rectangle.
#include <algorithm>
#include <cstdint>

#include "tests/reference/reference.h"

namespace reference {
namespace {

constexpr uint32_t kOk = 0;
constexpr uint32_t kBadArgument = 2;
constexpr int64_t kUnitStep = 0x10000;

// Source pixels per destination pixel, in double precision as callers know it.
int64_t Step(int64_t source, int64_t destination) {
  const double step = 65536.0 * double(source) / double(destination);
  return step >= 4294967295.0 ? 0xFFFFFFFFLL : int64_t(step);
}

int64_t FloorDivide(int64_t value, int64_t divisor) {
  const int64_t quotient = value / divisor;
  return quotient * divisor > value ? quotient - 1 : quotient;
}

int64_t RoundDown(int64_t value, int64_t multiple) {
  return FloorDivide(value, multiple) * multiple;
}

int64_t RoundUp(int64_t value, int64_t multiple) {
  return -RoundDown(-value, multiple);
}

uint32_t BlockMode(const Format& dst, const Format& src, uint32_t passMode, bool fast4x4) {
  const bool anySubsampling = dst.code == CODE_YV_ANY || dst.code == CODE_I_ANY ||
                              src.code == CODE_YV_ANY || src.code == CODE_I_ANY;
  if (passMode < 2 || passMode > 4 || anySubsampling || src.palette != nullptr) {
    return 1;
  }
  return passMode == 4 && !fast4x4 ? 3 : passMode;
}

// Regions and sizes are rounded to the blocks of the engine.
int64_t BlockSize(uint32_t blockMode) {
  return blockMode == 2 ? 2 : blockMode == 3 ? 4 : 1;
}

// One axis of a region that shrinks about its centre.
struct Span {
  int64_t origin;
  int64_t length;
};

void ShrinkToFit(int64_t newLength, int64_t block, Span* span) {
  const int64_t kept = RoundDown(newLength, block);
  const int64_t margin = RoundUp((span->length - kept + 1) >> 1, block);
  span->origin += margin;
  span->length -= 2 * margin;
}

void Crop(int64_t newLength, int64_t block, Span* span) {
  const int64_t kept = RoundDown(newLength, block);
  const int64_t margin = RoundDown((span->length - kept + 1) >> 1, block);
  span->origin += margin;
  span->length -= 2 * margin;
}

// Two codes stand for others while an engine is built.
MPPFORMAT Normalised(MPPFORMAT record) {
  if (record.format == FORMAT_BGRX8888) {
    record.format = FORMAT_XBGR8888;
  } else if (record.format == FORMAT_RGBX8888) {
    record.format = FORMAT_XRGB8888;
  }
  return record;
}

ColourPath PathOf(const Format& dst, const Format& src) {
  if (src.IsRgb()) {
    return dst.IsRgb() ? ColourPath::kRgbToRgb : ColourPath::kRgbToYuv;
  }
  return dst.IsRgb() ? ColourPath::kYuvToRgb : ColourPath::kYuvToYuv;
}

bool IsGiven(const MRECT& rect) {
  return rect.left || rect.top || rect.right || rect.bottom;
}

}  // namespace

uint32_t BuildEngine(const MPPFORMAT& dst, const MPPFORMAT& src, const MPPPARAM& params,
                     uint32_t passMode, Engine* engine) {
  if (dst.width == 0 || dst.height == 0 || src.width == 0 || src.height == 0) {
    return kBadArgument;
  }
  *engine = Engine();
  if (const uint32_t code = DecodeFormat(Normalised(dst), &engine->dst); code != kOk) {
    return code;
  }
  if (const uint32_t code = DecodeFormat(Normalised(src), &engine->src); code != kOk) {
    return code;
  }
  if (dst.width < 0 || dst.height < 0 || src.width < 0 || src.height < 0) {
    return kBadArgument;  // their steps are below 0, which comes after the formats
  }
  engine->path = PathOf(engine->dst, engine->src);
  engine->passMode = passMode;
  engine->transformCode = params.transformCode;
  engine->swapXY = (params.transformCode & 1) != 0;
  engine->mirrorX = (params.transformCode & 2) != 0;
  engine->mirrorY = (params.transformCode & 4) != 0;
  engine->tallBands = params.bandSelector == 4;
  engine->alpha = uint8_t(std::min<uint32_t>(params.alpha, 255));

  // Loop orientation: x runs along source rows.
  Span width{params.dstOriginX, dst.width};
  Span height{params.dstOriginY, dst.height};
  Span& loopX = engine->swapXY ? height : width;
  Span& loopY = engine->swapXY ? width : height;
  Span srcX{params.srcOriginX, src.width};
  Span srcY{params.srcOriginY, src.height};
  engine->stepX = Step(srcX.length, loopX.length);
  engine->stepY = Step(srcY.length, loopY.length);

  // Decided before the aspect policy, which may still turn the job into 1:1.
  engine->bilinear =
      params.resampleFlags == 2 && !(engine->stepX == kUnitStep && engine->stepY == kUnitStep);

  if (IsGiven(params.srcRect)) {
    engine->srcRect = {params.srcRect.left, params.srcRect.top, params.srcRect.right,
                       params.srcRect.bottom};
  } else {
    engine->srcRect = {srcX.origin, srcY.origin, srcX.origin + srcX.length,
                       srcY.origin + srcY.length};
  }
  engine->srcReadRight = srcX.origin + srcX.length;
  engine->srcReadBottom = srcY.origin + srcY.length;
  engine->dstImageRight = width.origin + width.length;

  const bool fast4x4 =
      engine->bilinear && engine->dst.code == CODE_I420 && engine->src.code == CODE_I420 &&
      (params.transformCode == 0 || params.transformCode == 3 || params.transformCode == 5);
  engine->blockMode = BlockMode(engine->dst, engine->src, passMode, fast4x4);
  const int64_t block = BlockSize(engine->blockMode);

  if (engine->stepX != engine->stepY) {
    if (params.aspectMode & MPP_ASPECT_FIT) {
      if (engine->stepX <= engine->stepY) {
        ShrinkToFit(loopY.length * srcX.length / srcY.length, block, &loopX);
        engine->stepX = engine->stepY;
      } else {
        ShrinkToFit(loopX.length * srcY.length / srcX.length, block, &loopY);
        engine->stepY = engine->stepX;
      }
    }
    // An engine whose destination is already empty draws nothing, whatever the source.
    if ((params.aspectMode & MPP_ASPECT_CROP) && loopX.length > 0 && loopY.length > 0) {
      if (engine->stepX < engine->stepY) {
        Crop(loopY.length * srcX.length / loopX.length, block, &srcY);
        engine->stepY = engine->stepX;
      } else {
        Crop(loopX.length * srcY.length / loopY.length, block, &srcX);
        engine->stepX = engine->stepY;
      }
    }
  }
  if (engine->stepX == 0 || engine->stepY == 0) {
    return kBadArgument;
  }

  engine->sourceIsEmpty = srcX.length <= 0 || srcY.length <= 0;
  engine->srcOriginX = srcX.origin;
  engine->srcOriginY = srcY.origin;
  engine->loopOriginX = loopX.origin;
  engine->loopOriginY = loopY.origin;
  engine->dstRegion = {width.origin, height.origin, width.origin + width.length,
                       height.origin + height.length};

  const int64_t centreX = engine->stepX / 2 + 32768;
  const int64_t centreY = engine->stepY / 2 + 32768;
  const Rect& given = engine->srcRect;
  const auto covered = [](int64_t position, int64_t origin, int64_t centre, int64_t step) {
    return ((position - origin) * 65536 + centre) / step;
  };
  engine->coveredRect = {
      covered(given.left, srcX.origin, centreX, engine->stepX) + loopX.origin,
      covered(given.top, srcY.origin, centreY, engine->stepY) + loopY.origin,
      covered(given.right - 1, srcX.origin, centreX, engine->stepX) + loopX.origin + 1,
      covered(given.bottom - 1, srcY.origin, centreY, engine->stepY) + loopY.origin + 1};

  const auto clampAdjustment = [](int32_t value) { return std::clamp(value, -128, 128); };
  const Adjustments adjustments{clampAdjustment(params.brightness),
                                clampAdjustment(params.contrast),
                                clampAdjustment(params.saturation)};
  if (engine->path == ColourPath::kYuvToRgb) {
    engine->yuvToRgb = YuvToRgb(engine->src, engine->dst, adjustments);
  }
  engine->dither = params.dither != 0 && (dst.format & 0xFF000000) == 0x15000000;
  if (engine->path == ColourPath::kYuvToYuv) {
    engine->changesLevels =
        !adjustments.IsNeutral() || ((engine->src.standard ^ engine->dst.standard) & 3) != 0;
    engine->levels = LevelChange(engine->src.standard, engine->dst.standard, adjustments);
    if (engine->changesLevels && ((engine->src.standard ^ engine->dst.standard) & 3) == 0) {
      // Levels that change within one range make both sides video range from here on.
      engine->src.standard = (engine->src.standard & ~3u) | 1;
      engine->dst.standard = (engine->dst.standard & ~3u) | 1;
    }
  }
  if (IsUnitScale(*engine)) {
    engine->blockMode = std::min(engine->blockMode, 3u);
    if (engine->blockMode == 3 && engine->changesLevels) {
      engine->blockMode = 2;
    }
  }
  return kOk;
}

}  // namespace reference
