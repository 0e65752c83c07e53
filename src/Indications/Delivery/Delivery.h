// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "Indications/Delivery/AddressPolicy.h"
#include "Indications/Delivery/Queue.h"

namespace indications {

/// Brings messages to listeners, on one thread of its own: those of one destination in their order and one at
/// a time, those of different destinations side by side, so that a listener that is slow or gone holds up
/// nobody else's. Nothing waits for a listener but the end, and that for a moment. Thread-safe.
///
/// What a listener takes it acknowledges; what it does not take is tried again, the others of that
/// destination waiting, until it is given up. What waits is bounded: the oldest makes room, and is counted.
/// What waits at the end is lost, which the next start's context of numbers tells listeners.
class Delivery {
  public:
    using Body = std::function<std::string(const Sequence&)>;

    /// Throws utils::Exception where the system has no thread, std::bad_alloc, control::NoCurlLibrary.
    explicit Delivery(DeliverySettings settings);
    /// Ends what is under way, if it ends in time, and drops the rest.
    ~Delivery();
    Delivery(const Delivery&) = delete;
    Delivery& operator=(const Delivery&) = delete;

    /// From here on messages may go there. Its numbers begin at 0, so the context has to be a new one.
    /// @param url  as requireDestination() takes it
    void add(const std::string& destination, const std::string& url, const AddressPolicy& policy,
             const std::string& context);
    /// Drops what waits. One that is under way may still arrive.
    void remove(const std::string& destination);

    /// Has a message sent. One for a destination that is not there is dropped.
    /// @param tag   of the subscription
    /// @param body  called at once, with the number of the message. Must not call this object
    void send(const std::string& destination, std::uint64_t tag, const Body& body);
    /// Drops what waits of a subscription.
    void drop(const std::string& destination, std::uint64_t tag);

    DeliveryCounters counters(const std::string& destination) const;

  private:
    class Courier;
    std::unique_ptr<Courier> m_courier;
};

}  // namespace indications
