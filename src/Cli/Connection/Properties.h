// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Requests/CimOperations.h"

/// Reading properties of instances as plain values.
namespace cli {

/// Nothing for a property that is null, absent or of another type.
template <class T>
std::optional<T> valueOf(const core::InstanceValue& instance, std::string_view name) {
    const core::PropertyValue* property = instance.find(name);
    const core::CimScalar* scalar = property == nullptr ? nullptr : property->value.scalar();
    const T* held = scalar == nullptr ? nullptr : std::get_if<T>(scalar);
    return held == nullptr ? std::nullopt : std::optional<T>(*held);
}

/// Empty where valueOf() gives nothing.
inline std::string textOf(const core::InstanceValue& instance, std::string_view name) {
    return valueOf<std::string>(instance, name).value_or("");
}

/// 0 where valueOf() gives nothing.
inline std::uint64_t numberOf(const core::InstanceValue& instance, std::string_view name) {
    return valueOf<std::uint64_t>(instance, name).value_or(0);
}

/// The elements of an array of strings; none where the property is anything else.
inline std::vector<std::string> textsOf(const core::InstanceValue& instance, std::string_view name) {
    const core::PropertyValue* property = instance.find(name);
    std::vector<std::string> texts;
    if (property == nullptr || property->value.elements() == nullptr) return texts;
    for (const core::CimScalar& element : *property->value.elements()) {
        if (const auto* text = std::get_if<std::string>(&element)) texts.push_back(*text);
    }
    return texts;
}

}  // namespace cli
