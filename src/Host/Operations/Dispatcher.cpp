// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/Dispatcher.h"

#include <algorithm>
#include <new>
#include <utility>

#include "CimXml/InstanceStream.h"
#include "Framework/Requests/Audit.h"
#include "Framework/Requests/Caller.h"
#include "Framework/Requests/DeniedUpdates.h"

namespace host {

namespace {

using cimxml::ErrorResult;
using cimxml::IntrinsicResult;
using core::CimError;
using core::CimStatus;

void requirePrivilege(Privilege privilege, const Caller& caller) {
    if (privilege == Privilege::Administer && !caller.isAdministrator) {
        core::NotedCall::noteReason(core::ReasonId::NotAdministrator);
        throw CimError(CimStatus::AccessDenied, "user " + caller.user + " may only read");
    }
}

/// Whether the call changes something, or would. No method is known to change nothing: a check claims its
/// adapter.
bool isAudited(const cimxml::Request& request) {
    const auto* call = std::get_if<cimxml::IntrinsicCall>(&request.call);
    if (call == nullptr) return true;
    const Operation* operation = findOperation(call->operation);
    return operation != nullptr && operation->privilege == Privilege::Administer;
}

struct OutcomeText {
    std::string operator()(const ErrorResult& error) const {
        return core::outcomeOf(error.status, error.description);
    }
    std::string operator()(const core::MethodResult& result) const { return core::outcomeOf(result); }
    std::string operator()(const IntrinsicResult&) const { return "done"; }
};

core::Caller callerOf(const Caller& caller) {
    return {.principal = caller.user,
            .address = caller.address,
            .front = "quenx-cimd",
            .isAdministrator = caller.isAdministrator};
}

/// The path that the call names; empty when it names none.
std::string targetOf(const cimxml::IntrinsicCall& call) {
    for (const cimxml::Parameter& parameter : call.parameters) {
        if (const auto* path = std::get_if<core::CimPath>(&parameter.value)) return path->toString();
        if (const auto* body = std::get_if<cimxml::InstanceBody>(&parameter.value))
            return body->path ? body->path->toString() : body->className;
    }
    return "";
}

}  // namespace

Dispatcher::Dispatcher(Namespaces namespaces, const PullLimits& limits, std::size_t answerBytes,
                       std::shared_ptr<AuditTrail> trail)
    : m_namespaces(std::move(namespaces)),
      m_budget(answerBytes),
      m_enumerations(limits),
      m_trail(std::move(trail)) {}

core::CimOperations& Dispatcher::findNamespace(const std::string& name) const {
    for (const auto& each : m_namespaces) {
        if (core::sameName(each->getNamespace(), name)) return *each;
    }
    throw CimError(CimStatus::InvalidNamespace, "no namespace \"" + name + "\"");
}

IntrinsicResult Dispatcher::callOperation(const cimxml::IntrinsicCall& call, const Caller& caller,
                                          AnswerCharge& charge, cimxml::InstanceStream* stream) {
    const Operation* operation = findOperation(call.operation);
    if (operation != nullptr) requirePrivilege(operation->privilege, caller);
    // The namespace before the operation: clients probe for namespaces with whatever operation they like.
    core::CimOperations& target = findNamespace(call.namespaceName);
    if (operation == nullptr) {
        throw CimError(CimStatus::NotSupported, "operation " + call.operation + " is not supported");
    }
    return operation->handler({target, caller, m_enumerations, charge, stream},
                              Parameters(call, operation->parameters));
}

core::MethodResult Dispatcher::callMethod(const cimxml::MethodCall& call, const Caller& caller) {
    // Before anything else, so that a reader learns nothing of what there is to call.
    try {
        requirePrivilege(kMethodPrivilege, caller);
    } catch (const CimError& denied) {
        core::tellOfDenied(call.method, call.arguments, core::ReasonId::NotAdministrator, denied.what());
        throw;
    }
    core::CimOperations& target = findNamespace(call.object.getNamespace());
    if (!call.mistypedArgument.empty()) {
        throw CimError(CimStatus::InvalidParameter,
                       "parameter " + call.mistypedArgument + " does not hold a value of its stated type");
    }
    return target.invokeMethod(call.object, call.method, call.arguments);
}

void Dispatcher::audit(const cimxml::Request& request, const Caller& caller, const cimxml::Response& response,
                       const core::CallNotes& notes) try {
    core::AuditEvent event{callerOf(caller), request.name(), "", std::visit(OutcomeText{}, response.content),
                           notes};
    const auto* method = std::get_if<cimxml::MethodCall>(&request.call);
    event.target = method != nullptr ? method->object.toString()
                                     : targetOf(std::get<cimxml::IntrinsicCall>(request.call));
    static const std::vector<core::Argument> kNone;
    const std::vector<core::Argument>& arguments = method != nullptr ? method->arguments : kNone;
    const auto* error = std::get_if<ErrorResult>(&response.content);
    if (error != nullptr && error->status == CimStatus::AccessDenied) {
        m_trail->refused(event, arguments);
    } else {
        m_trail->writeNumbers();
        core::audit(event, arguments);
    }
} catch (const std::bad_alloc&) {
    // As in the rest of the log: a line that cannot be built is dropped.
}

cimxml::Response Dispatcher::dispatch(const cimxml::Request& request, const Caller& caller,
                                      AnswerCharge& charge, cimxml::InstanceStream* stream) {
    const core::NotedCall noted;
    cimxml::Response response = carryOut(request, caller, charge, stream);
    // However it ended: that somebody was refused is worth knowing, too.
    if (isAudited(request)) audit(request, caller, response, noted.notes());
    return response;
}

cimxml::Pieces Dispatcher::answer(const cimxml::Request& request, const Caller& caller,
                                  AnswerCharge& charge) {
    cimxml::InstanceStream stream(request.messageId, request.name());
    cimxml::Response response = dispatch(request, caller, charge, &stream);
    // What the stream holds of an enumeration that failed is not part of the answer.
    const auto* result = std::get_if<IntrinsicResult>(&response.content);
    if (result != nullptr && result->isStreamed) return stream.finish();
    // Not by an initializer list, which would copy the text.
    cimxml::Pieces whole;
    whole.push_back(
        cimxml::writeResponse(std::move(response), [&](std::size_t bytes) { charge.cover(bytes); }));
    return whole;
}

cimxml::Response Dispatcher::carryOut(const cimxml::Request& request, const Caller& caller,
                                      AnswerCharge& charge, cimxml::InstanceStream* stream) {
    cimxml::Response response;
    response.messageId = request.messageId;
    response.name = request.name();
    response.isMethod = std::holds_alternative<cimxml::MethodCall>(request.call);
    response.host = caller.host;
    const ChargingMeter meter(charge);
    try {
        const core::CallerScope scope(callerOf(caller));
        if (m_shuttingDown.load()) {
            throw CimError(CimStatus::ServerIsShuttingDown, "the server is shutting down");
        }
        if (const auto* method = std::get_if<cimxml::MethodCall>(&request.call)) {
            response.content = callMethod(*method, caller);
        } else {
            response.content =
                callOperation(std::get<cimxml::IntrinsicCall>(request.call), caller, charge, stream);
        }
    } catch (const CimError& error) {
        response.content = ErrorResult{error.status(), core::shownText(error)};
    } catch (const OverBudget&) {
        // Those that nobody reads on are let go of by the way, and nobody may come by if all are refused
        // here.
        m_enumerations.dropExpired();
        throw;
    } catch (const std::bad_alloc&) {
        // Most of what the request took is free again, so the small answer fits.
        response.content = ErrorResult{CimStatus::Failed, "out of memory"};
    } catch (const std::exception& error) {
        // A provider's fault is the answer to this request alone; the connection and the daemon go on.
        response.content = ErrorResult{CimStatus::Failed, core::shownText(error)};
    }
    return response;
}

}  // namespace host
