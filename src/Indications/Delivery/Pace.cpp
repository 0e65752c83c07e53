// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/Pace.h"

#include <algorithm>

namespace indications {

void Pace::count(const std::string& address, Clock::time_point now) {
    if (m_perSecond == 0 || address.empty()) return;
    std::erase_if(m_spread, [&](const auto& each) { return each.second <= now; });
    Clock::time_point& end = m_spread.try_emplace(address, now).first->second;
    end += Clock::duration(std::chrono::seconds(1)) / m_perSecond;
}

Clock::time_point Pace::next(const std::string& address) const {
    constexpr std::chrono::seconds kAverage{30};
    const auto found = m_spread.find(address);
    return found == m_spread.end() ? Clock::time_point() : found->second - kAverage;
}

}  // namespace indications
