#include "CimXml/PathReader.h"

#include <algorithm>
#include <array>
#include <utility>
#include <vector>

#include "CimXml/XmlElement.h"

namespace cimxml {

namespace {

core::CimScalar typedText(const pugi::xml_node& element, std::string text) {
    if (const auto type = core::typeByName(element.attribute("TYPE").value())) {
        return core::parseScalar(*type, text).value_or(core::CimScalar(text));
    }
    const std::string_view valueType = element.attribute("VALUETYPE").value();
    std::optional<core::CimScalar> value;
    if (core::sameName(valueType, "boolean")) {
        value = core::parseScalar(core::CimType::Boolean, text);
    } else if (core::sameName(valueType, "numeric")) {
        value = core::parseScalar(core::CimType::Uint64, text);
        if (!value) value = core::parseScalar(core::CimType::Sint64, text);
        if (!value) value = core::parseScalar(core::CimType::Real64, text);
    }
    return value.value_or(core::CimScalar(std::move(text)));
}

core::CimScalar readKeyValue(const pugi::xml_node& element, KeyTyping typing) {
    if (isElement(element, "VALUE.REFERENCE")) return readReference(element, typing);
    expectElement(element, "KEYVALUE");
    std::string text = textOf(element);
    return typing == KeyTyping::Text ? core::CimScalar(std::move(text)) : typedText(element, std::move(text));
}

core::CimPath readInstanceName(const pugi::xml_node& element, KeyTyping typing) {
    std::vector<core::CimKey> keys;
    const std::vector<pugi::xml_node> children = childElements(element);
    for (const pugi::xml_node& child : children) {
        if (isElement(child, "KEYBINDING")) {
            keys.push_back({requiredAttribute(child, "NAME"), readKeyValue(onlyChild(child), typing)});
        } else if (children.size() == 1) {
            keys.push_back({"", readKeyValue(child, typing)});
        } else {
            refuseElement(child, "stands where KEYBINDING was expected");
        }
    }
    return {requiredAttribute(element, "CLASSNAME"), std::move(keys)};
}

struct Place {
    std::string host;
    std::string namespaceName;
};

Place readPlace(const pugi::xml_node& element) {
    if (isElement(element, "LOCALNAMESPACEPATH")) return {"", readNamespace(element)};
    expectElement(element, "NAMESPACEPATH");
    const std::vector<pugi::xml_node> parts = childElements(element);
    if (parts.size() != 2) refuseElement(element, "must hold HOST and LOCALNAMESPACEPATH");
    expectElement(parts[0], "HOST");
    return {textOf(parts[0]), readNamespace(parts[1])};
}

/// The elements that put a place in front of a name.
constexpr std::array<std::string_view, 4> kPlaced{"LOCALINSTANCEPATH", "INSTANCEPATH", "LOCALCLASSPATH",
                                                  "CLASSPATH"};

bool isPlaced(const pugi::xml_node& element) {
    return std::find(kPlaced.begin(), kPlaced.end(), std::string_view(element.name())) != kPlaced.end();
}

}  // namespace

std::string readNamespace(const pugi::xml_node& element) {
    expectElement(element, "LOCALNAMESPACEPATH");
    std::string joined;
    for (const pugi::xml_node& part : childElements(element)) {
        expectElement(part, "NAMESPACE");
        if (!joined.empty()) joined += '/';
        joined += requiredAttribute(part, "NAME");
    }
    if (joined.empty()) refuseElement(element, "names no namespace");
    return joined;
}

bool isObject(const pugi::xml_node& element) {
    return isElement(element, "INSTANCENAME") || isElement(element, "CLASSNAME") || isPlaced(element);
}

ObjectName readObject(const pugi::xml_node& element, KeyTyping typing) {
    if (isElement(element, "CLASSNAME")) return {{requiredAttribute(element, "NAME"), {}}, true};
    if (isElement(element, "INSTANCENAME")) return {readInstanceName(element, typing), false};
    if (!isPlaced(element)) refuseElement(element, "names no object");
    const std::vector<pugi::xml_node> parts = childElements(element);
    if (parts.size() != 2 || isPlaced(parts[1])) refuseElement(element, "must hold a namespace and a name");
    Place place = readPlace(parts[0]);
    ObjectName object = readObject(parts[1], typing);
    object.path.setHost(std::move(place.host));
    object.path.setNamespace(place.namespaceName);
    return object;
}

core::CimPath readReference(const pugi::xml_node& element, KeyTyping typing) {
    expectElement(element, "VALUE.REFERENCE");
    return readObject(onlyChild(element), typing).path;
}

}  // namespace cimxml
