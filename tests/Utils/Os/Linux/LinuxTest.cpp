// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/linux.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <grp.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <system_error>
#include <thread>

#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"
#include "Utils/Exception.h"
#include "Utils/Os/Linux/OwnFiles.h"

TEST(FileSizeTest, FailsForUnreadableFilesAndDescriptorZero) {
    const test::TempFolder folder;
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    const std::string secret = folder.write("secret", "x");
    ASSERT_EQ(chmod(secret.c_str(), 0), 0);
    const std::string open = folder.write("open", "x");
    EXPECT_EXIT(
        {
            // Root may read everything.
            constexpr uid_t nobody = 65534;
            if (geteuid() == 0 && (setgroups(0, nullptr) != 0 || setgid(nobody) != 0 || setuid(nobody) != 0))
                _exit(2);
            const test::LogLevelGuard guard(0);
            EXPECT_THROW(os::getFileSize(secret), utils::Exception);
            std::uint8_t byte = 0;
            EXPECT_EQ(os::readFile(secret, {&byte, 1}), 0U);
            EXPECT_EQ(os::getFileSize(open), 1);
            close(0);
            EXPECT_THROW(os::getFileSize(open), utils::Exception);
            _exit(HasFailure() ? 1 : 0);
        },
        testing::ExitedWithCode(0), "");
}

TEST(LinuxTest, KeepsTheNumbersOfClosedStandardStreams) {
    const test::TempFolder folder;
    EXPECT_EXIT(
        {
            const int lowest = dup(0);
            close(lowest);
            for (int number = 0; number <= 2; ++number)
                close(number);
            os::openStandardDescriptors();
            const int next = dup(0);
            close(2);
            const int above = os::openOwnFile(folder / "own", O_WRONLY, "cannot write");
            const bool isFree = fcntl(2, F_GETFD) < 0 && dup(0) == 2;
            _exit(isFree && above > next && next == lowest && write(1, "x", 1) == 1 && write(2, "x", 1) == 1
                      ? 0
                      : 1);
        },
        testing::ExitedWithCode(0), "");
}

TEST(LinuxTest, WaitsForALease) {
    const test::TempFolder folder;
    const std::string file = folder.write("leased", "12345");
    const os::Descriptor holder(open(file.c_str(), O_RDWR));
    signal(SIGIO, SIG_IGN);  // as the holder is told
    if (fcntl(holder.number(), F_SETLEASE, F_WRLCK) != 0) GTEST_SKIP() << "a file system without leases";
    const std::jthread gives([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        fcntl(holder.number(), F_SETLEASE, F_UNLCK);
    });
    EXPECT_EQ(os::readWholeFile(file, 10).value().size(), 5U);
}

TEST(LinuxTest, ReadsWholeFilesUpToALimit) {
    const test::TempFolder folder;
    const std::string large(600 * 1024, 'x');
    const auto sizeRead = [&](const std::string& path, std::size_t most) {
        return os::readWholeFile(path, most).value().size();
    };
    EXPECT_EQ(sizeRead(folder.write("large", large), SIZE_MAX), large.size());
    EXPECT_EQ(sizeRead(folder / "large", 300 * 1024), 300U * 1024);
    EXPECT_EQ(os::readSystemText(folder.write("huge", large + large)).value().size(), 1U << 20);
    EXPECT_GT(sizeRead("/proc/self/status", 4096), 0U) << "a file whose size the system does not tell";
    ASSERT_EQ(mkfifo((folder / "fifo").c_str(), 0600), 0);
    EXPECT_EQ(sizeRead(folder / "fifo", 10), 0U) << "and does not hang";
    EXPECT_EQ(os::readWholeFile(folder / "missing", 10), std::nullopt);
    EXPECT_THAT(
        [&] { os::readWholeFile(folder.path(), 10); },
        testing::ThrowsMessage<std::system_error>("cannot read " + folder.path() + ": Is a directory"));
}
