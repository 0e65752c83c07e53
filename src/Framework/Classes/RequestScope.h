// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <vector>

#include "Utils/Export.h"

namespace core {

struct AgentRegistration;
class AgentUse;

/// One request of a client, on the calling thread. Whatever is enumerated, looked up or added meanwhile on
/// this thread stays alive until the scope ends, so plain pointers to instances are good that long. Every
/// front opens one around each request. A scope inside a scope is part of the outer one.
class QUENX_EXPORT RequestScope {
  public:
    RequestScope();
    ~RequestScope();
    RequestScope(const RequestScope&) = delete;
    RequestScope& operator=(const RequestScope&) = delete;

    /// The outermost scope of the calling thread; null when there is none.
    static RequestScope* current();

    /// Keeps the object until the scope ends.
    void hold(std::shared_ptr<const void> object);
    /// Keeps the agent from leaving until the scope ends.
    void hold(const std::shared_ptr<AgentRegistration>& registration);

  private:
    bool m_outermost;
    std::vector<std::shared_ptr<const void>> m_held;
    std::vector<AgentUse> m_agents;
};

}  // namespace core
