// SPDX-License-Identifier: Apache-2.0
#include <new>

#include "CimXml/ElementCodec.h"

#include "CimXml/WireError.h"

namespace cimxml {

namespace {

constexpr std::size_t kLongestMessageId = 1024;

void parseDocument(pugi::xml_document& document, std::string_view bytes) {
    checkWellFormed(bytes);
    // Blanks count inside VALUE, so none are dropped here; readers pass over those between elements.
    constexpr unsigned int kOptions = pugi::parse_cdata | pugi::parse_escapes | pugi::parse_eol |
                                      pugi::parse_wconv_attribute | pugi::parse_ws_pcdata;
    const pugi::xml_parse_result result =
        document.load_buffer(bytes.data(), bytes.size(), kOptions, pugi::encoding_utf8);
    // Says nothing of the document: asked again later, it may be read.
    if (result.status == pugi::status_out_of_memory) throw std::bad_alloc();
    if (!result) throw WireError(faults::kNotWellFormed, result.description());
}

/// Only the major version tells of another language; a client may use any minor one.
void checkVersion(const pugi::xml_node& element, const char* attribute, std::string_view major,
                  WireFault fault) {
    const std::string version = requiredAttribute(element, attribute);
    if (!version.starts_with(major)) {
        throw WireError(fault,
                        std::string(attribute) + " is " + version + ", not " + std::string(major) + "x");
    }
}

/// The call or response, after the correlators that may stand in front of it (DSP0201 5.2.3.2).
pugi::xml_node contentOf(const pugi::xml_node& wrapper) {
    pugi::xml_node content;
    for (const pugi::xml_node& child : childElements(wrapper)) {
        if (isElement(child, "CORRELATOR") && !content) continue;
        if (content) refuseElement(wrapper, "must hold one call or response");
        content = child;
    }
    if (!content) refuseElement(wrapper, "is empty");
    return content;
}

}  // namespace

Envelope openEnvelope(pugi::xml_document& document, std::string_view bytes, std::string_view wrapper) {
    parseDocument(document, bytes);
    const pugi::xml_node root = document.document_element();
    expectElement(root, "CIM");
    checkVersion(root, "CIMVERSION", "2.", faults::kUnsupportedCimVersion);
    checkVersion(root, "DTDVERSION", "2.", faults::kUnsupportedDtdVersion);
    const pugi::xml_node message = onlyChild(root);
    expectElement(message, "MESSAGE");
    Envelope envelope;
    envelope.messageId = requiredAttribute(message, "ID");
    // The answer repeats it, escaped, and nobody's budget knows of it beforehand.
    if (envelope.messageId.size() > kLongestMessageId)
        throw WireError(faults::kNotValid, "the ID of MESSAGE is longer than 1024 bytes");
    checkVersion(message, "PROTOCOLVERSION", "1.", faults::kUnsupportedProtocol);
    const pugi::xml_node wrapped = onlyChild(message);
    // Refused by its own name, so that a client that can batch falls back to single requests.
    if (isElement(wrapped, "MULTIREQ")) {
        throw WireError(faults::kMultipleRequests, "several requests in one message");
    }
    expectElement(wrapped, wrapper);
    envelope.content = contentOf(wrapped);
    return envelope;
}

void startEnvelope(XmlWriter& writer, std::string_view messageId, std::string_view wrapper) {
    // There are clients that refuse a message without the XML declaration.
    writer.raw("<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\">");
    writer.start("MESSAGE").attribute("ID", messageId).attribute("PROTOCOLVERSION", "1.0").content();
    writer.open(wrapper);
}

void endEnvelope(XmlWriter& writer, std::string_view wrapper) {
    writer.end(wrapper).end("MESSAGE").end("CIM");
    writer.raw("\n");
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

// The messages name the element, because a client's author sees nothing else of what the server made of it.
std::string requiredAttribute(const pugi::xml_node& element, const char* name) {
    const pugi::xml_attribute attribute = element.attribute(name);
    if (!attribute) refuseElement(element, std::string("has no attribute ") + name);
    return attribute.value();
}

std::string textOf(const pugi::xml_node& element) {
    // A comment or a CDATA section cuts one text into several nodes.
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
    throw WireError(faults::kNotValid, "element " + std::string(element.name()) + " " + std::string(why));
}

}  // namespace cimxml
