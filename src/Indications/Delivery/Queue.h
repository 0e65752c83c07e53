// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <deque>
#include <functional>
#include <string>

#include "Indications/Indication.h"

namespace indications {

using Clock = std::chrono::steady_clock;

/// How deliveries are tried, and what may wait for them.
struct DeliverySettings {
    int retries = 3;  ///< tries after the first
    std::chrono::milliseconds retryPause{30'000};
    std::chrono::milliseconds connectTime{5'000};
    std::chrono::milliseconds wholeTime{10'000};    ///< of one try
    std::chrono::milliseconds farewellTime{2'000};  ///< for what is under way at the end
    std::size_t mostWaiting = 1024;                 ///< messages of one destination
    std::size_t mostBytes = 8 << 20;                ///< of them
    std::size_t mostBytesOfAll = 32 << 20;
    std::chrono::milliseconds abandonTime = std::chrono::hours(24);  ///< of a transient one; 0: never
    unsigned int perSecond = 0;  ///< messages to one address, on average; 0 sets no bound
    std::string certificates;    ///< a file of authorities beside the system's; empty for none
    bool verifies = true;        ///< false takes any certificate
};

/// What has become of a destination's messages.
struct DeliveryCounters {
    std::uint64_t delivered = 0;
    std::uint64_t givenUp = 0;   ///< refused, or not taken in all tries
    std::uint64_t overflow = 0;  ///< the oldest that had to make room
    std::size_t waiting = 0;
    bool isFailing = false;  ///< the last one was given up
    /// From the first that was given up to the last, since one was delivered.
    Clock::duration failingFor{};
};

/// One message.
struct Message {
    std::uint64_t tag = 0;  ///< of the subscription that it is for
    std::int64_t number = 0;
    std::string body;
    int tries = 0;
};

/// What became of one try.
enum class Outcome {
    Taken,
    Refused,  ///< another try would be refused as well
    Failed
};

/// The messages of one destination, in their order. The first is the one under way, or the next. For one
/// thread at a time.
class Queue {
  public:
    explicit Queue(std::string context) : m_context(std::move(context)) {}

    /// Numbers a message and puts it at the end. Makes room where there is too much, from the oldest on that
    /// is not under way.
    void add(std::uint64_t tag, const std::function<std::string(const Sequence&)>& body,
             const DeliverySettings& settings);
    /// Drops what waits with the tag. What is under way stays.
    void drop(std::uint64_t tag);

    /// What to send now; null for nothing. It is under way then, until it has ended.
    const Message* begin(Clock::time_point now);
    void end(Outcome outcome, const DeliverySettings& settings, Clock::time_point now);

    /// When to ask for the next again; nothing where there is none, or one is under way.
    std::optional<Clock::time_point> due() const;
    std::size_t bytes() const { return m_bytes; }
    /// Whether the last try was taken.
    bool isReliable() const { return m_isReliable; }
    /// Drops the oldest that is not under way; false where there is none.
    bool dropOldest();
    DeliveryCounters counters() const;

  private:
    std::deque<Message>::iterator firstWaiting();
    void erase(std::deque<Message>::iterator message);

    const std::string m_context;
    std::int64_t m_next = 0;
    std::deque<Message> m_messages;
    std::size_t m_bytes = 0;
    bool m_isUnderWay = false;
    bool m_isReliable = false;
    Clock::time_point m_notBefore{};
    Clock::time_point m_failingSince{};
    DeliveryCounters m_counters;
};

}  // namespace indications
