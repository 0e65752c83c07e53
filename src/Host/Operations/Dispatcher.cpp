// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/Dispatcher.h"

#include <new>

namespace host {

namespace {

using cimxml::ErrorResult;
using cimxml::IntrinsicResult;
using core::CimError;
using core::CimStatus;

void requirePrivilege(Privilege privilege, const Caller& caller) {
    if (privilege == Privilege::Administer && !caller.isAdministrator) {
        throw CimError(CimStatus::AccessDenied, "user " + caller.user + " may only read");
    }
}

}  // namespace

Dispatcher::Dispatcher(Namespaces namespaces, const PullLimits& limits)
    : m_namespaces(std::move(namespaces)), m_enumerations(limits) {}

core::CimOperations& Dispatcher::findNamespace(const std::string& name) const {
    for (const auto& each : m_namespaces) {
        if (core::sameName(each->getNamespace(), name)) return *each;
    }
    throw CimError(CimStatus::InvalidNamespace, "no namespace \"" + name + "\"");
}

IntrinsicResult Dispatcher::callOperation(const cimxml::IntrinsicCall& call, const Caller& caller) {
    const Operation* operation = findOperation(call.operation);
    if (operation != nullptr) requirePrivilege(operation->privilege, caller);
    // The namespace before the operation: clients probe for namespaces with whatever operation they like.
    core::CimOperations& target = findNamespace(call.namespaceName);
    if (operation == nullptr) {
        throw CimError(CimStatus::NotSupported, "operation " + call.operation + " is not supported");
    }
    return operation->handler({target, caller, m_enumerations}, Parameters(call, operation->parameters));
}

core::MethodResult Dispatcher::callMethod(const cimxml::MethodCall& call, const Caller& caller) {
    // Before anything else, so that a reader learns nothing of what there is to call.
    requirePrivilege(kMethodPrivilege, caller);
    core::CimOperations& target = findNamespace(call.object.getNamespace());
    if (!call.mistypedArgument.empty()) {
        throw CimError(CimStatus::InvalidParameter,
                       "parameter " + call.mistypedArgument + " does not hold a value of its stated type");
    }
    return target.invokeMethod(call.object, call.method, call.arguments);
}

cimxml::Response Dispatcher::dispatch(const cimxml::Request& request, const Caller& caller) {
    cimxml::Response response;
    response.messageId = request.messageId;
    response.name = request.name();
    response.isMethod = std::holds_alternative<cimxml::MethodCall>(request.call);
    response.host = caller.host;
    try {
        if (m_shuttingDown.load()) {
            throw CimError(CimStatus::ServerIsShuttingDown, "the server is shutting down");
        }
        if (const auto* method = std::get_if<cimxml::MethodCall>(&request.call)) {
            response.content = callMethod(*method, caller);
        } else {
            response.content = callOperation(std::get<cimxml::IntrinsicCall>(request.call), caller);
        }
    } catch (const CimError& error) {
        response.content = ErrorResult{error.status(), error.what()};
    } catch (const std::bad_alloc&) {
        // Most of what the request took is free again, so the small answer fits.
        response.content = ErrorResult{CimStatus::Failed, "out of memory"};
    } catch (const std::exception& error) {
        // A provider's fault is the answer to this request alone; the connection and the daemon go on.
        response.content = ErrorResult{CimStatus::Failed, error.what()};
    }
    return response;
}

}  // namespace host
