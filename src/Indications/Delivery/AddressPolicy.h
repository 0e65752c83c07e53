// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <netinet/in.h>
#include <sys/socket.h>

#include <array>
#include <cstdint>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

namespace indications {

/// An address of a machine. One of IPv4 is held as IPv6 has it, ::ffff:192.0.2.1, so that both of its
/// spellings are one.
using MachineAddress = std::array<std::uint8_t, 16>;

/// The address in a text without a port or brackets; nothing for a text that is none. A zone (`%eth0`) is
/// passed over.
std::optional<MachineAddress> machineAddress(const std::string& text);

/// Addresses that begin with the same bits.
struct Network {
    MachineAddress address{};
    int bits = 128;  ///< of the 128, so 96 more than IPv4 counts
};

/// The network in a text: "192.0.2.0/24", "2001:db8::/32", or one address. Nothing for a text that is none.
std::optional<Network> networkIn(const std::string& text);

/// The ports that this process listens on itself, which may become known late. Thread-safe.
class OwnPorts {
  public:
    void add(std::uint16_t port);
    bool has(std::uint16_t port) const;

  private:
    mutable std::mutex m_mutex;
    std::vector<std::uint16_t> m_ports;
};

/// To which machines indications may go. It looks at the address that a connection is about to be made to,
/// since a name can stand for any address, and for another one the next time. A value.
class AddressPolicy {
  public:
    /// The machine that subscribed, and no other.
    static AddressPolicy onlyTo(const MachineAddress& subscriber);
    /// Machines in these networks, loopback only where one of them is of it. They decide of ports, too: all
    /// are open.
    static AddressPolicy onlyTo(std::vector<Network> networks);
    /// All machines; loopback only for who subscribed from there.
    static AddressPolicy anywhere(const MachineAddress& subscriber);

    /// Nothing goes to these ports, unless a list of networks says where.
    /// @param ports  null for none
    void deny(std::shared_ptr<const OwnPorts> ports) { m_ownPorts = std::move(ports); }

    /// Whether a connection may go there. Never to addresses that name no single other machine (unspecified,
    /// multicast, broadcast) nor to those of the link (169.254.0.0/16, fe80::/10), where machines in a cloud
    /// keep their secrets; and below port 1024 to 80 and 443 only, unless a list of networks says where.
    bool allows(const sockaddr& address) const;

  private:
    std::vector<Network> m_networks;
    std::shared_ptr<const OwnPorts> m_ownPorts;
    bool m_isList = false;
    bool m_isAnywhere = false;
};

}  // namespace indications
