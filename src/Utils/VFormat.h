// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdarg>
#include <string>

namespace utils {

/// The expansion of a printf format, cut at 511 characters. Private to this library.
/// @throws std::bad_alloc
std::string vformatStr(const char* format, va_list arguments) __attribute__((format(printf, 1, 0)));

}  // namespace utils
