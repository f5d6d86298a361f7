/* Image buffers and the one-shot conversion. Results are the codes of engine/api.h. No shared
 * state: calls on separate descriptors may run on any threads at once. */
#ifndef KESTREL_JNI_BITMAP_BUFFERS_H
#define KESTREL_JNI_BITMAP_BUFFERS_H

#include <stdint.h>

#include "engine/api.h"
#include "engine/records.h"

KESTREL_BEGIN_C

/* Milliseconds of the wall clock, modulo 2^32. */
KESTREL_API uint32_t getCurrentTimeStamp(void);

/* Bytes of a buffer for an image, luma sides of planar layouts rounded up to 16; 0 for a format it
 * does not know, a size below 1 or a length above 2147483647. */
KESTREL_API uint32_t getBufferLength(uint32_t format, int32_t width, int32_t height);

/*
 * Allocates the planes of a descriptor whose format, width and height are set. Pitches that are not
 * zero are kept; zero pitches are computed (a format with three pitches has all three computed when
 * one is zero). One block holds all planes and becomes plane 0; an address found there is freed as
 * a block of an earlier call, so clear a fresh descriptor first.
 * Returns KESTREL_OK; KESTREL_UNSUPPORTED for a size below 1 or a format that cannot be allocated;
 * KESTREL_OUT_OF_MEMORY when no block of that size can be had or a pitch is negative. The
 * descriptor is unchanged on failure.
 */
KESTREL_API uint32_t MBitmapAlloc(MBITMAP* bitmap);

/* Frees what MBitmapAlloc allocated and clears the descriptor. Never for planes that came from
 * elsewhere. KESTREL_BAD_ARGUMENT for null. */
KESTREL_API uint32_t MBitmapFree(MBITMAP* bitmap);

/* Debugging aid: writes the rows of all planes, without padding, to a file. Reports nothing. */
KESTREL_API void dumpBitmap2(const char* path, const MBITMAP* bitmap);

/*
 * Converts a whole image into another: formats and sizes from the descriptors, bilinear, the source
 * cut to the destination's aspect. Both descriptors are complete, with planes and pitches.
 * Returns KESTREL_OK, or the code of MPPCreate or MPProcess; KESTREL_BAD_ARGUMENT for null.
 */
KESTREL_API uint32_t ConvertCS(const MBITMAP* src, const MBITMAP* dst);

KESTREL_END_C

#endif
