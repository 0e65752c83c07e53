// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <concepts>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Classes/InstanceList.h"
#include "Framework/Model/ClassDeclaration.h"

namespace core {

class CimPath;

/// A class object: serves the instances of one class. Called from several threads at once.
class QUENX_EXPORT CimClass {
  public:
    CimClass() = default;
    CimClass(const CimClass&) = delete;
    CimClass& operator=(const CimClass&) = delete;

    virtual std::string getClassName() = 0;
    /// The class's instances; the base version yields none.
    virtual utils::SafeList<CimInstance*>::Iterator getInstances();
    virtual void createInstance(CimInstance* instance);
    virtual void enableIndications();
    virtual void disableIndications();
    virtual ~CimClass();
};

/// The code by which a class's DeleteInstance says that no instance answers to the path.
inline constexpr int kDeleteNotFound = 90;

/// A class object whose instances can be deleted. The operation is found at compile time where the class
/// object is added, so it takes no virtual slot and classes without it need not know of it.
template <class T>
concept DeletesInstances = requires(T& object, CimPath& path) {
    { object.DeleteInstance(path) } -> std::convertible_to<int>;
};

/// A class object that finds an instance by its path without refreshing the others; null when the path names
/// none. What it finds is as fresh as an enumeration would serve it, stays owned by its list, and is held by
/// the calling thread's request scope. Found like DeletesInstances.
template <class T>
concept FindsInstances = requires(T& object, const CimPath& path) {
    { object.findInstance(path) } -> std::convertible_to<CimInstance*>;
};

/// A class object that says which instance class it serves, and so what its declaration is.
template <class T>
concept DeclaresInstances = requires {
    { T::Instance::classInfo } -> std::convertible_to<const CimClassInfo&>;
};

/// A class object with what is known of its type.
struct ServedClass {
    using Delete = int (*)(CimClass& object, CimPath& path);
    using Find = CimInstance* (*)(CimClass& object, const CimPath& path);

    std::unique_ptr<CimClass> object;
    const CimClassInfo* info = nullptr;  ///< null when the class object declares nothing
    Delete deleteInstance = nullptr;     ///< null when its instances cannot be deleted
    Find findInstance = nullptr;         ///< null when they are found among all of them only
    std::string name;                    ///< what getClassName() says
    ClassChain chain;                    ///< never empty; without class information it holds the bare name
    std::vector<ClassChain> mentioned = {};  ///< of the classes that its parameters name and nobody serves
};

/// The class objects of an agent, in the order of adding; owned, and destroyed in the reverse order.
/// Filled while the agent is built; look-ups are thread-safe.
class QUENX_EXPORT CimClasses {
  public:
    CimClasses() = default;
    ~CimClasses();
    CimClasses(const CimClasses&) = delete;
    CimClasses& operator=(const CimClasses&) = delete;

    /// Takes ownership, also when it throws.
    template <std::derived_from<CimClass> T>
    void add(T* object) {
        ServedClass served{std::unique_ptr<CimClass>(object), nullptr, nullptr, nullptr, {}, {}};
        if constexpr (DeclaresInstances<T>) served.info = &T::Instance::classInfo;
        if constexpr (DeletesInstances<T>) {
            served.deleteInstance = [](CimClass& base, CimPath& path) -> int {
                return static_cast<T&>(base).DeleteInstance(path);
            };
        }
        if constexpr (FindsInstances<T>) {
            served.findInstance = [](CimClass& base, const CimPath& path) -> CimInstance* {
                return static_cast<T&>(base).findInstance(path);
            };
        }
        append(std::move(served));
    }

    /// The class object of that name, compared without regard to case; null when there is none.
    const ServedClass* find(std::string_view className) const;
    /// A copy of pointers, valid while the collection lives.
    std::vector<const ServedClass*> getAll() const;
    /// Destroys the class objects, the last one first.
    void clear();
    /// Leaves them as they are, for ever, and takes no lock.
    void abandon() noexcept;

  private:
    void append(ServedClass served);

    mutable utils::Mutex m_mutex;
    std::vector<std::unique_ptr<ServedClass>> m_served QUENX_GUARDED_BY(m_mutex);
};

}  // namespace core
