#pragma once

#include <pugixml.hpp>

#include "CimXml/PathReader.h"
#include "CimXml/Request.h"

namespace cimxml {

/// The value inside PARAMVALUE, RETURNVALUE or a property element: none (null), VALUE, VALUE.ARRAY,
/// VALUE.REFERENCE, VALUE.REFARRAY, or a bare object name where a reference is meant. The type is taken from
/// the attribute when the element has it. WireError (not valid) for anything else.
RawValue readValue(const pugi::xml_node& element, const char* typeAttribute, KeyTyping typing);

/// VALUE.ARRAY: the texts; nulls among them are only noted.
std::vector<std::string> readTexts(const pugi::xml_node& element, bool& hasNull);

/// The value as one of its own stated type (string where none is stated); nothing when a text is no such
/// value.
std::optional<core::CimValue> typedValueOf(const RawValue& raw, std::optional<core::CimType> type,
                                           bool isArray);

}  // namespace cimxml
