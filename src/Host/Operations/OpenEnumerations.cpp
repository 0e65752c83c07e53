// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/OpenEnumerations.h"

#include <sys/random.h>

#include <algorithm>
#include <array>

#include "Framework/Model/CimError.h"
#include "Utils/Utils.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using core::CimError;
using core::CimStatus;
using core::CimType;
using core::CimValue;

[[noreturn]] void refuseContext() {
    throw CimError(CimStatus::InvalidEnumerationContext, "no enumeration of that context is open");
}

/// A name that nobody can guess: if a client of the same user knew it, it could read the rest.
std::string newContext() {
    std::array<unsigned char, 16> bytes{};
    if (::getrandom(bytes.data(), bytes.size(), 0) != static_cast<ssize_t>(bytes.size())) {
        throw CimError(CimStatus::Failed, "no random numbers for an enumeration context");
    }
    std::string text;
    for (const unsigned char byte : bytes)
        text += utils::hexByte(byte);
    return text;
}

template <class T>
void takeLast(std::vector<T>& from, std::vector<T>& to, std::size_t count) {
    for (std::size_t i = std::min(count, from.size()); i > 0; --i) {
        to.push_back(std::move(from.back()));
        from.pop_back();
    }
}

/// The next objects of what is left; the outputs are still missing.
IntrinsicResult takeNext(IntrinsicResult& rest, std::size_t count) {
    IntrinsicResult part{.kind = rest.kind, .origins = rest.origins};
    takeLast(rest.instances, part.instances, count);
    takeLast(rest.paths, part.paths, count);
    return part;
}

bool isEmpty(const IntrinsicResult& rest) {
    return rest.instances.empty() && rest.paths.empty();
}

void addOutputs(IntrinsicResult& part, bool ended, const std::string& context) {
    part.outputs.push_back({"EndOfSequence", CimValue::of(CimType::Boolean, ended)});
    part.outputs.push_back({"EnumerationContext", CimValue::of(CimType::String, context)});
}

}  // namespace

std::chrono::seconds OpenEnumerations::checkedTimeout(std::optional<std::uint32_t> seconds) const {
    if (!seconds) return m_limits.timeout;
    const std::chrono::seconds wanted(*seconds);
    if (wanted.count() == 0 || wanted > m_limits.maxTimeout) {
        throw CimError(CimStatus::InvalidOperationTimeout,
                       "OperationTimeout must be from 1 to " + std::to_string(m_limits.maxTimeout.count()));
    }
    return wanted;
}

void OpenEnumerations::dropExpired() {
    const utils::Mutex::AutoLocker lock(m_mutex);
    dropExpiredLocked();
}

void OpenEnumerations::dropExpiredLocked() {
    // Whenever somebody comes by: with a limit on their number, expired ones need no thread that removes
    // them.
    std::erase_if(m_entries, [now = Clock::now()](const auto& each) { return each.second.expires <= now; });
}

OpenEnumerations::Entries::iterator OpenEnumerations::find(const EnumerationOwner& owner,
                                                           const std::string& context) {
    dropExpiredLocked();
    const auto found = m_entries.find(context);
    // Somebody else's context is answered as an unknown one, which tells nothing.
    if (found == m_entries.end() || found->second.owner != owner) refuseContext();
    return found;
}

void OpenEnumerations::requireRoomFor(const EnumerationOwner& owner) {
    dropExpiredLocked();
    const auto own = std::count_if(m_entries.begin(), m_entries.end(),
                                   [&](const auto& each) { return each.second.owner.user == owner.user; });
    if (static_cast<std::size_t>(own) >= m_limits.openPerUser) {
        throw CimError(CimStatus::ServerLimitsExceeded,
                       "user " + owner.user + " has too many enumerations open");
    }
    if (m_entries.size() >= m_limits.open)
        throw CimError(CimStatus::ServerLimitsExceeded, "too many enumerations are open");
}

IntrinsicResult OpenEnumerations::open(const EnumerationOwner& owner, IntrinsicResult result,
                                       std::size_t count, std::optional<std::uint32_t> timeoutSeconds,
                                       AnswerCharge& charge) {
    const std::chrono::seconds timeout = checkedTimeout(timeoutSeconds);
    // The rest is kept in the reverse order and taken from its end, so that each pull costs what it delivers
    // and frees it.
    std::reverse(result.instances.begin(), result.instances.end());
    std::reverse(result.paths.begin(), result.paths.end());
    IntrinsicResult part = takeNext(result, count);
    if (isEmpty(result)) {
        addOutputs(part, true, "");
        return part;
    }
    // A result that fits into the first answer is never kept, and counts against no limit.
    const std::string context = newContext();
    const utils::Mutex::AutoLocker lock(m_mutex);
    // Checked last: only a result that is kept takes memory that needs a bound.
    requireRoomFor(owner);
    AnswerCharge kept = charge.split(bytesOf(result));
    m_entries.emplace(context,
                      Entry{owner, std::move(kept), std::move(result), timeout, Clock::now() + timeout});
    // Refused now, the client would never learn the name of what is open.
    charge.owe();
    addOutputs(part, false, context);
    return part;
}

IntrinsicResult OpenEnumerations::pull(const EnumerationOwner& owner, cimxml::ResultKind kind,
                                       const std::string& context, std::size_t count, AnswerCharge& charge) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    const auto found = find(owner, context);
    if (found->second.rest.kind != kind) refuseContext();
    IntrinsicResult part = takeNext(found->second.rest, count);
    found->second.charge.moveTo(charge, bytesOf(part));
    // Refused now, these objects would be in no answer: whoever asks again gets the next ones.
    if (!isEmpty(part)) charge.owe();
    const bool ended = isEmpty(found->second.rest);
    addOutputs(part, ended, ended ? "" : context);
    if (ended) {
        m_entries.erase(found);
    } else {
        // The time counts anew with each pull: a client that goes on reading is never cut off.
        found->second.expires = Clock::now() + found->second.timeout;
    }
    return part;
}

void OpenEnumerations::close(const EnumerationOwner& owner, const std::string& context) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_entries.erase(find(owner, context));
}

}  // namespace host
