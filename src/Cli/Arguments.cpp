// SPDX-License-Identifier: Apache-2.0
#include "Cli/Arguments.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <iostream>
#include <memory>
#include <set>
#include <string_view>

#include "Cli/Failure.h"
#include "Cli/Suggestion.h"
#include "Utils/Utils.h"

#ifndef QUENX_VERSION
#define QUENX_VERSION "unknown"
#endif

namespace cli {

namespace {

constexpr const char* FOOTER =
    "Exit status:\n"
    "  0  done\n"
    "  1  failed or refused: the message says what happened, and what to do next where that helps\n"
    "  2  wrong use: the command line itself is wrong, or a file that an option names cannot be used\n"
    "  3  already current: what was to be installed is what is installed (see --force)\n"
    "  4  not found: there is no such adapter, image file, identity, job, class or instance\n";

constexpr const char* TARGET_TEXT = "Adapter: its name, PCI address or object path";
constexpr const char* IDENTITY_TEXT = "Image: a software identity that \"identities\" lists";

std::vector<std::string> typesOf(std::string text) {
    utils::replaceCharacter(text, '+', ',');
    std::vector<std::string> types;
    for (const std::string& piece : utils::split(text, ','))
        types.push_back(utils::trim(piece));
    return types;
}

void addServerOptions(CLI::App& app, Arguments& arguments, const std::vector<CLI::Option*>& localOptions) {
    ServerSettings& server = arguments.server;
    CLI::Option* url =
        app.add_option_function<std::string>(
               "--server", [&arguments](const std::string& text) { arguments.serverUrl.emplace(text); },
               "Use a WBEM server (https://host:5989) instead of this process; images are then files on "
               "that host")
            ->type_name("URL");
    for (CLI::Option* option : localOptions)
        option->excludes(url);
    app.add_option("--user", server.user,
                   "User on the server (default: QUENXCTL_USER, else asked for); the password is taken from "
                   "QUENXCTL_PASSWORD or asked for")
        ->type_name("NAME")
        ->needs(url);
    app.add_option("--namespace", server.namespaceName, "Namespace on the server")
        ->type_name("NAME")
        ->capture_default_str()
        ->needs(url);
    CLI::Option* trusted = app.add_option("--cacert", server.caFile, "Trust the certificates in this file")
                               ->type_name("FILE")
                               ->needs(url);
    app.add_flag("--insecure", server.insecure, "Accept any server certificate: for tests only")
        ->needs(url)
        ->excludes(trusted);
}

void addCommonOptions(CLI::App& app, Arguments& arguments) {
    app.add_flag("--json", arguments.json,
                 "Print the result, or the error, as one JSON document; progress goes to standard error");
    CLI::Option* config =
        app.add_option("--config", arguments.local.configFile,
                       "Configuration file of the providers (default: /etc/quenx-cimprovider.conf)")
            ->type_name("FILE");
    CLI::Option* adapters = app.add_option("--adapters", arguments.local.adapterDescription,
                                           "Description of simulated adapters (default: QUENX_ADAPTERS, else "
                                           "/etc/quenx-adapters.toml)")
                                ->type_name("FILE");
    app.add_option(
           "--state", arguments.local.stateDirectory,
           "Where the simulated adapters of --adapters keep their flash (default: QUENX_ADAPTER_STATE, "
           "else beside FILE, with the extension .state)")
        ->type_name("DIR")
        ->needs(adapters);
    CLI::Option* providers =
        app.add_option("--providers", arguments.local.providerDirectory,
                       "Directory of the provider libraries (default: those installed with this program)")
            ->type_name("DIR");
    addServerOptions(app, arguments, {config, adapters, providers});
}

/// The image is named in one of two ways.
void requireOneImage(const CLI::App& verb, const CLI::Option* file, const CLI::Option* identity) {
    if (file->count() + identity->count() == 1) return;
    throw CLI::ValidationError(verb.get_name(), "name one image, either as a file or with --identity");
}

CLI::Option* addTypes(CLI::App& verb, std::string& types) {
    return verb
        .add_option("--types", types,
                    "Image types to install, separated by commas (default: all in the image)")
        ->type_name("TYPES");
}

void addInstall(CLI::App& app, Arguments& arguments) {
    CLI::App* verb =
        app.add_subcommand("install", "Install a firmware image on an adapter and wait until it is done");
    verb->alias("update");
    auto order = std::make_shared<InstallOrder>();
    auto types = std::make_shared<std::string>();
    verb->add_option("--target", order->target, TARGET_TEXT)->type_name("ADAPTER")->required();
    CLI::Option* image =
        verb->add_option("image", order->image, "Image: a path or a file URI")->type_name("URI");
    CLI::Option* identity = verb->add_option("--identity", order->identity, IDENTITY_TEXT)->type_name("ID");
    addTypes(*verb, *types)->excludes(identity);
    verb->add_flag("--force", order->force, "Also install an older image, or the same one again");
    verb->footer("An update that has begun always runs to its end: Ctrl-C does not stop it.");
    verb->callback([=, &arguments] {
        requireOneImage(*verb, image, identity);
        if (!types->empty()) order->types = typesOf(*types);
        arguments.startsUpdate = true;
        arguments.verb = [order](Context& context) { return install(context, *order); };
    });
}

void addCheck(CLI::App& app, Arguments& arguments) {
    CLI::App* verb = app.add_subcommand(
        "check",
        "Say whether an image could be installed, without writing it (a server may hold the adapter)");
    auto order = std::make_shared<CheckOrder>();
    auto types = std::make_shared<std::string>();
    verb->add_option("--target", order->target, TARGET_TEXT)->type_name("ADAPTER")->required();
    CLI::Option* file =
        verb->add_option("image", order->file,
                         "Image: a path or a file URI; with --server only one that \"identities\" lists")
            ->type_name("URI");
    CLI::Option* identity = verb->add_option("--identity", order->identity, IDENTITY_TEXT)->type_name("ID");
    addTypes(*verb, *types)->excludes(identity);
    verb->add_flag("--force", order->force, "Check whether it could be installed with --force")
        ->excludes(identity);
    verb->footer("--types and --force cannot be used with --server.");
    verb->callback([=, &arguments] {
        requireOneImage(*verb, file, identity);
        if (!types->empty()) order->types = typesOf(*types);
        arguments.verb = [order](Context& context) { return check(context, *order); };
    });
}

void addInstances(CLI::App& app, Arguments& arguments) {
    CLI::App* verb = app.add_subcommand("instances", "List the instances of a class");
    auto order = std::make_shared<InstancesOrder>();
    verb->add_option("class", order->className, "Class, for example Quenx_ConcreteJob")
        ->type_name("CLASS")
        ->required();
    verb->add_flag("--names", order->namesOnly, "Only their object paths");
    verb->callback([order, &arguments] {
        arguments.verb = [order](Context& context) { return showInstances(context, *order); };
    });
}

void addAssociators(CLI::App& app, Arguments& arguments) {
    CLI::App* verb = app.add_subcommand("associators", "List the instances associated with an instance");
    auto order = std::make_shared<AssociatorsOrder>();
    verb->add_option("path", order->path, "Object path, as \"instances CLASS --names\" prints it")
        ->type_name("PATH")
        ->required();
    verb->add_option("--class", order->filter.associationClass, "Only through associations of this class")
        ->type_name("CLASS");
    verb->add_option("--result-class", order->filter.resultClass, "Only instances of this class")
        ->type_name("CLASS");
    verb->add_option("--role", order->filter.role, "Only where the instance has this role")
        ->type_name("ROLE");
    verb->add_option("--result-role", order->filter.resultRole, "Only instances with this role")
        ->type_name("ROLE");
    verb->add_flag("--names", order->namesOnly, "Only their object paths");
    verb->callback([order, &arguments] {
        arguments.verb = [order](Context& context) { return showAssociators(context, *order); };
    });
}

void addDelete(CLI::App& app, Arguments& arguments) {
    CLI::App* verb =
        app.add_subcommand("delete", "Delete a job from the list of a server; its update continues");
    auto job = std::make_shared<std::string>();
    verb->add_option("job", *job, "Job: its id as \"jobs\" lists it, or the number at its end")
        ->type_name("JOB")
        ->required();
    verb->callback(
        [job, &arguments] { arguments.verb = [job](Context& context) { return deleteJob(context, *job); }; });
}

void addPlainVerb(CLI::App& app, Arguments& arguments, const char* name, const char* description,
                  ExitStatus (*verb)(Context&)) {
    app.add_subcommand(name, description)->callback([verb, &arguments] { arguments.verb = verb; });
}

constexpr const char* ASK_HELP = "\"quenxctl --help\" lists the verbs and options.";

std::vector<const CLI::App*> verbsOf(const CLI::App& app) {
    return app.get_subcommands([](const CLI::App*) { return true; });
}

Failure unknownVerb(const CLI::App& app, const std::string& name) {
    std::vector<std::string> names;
    for (const CLI::App* verb : verbsOf(app)) {
        names.push_back(verb->get_name());
        names.insert(names.end(), verb->get_aliases().begin(), verb->get_aliases().end());
    }
    return {ExitStatus::WrongUse, "There is no verb \"" + name + "\".", didYouMean(name, names) + ASK_HELP};
}

std::string askHelpOf(const CLI::App& verb) {
    return "\"quenxctl help " + verb.get_name() + "\" lists what it takes.";
}

bool isLongOption(const std::string& word) {
    return word.size() > 2 && word.starts_with("--");
}

/// The long options that could have been meant: those of the verb, or of every verb where none was read.
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
std::optional<Failure> unknownOption(const CLI::App& app, const CLI::App* verb) {
    const std::vector<std::string> rest = app.remaining(true);
    const auto word = std::find_if(rest.begin(), rest.end(), isLongOption);
    // Behind an unknown verb, options may be right for the verb that was meant.
    if (word == rest.end() || (verb == nullptr && word != rest.begin())) return std::nullopt;
    const std::string name = word->substr(0, word->find('='));
    const std::vector<std::string> known = optionsOf(app, verb);
    if (std::find(known.begin(), known.end(), name) != known.end()) return std::nullopt;
    const std::string subject = verb == nullptr ? "There is" : "\"" + verb->get_name() + "\" has";
    return Failure(ExitStatus::WrongUse, subject + " no option \"" + name + "\".",
                   didYouMean(name, known) + (verb == nullptr ? ASK_HELP : askHelpOf(*verb)));
}

/// The library only says that a verb is missing, both where there is none and where it is unknown.
Failure wrongUse(const CLI::App& app, const CLI::ParseError& error) {
    const auto verbs = app.get_subcommands();
    const CLI::App* verb = verbs.empty() ? nullptr : verbs.front();
    if (const std::optional<Failure> unknown = unknownOption(app, verb)) return *unknown;
    if (verb != nullptr) return {ExitStatus::WrongUse, std::string(error.what()) + ".", askHelpOf(*verb)};
    const std::vector<std::string> rest = app.remaining();
    if (error.get_name() != "RequiredError")
        return {ExitStatus::WrongUse, error.what() + std::string("."), ASK_HELP};
    return rest.empty() ? Failure(ExitStatus::WrongUse, "No verb was given.", ASK_HELP)
                        : unknownVerb(app, rest.front());
}

/// Prints the help of the program, or with a name that of a verb.
void printHelp(const CLI::App& app, const std::string& name) {
    // Not App::help(): once a verb was read, that gives the help of the verb.
    const auto print = [](const CLI::App& asked, const std::string& title) {
        std::cout << asked.get_formatter()->make_help(&asked, title, CLI::AppFormatMode::Normal);
    };
    if (name.empty()) return print(app, app.get_name());
    for (const CLI::App* verb : verbsOf(app)) {
        if (verb->check_name(name)) return print(*verb, app.get_name() + " " + verb->get_name());
    }
    throw unknownVerb(app, name);
}

}  // namespace

std::optional<Arguments> readArguments(int argc, char** argv) {
    Arguments arguments;
    CLI::App app("Updates the firmware of Ethernet adapters.", "quenxctl");
    app.set_version_flag("--version", QUENX_VERSION);
    app.require_subcommand(1);
    app.fallthrough();
    addCommonOptions(app, arguments);
    addPlainVerb(app, arguments, "adapters", "List the adapters and the firmware on them", showAdapters);
    addPlainVerb(app, arguments, "identities",
                 "List the images that the inventory offers, and those installed", showIdentities);
    addCheck(app, arguments);
    addInstall(app, arguments);
    addPlainVerb(app, arguments, "jobs", "List the jobs on a server", showJobs);
    addDelete(app, arguments);
    addInstances(app, arguments);
    addAssociators(app, arguments);
    addPlainVerb(app, arguments, "mof", "Print the schema of all served classes as MOF", showMof);
    std::string helpOf;
    CLI::App* help = app.add_subcommand("help", "Print this help, or that of a verb");
    help->add_option("verb", helpOf, "Verb")->type_name("VERB");
    for (CLI::App* verb : app.get_subcommands({}))
        verb->group("Verbs");
    app.get_formatter()->label("SUBCOMMAND", "VERB");
    app.footer(FOOTER);  // last: verbs take over the footer that is there when they are added
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() != 0) {
            throw wrongUse(app, error);
        }
        app.exit(error);
        return std::nullopt;
    }
    if (help->parsed()) {
        printHelp(app, helpOf);
        return std::nullopt;
    }
    return arguments;
}

bool asksForJson(int argc, char** argv) {
    return std::any_of(argv, argv + argc,
                       [](const char* word) { return std::string_view(word) == "--json"; });
}

}  // namespace cli
