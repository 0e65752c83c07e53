// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/LocalSocket.h"

#include <gmock/gmock.h>
#include <sys/stat.h>

#include <filesystem>

#include "Host/Server/HttpServer.h"
#include "Host/UnixSocket.h"
#include "Support/TempFolder.h"

namespace {

using host::LocalSocket;

class LocalSocketTest : public ::testing::Test {
  protected:
    static void expectRefusal(const std::string& path, const std::string& reason) {
        EXPECT_THAT([&] { const LocalSocket socket(path); },
                    ::testing::ThrowsMessage<host::ListenError>(::testing::HasSubstr(reason)));
    }

    const test::TempFolder m_folder;
    const std::string m_path = m_folder / "socket";
};

TEST_F(LocalSocketTest, IsItsOwnersAloneAndGoneAtItsEnd) {
    {
        const LocalSocket socket(m_path);
        const os::Descriptor listener(socket.listener());
        struct stat status {};
        ASSERT_EQ(::lstat(m_path.c_str(), &status), 0);
        EXPECT_EQ(status.st_mode, static_cast<mode_t>(S_IFSOCK | 0600));
        expectRefusal(m_path, "another process listens there");
    }
    EXPECT_FALSE(std::filesystem::exists(m_path));
}

TEST_F(LocalSocketTest, ReplacesWhatAKilledDaemonLeftAndNothingElse) {
    { const test::UnixSocket killed(SOCK_STREAM, m_path); }
    {
        const LocalSocket socket(m_path);
        const os::Descriptor listener(socket.listener());
    }
    const test::UnixSocket foreign(SOCK_STREAM, m_path);
    ASSERT_EQ(::listen(foreign.number(), 1), 0);
    expectRefusal(m_path, "another process listens there");
    std::filesystem::rename(m_path, m_folder / "other");
    std::filesystem::create_symlink(m_folder / "other", m_path);
    expectRefusal(m_path, "there is a file that is no socket");
    EXPECT_TRUE(std::filesystem::is_symlink(m_path));
    std::filesystem::remove(m_path);
    m_folder.write("socket", "somebody's file");
    expectRefusal(m_path, "there is a file that is no socket");
    EXPECT_TRUE(std::filesystem::is_regular_file(m_path));
}

TEST_F(LocalSocketTest, StandsWhereNobodyElseCanPutOne) {
    expectRefusal(m_folder / "none/socket", "No such file or directory");
    expectRefusal(m_folder / std::string(120, 'x'), "a socket's path has at most 107 characters");
    ::chmod(m_folder.path().c_str(), 01777);
    expectRefusal(m_path, "others can write to " + m_folder.path());
}

}  // namespace
