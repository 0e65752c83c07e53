// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/InstanceLifetime.h"

#include <condition_variable>
#include <cstdint>
#include <exception>
#include <mutex>
#include <thread>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Model/CimInstance.h"

namespace core {

namespace {

thread_local RequestScope* currentScope = nullptr;

}  // namespace

RequestScope::RequestScope() : m_outermost(currentScope == nullptr) {
    if (m_outermost) currentScope = this;
}

RequestScope::~RequestScope() {
    if (!m_outermost) return;
    currentScope = nullptr;
    // Instances go before their agents may.
    m_held.clear();
    m_agents.clear();
}

RequestScope* RequestScope::current() {
    return currentScope;
}

void RequestScope::hold(std::shared_ptr<const void> object) {
    // The same snapshot is often taken several times in a row.
    if (!m_held.empty() && m_held.back() == object) return;
    m_held.push_back(std::move(object));
}

void RequestScope::hold(const std::shared_ptr<AgentRegistration>& registration) {
    // A request looks at the agents many times; a process has two or three of them.
    for (const AgentUse& use : m_agents) {
        if (use.uses(registration)) return;
    }
    m_agents.emplace_back(registration);
}

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

    /// Destroyed at the end of the process, after whatever was built after prepareReaper().
    static InstanceReaper& theOne() {
        static InstanceReaper reaper;
        return reaper;
    }

    /// A thread that was refused is asked for again: the daemon calls this until everything is destroyed.
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
        // Without a thread the caller does the work, since it must not go on before it is done.
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
            // The destructor waits, for a flash, say; and it may release instances that end up here.
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

void InstanceRelease::operator()(CimInstance* instance) const noexcept {
    if (instance != nullptr && instance->m_destructionWaits) {
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
