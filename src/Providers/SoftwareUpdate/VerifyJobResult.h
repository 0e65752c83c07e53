#pragma once

namespace utils {
class Exception;
}

/// What the job registry answers a request with. An int and no closed set: whatever is not listed counts as
/// success.
namespace VerifyJobResult {

inline constexpr int Success = 0;
inline constexpr int InvalidParameter = 1;
inline constexpr int AdapterNotSupported = 2;
inline constexpr int DowngradeDetected = 3;
inline constexpr int UnspecifiedError = 4;
inline constexpr int NotApplicableForTarget = 5;
inline constexpr int InvalidUri = 100;
inline constexpr int UriDoesNotExist = 101;
// 102 is never produced; the gap is intended.
inline constexpr int ImageReadError = 103;
inline constexpr int JobIsRunning = 104;
inline constexpr int TargetInUse = 105;
inline constexpr int JobStartFailed = 106;

}  // namespace VerifyJobResult

/// True for the exceptions of UpdateExceptions.h: the image, the adapter or the options were judged. Anything
/// else is a failure on the way there.
bool isRefusal(const utils::Exception& exception);

/// The code for the exception that is being handled; a refusal's text goes to the error log on the way.
/// Call it within a catch block only. Never throws.
int verifyJobResultOfCurrentException() noexcept;
