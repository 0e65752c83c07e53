// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/Parameters.h"

#include "Framework/Model/CimError.h"

namespace host {

namespace {

using cimxml::Parameter;
using cimxml::ParameterValue;
using core::CimType;

[[noreturn]] void refuse(const std::string& text) {
    throw core::CimError(core::CimStatus::InvalidParameter, text);
}

/// Booleans and numbers come as texts, and whether they can be read shows here: the accessors rely on it.
bool isOfKind(ParameterKind kind, const ParameterValue& value) {
    const auto* text = std::get_if<std::string>(&value);
    switch (kind) {
        case ParameterKind::ClassName:
            return std::holds_alternative<cimxml::ClassName>(value);
        case ParameterKind::InstanceName:
            return std::holds_alternative<core::CimPath>(value);
        case ParameterKind::ObjectName:
            return std::holds_alternative<core::CimPath>(value) ||
                   std::holds_alternative<cimxml::ClassName>(value);
        case ParameterKind::Boolean:
            return text != nullptr && core::parseScalar(CimType::Boolean, *text).has_value();
        case ParameterKind::Number:
            return text != nullptr && core::parseScalar(CimType::Uint32, *text).has_value();
        case ParameterKind::Text:
            return text != nullptr;
        case ParameterKind::TextList:
            return text != nullptr || std::holds_alternative<std::vector<std::string>>(value);
        case ParameterKind::Instance:
            return std::holds_alternative<cimxml::InstanceBody>(value);
    }
    return false;
}

bool isNull(const ParameterValue& value) {
    return std::holds_alternative<std::monostate>(value);
}

}  // namespace

Parameters::Parameters(const cimxml::IntrinsicCall& call, std::span<const ParameterSpec> allowed)
    : m_call(call) {
    for (const Parameter& parameter : call.parameters) {
        const ParameterSpec* known = core::findByName(allowed, parameter.name);
        if (known == nullptr) refuse(call.operation + " has no parameter " + parameter.name);
        // Which of two values counts would be anybody's guess.
        if (core::findByName(call.parameters, parameter.name) != &parameter)
            refuse(parameter.name + " is given twice");
        if (!isNull(parameter.value) && !isOfKind(known->kind, parameter.value)) {
            refuse(parameter.name + " is a value of another kind");
        }
    }
    for (const ParameterSpec& known : allowed) {
        if (known.required && !isGiven(known.name)) refuse(std::string(known.name) + " is missing");
    }
}

const ParameterValue* Parameters::find(std::string_view name) const {
    const Parameter* parameter = core::findByName(m_call.parameters, name);
    return parameter == nullptr || isNull(parameter->value) ? nullptr : &parameter->value;
}

bool Parameters::flag(std::string_view name, bool otherwise) const {
    const ParameterValue* value = find(name);
    if (value == nullptr) return otherwise;
    // That it can be read was seen when the call was checked.
    return std::get<bool>(*core::parseScalar(CimType::Boolean, std::get<std::string>(*value)));
}

std::optional<std::uint32_t> Parameters::number(std::string_view name) const {
    const ParameterValue* value = find(name);
    if (value == nullptr) return std::nullopt;
    const auto scalar = core::parseScalar(CimType::Uint32, std::get<std::string>(*value));
    return static_cast<std::uint32_t>(std::get<std::uint64_t>(*scalar));
}

std::string Parameters::text(std::string_view name) const {
    const ParameterValue* value = find(name);
    return value == nullptr ? "" : std::get<std::string>(*value);
}

std::string Parameters::className(std::string_view name) const {
    const ParameterValue* value = find(name);
    return value == nullptr ? "" : std::get<cimxml::ClassName>(*value).name;
}

core::PropertyFilter Parameters::list(std::string_view name) const {
    const ParameterValue* value = find(name);
    if (value == nullptr) return std::nullopt;
    // A list of one may come as the one.
    if (const auto* text = std::get_if<std::string>(value)) return core::PropertyFilter({*text});
    return std::get<std::vector<std::string>>(*value);
}

core::CimPath Parameters::path(std::string_view name) const {
    const ParameterValue* value = find(name);
    if (value == nullptr) return {};
    const auto* path = std::get_if<core::CimPath>(value);
    return path != nullptr ? *path : core::CimPath(className(name), {});
}

const cimxml::InstanceBody& Parameters::instance(std::string_view name) const {
    return std::get<cimxml::InstanceBody>(*find(name));
}

bool Parameters::isClassName(std::string_view name) const {
    const ParameterValue* value = find(name);
    return value != nullptr && std::holds_alternative<cimxml::ClassName>(*value);
}

}  // namespace host
