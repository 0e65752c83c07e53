// SPDX-License-Identifier: Apache-2.0
#include "Cli/LinePrinter.h"

namespace cli {

namespace {

constexpr const char* CLEAR_LINE = "\r\x1B[K";

}  // namespace

void LinePrinter::print(const std::string& line) {
    if (!bottom_.empty()) out_ << CLEAR_LINE;
    out_ << line << '\n' << bottom_ << std::flush;
}

void LinePrinter::rewrite(const std::string& line) {
    // The last column is left free: some terminals wrap as soon as it is written.
    bottom_ = elideMiddle(line, width() - 1);
    out_ << CLEAR_LINE << bottom_ << std::flush;
}

void LinePrinter::keep() {
    if (bottom_.empty()) return;
    bottom_.clear();
    out_ << '\n' << std::flush;
}

}  // namespace cli
