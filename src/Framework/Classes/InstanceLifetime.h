// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <vector>

#include "Utils/Export.h"

/// How long instances live: at least as long as the requests that have met them, and until the reaper has
/// destroyed them.
namespace core {

class AgentUse;
class CimInstance;
struct AgentRegistration;

/// One request of a client, on the calling thread. Whatever is enumerated, looked up or added meanwhile on
/// this thread stays alive until the scope ends, so plain pointers to instances are good that long. The
/// request layer opens one around each request; code that calls the broker itself opens its own. A scope
/// inside a scope is part of the outer one.
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

/// The deleter of listed instances: destroys one that nobody holds any more, at once, or on the reaper's
/// thread when the instance's destructor waits. Never fails and never waits; where that thread cannot be had,
/// the instance stays queued until the next one comes, or drainReaper().
struct InstanceRelease {
    void operator()(CimInstance* instance) const noexcept;
};

/// Makes sure that the reaper is built, and so destroyed after the object that is being built now.
void prepareReaper();

/// Returns when every instance that was queued is destroyed, code of its library included.
QUENX_EXPORT void drainReaper() noexcept;

/// Whether the thread still has instances to destroy.
QUENX_EXPORT bool isReaperBusy() noexcept;

}  // namespace core
