// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/MethodResults.h"

#include "Providers/SoftwareUpdate/UpdateReport.h"
#include "Utils/Log.h"

namespace {

template <class T>
bool is(const utils::Exception& exception) {
    return dynamic_cast<const T*>(&exception) != nullptr;
}

using Id = core::ReasonId;

struct RefusalCode {
    bool (*isOf)(const utils::Exception&);
    int code;
    /// What the type alone says, where whoever threw it has not noted a closer one.
    Id reason;
};

constexpr RefusalCode kRefusalCodes[] = {
    {is<EJobIsRunning>, VerifyJobResult::JobIsRunning, Id::OtherAdapterUpdating},
    {is<ETargetInUse>, VerifyJobResult::TargetInUse, Id::AdapterUpdating},
    {is<EInvalidUri>, VerifyJobResult::InvalidUri, Id::UriInvalid},
    {is<EUriDoesNotExist>, VerifyJobResult::UriDoesNotExist, Id::FileMissing},
    {is<EImageReadError>, VerifyJobResult::ImageReadError, Id::FileNotRead},
    {is<EAdapterNotSupported>, VerifyJobResult::AdapterNotSupported, Id::ImageNotSupported},
    {is<utils::EInvalidParameter>, VerifyJobResult::InvalidParameter, Id::ImageDamaged},
    {is<utils::EUnspecifiedError>, VerifyJobResult::UnspecifiedError, Id::AdapterNotRead},
    {is<EDowngradeDetected>, VerifyJobResult::DowngradeDetected, Id::ImageOlder},
    {is<ENotApplicableForTarget>, VerifyJobResult::NotApplicableForTarget, Id::ImageNotApplicable},
};

/// Null for an exception that is not a refusal.
const RefusalCode* refusalOf(const utils::Exception& exception) {
    for (const RefusalCode& refusal : kRefusalCodes)
        if (refusal.isOf(exception)) return &refusal;
    return nullptr;
}

/// A line of the log is `before`, the target's path, `after`.
struct Verdict {
    int result;
    unsigned int returnValue;
    const char* before;
    const char* after;
};

// Clients know these rows as they are, the two lines that end in a blank included. InvalidParameter is not
// among them: its line depends on the method, so returnValueOf() writes it.
constexpr Verdict kVerdicts[] = {
    {VerifyJobResult::AdapterNotSupported, MethodReturn::UnsupportedTargetType,
     "Target is not supported by service for '", "'"},
    {VerifyJobResult::DowngradeDetected, MethodReturn::DowngradeNotSupported,
     "Downgrade is not supported by service for '", "'. Execute with FORCE INSTALL flag."},
    {VerifyJobResult::UnspecifiedError, MethodReturn::UnspecifiedError, "Unspecified Error for '", "'"},
    {VerifyJobResult::NotApplicableForTarget, MethodReturn::NotApplicable, "Not applicable for target for '",
     "' "},
    {VerifyJobResult::InvalidUri, MethodReturn::InvalidParameter, "Invalid URI for '", "'"},
    {VerifyJobResult::UriDoesNotExist, MethodReturn::InvalidParameter, "URI does not exists for '", "'"},
    {VerifyJobResult::ImageReadError, MethodReturn::UnspecifiedError, "Job cannot read the URI for '", "'"},
    {VerifyJobResult::JobIsRunning, MethodReturn::UnspecifiedError, "Other job is in progress '", "'"},
    {VerifyJobResult::TargetInUse, MethodReturn::InUse, "Target '", "' is in update state at this moment"},
    {VerifyJobResult::JobStartFailed, MethodReturn::Failed, "Failed to start job for '", "' "},
};

}  // namespace

bool isRefusal(const utils::Exception& exception) {
    return refusalOf(exception) != nullptr;
}

int verifyJobResultOf(const utils::Exception& exception) noexcept {
    UpdateReport::noteReason(exception.what());
    const RefusalCode* refusal = refusalOf(exception);
    // What is not a refusal has logged itself, if it could.
    if (refusal == nullptr) return VerifyJobResult::UnspecifiedError;
    core::NotedCall::noteReason(refusal->reason);
    QUENX_ERROR("Exception: '%s'", exception.what());
    return refusal->code;
}

unsigned int returnValueOf(const MethodKind& kind, int verifyJobResult, const std::string& target) {
    QUENX_DEBUG("%s returns: %d", kind.verification, verifyJobResult);
    if (verifyJobResult == VerifyJobResult::InvalidParameter) {
        QUENX_DEBUG("%s returned Invalid Parameter for '%s'", kind.parameterVerdict, target.c_str());
        return MethodReturn::InvalidParameter;
    }
    for (const Verdict& verdict : kVerdicts) {
        if (verdict.result != verifyJobResult) continue;
        QUENX_DEBUG("%s%s%s", verdict.before, target.c_str(), verdict.after);
        return verdict.returnValue;
    }
    // Nothing above matched, so it is a success: registries may have numbers that are not known here.
    return kind.createsJob ? MethodReturn::JobStarted : MethodReturn::Completed;
}
