/* A plain C program against the shared library: the records have the documented layout and the
 * entry points work from C. Prints what is wrong and answers 1. */
#include <stddef.h>
#include <stdio.h>
#include <string.h>

#include "engine/postprocess.h"
#include "jni/bitmap_buffers.h"

static int failures = 0;

static void Expect(int holds, const char* what, int line) {
  if (holds) return;
  printf("line %d: %s does not hold\n", line, what);
  ++failures;
}
#define EXPECT(condition) Expect(condition, #condition, __LINE__)

enum { kPointer = sizeof(void*) };

static void CheckRecords(void) {
  EXPECT(sizeof(MRECT) == 16);
  EXPECT(offsetof(MRECT, left) == 0 && offsetof(MRECT, top) == 4);
  EXPECT(offsetof(MRECT, right) == 8 && offsetof(MRECT, bottom) == 12);

  EXPECT(sizeof(MBITMAP) == 24 + 3 * kPointer); /* 36 bytes with 32-bit pointers */
  EXPECT(offsetof(MBITMAP, format) == 0 && offsetof(MBITMAP, width) == 4);
  EXPECT(offsetof(MBITMAP, height) == 8 && offsetof(MBITMAP, pitch) == 12);
  EXPECT(offsetof(MBITMAP, plane) == 24);

  EXPECT(offsetof(MPPFORMAT, format) == 0 && offsetof(MPPFORMAT, width) == 4);
  EXPECT(offsetof(MPPFORMAT, height) == 8);
  EXPECT(sizeof(((MPPFORMAT*)0)->palette) == kPointer);
  EXPECT(kPointer != 4 || sizeof(MPPFORMAT) == 16);

  EXPECT(sizeof(MPPPARAM) == 72);
  EXPECT(offsetof(MPPPARAM, resampleFlags) == 0 && offsetof(MPPPARAM, transformCode) == 4);
  EXPECT(offsetof(MPPPARAM, bandSelector) == 8 && offsetof(MPPPARAM, passMode) == 12);
  EXPECT(offsetof(MPPPARAM, aspectMode) == 16 && offsetof(MPPPARAM, dither) == 20);
  EXPECT(offsetof(MPPPARAM, brightness) == 24 && offsetof(MPPPARAM, contrast) == 28);
  EXPECT(offsetof(MPPPARAM, saturation) == 32 && offsetof(MPPPARAM, srcOriginX) == 36);
  EXPECT(offsetof(MPPPARAM, srcOriginY) == 40 && offsetof(MPPPARAM, dstOriginX) == 44);
  EXPECT(offsetof(MPPPARAM, dstOriginY) == 48 && offsetof(MPPPARAM, srcRect) == 52);
  EXPECT(offsetof(MPPPARAM, alpha) == 68);

  EXPECT(offsetof(FormatDesc, code) == 0 && offsetof(FormatDesc, width) == 4);
  EXPECT(offsetof(FormatDesc, height) == 8 && offsetof(FormatDesc, colourStandard) == 12);
  EXPECT(offsetof(FormatDesc, layout) == 16);
  EXPECT(offsetof(FormatDesc, palette) == 40); /* after the ten words */
  EXPECT(offsetof(PlaneLayout, code) == 0 && offsetof(PlaneLayout, step) == 4);
  EXPECT(offsetof(PlaneLayout, pitch) == 16);
  EXPECT(offsetof(MPPHandle, passMode) == 0);
  EXPECT(kPointer != 4 || sizeof(MPPHandle) == 16); /* four words */
}

static void CheckConversion(void) {
  uint8_t grey[16 * 4];
  uint8_t rgba[16 * 4 * 4];
  uint8_t* dst_planes[3] = {rgba, NULL, NULL};
  const uint8_t* src_planes[3] = {grey, NULL, NULL};
  const int32_t dst_pitches[3] = {16 * 4, 0, 0};
  const int32_t src_pitches[3] = {16, 0, 0};
  MPPFORMAT dst = {FORMAT_XBGR8888, 16, 4, NULL};
  MPPFORMAT src = {FORMAT_GRAY8 | FORMAT_BT601_FULL, 16, 4, NULL};
  MPPPARAM params;
  MPPHandle* handle = NULL;
  int i;
  memset(&params, 0, sizeof params);
  params.passMode = MPP_PASS_TILED;
  params.alpha = 200;
  for (i = 0; i < 64; ++i) grey[i] = (uint8_t)(i * 4);
  memset(rgba, 0, sizeof rgba);

  EXPECT(MPPCreate(&dst, &src, &params, &handle) == KESTREL_OK);
  EXPECT(handle != NULL);
  if (handle == NULL) return;
  EXPECT(MPProcess(handle, dst_planes, NULL, dst_pitches, src_planes, src_pitches) == KESTREL_OK);
  EXPECT(MPPDestroy(handle) == KESTREL_OK);
  for (i = 0; i < 64; ++i) { /* full-range grey becomes the same grey */
    if (rgba[4 * i] != grey[i] || rgba[4 * i + 1] != grey[i] || rgba[4 * i + 2] != grey[i] ||
        rgba[4 * i + 3] != 200) {
      Expect(0, "grey pixels keep their value", __LINE__);
      break;
    }
  }
  EXPECT(PostProcessGetVersionInfo() == NULL);
}

static void CheckOneShot(void) {
  MBITMAP src;
  MBITMAP dst;
  memset(&src, 0, sizeof src);
  memset(&dst, 0, sizeof dst);
  src.format = FORMAT_BGRX8888;
  src.width = 32;
  src.height = 16;
  dst = src;
  dst.format = FORMAT_NV21 | FORMAT_BT601_FULL;
  EXPECT(MBitmapAlloc(&src) == KESTREL_OK);
  EXPECT(MBitmapAlloc(&dst) == KESTREL_OK);
  if (src.plane[0] != NULL && dst.plane[0] != NULL) {
    memset(src.plane[0], 0xFF, (size_t)src.pitch[0] * 16); /* white */
    EXPECT(ConvertCS(&src, &dst) == KESTREL_OK);
    EXPECT(dst.plane[0][0] == 255 && dst.plane[2][0] == 128 && dst.plane[1][0] == 128);
    EXPECT(dst.plane[1] == dst.plane[2] + 1);
  }
  EXPECT(MBitmapFree(&src) == KESTREL_OK);
  EXPECT(MBitmapFree(&dst) == KESTREL_OK);
}

int main(void) {
  CheckRecords();
  CheckConversion();
  CheckOneShot();
  return failures != 0;
}
