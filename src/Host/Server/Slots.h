#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>

namespace host {

/// A number of places that threads take turns in.
class Slots {
  public:
    explicit Slots(unsigned int count) : m_free(count) {}
    Slots(const Slots&) = delete;
    Slots& operator=(const Slots&) = delete;

    /// A place for the scope; false when none came free in time.
    class Use {
      public:
        Use(Slots& slots, std::chrono::milliseconds patience) : m_slots(slots) {
            std::unique_lock lock(m_slots.m_mutex);
            m_taken = m_slots.m_changed.wait_for(lock, patience, [&] { return m_slots.m_free > 0; });
            if (m_taken) --m_slots.m_free;
        }
        ~Use() {
            if (!m_taken) return;
            const std::lock_guard lock(m_slots.m_mutex);
            ++m_slots.m_free;
            m_slots.m_changed.notify_one();
        }
        Use(const Use&) = delete;
        Use& operator=(const Use&) = delete;

        explicit operator bool() const { return m_taken; }

      private:
        Slots& m_slots;
        bool m_taken = false;
    };

  private:
    std::mutex m_mutex;
    std::condition_variable m_changed;
    unsigned int m_free;
};

/// Sleep that can be ended for good.
class StopSignal {
  public:
    /// False when stop() was called before the time came.
    bool sleepUntil(std::chrono::steady_clock::time_point time) {
        std::unique_lock lock(m_mutex);
        return !m_changed.wait_until(lock, time, [&] { return m_stopped; });
    }
    void stop() {
        const std::lock_guard lock(m_mutex);
        m_stopped = true;
        m_changed.notify_all();
    }

  private:
    std::mutex m_mutex;
    std::condition_variable m_changed;
    bool m_stopped = false;
};

}  // namespace host
