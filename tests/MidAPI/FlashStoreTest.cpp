// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/FlashStore.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <functional>
#include <system_error>

#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TestRoms.h"

namespace {

namespace fs = std::filesystem;
using Bytes = std::vector<std::uint8_t>;
using enum utils::FirmwareType;

class FlashStoreTest : public testing::Test {
  protected:
    std::string path(const std::string& file) const { return m_adapters.stateDirectory() + "/eth0/" + file; }
    void write(const std::string& file, const Bytes& bytes) const {
        m_adapters.folder().write("state/eth0/" + file, std::span(bytes));
    }
    static void writeRevision(std::uint16_t revision) {
        EXPECT_TRUE(test::writeImage("eth0", test::madeRom({{PXE, revision}})).done);
    }
    /// What the adapter boots after its power was off and on.
    std::string afterRestart() {
        m_adapters.restart();
        return test::componentsOf("eth0");
    }
    static bool hasMode(const std::string& file, unsigned int mode) {
        return fs::status(file).permissions() == fs::perms(mode);
    }

    test::SimulatedAdapters m_adapters;
};

TEST_F(FlashStoreTest, BootsTheNewImageWhateverHappensToItsRecord) {
    const test::LogLevelGuard errors(1);
    writeRevision(2);
    writeRevision(3);
    const Bytes record = test::readTestFile(path("state"));
    ASSERT_EQ(record, test::readTestFile(path("state.copy")));
    const fs::path active =
        path(m_adapters->flashState("eth0").activeBank == 0 ? "bank-0.rom" : "bank-1.rom");
    fs::last_write_time(active, fs::last_write_time(active) + std::chrono::seconds(1));

    // No bytes stand for a folder in the file's place.
    std::vector<std::optional<Bytes>> damages{std::nullopt};
    for (std::size_t i = 0; i < record.size(); ++i) {
        damages.emplace_back(Bytes(record.begin(), record.begin() + static_cast<long>(i)));
        damages.emplace_back(record)->at(i) ^= 0x10;
    }
    const auto expectBootsAndSays = [&](const std::string& what) {
        test::SyslogCapture::clear();
        EXPECT_EQ(afterRestart(), "IMG_PXE 3, IMG_UEFI 0");
        EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 3, IMG_UEFI 0");
        EXPECT_EQ(test::SyslogCapture::count(path("state") + what), 1U);
    };
    const std::string isMadeAnew = ", its copy is no better; it is made anew from the banks, and boots ";
    for (const std::optional<Bytes>& damage : damages) {
        std::string said = " is damaged; its copy is used";
        for (const char* file : {"state", "state.copy"}) {
            fs::remove(path(file));
            damage ? write(file, *damage) : static_cast<void>(fs::create_directory(path(file)));
            expectBootsAndSays(said);
            said = " is damaged" + isMadeAnew + active.string();
        }
        for (const char* file : {"state", "state.copy"}) {
            fs::remove(path(file));
            write(file, record);
        }
    }
    fs::remove(path("state"));
    expectBootsAndSays(" is missing; its copy is used");
    fs::remove(path("state.copy"));
    expectBootsAndSays(" is missing" + isMadeAnew + active.string());
}

TEST_F(FlashStoreTest, MendsARecordMadeFromTheBanksAtTheNextChange) {
    for (std::uint16_t revision = 2; revision < 4; ++revision) {
        writeRevision(revision);
        for (const char* file : {"state", "state.copy"})
            write(file, {});
        EXPECT_EQ(m_adapters->flashState("eth0").capabilityWord, 0b11000U);
    }
    // A version that keeps no copy leaves one behind that names what is no longer there.
    writeRevision(4);
    const Bytes stale = test::readTestFile(path("state.copy"));
    writeRevision(5);
    writeRevision(6);
    write("state.copy", stale);
    write("state", {});
    const std::string found = afterRestart();
    EXPECT_TRUE(found == "IMG_PXE 5, IMG_UEFI 0" || found == "IMG_PXE 6, IMG_UEFI 0") << found;
}

TEST_F(FlashStoreTest, DoesNotTrustAnOldRecordThatFitsNoBank) {
    writeRevision(2);
    const Bytes old = test::readTestFile(path("state"));
    for (std::uint16_t revision = 3; revision < 6; ++revision)
        writeRevision(revision);
    write("state", old);
    test::SyslogCapture::clear();
    EXPECT_EQ(afterRestart(), "IMG_PXE 5, IMG_UEFI 0");
    writeRevision(6);
    EXPECT_EQ(test::SyslogCapture::count(path("state") + " fits neither bank; its copy is used"), 1U);
    EXPECT_EQ(afterRestart(), "IMG_PXE 6, IMG_UEFI 0");
}

TEST_F(FlashStoreTest, WritesToNoFileButItsOwn) {
    writeRevision(2);
    const std::string precious = m_adapters.folder().write("precious", "content");
    const std::string other =
        path(m_adapters->flashState("eth0").activeBank == 0 ? "bank-1.rom" : "bank-0.rom");
    const auto write = [] { return test::writeImage("eth0", test::madeRom({{PXE, 3}})).done; };
    fs::remove(other);
    fs::create_hard_link(precious, other);
    EXPECT_FALSE(write());
    EXPECT_EQ(fs::file_size(precious), 7U);
    fs::remove(other);
    ASSERT_EQ(::mkfifo(other.c_str(), 0600), 0);
    EXPECT_FALSE(write());
    fs::remove(other);
    EXPECT_TRUE(write());
}

TEST_F(FlashStoreTest, ReadsAndKeepsTheLayoutOfRecordedFiles) {
    const Bytes recorded = test::readTestFile(QUENX_MIDAPI_TEST_DIR "/samples/record-1");
    const Bytes changed = test::readTestFile(QUENX_MIDAPI_TEST_DIR "/samples/record-1-changed");
    fs::create_directories(path(""));
    write("state", recorded);
    const ma::FlashState state = m_adapters->flashState("eth0");
    EXPECT_EQ(state.activeBank, 1);
    EXPECT_EQ(state.banks[0].length, 2048U);
    EXPECT_EQ(state.banks[0].checksum, 0x40c1830aU);
    EXPECT_EQ(state.banks[1].length, 249344U);
    EXPECT_EQ(state.banks[1].checksum, 0x81de21f3U);
    ASSERT_TRUE(ma::setBootType("eth0", ma::BootType::iSCSI));
    EXPECT_EQ(test::readTestFile(path("state")), changed);
    EXPECT_EQ(test::readTestFile(path("state.copy")), changed);
    EXPECT_EQ(m_adapters->flashState("eth0").bootType, 2U);
}

/// Nobody's patience lasts for half a minute in a test.
class ImpatientFiles : public test::UnsyncedFiles {
  public:
    std::chrono::milliseconds patience() const override { return std::chrono::milliseconds(20); }
};

TEST_F(FlashStoreTest, GivesUpOnARecordThatSomebodyHoldsAndSaysWho) {
    const test::SimulatedAdapters impatient(test::kTestAdapters, std::make_shared<ImpatientFiles>());
    fs::create_directories(impatient.stateDirectory() + "/eth0");
    const os::FileLock held(impatient.stateDirectory() + "/eth0/state.lock");
    const test::WriteResult result = test::writeImage("eth0", test::madeRom({{PXE, 2}}));
    EXPECT_EQ(result.code, ma::WriteError::Busy);
    const std::string holder = "process " + std::to_string(::getpid()) + " (MidApiSimulator)";
    EXPECT_TRUE(result.text.starts_with(holder + " holds " + impatient.stateDirectory())) << result.text;
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 1, IMG_UEFI 0");
    EXPECT_TRUE(test::writeImage("eth1", test::madeRom({{PXE, 2}})).done) << "another adapter is free";
}

TEST_F(FlashStoreTest, ClosesItsFilesToOtherUsers) {
    writeRevision(2);
    EXPECT_TRUE(hasMode(path(""), 0700));
    for (const char* file : {"state", "state.copy", "state.lock", "flash.lock", "bank-0.rom", "bank-1.rom"})
        EXPECT_TRUE(hasMode(path(file), 0600)) << file;
    // As an older version has left them.
    fs::permissions(path(""), fs::perms(0755));
    fs::permissions(path("state.lock"), fs::perms(0644));
    writeRevision(3);
    EXPECT_TRUE(hasMode(path(""), 0700) && hasMode(path("state.lock"), 0600));

    // Whoever owns the folder around it, or may write there, could exchange it.
    const std::string around = m_adapters.stateDirectory();
    const auto isWritten = [] { return test::writeImage("eth0", test::madeRom({{PXE, 3}})).done; };
    ASSERT_EQ(::chmod(around.c_str(), 0777), 0);
    EXPECT_FALSE(isWritten());
    ASSERT_EQ(::chmod(around.c_str(), 01777), 0);
    EXPECT_TRUE(isWritten());
    if (::chown(around.c_str(), 1, 1) == 0) {
        EXPECT_FALSE(isWritten());
        ASSERT_EQ(::chown(around.c_str(), 0, 0), 0);
    }

    fs::rename(path(""), m_adapters.folder() / "elsewhere");
    fs::create_symlink(m_adapters.folder() / "elsewhere", m_adapters.stateDirectory() + "/eth0");
    EXPECT_EQ(test::writeImage("eth0", test::madeRom({{PXE, 4}})).code, ma::WriteError::DeviceFailed);
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 3, IMG_UEFI 0");
}

TEST(FlashFilesTest, SayWhatTheyCannotDo) {
    const test::TempFolder folder;
    ma::FlashFiles files;
    const auto saidBy = [](const std::function<void()>& step) {
        try {
            step();
        } catch (const std::system_error& error) {
            return std::string(error.what());
        }
        return std::string();
    };
    const std::string none = folder / "none/it";
    EXPECT_EQ(saidBy([&] { files.makeFolder(none); }),
              "cannot make the folder " + none + ": No such file or directory");
    EXPECT_EQ(saidBy([&] { files.makeFolder(folder.path()); }), "") << "it is there";
    EXPECT_EQ(saidBy([&] { files.create(none); }),
              "cannot write the file " + none + ": No such file or directory");
    const Bytes bytes(1);
    EXPECT_EQ(saidBy([&] { files.write(-1, bytes); }), "cannot write to the flash: Bad file descriptor");
    EXPECT_EQ(saidBy([&] { files.sync(-1); }), "cannot bring the flash to the medium: Bad file descriptor");
    EXPECT_EQ(saidBy([&] { files.rename(none, folder / "x"); }),
              "cannot rename " + none + ": No such file or directory");
    folder.write("file", "long");
    ::close(files.create(folder / "file"));
    EXPECT_EQ(fs::file_size(folder / "file"), 0U);
}

}  // namespace
