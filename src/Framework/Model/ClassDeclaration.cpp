// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/ClassDeclaration.h"

#include <algorithm>
#include <map>
#include <set>

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Utils.h"

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
        {.name = "Abstract",
         .defaultValue = no,
         .scopes = {"CLASS", "ASSOCIATION", "INDICATION"},
         .isInherited = false},
        {.name = "Association", .defaultValue = no, .scopes = {"ASSOCIATION"}, .isOverridable = false},
        {.name = "Description", .defaultValue = noText, .scopes = qualifierScopes(), .isTranslatable = true},
        {.name = "EmbeddedObject", .defaultValue = no, .scopes = valued, .isOverridable = false},
        {.name = "In", .defaultValue = yes, .scopes = {"PARAMETER"}, .isOverridable = false},
        {.name = "Indication", .defaultValue = no, .scopes = {"CLASS", "INDICATION"}, .isOverridable = false},
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

std::string referenceClassOf(const CimProperty& property) {
    const char* target = property.getReferenceClass();
    return target ? target : "";
}

/// What the superclasses have declared: names, with the class that each reference leads to, and which of them
/// are keys.
struct Inherited {
    std::map<std::string, std::string> referenceClasses;
    std::set<std::string> keys;

    void add(const CimProperty& property) {
        referenceClasses[foldName(property.getName())] = referenceClassOf(property);
        if (property.isKey()) keys.insert(foldName(property.getName()));
    }
    bool has(const CimProperty& property) const {
        return referenceClasses.contains(foldName(property.getName()));
    }
    /// Bindings repeat inherited properties; only a repetition that changes something is a declaration.
    bool isNewOrChanged(const CimProperty& property) const {
        if (!has(property)) return true;
        const std::string name = foldName(property.getName());
        return (property.isKey() && !keys.contains(name)) ||
               referenceClasses.at(name) != referenceClassOf(property);  // a reference narrows its class
    }
};

Qualifier flag(const char* name, bool value) {
    return {name, CimValue::of(CimType::Boolean, value)};
}

Qualifier textQualifier(const char* name, const std::string& text) {
    return {name, CimValue::of(CimType::String, text)};
}

PropertyDeclaration declare(CimProperty& property, bool isRepeated) {
    PropertyDeclaration result{property.getName(), property.getType(), property.isArray(), property.isKey(),
                               referenceClassOf(property)};
    if (isRepeated) result.qualifiers.push_back(textQualifier("Override", result.name));
    return result;
}

/// The properties that the class adds, read off an instance of it.
std::vector<PropertyDeclaration> readProperties(const CimClassInfo& info) {
    if (info.makeSample == nullptr) return {};
    // Nothing but a constructor knows which class of the chain brought which property.
    const DeclarationRecorder recorder;
    const auto sample = info.makeSample();
    const auto& all = sample->getAllProperties();
    Inherited inherited;
    std::vector<PropertyDeclaration> result;
    std::size_t begin = 0;
    for (const auto& [declaring, end] : recorder.marks) {
        for (std::size_t i = begin; i < end; ++i) {
            if (declaring == &info && inherited.isNewOrChanged(*all[i])) {
                result.push_back(declare(*all[i], inherited.has(*all[i])));
            }
        }
        for (std::size_t i = begin; i < end; ++i)
            inherited.add(*all[i]);
        begin = end;
    }
    return result;
}

MethodDeclaration declare(const CimMethodInfo& method) {
    MethodDeclaration result{method.name, method.returnType, {}};
    for (const CimParameterInfo& parameter : method.parameters) {
        result.parameters.push_back({parameter.name, parameter.type, parameter.isArray, parameter.direction,
                                     parameter.optional,
                                     parameter.referenceClass ? parameter.referenceClass : ""});
    }
    return result;
}

/// The two arrays of a value map, which belong together by position.
std::vector<Qualifier> valueMap(std::string_view text) {
    if (text.empty()) return {};
    std::vector<CimScalar> values;
    std::vector<CimScalar> meanings;
    for (const std::string& one : utils::split(text, ';')) {
        const std::size_t equals = one.find('=');
        values.emplace_back(one.substr(0, equals));
        meanings.emplace_back(one.substr(equals + 1));
    }
    return {{"ValueMap", CimValue::arrayOf(CimType::String, std::move(values))},
            {"Values", CimValue::arrayOf(CimType::String, std::move(meanings))}};
}

/// Adds the texts of the element, if the schema has any.
void addTexts(std::vector<Qualifier>& qualifiers, const CimClassInfo& info, std::string_view element) {
    for (const CimElementText& text : info.texts) {
        if (text.element != element) continue;  // a handful per class, and read once per process
        qualifiers.push_back(textQualifier("Description", text.description));
        for (Qualifier& one : valueMap(text.values))
            qualifiers.push_back(std::move(one));
    }
}

void addTexts(ClassDeclaration& declaration, const CimClassInfo& info) {
    addTexts(declaration.qualifiers, info, "");
    for (PropertyDeclaration& property : declaration.properties)
        addTexts(property.qualifiers, info, property.name);
    for (MethodDeclaration& method : declaration.methods) {
        addTexts(method.qualifiers, info, method.name);
        for (ParameterDeclaration& parameter : method.parameters)
            addTexts(parameter.qualifiers, info, method.name + "." + parameter.name);
    }
}

std::shared_ptr<const ClassDeclaration> read(const CimClassInfo& info) {
    auto declaration = std::make_shared<ClassDeclaration>();
    declaration->name = info.name;
    if (info.superclass != nullptr) declaration->superclass = info.superclass->name;
    declaration->isAssociation = info.isAssociation;
    declaration->properties = readProperties(info);
    for (const CimMethodInfo& method : info.methods)
        declaration->methods.push_back(declare(method));
    addImpliedQualifiers(*declaration);
    addTexts(*declaration, info);
    return declaration;
}

using DeclarationsByName = std::map<std::string, std::shared_ptr<const ClassDeclaration>>;

/// Throws CimError if a server sends classes whose chains would take all memory.
void addSuperclasses(ClassChain& chain, const DeclarationsByName& byName) {
    // Schemas stay below twenty.
    constexpr std::size_t kMaxLength = 64;
    for (;;) {
        const auto superclass = byName.find(foldName(chain.back()->superclass));
        if (superclass == byName.end()) return;
        const std::string& name = superclass->second->name;
        if (derivesFrom(chain, name))
            throw CimError(CimStatus::Failed, "class " + name + " is its own superclass");
        if (chain.size() == kMaxLength)
            throw CimError(CimStatus::Failed, "class " + chain.front()->name + " has too many superclasses");
        chain.push_back(superclass->second);
    }
}

/// Reads each class once, and remembers it by name, so that nothing points into a library that has unloaded.
std::shared_ptr<const ClassDeclaration> declarationOf(const CimClassInfo& info) {
    static utils::Mutex mutex;
    static DeclarationsByName known;
    const utils::Mutex::AutoLocker lock(mutex);
    // Held while the sample is built, whose constructors need no declaration.
    auto& declaration = known[info.name];
    if (declaration == nullptr) declaration = read(info);
    return declaration;
}

}  // namespace

const std::vector<std::string_view>& qualifierScopes() {
    static const Scopes kScopes{"CLASS",  "ASSOCIATION", "REFERENCE", "PROPERTY",
                                "METHOD", "PARAMETER",   "INDICATION"};
    return kScopes;
}

const std::vector<QualifierDeclaration>& qualifierDeclarations() {
    static const std::vector<QualifierDeclaration> kDeclarations = makeDeclarations();
    return kDeclarations;
}

std::vector<Qualifier> mergeQualifiers(std::vector<Qualifier> own, const std::vector<Qualifier>& inherited) {
    for (const Qualifier& one : inherited) {
        // A qualifier without a declaration comes from a foreign server; by default they are inherited.
        const QualifierDeclaration* declaration = findByName(qualifierDeclarations(), one.name);
        if (declaration != nullptr && !declaration->isInherited) continue;
        if (findByName(own, one.name) == nullptr) own.push_back({one.name, one.value, true});
    }
    return own;
}

ClassChain declarationsOf(const CimClassInfo& info) {
    ClassChain chain;
    for (const CimClassInfo* level = &info; level != nullptr; level = level->superclass)
        chain.push_back(declarationOf(*level));
    return chain;
}

std::vector<ClassChain> chainsOf(std::vector<ClassDeclaration> declarations) {
    DeclarationsByName byName;
    std::vector<ClassChain> chains;
    for (ClassDeclaration& each : declarations) {
        chains.push_back({std::make_shared<const ClassDeclaration>(std::move(each))});
        byName.emplace(foldName(chains.back().front()->name), chains.back().front());
    }
    for (ClassChain& chain : chains) {
        addSuperclasses(chain, byName);
    }
    return chains;
}

void addImpliedQualifiers(ClassDeclaration& declaration) {
    // MOF wants Association to be the first qualifier of its class.
    if (declaration.isAssociation)
        declaration.qualifiers.insert(declaration.qualifiers.begin(), flag("Association", true));
    for (PropertyDeclaration& property : declaration.properties) {
        if (property.isKey) property.qualifiers.insert(property.qualifiers.begin(), flag("Key", true));
    }
    for (MethodDeclaration& method : declaration.methods) {
        for (ParameterDeclaration& parameter : method.parameters) {
            const bool isInput = parameter.direction == CimDirection::In;
            // In is true by default (DSP0004), so an output has to deny it.
            parameter.qualifiers.push_back(flag("In", isInput));
            if (!isInput) parameter.qualifiers.push_back(flag("Out", true));
        }
    }
}

bool derivesFrom(const ClassChain& chain, std::string_view className) {
    return std::ranges::any_of(
        chain, [&](const auto& declaration) { return sameName(declaration->name, className); });
}

bool isBelow(const ClassChain& chain, std::string_view className, bool deep) {
    const ClassDeclaration& first = *chain.front();
    if (className.empty()) return deep || first.superclass.empty();
    if (sameName(first.name, className)) return false;
    return deep ? derivesFrom(chain, className) : sameName(first.superclass, className);
}

bool isAssociation(const ClassChain& chain) {
    return std::ranges::any_of(chain, [](const auto& declaration) { return declaration->isAssociation; });
}

const MethodDeclaration* findMethod(const ClassChain& chain, std::string_view name) {
    for (const auto& declaration : chain) {
        if (const MethodDeclaration* method = findByName(declaration->methods, name)) return method;
    }
    return nullptr;
}

}  // namespace core
