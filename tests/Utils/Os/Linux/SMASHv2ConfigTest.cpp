// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/SMASHv2Config.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"

using test::SyslogCapture;
using utils::SMASHv2Config;
using Lines = std::vector<std::string>;

namespace {

struct SMASHv2ConfigTest : ::testing::Test {
    SMASHv2ConfigTest() { SyslogCapture::clear(); }  // the lines of opening the log and of construction
    void write(const std::string& content) { folder.write("conf", content); }
    test::TempFolder folder;
    SMASHv2Config config{folder / "conf"};
    test::LogLevelGuard guard{2};
};

}  // namespace

TEST_F(SMASHv2ConfigTest, WaitsForNoPipeAndSkipsAByteOrderMark) {
    ASSERT_EQ(mkfifo((folder / "fifo").c_str(), 0600), 0);
    EXPECT_EQ(SMASHv2Config(folder / "fifo").getLockerTimeout(), 300000U);
    write("\xEF\xBB\xBFOEMCustomizeable=5\n");
    EXPECT_FALSE(config.isDowngradeEnabled());
}

TEST_F(SMASHv2ConfigTest, ReadsAndLogsEachLine) {
    for (const Lines& row : test::readTestTable(QUENX_UTILS_SAMPLES "/settings")) {
        write("\n \t\n" + row[0] + "\nUnknown=1\n");
        SMASHv2Config fresh(folder / "conf");
        SyslogCapture::clear();
        fresh.initialize();
        SCOPED_TRACE(row[0]);
        const Lines messages(row.begin() + 2, row.end());
        EXPECT_EQ(SyslogCapture::messages(), messages);
        EXPECT_EQ(SyslogCapture::count("(initialize@SMASHv2Config.cpp:"), messages.size());
        const auto [silence, largest] = fresh.getImageLimits();
        EXPECT_EQ(fresh.getNamespace() + ", " + std::to_string(fresh.getLockerTimeout()) + " ms, " +
                      std::to_string(silence.count()) + " s, " + std::to_string(largest) + " bytes",
                  row[1]);
    }
}

TEST_F(SMASHv2ConfigTest, KeepsTheValueOfARemovedKeyAndTheBanOnDowngrades) {
    EXPECT_TRUE(config.isDowngradeEnabled());  // no file yet
    write("Namespace=root/a\nOEMCustomizeable=5\nReleaseClaimAfterCheck=1\n");
    // A look at what only this system knows is not a look at the rest.
    SyslogCapture::clear();
    EXPECT_TRUE(config.getReleaseClaimAfterCheck());
    EXPECT_EQ(SyslogCapture::messages(), Lines{});
    write("ReleaseClaimAfterCheck=1\n");
    EXPECT_EQ(config.getNamespace(), "root/cimv2");
    write("Namespace=root/a\nOEMCustomizeable=5\n");
    config.initialize();
    write("");
    EXPECT_EQ(config.getNamespace(), "root/a");
    EXPECT_TRUE(config.getReleaseClaimAfterCheck());
    EXPECT_FALSE(config.isDowngradeEnabled());
    write("OEMCustomizeable=4\nReleaseClaimAfterCheck=0\n");
    EXPECT_FALSE(config.isDowngradeEnabled());
    EXPECT_FALSE(config.getReleaseClaimAfterCheck());
    // A folder in its place is as good as no file.
    std::filesystem::remove(folder / "conf");
    mkdir((folder / "conf").c_str(), 0700);
    SyslogCapture::clear();
    EXPECT_FALSE(config.isDowngradeEnabled());
    EXPECT_EQ(SyslogCapture::messages(), Lines{});
}

TEST_F(SMASHv2ConfigTest, BuildsDirectoriesAnewFromEveryLine) {
    const std::string one = folder / "one", two = folder / "two", three = folder / "three";
    for (const std::string& path : {one, two, three})
        ASSERT_EQ(mkdir(path.c_str(), 0700), 0);
    write("FWFilePath= " + one + "/ ; /missing;;  ;" + two + "\n" +  // a blank item and the root are none
          "FWFilePath=/;\t" + three + ";" + one + "/x;" + three + "\n");
    EXPECT_EQ(config.getFirmwareFilesPaths(), (utils::StringArray{one, two, three}));
    EXPECT_EQ(SyslogCapture::messages(),
              (Lines{"Adding path-> " + one, "Adding path-> " + two, "Adding path-> " + three}));
    write("");
    EXPECT_TRUE(config.getFirmwareFilesPaths().empty());
}
