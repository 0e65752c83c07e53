// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "CimXml/Response.h"
#include "Framework/Model/CimError.h"
#include "Framework/Requests/CimOperations.h"
#include "Host/Operations/OpenEnumerations.h"
#include "Host/Operations/Parameters.h"

namespace cimxml {
class InstanceStream;
}

namespace host {

/// What a user must be allowed in order to call an operation.
enum class Privilege { Read, Administer };

/// Who calls.
struct Caller {
    std::string user;
    bool isAdministrator = false;
    std::string host;     ///< as the client addressed the server: host or host:port; goes into paths
    std::string address;  ///< where the client is
};

/// What a handler works on.
struct OperationContext {
    core::CimOperations& target;  ///< the namespace that the client addressed
    const Caller& caller;
    OpenEnumerations& enumerations;
    AnswerCharge& charge;  ///< of the answer
    /// Takes the instances of an enumeration, or the one asked for, instead of the result, which then says
    /// so; null when they are wanted as values.
    cimxml::InstanceStream* stream = nullptr;
};

/// An intrinsic operation. Handlers throw CimError.
using OperationHandler = cimxml::IntrinsicResult (*)(const OperationContext&, const Parameters&);

struct Operation {
    std::string_view name;
    Privilege privilege;
    OperationHandler handler;
    std::vector<ParameterSpec> parameters;
};

/// The operation of that name, without regard to case; null for an unknown one.
const Operation* findOperation(std::string_view name);

/// What calling a method takes. Methods install firmware or may do so; there is one privilege for all, since
/// classes come with the providers.
inline constexpr Privilege kMethodPrivilege = Privilege::Administer;

// The handlers that the operation table names. Those of pull operations stand beside it.

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
cimxml::IntrinsicResult associators(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult associatorNames(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult references(const OperationContext& context, const Parameters& parameters);
cimxml::IntrinsicResult referenceNames(const OperationContext& context, const Parameters& parameters);

/// The chain of the class; CimError with the given status when the target does not know it.
core::ClassChain requireClass(core::CimOperations& target, const std::string& className,
                              core::CimStatus otherwise);

}  // namespace host
