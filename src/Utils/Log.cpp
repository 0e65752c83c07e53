// SPDX-License-Identifier: Apache-2.0
#include "Utils/Log.h"

#include <execinfo.h>
#include <syslog.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <cstdarg>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <mutex>
#include <vector>

#include "Utils/Os/Linux/StackWalk.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace utils {

std::atomic<std::int32_t> logLevel{-1};

namespace {

constexpr const char* kLevelVariable = "TARVEL_SMASHv2_LOG_LEVEL";
constexpr const char* kCopyVariable = "QUENX_LOG";
constexpr const char* kBanner = "Quenx Management Provider, Tarvel, 2026";
constexpr int kBacktraceDepth = 40;
// logBacktrace itself, the writer that called it, and the writer's caller.
constexpr std::size_t kSkippedFrames = 3;

std::mutex openMutex;

/// Leaves errno as it was found, and gives it back in between to those who print it.
class ErrnoKeeper {
  public:
    ErrnoKeeper() noexcept : m_saved(errno) {}
    ~ErrnoKeeper() { errno = m_saved; }
    ErrnoKeeper(const ErrnoKeeper&) = delete;
    ErrnoKeeper& operator=(const ErrnoKeeper&) = delete;
    void restore() const noexcept { errno = m_saved; }

  private:
    const int m_saved;
};

std::int32_t levelFromEnvironment() noexcept {
    const char* const text = os::getEnvVariable(kLevelVariable);
    if (text != nullptr && text[0] == '0') return 0;
    if (text != nullptr && text[0] == '2') return 2;
    return 1;
}

/// syslog's own copy to standard error serves where no system log runs. The console, syslog's way out there,
/// is then left alone: in a container it is often the same terminal.
int openOptions() noexcept {
    const char* const text = os::getEnvVariable(kCopyVariable);
    return text != nullptr && std::strcmp(text, "stderr") == 0 ? LOG_PERROR : LOG_CONS;
}

/// The line is handed to syslog as its format. Only the conversions that need no argument may stay, and no
/// control character may forge a second line.
std::string escapeForSyslog(const std::string& line) {
    std::string format;
    format.reserve(line.size() + 16);
    std::size_t copied = 0;
    for (std::size_t i = 0; i < line.size(); ++i) {
        const char c = line[i];
        if (c != '%' && !isControl(c)) continue;
        format.append(line, copied, i - copied);
        copied = i + 1;
        if (c != '%') {
            format += formatStr("#%03o", static_cast<unsigned int>(c));
        } else if (copied < line.size() && (line[copied] == '%' || line[copied] == 'm')) {
            format += c;
            format += line[copied++];
            ++i;
        } else {
            format += "%%";
        }
    }
    return format.append(line, copied);
}

/// "7f0012345678 ", of eight digits at least.
void appendAddress(std::string& text, const void* address) {
    constexpr int kHexadecimal = 16;
    constexpr std::size_t kLeast = 8;
    std::array<char, 2 * sizeof address> digits{};
    const char* const end = std::to_chars(digits.data(), digits.data() + digits.size(),
                                          reinterpret_cast<std::uintptr_t>(address), kHexadecimal)
                                .ptr;
    const std::string_view shown(digits.data(), static_cast<std::size_t>(end - digits.data()));
    if (shown.size() < kLeast) text.append(kLeast - shown.size(), '0');
    text.append(shown).append(1, ' ');
}

// A finished line goes to syslog as its format, so that %m works in messages; escapeForSyslog has made it
// harmless.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-security"
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
void handOver(int priority, const std::string& line, const ErrnoKeeper& callersErrno) {
    const std::string format = escapeForSyslog(line);
    callersErrno.restore();
    syslog(priority, format.c_str());
}
#pragma GCC diagnostic pop

/// Inlined for the backtrace's sake, which leaves out a fixed number of frames up to the call site.
template <class Write>
[[gnu::always_inline, gnu::format(printf, 5, 0)]] inline void formatAndWrite(Write write, const char* file,
                                                                             const char* function, int line,
                                                                             const char* format,
                                                                             va_list arguments) noexcept {
    const ErrnoKeeper callersErrno;
    try {
        std::string message = vformatStr(format, arguments);
        callersErrno.restore();
        write(file, function, line, std::move(message));
    } catch (...) {
    }
}

}  // namespace

void openLinuxLog() noexcept {
    if (logLevel.load(std::memory_order_acquire) != -1) return;
    const ErrnoKeeper callersErrno;
    std::lock_guard<std::mutex> lock(openMutex);
    if (logLevel.load() != -1) return;
    const std::int32_t level = levelFromEnvironment();
    // The system keeps the pointer, and the host may log when this library has gone.
    static const char* const name = ::strdup("quenx");
    openlog(name, openOptions(), LOG_USER);
    syslog(LOG_NOTICE, "Opening log, level=%d", level);
    syslog(LOG_NOTICE, "%s", kBanner);
    logLevel.store(level);
}

bool isDebugLogged() noexcept {
    openLinuxLog();
    return logLevel.load(std::memory_order_relaxed) >= 2;
}

bool isErrorLogged() noexcept {
    openLinuxLog();
    return logLevel.load(std::memory_order_relaxed) >= 1;
}

std::string formatLogMessage(const char* file, const char* function, int line, const char* level,
                             const std::string& message) {
    const char* const slash = std::strrchr(file, '/');
    return formatStr("[%s] \"%s\" (%s@%s:%d)", level, message.c_str(), function,
                     slash == nullptr ? file : slash + 1, line);
}

__attribute__((noinline)) void writeErrorLog(const char* file, const char* function, int line,
                                             std::string message) noexcept {
    const ErrnoKeeper callersErrno;
    if (!isErrorLogged()) return;
    try {
        handOver(LOG_ERR, formatLogMessage(file, function, line, "error", message), callersErrno);
    } catch (...) {
    }
    logBacktrace(LOG_ERR, kBacktraceDepth, logLevel.load() > 1);
}

void writeDebugLog(const char* file, const char* function, int line, std::string message) noexcept {
    const ErrnoKeeper callersErrno;
    if (!isDebugLogged()) return;
    try {
        // Debug lines have the priority of errors, so that a filter on priority never parts the two; the
        // level word tells them apart.
        handOver(LOG_ERR, formatLogMessage(file, function, line, "debug", message), callersErrno);
    } catch (...) {
    }
}

void writeAuditLog(const std::string& line) noexcept {
    const ErrnoKeeper callersErrno;
    if (isErrorLogged()) syslog(LOG_NOTICE, "%s", line.c_str());
}

std::string escapeForLog(std::string_view text, std::size_t limit) {
    std::string escaped;
    escaped.reserve(std::min(text.size(), limit));
    for (const char c : text) {
        // Whatever is not ASCII too: a look-alike of another name, or an override that turns the line around.
        const bool isHidden = isControl(c) || static_cast<unsigned char>(c) >= 0x80;
        const bool isMark = c == '"' || c == '\'' || c == '\\';
        const std::size_t length = isHidden ? 4 : isMark ? 2 : 1;
        if (escaped.size() + length > limit) return escaped.append("\\...");
        if (isHidden) {
            escaped.append("\\x").append(hexByte(static_cast<unsigned char>(c)));
        } else {
            if (isMark) escaped += '\\';
            escaped += c;
        }
    }
    return escaped;
}

std::string escapeForFormat(std::string_view text) {
    std::string format;
    for (const char c : escapeForLog(text))
        format.append(c == '%' ? 2 : 1, c);
    return format;
}

__attribute__((noinline)) void logBacktrace(int priority, int depth, bool withSymbols) noexcept {
    const ErrnoKeeper callersErrno;
    if (depth <= 0) return;
    try {
        std::vector<void*> frames(static_cast<std::size_t>(depth));
        frames.resize(os::walkStack(frames));

        std::string text = "  Backtrace: ";
        for (std::size_t i = kSkippedFrames; i < frames.size(); ++i)
            appendAddress(text, frames[i]);
        handOver(priority, text, callersErrno);

        if (!withSymbols) return;
        const std::unique_ptr<char*, decltype(&std::free)> symbols(
            backtrace_symbols(frames.data(), static_cast<int>(frames.size())), &std::free);
        if (symbols == nullptr) return;
        for (std::size_t i = kSkippedFrames; i < frames.size(); ++i) {
            handOver(priority, formatStr("  %s ", symbols.get()[i]), callersErrno);
        }
    } catch (...) {
    }
}

void formatDebugLog(const char* file, const char* function, int line, const char* format, ...) noexcept {
    if (!isDebugLogged()) return;
    va_list arguments;
    va_start(arguments, format);
    formatAndWrite(writeDebugLog, file, function, line, format, arguments);
    va_end(arguments);
}

void formatErrorLog(const char* file, const char* function, int line, const char* format, ...) noexcept {
    if (!isErrorLogged()) return;
    va_list arguments;
    va_start(arguments, format);
    formatAndWrite(writeErrorLog, file, function, line, format, arguments);
    va_end(arguments);
}

}  // namespace utils
