// SPDX-License-Identifier: Apache-2.0
#include "Cli/Arguments/Arguments.h"

#include <unistd.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <iostream>
#include <sstream>
#include <string_view>
#include <tuple>

#include "Cli/Arguments/Completion.h"
#include "Cli/Arguments/Parsing.h"
#include "Cli/Display/Terminal.h"

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
    app.add_flag("--quiet", arguments.quiet,
                 "Print neither progress nor success of what installs, checks, deletes or releases; errors "
                 "and the exit status tell the rest")
        ->excludes("--json");
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

/// Where an adapter is named, all but the image goes with several.
void requireOneTarget(const CLI::App& app, Arguments& arguments) {
    ManyOptions& many = arguments.options.many;
    UpdateOptions& update = arguments.options.update;
    if (arguments.verb != install) return;
    const auto refuse = [&](const std::string& text) {
        throw CommandError(ExitStatus::WrongUse, text, askHelpOf(*app.get_subcommands().front()));
    };
    if (update.target.empty() && !many.isAsked())
        refuse("Name an adapter with --target, or several with --all, --match or --fit.");
    if (many.images.size() > 1 && !many.isFit)
        refuse("Several images can be given with --fit only: \"" + many.images[1] + "\" is one too many.");
    if (!many.images.empty()) update.image = many.images.front();
    many.isConfirmed = many.isConfirmed || arguments.providers.adapters.backend == ma::kDevlinkBackend;
}

/// The library can exclude one option by another, but not require one of two.
void requireOneImage(const CLI::App& app, const Arguments& arguments) {
    const UpdateOptions& update = arguments.options.update;
    const bool takesImage = arguments.verb == install || arguments.verb == check;
    if (!takesImage || update.image.empty() != update.identity.empty()) return;
    const std::string& pattern = arguments.options.many.match;
    if (update.image.empty() && ::access(pattern.c_str(), F_OK) == 0)
        throw CommandError(ExitStatus::WrongUse, "--match takes a pattern, and took " + pattern + " as one.",
                           "Put the pattern before the image, such as --match 'eth*'.");
    throw CommandError(ExitStatus::WrongUse, "Name one image, either as a file or with --identity.",
                       askHelpOf(*app.get_subcommands().front()));
}

/// For whoever has just met the program. A script that forgets the verb is told so.
void chooseOverview(const CLI::App& app, Arguments& arguments) {
    if (!app.get_subcommands().empty()) return;
    if (arguments.json) throw CommandError(ExitStatus::WrongUse, "No verb was given.", kAskHelp);
    arguments.verb = showOverview;
}

/// Who resets a card has to be where its network is, and who registers libraries where they are.
void requireOwnMachine(const Arguments& arguments) {
    for (const auto& [verb, name, place] :
         {std::tuple{&activate, "activate", "that has the adapter"},
          std::tuple{&rollback, "rollback", "that has the adapter"},
          std::tuple{&showRegistration, "registration", "of the object manager"}}) {
        if (arguments.verb == verb && arguments.server.url)
            throw CommandError(ExitStatus::WrongUse,
                               "\"" + std::string(name) + "\" cannot be used with --server.",
                               "Run it on the machine " + std::string(place) + ".");
    }
}

void requireServerForUpload(const Arguments& arguments) {
    if (arguments.options.update.upload && !arguments.server.url)
        throw CommandError(ExitStatus::WrongUse, "--upload can only be used with --server.",
                           "Leave it out: without a server, this program reads the image itself.");
}

/// Jobs are kept by a server: where no other is named, the one of this machine, if it is there for this user.
void chooseServer(Arguments& arguments) {
    const ProviderSettings& own = arguments.providers;
    const bool namesProviders = !own.configFile.empty() || !own.policyFile.empty() || own.adapters.backend ||
                                own.adapters.description || !own.directory.empty();
    constexpr Verb kOfServers[] = {showJobs, deleteJob, showStatus, releaseAdapter, listen};
    const bool needsServer = std::ranges::find(kOfServers, arguments.verb) != std::end(kOfServers);
    if (arguments.server.url || namesProviders || !needsServer) return;
    if (::access(localSocket().c_str(), W_OK) == 0) arguments.server.url.emplace("unix:");
}

/// Prints a help; on a terminal its descriptions go on below themselves.
void printFitted(const std::string& help) {
    constexpr std::size_t kNames = 30;  // columns, of the library's own making
    const std::size_t width = widthOf(std::cout);
    std::istringstream lines(help);
    for (std::string line; std::getline(lines, line);) {
        const bool isDescribed = line.starts_with("  ") && width >= 2 * kNames;
        for (const std::string& each : wrapped(line, width, isDescribed ? kNames : 0))
            std::cout << each << '\n';
    }
}

/// Prints the help of the program, or with a name that of a verb.
void printHelp(const CLI::App& app, const std::string& name) {
    // Not App::help(): once a verb was read, that gives the help of the verb.
    const auto print = [](const CLI::App& asked, const std::string& title) {
        printFitted(asked.get_formatter()->make_help(&asked, title, CLI::AppFormatMode::Normal));
    };
    if (name.empty()) return print(app, app.get_name());
    for (const CLI::App* verb : verbsOf(app)) {
        if (verb->check_name(name)) return print(*verb, app.get_name() + " " + verb->get_name());
    }
    throw unknownVerb(app, name);
}

/// For whoever tells of it where it is not carried out.
std::vector<core::Argument> orderOf(const UpdateOptions& update) {
    const auto argument = [](const char* name, const std::string& text) {
        return core::Argument{name, core::CimValue::of(core::CimType::String, text)};
    };
    std::vector<core::Argument> order;
    if (!update.image.empty()) order.push_back(argument("URI", imageUri(update.image)));
    if (!update.target.empty()) order.push_back(argument("Target", update.target));
    return order;
}

}  // namespace

std::optional<Arguments> readArguments(int argc, char** argv) {
    Arguments arguments;
    CLI::App app("Updates the firmware of Ethernet adapters.", "quenxctl");
    app.set_version_flag("--version", QUENX_VERSION);
    app.require_subcommand(0, 1);
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
    if (argc > 1 && argv[1] == std::string_view(kCompleteWord)) {
        constexpr int kProgramAndWord = 2;
        complete(app, {argv + kProgramAndWord, argv + argc}, arguments);
        if (arguments.verb == nullptr) return std::nullopt;
        chooseServer(arguments);
        arguments.verb = showCandidates;
        return arguments;
    }
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() != 0) throw wrongUse(app, error);
        std::ostringstream said;  // a help, or the version
        app.exit(error, said, said);
        printFitted(said.str());
        return std::nullopt;
    }
    if (help->parsed()) {
        printHelp(app, helpOf);
        return std::nullopt;
    }
    chooseOverview(app, arguments);
    requireOneTarget(app, arguments);
    requireOneImage(app, arguments);
    requireOwnMachine(arguments);
    requireServerForUpload(arguments);
    chooseServer(arguments);
    // Where subscriptions are made.
    if (arguments.verb == listen) arguments.server.namespaceName = "interop";
    if (arguments.verb == install || arguments.verb == rollback)
        arguments.providers.order = orderOf(arguments.options.update);
    return arguments;
}

bool asksFor(std::string_view flag, int argc, char** argv) {
    // Looked for here, since reading ends at the first mistake, and the flag may come after that.
    return std::any_of(argv, argv + argc, [flag](const char* word) { return flag == word; });
}

}  // namespace cli
