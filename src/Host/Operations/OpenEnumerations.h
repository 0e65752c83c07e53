// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <map>
#include <string>

#include "CimXml/Response.h"
#include "Host/Operations/AnswerBudget.h"
#include "Host/Settings.h"
#include "Utils/Os/Linux/Mutex.h"

namespace host {

/// Who may pull on an enumeration.
struct EnumerationOwner {
    std::string namespaceName;  ///< folded
    std::string user;

    bool operator==(const EnumerationOwner&) const = default;
};

/// The enumerations that clients have opened and not yet read to the end. They hold values, so if an instance
/// is deleted meanwhile, it is still read. Thread-safe. All errors are CimError.
class OpenEnumerations {
  public:
    using Clock = std::chrono::steady_clock;

    explicit OpenEnumerations(const PullLimits& limits) : m_limits(limits) {}

    /// The first `count` objects of the result, with the outputs EndOfSequence and EnumerationContext. What
    /// is left is kept. Server limits exceeded when too many are open, in all or by this user; invalid
    /// operation timeout for one out of range.
    /// @param charge  of the answer, here and below: what is kept is the enumeration's part of it
    cimxml::IntrinsicResult open(const EnumerationOwner& owner, cimxml::IntrinsicResult result,
                                 std::size_t count, std::optional<std::uint32_t> timeoutSeconds,
                                 AnswerCharge& charge);
    /// The next ones. Invalid enumeration context for one that is unknown, ended, timed out, of another kind,
    /// or somebody else's.
    cimxml::IntrinsicResult pull(const EnumerationOwner& owner, cimxml::ResultKind kind,
                                 const std::string& context, std::size_t count, AnswerCharge& charge);
    /// Lets go of an enumeration, of whichever kind.
    void close(const EnumerationOwner& owner, const std::string& context);
    /// Lets go of those that have timed out, as the others do by the way.
    void dropExpired();

  private:
    struct Entry {
        EnumerationOwner owner;
        AnswerCharge charge;
        cimxml::IntrinsicResult rest;  ///< in the reverse order, so that the next ones are at the end
        std::chrono::seconds timeout{0};
        Clock::time_point expires;
    };
    using Entries = std::map<std::string, Entry>;

    std::chrono::seconds checkedTimeout(std::optional<std::uint32_t> seconds) const;
    void dropExpiredLocked() QUENX_REQUIRES(m_mutex);
    void requireRoomFor(const EnumerationOwner& owner) QUENX_REQUIRES(m_mutex);
    Entries::iterator find(const EnumerationOwner& owner, const std::string& context) QUENX_REQUIRES(m_mutex);

    const PullLimits m_limits;
    utils::Mutex m_mutex;
    Entries m_entries QUENX_GUARDED_BY(m_mutex);
};

}  // namespace host
