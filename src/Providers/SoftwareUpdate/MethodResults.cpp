#include "Providers/SoftwareUpdate/MethodResults.h"

#include "Providers/SoftwareUpdate/VerifyJobResult.h"
#include "Utils/Log.h"

const MethodTraits kCheckSoftwareIdentity{"Quenx_SoftwareInstallationService::CheckSoftwareIdentity",
                                          "Verification of image",
                                          "Image verification",
                                          "Checking Firmware Update",
                                          "Both Target and Collection are defined",
                                          false};
const MethodTraits kInstallFromUri{"Quenx_SoftwareInstallationService::InstallFromURI",
                                   "Creation of new job",
                                   "Job creation",
                                   "Firmware Update",
                                   nullptr,
                                   true};
const MethodTraits kInstallFromSoftwareIdentity{
    "Quenx_SoftwareInstallationService::InstallFromSoftwareIdentity",
    "Creation of new job",
    "Job creation",
    "Firmware Update",
    "Target and Collection are defined",
    true};
const MethodTraits kCheckImage{"Quenx_SoftwareInstallationService::checkImage",
                               "Verification of image",
                               "Image verification",
                               "Checking Firmware Update",
                               nullptr,
                               false};

namespace {

/// A line of the log is `before`, the target's path, `after`.
struct Verdict {
    int result;
    unsigned int returnValue;
    const char* before;
    const char* after;
};

// Two lines end in a blank, a job that runs is "unspecified" while a target in use is "in use", and an image
// that cannot be read is "unspecified" while one that is not there is an invalid parameter: all intended.
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

unsigned int returnValueOf(const MethodTraits& method, int verifyJobResult, const std::string& target) {
    QUENX_DEBUG("%s returns: %d", method.verification, verifyJobResult);
    if (verifyJobResult == VerifyJobResult::InvalidParameter) {
        QUENX_DEBUG("%s returned Invalid Parameter for '%s'", method.parameterVerdict, target.c_str());
        return MethodReturn::InvalidParameter;
    }
    for (const Verdict& verdict : kVerdicts) {
        if (verdict.result != verifyJobResult) continue;
        QUENX_DEBUG("%s%s%s", verdict.before, target.c_str(), verdict.after);
        return verdict.returnValue;
    }
    return method.createsJob ? MethodReturn::JobStarted : MethodReturn::Completed;
}
