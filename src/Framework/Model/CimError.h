// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <stdexcept>
#include <string>

#include "Utils/Export.h"

namespace core {

/// The status codes of CIM operations (DSP0223 Annex, DSP0200 5.5).
enum class CimStatus {
    Failed = 1,
    AccessDenied = 2,
    InvalidNamespace = 3,
    InvalidParameter = 4,
    InvalidClass = 5,
    NotFound = 6,
    NotSupported = 7,
    AlreadyExists = 11,
    NoSuchProperty = 12,
    TypeMismatch = 13,
    QueryLanguageNotSupported = 14,
    InvalidQuery = 15,
    MethodNotAvailable = 16,
    MethodNotFound = 17,
    InvalidEnumerationContext = 21,
    InvalidOperationTimeout = 22,
    FilteredEnumerationNotSupported = 25,
    ContinuationOnErrorNotSupported = 26,
    ServerLimitsExceeded = 27,
    ServerIsShuttingDown = 28,
    QueryFeatureNotSupported = 29
};

/// A request that ends with a CIM status. Unlike the providers' exceptions it does not log itself: a client's
/// mistake must not fill the server's log.
class QUENX_EXPORT CimError : public std::runtime_error {
  public:
    CimError(CimStatus status, const std::string& description);
    ~CimError() override;

    CimStatus status() const { return m_status; }

  private:
    CimStatus m_status;
};

/// For a catch clause: throws what is being handled as CimError. What is none becomes CimStatus::Failed, with
/// the provider's own text; but the lack of memory passes, since there may be none to build an answer in.
[[noreturn]] QUENX_EXPORT void rethrowAsCimError();

}  // namespace core
