// SPDX-License-Identifier: Apache-2.0
// quenxctl --server: the same verbs over CIM-XML, against a real quenx-cimd.
#include <gtest/gtest.h>

#include <cstdlib>
#include <nlohmann/json.hpp>
#include <set>
#include <sstream>

#include "Cli/Connection/Connection.h"
#include "System/HeldFlash.h"
#include "System/Quenxctl.h"
#include "System/RunningDaemon.h"

namespace {

using test::contains;
using test::Program;
using test::ProgramResult;

class RemoteTest : public ::testing::Test {
  protected:
    std::vector<std::string> command(const std::string& line) const {
        const std::string url = "https://127.0.0.1:" + std::to_string(m_daemon.httpsPort());
        std::vector<std::string> words = test::wordsOf(line, m_daemon.image());
        words.insert(words.begin(), {QUENXCTL, "--server", url, "--user", "admin"});
        return words;
    }
    /// With the daemon's own certificate as the one to trust.
    std::string trusting(const std::string& line) const {
        return line + " --cacert " + (m_daemon.folder() / "cert.pem");
    }
    ProgramResult quenxctl(const std::string& line, const std::string& password = "admin") const {
        return test::run(command(trusting(line)), {"QUENXCTL_PASSWORD=" + password});
    }
    void expectError(const std::string& line, int status, const std::string& part) const {
        const ProgramResult result = quenxctl(line);
        EXPECT_EQ(result.status, status) << line << result.error;
        EXPECT_TRUE(contains(result.error, part)) << line << result.error;
    }

    test::RunningDaemon m_daemon;
};

TEST_F(RemoteTest, UpdatesAndKeepsTheJob) {
    const ProgramResult result = quenxctl("install --target eth0 IMAGE");
    EXPECT_EQ(result.status, 0) << result.error;
    EXPECT_TRUE(contains(result.out, "eth0 was updated.\n  IMG_PXE   1 -> 2\n")) << result.out;
    EXPECT_EQ(quenxctl("install --target eth0 IMAGE").status, 3);
    expectError("install --target eth3 IMAGE", 1, "The firmware of eth3 cannot be updated.");

    const auto jobs = nlohmann::json::parse(quenxctl("jobs --json").out)["jobs"];
    ASSERT_EQ(jobs.size(), 1U);
    EXPECT_EQ(jobs[0]["state"], 7);
    EXPECT_EQ(jobs[0]["adapter"], "eth0");
    EXPECT_EQ(jobs[0]["user"], nullptr);
    const std::string day = jobs[0].value("startTime", "none").substr(0, 4);
    const std::string table = quenxctl("jobs").out;
    EXPECT_TRUE(contains(table, "Job#1  eth0     Completed  100      " + day + "-")) << table;
    // A server checks by identity only.
    expectError("check --target eth0 IMAGE", 4, "The service's inventory does not have " + m_daemon.image());
    expectError("check --target eth0 IMAGE --force", 2, "takes neither --types nor --force.");
    EXPECT_EQ(quenxctl("delete 0").status, 4);
    EXPECT_EQ(quenxctl("delete 1").status, 0);
    EXPECT_EQ(quenxctl("delete " + jobs[0].value("id", "")).status, 4);
    EXPECT_TRUE(nlohmann::json::parse(quenxctl("jobs --json").out)["jobs"].empty());
}

TEST_F(RemoteTest, SaysWhoHoldsTheAdapters) {
    test::HeldFlash held(m_daemon.folder() / "state/eth0");
    Program first(command(trusting("install --target eth0 IMAGE")), Program::Output::Pipes,
                  {"QUENXCTL_PASSWORD=admin"});
    ASSERT_TRUE(held.isWaitedFor());
    expectError("install --target eth0 IMAGE", 1, "eth0 is being updated (Quenx:FirmwareUpdate@Job#1, ");
    expectError("install --target eth1 IMAGE", 1, "eth0 is being updated (Quenx:FirmwareUpdate@Job#1, ");
    const std::string deleted = quenxctl("delete Quenx:FirmwareUpdate@Job#1").out;
    EXPECT_TRUE(contains(deleted, "Its update continues, but can no longer be followed")) << deleted;
    EXPECT_TRUE(contains(first.finish().error, "it was deleted"));
    expectError("install --target eth0 IMAGE", 1,
                "The server refuses eth0, although no job is running: an earlier check may hold it, or ");
    expectError("install --target eth1 IMAGE", 1,
                "or another adapter than eth1 is in use: an earlier check may hold it, or ");
}

TEST_F(RemoteTest, LeavesAnUpdateToTheServerWhenInterrupted) {
    test::HeldFlash held(m_daemon.folder() / "state/eth0");
    Program first(command(trusting("install --target eth0 IMAGE")), Program::Output::Pipes,
                  {"QUENXCTL_PASSWORD=admin"});
    ASSERT_TRUE(first.waitFor("eth0: 0 %"));
    first.send(SIGINT);
    const ProgramResult left = first.finish();
    EXPECT_EQ(left.status, 6);
    EXPECT_EQ(left.error,
              "quenxctl: Interrupted. The update of eth0 goes on on the server.\n"
              "\"quenxctl jobs\" shows how far it is.\n");
    // A server that hangs must not hold its user either.
    m_daemon.program().send(SIGSTOP);
    Program second(command(trusting("install --target eth0 IMAGE")), Program::Output::Terminal,
                   {"QUENXCTL_PASSWORD=admin"});
    std::this_thread::sleep_for(std::chrono::milliseconds(300));
    second.send(SIGTERM);
    const ProgramResult hung = second.finish();
    m_daemon.program().send(SIGCONT);
    // The signal may have come before the program was ready for it.
    if (hung.status != -SIGTERM) {
        EXPECT_EQ(hung.status, 6);
        EXPECT_TRUE(contains(hung.out, "Interrupted before the update began: nothing was changed."))
            << hung.out;
    }
}

/// The lines, whatever their order.
std::multiset<std::string> linesOf(const std::string& text) {
    std::multiset<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);)
        lines.insert(line);
    return lines;
}

TEST_F(RemoteTest, ShowsTheSameModelAsInProcess) {
    const auto inProcess = [&](const std::string& line) {
        std::vector<std::string> words = test::wordsOf(line);
        words.insert(words.begin(), {QUENXCTL, "--adapters", m_daemon.folder() / "adapters.toml", "--config",
                                     m_daemon.folder() / "provider.conf"});
        return test::run(words).out;
    };
    const std::string names = inProcess("instances Quenx_EthernetPort --names");
    const std::string port = names.substr(0, names.find('\n'));
    for (const std::string& line :
         {std::string("adapters"), std::string("identities"), std::string("mof"),
          std::string("instances CIM_ManagedElement"),
          "associators " + port + " --result-class Quenx_SoftwareIdentity",
          "associators " + port + " --role Dependent --class Quenx_ElementSoftwareIdentity"}) {
        const std::string expected = inProcess(line);
        EXPECT_NE(expected, "") << line;
        EXPECT_EQ(linesOf(quenxctl(line).out), linesOf(expected)) << line;
    }
    expectError("associators " + port + " --class No_Such", 4, "No class \"No_Such\" is served.");
    expectError("instances No_<&>\"Such", 4, "No_<&>\"Such");
}

TEST_F(RemoteTest, AnswersOperationsThatNoVerbNeeds) {
    ::setenv("QUENXCTL_PASSWORD", "admin", 1);
    cli::ServerSettings settings;
    settings.url.emplace("http://127.0.0.1:" + std::to_string(m_daemon.httpPort()));
    settings.user = "admin";
    const cli::Connection connection = cli::openServer(settings, [] { return false; });
    core::CimOperations& server = *connection.operations;
    const core::CimPath port = server.enumerateInstanceNames("Quenx_EthernetPort").at(0);
    const core::AssociationFilter byFirmware{"Quenx_ElementSoftwareIdentity", "", "", ""};
    EXPECT_EQ(server.referenceNames(port, byFirmware).size(), 2U);
    const auto links = server.references(port, byFirmware, {{"Antecedent"}});
    ASSERT_EQ(links.size(), 2U);
    EXPECT_EQ(links[0].properties.size(), 1U);
    EXPECT_EQ(server.getInstance(port, {{"Name"}}).properties.size(), 1U);
    EXPECT_EQ(server.getClass("quenx_ethernetport").back()->name, "CIM_ManagedElement");
    EXPECT_TRUE(server.getClass("No_Such").empty());
    EXPECT_EQ(server.enumerateClasses("Quenx_EthernetPort", true).size(), 0U);
    EXPECT_THROW(server.enumerateClasses("No_Such", true), core::CimError);
}

TEST_F(RemoteTest, RefusesWhomItCannotTrust) {
    const auto expect = [](const std::vector<std::string>& command, int status, const std::string& part) {
        const ProgramResult result = test::run(command, {"QUENXCTL_PASSWORD=admin", "QUENXCTL_USER=admin"});
        EXPECT_EQ(result.status, status) << part;
        EXPECT_TRUE(contains(result.error, part)) << result.error;
    };
    expect(command("adapters"), 1, "with --cacert.");
    expect(command("adapters --insecure"), 0, "WARNING: --insecure");
    const std::string plain = "http://127.0.0.1:" + std::to_string(m_daemon.httpPort());
    expect({QUENXCTL, "--server", plain, "--user", "nobody", "adapters"}, 1,
           "does not accept the user name and password.");
    const std::string mistaken = "http://127.0.0.1:" + std::to_string(m_daemon.httpsPort());
    expect({QUENXCTL, "--server", mistaken, "adapters"}, 1, "try https:// in --server.");
    // No other host than this one, and nobody who would answer.
    expect({QUENXCTL, "--server", "http://0.0.0.0:1", "adapters"}, 1,
           "WARNING: http:// sends the password and everything else unencrypted.");
}

TEST_F(RemoteTest, AsksForThePasswordWithoutShowingIt) {
    Program program(command(trusting("adapters")), Program::Output::Terminal, {"QUENXCTL_PASSWORD"});
    ASSERT_TRUE(program.waitFor("Password for admin: "));
    program.type("admin\n");
    const ProgramResult result = program.finish();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_FALSE(contains(result.out, "Password for admin: admin")) << result.out;

    std::vector<std::string> ended = command("adapters");
    ended.insert(ended.begin(), {"/bin/sh", "-c", "trap : INT; \"$@\"; stty -a", "sh"});
    Program shell(ended, Program::Output::Terminal, {"QUENXCTL_PASSWORD"});
    ASSERT_TRUE(shell.waitFor("Password for admin: "));
    shell.type("adm\x03");
    const std::string settings = shell.finish().out;
    EXPECT_TRUE(contains(settings, " echo ")) << settings;

    for (const char* user : {"admin", ""}) {
        const ProgramResult silent =
            test::run({"/bin/sh", "-c", "\"$@\" </dev/null", "sh", QUENXCTL, "--server",
                       "https://127.0.0.1:1", "--user", user, "adapters"},
                      {"QUENXCTL_PASSWORD"});
        EXPECT_EQ(silent.status, 2);
        EXPECT_TRUE(contains(silent.error, *user == '\0' ? "--user or the" : "variable QUENXCTL_PASSWORD"))
            << silent.error;
    }
}

}  // namespace
