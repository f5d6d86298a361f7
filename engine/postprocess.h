/*
 * Image post-processing in one pass: pixel format conversion combined with resizing, rotation,
 * mirroring, aspect fit or crop, brightness/contrast/saturation and restriction to a region.
 *
 *   MPPFORMAT dst = {FORMAT_XBGR8888, 1280, 720, 0}, src = {FORMAT_NV21, 1920, 1080, 0};
 *   MPPPARAM param = {MPP_BILINEAR, 0, 0, MPP_PASS_TILED};
 *   MPPHandle* engine;
 *   if (MPPCreate(&dst, &src, &param, &engine) == KESTREL_OK) {
 *     MPProcess(engine, dstPlanes, NULL, dstPitches, srcPlanes, srcPitches);
 *     MPPDestroy(engine);
 *   }
 *
 * Destination comes before source in every call. The caller owns every record, plane, pitch array
 * and rectangle; the handle owns all that creation allocated. Memory is taken at creation only.
 *
 * Threads: there is no global state. Separate handles are independent; one handle serves one thread
 * at a time. Sources and palettes may be shared read-only; format and parameter records may not be
 * shared by threads that create engines at once, because creation rewrites and restores words of
 * them.
 *
 * Arrays of planes and pitches hold three entries: 0 Y or RGB, 1 U, 2 V; unused entries are null
 * and 0. The V-first planar codes (FORMAT_YV12 ...) take V in entry 1 and U in entry 2. Semi-planar
 * images take the address of the first U sample in entry 1 and of the first V sample in entry 2,
 * one byte apart, with the pitch of the chroma plane in both. docs/pixel-formats.md shows the
 * bytes.
 *
 * What the caller answers for: that planes, pitches and palettes are as large as formats, sizes,
 * origins and rectangles say. Everything else is checked, clamped or ignored, as said at each call.
 */
#ifndef KESTREL_ENGINE_POSTPROCESS_H
#define KESTREL_ENGINE_POSTPROCESS_H

#include <stdint.h>

#include "engine/api.h"
#include "engine/context.h"
#include "engine/format_codes.h"
#include "engine/records.h"

KESTREL_BEGIN_C

/* ---- Engines -------------------------------------------------------------------------------- */

/*
 * Creates an engine for one pair of formats and sizes. The records are only read during the call
 * (their format and dither words are rewritten while it runs and restored before it returns).
 *
 * Returns KESTREL_OK; KESTREL_BAD_ARGUMENT for a null argument, a size below 1 or a scale so
 * extreme that a 16.16 step becomes 0; KESTREL_UNSUPPORTED for a format code that is not known;
 * KESTREL_OUT_OF_MEMORY when the handle, a pass engine or a context cannot be allocated (when it is
 * the handle, the format words and dither of the caller's records are cleared, and stay so).
 * On failure *outHandle is null. A conversion table that cannot be allocated does not fail
 * creation: such an engine runs, and writes nothing where it would have needed the table.
 */
KESTREL_API uint32_t MPPCreate(MPPFORMAT* dstFormat, MPPFORMAT* srcFormat, MPPPARAM* params,
                               MPPHandle** outHandle);

/* Frees an engine and all it owns. Null is accepted. Returns KESTREL_OK. */
KESTREL_API uint32_t MPPDestroy(MPPHandle* handle);

/* Always null: the library carries no version record. */
KESTREL_API const void* PostProcessGetVersionInfo(void);

/* ---- Running an engine ---------------------------------------------------------------------- */

/*
 * Converts into dstRect (destination-image pixels; null = the whole destination region). Plane
 * addresses are those of the image origins. Left and top of dstRect are clipped to the region, its
 * width and height to the region's size; an empty or inverted rectangle draws nothing, nor does one
 * whose bottom is 0 or less. Pitches may be negative.
 *
 * Nothing outside the rectangle is written, except chroma samples that its edge pixels share with
 * neighbours. A job that needs a plane whose address is null writes nothing.
 *
 * Returns KESTREL_OK, or KESTREL_BAD_ARGUMENT (nothing written) for a null handle, array or first
 * plane. A region that starts beyond 16777216 pixels or an image plane of 2 GiB or more is not
 * drawn.
 */
KESTREL_API uint32_t MPProcess(MPPHandle* handle, uint8_t* const* dstPlanes, const MRECT* dstRect,
                               const int32_t* dstPitches, const uint8_t* const* srcPlanes,
                               const int32_t* srcPitches);

/*
 * The same for destination addresses that point at the pixel (originRect->left, originRect->top)
 * instead of the image origin. The whole pixel's size, (bits per pixel / 8), is taken as the
 * column step of every plane, also of chroma planes with two-byte samples; callers rely on it.
 * Also KESTREL_BAD_ARGUMENT for a null originRect or one whose left or top is negative or beyond
 * 16777216.
 */
KESTREL_API uint32_t MPProcessEx(MPPHandle* handle, uint8_t* const* dstPlanes,
                                 const MRECT* originRect, const MRECT* dstRect,
                                 const int32_t* dstPitches, const uint8_t* const* srcPlanes,
                                 const int32_t* srcPitches);

/*
 * Plans regions. One rectangle is given, the other is all zero and receives the answer: the source
 * pixels that a destination rectangle needs, or the destination pixels that a source rectangle
 * covers. When both are all zero the destination is taken as given.
 * Returns KESTREL_OK, or KESTREL_BAD_ARGUMENT for a null argument or when neither is all zero.
 */
KESTREL_API uint32_t MPPAlign(MPPHandle* handle, MRECT* dstRect, MRECT* srcRect);

/*
 * The chain of kernel families: offers the job to each dispatcher in a fixed order and to the
 * generic converter last. Arguments are those of the kernel contract. Returns KESTREL_OK, or
 * KESTREL_BAD_ARGUMENT for a null argument.
 */
KESTREL_API KernelFn ANY_ANY_Bilinear_No_Table;

/* ---- Format and rectangle helpers ----------------------------------------------------------- */

/* Null arguments to the helpers below do nothing and give KESTREL_BAD_ARGUMENT, or 0 bits per
 * pixel.
 *
 * Decodes a public code. Returns KESTREL_OK, or KESTREL_UNSUPPORTED for an unknown code; the
 * descriptor may be partly written then. */
KESTREL_API uint32_t MPParseFormat(FormatDesc* desc, const MPPFORMAT* record);

/* Fills code, isPacked, isPlanar and bitsPerPixel of a layout and normalises desc->code. Returns
 * the bits per pixel; 0 for an unknown code. */
KESTREL_API uint32_t MPGetPlaneLayout(FormatDesc* desc, PlaneLayout* layout);

/* Fills steps, planeCount and offsets of a layout and the six subsampling factors (horizontal Y U
 * V, vertical Y U V). Returns KESTREL_OK, or KESTREL_UNSUPPORTED for an unknown code. */
KESTREL_API uint32_t MPGetSubsampling(const FormatDesc* desc, PlaneLayout* layout,
                                      uint32_t* factors);

/* Number of set bits. */
KESTREL_API uint32_t MGetMaskSize(uint32_t mask);

/* Index of the lowest set bit; 0 for 0. */
KESTREL_API uint32_t MGetMaskPos(uint32_t mask);

KESTREL_API void RectCopy(MRECT* dst, const MRECT* src);

/* Exchanges the axes. */
KESTREL_API void MSwapRect(MRECT* rect);

/* Mirrors rect inside frame: vertically, horizontally. */
KESTREL_API void FlipUpDownRect(const MRECT* frame, MRECT* rect);
KESTREL_API void MFlipLeftRightRect(const MRECT* frame, MRECT* rect);

/* ---- Family dispatchers, in the order of the chain, and the generic converter -----------------
 */

KESTREL_API KernelFn NEC_ALL;
KESTREL_API KernelFn ANY_ANY_C_FAST_R8G8B8;
KESTREL_API KernelFn YUV2YUV_Fast;
KESTREL_API KernelFn ANY_ANY_C_FAST_R5G6B5;
KESTREL_API KernelFn I420_To_I422_Fast;
KESTREL_API KernelFn YUV_YUV_C_FAST;
KESTREL_API KernelFn YUV_RGB32_C_FAST; /* may have drawn although it answers KESTREL_UNSUPPORTED */
KESTREL_API KernelFn YUYV_RGB32_FAST;
KESTREL_API KernelFn ANY_ANY_C_FAST_RGB32;
KESTREL_API KernelFn Gray2Gray_C_FAST;

/* Converts any job; never declines. KESTREL_BAD_ARGUMENT for a null argument. */
KESTREL_API KernelFn ANY_ANY_C_SLOW;

/* Does nothing. Part of the exported interface, called by nobody. */
KESTREL_API void NEC_DebugWin32(void);

KESTREL_END_C

#endif
