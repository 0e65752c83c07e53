// SPDX-License-Identifier: Apache-2.0
#include "Utils/Exception.h"

#include <cstdarg>
#include <utility>

#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace utils {

Exception::Exception(const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    m_message = vformatStr(format, arguments);
    va_end(arguments);
    QUENX_ERROR_TEXT(m_message);
}

// The prefix tells clients whose message it is; in the log the identity of the lines does.
Exception::Exception(std::string text) : m_message("SMASHv2:" + text) {
    QUENX_ERROR_TEXT(std::move(text));
}

Exception::~Exception() noexcept = default;

const char* Exception::what() const noexcept {
    return m_message.c_str();
}

EUnspecifiedError::EUnspecifiedError(std::string message) : Exception("EUnspecifiedError:" + message) {}

EUnspecifiedError::~EUnspecifiedError() noexcept = default;

void failAssertion(const char* file, int line, const char* text) {
    throw Exception(formatStr("%s:%d: Assertion failed: '%s'", file, line, text));
}

}  // namespace utils
