// SPDX-License-Identifier: Apache-2.0
// The Unix socket of a real quenx-cimd, and who gets in there.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>

#include "System/HeldFlash.h"
#include "System/Quenxctl.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"

namespace {

using test::contains;
using test::ProgramResult;

class LocalServerTest : public test::Quenxctl {
  protected:
    LocalServerTest() { ::setenv("QUENXCTL_SOCKET", m_socket.c_str(), 1); }
    std::vector<std::string> command(const std::string& line) const override {
        std::vector<std::string> words = test::wordsOf(line, m_daemon.image());
        words.insert(words.begin(), QUENXCTL);
        return words;
    }

    test::RunningDaemon m_daemon{{"--limits-connections", "1"}};
    const std::string m_socket = m_daemon.folder() / "socket";
};

TEST_F(LocalServerTest, IsThereForRootWhenTheNetworkIsFull) {
    test::HeldFlash held(m_daemon.folder() / "state/eth0");
    const std::string url = "http://127.0.0.1:" + std::to_string(m_daemon.httpPort());
    test::Program only(
        {QUENXCTL, "--server", url, "--user", "admin", "install", "--target", "eth0", m_daemon.image()},
        test::Program::Output::Pipes, {"QUENXCTL_PASSWORD=admin"});
    ASSERT_TRUE(only.waitFor("eth0: 0 %"));
    // The one connection of the network has logged in, and makes room for nobody.
    const test::RawConnection refused(m_daemon.httpPort(), "127.0.0.1");
    refused.send(test::httpRequest(""));
    EXPECT_EQ(refused.receive(), "");
    expectOutput("jobs", "Job#1");
    expectError("install --server unix:" + m_socket + " --target eth1 IMAGE", 1, "eth0 is being updated");
    held.release();
    EXPECT_EQ(only.finish().status, 0);
    expectOutput("delete 1", "Deleted");
    expectOutput("jobs --server unix:", "There are no jobs.");
    expectError("jobs --server unix: --user admin", 2, "--user, --cacert and --insecure cannot be used");
    const std::string other = m_socket + "2";
    expectError("jobs --server unix:" + other, 4, "There is no socket " + other);
    EXPECT_TRUE(contains(quenxctl("jobs", {"QUENXCTL_SOCKET=" + other}).error, "with --server."));
}

TEST_F(LocalServerTest, KeepsOthersOutEvenIfFolderAndModeWereOpen) {
    if (::geteuid() != 0) GTEST_SKIP() << "only root can become somebody else";
    const auto expectForNobody = [&](const std::string& reason) {
        const ProgramResult result = test::run(test::asNobody(command("jobs --server unix:")));
        EXPECT_TRUE(contains(result.error, reason)) << result.error;
    };
    expectForNobody("Only root may use " + m_socket);
    ::chmod(m_daemon.folder().path().c_str(), 0755);
    expectForNobody("Only root may use " + m_socket);
    ::chmod(m_socket.c_str(), 0666);
    expectForNobody("This user may not use the server.");
}

}  // namespace
