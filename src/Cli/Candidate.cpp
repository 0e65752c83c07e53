// SPDX-License-Identifier: Apache-2.0
#include "Cli/Candidate.h"

#include "Cli/ImageUri.h"

namespace cli {

Candidate makeCandidate(Adapter adapter, const std::string& uri, std::vector<std::string> types, bool force,
                        bool sharesFiles) {
    Candidate candidate{std::move(adapter), uri, std::move(types), force, std::nullopt, std::nullopt};
    const std::optional<std::string> path = localPath(uri);
    if (!path || !sharesFiles) return candidate;
    candidate.image = readFirmwareImage(*path);
    if (candidate.image->isIntact()) {
        candidate.comparison = compareImage(*candidate.image, candidate.adapter, candidate.types);
    }
    return candidate;
}

bool isAlreadyCurrent(const Candidate& candidate) {
    const std::optional<Comparison>& found = candidate.comparison;
    // An image for another card can have the same versions: the service is to refuse that one.
    return found && found->current && found->foreignIds.empty() && found->isNetwork &&
           found->missing.empty() && candidate.adapter.updatable;
}

std::string alreadyCurrentText(const Candidate& candidate) {
    return candidate.adapter.name + " is already current: it has " +
           componentsText(candidate.comparison->chosen) + ".";
}

}  // namespace cli
