// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Service.h"

#include <unistd.h>

#include <cerrno>
#include <system_error>

#include "Cli/Connection/ServerControl.h"
#include "Cli/Update/ServedLog.h"

namespace cli {

namespace {

/// Nothing where the return value's meaning is the best explanation.
using Reason = std::optional<Explanation>;

constexpr const char* kAskLogAgain =
    "The system log may have the details; for more of them, set TARVEL_SMASHv2_LOG_LEVEL=2 and try again.";

struct ReturnValueText {
    std::uint32_t value;
    const char* meaning;
    const char* advice;
};

/// CIM_SoftwareInstallationService's return values (DSP1025).
constexpr ReturnValueText kReturnValues[] = {
    {0, "The image can be installed.", ""},
    {1, "The service does not support this method.",
     "Name the image the other way: as a file, or with --identity."},
    {2, "The service could not read or prepare the image.", "Check the file and try again."},
    {3, "The service did not answer in time.", "Try again."},
    {4, "The service could not start the update.", "Free some memory or end some processes, then try again."},
    {5, "The service did not accept the image, the adapter or an option.",
     "Check that the service can read the file and that it is a complete firmware image."},
    {6, "The adapter is in use.", "Wait for its update to end, then try again."},
    {4096, "The update was started.", ""},
    {4097, "The service does not install this image on this adapter.",
     "Check with \"quenxctl adapters\" that the adapter can be updated, and get the image made for its ids."},
    {4098, "The service cannot install unattended.", "Install with the adapter maker's own tool."},
    {4099, "The image is older than the installed firmware, or has other image types.",
     "Use a newer image, or install this one with --force."},
    {4100, "The service ran out of memory or met an unexpected error.", kAskLogAgain},
    {4101, "The service has too little swap space.", "Free some memory and try again."},
    {4102, "The service cannot update the installed version to this one.",
     "Install a version in between first."},
    {4103, "The service has too little disk space.", "Free some disk space and try again."},
    {4104, "The image is for another operating system.", "Get the image for this system."},
    {4105, "The image needs other software that is not installed.", "Install that software first."},
    {4106, "The image has nothing that can be installed on this target.",
     "Leave out --types or name types that the image has, and name an Ethernet port as the target."},
    {4107, "The service cannot access the image.", "Copy the image to a place that the service can read."},
    {4108, "The service does not install on collections.", "Name one Ethernet port as the target."},
    {4109, "Another update is running.", "Wait for it to end, then try again."},
};

Explanation explainReturnValue(std::uint32_t value) {
    for (const ReturnValueText& row : kReturnValues) {
        if (row.value == value) return {row.meaning, row.advice};
    }
    return {"The service answered with the unknown value " + std::to_string(value) + ".", kAskLogAgain};
}

/// The service holds an adapter, and no job says why.
Reason explainHiddenHolder(std::uint32_t returnValue, const Candidate& candidate) {
    constexpr const char* kHolder = ": an earlier check may hold it, or an update whose job was deleted.";
    constexpr const char* kWaitOrRestart =
        "If an update is running, try again later. If a check holds the adapter, restart the server; with "
        "\"ReleaseClaimAfterCheck=1\" in the configuration file of its providers, checks hold nothing.";
    const std::string& name = candidate.adapter.name;
    if (returnValue == MethodReturn::InUse) {
        return Explanation{"The server refuses " + name + ", although no job is running" + kHolder,
                           kWaitOrRestart};
    }
    // A file that is not an image explains the answer by itself.
    if (candidate.image && candidate.image->problem) return std::nullopt;
    return Explanation{"The server could not read or prepare the image, or another adapter than " + name +
                           " is in use" + kHolder,
                       kWaitOrRestart};
}

/// In the words of the service, where it is known what they were.
Reason explainTold(const Connection& connection, std::uint32_t returnValue, const Candidate& candidate,
                   core::ReasonId id) {
    const std::string reason = toldReason(connection, candidate.adapter.name, candidate.uri, returnValue, id);
    if (reason.empty()) return std::nullopt;
    // It may have met anything.
    const bool isVague = returnValue == MethodReturn::UnspecifiedError;
    return Explanation{sentence(reason), isVague ? kAskLogAgain : explainReturnValue(returnValue).advice};
}

/// What the server itself tells of its hold. Nothing where it tells none.
Reason explainClaim(const Connection& connection) {
    const auto held = connection.control == nullptr ? std::nullopt : connection.control->held();
    if (!held || held->adapter.empty()) return std::nullopt;
    const std::string text = held->adapter + " is held by " + held->text();
    if (held->isNeeded)
        return Explanation{text + ". The server works on one adapter at a time.",
                           "Try again when that has ended; \"quenxctl status\" shows it."};
    return Explanation{text + ", which has ended.",
                       "Free it with \"quenxctl release " + held->adapter + "\" and the same --server."};
}

/// Who holds the adapter. If the service is busy with another adapter, it answers as it does for an image
/// that it cannot read. In process, no other client can.
Reason explainHolder(const Connection& connection, std::uint32_t returnValue, const Candidate& candidate,
                     core::ReasonId id) {
    const bool mayBeHeld =
        returnValue == MethodReturn::InUse || returnValue == MethodReturn::UnspecifiedError;
    if (!mayBeHeld || connection.isInProcess) return std::nullopt;
    for (const JobView& job : readJobs(*connection.operations)) {
        if (job.hasEnded()) continue;
        const auto percent = job.certainPercent();
        return Explanation{(job.adapter.empty() ? "An adapter" : job.adapter) + " is being updated (" +
                               job.id + (percent ? ", " + std::to_string(*percent) + " % done" : "") +
                               "). The server updates one adapter at a time.",
                           "Try again when that update has ended; \"quenxctl jobs\" shows its progress."};
    }
    // Looked at anew: the update may have begun since, of another process or of a job that was deleted.
    const Adapter now = findAdapter(connection, candidate.adapter.name);
    if (now.busy) {
        return Explanation{now.name + " is being written to by " +
                               (now.writer.empty() ? "another process" : now.writer) +
                               ", on the server's machine.",
                           "Try again when that process is done."};
    }
    if (const Reason claim = explainClaim(connection)) return claim;
    if (const Reason told = explainTold(connection, returnValue, candidate, id)) return told;
    return explainHiddenHolder(returnValue, candidate);
}

Reason explainFile(const Candidate& candidate) {
    if (candidate.image) return candidate.image->problem;
    const std::string scheme = uriScheme(candidate.uri);
    if (localPath(candidate.uri)) return std::nullopt;  // a file of the server, which only the server sees
    if (scheme == "file") {
        return Explanation{candidate.uri + " is not a valid file URI.",
                           "Write it as file:///directory/file, or give the path alone."};
    }
    return Explanation{"The service does not read images over \"" + scheme + ":\".",
                       "Copy the image to a local file and name that."};
}

/// Why a server refuses a file that may well be there for this program.
Reason explainServersFile(const Candidate& candidate) {
    const std::optional<std::string> path = localPath(candidate.uri);
    if (candidate.image && !candidate.image->problem) {
        return Explanation{
            "The server did not accept " + candidate.image->path + ", which this program can read.",
            "Put the image where the server can read it; a server that systemd started may have a /tmp of "
            "its own."};
    }
    if (candidate.image || !path) return explainFile(candidate);
    return Explanation{
        "The server did not accept " + *path + ".",
        "Images are files on the server's machine: check that the file is there, that the server can "
        "read it, and that it is a complete firmware image."};
}

std::string getImageFor(const Adapter& adapter) {
    return "Get the image made for " + (adapter.ids.empty() ? adapter.name : adapter.ids) + ".";
}

Reason explainUnsupported(const Candidate& candidate) {
    const Adapter& adapter = candidate.adapter;
    // Checked first: if the adapter cannot be updated, its ids do not matter.
    if (!adapter.updatable) {
        return Explanation{"The firmware of " + adapter.name + " cannot be updated.",
                           "\"quenxctl adapters\" shows which adapters can be updated."};
    }
    if (!candidate.comparison) return std::nullopt;
    if (!candidate.comparison->isNetwork) {
        return Explanation{candidate.image->path + " is for a device that is not a network adapter.",
                           getImageFor(adapter)};
    }
    if (candidate.comparison->foreignIds.empty()) return std::nullopt;
    return Explanation{"The image is for " + candidate.comparison->foreignIds + ", but " + adapter.name +
                           " is " + adapter.ids + ".",
                       getImageFor(adapter)};
}

/// "IMG_PXE 1 is older than the installed 7, IMG_UEFI 0 than the installed 2."
std::string olderText(const Candidate& candidate) {
    std::string text;
    for (const Component& component : candidate.comparison->chosen) {
        const auto installed = versionOf(candidate.adapter.components, component.type);
        if (!installed || component.version >= *installed) continue;
        // The words that all have in common are said once.
        text += (text.empty() ? "" : ", ") + component.type + " " + std::to_string(component.version) +
                (text.empty() ? " is older" : "") + " than the installed " + std::to_string(*installed);
    }
    return text.empty() ? "" : text + ".";
}

/// What the image has and the adapter lacks, or the other way round. Empty when the types are the same.
std::string otherTypesText(const Candidate& candidate) {
    const std::string& name = candidate.adapter.name;
    const std::vector<Component>& chosen = candidate.comparison->chosen;
    const std::vector<Component>& installed = candidate.adapter.components;
    for (const Component& component : chosen) {
        if (versionOf(installed, component.type)) continue;
        return "The image types differ: the image has " + component.type + ", which " + name +
               " does not: it has " + componentsText(installed) + ".";
    }
    // A CLP entry point is part of the PXE image, so it goes with the old one.
    const bool losesClp =
        versionOf(installed, "IMG_CLP") && versionOf(chosen, "IMG_PXE") && !versionOf(chosen, "IMG_CLP");
    return losesClp ? "The image types differ: " + name + " has IMG_CLP, but the image does not." : "";
}

Reason explainDowngrade(const Candidate& candidate) {
    // Without knowing what is installed there is nothing to compare with.
    if (!candidate.comparison || candidate.adapter.components.empty()) return std::nullopt;
    const std::string types = otherTypesText(candidate);
    if (!types.empty()) {
        return Explanation{
            types, candidate.force ? "Use an image with the same types: --force does not help where the "
                                     "configuration forbids other types (OEMCustomizeable=5)."
                                   : "Use an image with the same types, or --force, which works unless the "
                                     "configuration forbids other types (OEMCustomizeable=5)."};
    }
    const std::string older = olderText(candidate);
    if (older.empty()) return std::nullopt;
    return Explanation{older, "Use a newer image, or install this one with --force."};
}

Reason explainNotApplicable(const Candidate& candidate) {
    if (!candidate.comparison) return std::nullopt;
    std::vector<std::string> types;
    for (const utils::FirmwareVersionInfo& component : candidate.image->rom.components())
        types.emplace_back(ma::firmwareTypeName(component.type));
    if (types.empty()) {
        return Explanation{candidate.image->path + " has nothing that can be installed.",
                           getImageFor(candidate.adapter)};
    }
    // Types that are there were refused for the target: the return value's meaning says that.
    if (candidate.comparison->missing.empty()) return std::nullopt;
    return Explanation{"The image has no " + candidate.comparison->missing.front() + ".",
                       "It has " + joined(types) + "."};
}

/// In the words of the backend, which alone knows the format.
Reason explainVerdict(const Candidate& candidate) {
    const ma::ImageVerdict& verdict = *candidate.verdict;
    if (verdict.reason.empty()) return std::nullopt;
    const std::string reason = verdict.reason + (verdict.reason.ends_with('.') ? "" : ".");
    const std::string message =
        candidate.adapter.name + " does not take " + candidate.image->path + ": " + reason;
    switch (verdict.status) {
        case ma::PrepareStatus::InvalidParameter:
            return Explanation{message, "Name a complete firmware image."};
        case ma::PrepareStatus::ImageNotSupported:
            return Explanation{message, candidate.adapter.updatable ? getImageFor(candidate.adapter) : ""};
        case ma::PrepareStatus::ImageIsOlder:
            return Explanation{message, "Use a newer image, or install this one with --force."};
        case ma::PrepareStatus::UnspecifiedError:
            return Explanation{candidate.adapter.name + " cannot be updated now: " + reason, ""};
        default:
            return Explanation{message, ""};
    }
}

Reason explainImage(const Connection& connection, std::uint32_t returnValue, const Candidate& candidate) {
    if (candidate.verdict) return explainVerdict(candidate);
    switch (returnValue) {
        case MethodReturn::UnspecifiedError:
            if (candidate.adapter.answers) return explainFile(candidate);
            return Explanation{"The firmware of " + candidate.adapter.name + " cannot be read.",
                               adviceForSilence(connection)};
        case MethodReturn::InvalidParameter:
            return connection.isInProcess ? explainFile(candidate) : explainServersFile(candidate);
        case MethodReturn::UnsupportedTargetType:
            return explainUnsupported(candidate);
        case MethodReturn::DowngradeNotSupported:
            return explainDowngrade(candidate);
        case MethodReturn::NotApplicable:
            return explainNotApplicable(candidate);
        default:
            return std::nullopt;
    }
}

/// What the table of reasons has on the policy and on the trust in images.
constexpr unsigned kFirstOfPolicy = 500;
constexpr unsigned kLastOfTrust = 699;

/// An image that the policy does not let be installed may be right in every other way.
Reason explainPolicy(const Connection& connection, std::uint32_t returnValue, const Candidate& candidate,
                     core::ReasonId id) {
    const core::Reason* row = core::findReason(id);
    const auto number = static_cast<unsigned>(id);
    if (row == nullptr || number < kFirstOfPolicy || number > kLastOfTrust) return std::nullopt;
    const std::string told = toldReason(connection, candidate.adapter.name, candidate.uri, returnValue, id);
    return Explanation{told.empty() ? row->text : sentence(told), row->advice};
}

/// Says that the old firmware is still there only when what was read back shows it.
std::string readBackText(const Candidate& candidate, const std::vector<Component>& after, bool isBusy) {
    const std::vector<Component>& before = candidate.adapter.components;
    if (after.empty() || before.empty()) return {};
    if (after != before) return "It now has " + componentsText(after) + ".";
    // Somebody else may change them at any moment.
    if (isBusy) {
        return "This update left its firmware as it was. While somebody else writes to it, \"quenxctl "
               "adapters\" shows it as busy.";
    }
    // If the image has the versions that were there, reading them back shows nothing.
    const bool isTelling = candidate.comparison && !candidate.comparison->current;
    return isTelling ? "It keeps its old firmware." : "It reports the same versions as before.";
}

/// Simulated adapters keep their flash in files, which not every user may write.
std::string permissionAdvice(const std::string& reason) {
    // The job only carries the text that the adapter API made of the error.
    for (const int error : {EACCES, EPERM, EROFS}) {
        if (reason.find(std::generic_category().message(error)) == std::string::npos) continue;
        const bool mayRootHelp = ::geteuid() != 0 && error != EROFS;
        return (mayRootHelp ? "Run quenxctl as root, or name a folder of your own"
                            : "Name a folder that can be written") +
               std::string(" with --adapters FILE --state DIR.");
    }
    return {};
}

}  // namespace

Explanation explainRefusal(const Connection& connection, std::uint32_t returnValue,
                           const Candidate& candidate, core::ReasonId id) {
    if (const Reason untrusted = explainPolicy(connection, returnValue, candidate, id)) return *untrusted;
    // Who holds the adapter goes first: the image may be all right.
    Reason reason = explainHolder(connection, returnValue, candidate, id);
    // These two mean anything, of which nothing can be seen from afar.
    const bool isGuessed =
        returnValue == MethodReturn::UnspecifiedError || returnValue == MethodReturn::InvalidParameter;
    if (!reason && isGuessed && !connection.isInProcess)
        reason = explainTold(connection, returnValue, candidate, id);
    if (!reason) reason = explainImage(connection, returnValue, candidate);
    if (!reason && (!isGuessed || connection.isInProcess))
        reason = explainTold(connection, returnValue, candidate, id);
    return reason ? *reason : explainReturnValue(returnValue);
}

Explanation explainFailedJob(const Connection& connection, const JobView& job, const Candidate& candidate,
                             const std::vector<Component>& after) {
    const std::string reason = job.errorDescription.empty() ? "no reason was given" : job.errorDescription;
    std::string next = readBackText(candidate, after, job.errorCode == ma::WriteError::Busy);
    // Of its own format a backend says itself what it takes.
    const bool mayBeFiles = connection.isInProcess && !candidate.verdict;
    const std::string advice = mayBeFiles ? permissionAdvice(reason) : "";
    if (!next.empty() && !advice.empty()) next += ' ';
    return {"The update of " + candidate.adapter.name + " failed: " + reason + " (error " +
                std::to_string(job.errorCode) + ").",
            next + advice};
}

std::string warningOfHold(const std::string& adapter) {
    return "This server can check an image only by holding " + adapter +
           ": unless its configuration has \"ReleaseClaimAfterCheck=1\", it refuses further checks and "
           "installs "
           "after that until it is restarted.";
}

}  // namespace cli
