// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

#include "Utils/Export.h"

namespace utils {

/// A timer for a scope: its destructor writes the debug line "time(name) = Nms ".
class QUENX_EXPORT TimeStamp {
  public:
    /// Named by its own address; logs its start.
    TimeStamp();
    /// Does not log its start.
    explicit TimeStamp(std::string name);
    /// Logs its start as "<name>" if `logStart`.
    TimeStamp(std::string name, bool logStart);
    ~TimeStamp();

    TimeStamp(const TimeStamp&) = delete;
    TimeStamp& operator=(const TimeStamp&) = delete;

  private:
    void Init(bool logStart);

    std::string m_name;
    std::uint64_t m_start = 0;  ///< microseconds of the monotonic clock
};

}  // namespace utils
