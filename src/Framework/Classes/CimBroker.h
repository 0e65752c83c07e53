// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Classes/CimAgent.h"

namespace core {

/// One agent's entry with the broker; counts the requests that use the agent.
struct AgentRegistration {
    CimAgent* agent = nullptr;
    std::atomic<int> users{0};
};

/// Keeps an agent from leaving while it lives. Movable, not copyable.
class QUENX_EXPORT AgentUse {
  public:
    explicit AgentUse(std::shared_ptr<AgentRegistration> registration) noexcept;
    AgentUse(AgentUse&&) noexcept = default;
    AgentUse& operator=(AgentUse&&) = delete;
    ~AgentUse();

    CimAgent& agent() const { return *m_registration->agent; }
    bool uses(const std::shared_ptr<AgentRegistration>& registration) const {
        return m_registration == registration;
    }

  private:
    std::shared_ptr<AgentRegistration> m_registration;
};

/// Knows all agents of the process. Thread-safe.
class QUENX_EXPORT CimBroker {
  public:
    CimBroker();
    CimBroker(const CimBroker&) = delete;
    CimBroker& operator=(const CimBroker&) = delete;

    /// Registers an agent; called once, from the agent's constructor, before its classes are added.
    virtual void addAgent(CimAgent* agent);
    /// The instance that the path names, from whichever agent serves its class; null when there is none. It
    /// stays owned by its class object and is good until the calling thread's request scope ends. Throws what
    /// a class object throws.
    virtual CimInstance* getInstanceByPath(CimPath& path);
    /// The instances of one class: of the named provider, or with an empty name of every provider that serves
    /// the class, joined in the order of registration. An unknown class yields an empty enumeration.
    virtual utils::SafeList<CimInstance*>::Iterator getInstances(std::string className,
                                                                 std::string providerName);
    virtual ~CimBroker();

    /// Takes the agent out and waits until nobody uses it. An agent that is not registered is ignored.
    void removeAgent(CimAgent* agent) noexcept;

    /// Every agent, each kept from leaving while its entry lives. With a request scope open on the calling
    /// thread the scope keeps them too, until it ends.
    std::vector<AgentUse> useAgents();

  private:
    utils::Mutex m_mutex;
    std::vector<std::shared_ptr<AgentRegistration>> m_agents QUENX_GUARDED_BY(m_mutex);
};

/// The process-wide broker; never null. Lives until after every library that uses it has unloaded.
QUENX_EXPORT CimBroker* GetCimBroker();

}  // namespace core
