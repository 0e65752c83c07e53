// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace cli {

/// What a file descriptor can show: asked once, when the program starts.
struct Terminal {
    /// True when a line can be written over: a terminal, unless TERM is "dumb" or NO_COLOR is set.
    bool canRewrite = false;
    /// Whose width is asked for each line, since people resize windows.
    int descriptor = -1;

    static Terminal of(int descriptor);

    /// Columns; nothing when there is no telling.
    std::optional<std::size_t> width() const;
};

/// The text cut in the middle to at most `width` columns, "..." in the place of what is left out.
std::string elideMiddle(std::string_view text, std::size_t width);

/// The text with control characters written as \xNN, so that a device's or a file's text cannot drive the
/// terminal.
std::string printable(std::string_view text);

}  // namespace cli
