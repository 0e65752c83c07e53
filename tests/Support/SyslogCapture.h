// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include "Utils/Log.h"

namespace test {

struct SyslogLine {
    int priority;
    std::string text;
};

/// What openlog was told; nothing when it was not called.
struct SyslogOpening {
    std::string identity{};
    int options = 0;
    int facility = 0;
};

/// Takes the place of the C library's syslog in every test program, for the shared libraries' calls too: what
/// would have reached the system log, expanded as syslog does it, is kept here. Thread-safe.
class SyslogCapture {
  public:
    /// Starts empty.
    SyslogCapture() { clear(); }

    static void clear();
    static std::vector<SyslogLine> lines();
    /// The number of lines that contain the text.
    static std::size_t count(std::string_view part);
    static bool contains(std::string_view part) { return count(part) != 0; }
    /// Whether a line has the text up to the end of the line, or of what stands there in quotes.
    static bool says(std::string_view text);
    /// The messages of the lines "[level] "message" (...)", in order; other lines are left out.
    static std::vector<std::string> messages(std::string_view level = "debug");
    /// The last opening since clear().
    static SyslogOpening opening();

    /// Has every line shown to the observer, on the thread that writes it; null for none.
    static void observe(std::function<void(const std::string& line)> observer);
    /// Whether lines are kept; for tests that would keep too many.
    static void keep(bool lines);
};

/// Sets utils::logLevel for a scope.
class LogLevelGuard {
  public:
    explicit LogLevelGuard(std::int32_t level) : m_saved(utils::logLevel.exchange(level)) {}
    ~LogLevelGuard() { utils::logLevel.store(m_saved); }
    LogLevelGuard(const LogLevelGuard&) = delete;
    LogLevelGuard& operator=(const LogLevelGuard&) = delete;

  private:
    const std::int32_t m_saved;
};

}  // namespace test
