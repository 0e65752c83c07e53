// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <condition_variable>
#include <exception>
#include <functional>
#include <mutex>
#include <stop_token>

namespace host {

/// Works on the calling thread after each pause, until the thread is asked to stop, which ends a pause at
/// once. Work that throws is done again after the next one: there is nobody to tell, and what was missing,
/// memory above all, may be there then.
inline void repeat(const std::stop_token& stop, std::chrono::nanoseconds pause,
                   const std::function<void()>& work) {
    std::mutex mutex;
    std::condition_variable_any stopped;  // nobody calls it: only the time or the stop ends a wait
    std::unique_lock lock(mutex);
    while (!stopped.wait_for(lock, stop, pause, [&] { return stop.stop_requested(); })) {
        try {
            work();
        } catch (const std::exception&) {
            // See above.
        }
    }
}

}  // namespace host
