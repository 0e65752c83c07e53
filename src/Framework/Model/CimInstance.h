// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Utils/Export.h"
#include "Utils/Os/Linux/Mutex.h"

namespace core {

class CimInstance;
class CimPath;
class CimProperty;
class CimPropertyList;
struct CimClassInfo;

/// A mutex that its holder may lock again; annotated, so that Clang checks what it guards.
class QUENX_CAPABILITY("mutex") RecursiveMutex {
  public:
    void lock() QUENX_ACQUIRE() { m_mutex.lock(); }
    void unlock() QUENX_RELEASE() { m_mutex.unlock(); }

  private:
    std::recursive_mutex m_mutex;
};

/// Holds a RecursiveMutex for a scope.
class QUENX_SCOPED_CAPABILITY RecursiveLocker {
  public:
    explicit RecursiveLocker(RecursiveMutex& mutex) QUENX_ACQUIRE(mutex) : m_mutex(mutex) { m_mutex.lock(); }
    ~RecursiveLocker() QUENX_RELEASE() { m_mutex.unlock(); }
    RecursiveLocker(const RecursiveLocker&) = delete;
    RecursiveLocker& operator=(const RecursiveLocker&) = delete;

  private:
    RecursiveMutex& m_mutex;
};

/// The way from an instance back to the list that serves it; outlives both.
class InstanceListLink {
  public:
    virtual ~InstanceListLink() = default;
    /// Takes the instance out of its list, if the list still exists.
    virtual void remove(const CimInstance* instance) = 0;
    /// An instance of the list has another key than before. Called under the instance's lock.
    virtual void keyChanged() noexcept = 0;
};

/// Base of every instance class.
///
/// Owns no properties: they are members of the derived classes and register themselves here. Several
/// registered properties may share a name, one per class of the chain that declares it; the one served is the
/// most derived.
class QUENX_EXPORT CimInstance {
  public:
    /// What instances have in common whose properties have the same names, types and keys in the same order:
    /// whatever was found out of one by that is true of all. One object for them all, which lives as long as
    /// the process.
    struct Shape;

    /// A provider method: input arguments, output arguments, an instance handed back (such as a created job);
    /// returns the method's CIM return value. The instance handed back stays owned by its class object's
    /// list.
    using Method = unsigned int (CimInstance::*)(CimPropertyList&, CimPropertyList&, CimInstance*&);

    CimInstance() = default;
    CimInstance(const CimInstance&) = delete;
    CimInstance& operator=(const CimInstance&) = delete;

    /// The class that the instance is served as; the base gives the name of the most derived binding class.
    virtual std::string getClassName() const;
    /// Gives the named properties new values: all are checked first, then all set, under one lock.
    /// CimError for an unknown property, a key, or a wrong type; nothing is changed then.
    virtual unsigned int modifyInstance(CimPropertyList& requested);
    /// Looks up the method (without regard to case) and calls it. CimError (method not available) when it is
    /// not registered; what the method throws passes through.
    virtual unsigned int invokeMethod(std::string name, CimPropertyList& in, CimPropertyList& out,
                                      CimInstance*& result);
    virtual ~CimInstance();

    /// The class name that the instance reports as its creation class: getClassName().
    std::string getCreationClassName() const;

    /// With true the instance leaves its list at once and is in no later enumeration or look-up. It is
    /// destroyed when the requests that have enumerated it have ended. The mark cannot be taken back: false
    /// does nothing.
    void setDeleted(bool deleted);
    bool isDeleted() const { return m_deleted.load(std::memory_order_acquire); }

    /// The most derived property of that name (without regard to case); null when there is none.
    CimProperty* getPropertyByName(std::string_view name) const;
    /// One property per name, the most derived, in the order of declaration.
    std::vector<CimProperty*> getProperties() const;
    /// The keys among them.
    std::vector<CimProperty*> getKeys() const;
    /// Every registered property, repeated names included, in the order of construction.
    const std::vector<CimProperty*>& getAllProperties() const { return m_properties; }
    // To be called under the lock below.
    const Shape& shape() const QUENX_REQUIRES(m_mutex);
    /// Where the keys that are served stand among all properties.
    const std::vector<std::size_t>& keyIndices() const QUENX_REQUIRES(m_mutex);
    /// CimPath::of() this instance, found once and shared until a key changes.
    std::shared_ptr<const CimPath> getPath() const;

    /// The same for instances whose paths are the same; of few others.
    std::size_t hashOfKeys() const;

    /// Guards the values of all properties. A refresh holds it from beginning to end, a front while it copies
    /// the values, so that nobody sees half a refresh. Never hold the locks of two instances.
    RecursiveMutex& getMutex() const QUENX_RETURN_CAPABILITY(m_mutex) { return m_mutex; }

  protected:
    /// Registers a method under its CIM name; called in constructors. The member may be virtual.
    template <class T>
    void addMethod(std::string name,
                   unsigned int (T::*method)(CimPropertyList&, CimPropertyList&, CimInstance*&)) {
        m_methods.emplace_back(std::move(name), static_cast<Method>(method));
    }

    /// Says that the properties built since the last call belong to this class. Called at the end of each
    /// constructor in the chain; the class information must live as long as the instance.
    void declareClass(const CimClassInfo& info);

    /// For classes whose destructor waits (for a thread, say): a released instance is then destroyed on a
    /// thread of the framework's own, so that no request waits for it.
    void setDestructionWaits() { m_destructionWaits = true; }
    /// When the framework was to destroy it (os::getMonotonicuSeconds()); 0 when somebody else does. Those
    /// that wait for some time are destroyed one by one, and each counts its time from here.
    std::uint64_t releaseTime() const { return m_releaseTime; }

  private:
    friend class CimProperty;
    friend class InstanceList;
    friend class InstanceReaper;

    static std::shared_ptr<const Shape> findShape(const std::vector<CimProperty*>& properties);
    std::vector<CimProperty*> select(const std::vector<std::size_t>& indices) const;
    void registerProperty(CimProperty* property);
    void unregisterProperty(CimProperty* property) noexcept;
    /// When a key has changed.
    void forgetPath() const;

    // What an enumeration asks of each instance stands together: among thousands nothing of it is in the
    // processor's caches. The hash, the shape and the path are found at the first use.
    std::atomic<bool> m_deleted{false};
    mutable RecursiveMutex m_mutex;
    mutable std::optional<std::size_t> m_hashOfKeys QUENX_GUARDED_BY(m_mutex);
    std::vector<CimProperty*> m_properties;
    mutable std::shared_ptr<const Shape> m_shape QUENX_GUARDED_BY(m_mutex);
    mutable std::shared_ptr<const CimPath> m_path QUENX_GUARDED_BY(m_mutex);
    std::vector<std::pair<std::string, Method>> m_methods;
    const CimClassInfo* m_classInfo = nullptr;
    std::weak_ptr<InstanceListLink> m_list;  ///< set once, when the instance is added
    CimInstance* m_nextToDestroy = nullptr;  ///< links the queue of instances to destroy
    std::uint64_t m_releaseTime = 0;         ///< when it was queued; 0 for never
    bool m_destructionWaits = false;
};

/// Learns which class of a chain has declared which properties: it collects what the constructors of the
/// instances that are built on this thread say to CimInstance::declareClass() while it lives.
class DeclarationRecorder {
  public:
    DeclarationRecorder();
    ~DeclarationRecorder();
    DeclarationRecorder(const DeclarationRecorder&) = delete;
    DeclarationRecorder& operator=(const DeclarationRecorder&) = delete;

    /// Each class, and how many properties the instance had when its constructor ended.
    std::vector<std::pair<const CimClassInfo*, std::size_t>> marks;

  private:
    DeclarationRecorder* m_outer;
};

}  // namespace core
