// SPDX-License-Identifier: Apache-2.0
#include "Cli/ProgressDisplay.h"

namespace cli {

namespace {

constexpr unsigned LINE_EVERY_PERCENT = 10;
constexpr std::chrono::seconds LINE_AT_LEAST_EVERY{10};

}  // namespace

ProgressDisplay::ProgressDisplay(LinePrinter& printer, Clock clock)
    : printer_(printer), clock_(std::move(clock)) {}

void ProgressDisplay::started(const std::string& adapter, std::uint64_t bytes) {
    progress_ = {adapter, 0, bytes, std::chrono::milliseconds(0), 0};
    moving_ = false;
    if (!printer_.canRewrite()) showLine(clock_());
}

void ProgressDisplay::progressed(unsigned percent) {
    const auto now = clock_();
    if (!moving_ && percent > 0) {
        moving_ = true;
        firstSeen_ = now;
        progress_.percentAtStart = percent;
    }
    progress_.percent = percent;
    if (moving_) progress_.elapsed = std::chrono::duration_cast<std::chrono::milliseconds>(now - firstSeen_);

    if (printer_.canRewrite()) {
        printer_.rewrite(barText(progress_, printer_.width() - 1));
    } else if (percent >= lastLine_ + LINE_EVERY_PERCENT || (percent == 100 && lastLine_ != 100) ||
               now - lastLineAt_ >= LINE_AT_LEAST_EVERY) {
        showLine(now);
    }
}

void ProgressDisplay::showLine(std::chrono::steady_clock::time_point now) {
    printer_.print(lineText(progress_));
    // Whole steps, so that lines come at 10, 20, 30 whatever the moments of looking.
    lastLine_ = progress_.percent - progress_.percent % LINE_EVERY_PERCENT;
    lastLineAt_ = now;
}

void ProgressDisplay::interrupted() {
    printer_.print("The update of " + printable(progress_.adapter) +
                   " cannot be stopped halfway: it runs to its end, and this program waits for it.");
}

void ProgressDisplay::ended(const JobView&) {
    printer_.keep();
}

}  // namespace cli
