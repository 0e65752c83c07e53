// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <memory>
#include <string>
#include <vector>

#include "Utils/Export.h"

/// What keeps providers and their instances alive while somebody uses them.
namespace core {

class CimAgent;

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

/// One request of a client, on the calling thread. Whatever is enumerated, looked up or added meanwhile on
/// this thread stays alive until the scope ends, so plain pointers to instances are good that long. The
/// request layer opens one around each request; code that calls the broker itself opens its own. A scope
/// inside a scope is part of the outer one. Until the scope ends the thread cannot be cancelled: a
/// pthread_cancel() takes effect after it.
class QUENX_EXPORT RequestScope {
  public:
    RequestScope();
    /// @param servedNamespace  the one that the request is for; has to outlive the scope
    explicit RequestScope(const std::string& servedNamespace);
    ~RequestScope();
    RequestScope(const RequestScope&) = delete;
    RequestScope& operator=(const RequestScope&) = delete;

    /// The outermost scope of the calling thread; null when there is none.
    static RequestScope* current();

    /// Whether a path of this namespace can name something for the calling thread's request: any can outside
    /// a request for a namespace, and an empty one always means the namespace that is served.
    static bool serves(const std::string& namespaceName);

    /// Keeps the object until the scope ends.
    void hold(std::shared_ptr<const void> object);
    /// Keeps the agent from leaving until the scope ends.
    void hold(const std::shared_ptr<AgentRegistration>& registration);

  private:
    bool m_outermost;
    const std::string* m_outerNamespace;
    int m_cancelState = 0;
    std::vector<std::shared_ptr<const void>> m_held;
    std::vector<AgentUse> m_agents;
};

}  // namespace core
