// SPDX-License-Identifier: Apache-2.0
// quenx-cimd as a whole, driven by the WBEM client wbemcli.
#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <csignal>
#include <cstring>
#include <filesystem>
#include <thread>

#include "CimXml/WireCheck.h"
#include "System/HeldFlash.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"

namespace {

using test::contains;
using test::ProgramResult;
using test::RunningDaemon;
using ::testing::AllOf;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::HasSubstr;

/// Starts the update of eth0 to a real image and returns the job's path.
std::string startUpdate(const RunningDaemon& daemon) {
    const std::string service = daemon.lines("ein", "Quenx_SoftwareInstallationService").at(0);
    const std::string port = daemon.lines("ein", "Quenx_EthernetPort").at(0);
    const ProgramResult called = daemon.wbemcli(
        "cm", service,
        {"InstallFromURI.URI=\"file://" + daemon.image() + "\",InstallOptions=5,Target=" + port});
    EXPECT_TRUE(contains(called.out, "InstallFromURI: 4096")) << called.out << called.error;
    const std::string job = daemon.lines("ein", "Quenx_ConcreteJob").at(0);
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
    for (const char* operation : {"ei", "gc", "ec"}) {
        EXPECT_EQ(daemon.wbemcli(operation, "CIM_ManagedElement", {}, true).status, 0) << operation;
    }
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
    test::HeldFlash flash(daemon.folder() / "state/eth0");
    const std::string job = startUpdate(daemon);
    ASSERT_TRUE(reaches(daemon, job, "4"));
    std::this_thread::sleep_for(std::chrono::seconds(3));
    EXPECT_EQ(daemon.wbemcli("gi", job).status, 0);
    flash.release();
    EXPECT_TRUE(daemon.program().waitFor(
        "[audit] user=\"quenx-cimd\" address=\"local\" operation=\"DeleteInstance\" "
        "target=\"root/cimv2:Quenx_ConcreteJob.InstanceID=\\\"Quenx:FirmwareUpdate@Job#1\\\"\" "
        "arguments=\"rule='jobs.keep_seconds'\" outcome=\"done\""));
    EXPECT_TRUE(contains(daemon.wbemcli("gi", job).error, "(6) CIM_ERR_NOT_FOUND"));
}

TEST(DaemonTest, CarriesAnUpdateFromItsStartToItsDeletion) {
    RunningDaemon daemon;
    const std::string job = startUpdate(daemon);
    // The service, the port and its card.
    for (const char* operation : {"ain", "ai", "rin", "ri"})
        EXPECT_EQ(daemon.lines(operation, job).size(), 3U) << operation;
    EXPECT_EQ(daemon.lines("-ac CIM_OwningJobElement -ar OwnedElement ain", job).size(), 1U);
    EXPECT_TRUE(reaches(daemon, job, "7"));
    EXPECT_THAT(daemon.lines("ei", "Quenx_SoftwareIdentity"),
                Contains(AllOf(HasSubstr("eth0:IMG_PXE"), HasSubstr("VersionString=\"IMG_PXE 2\""))));
    EXPECT_EQ(daemon.wbemcli("di", job).status, 0);
    EXPECT_TRUE(contains(daemon.wbemcli("gi", job).error, "(6) CIM_ERR_NOT_FOUND"));
    EXPECT_TRUE(contains(daemon.wbemcli("di", job).error, "(6) CIM_ERR_NOT_FOUND"));
}

TEST(DaemonTest, IsDiscoveredFromTheInteropNamespace) {
    RunningDaemon daemon;
    for (const char* name : {"interop", "root/interop"}) {
        daemon.namespaceName = name;
        EXPECT_EQ(daemon.lines("ein", "CIM_ObjectManager").size(), 1U);
        EXPECT_EQ(daemon.lines("ein", "CIM_Namespace").size(), 3U);
        std::string profile;
        for (const std::string& path : daemon.lines("ein", "CIM_RegisteredProfile")) {
            if (contains(path, "SoftwareUpdate")) profile = path;
        }
        EXPECT_THAT(daemon.lines("-ac CIM_ElementConformsToProfile ain", profile),
                    ElementsAre(HasSubstr("/root/cimv2:Quenx_SoftwareInstallationService.")));
        EXPECT_THAT(daemon.lines("-ac CIM_ReferencedProfile ain", profile),
                    ElementsAre(HasSubstr("Quenx:EthernetPort")));
    }
    // Each end of an association stands in its own namespace, and each path can be asked for.
    for (const std::string& path : daemon.lines("ein", "CIM_ElementConformsToProfile")) {
        EXPECT_THAT(daemon.lines("gi", path).at(0),
                    AllOf(HasSubstr("ConformantStandard=root/interop:Quenx_RegisteredProfile"),
                          HasSubstr("ManagedElement=root/cimv2:Quenx_")));
    }
    const std::string manager = daemon.lines("ein", "CIM_Service").at(0);
    EXPECT_TRUE(contains(daemon.wbemcli("di", manager).error, "(7) CIM_ERR_NOT_SUPPORTED"));
    // What is served elsewhere is not shown here.
    EXPECT_TRUE(contains(daemon.wbemcli("ei", "Quenx_EthernetPort").error, "(5) CIM_ERR_INVALID_CLASS"));
    EXPECT_TRUE(contains(daemon.wbemcli("gc", "Quenx_EthernetPort").error, "(6) CIM_ERR_NOT_FOUND"));
    for (const std::string& name : daemon.lines("ecn", ""))
        EXPECT_FALSE(daemon.lines("gc", name).empty()) << name;
}

TEST(DaemonTest, LetsAFlashEndBeforeItStops) {
    for (const bool isDeleted : {false, true}) {
        // A socket stands in for the service manager.
        const test::TempFolder folder;
        const std::string path = folder / "notify";
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        path.copy(address.sun_path, sizeof address.sun_path - 1);
        const int manager = ::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
        ASSERT_EQ(::bind(manager, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);

        RunningDaemon daemon({}, {"NOTIFY_SOCKET=" + path});
        test::HeldFlash flash(daemon.folder() / "state/eth0");
        const std::string job = startUpdate(daemon);
        ASSERT_TRUE(reaches(daemon, job, "4"));
        if (isDeleted) daemon.lines("di", job);
        daemon.program().send(SIGTERM);
        ASSERT_TRUE(
            daemon.program().waitFor(isDeleted ? "Waiting for an update whose job was deleted."
                                               : "Waiting for the update of Quenx:FirmwareUpdate@Job#1 at "));
        // What means nothing here must not end a flash.
        for (const int signal : {SIGUSR1, SIGUSR2, SIGALRM, SIGHUP})
            daemon.program().send(signal);
        EXPECT_TRUE(daemon.program().waitFor("Asked again to stop. Still waiting for "));
        flash.release();
        const ProgramResult result = daemon.program().finish();
        EXPECT_EQ(result.status, 0) << result.out;
        EXPECT_TRUE(contains(result.out, "Stopped.")) << result.out;

        std::string told;
        char bytes[512];
        for (ssize_t length = 0; (length = ::recv(manager, bytes, sizeof bytes, MSG_DONTWAIT)) > 0;)
            told.append(bytes, static_cast<std::size_t>(length)).append("\n");
        ::close(manager);
        for (const char* part :
             {"READY=1", "STOPPING=1", "EXTEND_TIMEOUT_USEC=30000000", "STATUS=Waiting for"})
            EXPECT_THAT(told, HasSubstr(part));
    }
}

TEST(DaemonTest, ReadsUsersAndCertificateAgain) {
    RunningDaemon daemon;
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
    for (const char* file : {"cert.pem", "key.pem"})
        daemon.folder().write(file, test::readTestFile(other.folder() / file));
    EXPECT_FALSE(isServed("admin", true));  // it still shows the old one
    daemon.program().send(SIGHUP);
    bool isNew = false;
    for (int round = 0; round < 1000 && !isNew; ++round)
        isNew = isServed("admin", true);
    EXPECT_TRUE(isNew);
    EXPECT_EQ(daemon.stop().status, 0);
}

TEST(DaemonTest, AsksPamAndTheGroupsOfTheSystem) {
    const auto privately = [](std::vector<std::string> words) {
        words.insert(words.begin(), {"/usr/bin/unshare", "-m", "--propagation", "private", "/bin/sh", "-c"});
        return words;
    };
    if (test::run(privately({"mount --bind /etc /etc"})).status != 0)
        GTEST_SKIP() << "nothing can be mounted";
    // A system of its own: the users below, all with the password "secret".
    const test::TempFolder etc;
    const std::string secret =
        ":$6$quenxtest$.xlSksxRD.dejcRvfnG4BPvAFrzRVgFmpd5."
        "PLjUWcskxPz5GZtukA9MFOf55EEozqmI15fR8UkYekJBjxiOL0:"
        "19000:0:99999:7::";
    std::string passwd = "root:x:0:0::/:/bin/sh\n";
    std::string shadow = "root" + secret + ":\nexpired" + secret + "19001:\n";
    for (const std::string name : {"chief", "reader", "watcher", "other", "expired"}) {
        passwd += name + ":x:" + std::to_string(passwd.size()) + ":1::/:/bin/sh\n";
        if (name != "expired") shadow += name + secret + ":\n";
    }
    etc.write("passwd", passwd);
    etc.write("shadow", shadow);
    etc.write("group", "root:x:0:\nquenx-admin:x:101:chief\nwatchers:x:102:watcher\n");
    std::filesystem::copy("/etc/pam.d", etc / "pam.d");
    std::filesystem::copy(QUENX_PACKAGING_DIR "/pam.d", etc / "pam.d",
                          std::filesystem::copy_options::overwrite_existing);
    RunningDaemon daemon(
        {"--auth-method", "pam", "--auth-readers", "reader", "@watchers"}, {},
        privately({"for f in passwd shadow group pam.d; do mount --bind $0/$f /etc/$f; done; exec \"$@\"",
                   etc.path()}));
    const char* const kMayDelete = "(6) CIM_ERR_NOT_FOUND";
    const char* const kMayRead = "(2) CIM_ERR_ACCESS_DENIED";
    const char* const kWrong = "Invalid username/password";
    const struct {
        const char* user;
        const char* password;
        const char* expected;
    } table[] = {
        {"root", "secret", kMayDelete}, {"chief", "secret", kMayDelete},
        {"reader", "secret", kMayRead}, {"watcher", "secret", kMayRead},
        {"chief", "wrong", kWrong},     {"other", "secret", "HTTP response code said error"},
        {"expired", "secret", kWrong},  {"unknown", "secret", kWrong},
    };
    for (const auto& row : table) {
        daemon.user = row.user;
        daemon.password = row.password;
        const ProgramResult result = daemon.wbemcli("di", "Quenx_ConcreteJob.InstanceID=\"none\"");
        EXPECT_TRUE(contains(result.error, row.expected)) << row.user << result.error;
    }
}

/// Installs the build below a folder, for a prefix, as a package is staged. The component is that of every
/// file here; named, it leaves the manifest of a real installation alone.
ProgramResult installBelow(const test::TempFolder& place, const std::string& prefix) {
    return test::run(
        {CMAKE, "--install", QUENX_BUILD, "--strip", "--component", "Unspecified", "--prefix", prefix},
        {"DESTDIR=" + (place / "staged")});
}

TEST(DaemonTest, RunsWhereItIsInstalled) {
    const test::TempFolder place;
    const ProgramResult installed = installBelow(place, "/new/prefix");
    ASSERT_EQ(installed.status, 0) << installed.error;
    const std::string prefix = place / "staged/new/prefix";
    const std::string daemon = prefix + "/sbin/quenx-cimd";
    const std::string config = place.write(
        "config",
        "[listen]\nhttps = false\nhttp = true\nhttp_port = 0\nsocket = ''\n[daemon]\nlock_file = '" +
            (place / "lock") + "'\n");
    const ProgramResult checked = test::run({daemon, "--check-config", "--config", config});
    EXPECT_EQ(checked.status, 0) << checked.error;
    EXPECT_EQ(test::run({prefix + "/bin/quenxctl", "mof"}).status, 0);
    for (const auto& file : std::filesystem::recursive_directory_iterator(prefix)) {
        if (!file.is_regular_file()) continue;
        const auto bytes = test::readTestFile(file.path().string());
        EXPECT_FALSE(contains({bytes.begin(), bytes.end()}, QUENX_BUILD "/lib")) << file.path();
    }
    // The users file, too, has a directory that is not there yet.
    const std::string users = place / "etc/users";
    const std::string script = "echo x | \"$0\" --config \"$1\" passwd ann --users \"$2\"";
    EXPECT_EQ(test::run({"/bin/sh", "-c", script, daemon, config, users}).status, 0);
    EXPECT_TRUE(std::filesystem::exists(users));
}

TEST(DaemonTest, InstallsConfigurationWhereThereIsNone) {
    // Only an installation of the distribution's kind configures the machine itself.
    for (const auto& [prefix, folder] : {std::pair{"/usr", "/etc"}, {"/usr/local", "/usr/local/etc"}}) {
        const test::TempFolder place;
        const std::string name = "staged" + std::string(folder) + "/pam.d/quenx-cimd";
        const std::string file = place / name;
        ASSERT_EQ(installBelow(place, prefix).status, 0) << prefix;
        EXPECT_EQ(test::readTestFile(file), test::readTestFile(QUENX_PACKAGING_DIR "/pam.d/quenx-cimd"));
        place.write(name, "# mine");
        EXPECT_THAT(installBelow(place, prefix).out, HasSubstr("Kept: " + file));
        EXPECT_EQ(test::readTestFile(file).size(), std::strlen("# mine"));
    }
}

TEST(DaemonTest, CopiesItsLogToStandardErrorWhenAsked) {
    RunningDaemon talkative({}, {"QUENX_LOG=stderr", "TARVEL_SMASHv2_LOG_LEVEL=2"});
    EXPECT_TRUE(talkative.program().waitFor("quenx: [debug] \"Serving https://"));
    RunningDaemon quiet({}, {"QUENX_LOG=", "TARVEL_SMASHv2_LOG_LEVEL=2"});
    EXPECT_FALSE(contains(quiet.stop().out, "[debug]"));
}

TEST(DaemonTest, NamesWhatKeepsItFromServing) {
    const test::TempFolder folder;
    folder.write("libQuenx_Broken.so", "no library");
    for (const char* name : {"libQuenx_SoftwareUpdate.so", "libQuenx_SoftwareInventory.so"}) {
        std::filesystem::create_symlink(std::filesystem::path(QUENX_LIBRARIES) / name, folder / name);
    }
    RunningDaemon daemon({"--providers-directory", folder.path()});
    EXPECT_EQ(daemon.lines("ein", "Quenx_EthernetPort").size(), 5U);
    EXPECT_TRUE(contains(daemon.program().seen(), "libQuenx_Broken.so: ")) << daemon.program().seen();

    const std::string held = "--daemon-lock-file=" + (daemon.folder() / "lock");
    const std::string lock = "--daemon-lock-file=" + (folder / "lock");
    const std::string port = std::to_string(daemon.httpPort());
    const std::string taken = "--listen-http-port=" + port;
    const std::string free = "--listen-http-port=0";
    const struct {
        int status;
        std::vector<std::string> options;
        std::string said;
    } table[] = {
        {1, {held, free}, "process " + std::to_string(daemon.program().id()) + " (quenx-cimd) holds "},
        {1, {lock, taken}, "127.0.0.1 port " + port + ": Address already in use. Stop the program that"},
        // The lock is free again.
        {1, {lock, free, "--providers-directory=/nonexistent"}, "/nonexistent"},
        // A check says the same, but not of the daemon that a start would replace.
        {2, {lock, taken, "--check-config"}, "port " + port + ": Address already in use."},
        {0, {held, taken, "--check-config"}, ""},
    };
    for (const auto& row : table) {
        std::vector<std::string> command{
            QUENX_CIMD,        "--config", folder.write("empty", ""), "--listen-https=false", "--listen-http",
            "--listen-socket", ""};
        command.insert(command.end(), row.options.begin(), row.options.end());
        const ProgramResult result = test::run(command);
        EXPECT_EQ(result.status, row.status) << result.error;
        EXPECT_THAT(result.error, HasSubstr(row.said));
    }
}

}  // namespace
