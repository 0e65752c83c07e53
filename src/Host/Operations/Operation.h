#pragma once

#include <span>
#include <string>
#include <string_view>

#include "CimXml/Response.h"
#include "Host/Operations/NamespaceModel.h"
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
    const NamespaceModel& model;
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

}  // namespace host
