// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <filesystem>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"
#include "Utils/Uri.h"

namespace {

namespace fs = std::filesystem;
using Rows = std::vector<std::string>;

/// Two firmware directories, and adapters that carry nothing.
class FirmwareTest : public test::UpdateTest {
  protected:
    FirmwareTest() {
        fs::create_directory(m_folder / "a");
        fs::create_directory(m_folder / "b");
        m_folder.write("quenx.conf", "FWFilePath=" + (m_folder / "a") + ";" + (m_folder / "b") + "\n");
    }

    static std::vector<std::uint8_t> rom(std::uint32_t version) {
        return test::madeRom({{utils::FirmwareType::PXE, version}, {utils::FirmwareType::UEFI, 0}});
    }

    Rows images() const { return table("Quenx_SoftwareIdentity", {"ElementName"}); }
    /// The files' names.
    Rows files() const { return table("Quenx_SoftwareIdentityResource", {"ElementName"}); }

    const test::SimulatedAdapters m_none{""};
};

TEST_F(FirmwareTest, ComesAndGoesWithItsFile) {
    m_folder.write("a/one.rom", rom(1));
    EXPECT_EQ(images(), Rows{"1af4:1041 IMG_PXE 1, IMG_UEFI 0"});
    const auto path = m_requests.enumerateInstanceNames("Quenx_SoftwareIdentity").front();
    EXPECT_TRUE(m_requests.getInstance(path).path.isSameObjectAs(path));

    // The same firmware is served once, wherever its files are.
    const std::string copy = m_folder.write("b/a copy::.rom", rom(1));
    EXPECT_EQ(images().size(), 1U);
    const std::string uri = table("Quenx_SoftwareIdentityResource", {"AccessInfo"}).at(1);
    EXPECT_EQ(utils::Uri(uri).getSourcePath(), copy);
    fs::remove(copy);

    m_folder.write("b/two.rom", rom(2));
    EXPECT_EQ(files(), (Rows{"one.rom", "two.rom"}));
    // As an update of a file is usually done: same name and size, other content.
    m_folder.write("a/new", rom(3));
    fs::rename(m_folder / "a/new", m_folder / "a/one.rom");
    EXPECT_EQ(images(), (Rows{"1af4:1041 IMG_PXE 3, IMG_UEFI 0", "1af4:1041 IMG_PXE 2, IMG_UEFI 0"}));
    EXPECT_THROW(m_requests.getInstance(path), core::CimError);

    m_folder.write("quenx.conf", "FWFilePath=" + (m_folder / "b") + "\n");
    EXPECT_EQ(files(), Rows{"two.rom"});
    fs::remove(m_folder / "b/two.rom");
    EXPECT_EQ(files(), Rows{});
    m_folder.write("b/efi-virtio.rom", test::realRom("efi-virtio"));
    EXPECT_EQ(table("Quenx_SoftwareIdentity", {"ElementName", "Manufacturer", "Name"}),
              Rows{"1af4:1041 IMG_PXE 1, IMG_UEFI 0; http://ipxe.org; iPXE"});
}

TEST_F(FirmwareTest, IsSeenHoweverItsFileChanges) {
    // Three files: one in its place, one that a link leads to, and one with a name in another directory.
    const std::vector<std::string> written{"a/one.rom", "beyond the link.rom", "second name.rom"};
    for (const std::string& file : written)
        m_folder.write(file, rom(1));
    fs::create_symlink(m_folder / written[1], m_folder / "a/three.rom");
    fs::create_hard_link(m_folder / written[2], m_folder / "a/two.rom");
    const auto versions = [this] { return table("Quenx_SoftwareIdentity", {"MajorVersion"}); };
    EXPECT_EQ(versions(), Rows{"1"}) << "equal files are one firmware";
    for (std::uint32_t round = 0; round < 2; ++round) {
        for (std::uint32_t version = 2; const std::string& file : written) {
            // In its place, with the size and the time that it had.
            const auto time = fs::last_write_time(m_folder / file);
            m_folder.write(file, rom(version * 10 + round));
            fs::last_write_time(m_folder / file, time);
            const std::string text = std::to_string(version * 10 + round);
            const Rows now = versions();
            EXPECT_EQ(std::ranges::count(now, text), 1) << file << " in round " << round;
            ++version;
        }
    }
    EXPECT_EQ(versions(), (Rows{"21", "31", "41"}));

    fs::rename(m_folder / "a", m_folder / "c");
    EXPECT_EQ(versions(), Rows{});
    m_folder.write("c/one.rom", rom(5));
    fs::create_directory_symlink(m_folder / "c", m_folder / "a");
    fs::remove(m_folder / "c/two.rom");
    EXPECT_EQ(versions(), (Rows{"5", "31"}));
}

TEST_F(FirmwareTest, HasTheKindsOfWhatIsInIt) {
    std::vector<std::uint8_t> other = test::madeRom({{utils::FirmwareType::PXE, 1}});
    other.at(other[0x18] + 0x14U) = 1;  // code for Open Firmware, which has no type here
    other.back() -= 1;                  // the sum stays
    m_folder.write("a/other.rom", other);
    m_folder.write("b/both.rom", rom(1));
    EXPECT_EQ(table("Quenx_SoftwareIdentity", {"Classifications"}), (Rows{"10", "10,2,11"}));
}

TEST_F(FirmwareTest, IsReadOncePerChangeAndSkippedWithOneLineWhereBroken) {
    std::vector<std::uint8_t> cut = rom(1);
    cut.resize(cut.size() - 512);
    m_folder.write("a/cut.rom", cut);
    m_folder.write("a/empty.rom", "");
    m_folder.write("a/readme.txt", "Notes on the images here");
    fs::create_symlink(m_folder / "nowhere", m_folder / "a/dangling.rom");
    fs::create_directory(m_folder / "a/subdirectory");
    ASSERT_EQ(mkfifo((m_folder / "a/fifo").c_str(), 0600), 0) << "reading it would never end";
    m_folder.write("a/good.rom", rom(5));
    m_folder.write("b/huge.rom", "\x55\xaa");
    fs::resize_file(m_folder / "b/huge.rom", 3'000'000'000);

    test::SyslogCapture::clear();
    for (int round = 0; round < 3; round++)
        EXPECT_EQ(files(), Rows{"good.rom"});
    EXPECT_EQ(m_log.count("Reading firmware file "), 6U);
    EXPECT_EQ(m_log.count("is skipped: "), 5U);
    for (const char* line :
         {"cut.rom' is skipped: ", "empty.rom' is skipped: it is empty or cannot be read\"",
          "readme.txt' is skipped: it is not an option ROM\"",
          "dangling.rom' is skipped: it is empty or cannot be read\"",
          "huge.rom' is skipped: it is too large for an option ROM\""})
        EXPECT_EQ(m_log.count(line), 1U) << line;

    m_folder.write("a/cut.rom", rom(6));
    m_folder.write("nowhere", rom(7));
    EXPECT_EQ(files(), (Rows{"cut.rom", "dangling.rom", "good.rom"}));
}

}  // namespace
