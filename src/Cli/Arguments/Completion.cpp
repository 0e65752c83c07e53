// SPDX-License-Identifier: Apache-2.0
#include "Cli/Arguments/Completion.h"

#include <algorithm>
#include <cstdlib>
#include <iostream>
#include <string_view>

#include "Cli/Arguments/Parsing.h"

namespace cli {

namespace {

const CLI::Option* findOption(const CLI::App& app, const std::string& word) {
    return word.starts_with('-') ? app.get_option_no_throw(word) : nullptr;
}

/// The words before the one that is completed, as far as they tell what is asked for.
struct Line {
    Line(const CLI::App& app, const std::vector<std::string>& words) : prefix(words.back()) {
        for (std::size_t i = 0; i + 1 < words.size(); ++i)
            read(app, words[i]);
    }

    std::string prefix;
    const CLI::App* verb = nullptr;
    const CLI::Option* open = nullptr;  ///< the value that comes next is that of this option
    std::size_t positionals = 0;
    std::vector<std::string> common;  ///< options of every verb, with their values

  private:
    void read(const CLI::App& app, const std::string& word) {
        if (open != nullptr) {
            if (m_isCommon) common.push_back(word);
            open = nullptr;
            return;
        }
        const CLI::Option* option = verb == nullptr ? nullptr : findOption(*verb, word);
        m_isCommon = option == nullptr;
        if (option == nullptr) option = findOption(app, word);
        if (option != nullptr) {
            if (m_isCommon) common.push_back(word);
            if (takesValue(*option)) open = option;
            return;
        }
        if (word.starts_with('-')) return;  // with its value behind "=", or misspelt
        if (verb != nullptr) {
            ++positionals;
            return;
        }
        const auto verbs = verbsOf(app);
        const auto found =
            std::ranges::find_if(verbs, [&](const auto* each) { return each->check_name(word); });
        if (found != verbs.end()) verb = *found;
    }

    bool m_isCommon = false;
};

void print(const std::string& prefix, const std::string& word, const std::string& description = "") {
    if (word.starts_with(prefix)) std::cout << word << '\t' << description << '\n';
}

void printOptions(const CLI::App& app, const std::string& prefix) {
    for (const CLI::Option* option : app.get_options())
        for (const std::string& name : option->get_lnames())
            print(prefix, "--" + name, option->get_description());
}

/// The argument of the verb whose turn it is.
const CLI::Option* nextArgument(const Line& line) {
    std::size_t index = 0;
    for (const CLI::Option* option : line.verb->get_options()) {
        if (!option->get_positional()) continue;
        const bool takesAll = option->get_items_expected_max() > 1;
        if (takesAll || index++ == line.positionals) return option;
    }
    return nullptr;
}

/// Which verb of candidates finds values of this kind.
CandidateKind kindOf(std::string_view type) {
    if (type == "ADAPTER") return CandidateKind::Adapters;
    if (type == "JOB") return CandidateKind::Jobs;
    return CandidateKind::None;
}

/// The candidates that only the model knows: asked as the options so far say, and never for a password.
void leaveToModel(CLI::App& app, const Line& line, CandidateKind kind, Arguments& arguments) {
    std::vector<std::string> words = line.common;
    words.emplace_back(kind == CandidateKind::Jobs ? "jobs" : "adapters");
    std::ranges::reverse(words);  // as the library wants them
    app.parse(words);
    const bool asksUser = arguments.server.url && arguments.server.url->socket().empty() &&
                          std::getenv("QUENXCTL_PASSWORD") == nullptr;
    if (asksUser) {
        arguments.verb = nullptr;
        return;
    }
    arguments.options.candidates = {kind, line.prefix};
}

void completeValue(CLI::App& app, const Line& line, const CLI::Option& option, Arguments& arguments) {
    const std::string type = option.get_type_name();
    CandidateKind kind = kindOf(type);
    if (option.check_lname("identity")) kind = CandidateKind::Identities;
    if (kind != CandidateKind::None) return leaveToModel(app, line, kind, arguments);
    if (option.check_lname("backend"))
        for (const char* name : {"auto", "devlink", "simulator"})
            print(line.prefix, name);
    else if (type == "MANAGER")
        for (const char* name : {"sfcb", "pegasus"})
            print(line.prefix, name);
    else if (type == "VERB")
        for (const CLI::App* verb : verbsOf(app))
            print(line.prefix, verb->get_name(), verb->get_description());
    else if (type == "FILE" || type == "DIR" || type == "URI")
        std::cout << ":files\n";
}

}  // namespace

void complete(CLI::App& app, const std::vector<std::string>& words, Arguments& arguments) {
    const Line line(app, words.empty() ? std::vector<std::string>{""} : words);
    if (line.open != nullptr) return completeValue(app, line, *line.open, arguments);
    if (line.prefix.starts_with('-')) {
        if (line.verb != nullptr) printOptions(*line.verb, line.prefix);
        return printOptions(app, line.prefix);
    }
    if (line.verb == nullptr) {
        for (const CLI::App* verb : verbsOf(app))
            print(line.prefix, verb->get_name(), verb->get_description());
        return;
    }
    if (const CLI::Option* argument = nextArgument(line)) completeValue(app, line, *argument, arguments);
}

}  // namespace cli
