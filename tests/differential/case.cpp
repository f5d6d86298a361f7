#include "tests/differential/case.h"

#include <algorithm>
#include <cstdio>
#include <utility>

#include "tests/support/formats.h"

namespace differential {
namespace {

using testing_support::GuardedBuffer;
using testing_support::PublicCodes;

constexpr auto kRgbCodes = PublicCodes<testing_support::IsRgbCode>();
constexpr auto kIndexedCodes = PublicCodes<testing_support::IsIndexedCode>();
constexpr auto kPackedCodes = PublicCodes<testing_support::IsPackedYuvCode>();
constexpr auto kPlanarCodes = PublicCodes<testing_support::IsPlanarCode>();
constexpr auto kSemiPlanarCodes = PublicCodes<testing_support::IsSemiPlanarCode>();
constexpr uint32_t kUnknownCodes[] = {0,          0x14000343, 0x42000000, 0x50000020, 0x50000d11,
                                      0x63000000, 0x70000001, 0x70000006, 0x80000000, 0xF5000454};

// Channel widths that no listed code has, spare bits low or high, either order.
uint32_t DrawOddRgb(Random* random) {
  const uint32_t family = random->Percent(50) ? 0x10000000u : 0x30000000u;
  const uint32_t storage = uint32_t(random->Between(5, 7)) << 24;
  const int32_t widest = random->Percent(80) ? 8 : 16;
  uint32_t widths = 0;
  for (int i = 0; i < 3; ++i) {
    widths = widths << 4 | uint32_t(random->Between(1, widest) - 1);
  }
  return family | storage | (random->Percent(50) ? 0x1000u : 0u) | widths;
}

uint32_t DrawFormat(Random* random) {
  const int32_t kind = random->Between(0, 199);
  if (kind < 56) {
    return random->Pick(kRgbCodes);
  }
  if (kind < 70) {
    return DrawOddRgb(random);
  }
  if (kind < 80) {
    return random->Pick(kIndexedCodes);
  }
  if (kind < 81) {
    return random->Pick(kUnknownCodes);
  }
  const uint32_t standard = uint32_t(random->Between(0, 3)) << 12;
  if (kind < 116) {
    return standard | random->Pick(kPackedCodes);
  }
  if (kind < 146) {
    return standard | random->Pick(kPlanarCodes);
  }
  if (kind < 160) {
    return standard | 0x50000800u | (random->Percent(50) ? 0x200u : 0u) |
           uint32_t(random->Between(0, 3)) << 4 | uint32_t(random->Between(0, 3));
  }
  if (kind < 174) {
    return standard | FORMAT_GRAY8;
  }
  return standard | random->Pick(kSemiPlanarCodes);
}

int32_t DrawLength(Random* random) {
  const int32_t kind = random->Between(1, 100);
  return random->Between(1, kind <= 45 ? 14 : kind <= 84 ? 34 : 70);
}

// About the lengths at which rows are cut, between them and up to two and a bit of the longest.
int32_t DrawLongLength(Random* random) {
  constexpr int32_t kCuts[] = {512, 1024, 2048, 2048};
  return random->Percent(35) ? random->Pick(kCuts) + random->Between(-2, 3)
                             : random->Between(500, 4700);
}

// A length along one axis of the walk.
using DrawAxis = int32_t (*)(Random* random);

int32_t DrawShortLength(Random* random) {
  return random->Between(1, 6);
}

void DrawSizes(Random* random, Lengths lengths, bool swapXY, MPPFORMAT* dst, MPPFORMAT* src) {
  DrawAxis across = DrawLength;
  DrawAxis down = DrawLength;
  if (lengths == Lengths::kLong) {
    const bool isWide = random->Percent(75);
    across = isWide ? DrawLongLength : DrawShortLength;
    down = isWide ? DrawShortLength : DrawLongLength;
  }
  src->width = across(random);
  src->height = down(random);
  int32_t width = src->width;
  int32_t height = src->height;
  const int32_t kind = random->Between(lengths == Lengths::kLong ? 20 : 1, 100);
  if (kind <= 40) {
    // 1:1
  } else if (kind <= 48) {
    width *= 2;
    height *= 2;
  } else if (kind <= 54) {
    width = (width + 1) / 2;
    height = (height + 1) / 2;
  } else if (kind <= 62) {
    width = across(random);
  } else if (kind <= 70) {
    height = down(random);
  } else {
    width = across(random);
    height = down(random);
    if (lengths == Lengths::kLong && width > src->width && random->Percent(60)) {
      std::swap(width, src->width);  // reduced, and many columns left
    }
  }
  dst->width = swapXY ? height : width;
  dst->height = swapXY ? width : height;
  if (random->Percent(1)) {
    int32_t* const sizes[] = {&dst->width, &dst->height, &src->width, &src->height};
    *random->Pick(sizes) = random->Between(-1, 0);
  }
}

int32_t DrawAdjustment(Random* random) {
  constexpr int32_t kExtremes[] = {-128, 128, -127, 127, -1, 1, -1000, 1000, INT32_MIN, INT32_MAX};
  const int32_t kind = random->Between(1, 100);
  return kind <= 40 ? 0 : kind <= 85 ? random->Between(-128, 128) : random->Pick(kExtremes);
}

int32_t DrawOrigin(Random* random) {
  const int32_t kind = random->Between(1, 100);
  return kind <= 55 ? 0 : kind <= 96 ? random->Between(1, 9) : -random->Between(1, 4);
}

void DrawParams(Random* random, MPPPARAM* params) {
  constexpr uint32_t kResample[] = {MPP_BILINEAR,
                                    MPP_BILINEAR,
                                    MPP_BILINEAR,
                                    MPP_BILINEAR,
                                    MPP_NEAREST,
                                    MPP_NEAREST,
                                    MPP_NEAREST,
                                    1,
                                    3};
  constexpr uint32_t kPassModes[] = {
      MPP_PASS_TILED, MPP_PASS_TILED, MPP_PASS_TILED, MPP_PASS_TILED, 1, 2, 3, 4, 0, 5};
  constexpr uint32_t kBands[] = {0, 2, 3, 4, 4, 5};
  constexpr uint32_t kAspects[] = {0, 0, 0, 1, 2, 2, 3, 4};
  constexpr uint32_t kAlphas[] = {0, 1, 128, 255, 256, 0xFFFFFFFFu};
  params->resampleFlags = random->Pick(kResample);
  params->transformCode = random->Percent(35) ? 0 : uint32_t(random->Between(0, 7));
  if (random->Percent(3)) {
    params->transformCode |= 8;
  }
  params->bandSelector = random->Pick(kBands);
  params->passMode = random->Pick(kPassModes);
  params->aspectMode = random->Pick(kAspects);
  params->dither = random->Percent(40) ? uint32_t(random->Between(1, 2)) : 0;
  if (random->Percent(40)) {
    params->brightness = DrawAdjustment(random);
    params->contrast = DrawAdjustment(random);
    params->saturation = DrawAdjustment(random);
  }
  params->srcOriginX = DrawOrigin(random);
  params->srcOriginY = DrawOrigin(random);
  params->dstOriginX = DrawOrigin(random);
  params->dstOriginY = DrawOrigin(random);
  params->alpha = random->Pick(kAlphas);
}

// Packed 4:2:2, whose columns come in pairs wherever rows are cut: on either side or on both.
void MakePairs(Random* random, Case* drawn) {
  constexpr auto kCodes = PublicCodes<testing_support::HasPackedPairs>();
  const int32_t kind = random->Between(1, 5);
  if (kind <= 3) {
    drawn->dst.record.format = random->Pick(kCodes) | uint32_t(random->Between(0, 3)) << 12;
  }
  if (kind >= 3) {
    drawn->src.record.format = random->Pick(kCodes) | uint32_t(random->Between(0, 3)) << 12;
    drawn->src.record.palette = nullptr;
  }
}

// The one pair that has a block mode of its own, too rare to be met by chance.
void MakePlanarEnlargement(Random* random, Case* drawn) {
  constexpr uint32_t kTransforms[] = {0, 3, 5, 6, 11};
  const uint32_t standard = drawn->dst.record.format & FORMAT_STANDARD_MASK;
  drawn->dst.record.format = FORMAT_I420 | standard;
  drawn->src.record = {FORMAT_I420 | standard, 0, 0, nullptr};
  drawn->params.resampleFlags = MPP_BILINEAR;
  drawn->params.passMode = 4;
  drawn->params.aspectMode = uint32_t(random->Between(0, 3));
  drawn->params.transformCode = random->Pick(kTransforms);
}

// start..end inside [low, high), at least one pixel.
void DrawInside(Random* random, int32_t low, int32_t high, int32_t* start, int32_t* end) {
  *start = random->Between(low, high - 1);
  *end = random->Between(*start + 1, high);
}

void DrawSourceRect(Random* random, const MPPFORMAT& src, MPPPARAM* params) {
  const int32_t left = std::max(params->srcOriginX, 0);
  const int32_t top = std::max(params->srcOriginY, 0);
  int32_t right = params->srcOriginX + src.width;
  int32_t bottom = params->srcOriginY + src.height;
  if (!random->Percent(30) || left >= right || top >= bottom) {
    return;
  }
  if (random->Percent(15)) {  // beyond the region: the last column and row repeat
    right += random->Between(0, 6);
    bottom += random->Between(0, 6);
  }
  DrawInside(random, left, right, &params->srcRect.left, &params->srcRect.right);
  DrawInside(random, top, bottom, &params->srcRect.top, &params->srcRect.bottom);
}

// A bit off both ends of low..high; odd starts and odd lengths, which cut pairs, are met most.
void DrawShortened(Random* random, int32_t low, int32_t high, int32_t* start, int32_t* end) {
  *start = low + random->Between(0, std::min(9, high - low - 1));
  if (*start % 2 == 0 && *start + 1 < high && random->Percent(60)) {
    ++*start;
  }
  *end = high - random->Between(0, std::min(9, high - *start - 1));
  if ((*end - *start) % 2 == 0 && random->Percent(60)) {
    --*end;
  }
}

void DrawDestinationRect(Random* random, Lengths lengths, Case* drawn) {
  const MPPPARAM& params = drawn->params;
  const int32_t left = params.dstOriginX;
  const int32_t top = params.dstOriginY;
  const int32_t right = left + std::max(drawn->dst.record.width, 1);
  const int32_t bottom = top + std::max(drawn->dst.record.height, 1);
  const int32_t kind = random->Between(1, 100);
  const bool isLong = lengths == Lengths::kLong;
  drawn->hasRect = kind > (isLong ? 25 : 40);
  MRECT& rect = drawn->rect;
  if (isLong && random->Percent(75)) {  // most columns are left
    DrawShortened(random, left, right, &rect.left, &rect.right);
    DrawShortened(random, top, bottom, &rect.top, &rect.bottom);
  } else if (kind <= 55) {
    rect = {left, top, right, bottom};
  } else if (kind <= 80) {
    DrawInside(random, left, right, &rect.left, &rect.right);
    DrawInside(random, top, bottom, &rect.top, &rect.bottom);
  } else if (kind <= 92) {
    DrawInside(random, left - 7, right + 7, &rect.left, &rect.right);
    DrawInside(random, top - 7, bottom + 7, &rect.top, &rect.bottom);
  } else {  // far away, empty or inverted
    rect = {random->Between(-30, 110), random->Between(-30, 110), random->Between(-30, 110),
            random->Between(-30, 110)};
  }
}

Placement DrawPlacement(Random* random) {
  Placement placement;
  placement.edge = random->Percent(70) ? GuardedBuffer::Edge::kEnd : GuardedBuffer::Edge::kStart;
  placement.alignment = random->Percent(45) ? 1 : random->Percent(50) ? 4 : 16;
  placement.remainder = random->Percent(70) ? 0 : uint32_t(random->Between(0, 15));
  return placement;
}

int32_t DrawPitch(Random* random, int32_t rowBytes) {
  const int32_t kind = random->Between(1, 100);
  int32_t pitch = rowBytes;  // tight
  if (kind > 80) {
    pitch = (rowBytes + 15) / 16 * 16 + 16 * random->Between(0, 1);
  } else if (kind > 50) {
    pitch = (rowBytes + 3) / 4 * 4;
  } else if (kind > 25) {
    pitch += random->Between(0, 9);
  }
  return random->Percent(20) ? -pitch : pitch;
}

void Append(std::string* text, const char* name, const MPPFORMAT& record, const Side& side) {
  char line[256];
  std::snprintf(line, sizeof(line), "  %s: format 0x%08x (internal 0x%x) %dx%d%s", name,
                record.format, side.format.code, record.width, record.height,
                record.palette ? ", palette" : "");
  *text += line;
  for (int i = 0; i < side.blocks.count; ++i) {
    const Block& block = side.blocks.block[i];
    std::snprintf(
        line, sizeof(line), "\n    block %d: %d bytes x %d rows, pitch %d, at the %s, %u mod %u", i,
        block.rowBytes, block.rows, side.pitches[i],
        side.placement[i].edge == GuardedBuffer::Edge::kEnd ? "end" : "start",
        side.placement[i].remainder % side.placement[i].alignment, side.placement[i].alignment);
    *text += line;
  }
  if (side.nullSlot >= 0) {
    *text += "\n    null plane in slot " + std::to_string(side.nullSlot);
  }
  *text += '\n';
}

}  // namespace

void DrawSide(Random* random, int32_t imageWidth, int32_t imageHeight, Side* side) {
  side->nullSlot = -1;
  side->isKnown = reference::DecodeFormat(side->record, &side->format) == 0;
  if (!side->isKnown) {
    side->blocks = ImageBlocks{1, {{1, 1}, {0, 0}, {0, 0}}};
  } else {
    side->blocks = BlocksOf(side->format, std::max(imageWidth, 1), std::max(imageHeight, 1),
                            random->Percent(10));
  }
  for (int i = 0; i < side->blocks.count; ++i) {
    side->pitches[i] = DrawPitch(random, side->blocks.block[i].rowBytes);
    side->placement[i] = DrawPlacement(random);
  }
  if (side->blocks.count == 2 || (side->blocks.count == 3 && random->Percent(50))) {
    side->pitches[2] = side->pitches[1];
  }
  if (side->isKnown && side->format.planeCount == 3 && random->Percent(1)) {
    side->nullSlot = random->Between(1, 2);
  }
}

Case DrawCase(uint64_t seed, uint64_t number, Lengths lengths) {
  static const uint8_t kSomePalette[4] = {0, 0, 0, 0};
  Random random(seed, number);
  Case drawn{};
  drawn.seed = seed;
  drawn.number = number;
  drawn.dst.record.format = DrawFormat(&random);
  drawn.src.record.format = random.Percent(12) ? drawn.dst.record.format : DrawFormat(&random);
  if (testing_support::IsIndexedCode(drawn.src.record.format) && !random.Percent(5)) {
    drawn.src.record.palette = kSomePalette;
  }
  DrawParams(&random, &drawn.params);
  if (lengths == Lengths::kLong && random.Percent(40)) {
    MakePairs(&random, &drawn);
  }
  if (random.Percent(1)) {
    MakePlanarEnlargement(&random, &drawn);
  }
  if (lengths == Lengths::kLong && random.Percent(50)) {
    drawn.params.transformCode = 0;  // more ways of converting take no transformed picture
  }
  DrawSizes(&random, lengths, (drawn.params.transformCode & 1) != 0, &drawn.dst.record,
            &drawn.src.record);
  DrawSourceRect(&random, drawn.src.record, &drawn.params);
  DrawDestinationRect(&random, lengths, &drawn);
  constexpr Content kContents[] = {Content::kNoise, Content::kNoise, Content::kExtremes,
                                   Content::kSmooth};
  drawn.content = random.Pick(kContents);

  int32_t dstRight = drawn.params.dstOriginX + drawn.dst.record.width;
  int32_t dstBottom = drawn.params.dstOriginY + drawn.dst.record.height;
  if (drawn.hasRect) {
    dstRight = std::max(dstRight, drawn.rect.right);
    dstBottom = std::max(dstBottom, drawn.rect.bottom);
  }
  DrawSide(&random, dstRight, dstBottom, &drawn.dst);
  DrawSide(&random, drawn.params.srcOriginX + drawn.src.record.width,
           drawn.params.srcOriginY + drawn.src.record.height, &drawn.src);
  if (drawn.dst.isKnown && drawn.dst.format.IsGrey()) {
    drawn.src.nullSlot = -1;  // whether grey output needs chroma planes is nobody's promise
  }
  return drawn;
}

std::string Describe(const Case& drawn) {
  char line[512];
  std::string text =
      "case " + std::to_string(drawn.number) + " of seed " + std::to_string(drawn.seed) + "\n";
  Append(&text, "destination", drawn.dst.record, drawn.dst);
  Append(&text, "source", drawn.src.record, drawn.src);
  const MPPPARAM& p = drawn.params;
  std::snprintf(
      line, sizeof(line),
      "  resample %u, transform %u, bands %u, pass mode %u, aspect %u, dither %u, alpha %u\n"
      "  brightness %d, contrast %d, saturation %d\n"
      "  source origin (%d, %d), source rectangle (%d, %d, %d, %d)\n"
      "  destination origin (%d, %d), ",
      p.resampleFlags, p.transformCode, p.bandSelector, p.passMode, p.aspectMode, p.dither, p.alpha,
      p.brightness, p.contrast, p.saturation, p.srcOriginX, p.srcOriginY, p.srcRect.left,
      p.srcRect.top, p.srcRect.right, p.srcRect.bottom, p.dstOriginX, p.dstOriginY);
  text += line;
  if (drawn.hasRect) {
    std::snprintf(line, sizeof(line), "rectangle (%d, %d, %d, %d)\n", drawn.rect.left,
                  drawn.rect.top, drawn.rect.right, drawn.rect.bottom);
    text += line;
  } else {
    text += "no rectangle\n";
  }
  return text;
}

}  // namespace differential
