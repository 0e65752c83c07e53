// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/CimOperations.h"

#include <algorithm>
#include <span>

#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"
#include "Framework/Requests/AnswerMeter.h"
#include "Utils/Utils.h"

namespace core {

namespace {

PropertyValue readProperty(const CimProperty& property, const std::string& namespaceName) {
    PropertyValue result{property.getName(), property.getValue(), property.isKey(), {}};
    if (const char* target = property.getReferenceClass()) result.referenceClass = target;
    // Providers do not know in which namespace they are served.
    result.value.completeNamespace(namespaceName);
    return result;
}

/// The key properties of a class, the nearest declaration of each.
using DeclaredKeys = std::vector<const PropertyDeclaration*>;

const PropertyDeclaration* findKey(const DeclaredKeys& keys, std::string_view name) {
    const auto found = std::ranges::find_if(keys, [&](const auto* key) { return sameName(key->name, name); });
    return found == keys.end() ? nullptr : *found;
}

DeclaredKeys keysOf(const ClassChain& chain) {
    DeclaredKeys keys;
    // From the class to the root, so that a reference that a subclass narrows counts as narrowed.
    for (const auto& declaration : chain) {
        for (const PropertyDeclaration& property : declaration->properties) {
            if (property.isKey && findKey(keys, property.name) == nullptr) keys.push_back(&property);
        }
    }
    return keys;
}

[[noreturn]] void refuse(const std::string& text) {
    throw CimError(CimStatus::InvalidParameter, text);
}

CimPath typedReference(const CimPath& path, const ClassLookup& classes);

CimScalar typedKey(const PropertyDeclaration& declared, const CimScalar& value, const ClassLookup& classes) {
    const auto* text = std::get_if<std::string>(&value);
    // A text is parsed, not converted: a command line and some clients know no types, and write 5 as "5".
    const auto typed =
        text != nullptr ? parseScalar(declared.type, *text) : convertScalar(declared.type, value);
    if (!typed) {
        refuse("key " + declared.name + " does not hold a value of type " +
               std::string(typeName(declared.type)));
    }
    if (const auto* path = std::get_if<CimPath>(&*typed)) return typedReference(*path, classes);
    return *typed;
}

CimPath typedKeys(const CimPath& path, const ClassChain& chain, const ClassLookup& classes) {
    const DeclaredKeys declared = keysOf(chain);
    const std::string& className = chain.front()->name;
    if (declared.empty() || path.getKeys().size() != declared.size()) {
        refuse(className + " has " + std::to_string(declared.size()) + " keys, not " +
               std::to_string(path.getKeys().size()));
    }
    std::vector<CimKey> keys;
    for (const CimKey& key : path.getKeys()) {
        // CIM-XML lets a class's one key come without its name (DSP0201, KEYVALUE without KEYBINDING).
        const bool isOnlyKey = key.name.empty() && declared.size() == 1;
        const PropertyDeclaration* found = isOnlyKey ? declared.front() : findKey(declared, key.name);
        if (found == nullptr) refuse(className + " has no key " + key.name);
        if (findByName(keys, found->name) != nullptr) refuse("key " + found->name + " is given twice");
        keys.push_back({found->name, typedKey(*found, key.value, classes)});
    }
    CimPath typed(className, std::move(keys));
    typed.setNamespace(path.getNamespace());
    typed.setHost(path.getHost());
    return typed;
}

/// A reference that an argument or a key holds. One that does not fit its class is left as it is, and equals
/// nothing.
CimPath typedReference(const CimPath& path, const ClassLookup& classes) {
    if (!path.isInstancePath()) return path;
    const ClassChain chain = classes(path.getClassName());
    if (chain.empty()) return path;
    try {
        return typedKeys(path, chain, classes);
    } catch (const CimError&) {
        return path;
    }
}

/// Clients may mix up the widths of integers. A path or a date written as a text would be guessed at, so
/// those are never converted.
std::optional<CimScalar> typedElement(CimType type, const CimScalar& value, const Argument& given) {
    const auto* text = given.isUntyped ? std::get_if<std::string>(&value) : nullptr;
    if (text != nullptr && type != CimType::Reference) return parseScalar(type, *text);
    const bool mustBeGivenSo = type == CimType::Reference || type == CimType::Datetime;
    return mustBeGivenSo && given.value.type != type ? std::nullopt : convertScalar(type, value);
}

/// An order in which the same names are equal. Names are not copied for it: most are too long for that.
bool isFoldedBefore(std::string_view left, std::string_view right) {
    return std::lexicographical_compare(
        left.begin(), left.end(), right.begin(), right.end(),
        [](char a, char b) { return utils::lowerCase(a) < utils::lowerCase(b); });
}

/// The value as the declaration wants it; nothing where it is of another kind, or does not fit.
std::optional<CimValue> typedValue(const ParameterDeclaration& declared, const Argument& given,
                                   const ClassLookup& classes) {
    if (given.value.isNull()) return CimValue::null(declared.type, declared.isArray);
    const CimScalar* single = given.value.scalar();
    if (single == nullptr && !declared.isArray) return std::nullopt;
    std::vector<CimScalar> typed;
    for (const CimScalar& each :
         single == nullptr ? std::span(*given.value.elements()) : std::span(single, 1)) {
        auto value = typedElement(declared.type, each, given);
        if (!value) return std::nullopt;
        if (auto* path = std::get_if<CimPath>(&*value)) *path = typedReference(*path, classes);
        typed.push_back(std::move(*value));
    }
    // An array of one element may come as the element alone.
    if (declared.isArray) return CimValue::arrayOf(declared.type, std::move(typed));
    return CimValue::of(declared.type, std::move(typed.front()));
}

}  // namespace

InstanceSink::~InstanceSink() = default;

CimOperations::~CimOperations() = default;

void CimOperations::streamInstances(const std::string& className, const PropertyFilter& filter,
                                    InstanceSink& sink) {
    for (const InstanceValue& instance : enumerateInstances(className, filter))
        AnswerMeter::tell(sink.take(instance));
}

void CimOperations::streamInstance(const CimPath& path, const PropertyFilter& filter, InstanceSink& sink) {
    AnswerMeter::tell(sink.take(getInstance(path, filter)));
}

// Most cannot. A client that is wrong about the class or the instance, too, hears that first.

CimPath CimOperations::createInstance(const InstanceValue& instance) {
    const std::string& className = instance.path.getClassName();
    if (getClass(className).empty())
        throw CimError(CimStatus::InvalidClass, "no class \"" + className + "\" in " + getNamespace());
    throw CimError(CimStatus::NotSupported, "instances of " + className + " cannot be created");
}

void CimOperations::modifyInstance(const InstanceValue& instance, const PropertyFilter&) {
    getInstance(instance.path, std::vector<std::string>());
    throw CimError(CimStatus::NotSupported,
                   "instances of " + instance.path.getClassName() + " cannot be modified");
}

const PropertyValue* InstanceValue::find(std::string_view name) const {
    return findByName(properties, name);
}

std::vector<std::string> InstanceValue::texts(std::string_view name) const {
    const PropertyValue* property = find(name);
    std::vector<std::string> texts;
    if (property == nullptr || property->value.elements() == nullptr) return texts;
    for (const CimScalar& element : *property->value.elements()) {
        if (const auto* text = std::get_if<std::string>(&element)) texts.push_back(*text);
    }
    return texts;
}

WantedProperties::WantedProperties(const PropertyFilter& filter) {
    if (!filter) return;
    m_names.emplace(filter->begin(), filter->end());
    std::sort(m_names->begin(), m_names->end(), isFoldedBefore);
}

bool WantedProperties::includes(std::string_view name) const {
    return !m_names || std::binary_search(m_names->begin(), m_names->end(), name, isFoldedBefore);
}

const WantedProperties::Choice& WantedProperties::among(const CimInstance& instance)
    QUENX_NO_THREAD_SAFETY_ANALYSIS {
    const auto [entry, isNew] = m_choices.try_emplace(&instance.shape());
    Choice& choice = entry->second;
    if (!isNew) return choice;
    const std::vector<CimProperty*>& all = instance.getAllProperties();
    auto place = all.begin();
    for (CimProperty* property : instance.getProperties()) {
        place = std::find(place, all.end(), property);
        const bool isWanted = includes(property->getName());
        if (isWanted) choice.properties.push_back(static_cast<std::size_t>(place - all.begin()));
        if ((isWanted || property->isKey()) && property->getType() == CimType::Reference)
            choice.hasReferences = true;
    }
    return choice;
}

InstanceValue readInstance(CimInstance& instance, CimPath path, WantedProperties& wanted,
                           const std::string& namespaceName) {
    InstanceValue result{std::move(path), {}};
    result.path.completeNamespace(namespaceName);
    // One lock around all properties: a refresh on another thread shows whole or not at all.
    const RecursiveLocker lock(instance.getMutex());
    const std::vector<std::size_t>& chosen = wanted.among(instance).properties;
    result.properties.reserve(chosen.size());
    for (const std::size_t index : chosen)
        result.properties.push_back(readProperty(*instance.getAllProperties()[index], namespaceName));
    return result;
}

InstanceValue readInstance(CimInstance& instance, const std::string& namespaceName) {
    const PropertyFilter everything;
    WantedProperties wanted(everything);
    return readInstance(instance, *instance.getPath(), wanted, namespaceName);
}

std::string shownPath(const CimPath& path) {
    constexpr std::size_t kMost = 4096;
    const std::size_t bytes = bytesOf(path);
    return bytes <= kMost ? path.toString() : "a path of " + std::to_string(bytes) + " bytes";
}

CimPath typedPath(const CimPath& path, const ClassLookup& classes) {
    if (!path.isValid()) {
        refuse("'" + shownPath(path) + "' is not an object path; write one as namespace:Class.Key=\"value\"");
    }
    const ClassChain chain = classes(path.getClassName());
    if (chain.empty()) {
        throw CimError(CimStatus::InvalidClass, "no class \"" + path.getClassName() + "\" is served");
    }
    return typedKeys(path, chain, classes);
}

std::vector<Argument> typedArguments(const MethodDeclaration& method, const std::vector<Argument>& arguments,
                                     const ClassLookup& classes) {
    std::vector<Argument> result;
    for (const Argument& given : arguments) {
        const ParameterDeclaration* declared = findByName(method.parameters, given.name);
        if (declared == nullptr) refuse(method.name + " has no parameter " + given.name);
        if (findByName(result, declared->name) != nullptr) refuse(declared->name + " is given twice");
        auto value = typedValue(*declared, given, classes);
        if (!value) {
            refuse("parameter " + declared->name + " takes a value of type " +
                   std::string(typeName(declared->type)) + (declared->isArray ? "[]" : ""));
        }
        result.push_back({declared->name, std::move(*value)});
    }
    return result;
}

}  // namespace core
