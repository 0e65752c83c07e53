#include "Framework/Retirement.h"

#include <condition_variable>
#include <exception>
#include <mutex>
#include <thread>

#include "Framework/CimInstance.h"

namespace core {

/// The queue of instances to destroy, and the one thread that destroys them. The queue is linked through the
/// instances, so that retiring never needs memory.
class Retirement {
  public:
    Retirement() = default;
    Retirement(const Retirement&) = delete;
    Retirement& operator=(const Retirement&) = delete;

    ~Retirement() {
        drain();
        {
            const std::lock_guard lock(m_mutex);
            m_ending = true;
        }
        m_changed.notify_all();
        if (m_thread.joinable()) m_thread.join();
    }

    static Retirement& theOne() {
        static Retirement retirement;
        return retirement;
    }

    static bool waits(const CimInstance* instance) { return instance->m_destructionWaits; }

    void add(CimInstance* instance) noexcept {
        {
            const std::lock_guard lock(m_mutex);
            if (startThread()) {
                append(instance);
                instance = nullptr;
            }
        }
        m_changed.notify_all();
        delete instance;
    }

    void drain() noexcept {
        std::unique_lock lock(m_mutex);
        m_changed.wait(lock, [this] { return m_first == nullptr && !m_busy; });
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
        (m_last == nullptr ? m_first : m_last->m_nextRetired) = instance;
        m_last = instance;
    }

    void run() noexcept {
        std::unique_lock lock(m_mutex);
        while (true) {
            m_changed.wait(lock, [this] { return m_first != nullptr || m_ending; });
            if (m_first == nullptr) return;
            CimInstance* instance = m_first;
            m_first = instance->m_nextRetired;
            if (m_first == nullptr) m_last = nullptr;
            m_busy = true;
            lock.unlock();
            delete instance;
            lock.lock();
            m_busy = false;
            m_changed.notify_all();
        }
    }

    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::thread m_thread;
    CimInstance* m_first = nullptr;
    CimInstance* m_last = nullptr;
    bool m_busy = false;
    bool m_ending = false;
};

void retireInstance(CimInstance* instance) noexcept {
    if (instance == nullptr) return;
    if (Retirement::waits(instance)) {
        Retirement::theOne().add(instance);
    } else {
        delete instance;
    }
}

void prepareRetirement() {
    Retirement::theOne();
}

void drainRetired() noexcept {
    Retirement::theOne().drain();
}

}  // namespace core
