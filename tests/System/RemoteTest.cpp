// SPDX-License-Identifier: Apache-2.0
// quenxctl --server: the same verbs over CIM-XML, against a real quenx-cimd.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <nlohmann/json.hpp>
#include <set>
#include <sstream>

#include "System/HeldFlash.h"
#include "System/Quenxctl.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"

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
        return trustingNobody(line + " --cacert " + (m_daemon.folder() / "cert.pem"));
    }
    std::vector<std::string> trustingNobody(const std::string& line) const {
        const std::string url = "https://127.0.0.1:" + std::to_string(m_daemon.httpsPort());
        return test::withWordsOf(line, m_daemon.image(), {QUENXCTL, "--server", url, "--user", "admin"});
    }

    test::RunningDaemon m_daemon;
    const std::string m_plainUrl = "http://127.0.0.1:" + std::to_string(m_daemon.httpPort());
    const std::string m_flash = m_daemon.folder() / "state/eth0";
};

TEST_F(RemoteTest, UpdatesAndKeepsTheJob) {
    expectOutput(kInstall, "eth0 (simulated) was updated.\n  IMG_PXE   1 -> 2\n");
    EXPECT_EQ(quenxctl(kInstall).status, 3);
    expectError("install --target eth3 IMAGE", 1, "The firmware of eth3 cannot be updated.");

    const auto jobs = nlohmann::json::parse(quenxctl("jobs --json").out)["jobs"];
    ASSERT_EQ(jobs.size(), 1U);
    EXPECT_EQ(jobs[0]["state"], 7);
    EXPECT_EQ(jobs[0]["adapter"], "eth0");
    EXPECT_EQ(jobs[0]["user"], nullptr);
    const std::string day = jobs[0].value("startTime", "none").substr(0, 4);
    expectOutput("jobs", "Job#1  eth0 (simulated)  Completed  100      " + day + "-");
    // A server checks by identity only.
    expectError("check --target eth0 IMAGE", 4, "The service's inventory does not have " + m_daemon.image());
    expectError("check --target eth0 IMAGE --force", 2, "takes neither --types nor --force.");
    EXPECT_EQ(quenxctl("delete 0").status, 4);
    EXPECT_EQ(quenxctl("delete 1").status, 0);
    EXPECT_EQ(quenxctl("delete " + jobs[0].value("id", "")).status, 4);
    EXPECT_TRUE(nlohmann::json::parse(quenxctl("jobs --json").out)["jobs"].empty());
}

TEST_F(RemoteTest, SaysWhoHoldsTheAdapters) {
    test::HeldFlash held(m_flash);
    Program first(command(kInstall));
    ASSERT_TRUE(held.isWaitedFor());
    expectError(kInstall, 1, "eth0 is being updated (Quenx:FirmwareUpdate@Job#1, ");
    expectError("install --target eth1 IMAGE", 1, "eth0 is being updated (Quenx:FirmwareUpdate@Job#1, ");
    expectOutput("delete Quenx:FirmwareUpdate@Job#1", "Its update continues, but can no longer be followed");
    EXPECT_TRUE(contains(first.finish().error, "it was deleted"));
    expectError(kInstall, 1,
                "The server refuses eth0, although no job is running: an earlier check may hold it, or ");
    expectError("install --target eth1 IMAGE", 1,
                "or another adapter than eth1 is in use: an earlier check may hold it, or ");
}

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

/// The lines, whatever their order.
std::multiset<std::string> linesOf(const std::string& text) {
    std::istringstream stream(text);
    std::multiset<std::string> lines;
    for (std::string line; std::getline(stream, line);)
        lines.insert(line);
    return lines;
}

TEST_F(RemoteTest, ShowsTheSameModelAsInProcess) {
    const auto inProcess = [&](const std::string& line) {
        return test::run(test::withWordsOf(line, "",
                                           {QUENXCTL, "--adapters", m_daemon.folder() / "adapters.toml",
                                            "--config", m_daemon.folder() / "provider.conf"}))
            .out;
    };
    const std::string names = inProcess("instances Quenx_EthernetPort --names");
    const std::string port = " " + names.substr(0, names.find('\n'));
    const std::string walk = "associators" + port;
    for (const std::string& line :
         {std::string("adapters"), std::string("identities"), std::string("mof"),
          std::string("instances CIM_ManagedElement"), walk + " --result-class Quenx_SoftwareIdentity",
          walk + " --class Quenx_ElementSoftwareIdentity", walk + " --role Dependent --names",
          walk + " --result-role Antecedent", "references --role Dependent" + port,
          "references --names --class Quenx_ElementSoftwareIdentity" + port}) {
        const std::string expected = inProcess(line);
        EXPECT_NE(expected, "") << line;
        EXPECT_EQ(linesOf(quenxctl(line).out), linesOf(expected)) << line;
    }
    expectError(walk + " --class No_Such", 4, "No class \"No_Such\" is served.");
    expectError("instances No_<&>\"Such", 4, "No_<&>\"Such");
}

TEST_F(RemoteTest, RefusesWhomItCannotTrust) {
    const std::string tlsPort = "http://127.0.0.1:" + std::to_string(m_daemon.httpsPort());
    const std::tuple<std::vector<std::string>, int, const char*> table[] = {
        {trustingNobody("adapters"), 1, "with --cacert."},
        {trustingNobody("adapters --insecure"), 0, "WARNING: --insecure"},
        {{QUENXCTL, "--server", m_plainUrl, "--user", "nobody", "adapters"},
         1,
         "does not accept the user name and password."},
        {{QUENXCTL, "--server", tlsPort, "adapters"}, 1, "try https:// in --server."},
        // No other host than this one, and nobody who would answer.
        {{QUENXCTL, "--server", "http://0.0.0.0:1", "adapters"},
         1,
         "WARNING: http:// sends the password and everything else unencrypted."},
    };
    for (const auto& [command, status, said] : table) {
        const ProgramResult result = test::run(command, {"QUENXCTL_USER=admin"});
        EXPECT_EQ(result.status, status) << said;
        EXPECT_TRUE(contains(result.error, said)) << result.error;
    }
}

TEST_F(RemoteTest, AsksForThePasswordWithoutShowingIt) {
    Program program(command("adapters"), Program::Output::Terminal, {"QUENXCTL_PASSWORD"});
    ASSERT_TRUE(program.waitFor("Password for admin: "));
    program.type("admin\n");
    const ProgramResult result = program.finish();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_FALSE(contains(result.out, "Password for admin: admin")) << result.out;

    const auto inShell = [](const std::string& script, std::vector<std::string> words) {
        words.insert(words.begin(), {"/bin/sh", "-c", script, "sh"});
        return words;
    };
    Program shell(inShell("trap : INT; \"$@\"; stty -a", command("adapters")), Program::Output::Terminal,
                  {"QUENXCTL_PASSWORD"});
    ASSERT_TRUE(shell.waitFor("Password for admin: "));
    shell.type("adm\x03");
    const std::string settings = shell.finish().out;
    EXPECT_TRUE(contains(settings, " echo ")) << settings;

    for (const std::string user : {"admin", ""}) {
        const ProgramResult silent = test::run(
            inShell("\"$@\" </dev/null", {QUENXCTL, "--server", m_plainUrl, "--user", user, "adapters"}),
            {"QUENXCTL_PASSWORD"});
        EXPECT_EQ(silent.status, 2);
        EXPECT_TRUE(contains(silent.error, user.empty() ? "--user or the" : "variable QUENXCTL_PASSWORD"))
            << silent.error;
    }
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
    expectError("jobs --server unix: --user admin", 2, "--user, --cacert and --insecure cannot be used");
    const std::string other = m_socket + "2";
    expectError("jobs --server unix:" + other, 4, "There is no socket " + other);
    EXPECT_TRUE(contains(quenxctl("jobs", {"QUENXCTL_SOCKET=" + other}).error, "with --server."));
}

TEST_F(LocalServerTest, KeepsOthersOutEvenIfFolderAndModeWereOpen) {
    if (::geteuid() != 0) GTEST_SKIP() << "only root can become somebody else";
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
