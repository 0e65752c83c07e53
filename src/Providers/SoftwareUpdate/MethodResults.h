// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <new>
#include <string>

#include "Framework/Requests/NotedCall.h"
#include "Providers/Schema/ValueMaps.h"
#include "Utils/Exception.h"

// From a refusal to what the client is told: exception, result of the registry, return value of the method.

namespace utils {

class EInvalidParameter : public Exception {
  public:
    explicit EInvalidParameter(std::string message) : Exception("EInvalidParameter:" + message) {}
};

}  // namespace utils

// The other refusals, beside utils::EUnspecifiedError. Each message is the class's name, a colon and the
// text, with no blank between; the base puts its own prefix in front and logs the rest.

/// The target adapter is already being updated.
class ETargetInUse : public utils::Exception {
  public:
    explicit ETargetInUse(std::string message) : Exception("ETargetInUse:" + message) {}
};

/// Another adapter is being updated.
class EJobIsRunning : public utils::Exception {
  public:
    explicit EJobIsRunning(std::string message) : Exception("EJobIsRunning:" + message) {}
};

class EInvalidUri : public utils::Exception {
  public:
    explicit EInvalidUri(std::string message) : Exception("EInvalidUri:" + message) {}
};

/// The file that the URI names cannot be opened.
class EUriDoesNotExist : public utils::Exception {
  public:
    explicit EUriDoesNotExist(std::string message) : Exception("EUriDoesNotExist:" + message) {}
};

class EImageReadError : public utils::Exception {
  public:
    explicit EImageReadError(std::string message) : Exception("EImageReadError:" + message) {}
};

/// The image is for another adapter.
class EAdapterNotSupported : public utils::Exception {
  public:
    explicit EAdapterNotSupported(std::string message) : Exception("EAdapterNotSupported:" + message) {}
};

/// The image is a downgrade that neither the options nor the configuration permit.
class EDowngradeDetected : public utils::Exception {
  public:
    explicit EDowngradeDetected(std::string message) : Exception("EDowngradeDetected:" + message) {}
};

class ENotApplicableForTarget : public utils::Exception {
  public:
    explicit ENotApplicableForTarget(std::string message) : Exception("ENotApplicableForTarget:" + message) {}
};

/// What the job registry answers a request with. An int and no closed set: whatever is not listed counts as
/// success.
struct VerifyJobResult {
    enum Value : int {
        Success = 0,
        InvalidParameter = 1,
        AdapterNotSupported = 2,
        DowngradeDetected = 3,
        UnspecifiedError = 4,
        NotApplicableForTarget = 5,
        InvalidUri = 100,
        UriDoesNotExist = 101,
        // Nothing produces 102.
        ImageReadError = 103,
        JobIsRunning = 104,
        TargetInUse = 105,
        JobStartFailed = 106,
    };
};

/// Whether the exception is one of the refusals above, and so says something of the request and not of a
/// failure on the way.
bool isRefusal(const utils::Exception& exception);

/// The code for the exception; a refusal's text goes to the error log on the way.
int verifyJobResultOf(const utils::Exception& exception) noexcept;

/// What the step returns, or the code for what it throws.
template <class Step>
int resultOf(Step&& step) noexcept {
    try {
        return step();
    } catch (const utils::Exception& exception) {
        return verifyJobResultOf(exception);
    } catch (const std::bad_alloc&) {
        core::NotedCall::noteReason(core::ReasonId::NoMemoryToPrepare);
        return VerifyJobResult::UnspecifiedError;
    } catch (...) {
        return VerifyJobResult::UnspecifiedError;
    }
}

/// What tells the methods that only verify from those that install.
struct MethodKind {
    const char* verification;      ///< "... returns: %d"
    const char* parameterVerdict;  ///< "... returned Invalid Parameter for '%s'"
    const char* subject;           ///< who cannot find an instance or does not support a source
    bool createsJob;
};

inline constexpr MethodKind kChecking{"Verification of image", "Image verification",
                                      "Checking Firmware Update", false};
inline constexpr MethodKind kInstalling{"Creation of new job", "Job creation", "Firmware Update", true};

/// Logs the registry's result and what it means for the target; returns the method's return value.
unsigned int returnValueOf(const MethodKind& kind, int verifyJobResult, const std::string& target);
