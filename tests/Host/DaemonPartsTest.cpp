// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include "Host/Authentication/PasswordChecker.h"
#include "Host/Daemon/CommandLine.h"
#include "Host/Daemon/Daemon.h"
#include "Host/Daemon/IndicationSettings.h"
#include "Host/Daemon/Report.h"
#include "Host/Daemon/SettingsField.h"
#include "Host/Server/HttpServer.h"
#include "Host/Server/LocalSocket.h"
#include "Host/Server/ServerCertificate.h"
#include "Host/Server/TlsPriorities.h"
#include "Host/UnixSocket.h"
#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"
#include "Support/Together.h"

namespace {

namespace fs = std::filesystem;
using host::LocalSocket;
using host::Settings;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::ThrowsMessage;

TEST(SettingsTest, AreAllInTheFileThatIsShipped) {
    // Uncommented, the shipped file says the defaults, but for the jobs.
    std::ifstream lines(QUENX_PACKAGING_DIR "/quenx-cimd.toml");
    std::string content;
    for (std::string line; std::getline(lines, line);) {
        const bool isSetting = line.size() > 1 && line[0] == '#' && line[1] != ' ';
        content += (isSetting ? line.substr(1) : line) + "\n";
    }
    const test::TempFolder folder;
    Settings read;
    host::readSettingsFile(folder.write("shipped", content), read);
    Settings defaults;
    defaults.providers = "/usr/lib/quenx";
    defaults.backend = "auto";
    defaults.adapters = "/etc/quenx-adapters.toml";
    defaults.adapterState = "/var/lib/quenx/adapters";
    defaults.jobs = {1000, std::chrono::hours(24)};  // the one section that is not commented out
    const auto expected = host::fieldsOf(defaults);
    const auto found = host::fieldsOf(read);
    for (std::size_t i = 0; i < expected.size(); ++i) {
        EXPECT_EQ(found[i].text(), expected[i].text()) << expected[i].key;
        const std::string name = expected[i].key.substr(expected[i].key.find('.') + 1);
        EXPECT_NE(content.find("\n" + name + " = "), std::string::npos) << name;
    }
}

TEST(CommandLineTest, PutsOptionsBeforeTheFile) {
    const test::TempFolder folder;
    const std::string file = folder.write(
        "file",
        "[listen]\nhttp_port = 1\nhttps_port = 2\n[auth]\nreaders = ['a', '@b']\nremember_seconds = 5\n");
    const auto read = [&](std::vector<const char*> options) {
        options.insert(options.begin(), {"quenx-cimd", "--config", file.c_str()});
        return host::readCommandLine(static_cast<int>(options.size()), options.data());
    };
    const auto line = read({"--listen-http-port", "65535", "--listen-http"});
    EXPECT_FALSE(line.exitStatus);
    EXPECT_EQ(line.settings.listen.httpPort, 65535);
    EXPECT_EQ(line.settings.listen.httpsPort, 2);
    EXPECT_TRUE(line.settings.listen.http);
    EXPECT_THAT(line.settings.authentication.readers, ElementsAre("a", "@b"));
    EXPECT_EQ(line.settings.authentication.rememberFor, std::chrono::seconds(5));
    EXPECT_THAT(read({"--auth-readers", "b", "c"}).settings.authentication.readers, ElementsAre("b", "c"));
    EXPECT_FALSE(read({"--limits-body-bytes", "16384", "--limits-enumeration-seconds", "600",
                       "--uploads-image-bytes", "1073741824"})
                     .exitStatus)
        << "no more than others allow";
}

TEST(SettingsTest, SayWhereIndicationsMayGo) {
    using Kind = indications::DestinationRule::Kind;
    const auto rule = [](std::vector<std::string> destinations) {
        Settings settings;
        settings.indications.destinations = std::move(destinations);
        const auto result = host::subscriptionSettings(settings).destinations;
        return std::pair(result.kind, static_cast<int>(result.networks.size()));
    };
    EXPECT_EQ(rule({}), std::pair(Kind::Subscriber, 0));
    EXPECT_EQ(rule({"subscriber"}), std::pair(Kind::Subscriber, 0));
    EXPECT_EQ(rule({"any"}), std::pair(Kind::Any, 0));
    EXPECT_EQ(rule({"10.0.0.0/8"}), std::pair(Kind::Listed, 1));
    EXPECT_EQ(rule({"10.0.0.0/8", "2001:db8::/32"}), std::pair(Kind::Listed, 2));
    for (const char* alone : {"any", "subscriber"})
        EXPECT_THROW(rule({alone, "10.0.0.0/8"}), std::runtime_error) << alone;
}

TEST(ServerCertificateTest, IsRenewedOnlyIfMadeByAnUnsetClock) {
    const test::TempFolder folder;
    const host::TlsSettings files{folder / "new/cert.pem", folder / "new/key.pem", true};
    const auto warning = [&] { return host::ServerCertificate(files.certificate, files.key).warning(); };
    EXPECT_THROW(host::makeTlsFiles({files.certificate, files.key, false}), std::runtime_error);
    ASSERT_TRUE(host::makeTlsFiles(files));
    EXPECT_EQ(warning(), "");
    EXPECT_EQ(fs::status(files.key).permissions(), fs::perms(0600));
    const auto put = [&](const std::string& certificate) {
        const fs::path samples = QUENX_HOST_TEST_DIR "/samples/certificates";
        const auto replace = fs::copy_options::overwrite_existing;
        fs::copy(samples / certificate, files.certificate, replace);
        fs::copy(samples / "key.pem", files.key, replace);
        fs::permissions(files.key, fs::perms(0600));
        return warning();
    };
    EXPECT_THAT(put("expired.pem"), HasSubstr(" has expired on "));
    EXPECT_FALSE(host::makeTlsFiles(files)) << "the administrator's own";
    EXPECT_THAT(put("ahead.pem"), HasSubstr(" is not valid before "));
    EXPECT_FALSE(host::makeTlsFiles(files));
    for (const char* unset : {"made-in-1970.pem", "made-in-2000.pem"}) {
        EXPECT_NE(put(unset), "");
        EXPECT_TRUE(host::makeTlsFiles(files)) << unset;
        EXPECT_EQ(warning(), "");
    }
    fs::permissions(files.key, fs::perms(0640));
    EXPECT_EQ(warning(), "");
    fs::remove(files.key);
    EXPECT_THROW(host::makeTlsFiles(files), std::runtime_error) << "for the certificate that is there";
}

TEST(TlsPrioritiesTest, AreRefusedWhereTheLibraryDoesNotKnowThem) {
    EXPECT_NO_THROW(host::requireTlsPriorities(host::tlsPriorities()));
    EXPECT_THAT([] { host::requireTlsPriorities("NORMAL:+VERS-TLS9.9:-RSA"); },
                ThrowsMessage<std::runtime_error>(HasSubstr("does not take from \"+VERS-TLS9.9:-RSA\" on")));
    EXPECT_THAT([] { host::requireTlsPriorities("@QUENX-TEST"); },
                ThrowsMessage<std::runtime_error>(HasSubstr("Define them in the section [priorities] of /")));
}

TEST(LockFileTest, IsInAFolderThatAStartMakes) {
    EXPECT_TRUE(host::isInDefaultFolder("/run/quenx-cimd/socket"));
    for (const char* elsewhere : {"/run/quenx-cimd/a/b", "/run/quenx-cimx/lock", "quenx-cimd/lock"})
        EXPECT_FALSE(host::isInDefaultFolder(elsewhere)) << elsewhere;
}

TEST(ReportTest, TellsTheServiceManagerAndKeepsNoDescriptor) {
    const test::TempFolder folder;
    const auto descriptors = [] { return std::distance(fs::directory_iterator("/proc/self/fd"), {}); };
    for (const std::string& path : {folder / "notify", "@" + folder.path()}) {
        const test::UnixSocket manager(SOCK_DGRAM, path);
        ::setenv("NOTIFY_SOCKET", path.c_str(), 1);
        const auto before = descriptors();
        host::notifyServiceManager("READY=1");
        EXPECT_EQ(descriptors(), before);
        EXPECT_EQ(manager.received(), "READY=1\n") << path;
        // One that does not read holds up nobody.
        for (int i = 0; i < 1000; ++i)
            host::notifyServiceManager("STATUS=x");
    }
    ::unsetenv("NOTIFY_SOCKET");
    const test::SyslogCapture log;
    host::reportProblem("It burns.");
    EXPECT_THAT(log.lines().at(0).text, HasSubstr("It burns."));
}

TEST(PasswdTest, LosesNoChangeThatOthersMake) {
    const test::TempFolder folder;
    const std::string file = folder / "new/users";
    host::UserEntries users;
    for (int i = 0; i < 8; ++i)
        users["user" + std::to_string(i)] = {"$x", true};
    host::writeUsersFile(file, users);
    std::vector<std::function<void()>> removals;
    for (const auto& [name, entry] : users)
        removals.emplace_back([&, name = name] {
            EXPECT_EQ(host::runPasswd({.user = name, .usersFile = file, .isRemoval = true, .configured = {}}),
                      0);
        });
    test::together(removals);
    EXPECT_TRUE(host::readUsersFile(file).empty());
}

TEST(LocalSocketTest, ReplacesWhatAKilledDaemonLeftAndNothingElse) {
    const test::TempFolder folder;
    const std::string path = folder / "socket";
    { const test::UnixSocket killed(SOCK_STREAM, path); }
    {
        const LocalSocket socket(path);
        const os::Descriptor listener(socket.listener());
    }
    EXPECT_FALSE(fs::exists(path));
    const test::UnixSocket foreign(SOCK_STREAM, folder / "other");
    fs::create_symlink(folder / "other", path);
    EXPECT_THAT([&] { const LocalSocket socket(path); },
                ThrowsMessage<host::ListenError>(HasSubstr("there is a file that is not a socket")));
    EXPECT_TRUE(fs::is_symlink(path));
}

TEST(LocalSocketTest, StandsInAFolderThatNobodyElseWritesTo) {
    const test::TempFolder folder;
    const std::string shared = folder / "shared";
    const auto check = [&] { LocalSocket::check(shared + "/socket"); };
    const auto refuses = [](const std::string& why) {
        return ThrowsMessage<host::ListenError>(HasSubstr(why));
    };
    EXPECT_THAT(check,
                refuses("No such file or directory. Set listen.socket to a path in a folder of root's"));
    folder.write("shared", "");
    EXPECT_THAT(check, refuses("Not a directory. Set listen.socket"));
    fs::remove(shared);
    fs::create_directory(shared);
    check();
    for (const fs::perms more : {fs::perms::group_write, fs::perms::others_write}) {
        fs::permissions(shared, fs::perms::owner_all | more);
        EXPECT_THAT(check, refuses("others can write to " + shared + "."));
    }
    fs::permissions(shared, fs::perms::owner_all);
    // Only root can give a folder away.
    if (::chown(shared.c_str(), 65534, 65534) == 0 && ::geteuid() == 0) {
        EXPECT_THAT(check, refuses("others can write to " + shared + "."));
    }
}

}  // namespace
