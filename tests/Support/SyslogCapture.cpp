// SPDX-License-Identifier: Apache-2.0
#include "Support/SyslogCapture.h"

#include <syslog.h>

#include <algorithm>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <mutex>

#include "Utils/Export.h"

namespace test {

namespace {

struct Store {
    std::mutex mutex;
    std::vector<SyslogLine> lines;
    SyslogOpening opening;
    std::function<void(const std::string&)> observer;
    bool keepsLines = true;
};

/// Never destroyed: libraries log while they are unloaded.
Store& store() {
    static Store* const instance = new Store;
    return *instance;
}

[[gnu::format(printf, 2, 0)]] void record(int priority, const char* format, va_list arguments) {
    const int callersErrno = errno;
    char buffer[8192];
    vsnprintf(buffer, sizeof buffer, format, arguments);
    std::function<void(const std::string&)> observer;
    {
        const std::lock_guard lock(store().mutex);
        if (store().keepsLines) store().lines.push_back({priority, buffer});
        observer = store().observer;
    }
    if (observer) observer(buffer);
    errno = callersErrno;
}

}  // namespace

void SyslogCapture::clear() {
    const std::lock_guard lock(store().mutex);
    store().lines.clear();
    store().opening = {};
}

std::vector<SyslogLine> SyslogCapture::lines() {
    const std::lock_guard lock(store().mutex);
    return store().lines;
}

std::size_t SyslogCapture::count(std::string_view part) {
    const auto holdsPart = [part](const SyslogLine& line) {
        return line.text.find(part) != std::string::npos;
    };
    return static_cast<std::size_t>(std::ranges::count_if(lines(), holdsPart));
}

bool SyslogCapture::says(std::string_view text) {
    return std::ranges::any_of(lines(), [text](const SyslogLine& line) {
        return line.text.ends_with(text) || line.text.find(std::string(text) + '"') != std::string::npos;
    });
}

std::vector<std::string> SyslogCapture::messages(std::string_view level) {
    const std::string begin = "[" + std::string(level) + "] \"";
    std::vector<std::string> found;
    for (const SyslogLine& line : lines()) {
        const std::size_t end = line.text.rfind("\" (");
        if (line.text.starts_with(begin) && end != std::string::npos)
            found.push_back(line.text.substr(begin.size(), end - begin.size()));
    }
    return found;
}

SyslogOpening SyslogCapture::opening() {
    const std::lock_guard lock(store().mutex);
    return store().opening;
}

void SyslogCapture::observe(std::function<void(const std::string&)> observer) {
    const std::lock_guard lock(store().mutex);
    store().observer = std::move(observer);
}

void SyslogCapture::keep(bool lines) {
    const std::lock_guard lock(store().mutex);
    store().keepsLines = lines;
}

}  // namespace test

// The C library's functions that the log uses, and the form that a fortified build calls instead.
extern "C" {

QUENX_EXPORT void openlog(const char* identity, int options, int facility) {
    const std::lock_guard lock(test::store().mutex);
    test::store().opening = {identity, options, facility};
}

QUENX_EXPORT void closelog() {}

QUENX_EXPORT void syslog(int priority, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    test::record(priority, format, arguments);
    va_end(arguments);
}

[[gnu::format(printf, 3, 4)]] QUENX_EXPORT void __syslog_chk(int priority, int, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    test::record(priority, format, arguments);
    va_end(arguments);
}
}
