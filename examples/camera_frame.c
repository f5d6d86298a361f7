/* Turns a camera frame upright: 640x480 NV21 -> 270x360 RGBA, rotated by 90 degrees and scaled in
 * one pass with the tiled engine. Writes the picture as camera_frame.ppm. */
#include <stdint.h>
#include <stdio.h>

#include "engine/postprocess.h"

enum { SRC_WIDTH = 640, SRC_HEIGHT = 480, DST_WIDTH = 270, DST_HEIGHT = 360 };

static uint8_t nv21[SRC_WIDTH * SRC_HEIGHT * 3 / 2];
static uint8_t rgba[DST_WIDTH * DST_HEIGHT * 4];

/* A grey ramp from left to right, reddish above and bluish below, and a white bar at the left. */
static void DrawTestFrame(void) {
  uint8_t* luma = nv21;
  uint8_t* chroma = nv21 + SRC_WIDTH * SRC_HEIGHT;
  for (int y = 0; y < SRC_HEIGHT; ++y) {
    for (int x = 0; x < SRC_WIDTH; ++x) {
      luma[y * SRC_WIDTH + x] = (uint8_t)(x < 80 ? 235 : 32 + x / 4);
    }
  }
  for (int y = 0; y < SRC_HEIGHT / 2; ++y) {
    for (int x = 0; x < SRC_WIDTH / 2; ++x) {
      const int upper = y < SRC_HEIGHT / 4;
      uint8_t* pair = chroma + y * SRC_WIDTH + 2 * x;
      pair[0] = (uint8_t)(x < 40 ? 128 : upper ? 176 : 96);  /* V */
      pair[1] = (uint8_t)(x < 40 ? 128 : upper ? 112 : 176); /* U */
    }
  }
}

static int WritePpm(const char* path) {
  FILE* file = fopen(path, "wb");
  if (file == NULL) return 0;
  int good = fprintf(file, "P6\n%d %d\n255\n", DST_WIDTH, DST_HEIGHT) > 0;
  for (int i = 0; i < DST_WIDTH * DST_HEIGHT; ++i) good &= fwrite(rgba + 4 * i, 3, 1, file) == 1;
  return (fclose(file) == 0) & good;
}

int main(void) {
  DrawTestFrame();

  MPPFORMAT dst = {FORMAT_XBGR8888, DST_WIDTH, DST_HEIGHT, NULL};
  MPPFORMAT src = {FORMAT_NV21, SRC_WIDTH, SRC_HEIGHT, NULL};
  MPPPARAM param = {0};
  param.resampleFlags = MPP_BILINEAR;
  param.transformCode = MPP_SWAP_XY | MPP_MIRROR_X; /* 90 degrees */
  param.passMode = MPP_PASS_TILED;
  param.alpha = 255;

  MPPHandle* engine = NULL;
  uint32_t result = MPPCreate(&dst, &src, &param, &engine);
  if (result != KESTREL_OK) {
    fprintf(stderr, "MPPCreate answers %u\n", result);
    return 1;
  }

  uint8_t* dstPlanes[3] = {rgba, NULL, NULL};
  const int32_t dstPitches[3] = {DST_WIDTH * 4, 0, 0};
  const uint8_t* v = nv21 + SRC_WIDTH * SRC_HEIGHT;
  const uint8_t* srcPlanes[3] = {nv21, v + 1, v};
  const int32_t srcPitches[3] = {SRC_WIDTH, SRC_WIDTH, SRC_WIDTH};
  result = MPProcess(engine, dstPlanes, NULL, dstPitches, srcPlanes, srcPitches);
  MPPDestroy(engine);
  if (result != KESTREL_OK) {
    fprintf(stderr, "MPProcess answers %u\n", result);
    return 1;
  }

  if (!WritePpm("camera_frame.ppm")) {
    fprintf(stderr, "camera_frame.ppm cannot be written\n");
    return 1;
  }
  printf("camera_frame.ppm: %dx%d NV21 as %dx%d RGBA, turned by 90 degrees\n", SRC_WIDTH,
         SRC_HEIGHT, DST_WIDTH, DST_HEIGHT);
  return 0;
}
