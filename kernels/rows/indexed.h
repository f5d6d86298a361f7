// Indexed pixels. In an unnamed namespace, because files that are compiled for different sets must
// never share a function: compilers make vectors of most of this, as wide as the file's flags
// allow.
#ifndef KESTREL_KERNELS_ROWS_INDEXED_H
#define KESTREL_KERNELS_ROWS_INDEXED_H

#include <stddef.h>
#include <stdint.h>
#include <string.h>

namespace kestrel {
namespace {

// Of indices that are a byte each, the first one that of column `first`.
inline void GatherEntries(uint8_t* dst, const uint8_t* indices, const int32_t* columns,
                          int32_t first, const uint8_t* palette, int n) {
  // As a number: an index of column 0 need not exist.
  const uintptr_t start = reinterpret_cast<uintptr_t>(indices) - uintptr_t(first);
  const auto put = [=](int i) {
    const auto* const index = reinterpret_cast<const uint8_t*>(start + uintptr_t(columns[i]));
    memcpy(dst + ptrdiff_t{4} * i, palette + size_t{4} * *index, 4);
  };
  int i = 0;
  for (; i + 4 <= n; i += 4) {
    put(i);
    put(i + 1);
    put(i + 2);
    put(i + 3);
  }
  for (; i < n; ++i) put(i);
}

// The indices of whole bytes of pixels, a byte each.
template <uint32_t kBits>
void TakeIndicesApart(uint8_t* indices, const uint8_t* row, int bytes) {
  constexpr uint32_t kPerByte = 8 / kBits;
  for (int i = 0; i < bytes; ++i) {
    for (uint32_t k = 0; k < kPerByte; ++k) {
      indices[uint32_t(i) * kPerByte + k] =
          uint8_t((row[i] >> (8 - kBits * (k + 1))) & ((1 << kBits) - 1));
    }
  }
}

// In vectors.
inline bool AreNeighbours(const int32_t* columns, int n) {
  int32_t differences = 0;
  for (int i = 0; i < n; ++i) differences |= (columns[i] - columns[0]) ^ i;
  return differences == 0;
}

template <uint32_t kBits>
void LookUp(uint8_t* dst, const uint8_t* indices, const uint8_t* palette, int n) {
  if constexpr (kBits == 1) {
    uint32_t entries[2];
    memcpy(entries, palette, sizeof(entries));
    for (int i = 0; i < n; ++i) {
      const uint32_t entry = entries[0] ^ ((entries[0] ^ entries[1]) & (0u - indices[i]));
      memcpy(dst + ptrdiff_t{4} * i, &entry, sizeof(entry));
    }
  } else {
    for (int i = 0; i < n; ++i) {
      memcpy(dst + ptrdiff_t{4} * i, palette + size_t{4} * indices[i], 4);
    }
  }
}

// Neighbours share bytes: those that lie between some pixels are taken apart before any is looked
// up, if they are not many more than are wanted.
template <uint32_t kBits>
void GatherSmallEntries(uint8_t* dst, const uint8_t* row, const int32_t* columns,
                        const uint8_t* palette, int n) {
  constexpr int32_t kPerByte = 8 / kBits;
  constexpr int kPiece = 256;
  uint8_t indices[4 * kPiece];
  for (int x = 0; x < n;) {
    const int32_t* const some = columns + x;
    int count = n - x < kPiece ? n - x : kPiece;
    uint8_t* const entries = dst + ptrdiff_t{4} * x;
    if (AreNeighbours(some, count)) {
      const int32_t before = some[0] % kPerByte;
      TakeIndicesApart<kBits>(indices, row + some[0] / kPerByte,
                              (before + count - 1) / kPerByte + 1);
      LookUp<kBits>(entries, indices + before, palette, count);
      x += count;
      continue;
    }
    int32_t first = some[0];
    int32_t last = some[0];
    for (int i = 0; i < count; ++i) {
      first = some[i] < first ? some[i] : first;
      last = some[i] > last ? some[i] : last;
    }
    first -= first % kPerByte;
    if (last - first >= int32_t(sizeof(indices)) - kPerByte) {
      // Far apart: one by one.
      first = some[0] - some[0] % kPerByte;
      last = some[0];
      count = 1;
    }
    TakeIndicesApart<kBits>(indices, row + first / kPerByte, (last - first) / kPerByte + 1);
    GatherEntries(entries, indices, some, first, palette, count);
    x += count;
  }
}

// As gatherIndexed.
inline void GatherPaletteEntries(uint8_t* dst, const uint8_t* row, const int32_t* columns,
                                 uint32_t bits, const uint8_t* palette, int n) {
  switch (bits) {
    case 1:
      return GatherSmallEntries<1>(dst, row, columns, palette, n);
    case 2:
      return GatherSmallEntries<2>(dst, row, columns, palette, n);
    case 4:
      return GatherSmallEntries<4>(dst, row, columns, palette, n);
    default:
      return GatherEntries(dst, row, columns, 0, palette, n);
  }
}

}  // namespace
}  // namespace kestrel

#endif
