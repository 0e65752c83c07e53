// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <ostream>
#include <string>

#include "Cli/Terminal.h"

namespace cli {

/// Puts lines on one terminal or into one file: lines that stay, and on a terminal one line at the bottom
/// that is written over. The last of the three layers of the progress display.
class LinePrinter {
  public:
    LinePrinter(std::ostream& out, Terminal terminal) : out_(out), terminal_(terminal) {}
    /// Leaves the bottom line where it is, with a line end behind it.
    ~LinePrinter() { keep(); }
    LinePrinter(const LinePrinter&) = delete;
    LinePrinter& operator=(const LinePrinter&) = delete;

    /// False for a pipe, a file or a dumb terminal: nothing can be written over there.
    bool canRewrite() const { return terminal_.canRewrite; }
    std::size_t width() const { return terminal_.width().value_or(80); }

    /// A line that stays.
    void print(const std::string& line);
    /// The line at the bottom, in the place of the previous one, cut in the middle to the width. Only when
    /// canRewrite().
    void rewrite(const std::string& line);
    /// Lets the bottom line stay.
    void keep();

  private:
    std::ostream& out_;
    Terminal terminal_;
    std::string bottom_;
};

}  // namespace cli
