// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/Qualifier.h"

#include <algorithm>

#include "Framework/Model/CimType.h"

namespace core {

namespace {

using Scopes = std::vector<std::string_view>;

std::vector<QualifierDeclaration> makeDeclarations() {
    const CimValue no = CimValue::of(CimType::Boolean, false);
    const CimValue yes = CimValue::of(CimType::Boolean, true);
    const CimValue noText = CimValue::null(CimType::String);
    const CimValue noTexts = CimValue::null(CimType::String, true);
    const Scopes valued{"PROPERTY", "METHOD", "PARAMETER"};
    // Scopes and flavors are those of the DMTF's qualifiers.mof, so that a client finds what it knows.
    return {
        {.name = "Association", .defaultValue = no, .scopes = {"ASSOCIATION"}, .isOverridable = false},
        {.name = "Description", .defaultValue = noText, .scopes = qualifierScopes(), .isTranslatable = true},
        {.name = "In", .defaultValue = yes, .scopes = {"PARAMETER"}, .isOverridable = false},
        {.name = "Key", .defaultValue = no, .scopes = {"PROPERTY", "REFERENCE"}, .isOverridable = false},
        {.name = "Out", .defaultValue = no, .scopes = {"PARAMETER"}, .isOverridable = false},
        {.name = "Override",
         .defaultValue = noText,
         .scopes = {"PROPERTY", "REFERENCE", "METHOD"},
         .isInherited = false},
        {.name = "ValueMap", .defaultValue = noTexts, .scopes = valued},
        {.name = "Values", .defaultValue = noTexts, .scopes = valued, .isTranslatable = true},
    };
}

template <class Item>
const Item* findByName(const std::vector<Item>& items, std::string_view name) {
    const auto found =
        std::find_if(items.begin(), items.end(), [&](const Item& item) { return sameName(item.name, name); });
    return found == items.end() ? nullptr : &*found;
}

}  // namespace

const std::vector<std::string_view>& qualifierScopes() {
    static const Scopes scopes{"CLASS",  "ASSOCIATION", "REFERENCE", "PROPERTY",
                               "METHOD", "PARAMETER",   "INDICATION"};
    return scopes;
}

const std::vector<QualifierDeclaration>& qualifierDeclarations() {
    static const std::vector<QualifierDeclaration> declarations = makeDeclarations();
    return declarations;
}

const QualifierDeclaration* findQualifierDeclaration(std::string_view name) {
    return findByName(qualifierDeclarations(), name);
}

const Qualifier* findQualifier(const std::vector<Qualifier>& qualifiers, std::string_view name) {
    return findByName(qualifiers, name);
}

std::vector<Qualifier> mergeQualifiers(std::vector<Qualifier> own, const std::vector<Qualifier>& inherited) {
    for (const Qualifier& one : inherited) {
        // A qualifier without a declaration comes from a foreign server; by default they are inherited.
        const QualifierDeclaration* declaration = findQualifierDeclaration(one.name);
        if (declaration != nullptr && !declaration->isInherited) continue;
        if (findQualifier(own, one.name) == nullptr) own.push_back({one.name, one.value, true});
    }
    return own;
}

}  // namespace core
