// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>
#include <linux/devlink.h>
#include <linux/netlink.h>

#include <cerrno>
#include <thread>

#include "MidAPI/Devlink/DevlinkBench.h"
#include "MidAPI/Devlink/StagedImage.h"
#include "Support/SyslogCapture.h"
#include "Support/Together.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using enum utils::FirmwareType;

std::string storedVersion(const std::string& adapter) {
    const ma::AdapterInfo info = ma::getAdapterInfo(adapter);
    return info.versions.empty() ? "" : info.versions.front().stored;
}

/// The thread that follows a flash is not the one that flashes.
std::uint16_t waitForProgress(const std::string& adapter, std::uint16_t percent) {
    for (int tries = 0; tries < 2000 && ma::getFlashImageUpdateProgress(adapter) < percent; ++tries)
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    return ma::getFlashImageUpdateProgress(adapter);
}

TEST(DevlinkFlashTest, StagesFlashesAndCleansUp) {
    const test::DevlinkBench bench;
    bench.kernel->put("/lib/firmware/quenx/0000:05:00-left.bin", "of a process that was killed");
    bench.kernel->put("/lib/firmware/quenx/0000:06:00-other.bin", "of another card");
    bench.device().duringFlash = [&] {
        EXPECT_EQ(49, waitForProgress(bench.first, 49)) << "half of what is told before the end";
        EXPECT_EQ(2U, bench.staged().size());
        bench.kernel->failures["removeFile"] = EROFS;  // which leaves this one
    };
    EXPECT_EQ("1.2.3", storedVersion(bench.first));
    const test::WriteResult result = bench.install();
    EXPECT_TRUE(result.done && result.code == 0 && result.text.empty()) << result.text;
    EXPECT_EQ(2U, bench.staged().size());
    EXPECT_EQ(100, ma::getFlashImageUpdateProgress(bench.first));
    EXPECT_EQ(0, ma::getFlashImageUpdateProgress(bench.second));

    std::uint32_t code = 9;
    std::string text = "old";
    EXPECT_TRUE(ma::updateCapabilityWord(bench.first, {}, code, text));
    EXPECT_TRUE(code == 0 && text.empty());
    EXPECT_EQ("1.3.0", storedVersion(bench.first));
    EXPECT_EQ(ma::ResetNeeded::Unknown, ma::getAdapterInfo(bench.first).resetNeeded);
    bench.kernel->failures.clear();
    bench.device().statuses = {{"more than there is", 11, 10}};
    bench.device().duringFlash = [&] {
        EXPECT_EQ(99, waitForProgress(bench.first, 99));
        EXPECT_EQ(0, ma::getFlashImageUpdateProgress(bench.second));
        EXPECT_EQ(2U, bench.staged().size());
    };
    EXPECT_EQ(0, bench.prepare());
    EXPECT_EQ(0, ma::getFlashImageUpdateProgress(bench.first));
    EXPECT_TRUE(bench.write().done);
    EXPECT_THAT(bench.staged(), ElementsAre("0000:06:00-other.bin"));
    EXPECT_THAT(bench.kernel->flashed, ElementsAre(":image", ":image"));
    const auto isStaged = testing::StartsWith("/lib/firmware/quenx/0000:05:00-");
    EXPECT_THAT(bench.kernel->flashedFiles, ElementsAre(isStaged, isStaged));
    EXPECT_NE(bench.kernel->flashedFiles[0], bench.kernel->flashedFiles[1]);
}

std::string chooseFolder(test::FakeKernel& machine, const std::string& configured) try {
    return "chose " + ma::devlink::chooseFirmwareFolder(machine, configured);
} catch (const ma::AdapterError& error) {
    return error.what();
}

TEST(DevlinkFlashTest, StagesInTheFirstWritableFolderThatTheKernelSearches) {
    test::FakeKernel machine;
    machine.put("/sys/module/firmware_class/parameters/path", "/srv/firmware\n");
    EXPECT_THAT(ma::devlink::firmwareFolders(machine),
                ElementsAre("/srv/firmware", "/lib/firmware/updates/6.1.0", "/lib/firmware/updates",
                            "/lib/firmware/6.1.0", "/lib/firmware"));
    machine.drop("/lib/firmware");
    machine.putFolder("/home");
    EXPECT_THAT(chooseFolder(machine, ""),
                testing::EndsWith("/lib/firmware, of which none is there. Make the folder /lib/firmware."));
    machine.putFolder("/lib/firmware/updates");
    EXPECT_EQ("chose /lib/firmware/updates", chooseFolder(machine, ""));
    machine.readOnly = {"/lib/firmware/updates/quenx"};
    machine.putFolder("/lib/firmware/updates/quenx");  // the own folder decides where there is one
    EXPECT_EQ("chose /lib/firmware", chooseFolder(machine, ""));
    machine.readOnly = {"/lib/firmware/updates"};
    EXPECT_EQ("chose /lib/firmware/updates", chooseFolder(machine, ""));
    EXPECT_EQ("chose /lib/firmware", chooseFolder(machine, "/lib/firmware"));
    EXPECT_THAT(chooseFolder(machine, "/srv/firmware"), HasSubstr("in /srv/firmware, which is not there."));
    machine.readOnly.insert("/lib/firmware");
    machine.drop("/lib/firmware/updates/quenx");
    EXPECT_THAT(chooseFolder(machine, ""),
                HasSubstr("may not write to /lib/firmware/updates, /lib/firmware. "));
    EXPECT_THAT(chooseFolder(machine, "/home"), HasSubstr("does not look for firmware in /home"));
}

/// What is wrong with a machine, and what that means before an image is prepared, and after that.
struct Trouble {
    std::function<void(test::FakeKernel&, test::FakeDevice&)> spoil;
    bool canBeUpdated;
    int status;
    std::string log;
    std::uint32_t code;
};

auto failing(const std::string& operation, int error) {
    return [=](test::FakeKernel& kernel, test::FakeDevice&) { kernel.failures[operation] = error; };
}
auto ending(int error, const std::string& text) {
    return [=](test::FakeKernel&, test::FakeDevice& device) {
        device.error = error;
        device.errorText = text;
    };
}

/// What is said of the adapter before a write, in two lines.
std::string saidBefore(const Trouble& trouble) {
    const test::SyslogCapture log;
    const test::DevlinkBench bench;
    trouble.spoil(*bench.kernel, bench.device());
    EXPECT_EQ(trouble.canBeUpdated, ma::getCanBeUpdated(bench.first));
    const std::string search = ma::describeSearch();
    EXPECT_EQ(trouble.canBeUpdated,
              search.find(bench.first + " (fake) cannot be updated: ") == std::string::npos)
        << search;
    const auto verdict = ma::judgeImage(bench.first, bench.image, {});
    EXPECT_EQ(trouble.status, verdict->status);
    EXPECT_EQ(trouble.status, bench.prepare());
    EXPECT_TRUE(trouble.log.empty() || log.contains(trouble.log)) << trouble.log;
    EXPECT_EQ(2U, ma::enumerateAdapters().size());
    return search + "\n" + verdict->reason + "\n";
}

/// What is said of the write.
std::string saidDuring(const Trouble& trouble) {
    const test::DevlinkBench bench;
    EXPECT_EQ(0, bench.prepare());
    const auto devices = bench.kernel->devices;
    trouble.spoil(*bench.kernel, bench.device());
    const test::WriteResult result = bench.write();
    EXPECT_EQ(trouble.code == 0, result.done);
    EXPECT_EQ(trouble.code, result.code);
    EXPECT_THAT(bench.staged(), testing::IsEmpty());
    EXPECT_EQ(result.done, ma::getFlashImageUpdateProgress(bench.first) == 100);

    bench.kernel->failures.clear();
    bench.kernel->readOnly.clear();
    bench.kernel->mangle = {};
    bench.kernel->hasDevlink = bench.kernel->isPermitted = true;
    bench.kernel->devices = devices;
    EXPECT_TRUE(bench.write().done) << "nothing is held";
    return result.text + "\n";
}

TEST(DevlinkFlashTest, TellsWhatIsWrongAndLeavesNothingBehind) {
    using enum ma::PrepareStatus;
    using enum ma::WriteError;
    const std::vector<Trouble> troubles = {
        {[](auto&, auto&) {}, true, Prepared, "", 0},
        {[](auto&, auto& device) { device.hasInfo = false; }, true, Prepared, "", 0},
        {[](auto&, auto& device) { device.hasFlash = false; }, false, ImageNotSupported, "", NotUpdatable},
        {[](auto&, auto& device) { device.infoError = EIO; }, true, UnspecifiedError,
         "versions of adapter 0000:05:00.0 cannot be read: Input/output error", 0},
        {[](auto& kernel, auto&) { kernel.devices.erase("0000:05:00.0"); }, false, ImageNotSupported, "",
         NotUpdatable},
        {[](auto& kernel, auto&) { kernel.hasDevlink = false; }, false, ImageNotSupported, "", NotUpdatable},
        {[](auto& kernel, auto&) { kernel.isPermitted = false; }, false, UnspecifiedError, "run it as root",
         DeviceFailed},
        {[](auto& kernel, auto&) { kernel.mangle = [](test::Datagram& datagram) { datagram.resize(1); }; },
         false, UnspecifiedError, "does not say whether it has devlink", DeviceFailed},
        {[](auto& kernel, auto&) { kernel.readOnly.insert("/lib/firmware"); }, true, UnspecifiedError,
         "/lib/firmware", EACCES},
        {failing("openNetlink", EMFILE), false, UnspecifiedError, "Too many open files", DeviceFailed},
        {failing("joinGroup", EPERM), false, UnspecifiedError, "Operation not permitted", DeviceFailed},
        {failing("send", ENOBUFS), false, UnspecifiedError, "No buffer space", DeviceFailed},
        {ending(EIO, "erasing bank 1 failed"), true, Prepared, "", DeviceFailed},
        {ending(EIO, ""), true, Prepared, "", DeviceFailed},
        {ending(ENOENT, "failed to locate the requested firmware file"), true, Prepared, "", DeviceFailed},
        // Of the driver's own, which say nothing of rights, places or folders.
        {ending(ENODEV, "bank 1"), true, Prepared, "", ENODEV},
        {ending(ENOENT, "section 7"), true, Prepared, "", DeviceFailed},
        {failing("makeFolder", EROFS), true, Prepared, "", DeviceFailed},
        {failing("lock", EACCES), true, Prepared, "", DeviceFailed},
        {failing("createFile", EROFS), true, Prepared, "", EROFS},
        {failing("writeFile", ENOSPC), true, Prepared, "", ENOSPC},
        {failing("syncFile", EIO), true, Prepared, "", DeviceFailed},
        {failing("syncFolder", EIO), true, Prepared, "", DeviceFailed},
    };
    std::string said;
    for (const Trouble& trouble : troubles) {
        SCOPED_TRACE(said);
        said += saidBefore(trouble) + saidDuring(trouble) + "\n";
    }
    const auto expected = test::readTestFile(QUENX_MIDAPI_TEST_DIR "/samples/devlink-troubles");
    EXPECT_EQ(said, std::string(expected.begin(), expected.end()));
}

TEST(DevlinkFlashTest, WritesOnlyWhatWasPreparedForTheAdapter) {
    const test::DevlinkBench bench;
    EXPECT_EQ(ma::WriteError::BadImage, bench.write().code);
    EXPECT_EQ(3U, ma::judgeImage(bench.first, bench.image, {})->unchecked.size());
    EXPECT_EQ(ma::InvalidParameter, ma::judgeImage(bench.first, {}, {})->status);
    EXPECT_EQ(ma::WriteError::BadImage, bench.write().code) << "a judgement prepares nothing";
    ASSERT_EQ(0, bench.prepare());
    EXPECT_EQ(ma::WriteError::BadImage, test::writeImage(bench.first, {'I', 'm', 'a', 'g', 'e'}).code);
    EXPECT_EQ(ma::WriteError::BadImage, test::writeImage(bench.second, bench.image).code);
    EXPECT_EQ(ma::WriteError::UnknownAdapter, test::writeImage("0000:09:00.0", bench.image).code);
    EXPECT_THAT(bench.kernel->flashed, testing::IsEmpty());
}

TEST(DevlinkFlashTest, ReadsFromTheFlashWhatALostAcknowledgementWouldHaveTold) {
    struct Case {
        std::map<std::string, std::string> stored;
        std::string afterwards;
        bool done;
        std::string text;
    };
    const std::vector<Case> cases = {
        {{{"fw", "1.2.3"}}, "1.3.0", true, ""},
        {{{"fw", "1.2.3"}}, "1.2.3", false, "the flash holds fw 1.2.3, as before"},
        {{}, "1.3.0", false, "the driver does not tell what is in the flash"},
    };
    for (std::size_t index = 0; index < 2 * cases.size(); ++index) {
        const Case& each = cases[index / 2];
        const test::DevlinkBench bench;
        bench.device().stored = each.stored;
        bench.device().storedAfterwards = each.afterwards;
        // It does not come, or is such that it cannot be read.
        bench.device().isAcknowledged = index % 2 == 0;
        bench.device().duringFlash = [&] {
            if (!bench.device().isAcknowledged) return;
            bench.kernel->mangle = [isFirst = true](test::Datagram& datagram) mutable {
                if (datagram[4] == NLMSG_ERROR && std::exchange(isFirst, false)) datagram.resize(100'000);
            };
        };
        const test::WriteResult result = bench.install();
        EXPECT_EQ(each.done, result.done) << each.text;
        EXPECT_EQ(each.done ? 0 : ETIMEDOUT, static_cast<int>(result.code)) << each.text;
        EXPECT_EQ(result.text, each.done ? ""
                                         : "the kernel did not tell how the update ended; " + each.text +
                                               "; look at the adapter's versions, and update it again");
        EXPECT_EQ(each.done, ma::getFlashImageUpdateProgress(bench.first) == 100);
    }
    // What was not known before has not changed by being known now.
    const test::DevlinkBench bench;
    ASSERT_EQ(0, bench.prepare());
    bench.device().infoError = EIO;
    bench.device().isAcknowledged = false;
    bench.device().duringFlash = [&] { bench.device().infoError = 0; };
    EXPECT_THAT(bench.write().text, HasSubstr("how the update ended; the flash holds fw 1.3.0; look at"));
}

TEST(DevlinkFlashTest, FlashesACardFromOnePlaceAtATime) {
    const test::DevlinkBench bench;
    bench.kernel->add("0000:06:00.0").boardSerial = bench.device().boardSerial = "SN 1/2";
    bench.kernel->add("0000:07:00.0").boardSerial = "SN 3";
    const std::vector<std::string> others = {bench.second, "0000:06:00.0", "0000:07:00.0"};
    for (const std::string& other : others)
        EXPECT_EQ(0, test::prepareImage(other, bench.image).status);
    std::vector<std::uint32_t> codes;
    bench.device().duringFlash = [&] {
        for (const std::string& other : others) {
            const test::WriteResult result = test::writeImage(other, bench.image);
            codes.push_back(result.code);
            const bool isTold = result.text.find("is being written to by process " +
                                                 std::to_string(::getpid())) != std::string::npos;
            EXPECT_NE(result.done, isTold) << result.text;
        }
    };
    EXPECT_TRUE(bench.install().done);
    EXPECT_THAT(codes, ElementsAre(ma::WriteError::Busy, ma::WriteError::Busy, 0));
    // The check of this one was against what is no longer there: both have one flash.
    bench.kernel->devices.at(bench.second).stored = bench.device().stored;
    EXPECT_THAT(test::writeImage(bench.second, bench.image).text, HasSubstr("has other firmware than when"));
    EXPECT_EQ(0, test::prepareImage(bench.second, bench.image).status);
    EXPECT_TRUE(test::writeImage(bench.second, bench.image).done);
}

TEST(DevlinkFlashTest, FlashesComponentsOneAfterTheOther) {
    const test::DevlinkBench bench;
    bench.device().components = {"fw.undi", "fw.uefi"};
    // No step that is not counted, or begins anew, takes it back.
    bench.device().statuses = {{"Flashing", UINT64_MAX / 2, UINT64_MAX}, {"Verifying"}, {"Sealing", 0, 10}};
    EXPECT_EQ(ma::PrepareStatus::ImageNotApplicable, bench.prepare({PXE, iSCSI}));
    ASSERT_EQ(0, bench.prepare({UEFI, PXE, None, UEFI}));
    std::vector<int> percents;
    bench.device().duringFlash = [&] {
        percents.push_back(waitForProgress(bench.first, bench.kernel->flashed.empty() ? 24 : 74));
    };
    EXPECT_TRUE(bench.write().done);
    EXPECT_THAT(percents, ElementsAre(24, 74));
    EXPECT_THAT(bench.kernel->flashed, ElementsAre("fw.undi:image", "fw.uefi:image"));
    EXPECT_EQ(100, ma::getFlashImageUpdateProgress(bench.first));

    bench.kernel->flashed.clear();
    bench.device().duringFlash = {};
    bench.device().error = EBADMSG;
    EXPECT_EQ(std::uint32_t{EBADMSG}, bench.write().code);
    EXPECT_EQ(1U, bench.kernel->flashed.size()) << "the ones after a failure are not begun";
    bench.device().duringFlash = [&] {
        bench.device().error = bench.kernel->flashed.size() > 1 ? EBADMSG : 0;
    };
    EXPECT_THAT(bench.write().text,
                testing::AllOf(HasSubstr("the update of fw.uefi failed: "),
                               HasSubstr("the flash holds fw 1.3.0; before it fw.undi was written")));
    EXPECT_GT(100, ma::getFlashImageUpdateProgress(bench.first));
}

TEST(DevlinkFlashTest, PreparesAnImageForOneWriteAtATime) {
    const test::DevlinkBench bench;
    bench.device().components = {"fw.undi", "fw.uefi"};
    ASSERT_EQ(0, bench.prepare({PXE}));
    EXPECT_EQ(ma::PrepareStatus::UnspecifiedError, bench.prepare({UEFI}));
    EXPECT_EQ(0, bench.prepare({PXE}));
    EXPECT_TRUE(bench.write().done);
    EXPECT_THAT(bench.kernel->flashed, ElementsAre("fw.undi:image"));
    EXPECT_EQ(0, bench.prepare({UEFI}));
}

TEST(DevlinkFlashTest, LeavesACardAloneThatAnotherToolFlashes) {
    const test::DevlinkBench bench;
    bench.device().offersActivation = true;
    ASSERT_EQ(0, bench.prepare());
    ASSERT_TRUE(ma::getCanBeUpdated(bench.second));
    bench.kernel->notify(DEVLINK_CMD_FLASH_UPDATE, bench.second);
    const test::WriteResult result = bench.write();
    EXPECT_EQ(ma::WriteError::Busy, result.code);
    EXPECT_THAT(result.text, HasSubstr("function 0000:05:00.1 of the card is being written to by another"));
    const ma::Activation activation = ma::activate(bench.first, {.mayDisrupt = true});
    EXPECT_EQ(ma::Activation::Failed, activation.status);
    EXPECT_THAT(activation.text, HasSubstr("function 0000:05:00.1"));
    EXPECT_THAT(bench.kernel->flashed, testing::IsEmpty());
    // It brings new firmware to all, which is not to be compared with what was read before.
    bench.device().running["fw"] = "2.0.0";
    bench.kernel->notify(DEVLINK_CMD_FLASH_UPDATE_END, bench.second);
    EXPECT_EQ("2.0.0", ma::getAdapterInfo(bench.first).versions.front().running);
    EXPECT_EQ(ma::WriteError::Busy, bench.write().code) << "it was held against 1.2.3";
    EXPECT_TRUE(bench.install().done);
}

TEST(DevlinkFlashTest, OutlivesAStormOfNotifications) {
    const test::DevlinkBench bench;
    constexpr std::uint64_t kTotal = 2000;
    bench.device().statuses.clear();
    for (std::uint64_t done = 0; done <= kTotal; ++done)
        bench.device().statuses.push_back({"", done % 1000, 1000});
    bench.device().tellsEnd = false;
    EXPECT_TRUE(bench.install().done);
    EXPECT_EQ(100, ma::getFlashImageUpdateProgress(bench.first));
    EXPECT_TRUE(ma::getCanBeUpdated(bench.first)) << "asked anew after some were lost";
}

TEST(DevlinkFlashTest, CallsNothingDoneThatTheKernelDidNotDo) {
    unsigned int random = 1;
    for (int round = 0; round < 25; ++round) {
        const test::DevlinkBench bench;
        bench.kernel->mangle = [&](test::Datagram& datagram) {
            random = random * 1103515245 + 12345;
            if (random >> 16 & 1) datagram.resize((random >> 17) % (datagram.size() + 1));
            if (!datagram.empty())
                datagram[(random >> 8) % datagram.size()] ^= static_cast<std::uint8_t>(random >> 24);
        };
        bench.device().error = EIO;
        EXPECT_FALSE(bench.install().done);
        try {
            ma::getAdapterInfo(bench.first);
        } catch (const ma::AdapterError&) {  // where the versions cannot be read
        }
        EXPECT_EQ(2U, ma::enumerateAdapters().size());
    }
}

}  // namespace
