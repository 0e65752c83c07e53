// SPDX-License-Identifier: Apache-2.0
#include "Logind/Inhibitor.h"

#include <gmock/gmock.h>

#include <chrono>
#include <cstdlib>
#include <filesystem>

#include "Host/UnixSocket.h"
#include "Logind/InhibitingLocker.h"
#include "Logind/StandIn.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"
#include "System/HeldFlash.h"
#include "System/RunningDaemon.h"

namespace {

using test::StandIn;
using ::testing::HasSubstr;

/// This process finds that bus, as long as this lives.
class OnTheBus {
  public:
    explicit OnTheBus(const std::string& address) {
        ::setenv(kName, address.c_str(), 1);
        EXPECT_EQ(logind::loadLibrary(), "");
    }
    explicit OnTheBus(const StandIn& standIn)
        : OnTheBus(standIn.environment().substr(std::string(kName).size() + 1)) {}
    OnTheBus(const OnTheBus&) = delete;
    ~OnTheBus() { ::setenv(kName, m_before.c_str(), 1); }

  private:
    static constexpr const char* kName = "DBUS_SYSTEM_BUS_ADDRESS";
    const std::string m_before = std::getenv(kName);
};

TEST(InhibitorTest, HoldsUpAShutdownAsLongAsALockerIsHeld) {
    const StandIn logind(StandIn::Manner::Grants);
    const OnTheBus address(logind);
    logind::InhibitingLocker locker("quenx-test");
    EXPECT_EQ(locker.Lock(), 0);
    EXPECT_EQ(logind.asked(),
              "shutdown:sleep/quenx-test/The firmware of a network adapter is being written./block");
    EXPECT_TRUE(logind.isHeld(true));
    EXPECT_EQ(locker.Lock(), 2);
    EXPECT_TRUE(logind.isHeld(true)) << "the same one";
    EXPECT_EQ(locker.UnLock(), 0);
    EXPECT_FALSE(logind.isHeld(false));
    EXPECT_EQ(locker.Lock(), 0);
    EXPECT_TRUE(logind.isHeld(true)) << "another one";
}

TEST(InhibitorTest, GoesOnWithoutABusAndWithoutAnAnswer) {
    EXPECT_EQ(logind::Inhibitor("me", "why").problem(),
              "the library that talks to the system's bus is not loaded");
    {
        const StandIn logind(StandIn::Manner::Refuses);
        const OnTheBus address(logind);
        EXPECT_EQ(logind::Inhibitor("me", "why").problem(), "not today");
    }
    const test::TempFolder folder;
    const OnTheBus nobody("unix:path=" + folder / "bus");
    EXPECT_EQ(logind::Inhibitor("me", "why").problem(), "the system's bus: No such file or directory");
    // A bus that takes the connection and says nothing, and a logind that does.
    const test::UnixSocket silent(SOCK_STREAM, folder / "bus");
    ASSERT_EQ(::listen(silent.number(), 1), 0);
    const StandIn logind(StandIn::Manner::IsSilent);
    for (const bool isBusSilent : {true, false}) {
        if (!isBusSilent) ::setenv("DBUS_SYSTEM_BUS_ADDRESS", logind.environment().substr(24).c_str(), 1);
        const auto begun = std::chrono::steady_clock::now();
        EXPECT_EQ(logind::Inhibitor("me", "why").problem(),
                  isBusSilent ? "the system's bus: Connection timed out" : "Connection timed out");
        EXPECT_LT(std::chrono::steady_clock::now() - begun, std::chrono::seconds(20)) << "one or two";
    }
}

TEST(InhibitorTest, LoadsNothingWhereThereIsNoBus) {
    const OnTheBus address("unix:path=/none");
    ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS");
    const bool hasOne = std::filesystem::exists("/run/dbus/system_bus_socket");
    EXPECT_EQ(logind::loadLibrary(), hasOne ? "" : "there is no system bus");
}

TEST(InhibitorTest, IsHeldWhileAnAdapterIsWrittenTo) {
    const StandIn logind(StandIn::Manner::Grants);
    const test::TempFolder folder;
    test::HeldFlash flash(folder / "state/eth0");
    test::Program update(
        {QUENXCTL, "install", "--policy", folder.write("policy.toml", "# As if there were none.\n"),
         "--config", folder.write("provider.conf", ""), "--backend", "simulator", "--adapters",
         folder.write("adapters.toml", test::kTestAdapters), "--state", folder / "state", "--target", "eth0",
         folder.write("new.rom", test::withRevision(test::realRom("efi-virtio"), 2))},
        test::Program::Output::Pipes, {logind.environment()});
    EXPECT_TRUE(flash.isWaitedFor());
    EXPECT_THAT(logind.asked(), HasSubstr("/quenxctl/"));
    EXPECT_TRUE(logind.isHeld(true));
    flash.release();
    EXPECT_EQ(update.finish().status, 0);
    EXPECT_FALSE(logind.isHeld(false));
}

TEST(InhibitorTest, IsHeldByTheDaemonThatWrites) {
    const StandIn logind(StandIn::Manner::Grants);
    const test::RunningDaemon daemon({}, {logind.environment()});
    test::HeldFlash flash(daemon.folder() / "state/eth0");
    test::Program update({QUENXCTL, "--server", "http://127.0.0.1:" + std::to_string(daemon.httpPort()),
                          "--user", "admin", "install", "--target", "eth0", daemon.image()},
                         test::Program::Output::Pipes, {"QUENXCTL_PASSWORD=admin"});
    EXPECT_TRUE(flash.isWaitedFor());
    EXPECT_THAT(logind.asked(), HasSubstr("/quenx-cimd/"));
    EXPECT_TRUE(logind.isHeld(true));
    flash.release();
    EXPECT_EQ(update.finish().status, 0);
}

}  // namespace
