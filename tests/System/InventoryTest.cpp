// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "System/Quenxctl.h"

namespace {

using ::testing::AllOf;
using ::testing::HasSubstr;

/// Images in a directory that the inventory looks into.
class InventoryTest : public test::Quenxctl {
  protected:
    InventoryTest() {
        std::filesystem::create_directory(m_folder / "firmware");
        m_folder.write("firmware/new.rom", test::readTestFile(m_image));
        m_folder.write("firmware/other.rom", test::realRom("efi-rtl8139"));
        m_folder.write("firmware/broken.rom", "no image");
        m_folder.write("default.conf", "FWFilePath=" + (m_folder / "firmware") + "\n");
    }

    /// The first id with this in it: an image's has the ids of its device, as "1af4-1041".
    std::string idOf(const std::string& part) const {
        const auto document = nlohmann::json::parse(quenxctl("identities --json").out);
        for (const auto& one : document["identities"]) {
            if (test::contains(one["id"], part)) return one["id"];
        }
        return "no id with " + part;
    }
};

TEST_F(InventoryTest, TellsAnOrdinaryUserWhatOnlyRootMaySee) {
    if (::geteuid() != 0) GTEST_SKIP() << "needs root, to become another user";
    EXPECT_EQ(quenxctl("install --target eth0 IMAGE").status, 0);
    std::filesystem::permissions(m_folder.path(), std::filesystem::perms(0755));
    const test::ProgramResult listed = test::run(test::asNobody(command("adapters")));
    EXPECT_EQ(listed.status, 0);
    EXPECT_THAT(listed.error, HasSubstr("The firmware of eth0 cannot be read. Run quenxctl as root, "));
    EXPECT_THAT(listed.out, AllOf(HasSubstr("eth1"), HasSubstr("IMG_PXE 1")));
    const test::ProgramResult checked = test::run(test::asNobody(command("check --target eth0 IMAGE")));
    EXPECT_EQ(checked.status, 1);
    EXPECT_THAT(checked.error, HasSubstr("The firmware of eth0 cannot be read.\nRun quenxctl as root, "));
}

TEST_F(InventoryTest, ChangesNothingByACheckAndInstallsByIdentity) {
    EXPECT_THAT(
        quenxctl("identities").out,
        AllOf(HasSubstr("IMG_PXE 2, IMG_UEFI 2  IMG_PXE,IMG_UEFI  file://"), HasSubstr("/firmware/new.rom"),
              HasSubstr("/firmware/other.rom"), HasSubstr("Firmware of simulated adapter eth0"),
              ::testing::Not(HasSubstr("broken.rom"))));

    const std::string identity = " --target eth0 --identity " + idOf("1af4-1041");
    // A file need not be in the inventory.
    for (const std::string& line : {"check" + identity, std::string("check --target eth0 IMAGE")})
        EXPECT_EQ(quenxctl(line).out, "The image can be installed on eth0 (simulated).\n");
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");
    EXPECT_EQ(quenxctl("install" + identity).status, 0);
    EXPECT_EQ(firmwareOf("eth0"), "IMG_PXE 2, IMG_UEFI 2");
    EXPECT_EQ(quenxctl("check" + identity).status, 3);
    EXPECT_EQ(quenxctl("install" + identity).status, 3);
    EXPECT_EQ(quenxctl("install --force" + identity).status, 0);

    const std::string other = " --target eth0 --identity " + idOf("10ec-8139");
    expectError("check" + other, 1, "is for 10ec:8139, but eth0 is 1af4:1041.");
    expectError("install" + other, 1, "is for 10ec:8139, but eth0 is 1af4:1041.");
    expectError("check --target eth0 --identity none", 4, "There is no software identity \"none\".");
    expectError("check --target eth0 --identity " + idOf("eth0"), 4, "there is no image file of it");
    expectError("check --target eth3 --identity " + idOf("1af4-1041"), 1, "cannot be updated");
    expectError("install --types IMG_PXE" + other, 2, "--identity cannot be used with --types.");
}

TEST_F(InventoryTest, PrintsTheSchemaAsTheSampleHasIt) {
    const auto sample = test::readTestFile(QUENX_SYSTEM_TEST_DIR "/samples/schema.mof");
    EXPECT_EQ(quenxctl("mof").out, std::string(sample.begin(), sample.end()));
}

}  // namespace
