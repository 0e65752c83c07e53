// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/RequestScope.h"

#include "Framework/Classes/CimBroker.h"

namespace core {

namespace {

thread_local RequestScope* currentScope = nullptr;

}  // namespace

RequestScope::RequestScope() : m_outermost(currentScope == nullptr) {
    if (m_outermost) currentScope = this;
}

RequestScope::~RequestScope() {
    if (!m_outermost) return;
    currentScope = nullptr;
    // Instances go before their agents may.
    m_held.clear();
    m_agents.clear();
}

RequestScope* RequestScope::current() {
    return currentScope;
}

void RequestScope::hold(std::shared_ptr<const void> object) {
    // The same snapshot is often taken several times in a row.
    if (!m_held.empty() && m_held.back() == object) return;
    m_held.push_back(std::move(object));
}

void RequestScope::hold(const std::shared_ptr<AgentRegistration>& registration) {
    for (const AgentUse& use : m_agents) {
        if (use.uses(registration)) return;
    }
    m_agents.emplace_back(registration);
}

}  // namespace core
