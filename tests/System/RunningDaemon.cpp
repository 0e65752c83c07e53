#include "System/RunningDaemon.h"

#include <gtest/gtest.h>

#include <csignal>
#include <filesystem>
#include <sstream>

namespace test {

namespace {

constexpr const char* kAdapters = R"([[adapter]]
name = "eth0"
pci_address = "0000:03:00.0"
pci_id = "1af4:1041"
mac = "52:54:00:10:00:00"
components = [ { type = "IMG_PXE", revision = 0 }, { type = "IMG_UEFI", revision = 0 } ]

[[adapter]]
name = "eth3"
pci_address = "0000:05:00.0"
pci_id = "1022:2000"
mac = "52:54:00:10:00:03"
updatable = false
components = [ { type = "IMG_PXE", revision = 1 } ]
)";

}  // namespace

RunningDaemon::RunningDaemon(const std::vector<std::string>& options,
                             const std::vector<std::string>& environment) {
    setPassword("admin");
    setPassword("guest", {"--reader"});
    m_folder.write("quenx-cimd.toml", "[listen]\nhttps_port = 0\nhttp = true\nhttp_port = 0\n");
    m_folder.write("provider.conf", "");
    m_folder.write("adapters.toml", kAdapters);
    std::vector<std::string> command{QUENX_CIMD, "--auth-method", "users"};
    const std::pair<const char*, const char*> files[] = {{"--config", "quenx-cimd.toml"},
                                                         {"--tls-certificate", "cert.pem"},
                                                         {"--tls-key", "key.pem"},
                                                         {"--auth-users-file", "users"},
                                                         {"--providers-configuration", "provider.conf"},
                                                         {"--adapters-description", "adapters.toml"},
                                                         {"--adapters-state", "state"},
                                                         {"--daemon-lock-file", "lock"}};
    for (const auto& [option, file] : files)
        command.insert(command.end(), {option, m_folder / file});
    command.insert(command.end(), options.begin(), options.end());
    m_program = std::make_unique<Program>(command, Program::Output::Terminal, environment);
    EXPECT_TRUE(m_program->waitFor("serving http")) << "the daemon does not start: " << m_program->seen();
    const std::string said = m_program->seen();
    m_httpsPort = portOf("https://127.0.0.1:", said);
    m_httpPort = portOf(" http://127.0.0.1:", said);
}

int RunningDaemon::portOf(const std::string& scheme, const std::string& line) const {
    const std::size_t at = line.find(scheme);
    EXPECT_NE(at, std::string::npos) << line;
    return at == std::string::npos ? 0 : std::stoi(line.substr(at + scheme.size()));
}

void RunningDaemon::setPassword(const std::string& name, const std::vector<std::string>& options) const {
    std::vector<std::string> command{"/bin/sh", "-c",      "echo $0 | \"$@\"", name, QUENX_CIMD, "passwd",
                                     name,      "--users", m_folder / "users"};
    command.insert(command.end(), options.begin(), options.end());
    const ProgramResult result = run(command);
    EXPECT_EQ(result.status, 0) << result.error;
}

ProgramResult RunningDaemon::stop() {
    m_program->send(SIGTERM);
    return m_program->finish();
}

ProgramResult RunningDaemon::wbemcli(const std::string& operation, const std::string& path,
                                     const std::vector<std::string>& arguments, bool https) const {
    std::istringstream words(operation);
    std::vector<std::string> command{"/usr/bin/wbemcli"};
    if (https) command.insert(command.end(), {"-cacert", m_folder / "cert.pem"});
    for (std::string word; words >> word;)
        command.push_back(word);
    const std::string scheme = https ? "https://" : "http://";
    const int port = https ? m_httpsPort : m_httpPort;
    std::string url = scheme + user + ":" + password + "@127.0.0.1:" + std::to_string(port) + "/";
    url += namespaceName;
    if (!path.empty()) url += ":" + path;
    command.push_back(url);
    command.insert(command.end(), arguments.begin(), arguments.end());
    return run(command);
}

std::vector<std::string> RunningDaemon::lines(const std::string& operation, const std::string& path,
                                              const std::vector<std::string>& arguments) const {
    const ProgramResult result = wbemcli(operation, path, arguments);
    EXPECT_EQ(result.status, 0) << operation << " " << path << ": " << result.error;
    std::istringstream text(result.out);
    const std::string front = "127.0.0.1:" + std::to_string(m_httpPort) + "/" + namespaceName + ":";
    std::vector<std::string> found;
    for (std::string line; std::getline(text, line);) {
        found.push_back(line.starts_with(front) ? line.substr(front.size()) : line);
    }
    return found;
}

}  // namespace test
