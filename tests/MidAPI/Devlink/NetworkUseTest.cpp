// SPDX-License-Identifier: Apache-2.0
// What of the machine's network runs over a card.
#include <arpa/inet.h>
#include <gmock/gmock.h>

#include <algorithm>

#include "MidAPI/Devlink/FakeKernel.h"
#include "MidAPI/Devlink/NetworkUse.h"
#include "Utils/Utils.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using Names = utils::StringArray;

/// As the kernel prints it: the numbers of IPv4 in the order of this machine.
std::string routeV4(const std::string& interface, std::uint32_t network, std::uint32_t mask, int metric,
                    int flags = 3) {
    return interface +
           utils::formatStr("\t%08X\t00000000\t%04X\t0\t0\t%d\t%08X\t0\t0\t0", htonl(network), flags, metric,
                            htonl(mask)) +
           "\n";
}
std::string routeV6(const std::string& interface, const std::string& network, const std::string& length,
                    const std::string& metric, const std::string& flags = "00000003") {
    const std::string none(32, '0');
    return network + std::string(32 - network.size(), '0') + ' ' + length + ' ' + none + " 00 " + none + ' ' +
           metric + " 00000001 00000000 " + flags + ' ' + interface + "\n";
}

class NetworkUseTest : public ::testing::Test {
  protected:
    /// Puts `upper` on `lower`.
    void stack(const std::string& upper, const std::string& lower) {
        m_machine.putFolder("/sys/class/net/" + lower + "/upper_" + upper);
    }
    void bond(const std::string& name, const Names& slaves, const std::string& down = "") {
        m_machine.put("/sys/class/net/" + name + "/bonding/slaves", utils::joined(slaves, " "));
        for (const std::string& slave : slaves) {
            stack(name, slave);
            m_machine.put("/sys/class/net/" + slave + "/bonding_slave/mii_status",
                          slave == down ? "down" : "up");
        }
    }
    ma::CardUse use(const Names& interfaces, const std::string& caller = "") {
        ma::CardUse found;
        found.interfaces = interfaces;
        m_machine.put("/proc/self/net/route", m_routesV4);
        m_machine.put("/proc/self/net/ipv6_route", m_routesV6);
        ma::devlink::findNetworkUse(m_machine, caller, found);
        return found;
    }

    test::FakeKernel m_machine;
    std::string m_routesV4 =
        "Iface\tDestination\tGateway \tFlags\tRefCnt\tUse\tMetric\tMask\tMTU\tWindow\tIRTT\n";
    std::string m_routesV6;
};

TEST_F(NetworkUseTest, FollowsBridgesAndVlansToTheDefaultRoute) {
    stack("eth0.7", "eth0");
    stack("br0", "eth0.7");
    m_machine.put("/sys/class/net/br0/bridge/forward_delay", "0");
    m_routesV4 += routeV4("br0", 0, 0, 100) + routeV4("wlan0", 0, 0, 600) + routeV4("wlan0", 0, 0, 0, 0x203);
    const ma::CardUse found = use({"eth0"});
    EXPECT_THAT(found.bridges, ElementsAre("br0"));
    EXPECT_THAT(found.bonds, IsEmpty());
    EXPECT_THAT(found.losses, ElementsAre("the default route goes through br0"));
    EXPECT_THAT(use({"wlan0"}).losses, IsEmpty());  // its route is the worse one
}

TEST_F(NetworkUseTest, KnowsWhichBondsLastWithoutTheCard) {
    bond("bond0", {"eth0", "eth1", "eth2"}, "eth2");
    stack("br0", "bond0");
    m_routesV6 = routeV6("lo", "", "00", "ffffffff", "00200200") + routeV6("br0", "", "00", "00000400");
    EXPECT_THAT(use({"eth0"}).losses, IsEmpty());
    EXPECT_THAT(use({"eth0"}).bonds, ElementsAre("bond0"));
    EXPECT_THAT(use({"eth0", "eth1"}).losses,
                ElementsAre("bond0 loses its last active slave", "the default route goes through br0"));
    EXPECT_THAT(use({"eth2"}).losses, IsEmpty());
}

TEST_F(NetworkUseTest, FindsTheConnectionOfWhoAsks) {
    m_routesV4 += routeV4("eth0", 0xC0000200, 0xFFFFFF00, 0) + routeV4("eth1", 0xC0000000, 0xFFFF0000, 0) +
                  routeV4("eth2", 0xC0000280, 0xFFFFFF80, 5) + routeV4("eth3", 0xC0000280, 0xFFFFFF80, 4);
    m_routesV6 = routeV6("eth4", "20010db8000a", "2f", "00000100");
    const std::pair<const char*, const char*> table[] = {
        {"192.0.2.7", "eth0"},     {"192.0.3.7", "eth1"},        {"192.0.2.200", "eth3"},
        {"2001:db8:b::1", "eth4"}, {"::ffff:192.0.2.7", "eth0"}, {"fe80::1%eth5", "eth5"}};
    for (const auto& [caller, interface] : table) {
        EXPECT_THAT(
            use({interface}, caller).losses,
            ElementsAre("your own connection from " + std::string(caller) + " comes through " + interface));
        EXPECT_THAT(use({"other"}, caller).losses, IsEmpty()) << caller;
    }
    const std::string callerV6 = "20010db8000c" + std::string(19, '0') + '1';
    m_routesV6 += routeV6("eth5", "20010db8000d" + std::string(19, '0') + '1', "80", "00000100");
    EXPECT_EQ(1U, use({"eth5"}, "2001:db8:d::1").losses.size()) << "a route to one host";
    // Lines that are no routes, or say that a network is not to be reached.
    m_routesV4 += "eth0 C6336401 0 0003 0 0 0\n" + routeV4("eth0", 0xC6336401, 0xFFFFFFFF, 0, 2) +
                  routeV4("eth0", 0xC6336401, 0xFFFFFFFF, 0, 0x201) +
                  routeV4("eth0", 0xC6336401, 0xFFFFFFFF, -1);
    m_routesV6 += routeV6("eth4", callerV6, "81", "00000100") + routeV6("eth4", "20010db8000c", "30", "x") +
                  routeV6("eth4", "20010db8000c", "30", "0", "00000200") +
                  routeV6("eth4", "20010db8000x", "30", "0") + routeV6("", "20010db8000c", "30", "0") +
                  routeV6("eth4", "20010db8000c", "30", "0").insert(32, "0");
    for (const char* caller : {"198.51.100.1", "2001:db8:c::1", "name", ""})
        EXPECT_THAT(use({"eth0", "eth1", "eth2", "eth3", "eth4"}, caller).losses, IsEmpty()) << caller;
}

TEST_F(NetworkUseTest, SaysThatItKnowsNoRoutes) {
    ma::CardUse found;
    ma::devlink::findNetworkUse(m_machine, "192.0.2.7", found);
    EXPECT_THAT(found.losses, ElementsAre("the routes cannot be read"));
    m_machine.put("/proc/self/net/ipv6_route", "");
    found.losses.clear();
    ma::devlink::findNetworkUse(m_machine, "192.0.2.7", found);
    EXPECT_THAT(found.losses, IsEmpty());
}

TEST_F(NetworkUseTest, TellsWhichLinksHaveNotComeBack) {
    const auto put = [this](const std::string& number, const std::string& interface, bool isUp) {
        m_machine.add("0000:0" + number + ":00.0", interface);
        if (isUp) m_machine.put("/sys/class/net/" + interface + "/carrier", "1");
    };
    Names functions;
    for (const std::string number : {"1", "2", "3", "4"}) {
        put(number, "eth" + number, number != "4");
        functions.push_back("0000:0" + number + ":00.0");
    }
    // Of the card's switch, not the function's own.
    put("1", "eth1_0", true);
    m_machine.put("/sys/class/net/eth1_0/phys_port_name", "pf0vf0");
    const auto before = ma::devlink::linksOf(m_machine, functions);
    EXPECT_EQ(4U, before.size());
    EXPECT_THAT(ma::devlink::missingLinks(m_machine, before), IsEmpty());
    m_machine.drop("/sys");
    put("1", "eth1", false);
    put("2", "renamed", true);
    put("4", "eth4", false);
    EXPECT_THAT(ma::devlink::missingLinks(m_machine, before),
                ElementsAre("eth1 is down", "0000:03:00.0 has no network interface (before: eth3)"));
    m_machine.put("/sys/class/net/eth1/carrier", "0");
    m_machine.put("/sys/class/net/renamed/carrier", "0");
    put("3", "eth3", true);
    EXPECT_THAT(ma::devlink::missingLinks(m_machine, before),
                ElementsAre("eth1 has no link", "0000:02:00.0 has no link"));
}

}  // namespace
