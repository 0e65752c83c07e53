// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/VersionText.h"

#include <algorithm>
#include <string>

#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

using Fields = utils::StringArray;

/// Nothing where a field is empty or has anything but digits.
std::optional<Fields> decimalFields(std::string_view text) {
    Fields fields = utils::split(text, '.');
    const auto isNumber = [](const std::string& field) {
        return !field.empty() && std::ranges::all_of(field, utils::isDigit);
    };
    return std::ranges::all_of(fields, isNumber) ? std::optional(std::move(fields)) : std::nullopt;
}

/// Makers count builds and dates in fields, which no integer type is sure to hold.
std::strong_ordering compareFields(std::string_view left, std::string_view right) {
    left.remove_prefix(std::min(left.find_first_not_of('0'), left.size()));
    right.remove_prefix(std::min(right.find_first_not_of('0'), right.size()));
    const auto byLength = left.size() <=> right.size();
    return byLength != 0 ? byLength : left.compare(right) <=> 0;
}

}  // namespace

std::uint32_t versionNumber(std::string_view text) {
    constexpr std::size_t kMostFields = 4;
    const Fields fields = utils::split(text, '.');
    if (fields.size() > kMostFields) return 0;
    std::uint32_t number = 0;
    for (std::size_t index = 0; index < kMostFields; ++index) {
        const auto field =
            index < fields.size() ? utils::parseNumber<std::uint8_t>(fields[index]) : std::uint8_t{0};
        if (!field) return 0;
        number = number << 8 | *field;
    }
    return number;
}

std::optional<std::strong_ordering> compareVersions(std::string_view left, std::string_view right) {
    if (left == right) return std::strong_ordering::equal;
    const auto leftFields = decimalFields(left);
    const auto rightFields = decimalFields(right);
    if (!leftFields || !rightFields) return std::nullopt;
    for (std::size_t index = 0; index < std::max(leftFields->size(), rightFields->size()); ++index) {
        const auto order = compareFields(index < leftFields->size() ? (*leftFields)[index] : "",
                                         index < rightFields->size() ? (*rightFields)[index] : "");
        if (order != 0) return order;
    }
    return std::strong_ordering::equal;
}

}  // namespace ma::devlink
