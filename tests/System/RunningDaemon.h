#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Support/TempFolder.h"
#include "System/Program.h"

namespace test {

/// A real quenx-cimd on free loopback ports, with the real providers and simulated adapters of its own. Users
/// "admin" and "guest" (who may only read), each with its name as password.
class RunningDaemon {
  public:
    /// @param options  further ones, such as limits
    explicit RunningDaemon(const std::vector<std::string>& options = {},
                           const std::vector<std::string>& environment = {});

    int httpPort() const { return m_httpPort; }
    int httpsPort() const { return m_httpsPort; }
    const TempFolder& folder() const { return m_folder; }
    Program& program() { return *m_program; }
    /// Runs quenx-cimd passwd on the daemon's users file.
    void setPassword(const std::string& user, const std::vector<std::string>& options = {}) const;

    /// SIGTERM, and what the daemon said until its end.
    ProgramResult stop();

    /// Runs wbemcli: the operation, its options in front, a path behind the URL of the namespace, arguments.
    ProgramResult wbemcli(const std::string& operation, const std::string& path,
                          const std::vector<std::string>& arguments = {}, bool https = false) const;
    /// The lines that an operation prints, without host and namespace. Expects success.
    std::vector<std::string> lines(const std::string& operation, const std::string& path,
                                   const std::vector<std::string>& arguments = {}) const;

    std::string user = "admin";
    std::string password = "admin";
    std::string namespaceName = "root/cimv2";

  private:
    int portOf(const std::string& scheme, const std::string& line) const;

    TempFolder m_folder;
    std::unique_ptr<Program> m_program;
    int m_httpPort = 0;
    int m_httpsPort = 0;
};

}  // namespace test
