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
    /// limit is reached: the oldest that has not logged in, of the networks from which nobody has and which
    /// have the most such; if there is none, one of the user with the most connections, where that is more
    /// than a quarter; else the oldest that has not logged in of any network. A part of the limit is kept for
    /// networks from which somebody has logged in. Waits while the threads of many ended
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

    /// The client is one that may use the server, and is not dropped for another user's.
    void loggedIn(int socket, const std::string& user);
    /// The client's last request was refused: others may have its place.
    void loggedOut(int socket);
    /// Users may have been removed: whoever is idle now counts as logged in after the next request.
    void doubtLogins();
    /// What the connection does now has to be over in that time.
    void allow(int socket, Clock::duration allowed);
    /// No limit: the server itself is at work, or has the client wait. What it waits for is in vain once the
    /// token says so.
    std::stop_token suspend(int socket);
    /// Between two requests; endIdle() ends such connections.
    void idle(int socket, Clock::duration allowed);

    /// Ends every connection that is idle now or comes to be, and soon those that have not logged in.
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
        std::string user;        ///< who has logged in; empty for nobody
        bool isIdle = false;
        bool isEnded = false;
        std::stop_source waiting;

        bool isLocal() const;
        bool isLoggedIn() const { return !user.empty(); }
    };
    using Condition = std::function<bool(const Watched&)>;
    /// A network from which somebody has logged in.
    struct Known {
        std::string user;
        std::uint64_t last = 0;  ///< time, by the numbers of connections
    };
    /// What it took to admit one more, for the log.
    struct Room {
        std::string reached;  ///< which limit; empty for none
        std::string closed = "a connection that has not logged in";
    };
    struct Note {
        Clock::time_point next;
        unsigned int silent = 0;  ///< how often it was not logged
    };

    void set(int socket, Clock::time_point deadline, bool isIdle);
    void hurry(Watched& watched) const;
    static void end(int socket, Watched& watched);
    std::size_t count(const Condition& isMeant) const;
    bool endOldest(const Condition& isMeant);
    /// Of the network, or the user, with the most connections of that kind.
    bool endOldestOfMost(const Condition& isMeant);
    bool endOneOfBusiestUser(const Condition& isMeant, unsigned int limit, Room& room);
    /// Who has more than a quarter of the limit, and the most; empty for nobody.
    std::string busiestUser(const Condition& isMeant, unsigned int limit) const;
    bool makeRoom(const std::string& network, Room& room);
    bool isKnown(const std::string& network) const { return m_known.contains(network); }
    void run(const std::stop_token& stop);

    const ServerLimits m_limits;
    std::mutex m_mutex;
    std::condition_variable_any m_stopped;
    std::condition_variable_any m_closed;
    std::map<int, Watched> m_watched;
    std::uint64_t m_closures = 0;
    std::uint64_t m_lastNumber = 0;
    std::map<std::string, Known> m_known;
    bool m_stopping = false;
    Clock::time_point m_last;  ///< while it stops, for those who have not logged in
    std::mutex m_noteMutex;
    std::map<std::string, Note> m_notes;
    std::jthread m_thread{[this](const std::stop_token& stop) { run(stop); }};  // last: it uses the others
};

}  // namespace host
