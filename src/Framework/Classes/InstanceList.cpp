// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/InstanceList.h"

#include <pthread.h>

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <mutex>

#include "Framework/Classes/KeyIndex.h"
#include "Framework/Classes/RequestScope.h"
#include "Framework/Model/CimInstance.h"
#include "Utils/Os/Linux/SignalsBlocked.h"
#include "Utils/Os/Linux/Thread.h"
#include "Utils/Os/Linux/linux.h"

namespace core {

namespace {

/// Walks a snapshot and keeps it. Instances deleted since it was taken are passed over.
class SnapshotIterator : public InstanceList::IteratorImplementation {
  public:
    explicit SnapshotIterator(std::shared_ptr<const InstanceList::Snapshot> snapshot)
        : m_snapshot(std::move(snapshot)) {}

    CimInstance* next() override {
        while (m_position < m_snapshot->size()) {
            CimInstance* instance = (*m_snapshot)[m_position++].get();
            if (!instance->isDeleted()) return instance;
        }
        return nullptr;
    }

    CimInstance* first() override {
        m_position = 0;
        return next();
    }

    std::size_t size() override { return m_snapshot->size(); }

    std::unique_ptr<IteratorImplementation> clone() override {
        return std::make_unique<SnapshotIterator>(m_snapshot);
    }

  private:
    std::shared_ptr<const InstanceList::Snapshot> m_snapshot;
    std::size_t m_position = 0;
};

void holdInScope(std::shared_ptr<const void> object) {
    if (RequestScope* scope = RequestScope::current()) scope->hold(std::move(object));
}

}  // namespace

/// The queue of instances to destroy, and the one thread that destroys them, which ends when the queue is
/// empty: a process whose main thread has left ends with its last thread. The queue is linked through the
/// instances, so that queueing one never needs memory.
class InstanceReaper {
  public:
    InstanceReaper() = default;
    InstanceReaper(const InstanceReaper&) = delete;
    InstanceReaper& operator=(const InstanceReaper&) = delete;

    ~InstanceReaper() {
        banThreads();
        drain();
        std::unique_lock lock(m_mutex);
        m_changed.wait(lock, [this] { return !m_isRunning; });
        forgetThread();
    }

    /// Destroyed at the end of the process, after whatever was built after prepareReaper(). Not in a child of
    /// the process that has used it: a thread that is not there would still be waited for.
    static InstanceReaper& theOne() {
        struct Keeper {
            Keeper() = default;
            Keeper(const Keeper&) = delete;
            Keeper& operator=(const Keeper&) = delete;
            ~Keeper() {
                if (reaper->isOfThisProcess()) delete reaper;
            }
            InstanceReaper* const reaper = new InstanceReaper;
        };
        static const Keeper keeper;
        return *keeper.reaper;
    }

    /// The deleter of listed instances, for one that nobody holds any more. Never fails and never waits.
    static void release(CimInstance* instance) noexcept {
        if (instance != nullptr && instance->m_destructionWaits) {
            theOne().add(instance);
        } else {
            delete instance;
        }
    }

    /// A thread that was refused is asked for again: the daemon calls this until everything is destroyed.
    bool isWorking() noexcept {
        const std::lock_guard lock(m_mutex);
        return (m_first != nullptr && startThread()) || m_busy;
    }

    void add(CimInstance* instance) noexcept {
        const std::lock_guard lock(m_mutex);
        instance->m_releaseTime = os::getMonotonicuSeconds();
        (m_last == nullptr ? m_first : m_last->m_nextToDestroy) = instance;
        m_last = instance;
        startThread();
    }

    void banThreads() noexcept {
        const std::lock_guard lock(m_mutex);
        ++m_bans;
    }
    void allowThreads() noexcept {
        const std::lock_guard lock(m_mutex);
        if (--m_bans == 0 && m_first != nullptr) startThread();
    }

    /// To be called while threads are banned.
    void drain() noexcept {
        const utils::Thread::Waiting waiting;
        std::unique_lock lock(m_mutex);
        if (!isOfThisProcess() && m_first == nullptr) return;
        while (m_first != nullptr || m_busy != 0) {
            // No thread starts now. Without one the caller does the work, since it must not go on before it
            // is done.
            if (m_first != nullptr && !hasThread()) {
                destroyQueued(lock);
            } else {
                m_changed.wait(lock);
            }
        }
    }

  private:
    bool isOfThisProcess() const { return m_forks == os::forkCount(); }

    /// Under the lock.
    bool hasThread() noexcept {
        if (!isOfThisProcess()) {
            // The parent's thread is not here, whatever it was doing.
            m_forks = os::forkCount();
            m_isRunning = m_isJoinable = false;
            m_busy = 0;
        }
        return m_isRunning;
    }

    /// Under the lock. False when the system refuses a thread, or one is not wanted.
    bool startThread() noexcept {
        if (hasThread()) return true;
        if (m_bans != 0) return false;
        forgetThread();
        const utils::SignalsBlocked blocked;
        m_isRunning = pthread_create(&m_thread, nullptr, &InstanceReaper::run, this) == 0;
        m_isJoinable = m_isRunning;
        return m_isRunning;
    }

    /// Under the lock, which a thread that has ended does not take any more.
    void forgetThread() noexcept {
        if (!m_isJoinable) return;
        m_isJoinable = false;
        if (!isOfThisProcess()) return;
        // The last thread of a process runs its end, and may be the one that destroyed.
        if (pthread_equal(m_thread, pthread_self()) != 0) {
            pthread_detach(m_thread);
        } else {
            pthread_join(m_thread, nullptr);
        }
    }

    static void* run(void* argument) noexcept {
        auto& reaper = *static_cast<InstanceReaper*>(argument);
        std::unique_lock lock(reaper.m_mutex);
        reaper.destroyQueued(lock);
        reaper.m_isRunning = false;
        reaper.m_changed.notify_all();
        return nullptr;
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
    pthread_t m_thread{};
    bool m_isRunning = false;
    bool m_isJoinable = false;
    unsigned int m_forks = os::forkCount();  ///< where the thread runs
    CimInstance* m_first = nullptr;
    CimInstance* m_last = nullptr;
    std::uint32_t m_busy = 0;  ///< how many are being destroyed
    std::uint32_t m_bans = 0;  ///< how many want no thread
};

/// A list and its instances end in any order: an instance that a request still holds outlives its list, and
/// may be marked as deleted after that. So both look at each other through this.
class InstanceList::Link : public InstanceListLink {
  public:
    explicit Link(InstanceList* list) : m_list(list) {}

    void remove(const CimInstance* instance) override {
        const utils::Mutex::AutoLocker lock(m_mutex);
        if (m_list != nullptr) m_list->remove(instance);
    }
    // Counted only: it is called under the instance's lock, where no other may be taken.
    void keyChanged() noexcept override { m_keyChanges.fetch_add(1, std::memory_order_acq_rel); }
    std::uint32_t keyChanges() const noexcept { return m_keyChanges.load(std::memory_order_acquire); }
    /// The list is about to go.
    void close() {
        const utils::Mutex::AutoLocker lock(m_mutex);
        m_list = nullptr;
    }

  private:
    utils::Mutex m_mutex;
    InstanceList* m_list QUENX_GUARDED_BY(m_mutex);
    std::atomic<std::uint32_t> m_keyChanges{0};
};

InstanceList::InstanceList() : m_link(std::make_shared<Link>(this)) {
    setElementOwner(this);
}

InstanceList::~InstanceList() {
    // First, so that no instance reaches a list that is half gone.
    m_link->close();
    InstanceList::clear();
    setElementOwner(nullptr);
}

InstanceList::Iterator InstanceList::getElements() {
    return getElements(false);
}

InstanceList::Iterator InstanceList::getElements(bool) {
    auto taken = snapshot();
    holdInScope(taken);
    return Iterator(std::make_unique<SnapshotIterator>(std::move(taken)));
}

InstanceList::SharedSnapshot InstanceList::snapshot() {
    const utils::Mutex::AutoLocker lock(getMutex());
    if (m_cache.snapshot == nullptr) m_cache.snapshot = std::make_shared<const Snapshot>(m_held);
    return m_cache.snapshot;
}

InstanceList::Cache InstanceList::indexed() {
    // Asked first: a key that changes while the index is made makes it old at once.
    const std::uint32_t keyChanges = m_link->keyChanges();
    const SharedSnapshot current = snapshot();
    {
        const utils::Mutex::AutoLocker lock(getMutex());
        const bool isCurrent = m_cache.snapshot == current && m_cache.index != nullptr;
        if (isCurrent && m_cache.index->keyChanges() == keyChanges) return m_cache;
    }
    // Outside the lock, since it takes those of the instances.
    auto index = std::make_shared<const KeyIndex>(*current, keyChanges);
    const utils::Mutex::AutoLocker lock(getMutex());
    if (m_cache.snapshot == current) m_cache.index = index;
    return {current, std::move(index)};
}

CimInstance* InstanceList::find(const CimPath& path) {
    const Cache cache = indexed();
    for (const KeyIndex::Place& place : cache.index->placesOf(path)) {
        const std::shared_ptr<CimInstance>& found = (*cache.snapshot)[place.position];
        if (found->isDeleted() || !path.isSameObjectAs(*found)) continue;
        holdInScope(found);
        return found.get();
    }
    return nullptr;
}

void InstanceList::add(CimInstance* element) {
    // Owned before anything can throw, so that a caller never has to clean up.
    const std::shared_ptr<CimInstance> owned(element, &InstanceReaper::release);
    element->m_list = m_link;
    holdInScope(owned);
    Cache outdated;
    const utils::Mutex::AutoLocker lock(getMutex());
    m_held.push_back(owned);
    // The base's list has to name the same elements, whatever happens: callers may walk it.
    try {
        getStlList().push_back(element);
    } catch (...) {
        m_held.pop_back();
        throw;
    }
    std::swap(outdated, m_cache);
}

void InstanceList::clear() {
    // What is let go of is destroyed after the lock is released.
    Snapshot released;
    Cache outdated;
    const utils::Mutex::AutoLocker lock(getMutex());
    released.swap(m_held);
    std::swap(outdated, m_cache);
    getStlList().clear();
}

bool InstanceList::remove(const CimInstance* element) {
    std::shared_ptr<CimInstance> released;
    Cache outdated;
    const utils::Mutex::AutoLocker lock(getMutex());
    const auto found = std::ranges::find_if(m_held, [&](const auto& each) { return each.get() == element; });
    if (found == m_held.end()) return false;
    released = std::move(*found);
    m_held.erase(found);
    std::swap(outdated, m_cache);
    getStlList().remove(const_cast<CimInstance*>(element));
    return true;
}

void InstanceList::publish(InstanceList& rebuilt) {
    Snapshot taken;
    std::list<CimInstance*> elements;
    Cache outdated;
    {
        const utils::Mutex::AutoLocker lock(rebuilt.getMutex());
        taken.swap(rebuilt.m_held);
        elements.swap(rebuilt.getStlList());
        rebuilt.m_cache = {};
    }
    // Before they are listed: from then on any thread may delete one.
    for (const auto& instance : taken)
        instance->m_list = m_link;
    const utils::Mutex::AutoLocker lock(getMutex());
    m_held.swap(taken);
    getStlList().swap(elements);
    std::swap(outdated, m_cache);
}

InstanceList::Iterator joinInstances(std::vector<InstanceList::Iterator> parts) {
    const auto kept = std::make_shared<std::vector<InstanceList::Iterator>>(std::move(parts));
    auto joined = std::make_shared<InstanceList::Snapshot>();
    for (InstanceList::Iterator& part : *kept) {
        for (CimInstance* each = part.first(); each != nullptr; each = part.next()) {
            // Shares the ownership of the enumerations, which keep their elements.
            joined->emplace_back(kept, each);
        }
    }
    return InstanceList::Iterator(std::make_unique<SnapshotIterator>(std::move(joined)));
}

void prepareReaper() {
    InstanceReaper::theOne();
}

void drainReaper(const std::function<void()>& release) noexcept {
    InstanceReaper& reaper = InstanceReaper::theOne();
    reaper.banThreads();
    release();
    reaper.drain();
    reaper.allowThreads();
}

bool isReaperBusy() noexcept {
    return InstanceReaper::theOne().isWorking();
}

}  // namespace core
