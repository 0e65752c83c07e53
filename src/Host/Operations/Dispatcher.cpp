#include "Host/Operations/Dispatcher.h"

#include <new>

#include "Host/Operations/Handlers.h"
#include "Host/Operations/PathTyping.h"

namespace host {

namespace {

using cimxml::ExtrinsicResult;
using cimxml::Failure;
using cimxml::IntrinsicResult;
using core::CimError;
using core::CimStatus;

void requirePrivilege(Privilege privilege, const Caller& caller) {
    if (privilege == Privilege::Administer && !caller.isAdministrator) {
        throw CimError(CimStatus::AccessDenied, "user " + caller.user + " may only read");
    }
}

/// What an operation that is not in the table needs: nothing, since it does nothing.
constexpr Operation kUnknown{"", Privilege::Read, {}, notSupported};

}  // namespace

Dispatcher::Dispatcher(Namespaces namespaces, const PullLimits& limits)
    : m_namespaces(std::move(namespaces)), m_pulls(limits) {}

const NamespaceModel& Dispatcher::model(const std::string& name) const {
    for (const auto& each : m_namespaces) {
        if (core::sameName(each->name(), name)) return *each;
    }
    throw CimError(CimStatus::InvalidNamespace, "no namespace \"" + name + "\"");
}

IntrinsicResult Dispatcher::call(const cimxml::IntrinsicCall& call, const Caller& caller) {
    const Operation* operation = findOperation(call.operation);
    if (operation != nullptr) requirePrivilege(operation->privilege, caller);
    const NamespaceModel& target = model(call.namespaceName);
    if (operation == nullptr) {
        // The parameters of an unknown operation are not looked at.
        const cimxml::IntrinsicCall bare{call.operation, call.namespaceName, {}};
        return kUnknown.handler({target, caller, m_pulls, call.operation}, Parameters(bare, {}));
    }
    return operation->handler({target, caller, m_pulls, operation->name},
                              Parameters(call, operation->parameters));
}

ExtrinsicResult Dispatcher::call(const cimxml::MethodCall& call, const Caller& caller) {
    requirePrivilege(methodPrivilege(), caller);
    const NamespaceModel& target = model(call.object.getNamespace());
    const core::ClassChain chain = target.getClass(call.object.getClassName());
    const core::MethodDeclaration* method = core::findMethod(chain, call.method);
    if (method == nullptr) {
        throw CimError(CimStatus::MethodNotFound, chain.front()->name + " has no method " + call.method);
    }
    if (call.isClass) {
        throw CimError(CimStatus::MethodNotAvailable, method->name + " is called on an instance");
    }
    const core::CimPath path = typedPath(target, chain, call.object);
    return {method->returnType,
            target.invokeMethod(path, method->name, typedArguments(target, *method, call.arguments))};
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
            response.content = call(*method, caller);
        } else {
            response.content = call(std::get<cimxml::IntrinsicCall>(request.call), caller);
        }
    } catch (const CimError& error) {
        response.content = Failure{error.status(), error.what()};
    } catch (const std::bad_alloc&) {
        response.content = Failure{CimStatus::Failed, "out of memory"};
    } catch (const std::exception& error) {
        response.content = Failure{CimStatus::Failed, error.what()};
    }
    return response;
}

}  // namespace host
