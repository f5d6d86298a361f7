#include "tests/memory/watch.h"

#include <algorithm>
#include <cstring>

#if defined(__has_feature)
#if __has_feature(memory_sanitizer)
#define KESTREL_MEMORY_SANITIZER 1
#endif
#endif

#if defined(KESTREL_MEMORY_SANITIZER)
#include <sanitizer/msan_interface.h>
#elif __has_include(<valgrind/memcheck.h>)
#define KESTREL_VALGRIND 1
#include <valgrind/memcheck.h>
#endif

namespace watch {

#if defined(KESTREL_MEMORY_SANITIZER)

const char* Watcher() {
  return "MemorySanitizer";
}

void Undefine(const void* bytes, size_t count) {
  __msan_poison(bytes, count);
}

void Forbid(const void* bytes, size_t count) {
  __msan_poison(bytes, count);
}

void ReadMap(const uint8_t* bytes, size_t count, uint8_t* map) {
  constexpr size_t kPiece = 64;  // every question costs as much as it asks for
  std::memset(map, 0, count);
  for (size_t at = 0; at < count;) {
    const size_t asked = std::min(kPiece, count - at);
    const intptr_t next = __msan_test_shadow(bytes + at, asked);
    if (next < 0) {
      at += asked;
    } else {
      at += size_t(next);
      map[at++] = 1;
    }
  }
}

ptrdiff_t FirstUndefined(const void* bytes, size_t count) {
  return __msan_test_shadow(bytes, count);
}

#elif defined(KESTREL_VALGRIND)

const char* Watcher() {
  return RUNNING_ON_VALGRIND ? "valgrind" : nullptr;
}

void Undefine(const void* bytes, size_t count) {
  VALGRIND_MAKE_MEM_UNDEFINED(bytes, count);
}

void Forbid(const void* bytes, size_t count) {
  VALGRIND_MAKE_MEM_NOACCESS(bytes, count);
}

void ReadMap(const uint8_t* bytes, size_t count, uint8_t* map) {
  std::memset(map, 0, count);
  VALGRIND_GET_VBITS(bytes, map, count);
}

ptrdiff_t FirstUndefined(const void* bytes, size_t count) {
  uint8_t map[256];
  const uint8_t* const first = static_cast<const uint8_t*>(bytes);
  for (size_t start = 0; start < count; start += sizeof(map)) {
    const size_t part = count - start < sizeof(map) ? count - start : sizeof(map);
    ReadMap(first + start, part, map);
    for (size_t i = 0; i < part; ++i) {
      if (map[i] != 0) {
        return ptrdiff_t(start + i);
      }
    }
  }
  return -1;
}

#else

const char* Watcher() {
  return nullptr;
}

void Undefine(const void*, size_t) {}

void Forbid(const void*, size_t) {}

void ReadMap(const uint8_t*, size_t count, uint8_t* map) {
  std::memset(map, 0, count);
}

ptrdiff_t FirstUndefined(const void*, size_t) {
  return -1;
}

#endif

}  // namespace watch
