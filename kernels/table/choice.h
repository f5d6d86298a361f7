// What the dispatchers' decisions depend on, and how a dispatcher runs what it has chosen.
#ifndef KESTREL_KERNELS_TABLE_CHOICE_H
#define KESTREL_KERNELS_TABLE_CHOICE_H

#include "kernels/table/kernels.h"

namespace kestrel {

constexpr int kDeclined = -1;  // in place of a kernel's number

// The lowest bits of red, green and blue as one number.
constexpr uint32_t ChannelOrder(uint32_t red, uint32_t green, uint32_t blue) {
  return red | green << 8 | blue << 16;
}

// Whole bytes, in the order of addresses; 32-bit pixels have a spare byte after or before them.
constexpr uint32_t kRgbBytes = ChannelOrder(0, 8, 16);
constexpr uint32_t kBgrBytes = ChannelOrder(16, 8, 0);
constexpr uint32_t kSpareRgbBytes = ChannelOrder(8, 16, 24);
constexpr uint32_t kSpareBgrBytes = ChannelOrder(24, 16, 8);
// Words of 16 bits.
constexpr uint32_t kRedLow = ChannelOrder(0, 5, 11);
constexpr uint32_t kRedHigh = ChannelOrder(11, 5, 0);

// Which conversion a job is follows from its two layouts.
struct Question {
  explicit Question(const EngineContext& c)
      : engine(c),
        source(c.srcLayoutBit),
        destination(c.dstLayoutBit),
        sourceOrder(ChannelOrder(c.srcChannelPos[0], c.srcChannelPos[1], c.srcChannelPos[2])),
        destinationOrder(ChannelOrder(c.dstChannelPos[0], c.dstChannelPos[1], c.dstChannelPos[2])),
        blockMode(c.blockMode),
        unit(c.stepX == 0x10000 && c.stepY == 0x10000),
        bilinear(c.bilinear != 0),
        dither(c.dither != 0),
        swap(c.swapXY != 0),
        mirrorX(c.mirrorX != 0),
        mirrorY(c.mirrorY != 0) {}

  bool from(uint32_t layouts) const { return (source & layouts) != 0; }
  bool to(uint32_t layouts) const { return (destination & layouts) != 0; }
  bool fromTo(uint32_t from, uint32_t to) const { return this->from(from) && this->to(to); }
  bool orders(uint32_t order) const { return sourceOrder == order && destinationOrder == order; }
  bool untransformed() const { return !swap && !mirrorX && !mirrorY; }
  bool blocked() const { return blockMode == 2 || blockMode == 3; }

  const EngineContext& engine;
  uint32_t source, destination;  // one bit of FormatSet, or 0
  uint32_t sourceOrder, destinationOrder;
  uint32_t blockMode;
  bool unit;  // by the steps: also where a crop ended at 1:1 and bilinear is still set
  bool bilinear, dither, swap, mirrorX, mirrorY;
};

// The layouts beyond which a dispatcher declines whatever else the question is. There are ten
// dispatchers, and most jobs concern few of them.
struct Sides {
  uint32_t sources, destinations;
  bool Include(const EngineContext& c) const {
    return (c.srcLayoutBit & sources) != 0 && (c.dstLayoutBit & destinations) != 0;
  }
};

// A dispatcher: one kernel takes the whole job, or nobody has written.
inline uint32_t Dispatch(const Sides& sides, int (*choose)(const Question&), const MRECT* rect,
                         const int32_t* dstPitches, const int32_t* srcPitches,
                         uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                         const EngineContext* context) {
  if (context == nullptr) return KESTREL_BAD_ARGUMENT;
  if (!sides.Include(*context)) return KESTREL_UNSUPPORTED;
  const int id = choose(Question(*context));
  if (id == kDeclined) return KESTREL_UNSUPPORTED;
  return RunKernel(kKernels[id], rect, dstPitches, srcPitches, dstPlanes, srcPlanes, context);
}

}  // namespace kestrel

#endif
