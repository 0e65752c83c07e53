// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/CimBroker.h"

#include <algorithm>

#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimValue.h"
#include "Utils/Os/Linux/linux.h"

namespace core {

CimAgent::CimAgent(std::string providerName)
    : m_providerName(std::move(providerName)), m_forks(os::forkCount()) {
    // An agent of static storage that is never unloaded destroys its instances when the process exits.
    prepareReaper();
}

CimAgent::~CimAgent() {
    leaveBroker();
}

bool CimAgent::isClassSupported(std::string className) {
    return m_classes.find(className) != nullptr;
}

utils::SafeList<CimInstance*>::Iterator CimAgent::getInstances(std::string className) {
    const ServedClass* served = m_classes.find(className);
    return served == nullptr ? joinInstances({}) : served->object->getInstances();
}

void CimAgent::createInstance(CimInstance* instance) {
    if (const ServedClass* served = m_classes.find(instance->getClassName()))
        served->object->createInstance(instance);
}

void CimAgent::enableIndications(std::string className) {
    if (const ServedClass* served = m_classes.find(className)) served->object->enableIndications();
}

void CimAgent::disableIndications(std::string className) {
    if (const ServedClass* served = m_classes.find(className)) served->object->disableIndications();
}

void CimAgent::leaveBroker() noexcept {
    if (m_forks != os::forkCount() && !GetCimBroker()->isUsedHere()) {
        GetCimBroker()->forgetAgent(this);
        m_classes.abandon();
        return;
    }
    GetCimBroker()->removeAgent(this);
    // A deleted job may still be flashing, and its code is the library's that is about to unload.
    drainReaper([this] { m_classes.clear(); });
}

CimBroker::~CimBroker() = default;

void CimBroker::addAgent(CimAgent* agent) {
    // Shared with the requests that use the agent, which count themselves in it.
    auto registration = std::make_shared<AgentRegistration>();
    registration->agent = agent;
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_agents.push_back(std::move(registration));
}

void CimBroker::removeAgent(CimAgent* agent) noexcept {
    std::shared_ptr<AgentRegistration> leaving;
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        const auto found =
            std::ranges::find_if(m_agents, [&](const auto& each) { return each->agent == agent; });
        if (found == m_agents.end()) return;
        leaving = std::move(*found);
        m_agents.erase(found);
    }
    // Outside the lock: the requests waited for may ask the broker themselves.
    for (int users = leaving->users; users != 0; users = leaving->users)
        leaving->users.wait(users);
}

void CimBroker::forgetAgent(const CimAgent* agent) noexcept QUENX_NO_THREAD_SAFETY_ANALYSIS {
    std::erase_if(m_agents, [&](const auto& each) { return each->agent == agent; });
}

bool CimBroker::isUsedHere() const noexcept {
    return m_usedAtForks == os::forkCount();
}

std::vector<AgentUse> CimBroker::useAgents() {
    m_usedAtForks = os::forkCount();
    RequestScope* scope = RequestScope::current();
    // Counted under the lock: an agent that has left the list gets no new users, so its wait can end.
    const utils::Mutex::AutoLocker lock(m_mutex);
    std::vector<AgentUse> uses;
    uses.reserve(m_agents.size());
    for (const auto& registration : m_agents) {
        uses.emplace_back(registration);
        if (scope != nullptr) scope->hold(registration);
    }
    return uses;
}

CimInstance* CimBroker::getInstanceByPath(CimPath& path) {
    if (!path.isValid() || !RequestScope::serves(path.getNamespace())) return nullptr;
    for (const AgentUse& use : useAgents()) {
        const ServedClass* served = use.agent().getClasses().find(path.getClassName());
        if (served != nullptr && served->findInstance != nullptr) {
            if (CimInstance* found = served->findInstance(*served->object, path)) return found;
            continue;
        }
        if (!use.agent().isClassSupported(path.getClassName())) continue;
        for (CimInstance* instance : InstanceRange(use.agent().getInstances(path.getClassName()))) {
            if (path.isSameObjectAs(*instance)) return instance;
        }
    }
    return nullptr;
}

utils::SafeList<CimInstance*>::Iterator CimBroker::getInstances(std::string className,
                                                                std::string providerName) {
    std::vector<utils::SafeList<CimInstance*>::Iterator> parts;
    for (const AgentUse& use : useAgents()) {
        CimAgent& agent = use.agent();
        if (!providerName.empty() && agent.getProviderName() != providerName) continue;
        if (agent.isClassSupported(className)) parts.push_back(agent.getInstances(className));
    }
    // The usual case, without a copy of all elements.
    if (parts.size() == 1) return std::move(parts.front());
    return joinInstances(std::move(parts));
}

CimBroker* GetCimBroker() {
    // Static storage of the lowest library that knows it: it is built before, and destroyed after, the
    // agents.
    static CimBroker broker;
    return &broker;
}

}  // namespace core
