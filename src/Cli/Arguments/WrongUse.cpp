// SPDX-License-Identifier: Apache-2.0
#include <CLI/CLI.hpp>
#include <algorithm>
#include <set>

#include "Cli/Arguments/Parsing.h"

namespace cli {

namespace {

bool isLongOption(const std::string& word) {
    return word.size() > 2 && word.starts_with("--");
}

/// The long options that could have been meant: those of the verb, or of every verb where none was read.
/// Short ones are too short to tell what was meant.
std::vector<std::string> optionsOf(const CLI::App& app, const CLI::App* verb) {
    std::vector<const CLI::App*> takers = verb == nullptr ? verbsOf(app) : std::vector{verb};
    takers.push_back(&app);
    std::set<std::string> names;
    for (const CLI::App* taker : takers) {
        for (const CLI::Option* option : taker->get_options()) {
            for (const std::string& name : option->get_lnames())
                names.insert("--" + name);
        }
    }
    return {names.begin(), names.end()};
}

/// A misspelt option is the cause of what the library tells first: that another is missing.
std::optional<CommandError> unknownOption(const CLI::App& app, const CLI::App* verb) {
    const std::vector<std::string> rest = app.remaining(true);
    const auto word = std::find_if(rest.begin(), rest.end(), isLongOption);
    // Behind an unknown verb, options may be right for the verb that was meant.
    if (word == rest.end() || (verb == nullptr && word != rest.begin())) return std::nullopt;
    const std::string name = word->substr(0, word->find('='));
    const std::vector<std::string> known = optionsOf(app, verb);
    if (std::find(known.begin(), known.end(), name) != known.end()) return std::nullopt;
    const std::string subject = verb == nullptr ? "There is" : "\"" + verb->get_name() + "\" has";
    return CommandError(ExitStatus::WrongUse, subject + " no option \"" + name + "\".",
                        didYouMean(name, known) + (verb == nullptr ? kAskHelp : askHelpOf(*verb)));
}

/// What the library found wrong, in this program's words; its own text names the option.
std::string messageOf(const CLI::App& app, const CLI::App& verb, const CLI::ParseError& error) {
    const std::string text = error.what();
    const std::size_t dashes = text.find("--");
    const std::size_t start = dashes == std::string::npos ? 0 : dashes;
    const std::string option = text.substr(start, text.find_first_of(": ", start) - start);
    const CLI::Option* known = verb.get_option_no_throw(option);
    constexpr std::string_view kValue = " = ";
    switch (static_cast<CLI::ExitCodes>(error.get_exit_code())) {
        case CLI::ExitCodes::ExtrasError:
            return "Unexpected argument \"" + app.remaining(true).front() + "\".";
        case CLI::ExitCodes::ExcludesError:
            return option + " cannot be used with " + text.substr(text.rfind(' ') + 1) + ".";
        case CLI::ExitCodes::ArgumentMismatch:
            return option + (text.find("At Most") == std::string::npos ? " needs a value."
                                                                       : " can be given only once.");
        case CLI::ExitCodes::ConversionError:
            // Texts always convert, so it was a number or a flag.
            if (known == nullptr || !takesValue(*known)) return option + " takes no value.";
            return option + " is \"" + text.substr(text.find(kValue) + kValue.size()) +
                   "\", which is no number that it can take.";
        case CLI::ExitCodes::RequiredError: {
            // Arguments have a name only to the library; the help shows what they are.
            const bool isArgument = known != nullptr && known->get_positional();
            return (isArgument ? known->get_type_name() : option) + " is required.";
        }
        default:
            return text + ".";
    }
}

}  // namespace

std::vector<const CLI::App*> verbsOf(const CLI::App& app) {
    return app.get_subcommands([](const CLI::App*) { return true; });
}

CommandError unknownVerb(const CLI::App& app, const std::string& name) {
    std::vector<std::string> names;
    for (const CLI::App* verb : verbsOf(app)) {
        names.push_back(verb->get_name());
        names.insert(names.end(), verb->get_aliases().begin(), verb->get_aliases().end());
    }
    return {ExitStatus::WrongUse, "There is no verb \"" + name + "\".", didYouMean(name, names) + kAskHelp};
}

std::string askHelpOf(const CLI::App& verb) {
    return "\"quenxctl help " + verb.get_name() + "\" lists what it takes.";
}

CommandError wrongUse(const CLI::App& app, const CLI::ParseError& error) {
    const auto verbs = app.get_subcommands();
    const CLI::App* verb = verbs.empty() ? nullptr : verbs.front();
    if (const std::optional<CommandError> unknown = unknownOption(app, verb)) return *unknown;
    if (verb != nullptr) return {ExitStatus::WrongUse, messageOf(app, *verb, error), askHelpOf(*verb)};
    // A word that belongs to nothing stands where a verb would.
    const std::vector<std::string> rest = app.remaining();
    if (!rest.empty() && !rest.front().starts_with('-')) return unknownVerb(app, rest.front());
    return {ExitStatus::WrongUse, messageOf(app, app, error), kAskHelp};
}

}  // namespace cli
