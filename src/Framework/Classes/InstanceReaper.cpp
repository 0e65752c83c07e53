// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/InstanceReaper.h"

#include <condition_variable>
#include <cstdint>
#include <exception>
#include <mutex>
#include <thread>

#include "Framework/Model/CimInstance.h"

namespace core {

/// The queue of instances to destroy, and the one thread that destroys them. The queue is linked through the
/// instances, so that queueing one never needs memory.
class InstanceReaper {
  public:
    InstanceReaper() = default;
    InstanceReaper(const InstanceReaper&) = delete;
    InstanceReaper& operator=(const InstanceReaper&) = delete;

    ~InstanceReaper() {
        drain();
        {
            const std::lock_guard lock(m_mutex);
            m_ending = true;
        }
        m_changed.notify_all();
        if (m_thread.joinable()) m_thread.join();
    }

    static InstanceReaper& theOne() {
        static InstanceReaper reaper;
        return reaper;
    }

    static bool waits(const CimInstance* instance) { return instance->m_destructionWaits; }

    bool isWorking() noexcept {
        const std::lock_guard lock(m_mutex);
        return (m_first != nullptr && startThread()) || m_busy;
    }

    void add(CimInstance* instance) noexcept {
        {
            const std::lock_guard lock(m_mutex);
            append(instance);
            startThread();
        }
        m_changed.notify_all();
    }

    void drain() noexcept {
        std::unique_lock lock(m_mutex);
        if (m_first != nullptr && !startThread()) destroyQueued(lock);
        m_changed.wait(lock, [this] { return m_first == nullptr && m_busy == 0; });
    }

  private:
    /// Under the lock. False when the system refuses a thread.
    bool startThread() noexcept {
        if (m_thread.joinable()) return true;
        try {
            m_thread = std::thread([this] { run(); });
            return true;
        } catch (const std::exception&) {
            return false;
        }
    }

    /// Under the lock.
    void append(CimInstance* instance) noexcept {
        (m_last == nullptr ? m_first : m_last->m_nextToDestroy) = instance;
        m_last = instance;
    }

    void run() noexcept {
        std::unique_lock lock(m_mutex);
        while (!m_ending) {
            m_changed.wait(lock, [this] { return m_first != nullptr || m_ending; });
            destroyQueued(lock);
        }
    }

    /// Under the lock, which it gives up while a destructor runs.
    void destroyQueued(std::unique_lock<std::mutex>& lock) noexcept {
        while (m_first != nullptr) {
            CimInstance* instance = m_first;
            m_first = instance->m_nextToDestroy;
            if (m_first == nullptr) m_last = nullptr;
            ++m_busy;
            lock.unlock();
            delete instance;
            lock.lock();
            --m_busy;
            m_changed.notify_all();
        }
    }

    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::thread m_thread;
    CimInstance* m_first = nullptr;
    CimInstance* m_last = nullptr;
    std::uint32_t m_busy = 0;  ///< how many are being destroyed
    bool m_ending = false;
};

void destroyInstance(CimInstance* instance) noexcept {
    if (instance == nullptr) return;
    if (InstanceReaper::waits(instance)) {
        InstanceReaper::theOne().add(instance);
    } else {
        delete instance;
    }
}

void prepareReaper() {
    InstanceReaper::theOne();
}

void drainReaper() noexcept {
    InstanceReaper::theOne().drain();
}

bool isReaperBusy() noexcept {
    return InstanceReaper::theOne().isWorking();
}

}  // namespace core
