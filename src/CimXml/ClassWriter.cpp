#include "CimXml/ClassWriter.h"

#include "CimXml/ValueWriter.h"

namespace cimxml {

namespace {

void writeQualifiers(XmlWriter& writer, const std::vector<Qualifier>& qualifiers) {
    for (const Qualifier& qualifier : qualifiers) {
        writer.start("QUALIFIER").attribute("NAME", qualifier.name);
        writer.attribute("TYPE", core::typeName(qualifier.value.type));
        if (!qualifier.overridable) writer.attribute("OVERRIDABLE", "false");
        writer.content();
        writeValue(writer, qualifier.value);
        writer.end("QUALIFIER");
    }
}

/// NAME, and TYPE or REFERENCECLASS, as the four property and parameter elements have them.
void writeNameAndType(XmlWriter& writer, const std::string& name, core::CimType type,
                      const std::string& referenceClass) {
    writer.attribute("NAME", name);
    if (type != core::CimType::Reference) {
        writer.attribute("TYPE", core::typeName(type));
    } else if (!referenceClass.empty()) {
        writer.attribute("REFERENCECLASS", referenceClass);
    }
}

void writeOrigin(XmlWriter& writer, const std::string& origin, bool propagated) {
    if (!origin.empty()) writer.attribute("CLASSORIGIN", origin);
    if (propagated) writer.attribute("PROPAGATED", "true");
}

void writeProperty(XmlWriter& writer, const ClassProperty& property) {
    const core::PropertyDeclaration& declared = property.declaration;
    const std::string_view element = declared.isArray                            ? "PROPERTY.ARRAY"
                                     : declared.type == core::CimType::Reference ? "PROPERTY.REFERENCE"
                                                                                 : "PROPERTY";
    writer.start(element);
    writeNameAndType(writer, declared.name, declared.type, declared.referenceClass);
    writeOrigin(writer, property.origin, property.propagated);
    writer.content();
    writeQualifiers(writer, property.qualifiers);
    writer.end(element);
}

std::string_view parameterElement(const core::ParameterDeclaration& declared) {
    if (declared.type == core::CimType::Reference) {
        return declared.isArray ? "PARAMETER.REFARRAY" : "PARAMETER.REFERENCE";
    }
    return declared.isArray ? "PARAMETER.ARRAY" : "PARAMETER";
}

void writeParameter(XmlWriter& writer, const ClassParameter& parameter) {
    const core::ParameterDeclaration& declared = parameter.declaration;
    const std::string_view element = parameterElement(declared);
    writer.start(element);
    writeNameAndType(writer, declared.name, declared.type, declared.referenceClass);
    writer.content();
    writeQualifiers(writer, parameter.qualifiers);
    writer.end(element);
}

void writeMethod(XmlWriter& writer, const ClassMethod& method) {
    writer.start("METHOD").attribute("NAME", method.name);
    writer.attribute("TYPE", core::typeName(method.returnType));
    writeOrigin(writer, method.origin, method.propagated);
    writer.content();
    writeQualifiers(writer, method.qualifiers);
    for (const ClassParameter& parameter : method.parameters)
        writeParameter(writer, parameter);
    writer.end("METHOD");
}

}  // namespace

void writeClass(XmlWriter& writer, const ClassElement& element) {
    writer.start("CLASS").attribute("NAME", element.name);
    if (!element.superclass.empty()) writer.attribute("SUPERCLASS", element.superclass);
    writer.content();
    writeQualifiers(writer, element.qualifiers);
    for (const ClassProperty& property : element.properties)
        writeProperty(writer, property);
    for (const ClassMethod& method : element.methods)
        writeMethod(writer, method);
    writer.end("CLASS");
}

void writeQualifierDeclaration(XmlWriter& writer, const QualifierDeclaration& declaration) {
    writer.start("QUALIFIER.DECLARATION").attribute("NAME", declaration.name);
    writer.attribute("TYPE", core::typeName(declaration.type));
    if (declaration.isArray) writer.attribute("ISARRAY", "true");
    if (!declaration.overridable) writer.attribute("OVERRIDABLE", "false");
    writer.content();
    if (!declaration.scopes.empty()) {
        writer.start("SCOPE");
        for (const std::string& scope : declaration.scopes)
            writer.attribute(scope, "true");
        writer.empty();
    }
    writeValue(writer, declaration.defaultValue);
    writer.end("QUALIFIER.DECLARATION");
}

}  // namespace cimxml
