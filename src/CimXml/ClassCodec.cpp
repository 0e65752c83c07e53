// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "CimXml/ElementCodec.h"

namespace cimxml {

namespace {

using core::CimType;
using core::Qualifier;

// Reading.

/// A name ends up in the MOF that is made of a class, outside of any quotes.
std::string readName(const pugi::xml_node& element, const char* attribute) {
    std::string name = requiredAttribute(element, attribute);
    // What is read as a path is its class alone, or no name.
    if (name.empty() || core::CimPath(name).getClassName() != name)
        refuseElement(element, std::string("has no valid name in ") + attribute);
    return name;
}

std::string readOptionalName(const pugi::xml_node& element, const char* attribute) {
    return std::string_view(element.attribute(attribute).value()).empty() ? "" : readName(element, attribute);
}

CimType requireType(const pugi::xml_node& element) {
    const auto type = readType(element, "TYPE");
    if (!type) refuseElement(element, "has no attribute TYPE");
    return *type;
}

bool isTrue(const pugi::xml_attribute& attribute) {
    return core::sameName(attribute.value(), "true");
}

bool startsWith(const pugi::xml_node& element, std::string_view name) {
    return std::string_view(element.name()).starts_with(name);
}

Qualifier readQualifier(const pugi::xml_node& element) {
    // A QUALIFIER does not say whether it is an array, only its value does; null counts as a single one.
    auto value = readValue(element, requireType(element), std::nullopt, KeyTyping::ByAttributes);
    if (!value) refuseElement(element, "holds no value of its type");
    return {readName(element, "NAME"), std::move(*value), isTrue(element.attribute("PROPAGATED"))};
}

std::vector<Qualifier> readQualifiers(const pugi::xml_node& element) {
    std::vector<Qualifier> qualifiers;
    for (const pugi::xml_node& child : element.children("QUALIFIER"))
        qualifiers.push_back(readQualifier(child));
    return qualifiers;
}

bool isSet(const std::vector<Qualifier>& qualifiers, std::string_view name) {
    const Qualifier* qualifier = core::findByName(qualifiers, name);
    const bool* flag = qualifier == nullptr ? nullptr : qualifier->value.get<bool>();
    return flag != nullptr && *flag;
}

/// What properties and parameters have alike. PROPERTY, PROPERTY.ARRAY, PROPERTY.REFERENCE and the four of
/// PARAMETER differ by their suffix alone.
template <class Declaration>
Declaration readTyped(const pugi::xml_node& element) {
    const std::string_view name = element.name();
    const std::string_view suffix = name.substr(std::min(name.find('.'), name.size()));
    const bool isReference = suffix == ".REFERENCE" || suffix == ".REFARRAY";
    Declaration declaration{};
    declaration.name = readName(element, "NAME");
    declaration.type = isReference ? CimType::Reference : requireType(element);
    declaration.isArray = suffix == ".ARRAY" || suffix == ".REFARRAY";
    if (isReference) declaration.referenceClass = readOptionalName(element, "REFERENCECLASS");
    declaration.qualifiers = readQualifiers(element);
    return declaration;
}

template <class Declaration>
void readOrigin(const pugi::xml_node& element, Declaration& declaration) {
    declaration.origin = element.attribute("CLASSORIGIN").value();
    declaration.isPropagated = isTrue(element.attribute("PROPAGATED"));
}

core::PropertyDeclaration readProperty(const pugi::xml_node& element) {
    auto property = readTyped<core::PropertyDeclaration>(element);
    property.isKey = isSet(property.qualifiers, "Key");
    readOrigin(element, property);
    return property;
}

core::ParameterDeclaration readParameter(const pugi::xml_node& element) {
    auto parameter = readTyped<core::ParameterDeclaration>(element);
    // One that goes both ways counts as an output here: it need not be given.
    parameter.optional = isSet(parameter.qualifiers, "Out");
    parameter.direction = parameter.optional ? core::CimDirection::Out : core::CimDirection::In;
    return parameter;
}

core::MethodDeclaration readMethod(const pugi::xml_node& element) {
    core::MethodDeclaration method{readName(element, "NAME"), requireType(element), {}};
    readOrigin(element, method);
    method.qualifiers = readQualifiers(element);
    for (const pugi::xml_node& child : childElements(element)) {
        // What else stands here are the qualifiers, which have been read.
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
        const auto* declaration = core::findByName(core::qualifierDeclarations(), qualifier.name);
        if (declaration != nullptr) writeFlavors(writer, *declaration);
        writer.content();
        writeValue(writer, qualifier.value);
        writer.end("QUALIFIER");
    }
}

template <class Declaration>
void writeOrigin(XmlWriter& writer, const Declaration& declaration) {
    if (!declaration.origin.empty()) writer.attribute("CLASSORIGIN", declaration.origin);
    if (declaration.isPropagated) writer.attribute("PROPAGATED", "true");
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
    const std::string_view element = propertyElement(property.type, property.isArray);
    startTyped(writer, element, property);
    writeOrigin(writer, property);
    writer.content();
    writeQualifiers(writer, property.qualifiers);
    writer.end(element);
}

void writeParameter(XmlWriter& writer, const core::ParameterDeclaration& parameter) {
    const bool isReference = parameter.type == CimType::Reference;
    const std::string_view element = isReference
                                         ? (parameter.isArray ? "PARAMETER.REFARRAY" : "PARAMETER.REFERENCE")
                                         : (parameter.isArray ? "PARAMETER.ARRAY" : "PARAMETER");
    startTyped(writer, element, parameter);
    writer.content();
    writeQualifiers(writer, parameter.qualifiers);
    writer.end(element);
}

void writeMethod(XmlWriter& writer, const core::MethodDeclaration& method) {
    writer.start("METHOD").attribute("NAME", method.name);
    writer.attribute("TYPE", core::typeName(method.returnType));
    writeOrigin(writer, method);
    writer.content();
    writeQualifiers(writer, method.qualifiers);
    for (const core::ParameterDeclaration& parameter : method.parameters)
        writeParameter(writer, parameter);
    writer.end("METHOD");
}

}  // namespace

core::ClassDeclaration readClass(const pugi::xml_node& element) {
    expectElement(element, "CLASS");
    core::ClassDeclaration result;
    result.name = readName(element, "NAME");
    result.superclass = readOptionalName(element, "SUPERCLASS");
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
        const bool isIn = std::ranges::find(declaration.scopes, scope) != declaration.scopes.end();
        writer.attribute(scope, isIn ? "true" : "false");
    }
    writer.empty();
    writeValue(writer, declaration.defaultValue);
    writer.end("QUALIFIER.DECLARATION");
}

}  // namespace cimxml
