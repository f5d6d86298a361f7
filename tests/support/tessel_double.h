// Base library for tests: put tessel_double.cpp among a test's sources and its MMemAlloc family
// takes the place of libtessel, in tests of the objects and of the shared library alike (a
// program's own definitions come first). It counts what is alive, fails on demand and notices
// misuse.
#ifndef KESTREL_TESTS_SUPPORT_TESSEL_DOUBLE_H
#define KESTREL_TESTS_SUPPORT_TESSEL_DOUBLE_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace tessel_double {

// Forgets the failure plan, the requests and the faults seen so far. Live blocks stay known.
void Reset();

// Failure plans; they add up and last until the next Reset.
void FailNth(size_t n);          // the n-th request since Reset, counted from 1
void FailAbove(uint32_t bytes);  // every request larger than this
void FailSize(uint32_t bytes);   // every request of exactly this size

size_t LiveBlocks();
size_t LiveBytes();

// Sizes asked for since Reset, in order, failed ones included.
std::vector<uint32_t> Requests();

// Misuse since Reset: a pool handle that is not null, a block freed twice or never allocated, bytes
// written beside a block (found when it is freed).
std::vector<std::string> Faults();

// False under AddressSanitizer, which finds writes beside a block at once and by itself.
bool HasMargins();

}  // namespace tessel_double

#endif
