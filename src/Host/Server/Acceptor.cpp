// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/Acceptor.h"

#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <new>
#include <utility>

#include "Host/Authentication/ClientAddress.h"
#include "Utils/Log.h"

namespace host {

Acceptor::Acceptor(int listener, ConnectionWatch& watch, Taker taker)
    : m_listener(listener), m_watch(watch), m_taker(std::move(taker)) {}

Acceptor::~Acceptor() {
    m_thread.request_stop();
    ::shutdown(m_listener, SHUT_RDWR);  // wakes the thread, which waits for a connection
    m_thread.join();
    ::close(m_listener);
}

void Acceptor::run(const std::stop_token& stop) {
    while (!stop.stop_requested()) {
        sockaddr_storage storage{};
        auto& address = reinterpret_cast<sockaddr&>(storage);
        socklen_t length = sizeof storage;
        const int socket = ::accept4(m_listener, &address, &length, SOCK_CLOEXEC | SOCK_NONBLOCK);
        if (socket < 0) {
            pause(errno, stop);
        } else if (const auto number = admit(socket, address, stop)) {
            if (!m_taker(socket, address, length)) m_watch.refused(socket, *number);
        } else {
            ::close(socket);
        }
    }
}

std::optional<std::uint64_t> Acceptor::admit(int socket, const sockaddr& address,
                                             const std::stop_token& stop) {
    try {
        return m_watch.admit(socket, networkOf(addressText(address)), stop);
    } catch (const std::exception& error) {
        QUENX_ERROR("a connection was refused: %s", error.what());
        return std::nullopt;
    }
}

void Acceptor::pause(int error, const std::stop_token& stop) try {
    // A client that has gone already costs nothing. All else, descriptors and memory above all, takes others
    // to end first: trying on at once would take a whole processor.
    if (error == EINTR || error == ECONNABORTED || stop.stop_requested()) return;
    m_watch.noteLimit("a limit of the system",
                      std::string("a connection has to wait: ") + std::strerror(error));
    m_watch.giveUpOne(stop);
} catch (const std::bad_alloc&) {
    // Descriptors and memory ran out together. The next round tries again.
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
}

}  // namespace host
