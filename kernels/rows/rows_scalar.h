// The reference version of every row operation: what vectors leave over falls to these.
#ifndef KESTREL_KERNELS_ROWS_ROWS_SCALAR_H
#define KESTREL_KERNELS_ROWS_ROWS_SCALAR_H

#include "kernels/rows/rows.h"

// For parts of loops that compilers find too large to inline: calls would keep whole vectors in
// memory.
#define KESTREL_INLINE inline __attribute__((always_inline))

namespace kestrel {
namespace scalar {

void ReadStrided(uint8_t* dst, const uint8_t* src, ptrdiff_t step, int n);
void Gather(uint8_t* dst, const uint8_t* src, const int32_t* offsets, int n);
void GatherPixels(uint8_t* dst, const uint8_t* src, const int32_t* offsets, int bytes, int n);
void PlanPairs(PairPlan*);
void ReadPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan);
// Pairs i up to end.
void ReadSomePairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan, int i, int end);
void BlendPairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan);
void BlendSomePairs(uint8_t* dst, const uint8_t* src, const PairPlan& plan, int i, int end);
void BlendColumns(uint8_t* dst, const uint8_t* a, const uint8_t* b, const uint16_t* weights, int n);
void BlendRows(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight, int n);
void BlendPixelRows(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight,
                    int alphaByte, int n);
void UnpackRgb(uint8_t* const rgb[3], const uint8_t* src, const PixelFormat& format, int n);
void UnpackAlpha(uint8_t* alpha, const uint8_t* src, const PixelFormat& format, int n);
void GatherIndexed(uint8_t* dst, const uint8_t* row, const int32_t* columns, uint32_t bits,
                   const uint8_t* palette, int n);
void YuvToRgbByTable(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                     const YuvToRgbTable& table, int n);
void YuvToRgbByWideSums(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                        const YuvToRgbWide& sums, int n);
void YuvToRgbCarry(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                   const YuvToRgbWide& sums, Carry* carry, int n);
void YuvToRgbBySixBits(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                       int n);
void YuvToPixels(const PixelRows& rows, const ChromaRows& chroma, const YuvToRgb& colour,
                 const PixelFormat& format, AlphaFill alpha, int n);
void RgbToYuv(uint8_t* dst, const uint8_t* const rgb[3], RgbToYuvTables tables, int n);
void PixelsToYuv(uint8_t* dst, const uint8_t* src, const PixelFormat& format, RgbToYuvTables tables,
                 int n);
void PixelPairsToChroma(uint8_t* u, uint8_t* v, int step, const uint8_t* src,
                        const PixelFormat& format, RgbToYuvTables tables, int n);
void MapLevels(uint8_t* dst, const uint8_t* src, const LevelMap& levels, int n);
void NarrowWithCarry(uint8_t* const dst[3], const uint8_t* const src[3], const FieldShifts& shifts,
                     Carry* carry, int n);
void PackRgb(uint8_t* dst, const uint8_t* const rgb[3], const PixelFormat& format,
             const FieldShifts& shifts, AlphaFill alpha, int n);
void RepackPixels(uint8_t* dst, const uint8_t* src, const PixelFormat& from, const PixelFormat& to,
                  int n);
void PutAlpha(uint8_t* pixels, const uint8_t* alpha, const PixelFormat& format, int n);
void Interleave(uint8_t* dst, const uint8_t* a, const uint8_t* b, int n);
void Deinterleave(uint8_t* a, uint8_t* b, const uint8_t* src, int n);
void SwapPairs(uint8_t* dst, const uint8_t* src, int n);
void SplitGroups(uint8_t* luma, uint8_t* const chroma[2], const uint8_t* groups, bool lumaFirst,
                 int n);
void Transpose(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch, int unit,
               int rows, int columns);
void WriteStrided(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int n);
void WritePixels(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int bytes, int n);

}  // namespace scalar
}  // namespace kestrel

#endif
