// SPDX-License-Identifier: Apache-2.0
#include "Cli/Display/Progress.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <vector>

#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr unsigned kLineEveryPercent = 10;
constexpr std::chrono::seconds kLineAtLeastEvery{10};

/// Percent per millisecond. Nothing as long as there is too little to go by: an estimate that jumps about is
/// worse than none.
std::optional<double> speedOf(const UpdateProgress& progress) {
    constexpr std::chrono::milliseconds kEnough{300};
    if (progress.elapsed < kEnough || progress.percent <= progress.percentAtStart) return std::nullopt;
    return (progress.percent - progress.percentAtStart) / static_cast<double>(progress.elapsed.count());
}

/// What there is to say besides the percentage, the most useful first.
std::vector<std::string> details(const UpdateProgress& progress) {
    std::vector<std::string> parts;
    if (progress.bytes != 0) {
        // An estimate: the service tells percent, and the image's size is what this program knows.
        parts.push_back(byteText(progress.bytes * progress.percent / 100) + " of " +
                        byteText(progress.bytes));
    }
    const std::optional<double> speed = speedOf(progress);
    if (!speed || progress.percent >= 100) return parts;
    if (progress.bytes != 0) {
        const double perSecond = *speed * 1000 / 100 * static_cast<double>(progress.bytes);
        parts.push_back(byteText(static_cast<std::uint64_t>(perSecond)) + "/s");
    }
    const double left = (100 - progress.percent) / *speed / 1000;
    parts.push_back(durationText(std::chrono::seconds(std::llround(std::ceil(left)))) + " left");
    return parts;
}

std::string bar(unsigned percent, std::size_t length) {
    const std::size_t done = length * percent / 100;
    std::string result(done, '=');
    if (done < length) result += '>';
    result.resize(length, ' ');
    return "[" + result + "]";
}

}  // namespace

std::string barText(const UpdateProgress& progress, std::size_t width) {
    constexpr std::size_t kLeastBar = 8;
    constexpr std::size_t kWidestBar = 40;
    const std::string head = printable(progress.adapter) + "  ";
    std::string tail = utils::formatStr(" %3u %%", progress.percent);
    for (const std::string& part : details(progress)) {
        // What does not fit next to the shortest bar is left out.
        if (columnsOf(head) + kLeastBar + 2 + tail.size() + 2 + part.size() > width) break;
        tail += "  " + part;
    }
    const std::size_t taken = columnsOf(head) + 2 + tail.size();
    if (taken + kLeastBar > width) return head + tail.substr(1);
    return head + bar(progress.percent, std::min(kWidestBar, width - taken)) + tail;
}

std::string lineText(const UpdateProgress& progress) {
    std::string text = printable(progress.adapter) + ": " + std::to_string(progress.percent) + " %";
    for (const std::string& part : details(progress))
        text += ", " + part;
    return text;
}

std::string byteText(std::uint64_t bytes) {
    constexpr std::array<const char*, 4> kUnits = {"KiB", "MiB", "GiB", "TiB"};
    if (bytes < 1024) return std::to_string(bytes) + " B";
    double value = static_cast<double>(bytes) / 1024;
    std::size_t unit = 0;
    while (value >= 1024 && unit + 1 < kUnits.size()) {
        value /= 1024;
        ++unit;
    }
    return utils::formatStr("%.1f %s", value, kUnits[unit]);
}

std::string durationText(std::chrono::seconds duration) {
    const auto total = static_cast<unsigned long long>(duration.count());
    if (total < 3600) return utils::formatStr("%llu:%02llu", total / 60, total % 60);
    return utils::formatStr("%llu:%02llu:%02llu", total / 3600, total / 60 % 60, total % 60);
}

ProgressDisplay::ProgressDisplay(LinePrinter& printer, Clock clock)
    : m_printer(printer), m_clock(std::move(clock)) {}

void ProgressDisplay::started(const std::string& adapter, std::uint64_t bytes) {
    m_progress = {adapter, 0, bytes, std::chrono::milliseconds(0), 0};
    m_movesSince.reset();
    // A log says right away what the program waits for; a bar appears with the first look at the job.
    if (!m_printer.canRewrite()) showLine(m_clock());
}

void ProgressDisplay::progressed(unsigned percent) {
    const auto now = m_clock();
    // The time before the first progress is the service's preparation, which says nothing of the speed.
    if (!m_movesSince && percent > 0) {
        m_movesSince = now;
        m_progress.percentAtStart = percent;
    }
    m_progress.percent = percent;
    if (m_movesSince)
        m_progress.elapsed = std::chrono::duration_cast<std::chrono::milliseconds>(now - *m_movesSince);

    if (m_printer.canRewrite()) {
        m_printer.rewrite(barText(m_progress, m_printer.width()));
        // Now and then even when nothing moves: a silent log looks like a program that hangs.
    } else if (percent >= m_lastLine + kLineEveryPercent || (percent == 100 && m_lastLine != 100) ||
               now - m_lastLineAt >= kLineAtLeastEvery) {
        showLine(now);
    }
}

void ProgressDisplay::showLine(std::chrono::steady_clock::time_point now) {
    m_printer.print(lineText(m_progress));
    // Rounded down, so that lines come at about 10, 20 and 30, however the looks at the job happen to fall.
    m_lastLine = m_progress.percent - m_progress.percent % kLineEveryPercent;
    m_lastLineAt = now;
}

void ProgressDisplay::interrupted() {
    m_printer.print("The update of " + printable(m_progress.adapter) +
                    " cannot be stopped halfway: it runs to its end, and this program waits for it.");
}

void ProgressDisplay::ended() {
    m_printer.keep();
}

}  // namespace cli
