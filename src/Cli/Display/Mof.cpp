// SPDX-License-Identifier: Apache-2.0
#include "Cli/Display/Mof.h"

#include <algorithm>
#include <map>

#include "Cli/Display/Messages.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

std::string literal(const core::CimScalar& value) {
    const std::string text = core::scalarText(value);
    // Whatever may hold a text of the server's stands in quotes.
    const bool isWord =
        !std::holds_alternative<std::string>(value) && !std::holds_alternative<core::CimPath>(value);
    return isWord ? core::foldName(text) : utils::quoted(text);
}

std::string literal(const core::CimValue& value) {
    if (const core::CimScalar* scalar = value.scalar()) return literal(*scalar);
    if (value.elements() == nullptr) return "null";
    std::vector<std::string> items;
    for (const core::CimScalar& element : *value.elements())
        items.push_back(literal(element));
    return "{ " + joined(items, ", ") + " }";
}

std::string qualifierText(const core::Qualifier& qualifier) {
    const std::string value = literal(qualifier.value);
    if (value == "true") return qualifier.name;  // a flag is set by its name alone
    return qualifier.name + (qualifier.value.isArray ? " " + value : " ( " + value + " )");
}

std::string qualifierList(const std::vector<core::Qualifier>& qualifiers, const std::string& indent) {
    std::vector<std::string> texts;
    for (const core::Qualifier& qualifier : qualifiers) {
        // If an inherited qualifier were repeated, it would override, which some do not allow.
        if (!qualifier.isPropagated) texts.push_back(qualifierText(qualifier));
    }
    if (texts.empty()) return {};
    return indent + "[ " + joined(texts, ",\n" + indent + "   ") + " ]\n";
}

std::string declarationText(const core::QualifierDeclaration& declaration) {
    std::vector<std::string> scopes;
    for (const std::string_view scope : declaration.scopes)
        scopes.push_back(core::foldName(scope));
    std::string text = "Qualifier " + declaration.name + " : ";
    text += core::typeName(declaration.defaultValue.type);
    text += declaration.defaultValue.isArray ? "[] = " : " = ";
    text += literal(declaration.defaultValue) + ",\n    Scope(";
    text += declaration.scopes == core::qualifierScopes() ? "any" : joined(scopes, ", ");
    text += "),\n    Flavor(";
    text += declaration.isOverridable ? "EnableOverride, " : "DisableOverride, ";
    text += declaration.isInherited ? "ToSubclass" : "Restricted";
    text += declaration.isTranslatable ? ", Translatable);\n" : ");\n";
    return text;
}

/// The qualifiers of a property or parameter, then "TYPE Name[]".
template <class Declaration>
std::string elementText(const Declaration& element, const std::string& indent) {
    std::string type(core::typeName(element.type));
    if (element.type == core::CimType::Reference) type = element.referenceClass + " REF";
    return qualifierList(element.qualifiers, indent) + indent + type + " " + element.name +
           (element.isArray ? "[]" : "");
}

std::string methodText(const core::MethodDeclaration& method) {
    const std::string indent(4, ' ');
    std::vector<std::string> parameters;
    for (const core::ParameterDeclaration& parameter : method.parameters)
        parameters.push_back(elementText(parameter, std::string(8, ' ')));
    return qualifierList(method.qualifiers, indent) + indent +
           std::string(core::typeName(method.returnType)) + " " + method.name + "(\n" +
           joined(parameters, ",\n") + ");\n";
}

/// The classes that are still to be written, by folded name: the same order on every machine.
using Waiting = std::map<std::string, const core::ClassChain*>;

bool isDone(const Waiting& waiting, const std::string& name, const core::ClassDeclaration& user) {
    return core::sameName(name, user.name) || !waiting.contains(core::foldName(name));
}

bool refersToDone(const Waiting& waiting, const core::ClassDeclaration& declaration) {
    const auto isReady = [&](const auto& element) {
        return isDone(waiting, element.referenceClass, declaration);
    };
    return std::all_of(declaration.properties.begin(), declaration.properties.end(), isReady) &&
           std::all_of(declaration.methods.begin(), declaration.methods.end(), [&](const auto& method) {
               return std::all_of(method.parameters.begin(), method.parameters.end(), isReady);
           });
}

/// The next class to write, the first by name of those that can be. Where classes refer to each other in a
/// circle, a reference has to point forward; a superclass never may.
Waiting::const_iterator nextClass(const Waiting& waiting) {
    auto best = waiting.end();
    for (auto each = waiting.begin(); each != waiting.end(); ++each) {
        const core::ClassDeclaration& declaration = *each->second->front();
        if (!isDone(waiting, declaration.superclass, declaration)) continue;
        if (refersToDone(waiting, declaration)) return each;
        if (best == waiting.end()) best = each;
    }
    // If a server answers each time otherwise, none may fit; the loop must end even then.
    return best == waiting.end() ? waiting.begin() : best;
}

}  // namespace

std::string qualifiersMof() {
    std::string text;
    for (const core::QualifierDeclaration& declaration : core::qualifierDeclarations())
        text += declarationText(declaration);
    return text;
}

std::string classMof(const core::ClassDeclaration& declaration) {
    std::string text = qualifierList(declaration.qualifiers, "") + "class " + declaration.name;
    if (!declaration.superclass.empty()) text += " : " + declaration.superclass;
    text += " {\n";
    for (const core::PropertyDeclaration& property : declaration.properties)
        text += elementText(property, std::string(4, ' ')) + ";\n";
    for (const core::MethodDeclaration& method : declaration.methods)
        text += methodText(method);
    return text + "};\n";
}

std::vector<core::ClassChain> inMofOrder(const std::vector<core::ClassChain>& classes) {
    Waiting waiting;
    // If a server sends two classes of one name, the first counts, as it does in the chains.
    for (const core::ClassChain& chain : classes)
        waiting.emplace(core::foldName(chain.front()->name), &chain);
    std::vector<core::ClassChain> ordered;
    while (!waiting.empty()) {
        const auto next = nextClass(waiting);
        ordered.push_back(*next->second);
        waiting.erase(next);
    }
    return ordered;
}

}  // namespace cli
