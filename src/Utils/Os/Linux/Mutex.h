// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <pthread.h>

#include <atomic>

#include "Utils/Export.h"
#include "Utils/ThreadAnnotations.h"

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

}  // namespace utils
