// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace indications {

inline constexpr std::size_t kLongestDestination = 1024;

/// CimError (invalid parameter) that says what is wrong with the URL of a destination: it takes http or https
/// (http where there is no scheme), a host, no name and password, and no character that is none of a URL.
/// Which machine it is, is looked at when a connection is made.
void requireDestination(const std::string& url);

}  // namespace indications
