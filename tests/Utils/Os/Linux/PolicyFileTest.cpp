// SPDX-License-Identifier: Apache-2.0
// What makes a file bad stands in the session Policy.
#include "Utils/Os/Linux/PolicyFile.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>

#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"

namespace {

using test::SyslogCapture;
using utils::PolicyFile;
using Names = std::vector<std::string>;

TEST(PolicyFileTest, ObeysEachEditFromTheNextDecisionOnAndLogsAMistakeOnce) {
    const test::TempFolder folder;
    const std::string path = folder / "quenx/policy.toml";
    const char* const machines = utils::systemPolicyFile.exchange(path.c_str());
    PolicyFile file;
    EXPECT_FALSE(PolicyFile::isOnMachine() || file.current()->administrators);
    std::filesystem::create_directory(folder / "quenx");
    folder.write("quenx/policy.toml", "administrators = []\n");
    const auto nobody = file.current();
    EXPECT_EQ(file.current(), nobody);  // read, but not anew
    // The same size and, as far as most clocks know, the same moment.
    for (const char* name : {"a", "b"}) {
        folder.write("quenx/policy.toml", "# A comment.\nadministrators = ['" + std::string(name) + "']\n");
        EXPECT_EQ(file.current()->administrators, Names{name});
        EXPECT_EQ(file.current()->administratorsPlace, path + ", line 2");
    }
    EXPECT_EQ(nobody->administrators, Names());
    SyslogCapture::clear();
    for (const char* text : {"a = 1", "a = 1", ""}) {
        folder.write("quenx/policy.toml", text);
        EXPECT_THROW(file.current(), utils::PolicyError);
        EXPECT_NE(file.problem(), "");
    }
    EXPECT_EQ(SyslogCapture::count("The policy cannot be obeyed"), 2U);
    EXPECT_TRUE(PolicyFile::isOnMachine());
    std::filesystem::remove_all(folder / "quenx");
    EXPECT_FALSE(file.current()->administrators);
    utils::systemPolicyFile = machines;
}

TEST(PolicyFileTest, TrustsNothingThatAnotherUserOwns) {
    if (::geteuid() != 0) GTEST_SKIP() << "only root gives files away";
    const test::TempFolder folder;
    PolicyFile file(folder.write("policy.toml", ""));
    const std::string end = " belongs to user 65534, who could change it; run: chown root " + folder.path();
    ASSERT_EQ(::chown((folder / "policy.toml").c_str(), 65534, 0), 0);
    EXPECT_EQ(file.problem(), folder / "policy.toml" + ": it" + end + "/policy.toml");
    ASSERT_EQ(::chown(folder.path().c_str(), 65534, 0), 0);
    EXPECT_EQ(file.problem(), folder / "policy.toml" + ": its folder" + end);
}

}  // namespace
