// Row operations: plain functions on a run of n samples or pixels. They know nothing of engines,
// images or rectangles, never touch a byte beyond the runs they are given, and every instruction
// set's version gives the same bytes. Source and destination runs do not overlap, except that
// blendColumns, blendRows, mapLevels and narrowWithCarry may write over one of their sources.
#ifndef KESTREL_KERNELS_ROWS_ROWS_H
#define KESTREL_KERNELS_ROWS_ROWS_H

#include <stddef.h>
#include <stdint.h>

namespace kestrel {

// A packed RGB pixel: little-endian word of 1..4 bytes with a field for each of R, G, B.
struct PixelFormat {
  int32_t bytes;
  uint32_t size[3];      // bits of the field, 0..16
  uint32_t position[3];  // of its lowest bit; the field ends within 32 bits
  int32_t alphaByte;     // byte of the pixel that holds alpha; -1 when there is none
  bool wholeBytes;       // each field is one whole byte of the pixel
};

// How 8-bit (or already narrowed) channel values become fields: shifted right, or left if negative.
struct FieldShifts {
  int32_t right[3];
};

// A constant alpha: pixel = (fields & keep) | bits.
struct AlphaFill {
  uint32_t keep;
  uint32_t bits;
};

// YUV to RGB by table reads. index = sum >> 20; channel = clamp[index >> narrowing].
struct YuvToRgbTable {
  const uint8_t* clamp;
  const uint32_t* y;
  const uint32_t* u;
  const uint32_t* v;
  uint32_t narrowing[3];
};

// The same by multiplication, in sums that cannot wrap, saturating:
// channel = min(max((index >> narrowing) - base, 0), maximum), where maximum = 255 >> narrowing.
// Gains and offsets are those of a standard under any adjustment.
struct YuvToRgbWide {
  int32_t yGain, vToR, vToG, uToG, uToB;
  int32_t offset[3];
  uint32_t narrowing[3];
  int32_t base[3];
  int32_t maximum[3];
};

// How YUV becomes RGB, decided once per engine.
enum class YuvToRgbForm : uint8_t {
  kWide,       // sums can leave the clamp tables: in numbers that cannot wrap
  kTable,      // by table reads, or by sums of 16 bits
  kWholeLuma,  // the same with a luma gain of exactly 65536: luma adds no fraction to the sums
  // By factors of six fractional bits, for full range BT.601, never adjusted:
  //   R = Y + ((90 V - 11485) >> 6), G = Y + ((8669 - 46 V - 22 U) >> 6),
  //   B = Y + ((113 U - 14516) >> 6), each clamped to 0..255.
  kSixBits,
};

struct YuvToRgb {
  YuvToRgbForm form;
  YuvToRgbTable table;
  YuvToRgbWide wide;
};

// Rows of luma and what becomes of them.
struct PixelRows {
  uint8_t* dst;
  ptrdiff_t dstPitch;
  const uint8_t* y;
  ptrdiff_t yPitch;
  int rows;
};

// Their chroma: pixel i of row r has, in row r >> rowShift, sample (i >> shift) * step of each.
struct ChromaRows {
  const uint8_t* u;
  const uint8_t* v;
  int32_t shift;  // 0 or 1
  int32_t step;   // 1, or 2 where samples of U and V take turns: then one is beside the other
  ptrdiff_t uPitch;
  ptrdiff_t vPitch;
  int32_t rowShift;  // 0 or 1
};

// A map of levels, and the numbers that it is made of: map[i] = (i * gain + offset) >> 16, clamped.
struct LevelMap {
  const uint8_t* map;
  int32_t gain;
  int32_t offset;
};

// For each of n pairs of bytes where they come from, and what an instruction set prepares of that
// for itself. The lists are the caller's: byte offsets from the start of a row. Bytes of pixels are
// pairs as well: each unit of some bytes has an entry in the lists.
struct PairPlan {
  static constexpr int kBlock = 64;         // of pairs
  static constexpr int kPreparedBytes = 3;  // for each pair
  int n = 0;
  const int32_t* first = nullptr;  // of unit i: first[i * stride], second[i * stride]
  const int32_t* second = nullptr;
  int32_t apart = 0;  // without `second`: from each first byte to the second
  int stride = 1;
  const uint16_t* weights = nullptr;  // for blendPairs: a weight for each unit
  int unit = 1;                       // bytes: 1, or those of a pixel of 3 or 4
  int keptByte = -1;                  // of a unit: both of its pairs are the first byte
  // Memory for what is prepared, in whole blocks: some bytes for each pair, and a word for each
  // that has a weight.
  uint8_t* prepared = nullptr;
  uint16_t* blends = nullptr;

  // Where the units of pairs begin.
  struct Lists {
    explicit Lists(const PairPlan& plan)
        : first(plan.first),
          second(plan.second == nullptr ? plan.first : plan.second),
          stride(plan.stride),
          apart(plan.second == nullptr ? plan.apart : 0) {}
    int32_t First(int i) const { return first[ptrdiff_t{i} * stride]; }
    int32_t Second(int i) const { return second[ptrdiff_t{i} * stride] + apart; }
    const int32_t* first;
    const int32_t* second;
    int stride;
    int32_t apart;
  };

  // Of the bytes that are read the lowest, and how far it is to the end of the highest.
  int32_t lowest = 0, extent = 0;
  // How many windows of some bytes each group of pairs has, of which vectors take theirs: 1, 2 or
  // 4. Where there is no such window pairs are read one by one.
  int windows = 0;
  bool hasWindows = false;  // everywhere
};

// Error carry of 16-bit RGB: the bits that narrowing drops are added to the next pixel's index.
// Masks are of the lowest 0 to 8 bits, remainders within them.
struct Carry {
  int32_t mask[3];
  int32_t remainder[3];
};

// RGB to YUV: eight tables of 256 words, each a straight line; channel = (sum of three) >> 16.
using RgbToYuvTables = const int32_t (*)[256];

}  // namespace kestrel

// One per instruction set. Global because engine contexts, plain C records, point at one.
struct KestrelRowOps {
  const char* name;  // of the instruction set

  // dst[i] = src[i * step], step 1..4.
  void (*readStrided)(uint8_t* dst, const uint8_t* src, ptrdiff_t step, int n);
  // dst[i] = src[offsets[i]].
  void (*gather)(uint8_t* dst, const uint8_t* src, const int32_t* offsets, int n);
  // Pixels of `bytes` bytes at src + offsets[i], packed together.
  void (*gatherPixels)(uint8_t* dst, const uint8_t* src, const int32_t* offsets, int bytes, int n);
  // Prepares a plan whose n, lists and memory are set.
  void (*planPairs)(kestrel::PairPlan* plan);
  // The first and second bytes of pairs in turn.
  void (*readPairs)(uint8_t* dst, const uint8_t* src, const kestrel::PairPlan& plan);
  // Each pair blended by the weight of its unit: as blendColumns.
  void (*blendPairs)(uint8_t* dst, const uint8_t* src, const kestrel::PairPlan& plan);
  // a + floor((b - a) * weight / 65536): a weight for each column, or one for the whole row.
  void (*blendColumns)(uint8_t* dst, const uint8_t* a, const uint8_t* b, const uint16_t* weights,
                       int n);
  void (*blendRows)(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight, int n);

  // The same for packed pixels of four bytes, but for byte `alphaByte`, which is a's. -1: none.
  void (*blendPixelRows)(uint8_t* dst, const uint8_t* a, const uint8_t* b, uint32_t weight,
                         int alphaByte, int n);

  // Packed pixels to channels of 8 bits: the top bits of each field, zero-filled below.
  void (*unpackRgb)(uint8_t* const rgb[3], const uint8_t* src, const kestrel::PixelFormat& format,
                    int n);
  // Byte `alphaByte` of each pixel.
  void (*unpackAlpha)(uint8_t* alpha, const uint8_t* src, const kestrel::PixelFormat& format,
                      int n);
  // Palette entries, of four bytes, of the pixels at `columns`; bits per pixel 1, 2, 4 or 8,
  // leftmost in the top bits.
  void (*gatherIndexed)(uint8_t* dst, const uint8_t* row, const int32_t* columns, uint32_t bits,
                        const uint8_t* palette, int n);

  void (*yuvToRgbWide)(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                       const kestrel::YuvToRgbWide& sums, int n);
  void (*yuvToRgbCarry)(uint8_t* const rgb[3], const uint8_t* y, const uint8_t* u, const uint8_t* v,
                        const kestrel::YuvToRgbWide& sums, kestrel::Carry* carry, int n);
  // Whole packed pixels. Fields of 16-bit pixels are narrowed as the sums say; what the six-bit
  // form gives for them, and all that other fields narrower than 8 bits get, is truncated.
  void (*yuvToPixels)(const kestrel::PixelRows& rows, const kestrel::ChromaRows& chroma,
                      const kestrel::YuvToRgb& colour, const kestrel::PixelFormat& format,
                      kestrel::AlphaFill alpha, int n);
  // Y with tables 0..2, U with 3..5, V with 5..7: `tables` is the first of the three.
  void (*rgbToYuv)(uint8_t* dst, const uint8_t* const rgb[3], kestrel::RgbToYuvTables tables,
                   int n);
  // The same of pixel i.
  void (*pixelsToYuv)(uint8_t* dst, const uint8_t* src, const kestrel::PixelFormat& format,
                      kestrel::RgbToYuvTables tables, int n);
  // U and V of pixel 2 * i + 1, to u[i * step] and v[i * step]: step 1, or 2 where they take turns.
  // (The tables are all eight.)
  void (*pixelPairsToChroma)(uint8_t* u, uint8_t* v, int step, const uint8_t* src,
                             const kestrel::PixelFormat& format, kestrel::RgbToYuvTables tables,
                             int n);
  void (*mapLevels)(uint8_t* dst, const uint8_t* src, const kestrel::LevelMap& levels, int n);

  // Channels of 8 bits to fields, carrying what narrowing drops into the next pixel:
  // sum = src + remainder, dst = min(sum, 255) >> shift, remainder = sum & mask.
  void (*narrowWithCarry)(uint8_t* const dst[3], const uint8_t* const src[3],
                          const kestrel::FieldShifts& shifts, kestrel::Carry* carry, int n);
  // Channels to packed pixels.
  void (*packRgb)(uint8_t* dst, const uint8_t* const rgb[3], const kestrel::PixelFormat& format,
                  const kestrel::FieldShifts& shifts, kestrel::AlphaFill alpha, int n);
  // Pixels of one format to pixels of another, with their alpha where both have one, else zero.
  void (*repackPixels)(uint8_t* dst, const uint8_t* src, const kestrel::PixelFormat& from,
                       const kestrel::PixelFormat& to, int n);
  // Overwrites byte `alphaByte` of each packed pixel.
  void (*putAlpha)(uint8_t* pixels, const uint8_t* alpha, const kestrel::PixelFormat& format,
                   int n);

  // dst[2 * i] = a[i], dst[2 * i + 1] = b[i]; the reverse; and pairs with their halves exchanged.
  void (*interleave)(uint8_t* dst, const uint8_t* a, const uint8_t* b, int n);
  void (*deinterleave)(uint8_t* a, uint8_t* b, const uint8_t* src, int n);
  void (*swapPairs)(uint8_t* dst, const uint8_t* src, int n);
  // Groups of packed 4:2:2, luma and chroma in turn: two samples of luma and one of each component,
  // the first one's and then the second one's.
  void (*splitGroups)(uint8_t* luma, uint8_t* const chroma[2], const uint8_t* groups,
                      bool lumaFirst, int n);
  // Unit i of row j of the source becomes unit j of row i of the destination; units of 1..4 bytes.
  void (*transpose)(uint8_t* dst, ptrdiff_t dstPitch, const uint8_t* src, ptrdiff_t srcPitch,
                    int unit, int rows, int columns);
  // dst[i * step] = src[i]: bytes, and packed pixels whose own bytes stay ascending.
  void (*writeStrided)(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int n);
  void (*writePixels)(uint8_t* dst, ptrdiff_t step, const uint8_t* src, int bytes, int n);
};

namespace kestrel {

using RowOps = KestrelRowOps;

extern const RowOps kScalarRows;
#if defined(__x86_64__)
extern const RowOps kSse41Rows;
extern const RowOps kAvx2Rows;
extern const RowOps kAvx512Rows;
#elif defined(__ARM_NEON)
extern const RowOps kNeonRows;
#endif

// The tables that this CPU can run, the fastest first and the scalar one last; null after that.
constexpr int kMostRowOps = 4;
struct RowOpsList {
  const RowOps* ops[kMostRowOps + 1];
};
RowOpsList AvailableRowOps();

}  // namespace kestrel

#endif
