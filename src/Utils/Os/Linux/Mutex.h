// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <pthread.h>

#include <atomic>
#include <utility>

#include "Utils/Export.h"

/// Clang's thread-safety annotations; empty where the compiler does not know them.
/// A class marked QUENX_CAPABILITY is a lock, one marked QUENX_SCOPED_CAPABILITY holds a lock for its scope.

#if defined(__clang__)
#define QUENX_THREAD_ANNOTATION(x) __attribute__((x))
#else
#define QUENX_THREAD_ANNOTATION(x)
#endif

#define QUENX_CAPABILITY(x) QUENX_THREAD_ANNOTATION(capability(x))
#define QUENX_SCOPED_CAPABILITY QUENX_THREAD_ANNOTATION(scoped_lockable)
#define QUENX_GUARDED_BY(x) QUENX_THREAD_ANNOTATION(guarded_by(x))
#define QUENX_REQUIRES(...) QUENX_THREAD_ANNOTATION(requires_capability(__VA_ARGS__))
#define QUENX_ACQUIRE(...) QUENX_THREAD_ANNOTATION(acquire_capability(__VA_ARGS__))
#define QUENX_RELEASE(...) QUENX_THREAD_ANNOTATION(release_capability(__VA_ARGS__))
#define QUENX_RETURN_CAPABILITY(x) QUENX_THREAD_ANNOTATION(lock_returned(x))
#define QUENX_NO_THREAD_SAFETY_ANALYSIS QUENX_THREAD_ANNOTATION(no_thread_safety_analysis)

namespace utils {

/// A POSIX mutex with default attributes: not recursive. Constant-initialised, so one with static storage is
/// usable before any constructor has run.
class QUENX_EXPORT QUENX_CAPABILITY("mutex") Mutex {
  public:
    class AutoLocker;

    constexpr Mutex() noexcept = default;
    ~Mutex();
    Mutex(const Mutex&) = delete;
    Mutex& operator=(const Mutex&) = delete;

    void Lock() noexcept QUENX_ACQUIRE();
    void Unlock() noexcept QUENX_RELEASE();

    /// How often any mutex of the process was locked and unlocked, modulo 2^32; for diagnosis only.
    static std::atomic<unsigned int> lockCounter;
    static std::atomic<unsigned int> unlockCounter;

  private:
    pthread_mutex_t m_mutex = PTHREAD_MUTEX_INITIALIZER;
};

/// Holds a mutex for a scope.
class QUENX_SCOPED_CAPABILITY Mutex::AutoLocker {
  public:
    explicit AutoLocker(Mutex& mutex) noexcept QUENX_ACQUIRE(mutex) : m_mutex(mutex) { m_mutex.Lock(); }
    ~AutoLocker() QUENX_RELEASE() { m_mutex.Unlock(); }
    AutoLocker(const AutoLocker&) = delete;
    AutoLocker& operator=(const AutoLocker&) = delete;

  private:
    Mutex& m_mutex;
};

/// A value of any type guarded by its own mutex. Each operation is atomic; a read followed by a write is two
/// of them, so what must not be torn apart goes through compareAndSet().
template <typename T>
class Atomic {
  public:
    Atomic() = default;
    explicit Atomic(T value) : m_value(std::move(value)) {}
    Atomic(const Atomic&) = delete;
    Atomic& operator=(const Atomic&) = delete;

    Atomic& operator=(T value) {
        {
            Mutex::AutoLocker locker(m_mutex);
            std::swap(m_value, value);
        }
        return *this;  // the old value is freed outside the lock
    }

    bool operator==(const T& value) const {
        Mutex::AutoLocker locker(m_mutex);
        return m_value == value;
    }

    /// A copy of the value.
    operator T() const { return get(); }
    T get() const {
        Mutex::AutoLocker locker(m_mutex);
        return m_value;
    }

    /// Test and set in one: if the value equals `expected`, it becomes `desired` and the result is true;
    /// otherwise it stays, `actual` receives a copy of it, and the result is false.
    bool compareAndSet(const T& expected, T desired, T& actual) {
        Mutex::AutoLocker locker(m_mutex);
        if (m_value == expected) {
            std::swap(m_value, desired);
            return true;
        }
        actual = m_value;
        return false;
    }

  private:
    mutable Mutex m_mutex;
    T m_value QUENX_GUARDED_BY(m_mutex){};
};

}  // namespace utils
