// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <algorithm>
#include <optional>
#include <string>
#include <string_view>

#include "Utils/Export.h"

namespace core {

/// The data types of CIM (DSP0004 5.2.1).
enum class CimType {
    Boolean,
    String,
    Char16,
    Uint8,
    Uint16,
    Uint32,
    Uint64,
    Sint8,
    Sint16,
    Sint32,
    Sint64,
    Real32,
    Real64,
    Datetime,
    Reference
};

/// The type's name as CIM writes it: "uint16", "datetime", "reference". Never empty.
QUENX_EXPORT std::string_view typeName(CimType type);

/// The type of that name, compared without regard to case; nothing for an unknown name.
QUENX_EXPORT std::optional<CimType> typeByName(std::string_view name);

constexpr bool isUnsigned(CimType type) {
    return type >= CimType::Uint8 && type <= CimType::Uint64;
}
constexpr bool isSigned(CimType type) {
    return type >= CimType::Sint8 && type <= CimType::Sint64;
}
constexpr bool isReal(CimType type) {
    return type == CimType::Real32 || type == CimType::Real64;
}

/// CIM compares the names of classes, properties, methods and roles without regard to case (DSP0004 5.2.1).
/// Only the letters of ASCII are folded.
QUENX_EXPORT bool sameName(std::string_view left, std::string_view right);

/// The name folded to one case, for use as a key in a map.
QUENX_EXPORT std::string foldName(std::string_view name);

/// The first element whose member `name` is that name, compared likewise; null when there is none.
template <class Elements>
auto* findByName(Elements& elements, std::string_view name) {
    const auto found =
        std::ranges::find_if(elements, [&](const auto& element) { return sameName(element.name, name); });
    return found == elements.end() ? nullptr : &*found;
}

}  // namespace core
