// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/ConnectionWatch.h"

#include <sys/socket.h>

namespace host {

namespace {

// Limits are whole seconds, so looking four times a second is exact enough and needs no queue of deadlines.
constexpr std::chrono::milliseconds kTick{250};

/// The connection's own thread sees the end and closes; closing here would let the number be used again.
void end(int socket) {
    ::shutdown(socket, SHUT_RDWR);
}

}  // namespace

void ConnectionWatch::opened(int socket, Clock::duration allowed) {
    const std::lock_guard lock(m_mutex);
    m_watched[socket] = {Clock::now() + allowed, false};
}

void ConnectionWatch::closed(int socket) {
    const std::lock_guard lock(m_mutex);
    m_watched.erase(socket);
}

void ConnectionWatch::set(int socket, const Watched& watched) {
    const std::lock_guard lock(m_mutex);
    const auto found = m_watched.find(socket);
    if (found == m_watched.end()) return;  // closed meanwhile; the number may be another connection's soon
    found->second = watched;
    if (m_ending && watched.isIdle) end(socket);
}

void ConnectionWatch::allow(int socket, Clock::duration allowed) {
    set(socket, {Clock::now() + allowed, false});
}

void ConnectionWatch::suspend(int socket) {
    set(socket, {Clock::time_point::max(), false});
}

void ConnectionWatch::idle(int socket, Clock::duration allowed) {
    set(socket, {Clock::now() + allowed, true});
}

void ConnectionWatch::endIdle() {
    const std::lock_guard lock(m_mutex);
    // Those at work end by themselves: their answers carry "Connection: close".
    m_ending = true;
    for (const auto& [socket, watched] : m_watched) {
        if (watched.isIdle) end(socket);
    }
}

void ConnectionWatch::run(const std::stop_token& stop) {
    std::unique_lock lock(m_mutex);
    while (!stop.stop_requested()) {
        m_stopped.wait_for(lock, stop, kTick, [] { return false; });
        const auto now = Clock::now();
        for (const auto& [socket, watched] : m_watched) {
            if (watched.deadline <= now) end(socket);
        }
    }
}

}  // namespace host
