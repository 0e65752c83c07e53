#include "CimXml/ValueReader.h"

#include "CimXml/XmlElement.h"

namespace cimxml {

namespace {

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
