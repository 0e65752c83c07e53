#pragma once

#include <string_view>

#include "Host/Operations/Operation.h"

namespace host {

/// The typed path of an instance that a parameter names. CimError in the order that clients expect: invalid
/// class, then invalid parameter.
core::CimPath instancePath(const OperationContext& context, const core::CimPath& path);

/// Sets the origins of the properties of all instances in the result.
void addOrigins(const NamespaceModel& model, cimxml::IntrinsicResult& result);

}  // namespace host
