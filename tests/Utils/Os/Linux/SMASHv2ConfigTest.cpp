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
    const char* const defaults = "root/cimv2, 300000 ms, 30 s, 0 bytes";
    const std::tuple<const char*, const char*, Lines> table[] = {
        {"namespace=root/x", defaults, {}},
        {"  # Namespace=root/x", defaults, {}},
        {"Namespace=interop", defaults, {}},
        {"\tNamespace==root/x=y z", "root/x, 300000 ms, 30 s, 0 bytes", {"Read NameSpace : root/x"}},
        {"Timeout=0x1F4", "root/cimv2, 500 ms, 30 s, 0 bytes", {"Read LockerTimeout : 500"}},
        {"Timeout 42 43", "root/cimv2, 42 ms, 30 s, 0 bytes", {"Read LockerTimeout : 42"}},
        {"Timeout=0xFFFFFFFF", "root/cimv2, 4294967295 ms, 30 s, 0 bytes", {"Read LockerTimeout : -1"}},
        {"Timeout=", defaults, {"Read LockerTimeout : 300000"}},
        {"Timeout=-1", defaults, {"Read LockerTimeout : 300000"}},
        {"Timeout=2147483648", defaults, {"Read LockerTimeout : 300000"}},
        {"Timeout=0x100000000", defaults, {"Read LockerTimeout : 300000"}},
        {"OEMCustomizeable=4x", defaults, {"Read OEMCustomizeable : 4"}},
        {"OEMCustomizeable=65536", defaults, {}},
        {"ReleaseClaimAfterCheck=1", defaults, {}},
        {"ReleaseClaimAfterCheck=2", defaults, {}},
        {"ImageReadTimeout=86400", "root/cimv2, 300000 ms, 86400 s, 0 bytes", {}},
        {"ImageReadTimeout=0", defaults, {}},
        {"ImageReadTimeout=86401", defaults, {}},
        {"LargestImage=1048576", "root/cimv2, 300000 ms, 30 s, 1048576 bytes", {}},
        {"LargestImage=1M", defaults, {}},
    };
    for (const auto& [line, settings, messages] : table) {
        write(std::string("\n \t\n") + line + "\nUnknown=1\n");
        SMASHv2Config fresh(folder / "conf");
        SyslogCapture::clear();
        fresh.initialize();
        SCOPED_TRACE(line);
        EXPECT_EQ(SyslogCapture::messages(), messages);
        EXPECT_EQ(SyslogCapture::count("(initialize@SMASHv2Config.cpp:"), messages.size());
        const auto [silence, largest] = fresh.getImageLimits();
        EXPECT_EQ(fresh.getNamespace() + ", " + std::to_string(fresh.getLockerTimeout()) + " ms, " +
                      std::to_string(silence.count()) + " s, " + std::to_string(largest) + " bytes",
                  settings);
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
