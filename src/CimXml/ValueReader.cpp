// SPDX-License-Identifier: Apache-2.0
#include "CimXml/ValueReader.h"

#include <algorithm>
#include <array>
#include <utility>

#include "CimXml/Message.h"

namespace cimxml {

namespace {

/// TYPE is precise where it is there; VALUETYPE tells numbers from texts but not their width. A text that is
/// no value of its stated type stays a text, since a foreign server's path still has to be sent back as it
/// came.
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
            // DSP0201 lets the key of a class with a single one go without its name.
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

bool isNullElement(const pugi::xml_node& element) {
    return isElement(element, "VALUE.NULL");
}

std::vector<core::CimPath> readReferences(const pugi::xml_node& element, KeyTyping typing, bool& hasNull) {
    std::vector<core::CimPath> paths;
    for (const pugi::xml_node& child : childElements(element)) {
        if (isNullElement(child)) {
            hasNull = true;
        } else {
            paths.push_back(readReference(child, typing));
        }
    }
    return paths;
}

std::optional<core::CimScalar> parseOne(core::CimType type, const std::string& text) {
    // A path written as a text would be guessed at: a reference has an element of its own.
    if (type == core::CimType::Reference) return std::nullopt;
    return core::parseScalar(type, text);
}

std::optional<core::CimScalar> parseOne(core::CimType type, const core::CimPath& path) {
    if (type != core::CimType::Reference) return std::nullopt;
    return core::CimScalar(path);
}

template <class T>
std::optional<std::vector<core::CimScalar>> parseAll(core::CimType type, const std::vector<T>& items) {
    std::vector<core::CimScalar> values;
    values.reserve(items.size());
    for (const T& item : items) {
        auto value = parseOne(type, item);
        if (!value) return std::nullopt;
        values.push_back(std::move(*value));
    }
    return values;
}

/// Turns whichever form the raw value has into the declared one.
struct Typer {
    core::CimType type;
    bool isArray;

    std::optional<core::CimValue> operator()(std::monostate) const {
        return core::CimValue::null(type, isArray);
    }
    template <class T>
    std::optional<core::CimValue> operator()(const T& single) const {
        auto value = parseOne(type, single);
        if (!value) return std::nullopt;
        // An array of one element may come as the element alone.
        if (isArray) return core::CimValue::arrayOf(type, {std::move(*value)});
        return core::CimValue::of(type, std::move(*value));
    }
    template <class T>
    std::optional<core::CimValue> operator()(const std::vector<T>& items) const {
        auto values = parseAll(type, items);
        if (!isArray || !values) return std::nullopt;
        return core::CimValue::arrayOf(type, std::move(*values));
    }
};

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
    // A placed name inside a placed name would let a message nest without end.
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

std::vector<std::string> readTexts(const pugi::xml_node& element, bool& hasNull) {
    expectElement(element, "VALUE.ARRAY");
    std::vector<std::string> texts;
    for (const pugi::xml_node& child : childElements(element)) {
        if (isNullElement(child)) {
            hasNull = true;
        } else {
            expectElement(child, "VALUE");
            texts.push_back(textOf(child));
        }
    }
    return texts;
}

RawValue readValue(const pugi::xml_node& element, const char* typeAttribute, KeyTyping typing) {
    RawValue raw;
    if (const pugi::xml_attribute attribute = element.attribute(typeAttribute)) {
        raw.type = core::typeByName(attribute.value());
        if (!raw.type) refuseElement(element, "has an unknown type");
    }
    const std::vector<pugi::xml_node> children = childElements(element);
    if (children.empty()) return raw;
    const pugi::xml_node value = onlyChild(element);
    if (isElement(value, "VALUE")) {
        raw.data = textOf(value);
    } else if (isElement(value, "VALUE.ARRAY")) {
        raw.data = readTexts(value, raw.hasNullElement);
    } else if (isElement(value, "VALUE.REFERENCE")) {
        raw.data = readReference(value, typing);
    } else if (isElement(value, "VALUE.REFARRAY")) {
        raw.data = readReferences(value, typing, raw.hasNullElement);
    } else {
        raw.data = readObject(value, typing).path;
    }
    return raw;
}

std::optional<core::CimValue> typedValueOf(const RawValue& raw, std::optional<core::CimType> type,
                                           bool isArray) {
    if (raw.hasNullElement) return std::nullopt;
    const core::CimType known = type.value_or(raw.type.value_or(core::CimType::String));
    return std::visit(Typer{known, isArray}, raw.data);
}

}  // namespace cimxml
