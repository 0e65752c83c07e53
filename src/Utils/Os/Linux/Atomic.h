// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <utility>

#include "Utils/Os/Linux/Mutex.h"
#include "Utils/ThreadAnnotations.h"

namespace utils {

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
