// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <map>
#include <mutex>
#include <string>

namespace test {

/// How much the reliability tests try: little when they run as tests, everything when they run as the soak.
struct Effort {
    bool everything = false;
    std::chrono::milliseconds stress{1500};
    std::uint64_t jobs = 40;  ///< to create and delete under stress, at least
};

/// The program's effort; the soak sets it before the tests run.
inline Effort effort;

inline std::mutex figuresMutex;
inline std::map<std::string, std::uint64_t> figures;

/// Adds to one of the figures that the soak prints at its end, such as "faults injected".
inline void count(const std::string& figure, std::uint64_t number = 1) {
    const std::lock_guard lock(figuresMutex);
    figures[figure] += number;
}

}  // namespace test
