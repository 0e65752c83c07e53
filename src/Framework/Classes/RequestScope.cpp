// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/RequestScope.h"

#include <pthread.h>

#include <utility>

#include "Framework/Model/CimType.h"

namespace core {

namespace {

thread_local RequestScope* currentScope = nullptr;
thread_local const std::string* currentNamespace = nullptr;

}  // namespace

AgentUse::AgentUse(std::shared_ptr<AgentRegistration> registration) noexcept
    : m_registration(std::move(registration)) {
    m_registration->users.fetch_add(1, std::memory_order_acq_rel);
}

AgentUse::~AgentUse() {
    if (m_registration == nullptr) return;
    m_registration->users.fetch_sub(1, std::memory_order_acq_rel);
    m_registration->users.notify_all();
}

RequestScope::RequestScope(const std::string& servedNamespace) : RequestScope() {
    currentNamespace = &servedNamespace;
}

RequestScope::RequestScope() : m_outermost(currentScope == nullptr), m_outerNamespace(currentNamespace) {
    if (!m_outermost) return;
    currentScope = this;
    // Cancelled in here, a host's thread would leave locks behind, and end the process at the first noexcept.
    ::pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &m_cancelState);
}

RequestScope::~RequestScope() {
    currentNamespace = m_outerNamespace;
    if (!m_outermost) return;
    currentScope = nullptr;
    // Instances go before their agents may.
    m_held.clear();
    m_agents.clear();
    ::pthread_setcancelstate(m_cancelState, nullptr);
}

RequestScope* RequestScope::current() {
    return currentScope;
}

bool RequestScope::serves(const std::string& namespaceName) {
    return currentNamespace == nullptr || namespaceName.empty() || sameName(namespaceName, *currentNamespace);
}

void RequestScope::hold(std::shared_ptr<const void> object) {
    // The same snapshot is often taken several times in a row.
    if (!m_held.empty() && m_held.back() == object) return;
    m_held.push_back(std::move(object));
}

void RequestScope::hold(const std::shared_ptr<AgentRegistration>& registration) {
    // A request looks at the agents many times; a process has two or three of them.
    for (const AgentUse& use : m_agents) {
        if (use.uses(registration)) return;
    }
    m_agents.emplace_back(registration);
}

}  // namespace core
