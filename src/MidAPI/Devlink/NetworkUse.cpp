// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/NetworkUse.h"

#include <algorithm>
#include <set>

#include "MidAPI/Devlink/Machine.h"
#include "MidAPI/Devlink/PciFunctions.h"
#include "MidAPI/Devlink/Routes.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

std::string netFolder(const std::string& interface) {
    return "/sys/class/net/" + interface;
}

const utils::StringArray kNone;

/// Follows the interfaces of a card up to those that would lose their way out with it.
class Stack {
  public:
    Stack(Machine& machine, CardUse& use)
        : m_machine(machine), m_use(use), m_lost(use.interfaces.begin(), use.interfaces.end()) {
        utils::StringArray waiting = use.interfaces;
        while (!waiting.empty()) {
            const std::string lower = std::move(waiting.back());
            waiting.pop_back();
            for (const std::string& upper : uppersOf(lower))
                if (isLost(upper) && m_lost.insert(upper).second) waiting.push_back(upper);
        }
    }

    bool hasLost(const std::string& interface) const { return m_lost.contains(interface); }

  private:
    utils::StringArray uppersOf(const std::string& interface) const {
        constexpr std::string_view kPrefix = "upper_";
        utils::StringArray uppers;
        for (const std::string& entry : m_machine.listFolder(netFolder(interface)).value_or(kNone))
            if (entry.starts_with(kPrefix)) uppers.push_back(entry.substr(kPrefix.size()));
        return uppers;
    }

    /// All but a bond are taken to be lost with any interface below them; that one may have others.
    bool isLost(const std::string& upper) {
        if (m_machine.folderExists(netFolder(upper) + "/bridge")) note(m_use.bridges, upper);
        if (!m_machine.folderExists(netFolder(upper) + "/bonding")) return true;
        note(m_use.bonds, upper);
        const auto slaves = m_machine.readFile(netFolder(upper) + "/bonding/slaves").value_or("");
        bool losesOne = false;
        for (const std::string& slave : utils::split(slaves, ' ')) {
            if (m_machine.readFile(netFolder(slave) + "/bonding_slave/mii_status") != "up") continue;
            if (!m_lost.contains(slave)) return false;
            losesOne = true;
        }
        if (losesOne) note(m_use.losses, upper + " loses its last active slave");
        return losesOne;
    }

    static void note(utils::StringArray& names, const std::string& name) {
        if (std::ranges::find(names, name) == names.end()) names.push_back(name);
    }

    Machine& m_machine;
    CardUse& m_use;
    std::set<std::string> m_lost;
};

bool hasLink(Machine& machine, const std::string& interface) {
    return machine.readFile(netFolder(interface) + "/carrier") == "1";
}

/// Of an interface without a link. One that nobody has brought up tells nothing of it.
std::string whyNoLink(Machine& machine, const std::string& interface) {
    return interface + (machine.readFile(netFolder(interface) + "/carrier") ? " has no link" : " is down");
}

/// The function's own interfaces: those that stand for virtual functions come and go with these.
utils::StringArray interfacesOf(const std::vector<PciFunction>& functions, const std::string& address) {
    const auto found = std::ranges::find(functions, address, &PciFunction::address);
    return found == functions.end() ? utils::StringArray() : found->interfaces;
}

}  // namespace

void findNetworkUse(Machine& machine, const std::string& caller, CardUse& use) {
    const Stack stack(machine, use);
    const Routes routes(machine);
    if (!routes.areKnown()) use.losses.emplace_back("the routes cannot be read");
    for (const std::string& interface : routes.defaultInterfaces())
        if (stack.hasLost(interface)) use.losses.push_back("the default route goes through " + interface);
    const std::string way = caller.empty() ? "" : routes.interfaceTo(caller);
    if (stack.hasLost(way))
        use.losses.push_back("your own connection from " + caller + " comes through " + way);
}

std::vector<LinkState> linksOf(Machine& machine, const utils::StringArray& functions) {
    const std::vector<PciFunction> all = findPciFunctions(machine).value_or(std::vector<PciFunction>());
    std::vector<LinkState> links;
    for (const std::string& function : functions)
        for (const std::string& interface : interfacesOf(all, function))
            links.push_back({function, interface, hasLink(machine, interface)});
    return links;
}

utils::StringArray missingLinks(Machine& machine, const std::vector<LinkState>& before) {
    const std::vector<PciFunction> all = findPciFunctions(machine).value_or(std::vector<PciFunction>());
    utils::StringArray missing;
    for (const LinkState& link : before) {
        const utils::StringArray now = interfacesOf(all, link.function);
        const bool hasName = std::ranges::find(now, link.interface) != now.end();
        // An interface may have come back under another name; then any of the function's will do.
        const auto isUp = [&machine](const std::string& interface) { return hasLink(machine, interface); };
        if (now.empty())
            missing.push_back(link.function + " has no network interface (before: " + link.interface + ")");
        else if (link.isUp && !(hasName ? isUp(link.interface) : std::ranges::any_of(now, isUp)))
            missing.push_back(hasName ? whyNoLink(machine, link.interface) : link.function + " has no link");
    }
    return missing;
}

}  // namespace ma::devlink
