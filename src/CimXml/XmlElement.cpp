#include "CimXml/XmlElement.h"

#include "CimXml/WireError.h"
#include "CimXml/XmlGuard.h"

namespace cimxml {

void parseDocument(pugi::xml_document& document, std::string_view bytes) {
    checkWellFormed(bytes);
    // Blanks count inside VALUE, so none are dropped here; childElements() passes over those between
    // elements.
    constexpr unsigned int kOptions = pugi::parse_cdata | pugi::parse_escapes | pugi::parse_eol |
                                      pugi::parse_wconv_attribute | pugi::parse_ws_pcdata;
    const pugi::xml_parse_result result =
        document.load_buffer(bytes.data(), bytes.size(), kOptions, pugi::encoding_utf8);
    if (!result) throw WireError(WireFault::NotWellFormed, result.description());
}

std::vector<pugi::xml_node> childElements(const pugi::xml_node& element) {
    std::vector<pugi::xml_node> children;
    for (const pugi::xml_node& child : element.children()) {
        if (child.type() == pugi::node_element) {
            children.push_back(child);
        } else if (std::string_view(child.value()).find_first_not_of(" \t\r\n") != std::string_view::npos) {
            refuseElement(element, "holds text");
        }
    }
    return children;
}

pugi::xml_node onlyChild(const pugi::xml_node& element) {
    const std::vector<pugi::xml_node> children = childElements(element);
    if (children.size() != 1) refuseElement(element, "must hold one element");
    return children.front();
}

std::string requiredAttribute(const pugi::xml_node& element, const char* name) {
    const pugi::xml_attribute attribute = element.attribute(name);
    if (!attribute) refuseElement(element, std::string("has no attribute ") + name);
    return attribute.value();
}

std::string textOf(const pugi::xml_node& element) {
    std::string text;
    for (const pugi::xml_node& child : element.children()) {
        if (child.type() == pugi::node_element) refuseElement(element, "must hold text only");
        text += child.value();
    }
    return text;
}

void expectElement(const pugi::xml_node& element, std::string_view name) {
    if (!isElement(element, name)) {
        refuseElement(element, "stands where " + std::string(name) + " was expected");
    }
}

void refuseElement(const pugi::xml_node& element, std::string_view why) {
    throw WireError(WireFault::NotValid, "element " + std::string(element.name()) + " " + std::string(why));
}

}  // namespace cimxml
