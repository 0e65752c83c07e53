// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "Framework/Events/EventInterest.h"
#include "Framework/Requests/CimOperations.h"
#include "Indications/Delivery/Delivery.h"
#include "Indications/Subscriptions/EventQueue.h"
#include "Indications/Subscriptions/Records.h"

namespace indications {

class Indication;

/// Tells those who have subscribed of the events of this process: matches each event with the subscriptions,
/// on a thread of its own, and hands what comes of it to the delivery. Neither is there before the first
/// subscription; events are made only while there is one. Thread-safe, but for prepare() and follow(), which
/// are called by one thread at a time.
class Broadcast {
  public:
    /// To where messages for a destination may go.
    using Policy = std::function<AddressPolicy(const Destination&)>;
    /// Called by the thread when a destination has been abandoned, at most a minute later.
    using Clearing = std::function<void()>;

    /// @param implementation  knows the classes of instances; used until the end
    Broadcast(DeliverySettings settings, std::string systemName, Policy policy, Clearing clearing,
              std::shared_ptr<core::CimOperations> implementation, std::shared_ptr<EventQueue> events);
    /// Ends what is under way, if it ends in time. The providers must still be there.
    ~Broadcast();
    Broadcast(const Broadcast&) = delete;
    Broadcast& operator=(const Broadcast&) = delete;

    /// Has events made, if these records want any. CimError (not supported) where nobody makes them,
    /// utils::Exception where the system has no thread.
    void prepare(const Records& records);
    /// Goes by these records from here on, which have been prepared for.
    void follow(std::shared_ptr<const Records> records);

    /// What became of a destination's messages; nothing where none has been subscribed to.
    std::optional<DeliveryCounters> counters(const DestinationKey& destination) const;
    /// Transient destinations that have taken nothing for so long that nobody can be there any more.
    std::vector<DestinationKey> abandoned() const;

  private:
    void run(const std::stop_token& stop);
    void tell(const core::InstanceEvent& event);
    void send(const Indication& indication, const Subscription& subscription, const Filter& filter);
    void followDestinations(const Records& before, const Records& now);
    void followSubscriptions(const Records& before, const Records& now);
    std::shared_ptr<const Records> records() const;

    const DeliverySettings m_settings;
    const std::string m_systemName;
    const Policy m_policy;
    const Clearing m_clearing;
    const std::shared_ptr<core::CimOperations> m_implementation;
    const std::shared_ptr<EventQueue> m_events;
    const std::string m_start;        ///< of this one, unique over restarts
    std::set<std::string> m_reached;  ///< destinations that the delivery knows
    std::uint64_t m_contexts = 0;
    std::uint64_t m_indications = 0;  ///< the thread's own

    mutable std::mutex m_mutex;  ///< held for moments
    std::shared_ptr<const Records> m_records;
    std::shared_ptr<Delivery> m_delivery;  ///< null before the first subscription
    std::optional<core::EventInterest> m_interest;
    std::jthread m_thread;  // last: it uses the others
};

}  // namespace indications
