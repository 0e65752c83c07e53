// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "Host/Operations/Operations.h"

namespace host {

namespace {

using cimxml::IntrinsicResult;
using cimxml::ResultKind;
using core::ClassDeclaration;
using core::MethodDeclaration;
using core::PropertyDeclaration;
using core::Qualifier;

/// What of a class a client asks for (DSP0200 5.4.2.1).
struct ClassOptions {
    bool localOnly;
    bool includeQualifiers;
    bool includeClassOrigin;
    core::PropertyFilter properties;
};

ClassOptions optionsOf(const Parameters& parameters) {
    return {parameters.flag("LocalOnly", true), parameters.flag("IncludeQualifiers", true),
            parameters.flag("IncludeClassOrigin", false), parameters.list("PropertyList")};
}

/// Calls the function with each property and method.
template <class Function>
void forEachElement(ClassDeclaration& declaration, Function&& function) {
    std::for_each(declaration.properties.begin(), declaration.properties.end(), function);
    std::for_each(declaration.methods.begin(), declaration.methods.end(), function);
}

/// Calls the function with each list of qualifiers in the class.
template <class Function>
void forEachQualifierList(ClassDeclaration& declaration, Function&& function) {
    function(declaration.qualifiers);
    forEachElement(declaration, [&](auto& element) { function(element.qualifiers); });
    for (MethodDeclaration& method : declaration.methods) {
        for (core::ParameterDeclaration& parameter : method.parameters)
            function(parameter.qualifiers);
    }
}

/// Marks all that there is as coming from a superclass; qualifiers that subclasses do not inherit go.
void setPropagated(ClassDeclaration& declaration) {
    forEachElement(declaration, [](auto& element) { element.isPropagated = true; });
    forEachQualifierList(declaration, [](std::vector<Qualifier>& qualifiers) {
        qualifiers = core::mergeQualifiers({}, qualifiers);
    });
}

/// Adds an element, or redeclares the one of its name: the nearest declaration counts, but the origin stays
/// where the name first appeared, and a key stays one.
template <class Element>
void addElement(std::vector<Element>& elements, Element declared, const std::string& className) {
    Element* found = core::findByName(elements, declared.name);
    if (found == nullptr) {
        declared.origin = className;
        elements.push_back(std::move(declared));
        return;
    }
    declared.origin = found->origin;
    declared.qualifiers = core::mergeQualifiers(std::move(declared.qualifiers), found->qualifiers);
    if constexpr (std::is_same_v<Element, PropertyDeclaration>) declared.isKey |= found->isKey;
    *found = std::move(declared);
}

/// The class with everything that it inherits, built from the root down: each element once, by its nearest
/// declaration, those of the superclasses first.
ClassDeclaration completeClass(const core::ClassChain& chain) {
    ClassDeclaration whole;
    for (auto level = chain.rbegin(); level != chain.rend(); ++level) {
        const ClassDeclaration& declaration = **level;
        setPropagated(whole);
        for (const PropertyDeclaration& property : declaration.properties)
            addElement(whole.properties, property, declaration.name);
        for (const MethodDeclaration& method : declaration.methods)
            addElement(whole.methods, method, declaration.name);
        whole.name = declaration.name;
        whole.superclass = declaration.superclass;
        // A subclass of an association is one, whether it says so or not.
        whole.isAssociation |= declaration.isAssociation;
        whole.qualifiers = core::mergeQualifiers(declaration.qualifiers, whole.qualifiers);
    }
    return whole;
}

void dropPropagated(ClassDeclaration& declaration) {
    const auto isPropagated = [](const auto& element) { return element.isPropagated; };
    std::erase_if(declaration.properties, isPropagated);
    std::erase_if(declaration.methods, isPropagated);
    forEachQualifierList(declaration, [&](auto& qualifiers) { std::erase_if(qualifiers, isPropagated); });
}

/// The class as the answer shows it.
ClassDeclaration answerOf(const core::ClassChain& chain, const ClassOptions& options) {
    ClassDeclaration answer = completeClass(chain);
    // Narrowed at the end: what a class redeclares is only known once the whole is built.
    if (options.localOnly) dropPropagated(answer);
    const core::WantedProperties wanted(options.properties);
    std::erase_if(answer.properties,
                  [&](const PropertyDeclaration& property) { return !wanted.includes(property.name); });
    if (!options.includeClassOrigin) forEachElement(answer, [](auto& element) { element.origin.clear(); });
    if (!options.includeQualifiers)
        forEachQualifierList(answer, [](auto& qualifiers) { qualifiers.clear(); });
    return answer;
}

std::vector<core::ClassChain> wantedClasses(const OperationContext& context, const Parameters& parameters) {
    return context.target.enumerateClasses(parameters.className("ClassName"),
                                           parameters.flag("DeepInheritance", false));
}

}  // namespace

core::ClassChain requireClass(core::CimOperations& target, const std::string& className,
                              core::CimStatus otherwise) {
    core::ClassChain chain = target.getClass(className);
    if (!chain.empty()) return chain;
    throw core::CimError(otherwise, "no class \"" + className + "\" in " + target.getNamespace());
}

IntrinsicResult getClass(const OperationContext& context, const Parameters& parameters) {
    const core::ClassChain chain =
        requireClass(context.target, parameters.className("ClassName"), core::CimStatus::NotFound);
    return {.kind = ResultKind::Classes, .classes = {answerOf(chain, optionsOf(parameters))}};
}

IntrinsicResult enumerateClasses(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result{.kind = ResultKind::Classes};
    const ClassOptions options = optionsOf(parameters);
    for (const core::ClassChain& chain : wantedClasses(context, parameters))
        result.classes.push_back(answerOf(chain, options));
    return result;
}

IntrinsicResult enumerateClassNames(const OperationContext& context, const Parameters& parameters) {
    IntrinsicResult result{.kind = ResultKind::ClassNames};
    for (const core::ClassChain& chain : wantedClasses(context, parameters))
        result.classNames.push_back(chain.front()->name);
    return result;
}

// Qualifier types are the schema's, the same in every namespace.

IntrinsicResult getQualifier(const OperationContext&, const Parameters& parameters) {
    const std::string name = parameters.text("QualifierName");
    const core::QualifierDeclaration* declaration = core::findByName(core::qualifierDeclarations(), name);
    if (declaration == nullptr)
        throw core::CimError(core::CimStatus::NotFound, "no qualifier \"" + name + "\"");
    return {.kind = ResultKind::Qualifiers, .qualifiers = {*declaration}};
}

IntrinsicResult enumerateQualifiers(const OperationContext&, const Parameters&) {
    return {.kind = ResultKind::Qualifiers, .qualifiers = core::qualifierDeclarations()};
}

}  // namespace host
