// SPDX-License-Identifier: Apache-2.0
// The reliability tests, tried thoroughly:  soak [--seconds=N] [--jobs=N] [GoogleTest's own flags]
// Prints the figures of docs/reliability.md at its end.
#include <gtest/gtest.h>

#include <charconv>
#include <cinttypes>
#include <cstdio>
#include <string_view>

#include "Reliability/Effort.h"
#include "Support/Environment.h"

namespace {

/// Takes "--name=number"; false when the argument is something else.
bool take(std::string_view argument, std::string_view name, std::uint64_t& number) {
    if (!argument.starts_with(name)) return false;
    argument.remove_prefix(name.size());
    const auto [end, error] = std::from_chars(argument.data(), argument.data() + argument.size(), number);
    return error == std::errc() && end == argument.data() + argument.size();
}

}  // namespace

int main(int argc, char** argv) {
    ::testing::InitGoogleTest(&argc, argv);
    std::uint64_t seconds = 60;
    std::uint64_t jobs = 10'000;
    for (int i = 1; i < argc; ++i) {
        if (take(argv[i], "--seconds=", seconds) || take(argv[i], "--jobs=", jobs)) continue;
        std::fprintf(stderr, "soak: \"%s\" is not one of --seconds=N and --jobs=N, with a number.\n",
                     argv[i]);
        return 2;
    }
    test::effort = {true, std::chrono::seconds(seconds), jobs};
    const test::ChosenEnvironment environment;
    const int status = RUN_ALL_TESTS();
    std::printf("\n| figure | number |\n|---|---|\n");
    for (const auto& [name, number] : test::figures)
        std::printf("| %s | %" PRIu64 " |\n", name.c_str(), number);
    std::printf("| tests that found a loss | %d |\n",
                ::testing::UnitTest::GetInstance()->failed_test_count());
    return status;
}
