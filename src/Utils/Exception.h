// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <exception>
#include <string>

#include "Utils/Export.h"

namespace utils {

/// The base of every failure. Constructing one writes an error line and a backtrace, so catch sites do not
/// log it again. The two constructors differ deliberately: only the one from a text prefixes the message.
class QUENX_EXPORT Exception : public std::exception {
  public:
    /// Message: the expansion of the format, cut at 511 characters, without prefix. Never pass a text that
    /// comes from outside as the format.
    explicit Exception(const char* format, ...) __attribute__((format(printf, 2, 3)));

    /// Message: "SMASHv2:" and the text; the text alone is logged.
    explicit Exception(std::string text);

    Exception(const Exception&) = default;
    Exception& operator=(const Exception&) = default;
    ~Exception() noexcept override;

    /// The message, valid while this object lives.
    const char* what() const noexcept override;

  private:
    std::string m_message;
};

/// Two uses: from a method, a caller's mistake in the arguments (the request layer answers InvalidParameter);
/// from verification, a failure without a name (return value 2). The name and the text are known to clients.
class QUENX_EXPORT EUnspecifiedError : public Exception {
  public:
    explicit EUnspecifiedError(std::string message);
    EUnspecifiedError(const EUnspecifiedError&) = default;
    EUnspecifiedError& operator=(const EUnspecifiedError&) = default;
    ~EUnspecifiedError() noexcept override;
};

/// Throws the Exception "file:line: Assertion failed: 'text'" (built from a text, so with prefix).
[[noreturn]] QUENX_EXPORT void failAssertion(const char* file, int line, const char* text);

}  // namespace utils

/// Assertions are always active. The second form gives file, line and condition text itself, for texts that
/// are fixed (such as "implementation != __null") whatever the condition looks like here.
#define QUENX_ASSERT(condition) QUENX_ASSERT_TEXT(condition, __FILE__, __LINE__, #condition)
#define QUENX_ASSERT_TEXT(condition, file, line, text)              \
    do {                                                            \
        if (!(condition)) ::utils::failAssertion(file, line, text); \
    } while (false)
