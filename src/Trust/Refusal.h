// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <stdexcept>
#include <string>

#include "Framework/Requests/Reasons.h"

namespace trust {

/// An image is not trusted. what() names the file, what is wrong with it and what would be right.
class Refusal : public std::runtime_error {
  public:
    Refusal(core::ReasonId reason, const std::string& text) : std::runtime_error(text), m_reason(reason) {}
    core::ReasonId reason() const { return m_reason; }

  private:
    core::ReasonId m_reason;
};

}  // namespace trust
