// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <array>
#include <utility>

#include "CimXml/ElementCodec.h"

namespace cimxml {

namespace {

/// TYPE is precise where it is there; VALUETYPE tells numbers from texts but not their width.
std::optional<core::CimScalar> typedKey(const pugi::xml_node& element, const std::string& text) {
    if (const auto type = core::typeByName(element.attribute("TYPE").value()))
        return core::parseScalar(*type, text);
    const std::string_view valueType = element.attribute("VALUETYPE").value();
    if (core::sameName(valueType, "boolean")) return core::parseScalar(core::CimType::Boolean, text);
    if (!core::sameName(valueType, "numeric")) return std::nullopt;
    auto number = core::parseScalar(core::CimType::Uint64, text);
    if (!number) number = core::parseScalar(core::CimType::Sint64, text);
    return number ? number : core::parseScalar(core::CimType::Real64, text);
}

/// How paths are read, and how deep inside the keys of others.
struct Reading {
    KeyTyping typing;
    unsigned depth = 0;

    /// For a key that is a path itself. Each level doubles the quotes and backslashes of those inside when
    /// the path is written as a text, so a small message could take all memory.
    Reading inside(const pugi::xml_node& key) const {
        constexpr unsigned kDeepest = 3;
        if (depth == kDeepest)
            refuseElement(key, "lies more than three references deep in the keys of a path");
        return {typing, depth + 1};
    }
};

ObjectName readObjectAt(const pugi::xml_node& element, const Reading& reading);

core::CimPath readReferenceAt(const pugi::xml_node& element, const Reading& reading) {
    expectElement(element, "VALUE.REFERENCE");
    return readObjectAt(onlyChild(element), reading).path;
}

core::CimScalar readKeyValue(const pugi::xml_node& element, const Reading& reading) {
    if (isElement(element, "VALUE.REFERENCE")) return readReferenceAt(element, reading.inside(element));
    expectElement(element, "KEYVALUE");
    std::string text = textOf(element);
    if (reading.typing == KeyTyping::ByAttributes) {
        if (auto typed = typedKey(element, text)) return std::move(*typed);
    }
    // Also one that is not of its stated type: a foreign server's path has to be sent back as it came.
    return text;
}

core::CimPath readInstanceName(const pugi::xml_node& element, const Reading& reading) {
    std::vector<core::CimKey> keys;
    const std::vector<pugi::xml_node> children = childElements(element);
    for (const pugi::xml_node& child : children) {
        if (isElement(child, "KEYBINDING")) {
            keys.push_back({requiredAttribute(child, "NAME"), readKeyValue(onlyChild(child), reading)});
        } else if (children.size() == 1) {
            // The key of a class with a single one may go without its name (DSP0201 5.2.2.2).
            keys.push_back({"", readKeyValue(child, reading)});
        } else {
            refuseElement(child, "stands where KEYBINDING was expected");
        }
    }
    return {requiredAttribute(element, "CLASSNAME"), std::move(keys)};
}

/// Sets the host, if the element has one, and the namespace: NAMESPACEPATH or LOCALNAMESPACEPATH.
void readLocation(const pugi::xml_node& element, core::CimPath& path) {
    if (isElement(element, "LOCALNAMESPACEPATH")) {
        path.setNamespace(readNamespace(element));
        return;
    }
    expectElement(element, "NAMESPACEPATH");
    const std::vector<pugi::xml_node> parts = childElements(element);
    if (parts.size() != 2) refuseElement(element, "must hold HOST and LOCALNAMESPACEPATH");
    expectElement(parts[0], "HOST");
    path.setHost(textOf(parts[0]));
    path.setNamespace(readNamespace(parts[1]));
}

/// Whether the element puts a namespace in front of a name.
bool isFullPath(const pugi::xml_node& element) {
    constexpr std::array<std::string_view, 4> kFullPaths{"LOCALINSTANCEPATH", "INSTANCEPATH",
                                                         "LOCALCLASSPATH", "CLASSPATH"};
    return std::ranges::find(kFullPaths, std::string_view(element.name())) != kFullPaths.end();
}

/// One VALUE of the type; nothing when its text is no such value.
std::optional<core::CimScalar> readText(const pugi::xml_node& element, core::CimType type) {
    expectElement(element, "VALUE");
    std::string text = textOf(element);
    // Most values are strings, and a large answer has many thousands.
    if (type == core::CimType::String) return core::CimScalar(std::move(text));
    // A path written as a text would be guessed at: a reference has an element of its own.
    if (type == core::CimType::Reference) return std::nullopt;
    return core::parseScalar(type, text);
}

ObjectName readObjectAt(const pugi::xml_node& element, const Reading& reading) {
    if (isElement(element, "CLASSNAME")) return {{requiredAttribute(element, "NAME"), {}}, true};
    if (isElement(element, "INSTANCENAME")) return {readInstanceName(element, reading), false};
    if (!isFullPath(element)) refuseElement(element, "names no object");
    const std::vector<pugi::xml_node> parts = childElements(element);
    // A full path inside a full path would let a message nest without end.
    if (parts.size() != 2 || isFullPath(parts[1])) refuseElement(element, "must hold a namespace and a name");
    ObjectName object = readObjectAt(parts[1], reading);
    readLocation(parts[0], object.path);
    return object;
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

ObjectName readObject(const pugi::xml_node& element, KeyTyping typing) {
    return readObjectAt(element, {typing});
}

core::CimPath readReference(const pugi::xml_node& element, KeyTyping typing) {
    return readReferenceAt(element, {typing});
}

std::optional<core::CimType> readType(const pugi::xml_node& element, const char* attribute) {
    const pugi::xml_attribute name = element.attribute(attribute);
    if (!name) return std::nullopt;
    const auto type = core::typeByName(name.value());
    if (!type) refuseElement(element, "has an unknown type");
    return type;
}

std::optional<core::CimValue> readValue(const pugi::xml_node& element, std::optional<core::CimType> type,
                                        std::optional<bool> isArray, KeyTyping typing) {
    using core::CimType;
    if (childElements(element).empty())
        return core::CimValue::null(type.value_or(CimType::String), isArray.value_or(false));
    const pugi::xml_node value = onlyChild(element);
    const bool holdsTexts = isElement(value, "VALUE") || isElement(value, "VALUE.ARRAY");
    const bool holdsArray = isElement(value, "VALUE.ARRAY") || isElement(value, "VALUE.REFARRAY");
    const CimType known = type.value_or(holdsTexts ? CimType::String : CimType::Reference);
    // Read to the end even after a value that does not fit: a message that is not valid is refused as such.
    bool fits = isArray.value_or(holdsArray) || !holdsArray;
    std::vector<core::CimScalar> scalars;
    for (const pugi::xml_node& each : holdsArray ? childElements(value) : std::vector{value}) {
        std::optional<core::CimScalar> scalar;
        if (holdsTexts && !isElement(each, "VALUE.NULL")) {
            scalar = readText(each, known);
        } else if (!isElement(each, "VALUE.NULL")) {
            const bool isNamed = holdsArray || isElement(each, "VALUE.REFERENCE");
            core::CimPath path = isNamed ? readReference(each, typing) : readObject(each, typing).path;
            if (known == CimType::Reference) scalar = std::move(path);
        }
        fits = fits && scalar;
        if (fits) scalars.push_back(std::move(*scalar));
    }
    if (!fits) return std::nullopt;
    // An array of one element may come as the element alone.
    if (isArray.value_or(holdsArray)) return core::CimValue::arrayOf(known, std::move(scalars));
    return core::CimValue::of(known, std::move(scalars.front()));
}

}  // namespace cimxml
