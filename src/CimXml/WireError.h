// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <stdexcept>
#include <string>

namespace cimxml {

/// Why a message is refused before any operation is called. The names are those of the CIMError header
/// (DSP0200 6.3), each with the HTTP status that goes with it.
enum class WireFault {
    NotWellFormed,          ///< 400 request-not-well-formed
    NotValid,               ///< 400 request-not-valid
    HeaderMismatch,         ///< 400 header-mismatch
    UnsupportedOperation,   ///< 400 unsupported-operation
    UnsupportedProtocol,    ///< 501 unsupported-protocol-version
    UnsupportedCimVersion,  ///< 501 unsupported-cim-version
    UnsupportedDtdVersion,  ///< 501 unsupported-dtd-version
    MultipleRequests        ///< 501 multiple-requests-unsupported
};

/// The HTTP status of the fault: 400 or 501.
int httpStatus(WireFault fault);

/// The fault's name in the CIMError header.
const char* cimErrorHeader(WireFault fault);

/// A message that cannot be taken. what() says for a person what is wrong with it.
class WireError : public std::runtime_error {
  public:
    WireError(WireFault fault, const std::string& text) : std::runtime_error(text), m_fault(fault) {}

    WireFault fault() const { return m_fault; }

  private:
    WireFault m_fault;
};

}  // namespace cimxml
