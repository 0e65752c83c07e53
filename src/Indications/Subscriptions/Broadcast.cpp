// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/Broadcast.h"

#include <algorithm>
#include <map>

#include "CimXml/Export.h"
#include "Framework/Model/CimError.h"
#include "Indications/Indication.h"
#include "Indications/Subscriptions/Requests.h"
#include "Utils/Log.h"

namespace indications {

namespace {

/// Of which instances there are events.
constexpr const char* kSource = "CIM_ConcreteJob";

bool canFire(const Subscription& subscription, const Records& records) {
    const Filter* const filter = records.filter(subscription.filter);
    return subscription.state == kEnabled && filter != nullptr && filter->compiled != nullptr;
}

bool wantsAny(const Records& records) {
    return std::ranges::any_of(records.subscriptions,
                               [&](const auto& each) { return canFire(each, records); });
}

}  // namespace

Broadcast::Broadcast(DeliverySettings settings, std::string systemName, Policy policy, Clearing clearing,
                     std::shared_ptr<core::CimOperations> implementation, std::shared_ptr<EventQueue> events)
    : m_settings(std::move(settings)),
      m_systemName(std::move(systemName)),
      m_policy(std::move(policy)),
      m_clearing(std::move(clearing)),
      m_implementation(std::move(implementation)),
      m_events(std::move(events)),
      m_start(std::to_string(currentTime())),
      m_records(std::make_shared<const Records>()) {}

Broadcast::~Broadcast() = default;

std::shared_ptr<const Records> Broadcast::records() const {
    const std::lock_guard lock(m_mutex);
    return m_records;
}

void Broadcast::prepare(const Records& records) {
    if (!wantsAny(records)) return;
    if (!m_interest) {
        try {
            m_interest.emplace(kSource);
        } catch (const core::CimError& error) {
            throw core::CimError(core::CimStatus::NotSupported, error.what());
        }
    }
    if (m_delivery == nullptr) {
        auto delivery = std::make_shared<Delivery>(m_settings);
        const std::lock_guard lock(m_mutex);
        m_delivery = std::move(delivery);
    }
    if (m_thread.joinable()) return;
    m_thread = std::jthread([this](const std::stop_token& stop) { run(stop); });
}

void Broadcast::followDestinations(const Records& before, const Records& now) {
    for (const Destination& each : before.destinations) {
        if (now.destination(each.key) != nullptr) continue;
        m_delivery->remove(each.key.text());
        m_reached.erase(each.key.text());
    }
    for (const Destination& each : now.destinations) {
        // Those that were there before the first subscription, too.
        if (!m_reached.insert(each.key.text()).second) continue;
        // Listeners tell by it that numbers begin anew.
        const std::string context = "quenx-cimd#" + m_start + "#" + std::to_string(++m_contexts);
        m_delivery->add(each.key.text(), each.url, m_policy(each), context);
    }
}

void Broadcast::followSubscriptions(const Records& before, const Records& now) {
    for (const Subscription& each : before.subscriptions) {
        const Subscription* const same = now.subscription(each.filter, each.destination);
        const bool stays = same != nullptr && same->tag == each.tag && same->state == kEnabled;
        if (!stays) m_delivery->drop(each.destination.text(), each.tag);
    }
}

void Broadcast::follow(std::shared_ptr<const Records> now) {
    const std::shared_ptr<const Records> before = records();
    // Destinations come before what is sent there, and go after it.
    if (m_delivery != nullptr) followDestinations(*before, *now);
    {
        const std::lock_guard lock(m_mutex);
        m_records = now;
    }
    if (m_delivery != nullptr) followSubscriptions(*before, *now);
    if (!wantsAny(*now)) m_interest.reset();
}

std::optional<DeliveryCounters> Broadcast::counters(const DestinationKey& destination) const {
    std::shared_ptr<Delivery> delivery;
    {
        const std::lock_guard lock(m_mutex);
        delivery = m_delivery;
    }
    if (delivery == nullptr) return std::nullopt;
    return delivery->counters(destination.text());
}

std::vector<DestinationKey> Broadcast::abandoned() const {
    std::vector<DestinationKey> keys;
    if (m_settings.abandonTime.count() == 0) return keys;
    for (const Destination& each : records()->destinations) {
        if (each.persistence != kTransient) continue;
        const auto counted = counters(each.key);
        if (counted && counted->failingFor >= m_settings.abandonTime) keys.push_back(each.key);
    }
    return keys;
}

void Broadcast::run(const std::stop_token& stop) {
    constexpr std::chrono::milliseconds kLook = std::chrono::minutes(1);
    const auto none = std::chrono::milliseconds::zero();
    const auto patience = m_settings.abandonTime == none ? kLook : std::min(kLook, m_settings.abandonTime);
    while (!stop.stop_requested()) {
        try {
            const auto event = m_events->next(stop, patience);
            if (!abandoned().empty()) m_clearing();
            if (event) tell(*event);
        } catch (const std::exception& error) {
            QUENX_ERROR("An event could not be told: %s", error.what());
        }
    }
}

void Broadcast::tell(const core::InstanceEvent& event) {
    const std::shared_ptr<const Records> all = records();
    const std::string identifier = "Quenx:" + m_start + "-" + std::to_string(++m_indications);
    const Indication indication(event, identifier, m_systemName, [this](const std::string& className) {
        return m_implementation->getClass(className);
    });
    std::map<const Filter*, bool> matching;  // many may have subscribed to one filter
    for (const Subscription& subscription : all->subscriptions) {
        const Filter* const filter = all->filter(subscription.filter);
        if (!canFire(subscription, *all) || subscription.isExpired(event.time)) continue;
        const auto [known, isNew] = matching.try_emplace(filter);
        if (isNew) known->second = indication.matches(*filter->compiled);
        if (known->second) send(indication, subscription, *filter);
    }
}

void Broadcast::send(const Indication& indication, const Subscription& subscription, const Filter& filter) {
    m_delivery->send(subscription.destination.text(), subscription.tag, [&](const Sequence& sequence) {
        return cimxml::writeExport(indication.exported(*filter.compiled, filter.name, sequence),
                                   std::to_string(sequence.number));
    });
}

}  // namespace indications
