// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/PciFunctions.h"

#include <gtest/gtest.h>

#include "MidAPI/Devlink/FakeKernel.h"
#include "Utils/Utils.h"

namespace {

using namespace ma::devlink;

const std::string kDevices = "/sys/bus/pci/devices/";

TEST(PciFunctionsTest, FindsTheEthernetFunctionsAndTheirInterfaces) {
    test::FakeKernel machine;
    machine.add("0000:05:00.1", "enp5s0f1");
    machine.add("0000:05:00.0", "enp5s0f0");
    machine.add("10000:01:00.0");  // behind a storage controller; no driver, so no interface
    machine.links.erase(kDevices + "10000:01:00.0/driver");
    machine.add("0000:00:03.0");
    machine.folders.insert(kDevices + "0000:00:03.0/virtio2/net/eth0");
    machine.add("0000:06:00.0", "ib0");
    machine.files[kDevices + "0000:06:00.0/class"] = "0x020700";
    machine.add("0000:05:02.0", "enp5s2");
    machine.links[kDevices + "0000:05:02.0/physfn"] = "../0000:05:00.0";
    machine.add("0000:07:00.0");
    machine.folders.insert(kDevices + "0000:07:00.0/net");  // its interface is in another namespace
    // A card's switch: the uplink's port is its own, the others stand for functions.
    for (const auto& [interface, port] :
         {std::pair{"enp5s0f0", "p0"}, {"rep0", "pf0vf0"}, {"rep1", "c1pf0"}, {"rep2", "pf0sf88"}}) {
        machine.folders.insert(kDevices + "0000:05:00.0/net/" + interface);
        machine.files[std::string("/sys/class/net/") + interface + "/phys_port_name"] = port;
    }

    std::string found;
    for (const PciFunction& function : findPciFunctions(machine))
        found += function.address + ' ' + function.card() + ' ' + function.driver + " [" +
                 utils::joined(function.interfaces) + "]\n";
    EXPECT_EQ(
        "0000:00:03.0 0000:00:03 fake [eth0]\n"
        "0000:05:00.0 0000:05:00 fake [enp5s0f0]\n"
        "0000:05:00.1 0000:05:00 fake [enp5s0f1]\n"
        "10000:01:00.0 10000:01:00  []\n",
        found);
    const ma::PciIds ids = findPciFunctions(machine).at(0).ids;
    EXPECT_TRUE(ids.vendor == 0x1af4 && ids.device == 0x1041 && ids.subsystemVendor == 0x1af4 &&
                ids.subsystemDevice == 0x1100);
}

TEST(PciFunctionsTest, ReadsTheStateOfInterfaces) {
    test::FakeKernel machine;
    const PciFunction function{.address = "0000:05:00.0", .interfaces = {"eth0", "eth1"}};
    machine.files["/sys/class/net/eth0/address"] = "52:54:00:12:34:5f";
    machine.files["/sys/class/net/eth0/speed"] = "25000";
    machine.files["/sys/class/net/eth0/carrier"] = "0";
    machine.files["/sys/class/net/eth1/address"] = "52:54:00:12:34:60";
    machine.files["/sys/class/net/eth1/speed"] = "-1";
    machine.files["/sys/class/net/eth1/carrier"] = "1";
    const InterfaceState state = readInterfaceState(machine, function);
    EXPECT_EQ((std::array<std::uint8_t, 6>{0x52, 0x54, 0, 0x12, 0x34, 0x5f}), state.mac) << "the first one's";
    EXPECT_EQ(25'000'000'000U, state.speed);
    EXPECT_TRUE(state.linkUp) << "of either";
}

TEST(PciFunctionsTest, TakesAddressesApart) {
    const auto address = parseFunctionAddress("10000:af:1f.7");
    ASSERT_TRUE(address);
    EXPECT_EQ((utils::PCIAddr{0xaf, 0x1f, 7, false, "10000:af:1f.7"}), *address);
    for (const char* bad : {"", "0000:05:00", "0000:05:00.", "05:00.0", "0000:05:20.0", "0000:05:00.8",
                            "0000:05:00.0.1", "0000:100:00.0", "eth0", "0000:05:", "0000:0x:00.0"})
        EXPECT_FALSE(parseFunctionAddress(bad)) << bad;
}

}  // namespace
