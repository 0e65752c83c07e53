// SPDX-License-Identifier: Apache-2.0
// Going back to the image that an adapter had before.
#include <unistd.h>

#include "Cli/Display/Output.h"
#include "Cli/Display/Terminal.h"
#include "Cli/Update/PastImages.h"
#include "Cli/Verbs/Outcome.h"
#include "Framework/Model/CimError.h"
#include "Framework/Requests/NotedCall.h"
#include "Framework/Requests/PolicyDecision.h"
#include "History/KeptImages.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using history::Record;

constexpr char kTypeSeparator = '+';  // in the records

/// "IMG_PXE 1, IMG_UEFI 0 (SHA-256 9f86...)"
std::string imageText(const Record& record) {
    const std::string& versions = record.versionsAfter.empty() ? record.imageVersions : record.versionsAfter;
    return (versions.empty() ? "versions that are not known" : versions) + " (SHA-256 " + record.sha256 + ")";
}

/// The image to go back to. Throws CommandError where the history does not tell it.
Record imageBefore(const Connection& connection, const Adapter& adapter) {
    const PastImages past = pastImagesOf(connection, adapter);
    if (!past.last)
        throw CommandError(ExitStatus::NotFound,
                           "The history has no image that was written to " + adapter.name + ".",
                           "Install the image that you want with --force.");
    if (past.failed)
        throw CommandError(ExitStatus::Failed,
                           "A later update of " + adapter.name + " (record " +
                               std::to_string(past.failed->id) + " of the history: " + past.failed->outcome +
                               ") may have left anything in its flash.",
                           "Install the image that you want with --force.");
    if (!past.isUnchanged)
        throw CommandError(
            ExitStatus::Failed,
            adapter.name + " has " + componentsText(adapter.components) +
                ", not what the last update of the history has left: " + imageText(*past.last) + ".",
            "Install the image that you want with --force.");
    if (past.before) return *past.before;
    const std::string& versions = past.last->versionsBefore;
    throw CommandError(ExitStatus::NotFound,
                       "The history does not know the image that " + adapter.name + " had before" +
                           (versions.empty() ? "" : ": it had " + versions) + ".",
                       "Install the image that you want with --force.");
}

/// Where images may lie, in the order in which they are looked for.
std::vector<std::string> imageFolders(core::CimOperations& operations) {
    const utils::Policy& policy = core::PolicyDecision::policy();
    std::vector<std::string> folders;
    if (!policy.keepImages.empty()) folders.push_back(policy.keepImages);
    for (const InventoryItem& item : readInventory(operations))
        for (const std::string& uri : item.uris)
            if (const auto path = localPath(uri)) folders.push_back(path->substr(0, path->rfind('/')));
    return folders;
}

/// Whom the policy does not let install is told so before anything is looked for.
core::PolicyDecision requireLeave(const std::string& adapter) {
    const core::NotedCall noted;
    try {
        return core::PolicyDecision();
    } catch (const core::CimError& denied) {
        const core::Argument target{"Target", core::CimValue::of(core::CimType::String, adapter)};
        tellOfRefusal({target}, noted.notes().reason, denied.what());
        throw;
    }
}

/// A file that has the image. Throws CommandError that says which one is missing.
std::string fileOf(core::CimOperations& operations, const Record& image) {
    const std::int64_t bytes = image.bytes.value_or(0);
    const std::string path = localPath(image.uri).value_or("");
    const core::PolicyDecision decision = requireLeave(image.adapter);
    const std::vector<std::string> folders = imageFolders(operations);
    for (const std::string& folder : folders)
        if (auto found = history::findImage(folder, image.sha256, bytes)) return *std::move(found);
    // The last place, since others may be able to write there.
    if (history::hasSum(path, image.sha256, bytes)) return path;
    throw CommandError(
        ExitStatus::NotFound,
        "The image is missing that " + image.adapter + " had before: " + imageText(image) +
            ". It was installed from " + image.uri + ".",
        "Put it back there" + (folders.empty() ? "" : ", or into " + folders.front()) + ", and try again.");
}

}  // namespace

ExitStatus rollback(Context& context, const VerbOptions& options) try {
    const Connection& connection = context.connection;
    const Adapter adapter = findAdapter(connection, options.update.target);
    const Record image = imageBefore(connection, adapter);
    UpdateOptions update;
    update.target = adapter.name;
    update.image = fileOf(*connection.operations, image);
    // No more than was written of it then.
    if (!image.optionValues.empty()) {
        for (const std::string& type : utils::split(image.optionValues, kTypeSeparator))
            update.types.push_back(type);
    }
    // It is older than what is there, as a rule.
    update.force = true;
    if (!context.json)
        context.out << printable(labelOf(adapter.name, adapter.backend) + " goes back to " +
                                 imageText(image) + ", from " + update.image)
                    << ".\n";
    const Outcome outcome = installCandidate(context, makeCandidate(connection, update));
    // Whoever may write to the file's folder could have exchanged it on the way.
    const auto written = pastImagesOf(connection, adapter).last;
    if (outcome.status == ExitStatus::Done && written && written->process == ::getpid() &&
        written->sha256 != image.sha256)
        throw CommandError(ExitStatus::Failed,
                           adapter.name + " got another image than the one that it had before: " +
                               update.image + " was exchanged meanwhile.",
                           "Install the image that you want with --force.");
    if (context.json)
        printJson(context.out, outcome);
    else
        printText(context, outcome);
    return outcome.status;
} catch (const CommandError& error) {
    if (error.status() != ExitStatus::Interrupted) throw;
    throw CommandError(ExitStatus::Interrupted, "Interrupted before the update began: nothing was changed.",
                       "");
}

}  // namespace cli
