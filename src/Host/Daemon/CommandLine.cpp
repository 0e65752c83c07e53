// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/CommandLine.h"

#include <unistd.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <iostream>

#include "Framework/Requests/ProviderSession.h"
#include "Host/Daemon/SettingsField.h"

namespace host {

namespace {

constexpr const char* kDefaultFile = "/etc/quenx-cimd/quenx-cimd.toml";
constexpr int kWrongUse = 2;
constexpr const char* kDescription =
    "Serves firmware updates of Ethernet adapters over CIM-XML.\n\n"
    "Runs in the foreground until SIGTERM or SIGINT. It then finishes the requests and updates that have\n"
    "begun; a second signal does not hurry it. SIGHUP reloads the certificate, the key and the users.\n\n"
    "Exit status: 0 success, 1 failure, 2 wrong use or a fault that --check-config found.\n";

/// The texts given for a setting; empty when its option was not used.
struct GivenOption {
    SettingsField field;
    std::vector<std::string> texts;
};

/// Options are taken as texts: CLI11 would say in its own words what is wrong with a number, while the file's
/// mistakes are told in ours.
void addOptions(CLI::App& app, std::vector<GivenOption>& given) {
    for (GivenOption& each : given) {
        const std::string range = each.field.isNumber() ? "; " + each.field.range() : "";
        const std::string help = each.field.help + " [" + each.field.text() + range + "]";
        CLI::Option* option = app.add_option(each.field.option(), each.texts, help);
        option->group("Settings (" + each.field.key.substr(0, each.field.key.find('.')) + ".* in the file)");
        // "--listen-http" alone turns it on; "--listen-https=false" needs the equals sign.
        if (each.field.isFlag()) option->expected(0, 1)->default_str("true");
        if (!each.field.isList() && !each.field.isFlag()) option->expected(1);
        option->type_name(each.field.isFlag() ? "BOOL" : each.field.isText() ? "TEXT" : "NUMBER");
    }
}

/// Options override the file, so they are applied when it has been read.
void applyOptions(const std::vector<GivenOption>& given) {
    for (const auto& [field, texts] : given) {
        // One --auth-readers replaces the whole list of the file: else nobody could be taken off it.
        if (field.isList() && !texts.empty()) std::get<std::vector<std::string>*>(field.target)->clear();
        for (const std::string& text : texts)
            field.set(text);
    }
}

/// The default file may be missing; one that somebody names may not.
void readFile(const std::string& named, Settings& settings) {
    if (!named.empty()) {
        readSettingsFile(named, settings);
    } else if (::access(kDefaultFile, F_OK) == 0) {
        readSettingsFile(kDefaultFile, settings);
    }
}

CLI::App* addPasswd(CLI::App& app, PasswdRequest& passwd) {
    CLI::App* command = app.add_subcommand("passwd", "Add, change or remove a user of the users file.");
    // Options of the program may stand behind the command, too.
    command->fallthrough();
    command->add_option("USER", passwd.user, "name of the user");
    command->add_option("--users", passwd.usersFile, "the users file [auth.users_file]");
    command->add_flag("--reader", passwd.isReader, "the user may only read");
    command->add_flag("--delete", passwd.isRemoval, "remove the user");
    return command;
}

/// What asks for two things at a time, or for half of one, is refused: nothing is left out silently.
void checkPasswd(const PasswdRequest& passwd, bool checkOnly) {
    if (passwd.user.empty())
        throw std::runtime_error("passwd needs the name of a user, such as: quenx-cimd passwd admin");
    if (passwd.isReader && passwd.isRemoval) {
        throw std::runtime_error(
            "--delete removes the user, so --reader has nothing to change. Give only one of them.");
    }
    if (checkOnly)
        throw std::runtime_error("--check-config and passwd are two commands. Give only one of them.");
}

/// What is wrong with words that CLI11 does not know, and what there is in their place.
std::string unknownWord(const std::vector<std::string>& words, const std::vector<GivenOption>& options) {
    const auto isOption = [](const std::string& word) { return word.starts_with("-"); };
    const auto found = std::find_if(words.begin(), words.end(), isOption);
    if (found == words.end())
        return "\"" + words.front() + "\" is not expected here. The only command is passwd.";
    const std::string name = found->substr(0, found->find('='));
    const std::string section = name.substr(0, name.find('-', 2) + 1);
    std::string known;
    for (const GivenOption& each : options) {
        const std::string option = each.field.option();
        if (!section.empty() && option.starts_with(section)) known += (known.empty() ? "" : ", ") + option;
    }
    return "There is no option " + name + "." + (known.empty() ? "" : " There are " + known + ".");
}

std::string mistakeIn(const CLI::App& app, const CLI::ParseError& error,
                      const std::vector<GivenOption>& options) {
    const std::vector<std::string> unknown = app.remaining(true);
    const bool isUnknown = dynamic_cast<const CLI::ExtrasError*>(&error) != nullptr && !unknown.empty();
    return (isUnknown ? unknownWord(unknown, options) : std::string(error.what()) + ".") +
           " \"quenx-cimd --help\" lists all options.";
}

}  // namespace

CommandLine readCommandLine(int argc, const char* const* argv) {
    CommandLine result;
    result.settings.providers = core::ProviderLibraries::defaultDirectory();
    CLI::App app(kDescription, "quenx-cimd");
    app.set_version_flag("--version", QUENX_VERSION);
    std::string file;
    app.add_option("--config", file, std::string("configuration file [") + kDefaultFile + ", if it exists]");
    app.add_flag("--check-config", result.checkOnly, "check all that a start needs, and exit");
    std::vector<GivenOption> given;
    for (const SettingsField& field : fieldsOf(result.settings))
        given.push_back({field, {}});
    addOptions(app, given);
    PasswdRequest passwd;
    const CLI::App* passwdCommand = addPasswd(app, passwd);
    const auto refuse = [&](const std::string& mistake) {
        std::cerr << "quenx-cimd: " << mistake << '\n';
        result.exitStatus = kWrongUse;
    };
    try {
        app.parse(argc, argv);
        if (passwdCommand->parsed()) checkPasswd(passwd, result.checkOnly);
        // The file in between: the command line names it, and overrides what it says.
        readFile(file, result.settings);
        applyOptions(given);
        checkSettings(result.settings);
    } catch (const CLI::Success& helpOrVersion) {
        result.exitStatus = app.exit(helpOrVersion);
    } catch (const CLI::ParseError& error) {
        refuse(mistakeIn(app, error, given));
    } catch (const std::runtime_error& error) {
        refuse(error.what());
    }
    if (passwdCommand->parsed()) {
        passwd.configured = result.settings.authentication;
        if (passwd.usersFile.empty()) passwd.usersFile = passwd.configured.usersFile;
        result.passwd = passwd;
    }
    return result;
}

}  // namespace host
