// SPDX-License-Identifier: Apache-2.0
#include "Cli/Verbs/Listener.h"

#include <netdb.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <memory>
#include <vector>

#include "Cli/Display/Messages.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using Clock = std::chrono::steady_clock;

constexpr std::size_t kLongestHead = 16 << 10;
constexpr std::size_t kLongestBody = 4 << 20;
constexpr std::chrono::seconds kWholeTime{10};  ///< for one message
constexpr std::size_t kMostIncoming = 16;

bool isUnspecified(const sockaddr& address) {
    if (address.sa_family == AF_INET)
        return reinterpret_cast<const sockaddr_in&>(address).sin_addr.s_addr == INADDR_ANY;
    return IN6_IS_ADDR_UNSPECIFIED(&reinterpret_cast<const sockaddr_in6&>(address).sin6_addr);
}

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
    if (isUnspecified(*found->ai_addr)) {
        ::freeaddrinfo(found);
        throw CommandError(ExitStatus::WrongUse,
                           "--address is \"" + address + "\", which no server can reach.",
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

void Listener::accept() {
    os::Descriptor connection(::accept4(m_socket.number(), nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK));
    if (!connection.isOpen()) return;
    // A server sends one at a time, and at once: those on which nothing has come are somebody else's.
    if (m_incoming.size() >= kMostIncoming) {
        const auto silent = std::ranges::find_if(m_incoming, [](auto& each) { return each.bytes.empty(); });
        m_incoming.erase(silent == m_incoming.end() ? m_incoming.begin() : silent);
    }
    m_incoming.push_back({std::move(connection), Clock::now() + kWholeTime});
}

/// False at the end of the connection.
bool Listener::readMore(Incoming& incoming) const {
    std::array<char, 16384> piece{};
    const ssize_t got = ::recv(incoming.connection.number(), piece.data(), piece.size(), 0);
    if (got < 0) return errno == EAGAIN || errno == EINTR;
    incoming.bytes.append(piece.data(), static_cast<std::size_t>(got));
    return got > 0;
}

/// The message if all of it is there. What can be none is answered, and its connection closed.
std::optional<Listener::Delivered> Listener::messageIn(Incoming& incoming) const {
    const auto refuse = [&](const char* status) {
        send(incoming.connection.number(), status, "", "");
        incoming.isOver = true;
        return std::nullopt;
    };
    const std::string_view bytes = incoming.bytes;
    const std::size_t end = bytes.find("\r\n\r\n");
    if (end == std::string_view::npos)
        return bytes.size() > kLongestHead ? refuse("431 Request Header Fields Too Large") : std::nullopt;
    if (!bytes.starts_with("POST " + m_path + " ")) return refuse("404 Not Found");
    const std::size_t length = lengthIn(bytes.substr(0, end));
    if (length == 0 || length > kLongestBody) return refuse("400 Bad Request");
    const std::string_view body = bytes.substr(end + 4);
    if (body.size() < length) return std::nullopt;
    return Delivered{std::move(incoming.connection), std::string(body.substr(0, length))};
}

std::optional<Listener::Delivered> Listener::next(std::chrono::milliseconds patience) {
    std::vector<pollfd> polled{{m_socket.number(), POLLIN, 0}};
    for (const Incoming& each : m_incoming)
        polled.push_back({each.connection.number(), POLLIN, 0});
    if (::poll(polled.data(), polled.size(), static_cast<int>(patience.count())) < 0) return std::nullopt;
    auto ready = polled.begin() + 1;
    for (auto each = m_incoming.begin(); each != m_incoming.end();) {
        const bool hasMore = (ready++)->revents != 0;
        if ((hasMore && !readMore(*each)) || Clock::now() > each->deadline) each->isOver = true;
        auto message = hasMore ? messageIn(*each) : std::nullopt;
        each = each->isOver || message ? m_incoming.erase(each) : std::next(each);
        if (message) return message;
    }
    if (polled.front().revents != 0) accept();
    return std::nullopt;
}

void Listener::answer(const Delivered& delivered, const std::string& body) {
    if (body.empty()) return send(delivered.connection.number(), "400 Bad Request", "", "");
    send(delivered.connection.number(), "200 OK",
         "Content-Type: application/xml; charset=utf-8\r\nCIMExport: MethodResponse\r\n", body);
}

}  // namespace cli
