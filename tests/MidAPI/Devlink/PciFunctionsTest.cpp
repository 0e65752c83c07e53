// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/PciFunctions.h"

#include <gtest/gtest.h>

#include <filesystem>

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
    machine.drop(kDevices + "10000:01:00.0/driver");
    machine.add("0000:00:03.0");
    machine.putFolder(kDevices + "0000:00:03.0/virtio2/net/eth0");
    machine.add("0000:06:00.0", "ib0");
    machine.put(kDevices + "0000:06:00.0/class", "0x020700");
    machine.add("0000:05:02.0", "enp5s2");
    std::filesystem::create_symlink("../0000:05:00.0", machine.in(kDevices + "0000:05:02.0/physfn"));
    machine.add("0000:07:00.0");
    machine.putFolder(kDevices + "0000:07:00.0/net");  // its interface is in another namespace
    // A card's switch: the uplink's port is its own, the others stand for functions.
    for (const auto& [interface, port] :
         {std::pair{"enp5s0f0", "p0"}, {"rep0", "pf0vf0"}, {"rep1", "c1pf0"}, {"rep2", "pf0sf88"}}) {
        machine.putFolder(kDevices + "0000:05:00.0/net/" + interface);
        machine.put(std::string("/sys/class/net/") + interface + "/phys_port_name", port);
    }

    std::string found;
    const auto functions = findPciFunctions(machine).value();
    for (const PciFunction& function : functions)
        found += function.address + ' ' + function.card() + ' ' + function.driver + " [" +
                 utils::joined(function.interfaces) + "]\n";
    EXPECT_EQ(
        "0000:00:03.0 0000:00:03 fake [eth0]\n"
        "0000:05:00.0 0000:05:00 fake [enp5s0f0]\n"
        "0000:05:00.1 0000:05:00 fake [enp5s0f1]\n"
        "10000:01:00.0 10000:01:00  []\n",
        found);
    const ma::PciIds ids = functions.at(0).ids;
    EXPECT_TRUE(ids.vendor == 0x1af4 && ids.device == 0x1041 && ids.subsystemVendor == 0x1af4 &&
                ids.subsystemDevice == 0x1100);
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
