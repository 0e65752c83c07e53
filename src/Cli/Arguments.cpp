#include "Cli/Arguments.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <memory>
#include <string_view>

#include "Cli/Failure.h"
#include "Utils/Utils.h"

#ifndef QUENX_VERSION
#define QUENX_VERSION "unknown"
#endif

namespace cli {

namespace {

constexpr const char* FOOTER =
    "Exit status:\n"
    "  0  done\n"
    "  1  failed: the message says what happened and what to do next\n"
    "  2  wrong use: the command line itself is wrong, or a file that an option names cannot be used\n"
    "  3  already current: what was to be installed is what is installed (see --force)\n";

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
               "Work on a WBEM server, https://host:5989, and not in this process; images are "
               "then files of that host")
            ->type_name("URL");
    for (CLI::Option* option : localOptions)
        option->excludes(url);
    app.add_option("--user", server.user,
                   "User on the server; the password is asked for, or taken from QUENXCTL_PASSWORD")
        ->envname("QUENXCTL_USER")
        ->type_name("NAME");
    app.add_option("--namespace", server.namespaceName, "Namespace on the server")
        ->type_name("NAME")
        ->capture_default_str();
    CLI::Option* trusted =
        app.add_option("--cacert", server.caFile, "Certificates to trust")->type_name("FILE")->needs(url);
    app.add_flag("--insecure", server.insecure, "Take any certificate: anybody could be the server")
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
    CLI::Option* adapters =
        app.add_option("--adapters", arguments.local.adapterDescription, "Description of simulated adapters")
            ->type_name("FILE");
    app.add_option("--state", arguments.local.stateDirectory,
                   "Where simulated adapters keep their flash (default: beside their description)")
        ->type_name("DIR")
        ->needs(adapters);
    CLI::Option* providers =
        app.add_option("--providers", arguments.local.providerDirectory,
                       "Directory of the provider libraries (default: those that belong to this program)")
            ->type_name("DIR");
    addServerOptions(app, arguments, {config, adapters, providers});
}

/// The image is named in one of two ways.
void requireOneImage(const CLI::App& verb, const CLI::Option* file, const CLI::Option* identity) {
    if (file->count() + identity->count() == 1) return;
    throw CLI::ValidationError(verb.get_name(), "name one image, either as a file or with --identity");
}

void addInstall(CLI::App& app, Arguments& arguments) {
    CLI::App* verb =
        app.add_subcommand("install", "Install a firmware image on an adapter and wait for the end");
    auto order = std::make_shared<InstallOrder>();
    auto types = std::make_shared<std::string>();
    verb->add_option("--target", order->target, "Adapter: its name, PCI address or object path")
        ->type_name("ADAPTER")
        ->required();
    CLI::Option* image =
        verb->add_option("image", order->image, "Image: a path or a file URI")->type_name("URI");
    CLI::Option* identity = verb->add_option("--identity", order->identity,
                                             "Image: a software identity that \"identities\" lists")
                                ->type_name("ID");
    verb->add_option("--types", *types,
                     "Image types to install, separated by commas (default: all in the image)")
        ->type_name("TYPES")
        ->excludes(identity);
    verb->add_flag("--force", order->force, "Install an older image too, and one that is installed already");
    verb->footer(
        "An update that has begun always runs to its end: Ctrl-C does not stop it, the program waits for "
        "it.");
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
        "Say whether an image could be installed; nothing is written (a server may hold the adapter)");
    auto order = std::make_shared<CheckOrder>();
    verb->add_option("--target", order->target, "Adapter: its name, PCI address or object path")
        ->type_name("ADAPTER")
        ->required();
    CLI::Option* file =
        verb->add_option("file", order->file, "Image: a file in a firmware directory of the configuration")
            ->type_name("FILE");
    CLI::Option* identity = verb->add_option("--identity", order->identity,
                                             "Image: a software identity that \"identities\" lists")
                                ->type_name("ID");
    verb->callback([=, &arguments] {
        requireOneImage(*verb, file, identity);
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
    CLI::App* verb = app.add_subcommand("associators", "List what is associated with an instance");
    auto order = std::make_shared<AssociatorsOrder>();
    verb->add_option("path", order->path, "Object path, as \"instances CLASS --names\" prints it")
        ->type_name("PATH")
        ->required();
    verb->add_option("--class", order->filter.associationClass, "Only by associations of this class")
        ->type_name("CLASS");
    verb->add_option("--result-class", order->filter.resultClass, "Only instances of this class")
        ->type_name("CLASS");
    verb->add_option("--role", order->filter.role, "Only where the instance has this role")
        ->type_name("ROLE");
    verb->add_option("--result-role", order->filter.resultRole, "Only what has this role")->type_name("ROLE");
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

/// The library only says that a verb is missing where one is not known.
std::string reasonOf(const CLI::App& app, const CLI::ParseError& error) {
    const std::vector<std::string> rest = app.remaining();
    const bool isUnknownVerb =
        error.get_name() == "RequiredError" && !rest.empty() && app.get_subcommands().empty();
    return isUnknownVerb ? "There is no verb \"" + rest.front() + "\"." : std::string(error.what()) + ".";
}

std::string helpAdvice(const CLI::App& app) {
    const auto verbs = app.get_subcommands();
    return verbs.empty() ? "\"quenxctl --help\" lists the verbs and options."
                         : "\"quenxctl " + verbs.front()->get_name() + " --help\" lists what it takes.";
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
    app.footer(FOOTER);  // last: verbs take over the footer that is there when they are added
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() != 0) {
            throw Failure(ExitStatus::WrongUse, reasonOf(app, error), helpAdvice(app));
        }
        app.exit(error);
        return std::nullopt;
    }
    return arguments;
}

bool asksForJson(int argc, char** argv) {
    return std::any_of(argv, argv + argc,
                       [](const char* word) { return std::string_view(word) == "--json"; });
}

}  // namespace cli
