// SPDX-License-Identifier: Apache-2.0
// The Unix socket of a real quenx-cimd, and who gets in there.
#include <grp.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/un.h>

#include "System/HeldFlash.h"
#include "System/Quenxctl.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"

namespace {

using test::contains;
using test::ProgramResult;

class LocalServerTest : public ::testing::Test {
  protected:
    ProgramResult quenxctl(const std::string& line, const std::string& socket) const {
        std::vector<std::string> words = test::wordsOf(line, m_daemon.image());
        words.insert(words.begin(), QUENXCTL);
        return test::run(words, {"QUENXCTL_SOCKET=" + socket});
    }
    void expect(const std::string& line, int status, const std::string& part) const {
        const ProgramResult result = quenxctl(line, m_socket);
        EXPECT_EQ(result.status, status) << line << result.error;
        EXPECT_TRUE(contains(result.out + result.error, part)) << line << result.out << result.error;
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
    expect("jobs", 0, "Job#1");
    expect("install --server unix:" + m_socket + " --target eth1 IMAGE", 1, "eth0 is being updated");
    held.release();
    EXPECT_EQ(only.finish().status, 0);
    expect("delete 1", 0, "Deleted");
    expect("jobs --server unix:", 0, "There are no jobs.");
    expect("jobs --server unix: --user admin", 2, "--user, --cacert and --insecure cannot be used");
    expect("jobs --server unix:" + m_socket + "2", 4, "There is no socket " + m_socket + "2");
    EXPECT_TRUE(contains(quenxctl("jobs", m_socket + "2").error, "Name the server with --server."));
}

/// The HTTP status that user nobody gets on the socket; 1 when he cannot even connect.
int statusForNobody(const std::string& path) {
    constexpr uid_t nobody = 65534;
    if (::setgroups(0, nullptr) != 0 || ::setgid(nobody) != 0 || ::setuid(nobody) != 0) return 2;
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    path.copy(address.sun_path, sizeof address.sun_path - 1);
    const int socket = ::socket(AF_UNIX, SOCK_STREAM, 0);
    if (::connect(socket, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) return 1;
    const std::string request = test::httpRequest("");
    std::array<char, 64> answer{};
    if (::send(socket, request.data(), request.size(), 0) <= 0) return 3;
    return ::recv(socket, answer.data(), answer.size() - 1, 0) > 0 ? test::statusOf(answer.data()) : 4;
}

TEST_F(LocalServerTest, KeepsOthersOutEvenIfFolderAndModeWereOpen) {
    if (::geteuid() != 0) GTEST_SKIP() << "only root can become somebody else";
    const auto expectForNobody = [&](int status) {
        EXPECT_EXIT(_exit(statusForNobody(m_socket) == status ? 0 : 1), ::testing::ExitedWithCode(0), "");
    };
    expectForNobody(1);
    ::chmod(m_daemon.folder().path().c_str(), 0755);
    expectForNobody(1);
    ::chmod(m_socket.c_str(), 0666);
    expectForNobody(403);
}

}  // namespace
