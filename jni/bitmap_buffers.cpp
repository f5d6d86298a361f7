// Buffers for images: lengths, allocation, a raw dump, a time stamp.
#include "jni/bitmap_buffers.h"

#include <stddef.h>
#include <stdio.h>
#include <string.h>
#include <sys/time.h>

#include "engine/format_codes.h"
#include "platform/tessel/tessel.h"

namespace kestrel {
namespace {

constexpr uint32_t kFull = FORMAT_BT601_FULL;

// Rows and pitches of a buffer are those of the size rounded up to whole 16 x 16 blocks, except for
// RGB and packed formats.
int64_t RoundUpTo16(int64_t value) {
  return (value + 15) & ~int64_t{15};
}

// Bytes of a row of `bits` bits per pixel, in whole words.
int64_t WordAlignedRow(int64_t width, int64_t bits) {
  return ((width * bits + 31) >> 5) * 4;
}

// How the planes of a format share a buffer.
struct BufferLayout {
  enum Kind : uint8_t {
    kNone,
    kRow32,
    kRow24,
    kRow16,
    kRow8,
    kGrey,
    kPlanar,
    kUFirst,
    kVFirst
  } kind;
  uint8_t horizontal, vertical;  // chroma factors
  bool vFirst = false;           // planar, V in front of U

  bool hasChroma() const { return kind == kPlanar || kind == kUFirst || kind == kVFirst; }
  bool roundsUp() const { return hasChroma() || kind == kGrey; }
};

// The formats that getBufferLength and MBitmapAlloc both know.
BufferLayout CommonLayout(uint32_t format) {
  switch (format) {
    case FORMAT_XRGB8888:
    case FORMAT_XBGR8888:
    case FORMAT_RGBX8888:
    case FORMAT_BGRX8888:
      return {BufferLayout::kRow32, 0, 0};
    case FORMAT_RGB666:
    case FORMAT_BGR666:
    case FORMAT_RGB888:
    case FORMAT_BGR888:
      return {BufferLayout::kRow24, 0, 0};
    case FORMAT_RGB565:
    case FORMAT_BGR565:
    case FORMAT_UYVY:
    case FORMAT_VYUY:
      return {BufferLayout::kRow16, 0, 0};
    case FORMAT_INDEX8:
      return {BufferLayout::kRow8, 0, 0};
    case FORMAT_GRAY8:
    case FORMAT_GRAY8 | kFull:
      return {BufferLayout::kGrey, 0, 0};
    case FORMAT_I420:
      return {BufferLayout::kPlanar, 2, 2};
    case FORMAT_YV12:
      return {BufferLayout::kPlanar, 2, 2, true};
    case FORMAT_I422:
    case FORMAT_I422 | kFull:
      return {BufferLayout::kPlanar, 2, 1};
    case FORMAT_I440:
      return {BufferLayout::kPlanar, 1, 2};
    case FORMAT_I444:
    case FORMAT_I444 | kFull:
      return {BufferLayout::kPlanar, 1, 1};
    case FORMAT_NV12:
    case FORMAT_NV12 | kFull:
      return {BufferLayout::kUFirst, 2, 2};
    case FORMAT_NV21:
    case FORMAT_NV21 | kFull:
      return {BufferLayout::kVFirst, 2, 2};
    default:
      return {BufferLayout::kNone, 0, 0};
  }
}

// MBitmapAlloc knows three codes more.
BufferLayout AllocatableLayout(uint32_t format) {
  switch (format) {
    case FORMAT_YUYV | kFull:
      return {BufferLayout::kRow16, 0, 0};
    case FORMAT_I420 | kFull:
      return {BufferLayout::kPlanar, 2, 2};
    case FORMAT_I440 | kFull:
      return {BufferLayout::kPlanar, 1, 2};
    default:
      return CommonLayout(format);
  }
}

struct Pitches {
  int64_t of[3];
};

Pitches ComputePitches(const BufferLayout& layout, int64_t width) {
  const int64_t aligned = RoundUpTo16(width);
  switch (layout.kind) {
    case BufferLayout::kRow32:
      return {{width * 4, 0, 0}};
    case BufferLayout::kRow24:
      return {{WordAlignedRow(width, 24), 0, 0}};
    case BufferLayout::kRow16:
      return {{WordAlignedRow(width, 16), 0, 0}};
    case BufferLayout::kRow8:
      return {{WordAlignedRow(width, 8), 0, 0}};
    case BufferLayout::kPlanar:
      return {{aligned, aligned / layout.horizontal, aligned / layout.horizontal}};
    case BufferLayout::kUFirst:
    case BufferLayout::kVFirst:
      return {{aligned, aligned, aligned}};
    default:
      return {{aligned, 0, 0}};
  }
}

// Bytes of the block that holds all planes; more than INT32_MAX when there can be no such block.
uint64_t BlockSize(const BufferLayout& layout, const Pitches& pitches, int64_t height) {
  for (const int64_t pitch : pitches.of) {
    if (pitch < 0 || pitch > INT32_MAX) return UINT64_MAX;
  }
  // The sum of three products of 31-bit numbers fits 64 bits.
  const uint64_t rows = uint64_t(layout.roundsUp() ? RoundUpTo16(height) : height);
  const uint64_t size = rows * uint64_t(pitches.of[0]);
  if (!layout.hasChroma()) return size;
  const uint64_t chromaRows = rows / layout.vertical;
  const uint64_t first = chromaRows * uint64_t(pitches.of[1]);
  const uint64_t second = chromaRows * uint64_t(pitches.of[2]);
  const uint64_t longer = first > second ? first : second;
  // The plane of a semi-planar image is walked with both pitches. In planar ones engines walk the U
  // plane with pitch 1 wherever it is: in slot 2 when V comes first.
  if (layout.kind != BufferLayout::kPlanar) return size + longer;
  return size + first + (layout.vFirst ? longer : second);
}

// An address that may lie beyond the block: a one-plane format with pitches 1 and 2 gets them
// placed like planes, and nothing uses them.
uint8_t* Offset(uint8_t* block, int64_t bytes) {
  return reinterpret_cast<uint8_t*>(reinterpret_cast<uintptr_t>(block) + uintptr_t(bytes));
}

void PlacePlanes(const BufferLayout& layout, int64_t height, MBITMAP* bitmap) {
  uint8_t* const block = bitmap->plane[0];
  const int64_t rows = layout.roundsUp() ? RoundUpTo16(height) : height;
  uint8_t* const chroma = Offset(block, rows * bitmap->pitch[0]);
  const int32_t p1 = bitmap->pitch[1];
  const int32_t p2 = bitmap->pitch[2];
  switch (layout.kind) {
    case BufferLayout::kUFirst:
      if (p1 != 0) bitmap->plane[1] = chroma;
      if (p2 != 0) bitmap->plane[2] = chroma + 1;
      break;
    case BufferLayout::kVFirst:
      if (p2 != 0) bitmap->plane[2] = chroma;
      if (p1 != 0) bitmap->plane[1] = chroma + 1;
      break;
    default: {
      const int64_t divisor = layout.vertical == 2 ? 2 : 1;
      if (p1 != 0) bitmap->plane[1] = chroma;
      if (p2 != 0) bitmap->plane[2] = Offset(chroma, rows / divisor * p1);
      break;
    }
  }
}

// What dumpBitmap2 writes of a format: bytes per pixel of plane 0, then the chroma rows.
struct DumpLayout {
  int64_t bytesPerPixel;
  enum Chroma : uint8_t { kNone, kUFirst, kVFirst, kPlanar } chroma;
  uint8_t horizontal, vertical;
};

DumpLayout DescribeDump(uint32_t format) {
  switch (format) {
    case FORMAT_RGB565:
    case FORMAT_BGR565:
    case FORMAT_YUYV:
    case FORMAT_YUYV | kFull:
      return {2, DumpLayout::kNone, 1, 1};
    case FORMAT_RGB888:
    case FORMAT_BGR888:
    case FORMAT_YUV444 | kFull:
      return {3, DumpLayout::kNone, 1, 1};
    case FORMAT_XRGB8888:
    case FORMAT_XBGR8888:
    case FORMAT_RGBX8888:
    case FORMAT_BGRX8888:
    case 0x37004777u:
    case 0x37005777u:
      return {4, DumpLayout::kNone, 1, 1};
    case FORMAT_NV12:
    case FORMAT_NV12 | kFull:
      return {1, DumpLayout::kUFirst, 2, 2};
    case FORMAT_NV21:
    case FORMAT_NV21 | kFull:
      return {1, DumpLayout::kVFirst, 2, 2};
    case FORMAT_I420:
    case FORMAT_I420 | kFull:
    case FORMAT_YV12:
    case FORMAT_YV12 | kFull:
      return {1, DumpLayout::kPlanar, 2, 2};
    case FORMAT_I422:
    case FORMAT_I422 | kFull:
      return {1, DumpLayout::kPlanar, 2, 1};
    case FORMAT_I440:
    case FORMAT_I440 | kFull:
      return {1, DumpLayout::kPlanar, 1, 2};
    case FORMAT_I444:
    case FORMAT_I444 | kFull:
      return {1, DumpLayout::kPlanar, 1, 1};
    default:
      // Every other planar code, and grey: luma only.
      return {format >> 28 == 5 || format >> 28 == 6 || format >> 28 == 7 ? 1 : 0,
              DumpLayout::kNone, 1, 1};
  }
}

void WriteRows(FILE* file, const uint8_t* plane, int64_t pitch, int64_t bytes, int64_t rows) {
  if (plane == nullptr || bytes <= 0) return;
  for (int64_t row = 0; row < rows; ++row) {
    (void)fwrite(plane + ptrdiff_t(row * pitch), 1, size_t(bytes), file);
  }
}

void WriteChroma(FILE* file, const MBITMAP& bitmap, const DumpLayout& layout) {
  const int64_t pairs = (int64_t(bitmap.width) + 1) / 2;
  const int64_t height = bitmap.height;
  switch (layout.chroma) {
    case DumpLayout::kUFirst:
      // Rounded down here and up for V first: tools that read the dumps count on both.
      WriteRows(file, bitmap.plane[1], bitmap.pitch[1], pairs * 2, height / 2);
      break;
    case DumpLayout::kVFirst:
      WriteRows(file, bitmap.plane[2], bitmap.pitch[2], pairs * 2, (height + 1) / 2);
      break;
    case DumpLayout::kPlanar:
      for (int i = 1; i < 3; ++i) {
        if (bitmap.pitch[i] == 0) continue;
        WriteRows(file, bitmap.plane[i], bitmap.pitch[i], bitmap.width / layout.horizontal,
                  height / layout.vertical);
      }
      break;
    default:
      break;
  }
}

}  // namespace
}  // namespace kestrel

using namespace kestrel;

extern "C" {

uint32_t getCurrentTimeStamp(void) {
  struct timeval now;
  if (gettimeofday(&now, nullptr) != 0) return 0;
  return uint32_t(now.tv_sec) * 1000u + uint32_t(now.tv_usec) / 1000u;
}

uint32_t getBufferLength(uint32_t format, int32_t width, int32_t height) {
  const BufferLayout layout = CommonLayout(format);
  if (width < 1 || height < 1 || layout.kind == BufferLayout::kNone) return 0;
  const Pitches pitches = ComputePitches(layout, width);
  const uint64_t size = BlockSize(layout, pitches, height);
  return size > INT32_MAX ? 0 : uint32_t(size);
}

uint32_t MBitmapAlloc(MBITMAP* bitmap) {
  if (bitmap == nullptr) return KESTREL_BAD_ARGUMENT;
  const BufferLayout layout = AllocatableLayout(bitmap->format);
  if (bitmap->width < 1 || bitmap->height < 1 || layout.kind == BufferLayout::kNone) {
    return KESTREL_UNSUPPORTED;
  }
  Pitches pitches = ComputePitches(layout, bitmap->width);
  const int32_t* const given = bitmap->pitch;
  if (layout.hasChroma()) {
    if (given[0] != 0 && given[1] != 0 && given[2] != 0) {
      pitches = {{given[0], given[1], given[2]}};
    }
  } else {
    // Also pitches 1 and 2, which one-plane formats have no use for, stay as they were given.
    for (int i = 0; i < 3; ++i) {
      if (given[i] != 0) pitches.of[i] = given[i];
    }
  }
  const uint64_t size = BlockSize(layout, pitches, bitmap->height);
  if (size > INT32_MAX) return KESTREL_OUT_OF_MEMORY;
  uint8_t* block = static_cast<uint8_t*>(MMemAlloc(nullptr, uint32_t(size)));
  if (block == nullptr) return KESTREL_OUT_OF_MEMORY;

  if (bitmap->plane[0] != nullptr) MMemFree(nullptr, bitmap->plane[0]);
  bitmap->plane[0] = block;
  bitmap->plane[1] = bitmap->plane[2] = nullptr;
  for (int i = 0; i < 3; ++i) bitmap->pitch[i] = int32_t(pitches.of[i]);
  PlacePlanes(layout, bitmap->height, bitmap);
  return KESTREL_OK;
}

uint32_t MBitmapFree(MBITMAP* bitmap) {
  if (bitmap == nullptr) return KESTREL_BAD_ARGUMENT;
  if (bitmap->plane[0] != nullptr) MMemFree(nullptr, bitmap->plane[0]);
  *bitmap = {};
  return KESTREL_OK;
}

// Results of writing are dropped on purpose: a dump reports nothing.
void dumpBitmap2(const char* path, const MBITMAP* bitmap) {
  if (path == nullptr || bitmap == nullptr) return;
  FILE* file = fopen(path, "wb");
  if (file != nullptr) (void)fclose(file);
  file = fopen(path, "ab");
  if (file == nullptr) return;
  const DumpLayout layout = DescribeDump(bitmap->format);
  WriteRows(file, bitmap->plane[0], bitmap->pitch[0], layout.bytesPerPixel * bitmap->width,
            bitmap->height);
  WriteChroma(file, *bitmap, layout);
  (void)fclose(file);
}

}  // extern "C"
