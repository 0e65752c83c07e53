#pragma once

#include <string>

/// Return values of the extrinsic methods: the DMTF value map of CIM_SoftwareInstallationService, as far as
/// used.
namespace MethodReturn {

inline constexpr unsigned int Completed = 0;
inline constexpr unsigned int UnspecifiedError = 2;
inline constexpr unsigned int Failed = 4;
inline constexpr unsigned int InvalidParameter = 5;
inline constexpr unsigned int InUse = 6;
inline constexpr unsigned int JobStarted = 4096;
inline constexpr unsigned int UnsupportedTargetType = 4097;
inline constexpr unsigned int DowngradeNotSupported = 4099;
inline constexpr unsigned int InsufficientMemory = 4100;
inline constexpr unsigned int NotApplicable = 4106;
inline constexpr unsigned int CollectionNotSupported = 4108;

}  // namespace MethodReturn

/// What tells the three methods and the check in process apart. The differences between the texts are
/// intended.
struct MethodTraits {
    const char* name;              ///< labels the call in the log
    const char* verification;      ///< "... returns: %d"
    const char* parameterVerdict;  ///< "... returned Invalid Parameter for '%s'"
    const char* subject;           ///< who cannot find an instance or does not support a source
    const char* bothGiven;         ///< the error for a Target and a Collection; null for no Collection at all
    bool createsJob;
};

extern const MethodTraits kCheckSoftwareIdentity;
extern const MethodTraits kInstallFromUri;
extern const MethodTraits kInstallFromSoftwareIdentity;
extern const MethodTraits kCheckImage;

/// Logs the verification's result and what it means for the target; returns the method's return value.
unsigned int returnValueOf(const MethodTraits& method, int verifyJobResult, const std::string& target);
