// The library's engine behind one call: created when first needed, reused while jobs stay alike.
#ifndef KESTREL_TOOLS_COMMON_CONVERTER_H
#define KESTREL_TOOLS_COMMON_CONVERTER_H

#include <cstdint>
#include <memory>

#include "tools/common/image.h"

namespace kestrel::tools {

struct ConversionTime {
  double engineMs = 0;   // creation; 0 when the engine was reused
  double convertMs = 0;  // the conversion itself
};

class Converter {
 public:
  // Converts a region of one image into a region of another. The origins in params are set here.
  ConversionTime Convert(const Image& src, const Region& srcRegion, Image* dst,
                         const Region& dstRegion, MPPPARAM params);

 private:
  struct Destroyer {
    void operator()(MPPHandle* handle) const { MPPDestroy(handle); }
  };

  std::unique_ptr<MPPHandle, Destroyer> handle_;
  MPPFORMAT dstRecord_ = {};
  MPPFORMAT srcRecord_ = {};
  MPPPARAM params_ = {};
  std::shared_ptr<const std::vector<uint8_t>> palette_;
};

// A whole image as plain RGBA bytes (FORMAT_XBGR8888) of the same size.
class RgbaConverter {
 public:
  Image Convert(const Image& src);

 private:
  Converter converter_;
};

}  // namespace kestrel::tools

#endif
