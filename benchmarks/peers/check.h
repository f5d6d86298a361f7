// The picture that all contenders work on, and whether theirs is the right one.
//
// Every channel is a plane wave of half a period across the picture and another down it, so its
// value is known exactly at every place, under every scale, turn and crop, and no two places far
// apart look alike. Contenders may place samples differently (corners or centres of pixels, chroma
// averaged or taken), round differently and use factors of different precision; what they may not
// do is show something else. A sample is right when it is within
//
//   6 levels + a quantum of narrow channels (some libraries dither) + the greatest change of a wave
//   over two pixels of the coarser side of the job
//
// of the exact value, and a picture is right when 99 % of the samples of each component are, and
// the mean error is within half of that.
#ifndef KESTREL_BENCHMARKS_PEERS_CHECK_H
#define KESTREL_BENCHMARKS_PEERS_CHECK_H

#include <string>

#include "benchmarks/common/picture.h"
#include "benchmarks/peers/job.h"

namespace bench {

// Draws the waves in the picture's format.
void DrawWaves(const Picture& picture);

// Empty when dst shows what the job makes of the waves, otherwise what is wrong.
std::string WhatIsWrong(const Job& job, const Picture& dst);

}  // namespace bench

#endif
