// SPDX-License-Identifier: Apache-2.0
#include "Support/Environment.h"

#include <sys/stat.h>

#include <cstdlib>
#include <map>
#include <string>

namespace test {

ChosenEnvironment::ChosenEnvironment() {
    ::umask(022);
    std::map<std::string, std::string> chosen{
        {"PATH", "/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin"},
        {"HOME", m_home.path()},
        {"LC_ALL", "C.UTF-8"},
        {"QUENX_ADAPTERS", m_home.write("adapters.toml", "")},
        {"QUENXCTL_SOCKET", m_home / "socket"}};
    for (const char* kept : {"TMPDIR", "ASAN_OPTIONS", "LSAN_OPTIONS", "TSAN_OPTIONS", "UBSAN_OPTIONS",
                             "ASAN_SYMBOLIZER_PATH", "GCOV_PREFIX", "GCOV_PREFIX_STRIP"}) {
        if (const char* value = std::getenv(kept)) chosen.emplace(kept, value);
    }
    ::clearenv();
    for (const auto& [name, value] : chosen)
        ::setenv(name.c_str(), value.c_str(), 1);
}

}  // namespace test
