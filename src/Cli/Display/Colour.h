// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <ostream>
#include <string>
#include <string_view>

#include "Cli/Display/Terminal.h"

/// Colours, for eyes that look for something. None says anything that the words do not say.
namespace cli {

/// What a text is, and so how it looks where there are colours.
enum class Look { Plain, Failure, Success, Heading, Hint };

/// From now on this stream has colours if that terminal takes escape sequences. Other streams never have any:
/// what is collected, compared or read by a script stays text.
void allowColours(std::ostream& out, const Terminal& terminal);

/// The text as this stream shows it. Its escape sequences take no columns, so what is measured or cut is the
/// text before. @param text  already printable(): what it brings along is not looked at
std::string coloured(std::ostream& out, Look look, std::string_view text);

/// What somebody may do next, on a line; nothing where it is empty.
void printHint(std::ostream& out, const std::string& advice);

/// "quenxctl: What went wrong.", and below it what to do.
void printFailure(std::ostream& out, const std::string& message, const std::string& advice);

}  // namespace cli
