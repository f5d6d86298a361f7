// Buffers with any descriptors: lengths, allocation, the dump of planes, the one-shot conversion.
#include "jni/bitmap_buffers.h"

#include <sys/mman.h>
#include <unistd.h>

#include <cstring>

#include "fuzz/jobs.h"
#include "tests/support/tessel_double.h"

namespace {

using fuzz::Input;
using fuzz::Require;

constexpr uint32_t kMostBytes = 1u << 22;

int32_t DrawPitch(Input* input) {
  switch (input->Between(0, 7)) {
    case 5:
      return input->Between(1, 255);
    case 6:
      return 256 * input->Between(1, 4);
    case 7:
      return int32_t(input->Word());
    default:
      return 0;
  }
}

MBITMAP DrawDescriptor(Input* input) {
  MBITMAP bitmap = {};
  bitmap.format = fuzz::DrawFormat(input);
  bitmap.width = fuzz::DrawLength(input);
  bitmap.height = fuzz::DrawLength(input);
  const int32_t common = DrawPitch(input);
  const bool isCommon = input->OneIn(2);
  for (int32_t& pitch : bitmap.pitch) pitch = isCommon ? common : DrawPitch(input);
  return bitmap;
}

// A file in memory and its path.
class File {
 public:
  File() : handle_(memfd_create("dump", 0)) {
    Require(handle_ >= 0, "no file in memory");
    path_ = "/proc/self/fd/" + std::to_string(handle_);
  }
  ~File() { close(handle_); }
  File(const File&) = delete;
  File& operator=(const File&) = delete;

  const char* path() const { return path_.c_str(); }
  int64_t Size() const { return lseek(handle_, 0, SEEK_END); }
  std::string Start(size_t most) const {
    std::string bytes(most, '\0');
    const ssize_t count = pread(handle_, bytes.data(), most, 0);
    bytes.resize(count < 0 ? 0 : size_t(count));
    return bytes;
  }

 private:
  int handle_;
  std::string path_;
};

// Bytes of the image without padding, as its format says.
int64_t BytesOf(const differential::Side& side) {
  int64_t bytes = 0;
  for (int i = 0; i < side.blocks.count; ++i) {
    bytes += int64_t(side.blocks.block[i].rowBytes) * side.blocks.block[i].rows;
  }
  return bytes;
}

void Dump(const MBITMAP& bitmap, const differential::Side& side) {
  static const File file;
  dumpBitmap2(file.path(), &bitmap);
  const int64_t size = file.Size();
  Require(size <= BytesOf(side), "a dump is larger than its image");
  const size_t row = size_t(std::min<int64_t>(size, side.blocks.block[0].rowBytes));
  // Luma comes first, if it is there; sizes of packed rows are rounded down.
  if (row > 0 && side.format.planeCount == 3 && bitmap.plane[0] != nullptr) {
    Require(std::memcmp(file.Start(row).data(), bitmap.plane[0], row) == 0,
            "a dump does not start with the first row");
  }
}

// What MBitmapAlloc hands out must hold an image, be it written or read.
void Use(Input* input, const MBITMAP& bitmap) {
  differential::Side side = {};
  side.record = {bitmap.format, bitmap.width, bitmap.height, nullptr};
  Require(fuzz::DrawSide(input, bitmap.width, bitmap.height, &side) && side.isKnown,
          "an image of unknown format is allocated");
  for (int i = 0; i < side.blocks.count; ++i) {
    const int slot = side.blocks.count == 3 && side.format.HasVPlaneFirst() && i > 0 ? 3 - i : i;
    // Rows of a caller's pitch may overlap or be cut: that is the caller's image.
    if (bitmap.pitch[slot] < side.blocks.block[i].rowBytes) return;
  }
  if (differential::IsSemiPlanar(side.format) && bitmap.pitch[1] != bitmap.pitch[2]) {
    return;  // one plane
  }
  uint8_t grey[9 * 7];
  for (size_t i = 0; i < sizeof(grey); ++i) grey[i] = uint8_t(i * 5);
  const MBITMAP small = {FORMAT_GRAY8, 9, 7, {9, 0, 0}, {grey, nullptr, nullptr}};
  Require(ConvertCS(&small, &bitmap) == KESTREL_OK, "an allocated image takes no pixels");
  Dump(bitmap, side);
  Require(ConvertCS(&bitmap, &small) == KESTREL_OK, "an allocated image gives no pixels");
}

void Allocate(Input* input) {
  MBITMAP bitmap = DrawDescriptor(input);
  const uint32_t length = getBufferLength(bitmap.format, bitmap.width, bitmap.height);
  const bool isEmpty = bitmap.width < 1 || bitmap.height < 1;
  Require(length <= INT32_MAX && !(isEmpty && length != 0), "a senseless length");
  const MBITMAP before = bitmap;
  const uint32_t code = MBitmapAlloc(&bitmap);
  if (code != KESTREL_OK) {
    Require(code == KESTREL_UNSUPPORTED || code == KESTREL_OUT_OF_MEMORY, "a senseless code");
    Require(!isEmpty || code == KESTREL_UNSUPPORTED, "another code for no pixels");
    Require(std::memcmp(&bitmap, &before, sizeof(bitmap)) == 0, "a failure writes the descriptor");
    return;
  }
  Require(!isEmpty, "an image without pixels is allocated");
  const uint32_t block = tessel_double::Requests().back();
  const bool isOwn = (before.pitch[0] | before.pitch[1] | before.pitch[2]) == 0;
  if (isOwn && length != 0) Require(block == length, "a block is not as long as promised");
  std::memset(bitmap.plane[0], 0x5A, block);
  if (int64_t(bitmap.width) * bitmap.height <= 1 << 15) Use(input, bitmap);
  if (input->OneIn(4)) {  // the block of an earlier call is replaced
    bitmap.width = input->Between(1, 40);
    MBitmapAlloc(&bitmap);
  }
  Require(MBitmapFree(&bitmap) == KESTREL_OK, "freeing fails");
  Require(bitmap.plane[0] == nullptr && bitmap.width == 0, "a freed descriptor is not cleared");
}

MBITMAP Describe(const MPPFORMAT& record, const uint8_t* const* planes, const int32_t* pitches) {
  MBITMAP bitmap = {record.format, record.width, record.height, {}, {}};
  for (int i = 0; i < 3; ++i) {
    bitmap.pitch[i] = pitches[i];
    bitmap.plane[i] = const_cast<uint8_t*>(planes[i]);
  }
  return bitmap;
}

// A dump reads all rows, and those of pairs whole, each plane by the pitch of its own number: not
// where a pitch is not that of its plane, where U and V of pairs have memory of their own, or where
// V comes first and has another pitch than U, since elsewhere pitches stay in the order of U and V.
bool CanBeDumped(const fuzz::Job& job) {
  const differential::Side& side = job.drawn.dst;
  if (!side.isKnown || job.farDstPitch != 0) return false;
  if (differential::IsSemiPlanar(side.format)) return side.blocks.count == 2;
  return !side.format.HasVPlaneFirst() || side.pitches[1] == side.pitches[2];
}

// Both images between guard pages: conversion in one shot, and a dump of either.
void Convert(Input* input, fuzz::Images* images) {
  fuzz::Job job = fuzz::DrawJob(input);
  MPPPARAM& params = job.drawn.params;
  params = {};
  params.resampleFlags = MPP_BILINEAR;
  params.bandSelector = 5;
  params.passMode = MPP_PASS_TILED;
  params.aspectMode = MPP_ASPECT_CROP;
  MPPFORMAT& src = job.drawn.src.record;
  src.palette = nullptr;
  job.drawn.hasRect = true;
  job.drawn.rect = {0, 0, job.drawn.dst.record.width, job.drawn.dst.record.height};
  fuzz::DrawImages(input, &job);
  if (!job.hasImages) return;
  images->Prepare(job);
  const reference::Job call = images->JobOnProduct();
  const MBITMAP from = Describe(call.src, call.srcPlanes, call.srcPitches);
  const MBITMAP to = Describe(call.dst, call.dstPlanes, call.dstPitches);
  const uint32_t code = ConvertCS(&from, &to);
  if (job.drawsNothing) Require(images->ProductUnchanged(), "something is drawn");
  if (job.isModelled) {
    Require(code == reference::Convert(images->JobOnModel()),
            "another code than that of the model");
    const std::string difference = images->Difference();
    if (!difference.empty()) fuzz::Fail(difference + "\n" + differential::Describe(job.drawn));
  }
  Require(images->SourceUnchanged(), "the source is written");
  if (CanBeDumped(job)) Dump(to, job.drawn.dst);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static fuzz::Images images;
  Input input(data, size);
  tessel_double::Reset();
  tessel_double::FailAbove(kMostBytes);
  for (int32_t calls = input.Between(1, 4); calls > 0; --calls) {
    if (input.OneIn(2)) {
      Convert(&input, &images);
    } else {
      Allocate(&input);
    }
  }
  Require(tessel_double::LiveBlocks() == 0, "memory is left behind");
  Require(tessel_double::Faults().empty(), "memory is misused");
  return 0;
}
