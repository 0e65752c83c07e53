// SPDX-License-Identifier: Apache-2.0
#include <CLI/CLI.hpp>

#include "Cli/Arguments/Parsing.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

std::vector<std::string> typesOf(std::string text) {
    // People separate by commas, the service by plus signs; either may have been copied from somewhere.
    utils::replaceCharacter(text, InstallOption::kTargetTypeSeparator, ',');
    std::vector<std::string> types;
    for (const std::string& piece : utils::split(text, ','))
        types.push_back(utils::trim(piece));
    return types;
}

CLI::Option* addTarget(CLI::App& verb, UpdateOptions& options) {
    return addValue(verb, "--target", options.target, "ADAPTER",
                    "Adapter: its name, PCI address or object path");
}

/// What install and check have in common. Returns the option for an identity, which says its types itself.
CLI::Option* addUpdateOptions(CLI::App& verb, UpdateOptions& options) {
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

/// One adapter, or several of them.
void addTargets(CLI::App& verb, VerbOptions& options) {
    ManyOptions& many = options.many;
    CLI::Option* target = addTarget(verb, options.update);
    verb.add_option("image", many.images, "Image: a path or a file URI; with --fit several")
        ->type_name("URI");
    const auto add = [&](const char* name, bool& flag, const char* text) {
        verb.add_flag(name, flag, text)->excludes(target);
    };
    add("--all", many.isAll, "All adapters, a card once, instead of --target");
    addValue(verb, "--match", many.match, "GLOB",
             "Adapters whose name or PCI address matches a pattern, such as 'eth*'")
        ->excludes(target);
    add("--fit", many.isFit,
        "Only adapters that an image is made for: of all, or of those that --match names");
    add("--keep-going", many.keepsGoing, "Go on with the next adapter after a failure");
    add("--dry-run", many.isDryRun, "Say what would be done, and write nothing");
    add("--follow", many.follows, "Where an update of an adapter runs already, wait for its end first");
    add("--yes", many.isConfirmed,
        "Write to adapters that are hardware without asking; --backend devlink says the same");
}

void addImageVerbs(CLI::App& app, Arguments& arguments) {
    UpdateOptions& options = arguments.options.update;
    CLI::App* verb = addVerb(app, arguments, "check", check,
                             "Say whether an image could be installed, without writing it");
    addTarget(*verb, options)->required();
    addValue(*verb, "image", options.image, "URI", "Image: a path or a file URI");
    addUpdateOptions(*verb, options);
    verb->add_flag("--force", options.force, "Check whether it could be installed with --force");
    verb->footer(
        "The adapter is not held. A server other than quenx-cimd checks only what \"identities\" lists, "
        "takes neither --types nor --force, and may hold the adapter: that is said before.");

    verb = addVerb(app, arguments, "install", install,
                   "Install a firmware image on an adapter and wait until it is done");
    verb->alias("update");
    addTargets(*verb, arguments.options);
    CLI::Option* identity = addUpdateOptions(*verb, options);
    verb->add_flag("--upload", options.upload,
                   "Send the image, a file of this machine, to the server first; only to quenx-cimd")
        ->excludes(identity);
    verb->add_flag("--force", options.force,
                   "Also install an older image, the same one again, or one with other image types");
    verb->footer("An update that has begun always runs to its end: Ctrl-C does not stop it.");

    verb = addVerb(app, arguments, "rollback", rollback,
                   "Install the image that an adapter had before the last one, as the history knows it");
    addValue(*verb, "adapter", options.target, "ADAPTER", "Adapter: its name, PCI address or object path")
        ->required();
    verb->footer(
        "Only on the machine itself, without --server. The file has to be where it was installed from, in a "
        "folder of "
        "the inventory, or among the images that the policy keeps.");

    verb = addVerb(app, arguments, "activate", activate,
                   "Have an adapter run the firmware in its flash, by a reset of its card");
    addTarget(*verb, options)->required();
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

void addHistoryVerb(CLI::App& app, Arguments& arguments) {
    HistoryOptions& options = arguments.options.history;
    CLI::App* verb = addVerb(app, arguments, "history", showHistory,
                             "List the attempts to install, the newest first: who, what and how it ended");
    addValue(*verb, "--adapter", options.adapter, "ADAPTER",
             "Only those of this adapter, by name or PCI address");
    verb->add_flag("--failed", options.failedOnly, "Only those that were refused, failed or interrupted");
    addValue(
        *verb, "--since", options.since, "TIME",
        "Only those since then: 2026-11-22, or 2026-11-22T16:00, with a zone (Z, +01:00) unless it is local");
    addValue(*verb, "--after", options.after, "ID", "Only those with a higher id, the oldest first");
    verb->add_flag("--lines", options.asLines, "One JSON object a line, for programs that ship logs");
    verb->footer("At most 1,000; of a server only those among its newest 1,000.");
}

void addListen(CLI::App& app, Arguments& arguments) {
    ListenOptions& options = arguments.options.listening;
    CLI::App* verb = addVerb(app, arguments, "listen", listen,
                             "Subscribe to what happens to jobs on a server, and print it as it comes");
    addValue(
        *verb, "--address", options.address, "ADDRESS",
        "Address of this machine at which the server reaches it (default: 127.0.0.1, for a server here)");
    addValue(*verb, "--port", options.port, "PORT", "Port to listen on (default: a free one)");
    addValue(*verb, "--count", options.count, "N", "End after so many (default: when interrupted)");
    verb->footer("The subscription is taken away at the end. With --json, one object a line.");
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

}  // namespace

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
    addHistoryVerb(app, arguments);
    addVerb(
        app, arguments, "status", showStatus,
        "Show who holds each adapter, and how its last update ended (for root, by default on the server of "
        "this machine)");
    verb = addVerb(app, arguments, "release", releaseAdapter,
                   "Free an adapter that a check on a server still holds");
    addValue(*verb, "adapter", arguments.options.adapter, "ADAPTER",
             "Adapter: its name, PCI address or object path")
        ->required();
    verb->footer("An adapter that a running job or check needs is not freed. Only quenx-cimd can do this.");
    addListen(app, arguments);
    addModelVerbs(app, arguments);
    addRegistration(app, arguments);
}

}  // namespace cli
