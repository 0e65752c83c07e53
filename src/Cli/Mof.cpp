#include "Cli/Mof.h"

#include <algorithm>
#include <map>

#include "Framework/Model/SchemaQualifiers.h"

namespace cli {

namespace {

std::string literal(std::string_view text) {
    std::string result = "\"";
    for (const char c : text) {
        if (c == '"' || c == '\\') result += '\\';
        result += c;
    }
    return result + '"';
}

std::string valueList(const std::vector<core::ValueMeaning>& values,
                      std::string_view core::ValueMeaning::*part) {
    std::string list;
    for (const core::ValueMeaning& value : values)
        list += (list.empty() ? "" : ", ") + literal(value.*part);
    return "{ " + list + " }";
}

std::string qualifierList(std::vector<std::string> flags, const core::SchemaQualifiers& qualifiers,
                          const std::string& indent) {
    if (!qualifiers.description.empty())
        flags.push_back("Description ( " + literal(qualifiers.description) + " )");
    if (!qualifiers.values.empty()) {
        flags.push_back("ValueMap " + valueList(qualifiers.values, &core::ValueMeaning::value));
        flags.push_back("Values " + valueList(qualifiers.values, &core::ValueMeaning::meaning));
    }
    if (flags.empty()) return {};
    std::string list;
    for (const std::string& flag : flags)
        list += (list.empty() ? "" : ",\n" + indent + "   ") + flag;
    return indent + "[ " + list + " ]\n";
}

std::string typeText(core::CimType type, const std::string& referenceClass) {
    if (type != core::CimType::Reference) return std::string(core::typeName(type));
    return referenceClass + " REF";
}

std::string propertyText(const std::string& className, const core::PropertyDeclaration& property) {
    const std::string indent(4, ' ');
    std::vector<std::string> flags;
    if (property.isKey) flags.emplace_back("Key");
    return qualifierList(flags, core::elementQualifiers(className, property.name), indent) + indent +
           typeText(property.type, property.referenceClass) + " " + property.name +
           (property.isArray ? "[]" : "") + ";\n";
}

std::string parameterText(const std::string& className, const std::string& method,
                          const core::ParameterDeclaration& parameter) {
    const std::string indent(8, ' ');
    const std::string direction = parameter.direction == core::CimDirection::In ? "In" : "In ( false ), Out";
    return qualifierList({direction}, core::elementQualifiers(className, method + "." + parameter.name),
                         indent) +
           indent + typeText(parameter.type, parameter.referenceClass) + " " + parameter.name +
           (parameter.isArray ? "[]" : "");
}

std::string methodText(const std::string& className, const core::MethodDeclaration& method) {
    const std::string indent(4, ' ');
    std::string parameters;
    for (const core::ParameterDeclaration& parameter : method.parameters) {
        parameters += (parameters.empty() ? "" : ",\n") + parameterText(className, method.name, parameter);
    }
    return qualifierList({}, core::elementQualifiers(className, method.name), indent) + indent +
           std::string(core::typeName(method.returnType)) + " " + method.name + "(\n" + parameters + ");\n";
}

std::string classText(const core::ClassDeclaration& declaration) {
    std::vector<std::string> flags;
    if (declaration.isAssociation) flags.emplace_back("Association");
    std::string text =
        qualifierList(flags, core::classQualifiers(declaration.name), "") + "class " + declaration.name;
    if (!declaration.superclass.empty()) text += " : " + declaration.superclass;
    text += " {\n";
    for (const auto& property : declaration.properties)
        text += propertyText(declaration.name, property);
    for (const auto& method : declaration.methods)
        text += methodText(declaration.name, method);
    return text + "};\n";
}

using ClassesByName = std::map<std::string, const core::ClassDeclaration*>;

std::size_t depthOf(const ClassesByName& classes, const core::ClassDeclaration& declaration) {
    const auto superclass = classes.find(core::foldName(declaration.superclass));
    return superclass == classes.end() ? 0 : 1 + depthOf(classes, *superclass->second);
}

}  // namespace

std::string mofText(std::vector<core::ClassDeclaration> classes) {
    ClassesByName byName;
    for (const core::ClassDeclaration& one : classes)
        byName[core::foldName(one.name)] = &one;
    // References may point forward, superclasses may not. A map keeps classes of one depth in the order of
    // names.
    std::map<std::pair<std::size_t, std::string>, const core::ClassDeclaration*> ordered;
    for (const auto& [name, declaration] : byName)
        ordered[{depthOf(byName, *declaration), name}] = declaration;
    std::string text;
    for (const auto& [place, declaration] : ordered)
        text += (text.empty() ? "" : "\n") + classText(*declaration);
    return text;
}

}  // namespace cli
