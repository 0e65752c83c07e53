// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <memory>
#include <utility>
#include <vector>

#include "Utils/Containers.h"

namespace core {

class CimInstance;
class CimPath;
class KeyIndex;

/// A class object's instances. Owns them: an element is destroyed when the list and every snapshot, iterator
/// and request that holds it have let go. Thread-safe.
class QUENX_EXPORT InstanceList : public utils::SafeList<CimInstance*>,
                                  private utils::SafeList<CimInstance*>::ElementOwner {
  public:
    using Snapshot = std::vector<std::shared_ptr<CimInstance>>;

    InstanceList();
    ~InstanceList() override;

    /// An iterator over the list as it is now; later changes do not show in it. The iterator, and the calling
    /// thread's request scope if there is one, keep the elements alive.
    Iterator getElements() override;
    /// The same; the flag has no meaning here and is kept for callers that pass it.
    Iterator getElements(bool all);

    /// Appends and takes ownership, also when it throws. The calling thread's request scope holds it too.
    void add(CimInstance* element) override;
    /// Lets go of every element.
    void clear() override;
    /// Lets go of one element; false when it is not listed.
    bool remove(const CimInstance* element);
    /// The listed instance that the path names, by an index of the keys; null when there is none. The calling
    /// thread's request scope holds it. A path with a reference among its keys finds nothing where the class
    /// declares a text, nor the other way round.
    CimInstance* find(const CimPath& path);
    /// Takes over the other list's elements and lets go of its own, in one step: nobody sees half a list.
    /// The other list is left empty.
    void publish(InstanceList& rebuilt);

  private:
    using SharedSnapshot = std::shared_ptr<const Snapshot>;
    class Link;

    /// What is made of the list when it is read, and kept until it changes: most lists are read far more
    /// often than they change. The index, which only look-ups need, ends with a change of any key, too.
    struct Cache {
        SharedSnapshot snapshot;
        std::shared_ptr<const KeyIndex> index;
    };

    SharedSnapshot snapshot();
    Cache indexed();

    std::shared_ptr<Link> m_link;
    Snapshot m_held QUENX_GUARDED_BY(getMutex());
    Cache m_cache QUENX_GUARDED_BY(getMutex());
};

/// Several enumerations as one, in their order; none of them gives an empty one. It keeps the elements of
/// all.
QUENX_EXPORT utils::SafeList<CimInstance*>::Iterator joinInstances(
    std::vector<utils::SafeList<CimInstance*>::Iterator> parts);

// A released instance whose destructor waits (CimInstance::setDestructionWaits) is destroyed by the reaper,
// on a thread of its own. Where that thread cannot be had, it stays queued until the next one comes, or
// drainReaper().

/// Makes sure that the reaper is built, and so destroyed after the object that is being built now.
void prepareReaper();

/// Calls `release`, which lets go of instances and must not throw. Returns when every instance that was
/// queued is destroyed, code of its library included. No thread is started for that: the caller may be the
/// last thread of the process, which runs its end, and a further thread that ended then would run that end a
/// second time.
QUENX_EXPORT void drainReaper(const std::function<void()>& release) noexcept;

/// Whether the thread still has instances to destroy.
QUENX_EXPORT bool isReaperBusy() noexcept;

/// Lets a for loop walk an enumeration: `for (CimInstance* each : InstanceRange(broker->getInstances(...)))`.
/// Holds the enumeration's elements while it lives; can be walked again when a walk has ended.
class InstanceRange {
  public:
    explicit InstanceRange(utils::SafeList<CimInstance*>::Iterator instances)
        : m_instances(std::move(instances)) {}

    struct End {};
    class Step {
      public:
        explicit Step(InstanceRange& range) : m_range(range), m_current(range.m_instances.first()) {}
        CimInstance* operator*() const { return m_current; }
        Step& operator++() {
            m_current = m_range.m_instances.next();
            return *this;
        }
        bool operator!=(End) const { return m_current != nullptr; }

      private:
        InstanceRange& m_range;
        CimInstance* m_current;
    };

    Step begin() { return Step(*this); }
    End end() const { return {}; }
    std::size_t size() { return m_instances.size(); }

  private:
    utils::SafeList<CimInstance*>::Iterator m_instances;
};

}  // namespace core
