// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>
#include <linux/devlink.h>

#include <cerrno>
#include <thread>

#include "MidAPI/Devlink/DevlinkBench.h"
#include "MidAPI/Devlink/FlashProgress.h"
#include "Support/Together.h"

namespace {

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
    bench.kernel->files["/lib/firmware/quenx/0000:05:00-left.bin"] = "of a process that was killed";
    bench.kernel->files["/lib/firmware/quenx/0000:06:00-other.bin"] = "of another card";
    bench.device().duringFlash = [&] {
        EXPECT_EQ(49, waitForProgress(bench.first, 49)) << "half of what is told before the end";
        EXPECT_EQ(2U, bench.staged().size());
    };
    EXPECT_EQ("1.2.3", storedVersion(bench.first));
    const test::WriteResult result = bench.install();
    EXPECT_TRUE(result.done && result.code == 0 && result.text.empty()) << result.text;
    EXPECT_THAT(bench.kernel->flashed, testing::ElementsAre(":image"));
    EXPECT_THAT(bench.kernel->flashedFiles,
                testing::ElementsAre(testing::StartsWith("/lib/firmware/quenx/0000:05:00-")));
    EXPECT_THAT(bench.staged(), testing::ElementsAre("0000:06:00-other.bin"));
    EXPECT_EQ(100, ma::getFlashImageUpdateProgress(bench.first));
    EXPECT_EQ(0, ma::getFlashImageUpdateProgress(bench.second));

    std::uint32_t code = 9;
    std::string text = "old";
    EXPECT_TRUE(ma::updateCapabilityWord(bench.first, {}, code, text));
    EXPECT_TRUE(code == 0 && text.empty());
    EXPECT_EQ("1.3.0", storedVersion(bench.first));
    EXPECT_EQ(ma::ResetNeeded::Unknown, ma::getAdapterInfo(bench.first).resetNeeded);
    EXPECT_EQ(0, bench.prepare());
    EXPECT_EQ(0, ma::getFlashImageUpdateProgress(bench.first));
}

TEST(DevlinkFlashTest, TellsWhyAFlashFailedAndLeavesNothingBehind) {
    struct Case {
        std::function<void(test::FakeKernel&, test::FakeDevice&)> spoil;
        std::uint32_t code;
        std::string text;
    };
    const auto failing = [](const char* operation, int error) {
        return [=](test::FakeKernel& kernel, test::FakeDevice&) { kernel.failures[operation] = error; };
    };
    const auto ending = [](int error, const char* text) {
        return [=](test::FakeKernel&, test::FakeDevice& device) {
            device.error = error;
            device.errorText = text;
        };
    };
    const std::vector<Case> cases = {
        {ending(EIO, "erasing bank 1 failed"), EIO, "erasing bank 1 failed (Input/output error)"},
        {ending(EIO, ""), EIO, "Input/output error; the driver's last words were: Flashing done"},
        {ending(ENOENT, "failed to locate the requested firmware file"), ENOENT, "outside a container"},
        {[](auto& kernel, auto&) { kernel.isPermitted = false; }, EPERM, "run it as root"},
        {[](auto& kernel, auto&) { kernel.devices.erase("0000:05:00.0"); }, ENODEV, "The device is gone"},
        {[](auto& kernel, auto&) { kernel.hasDevlink = false; }, ENODEV, "no devlink"},
        {[](auto& kernel, auto&) { kernel.readOnly.insert("/lib/firmware"); }, EACCES, "/lib/firmware"},
        {failing("makeFolder", EROFS), ma::WriteError::DeviceFailed, "makeFolder: Read-only file system"},
        {failing("lock", EACCES), ma::WriteError::DeviceFailed, "lock: Permission denied"},
        {failing("createFile", EROFS), EROFS, "createFile: Read-only file system"},
        {failing("writeFile", ENOSPC), ENOSPC, "writeFile: No space left on device"},
        {failing("syncFile", EIO), EIO, "syncFile: Input/output error"},
        {failing("openNetlink", EMFILE), EMFILE, "openNetlink: Too many open files"},
        {failing("joinGroup", EPERM), EPERM, "joinGroup: Operation not permitted"},
        {failing("send", ENOBUFS), ENOBUFS, "send: No buffer space available"},
    };
    for (const Case& each : cases) {
        const test::DevlinkBench bench;
        ASSERT_EQ(0, bench.prepare());
        const auto devices = bench.kernel->devices;
        each.spoil(*bench.kernel, bench.device());
        const test::WriteResult result = bench.write();
        EXPECT_FALSE(result.done) << each.text;
        EXPECT_EQ(each.code, result.code) << each.text;
        EXPECT_THAT(result.text, HasSubstr(each.text));
        EXPECT_THAT(bench.staged(), testing::IsEmpty()) << each.text;
        EXPECT_GT(100, ma::getFlashImageUpdateProgress(bench.first)) << each.text;

        bench.kernel->failures.clear();
        bench.kernel->readOnly.clear();
        bench.kernel->hasDevlink = bench.kernel->isPermitted = true;
        bench.kernel->devices = devices;
        EXPECT_TRUE(bench.write().done) << "nothing is held after: " << each.text;
    }
}

TEST(DevlinkFlashTest, WritesOnlyWhatWasPreparedForTheAdapter) {
    const test::DevlinkBench bench;
    EXPECT_EQ(ma::WriteError::BadImage, bench.write().code);
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
    for (const Case& each : cases) {
        const test::DevlinkBench bench;
        bench.device().stored = each.stored;
        bench.device().storedAfterwards = each.afterwards;
        bench.device().isAcknowledged = false;
        const test::WriteResult result = bench.install();
        EXPECT_EQ(each.done, result.done) << each.text;
        EXPECT_EQ(each.done ? 0 : ETIMEDOUT, static_cast<int>(result.code)) << each.text;
        EXPECT_THAT(result.text, HasSubstr(each.text));
        EXPECT_EQ(each.done, ma::getFlashImageUpdateProgress(bench.first) == 100);
    }
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
            const bool isTold =
                result.text.find("is being written to by this process (") != std::string::npos;
            EXPECT_NE(result.done, isTold) << result.text;
        }
    };
    EXPECT_TRUE(bench.install().done);
    EXPECT_THAT(codes, testing::ElementsAre(ma::WriteError::Busy, ma::WriteError::Busy, 0));
    EXPECT_TRUE(test::writeImage(bench.second, bench.image).done);
}

TEST(DevlinkFlashTest, FlashesComponentsOneAfterTheOther) {
    const test::DevlinkBench bench;
    bench.device().components = {"fw.undi", "fw.uefi"};
    EXPECT_EQ(ma::PrepareStatus::ImageNotApplicable, bench.prepare({PXE, iSCSI}));
    ASSERT_EQ(0, bench.prepare({UEFI, PXE, None, UEFI}));
    std::vector<int> percents;
    bench.device().duringFlash = [&] {
        percents.push_back(waitForProgress(bench.first, bench.kernel->flashed.empty() ? 24 : 74));
    };
    EXPECT_TRUE(bench.write().done);
    EXPECT_THAT(percents, testing::ElementsAre(24, 74));
    EXPECT_THAT(bench.kernel->flashed, testing::ElementsAre("fw.undi:image", "fw.uefi:image"));
    EXPECT_EQ(100, ma::getFlashImageUpdateProgress(bench.first));

    bench.kernel->flashed.clear();
    bench.device().duringFlash = {};
    bench.device().error = EBADMSG;
    EXPECT_EQ(std::uint32_t{EBADMSG}, bench.write().code);
    EXPECT_EQ(1U, bench.kernel->flashed.size()) << "the ones after a failure are not begun";
    EXPECT_GT(100, ma::getFlashImageUpdateProgress(bench.first));
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

TEST(DevlinkFlashTest, MakesOnePercentageOfWhatDriversTell) {
    ma::Progress progress;
    ma::devlink::FlashProgress flash(progress, 2);
    progress.begin();
    const auto after = [&](std::uint64_t done, std::uint64_t total) {
        flash.report({.text = "", .done = done, .total = total, .timeout = 0});
        return progress.percent();
    };
    EXPECT_EQ(0, after(7, 0));
    EXPECT_EQ(24, after(5, 10));
    EXPECT_EQ(24, after(0, 10)) << "the driver's next step";
    EXPECT_EQ(49, after(11, 10)) << "more than there is";
    flash.partDone();
    EXPECT_EQ(50, progress.percent());
    EXPECT_EQ(74, after(UINT64_MAX / 2, UINT64_MAX));
    EXPECT_EQ(99, after(UINT64_MAX, UINT64_MAX));
    flash.partDone();
    EXPECT_EQ(100, progress.percent());
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
        EXPECT_NO_THROW(ma::getAdapterInfo(bench.first));
        EXPECT_EQ(2U, ma::enumerateAdapters().size());
    }
}

}  // namespace
