#include "Utils/Os/Linux/linux.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <numeric>
#include <vector>

#include "Support/ChildProcess.h"
#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"
#include "Utils/Exception.h"

namespace {

std::string sizeOf(const std::string& path) {
    try {
        return std::to_string(os::getFileSize(path));
    } catch (const utils::Exception& failure) {
        return failure.what();
    }
}

std::string couldNotOpen(const std::string& path) {
    return "SMASHv2:Could not open the file " + path;
}

}  // namespace

TEST(FileSize, IsGivenForRegularFilesOnly) {
    const test::TempFolder folder;
    const test::LogLevelGuard guard(2);
    const std::string file = folder.write("file", "12345");
    ASSERT_EQ(symlink(file.c_str(), (folder / "link").c_str()), 0);
    EXPECT_EQ(sizeOf(folder / "link"), "5");
    EXPECT_EQ(test::SyslogCapture::messages(), std::vector<std::string>{"Output size of file: 5"});
    const std::string headExists = file + std::string(1, '\0');
    EXPECT_EQ(sizeOf(headExists), couldNotOpen(file));
    EXPECT_EQ(sizeOf(folder / "missing"), couldNotOpen(folder / "missing"));
    EXPECT_EQ(sizeOf("/dev/null"), couldNotOpen("/dev/null"));
    EXPECT_EQ(sizeOf(folder.path()), "SMASHv2:The specyfied URI " + folder.path() + " points to a directory");
    const std::string fifo = folder / "fifo";
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    EXPECT_EQ(sizeOf(fifo), couldNotOpen(fifo));  // and does not hang
}

TEST(FileSize, LargeFilesAreRefusedWithoutWrapping) {
    const test::TempFolder folder;
    const test::LogLevelGuard guard(0);
    const std::string file = folder.write("sparse", "");
    constexpr std::int64_t largest = 2147483647;
    for (const std::int64_t size : {largest, largest + 1, (std::int64_t{1} << 32) + 5}) {
        ASSERT_EQ(truncate(file.c_str(), static_cast<off_t>(size)), 0);
        EXPECT_EQ(sizeOf(file), size == largest ? std::to_string(size) : couldNotOpen(file));
    }
}

TEST(FileSize, UnreadableFilesAndDescriptorZeroCountAsFailure) {
    const test::TempFolder folder;
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    const std::string secret = folder.write("secret", "x");
    ASSERT_EQ(chmod(secret.c_str(), 0), 0);
    const std::string open = folder.write("open", "x");
    EXPECT_EQ(test::runAsNobody([&]() -> std::string {
                  const test::LogLevelGuard guard(0);
                  if (sizeOf(secret) != couldNotOpen(secret)) return "secret: " + sizeOf(secret);
                  std::uint8_t byte = 0;
                  if (os::readFile(secret, {&byte, 1}) != 0) return "read the secret";
                  if (sizeOf(open) != "1") return "open: " + sizeOf(open);
                  close(0);
                  return sizeOf(open) == couldNotOpen(open) ? "" : "descriptor 0: " + sizeOf(open);
              }),
              "");
}

TEST(ReadFile, ReadsWhatIsThereUpToTheBuffer) {
    const test::TempFolder folder;
    std::vector<std::uint8_t> content(200000);
    std::iota(content.begin(), content.end(), std::uint8_t{0});
    const std::string file = folder.write("file", content);
    std::vector<std::uint8_t> buffer(content.size());
    EXPECT_EQ(os::readFile(file, buffer), content.size());
    EXPECT_EQ(buffer, content);
    EXPECT_EQ(os::readFile(file, std::span(buffer).first(10)), 10U);
    ASSERT_EQ(truncate(file.c_str(), 99), 0);  // it shrank after its size was asked for
    EXPECT_EQ(os::readFile(file, buffer), 99U);
    EXPECT_EQ(os::readFile(folder / "missing", buffer), 0U);
    EXPECT_EQ(os::readFile("/dev/zero", buffer), 0U);
    ASSERT_EQ(mkfifo((folder / "fifo").c_str(), 0600), 0);
    EXPECT_EQ(os::readFile(folder / "fifo", buffer), 0U);
}

TEST(Linux, DirectoriesAndTheHost) {
    const test::TempFolder folder;
    const std::string file = folder.write("b", "");
    folder.write("a", "");
    EXPECT_TRUE(os::isThisADir(folder.path()));
    EXPECT_FALSE(os::isThisADir(file));
    EXPECT_EQ(os::listDirectory(folder.path()), (utils::StringArray{"a", "b"}));
    EXPECT_TRUE(os::listDirectory(file).empty());
    EXPECT_FALSE(os::getHostname().empty());
    for (const std::string& interface : os::getNetworkInterfaceNames()) {
        EXPECT_EQ(access(("/sys/class/net/" + interface).c_str(), F_OK), 0) << interface;
    }
}
