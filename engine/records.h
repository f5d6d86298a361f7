/* The records that callers fill in. All are owned by the caller and only read, except where said.
 */
#ifndef KESTREL_ENGINE_RECORDS_H
#define KESTREL_ENGINE_RECORDS_H

#include <stdint.h>

/* Rectangle in pixels; right and bottom are exclusive. */
typedef struct MRECT {
  int32_t left;
  int32_t top;
  int32_t right;
  int32_t bottom;
} MRECT;

/* An image: what MBitmapAlloc fills and ConvertCS takes. Unused planes are null. */
typedef struct MBITMAP {
  uint32_t format;  /* public format code */
  int32_t width;    /* pixels */
  int32_t height;   /* pixels */
  int32_t pitch[3]; /* bytes from one row of a plane to the next; negative = bottom row first */
  uint8_t* plane[3];
} MBITMAP;

/* One side of an engine. The size is that of the region to convert (its place in the image is in
 * MPPPARAM), hence 1..16777216 each way. */
typedef struct MPPFORMAT {
  uint32_t format; /* public format code */
  int32_t width;
  int32_t height;
  const uint8_t* palette; /* indexed sources only: 2, 16 or 256 entries of 4 bytes B G R x */
} MPPFORMAT;

/* Values of MPPPARAM.resampleFlags; every other value means nearest. */
#define MPP_NEAREST 0u
#define MPP_BILINEAR 2u

/* Bits of MPPPARAM.transformCode. 3 = 90 degrees, 5 = 270 degrees, 6 = 180 degrees. */
#define MPP_SWAP_XY 1u
#define MPP_MIRROR_X 2u
#define MPP_MIRROR_Y 4u

/* MPPPARAM.passMode: a tiled engine; 1..4 give a single engine of that block mode. */
#define MPP_PASS_TILED 256u

/* Bits of MPPPARAM.aspectMode. */
#define MPP_ASPECT_FIT 1u  /* shrink the destination region to the source's aspect, centred */
#define MPP_ASPECT_CROP 2u /* cut the source region to the destination's aspect, centred */

/* Parameters of an engine, eighteen 32-bit words. All zero is a plain nearest-pixel conversion. */
typedef struct MPPPARAM {
  uint32_t resampleFlags; /* MPP_BILINEAR: interpolated and centre-aligned; else nearest pixel */
  uint32_t transformCode; /* MPP_SWAP_XY | MPP_MIRROR_X | MPP_MIRROR_Y */
  uint32_t bandSelector;  /* 4 = rotated jobs in bands of 64 rows instead of 32 */
  uint32_t passMode;      /* MPP_PASS_TILED, or block mode 1..4; any other value is block mode 1 */
  uint32_t aspectMode;    /* MPP_ASPECT_FIT, MPP_ASPECT_CROP */
  uint32_t dither;        /* nonzero: carry remainders into 16-bit RGB (0x15 codes) */
  int32_t brightness;     /* -128..128, 0 = unchanged; clamped. Not applied to RGB sources */
  int32_t contrast;       /* -128..128 */
  int32_t saturation;     /* -128..128 */
  int32_t srcOriginX;     /* top-left of the source region in the source image */
  int32_t srcOriginY;
  int32_t dstOriginX; /* top-left of the destination region in the destination image */
  int32_t dstOriginY;
  MRECT srcRect;  /* source pixels to convert; all zero = the whole source region */
  uint32_t alpha; /* spare byte of 32-bit RGB made from YUV or grey; above 255 means 255 */
} MPPPARAM;

#ifdef __cplusplus
static_assert(sizeof(MRECT) == 16, "four words");
static_assert(sizeof(MPPPARAM) == 72, "eighteen words on every CPU");
static_assert(sizeof(MBITMAP) == 24 + 3 * sizeof(void*), "36 bytes on 32-bit CPUs");
#endif

#endif
