// Transposition in blocks, around whatever transposes one block of an instruction set. In an
// unnamed namespace: files with different flags must never share a function.
#ifndef KESTREL_KERNELS_ROWS_TRANSPOSE_H
#define KESTREL_KERNELS_ROWS_TRANSPOSE_H

#include <stddef.h>
#include <stdint.h>
#include <string.h>

namespace kestrel {
namespace {

template <int kBytes>
void TransposeUnits(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch,
                    int rows, int columns) {
  for (int i = 0; i < columns; ++i) {
    uint8_t* const out = dst + i * dstPitch;
    const uint8_t* const in = src + i * kBytes;
    for (int j = 0; j < rows; ++j) memcpy(out + j * kBytes, in + j * srcPitch, kBytes);
  }
}

// In blocks whose columns fill a cache line of the destination each; the line after it is asked for
// early, because stores to lines that are far away are what this waits for. Only so many of the
// destination's rows are written at once that those lines, and the pages that they are in, stay
// near. The last blocks reach back over their neighbours, which gives the same bytes again.
template <typename Block, int kUnit>
void TransposeBy(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch, int rows,
                 int columns) {
  constexpr int kLine = 64 / kUnit / Block::kRows * Block::kRows;
  constexpr int kAtOnce = 128 / Block::kColumns * Block::kColumns;
  const int lastRow = rows - Block::kRows;
  const int lastColumn = columns - Block::kColumns;
  if (lastRow < 0 || lastColumn < 0) {
    return TransposeUnits<kUnit>(dst, dstPitch, src, srcPitch, rows, columns);
  }
  for (int left = 0; left < columns; left += kAtOnce) {
    const int right = left + kAtOnce < columns ? left + kAtOnce : columns;
    for (int top = 0; top < rows; top += kLine) {
      const int bottom = top + kLine < rows ? top + kLine : rows;
      for (int i = left; i < right; i += Block::kColumns) {
        const int column = i < lastColumn ? i : lastColumn;
        uint8_t* const out = dst + column * dstPitch;
        for (int k = 0; k < Block::kColumns; ++k) {
          __builtin_prefetch(out + k * dstPitch + bottom * kUnit, 1);
        }
        for (int j = top; j < bottom; j += Block::kRows) {
          const int row = j < lastRow ? j : lastRow;
          Block::Write(out + row * kUnit, dstPitch, src + row * srcPitch + column * kUnit,
                       srcPitch);
        }
      }
    }
  }
}

}  // namespace
}  // namespace kestrel

#endif
