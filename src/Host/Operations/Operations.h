// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <span>
#include <string>
#include <string_view>

#include "CimXml/Response.h"
#include "Framework/Model/CimError.h"
#include "Framework/Requests/CimOperations.h"
#include "Host/Operations/Parameters.h"
#include "Host/Operations/PullContexts.h"

namespace host {

/// What a user must be allowed in order to call an operation.
enum class Privilege { Read, Administer };

/// Who calls.
struct Caller {
    std::string user;
    bool isAdministrator = false;
    std::string host;  ///< as the client addressed the server: host or host:port; goes into paths
};

/// What a handler works on.
struct OperationContext {
    core::CimOperations& target;  ///< the namespace that the client addressed
    const Caller& caller;
    PullContexts& pulls;
    std::string_view operation;  ///< the name in the table
};

/// An intrinsic operation. Handlers throw CimError.
using OperationHandler = cimxml::IntrinsicResult (*)(const OperationContext&, const Parameters&);

struct Operation {
    std::string_view name;
    Privilege privilege;
    std::span<const ParameterSpec> parameters;
    OperationHandler handler;
};

/// The operation of that name, without regard to case; null for an unknown one.
const Operation* findOperation(std::string_view name);

/// What calling a method takes.
Privilege methodPrivilege();

// The handlers that the operation table names, each in the file of its group.

// ClassOperations.cpp
cimxml::IntrinsicResult getClass(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateClasses(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateClassNames(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult getQualifier(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateQualifiers(const OperationContext& context, const Parameters& parameters);

// InstanceOperations.cpp
cimxml::IntrinsicResult getInstance(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateInstances(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult enumerateInstanceNames(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult deleteInstance(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult createInstance(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult modifyInstance(const OperationContext& context, const Parameters& parameters);

// AssociationOperations.cpp
cimxml::IntrinsicResult associators(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult associatorNames(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult references(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult referenceNames(const OperationContext& context, const Parameters& parameters);

// PullOperations.cpp
cimxml::IntrinsicResult openEnumeration(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult pullEnumeration(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult closeEnumeration(const OperationContext& context, const Parameters& parameters);

// What several groups need.

/// The chain of the class; CimError with the given status when the target does not know it.
core::ClassChain requireClass(core::CimOperations& target, const std::string& className,
                              core::CimStatus otherwise);

/// Sets the origins of the properties of all instances in the result.
void addOrigins(core::CimOperations& target, cimxml::IntrinsicResult& result);

}  // namespace host
