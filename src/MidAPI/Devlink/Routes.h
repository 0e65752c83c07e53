// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Utils/Export.h"
#include "Utils/StringArray.h"

namespace ma::devlink {

class Machine;

/// The machine's routes, IPv4 and IPv6, as procfs lists them: the main table, and of several next hops the
/// first. Routes of other tables and rules are not seen.
class QUENX_EXPORT Routes {
  public:
    explicit Routes(Machine& machine);

    /// False where neither list can be read, so that nobody knows what goes where.
    bool areKnown() const { return m_areKnown; }

    /// The interfaces of the default routes in force: at most one of each protocol.
    utils::StringArray defaultInterfaces() const;

    /// The interface through which packets to an address leave; empty where there is none, and for a text
    /// that is no address. A zone ("fe80::1%eth0") says it by itself.
    std::string interfaceTo(const std::string& address) const;

  private:
    using Address = std::array<std::uint8_t, 16>;  ///< IPv4 in the first four bytes
    struct Route {
        bool isV4 = false;
        Address network{};
        unsigned length = 0;  ///< of the network's prefix, bits
        std::uint32_t metric = 0;
        std::string interface;

        bool covers(const Address& address) const;
        /// Whether the kernel takes this one where both cover an address.
        bool precedes(const Route& other) const;
    };

    static bool readV4(const std::string& line, Route& route);
    static bool readV6(const std::string& line, Route& route);
    void read(const std::optional<std::string>& text, bool (*readLine)(const std::string&, Route&));
    std::string best(bool isV4, const Address& address, unsigned longest) const;

    std::vector<Route> m_routes;
    bool m_areKnown = false;
};

}  // namespace ma::devlink
