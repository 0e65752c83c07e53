// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <algorithm>
#include <cstdint>

#include "Utils/Os/Linux/Mutex.h"

namespace ma {

/// The percentage of an adapter's update. Thread-safe.
class Progress {
  public:
    std::uint16_t percent() const {
        const utils::Mutex::AutoLocker lock(m_mutex);
        return m_percent;
    }

    /// An image was prepared: a new update is at its beginning, unless one is being written.
    void prepared() {
        const utils::Mutex::AutoLocker lock(m_mutex);
        if (!m_writing) m_percent = 0;
    }

    void begin() {
        const utils::Mutex::AutoLocker lock(m_mutex);
        m_writing = true;
        m_percent = 0;
    }

    void advance(std::uint16_t percent) {
        const utils::Mutex::AutoLocker lock(m_mutex);
        m_percent = std::max(m_percent, percent);
    }

    void end() {
        const utils::Mutex::AutoLocker lock(m_mutex);
        m_writing = false;
    }

  private:
    mutable utils::Mutex m_mutex;
    bool m_writing QUENX_GUARDED_BY(m_mutex) = false;
    std::uint16_t m_percent QUENX_GUARDED_BY(m_mutex) = 0;
};

/// Marks the time during which an adapter is being written to, however that ends.
class WritingScope {
  public:
    explicit WritingScope(Progress& progress) : m_progress(progress) { m_progress.begin(); }
    WritingScope(const WritingScope&) = delete;
    WritingScope& operator=(const WritingScope&) = delete;
    ~WritingScope() { m_progress.end(); }

  private:
    Progress& m_progress;
};

}  // namespace ma
