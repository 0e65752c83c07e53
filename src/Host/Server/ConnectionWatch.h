// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <stop_token>
#include <string>
#include <thread>

#include "Host/Settings.h"

namespace host {

/// The open connections: how long each may take, and which has to go when there are too many. The HTTP
/// library's own time-out bounds only how long nothing moves, so a client that sends a byte a second would
/// keep its thread for ever; and its own limits turn newcomers away, whoever they are. Thread-safe.
class ConnectionWatch {
  public:
    using Clock = std::chrono::steady_clock;

    /// How many clients of the Unix socket there can be at a time, beyond the limits of the settings.
    static constexpr unsigned int kLocalConnections = 16;
    /// The most connections at a time, those included that have been ended and whose threads still end.
    static unsigned int mostOf(const ServerLimits& limits);

    /// No connection may be left at its end.
    explicit ConnectionWatch(const ServerLimits& limits) : m_limits(limits) {}
    ConnectionWatch(const ConnectionWatch&) = delete;
    ConnectionWatch& operator=(const ConnectionWatch&) = delete;

    /// Takes in a connection, which has to be admitted before the library gets it. Ends another for it when a
    /// limit is reached: the oldest that has not logged in, of the network with the most such. A part of the
    /// limit is kept for networks from which somebody has logged in. Waits while the threads of many ended
    /// ones still end. Returns the connection's number; nothing when it is refused, or asked to stop.
    /// @param network  what networkOf() says; kLocalAddress for the Unix socket
    std::optional<std::uint64_t> admit(int socket, const std::string& network, const std::stop_token& stop);
    /// The library did not take the admitted connection, and has closed its socket.
    void refused(int socket, std::uint64_t number);
    /// Ends one that has not logged in, since no more descriptors are to be had, and waits a moment until one
    /// is closed.
    void giveUpOne(const std::stop_token& stop);

    /// From the start of the admitted connection's thread until before its socket is closed.
    void started(int socket);
    void closed(int socket);

    /// The client is one that may use the server, and is not dropped for another.
    void loggedIn(int socket);
    /// What the connection does now has to be over in that time.
    void allow(int socket, Clock::duration allowed);
    /// No limit: the server itself is at work, or has the client wait. What it waits for is in vain once the
    /// token says so.
    std::stop_token suspend(int socket);
    /// Between two requests; endIdle() ends such connections.
    void idle(int socket, Clock::duration allowed);

    /// Ends every connection that is idle now or comes to be.
    void endIdle();
    /// Lets go of every client that the server has wait.
    void endWaiting();

    /// Logs that a limit was reached, at most once a minute for each.
    void noteLimit(const std::string& limit, const std::string& what);

  private:
    struct Watched {
        std::string network;
        std::uint64_t number = 0;  ///< by age
        Clock::time_point deadline;
        bool isStarted = false;  ///< until then, the library may close the socket without a word
        bool isIdle = false;
        bool isLoggedIn = false;
        bool isEnded = false;
        std::stop_source waiting;

        bool isLocal() const;
    };
    using Condition = std::function<bool(const Watched&)>;
    struct Note {
        Clock::time_point next;
        unsigned int silent = 0;  ///< how often it was not logged
    };

    void set(int socket, Clock::time_point deadline, bool isIdle);
    static void end(int socket, Watched& watched);
    std::size_t count(const Condition& isMeant) const;
    bool endOldest(const Condition& isMeant);
    /// Of the network with the most connections of that kind.
    bool endOldestOfMost(const Condition& isMeant);
    bool makeRoom(const std::string& network, std::string& reached);
    bool isKnown(const std::string& network) const { return m_known.contains(network); }
    void run(const std::stop_token& stop);

    const ServerLimits m_limits;
    std::mutex m_mutex;
    std::condition_variable_any m_stopped;
    std::condition_variable_any m_closed;
    std::map<int, Watched> m_watched;
    std::uint64_t m_closures = 0;
    std::uint64_t m_lastNumber = 0;
    std::map<std::string, std::uint64_t> m_known;  ///< networks of those who logged in, by the last time
    bool m_stopping = false;
    std::mutex m_noteMutex;
    std::map<std::string, Note> m_notes;
    std::jthread m_thread{[this](const std::stop_token& stop) { run(stop); }};  // last: it uses the others
};

}  // namespace host
