// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <functional>
#include <optional>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

namespace cli {

/// The text with the bytes of control characters, of those that change the direction of writing, break lines
/// or cannot be seen, and of what is not UTF-8 written as \xNN: a text of a device, a file or a server must
/// not drive the terminal.
std::string printable(std::string_view text);

/// The columns that a UTF-8 text takes, each character one; bytes that are not UTF-8 count as one each.
std::size_t columnsOf(std::string_view text);

/// The text cut in the middle to at most `width` columns, "..." in the place of what is left out.
std::string elideMiddle(std::string_view text, std::size_t width);

/// Takes from the text what fits into `width` columns, up to a space where there is one; a text without any
/// is cut anywhere. @param width  at least 1
std::string takeLine(std::string& text, std::size_t width);

/// The text on as many lines as `width` columns take; the further ones begin `indent` columns in.
/// @param indent  less than the width
std::vector<std::string> wrapped(std::string text, std::size_t width, std::size_t indent = 0);

/// The columns of the terminal that the stream writes to; no limit for a pipe or a file, for another stream
/// than standard output and standard error, and where the terminal does not say.
std::size_t widthOf(const std::ostream& out);

/// What a file descriptor can show: asked once, when the program starts.
struct Terminal {
    /// True when a line can be written over: a terminal, unless TERM is "dumb" or NO_COLOR is set.
    bool canRewrite = false;
    /// Its width is asked for at each line, since people resize windows.
    int descriptor = -1;

    static Terminal of(int descriptor);
    /// In columns; 80 when the terminal does not say.
    std::size_t width() const;
};

/// The line that the user answers with. Nothing where standard input is no terminal, or when an interruption
/// is asked for; empty when nothing was typed.
/// @param isInterrupted  asked now and then while nothing is typed; empty where a signal ends the program
std::optional<std::string> askOnTerminal(const std::string& prompt,
                                         const std::function<bool()>& isInterrupted);

/// Puts lines on one terminal or into one file: lines that stay, and on a terminal one line at the bottom
/// that is written over.
class LinePrinter {
  public:
    LinePrinter(std::ostream& out, Terminal terminal) : m_out(out), m_terminal(terminal) {}
    /// Leaves the bottom line where it is and ends it.
    ~LinePrinter() { keep(); }
    LinePrinter(const LinePrinter&) = delete;
    LinePrinter& operator=(const LinePrinter&) = delete;

    /// False for a pipe, a file or a dumb terminal: nothing can be written over there.
    bool canRewrite() const { return m_terminal.canRewrite; }
    /// The columns that rewrite() has.
    std::size_t width() const;

    /// A line that stays. Like rewrite(), left out where nobody reads what was written before: an update must
    /// not wait for that.
    void print(const std::string& line);
    /// The line at the bottom, in the place of the previous one, cut in the middle to the width. Only when
    /// canRewrite().
    void rewrite(const std::string& line);
    /// Lets the bottom line stay.
    void keep();

  private:
    bool wouldBlock() const;

    std::ostream& m_out;
    Terminal m_terminal;
    std::string m_bottom;
};

}  // namespace cli
