// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <condition_variable>
#include <map>
#include <mutex>
#include <stop_token>
#include <thread>

namespace host {

/// Ends connections whose request has not arrived, or whose answer has not been taken, in time. The HTTP
/// library's own time-out bounds only how long nothing moves, so a client that sends a byte a second would
/// keep its thread for ever. Thread-safe.
class ConnectionWatch {
  public:
    using Clock = std::chrono::steady_clock;

    /// No connection may be left at its end.
    ConnectionWatch() = default;
    ConnectionWatch(const ConnectionWatch&) = delete;
    ConnectionWatch& operator=(const ConnectionWatch&) = delete;

    /// From the opening of the connection until before its socket is closed.
    void opened(int socket, Clock::duration allowed);
    void closed(int socket);

    /// What the connection does now has to be over in that time.
    void allow(int socket, Clock::duration allowed);
    /// No limit: the server itself is at work.
    void suspend(int socket);
    /// Between two requests; endIdle() ends such connections.
    void idle(int socket, Clock::duration allowed);

    /// Ends every connection that is idle now or comes to be.
    void endIdle();

  private:
    struct Watched {
        Clock::time_point deadline;
        bool isIdle = false;
    };

    void set(int socket, const Watched& watched);
    void run(const std::stop_token& stop);

    std::mutex m_mutex;
    std::condition_variable_any m_stopped;
    std::map<int, Watched> m_watched;
    bool m_ending = false;
    std::jthread m_thread{[this](const std::stop_token& stop) { run(stop); }};  // last: it uses the others
};

}  // namespace host
