#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <sstream>

#include "Host/Daemon/CommandLine.h"
#include "Host/Daemon/ConfigCheck.h"
#include "Host/Daemon/SettingsField.h"
#include "Host/Server/TlsIdentity.h"
#include "Support/TempFolder.h"

namespace {

using host::Settings;
using Words = std::vector<std::string>;

template <class Body>
std::string problemOf(Body&& body) {
    try {
        body();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "";
}

TEST(SettingsTest, MistakesInTheFileAreNamed) {
    const test::TempFolder folder;
    Settings settings;
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

host::CommandLine read(Words arguments) {
    arguments.insert(arguments.begin(), "quenx-cimd");
    std::vector<const char*> pointers;
    for (const std::string& each : arguments)
        pointers.push_back(each.c_str());
    return host::readCommandLine(static_cast<int>(pointers.size()), pointers.data());
}

TEST(CommandLineTest, PutsOptionsBeforeTheFile) {
    const test::TempFolder folder;
    const std::string file = folder.write(
        "file",
        "[listen]\nhttp_port = 1\nhttps_port = 2\n[auth]\nreaders = ['a', '@b']\nremember_seconds = 5\n");
    const auto line = read({"--config", file, "--listen-http-port", "3", "--listen-http"});
    EXPECT_FALSE(line.exitStatus);
    EXPECT_EQ(line.settings.listen.httpPort, 3);
    EXPECT_EQ(line.settings.listen.httpsPort, 2);
    EXPECT_TRUE(line.settings.listen.http);
    EXPECT_EQ(line.settings.authentication.readers, (Words{"a", "@b"}));
    EXPECT_EQ(line.settings.authentication.rememberFor, std::chrono::seconds(5));
    const auto other = read({"--config", file, "--auth-readers", "b", "c"});
    EXPECT_EQ(other.settings.authentication.readers, (Words{"b", "c"}));
    const std::vector<Words> mistakes{{"--unknown"},
                                      {"--config", "/nonexistent"},
                                      {"--limits-workers", "0"},
                                      {"--listen-https", "false"},
                                      {"--listen-http", "maybe"},
                                      {"--auth-method", "ldap"},
                                      {"--limits-body-bytes", "2000"},
                                      {"--limits-enumeration-seconds", "601"},
                                      {"--adapters-state", "/tmp"},
                                      {"passwd"}};
    for (const Words& mistake : mistakes)
        EXPECT_EQ(read(mistake).exitStatus, 2) << mistake[0];
}

TEST(ConfigCheckTest, LooksAtEveryFile) {
    const test::TempFolder folder;
    const auto check = [&](const Words& more) {
        Words arguments{
            "--config",     folder.write("config", ""), "--tls-certificate",    folder / "cert", "--tls-key",
            folder / "key", "--check-config",           "--providers-directory"};
        arguments.push_back(folder.path());
        arguments.insert(arguments.end(), more.begin(), more.end());
        return host::checkConfiguration(read(arguments).settings);
    };
    EXPECT_EQ(check({}), 0);
    EXPECT_EQ(check({"--auth-method", "users", "--auth-users-file", "/nonexistent"}), 2);
    EXPECT_EQ(check({"--providers-configuration", "/nonexistent"}), 2);
    EXPECT_EQ(check({"--adapters-description", "/nonexistent", "--adapters-state", "/tmp"}), 2);
    folder.write("key", "junk");
    EXPECT_EQ(check({}), 2);
    folder.write("cert", "junk");
    EXPECT_EQ(check({}), 2);
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

}  // namespace
