// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <mutex>

#include "Utils/ThreadAnnotations.h"

namespace core {

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

}  // namespace core
