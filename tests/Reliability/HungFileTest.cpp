// SPDX-License-Identifier: Apache-2.0
// The file system of the image stops answering.
#include <atomic>
#include <filesystem>
#include <thread>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Utils/Os/Linux/PatientReading.h"

namespace {

/// Counts the accesses to the image, and holds the one with a chosen number.
class HungFileTest : public test::UpdateTest {
  protected:
    HungFileTest() {
        m_path = m_uri.substr(std::string("file://").size());
        m_accesses = 0;
        os::beforeFileAccess = [](const std::string& path) {
            if (path != m_path) return;
            const int number = ++m_accesses;
            m_held.wait(number);
        };
    }
    ~HungFileTest() override { os::beforeFileAccess = nullptr; }

    /// Lets the file system answer, and waits until it has.
    void answer() const {
        m_held = 0;
        m_held.notify_all();
        while (install(m_uri, "eth0").returnValue != 4096U)
            std::this_thread::yield();
        deleteJobs();
    }

    const std::string m_uri = goodImage();
    static inline std::string m_path;
    static inline std::atomic<int> m_accesses{0};
    static inline std::atomic<int> m_held{0};
};

TEST_F(HungFileTest, EndsTheUpdateAsAReadErrorAndLetsOthersGoOn) {
    m_folder.write("quenx.conf", "ImageReadTimeout=1\n");
    // The look at it, the opening, the reading.
    for (const int held : {1, 2, 3}) {
        SCOPED_TRACE(held);
        m_accesses = 0;
        m_held = held;
        test::SyslogCapture::clear();
        EXPECT_EQ(install(m_uri, "eth0").returnValue, 2U);
        EXPECT_TRUE(test::SyslogCapture::says("Image read error: " + m_uri + " (" + m_path + ")"));
        EXPECT_TRUE(test::SyslogCapture::says(
            "is not read: its file system did not answer for 1 seconds, now or earlier"));
        EXPECT_EQ(claim(), "");
        // Nobody asks again, by whatever name, while the first one hangs.
        EXPECT_EQ(install("file:///." + m_path, "eth0").returnValue, 2U);
        EXPECT_EQ(m_accesses, held);
        EXPECT_EQ(install(file("other.rom", test::readTestFile(m_path)), "eth0").returnValue, 4096U);
        deleteJobs();

        answer();
        test::count("images on a file system that hung");
    }
}

TEST_F(HungFileTest, KnowsOneFileFromAnotherBehindALink) {
    m_folder.write("quenx.conf", "ImageReadTimeout=1\n");
    std::filesystem::create_directories(m_folder / "away/below");
    std::filesystem::create_directory_symlink("away/below", m_folder / "link");
    const std::string name = std::filesystem::path(m_path).filename();
    m_folder.write("away/" + name, test::readTestFile(m_path));
    m_held = 1;
    EXPECT_EQ(install(m_uri, "eth0").returnValue, 2U);
    EXPECT_EQ(install("file://" + (m_folder / "link/../") + name, "eth0").returnValue, 4096U);
    answer();
}

TEST_F(HungFileTest, ReadsNoImageThatIsLargerThanAllowed) {
    const std::string length = std::to_string(test::readTestFile(m_path).size());
    m_folder.write("quenx.conf", "LargestImage=512\n");
    EXPECT_EQ(install(m_uri, "eth0").returnValue, 2U);
    EXPECT_EQ(m_accesses, 2) << "it was read";
    EXPECT_EQ(claim(), "");
    EXPECT_TRUE(test::SyslogCapture::says(m_path + " has " + length +
                                          " bytes, more than the 512 that LargestImage allows"));
    m_folder.write("quenx.conf", "LargestImage=" + length + "\n");
    EXPECT_EQ(install(m_uri, "eth0").returnValue, 4096U);
}

TEST(PatienceTest, IsNotUsedUpByAMediumThatIsSlowButAnswers) {
    const test::TempFolder folder;
    const std::string path = folder.write("slow", std::string(2 * 64 * 1024, 'x'));
    static std::atomic<int> accesses;
    accesses = 0;
    os::beforeFileAccess = [](const std::string&) {
        if (++accesses == 3) std::this_thread::sleep_for(std::chrono::milliseconds(1100));
    };
    os::Patience patience;
    EXPECT_EQ(os::lookAtFile(path, INT32_MAX, patience).value().count, 2U * 64 * 1024);
    EXPECT_EQ(accesses, 2 + 1 + 16) << "the rest in pages, of which each is an answer";
    os::beforeFileAccess = nullptr;
}

TEST(PatienceTest, EndsWhenManySilencesTogetherAreTooLong) {
    const test::TempFolder folder;
    const std::string path = folder.write("slow", std::string(20 * 64 * 1024, 'x'));
    os::beforeFileAccess = [](const std::string&) {
        std::this_thread::sleep_for(std::chrono::milliseconds(1100));
    };
    os::Patience patience(std::chrono::seconds(2));
    EXPECT_FALSE(os::lookAtFile(path, INT32_MAX, patience));
    EXPECT_TRUE(patience.isUsedUp);
    os::beforeFileAccess = nullptr;
    os::Patience fresh;
    while (!os::lookAtFile(path, -1, fresh))
        std::this_thread::yield();
}

}  // namespace
