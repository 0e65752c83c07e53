// SPDX-License-Identifier: Apache-2.0
#include "Cli/Arguments.h"

#include <unistd.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <iostream>
#include <set>
#include <string_view>
#include <tuple>

#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr const char* kFooter =
    "Exit status:\n"
    "  0  done\n"
    "  1  failed or refused: the message says what happened, and what to do next where that helps\n"
    "  2  wrong use: the command line itself is wrong, or a file that an option names cannot be used\n"
    "  3  already current: what was to be installed is what is installed (see --force)\n"
    "  4  not found: there is no such adapter, image file, identity, job, class or instance\n"
    "  5  unknown: the update may have begun, or may still be running; the message says where to look\n"
    "  6  interrupted: before the update began, or while a server goes on with it; the message says which\n"
    "  7  a reset is pending: what \"adapters --pending\" lists has new firmware that does not run yet\n";

/// An option, or without dashes an argument, that takes one value.
template <class Value>
CLI::Option* addValue(CLI::App& app, const char* name, Value& value, const char* type,
                      const char* description) {
    return app.add_option(name, value, description)->type_name(type);
}

void addServerOptions(CLI::App& app, ServerSettings& server, const std::vector<CLI::Option*>& localOptions) {
    CLI::Option* url =
        app.add_option_function<std::string>(
               "--server", [&server](const std::string& text) { server.url.emplace(text); },
               "Use a WBEM server (https://host:5989; for root, unix: is the one of this machine) instead of "
               "this process; images are then files on that host")
            ->type_name("URL");
    // A server has its own; an option without effect would let its user believe otherwise.
    for (CLI::Option* option : localOptions)
        option->excludes(url);
    addValue(app, "--user", server.user, "NAME",
             "User on the server (default: QUENXCTL_USER, else asked for); the password is taken from "
             "QUENXCTL_PASSWORD or asked for")
        ->needs(url);
    addValue(app, "--namespace", server.namespaceName, "NAME", "Namespace on the server")
        ->capture_default_str()
        ->needs(url);
    CLI::Option* trusted =
        addValue(app, "--cacert", server.caFile, "FILE", "Trust the certificates in this file")->needs(url);
    app.add_flag("--insecure", server.insecure, "Accept any server certificate: for tests only")
        ->needs(url)
        ->excludes(trusted);
}

void addCommonOptions(CLI::App& app, Arguments& arguments) {
    ProviderSettings& providers = arguments.providers;
    app.add_flag("--json", arguments.json,
                 "Print the result, or the error, as one JSON document; progress goes to standard error");
    CLI::Option* config =
        addValue(app, "--config", providers.configFile, "FILE",
                 "Configuration file of the providers (default: /etc/quenx-cimprovider.conf)");
    CLI::Option* policy = addValue(app, "--policy", providers.policyFile, "FILE",
                                   "Who may install (default: /etc/quenx/policy.toml)");
    CLI::Option* backend = addValue(
        app, "--backend", providers.adapters.backend, "NAME",
        "Which adapters: devlink for this machine's own, simulator, or auto (default: QUENX_BACKEND, "
        "else auto: simulated ones where some are described by name, else the machine's own)");
    CLI::Option* adapters = addValue(app, "--adapters", providers.adapters.description, "FILE",
                                     "Description of simulated adapters (default: QUENX_ADAPTERS, else "
                                     "/etc/quenx-adapters.toml)");
    addValue(app, "--state", providers.adapters.state, "DIR",
             "Where the simulated adapters of --adapters keep their flash (default: QUENX_ADAPTER_STATE, "
             "else beside FILE, with the extension .state)")
        ->needs(adapters);
    CLI::Option* directory =
        addValue(app, "--providers", providers.directory, "DIR",
                 "Directory of the provider libraries (default: those installed with this program)");
    addServerOptions(app, arguments.server, {config, policy, backend, adapters, directory});
}

std::vector<std::string> typesOf(std::string text) {
    // People separate by commas, the service by plus signs; either may have been copied from somewhere.
    utils::replaceCharacter(text, InstallOption::kTargetTypeSeparator, ',');
    std::vector<std::string> types;
    for (const std::string& piece : utils::split(text, ','))
        types.push_back(utils::trim(piece));
    return types;
}

void addTarget(CLI::App& verb, UpdateOptions& options) {
    addValue(verb, "--target", options.target, "ADAPTER", "Adapter: its name, PCI address or object path")
        ->required();
}

/// What install and check have in common. Returns the option for an identity, which says its types itself.
CLI::Option* addUpdateOptions(CLI::App& verb, UpdateOptions& options, const char* imageText) {
    addTarget(verb, options);
    addValue(verb, "image", options.image, "URI", imageText);
    CLI::Option* identity = addValue(verb, "--identity", options.identity, "ID",
                                     "Image: a software identity that \"identities\" lists");
    const auto setTypes = [&options](const std::string& text) {
        if (!text.empty()) options.types = typesOf(text);
    };
    verb.add_option_function<std::string>(
            "--types", setTypes, "Image types to install, separated by commas (default: all in the image)")
        ->type_name("TYPES")
        ->excludes(identity);
    return identity;
}

CLI::App* addVerb(CLI::App& app, Arguments& arguments, const char* name, Verb verb, const char* description) {
    CLI::App* added = app.add_subcommand(name, description);
    // Run once the whole line has been read without a mistake.
    added->callback([verb, &arguments] { arguments.verb = verb; });
    return added;
}

void addImageVerbs(CLI::App& app, Arguments& arguments) {
    UpdateOptions& options = arguments.options.update;
    CLI::App* verb = addVerb(
        app, arguments, "check", check,
        "Say whether an image could be installed, without writing it (a server may hold the adapter)");
    CLI::Option* identity = addUpdateOptions(
        *verb, options, "Image: a path or a file URI; with --server only one that \"identities\" lists");
    verb->add_flag("--force", options.force, "Check whether it could be installed with --force")
        ->excludes(identity);
    verb->footer("--types and --force cannot be used with --server.");

    verb = addVerb(app, arguments, "install", install,
                   "Install a firmware image on an adapter and wait until it is done");
    verb->alias("update");
    addUpdateOptions(*verb, options, "Image: a path or a file URI");
    verb->add_flag("--force", options.force,
                   "Also install an older image, the same one again, or one with other image types");
    verb->footer("An update that has begun always runs to its end: Ctrl-C does not stop it.");

    verb = addVerb(app, arguments, "activate", activate,
                   "Have an adapter run the firmware in its flash, by a reset of its card");
    addTarget(*verb, options);
    verb->add_flag("--disrupt", arguments.options.mayDisrupt,
                   "Also where that cuts the machine, or you, off from the network for a moment");
    verb->footer("Only on the machine itself, without --server. Never done by itself after an update.");
}

/// A verb that looks around an instance. Whatever its result, the list can be of paths alone.
CLI::App* addWalk(CLI::App& app, Arguments& arguments, const char* name, Verb run, const char* description) {
    VerbOptions& options = arguments.options;
    CLI::App* verb = addVerb(app, arguments, name, run, description);
    addValue(*verb, "path", options.path, "PATH", "Object path, as \"instances CLASS --names\" prints it")
        ->required();
    addValue(*verb, "--class", options.filter.associationClass, "CLASS", "Only associations of this class");
    addValue(*verb, "--role", options.filter.role, "ROLE", "Only where the instance has this role");
    verb->add_flag("--names", options.namesOnly, "Only their object paths");
    return verb;
}

void addModelVerbs(CLI::App& app, Arguments& arguments) {
    VerbOptions& options = arguments.options;
    CLI::App* verb = addVerb(app, arguments, "instances", showInstances, "List the instances of a class");
    addValue(*verb, "class", options.className, "CLASS", "Class, for example Quenx_ConcreteJob")->required();
    verb->add_flag("--names", options.namesOnly, "Only their object paths");

    verb = addWalk(app, arguments, "associators", showAssociators,
                   "List the instances associated with an instance");
    addValue(*verb, "--result-class", options.filter.resultClass, "CLASS", "Only instances of this class");
    addValue(*verb, "--result-role", options.filter.resultRole, "ROLE", "Only instances with this role");
    addWalk(app, arguments, "references", showReferences, "List the associations of an instance");
    addVerb(app, arguments, "mof", showMof, "Print the schema of all served classes as MOF");
}

void addRegistration(CLI::App& app, Arguments& arguments) {
    RegistrationOptions& options = arguments.options.registration;
    CLI::App* verb = addVerb(app, arguments, "registration", showRegistration,
                             "Print or write what another object manager needs to load the providers");
    addValue(*verb, "--for", options.manager, "MANAGER", "Object manager: sfcb or pegasus")->required();
    addValue(*verb, "--namespace", options.namespaces, "NAME",
             "Serve the classes in this namespace; may be given several times (default: that of the "
             "configuration, root/cimv2)")
        ->allow_extra_args(false);
    addValue(*verb, "--output", options.directory, "DIR",
             "Write the files into this folder, replacing older ones (default: print them)");
    CLI::Option* qualifiers = verb->add_flag("--qualifiers", options.withQualifiers,
                                             "Also declare the qualifiers, for an object manager without the "
                                             "standard schema");
    verb->add_flag("--remove", options.isRemoval, "What undoes the registration, as a script")
        ->excludes(qualifiers);
    verb->footer(
        "Nothing is registered, removed or restarted by this: what to do next is printed on standard "
        "error.");
}

/// In the order in which the help lists them.
void addVerbs(CLI::App& app, Arguments& arguments) {
    CLI::App* adapters =
        addVerb(app, arguments, "adapters", showAdapters, "List the adapters and the firmware on them");
    adapters->add_flag("--pending", arguments.options.pendingOnly,
                       "List only those whose new firmware waits for a reset; the exit status tells whether "
                       "there are any");
    addVerb(app, arguments, "identities", showIdentities,
            "List the images that the inventory offers, and those installed");
    addImageVerbs(app, arguments);
    addVerb(app, arguments, "jobs", showJobs,
            "List the jobs on a server (for root, by default that of this machine)");
    CLI::App* verb = addVerb(app, arguments, "delete", deleteJob,
                             "Delete a job from the list that \"jobs\" shows; its update continues");
    addValue(*verb, "job", arguments.options.job, "JOB",
             "Job: its id as \"jobs\" lists it, or the number at its end")
        ->required();
    addModelVerbs(app, arguments);
    addRegistration(app, arguments);
}

constexpr const char* kAskHelp = "\"quenxctl --help\" lists the verbs and options.";

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
    switch (static_cast<CLI::ExitCodes>(error.get_exit_code())) {
        case CLI::ExitCodes::ExtrasError:
            return "Unexpected argument \"" + app.remaining(true).front() + "\".";
        case CLI::ExitCodes::ExcludesError:
            return option + " cannot be used with " + text.substr(text.rfind(' ') + 1) + ".";
        case CLI::ExitCodes::ArgumentMismatch:
            return option + (text.find("At Most") == std::string::npos ? " needs a value."
                                                                       : " can be given only once.");
        case CLI::ExitCodes::ConversionError:
            return option + " takes no value.";  // texts always convert, so it was a flag
        case CLI::ExitCodes::RequiredError: {
            // Arguments have a name only to the library; the help shows what they are.
            const CLI::Option* argument = verb.get_option_no_throw(option);
            const bool isArgument = argument != nullptr && argument->get_positional();
            return (isArgument ? argument->get_type_name() : option) + " is required.";
        }
        default:
            return text + ".";
    }
}

/// The library only says that a verb is missing, both where there is none and where it is unknown.
CommandError wrongUse(const CLI::App& app, const CLI::ParseError& error) {
    const auto verbs = app.get_subcommands();
    const CLI::App* verb = verbs.empty() ? nullptr : verbs.front();
    if (const std::optional<CommandError> unknown = unknownOption(app, verb)) return *unknown;
    if (verb != nullptr) return {ExitStatus::WrongUse, messageOf(app, *verb, error), askHelpOf(*verb)};
    if (error.get_exit_code() != static_cast<int>(CLI::ExitCodes::RequiredError))
        return {ExitStatus::WrongUse, messageOf(app, app, error), kAskHelp};
    const std::vector<std::string> rest = app.remaining();
    return rest.empty() ? CommandError(ExitStatus::WrongUse, "No verb was given.", kAskHelp)
                        : unknownVerb(app, rest.front());
}

/// The library can exclude one option by another, but not require one of two.
void requireOneImage(const CLI::App& app, const Arguments& arguments) {
    const UpdateOptions& update = arguments.options.update;
    const bool takesImage = arguments.verb == install || arguments.verb == check;
    if (!takesImage || update.image.empty() != update.identity.empty()) return;
    throw CommandError(ExitStatus::WrongUse, "Name one image, either as a file or with --identity.",
                       askHelpOf(*app.get_subcommands().front()));
}

/// Who resets a card has to be where its network is, and who registers libraries where they are.
void requireOwnMachine(const Arguments& arguments) {
    for (const auto& [verb, name, place] :
         {std::tuple{&activate, "activate", "that has the adapter"},
          std::tuple{&showRegistration, "registration", "of the object manager"}}) {
        if (arguments.verb == verb && arguments.server.url)
            throw CommandError(ExitStatus::WrongUse,
                               "\"" + std::string(name) + "\" cannot be used with --server.",
                               "Run it on the machine " + std::string(place) + ".");
    }
}

/// Jobs are kept by a server: where no other is named, the one of this machine, if it is there for this user.
void chooseServer(Arguments& arguments) {
    const ProviderSettings& own = arguments.providers;
    const bool namesProviders = !own.configFile.empty() || !own.policyFile.empty() || own.adapters.backend ||
                                own.adapters.description || !own.directory.empty();
    const bool needsServer = arguments.verb == showJobs || arguments.verb == deleteJob;
    if (arguments.server.url || namesProviders || !needsServer) return;
    if (::access(localSocket().c_str(), W_OK) == 0) arguments.server.url.emplace("unix:");
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
    app.fallthrough();  // options of every verb may come after the verb, too
    addCommonOptions(app, arguments);
    addVerbs(app, arguments);
    std::string helpOf;
    CLI::App* help = app.add_subcommand("help", "Print this help, or that of a verb");
    help->add_option("verb", helpOf, "Verb")->type_name("VERB");
    for (CLI::App* verb : app.get_subcommands({}))
        verb->group("Verbs");
    // The library's own words for these are not a user's.
    for (const auto& [word, plain] : {std::pair{"SUBCOMMAND", "VERB"},
                                      {"Positionals", "Arguments"},
                                      {"Needs", "Only with"},
                                      {"Excludes", "Not with"}})
        app.get_formatter()->label(word, plain);
    app.footer(kFooter);  // last: verbs take over the footer that is there when they are added
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() != 0) throw wrongUse(app, error);
        app.exit(error);
        return std::nullopt;
    }
    if (help->parsed()) {
        printHelp(app, helpOf);
        return std::nullopt;
    }
    requireOneImage(app, arguments);
    requireOwnMachine(arguments);
    chooseServer(arguments);
    arguments.providers.isGuarded = arguments.verb == install;
    return arguments;
}

bool asksForJson(int argc, char** argv) {
    // Looked for here, since reading ends at the first mistake, and --json may come after that.
    return std::any_of(argv, argv + argc,
                       [](const char* word) { return std::string_view(word) == "--json"; });
}

}  // namespace cli
