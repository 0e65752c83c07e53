// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <map>
#include <string>

#include "Indications/Delivery/Queue.h"

namespace indications {

/// How many messages may go to one address, whatever its destinations are called: so many a second on average
/// over half a minute, so that one event may reach a hundred subscribers at once. For one thread at a time.
class Pace {
  public:
    /// @param perSecond  0 sets no bound
    explicit Pace(unsigned int perSecond) : m_perSecond(perSecond) {}

    /// One has gone there.
    void count(const std::string& address, Clock::time_point now);
    /// When the next may go.
    Clock::time_point next(const std::string& address) const;

  private:
    const unsigned int m_perSecond;
    /// When all that went there would have gone, evenly spread.
    std::map<std::string, Clock::time_point> m_spread;
};

}  // namespace indications
