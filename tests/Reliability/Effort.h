#pragma once

#include <chrono>
#include <cstdint>
#include <string>

namespace test {

/// How much the reliability tests try: little when they run as tests, everything when they run as the soak.
struct Effort {
    bool everything = false;
    std::chrono::milliseconds stress{1500};
    std::uint64_t jobs = 40;  ///< to create and delete under stress, at least
};

/// The program's effort; the soak sets it before the tests run.
Effort& effort();

/// Adds to one of the figures that the soak prints at its end, such as "faults injected".
void count(const std::string& figure, std::uint64_t number = 1);
/// One line a figure, in the order of their names.
void printFigures();

}  // namespace test
