// SPDX-License-Identifier: Apache-2.0
#include "Host/Authentication/ClientAddress.h"

#include <arpa/inet.h>
#include <netinet/in.h>

#include <algorithm>
#include <array>

namespace host {

namespace {

std::string textOf(int family, const void* bytes) {
    std::array<char, INET6_ADDRSTRLEN> text{};
    ::inet_ntop(family, bytes, text.data(), static_cast<socklen_t>(text.size()));
    return text.data();
}

}  // namespace

std::string addressText(const sockaddr& address) {
    if (address.sa_family == AF_UNIX) return kLocalAddress;
    if (address.sa_family == AF_INET)
        return textOf(AF_INET, &reinterpret_cast<const sockaddr_in&>(address).sin_addr);
    if (address.sa_family != AF_INET6) return "unknown";
    const in6_addr& bytes = reinterpret_cast<const sockaddr_in6&>(address).sin6_addr;
    // A socket that listens on "::" serves IPv4, too, and shows it as ::ffff:192.0.2.1: all in one network.
    return IN6_IS_ADDR_V4MAPPED(&bytes) ? textOf(AF_INET, &bytes.s6_addr[12]) : textOf(AF_INET6, &bytes);
}

std::string networkOf(const std::string& address) {
    in6_addr bytes{};
    if (::inet_pton(AF_INET6, address.c_str(), &bytes) != 1) return address;
    std::fill(std::begin(bytes.s6_addr) + 8, std::end(bytes.s6_addr), std::uint8_t{0});
    return textOf(AF_INET6, &bytes) + "/64";
}

bool isLoopback(const std::string& address) {
    in_addr bytes{};
    if (::inet_pton(AF_INET, address.c_str(), &bytes) != 1) return address == "::1";
    return (ntohl(bytes.s_addr) >> 24) == IN_LOOPBACKNET;
}

std::string placeOf(const std::string& address) {
    return isLoopback(address) ? "loopback" : networkOf(address);
}

}  // namespace host
