// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <CLI/CLI.hpp>
#include <string>
#include <vector>

#include "Cli/Arguments/Arguments.h"

/// How the command line is put together and read with the help of the library; for the files of this folder.
namespace cli {

/// An option, or without dashes an argument, that takes one value.
template <class Value>
CLI::Option* addValue(CLI::App& app, const char* name, Value& value, const char* type,
                      const char* description) {
    return app.add_option(name, value, description)->type_name(type);
}

/// Whether it is no flag. The size of its type does not tell, which the library gives to flags, too.
inline bool takesValue(const CLI::Option& option) {
    return option.get_items_expected_max() > 0;
}

/// Adds the verbs with what each takes, in the order in which the help lists them. Reading the command line
/// then fills the arguments, which have to live until that is done.
void addVerbs(CLI::App& app, Arguments& arguments);

inline constexpr const char* kAskHelp = "\"quenxctl --help\" lists the verbs and options.";

/// Every verb that was added.
std::vector<const CLI::App*> verbsOf(const CLI::App& app);

/// What is wrong with a command line that the library could not read, in this program's words.
CommandError wrongUse(const CLI::App& app, const CLI::ParseError& error);

/// For a name that no verb has; suggests the one that may have been meant.
CommandError unknownVerb(const CLI::App& app, const std::string& name);

/// The sentence that leads to the help of a verb.
std::string askHelpOf(const CLI::App& verb);

}  // namespace cli
