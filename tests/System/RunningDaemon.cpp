// SPDX-License-Identifier: Apache-2.0
#include "System/RunningDaemon.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <csignal>
#include <filesystem>
#include <sstream>

#include "Support/SimulatedAdapters.h"

namespace test {

RunningDaemon::RunningDaemon(const std::vector<std::string>& options,
                             const std::vector<std::string>& environment, std::vector<std::string> command,
                             const std::string& policy) {
    m_folder.write("quenx-cimd.toml",
                   "[listen]\nhttps_port = 0\nhttp = true\nhttp_port = 0\n[tls]\ngenerate = "
                   "true\n[auth]\nmethod = 'users'\n");
    setPassword("admin");
    setPassword("guest", "--reader");
    m_folder.write("provider.conf", "");
    m_folder.write("policy.toml", policy);
    m_folder.write("adapters.toml", kTestAdapters);
    command.push_back(QUENX_CIMD);
    const std::pair<const char*, const char*> files[] = {{"--config", "quenx-cimd.toml"},
                                                         {"--tls-certificate", "cert.pem"},
                                                         {"--tls-key", "key.pem"},
                                                         {"--listen-socket", "socket"},
                                                         {"--auth-users-file", "users"},
                                                         {"--providers-configuration", "provider.conf"},
                                                         {"--providers-policy", "policy.toml"},
                                                         {"--adapters-description", "adapters.toml"},
                                                         {"--adapters-state", "state"},
                                                         {"--uploads-directory", "images"},
                                                         {"--indications-file", "subscriptions.json"},
                                                         {"--daemon-lock-file", "lock"}};
    for (const auto& [option, file] : files) {
        // A test may name its own.
        if (std::find(options.begin(), options.end(), option) == options.end())
            command.insert(command.end(), {option, m_folder / file});
    }
    command.insert(command.end(), options.begin(), options.end());
    m_program = std::make_unique<Program>(command, Program::Output::Terminal, environment);
    EXPECT_TRUE(m_program->waitFor("Serving http")) << "the daemon does not start: " << m_program->seen();
    const std::string served = m_program->seen().substr(m_program->seen().find("Serving http"));
    const auto portOf = [&served](const std::string& scheme) {
        const std::string rest = served.substr(served.find(scheme) + scheme.size());
        const std::string authority = rest.substr(0, rest.find_first_of(" \r"));
        // Behind the last colon: an IPv6 address has some of its own.
        return std::stoi(authority.substr(authority.rfind(':') + 1));
    };
    m_httpsPort = portOf("https://");
    m_httpPort = portOf(" http://");
}

void RunningDaemon::setPassword(const std::string& name, const std::string& option) const {
    const std::string script = "echo $0 | \"$1\" --config quenx-cimd.toml passwd $0 --users users $2";
    const ProgramResult result =
        run({"/bin/sh", "-c", "cd \"$3\" && " + script, name, QUENX_CIMD, option, m_folder.path()});
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
    command.push_back((https ? "https://" : "http://") + user + ":" + password +
                      "@127.0.0.1:" + std::to_string(https ? m_httpsPort : m_httpPort) + "/root/cimv2" +
                      (path.empty() ? "" : ":" + path));
    command.insert(command.end(), arguments.begin(), arguments.end());
    return run(command);
}

std::vector<std::string> RunningDaemon::lines(const std::string& operation, const std::string& path,
                                              const std::vector<std::string>& arguments) const {
    const ProgramResult result = wbemcli(operation, path, arguments);
    EXPECT_EQ(result.status, 0) << operation << " " << path << ": " << result.error;
    std::istringstream text(result.out);
    const std::string front = "127.0.0.1:" + std::to_string(m_httpPort) + "/root/cimv2:";
    std::vector<std::string> found;
    for (std::string line; std::getline(text, line);)
        found.push_back(line.starts_with(front) ? line.substr(front.size()) : line);
    return found;
}

}  // namespace test
