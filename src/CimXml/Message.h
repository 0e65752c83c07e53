// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <pugixml.hpp>
#include <string>
#include <string_view>
#include <vector>

#include "CimXml/Xml.h"

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

// The elements inside. All that a reader finds wrong with them is WireError (not valid).

/// The child elements, in order. WireError (not valid) when there is text between them.
std::vector<pugi::xml_node> childElements(const pugi::xml_node& element);

/// The one child element. WireError (not valid) when there is none or more than one.
pugi::xml_node onlyChild(const pugi::xml_node& element);

/// The value of an attribute that must be there; WireError (not valid) when it is not.
std::string requiredAttribute(const pugi::xml_node& element, const char* name);

/// The text of an element that holds nothing but text, blanks included. WireError (not valid) for one that
/// holds elements.
std::string textOf(const pugi::xml_node& element);

inline bool isElement(const pugi::xml_node& element, std::string_view name) {
    return name == element.name();
}

/// WireError (not valid) unless the element has that name.
void expectElement(const pugi::xml_node& element, std::string_view name);

/// Throws WireError (not valid) that names the element.
[[noreturn]] void refuseElement(const pugi::xml_node& element, std::string_view why);

}  // namespace cimxml
