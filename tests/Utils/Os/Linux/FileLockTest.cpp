// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/FileLock.h"

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <sys/wait.h>

#include <csignal>
#include <filesystem>
#include <system_error>

#include "Support/Program.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/OwnFiles.h"

namespace {

TEST(FileLockTest, TellsWhoHoldsIt) {
    const test::TempFolder folder;
    const std::string path = folder / "lock";
    {
        const os::FileLock held(path);
        EXPECT_TRUE(held.isHeld());
        const std::string space = std::filesystem::read_symlink("/proc/self/ns/pid");
        const std::string self = "process " + std::to_string(::getpid());
        const auto left = test::readTestFile(path);
        const std::string note(left.begin(), left.end());
        EXPECT_TRUE(note.starts_with(std::to_string(::getpid()) + " ") &&
                    note.ends_with(" " + space + " UtilsTest\n"))
            << note;
        EXPECT_EQ(os::FileLock(path).holder(), self + " (UtilsTest)");
        // The number is of a process that began at another time, then of none that the kernel names.
        folder.write("lock", std::to_string(::getpid()) + " 1 " + space + " old\x1b[m\n");
        EXPECT_EQ(os::FileLock(path).holder(), "a child that " + self + " (old[m) left behind");
        for (const std::string& forged : {"1 1 " + space + " init\n", std::string("-1 1 x\n"), self}) {
            folder.write("lock", forged);
            EXPECT_EQ(os::FileLock(path).holder(), self + " (UtilsTest)") << forged;
        }
    }
    EXPECT_TRUE(test::readTestFile(path).empty()) << "nobody holds it any more";

    // Another program's lock, which leaves no number in the file.
    const std::string other = folder.write("other", "");
    {
        const std::string sleep = "echo ready; exec sleep 60";
        test::Program holder({"/usr/bin/flock", "--no-fork", "--shared", other, "/bin/sh", "-c", sleep});
        ASSERT_TRUE(holder.waitFor("ready"));
        const os::FileLock refused(other);
        EXPECT_FALSE(refused.isHeld());
        const std::string begin = "process " + std::to_string(holder.id()) + " (";
        EXPECT_TRUE(refused.holder().starts_with(begin)) << refused.holder();
    }
    // Nor does a child keep what its parent held, and lets go of.
    auto let = std::make_unique<os::FileLock>(other, std::chrono::seconds(30));
    EXPECT_TRUE(let->isHeld());
    const pid_t heir = ::fork();
    if (heir == 0) {
        let.reset();
        for (;;)
            ::pause();
    }
    EXPECT_FALSE(os::FileLock(other).isHeld());
    let.reset();
    EXPECT_TRUE(os::FileLock(other).isHeld());
    ::kill(heir, SIGKILL);
    ::waitpid(heir, nullptr, 0);
}

TEST(FileLockTest, TakesOnlyAFileThatIsItsUsersOwn) {
    const test::TempFolder folder;
    const std::string precious = folder.write("precious", "content");
    std::filesystem::create_symlink(precious, folder / "link");
    std::filesystem::create_symlink(folder / "new", folder / "dangling");
    std::filesystem::create_hard_link(precious, folder / "second-name");
    ASSERT_EQ(::mkfifo((folder / "fifo").c_str(), 0600), 0);
    folder.write("foreign", "");
    const bool isRoot = ::chown((folder / "foreign").c_str(), 1, 1) == 0;
    for (const char* name : {"link", "dangling", "second-name", "fifo", "."})
        EXPECT_THROW(os::FileLock(folder / name), std::system_error) << name;
    const std::string said =
        "foreign: it belongs to user 1, who could exchange it; remove it, or run: chown 0 ";
    if (isRoot) {
        EXPECT_THAT([&] { os::FileLock(folder / "foreign"); },
                    testing::ThrowsMessage<os::ForeignFile>(testing::HasSubstr(said)));
    }
    EXPECT_EQ(test::readTestFile(precious).size(), 7U);
    EXPECT_FALSE(std::filesystem::exists(folder / "new"));
}

}  // namespace
