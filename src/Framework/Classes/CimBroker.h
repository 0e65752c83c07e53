// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Framework/Classes/CimClass.h"
#include "Framework/Classes/RequestScope.h"

namespace core {

/// A provider: a name and the class objects that it serves. The operations below answer by the class object
/// whose getClassName() equals the given name (without regard to case); an unknown name yields nothing.
class QUENX_EXPORT CimAgent {
  public:
    explicit CimAgent(std::string providerName);
    CimAgent(const CimAgent&) = delete;
    CimAgent& operator=(const CimAgent&) = delete;

    virtual bool isClassSupported(std::string className);
    virtual utils::SafeList<CimInstance*>::Iterator getInstances(std::string className);
    virtual void createInstance(CimInstance* instance);
    virtual void enableIndications(std::string className);
    virtual void disableIndications(std::string className);
    /// Calls leaveBroker() for agents whose own destructor did not.
    virtual ~CimAgent();

    const std::string& getProviderName() const { return m_providerName; }
    CimClasses& getClasses() { return m_classes; }

  protected:
    /// Takes the agent out of the broker, waits for the requests that use it, destroys its class objects and
    /// waits until every released instance is destroyed, so that its library can be unloaded. The most
    /// derived destructor calls it, before anything of the object is gone. Must not be called from within a
    /// request. A child of the process that built the agent, and which has not used any, only takes it out:
    /// the threads to wait for are not there, and locks may be held for ever.
    void leaveBroker() noexcept;

    CimClasses m_classes;

  private:
    std::string m_providerName;
    unsigned int m_forks;  ///< os::forkCount() where it was built
};

/// Knows all agents of the process. Thread-safe.
class QUENX_EXPORT CimBroker {
  public:
    CimBroker() = default;
    CimBroker(const CimBroker&) = delete;
    CimBroker& operator=(const CimBroker&) = delete;

    /// Registers an agent; called once, from the agent's constructor, before its classes are added.
    virtual void addAgent(CimAgent* agent);
    /// The instance that the path names, from whichever agent serves its class; null when there is none, and
    /// for a path of another namespace than the one that the calling thread's request is for. It stays owned
    /// by its class object and is good until the calling thread's request scope ends. Throws what a class
    /// object throws.
    virtual CimInstance* getInstanceByPath(CimPath& path);
    /// The instances of one class: of the named provider, or with an empty name of every provider that serves
    /// the class, joined in the order of registration. An unknown class yields an empty enumeration.
    virtual utils::SafeList<CimInstance*>::Iterator getInstances(std::string className,
                                                                 std::string providerName);
    virtual ~CimBroker();

    /// Takes the agent out and waits until nobody uses it. An agent that is not registered is ignored.
    void removeAgent(CimAgent* agent) noexcept;

    /// Takes the agent out, without a lock or a wait: for a child of the process that added it, where a
    /// thread that is not there may hold the lock. Nobody else may use the broker meanwhile.
    void forgetAgent(const CimAgent* agent) noexcept;

    /// Whether this process has used an agent. A child of one that has, has not yet.
    bool isUsedHere() const noexcept;

    /// Every agent, each kept from leaving while its entry lives. With a request scope open on the calling
    /// thread the scope keeps them too, until it ends.
    std::vector<AgentUse> useAgents();

  private:
    static constexpr unsigned int kNever = ~0U;

    std::atomic<unsigned int> m_usedAtForks{kNever};  ///< os::forkCount() at the last use
    utils::Mutex m_mutex;
    std::vector<std::shared_ptr<AgentRegistration>> m_agents QUENX_GUARDED_BY(m_mutex);
};

/// The process-wide broker; never null. Lives until after every library that uses it has unloaded.
QUENX_EXPORT CimBroker* GetCimBroker();

}  // namespace core
