// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <condition_variable>
#include <map>
#include <mutex>
#include <stop_token>
#include <string>

namespace host {

/// How many requests of each user are carried out at a time. A user's further ones wait, and only those: one
/// user must not take the workers of all. Thread-safe.
class UserSlots {
  public:
    explicit UserSlots(unsigned int perUser) : m_perUser(perUser) {}

  private:
    friend class HeldUserSlot;
    const unsigned int m_perUser;
    std::mutex m_mutex;
    std::condition_variable_any m_released;
    std::map<std::string, unsigned int> m_held;
};

/// One of the user's slots, held for the scope; false when none came free in time, or the wait was stopped.
class HeldUserSlot {
  public:
    HeldUserSlot(UserSlots& slots, std::string user, std::chrono::milliseconds patience,
                 const std::stop_token& stop = {})
        : m_slots(slots), m_user(std::move(user)) {
        std::unique_lock lock(m_slots.m_mutex);
        const auto isFree = [this] { return m_slots.m_held[m_user] < m_slots.m_perUser; };
        m_isHeld = m_slots.m_released.wait_for(lock, stop, patience, isFree);
        if (m_isHeld) ++m_slots.m_held[m_user];
    }
    ~HeldUserSlot() {
        if (!m_isHeld) return;
        const std::lock_guard lock(m_slots.m_mutex);
        const auto own = m_slots.m_held.find(m_user);
        if (--own->second == 0) m_slots.m_held.erase(own);
        m_slots.m_released.notify_all();
    }
    HeldUserSlot(const HeldUserSlot&) = delete;
    HeldUserSlot& operator=(const HeldUserSlot&) = delete;

    explicit operator bool() const { return m_isHeld; }

  private:
    UserSlots& m_slots;
    const std::string m_user;
    bool m_isHeld = false;
};

}  // namespace host
