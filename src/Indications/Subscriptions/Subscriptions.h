// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "Framework/Requests/CimOperations.h"
#include "Indications/Subscriptions/Broadcast.h"
#include "Indications/Subscriptions/StateFile.h"

namespace indications {

struct EventSources;

/// To which machines indications may go.
struct DestinationRule {
    enum class Kind { Subscriber, Listed, Any };

    Kind kind = Kind::Subscriber;
    std::vector<Network> networks;  ///< if listed
};

struct SubscriptionSettings {
    DeliverySettings delivery;
    DestinationRule destinations;
    std::shared_ptr<const OwnPorts> ownPorts;  ///< null for none
    std::string file;                          ///< see StateFile
    std::size_t most = 100;                    ///< destinations, and subscriptions; filters twice as many
};

/// What clients of the interop namespace make in order to be told of events: filters, destinations, and
/// subscriptions of the one to the other. Each change is kept before it is answered. Instances are those of
/// subscriptionClasses(), their paths without a namespace.
///
/// Who may do what has been asked before. Thread-safe.
class Subscriptions {
  public:
    /// @param namespaces  all that are served, that of the events first, behind it the names of the interop
    ///                    namespace
    /// @param events      which the providers tell
    Subscriptions(SubscriptionSettings settings, std::vector<std::string> namespaces, std::string systemName,
                  std::shared_ptr<core::CimOperations> implementation, std::shared_ptr<EventQueue> events);
    Subscriptions(const Subscriptions&) = delete;
    Subscriptions& operator=(const Subscriptions&) = delete;

    /// Goes on with what has been kept. To be called once, when the providers are there and before the first
    /// request; what is wrong is logged.
    void resume();

    /// Whether instances of the class can be made, of ours only.
    static bool serves(std::string_view className);

    std::vector<core::InstanceValue> instances() const;
    /// CimError (not found) where there is none. A path may name the system as it likes.
    core::InstanceValue get(const core::CimPath& path) const;
    /// Subscriptions that refer to a filter or destination.
    std::vector<core::InstanceValue> referring(const core::CimPath& path) const;

    /// CimError for what cannot be: already exists, not found for a filter or destination that is not there,
    /// server limits exceeded, failed where it cannot be kept; and those of the checks of Requests.h.
    core::CimPath create(const core::InstanceValue& instance);
    /// Subscriptions only; not supported for others.
    void modify(const core::InstanceValue& instance, const core::PropertyFilter& properties);
    /// Failed for what a subscription refers to, access denied for the server's own filters.
    void remove(const core::CimPath& path);

  private:
    // Under m_changes.
    core::CimPath createFilter(Records& records, const core::InstanceValue& instance);
    core::CimPath createDestination(Records& records, const core::InstanceValue& instance);
    core::CimPath createSubscription(Records& records, const core::InstanceValue& instance);
    Records changeable() const;
    void clear() noexcept;
    void publish(Records records);
    /// Whether all of them were accepted.
    bool accept(Records& all, Records kept);

    const Filter* findFilter(const Records& records, const core::CimPath& path) const;
    const Destination* findDestination(const Records& records, const core::CimPath& path) const;
    const Subscription* findSubscription(const Records& records, const core::CimPath& path) const;
    std::string nameIn(const core::CimPath& path) const;
    bool isHere(const core::CimPath& path) const;

    std::shared_ptr<const Records> records() const;
    core::InstanceValue shown(const Subscription& subscription, const Records& records) const;
    EventSources sources() const;
    AddressPolicy policyFor(const Destination& destination) const;

    const SubscriptionSettings m_settings;
    const std::vector<std::string> m_namespaces;
    const std::string m_systemName;
    const std::shared_ptr<core::CimOperations> m_implementation;
    std::mutex m_changes;  ///< for one change at a time, writing included; outside the others
    StateFile m_file;
    std::uint64_t m_tags = 0;
    mutable std::mutex m_mutex;  ///< held for moments
    std::shared_ptr<const Records> m_records;
    Broadcast m_broadcast;  // last: its thread ends first
};

}  // namespace indications
