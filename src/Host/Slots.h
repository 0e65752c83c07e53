// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <semaphore>

namespace host {

/// A number of places that threads take turns in.
using Slots = std::counting_semaphore<>;

/// One of the places, held for the scope; false when none came free in time.
class SlotUse {
  public:
    SlotUse(Slots& slots, std::chrono::milliseconds patience)
        : m_slots(slots), m_isTaken(slots.try_acquire_for(patience)) {}
    ~SlotUse() {
        if (m_isTaken) m_slots.release();
    }
    SlotUse(const SlotUse&) = delete;
    SlotUse& operator=(const SlotUse&) = delete;

    explicit operator bool() const { return m_isTaken; }

  private:
    Slots& m_slots;
    const bool m_isTaken;
};

}  // namespace host
