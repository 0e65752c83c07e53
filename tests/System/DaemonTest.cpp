// SPDX-License-Identifier: Apache-2.0
// quenx-cimd as a whole, driven by the WBEM client wbemcli.
#include <gmock/gmock.h>

#include <csignal>
#include <filesystem>
#include <thread>

#include "CimXml/WireCheck.h"
#include "Host/UnixSocket.h"
#include "Support/SimulatedAdapters.h"
#include "System/HeldFlash.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"
#include "System/Session.h"

namespace {

using test::contains;
using test::ProgramResult;
using test::RunningDaemon;
using ::testing::AllOf;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::StartsWith;

/// Starts the update of eth0 to a real image and returns the job's path.
std::string startUpdate(const RunningDaemon& daemon) {
    const std::string service = daemon.lines("ein", "Quenx_SoftwareInstallationService").at(0);
    const std::string port = daemon.lines("ein", "Quenx_EthernetPort").at(0);
    const ProgramResult called = daemon.wbemcli(
        "cm", service,
        {"InstallFromURI.URI=\"file://" + daemon.image() + "\",InstallOptions=5,Target=" + port});
    EXPECT_TRUE(contains(called.out, "InstallFromURI: 4096")) << called.out << called.error;
    const std::string job = daemon.lines("ein", "Quenx_ConcreteJob").back();
    EXPECT_TRUE(contains(called.out, job)) << called.out;
    return job;
}

bool reaches(const RunningDaemon& daemon, const std::string& path, const std::string& state) {
    for (int round = 0; round < 300; ++round) {
        if (contains(daemon.lines("gi", path, {"JobState"}).at(0), "JobState=" + state)) return true;
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }
    return false;
}

TEST(DaemonTest, ServesEveryClassToRealAndRecordedClients) {
    RunningDaemon daemon;
    std::size_t instances = 0;
    const std::vector<std::string> classes = daemon.lines("ecn", "");
    EXPECT_GT(classes.size(), 10U);
    for (const std::string& name : classes) {
        const std::size_t names = daemon.lines("ein", name).size();
        EXPECT_EQ(daemon.lines("ei", name).size(), names) << name;
        EXPECT_FALSE(daemon.lines("-t gc", name).empty()) << name;
        instances += names;
    }
    EXPECT_GT(instances, 10U);
    for (const char* operation : {"ei", "gc", "ec"})
        EXPECT_EQ(daemon.wbemcli(operation, "CIM_ManagedElement", {}, true).status, 0) << operation;
    for (const std::string& name : test::sampleNames()) {
        const test::RawConnection client(daemon.httpPort(), "127.0.0.1");
        client.send(test::httpRequest(test::readSample(name)));
        const std::string answer = client.receive();
        EXPECT_EQ(test::statusOf(answer), 200) << name;
        EXPECT_EQ(test::faultsOf(answer.substr(answer.find("\r\n\r\n") + 4)), "") << name << answer;
    }
}

TEST(DaemonTest, DeletesJobsThatHaveEndedWhenAskedTo) {
    RunningDaemon daemon({"--jobs-keep-seconds", "1"}, {"QUENX_LOG=stderr"});
    const std::string job = startUpdate(daemon);
    // What its own settings say is no matter of who may delete.
    daemon.folder().write("policy.toml", "administrators = []\n");
    EXPECT_TRUE(daemon.program().waitFor(
        "quenx: [audit] user=\"quenx-cimd\" address=\"local\" operation=\"DeleteInstance\" "
        "target=\"root/cimv2:Quenx_ConcreteJob.InstanceID=\\\"Quenx:FirmwareUpdate@Job#1\\\"\" "
        "arguments=\"rule='jobs.keep_seconds'\" outcome=\"done\""));
    EXPECT_TRUE(contains(daemon.wbemcli("gi", job).error, "(6) CIM_ERR_NOT_FOUND"));
}

TEST(DaemonTest, LetsAFlashEndBeforeItStops) {
    for (const bool isDeleted : {false, true}) {
        const test::TempFolder folder;
        const test::UnixSocket manager(SOCK_DGRAM, folder / "notify");
        RunningDaemon daemon({}, {"NOTIFY_SOCKET=" + folder / "notify"});
        ASSERT_TRUE(reaches(daemon, startUpdate(daemon), "7"));
        test::HeldFlash flash(daemon.folder() / "state/eth0");
        const std::string job = startUpdate(daemon);
        ASSERT_TRUE(reaches(daemon, job, "4"));
        if (isDeleted) daemon.lines("di", job);
        daemon.program().send(SIGHUP);
        ASSERT_TRUE(daemon.program().waitFor("Reloaded the certificate and key."));
        daemon.program().send(SIGTERM);
        const std::string rest = isDeleted ? "the update of eth0, whose job was deleted."
                                           : "the update of eth0 (Quenx:FirmwareUpdate@Job#2 at 0 %).";
        ASSERT_TRUE(daemon.program().waitFor("Waiting for " + rest));
        EXPECT_FALSE(test::RawConnection(daemon.httpPort(), "127.0.0.1").send("GET"));
        std::this_thread::sleep_for(std::chrono::milliseconds(300));
        // What means nothing here must not end a flash.
        for (const int signal : {SIGUSR1, SIGUSR2, SIGALRM, SIGHUP})
            daemon.program().send(signal);
        EXPECT_TRUE(daemon.program().waitFor("Asked again to stop. Still waiting for " + rest));
        flash.release();
        const ProgramResult result = daemon.program().finish();
        EXPECT_EQ(result.status, 0) << result.out;
        const std::string said = result.out.substr(result.out.find("quenx-cimd: Stopping."));
        EXPECT_THAT(
            said, AllOf(StartsWith("quenx-cimd: Stopping.\r\nquenx-cimd: Waiting for " + rest +
                                   "\r\nquenx-cimd: Asked again to stop. Still waiting for " + rest + "\r\n"),
                        EndsWith("\nquenx-cimd: Stopped.\r\n")));
        const std::string ready =
            "READY=1\nSTATUS=Serving https://127.0.0.1:" + std::to_string(daemon.httpsPort()) +
            " http://127.0.0.1:" + std::to_string(daemon.httpPort()) + " unix:" + daemon.folder().path() +
            "/socket\n";
        EXPECT_THAT(manager.received(),
                    StartsWith(ready + "RELOADING=1\n" + ready + "STOPPING=1\nSTATUS=Stopping.\n" +
                               "EXTEND_TIMEOUT_USEC=30000000\nSTATUS=Waiting for " + rest + "\n"));
    }
}

/// How a client connects that keeps its session in a file: "New, TLSv1.3" or "Reused, TLSv1.2".
std::string handshake(const RunningDaemon& daemon, const std::string& version, bool resumes) {
    // The server closes after its answer: by then the client has seen all tickets.
    const std::string script =
        "printf 'GET / HTTP/1.1\\r\\nHost: x\\r\\nConnection: close\\r\\n\\r\\n' |"
        " openssl s_client -ign_eof -connect 127.0.0.1:$0 -$1 $2 $3 -sess_out $3 |"
        " grep -o -m 1 -E '^(New|Reused), [^,]*'";
    return test::run({"/bin/sh", "-c", script, std::to_string(daemon.httpsPort()), version,
                      resumes ? "-sess_in" : "-sess_out", daemon.folder() / version})
        .out;
}

TEST(DaemonTest, ReadsUsersAndCertificateAgain) {
    RunningDaemon daemon({}, {"QUENX_LOG=", "TARVEL_SMASHv2_LOG_LEVEL=2"});
    const RunningDaemon other;
    const auto isServed = [&](const std::string& user, bool https) {
        daemon.user = daemon.password = user;
        return daemon.wbemcli("ein", "CIM_Service", {}, https).status == 0;
    };
    // What cannot be read stays as it was.
    daemon.setPassword("later");
    EXPECT_FALSE(isServed("later", false));
    const std::string certificate = daemon.folder() / "cert.pem";
    const std::string away = daemon.folder() / "old.pem";
    std::filesystem::rename(certificate, away);
    daemon.program().send(SIGHUP);
    ASSERT_TRUE(daemon.program().waitFor("Kept the old certificate and key. Cannot use "));
    EXPECT_THAT(daemon.program().seen(), AllOf(HasSubstr("Reloaded the users."),
                                               ::testing::Not(HasSubstr("Reloaded the certificate"))));
    EXPECT_TRUE(isServed("later", false));

    std::filesystem::rename(away, certificate);
    EXPECT_TRUE(isServed("admin", true));
    for (const bool resumes : {false, true}) {
        const std::string how = resumes ? "Reused, TLSv1." : "New, TLSv1.";
        EXPECT_EQ(handshake(daemon, "tls1_2", resumes), how + "2\n");
        EXPECT_EQ(handshake(daemon, "tls1_3", resumes), how + "3\n");
    }
    for (const char* file : {"cert.pem", "key.pem"})
        daemon.folder().write(file, test::readTestFile(other.folder() / file));
    EXPECT_FALSE(isServed("admin", true));  // it still shows the old one
    daemon.program().send(SIGHUP);
    bool isNew = false;
    for (int round = 0; round < 1000 && !isNew; ++round)
        isNew = isServed("admin", true);
    EXPECT_TRUE(isNew);
    // Whoever trusted the old one has to look at the new one.
    EXPECT_EQ(handshake(daemon, "tls1_2", true), "New, TLSv1.2\n");
    EXPECT_EQ(handshake(daemon, "tls1_3", true), "New, TLSv1.3\n");
    const ProgramResult result = daemon.stop();
    EXPECT_EQ(result.status, 0);
    EXPECT_FALSE(contains(result.out, "[debug]")) << "nobody asked for a copy of the log";
}

/// A shell's script, whose arguments begin with $0, with mounts of its own.
std::vector<std::string> withOwnMounts(std::vector<std::string> script) {
    script.insert(script.begin(), {"/usr/bin/unshare", "-m", "--propagation", "private", "/bin/sh", "-c"});
    return script;
}
bool canMount() {
    return test::run(withOwnMounts({"mount --bind /etc /etc && test -d /sys/bus/pci/devices"})).status == 0;
}

TEST(DaemonTest, SaysThatItsPolicyIsBadAndGoesOnServingReaders) {
    RunningDaemon daemon({}, {}, {}, "administrators = 'admin'\n");
    const std::string said =
        "The policy cannot be obeyed, and nothing is installed or deleted until it is mended: " +
        daemon.folder().path() + "/policy.toml, line ";
    EXPECT_THAT(daemon.program().seen(), HasSubstr(said + "1: "));
    daemon.folder().write("policy.toml", "\nadministrators = 'admin'\n");
    daemon.program().send(SIGHUP);
    EXPECT_TRUE(daemon.program().waitFor(said + "2: "));
    EXPECT_EQ(daemon.lines("ein", "Quenx_EthernetPort").size(), 5U);
}

TEST(DaemonTest, ReadsTheSystemsFilesWhereNoneAreNamed) {
    if (!canMount()) GTEST_SKIP() << "nothing can be mounted";
    const test::TempFolder etc;  // and what is written at run time, and the PCI functions
    std::filesystem::create_directory(etc / "pci");
    const auto withThisEtc = [&](const std::string& program, const std::string& arguments) {
        return test::run(withOwnMounts({"mount --bind $0/pci /sys/bus/pci/devices && mount --bind $0 /etc && "
                                        "mount --bind $0 /var/lib && exec \"$1\" $2",
                                        etc.path(), program, arguments}),
                         {"QUENX_ADAPTERS", "QUENX_BACKEND"});
    };
    EXPECT_THAT(withThisEtc(QUENXCTL, "adapters").out,
                StartsWith("There are no adapters.\nEthernet adapters were looked for on PCI (class "
                           "0200 in /sys/bus/pci/devices): 0 were found. Simulated ones can"));
    etc.write("quenx-adapters.toml", test::kTestAdapters);
    etc.write("quenx-cimprovider.conf", "FWFilePath=/etc\n");
    etc.write("new.rom", test::realRom("efi-virtio"));
    EXPECT_THAT(withThisEtc(QUENXCTL, "identities").out, HasSubstr("file:///etc/new.rom"));
    EXPECT_EQ(withThisEtc(QUENXCTL, "install --target eth0 --force /etc/new.rom").status, 0);
    EXPECT_TRUE(std::filesystem::exists(etc / "quenx/adapters/eth0/state"));
    etc.write("quenx/policy.toml", "[trust]\n");
    EXPECT_THAT(withThisEtc(QUENXCTL, "install --target eth0 --force /etc/new.rom").error,
                HasSubstr("The policy cannot be obeyed: /etc/quenx/policy.toml, line 1: "));
    // A forgotten description hides no card, which is out of reach here; one that is named is what is wanted.
    std::filesystem::create_directory(etc / "pci/0000:05:00.0");
    etc.write("pci/0000:05:00.0/class", "0x020000\n");
    const ProgramResult real = withThisEtc(QUENXCTL, "adapters");
    EXPECT_TRUE(real.status == -SIGSYS || contains(real.out, "0000:05:00.0  devlink")) << real.status;
    EXPECT_THAT(withThisEtc(QUENXCTL, "--adapters /etc/quenx-adapters.toml adapters").out, HasSubstr("eth0"));

    const ProgramResult without = withThisEtc(QUENX_CIMD, "--check-config");
    EXPECT_FALSE(contains(without.error, "quenx-cimd.toml")) << without.error;
    EXPECT_THAT(without.error, HasSubstr(" /etc/pam.d/quenx-cimd does not exist, so PAM applies "));
    std::filesystem::create_directory(etc / "quenx-cimd");
    etc.write("quenx-cimd/quenx-cimd.toml", "[listen]\nhttp = 1\n");
    const ProgramResult with = withThisEtc(QUENX_CIMD, "--check-config");
    EXPECT_EQ(with.status, 2);
    EXPECT_EQ(with.error,
              "quenx-cimd: /etc/quenx-cimd/quenx-cimd.toml:2: listen.http must be true or false\n");
}

TEST(DaemonTest, AsksPamAndTheGroupsOfTheSystem) {
    if (!canMount()) GTEST_SKIP() << "nothing can be mounted";
    // A system of its own, whose users all have the password "secret".
    const test::TempFolder etc;
    std::filesystem::copy(QUENX_SYSTEM_TEST_DIR "/samples/etc", etc.path());
    std::filesystem::copy("/etc/pam.d", etc / "pam.d");
    std::filesystem::copy(QUENX_PACKAGING_DIR "/pam.d", etc / "pam.d",
                          std::filesystem::copy_options::overwrite_existing);
    RunningDaemon daemon(
        {"--auth-method", "pam", "--auth-readers", "reader", "@absent", "@watchers"}, {},
        withOwnMounts({"for f in passwd shadow group pam.d; do mount --bind $0/$f /etc/$f; done; exec \"$@\"",
                       etc.path()}));
    const char* const kMayDelete = "(6) CIM_ERR_NOT_FOUND";
    const char* const kMayRead = "(2) CIM_ERR_ACCESS_DENIED";
    const char* const kWrong = "Invalid username/password";
    const char* const kRefused = "HTTP response code said error";
    const auto expectFor = [&](const char* user, const char* password, const char* expected) {
        daemon.user = user;
        daemon.password = password;
        EXPECT_THAT(daemon.wbemcli("di", "Quenx_ConcreteJob.InstanceID=\"none\"").error, HasSubstr(expected))
            << user;
    };
    const std::tuple<const char*, const char*, const char*> table[] = {
        {"root", "secret", kMayDelete},  {"chief", "secret", kMayDelete}, {"reader", "secret", kMayRead},
        {"watcher", "secret", kMayRead}, {"chief", "wrong", kWrong},      {"other", "secret", kRefused},
        {"expired", "secret", kWrong},   {"unknown", "secret", kWrong},   {"blank", "", kWrong}};
    for (const auto& [user, password, expected] : table)
        expectFor(user, password, expected);
    // What the modules are told, and what is made of their answers. Those are no wrong passwords.
    const auto askInstead = [&](const std::string& line) {
        etc.write("pam.d/quenx-cimd", "auth " + line + "\naccount required pam_permit.so\n");
    };
    askInstead("optional pam_exec.so log=" + etc.path() + "/told /usr/bin/env\nauth required pam_permit.so");
    expectFor("nobody-here", "x", kRefused);
    const auto told = test::readTestFile(etc / "told");
    EXPECT_THAT(std::string(told.begin(), told.end()),
                AllOf(HasSubstr("PAM_RHOST=127.0.0.1\n"), HasSubstr("PAM_SERVICE=quenx-cimd\n")));
    for (const char* error : {"buf_err", "system_err", "abort"}) {
        askInstead(std::string("required pam_debug.so auth=") + error);
        expectFor("other", error, kRefused);
    }
    askInstead("required pam_debug.so auth=authinfo_unavail");
    expectFor("other", "x", kWrong);
}

TEST(DaemonTest, MakesTheFolderOfItsLockAndSocket) {
    if (!canMount()) GTEST_SKIP() << "nothing can be mounted";
    const test::TempFolder run;
    const RunningDaemon daemon(
        {"--daemon-lock-file", "/run/quenx-cimd/other", "--listen-socket", "/run/quenx-cimd/socket"}, {},
        withOwnMounts({"mount --bind $0 /run && exec \"$@\"", run.path()}));
    EXPECT_EQ(std::filesystem::status(run / "quenx-cimd").permissions(), std::filesystem::perms(0700));
    EXPECT_TRUE(std::filesystem::is_socket(run / "quenx-cimd/socket"));
}

class DaemonSessionTest : public ::testing::TestWithParam<const char*> {
  protected:
    const std::string m_policy =
        GetParam() == std::string("ServedHistory") ? "history_served = true\n" : "# As if there were none.\n";
    const RunningDaemon m_daemon{{}, {}, {}, m_policy};
};

TEST_P(DaemonSessionTest, ShowsWhatIsWrittenDown) {
    const std::string loopback = "=127.0.0.1:";
    test::expectSession(GetParam(), m_daemon.folder(),
                        "HTTP" + loopback + std::to_string(m_daemon.httpPort()) + "\nHTTPS" + loopback +
                            std::to_string(m_daemon.httpsPort()) + R"(
        ADMIN=http://admin:admin@$HTTP
        export SOURCE=')" QUENX_PACKAGING_DIR R"(/..' QUENXCTL_PASSWORD=admin QUENXCTL_SOCKET=socket
        here() { quenxctl --adapters adapters.toml --config provider.conf --policy policy.toml "$@"; }
        remote() { quenxctl --server https://$HTTPS --user admin --cacert cert.pem "$@"; }
        same() { here "$@" | sort >there; remote "$@" | sort | diff there - && test -s there; }
    )");
}

INSTANTIATE_TEST_SUITE_P(Shell, DaemonSessionTest,
                         ::testing::Values("Completion", "Held", "Interop", "Listen", "Remote",
                                           "RemotePolicy", "SameModel", "SecondDaemon", "ServedHistory",
                                           "TwoFronts", "Update"),
                         [](const auto& session) { return std::string(session.param); });

}  // namespace
