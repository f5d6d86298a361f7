/*
 * Public pixel format codes and the internal codes they decode to.
 *
 * A public code is 32 bits: the family in bits 28-31 (1 packed RGB, 3 packed RGB with the spare
 * bits low, 4 indexed, 5 YUV packed or planar, 6 grey, 7 semi-planar and special YUV), and details
 * of the layout below. docs/pixel-formats.md shows every layout as bytes in memory.
 */
#ifndef KESTREL_ENGINE_FORMAT_CODES_H
#define KESTREL_ENGINE_FORMAT_CODES_H

/* Packed RGB. The name reads from the top of the pixel word down, memory is little-endian. */
#define FORMAT_RGB565 0x15000454u
#define FORMAT_BGR565 0x15001454u
#define FORMAT_RGB666 0x16000555u
#define FORMAT_BGR666 0x16001555u
#define FORMAT_RGB888 0x16000777u   /* bytes B G R */
#define FORMAT_BGR888 0x16001777u   /* bytes R G B */
#define FORMAT_XRGB8888 0x17000777u /* bytes B G R A */
#define FORMAT_XBGR8888 0x17001777u /* bytes R G B A: an Android RGBA_8888 Bitmap */
#define FORMAT_RGBX8888 0x37000777u /* an engine treats it as FORMAT_XRGB8888 */
#define FORMAT_BGRX8888 0x37001777u /* an engine treats it as FORMAT_XBGR8888 */

/* Indexed: palette of 4-byte entries B G R x in MPPFORMAT.palette, leftmost pixel in the top bits.
 */
#define FORMAT_INDEX1 0x41000000u
#define FORMAT_INDEX4 0x43000000u
#define FORMAT_INDEX8 0x44000000u

/* Packed 4:2:2, and its second set with the two lumas of a pair exchanged. */
#define FORMAT_YUYV 0x50000010u
#define FORMAT_YVYU 0x50000210u
#define FORMAT_UYVY 0x50000410u
#define FORMAT_VYUY 0x50000610u
#define FORMAT_YUYV_SWAPPED_LUMA 0x50000110u
#define FORMAT_YVYU_SWAPPED_LUMA 0x50000310u
#define FORMAT_UYVY_SWAPPED_LUMA 0x50000510u
#define FORMAT_VYUY_SWAPPED_LUMA 0x50000710u

/* Packed 4:4:4, three bytes a pixel in the order of the name. */
#define FORMAT_YUV444 0x50000000u
#define FORMAT_YVU444 0x50000200u
#define FORMAT_UVY444 0x50000400u
#define FORMAT_VUY444 0x50000600u

/* Planar. The YV forms are given with the V plane before the U plane. */
#define FORMAT_I420 0x50000811u
#define FORMAT_I422 0x50000810u
#define FORMAT_I440 0x50000801u
#define FORMAT_I444 0x50000800u
#define FORMAT_YV12 0x50000a11u
#define FORMAT_YV16 0x50000a10u
#define FORMAT_YV440 0x50000a01u
#define FORMAT_YV24 0x50000a00u

#define FORMAT_GRAY8 0x64000000u

/* Semi-planar: a luma plane and one plane of chroma pairs. */
#define FORMAT_NV21 0x70000002u /* V first, 4:2:0 */
#define FORMAT_NV12 0x70000003u /* U first, 4:2:0 */
#define FORMAT_NV61 0x70000004u /* V first, 4:2:2 */
#define FORMAT_NV16 0x70000005u /* U first, 4:2:2 */

/* Special one-plane layouts: luma step 2 with chroma at bytes 2 and 3, and Y U V in 4 bytes. */
#define FORMAT_YUV_SPECIAL8 0x70000008u
#define FORMAT_YUV_SPECIAL9 0x70000009u

/* Colour standard of a YUV, grey or semi-planar code: add one of these to the code. */
#define FORMAT_STANDARD_MASK 0x3000u
#define FORMAT_BT601_VIDEO 0x0000u
#define FORMAT_BT601_FULL 0x1000u
#define FORMAT_BT709_VIDEO 0x2000u
#define FORMAT_BT709_FULL 0x3000u

/* Colour-standard codes held in a decoded format: matrix in the high half; bit 0 video range, bit 1
 * full range. */
#define CS_BT601_VIDEO 0x10001u
#define CS_BT601_FULL 0x10002u
#define CS_BT709_VIDEO 0x20001u
#define CS_BT709_FULL 0x20002u
#define CS_VIDEO_RANGE 0x1u
#define CS_FULL_RANGE 0x2u

/* Internal codes: what kernels switch on. */
#define CODE_RGB 256u
#define CODE_YVYU 512u
#define CODE_YUYV 513u
#define CODE_UYVY 514u
#define CODE_VYUY 515u
#define CODE_YVYU_SWAPPED_LUMA 528u
#define CODE_YUYV_SWAPPED_LUMA 529u
#define CODE_UYVY_SWAPPED_LUMA 530u
#define CODE_VYUY_SWAPPED_LUMA 531u
#define CODE_YUV444 576u
#define CODE_YVU444 577u
#define CODE_UVY444 578u
#define CODE_VUY444 579u
#define CODE_UYV444 580u
#define CODE_VYU444 581u
#define CODE_GRAY8 640u
#define CODE_YV_ANY 768u /* planar, V first, subsampling from the code */
#define CODE_YV12 769u
#define CODE_YV440 770u
#define CODE_YV16 771u
#define CODE_YV24 772u
#define CODE_I_ANY 1024u /* planar, U first, subsampling from the code */
#define CODE_I420 1025u
#define CODE_I440 1026u
#define CODE_I422 1027u
#define CODE_I444 1028u
#define CODE_NV21 0x70000002u
#define CODE_NV12 0x70000003u
#define CODE_NV61 0x70000004u
#define CODE_NV16 0x70000005u
#define CODE_YUV_SPECIAL8 0x70000008u
#define CODE_YUV_SPECIAL9 0x70000009u

#endif
