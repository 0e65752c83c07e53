// SPDX-License-Identifier: Apache-2.0
// The image as a file for the kernel.
#include <gmock/gmock.h>

#include <algorithm>
#include <optional>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Devlink/MachineInMemory.h"
#include "MidAPI/Devlink/StagedImage.h"

namespace {

using ma::devlink::StagedImage;
using ::testing::ElementsAre;
using ::testing::HasSubstr;

const std::vector<std::uint8_t> kImage = {1, 2, 3};

std::string refusal(test::MachineInMemory& machine, const std::string& configured) {
    try {
        return "chose " + ma::devlink::chooseFirmwareFolder(machine, configured);
    } catch (const ma::AdapterError& error) {
        return error.what();
    }
}

TEST(FirmwareFolderTest, IsTheFirstWritableThatTheKernelSearches) {
    test::MachineInMemory machine;
    machine.files = {{"/sys/module/firmware_class/parameters/path", "/srv/firmware"},
                     {"/proc/sys/kernel/osrelease", "6.1.0"}};
    EXPECT_THAT(ma::devlink::firmwareFolders(machine),
                ElementsAre("/srv/firmware", "/lib/firmware/updates/6.1.0", "/lib/firmware/updates",
                            "/lib/firmware/6.1.0", "/lib/firmware"));
    EXPECT_THAT(refusal(machine, ""),
                HasSubstr("may not write to any of /srv/firmware, /lib/firmware/updates"));
    machine.writableFolders = {"/lib/firmware", "/lib/firmware/updates", "/home"};
    EXPECT_EQ("chose /lib/firmware/updates", refusal(machine, ""));
    machine.files["/lib/firmware/updates/quenx/old"] = "";  // the own folder decides where there is one
    EXPECT_EQ("chose /lib/firmware", refusal(machine, ""));
    machine.writableFolders.insert("/lib/firmware/updates/quenx");
    EXPECT_EQ("chose /lib/firmware/updates", refusal(machine, ""));
    EXPECT_EQ("chose /lib/firmware", refusal(machine, "/lib/firmware"));
    EXPECT_THAT(refusal(machine, "/srv/firmware"), HasSubstr("may not write to /srv/firmware."));
    EXPECT_THAT(refusal(machine, "/home"), HasSubstr("does not look for firmware in /home"));
}

TEST(StagedImageTest, IsThereUnderAFreshNameForItsLifeOnly) {
    test::MachineInMemory machine;
    machine.files = {{"/f/quenx/0000:05:00-left", ""}, {"/f/quenx/0000:06:00-other", ""}, {"/f/own", ""}};
    std::string first;
    for (int time = 0; time < 2; ++time) {
        const StagedImage staged(machine, "/f", "0000:05:00", kImage);
        EXPECT_THAT(staged.name(), testing::MatchesRegex("quenx/0000:05:00-[0-9a-f]{32}\\.bin"));
        EXPECT_NE(first, staged.name());
        first = staged.name();
        EXPECT_EQ("\1\2\3", machine.files.at("/f/" + first));
        EXPECT_EQ(3U, machine.files.size());  // what was left of this card has gone, and nothing else
    }
    EXPECT_EQ(2U, machine.files.size());
    const std::string path = "/f/" + first;
    machine.calls.erase(machine.calls.begin(), std::ranges::find(machine.calls, "createFile " + path));
    EXPECT_THAT(machine.calls, ElementsAre("createFile " + path, "writeFile " + path, "syncFile " + path,
                                           "syncFolder /f/quenx", "removeFile " + path));
}

TEST(StagedImageTest, LeavesNothingWhenItCannotBeMade) {
    for (const char* operation : {"makeFolder", "createFile", "writeFile", "syncFile", "syncFolder"}) {
        test::MachineInMemory machine;
        machine.fails = operation;
        EXPECT_THROW(StagedImage(machine, "/f", "0000:05:00", kImage), std::system_error) << operation;
        EXPECT_TRUE(machine.files.empty()) << operation;
    }
}

TEST(StagedImageTest, LeavesAFileThatCannotBeRemovedToTheNextOne) {
    test::MachineInMemory machine;
    std::optional<StagedImage> staged(std::in_place, machine, "/f", "0000:05:00", kImage);
    machine.fails = "removeFile";
    staged.reset();
    EXPECT_EQ(1U, machine.files.size());
    machine.fails = "";
    staged.emplace(machine, "/f", "0000:05:00", kImage);
    EXPECT_EQ(1U, machine.files.size());
}

}  // namespace
