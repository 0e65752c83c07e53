// SPDX-License-Identifier: Apache-2.0
#include "History/KeptImages.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>

#include "Control/Sha256.h"
#include "History/Place.h"
#include "History/Store.h"
#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TempFolder.h"

namespace {

namespace fs = std::filesystem;

std::string sumOf(const std::string& text) {
    control::Sha256 hash;
    hash.add(text.data(), text.size());
    return hash.take();
}

class KeptImagesTest : public ::testing::Test {
  protected:
    history::Record written(const std::string& text) {
        const std::string path = m_folder.write("image.rom", text);
        history::Record record;
        record.uri = "file://" + path;
        record.sha256 = sumOf(text);
        record.bytes = static_cast<std::int64_t>(text.size());
        return record;
    }
    void keep(const std::string& text, const char* model = "1af4:1041") {
        history::keepImage(m_kept, model, written(text));
        // Files that are written at once may have the same time.
        for (const fs::directory_entry& each : fs::directory_iterator(m_kept))
            fs::last_write_time(each, each.last_write_time() - std::chrono::hours(1));
    }
    std::size_t count() const {
        return static_cast<std::size_t>(
            std::distance(fs::directory_iterator(m_kept), fs::directory_iterator()));
    }
    bool isKept(const std::string& text) const { return fs::exists(m_kept + "/1af4-1041-" + sumOf(text)); }

    const test::TempFolder m_folder;
    const std::string m_kept = m_folder / "kept";
};

TEST_F(KeptImagesTest, KeepsTheTwoNewestOfEachModel) {
    keep("other model", "10ec:8139");
    for (const char* text : {"first", "second", "first", "third"})
        keep(text);
    EXPECT_TRUE(isKept("first") && isKept("third"));
    EXPECT_EQ(count(), 3U);
    struct stat status {};
    ASSERT_EQ(::stat((m_kept + "/1af4-1041-" + sumOf("third")).c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0600U);
    ASSERT_EQ(::stat(m_kept.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0700U);
}

TEST_F(KeptImagesTest, KeepsOnlyWhatWasWritten) {
    const history::Record record = written("first");
    const auto refused = [&](history::Record changed) {
        try {
            history::keepImage(m_kept, "1af4:1041", changed);
        } catch (const std::runtime_error& error) {
            return error.what() == changed.uri + " is no longer the file that was written";
        }
        return false;
    };
    history::Record wrong = record;
    wrong.sha256.clear();
    EXPECT_TRUE(refused(wrong));
    wrong = record;
    wrong.bytes = 4;
    EXPECT_TRUE(refused(wrong));
    wrong = record;
    wrong.uri.replace(0, 4, "http");
    EXPECT_TRUE(refused(wrong));
    written("fjrst");
    EXPECT_TRUE(refused(record));
    EXPECT_FALSE(fs::exists(m_kept));
}

TEST_F(KeptImagesTest, FindsAnImageByItsSumBelowAFolder) {
    fs::create_directories(m_folder / "a/b");
    m_folder.write("a/other", "12345");
    const std::string path = m_folder.write("a/b/image", "first");
    EXPECT_EQ(history::findImage(m_folder / "a", sumOf("first"), 5), path);
    EXPECT_EQ(history::findImage(m_folder / "a", sumOf("first"), 6), std::nullopt);
    EXPECT_EQ(history::findImage(m_folder / "none", sumOf("first"), 5), std::nullopt);
    EXPECT_TRUE(history::hasSum(path, sumOf("first"), 5));
    EXPECT_FALSE(history::hasSum(m_folder / "a", sumOf("first"), 5));
    fs::rename(path, m_folder / "image");
    fs::create_symlink(m_folder / "image", path);
    EXPECT_EQ(history::findImage(m_folder / "a", sumOf("first"), 5), std::nullopt);
}

TEST(HistoryPlaceTest, LiesBesideTheStateUnlessItIsNamed) {
    EXPECT_TRUE(history::isWanted());
    const test::SimulatedAdapters adapters;
    EXPECT_EQ(history::chooseFolder(), adapters.stateDirectory() + ".history");
    ::setenv("QUENX_HISTORY", "", 1);
    EXPECT_TRUE(history::isWanted());
    EXPECT_EQ(history::chooseFolder(), adapters.stateDirectory() + ".history");
    ::setenv("QUENX_HISTORY", "off", 1);
    EXPECT_FALSE(history::isWanted());
    ::setenv("QUENX_HISTORY", "/named", 1);
    EXPECT_TRUE(history::isWanted());
    EXPECT_EQ(history::chooseFolder(), "/named");
    ::unsetenv("QUENX_HISTORY");
}

}  // namespace
