// SPDX-License-Identifier: Apache-2.0
// How class objects come by their instances: once, anew at each enumeration, or only when something changed;
// and how instances come by those of other classes.
#pragma once

#include <algorithm>
#include <cstdint>
#include <memory>
#include <string>
#include <typeinfo>
#include <utility>
#include <vector>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Model/CimInstance.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/Mutex.h"

/// Makes properties null, as a refresh does with what is not known.
template <class... Property>
void setNull(Property&... properties) {
    (properties.setNull(), ...);
}

/// Sets a property to what is known, or makes it null.
template <class Property, class Value>
void setOrNull(Property& property, bool isKnown, const Value& value) {
    if (isKnown) {
        property = value;
    } else {
        property.setNull();
    }
}

/// dynamic_cast for many objects: where the T is in one of them, it is in the others of its type.
template <class T>
class ManyCasts {
  public:
    /// Null for one that is no T.
    T* operator()(core::CimInstance* object) {
        const std::type_info& type = typeid(*object);
        if (m_type != &type) {
            T* const found = dynamic_cast<T*>(object);
            m_type = &type;
            m_isFound = found != nullptr;
            m_distance = m_isFound ? reinterpret_cast<std::intptr_t>(found) - placeOf(object) : 0;
        }
        return m_isFound ? reinterpret_cast<T*>(placeOf(object) + m_distance) : nullptr;
    }

  private:
    static std::intptr_t placeOf(core::CimInstance* object) {
        return reinterpret_cast<std::intptr_t>(object);
    }

    const std::type_info* m_type = nullptr;
    bool m_isFound = false;
    std::intptr_t m_distance = 0;
};

/// The instances of a class as the broker finds them, those that are a T. Holds them while it lives.
template <class T>
class InstancesOf {
  public:
    /// @param provider  whose instances; empty for those of everybody who serves the class
    explicit InstancesOf(const std::string& className, const std::string& provider = {})
        : m_all(core::GetCimBroker()->getInstances(className, provider)) {
        ManyCasts<T> cast;
        for (core::CimInstance* each : m_all)
            if (T* found = cast(each)) m_found.push_back(found);
    }

    /// How many instances the class has, including those that are not a T.
    int count() { return static_cast<int>(m_all.size()); }
    /// The first of them; null when there is none.
    T* first() const { return m_found.empty() ? nullptr : m_found.front(); }
    auto begin() const { return m_found.begin(); }
    auto end() const { return m_found.end(); }

  private:
    core::InstanceRange m_all;
    std::vector<T*> m_found;
};

/// A class object that serves instances of T from a list of its own.
template <class T>
class ListedClass : public core::CimClass {
  public:
    using Instance = T;

    std::string getClassName() override { return T::classInfo.name; }

  protected:
    core::InstanceList m_instances;
};

/// A class object with one instance, which is made and refreshed at the first enumeration and then kept.
template <class T>
class SingletonClass : public ListedClass<T> {
  public:
    /// @param label      names the enumeration in the log; several classes may share one
    /// @param file,line  the place in the class's own unit that the log names: whoever reads a line looks for
    ///                   the class, not for this template
    SingletonClass(const char* label, const char* file, int line)
        : m_label(label), m_file(file), m_line(line) {}

    core::InstanceList::Iterator getInstances() override {
        log("getInstance");
        const utils::TimeStamp timing(m_label);
        createOnce();
        utils::formatDebugLog(m_file, kFunction, m_line, "return %d",
                              static_cast<int>(this->m_instances.size()));
        return this->m_instances.getElements(false);
    }

  private:
    static constexpr const char* kFunction = "getInstances";

    void log(const char* line) const { utils::formatDebugLog(m_file, kFunction, m_line, "%s", line); }

    /// Two first calls on two threads make one instance.
    void createOnce() {
        const utils::Mutex::AutoLocker lock(m_creation);
        if (this->m_instances.size() != 0) return;
        log("create new instance");
        auto instance = std::make_unique<T>();
        instance->refresh();
        this->m_instances.add(instance.release());
    }

    utils::Mutex m_creation;
    const char* m_label;
    const char* m_file;
    int m_line;
};

/// Fills a class object's list anew and publishes it in one step, so that two enumerations at once neither
/// double nor drop an instance. Where an exception ends it before that, the list is left empty.
class Rebuild {
  public:
    /// The list must outlive the rebuild.
    explicit Rebuild(core::InstanceList& instances) : m_instances(instances) {}
    ~Rebuild() {
        if (!m_isPublished) m_instances.clear();
    }
    Rebuild(const Rebuild&) = delete;
    Rebuild& operator=(const Rebuild&) = delete;

    /// Adds a new instance, for the caller to fill. The list owns it.
    template <class T>
    T& add() {
        auto* instance = new T;
        m_rebuilt.add(instance);
        return *instance;
    }
    /// Returns the list as it is then.
    core::InstanceList::Iterator publish() {
        m_instances.publish(m_rebuilt);
        m_isPublished = true;
        return m_instances.getElements(false);
    }

  private:
    core::InstanceList& m_instances;
    core::InstanceList m_rebuilt;
    bool m_isPublished = false;
};

/// Keys in parts. A part never changes, so one that is kept is known again by its place, not key by key.
template <class Key>
using KeyParts = std::vector<std::shared_ptr<const std::vector<Key>>>;

/// A class object with one instance for each key. The instances are kept while the keys stay the same, so
/// that references to them stay good. T is built from a Key and has refresh(), which is called at each look;
/// one whose values all follow from its key has a member kFollowsFromKey, and is refreshed when it is made.
template <class T, class Key>
class CachedClass : public ListedClass<T> {
  protected:
    /// The instances for these keys, all of them fresh.
    core::InstanceList::Iterator serve(const KeyParts<Key>& keys) {
        if (!rebuild(keys)) {
            for (core::CimInstance* instance : core::InstanceRange(this->m_instances.getElements(false)))
                static_cast<T*>(instance)->refresh();
        }
        return this->m_instances.getElements(false);
    }
    core::InstanceList::Iterator serve(std::vector<Key> keys) { return serve(onePart(std::move(keys))); }

    /// The one that the path names, fresh; null when none of these keys is its.
    T* find(const KeyParts<Key>& keys, const core::CimPath& path) {
        const bool isFresh = rebuild(keys);
        auto* found = static_cast<T*>(this->m_instances.find(path));
        if (found != nullptr && !isFresh) found->refresh();
        return found;
    }
    T* find(std::vector<Key> keys, const core::CimPath& path) { return find(onePart(std::move(keys)), path); }

  private:
    static KeyParts<Key> onePart(std::vector<Key> keys) {
        return {std::make_shared<const std::vector<Key>>(std::move(keys))};
    }
    static bool isSame(const KeyParts<Key>& left, const KeyParts<Key>& right) {
        return std::ranges::equal(
            left, right, [](const auto& one, const auto& other) { return one == other || *one == *other; });
    }

    /// Whether the instances are fresh then: made now, or such as never change.
    bool rebuild(const KeyParts<Key>& keys) {
        const utils::Mutex::AutoLocker lock(m_mutex);
        if (isSame(keys, m_keys)) return requires {
                T::kFollowsFromKey;
            };
        core::InstanceList rebuilt;
        for (const auto& part : keys) {
            for (const Key& key : *part) {
                auto instance = std::make_unique<T>(key);
                instance->refresh();
                rebuilt.add(instance.release());
            }
        }
        m_keys = keys;
        this->m_instances.publish(rebuilt);
        return true;
    }

    utils::Mutex m_mutex;
    KeyParts<Key> m_keys QUENX_GUARDED_BY(m_mutex);
};
