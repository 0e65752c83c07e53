#pragma once

#include "CimXml/Request.h"
#include "Host/Operations/NamespaceModel.h"

namespace host {

/// Gives the keys of an instance's path, which a message holds as texts, the types that the class declares,
/// and the spelling too. A single key without a name gets that of the class's one key.
/// CimError (invalid parameter) when the keys are not exactly those of the class, or a text is no such value.
core::CimPath typedPath(const NamespaceModel& model, const core::ClassChain& chain,
                        const core::CimPath& path);

/// The same for a path that an argument or a key holds: one that does not fit is left as it is, and equals
/// nothing.
core::CimPath typedReference(const NamespaceModel& model, const core::CimPath& path);

/// The arguments of a call with their declared types. CimError (invalid parameter) for an argument that the
/// method does not declare or whose value is of another kind.
std::vector<core::Argument> typedArguments(const NamespaceModel& model, const core::MethodDeclaration& method,
                                           const std::vector<cimxml::RawArgument>& arguments);

}  // namespace host
