// SPDX-License-Identifier: Apache-2.0
#include "Cli/ProgressText.h"

#include <array>
#include <cmath>
#include <vector>

#include "Cli/Terminal.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr std::size_t LEAST_BAR = 8;
constexpr std::size_t WIDEST_BAR = 40;

/// What there is to say beside the percentage, in the order of its worth.
std::vector<std::string> details(const Progress& progress) {
    std::vector<std::string> parts;
    if (progress.bytes != 0) {
        parts.push_back(byteText(progress.bytes * progress.percent / 100) + " of " +
                        byteText(progress.bytes));
    }
    const std::optional<double> speed = speedOf(progress);
    if (speed && progress.percent < 100) {
        if (progress.bytes != 0) {
            const double perSecond = *speed * 1000 / 100 * static_cast<double>(progress.bytes);
            parts.push_back(byteText(static_cast<std::uint64_t>(perSecond)) + "/s");
        }
        const double left = (100 - progress.percent) / *speed / 1000;
        parts.push_back(durationText(std::chrono::seconds(std::llround(std::ceil(left)))) + " left");
    }
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

std::optional<double> speedOf(const Progress& progress) {
    constexpr std::chrono::milliseconds ENOUGH{300};
    if (progress.elapsed < ENOUGH || progress.percent <= progress.percentAtStart) return std::nullopt;
    return (progress.percent - progress.percentAtStart) / static_cast<double>(progress.elapsed.count());
}

std::string barText(const Progress& progress, std::size_t width) {
    const std::string head = printable(progress.adapter) + "  ";
    std::string tail = utils::formatStr(" %3u %%", progress.percent);
    for (const std::string& part : details(progress)) {
        // What does not fit beside the shortest bar is left out.
        if (head.size() + LEAST_BAR + 2 + tail.size() + 2 + part.size() > width) break;
        tail += "  " + part;
    }
    const std::size_t taken = head.size() + 2 + tail.size();
    if (taken + LEAST_BAR > width) return head + tail.substr(1);
    return head + bar(progress.percent, std::min(WIDEST_BAR, width - taken)) + tail;
}

std::string lineText(const Progress& progress) {
    std::string text = printable(progress.adapter) + ": " + std::to_string(progress.percent) + " %";
    for (const std::string& part : details(progress))
        text += ", " + part;
    return text;
}

std::string byteText(std::uint64_t bytes) {
    constexpr std::array<const char*, 4> UNITS = {"KiB", "MiB", "GiB", "TiB"};
    if (bytes < 1024) return std::to_string(bytes) + " B";
    double value = static_cast<double>(bytes) / 1024;
    std::size_t unit = 0;
    while (value >= 1024 && unit + 1 < UNITS.size()) {
        value /= 1024;
        ++unit;
    }
    return utils::formatStr("%.1f %s", value, UNITS[unit]);
}

std::string durationText(std::chrono::seconds duration) {
    const auto total = static_cast<unsigned long long>(duration.count());
    if (total < 3600) return utils::formatStr("%llu:%02llu", total / 60, total % 60);
    return utils::formatStr("%llu:%02llu:%02llu", total / 3600, total / 60 % 60, total % 60);
}

}  // namespace cli
