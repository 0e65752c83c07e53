#pragma once

#include <chrono>
#include <condition_variable>
#include <map>
#include <mutex>
#include <thread>

namespace host {

/// Ends connections whose request has not arrived, or whose answer has not been taken, in time. The HTTP
/// library's own time-out bounds only how long nothing moves, so a client that sends a byte a second would
/// keep its thread for ever. Thread-safe.
class ConnectionWatch {
  public:
    using Clock = std::chrono::steady_clock;

    ConnectionWatch();
    /// No connection may be left.
    ~ConnectionWatch();
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
    void run();

    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::map<int, Watched> m_watched;
    bool m_ending = false;
    bool m_stopped = false;
    std::thread m_thread;
};

}  // namespace host
