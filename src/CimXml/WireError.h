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

    static const WireFault kNotWellFormed;
    static const WireFault kNotValid;
    static const WireFault kHeaderMismatch;
    static const WireFault kUnsupportedOperation;
    static const WireFault kUnsupportedProtocol;
    static const WireFault kUnsupportedCimVersion;
    static const WireFault kUnsupportedDtdVersion;
    static const WireFault kMultipleRequests;
};

inline constexpr WireFault WireFault::kNotWellFormed{400, "request-not-well-formed"};
inline constexpr WireFault WireFault::kNotValid{400, "request-not-valid"};
inline constexpr WireFault WireFault::kHeaderMismatch{400, "header-mismatch"};
inline constexpr WireFault WireFault::kUnsupportedOperation{400, "unsupported-operation"};
inline constexpr WireFault WireFault::kUnsupportedProtocol{501, "unsupported-protocol-version"};
inline constexpr WireFault WireFault::kUnsupportedCimVersion{501, "unsupported-cim-version"};
inline constexpr WireFault WireFault::kUnsupportedDtdVersion{501, "unsupported-dtd-version"};
inline constexpr WireFault WireFault::kMultipleRequests{501, "multiple-requests-unsupported"};

/// A message that cannot be taken. what() tells a person what is wrong with it.
class WireError : public std::runtime_error {
  public:
    WireError(const WireFault& fault, const std::string& text) : std::runtime_error(text), m_fault(fault) {}

    const WireFault& fault() const { return m_fault; }

  private:
    WireFault m_fault;
};

}  // namespace cimxml
