// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Model/CimClassInfo.h"
#include "Framework/Model/CimValue.h"
#include "Utils/Export.h"

namespace core {

/// A qualifier (DSP0004 5.6) on a class, property, method or parameter. Its type and flavors are those of its
/// declaration.
struct Qualifier {
    std::string name;
    CimValue value;
    bool isPropagated = false;  ///< comes from a superclass
};

/// The declaration of a qualifier that classes here may carry.
struct QualifierDeclaration {
    std::string name;
    CimValue defaultValue;  ///< tells the type as well
    /// Some of qualifierScopes(), in that order.
    std::vector<std::string_view> scopes;
    bool isOverridable = true;    ///< a subclass may give another value
    bool isInherited = true;      ///< subclasses have it too
    bool isTranslatable = false;  ///< the value is a text that may be in another language
};

/// The seven kinds of element that a qualifier may stand on: "CLASS", "ASSOCIATION" and so on.
QUENX_EXPORT const std::vector<std::string_view>& qualifierScopes();

/// All declarations, by name.
QUENX_EXPORT const std::vector<QualifierDeclaration>& qualifierDeclarations();

/// What an element carries that has qualifiers of its own and inherits others: its own, then those inherited
/// ones that it does not replace, marked as propagated.
QUENX_EXPORT std::vector<Qualifier> mergeQualifiers(std::vector<Qualifier> own,
                                                    const std::vector<Qualifier>& inherited);

struct PropertyDeclaration {
    std::string name;
    CimType type;
    bool isArray;
    bool isKey;
    std::string referenceClass = {};  ///< empty unless the type is Reference
    std::vector<Qualifier> qualifiers = {};
    std::string origin = {};    ///< the class that first declared it; empty where nobody asked
    bool isPropagated = false;  ///< comes from a superclass
};

struct ParameterDeclaration {
    std::string name;
    CimType type;
    bool isArray;
    CimDirection direction;
    bool optional;
    std::string referenceClass = {};  ///< empty unless the type is Reference
    std::vector<Qualifier> qualifiers = {};
};

struct MethodDeclaration {
    std::string name;
    CimType returnType;
    std::vector<ParameterDeclaration> parameters;
    std::vector<Qualifier> qualifiers = {};
    std::string origin = {};    ///< as of a property
    bool isPropagated = false;  ///< comes from a superclass
};

/// A class as a client reads it. As a link of a chain it holds what the class adds to its superclass, or
/// newly makes a key of; in an answer to a client it may hold inherited elements as well. A value, with no
/// tie to the library that it was read from.
struct ClassDeclaration {
    std::string name;
    std::string superclass;  ///< empty for a root
    bool isAssociation = false;
    std::vector<PropertyDeclaration> properties;
    std::vector<MethodDeclaration> methods;
    std::vector<Qualifier> qualifiers = {};
};

/// The declarations of the class and all its superclasses, the class itself first, the root last.
using ClassChain = std::vector<std::shared_ptr<const ClassDeclaration>>;

/// Reads the chain off the class information. Each class is read once per process and remembered by name.
/// Thread-safe.
QUENX_EXPORT ClassChain declarationsOf(const CimClassInfo& info);

/// Builds the chain of each class from declarations of them and their superclasses; one that is not among
/// them ends a chain. Throws CimError that names a class which is its own superclass, or has more
/// superclasses than any schema.
QUENX_EXPORT std::vector<ClassChain> chainsOf(std::vector<ClassDeclaration> declarations);

/// Adds the qualifiers that the other members imply: Association, Key, In and Out.
QUENX_EXPORT void addImpliedQualifiers(ClassDeclaration& declaration);

/// Whether a class of that name is in the chain.
QUENX_EXPORT bool derivesFrom(const ClassChain& chain, std::string_view className);

/// Whether the chain's first class stands below the named one: directly, or at any depth with `deep`. An
/// empty name stands above the roots.
QUENX_EXPORT bool isBelow(const ClassChain& chain, std::string_view className, bool deep);

/// An association, or derived from one.
QUENX_EXPORT bool isAssociation(const ClassChain& chain);

/// The method, looked up from the class towards the root; null when no class of the chain declares it.
QUENX_EXPORT const MethodDeclaration* findMethod(const ClassChain& chain, std::string_view name);

}  // namespace core
