#include "CimXml/ClassReader.h"

#include <algorithm>

#include "CimXml/ValueReader.h"
#include "CimXml/XmlElement.h"

namespace cimxml {

namespace {

core::CimType typeOf(const pugi::xml_node& element) {
    const auto type = core::typeByName(requiredAttribute(element, "TYPE"));
    if (!type) refuseElement(element, "has an unknown type");
    return *type;
}

bool isTrue(const pugi::xml_attribute& attribute) {
    return core::sameName(attribute.value(), "true");
}

/// PROPERTY, PROPERTY.ARRAY, PROPERTY.REFERENCE and the four of PARAMETER differ by their suffix alone.
struct Shape {
    core::CimType type;
    bool isArray;
    std::string referenceClass;
};

Shape shapeOf(const pugi::xml_node& element) {
    const std::string_view name = element.name();
    const std::string_view suffix = name.substr(std::min(name.find('.'), name.size()));
    if (suffix == ".REFERENCE" || suffix == ".REFARRAY") {
        return {core::CimType::Reference, suffix == ".REFARRAY", element.attribute("REFERENCECLASS").value()};
    }
    return {typeOf(element), suffix == ".ARRAY", ""};
}

bool startsWith(const pugi::xml_node& element, std::string_view name) {
    return std::string_view(element.name()).starts_with(name);
}

Qualifier readQualifier(const pugi::xml_node& element) {
    Qualifier qualifier;
    qualifier.name = requiredAttribute(element, "NAME");
    const RawValue raw = readValue(element, "TYPE", KeyTyping::ByAttributes);
    const bool isArray = std::holds_alternative<std::vector<std::string>>(raw.data);
    const auto value = typedValueOf(raw, typeOf(element), isArray);
    if (!value) refuseElement(element, "holds no value of its type");
    qualifier.value = *value;
    qualifier.overridable = !core::sameName(element.attribute("OVERRIDABLE").value(), "false");
    return qualifier;
}

bool isSet(const std::vector<Qualifier>& qualifiers, std::string_view name, bool otherwise) {
    for (const Qualifier& qualifier : qualifiers) {
        const core::CimScalar* value = qualifier.value.scalar();
        if (!core::sameName(qualifier.name, name) || value == nullptr) continue;
        const bool* flag = std::get_if<bool>(value);
        return flag != nullptr && *flag;
    }
    return otherwise;
}

std::vector<Qualifier> readQualifiers(const pugi::xml_node& element) {
    std::vector<Qualifier> qualifiers;
    for (const pugi::xml_node& child : element.children("QUALIFIER")) {
        qualifiers.push_back(readQualifier(child));
    }
    return qualifiers;
}

ClassProperty readProperty(const pugi::xml_node& element) {
    ClassProperty property;
    Shape shape = shapeOf(element);
    property.qualifiers = readQualifiers(element);
    property.declaration = {requiredAttribute(element, "NAME"), shape.type, shape.isArray,
                            isSet(property.qualifiers, "Key", false), std::move(shape.referenceClass)};
    property.origin = element.attribute("CLASSORIGIN").value();
    property.propagated = isTrue(element.attribute("PROPAGATED"));
    return property;
}

ClassParameter readParameter(const pugi::xml_node& element) {
    ClassParameter parameter;
    Shape shape = shapeOf(element);
    parameter.qualifiers = readQualifiers(element);
    const bool out = isSet(parameter.qualifiers, "Out", false);
    parameter.declaration = {requiredAttribute(element, "NAME"),
                             shape.type,
                             shape.isArray,
                             out ? core::CimDirection::Out : core::CimDirection::In,
                             out,
                             std::move(shape.referenceClass)};
    return parameter;
}

ClassMethod readMethod(const pugi::xml_node& element) {
    ClassMethod method;
    method.name = requiredAttribute(element, "NAME");
    method.returnType = typeOf(element);
    method.origin = element.attribute("CLASSORIGIN").value();
    method.propagated = isTrue(element.attribute("PROPAGATED"));
    method.qualifiers = readQualifiers(element);
    for (const pugi::xml_node& child : childElements(element)) {
        if (startsWith(child, "PARAMETER")) method.parameters.push_back(readParameter(child));
    }
    return method;
}

}  // namespace

ClassElement readClass(const pugi::xml_node& element) {
    expectElement(element, "CLASS");
    ClassElement result;
    result.name = requiredAttribute(element, "NAME");
    result.superclass = element.attribute("SUPERCLASS").value();
    result.qualifiers = readQualifiers(element);
    for (const pugi::xml_node& child : childElements(element)) {
        if (startsWith(child, "PROPERTY")) {
            result.properties.push_back(readProperty(child));
        } else if (isElement(child, "METHOD")) {
            result.methods.push_back(readMethod(child));
        } else {
            expectElement(child, "QUALIFIER");
        }
    }
    return result;
}

}  // namespace cimxml
