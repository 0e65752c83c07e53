// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "CimXml/ElementCodec.h"
#include "CimXml/Response.h"
#include "Utils/Utils.h"

namespace cimxml {

namespace {

// A client knows no declarations, so it has nothing but the attributes to go by.
constexpr KeyTyping kTyping = KeyTyping::ByAttributes;

core::CimValue requireValue(const pugi::xml_node& element, std::optional<core::CimType> type,
                            std::optional<bool> isArray) {
    const auto value = readValue(element, type, isArray, kTyping);
    if (!value) refuseElement(element, "holds no value of its type");
    return *value;
}

core::PropertyValue readProperty(const pugi::xml_node& element) {
    core::PropertyValue property;
    property.name = requiredAttribute(element, "NAME");
    if (isElement(element, "PROPERTY.REFERENCE")) {
        property.value = requireValue(element, core::CimType::Reference, false);
        property.referenceClass = element.attribute("REFERENCECLASS").value();
        return property;
    }
    const bool isArray = isElement(element, "PROPERTY.ARRAY");
    if (!isArray) expectElement(element, "PROPERTY");
    property.value = requireValue(element, readType(element, "TYPE"), isArray);
    return property;
}

bool isBefore(std::string_view left, std::string_view right) {
    return std::ranges::lexicographical_compare(
        left, right, [](char a, char b) { return utils::lowerCase(a) < utils::lowerCase(b); });
}

/// Sorted, since a server may send many thousands; views, since most send few, thousands of times.
template <class Elements>
std::vector<std::string_view> sortedNames(const Elements& elements) {
    std::vector<std::string_view> names;
    names.reserve(elements.size());
    for (const auto& element : elements)
        names.push_back(element.name);
    std::ranges::sort(names, isBefore);
    return names;
}

}  // namespace

core::InstanceValue readInstance(const pugi::xml_node& element) {
    expectElement(element, "INSTANCE");
    core::InstanceValue instance;
    instance.path = core::CimPath(requiredAttribute(element, "CLASSNAME"), {});
    for (const pugi::xml_node& child : childElements(element)) {
        if (!isElement(child, "QUALIFIER")) instance.properties.push_back(readProperty(child));
    }
    const std::vector<std::string_view> names = sortedNames(instance.properties);
    if (std::ranges::adjacent_find(names, core::sameName) != names.end())
        refuseElement(element, "has two properties of one name");
    return instance;
}

namespace {

/// An INSTANCE does not say which of its properties are keys; the path in front of it does.
void markKeys(core::InstanceValue& instance) {
    const std::vector<std::string_view> keys = sortedNames(instance.path.getKeys());
    for (core::PropertyValue& property : instance.properties)
        property.isKey = std::ranges::binary_search(keys, property.name, isBefore);
}

/// VALUE.NAMEDINSTANCE, VALUE.OBJECTWITHPATH, VALUE.INSTANCEWITHPATH.
core::InstanceValue readInstanceWithPath(const pugi::xml_node& element) {
    const std::vector<pugi::xml_node> parts = childElements(element);
    if (parts.size() != 2) refuseElement(element, "must hold a path and an instance");
    core::InstanceValue instance = readInstance(parts[1]);
    instance.path = readObject(parts[0], kTyping).path;
    markKeys(instance);
    return instance;
}

ResultKind kindOf(const pugi::xml_node& element) {
    const auto* found = std::find(kResultElements.begin(), kResultElements.end(), element.name());
    if (found == kResultElements.end()) refuseElement(element, "is no result that is known");
    return static_cast<ResultKind>(found - kResultElements.begin());
}

void readReturned(IntrinsicResult& result, const pugi::xml_node& element) {
    result.kind = kindOf(element);
    switch (result.kind) {
        case ResultKind::Instance:
            result.instances.push_back(readInstance(element));
            break;
        case ResultKind::NamedInstances:
        case ResultKind::ObjectsWithPath:
        case ResultKind::InstancesWithPath:
            result.instances.push_back(readInstanceWithPath(element));
            break;
        case ResultKind::InstanceNames:
        case ResultKind::InstancePaths:
            result.paths.push_back(readObject(element, kTyping).path);
            break;
        case ResultKind::ObjectPaths:
            result.paths.push_back(readObject(onlyChild(element), kTyping).path);
            break;
        case ResultKind::Classes:
            result.classes.push_back(readClass(element));
            break;
        default:
            break;  // qualifier declarations and names of classes: no client here asks for them
    }
}

core::Argument readOutput(const pugi::xml_node& element) {
    expectElement(element, "PARAMVALUE");
    return {requiredAttribute(element, "NAME"),
            requireValue(element, readType(element, "PARAMTYPE"), std::nullopt)};
}

std::uint32_t readNumber(const pugi::xml_node& element, const std::string& text) {
    const auto number = utils::parseNumber<std::uint32_t>(text);
    if (!number) refuseElement(element, "is no number");
    return *number;
}

ErrorResult readError(const pugi::xml_node& element) {
    const std::uint32_t code = readNumber(element, requiredAttribute(element, "CODE"));
    // A status that this version does not know still has a number and a text to show.
    return {static_cast<core::CimStatus>(code), element.attribute("DESCRIPTION").value()};
}

IntrinsicResult readIntrinsic(const std::vector<pugi::xml_node>& parts) {
    IntrinsicResult result;
    for (const pugi::xml_node& part : parts) {
        if (isElement(part, "IRETURNVALUE")) {
            for (const pugi::xml_node& child : childElements(part))
                readReturned(result, child);
        } else {
            result.outputs.push_back(readOutput(part));
        }
    }
    return result;
}

core::MethodResult readExtrinsic(const pugi::xml_node& element, const std::vector<pugi::xml_node>& parts) {
    core::MethodResult result;
    bool hasReturned = false;
    for (const pugi::xml_node& part : parts) {
        if (!isElement(part, "RETURNVALUE")) {
            result.outputs.push_back(readOutput(part));
            continue;
        }
        // There are servers that leave the type out; the methods of this schema return uint32.
        const auto type = core::typeByName(part.attribute("PARAMTYPE").value());
        result.returnType = type.value_or(core::CimType::Uint32);
        result.returnValue = readNumber(part, textOf(onlyChild(part)));
        hasReturned = true;
    }
    // Only void methods return without a value (DSP0203), and this schema has none.
    if (!hasReturned) refuseElement(element, "has no RETURNVALUE");
    return result;
}

}  // namespace

Response readResponse(std::string_view bytes) {
    pugi::xml_document document;
    const Envelope envelope = openEnvelope(document, bytes, "SIMPLERSP");
    Response response;
    response.messageId = envelope.messageId;
    response.isMethod = isElement(envelope.content, "METHODRESPONSE");
    if (!response.isMethod) expectElement(envelope.content, "IMETHODRESPONSE");
    response.name = requiredAttribute(envelope.content, "NAME");
    const std::vector<pugi::xml_node> parts = childElements(envelope.content);
    if (!parts.empty() && isElement(parts.front(), "ERROR")) {
        response.content = readError(parts.front());
    } else if (response.isMethod) {
        response.content = readExtrinsic(envelope.content, parts);
    } else {
        response.content = readIntrinsic(parts);
    }
    return response;
}

}  // namespace cimxml
