// The coefficient tables and the per-engine conversion table block.
#ifndef KESTREL_COLOUR_CONVERSION_TABLES_H
#define KESTREL_COLOUR_CONVERSION_TABLES_H

#include <stdint.h>

#include "engine/engine_internal.h"

extern "C" {

// Gain for an adjustment p: (p' + 64) / 64 with p' = p, halved (arithmetic shift) when negative.
// value times that gain, rounded half away from zero.
int32_t ScaleByGain(int32_t value, int32_t parameter);

// coefficient times the gain of contrast and, when isChroma, first that of saturation.
int32_t AdjustGain(int32_t coefficient, int32_t contrast, int32_t saturation, uint32_t isChroma);

// Q16 offset of a channel under contrast, which pivots about 128, and saturation, which keeps the
// chroma centre; coefficient is the sum of the chroma gains that act on the channel.
int32_t AdjustOffset(int32_t offset, int32_t contrast, int32_t saturation, int32_t coefficient);

}  // extern "C"

namespace kestrel {

// Q16. Gains to G are stored positive and subtracted; R and B biases are subtracted, G's added.
struct YuvToRgbCoeffs {
  int32_t y, vToR, vToG, uToB, uToG, rBias, gBias, bBias;
};

// Q16. The gains rToU, gToU, gToV and bToV are stored positive and subtracted.
struct RgbToYuvCoeffs {
  int32_t rToY, gToY, bToY, rToU, gToU, bToU, rToV, gToV, bToV, zero;
};

// Rows of the standard; CS_BT601_VIDEO for any other code.
const YuvToRgbCoeffs& YuvToRgbRow(uint32_t colourStandard);
const RgbToYuvCoeffs& RgbToYuvRow(uint32_t colourStandard);

// Layouts of the table block, in bytes. YUV to RGB blocks: clamp tables, then the Y, U and V
// tables.
constexpr uint32_t kRgbBlockSize = 4352;
constexpr uint32_t kRgb16BlockSize = 3552;
constexpr uint32_t kYuvBlockSize = 8192;   // eight tables of 256 signed words
constexpr uint32_t kLevelBlockSize = 512;  // luma map, chroma map
constexpr uint32_t kChannelTableSize = 1024;

}  // namespace kestrel

#endif
