// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Support/Program.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"

namespace test {

/// A real quenx-cimd on free loopback ports, with the real providers and the adapters of SimulatedAdapters.h
/// as its own. Users "admin" and "guest" (who may only read), each with its name as password.
class RunningDaemon {
  public:
    /// @param options  further ones, such as limits
    /// @param command  what runs the daemon, for one that does not run by itself
    explicit RunningDaemon(const std::vector<std::string>& options = {},
                           const std::vector<std::string>& environment = {},
                           std::vector<std::string> command = {},
                           const std::string& policy = "# As if there were none.\n");

    int httpPort() const { return m_httpPort; }
    int httpsPort() const { return m_httpsPort; }
    const TempFolder& folder() const { return m_folder; }
    /// An image for eth0: a real one with IMG_PXE 2 and IMG_UEFI 2.
    const std::string& image() const { return m_image; }
    Program& program() { return *m_program; }
    /// Runs quenx-cimd passwd on the daemon's users file, with an option if need be.
    void setPassword(const std::string& user, const std::string& option = "") const;

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

  private:
    TempFolder m_folder;
    std::string m_image = m_folder.write("new.rom", withRevision(realRom("efi-virtio"), 2));
    std::unique_ptr<Program> m_program;
    int m_httpPort = 0;
    int m_httpsPort = 0;
};

}  // namespace test
