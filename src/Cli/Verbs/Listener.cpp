// SPDX-License-Identifier: Apache-2.0
#include "Cli/Verbs/Listener.h"

#include <netdb.h>
#include <poll.h>
#include <sys/socket.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <memory>

#include "Cli/Display/Messages.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using Clock = std::chrono::steady_clock;

constexpr std::size_t kLongestHead = 16 << 10;
constexpr std::size_t kLongestBody = 4 << 20;
constexpr std::chrono::seconds kWholeTime{10};  ///< for one message

/// Numbers only: which of a name's addresses would be listened on is nothing to guess.
std::unique_ptr<addrinfo, decltype(&::freeaddrinfo)> placeOf(const std::string& address, std::uint16_t port) {
    addrinfo hints{};
    hints.ai_flags = AI_NUMERICHOST | AI_NUMERICSERV;
    hints.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    if (::getaddrinfo(address.c_str(), std::to_string(port).c_str(), &hints, &found) != 0) {
        throw CommandError(ExitStatus::WrongUse, "--address is \"" + address + "\", which is no address.",
                           "Name one of this machine, as 192.0.2.7 or 2001:db8::7.");
    }
    return {found, ::freeaddrinfo};
}

[[noreturn]] void refuse(const std::string& address, std::uint16_t port) {
    throw CommandError(
        ExitStatus::Failed,
        "Cannot listen on " + address + " port " + std::to_string(port) + ": " + std::strerror(errno) + ".",
        "Name an address of this machine with --address, and a free port with --port.");
}

/// Whether something comes in time.
bool waitFor(int socket, std::chrono::milliseconds patience) {
    pollfd waiting{socket, POLLIN, 0};
    return ::poll(&waiting, 1, static_cast<int>(std::max<std::int64_t>(patience.count(), 0))) > 0;
}

/// Bytes of one connection until there are so many, or an end; false where it is too slow.
class Reading {
  public:
    explicit Reading(int socket) : m_socket(socket) {}

    bool readMore(std::string& bytes) const {
        const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(m_deadline - Clock::now());
        if (!waitFor(m_socket, left)) return false;
        std::array<char, 16384> piece{};
        const ssize_t got = ::recv(m_socket, piece.data(), piece.size(), 0);
        if (got <= 0) return false;
        bytes.append(piece.data(), static_cast<std::size_t>(got));
        return true;
    }

  private:
    const int m_socket;
    const Clock::time_point m_deadline = Clock::now() + kWholeTime;
};

std::size_t lengthIn(std::string_view head) {
    constexpr std::string_view kName = "\r\ncontent-length:";
    std::string folded(head);
    for (char& each : folded)
        each = utils::lowerCase(each);
    const std::size_t place = folded.find(kName);
    if (place == std::string::npos) return 0;
    const std::size_t begin = place + kName.size();
    const auto number = utils::parseNumber<std::size_t>(
        utils::trim(std::string_view(folded).substr(begin, folded.find("\r\n", begin) - begin)));
    return number.value_or(0);
}

void send(int socket, const std::string& status, const std::string& headers, const std::string& body) {
    const std::string answer = "HTTP/1.1 " + status + "\r\n" + headers +
                               "Connection: close\r\nContent-Length: " + std::to_string(body.size()) +
                               "\r\n\r\n" + body;
    // A server that has gone meanwhile will send the message again.
    static_cast<void>(::send(socket, answer.data(), answer.size(), MSG_NOSIGNAL));
}

}  // namespace

Listener::Listener(const std::string& address, std::uint16_t port, std::string path)
    : m_socket(::socket(placeOf(address, port)->ai_family, SOCK_STREAM | SOCK_CLOEXEC, 0)),
      m_address(address),
      m_path(std::move(path)) {
    const auto place = placeOf(address, port);
    const int yes = 1;
    ::setsockopt(m_socket.number(), SOL_SOCKET, SO_REUSEADDR, &yes, sizeof yes);
    if (!m_socket.isOpen() || ::bind(m_socket.number(), place->ai_addr, place->ai_addrlen) != 0 ||
        ::listen(m_socket.number(), SOMAXCONN) != 0)
        refuse(address, port);
    sockaddr_storage bound{};
    socklen_t size = sizeof bound;
    std::array<char, 8> number{};
    if (::getsockname(m_socket.number(), reinterpret_cast<sockaddr*>(&bound), &size) != 0 ||
        ::getnameinfo(reinterpret_cast<sockaddr*>(&bound), size, nullptr, 0, number.data(), number.size(),
                      NI_NUMERICSERV) != 0)
        refuse(address, port);
    m_port = utils::parseNumber<std::uint16_t>(number.data()).value_or(0);
}

std::string Listener::url() const {
    const bool isIpv6 = m_address.find(':') != std::string::npos;
    return "http://" + (isIpv6 ? "[" + m_address + "]" : m_address) + ":" + std::to_string(m_port) + m_path;
}

std::optional<Listener::Delivered> Listener::next(std::chrono::milliseconds patience) {
    if (!waitFor(m_socket.number(), patience)) return std::nullopt;
    os::Descriptor connection(::accept4(m_socket.number(), nullptr, nullptr, SOCK_CLOEXEC));
    if (!connection.isOpen()) return std::nullopt;
    const Reading reading(connection.number());
    std::string bytes;
    std::size_t end = 0;
    while ((end = bytes.find("\r\n\r\n")) == std::string::npos)
        if (bytes.size() > kLongestHead || !reading.readMore(bytes)) return std::nullopt;
    if (!bytes.starts_with("POST " + m_path + " ")) {
        send(connection.number(), "404 Not Found", "", "");
        return std::nullopt;
    }
    const std::size_t length = lengthIn(std::string_view(bytes).substr(0, end));
    if (length == 0 || length > kLongestBody) {
        send(connection.number(), "400 Bad Request", "", "");
        return std::nullopt;
    }
    std::string body = bytes.substr(end + 4);
    while (body.size() < length)
        if (!reading.readMore(body)) return std::nullopt;
    body.resize(length);
    return Delivered{std::move(connection), std::move(body)};
}

void Listener::answer(const Delivered& delivered, const std::string& body) {
    if (body.empty()) return send(delivered.connection.number(), "400 Bad Request", "", "");
    send(delivered.connection.number(), "200 OK",
         "Content-Type: application/xml; charset=utf-8\r\nCIMExport: MethodResponse\r\n", body);
}

}  // namespace cli
