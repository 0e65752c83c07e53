// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>

#include "Cli/Update/Candidate.h"

/// The calls of the one software installation service. They throw CommandError when none is served.
namespace cli {

/// Calls InstallFromURI, or InstallFromSoftwareIdentity for an image of the inventory; the identity itself
/// says its types. Throws NoAnswer when the service was called and the update may have begun.
core::MethodResult startUpdate(core::CimOperations& operations, const Candidate& candidate);

/// The job among the outputs of startUpdate(). Throws CommandError with ExitStatus::Unknown when there is
/// none.
core::CimPath jobOf(const core::MethodResult& result);

/// Has the service verify the image as startUpdate() does, without installing it. Returns what the method
/// would, 0 for an image that could be installed. Nothing for a file on a server, whose service has no method
/// for that.
std::optional<std::uint32_t> verifyOnly(const Connection& connection, const Candidate& candidate);

}  // namespace cli
