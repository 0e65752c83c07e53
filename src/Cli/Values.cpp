// SPDX-License-Identifier: Apache-2.0
#include "Cli/Values.h"

#include "Cli/Terminal.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

const core::CimValue* valueOf(const core::InstanceValue& instance, std::string_view property) {
    const core::PropertyValue* found = instance.find(property);
    return found == nullptr ? nullptr : &found->value;
}

template <class T>
std::optional<T> scalarOf(const core::InstanceValue& instance, std::string_view property) {
    const core::CimValue* value = valueOf(instance, property);
    const core::CimScalar* scalar = value == nullptr ? nullptr : value->scalar();
    const T* held = scalar == nullptr ? nullptr : std::get_if<T>(scalar);
    return held == nullptr ? std::nullopt : std::optional<T>(*held);
}

template <class T>
std::vector<T> elementsOf(const core::InstanceValue& instance, std::string_view property) {
    std::vector<T> result;
    const core::CimValue* value = valueOf(instance, property);
    const std::vector<core::CimScalar>* elements = value == nullptr ? nullptr : value->elements();
    if (elements == nullptr) return result;
    for (const core::CimScalar& element : *elements) {
        if (const T* held = std::get_if<T>(&element)) result.push_back(*held);
    }
    return result;
}

std::string displayScalar(core::CimType type, const core::CimScalar& value) {
    const std::string text = core::scalarText(type, value);
    const bool isText = type == core::CimType::String || type == core::CimType::Char16;
    return printable(isText ? utils::quoted(text) : text);
}

}  // namespace

std::string textOf(const core::InstanceValue& instance, std::string_view property) {
    return scalarOf<std::string>(instance, property).value_or("");
}

std::uint64_t numberOf(const core::InstanceValue& instance, std::string_view property) {
    return scalarOf<std::uint64_t>(instance, property).value_or(0);
}

std::optional<utils::Time> timeOf(const core::InstanceValue& instance, std::string_view property) {
    return scalarOf<utils::Time>(instance, property);
}

std::vector<std::string> textsOf(const core::InstanceValue& instance, std::string_view property) {
    return elementsOf<std::string>(instance, property);
}

std::vector<std::uint64_t> numbersOf(const core::InstanceValue& instance, std::string_view property) {
    return elementsOf<std::uint64_t>(instance, property);
}

std::string displayText(const core::CimValue& value) {
    if (const core::CimScalar* scalar = value.scalar()) return displayScalar(value.type, *scalar);
    const std::vector<core::CimScalar>* elements = value.elements();
    if (elements == nullptr) return "NULL";
    std::string result;
    for (const core::CimScalar& element : *elements) {
        result += (result.empty() ? "" : ", ") + displayScalar(value.type, element);
    }
    return "{" + result + "}";
}

}  // namespace cli
