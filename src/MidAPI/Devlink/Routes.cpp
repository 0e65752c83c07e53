// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/Routes.h"

#include <arpa/inet.h>
#include <linux/route.h>

#include <algorithm>
#include <bit>
#include <cstring>
#include <sstream>

#include "MidAPI/Devlink/Machine.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

constexpr unsigned kAllBits = 128;

utils::StringArray words(const std::string& line) {
    std::istringstream stream(line);
    utils::StringArray found;
    for (std::string word; stream >> word;)
        found.push_back(std::move(word));
    return found;
}

std::optional<std::uint32_t> hexNumber(std::string_view text) {
    return utils::parseNumber<std::uint32_t>(text, 16);
}

/// A route that leads somewhere: others say that a network is not to be reached.
bool leadsOut(const std::optional<std::uint32_t>& flags) {
    return flags && (*flags & RTF_UP) != 0 && (*flags & RTF_REJECT) == 0;
}

}  // namespace

Routes::Routes(Machine& machine) {
    // The process's own are there where a service sees no more of procfs than that.
    read(machine.readFile("/proc/self/net/route"), readV4);
    read(machine.readFile("/proc/self/net/ipv6_route"), readV6);
}

void Routes::read(const std::optional<std::string>& text, bool (*readLine)(const std::string&, Route&)) {
    m_areKnown = m_areKnown || text;
    for (const std::string& line : utils::split(text.value_or(""), '\n'))
        if (Route route; readLine(line, route)) m_routes.push_back(std::move(route));
}

// Interface, destination, gateway, flags, references, use, metric, mask. Addresses are printed as numbers of
// this machine, so their bytes are in order once they are in memory.
bool Routes::readV4(const std::string& line, Route& route) {
    const utils::StringArray fields = words(line);
    if (fields.size() < 8 || !leadsOut(hexNumber(fields[3]))) return false;
    const auto network = hexNumber(fields[1]);
    const auto metric = utils::parseNumber<std::uint32_t>(fields[6]);
    const auto mask = hexNumber(fields[7]);
    if (!network || !metric || !mask) return false;
    route.isV4 = true;
    std::memcpy(route.network.data(), &*network, sizeof *network);
    route.length = static_cast<unsigned>(std::popcount(*mask));
    route.metric = *metric;
    route.interface = fields[0];
    return true;
}

// Destination and length, source and length, next hop, metric, references, use, flags, interface.
bool Routes::readV6(const std::string& line, Route& route) {
    const utils::StringArray fields = words(line);
    if (fields.size() < 10 || !leadsOut(hexNumber(fields[8]))) return false;
    if (fields[0].size() != 2 * route.network.size()) return false;
    for (std::size_t index = 0; index < route.network.size(); ++index) {
        const auto byte = utils::parseNumber<std::uint8_t>(fields[0].substr(2 * index, 2), 16);
        if (!byte) return false;
        route.network[index] = *byte;
    }
    const auto length = hexNumber(fields[1]);
    const auto metric = hexNumber(fields[5]);
    if (!length || *length > kAllBits || !metric) return false;
    route.length = *length;
    route.metric = *metric;
    route.interface = fields[9];
    return true;
}

bool Routes::Route::covers(const Address& address) const {
    const std::size_t whole = length / 8;
    if (!std::equal(network.begin(), network.begin() + static_cast<std::ptrdiff_t>(whole), address.begin()))
        return false;
    const unsigned rest = length % 8;
    return rest == 0 || (network[whole] ^ address[whole]) >> (8 - rest) == 0;
}

bool Routes::Route::precedes(const Route& other) const {
    return length != other.length ? length > other.length : metric < other.metric;
}

std::string Routes::best(bool isV4, const Address& address, unsigned longest) const {
    const Route* found = nullptr;
    for (const Route& route : m_routes) {
        const bool isMeant = route.isV4 == isV4 && route.length <= longest && route.covers(address);
        if (isMeant && (found == nullptr || route.precedes(*found))) found = &route;
    }
    return found == nullptr ? std::string() : found->interface;
}

utils::StringArray Routes::defaultInterfaces() const {
    utils::StringArray interfaces;
    for (const bool isV4 : {true, false}) {
        std::string interface = best(isV4, {}, 0);
        if (!interface.empty() && std::ranges::find(interfaces, interface) == interfaces.end())
            interfaces.push_back(std::move(interface));
    }
    return interfaces;
}

std::string Routes::interfaceTo(const std::string& address) const {
    if (const std::size_t zone = address.find('%'); zone != std::string::npos)
        return address.substr(zone + 1);
    Address bytes{};
    if (::inet_pton(AF_INET, address.c_str(), bytes.data()) == 1) return best(true, bytes, kAllBits);
    if (::inet_pton(AF_INET6, address.c_str(), bytes.data()) != 1) return {};
    // What comes over IPv4 to a socket for both has such an address.
    constexpr std::array<std::uint8_t, 12> kMapped = {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0xFF, 0xFF};
    if (!std::equal(kMapped.begin(), kMapped.end(), bytes.begin())) return best(false, bytes, kAllBits);
    Address inner{};
    std::copy(bytes.begin() + kMapped.size(), bytes.end(), inner.begin());
    return best(true, inner, kAllBits);
}

}  // namespace ma::devlink
