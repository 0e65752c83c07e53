// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <stdexcept>
#include <string>

namespace cimxml {

/// Why a message is refused before any operation is called: a name for the CIMError header (DSP0200 6.3), and
/// the HTTP status that goes with it.
struct WireFault {
    int httpStatus;
    const char* cimError;
};

namespace faults {

inline constexpr WireFault kNotWellFormed{400, "request-not-well-formed"};
inline constexpr WireFault kNotValid{400, "request-not-valid"};
inline constexpr WireFault kHeaderMismatch{400, "header-mismatch"};
inline constexpr WireFault kUnsupportedOperation{400, "unsupported-operation"};
inline constexpr WireFault kUnsupportedProtocol{501, "unsupported-protocol-version"};
inline constexpr WireFault kUnsupportedCimVersion{501, "unsupported-cim-version"};
inline constexpr WireFault kUnsupportedDtdVersion{501, "unsupported-dtd-version"};
inline constexpr WireFault kMultipleRequests{501, "multiple-requests-unsupported"};

}  // namespace faults

/// A message that cannot be taken. what() tells a person what is wrong with it.
class WireError : public std::runtime_error {
  public:
    WireError(const WireFault& fault, const std::string& text) : std::runtime_error(text), m_fault(fault) {}

    const WireFault& fault() const { return m_fault; }

  private:
    WireFault m_fault;
};

}  // namespace cimxml
