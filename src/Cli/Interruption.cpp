// SPDX-License-Identifier: Apache-2.0
#include "Cli/Interruption.h"

#include <array>
#include <atomic>

namespace cli {

namespace {

constexpr std::array<int, 3> NOTED = {SIGINT, SIGTERM, SIGHUP};

std::atomic<bool> asked{false};
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler stores it");

void note(int) {
    asked = true;
}

}  // namespace

Interruption::Interruption() {
    struct sigaction action = {};
    action.sa_handler = note;
    action.sa_flags = SA_RESTART;
    asked = false;
    std::size_t slot = 0;
    for (const int signal : NOTED)
        sigaction(signal, &action, &saved_[slot++]);
    action.sa_handler = SIG_IGN;
    sigaction(SIGPIPE, &action, &saved_[slot]);
}

Interruption::~Interruption() {
    std::size_t slot = 0;
    for (const int signal : NOTED)
        sigaction(signal, &saved_[slot++], nullptr);
    sigaction(SIGPIPE, &saved_[slot], nullptr);
}

bool Interruption::take() {
    return asked.exchange(false);
}

}  // namespace cli
