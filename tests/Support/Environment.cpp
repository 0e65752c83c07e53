// SPDX-License-Identifier: Apache-2.0
#include "Support/Environment.h"

#include <sys/stat.h>

#include <cstdlib>
#include <string>
#include <utility>
#include <vector>

namespace test {

namespace {

void chooseVariables(const TempFolder& home) {
    std::vector<std::pair<std::string, std::string>> chosen{
        {"PATH", "/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin"},
        {"HOME", home.path()},
        {"LC_ALL", "C.UTF-8"},
        {"QUENX_ADAPTERS", home.write("adapters.toml", "")}};
    for (const char* kept : {"TMPDIR", "ASAN_OPTIONS", "LSAN_OPTIONS", "TSAN_OPTIONS", "UBSAN_OPTIONS",
                             "ASAN_SYMBOLIZER_PATH", "GCOV_PREFIX", "GCOV_PREFIX_STRIP"}) {
        if (const char* value = std::getenv(kept)) chosen.emplace_back(kept, value);
    }
    ASSERT_EQ(::clearenv(), 0);
    for (const auto& [name, value] : chosen)
        ASSERT_EQ(::setenv(name.c_str(), value.c_str(), 1), 0) << name;
}

}  // namespace

void ChosenEnvironment::SetUp() {
    ::umask(022);
    m_home.emplace();
    chooseVariables(*m_home);
    m_configuration.emplace(*m_home / "quenx-cimprovider.conf");
}

void ChosenEnvironment::TearDown() {
    m_configuration.reset();
    m_home.reset();
}

}  // namespace test
