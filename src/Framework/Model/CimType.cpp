// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimType.h"

#include <array>

#include "Utils/Utils.h"

namespace core {

namespace {

constexpr std::array<std::string_view, 15> kTypeNames = {
    "boolean", "string", "char16", "uint8",  "uint16", "uint32",   "uint64",   "sint8",
    "sint16",  "sint32", "sint64", "real32", "real64", "datetime", "reference"};

}  // namespace

std::string_view typeName(CimType type) {
    return kTypeNames[static_cast<std::size_t>(type)];
}

std::optional<CimType> typeByName(std::string_view name) {
    for (std::size_t i = 0; i < kTypeNames.size(); ++i) {
        if (sameName(name, kTypeNames[i])) return static_cast<CimType>(i);
    }
    return std::nullopt;
}

bool sameName(std::string_view left, std::string_view right) {
    return utils::equalsIgnoringCase(left, right);
}

std::string foldName(std::string_view name) {
    return utils::lowerCase(name);
}

}  // namespace core
