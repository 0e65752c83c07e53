// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <exception>
#include <string>
#include <vector>

#include "Framework/Requests/Caller.h"
#include "Framework/Requests/CimOperations.h"
#include "Framework/Requests/NotedCall.h"

/// The audit trail: one line in the system log for each attempt to change something and for each refusal. A
/// front writes it, since only a front knows who asks.
namespace core {

/// Who asked for what, and how it ended. Any of the texts may come from a client.
struct AuditEvent {
    Caller caller;
    std::string operation;  ///< "DeleteInstance", "InstallFromURI", "login"
    std::string target;     ///< the path of the object; may be empty
    std::string outcome;    ///< see outcomeOf(); "done", "denied: ...", "failed: ..."
    CallNotes notes = {};
};

/// "returned 4096, Job=root/cimv2:...": the value, and the references among the outputs.
QUENX_EXPORT std::string outcomeOf(const MethodResult& result);
/// "failed: ... (CIM status 6)", or "denied: ..." for one who may not.
QUENX_EXPORT std::string outcomeOf(CimStatus status, const std::string& description);

/// What an error says, as far as anybody reads it: some repeat names of the request, which may be a megabyte
/// long.
QUENX_EXPORT std::string shownText(const std::exception& error);

/// The line, at most 1,400 characters of printable ASCII, whatever the event holds; docs/object-manager.md
/// has its exact form.
/// @param arguments  of a method
/// @throws std::bad_alloc
QUENX_EXPORT std::string auditLine(const AuditEvent& event, const std::vector<Argument>& arguments = {});

/// Writes the line at the default level of the log. If there is no memory for it, it is dropped. Thread-safe.
QUENX_EXPORT void audit(const AuditEvent& event, const std::vector<Argument>& arguments = {}) noexcept;

}  // namespace core
