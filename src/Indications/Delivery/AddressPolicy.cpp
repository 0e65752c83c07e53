// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/AddressPolicy.h"

#include <arpa/inet.h>

#include <algorithm>
#include <cstring>
#include <utility>

#include "Utils/Utils.h"

namespace indications {

namespace {

constexpr int kIpv4Bits = 96;  ///< those in front of an IPv4 address
constexpr std::uint16_t kFirstFreePort = 1024;

MachineAddress mapped(const in_addr& address) {
    MachineAddress result{};
    result[10] = result[11] = 0xFF;
    std::memcpy(result.data() + 12, &address, sizeof address);
    return result;
}

bool isIn(const MachineAddress& address, const Network& network) {
    for (int bit = 0; bit < network.bits; bit += 8) {
        const auto byte = static_cast<std::size_t>(bit / 8);
        const int counted = std::min(8, network.bits - bit);
        const auto difference = static_cast<unsigned int>(address[byte] ^ network.address[byte]);
        if ((difference >> (8 - counted)) != 0) return false;
    }
    return true;
}

bool isInAny(const MachineAddress& address, const std::vector<Network>& networks) {
    return std::ranges::any_of(networks, [&](const Network& each) { return isIn(address, each); });
}

std::vector<Network> networksIn(std::initializer_list<const char*> texts) {
    std::vector<Network> networks;
    for (const char* text : texts)
        networks.push_back(networkIn(text).value());
    return networks;
}

bool isOneOtherMachine(const MachineAddress& address) {
    static const auto kNoMachines =
        networksIn({"0.0.0.0/8", "224.0.0.0/3", "169.254.0.0/16", "::", "ff00::/8", "fe80::/10"});
    return !isInAny(address, kNoMachines);
}

bool isLoopback(const MachineAddress& address) {
    static const auto kLoopback = networksIn({"127.0.0.0/8", "::1"});
    return isInAny(address, kLoopback);
}

std::optional<std::pair<MachineAddress, std::uint16_t>> partsOf(const sockaddr& address) {
    if (address.sa_family == AF_INET) {
        sockaddr_in parts{};
        std::memcpy(&parts, &address, sizeof parts);
        return {{mapped(parts.sin_addr), ntohs(parts.sin_port)}};
    }
    if (address.sa_family != AF_INET6) return std::nullopt;
    sockaddr_in6 parts{};
    std::memcpy(&parts, &address, sizeof parts);
    MachineAddress machine{};
    std::memcpy(machine.data(), &parts.sin6_addr, machine.size());
    return {{machine, ntohs(parts.sin6_port)}};
}

}  // namespace

std::optional<MachineAddress> machineAddress(const std::string& text) {
    const std::string address = text.substr(0, text.find('%'));
    in_addr ipv4{};
    if (::inet_pton(AF_INET, address.c_str(), &ipv4) == 1) return mapped(ipv4);
    MachineAddress ipv6{};
    if (::inet_pton(AF_INET6, address.c_str(), ipv6.data()) == 1) return ipv6;
    return std::nullopt;
}

std::optional<Network> networkIn(const std::string& text) {
    const std::size_t slash = text.find('/');
    const auto address = machineAddress(text.substr(0, slash));
    if (!address) return std::nullopt;
    if (slash == std::string::npos) return Network{*address, 128};
    const bool isIpv4 = text.find(':') == std::string::npos;
    const auto bits = utils::parseNumber<unsigned int>(std::string_view(text).substr(slash + 1));
    if (!bits || *bits > (isIpv4 ? 32U : 128U)) return std::nullopt;
    return Network{*address, static_cast<int>(*bits) + (isIpv4 ? kIpv4Bits : 0)};
}

void OwnPorts::add(std::uint16_t port) {
    const std::lock_guard lock(m_mutex);
    m_ports.push_back(port);
}

bool OwnPorts::has(std::uint16_t port) const {
    const std::lock_guard lock(m_mutex);
    return std::ranges::find(m_ports, port) != m_ports.end();
}

AddressPolicy AddressPolicy::onlyTo(const MachineAddress& subscriber) {
    AddressPolicy policy;
    policy.m_networks.push_back({subscriber, 128});
    // Who subscribes from one address of this machine may listen on another.
    if (isLoopback(subscriber)) policy.m_networks = networksIn({"127.0.0.0/8", "::1"});
    return policy;
}

AddressPolicy AddressPolicy::onlyTo(std::vector<Network> networks) {
    AddressPolicy policy;
    policy.m_networks = std::move(networks);
    policy.m_isList = true;
    return policy;
}

AddressPolicy AddressPolicy::anywhere(const MachineAddress& subscriber) {
    AddressPolicy policy = onlyTo(subscriber);
    policy.m_isAnywhere = true;
    return policy;
}

bool AddressPolicy::allows(const sockaddr& address) const {
    const auto parts = partsOf(address);
    if (!parts || !isOneOtherMachine(parts->first)) return false;
    const auto& [machine, port] = *parts;
    if (port < kFirstFreePort && port != 80 && port != 443 && !m_isList) return false;
    if (m_ownPorts != nullptr && m_ownPorts->has(port) && !m_isList) return false;
    if (m_isAnywhere && !isLoopback(machine)) return true;
    // A network that holds all of the world does not mean this machine.
    const bool isNamed = isInAny(machine, m_networks);
    if (!isNamed || !isLoopback(machine)) return isNamed;
    return std::ranges::any_of(m_networks, [](const Network& each) { return isLoopback(each.address); });
}

}  // namespace indications
