// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/ClassAnswer.h"

#include <algorithm>

namespace host {

namespace {

using core::ClassDeclaration;
using core::MethodDeclaration;
using core::PropertyDeclaration;
using core::Qualifier;

template <class Elements>
auto findByName(Elements& elements, const std::string& name) {
    return std::find_if(elements.begin(), elements.end(),
                        [&](const auto& element) { return core::sameName(element.name, name); });
}

void setPropagated(std::vector<Qualifier>& qualifiers) {
    qualifiers = core::mergeQualifiers({}, qualifiers);
}

void setPropagated(PropertyDeclaration& property) {
    property.isPropagated = true;
    setPropagated(property.qualifiers);
}

void setPropagated(MethodDeclaration& method) {
    method.isPropagated = true;
    setPropagated(method.qualifiers);
    for (core::ParameterDeclaration& parameter : method.parameters)
        setPropagated(parameter.qualifiers);
}

/// What the element has, once its class declares it anew.
void redeclare(PropertyDeclaration& known, PropertyDeclaration declared) {
    declared.isKey = declared.isKey || known.isKey;  // a key stays one
    known = std::move(declared);
}

void redeclare(MethodDeclaration& known, MethodDeclaration declared) {
    known = std::move(declared);
}

template <class Element>
void addElement(std::vector<Element>& elements, Element declared, const std::string& className) {
    const auto found = findByName(elements, declared.name);
    if (found == elements.end()) {
        declared.origin = className;
        elements.push_back(std::move(declared));
        return;
    }
    // The nearest declaration counts, but the origin stays where the name first appeared.
    declared.origin = found->origin;
    declared.qualifiers = core::mergeQualifiers(std::move(declared.qualifiers), found->qualifiers);
    redeclare(*found, std::move(declared));
}

/// The class with everything that it inherits, built from the root down.
ClassDeclaration completeClass(const core::ClassChain& chain) {
    ClassDeclaration whole;
    for (auto level = chain.rbegin(); level != chain.rend(); ++level) {
        const ClassDeclaration& declaration = **level;
        for (PropertyDeclaration& property : whole.properties)
            setPropagated(property);
        for (MethodDeclaration& method : whole.methods)
            setPropagated(method);
        for (const PropertyDeclaration& property : declaration.properties)
            addElement(whole.properties, property, declaration.name);
        for (const MethodDeclaration& method : declaration.methods)
            addElement(whole.methods, method, declaration.name);
        whole.name = declaration.name;
        whole.superclass = declaration.superclass;
        whole.isAssociation = whole.isAssociation || declaration.isAssociation;
        whole.qualifiers = core::mergeQualifiers(declaration.qualifiers, whole.qualifiers);
    }
    return whole;
}

/// Calls the function with each list of qualifiers in the class.
template <class Function>
void forEachQualifierList(ClassDeclaration& declaration, Function&& function) {
    function(declaration.qualifiers);
    for (PropertyDeclaration& property : declaration.properties)
        function(property.qualifiers);
    for (MethodDeclaration& method : declaration.methods) {
        function(method.qualifiers);
        for (core::ParameterDeclaration& parameter : method.parameters)
            function(parameter.qualifiers);
    }
}

void dropPropagated(ClassDeclaration& declaration) {
    const auto isPropagated = [](const auto& element) { return element.isPropagated; };
    std::erase_if(declaration.properties, isPropagated);
    std::erase_if(declaration.methods, isPropagated);
    forEachQualifierList(declaration, [&](auto& qualifiers) { std::erase_if(qualifiers, isPropagated); });
}

void dropOrigins(ClassDeclaration& declaration) {
    for (PropertyDeclaration& property : declaration.properties)
        property.origin.clear();
    for (MethodDeclaration& method : declaration.methods)
        method.origin.clear();
}

}  // namespace

ClassDeclaration classAnswer(const core::ClassChain& chain, const ClassOptions& options) {
    ClassDeclaration answer = completeClass(chain);
    if (options.localOnly) dropPropagated(answer);
    std::erase_if(answer.properties, [&](const PropertyDeclaration& property) {
        return !core::isWanted(options.properties, property.name);
    });
    if (!options.includeClassOrigin) dropOrigins(answer);
    if (!options.includeQualifiers) {
        forEachQualifierList(answer, [](auto& qualifiers) { qualifiers.clear(); });
    }
    return answer;
}

std::vector<std::string> propertyNames(const core::ClassChain& chain) {
    std::vector<std::string> names;
    for (const auto& declaration : chain) {
        for (const PropertyDeclaration& property : declaration->properties) {
            names.push_back(property.name);
        }
    }
    return names;
}

std::map<std::string, std::string> originsOf(const core::ClassChain& chain) {
    std::map<std::string, std::string> origins;
    for (const auto& declaration : chain) {
        for (const PropertyDeclaration& property : declaration->properties) {
            origins[core::foldName(property.name)] = declaration->name;
        }
    }
    return origins;
}

}  // namespace host
