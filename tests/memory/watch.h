// What MemorySanitizer or valgrind knows of memory: which bytes have a value and which have none
// yet. Without either every byte counts as defined and marking does nothing.
#ifndef KESTREL_TESTS_MEMORY_WATCH_H
#define KESTREL_TESTS_MEMORY_WATCH_H

#include <cstddef>
#include <cstdint>

namespace watch {

// Who watches; null when nobody does.
const char* Watcher();

// Takes the value of bytes away.
void Undefine(const void* bytes, size_t count);

// The same, and nobody may even read them, where the watcher can tell.
void Forbid(const void* bytes, size_t count);

// map[i] becomes 0 when all bits of bytes[i] have a value, else something else.
void ReadMap(const uint8_t* bytes, size_t count, uint8_t* map);

// Offset of the first byte without a value, or -1.
ptrdiff_t FirstUndefined(const void* bytes, size_t count);

}  // namespace watch

#endif
