// SPDX-License-Identifier: Apache-2.0
// Putting new firmware in force, and what is looked at before and after.
#include <gmock/gmock.h>

#include <linux/devlink.h>

#include <cerrno>

#include "MidAPI/Devlink/DevlinkBench.h"

namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;

/// A card that has been updated and offers activation, whose first interface has a link.
class DevlinkActivationTest : public ::testing::Test {
  protected:
    DevlinkActivationTest() {
        device().offersActivation = true;
        device().stored["fw"] = "1.3.0";
        putLink(true);
        m_bench.kernel->put("/proc/self/net/route", "");
    }
    test::FakeDevice& device() const { return m_bench.device(); }
    void putLink(bool isUp) const {
        m_bench.kernel->put("/sys/class/net/enp5s0f0/carrier", isUp ? "1" : "0");
    }
    ma::Activation activate(const ma::ActivationRequest& request = {}) const {
        return ma::activate(m_bench.first, request);
    }
    ma::ResetNeeded resetNeeded() const { return ma::getAdapterInfo(m_bench.first).resetNeeded; }

    const test::DevlinkBench m_bench;
};

TEST_F(DevlinkActivationTest, ResetsTheCardAndReadsItAnew) {
    EXPECT_EQ(ma::ResetNeeded::Reload, resetNeeded());
    device().duringReset = [this] {
        putLink(false);
        // It is agreed on only while it is waited for.
        m_bench.kernel->reading = [this, looks = 0](const std::string& path) mutable {
            if (path.ends_with("enp5s0f0/carrier") && ++looks == 3) putLink(true);
        };
    };
    const ma::Activation activation = activate();
    EXPECT_EQ(ma::Activation::Done, activation.status) << activation.text;
    EXPECT_EQ("1.3.0", ma::getAdapterInfo(m_bench.first).versions.at(0).running);
    EXPECT_EQ(ma::ResetNeeded::None, resetNeeded());
}

TEST_F(DevlinkActivationTest, RefusesToCutTheMachineOffUnlessTold) {
    m_bench.kernel->put("/proc/self/net/route", "enp5s0f0 00000000 00000000 0003 0 0 0 00000000 0 0 0");
    const ma::CardUse use = ma::getCardUse(m_bench.second, "");
    EXPECT_THAT(use.functions, ElementsAre(m_bench.first, m_bench.second));
    EXPECT_THAT(use.interfaces, ElementsAre("enp5s0f0", "enp5s0f1"));
    const std::string card = "/sys/bus/pci/devices/0000:05:00.";
    m_bench.kernel->putFolder(card + "1/virtfn3/net/vf3");
    m_bench.kernel->putFolder(card + "1/net/rep3");
    m_bench.kernel->put("/sys/class/net/rep3/phys_port_name", "pf1vf3");
    m_bench.kernel->add("0000:05:00.2");
    m_bench.kernel->putFolder(card + "2/net");  // its interface is in another namespace
    const ma::CardUse more = ma::getCardUse(m_bench.first, "");
    EXPECT_THAT(more.functions, ElementsAre(m_bench.first, m_bench.second, "0000:05:00.2"));
    EXPECT_THAT(more.interfaces, ElementsAre("enp5s0f0", "enp5s0f1", "rep3", "vf3"));
    // The other function is reset, too.
    const ma::Activation refused = ma::activate(m_bench.second, {});
    EXPECT_EQ(ma::Activation::WouldDisrupt, refused.status);
    EXPECT_EQ("the default route goes through enp5s0f0", refused.text);
    EXPECT_EQ("1.2.3", device().running["fw"]);
    m_bench.kernel->drop("/proc/self/net");
    EXPECT_EQ("the routes cannot be read", activate().text);
    EXPECT_EQ(ma::Activation::Done, activate({.mayDisrupt = true}).status);
    m_bench.kernel->hasDevlink = false;
    EXPECT_EQ("this kernel has no devlink", activate().text) << "and so would cut nothing off";
}

TEST_F(DevlinkActivationTest, TellsWhatHasNotComeBack) {
    device().duringReset = [this] { putLink(false); };
    const ma::Activation activation = activate();
    EXPECT_EQ(ma::Activation::NotBack, activation.status);
    EXPECT_EQ("enp5s0f0 has no link", activation.text);
}

TEST_F(DevlinkActivationTest, SaysOnlyWhatTheVersionsProve) {
    struct Case {
        const char* what;
        bool isAcknowledged;
        int error;
        std::function<void(test::FakeDevice&)> during;
        ma::Activation::Status status;
        std::string text;
    };
    using enum ma::Activation::Status;
    const auto nothing = [](test::FakeDevice&) {};
    const auto activated = [](test::FakeDevice& device) { device.running = device.stored; };
    const auto unreadable = [](test::FakeDevice& device) { device.infoError = EIO; };
    const auto silent = [](test::FakeDevice& device) { device.running.clear(); };
    const std::string mute = "which firmware runs cannot be read: Input/output error";
    const std::string lost = "the kernel's answer did not come";
    const std::vector<Case> cases = {
        {"acknowledged without effect", true, 0, [](auto& device) { device.activates = false; }, StillPending,
         "fw 1.2.3 runs (1.3.0 is in the flash)"},
        {"acknowledged, then mute", true, 0, unreadable, Unknown, mute},
        {"acknowledged, tells nothing", true, 0, [](auto& device) { device.stored.clear(); }, Done,
         "the driver does not tell which firmware runs"},
        {"lost, done", false, 0, nothing, Done, ""},
        {"lost, not done", false, EIO, nothing, Failed, lost + "; fw 1.2.3 runs (1.3.0 is in the flash)"},
        {"lost, mute", false, EIO, unreadable, Unknown, lost + "; " + mute},
        {"failed half-way, done", true, EIO, activated, NotBack, "Input/output error"},
        {"failed half-way, mute", true, EIO, unreadable, Unknown, "Input/output error; " + mute},
        {"failed half-way, tells nothing", true, EIO, silent, Unknown,
         "Input/output error; the driver does not tell which firmware runs"},
    };
    for (const Case& each : cases) {
        const test::DevlinkBench bench;
        bench.kernel->put("/proc/self/net/route", "");
        bench.device().offersActivation = true;
        bench.device().stored["fw"] = "1.3.0";
        bench.device().isAcknowledged = each.isAcknowledged;
        bench.device().activationError = each.error;
        bench.device().duringReset = [&] { each.during(bench.device()); };
        const ma::Activation activation = ma::activate(bench.first, {});
        EXPECT_EQ(each.status, activation.status) << each.what << ": " << activation.text;
        EXPECT_EQ(activation.text, each.text) << each.what;
    }
}

TEST_F(DevlinkActivationTest, TellsWhyNothingWasActivated) {
    device().activationError = EIO;
    device().duringReset = [this] { m_bench.kernel->drop("/sys/bus/pci/devices/0000:05:00.0/net"); };
    const ma::Activation failed = activate();
    EXPECT_EQ(ma::Activation::Failed, failed.status);
    EXPECT_THAT(failed.text, HasSubstr("Input/output error; 0000:05:00.0 has no network interface"));

    device().offersActivation = false;
    m_bench.kernel->notify(DEVLINK_CMD_NEW, m_bench.first);
    EXPECT_EQ(ma::ResetNeeded::Unknown, resetNeeded());
    const ma::Activation none = activate();
    EXPECT_EQ(ma::Activation::NotOffered, none.status);
    EXPECT_THAT(none.text, HasSubstr("Requested reload action is not supported by the driver"));

    auto lock = m_bench.kernel->lock("/var/lib/quenx/locks/0000:05:00.lock", {});
    EXPECT_THAT(activate().text, HasSubstr("is being written to by process " + std::to_string(::getpid())));
    lock.reset();
    m_bench.kernel->isPermitted = false;
    EXPECT_THAT(activate().text, HasSubstr("run it as root"));
    EXPECT_THROW(ma::activate("0000:09:00.0", {}), ma::AdapterError);
}

}  // namespace
