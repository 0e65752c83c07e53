// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "Utils/Export.h"

/// The way into the system log. Every line but an audit line reads `[level] "message" (function@file:line)`.
/// Any thread may log at any time, static initialisation and destruction included. No function here reports a
/// failure or lets an exception out, formatLogMessage excepted: a line that cannot be built is dropped. errno
/// is left as it was.
namespace utils {

/// -1: not yet opened; 0: nothing is written; 1: errors; 2: errors with symbolised backtraces, and debug
/// lines. Set once, by openLinuxLog().
QUENX_EXPORT extern std::atomic<std::int32_t> logLevel;

/// Opens the system log and sets the level from the environment variable TARVEL_SMASHv2_LOG_LEVEL, on the
/// first call only. With QUENX_LOG=stderr every line also goes to standard error. The writers call it
/// themselves.
QUENX_EXPORT void openLinuxLog() noexcept;

/// Writes one error line and a backtrace when the level is 1 or more. The message is a text, not a format.
QUENX_EXPORT void writeErrorLog(const char* file, const char* function, int line,
                                std::string message) noexcept;

/// Writes one debug line when the level is 2 or more. The message is a text, not a format.
QUENX_EXPORT void writeDebugLog(const char* file, const char* function, int line,
                                std::string message) noexcept;

/// Writes one finished line when the level is 1 or more, as it is: nothing in it is expanded, and no
/// backtrace follows. What comes from outside has to be escaped already.
QUENX_EXPORT void writeAuditLog(const std::string& line) noexcept;

/// A text from outside as it may stand in a log, bare or between quotes: printable ASCII, with a backslash
/// before quotes, single ones too, and backslashes; any other byte as `\xNN`. At most `limit` characters, and
/// then the mark `\...`, which no text can hold, if something is missing.
/// @throws std::bad_alloc
QUENX_EXPORT std::string escapeForLog(std::string_view text, std::size_t limit = 256);
/// The same for a line in which `%m` would be expanded: each `%` is doubled.
/// @throws std::bad_alloc
QUENX_EXPORT std::string escapeForFormat(std::string_view text);

/// The finished line, at most 511 characters, with the base name of `file`.
/// @throws std::bad_alloc
QUENX_EXPORT std::string formatLogMessage(const char* file, const char* function, int line, const char* level,
                                          const std::string& message);

/// Writes the calling thread's stack, without its three innermost frames, as one line of addresses and, if
/// `withSymbols`, one line per frame. At most `depth` frames are looked at.
QUENX_EXPORT void logBacktrace(int priority, int depth, bool withSymbols) noexcept;

/// True when a debug (an error) line would be written now; opens the log if need be.
QUENX_EXPORT bool isDebugLogged() noexcept;
QUENX_EXPORT bool isErrorLogged() noexcept;

/// Formats and writes, as the macros below use it.
QUENX_EXPORT void formatDebugLog(const char* file, const char* function, int line, const char* format,
                                 ...) noexcept __attribute__((format(printf, 4, 5)));
QUENX_EXPORT void formatErrorLog(const char* file, const char* function, int line, const char* format,
                                 ...) noexcept __attribute__((format(printf, 4, 5)));

}  // namespace utils

/// Debug lines for code outside this system: formats, drops every newline and writes a debug line.
extern "C" QUENX_EXPORT void vpddbg(const char* format, ...) noexcept __attribute__((format(printf, 1, 2)));

/// What every call site uses. The arguments are evaluated only when the line would be written, and nothing
/// that they throw escapes: the line is dropped. QUENX_DEBUG and QUENX_ERROR take a format that the compiler
/// checks, the forms with _TEXT a finished text.
#define QUENX_LOG_IF(isLogged, write, ...)                                 \
    do {                                                                   \
        if (::utils::isLogged()) {                                         \
            try {                                                          \
                ::utils::write(__FILE__, __func__, __LINE__, __VA_ARGS__); \
            } catch (...) {                                                \
            }                                                              \
        }                                                                  \
    } while (false)
#define QUENX_DEBUG(...) QUENX_LOG_IF(isDebugLogged, formatDebugLog, __VA_ARGS__)
#define QUENX_ERROR(...) QUENX_LOG_IF(isErrorLogged, formatErrorLog, __VA_ARGS__)
#define QUENX_DEBUG_TEXT(text) QUENX_LOG_IF(isDebugLogged, writeDebugLog, text)
#define QUENX_ERROR_TEXT(text) QUENX_LOG_IF(isErrorLogged, writeErrorLog, text)
