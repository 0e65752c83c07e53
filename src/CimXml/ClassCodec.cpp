// SPDX-License-Identifier: Apache-2.0
#include "CimXml/ClassCodec.h"

#include <algorithm>

#include "CimXml/Message.h"
#include "CimXml/ValueReader.h"
#include "CimXml/ValueWriter.h"

namespace cimxml {

namespace {

using core::CimType;
using core::Qualifier;

// Reading.

CimType typeOf(const pugi::xml_node& element) {
    const auto type = core::typeByName(requiredAttribute(element, "TYPE"));
    if (!type) refuseElement(element, "has an unknown type");
    return *type;
}

bool isTrue(const pugi::xml_attribute& attribute) {
    return core::sameName(attribute.value(), "true");
}

/// PROPERTY, PROPERTY.ARRAY, PROPERTY.REFERENCE and the four of PARAMETER differ by their suffix alone.
struct Shape {
    CimType type;
    bool isArray;
    std::string referenceClass;
};

Shape shapeOf(const pugi::xml_node& element) {
    const std::string_view name = element.name();
    const std::string_view suffix = name.substr(std::min(name.find('.'), name.size()));
    if (suffix == ".REFERENCE" || suffix == ".REFARRAY") {
        return {CimType::Reference, suffix == ".REFARRAY", element.attribute("REFERENCECLASS").value()};
    }
    return {typeOf(element), suffix == ".ARRAY", ""};
}

bool startsWith(const pugi::xml_node& element, std::string_view name) {
    return std::string_view(element.name()).starts_with(name);
}

Qualifier readQualifier(const pugi::xml_node& element) {
    // A QUALIFIER does not say whether it is an array, only its value does; null counts as a single one.
    const RawValue raw = readValue(element, "TYPE", KeyTyping::ByAttributes);
    const bool isArray = std::holds_alternative<std::vector<std::string>>(raw.data);
    const auto value = typedValueOf(raw, typeOf(element), isArray);
    if (!value) refuseElement(element, "holds no value of its type");
    return {requiredAttribute(element, "NAME"), *value, isTrue(element.attribute("PROPAGATED"))};
}

std::vector<Qualifier> readQualifiers(const pugi::xml_node& element) {
    std::vector<Qualifier> qualifiers;
    for (const pugi::xml_node& child : element.children("QUALIFIER")) {
        qualifiers.push_back(readQualifier(child));
    }
    return qualifiers;
}

bool isSet(const std::vector<Qualifier>& qualifiers, std::string_view name) {
    const Qualifier* qualifier = core::findQualifier(qualifiers, name);
    const core::CimScalar* value = qualifier == nullptr ? nullptr : qualifier->value.scalar();
    const bool* flag = value == nullptr ? nullptr : std::get_if<bool>(value);
    return flag != nullptr && *flag;
}

core::PropertyDeclaration readProperty(const pugi::xml_node& element) {
    Shape shape = shapeOf(element);
    std::vector<Qualifier> qualifiers = readQualifiers(element);
    const bool isKey = isSet(qualifiers, "Key");
    return {requiredAttribute(element, "NAME"),
            shape.type,
            shape.isArray,
            isKey,
            std::move(shape.referenceClass),
            std::move(qualifiers),
            element.attribute("CLASSORIGIN").value(),
            isTrue(element.attribute("PROPAGATED"))};
}

core::ParameterDeclaration readParameter(const pugi::xml_node& element) {
    Shape shape = shapeOf(element);
    std::vector<Qualifier> qualifiers = readQualifiers(element);
    // One that goes both ways counts as an output here: it need not be given.
    const bool isOutput = isSet(qualifiers, "Out");
    return {requiredAttribute(element, "NAME"),
            shape.type,
            shape.isArray,
            isOutput ? core::CimDirection::Out : core::CimDirection::In,
            isOutput,
            std::move(shape.referenceClass),
            std::move(qualifiers)};
}

core::MethodDeclaration readMethod(const pugi::xml_node& element) {
    core::MethodDeclaration method{requiredAttribute(element, "NAME"), typeOf(element), {}};
    method.origin = element.attribute("CLASSORIGIN").value();
    method.isPropagated = isTrue(element.attribute("PROPAGATED"));
    method.qualifiers = readQualifiers(element);
    for (const pugi::xml_node& child : childElements(element)) {
        if (startsWith(child, "PARAMETER")) method.parameters.push_back(readParameter(child));
    }
    return method;
}

// Writing.

/// The flavors of a qualifier, as far as they differ from what a reader takes for granted (DSP0201 5.1.2).
void writeFlavors(XmlWriter& writer, const core::QualifierDeclaration& declaration) {
    if (!declaration.isOverridable) writer.attribute("OVERRIDABLE", "false");
    if (!declaration.isInherited) writer.attribute("TOSUBCLASS", "false");
    if (declaration.isTranslatable) writer.attribute("TRANSLATABLE", "true");
}

void writeQualifiers(XmlWriter& writer, const std::vector<Qualifier>& qualifiers) {
    for (const Qualifier& qualifier : qualifiers) {
        writer.start("QUALIFIER").attribute("NAME", qualifier.name);
        writer.attribute("TYPE", core::typeName(qualifier.value.type));
        if (qualifier.isPropagated) writer.attribute("PROPAGATED", "true");
        const auto* declaration = core::findQualifierDeclaration(qualifier.name);
        if (declaration != nullptr) writeFlavors(writer, *declaration);
        writer.content();
        writeValue(writer, qualifier.value);
        writer.end("QUALIFIER");
    }
}

void writeOrigin(XmlWriter& writer, const std::string& origin, bool isPropagated) {
    if (!origin.empty()) writer.attribute("CLASSORIGIN", origin);
    if (isPropagated) writer.attribute("PROPAGATED", "true");
}

/// The element, open for further attributes, with NAME and TYPE or REFERENCECLASS as properties and
/// parameters alike have them.
template <class Declaration>
void startTyped(XmlWriter& writer, std::string_view element, const Declaration& declared) {
    writer.start(element).attribute("NAME", declared.name);
    if (declared.type != CimType::Reference) {
        writer.attribute("TYPE", core::typeName(declared.type));
    } else if (!declared.referenceClass.empty()) {
        writer.attribute("REFERENCECLASS", declared.referenceClass);
    }
}

void writeProperty(XmlWriter& writer, const core::PropertyDeclaration& property) {
    const std::string_view element = property.isArray                      ? "PROPERTY.ARRAY"
                                     : property.type == CimType::Reference ? "PROPERTY.REFERENCE"
                                                                           : "PROPERTY";
    startTyped(writer, element, property);
    writeOrigin(writer, property.origin, property.isPropagated);
    writer.content();
    writeQualifiers(writer, property.qualifiers);
    writer.end(element);
}

std::string_view elementOf(const core::ParameterDeclaration& parameter) {
    if (parameter.type == CimType::Reference) {
        return parameter.isArray ? "PARAMETER.REFARRAY" : "PARAMETER.REFERENCE";
    }
    return parameter.isArray ? "PARAMETER.ARRAY" : "PARAMETER";
}

void writeMethod(XmlWriter& writer, const core::MethodDeclaration& method) {
    writer.start("METHOD").attribute("NAME", method.name);
    writer.attribute("TYPE", core::typeName(method.returnType));
    writeOrigin(writer, method.origin, method.isPropagated);
    writer.content();
    writeQualifiers(writer, method.qualifiers);
    for (const core::ParameterDeclaration& parameter : method.parameters) {
        const std::string_view element = elementOf(parameter);
        startTyped(writer, element, parameter);
        writer.content();
        writeQualifiers(writer, parameter.qualifiers);
        writer.end(element);
    }
    writer.end("METHOD");
}

}  // namespace

core::ClassDeclaration readClass(const pugi::xml_node& element) {
    expectElement(element, "CLASS");
    core::ClassDeclaration result;
    result.name = requiredAttribute(element, "NAME");
    result.superclass = element.attribute("SUPERCLASS").value();
    result.qualifiers = readQualifiers(element);
    result.isAssociation = isSet(result.qualifiers, "Association");
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

void writeClass(XmlWriter& writer, const core::ClassDeclaration& declaration) {
    writer.start("CLASS").attribute("NAME", declaration.name);
    if (!declaration.superclass.empty()) writer.attribute("SUPERCLASS", declaration.superclass);
    writer.content();
    writeQualifiers(writer, declaration.qualifiers);
    for (const core::PropertyDeclaration& property : declaration.properties)
        writeProperty(writer, property);
    for (const core::MethodDeclaration& method : declaration.methods)
        writeMethod(writer, method);
    writer.end("CLASS");
}

void writeQualifierDeclaration(XmlWriter& writer, const core::QualifierDeclaration& declaration) {
    writer.start("QUALIFIER.DECLARATION").attribute("NAME", declaration.name);
    writer.attribute("TYPE", core::typeName(declaration.defaultValue.type));
    if (declaration.defaultValue.isArray) writer.attribute("ISARRAY", "true");
    writeFlavors(writer, declaration);
    writer.content().start("SCOPE");
    // Readers disagree on the default of a scope that is left out, so all seven are there.
    for (const std::string_view scope : core::qualifierScopes()) {
        const bool isIn = std::find(declaration.scopes.begin(), declaration.scopes.end(), scope) !=
                          declaration.scopes.end();
        writer.attribute(scope, isIn ? "true" : "false");
    }
    writer.empty();
    writeValue(writer, declaration.defaultValue);
    writer.end("QUALIFIER.DECLARATION");
}

}  // namespace cimxml
