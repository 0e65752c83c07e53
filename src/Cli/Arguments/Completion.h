// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <CLI/CLI.hpp>
#include <string>
#include <vector>

#include "Cli/Arguments/Arguments.h"

namespace cli {

/// The word after which the rest of a command line is completed and not carried out; for the scripts of
/// shells.
inline constexpr const char* kCompleteWord = "complete";

/// What the last of the words of a command line may become: what the program itself takes is printed, one
/// candidate a line with a tab and its description, or ":files" for files. What only the model knows is left
/// to the arguments, whose verb then prints it; they have none where nothing is left.
/// @param words  without the program's name; the last one may be empty
void complete(CLI::App& app, const std::vector<std::string>& words, Arguments& arguments);

}  // namespace cli
