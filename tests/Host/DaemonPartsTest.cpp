// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>
#include <gnutls/x509.h>

#include <algorithm>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <fstream>

#include "Host/Authentication/PasswordChecker.h"
#include "Host/Daemon/CommandLine.h"
#include "Host/Daemon/Daemon.h"
#include "Host/Daemon/Report.h"
#include "Host/Daemon/SettingsField.h"
#include "Host/Server/ServerCertificate.h"
#include "Host/UnixSocket.h"
#include "Support/TempFolder.h"
#include "Support/Together.h"

namespace {

namespace fs = std::filesystem;
using host::Settings;
using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::StartsWith;
using ::testing::ThrowsMessage;
using Words = std::vector<std::string>;

TEST(SettingsTest, NameTheMistakesInTheFile) {
    const test::TempFolder folder;
    const std::string large((std::size_t{1} << 20) + 1, '\n');
    Settings unread;
    EXPECT_THAT([&] { host::readSettingsFile("/dev/zero", unread); },
                ThrowsMessage<std::runtime_error>(HasSubstr("/dev/zero is not a regular file.")));
    const std::pair<const char*, const char*> table[] = {
        {"[listen]\n\nhttps_port = 65536\n",
         ":3: listen.https_port is \"65536\". It must be a number from 0 to"},
        {"[listen]\nhttps_port = -1\n", ":2: "},
        {"[listen]\nhttps_port = '1'\n", "must be a whole number"},
        {"[listen]\nhttp = 1\n", "must be true or false"},
        {"[adapters]\ndescription = ''\n", "must be a text of at least one character"},
        {"[auth]\nreaders = 'a'\n", "must be a list"},
        {"[auth]\nreaders = [1]\n", "must be a text"},
        {"\n[list]\n", ":2: there is no section [list]"},
        {"[listen]\nunknown = 1\n", ":2: there is no setting listen.unknown"},
        {"https = true\n", "must be in a [section]"},
        {"[listen\n", ":1: "},
        {"[auth]\nmethod = users # two\n", ":2: "},
        {large.c_str(), " is larger than 1 MiB"},
        {"[listen]\naddress = 127.0.0.1", ". A text must stand in quotes: address = \"127.0.0.1\""}};
    for (const auto& [content, expected] : table) {
        const std::string file = folder.write("bad", content);
        Settings settings;
        EXPECT_THAT([&] { host::readSettingsFile(file, settings); },
                    ThrowsMessage<std::runtime_error>(AllOf(StartsWith(file), HasSubstr(expected))));
    }
}

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

/// With an empty file where the arguments name none: this machine's own is nobody's business here.
host::CommandLine read(Words arguments) {
    const test::TempFolder folder;
    if (std::find(arguments.begin(), arguments.end(), "--config") == arguments.end())
        arguments.insert(arguments.begin(), {"--config", folder.write("empty", "")});
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
}

TEST(CommandLineTest, SaysWhatWouldBeRight) {
    const std::pair<Words, const char*> table[] = {
        {{"--listen-port", "5"}, "no option --listen-port. There are --listen-address, --listen-https, --l"},
        {{"--unknown=5"}, "no option --unknown. \"quenx-cimd --help\" lists all options."},
        {{"password"}, "\"password\" is not expected here. The only command is passwd."},
        {{"--config"}, "--config: 1 required TEXT missing. \"quenx-cimd --help\""},
        {{"--config", "/nonexistent"}, "There is no file /nonexistent. Check --config."},
        {{"--limits-workers", "0"}, "limits.workers is \"0\". It must be a number from 1 to 4096."},
        {{"--listen-https", "false"}, "Set one of them to true."},
        {{"--listen-http", "true", "--listen-http-port=5989"}, "are both 5989. Set one of them to another"},
        {{"--auth-method", "ldap"}, "It must be \"pam\" or \"users\"."},
        {{"--limits-body-bytes", "2000"}, "is larger than limits.body_bytes."},
        {{"--adapters-state", "/tmp"}, "Set both, or neither."},
        {{"passwd"}, "passwd needs the name of a user"},
        {{"passwd", "--delete", "--reader", "admin"}, "Give only one of them."},
        {{"--check-config", "passwd", "admin"}, "Give only one of them."},
    };
    for (const auto& [arguments, expected] : table) {
        ::testing::internal::CaptureStderr();
        EXPECT_EQ(read(arguments).exitStatus, 2) << expected;
        EXPECT_THAT(::testing::internal::GetCapturedStderr(),
                    AllOf(StartsWith("quenx-cimd: "), HasSubstr(expected)));
    }
}

TEST(PasswdTest, SaysHowTheFileComesToBeUsed) {
    const test::TempFolder folder;
    const std::string file = folder / "users";
    host::writeUsersFile(file, {{"a", {"$x", true}}, {"b", {"$x", true}}, {"c", {"$x", true}}});
    const std::pair<Words, bool> table[] = {
        {{"passwd", "--delete", "a", "--auth-method", "users", "--auth-users-file", file}, true},
        {{"passwd", "--delete", "b", "--auth-method", "users", "--users", file}, false},
        {{"passwd", "--delete", "c", "--auth-users-file", file}, false}};
    for (const auto& [arguments, isUsed] : table) {
        ::testing::internal::CaptureStdout();
        EXPECT_EQ(host::runPasswd(*read(arguments).passwd), 0);
        const std::string said = ::testing::internal::GetCapturedStdout();
        const std::string advice = "--auth-method users --auth-users-file " + file + ".";
        EXPECT_EQ(said.find(advice) == std::string::npos, isUsed) << said;
    }
}

/// A self-signed certificate that is valid for that time.
void writeCertificate(const std::string& keyFile, const std::string& file, std::time_t from,
                      std::time_t until) {
    gnutls_datum_t pem{};
    gnutls_x509_privkey_t key{};
    gnutls_x509_crt_t certificate{};
    ASSERT_EQ(::gnutls_load_file(keyFile.c_str(), &pem), 0);
    ::gnutls_x509_privkey_init(&key);
    ASSERT_EQ(::gnutls_x509_privkey_import(key, &pem, GNUTLS_X509_FMT_PEM), 0);
    ::gnutls_free(pem.data);
    ::gnutls_x509_crt_init(&certificate);
    ::gnutls_x509_crt_set_serial(certificate, "1", 1);
    ::gnutls_x509_crt_set_activation_time(certificate, from);
    ::gnutls_x509_crt_set_expiration_time(certificate, until);
    ::gnutls_x509_crt_set_key(certificate, key);
    ASSERT_EQ(::gnutls_x509_crt_sign2(certificate, certificate, key, GNUTLS_DIG_SHA256, 0), 0);
    ASSERT_EQ(::gnutls_x509_crt_export2(certificate, GNUTLS_X509_FMT_PEM, &pem), 0);
    std::ofstream(file).write(reinterpret_cast<const char*>(pem.data), pem.size);
    ::gnutls_free(pem.data);
    ::gnutls_x509_crt_deinit(certificate);
    ::gnutls_x509_privkey_deinit(key);
}

TEST(ServerCertificateTest, IsRenewedOnlyIfMadeByAnUnsetClock) {
    const test::TempFolder folder;
    const host::TlsSettings files{folder / "cert.pem", folder / "key.pem", true};
    const auto warning = [&] { return host::ServerCertificate(files.certificate, files.key).warning(); };
    ASSERT_TRUE(host::makeTlsFiles(files));
    EXPECT_EQ(warning(), "");
    constexpr std::time_t day = 86400;
    const std::time_t now = std::time(nullptr);
    writeCertificate(files.key, files.certificate, now - 2 * day, now - day);
    EXPECT_THAT(warning(), HasSubstr(" has expired on "));
    EXPECT_FALSE(host::makeTlsFiles(files)) << "the administrator's own";
    writeCertificate(files.key, files.certificate, now + day, now + 2 * day);
    EXPECT_THAT(warning(), HasSubstr(" is not valid before "));
    EXPECT_FALSE(host::makeTlsFiles(files));
    for (const std::time_t unset : {std::time_t{100}, std::time_t{946684800}}) {
        writeCertificate(files.key, files.certificate, unset - day, unset + 3650 * day);
        EXPECT_NE(warning(), "");
        EXPECT_TRUE(host::makeTlsFiles(files)) << unset;
        EXPECT_EQ(warning(), "");
    }
    fs::permissions(files.key, fs::perms(0640));
    EXPECT_EQ(warning(), "");
    fs::permissions(files.key, fs::perms(0604));
    EXPECT_THAT(warning, ThrowsMessage<std::runtime_error>(HasSubstr("everybody may read")));
}

TEST(WarningsTest, TellWhatWorksButIsNotMeant) {
    Settings settings;
    EXPECT_TRUE(host::warningsOf(settings, 4096).empty());
    settings.listen.http = true;
    EXPECT_TRUE(host::warningsOf(settings, 4096).empty());
    settings.listen.address = "0.0.0.0";
    EXPECT_THAT(host::warningsOf(settings, 256),
                ::testing::ElementsAre(HasSubstr("listen.http sends"), HasSubstr("may have 256.")));
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
    }
    ::unsetenv("NOTIFY_SOCKET");
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

TEST(ConfigCheckTest, LooksAtEveryFile) {
    const test::TempFolder folder;
    const std::string certificate = folder / "new/cert.pem";
    const std::string key = folder / "new/key.pem";
    const std::string otherKey = folder / "other-key.pem";
    const std::string junk = folder.write("junk", "-----BEGIN CERTIFICATE-----\nx\n");
    const std::string noAdapters = folder.write("adapters.toml", "");
    EXPECT_THROW(host::makeTlsFiles({certificate, key, false}), std::runtime_error);
    EXPECT_TRUE(host::makeTlsFiles({certificate, key, true}));
    EXPECT_FALSE(host::makeTlsFiles({certificate, key, false}));
    EXPECT_TRUE(host::makeTlsFiles({folder / "other-cert.pem", otherKey, true}));
    EXPECT_EQ(fs::status(key).permissions(), fs::perms(0600));
    // The mistake that is named; nothing where there is none.
    const std::tuple<std::string, std::string, std::string, Words> table[] = {
        // First: with a sanitizer the providers stay where they are loaded.
        {"providers.directory", certificate, key, {"--providers-directory", folder.path()}},
        {"providers.directory", certificate, key, {"--providers-directory", "/nonexistent"}},
        {"", certificate, key, {}},
        {"", folder / "none", folder / "none", {"--tls-generate"}},
        {"tls.certificate is", folder / "none", folder / "none", {}},
        {"listen.address", certificate, key, {"--listen-address", "192.0.2.1"}},
        {"daemon.lock_file is", certificate, key, {"--daemon-lock-file", "/nonexistent/lock"}},
        {"listen.socket is", certificate, key, {"--listen-socket", "/nonexistent/socket"}},
        {"listen.socket", certificate, key, {"--listen-socket", junk}},
        {"", certificate, key, {"--listen-socket", folder / "socket"}},
        {"the users file", certificate, key, {"--auth-method", "users", "--auth-users-file", "/nonexistent"}},
        {"providers.configuration", certificate, key, {"--providers-configuration", "/nonexistent"}},
        {"providers.configuration", certificate, key, {"--providers-configuration", "/dev/zero"}},
        {"adapter description",
         certificate,
         key,
         {"--adapters-description", "/nonexistent", "--adapters-state", "/tmp"}},
        {"line 1", certificate, key, {"--adapters-description", junk, "--adapters-state", "/tmp"}},
        // Where a start could not write is said, and not found out by the first update.
        {"adapters.state",
         certificate,
         key,
         {"--adapters-description", noAdapters, "--adapters-state", junk + "/state"}},
        {"is not the key", certificate, otherKey, {}},
        {"private key", certificate, junk, {}},
        {"private key", certificate, "/dev/zero", {}},
        {"tls.key is", certificate, folder / "none", {"--tls-generate"}},
        {"tls.certificate is", folder / "none", key, {}},
        {"tls.certificate", junk, key, {}},
        {"tls.certificate", key, key, {}},
    };
    const std::string config = folder.write("config",
                                            "[listen]\nhttps_port = 0\nsocket = ''\n"
                                            "[daemon]\nlock_file = '" +
                                                (folder / "lock") + "'\n");
    for (const auto& [mistake, certificateFile, keyFile, more] : table) {
        Words arguments{"--config", config, "--tls-certificate", certificateFile, "--tls-key", keyFile};
        arguments.insert(arguments.end(), more.begin(), more.end());
        ::testing::internal::CaptureStderr();
        const int status = host::checkConfiguration(read(arguments).settings);
        EXPECT_THAT(::testing::internal::GetCapturedStderr(), HasSubstr(mistake));
        EXPECT_EQ(status, mistake.empty() ? 0 : 2) << certificateFile << keyFile;
    }
    fs::remove(key);
    EXPECT_THROW(host::makeTlsFiles({certificate, key, true}), std::runtime_error);
}

}  // namespace
