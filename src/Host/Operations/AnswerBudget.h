// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstddef>
#include <map>
#include <new>
#include <string>

#include "Framework/Requests/AnswerMeter.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Os/Linux/Thread.h"

namespace host {

/// There is no room for an answer now, but there will be. Passes through the request layer.
class OverBudget : public std::bad_alloc {
  public:
    const char* what() const noexcept override { return "too many large answers are in hand"; }
};

/// The memory that large answers may take together, from their first value until the client has read them:
/// slow readers and enumerations that nobody reads on must not use it up. One user gets at most three
/// quarters of it, and small answers count nothing, so others are always answered. Thread-safe.
class AnswerBudget {
  public:
    explicit AnswerBudget(std::size_t bytes) : m_bytes(bytes) {}
    AnswerBudget(const AnswerBudget&) = delete;
    AnswerBudget& operator=(const AnswerBudget&) = delete;

    /// The most that one user gets.
    std::size_t share() const { return m_bytes / 4 * 3; }

  private:
    friend class AnswerCharge;
    bool take(const std::string& user, std::size_t bytes, bool isOwed);
    void giveBack(const std::string& user, std::size_t bytes) noexcept;

    const std::size_t m_bytes;
    utils::Mutex m_mutex;
    std::size_t m_taken QUENX_GUARDED_BY(m_mutex) = 0;
    std::map<std::string, std::size_t> m_byUser QUENX_GUARDED_BY(m_mutex);
    std::size_t m_givenBack QUENX_GUARDED_BY(m_mutex) = 0;  ///< since the system got memory back
    std::chrono::steady_clock::time_point m_trimmed QUENX_GUARDED_BY(m_mutex) = {};  ///< when it did
};

/// What one answer takes of the budget, which must outlive it. Gives it back at its end, so what it counts
/// has to go before it. Used by one thread at a time.
class AnswerCharge {
  public:
    AnswerCharge(AnswerBudget& budget, std::string user) : m_budget(&budget), m_user(std::move(user)) {}
    AnswerCharge(AnswerCharge&& other) noexcept;
    AnswerCharge& operator=(AnswerCharge&& other) noexcept;
    ~AnswerCharge();

    /// More of the answer has been built. Throws OverBudget; or CimError (server limits exceeded) for an
    /// answer that the budget could never hold.
    void add(std::size_t bytes);
    /// What the answer takes now. Throws OverBudget.
    void set(std::size_t bytes);
    /// The same, where it is more than what is charged already.
    void cover(std::size_t bytes);
    /// From now on the answer is given whatever it takes: it holds what no other answer can.
    void owe() { m_isOwed = true; }
    /// So much of the answer is another answer of the same user from now on.
    void moveTo(AnswerCharge& other, std::size_t bytes);
    AnswerCharge split(std::size_t bytes);

  private:
    bool reserve();

    AnswerBudget* m_budget;
    std::string m_user;
    std::size_t m_bytes = 0;
    std::size_t m_reserved = 0;
    bool m_isOwed = false;
};

/// Charges what the requests of this thread build.
class ChargingMeter : public core::AnswerMeter {
  public:
    explicit ChargingMeter(AnswerCharge& charge) : m_charge(charge) {}
    void add(std::size_t bytes) override { m_charge.add(bytes); }

  private:
    AnswerCharge& m_charge;
    const Scope m_scope{*this};
};

}  // namespace host
