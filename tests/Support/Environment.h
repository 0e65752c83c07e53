// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/stat.h>

#include <cstdlib>
#include <map>
#include <string>

#include "MidAPI/AdapterTypes.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/PolicyFile.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace test {

/// The environment of a test program, and so of each program that it starts. Neither the caller's variables
/// and file mode mask nor the configuration and the policy of the machine change what the tests see: adapters
/// are simulated ones, of which there are none, the providers' settings are the defaults, and the home is a
/// folder of the tests' own. Only the variables that direct the instruments (sanitizers, coverage) and the
/// place of temporary files are kept.
class ChosenEnvironment {
  public:
    ChosenEnvironment() {
        ::umask(022);
        utils::systemPolicyFile = m_policy.c_str();
        std::map<std::string, std::string> chosen{
            {"PATH", "/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin"},
            {"HOME", m_home.path()},
            {"LC_ALL", "C.UTF-8"},
            {"QUENX_BACKEND", ma::kSimulatorBackend},
            {"QUENX_ADAPTERS", m_home.write("adapters.toml", "")},
            {"QUENXCTL_SOCKET", m_home / "socket"},
            {"DBUS_SYSTEM_BUS_ADDRESS", "unix:path=" + m_home / "no-bus"}};
        for (const char* kept : {"TMPDIR", "ASAN_OPTIONS", "LSAN_OPTIONS", "TSAN_OPTIONS", "UBSAN_OPTIONS",
                                 "ASAN_SYMBOLIZER_PATH", "GCOV_PREFIX", "GCOV_PREFIX_STRIP"}) {
            if (const char* value = std::getenv(kept)) chosen.emplace(kept, value);
        }
        ::clearenv();
        for (const auto& [name, value] : chosen)
            ::setenv(name.c_str(), value.c_str(), 1);
    }

  private:
    TempFolder m_home;
    utils::SMASHv2Config m_configuration{m_home / "quenx-cimprovider.conf"};
    const std::string m_policy = m_home / "policy.toml";
};

}  // namespace test
