// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/CimBroker.h"

#include <algorithm>

#include "Framework/Classes/RequestScope.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimPath.h"

namespace core {

namespace {

using List = utils::SafeList<CimInstance*>;

/// Several enumerations, one behind the other. Keeps them, and with them their elements.
class JoinedIterator : public List::IteratorImplementation {
  public:
    explicit JoinedIterator(std::vector<List::Iterator> parts)
        : m_joined(std::make_shared<Joined>(std::move(parts))) {}
    JoinedIterator(const JoinedIterator& other) : IteratorImplementation(), m_joined(other.m_joined) {}

    CimInstance* first() override {
        m_position = 0;
        return next();
    }

    CimInstance* next() override {
        while (m_position < m_joined->elements.size()) {
            CimInstance* element = m_joined->elements[m_position++];
            if (!element->isDeleted()) return element;
        }
        return nullptr;
    }

    std::size_t size() override { return m_joined->elements.size(); }

    std::unique_ptr<IteratorImplementation> clone() override {
        return std::make_unique<JoinedIterator>(*this);
    }

  private:
    struct Joined {
        explicit Joined(std::vector<List::Iterator> all) : parts(std::move(all)) {
            for (List::Iterator& part : parts) {
                for (CimInstance* element = part.first(); element != nullptr; element = part.next()) {
                    elements.push_back(element);
                }
            }
        }
        std::vector<List::Iterator> parts;
        std::vector<CimInstance*> elements;
    };

    std::shared_ptr<const Joined> m_joined;
    std::size_t m_position = 0;
};

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

CimBroker::CimBroker() = default;

CimBroker::~CimBroker() = default;

void CimBroker::addAgent(CimAgent* agent) {
    auto registration = std::make_shared<AgentRegistration>();
    registration->agent = agent;
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_agents.push_back(std::move(registration));
}

void CimBroker::removeAgent(CimAgent* agent) noexcept {
    std::shared_ptr<AgentRegistration> leaving;
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        const auto found = std::find_if(m_agents.begin(), m_agents.end(), [&](const auto& registration) {
            return registration->agent == agent;
        });
        if (found == m_agents.end()) return;
        leaving = std::move(*found);
        m_agents.erase(found);
    }
    // Outside the lock: the requests waited for may ask the broker themselves.
    for (int users = leaving->users; users != 0; users = leaving->users)
        leaving->users.wait(users);
}

std::vector<AgentUse> CimBroker::useAgents() {
    RequestScope* scope = RequestScope::current();
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
    if (!path.isValid()) return nullptr;
    for (const AgentUse& use : useAgents()) {
        if (!use.agent().isClassSupported(path.getClassName())) continue;
        List::Iterator instances = use.agent().getInstances(path.getClassName());
        for (CimInstance* instance = instances.first(); instance != nullptr; instance = instances.next()) {
            if (path.isSameObjectAs(*instance)) return instance;
        }
    }
    return nullptr;
}

List::Iterator CimBroker::getInstances(std::string className, std::string providerName) {
    std::vector<List::Iterator> parts;
    for (const AgentUse& use : useAgents()) {
        CimAgent& agent = use.agent();
        if (!providerName.empty() && agent.getProviderName() != providerName) continue;
        if (agent.isClassSupported(className)) parts.push_back(agent.getInstances(className));
    }
    // The usual case, without a copy of all elements.
    if (parts.size() == 1) return std::move(parts.front());
    return List::Iterator(std::make_unique<JoinedIterator>(std::move(parts)));
}

CimBroker* GetCimBroker() {
    static CimBroker broker;
    return &broker;
}

}  // namespace core
