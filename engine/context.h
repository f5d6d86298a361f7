/*
 * What an engine decides once and every kernel reads. Callers of MPPCreate and MPProcess need none
 * of this; it is public for those who call kernels or format helpers directly. Everything here is
 * written by engine creation and read-only afterwards, except the plane bindings of a pass engine,
 * which each run loads from the caller's arrays.
 */
#ifndef KESTREL_ENGINE_CONTEXT_H
#define KESTREL_ENGINE_CONTEXT_H

#include <stdint.h>

#include "engine/records.h"

/* A decoded format: ten words, then the palette as a real pointer (word 9 holds its low 32 bits).
 */
typedef struct FormatDesc {
  uint32_t code; /* internal code */
  int32_t width;
  int32_t height;
  uint32_t colourStandard; /* RGB and indexed: bits per pixel; otherwise a CS_ code */
  union {
    struct {
      uint32_t blueMask;
      uint32_t greenMask;
      uint32_t redMask;
      uint32_t unused8;
      uint32_t paletteWord;
      uint32_t unused10;
    } rgb;
    uint32_t subsample[6]; /* horizontal factors of Y, U, V, then vertical ones */
  } layout;
  const uint8_t* palette; /* null unless indexed */
} FormatDesc;

/* Where the samples of an image lie. Slot 0 is Y (or RGB), 1 is U, 2 is V in every layout. */
typedef struct PlaneLayout {
  uint32_t code;
  int32_t step[3];   /* bytes from one sample to the next; negated when the destination mirrors X */
  int32_t pitch[3];  /* bound per run */
  uint8_t* plane[3]; /* bound per run; one-plane layouts: plane 0 plus the sample's offset */
  uint32_t isPacked; /* one-plane YUV */
  uint32_t isPlanar; /* planar, semi-planar and grey */
  uint32_t planeCount; /* 1 or 3; semi-planar counts as 3 */
  uint32_t yOffset;    /* byte position of each sample inside a packed group */
  uint32_t uOffset;
  uint32_t vOffset;
  uint32_t bitsPerPixel;
} PlaneLayout;

#define PATH_YUV_TO_YUV 0u
#define PATH_YUV_TO_RGB 1u
#define PATH_RGB_TO_RGB 2u
#define PATH_RGB_TO_YUV 3u

/*
 * YUV to RGB as sums, the form behind the lookup tables: for channel c,
 * index = floor((Y*16*yGain + chroma words) / 2^20), see colour/conversion_tables.h.
 */
typedef struct YuvToRgbSums {
  int32_t yGain;
  int32_t vToR;
  int32_t vToG; /* negative: subtracts */
  int32_t uToG; /* negative: subtracts */
  int32_t uToB;
  int32_t offset[3];         /* R, G, B, clamp base included */
  uint32_t narrowing[3];     /* bits that the clamp table drops from each channel; 0 for 8 bits */
  int32_t indexBase[3];      /* position of value 0 in the clamp table */
  int32_t maximum[3];        /* greatest value of each channel */
  uint32_t insideClampTable; /* no colour can leave the clamp tables: plain table reads are exact */
} YuvToRgbSums;

/* YUV to YUV levels: value -> (value * gain + offset) >> 16, clamped; for luma and for chroma. */
typedef struct LevelSums {
  int32_t gain[2];
  int32_t offset[2];
} LevelSums;

struct KestrelRowOps;

/* The engine context: sixth argument of every kernel. Flags are 0 or nonzero. */
typedef struct EngineContext {
  uint32_t tableSize;       /* bytes */
  void* table;              /* conversion table block, or null; owned by the engine */
  uint32_t tableOffsets[3]; /* word indices of the U, V and Y tables in the block */
  uint32_t needsLevelTable; /* YUV to YUV with an adjustment or a change of range */
  uint32_t tableEnabled;    /* always 1 */
  uint32_t wideRgbOut;      /* 0 for YUV to 16-bit RGB, else 1 */
  uint32_t pathKind;        /* PATH_ code */
  uint32_t halfStep;        /* both steps 0x8000 */
  uint32_t unitStep;        /* both steps 0x10000 */
  uint32_t bilinear;
  uint32_t srcRgbBilinear[2];
  uint32_t blockMode; /* 1 = 1x1, 2 = 2x2, 3 = 4x4, 4 = 4x4 special: a hint for choosing kernels */
  uint32_t tallBands;
  uint32_t noDownscale; /* both steps were at most 0x10000 before the aspect policy */
  uint32_t bandCode;
  uint32_t srcSubsample[6];
  uint32_t srcChannelSize[3]; /* R, G, B bits */
  uint32_t srcChannelPos[3];
  uint32_t dstSubsample[6];
  uint32_t dstChannelSize[3];
  uint32_t dstChannelPos[3];
  FormatDesc dstFormat;
  FormatDesc srcFormat;
  MPPPARAM params;
  uint32_t xEnlarge;
  uint32_t yEnlarge;
  uint32_t i420Fast4x4;
  PlaneLayout srcLayout;
  PlaneLayout dstLayout;
  uint32_t
      dstPlaneFactors[9]; /* step, horizontal and vertical factor of each plane, untransformed */
  uint32_t swapXY;
  uint32_t mirrorX;
  uint32_t mirrorY;
  uint32_t stepX; /* 16.16 source pixels per destination pixel */
  uint32_t stepY;
  uint32_t invStepX;
  uint32_t invStepY;
  int32_t dstOriginX; /* in loop orientation: exchanged when swapXY */
  int32_t dstOriginY;
  int32_t srcOriginX;
  int32_t srcOriginY;
  MRECT srcRect;
  MRECT dstRect; /* loop orientation: what srcRect covers */
  uint32_t dither;
  uint32_t alpha;

  /* Beyond the classic record: what later layers derive once. */
  MRECT dstRegion;       /* region the engine draws, untransformed */
  int32_t dstImageRight; /* the destination image reaches at least to here */
  int32_t srcReadRight;  /* source samples are read from 0 up to these limits only */
  int32_t srcReadBottom;
  YuvToRgbSums rgbSums;             /* valid for PATH_YUV_TO_RGB */
  LevelSums levelSums;              /* valid where needsLevelTable is set */
  const struct KestrelRowOps* rows; /* row operations of the chosen instruction set */
  uint32_t srcLayoutBit;            /* what kernels call each side's layout; 0 = they do not */
  uint32_t dstLayoutBit;
} EngineContext;

/* A pass engine: the run-time view of one context, with the bindings of the most recent run. */
typedef struct PassEngine {
  int32_t srcRegionX;
  int32_t srcRegionY;
  int32_t dstRegionX;
  int32_t dstRegionY;
  uint32_t bandSelector;
  int32_t srcRegionWidth; /* the four sizes are those after the aspect policy */
  int32_t srcRegionHeight;
  int32_t dstRegionWidth;
  int32_t dstRegionHeight;
  uint32_t transformCode;
  uint32_t resampleMode;
  PlaneLayout srcLayout;
  PlaneLayout dstLayout;
  uint32_t dstPlaneFactors[9];
  EngineContext* context; /* owned */
  uint32_t swapXY;
  uint32_t mirrorX;
  uint32_t mirrorY;
  uint32_t stepX;
  uint32_t stepY;
  uint32_t invStepX;
  uint32_t invStepY;
  int32_t dstOriginX;
  int32_t dstOriginY;
  int32_t srcOriginX;
  int32_t srcOriginY;
  MRECT srcRect;
  MRECT dstRect;
  uint32_t dither;
  uint32_t alpha;
} PassEngine;

/* Engine handle: what MPPCreate returns. Pass 2 and 3 are null unless the engine is tiled. */
typedef struct MPPHandle {
  uint32_t passMode;
  PassEngine* pass[3];
} MPPHandle;

/*
 * The kernel contract: every dispatcher and every kernel takes these six arguments.
 *   rect        job rectangle in loop orientation: mirrored inside the destination region, and
 *               transposed when swapXY
 *   dstPitches  three pitches, negated when mirrorY
 *   srcPitches  three pitches
 *   dstPlanes   address of the first pixel of the job in each plane
 *   srcPlanes   address of the image origin in each plane
 * Answer: KESTREL_OK = done, KESTREL_UNSUPPORTED = declined with nothing written.
 */
typedef uint32_t KernelFn(const MRECT* rect, const int32_t* dstPitches, const int32_t* srcPitches,
                          uint8_t* const* dstPlanes, const uint8_t* const* srcPlanes,
                          const EngineContext* context);

#endif
