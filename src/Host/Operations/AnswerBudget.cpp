// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/AnswerBudget.h"

#include <malloc.h>

#include <algorithm>
#include <utility>

#include "Framework/Model/CimError.h"

namespace host {

namespace {

/// Answers up to this size are not counted: there are at most as many as connections. Larger ones are counted
/// in multiples of it, so that the budget is asked once for many values.
constexpr std::size_t kUncounted = std::size_t{64} << 10;

/// Once answers have given back so much, so does the process: the C library would keep it, once for each of
/// its arenas. While others are being written, they use it again, and only so often does it go back. So the
/// last answer of a crowd leaves less than this behind: with 32 MiB here it was 17 after four clients.
constexpr std::size_t kTrimmed = std::size_t{8} << 20;
constexpr std::chrono::seconds kBetweenTrims(1);

std::size_t countedOf(std::size_t bytes) {
    return bytes <= kUncounted ? 0 : (bytes + kUncounted - 1) / kUncounted * kUncounted;
}

}  // namespace

bool AnswerBudget::take(const std::string& user, std::size_t bytes, bool isOwed) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    std::size_t& own = m_byUser[user];
    const bool fits = isOwed || (m_taken + bytes <= m_bytes && own + bytes <= share());
    if (fits) {
        own += bytes;
        m_taken += bytes;
    } else if (own == 0) {
        m_byUser.erase(user);
    }
    return fits;
}

void AnswerBudget::giveBack(const std::string& user, std::size_t bytes) noexcept {
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        m_taken -= bytes;
        const auto own = m_byUser.find(user);
        own->second -= bytes;
        if (own->second == 0) m_byUser.erase(own);
        m_givenBack += bytes;
        const auto now = std::chrono::steady_clock::now();
        const bool isDue = m_taken == 0 || now - m_trimmed >= kBetweenTrims;
        if (m_givenBack < kTrimmed || !isDue) return;
        m_givenBack = 0;
        m_trimmed = now;
    }
    // Takes milliseconds, during which nobody should have to wait for the budget.
    ::malloc_trim(0);
}

AnswerCharge::AnswerCharge(AnswerCharge&& other) noexcept
    : m_budget(other.m_budget),
      m_user(std::move(other.m_user)),
      m_bytes(std::exchange(other.m_bytes, 0)),
      m_reserved(std::exchange(other.m_reserved, 0)),
      m_isOwed(other.m_isOwed) {}

AnswerCharge& AnswerCharge::operator=(AnswerCharge&& other) noexcept {
    // What was charged here goes with the other.
    std::swap(m_budget, other.m_budget);
    m_user.swap(other.m_user);
    std::swap(m_bytes, other.m_bytes);
    std::swap(m_reserved, other.m_reserved);
    std::swap(m_isOwed, other.m_isOwed);
    return *this;
}

AnswerCharge::~AnswerCharge() {
    if (m_reserved != 0) m_budget->giveBack(m_user, m_reserved);
}

bool AnswerCharge::reserve() {
    const std::size_t counted = countedOf(m_bytes);
    if (counted > m_reserved && !m_budget->take(m_user, counted - m_reserved, m_isOwed)) return false;
    if (counted < m_reserved) m_budget->giveBack(m_user, m_reserved - counted);
    m_reserved = counted;
    return true;
}

void AnswerCharge::add(std::size_t bytes) {
    m_bytes += bytes;
    if (countedOf(m_bytes) <= m_reserved || reserve()) return;
    if (countedOf(m_bytes) <= m_budget->share()) throw OverBudget();
    throw core::CimError(core::CimStatus::ServerLimitsExceeded,
                         "the answer is larger than limits.answer_bytes of the server allows; ask for fewer "
                         "properties, or for a class with fewer instances");
}

void AnswerCharge::set(std::size_t bytes) {
    m_bytes = bytes;
    if (!reserve()) throw OverBudget();
}

void AnswerCharge::cover(std::size_t bytes) {
    if (bytes > m_bytes) set(bytes);
}

void AnswerCharge::moveTo(AnswerCharge& other, std::size_t bytes) {
    m_bytes -= std::min(m_bytes, bytes);
    other.m_bytes += bytes;
    const std::size_t kept = std::min(m_reserved, countedOf(m_bytes));
    other.m_reserved += m_reserved - kept;
    m_reserved = kept;
}

AnswerCharge AnswerCharge::split(std::size_t bytes) {
    AnswerCharge part(*m_budget, m_user);
    moveTo(part, bytes);
    return part;
}

}  // namespace host
