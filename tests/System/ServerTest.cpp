// SPDX-License-Identifier: Apache-2.0
// quenxctl on a server: the same verbs over CIM-XML, against a real quenx-cimd.
#include <gtest/gtest.h>

#include <algorithm>
#include <nlohmann/json.hpp>
#include <sstream>

#include "System/HeldFlash.h"
#include "System/RunningDaemon.h"

namespace {

using test::contains;
using test::Program;
using test::ProgramResult;

class Server : public ::testing::Test {
  protected:
    std::vector<std::string> command(std::vector<std::string> arguments) const {
        const std::string url = "https://127.0.0.1:" + std::to_string(daemon_.httpsPort());
        arguments.insert(arguments.begin(), {QUENXCTL, "--server", url, "--user", "admin"});
        return arguments;
    }
    /// With the daemon's own certificate as the one to trust.
    ProgramResult quenxctl(std::vector<std::string> arguments, const std::string& password = "admin") const {
        arguments.insert(arguments.end(), {"--cacert", daemon_.folder() / "cert.pem"});
        return test::run(command(std::move(arguments)), {"QUENXCTL_PASSWORD=" + password});
    }

    test::RunningDaemon daemon_;
    const std::string& image_ = daemon_.image();
};

TEST_F(Server, UpdatesAndKeepsTheJob) {
    const ProgramResult result = quenxctl({"install", "--target", "eth0", image_});
    EXPECT_EQ(result.status, 0) << result.error;
    EXPECT_TRUE(contains(result.out, "eth0 was updated.\n  IMG_PXE   1 -> 2\n")) << result.out;
    EXPECT_EQ(quenxctl({"install", "--target", "eth0", image_}).status, 3);
    const ProgramResult refused = quenxctl({"install", "--target", "eth3", image_});
    EXPECT_EQ(refused.status, 1);
    EXPECT_TRUE(contains(refused.error, "The firmware of eth3 cannot be updated.")) << refused.error;

    const auto jobs = nlohmann::json::parse(quenxctl({"jobs", "--json"}).out)["jobs"];
    ASSERT_EQ(jobs.size(), 1U);
    EXPECT_EQ(jobs[0]["state"], 7);
    EXPECT_EQ(jobs[0]["adapter"], "eth0");
    EXPECT_EQ(jobs[0]["user"], nullptr);
    const std::string day = jobs[0].value("startTime", "none").substr(0, 4);
    const std::string table = quenxctl({"jobs"}).out;
    EXPECT_TRUE(contains(table, "Job#1  eth0     Completed  100      " + day + "-")) << table;
    // A server checks by identity only.
    const ProgramResult check = quenxctl({"check", "--target", "eth0", image_});
    EXPECT_EQ(check.status, 4);
    EXPECT_TRUE(contains(check.error, "The service's inventory does not have " + image_)) << check.error;
    EXPECT_EQ(quenxctl({"check", "--target", "eth0", image_, "--force"}).status, 2);
    EXPECT_EQ(quenxctl({"delete", "0"}).status, 4);
    EXPECT_EQ(quenxctl({"delete", "1"}).status, 0);
    EXPECT_EQ(quenxctl({"delete", jobs[0]["id"]}).status, 4);
    EXPECT_TRUE(nlohmann::json::parse(quenxctl({"jobs", "--json"}).out)["jobs"].empty());
}

TEST_F(Server, SaysWhoHoldsTheAdapters) {
    const std::string flash = daemon_.folder() / "state/eth0";
    test::HeldFlash held(flash);
    std::vector<std::string> install = {"install", "--target", "eth0",
                                        image_,    "--cacert", daemon_.folder() / "cert.pem"};
    Program first(command(install), Program::Output::Pipes, {"QUENXCTL_PASSWORD=admin"});
    ASSERT_TRUE(held.isWaitedFor());
    const auto expectRefusal = [&](const std::string& adapter, const std::string& part) {
        const std::string error = quenxctl({"install", "--target", adapter, image_}).error;
        EXPECT_TRUE(contains(error, part)) << error;
    };
    expectRefusal("eth0", "eth0 is being updated (Quenx:FirmwareUpdate@Job#1, ");
    expectRefusal("eth1", "eth0 is being updated (Quenx:FirmwareUpdate@Job#1, ");
    const std::string deleted = quenxctl({"delete", "Quenx:FirmwareUpdate@Job#1"}).out;
    EXPECT_TRUE(contains(deleted, "Its update continues, but can no longer be followed")) << deleted;
    EXPECT_TRUE(contains(first.finish().error, "it was deleted"));
    expectRefusal("eth0",
                  "The server refuses eth0, although no job is running: an earlier check may hold it, or ");
    expectRefusal("eth1", "or another adapter than eth1 is in use: an earlier check may hold it, or ");
}

/// The lines in an order that says nothing.
std::vector<std::string> comparable(const std::string& text) {
    std::istringstream stream(text);
    std::vector<std::string> lines;
    for (std::string line; std::getline(stream, line);)
        lines.push_back(line);
    std::sort(lines.begin(), lines.end());
    return lines;
}

TEST_F(Server, ShowsTheSameModelAsInProcess) {
    const auto inProcess = [&](std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), {QUENXCTL, "--adapters", daemon_.folder() / "adapters.toml",
                                             "--config", daemon_.folder() / "provider.conf"});
        return test::run(arguments).out;
    };
    const std::string names = inProcess({"instances", "Quenx_EthernetPort", "--names"});
    const std::string port = names.substr(0, names.find('\n'));
    for (const std::vector<std::string>& arguments :
         {std::vector<std::string>{"adapters"},
          {"identities"},
          {"mof"},
          {"instances", "CIM_ManagedElement"},
          {"associators", port, "--result-class", "Quenx_SoftwareIdentity"},
          {"associators", port, "--role", "Dependent", "--class", "Quenx_ElementSoftwareIdentity"}}) {
        const std::string expected = inProcess(arguments);
        EXPECT_NE(expected, "") << arguments[0];
        EXPECT_EQ(comparable(quenxctl(arguments).out), comparable(expected)) << arguments[0];
    }
    const ProgramResult unknown = quenxctl({"instances", "No_<&>\"Such"});
    EXPECT_EQ(unknown.status, 4);
    EXPECT_TRUE(contains(unknown.error, "No_<&>\"Such")) << unknown.error;
}

TEST_F(Server, RefusesWhomItCannotTrust) {
    const ProgramResult unknown = test::run(command({"adapters"}), {"QUENXCTL_PASSWORD=admin"});
    EXPECT_EQ(unknown.status, 1);
    EXPECT_TRUE(contains(unknown.error, "with --cacert.")) << unknown.error;
    const ProgramResult loud = test::run(command({"adapters", "--insecure"}), {"QUENXCTL_PASSWORD=admin"});
    EXPECT_EQ(loud.status, 0);
    EXPECT_TRUE(contains(loud.error, "WARNING: --insecure")) << loud.error;
    const ProgramResult wrong = quenxctl({"adapters"}, "guess");
    EXPECT_EQ(wrong.status, 1);
    EXPECT_TRUE(contains(wrong.error, "does not accept the user name and password.")) << wrong.error;
    const std::string mistaken = "http://127.0.0.1:" + std::to_string(daemon_.httpsPort());
    const ProgramResult plain = test::run({QUENXCTL, "--server", mistaken, "adapters"},
                                          {"QUENXCTL_USER=admin", "QUENXCTL_PASSWORD=admin"});
    EXPECT_TRUE(contains(plain.error, "try https:// in --server.")) << plain.error;
    // No other host than this one, and nobody who would answer.
    const ProgramResult clear = test::run(
        {QUENXCTL, "--server", "http://0.0.0.0:1", "--user", "a", "adapters"}, {"QUENXCTL_PASSWORD=a"});
    EXPECT_TRUE(contains(clear.error, "WARNING: http:// sends the password and everything else unencrypted."))
        << clear.error;
}

TEST_F(Server, AsksForThePasswordWithoutShowingIt) {
    Program program(command({"adapters", "--cacert", daemon_.folder() / "cert.pem"}),
                    Program::Output::Terminal, {"QUENXCTL_PASSWORD"});
    ASSERT_TRUE(program.waitFor("Password for admin: "));
    program.type("admin\n");
    const ProgramResult result = program.finish();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_FALSE(contains(result.out, "Password for admin: admin")) << result.out;

    std::vector<std::string> ended = command({"adapters"});
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
