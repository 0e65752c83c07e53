// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/CommandLine.h"

#include <unistd.h>

#include <CLI/CLI.hpp>
#include <iostream>

#include "Framework/Requests/ProviderLibraries.h"
#include "Host/Daemon/SettingsField.h"

namespace host {

namespace {

constexpr const char* kDefaultFile = "/etc/quenx-cimd/quenx-cimd.toml";
constexpr int kWrongUse = 2;

/// The texts given for a setting; empty when its option was not used.
struct GivenOption {
    SettingsField field;
    std::vector<std::string> texts;
};

void addOptions(CLI::App& app, std::vector<GivenOption>& given) {
    for (GivenOption& each : given) {
        const std::string help = each.field.help + " [" + each.field.text() + "]";
        CLI::Option* option = app.add_option(each.field.option(), each.texts, help);
        option->group("Settings (" + each.field.key.substr(0, each.field.key.find('.')) + ".* in the file)");
        if (each.field.isFlag()) option->expected(0, 1)->default_str("true");
        if (!each.field.isList() && !each.field.isFlag()) option->expected(1);
        option->type_name(each.field.isFlag() ? "BOOL" : each.field.isText() ? "TEXT" : "NUMBER");
    }
}

void applyOptions(const std::vector<GivenOption>& given, Settings& settings) {
    const std::vector<SettingsField> fields = fieldsOf(settings);
    for (std::size_t i = 0; i < given.size(); ++i) {
        if (given[i].texts.empty()) continue;
        if (fields[i].isList()) std::get<std::vector<std::string>*>(fields[i].target)->clear();
        for (const std::string& text : given[i].texts)
            fields[i].set(text);
    }
}

void readFile(const std::string& named, Settings& settings) {
    if (!named.empty()) {
        readSettingsFile(named, settings);
    } else if (::access(kDefaultFile, F_OK) == 0) {
        readSettingsFile(kDefaultFile, settings);
    }
}

}  // namespace

CommandLine readCommandLine(int argc, const char* const* argv) {
    CommandLine result;
    result.settings.providers = core::ProviderLibraries::defaultDirectory();
    CLI::App app(
        "Serves firmware updates of Ethernet adapters over CIM-XML.\n\n"
        "Runs in the foreground until SIGTERM or SIGINT. It then finishes the requests and updates that "
        "have\n"
        "begun; a second signal does not hurry it. SIGHUP reloads the certificate, the key and the users.\n\n"
        "Exit status: 0 success, 1 failure, 2 wrong use or a fault that --check-config found.\n",
        "quenx-cimd");
    app.set_version_flag("--version", QUENX_VERSION);
    std::string file;
    app.add_option("--config", file, std::string("configuration file [") + kDefaultFile + ", if it exists]");
    app.add_flag("--check-config", result.checkOnly, "check all that a start needs, and exit");
    std::vector<GivenOption> given;
    for (const SettingsField& field : fieldsOf(result.settings))
        given.push_back({field, {}});
    addOptions(app, given);

    PasswdRequest passwd;
    CLI::App* command = app.add_subcommand("passwd", "Add, change or remove a user of the users file.");
    command->fallthrough();
    command->add_option("USER", passwd.user, "name of the user")->required();
    command->add_option("--users", passwd.usersFile, "the users file [auth.users_file]");
    command->add_flag("--reader", passwd.isReader, "the user may only read");
    command->add_flag("--delete", passwd.remove, "remove the user");
    try {
        app.parse(argc, argv);
        readFile(file, result.settings);
        applyOptions(given, result.settings);
        checkSettings(result.settings);
    } catch (const CLI::ParseError& error) {
        result.exitStatus = app.exit(error) == 0 ? 0 : kWrongUse;
    } catch (const std::runtime_error& error) {
        std::cerr << "quenx-cimd: " << error.what() << '\n';
        result.exitStatus = kWrongUse;
    }
    if (command->parsed()) {
        if (passwd.usersFile.empty()) passwd.usersFile = result.settings.authentication.usersFile;
        passwd.isAsked = result.settings.authentication.method == "users";
        result.passwd = passwd;
    }
    return result;
}

}  // namespace host
