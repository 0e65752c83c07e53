// SPDX-License-Identifier: Apache-2.0
// quenxctl --server: the same verbs over CIM-XML, against a real quenx-cimd.
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>

#include "System/HeldFlash.h"
#include "System/Quenxctl.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"
#include "Utils/Os/Linux/linux.h"

namespace {

using test::contains;
using test::Program;
using test::ProgramResult;

const std::string kInstall = "install --target eth0 IMAGE";

/// The adapters are the daemon's. Its own certificate is the one to trust.
class RemoteTest : public test::Quenxctl {
  protected:
    RemoteTest() { ::setenv("QUENXCTL_PASSWORD", "admin", 1); }
    std::vector<std::string> command(const std::string& line) const override {
        const std::string url = "https://127.0.0.1:" + std::to_string(m_daemon.httpsPort());
        return test::withWordsOf(
            line, m_daemon.image(),
            {QUENXCTL, "--server", url, "--user", "admin", "--cacert", m_daemon.folder() / "cert.pem"});
    }

    test::RunningDaemon m_daemon;
    const std::string m_flash = m_daemon.folder() / "state/eth0";
};

/// Whether the program comes to handle the signal itself.
bool handles(const Program& program, int signal) {
    for (int round = 0; round < 1000; ++round) {
        std::ifstream status("/proc/" + std::to_string(program.id()) + "/status");
        for (std::string name, value; status >> name && std::getline(status, value);)
            if (name == "SigCgt:" && (std::stoull(value, nullptr, 16) >> (signal - 1) & 1U) != 0) return true;
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    return false;
}

bool hasIpv6Loopback() {
    const os::Descriptor socket(::socket(AF_INET6, SOCK_STREAM | SOCK_CLOEXEC, 0));
    sockaddr_in6 address{};
    address.sin6_family = AF_INET6;
    address.sin6_addr = in6addr_loopback;
    return ::bind(socket.number(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
}

TEST(Ipv6Test, LogsInAndInstallsOverTls) {
    if (!hasIpv6Loopback()) GTEST_SKIP() << "this machine has no IPv6 loopback";
    test::RunningDaemon daemon({"--listen-address", "::1"});
    EXPECT_TRUE(
        contains(daemon.program().seen(), " http://[::1]:" + std::to_string(daemon.httpPort()) + " "));
    const auto quenxctl = [&daemon](const std::string& options, const std::string& password) {
        const std::string server = "--server https://[::1]:" + std::to_string(daemon.httpsPort());
        return test::run(test::withWordsOf(server + " --user admin " + options, daemon.image(), {QUENXCTL}),
                         {"QUENXCTL_PASSWORD=" + password});
    };
    const std::string trusted = "--cacert " + (daemon.folder() / "cert.pem") + " ";
    EXPECT_THAT(quenxctl("adapters", "admin").error, ::testing::HasSubstr("certificate"));
    EXPECT_THAT(quenxctl(trusted + "adapters", "wrong").error, ::testing::HasSubstr("password"));
    const ProgramResult installed = quenxctl(trusted + kInstall, "admin");
    EXPECT_EQ(installed.status, 0) << installed.error;
    EXPECT_THAT(installed.out, ::testing::HasSubstr("eth0 (simulated) was updated."));
}

TEST_F(RemoteTest, LeavesAnUpdateToTheServerWhenInterrupted) {
    test::HeldFlash held(m_flash);
    Program first(command(kInstall));
    ASSERT_TRUE(first.waitFor("eth0: 0 %"));
    first.send(SIGINT);
    const ProgramResult left = first.finish();
    EXPECT_EQ(left.status, 6);
    EXPECT_EQ(left.error,
              "quenxctl: Interrupted. The update of eth0 goes on on the server.\n"
              "\"quenxctl jobs\" shows how far it is.\n");
    // A server that hangs must not hold its user either.
    m_daemon.program().send(SIGSTOP);
    Program second(command(kInstall), Program::Output::Terminal);
    EXPECT_TRUE(handles(second, SIGTERM));
    second.send(SIGTERM);
    const ProgramResult hung = second.finish();
    m_daemon.program().send(SIGCONT);
    EXPECT_EQ(hung.status, 6);
    EXPECT_TRUE(contains(hung.out, "Interrupted before the update began: nothing was changed.")) << hung.out;
}

TEST_F(RemoteTest, FollowsTheUpdateThatALostConnectionHasLeft) {
    test::HeldFlash held(m_flash);
    Program first(command(kInstall));
    ASSERT_TRUE(first.waitFor("eth0: 0 %"));
    first.send(SIGINT);
    EXPECT_EQ(first.finish().status, 6);
    Program second(command("install --match eth0 --follow IMAGE"));
    ASSERT_TRUE(second.waitFor("eth0: 0 %"));
    held.release();
    const ProgramResult followed = second.finish();
    EXPECT_EQ(followed.status, 0) << followed.error;
    EXPECT_TRUE(contains(followed.out, "eth0 (simulated) was updated by an update that ran already."))
        << followed.out;
    EXPECT_FALSE(contains(quenxctl("jobs").out, "Job#2"));
}

TEST_F(RemoteTest, AsksForThePasswordWithoutShowingIt) {
    Program program(command("adapters"), Program::Output::Terminal, {"QUENXCTL_PASSWORD"});
    ASSERT_TRUE(program.waitFor("Password for admin: "));
    program.type("admin\n");
    const ProgramResult result = program.finish();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_FALSE(contains(result.out, "Password for admin: admin")) << result.out;

    std::vector<std::string> words = command("adapters");
    words.insert(words.begin(), {"/bin/sh", "-c", "trap : INT; \"$@\"; stty -a", "sh"});
    Program shell(words, Program::Output::Terminal, {"QUENXCTL_PASSWORD"});
    ASSERT_TRUE(shell.waitFor("Password for admin: "));
    shell.type("adm\x03");
    const std::string settings = shell.finish().out;
    EXPECT_TRUE(contains(settings, " echo ")) << settings;
}

/// By the Unix socket of the daemon, and with one connection for all of the network.
class LocalServerTest : public test::Quenxctl {
  protected:
    LocalServerTest() { ::setenv("QUENXCTL_SOCKET", m_socket.c_str(), 1); }
    std::vector<std::string> command(const std::string& line) const override {
        return test::withWordsOf(line, m_daemon.image(), {QUENXCTL});
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
}

TEST_F(LocalServerTest, KeepsOthersOutEvenIfFolderAndModeWereOpen) {
    if (const std::string why = test::whyNotNobody(); !why.empty()) GTEST_SKIP() << why;
    const auto expectForNobody = [&](const std::string& reason) {
        const test::ProgramResult result = test::run(test::asNobody(command("jobs --server unix:")));
        EXPECT_TRUE(contains(result.error, reason)) << result.error;
    };
    expectForNobody("Only root may use " + m_socket);
    ::chmod(m_daemon.folder().path().c_str(), 0755);
    expectForNobody("Only root may use " + m_socket);
    ::chmod(m_socket.c_str(), 0666);
    expectForNobody("This user may not use the server.");
}

}  // namespace
