// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <latch>
#include <thread>
#include <vector>

#include "Support/SyslogCapture.h"

namespace test {

/// Calls all operations at once, each on a thread of its own, and returns when the last has ended.
///
/// What the threads share without a lock is found by the thread sanitizer, whichever came first: a thread
/// makes one call only, so that nothing it did before, and no line of the log, puts that call into an order
/// with those of the others.
inline void together(const std::vector<std::function<void()>>& operations) {
    const LogLevelGuard silent(0);
    std::latch start(static_cast<std::ptrdiff_t>(operations.size()));
    std::vector<std::jthread> threads;
    for (const std::function<void()>& operation : operations) {
        threads.emplace_back([&start, &operation] {
            start.arrive_and_wait();
            operation();
        });
    }
}

}  // namespace test
