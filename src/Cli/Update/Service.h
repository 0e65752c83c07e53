// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Update/Candidate.h"
#include "Cli/Update/Jobs.h"
#include "Providers/Schema/ProviderInterfaces.h"

/// The calls of the one software installation service, which throw CommandError when none is served, and
/// leave an audit line in process; and what its codes do not say: what is wrong with this image or adapter,
/// and what to do about it.
namespace cli {

/// Calls InstallFromURI, or InstallFromSoftwareIdentity for an image of the inventory; the identity itself
/// says its types. Throws NoAnswer when the service was called and the update may have begun.
core::MethodResult startUpdate(const Connection& connection, const Candidate& candidate);

/// The job among the outputs of startUpdate(). Throws CommandError with ExitStatus::Unknown when there is
/// none, or one that these operations cannot look at.
core::CimPath jobOf(const core::CimOperations& operations, const core::MethodResult& result);

/// Has the service verify the image as startUpdate() does, without installing it or claiming the adapter.
/// Returns what the method would, 0 for an image that could be installed. Nothing where the server has only
/// the model's method for that, CheckSoftwareIdentity.
std::optional<std::uint32_t> verifyOnly(const Connection& connection, const Candidate& candidate);

/// What the policy of the service's machine says of each of these images. Nothing where it asks for no
/// signatures, or nobody tells: a server without a way to ask, or one that tells only administrators.
std::optional<std::vector<update::ImageTrust>> readTrust(const Connection& connection,
                                                         const std::vector<std::string>& uris);

/// Calls CheckSoftwareIdentity for an image of the inventory, which may leave the adapter claimed. Returns
/// what it does.
std::uint32_t checkIdentity(const Connection& connection, const Candidate& candidate);

/// What to tell before checkIdentity(): that the server may hold the adapter afterwards.
std::string warningOfHold(const std::string& adapter);

/// Leaves the audit line of a change that this process makes by itself, without the service.
void auditOwn(const std::string& operation, const std::string& target, const std::string& outcome);

/// Why the service refused the candidate: what the program finds in the file, on the adapter and among the
/// service's jobs that explains the return value, else what the value means.
/// @param id  the cause, as far as it is known: one that is the policy's goes before all that the image shows
Explanation explainRefusal(const Connection& connection, std::uint32_t returnValue,
                           const Candidate& candidate, core::ReasonId id);

/// Why a job that was started did not complete, in the device's words.
/// @param after  what the adapter carries now; empty when that could not be read
Explanation explainFailedJob(const Connection& connection, const JobView& job, const Candidate& candidate,
                             const std::vector<Component>& after);

}  // namespace cli
