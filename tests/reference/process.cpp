// Processing: tiling, bands, mirroring and the binding of planes.
#include <algorithm>
#include <cstdint>
#include <utility>

#include "tests/reference/chooser.h"
#include "tests/reference/reference.h"

namespace reference {
namespace {

constexpr uint32_t kOk = 0;
constexpr uint32_t kBadArgument = 2;

// Planes and pitches per component, whatever the number of planes.
template <typename Byte>
struct Binding {
  Byte* address[3];
  int32_t pitch[3];

  Binding(const Format& format, Byte* const* planes, const int32_t* pitches) {
    for (int i = 0; i < 3; ++i) {
      if (format.planeCount == 3) {
        address[i] = planes[i];
        pitch[i] = pitches[i];
      } else {
        address[i] = planes[0] + format.offset[i];
        pitch[i] = pitches[0];
      }
    }
    if (format.HasVPlaneFirst()) {
      std::swap(address[kU], address[kV]);  // the pitches stay in their places
    }
  }

  bool HasNullPlane() const { return !address[0] || !address[1] || !address[2]; }
};

Rect Transposed(const Rect& rect) {
  return {rect.top, rect.left, rect.bottom, rect.right};
}

// Each edge of a strip is moved into the outer rectangle.
Rect ClampedInto(const Rect& rect, const Rect& bounds) {
  return {std::clamp(rect.left, bounds.left, bounds.right),
          std::clamp(rect.top, bounds.top, bounds.bottom),
          std::clamp(rect.right, bounds.left, bounds.right),
          std::clamp(rect.bottom, bounds.top, bounds.bottom)};
}

class Runner {
 public:
  Runner(const Engine& engine, const Job& job)
      : engine_(engine), job_(job), quirks_(QuirksOf(Choose(engine).kernel)) {}

  void Run(const Rect& rect) const {
    // The limits are measured from the clipped corner, not from that of the region.
    const Rect& region = engine_.dstRegion;
    Rect working = rect;
    working.left = std::max(working.left, region.left);
    working.top = std::max(working.top, region.top);
    working.right = std::min(working.right, working.left + (region.right - region.left));
    working.bottom = std::min(working.bottom, working.top + (region.bottom - region.top));

    int64_t next = working.top;
    int64_t lastBottom = 0;
    if (engine_.swapXY) {
      const int64_t bandHeight = engine_.tallBands ? 64 : 32;
      for (; next < working.bottom - bandHeight; next += bandHeight) {
        lastBottom = next + bandHeight;
        Dispatch({working.left, next, working.right, lastBottom});
      }
    }
    if (lastBottom < working.bottom) {
      Dispatch({working.left, next, working.right, working.bottom});
    }
  }

 private:
  void Dispatch(const Rect& band) const {
    KernelCall call;
    if (PrepareCall(engine_, job_, band, &call)) {
      ConvertLoopRect(engine_, call.loopRect, call.dstPitches, call.srcPitches, call.dstStarts,
                      call.srcPlanes, quirks_);
    }
  }

  const Engine& engine_;
  const Job& job_;
  const Quirks quirks_;
};

bool IsMultipleOf4(int64_t value) {
  return value % 4 == 0;
}

bool AllowsLargeGrid(const Engine& engine, const Job& job) {
  const Rect& region = engine.dstRegion;
  const bool mirrored = engine.mirrorX || engine.mirrorY;
  return IsMultipleOf4(job.dstPitches[0]) && IsMultipleOf4(job.srcPitches[0]) &&
         IsMultipleOf4(int64_t(reinterpret_cast<intptr_t>(job.dstPlanes[0]))) &&
         IsMultipleOf4(int64_t(reinterpret_cast<intptr_t>(job.srcPlanes[0]))) &&
         (!mirrored ||
          (IsMultipleOf4(region.right - region.left) && IsMultipleOf4(region.bottom - region.top)));
}

// passes: engines of block mode 1, 2 and 3.
void RunTiled(const Engine* passes, const Job& job) {
  const Rect outer = job.hasRect
                         ? Rect{job.rect.left, job.rect.top, job.rect.right, job.rect.bottom}
                         : passes[0].dstRegion;
  if (outer.IsEmpty()) {
    return;
  }
  const bool large = AllowsLargeGrid(passes[2], job);
  const int64_t columns = large ? 16 : 2;
  const int64_t rows = large ? 8 : 2;
  Rect inner = {(outer.left + columns - 1) / columns * columns,
                (outer.top + rows - 1) / rows * rows, outer.right / columns * columns,
                outer.bottom / rows * rows};
  const bool columnsCross = inner.left > inner.right;
  const bool rowsCross = inner.top > inner.bottom;
  inner.left = std::min(inner.left, inner.right);
  inner.top = std::min(inner.top, inner.bottom);
  if (!columnsCross && !rowsCross && !inner.IsEmpty()) {
    Runner(passes[large ? 2 : 1], job).Run(inner);
  }

  const Runner border(passes[0], job);
  const auto runStrip = [&](bool needed, const Rect& strip) {
    const Rect clamped = ClampedInto(strip, outer);
    if (needed && !clamped.IsEmpty()) {
      border.Run(clamped);
    }
  };
  runStrip(inner.top != outer.top, {outer.left, outer.top, outer.right, inner.top});
  runStrip(inner.bottom != outer.bottom, {outer.left, inner.bottom, outer.right, outer.bottom});
  runStrip(inner.left != outer.left, {outer.left, inner.top, inner.left, inner.bottom});
  runStrip(inner.right != outer.right, {inner.right, inner.top, outer.right, inner.bottom});
}

}  // namespace

bool PrepareCall(const Engine& engine, const Job& job, const Rect& band, KernelCall* call) {
  const Binding<uint8_t> dst(engine.dst, job.dstPlanes, job.dstPitches);
  const Binding<const uint8_t> src(engine.src, job.srcPlanes, job.srcPitches);
  const int64_t x = engine.mirrorX ? band.right - 1 : band.left;
  const int64_t y = engine.mirrorY ? band.bottom - 1 : band.top;
  if (band.IsEmpty() || dst.HasNullPlane() || src.HasNullPlane() || x < 0 || y < 0) {
    return false;
  }
  for (int i = 0; i < 3; ++i) {
    call->dstStarts[i] = dst.address[i] + dst.pitch[i] * (y / engine.dst.vertical[i]) +
                         engine.dst.step[i] * (x / engine.dst.horizontal[i]);
    call->dstPitches[i] = engine.mirrorY ? -dst.pitch[i] : dst.pitch[i];
    call->srcPlanes[i] = src.address[i];
    call->srcPitches[i] = src.pitch[i];
  }
  Rect& loop = call->loopRect;
  const Rect& region = engine.dstRegion;
  loop = band;
  if (engine.mirrorY) {
    loop.top = region.top + region.bottom - band.bottom;
    loop.bottom = region.top + region.bottom - band.top;
  }
  if (engine.mirrorX) {
    loop.left = region.left + region.right - band.right;
    loop.right = region.left + region.right - band.left;
  }
  if (engine.swapXY) {
    loop = Transposed(loop);
  }
  return true;
}

uint32_t Convert(const Job& job) {
  const bool tiled = job.params.passMode == MPP_PASS_TILED;
  Engine passes[3];
  for (int i = 0; i < (tiled ? 3 : 1); ++i) {
    const uint32_t passMode = tiled ? uint32_t(i) + 1 : job.params.passMode;
    if (const uint32_t code = BuildEngine(job.dst, job.src, job.params, passMode, &passes[i]);
        code != kOk) {
      return code;
    }
  }
  if (!job.dstPlanes[0] || !job.srcPlanes[0]) {
    return kBadArgument;
  }
  if (tiled) {
    RunTiled(passes, job);
  } else {
    Runner(passes[0], job)
        .Run(job.hasRect ? Rect{job.rect.left, job.rect.top, job.rect.right, job.rect.bottom}
                         : passes[0].dstRegion);
  }
  return kOk;
}

}  // namespace reference
