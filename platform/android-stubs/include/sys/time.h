// The part of the device's sys/time.h that the library uses. Both fields are `long` on every ABI.
#ifndef KESTREL_ANDROID_STUBS_SYS_TIME_H
#define KESTREL_ANDROID_STUBS_SYS_TIME_H

#ifdef __cplusplus
extern "C" {
#endif

struct timeval {
  long tv_sec;
  long tv_usec;
};
struct timezone;

int gettimeofday(struct timeval* now, struct timezone* zone);

#ifdef __cplusplus
}
#endif

#endif
