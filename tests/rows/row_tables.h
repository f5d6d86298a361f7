// The tables of row operations that this machine can run, and their arguments from real engines.
#ifndef KESTREL_TESTS_ROWS_ROW_TABLES_H
#define KESTREL_TESTS_ROWS_ROW_TABLES_H

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <string>
#include <vector>

#include "engine/engine_internal.h"
#include "kernels/rows/rows.h"

namespace rows_tests {

inline std::vector<const kestrel::RowOps*> AvailableRows() {
  std::vector<const kestrel::RowOps*> tables;
  const kestrel::RowOpsList list = kestrel::AvailableRowOps();
  for (const kestrel::RowOps* const* ops = list.ops; *ops != nullptr; ++ops) {
    tables.push_back(*ops);
  }
  return tables;
}

// As part of the name of a test.
inline std::string NameOf(const kestrel::RowOps* ops) {
  std::string name = ops->name;
  name.erase(std::remove_if(name.begin(), name.end(),
                            [](unsigned char letter) { return std::isalnum(letter) == 0; }),
             name.end());
  return name;
}

inline kestrel::YuvToRgbTable TableOf(const EngineContext& context) {
  const uint32_t* const words = static_cast<const uint32_t*>(context.table);
  const YuvToRgbSums& sums = context.rgbSums;
  return {static_cast<const uint8_t*>(context.table),
          words + context.tableOffsets[2],
          words + context.tableOffsets[0],
          words + context.tableOffsets[1],
          {sums.narrowing[0], sums.narrowing[1], sums.narrowing[2]}};
}

inline kestrel::YuvToRgbWide WideOf(const EngineContext& context) {
  const YuvToRgbSums& sums = context.rgbSums;
  kestrel::YuvToRgbWide wide = {sums.yGain, sums.vToR, sums.vToG, sums.uToG, sums.uToB,
                                {},         {},        {},        {}};
  for (int c = 0; c < 3; ++c) {
    wide.offset[c] = sums.offset[c];
    wide.narrowing[c] = sums.narrowing[c];
    wide.base[c] = sums.indexBase[c];
    wide.maximum[c] = sums.maximum[c];
  }
  return wide;
}

inline kestrel::RgbToYuvTables RgbToYuvTablesOf(const EngineContext& context) {
  return static_cast<kestrel::RgbToYuvTables>(context.table);
}

}  // namespace rows_tests

#endif
