// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <memory>
#include <vector>

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "Host/Operations/AuditTrail.h"
#include "Host/Operations/Operations.h"

namespace host {

/// Carries requests to the namespaces and turns every outcome into a response. Thread-safe.
class Dispatcher {
  public:
    using Namespaces = std::vector<std::shared_ptr<core::CimOperations>>;

    /// @param trail  of refusals; one for all that refuse
    explicit Dispatcher(Namespaces namespaces, const PullLimits& limits = {},
                        std::size_t answerBytes = ServerLimits().answerBytes,
                        std::shared_ptr<AuditTrail> trail = std::make_shared<AuditTrail>());

    /// A charge for an answer to the user.
    AnswerCharge charge(const std::string& user) { return {m_budget, user}; }

    /// Throws OverBudget, and nothing else for what a request asks or a provider does, memory exhaustion
    /// included. Leaves an audit line for each call that changes something, or would if it were allowed,
    /// but not for too many refusals of one user.
    /// @param charge  of the answer
    /// @param stream  takes the instances of an enumeration; see OperationContext
    cimxml::Response dispatch(const cimxml::Request& request, const Caller& caller, AnswerCharge& charge,
                              cimxml::InstanceStream* stream = nullptr);

    /// The same as a message. Throws OverBudget.
    cimxml::Pieces answer(const cimxml::Request& request, const Caller& caller, AnswerCharge& charge);

    /// From now on every request is answered with "server is shutting down".
    void shutDown() { m_shuttingDown.store(true); }

  private:
    cimxml::Response carryOut(const cimxml::Request& request, const Caller& caller, AnswerCharge& charge,
                              cimxml::InstanceStream* stream);
    cimxml::IntrinsicResult callOperation(const cimxml::IntrinsicCall& call, const Caller& caller,
                                          AnswerCharge& charge, cimxml::InstanceStream* stream);
    core::MethodResult callMethod(const cimxml::MethodCall& call, const Caller& caller);
    core::CimOperations& findNamespace(const std::string& name) const;
    void audit(const cimxml::Request& request, const Caller& caller, const cimxml::Response& response,
               const core::CallNotes& notes);

    const Namespaces m_namespaces;
    AnswerBudget m_budget;
    OpenEnumerations m_enumerations;
    const std::shared_ptr<AuditTrail> m_trail;
    std::atomic<bool> m_shuttingDown{false};
};

}  // namespace host
