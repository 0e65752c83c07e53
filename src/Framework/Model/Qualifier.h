// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <string_view>
#include <vector>

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

/// The declaration of that name, without regard to case; null for an unknown qualifier.
QUENX_EXPORT const QualifierDeclaration* findQualifierDeclaration(std::string_view name);

/// The qualifier of that name, without regard to case; null when it is not in the list.
QUENX_EXPORT const Qualifier* findQualifier(const std::vector<Qualifier>& qualifiers, std::string_view name);

/// What an element carries that has qualifiers of its own and inherits others: its own, then those inherited
/// ones that it does not replace, marked as propagated.
QUENX_EXPORT std::vector<Qualifier> mergeQualifiers(std::vector<Qualifier> own,
                                                    const std::vector<Qualifier>& inherited);

}  // namespace core
