// SPDX-License-Identifier: Apache-2.0
#include "Cmpi/Deliverer.h"

#include <utility>

#include "Cmpi/BrokerScopes.h"
#include "Cmpi/Instances.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"

namespace cmpi {

namespace {

/// The way to the object manager from a thread of our own: all of it, or none.
Context* firstContext(const Broker& broker, const Context* context) {
    const BrokerTable* table = broker.bft;
    const bool isWhole = table != nullptr && table->attachThread != nullptr &&
                         table->detachThread != nullptr && table->deliverIndication != nullptr;
    return made(isWhole ? preparedContext(broker, context) : nullptr,
                "a context for the thread that sends indications");
}

}  // namespace

Deliverer::Deliverer(const Broker& broker, const Context* context, std::string served,
                     std::shared_ptr<EventQueue> queue)
    : m_broker(broker),
      m_context(firstContext(broker, context)),
      m_served(std::move(served)),
      m_queue(std::move(queue)),
      m_host(os::getHostname()),
      m_idPrefix("Quenx:" + std::to_string(os::getuSecondsSinceEpoch()) + "-") {}

bool Deliverer::ends(std::chrono::milliseconds within) const {
    return !isInThisProcess() || m_hasEnded.wait_for(within) == std::future_status::ready;
}

void Deliverer::execute() {
    std::uint64_t number = 0;
    while (const auto item = m_queue->next()) {
        if (item->lost != 0)
            QUENX_ERROR("%llu events were dropped", static_cast<unsigned long long>(item->lost));
        ++number;
        bool isTaken = true;
        for (const std::string& nameSpace : *item->namespaces)
            isTaken = tryToDeliver(item->event, nameSpace.empty() ? m_served : nameSpace, number) && isTaken;
        m_isFailing = !isTaken;
    }
    { const Attachment last(m_broker, m_context); }
    m_end.set_value();
}

bool Deliverer::tryToDeliver(const core::InstanceEvent& event, const std::string& nameSpace,
                             std::uint64_t number) noexcept try {
    deliver(event, nameSpace, m_idPrefix + std::to_string(number));
    return true;
} catch (const std::exception& error) {
    if (!m_isFailing) QUENX_ERROR("Indications do not reach those who listen: %s", error.what());
    return false;
}

void Deliverer::deliver(const core::InstanceEvent& event, const std::string& nameSpace,
                        const std::string& identifier) const {
    const Attachment attachment(m_broker, preparedContext(m_broker, m_context));
    const Context* context = made(attachment.context(), "the thread one that may send indications");
    // Also what keeps sfcb from freeing twice when the thread ends.
    const Temporaries temporaries(m_broker);
    const Place place{m_broker, nameSpace, m_served};
    requireTaken(call(m_broker, m_broker.bft, &BrokerTable::deliverIndication, context, nameSpace.c_str(),
                      newIndication(place, event, identifier, m_host)),
                 "an indication");
}

}  // namespace cmpi
