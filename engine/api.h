/* Linkage of every name that the library exports. */
#ifndef KESTREL_ENGINE_API_H
#define KESTREL_ENGINE_API_H

#ifdef __cplusplus
#define KESTREL_BEGIN_C extern "C" {
#define KESTREL_END_C }
#else
#define KESTREL_BEGIN_C
#define KESTREL_END_C
#endif

#if defined(__GNUC__)
#define KESTREL_API __attribute__((visibility("default")))
#else
#define KESTREL_API
#endif

/* Result codes of every entry point. */
#define KESTREL_OK 0u           /* done */
#define KESTREL_BAD_ARGUMENT 2u /* null pointer, zero or negative size, step out of range */
#define KESTREL_UNSUPPORTED                                             \
  3u /* unknown format; as a kernel's answer: declined, nothing written \
      */
#define KESTREL_OUT_OF_MEMORY 4u /* the base library had no memory */

#endif
