// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Requests/CimRequests.h"

/// Reading properties of instances as plain values; what is null, absent or of another type reads as empty or
/// 0.
namespace cli {

std::string textOf(const core::InstanceValue& instance, std::string_view property);
/// Nothing for a property that holds no datetime.
std::optional<utils::Time> timeOf(const core::InstanceValue& instance, std::string_view property);
std::uint64_t numberOf(const core::InstanceValue& instance, std::string_view property);
std::vector<std::string> textsOf(const core::InstanceValue& instance, std::string_view property);
std::vector<std::uint64_t> numbersOf(const core::InstanceValue& instance, std::string_view property);

/// The value as one line for a person: strings in quotes, arrays in braces, "NULL".
std::string displayText(const core::CimValue& value);

}  // namespace cli
