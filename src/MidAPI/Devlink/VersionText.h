// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <compare>
#include <cstdint>
#include <optional>
#include <string_view>

#include "Utils/Export.h"

/// Versions as drivers and packages write them: free texts, most of them numbers with dots between. Free of
/// state; any thread may call.
namespace ma::devlink {

/// A version of one to four decimal fields, each below 256, as one number: the first field in the highest
/// byte, so that numbers are ordered as versions are ("1.2" is 0x01020000). 0 for any other text.
QUENX_EXPORT std::uint32_t versionNumber(std::string_view text);

/// How two versions of decimal fields compare, field by field; fields that one does not have count as 0, and
/// a field may be of any length. Nothing where a field is not a number, unless the texts are the same.
QUENX_EXPORT std::optional<std::strong_ordering> compareVersions(std::string_view left,
                                                                 std::string_view right);

}  // namespace ma::devlink
