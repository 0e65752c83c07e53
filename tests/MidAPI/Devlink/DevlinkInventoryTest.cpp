// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>
#include <linux/devlink.h>

#include <cerrno>
#include <csignal>

#include "MidAPI/Devlink/DevlinkBench.h"
#include "Support/NetlinkGuard.h"
#include "Support/Together.h"

namespace {

using testing::ElementsAre;

std::string runningVersion(const std::string& adapter) {
    const ma::AdapterInfo info = ma::getAdapterInfo(adapter);
    return info.versions.empty() ? "" : info.versions.front().running;
}

TEST(DevlinkInventoryTest, TellsWhatKernelAndDriverTell) {
    const test::DevlinkBench bench;
    bench.device().serial = "AB12";
    bench.device().boardSerial = "CD34";
    bench.device().fixed["board.id"] = "K12";
    bench.device().running[""] = "of nothing";
    bench.device().stored["fw"] = "1.3.0";
    const auto putState = [&](const std::string& name, const char* mac, const char* speed, const char* link) {
        bench.kernel->putFolder("/sys/bus/pci/devices/" + bench.first + "/net/" + name);
        bench.kernel->put("/sys/class/net/" + name + "/address", mac);
        bench.kernel->put("/sys/class/net/" + name + "/speed", speed);
        bench.kernel->put("/sys/class/net/" + name + "/carrier", link);
    };
    putState("enp5s0f0", "52:54:00:12:34:5f", "25000", "0");
    putState("enp5s0f0x", "52:54:00:12:34:60", "-1", "1");
    bench.kernel->put("/sys/class/net/enp5s0f0/bonding_slave/perm_hwaddr", "52:54:00:12:34:5e");
    EXPECT_THAT(ma::enumerateAdapters(), ElementsAre(bench.first, bench.second));
    EXPECT_EQ((utils::PCIAddr{5, 0, 1, false, bench.second}), ma::getPCIAddress(bench.second));
    const ma::AdapterInfo info = ma::getAdapterInfo(bench.first);
    EXPECT_EQ("devlink", info.backend);
    EXPECT_EQ("fake", info.driver);
    EXPECT_EQ("AB12", info.serialNumber);
    EXPECT_EQ("CD34", info.boardSerialNumber);
    EXPECT_THAT(info.permanentMac, ElementsAre(0x52, 0x54, 0, 0x12, 0x34, 0x5e)) << "the first one's own";
    EXPECT_EQ(25'000'000'000U, info.speed);
    EXPECT_TRUE(info.linkUp) << "of either";
    EXPECT_THAT(info.interfaces, ElementsAre("enp5s0f0", "enp5s0f0x"));
    EXPECT_THAT(info.versions, ElementsAre(ma::NamedVersion{"board.id", "K12", "", ""},
                                           ma::NamedVersion{"fw", "", "1.2.3", "1.3.0"}));
    EXPECT_EQ(ma::ResetNeeded::Unknown, info.resetNeeded);
    EXPECT_EQ(ma::ResetNeeded::None, ma::getAdapterInfo(bench.second).resetNeeded);
    bench.device().stored.clear();
    bench.kernel->notify(DEVLINK_CMD_NEW, bench.first);
    EXPECT_EQ(ma::ResetNeeded::Unknown, ma::getAdapterInfo(bench.first).resetNeeded);

    std::vector<utils::FirmwareVersionInfo> components;
    EXPECT_TRUE(ma::getAdapterFirmwareVersion(bench.first, components));
    ASSERT_EQ(1U, components.size());
    EXPECT_EQ(0x01020300U, components[0].version);
    EXPECT_FALSE(ma::getAdapterFirmwareVersion("eth0", components));
    EXPECT_EQ("there is no adapter eth0", test::adapterErrorOf([] { ma::getAdapterInfo("eth0"); }));
    EXPECT_EQ("there is no adapter eth0", test::adapterErrorOf([] { ma::getPCIAddress("eth0"); }));
    EXPECT_FALSE(ma::setBootType(bench.first, ma::BootType::None));
}

TEST(DevlinkInventoryTest, AsksADeviceOnceUntilItChanges) {
    test::DevlinkBench bench;
    EXPECT_EQ(ma::describeSearch(),
              "Ethernet adapters were looked for on PCI (class 0200 in /sys/bus/pci/devices): 2 were found. "
              "Asked at the first request whether they can be updated: 0000:05:00.0, 0000:05:00.1.");
    EXPECT_EQ(0, bench.kernel->requests) << "a service that starts only lists names";
    EXPECT_EQ("1.2.3", runningVersion(bench.first));
    const int asked = bench.kernel->requests;
    EXPECT_TRUE(ma::getCanBeUpdated(bench.first));
    EXPECT_EQ("1.2.3", runningVersion(bench.first));
    EXPECT_EQ(asked, bench.kernel->requests);

    bench.device().running["fw"] = "1.3.0";
    bench.kernel->notify(DEVLINK_CMD_NEW, "0000:06:00.0");
    EXPECT_EQ("1.2.3", runningVersion(bench.first)) << "told of another card";
    bench.kernel->notify(DEVLINK_CMD_PORT_DEL, bench.second);
    EXPECT_EQ("1.3.0", runningVersion(bench.first)) << "told of the same card";
    bench.device().infoError = EIO;
    bench.kernel->notify(DEVLINK_CMD_NEW, bench.first);
    std::vector<utils::FirmwareVersionInfo> components;
    const std::string text =
        "the firmware versions of adapter 0000:05:00.0 cannot be read: Input/output error";
    EXPECT_EQ(text, test::adapterErrorOf([&] { ma::getAdapterFirmwareVersion(bench.first, components); }));
    EXPECT_EQ(text, test::adapterErrorOf([&] { ma::getAdapterInfo(bench.first); }));
    bench.device().infoError = 0;
    EXPECT_EQ("1.3.0", runningVersion(bench.first)) << "a failure is not kept";
    const test::FakeDevice gone = bench.device();
    bench.kernel->devices.erase(bench.first);
    bench.kernel->notify(DEVLINK_CMD_DEL, bench.first);
    EXPECT_FALSE(ma::getCanBeUpdated(bench.first));
    EXPECT_EQ("", runningVersion(bench.first));
    bench.kernel->devices[bench.first] = gone;
    bench.kernel->notify(DEVLINK_CMD_NEW, bench.first);
    EXPECT_TRUE(ma::getCanBeUpdated(bench.first));

    bench.device().running["fw"] = "1.4.0";
    for (int lost = 0; lost < 2000; ++lost)
        bench.kernel->notify(DEVLINK_CMD_PORT_NEW, bench.second);
    EXPECT_EQ("1.4.0", runningVersion(bench.first)) << "what was lost may have been about it";

    bench.device().running["fw"] = "1.5.0";
    EXPECT_EQ("1.4.0", runningVersion(bench.first)) << "nothing was told";
    EXPECT_EQ(0, bench.prepare());
    EXPECT_EQ("1.5.0", runningVersion(bench.first)) << "what an image is held against is read anew";

    bench.kernel->add("0000:06:00.0");
    EXPECT_TRUE(ma::getCanBeUpdated("0000:06:00.0")) << "plugged in";
    for (const char* folder : {"", "/0000:06:00.0", "/0000:05:00.0/net"}) {
        bench.kernel->unreadable = "/sys/bus/pci/devices" + std::string(*folder == 0 ? "/" : folder);
        EXPECT_EQ(3U, ma::enumerateAdapters().size()) << "not read is not empty: " << folder;
    }
    bench.restart();
    bench.kernel->unreadable = "/sys/bus/pci/devices/";
    EXPECT_EQ(
        "The PCI devices of this machine cannot be listed (/sys/bus/pci/devices); this process may have "
        "too many files open.",
        test::adapterErrorOf([] { ma::enumerateAdapters(); }));
    bench.kernel->unreadable.clear();
    EXPECT_EQ(3U, ma::enumerateAdapters().size());
    bench.kernel->drop("/sys/bus/pci/devices/0000:06:00.0");
    EXPECT_EQ(2U, ma::enumerateAdapters().size()) << "pulled out";
    EXPECT_FALSE(ma::getCanBeUpdated("0000:06:00.0"));
    EXPECT_EQ(6, ma::getPCIAddress("0000:06:00.0").bus) << "where it was";
    EXPECT_THROW(ma::getPCIAddress("0000:09:00.0"), ma::AdapterError);
}

/// All that reads, which must not ask a device that is being flashed.
void expectAnswersFromMemory(const test::DevlinkBench& bench, bool isKnown) {
    const int asked = bench.kernel->requests;
    EXPECT_EQ(2U, ma::enumerateAdapters().size());
    EXPECT_TRUE(ma::getCanBeUpdated(bench.first));
    EXPECT_THAT(ma::getAdapterInfo(bench.first).writer, testing::HasSubstr("process"));
    EXPECT_EQ(isKnown ? "1.2.3" : "", runningVersion(bench.first));
    EXPECT_GT(100, ma::getFlashImageUpdateProgress(bench.first));
    EXPECT_EQ(5, ma::getPCIAddress(bench.first).bus);
    EXPECT_EQ(asked, bench.kernel->requests);
}

TEST(DevlinkInventoryTest, NeverAsksADeviceThatIsBeingFlashed) {
    test::DevlinkBench bench;
    bench.device().duringFlash = [&] { expectAnswersFromMemory(bench, true); };
    EXPECT_TRUE(bench.install().done);

    // By somebody else, who tells only the kernel; it begins before the first look, or after it.
    bench.device() = {};
    bench.restart();
    EXPECT_TRUE(ma::getCanBeUpdated(bench.first));
    bench.kernel->notify(DEVLINK_CMD_FLASH_UPDATE, bench.first);
    bench.kernel->notify(DEVLINK_CMD_NEW, bench.second);
    expectAnswersFromMemory(bench, true);
    EXPECT_EQ("another process", ma::getAdapterInfo(bench.first).writer) << "which takes no lock";
    {
        const auto lock = bench.kernel->lock("/var/lib/quenx/locks/0000:05:00.lock", {});
        EXPECT_EQ("process " + std::to_string(::getpid()) + " (MidApiDevlinkTe)",
                  ma::getAdapterInfo(bench.first).writer);
    }
    bench.device().running["fw"] = "1.3.0";
    bench.kernel->notify(DEVLINK_CMD_FLASH_UPDATE_END, bench.first);
    EXPECT_EQ("1.3.0", runningVersion(bench.first));

    bench.restart();
    bench.device() = {};
    {
        const auto lock = bench.kernel->lock("/var/lib/quenx/locks/0000:05:00.lock", {});
        expectAnswersFromMemory(bench, false);
        EXPECT_THAT(ma::describeSearch(),
                    testing::HasSubstr(bench.first + " (fake) is being written to by process " +
                                       std::to_string(::getpid()) + " ("));
        EXPECT_EQ(ma::PrepareStatus::UnspecifiedError, bench.prepare());
    }
    EXPECT_TRUE(ma::getCanBeUpdated(bench.first));

    // Not even a lock that others could exchange ends a question.
    bench.restart();
    bench.kernel->drop("/var/lib/quenx/locks/0000:05:00.lock");
    bench.kernel->put("/var/lib/quenx/locks/0000:05:00.lock", "1");
    bench.kernel->foreignLock = true;
    EXPECT_TRUE(ma::getCanBeUpdated(bench.first));
}

TEST(DevlinkInventoryTest, IsOutOfReachForAllTests) {
    // Every test program begins with this guard, and what it starts inherits it: a suite that passes has
    // opened no such socket.
    if (sizeof(void*) == 4 || !test::forbidGenericNetlink()) GTEST_SKIP() << "no filter for socket calls";
    EXPECT_EXIT(ma::devlink::LinuxMachine().openNetlink(), testing::KilledBySignal(SIGSYS), "");
}

TEST(DevlinkInventoryTest, ServesManyThreads) {
    const test::DevlinkBench bench;
    ASSERT_EQ(0, bench.prepare());
    std::vector<std::function<void()>> calls{[&] { bench.write(); }, [&] { bench.prepare(); },
                                             [&] { bench.kernel->notify(DEVLINK_CMD_NEW, bench.first); }};
    for (const std::string& adapter : {bench.first, bench.second}) {
        calls.emplace_back([=] { ma::enumerateAdapters(); });
        calls.emplace_back([=] { ma::getAdapterInfo(adapter); });
        calls.emplace_back([=] { ma::getCanBeUpdated(adapter); });
        calls.emplace_back([=] { ma::getFlashImageUpdateProgress(adapter); });
    }
    test::together(calls);
    EXPECT_TRUE(bench.write().done);
}

}  // namespace
