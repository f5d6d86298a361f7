// Construction of the conversion table block: standards, picture adjustments, rounding halves and
// clamp biases are all folded in here, so that a pixel costs table reads and additions only.
#include "colour/conversion_tables.h"

#include "platform/tessel/tessel.h"

namespace kestrel {
namespace {

constexpr int32_t kHalf = 32768;              // 0.5 in Q16
constexpr int32_t kChromaCentre = 128 << 16;  // in Q16
constexpr int32_t kVideoLumaFoot = 16 << 16;  // in Q16

// Adjustments below zero act at half strength: -128 gives a gain of 0, 128 one of 3.
int32_t HalvedBelowZero(int32_t parameter) {
  return parameter < 0 ? parameter >> 1 : parameter;
}

// value x multiplier / 256, rounded half away from zero.
int64_t ScaleBy256th(int64_t value, int32_t multiplier) {
  const int64_t magnitude =
      (value < 0 ? -value : value) * (multiplier < 0 ? -multiplier : multiplier);
  const int64_t scaled = (magnitude + 128) >> 8;
  return (value < 0) != (multiplier < 0) ? -scaled : scaled;
}

uint8_t ClampToByte(int32_t value) {
  return uint8_t(value < 0 ? 0 : value > 255 ? 255 : value);
}

void* AllocateTable(EngineContext* c, uint32_t size) {
  c->table = MMemAlloc(nullptr, size);
  if (c->table != nullptr) c->tableSize = size;
  return c->table;
}

// Whether the table of an engine of the same conversion could be taken over.
bool CopyTable(const EngineContext* like, EngineContext* c) {
  if (like == nullptr || like->table == nullptr) return false;
  MMemCpy(c->table, like->table, c->tableSize);
  return true;
}

// How a channel of `bits` bits reads the clamp tables: its narrowing, where value 0 lies in the
// table, and the greatest value. 16-bit pixels have tables of their own; in them every width but
// six uses the five-bit table's base.
void DescribeClamp(bool is16Bit, uint32_t bits, YuvToRgbSums* sums, int channel) {
  const bool narrow = is16Bit && bits < 8;
  sums->narrowing[channel] = narrow ? 8 - bits : 0;
  sums->indexBase[channel] = !narrow ? 512 : bits == 6 ? 288 : 64;
  sums->maximum[channel] = narrow ? (1 << bits) - 1 : 255;
}

// `feet` zeros, 0..maximum, and `heads` times the maximum.
uint8_t* WriteClampTable(uint8_t* table, int feet, int maximum, int heads) {
  MMemSet(table, 0, uint32_t(feet));
  table += feet;
  for (int value = 0; value <= maximum; ++value) table[value] = uint8_t(value);
  table += maximum + 1;
  MMemSet(table, maximum, uint32_t(heads));
  return table + heads;
}

void WriteClampTables(bool is16Bit, uint8_t* block) {
  if (is16Bit) {
    block = WriteClampTable(block, 64, 31, 64);
    WriteClampTable(block, 128, 63, 128);
  } else {
    WriteClampTable(block, 512, 255, 512);
  }
}

// first + i * gain for 0 <= i < 256. Written by adding up, which compilers turn into vectors also
// where these have no product of 32 bits. Unsigned, because the sum after the last may wrap.
struct Sum {
  int32_t first, gain;
};

void WriteLine(const Sum& sum, uint32_t* table) {
  const uint32_t gain = uint32_t(sum.gain);
  uint32_t value = uint32_t(sum.first);
  for (int i = 0; i < 128; ++i, value += gain) {
    table[i] = value;
    table[128 + i] = value + 128 * gain;
  }
}

// Two sums without their twelve lowest bits, in the low and the high half of each word.
void WriteChromaLine(const Sum& lowHalf, const Sum& highHalf, uint32_t* table) {
  uint32_t low = uint32_t(lowHalf.first) * 16;
  uint32_t high = uint32_t(highHalf.first) * 16;
  const uint32_t lowGain = uint32_t(lowHalf.gain) * 16;
  const uint32_t highGain = uint32_t(highHalf.gain) * 16;
  for (int i = 0; i < 256; ++i, low += lowGain, high += highGain) {
    table[i] = low >> 16 | (high & 0xFFFF0000);
  }
}

void WriteLevelLine(const Sum& sum, uint8_t* levels) {
  uint32_t value = uint32_t(sum.first);
  for (int i = 0; i < 256; ++i, value += uint32_t(sum.gain)) {
    levels[i] = ClampToByte(int32_t(value) >> 16);
  }
}

// Whether every colour stays inside the clamp tables, so that no sum wraps and none reads beyond
// them. Each sum is monotonic in each input: its extremes are at the corners.
bool StaysInsideClampTables(const YuvToRgbSums& s, bool is16Bit) {
  const int32_t gains[3][3] = {
      {s.yGain, s.vToR, 0}, {s.yGain, s.vToG, s.uToG}, {s.yGain, s.uToB, 0}};
  for (int channel = 0; channel < 3; ++channel) {
    int64_t low = s.offset[channel];
    int64_t high = s.offset[channel];
    for (const int32_t gain : gains[channel]) (gain < 0 ? low : high) += int64_t(gain) * 255;
    // Truncations of the chroma words take up to 1/8 level, carries of their low halves add up to
    // one; a carried remainder adds less than one step of the narrowest field.
    low -= 1 << 14;
    high += 9 << 16;
    // Where the channel's table begins and ends, in levels before narrowing. Fields of unusual
    // width have none.
    int64_t first = 0;
    int64_t last = 1280;
    if (is16Bit) {
      const uint32_t narrowing = s.narrowing[channel];
      if (narrowing != 3 && narrowing != 2) return false;
      first = narrowing == 2 ? 160 << 2 : 0;
      last = narrowing == 2 ? 480 << 2 : 160 << 3;
    }
    if (low < first * 65536 || high >= last * 65536) return false;
  }
  return true;
}

void BuildYuvToRgb(const EngineContext* like, EngineContext* c) {
  const MPPPARAM& p = c->params;
  if (c->srcFormat.code == CODE_GRAY8) c->params.contrast = c->params.saturation = 0;
  const YuvToRgbCoeffs& row = YuvToRgbRow(c->srcFormat.colourStandard);
  const bool is16Bit = c->dstFormat.colourStandard == 16;
  YuvToRgbSums& s = c->rgbSums;
  s.yGain = AdjustGain(row.y, p.contrast, p.saturation, 0);
  s.vToR = AdjustGain(row.vToR, p.contrast, p.saturation, 1);
  s.uToG = AdjustGain(-row.uToG, p.contrast, p.saturation, 1);
  s.vToG = AdjustGain(-row.vToG, p.contrast, p.saturation, 1);
  s.uToB = AdjustGain(row.uToB, p.contrast, p.saturation, 1);

  // G's rounding half goes in before the contrast pivot, R's and B's after it: with contrast this
  // moves G by a fraction, and every picture adjusted so far has it.
  const int32_t brightness = p.brightness * row.y;
  s.offset[0] = AdjustOffset(brightness - row.rBias, p.contrast, p.saturation, row.vToR) + kHalf;
  s.offset[1] =
      AdjustOffset(brightness + row.gBias + kHalf, p.contrast, p.saturation, -row.uToG - row.vToG);
  s.offset[2] = AdjustOffset(brightness - row.bBias, p.contrast, p.saturation, row.uToB) + kHalf;
  for (int channel = 0; channel < 3; ++channel) {
    DescribeClamp(is16Bit, c->dstChannelSize[channel], &s, channel);
    s.offset[channel] += s.indexBase[channel] << (s.narrowing[channel] + 16);
  }
  s.insideClampTable = StaysInsideClampTables(s, is16Bit);

  const uint32_t size = is16Bit ? kRgb16BlockSize : kRgbBlockSize;
  if (AllocateTable(c, size) == nullptr) return;
  c->tableOffsets[0] = (size - 2 * kChannelTableSize) / 4;
  c->tableOffsets[1] = (size - kChannelTableSize) / 4;
  c->tableOffsets[2] = (size - 3 * kChannelTableSize) / 4;
  if (CopyTable(like, c)) return;
  WriteClampTables(is16Bit, static_cast<uint8_t*>(c->table));
  uint32_t* const words = static_cast<uint32_t*>(c->table);
  WriteLine({0, s.yGain * 16}, words + c->tableOffsets[2]);
  WriteChromaLine({0, s.uToG}, {s.offset[2], s.uToB}, words + c->tableOffsets[0]);
  WriteChromaLine({s.offset[1], s.vToG}, {s.offset[0], s.vToR}, words + c->tableOffsets[1]);
}

void BuildRgbToYuv(const EngineContext* like, EngineContext* c) {
  const RgbToYuvCoeffs& row = RgbToYuvRow(c->dstFormat.colourStandard);
  if (AllocateTable(c, kYuvBlockSize) == nullptr || CopyTable(like, c)) return;
  const int32_t foot = (c->dstFormat.colourStandard & CS_VIDEO_RANGE) != 0 ? kVideoLumaFoot : 0;
  const Sum lines[] = {
      {foot, row.rToY}, {0, row.gToY},
      {0, row.bToY},    {0, -row.rToU},
      {0, -row.gToU},   {kChromaCentre, row.rToV},  // bToU is the same number in every row
      {0, -row.gToV},   {0, -row.bToV}};
  uint32_t* words = static_cast<uint32_t*>(c->table);
  for (const Sum& line : lines) {
    WriteLine(line, words);
    words += 256;
  }
}

struct LevelMap {
  int32_t lumaGain, lumaOffset, chromaGain, chromaOffset;
};

LevelMap ChooseLevelMap(EngineContext* c) {
  uint32_t& src = c->srcFormat.colourStandard;
  uint32_t& dst = c->dstFormat.colourStandard;
  const int32_t brightness = c->params.brightness * 65536;
  if ((src & CS_FULL_RANGE) != 0 && (dst & CS_VIDEO_RANGE) != 0) {
    return {56066, brightness + kVideoLumaFoot, 57344, 1048576};
  }
  if ((src & CS_VIDEO_RANGE) != 0 && (dst & CS_FULL_RANGE) != 0) {
    // The luma foot is added, not removed: 16 becomes 37. Stored pictures depend on it.
    return {76608, brightness + 1225728, 74901, -1198372};
  }
  // Equal ranges are handled as video range from here on, also by the kernels that ask.
  src = (src & ~3u) | CS_VIDEO_RANGE;
  dst = (dst & ~3u) | CS_VIDEO_RANGE;
  return {65536, brightness, 65536, 0};
}

void BuildLevelTable(const EngineContext* like, EngineContext* c) {
  const MPPPARAM& p = c->params;
  const LevelMap map = ChooseLevelMap(c);
  const int32_t lumaGain = AdjustGain(map.lumaGain, p.contrast, p.saturation, 0);
  const int32_t lumaOffset = AdjustOffset(map.lumaOffset, p.contrast, p.saturation, 0);
  const int32_t chromaGain = AdjustGain(map.chromaGain, p.contrast, p.saturation, 1);
  const int32_t chromaOffset =
      AdjustOffset(map.chromaOffset, p.contrast, p.saturation, map.chromaGain);
  c->levelSums = {{lumaGain, chromaGain}, {lumaOffset + kHalf, chromaOffset + kHalf}};
  if (AllocateTable(c, kLevelBlockSize) == nullptr || CopyTable(like, c)) return;
  uint8_t* const levels = static_cast<uint8_t*>(c->table);
  WriteLevelLine({lumaOffset + kHalf, lumaGain}, levels);
  WriteLevelLine({chromaOffset + kHalf, chromaGain}, levels + 256);
}

}  // namespace
}  // namespace kestrel

using namespace kestrel;

extern "C" {

int32_t ScaleByGain(int32_t value, int32_t parameter) {
  return int32_t(ScaleBy256th(value, 4 * (HalvedBelowZero(parameter) + 64)));
}

int32_t AdjustGain(int32_t coefficient, int32_t contrast, int32_t saturation, uint32_t isChroma) {
  if (isChroma != 0) coefficient = ScaleByGain(coefficient, saturation);
  return ScaleByGain(coefficient, contrast);
}

int32_t AdjustOffset(int32_t offset, int32_t contrast, int32_t saturation, int32_t coefficient) {
  const int64_t centred = offset - int64_t(2) * HalvedBelowZero(saturation) * coefficient;
  return int32_t(centred + ScaleBy256th(centred - kChromaCentre, 4 * HalvedBelowZero(contrast)));
}

void BuildConversionTables(const EngineContext* like, EngineContext* context) {
  switch (context->pathKind) {
    case PATH_YUV_TO_YUV:
      if (context->needsLevelTable != 0) BuildLevelTable(like, context);
      break;
    case PATH_YUV_TO_RGB:
      BuildYuvToRgb(like, context);
      break;
    case PATH_RGB_TO_YUV:
      BuildRgbToYuv(like, context);
      break;
    default:
      break;
  }
}

}  // extern "C"
