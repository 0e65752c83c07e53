// SPDX-License-Identifier: Apache-2.0
// The image as a file for the kernel.
#include <gmock/gmock.h>

#include <cerrno>
#include <optional>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Devlink/FakeKernel.h"
#include "MidAPI/Devlink/StagedImage.h"

namespace {

using ma::devlink::StagedImage;
using ::testing::ElementsAre;
using ::testing::HasSubstr;

const std::vector<std::uint8_t> kImage = {1, 2, 3};

std::string refusal(test::FakeKernel& machine, const std::string& configured) {
    try {
        return "chose " + ma::devlink::chooseFirmwareFolder(machine, configured);
    } catch (const ma::AdapterError& error) {
        return error.what();
    }
}

TEST(FirmwareFolderTest, IsTheFirstWritableThatTheKernelSearches) {
    test::FakeKernel machine;
    machine.files = {{"/sys/module/firmware_class/parameters/path", "/srv/firmware"},
                     {"/proc/sys/kernel/osrelease", "6.1.0"}};
    EXPECT_THAT(ma::devlink::firmwareFolders(machine),
                ElementsAre("/srv/firmware", "/lib/firmware/updates/6.1.0", "/lib/firmware/updates",
                            "/lib/firmware/6.1.0", "/lib/firmware"));
    machine.folders = {"/home"};
    EXPECT_THAT(refusal(machine, ""),
                HasSubstr("may not write to any of /srv/firmware, /lib/firmware/updates"));
    machine.folders = {"/lib/firmware", "/lib/firmware/updates", "/home"};
    EXPECT_EQ("chose /lib/firmware/updates", refusal(machine, ""));
    machine.readOnly = {"/lib/firmware/updates/quenx"};
    machine.files["/lib/firmware/updates/quenx/old"] = "";  // the own folder decides where there is one
    EXPECT_EQ("chose /lib/firmware", refusal(machine, ""));
    machine.readOnly = {"/lib/firmware/updates"};
    EXPECT_EQ("chose /lib/firmware/updates", refusal(machine, ""));
    EXPECT_EQ("chose /lib/firmware", refusal(machine, "/lib/firmware"));
    EXPECT_THAT(refusal(machine, "/srv/firmware"), HasSubstr("may not write to /srv/firmware."));
    EXPECT_THAT(refusal(machine, "/home"), HasSubstr("does not look for firmware in /home"));
}

TEST(StagedImageTest, LeavesNothingWhenItCannotBeMade) {
    for (const char* operation : {"makeFolder", "createFile", "writeFile", "syncFile", "syncFolder"}) {
        test::FakeKernel machine;
        machine.failures[operation] = ENOSPC;
        EXPECT_THROW(StagedImage(machine, "/f", "0000:05:00", kImage), std::system_error) << operation;
        EXPECT_TRUE(machine.files.empty()) << operation;
    }
}

TEST(StagedImageTest, HasAFreshNameAndRemovesWhatAnEarlierOneCouldNot) {
    test::FakeKernel machine;
    std::optional<StagedImage> staged(std::in_place, machine, "/f", "0000:05:00", kImage);
    const std::string first = staged->name();
    machine.failures["removeFile"] = EROFS;
    staged.reset();
    EXPECT_EQ(1U, machine.files.size());
    machine.failures.clear();
    staged.emplace(machine, "/f", "0000:05:00", kImage);
    EXPECT_EQ(1U, machine.files.size());
    EXPECT_NE(first, staged->name());
}

}  // namespace
