// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Candidate.h"

#include <algorithm>

#include "Cli/Connection/Properties.h"

namespace cli {

namespace {

/// Throws CommandError for a type that the service's capabilities do not name. If they name none, any type is
/// taken.
void requireKnownTypes(core::CimOperations& operations, const std::vector<std::string>& types) {
    const auto capabilities = operations.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities");
    if (capabilities.empty()) return;
    const std::vector<std::string> known = textsOf(capabilities.front(), "SupportedTargetTypes");
    if (known.empty()) return;
    // The service would answer with the code that every bad argument gets.
    for (const std::string& type : types) {
        if (type.empty() || std::find(known.begin(), known.end(), type) != known.end()) continue;
        throw CommandError(ExitStatus::WrongUse, "There is no image type \"" + type + "\".",
                           didYouMean(type, known) + "The types are " + joined(known) + ".");
    }
}

Candidate compared(const Connection& connection, Candidate candidate) {
    // If the service runs on another machine, the same path may name another file.
    const std::optional<std::string> path = localPath(candidate.uri);
    if (!path || !connection.sharesFiles) return candidate;
    candidate.image = readImage(*path);
    if (!candidate.image->problem)
        candidate.comparison = compare(candidate.image->rom, candidate.adapter, candidate.types);
    return candidate;
}

}  // namespace

bool Candidate::isAlreadyCurrent() const {
    // An image for another card can have the same versions: the service is to refuse that one.
    return comparison && comparison->current && comparison->foreignIds.empty() && comparison->isNetwork &&
           comparison->missing.empty() && adapter.updatable;
}

Candidate makeCandidate(const Connection& connection, const UpdateOptions& options) {
    Adapter adapter = findAdapter(connection, options.target);
    if (!options.identity.empty()) {
        return makeCandidate(connection, std::move(adapter),
                             findById(*connection.operations, options.identity), options.force);
    }
    requireKnownTypes(*connection.operations, options.types);
    return compared(connection, {.adapter = std::move(adapter),
                                 .uri = imageUri(options.image),
                                 .identity = {},
                                 .types = options.types,
                                 .force = options.force,
                                 .image = std::nullopt,
                                 .comparison = std::nullopt});
}

Candidate makeCandidate(const Connection& connection, Adapter adapter, const InventoryItem& image,
                        bool force) {
    return compared(connection, {.adapter = std::move(adapter),
                                 .uri = image.uri(),
                                 .identity = image.path,
                                 .types = image.types,
                                 .force = force,
                                 .image = std::nullopt,
                                 .comparison = std::nullopt});
}

}  // namespace cli
