#pragma once

#include <pugixml.hpp>
#include <string>
#include <string_view>
#include <vector>

namespace cimxml {

/// Checks the bytes (see checkWellFormed) and builds the tree. WireError when they are no document.
void parseDocument(pugi::xml_document& document, std::string_view bytes);

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
