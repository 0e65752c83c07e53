// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/OwnFiles.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <functional>

#include "Support/TempFolder.h"
#include "Utils/Os/Linux/linux.h"

namespace {

namespace fs = std::filesystem;

constexpr uid_t kStranger = 65534;

class OwnFilesTest : public ::testing::Test {
  protected:
    std::string in(const std::string& name) const { return m_folder / name; }
    static unsigned int modeOf(const std::string& path) {
        struct stat status {};
        return ::lstat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
    }
    /// What the step throws, with F for the folder; empty where it goes well.
    std::string saidBy(const std::function<void()>& step) const {
        std::string said;
        try {
            step();
        } catch (const std::exception& error) {
            said = error.what();
        }
        for (std::size_t at = 0; (at = said.find(m_folder.path())) != std::string::npos;)
            said.replace(at, m_folder.path().size(), "F");
        return said;
    }

    const test::TempFolder m_folder;
};

TEST_F(OwnFilesTest, AreOpenedAloneAndForTheirUserOnly) {
    {
        const os::Descriptor made(os::openOwnFile(in("new"), O_WRONLY, "cannot make"));
        EXPECT_GT(made.number(), STDERR_FILENO);
        EXPECT_NE(::fcntl(made.number(), F_GETFD) & FD_CLOEXEC, 0);
        EXPECT_EQ(modeOf(in("new")), 0600U);
    }
    m_folder.write("known", "content");
    const os::Descriptor known(os::openOwnFile(in("known"), O_RDWR, "cannot open"));
    EXPECT_EQ(os::readUpTo(known, 100), "content");
    fs::create_symlink("known", in("link"));
    fs::create_hard_link(in("new"), in("second"));
    ASSERT_EQ(::mkfifo(in("fifo").c_str(), 0600), 0);
    const auto opening = [&](const std::string& name) {
        return saidBy([&] { ::close(os::openOwnFile(in(name), O_RDWR, "cannot use")); });
    };
    EXPECT_EQ(opening("link"), "cannot use F/link: Too many levels of symbolic links");
    EXPECT_EQ(opening("second"), "cannot use F/second: Too many links");
    EXPECT_EQ(opening("fifo"), "cannot use F/fifo: Invalid argument");
    EXPECT_EQ(opening("none/file"), "cannot use F/none/file: No such file or directory");
    if (::chown(in("known").c_str(), kStranger, 0) != 0) return;  // only root can give files away
    EXPECT_EQ(
        opening("known"),
        "cannot use F/known: it belongs to user 65534, who could exchange it; remove it, or run: chown 0 "
        "F/known");
}

TEST_F(OwnFilesTest, FoldersAreClosedToOthers) {
    os::makeOwnFolder(in("a/b//"));
    EXPECT_EQ(modeOf(in("a/b")), 0700U);
    os::makeOwnFolder(in("a/b"));
    ::chmod(in("a/b").c_str(), 0710);
    const auto making = [&](const std::string& name) { return saidBy([&] { os::makeOwnFolder(in(name)); }); };
    EXPECT_EQ(making("a/b"),
              "cannot use the folder F/a/b: others may look into it; run: chmod 700 F/a/b, or "
              "name another folder");
    EXPECT_TRUE(os::closeFolderToOthers(in("a/b")));
    EXPECT_EQ(modeOf(in("a/b")), 0700U);
    EXPECT_FALSE(os::closeFolderToOthers(in("none")));
    const auto closing = [&](const std::string& name) {
        return saidBy([&] { os::closeFolderToOthers(in(name)); });
    };
    m_folder.write("file", "");
    fs::create_directory_symlink("a", in("link"));
    EXPECT_EQ(making("file"), "cannot use the folder F/file: Not a directory");
    EXPECT_EQ(closing("link"), "cannot use the folder F/link: Not a directory");
    EXPECT_NE(making("file/inside"), "");
    ::chmod(in("a").c_str(), 01777);
    EXPECT_EQ(closing("a/b"), "") << "as in /tmp";
    ::chmod(in("a").c_str(), 0702);
    EXPECT_EQ(closing("a/b"), "cannot use the folder F/a/b: everybody may exchange it; run: chmod o-w F/a");
    ::chmod(in("a").c_str(), 0700);
    if (::chown(in("a").c_str(), kStranger, 0) != 0) return;
    EXPECT_EQ(closing("a/b"),
              "cannot use the folder F/a: it belongs to user 65534, who could exchange it; "
              "remove it, or run: chown 0 F/a");
    EXPECT_EQ(closing("a"), closing("a/b"));
}

TEST_F(OwnFilesTest, LoseTheRightsOfOthersAlone) {
    m_folder.write("file", "");
    ::chmod(in("file").c_str(), 0604);
    const os::Descriptor file(::open(in("file").c_str(), O_RDONLY));
    EXPECT_TRUE(os::closeToOthers(file.number()));
    EXPECT_EQ(modeOf(in("file")), 0600U);
    ::chmod(in("file").c_str(), 0400);
    EXPECT_TRUE(os::closeToOthers(file.number()));
    EXPECT_EQ(modeOf(in("file")), 0400U);
    EXPECT_FALSE(os::closeToOthers(-1));
}

TEST_F(OwnFilesTest, TellWhoElseMayChangeThem) {
    const std::string path = m_folder.write("file", "");
    const os::Descriptor file(::open(path.c_str(), O_RDONLY));
    const auto said = [&] { return os::whoElseMayChange(file, "P"); };
    for (const mode_t harmless : {0644U, 0755U, 0600U}) {
        ::chmod(path.c_str(), harmless);
        EXPECT_EQ(said(), "");
    }
    for (const mode_t open : {0620U, 0602U}) {
        ::chmod(path.c_str(), open);
        EXPECT_EQ(said(), "can be changed by others than its owner; run: chmod go-w P");
    }
    EXPECT_EQ(saidBy([] { os::whoElseMayChange(os::Descriptor(-1), "P"); }),
              "cannot look at P: Bad file descriptor");
    ::chmod(path.c_str(), 0600);
    if (::chown(path.c_str(), kStranger, 0) != 0) return;
    EXPECT_EQ(said(), "belongs to user 65534, who could change it; run: chown root P");
}

TEST_F(OwnFilesTest, AreReadAndWrittenWhole) {
    const std::string content(10'000, 'x');
    os::replaceFile(in("file"), content, 0640);
    EXPECT_EQ(modeOf(in("file")), 0640U);
    const auto read = [&](std::size_t most) {
        return os::readUpTo(os::Descriptor(::open(in("file").c_str(), O_RDONLY)), most);
    };
    EXPECT_EQ(read(20'000), content);
    EXPECT_EQ(read(9'999), content.substr(1));
    EXPECT_EQ(read(0), "");
    os::replaceFile(in("file"), "new", 0600);
    EXPECT_EQ(read(100), "new");
    fs::create_directory(in("folder"));
    EXPECT_EQ(saidBy([&] { os::replaceFile(in("folder"), "x", 0600); }),
              "cannot write F/folder: Is a directory");
    EXPECT_EQ(saidBy([&] { os::replaceFile(in("none/file"), "x", 0600); }),
              "cannot write F/none/file: No such file or directory");
    EXPECT_EQ(std::distance(fs::directory_iterator(m_folder.path()), fs::directory_iterator()), 2)
        << "nothing is left behind";
    EXPECT_EQ(saidBy([&] { os::readUpTo(os::Descriptor(::open(in("folder").c_str(), O_RDONLY)), 1); }),
              "cannot read: Is a directory");
    EXPECT_EQ(saidBy([] { os::writeAll(-1, std::span<const std::uint8_t>(), "cannot write"); }), "");
    const std::uint8_t byte = 0;
    EXPECT_EQ(saidBy([&] { os::writeAll(-1, std::span(&byte, 1), "cannot write"); }),
              "cannot write: Bad file descriptor");
    os::syncFolder(in("folder"));
    EXPECT_EQ(saidBy([&] { os::syncFolder(in("file")); }), "cannot open the folder F/file: Not a directory");
}

}  // namespace
