#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <sstream>

#include "Host/Daemon/CommandLine.h"
#include "Host/Daemon/ConfigCheck.h"
#include "Host/Daemon/LockFile.h"
#include "Host/Daemon/ServiceManager.h"
#include "Host/Daemon/SettingsField.h"
#include "Host/Server/RequestGate.h"
#include "Host/Server/TlsIdentity.h"
#include "Support/TempFolder.h"

namespace {

using host::Settings;

template <class Body>
std::string problemOf(Body&& body) {
    try {
        body();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "";
}

TEST(SettingsTest, AreReadFromAFile) {
    const test::TempFolder folder;
    Settings settings;
    host::readSettingsFile(folder.write("good",
                                        "[listen]\nhttps_port = 0\nhttp = true\n[auth]\n"
                                        "readers = ['a', '@b']\nremember_seconds = 5\n"),
                           settings);
    EXPECT_EQ(settings.listen.httpsPort, 0);
    EXPECT_TRUE(settings.listen.http);
    EXPECT_EQ(settings.authentication.readers, (std::vector<std::string>{"a", "@b"}));
    EXPECT_EQ(settings.authentication.rememberFor, std::chrono::seconds(5));
    const std::pair<const char*, const char*> table[] = {
        {"[listen]\n\nhttps_port = 65536\n",
         ":3: listen.https_port is \"65536\"; it must be a number from 0 to"},
        {"[listen]\nhttps_port = -1\n", ":2: "},
        {"[listen]\nhttps_port = '1'\n", "must be a whole number"},
        {"[listen]\nhttp = 1\n", "must be true or false"},
        {"[listen]\naddress = 1\n", "must be a text"},
        {"[auth]\nreaders = 'a'\n", "must be a list"},
        {"[auth]\nreaders = [1]\n", "must be a text"},
        {"[listen]\nunknown = 1\n", ":2: there is no setting listen.unknown"},
        {"[unknown]\nx = 1\n", "unknown.x"},
        {"https = true\n", "must stand in a [section]"},
        {"[listen\n", ":1: "}};
    for (const auto& [content, expected] : table) {
        const std::string file = folder.write("bad", content);
        const std::string problem = problemOf([&] { host::readSettingsFile(file, settings); });
        EXPECT_EQ(problem.find(file), 0U) << problem;
        EXPECT_NE(problem.find(expected), std::string::npos) << problem;
    }
}

TEST(SettingsTest, AreAllInTheFileThatIsShipped) {
    // Uncommented, the shipped file says the defaults.
    const auto bytes = test::readTestFile(QUENX_PACKAGING_DIR "/quenx-cimd.toml");
    std::istringstream lines(std::string(bytes.begin(), bytes.end()));
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
    defaults.adapters = "/etc/quenx-adapters.toml";
    defaults.adapterState = "/var/lib/quenx/adapters";
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
    const std::string file =
        folder.write("file", "[listen]\nhttp_port = 1\nhttps_port = 2\n[auth]\nreaders = ['a']\n");
    const auto read = [](std::vector<const char*> arguments) {
        arguments.insert(arguments.begin(), "quenx-cimd");
        return host::readCommandLine(static_cast<int>(arguments.size()), arguments.data());
    };
    const auto line = read(
        {"--config", file.c_str(), "--listen-http-port", "3", "--listen-http", "--auth-readers", "b", "c"});
    EXPECT_FALSE(line.exitStatus);
    EXPECT_EQ(line.settings.listen.httpPort, 3);
    EXPECT_EQ(line.settings.listen.httpsPort, 2);
    EXPECT_TRUE(line.settings.listen.http);
    EXPECT_EQ(line.settings.authentication.readers, (std::vector<std::string>{"b", "c"}));
    const auto passwd = read({"passwd", "ann", "--reader"});
    ASSERT_TRUE(passwd.passwd);
    EXPECT_EQ(passwd.passwd->usersFile, Settings().authentication.usersFile);
    for (const std::vector<const char*>& wrong :
         std::vector<std::vector<const char*>>{{"--unknown"},
                                               {"--config", "/nonexistent"},
                                               {"--limits-workers", "0"},
                                               {"--listen-https", "false"},
                                               {"--listen-http", "maybe"},
                                               {"--auth-method", "ldap"},
                                               {"--limits-body-bytes", "2000"},
                                               {"--limits-enumeration-seconds", "601"},
                                               {"--adapters-state", "/tmp"},
                                               {"passwd"}}) {
        EXPECT_EQ(read(wrong).exitStatus, 2) << wrong[0];
    }
}

TEST(ConfigCheckTest, LooksAtEveryFile) {
    const test::TempFolder folder;
    Settings settings;
    settings.providers = folder.path();
    settings.tls = {folder / "cert", folder / "key"};
    EXPECT_EQ(host::checkConfiguration(settings), 0);
    for (const auto& spoil :
         std::vector<void (*)(Settings&)>{[](Settings& s) { s.providers = "/nonexistent"; },
                                          [](Settings& s) {
                                              s.authentication = {"users", "/nonexistent", {}, {}};
                                          },
                                          [](Settings& s) { s.tls.key = "/etc/passwd"; },
                                          [](Settings& s) {
                                              s.tls = {"/etc/passwd", "/etc/passwd"};
                                          },
                                          [](Settings& s) { s.providerConfiguration = "/nonexistent"; },
                                          [](Settings& s) { s.adapters = "/nonexistent"; }}) {
        Settings bad = settings;
        spoil(bad);
        EXPECT_EQ(host::checkConfiguration(bad), 2);
    }
}

TEST(TlsIdentityTest, MakesFilesOnceAndReadsThem) {
    const test::TempFolder folder;
    const std::string certificate = folder / "new/cert.pem";
    const std::string key = folder / "new/key.pem";
    EXPECT_TRUE(host::makeTlsFiles(certificate, key));
    EXPECT_FALSE(host::makeTlsFiles(certificate, key));
    struct stat status {};
    ASSERT_EQ(::stat(key.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0600U);
    EXPECT_EQ(host::TlsIdentity(certificate, key).certificateCount(), 1U);

    const std::string other = folder / "other.pem";
    host::makeTlsFiles(folder / "other-cert.pem", other);
    const std::string junk = folder.write("junk", "-----BEGIN CERTIFICATE-----\nx\n");
    const std::pair<std::string, std::string> wrong[] = {{certificate, other},
                                                         {junk, key},
                                                         {certificate, junk},
                                                         {certificate, folder / "missing"},
                                                         {key, key}};
    for (const auto& [c, k] : wrong) {
        EXPECT_NE(problemOf([&, c = c, k = k] { host::TlsIdentity(c, k); }), "") << c << " " << k;
    }
    ::unlink(key.c_str());
    EXPECT_NE(problemOf([&] { host::makeTlsFiles(certificate, key); }).find("is missing"), std::string::npos);
}

TEST(LockFileTest, IsHeldByOne) {
    const test::TempFolder folder;
    const std::string path = folder / "lock";
    {
        const host::LockFile lock(path);
        const std::string problem = problemOf([&] { const host::LockFile second(path); });
        EXPECT_NE(problem.find("held by process " + std::to_string(::getpid())), std::string::npos)
            << problem;
    }
    EXPECT_EQ(problemOf([&] { const host::LockFile again(path); }), "");
    EXPECT_NE(problemOf([&] { const host::LockFile wrong(folder / "no/lock"); }), "");
}

TEST(ServiceManagerTest, SpeaksItsProtocol) {
    const test::TempFolder folder;
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    const std::string path = folder / "notify";
    path.copy(address.sun_path, sizeof address.sun_path - 1);
    const int receiver = ::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    ASSERT_EQ(::bind(receiver, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
    const auto next = [&] {
        char text[256];
        const ssize_t length = ::recv(receiver, text, sizeof text, MSG_DONTWAIT);
        return length < 0 ? std::string() : std::string(text, static_cast<std::size_t>(length));
    };
    host::ServiceManager::ready("x");
    EXPECT_EQ(next(), "");
    ::setenv("NOTIFY_SOCKET", path.c_str(), 1);
    host::ServiceManager::ready("up");
    host::ServiceManager::stillStopping("flash at 5 %", 30);
    EXPECT_EQ(next(), "READY=1\nSTATUS=up");
    EXPECT_EQ(next(), "EXTEND_TIMEOUT_USEC=30000000\nSTATUS=flash at 5 %");
    ::unsetenv("NOTIFY_SOCKET");
    ::close(receiver);
}

TEST(RequestGateTest, RefusesByTheHeadAlone) {
    host::HttpHead good;
    good.method = "POST";
    good.contentLength = "10";
    good.contentType = "Application/XML; charset=\"UTF-8\"";
    const auto status = [&](void (*change)(host::HttpHead&)) {
        host::HttpHead head = good;
        change(head);
        const auto answer = host::refuseByHead(head, 100);
        return answer ? answer->status : 200U;
    };
    EXPECT_EQ(status([](host::HttpHead&) {}), 200U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentType = "text/xml"; }), 200U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentType.reset(); }), 200U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentLength = "100"; }), 200U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.method = "GET"; }), 405U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.method = "M-POST"; }), 501U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentLength.reset(); }), 411U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.chunked = true; }), 411U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentLength = "101"; }), 413U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentLength = "99999999999999999999"; }), 400U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentLength = "-1"; }), 400U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentType = "text/xmlish"; }), 415U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.contentType = "text/xml; charset=latin1"; }), 415U);
    EXPECT_EQ(status([](host::HttpHead& h) { h.cim.batch = true; }), 501U);
}

}  // namespace
