// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <benchmark/benchmark.h>

#include <cstddef>
#include <vector>

namespace bench {

/// Takes the processor's caches for other memory, outside the measured time. A management client asks every
/// few seconds and so finds them cold; what fits into them would also look cheaper than it is, and a tenfold
/// of it, which does not fit, like more than ten times the work.
inline void emptyCaches(benchmark::State& state) {
    constexpr std::size_t kBytes = std::size_t{256} * 1024 * 1024;
    constexpr std::size_t kCacheLine = 64;
    static std::vector<unsigned char> other(kBytes);
    state.PauseTiming();
    for (std::size_t i = 0; i < other.size(); i += kCacheLine)
        ++other[i];
    benchmark::DoNotOptimize(other.data());
    state.ResumeTiming();
}

}  // namespace bench
