// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <memory>
#include <mutex>

#include "Utils/Exception.h"
#include "Utils/Export.h"
#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace utils {

/// The base of a class T of which one instance is current in the process. The instances form a stack: a newer
/// one hides an older one until it is destroyed. T derives from Singleton<T> and has a static
/// GetSingletonName() that returns a const char*. Where several libraries use T, its header says `extern
/// template class utils::Singleton<T>;` and the library that owns T has the one explicit instantiation.
///
/// Construction, destruction and look-up may happen on any threads; whoever uses an instance sees to it that
/// it outlives the use.
template <typename T>
class QUENX_EXPORT Singleton {
  public:
    Singleton();
    virtual ~Singleton();

    Singleton(const Singleton&) = delete;
    Singleton& operator=(const Singleton&) = delete;

    /// The current instance, never null. @throws Exception "No singleton instance found for %s"
    static T* getInstance();

  protected:
    /// The current instance; null when there is none.
    static T* findInstance();

  private:
    static std::atomic<Singleton*> currentInstance;
    static std::mutex m_registryMutex;
    static Singleton* m_newestAlive;

    Singleton* m_previous = nullptr;
    Singleton* m_olderAlive = nullptr;
};

/// A singleton that is created on its first use: by T::CreateSingleton(), a static function that returns a
/// std::unique_ptr<T>. An instance so created lives until the library that owns T is unloaded.
template <typename T>
class QUENX_EXPORT AutoSingleton : protected Singleton<T> {
  public:
    /// The current instance, never null. Two first calls on two threads make one instance.
    static T* getInstance();

  private:
    static std::mutex m_creationMutex;
    static std::unique_ptr<T> m_createdInstance;
};

template <typename T>
std::atomic<Singleton<T>*> Singleton<T>::currentInstance{nullptr};
template <typename T>
std::mutex Singleton<T>::m_registryMutex;
template <typename T>
Singleton<T>* Singleton<T>::m_newestAlive = nullptr;
template <typename T>
std::mutex AutoSingleton<T>::m_creationMutex;
template <typename T>
std::unique_ptr<T> AutoSingleton<T>::m_createdInstance;

template <typename T>
Singleton<T>::Singleton() {
    {
        std::lock_guard<std::mutex> lock(m_registryMutex);
        m_previous = currentInstance.load();
        m_olderAlive = m_newestAlive;
        m_newestAlive = this;
        currentInstance.store(this);
    }
    QUENX_DEBUG("New singleton instance for %s", T::GetSingletonName());
}

template <typename T>
Singleton<T>::~Singleton() {
    std::lock_guard<std::mutex> lock(m_registryMutex);
    // The remembered one becomes current even when this one was not: the order of destruction decides.
    currentInstance.store(m_previous);
    // Instances that are destroyed out of order must not bring this one back.
    Singleton** link = &m_newestAlive;
    while (*link != nullptr) {
        if (*link == this) {
            *link = m_olderAlive;
        } else {
            if ((*link)->m_previous == this) (*link)->m_previous = m_previous;
            link = &(*link)->m_olderAlive;
        }
    }
}

template <typename T>
T* Singleton<T>::findInstance() {
    // Written as a conversion that may look through the non-public base of AutoSingleton.
    using Pointer = T*;
    return Pointer(currentInstance.load());
}

template <typename T>
T* Singleton<T>::getInstance() {
    T* const instance = findInstance();
    if (instance == nullptr) {
        throw Exception(formatStr("No singleton instance found for %s", T::GetSingletonName()));
    }
    QUENX_DEBUG("Instance of %s (#%p)", T::GetSingletonName(), static_cast<const void*>(instance));
    return instance;
}

template <typename T>
T* AutoSingleton<T>::getInstance() {
    // Always under the lock: an instance is current before its constructor has ended.
    std::lock_guard<std::mutex> lock(m_creationMutex);
    if (T* const instance = Singleton<T>::findInstance()) return instance;
    // One that destruction out of order has hidden still serves: callers may hold it.
    if (m_createdInstance == nullptr) m_createdInstance = T::CreateSingleton();
    return m_createdInstance.get();
}

}  // namespace utils
