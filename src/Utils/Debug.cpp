// SPDX-License-Identifier: Apache-2.0
#include "Utils/Debug.h"

#include <utility>

#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace utils {

TimeStamp::TimeStamp() : m_name(formatStr("%p", static_cast<void*>(this))) {
    Init(true);
}

TimeStamp::TimeStamp(std::string name) : m_name(std::move(name)) {
    Init(false);
}

TimeStamp::TimeStamp(std::string name, bool logStart) : m_name(std::move(name)) {
    Init(logStart);
}

void TimeStamp::Init(bool logStart) {
    m_start = os::getMonotonicuSeconds();
    if (logStart) QUENX_DEBUG("<%s>", m_name.c_str());
}

TimeStamp::~TimeStamp() {
    const std::uint64_t milliseconds = (os::getMonotonicuSeconds() - m_start) / 1000;
    // Log readers know this as a signed number of 32 bits.
    QUENX_DEBUG("time(%s) = %dms ", m_name.c_str(), static_cast<std::int32_t>(milliseconds));
}

}  // namespace utils
