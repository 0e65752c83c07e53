#include "Cli/Explanation.h"

#include "Cli/Busyness.h"
#include "Cli/ImageUri.h"
#include "Cli/ReturnValues.h"

namespace cli {

namespace {

Explanation explainFile(const Candidate& candidate) {
    if (!candidate.image) {
        const std::string scheme = uriScheme(candidate.uri);
        if (localPath(candidate.uri)) return {};  // a file of the server, which only the server sees
        if (scheme == "file") {
            return {candidate.uri + " is no well-formed file URI.",
                    "Write it as file:///directory/file, or give the path alone."};
        }
        return {"The service does not read images by \"" + scheme + ":\".",
                "Copy the image to a local file and name that."};
    }
    if (candidate.image->isIntact()) return {};
    return {candidate.image->path + " " + candidate.image->problem + ".",
            "Name a file that is a whole firmware image and that the service may read."};
}

/// Why a server takes no file that may well be there for this program.
Explanation explainServersFile(const Candidate& candidate) {
    constexpr const char* MOVE =
        "Put the image where the server may read it; a server that systemd started can have a /tmp of its "
        "own.";
    if (candidate.image && candidate.image->isIntact()) {
        return {"This program can read " + candidate.image->path + ", the server cannot.", MOVE};
    }
    if (!candidate.image && localPath(candidate.uri)) {
        return {"Images are files of the server's machine.", MOVE};
    }
    return {};
}

Explanation explainUnsupported(const Candidate& candidate) {
    const Adapter& adapter = candidate.adapter;
    if (!adapter.updatable) {
        return {"The firmware of " + adapter.name + " cannot be updated.",
                "\"quenxctl adapters\" shows which adapters can."};
    }
    if (!candidate.comparison) return {};
    if (!candidate.comparison->isNetwork) {
        return {candidate.image->path + " holds code for another kind of device than a network adapter.", ""};
    }
    if (candidate.comparison->foreignIds.empty()) return {};
    return {"The image is for " + candidate.comparison->foreignIds + ", and " + adapter.name + " is " +
                adapter.ids + ".",
            ""};
}

Explanation explainDowngrade(const Candidate& candidate) {
    // Without knowing what is installed there is nothing to compare with.
    if (!candidate.comparison || candidate.adapter.components.empty()) return {};
    const std::string versions = "Installed on " + candidate.adapter.name + ": " +
                                 componentsText(candidate.adapter.components) +
                                 "; in the image: " + componentsText(candidate.comparison->chosen) + ".";
    if (!candidate.comparison->sameTypes) {
        return {versions + " The image types differ.",
                "Use an image of the same types, choose among its types with --types, or use --force, which "
                "works unless the configuration forbids downgrades."};
    }
    return {versions, "Use a newer image, or --force to install the older one."};
}

Explanation explainNotApplicable(const Candidate& candidate) {
    if (!candidate.comparison || candidate.comparison->missing.empty()) return {};
    return {"The image holds no " + candidate.comparison->missing.front() + ".", ""};
}

Explanation find(const Management& management, std::uint32_t returnValue, const Candidate& candidate) {
    switch (returnValue) {
        case RETURN_UNSPECIFIED:
        case RETURN_INVALID_PARAMETER: {
            const bool isOnServer = returnValue == RETURN_INVALID_PARAMETER && !management.runsJobs();
            const Explanation found = isOnServer ? explainServersFile(candidate) : Explanation();
            return found.message.empty() ? explainFile(candidate) : found;
        }
        case RETURN_UNSUPPORTED_TARGET:
            return explainUnsupported(candidate);
        case RETURN_DOWNGRADE:
            return explainDowngrade(candidate);
        case RETURN_NOT_APPLICABLE:
            return explainNotApplicable(candidate);
        default:
            return {};
    }
}

}  // namespace

Explanation explainRefusal(Management& management, std::uint32_t returnValue, const Candidate& candidate) {
    Explanation busy = explainBusyness(management, returnValue, candidate);
    if (!busy.message.empty()) return busy;
    const ReturnValueText& general = returnValueText(returnValue);
    const Explanation found = find(management, returnValue, candidate);
    Explanation result;
    result.message = std::string(general.meaning) + (found.message.empty() ? "" : " ") + found.message;
    result.advice = found.advice.empty() ? general.advice : found.advice;
    return result;
}

Explanation explainFailedJob(const JobView& job, const std::string& adapter) {
    const std::string reason = job.errorDescription.empty() ? "no reason was given" : job.errorDescription;
    Explanation result;
    result.message = "The update of " + adapter + " failed: " + reason + " (error code " +
                     std::to_string(job.errorCode) + ", job " + jobStateName(job.state) + ").";
    result.advice = "The adapter keeps the firmware that it had; mend the cause and install again.";
    return result;
}

}  // namespace cli
