// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/PciFunctions.h"

#include <gtest/gtest.h>

#include <filesystem>

#include "MidAPI/Devlink/FakeKernel.h"
#include "Support/SimulatedAdapters.h"
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
    for (const auto& [interface, port] : {std::pair{"enp5s0f0", "p0"},
                                          {"own", "c10"},
                                          {"rep0", "pf0vf0"},
                                          {"rep1", "c1pf0"},
                                          {"rep2", "pf0sf88"}}) {
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
        "0000:05:00.0 0000:05:00 fake [enp5s0f0, own]\n"
        "0000:05:00.1 0000:05:00 fake [enp5s0f1]\n"
        "10000:01:00.0 10000:01:00  []\n",
        found);
    const ma::PciIds ids = functions.at(0).ids;
    EXPECT_TRUE(ids.vendor == 0x1af4 && ids.device == 0x1041 && ids.subsystemVendor == 0x1af4 &&
                ids.subsystemDevice == 0x1100);
}

TEST(PciFunctionsTest, ReadsWhatTheInterfacesTell) {
    test::FakeKernel machine;
    PciFunction function;
    function.interfaces = {"eth0"};
    const auto read = [&](const std::string& address, const std::string& speed) {
        machine.put("/sys/class/net/eth0/address", address);
        machine.put("/sys/class/net/eth0/speed", speed);
        const InterfaceState state = readInterfaceState(machine, function);
        std::string mac;
        for (const std::uint8_t byte : state.mac)
            mac += utils::hexByte(byte);
        return mac + ' ' + std::to_string(state.speed);
    };
    EXPECT_EQ("0102030405ff 1000000", read("01:02:03:04:05:ff", "1"));
    // A speed that is not known, and addresses of other networks.
    EXPECT_EQ("010203040506 0", read("01:02:03:04:05:06", "4294967295"));
    EXPECT_EQ("000000000000 4294967294000000", read("01:02:03:04:05", "4294967294"));
    EXPECT_EQ("000000000000 0", read("01:02:03:04:05:06:07", ""));
    EXPECT_EQ("010200040506 0", read("01:02:x:04:05:06", "fast"));
}

TEST(PciFunctionsTest, ReadsNoIdsButSuchNumbers) {
    test::FakeKernel machine;
    machine.add("0000:05:00.0", "eth0");
    machine.put(kDevices + "0000:05:00.0/vendor", "1af4");
    machine.put(kDevices + "0000:05:00.0/device", "0x11041");
    const ma::PciIds ids = findPciFunctions(machine).value().at(0).ids;
    EXPECT_TRUE(ids.vendor == 0 && ids.device == 0 && ids.subsystemVendor == 0x1af4);
}

TEST(PciFunctionsTest, ReadsACardWithItsVirtualFunctions) {
    test::FakeKernel machine;
    machine.add("0000:05:00.0", "eth0");
    machine.add("0000:05:00.1", "eth1");
    machine.add("0000:06:00.0", "eth2");
    machine.add("0000:07:00.0", "eth3");
    machine.putFolder(kDevices + "0000:05:00.0/virtfn0/net/eth0v0");
    machine.putFolder(kDevices + "0000:05:00.0/virtfn1/virtio3/net/eth0v1");
    machine.putFolder(kDevices + "0000:05:00.0/other/net/none");
    const CardFunctions card = readCard(machine, "0000:05:00", {"0000:07:00.0"});
    EXPECT_EQ((utils::StringArray{"0000:05:00.0", "0000:05:00.1", "0000:07:00.0"}), card.functions);
    EXPECT_EQ((utils::StringArray{"eth0", "eth0v0", "eth0v1", "eth1", "eth3"}), card.interfaces);
    machine.unreadable = "/sys/bus/pci/devices/";
    EXPECT_EQ(
        "What is on card 0000:05:00 cannot be read in /sys/bus/pci/devices/; this process may have too "
        "many files open.",
        test::adapterErrorOf([&] { readCard(machine, "0000:05:00", {}); }));
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
