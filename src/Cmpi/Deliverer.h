// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <future>
#include <memory>
#include <string>

#include "Cmpi/Cmpi.h"
#include "Cmpi/EventQueue.h"
#include "Utils/Os/Linux/Thread.h"

namespace cmpi {

/// The thread that brings events to the object manager as indications. It is attached there only while it
/// delivers one: some object managers keep what a thread makes until it detaches.
class Deliverer : public utils::Thread {
  public:
    /// @param context  of the call that this is made in; the only way to one of our own
    /// @param served   the namespace that the events' instances are in
    /// @throws core::CimError where the object manager has no contexts for threads
    Deliverer(const Broker& broker, const Context* context, std::string served,
              std::shared_ptr<EventQueue> queue);
    ~Deliverer() override { shutdown(); }

    /// To be called when the queue has been closed. False where the object manager does not come back from
    /// what the thread has called; this must not be destroyed then.
    bool ends(std::chrono::milliseconds within) const;

    void execute() override;

  private:
    /// False where the object manager does not take the indication; the first of some is logged.
    bool tryToDeliver(const core::InstanceEvent& event, const std::string& nameSpace,
                      std::uint64_t number) noexcept;
    /// Throws core::CimError there.
    void deliver(const core::InstanceEvent& event, const std::string& nameSpace,
                 const std::string& identifier) const;

    const Broker& m_broker;
    Context* const m_context;  ///< for the preparation of others, and to be freed at the end
    const std::string m_served;
    const std::shared_ptr<EventQueue> m_queue;
    const std::string m_host;
    const std::string m_idPrefix;  ///< unique over restarts, and among processes
    std::promise<void> m_end;
    const std::shared_future<void> m_hasEnded{m_end.get_future()};
    bool m_isFailing = false;
};

}  // namespace cmpi
