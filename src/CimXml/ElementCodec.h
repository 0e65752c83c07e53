// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <pugixml.hpp>
#include <string>
#include <string_view>
#include <vector>

#include "CimXml/Xml.h"
#include "Framework/Model/ClassDeclaration.h"
#include "Framework/Requests/CimOperations.h"

namespace cimxml {

/// What a message carries, with the wrapping taken off.
struct Envelope {
    std::string messageId;
    pugi::xml_node content;  ///< the call or the response; lives as long as the document
};

/// Reads the bytes into the document and opens CIM, MESSAGE and SIMPLEREQ or SIMPLERSP, as named. Any minor
/// version is taken. Throws WireError.
Envelope openEnvelope(pugi::xml_document& document, std::string_view bytes, std::string_view wrapper);

/// Writes the same in front of a message's content, and behind it.
void startEnvelope(XmlWriter& writer, std::string_view messageId, std::string_view wrapper);
void endEnvelope(XmlWriter& writer, std::string_view wrapper);

// Reading what is inside: the elements that requests and responses have in common. Whatever a reader finds
// wrong with them is WireError (not valid).

/// The child elements, in order. Refuses text between them.
std::vector<pugi::xml_node> childElements(const pugi::xml_node& element);

/// The one child element. Refuses none, and more than one.
pugi::xml_node onlyChild(const pugi::xml_node& element);

/// The value of an attribute that must be there.
std::string requiredAttribute(const pugi::xml_node& element, const char* name);

/// The text of an element that holds nothing but text, blanks included.
std::string textOf(const pugi::xml_node& element);

inline bool isElement(const pugi::xml_node& element, std::string_view name) {
    return name == element.name();
}

/// Refuses an element of another name.
void expectElement(const pugi::xml_node& element, std::string_view name);

/// Throws WireError (not valid) that names the element.
[[noreturn]] void refuseElement(const pugi::xml_node& element, std::string_view why);

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
/// unnamed key gets the empty name. Keys may refer to others three levels deep.
ObjectName readObject(const pugi::xml_node& element, KeyTyping typing);

/// VALUE.REFERENCE.
core::CimPath readReference(const pugi::xml_node& element, KeyTyping typing);

/// The type that the attribute names; nothing when the element lacks the attribute.
std::optional<core::CimType> readType(const pugi::xml_node& element, const char* attribute);

/// The value inside PARAMVALUE, QUALIFIER or a property element: none (null), VALUE, VALUE.ARRAY,
/// VALUE.REFERENCE, VALUE.REFARRAY, or a bare object name where a reference is meant. What the caller does
/// not know, the type or whether it is an array, the element inside decides; its texts are then strings.
/// Nothing for a value that is not of the type, or an array that holds a null.
std::optional<core::CimValue> readValue(const pugi::xml_node& element, std::optional<core::CimType> type,
                                        std::optional<bool> isArray, KeyTyping typing);

/// CLASS, as a client reads it: what is a key, an output and an association is taken from the qualifiers.
core::ClassDeclaration readClass(const pugi::xml_node& element);

/// The type of what is held, the widest of its kind.
core::CimType typeOfScalar(const core::CimScalar& value);

// Writing.

/// LOCALNAMESPACEPATH of the namespace's parts.
void writeNamespace(XmlWriter& writer, std::string_view namespaceName);

/// CLASSNAME.
void writeClassName(XmlWriter& writer, std::string_view name);

/// INSTANCENAME, with references among the keys as LOCALINSTANCEPATH.
void writeInstanceName(XmlWriter& writer, const core::CimPath& path);

/// LOCALINSTANCEPATH or LOCALCLASSPATH, whichever the path is.
void writeLocalPath(XmlWriter& writer, const core::CimPath& path);

/// INSTANCEPATH; the host stands in for one that the path does not have.
void writeInstancePath(XmlWriter& writer, const core::CimPath& path, std::string_view host);

/// VALUE, VALUE.ARRAY, VALUE.REFERENCE or VALUE.REFARRAY; nothing for null.
void writeValue(XmlWriter& writer, const core::CimValue& value);

/// VALUE with a text.
void writeText(XmlWriter& writer, std::string_view text);

/// VALUE of a cell, KEYVALUE, and what is inside of both.
void writeCell(XmlWriter& writer, const core::CimCell& cell);
void writeKeyValue(XmlWriter& writer, const core::CimCell& cell);
void writeCellText(XmlWriter& writer, const core::CimCell& cell);

/// The start of KEYVALUE for a value of the type.
void startKeyValue(XmlWriter& writer, core::CimType type);

/// PARAMVALUE, with its type unless the argument has none of its own.
void writeArgument(XmlWriter& writer, const core::Argument& argument);

/// The element of a property of that type: PROPERTY, PROPERTY.ARRAY or PROPERTY.REFERENCE.
std::string_view propertyElement(core::CimType type, bool isArray);

/// The start of that element, with its name and type.
void startProperty(XmlWriter& writer, std::string_view name, core::CimType type, bool isArray);

/// INSTANCE, as a client reads it: the class in its path alone. Refuses two properties of one name.
core::InstanceValue readInstance(const pugi::xml_node& element);

/// INSTANCE. Null properties are written as elements without a value.
void writeInstance(XmlWriter& writer, const core::InstanceValue& instance);

/// What an enumeration answers for an instance: VALUE.NAMEDINSTANCE.
void writeNamedInstance(XmlWriter& writer, const core::InstanceValue& instance);

/// The response message of an intrinsic operation, up to what IRETURNVALUE holds, and behind it.
void startResult(XmlWriter& writer, std::string_view messageId, std::string_view operation);
void endResult(XmlWriter& writer);

/// CLASS. The flavors of its qualifiers are those of their declarations.
void writeClass(XmlWriter& writer, const core::ClassDeclaration& declaration);

/// QUALIFIER.DECLARATION.
void writeQualifierDeclaration(XmlWriter& writer, const core::QualifierDeclaration& declaration);

}  // namespace cimxml
