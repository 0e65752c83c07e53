// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/linux.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <grp.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <chrono>
#include <csignal>
#include <system_error>
#include <thread>

#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"
#include "Utils/Exception.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/PatientReading.h"

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

TEST(LinuxTest, ReadsTextsThatArePlainFiles) {
    const test::TempFolder folder;
    const std::string large(std::size_t{1} << 20, 'x');
    EXPECT_EQ(os::readTextFile(folder.write("large", large)), large);
    EXPECT_EQ(os::readTextFile(folder / "none"), std::nullopt);
    folder.write("larger", large + "x");
    ASSERT_EQ(mkfifo((folder / "fifo").c_str(), 0600), 0);
    for (const auto& each : {std::pair(folder / "larger", "is larger than 1 MiB"),
                             {folder / "fifo", "is not a regular file"},
                             {std::string("/dev/zero"), "is not a regular file"}}) {
        EXPECT_THAT([&] { os::readTextFile(each.first); },
                    testing::ThrowsMessage<os::UnusableFile>(std::string(each.second)));
        EXPECT_EQ(os::isSpecialFile(each.first), !each.first.ends_with("larger"));
    }
    EXPECT_FALSE(os::isSpecialFile(folder.path()) || os::isSpecialFile(folder / "none"));
    EXPECT_TRUE(os::isThisADir(folder.path()));
    EXPECT_FALSE(os::isThisADir(folder / "large"));
    EXPECT_EQ(os::listDirectory(folder.path()), (utils::StringArray{"fifo", "large", "larger"}));
    EXPECT_TRUE(os::listDirectory(folder / "large").empty());
}

TEST(FileSizeTest, SaysWhatIsNoFile) {
    const test::LogLevelGuard guard(0);
    const test::TempFolder folder;
    const auto saidOf = [](const std::string& path) {
        try {
            return std::to_string(os::getFileSize(path));
        } catch (const utils::Exception& error) {
            return std::string(error.what());
        }
    };
    const std::string file = folder.write("file", "12345");
    EXPECT_EQ(saidOf(file), "5");
    EXPECT_EQ(saidOf(folder / "none"), "SMASHv2:Could not open the file " + folder / "none");
    EXPECT_EQ(saidOf(folder.path()), "SMASHv2:The specyfied URI " + folder.path() + " points to a directory");
    EXPECT_EQ(saidOf("/dev/null"), "SMASHv2:Could not open the file /dev/null");
    os::FileLook look;
    look.kind = os::FileKind::Regular;
    look.size = INT32_MAX;
    EXPECT_EQ(os::getFileSize(file, look), INT32_MAX);
    ++look.size;
    EXPECT_THROW(os::getFileSize(file, look), utils::Exception);
    look.kind = os::FileKind::CannotBeLookedAt;
    EXPECT_THAT([&] { os::getFileSize("F", look); },
                testing::ThrowsMessage<utils::Exception>("SMASHv2:Could not get info about the file F"));
    std::array<std::uint8_t, 8> bytes{};
    EXPECT_EQ(os::readFile(file, bytes), 5U);
    EXPECT_EQ(os::readFile(file, std::span(bytes).first(3)), 3U);
    EXPECT_EQ(os::readFile(folder.path(), bytes) + os::readFile("/dev/zero", bytes), 0U);
}

TEST(LinuxTest, CountsTimeInMicroseconds) {
    const std::uint64_t epoch = os::getuSecondsSinceEpoch();
    const std::uint64_t monotonic = os::getMonotonicuSeconds();
    // The clock of time() moves by ticks, and may be behind.
    EXPECT_LE(epoch / 1'000'000, static_cast<std::uint64_t>(time(nullptr)) + 1);
    EXPECT_GE(epoch / 1'000'000 + 100, static_cast<std::uint64_t>(time(nullptr)));
    std::this_thread::sleep_for(std::chrono::milliseconds(2));
    EXPECT_GE(os::getMonotonicuSeconds(), monotonic + 2000);
    EXPECT_GE(os::getuSecondsSinceEpoch() + 1'000'000, epoch);
}
