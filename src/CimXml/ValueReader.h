// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <pugixml.hpp>
#include <string>
#include <vector>

#include "CimXml/Request.h"

namespace cimxml {

/// How the keys of paths are read.
enum class KeyTyping {
    Text,         ///< as texts: a server knows the declared types and goes by them alone
    ByAttributes  ///< by TYPE or else VALUETYPE: a client has nothing better
};

/// An object as a message names it. A class has no keys; an instance may lack them too, which only isClass
/// tells apart.
struct ObjectName {
    core::CimPath path;
    bool isClass = false;
};

/// LOCALNAMESPACEPATH: the names joined by slashes.
std::string readNamespace(const pugi::xml_node& element);

/// Any of INSTANCENAME, LOCALINSTANCEPATH, INSTANCEPATH, CLASSNAME, LOCALCLASSPATH, CLASSPATH. A single
/// unnamed key gets the empty name. WireError (not valid) for anything else, here and below.
ObjectName readObject(const pugi::xml_node& element, KeyTyping typing);

/// Whether readObject() takes elements of that name.
bool isObject(const pugi::xml_node& element);

/// VALUE.REFERENCE.
core::CimPath readReference(const pugi::xml_node& element, KeyTyping typing);

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
