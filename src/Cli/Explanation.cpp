// SPDX-License-Identifier: Apache-2.0
#include "Cli/Explanation.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

#include "Cli/Busyness.h"
#include "Cli/ImageUri.h"
#include "Cli/ReturnValues.h"
#include "Cli/Suggestion.h"

namespace cli {

namespace {

Explanation explainFile(const Candidate& candidate) {
    if (candidate.image) return candidate.image->problem.value_or(Explanation());
    const std::string scheme = uriScheme(candidate.uri);
    if (localPath(candidate.uri)) return {};  // a file of the server, which only the server sees
    if (scheme == "file") {
        return {candidate.uri + " is not a valid file URI.",
                "Write it as file:///directory/file, or give the path alone."};
    }
    return {"The service does not read images over \"" + scheme + ":\".",
            "Copy the image to a local file and name that."};
}

/// Why a server refuses a file that may well be there for this program.
Explanation explainServersFile(const Candidate& candidate) {
    constexpr const char* MOVE =
        "Put the image where the server can read it; a server that systemd started may have a /tmp of its "
        "own.";
    if (candidate.image && candidate.image->isIntact()) {
        return {"The server did not accept " + candidate.image->path + ", which this program can read.",
                MOVE};
    }
    if (!candidate.image && localPath(candidate.uri)) {
        return {"The server did not accept " + *localPath(candidate.uri) + ".",
                "Images are files on the server's machine: check that the file is there, that the server can "
                "read it, and that it is a complete firmware image."};
    }
    return {};
}

std::string getImageFor(const Adapter& adapter) {
    return "Get the image made for " + (adapter.ids.empty() ? adapter.name : adapter.ids) + ".";
}

Explanation explainUnsupported(const Candidate& candidate) {
    const Adapter& adapter = candidate.adapter;
    if (!adapter.updatable) {
        return {"The firmware of " + adapter.name + " cannot be updated.",
                "\"quenxctl adapters\" shows which adapters can be updated."};
    }
    if (!candidate.comparison) return {};
    if (!candidate.comparison->isNetwork) {
        return {candidate.image->path + " is for a device that is not a network adapter.",
                getImageFor(adapter)};
    }
    if (candidate.comparison->foreignIds.empty()) return {};
    return {"The image is for " + candidate.comparison->foreignIds + ", but " + adapter.name + " is " +
                adapter.ids + ".",
            getImageFor(adapter)};
}

/// "IMG_PXE 1 is older than the installed 7, IMG_UEFI 0 than the installed 2."
std::string olderText(const Candidate& candidate) {
    std::string text;
    for (const Component& component : candidate.comparison->chosen) {
        const auto installed = versionOf(candidate.adapter.components, component.type);
        if (!installed || component.version >= *installed) continue;
        text += (text.empty() ? "" : ", ") + component.type + " " + std::to_string(component.version) +
                (text.empty() ? " is older" : "") + " than the installed " + std::to_string(*installed);
    }
    return text.empty() ? "" : text + ".";
}

/// What the image has and the adapter lacks, or the other way round. Empty when the types are the same.
std::string otherTypesText(const Candidate& candidate) {
    const std::string& name = candidate.adapter.name;
    for (const Component& component : candidate.comparison->chosen) {
        if (!versionOf(candidate.adapter.components, component.type)) {
            return "The image types differ: the image has " + component.type + ", but " + name + " has " +
                   componentsText(candidate.adapter.components) + ".";
        }
    }
    // A CLP entry point is part of the PXE image, so it goes with the old one.
    constexpr const char* CLP = "IMG_CLP";
    const bool losesClp = versionOf(candidate.adapter.components, CLP) &&
                          versionOf(candidate.comparison->chosen, "IMG_PXE") &&
                          !versionOf(candidate.comparison->chosen, CLP);
    return losesClp ? "The image types differ: " + name + " has IMG_CLP, but the image does not." : "";
}

Explanation explainDowngrade(const Candidate& candidate) {
    // Without knowing what is installed there is nothing to compare with.
    if (!candidate.comparison || candidate.adapter.components.empty()) return {};
    const std::string types = otherTypesText(candidate);
    if (types.empty()) return {olderText(candidate), "Use a newer image, or install this one with --force."};
    if (candidate.force) {
        return {types,
                "Use an image with the same types: --force does not help where the configuration "
                "forbids downgrades."};
    }
    return {types,
            "Use an image with the same types, or --force, which works unless the configuration "
            "forbids downgrades."};
}

Explanation explainNotApplicable(const Candidate& candidate) {
    if (!candidate.comparison) return {};
    std::vector<std::string> types;
    for (const utils::FirmwareVersionInfo& component : candidate.image->rom.components()) {
        types.emplace_back(ma::firmwareTypeName(component.type));
    }
    if (types.empty()) {
        return {candidate.image->path + " has nothing that can be installed.",
                getImageFor(candidate.adapter)};
    }
    if (candidate.comparison->missing.empty()) return {};
    return {"The image has no " + candidate.comparison->missing.front() + ".",
            "It has " + listText(types) + "."};
}

Explanation find(const Management& management, std::uint32_t returnValue, const Candidate& candidate) {
    switch (returnValue) {
        case MethodReturn::UnspecifiedError:
        case MethodReturn::InvalidParameter: {
            const bool isOnServer = returnValue == MethodReturn::InvalidParameter && !management.runsJobs();
            const Explanation found = isOnServer ? explainServersFile(candidate) : Explanation();
            return found.message.empty() ? explainFile(candidate) : found;
        }
        case MethodReturn::UnsupportedTargetType:
            return explainUnsupported(candidate);
        case MethodReturn::DowngradeNotSupported:
            return explainDowngrade(candidate);
        case MethodReturn::NotApplicable:
            return explainNotApplicable(candidate);
        default:
            return {};
    }
}

/// Says that the old firmware is still there only when what was read back shows it.
std::string readBackText(const Candidate& candidate, const std::vector<Component>& after) {
    const std::vector<Component>& before = candidate.adapter.components;
    if (after.empty() || before.empty()) return {};
    if (after != before) return "It now has " + componentsText(after) + ".";
    const bool isTelling = candidate.comparison && !candidate.comparison->current;
    return isTelling ? "It keeps its old firmware." : "It reports the same versions as before.";
}

/// Simulated adapters keep their flash in files, which not every user may write.
std::string permissionAdvice(const std::string& reason) {
    for (const int error : {EACCES, EPERM, EROFS}) {
        if (reason.find(std::generic_category().message(error)) != std::string::npos)
            return "Run quenxctl as root, or name a folder of yours with --adapters FILE --state DIR.";
    }
    return {};
}

}  // namespace

Explanation explainRefusal(Management& management, std::uint32_t returnValue, const Candidate& candidate) {
    const Explanation busy = explainBusyness(management, returnValue, candidate);
    if (!busy.message.empty()) return busy;
    const Explanation found = find(management, returnValue, candidate);
    return found.message.empty() ? explainReturnValue(returnValue) : found;
}

Explanation explainFailedJob(const Management& management, const JobView& job, const Candidate& candidate,
                             const std::vector<Component>& after) {
    const std::string reason = job.errorDescription.empty() ? "no reason was given" : job.errorDescription;
    std::string next = readBackText(candidate, after);
    const std::string advice = management.runsJobs() ? permissionAdvice(reason) : "";
    if (!next.empty() && !advice.empty()) next += ' ';
    return {"The update of " + candidate.adapter.name + " failed: " + reason + " (error " +
                std::to_string(job.errorCode) + ").",
            next + advice};
}

}  // namespace cli
