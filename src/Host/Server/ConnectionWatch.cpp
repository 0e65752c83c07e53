// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/ConnectionWatch.h"

#include <sys/socket.h>

#include <algorithm>

namespace host {

namespace {

// Limits are whole seconds, so looking four times a second is exact enough and needs no queue of deadlines.
constexpr std::chrono::milliseconds kTick{250};

// A stop waits so long for clients of whom nobody knows yet that they may use the server.
constexpr std::chrono::seconds kForStrangers{2};

}  // namespace

void ConnectionWatch::end(int socket, Watched& watched) {
    watched.isEnded = true;
    watched.waiting.request_stop();
    // The connection's own thread sees the end and closes; closing here would let the number be used again.
    if (watched.isStarted) ::shutdown(socket, SHUT_RDWR);
}

void ConnectionWatch::started(int socket) {
    const std::lock_guard lock(m_mutex);
    const auto found = m_watched.find(socket);
    if (found == m_watched.end()) return;
    found->second.isStarted = true;
    if (found->second.isEnded) end(socket, found->second);
}

void ConnectionWatch::refused(int socket, std::uint64_t number) {
    const std::lock_guard lock(m_mutex);
    const auto found = m_watched.find(socket);
    // Its socket is closed, and may be another connection's by now.
    if (found != m_watched.end() && found->second.number == number) m_watched.erase(found);
}

void ConnectionWatch::closed(int socket) {
    {
        const std::lock_guard lock(m_mutex);
        m_watched.erase(socket);
        ++m_closures;
    }
    m_closed.notify_all();
}

void ConnectionWatch::set(int socket, Clock::time_point deadline, bool isIdle) {
    const std::lock_guard lock(m_mutex);
    const auto found = m_watched.find(socket);
    if (found == m_watched.end()) return;  // closed meanwhile; the number may be another connection's soon
    found->second.deadline = deadline;
    found->second.isIdle = isIdle;
    if (m_stopping && isIdle) end(socket, found->second);
    if (m_stopping) hurry(found->second);
}

void ConnectionWatch::hurry(Watched& watched) const {
    if (!watched.isLocal() && !watched.isLoggedIn()) watched.deadline = std::min(watched.deadline, m_last);
}

void ConnectionWatch::allow(int socket, Clock::duration allowed) {
    set(socket, Clock::now() + allowed, false);
}

std::stop_token ConnectionWatch::suspend(int socket) {
    set(socket, Clock::time_point::max(), false);
    const std::lock_guard lock(m_mutex);
    const auto found = m_watched.find(socket);
    return found == m_watched.end() ? std::stop_token() : found->second.waiting.get_token();
}

void ConnectionWatch::idle(int socket, Clock::duration allowed) {
    set(socket, Clock::now() + allowed, true);
}

void ConnectionWatch::endIdle() {
    const std::lock_guard lock(m_mutex);
    // Those at work end by themselves: their answers carry "Connection: close".
    m_stopping = true;
    m_last = Clock::now() + kForStrangers;
    for (auto& [socket, watched] : m_watched) {
        if (watched.isIdle) end(socket, watched);
        hurry(watched);
    }
}

void ConnectionWatch::endWaiting() {
    const std::lock_guard lock(m_mutex);
    for (auto& [socket, watched] : m_watched)
        watched.waiting.request_stop();
}

void ConnectionWatch::run(const std::stop_token& stop) {
    std::unique_lock lock(m_mutex);
    while (!stop.stop_requested()) {
        m_stopped.wait_for(lock, stop, kTick, [] { return false; });
        const auto now = Clock::now();
        // What has never started was given up by the library.
        std::erase_if(m_watched, [&](const auto& each) {
            return !each.second.isStarted && each.second.deadline <= now;
        });
        for (auto& [socket, watched] : m_watched) {
            if (watched.deadline <= now) end(socket, watched);
        }
    }
}

}  // namespace host
