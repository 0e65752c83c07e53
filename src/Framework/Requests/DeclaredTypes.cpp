// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/DeclaredTypes.h"

#include <algorithm>

#include "Framework/Model/CimError.h"

namespace core {

namespace {

/// The key properties of a class, the nearest declaration of each.
std::vector<PropertyDeclaration> keysOf(const ClassChain& chain) {
    std::vector<PropertyDeclaration> keys;
    for (const auto& declaration : chain) {
        for (const PropertyDeclaration& property : declaration->properties) {
            const bool known = std::any_of(
                keys.begin(), keys.end(), [&](const auto& key) { return sameName(key.name, property.name); });
            if (property.isKey && !known) keys.push_back(property);
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
    const std::vector<PropertyDeclaration> declared = keysOf(chain);
    const std::string& className = chain.front()->name;
    if (declared.empty() || path.getKeys().size() != declared.size()) {
        refuse(className + " has " + std::to_string(declared.size()) + " keys, not " +
               std::to_string(path.getKeys().size()));
    }
    std::vector<CimKey> keys;
    for (const CimKey& key : path.getKeys()) {
        const auto found = std::find_if(declared.begin(), declared.end(), [&](const auto& each) {
            return sameName(each.name, key.name) || (key.name.empty() && declared.size() == 1);
        });
        if (found == declared.end()) refuse(className + " has no key " + key.name);
        if (std::any_of(keys.begin(), keys.end(),
                        [&](const CimKey& seen) { return seen.name == found->name; })) {
            refuse("key " + found->name + " is given twice");
        }
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

/// What a client may mix up within, such as the widths of integers.
enum class Kind { Boolean, Text, Integer, Real, Datetime, Reference };

Kind kindOf(CimType type) {
    switch (type) {
        case CimType::Boolean:
            return Kind::Boolean;
        case CimType::String:
        case CimType::Char16:
            return Kind::Text;
        case CimType::Datetime:
            return Kind::Datetime;
        case CimType::Reference:
            return Kind::Reference;
        default:
            return isReal(type) ? Kind::Real : Kind::Integer;
    }
}

/// A path written as a text would be guessed at, so a reference is never read from one.
std::optional<CimScalar> typedElement(CimType type, const CimScalar& value, const Argument& given) {
    const auto* text = given.isUntyped ? std::get_if<std::string>(&value) : nullptr;
    if (text != nullptr && type != CimType::Reference) return parseScalar(type, *text);
    return kindOf(type) == kindOf(given.value.type) ? convertScalar(type, value) : std::nullopt;
}

/// The value as the declaration wants it; nothing where it is of another kind, or does not fit.
std::optional<CimValue> typedValue(const ParameterDeclaration& declared, const Argument& given,
                                   const ClassLookup& classes) {
    if (given.value.isNull()) return CimValue::null(declared.type, declared.isArray);
    const CimScalar* single = given.value.scalar();
    if (single == nullptr && !declared.isArray) return std::nullopt;
    std::vector<CimScalar> typed;
    for (const CimScalar& each : single == nullptr ? *given.value.elements() : std::vector{*single}) {
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

CimPath typedPath(const CimPath& path, const ClassLookup& classes) {
    if (!path.isValid()) {
        refuse("'" + path.toString() + "' is not an object path; write one as namespace:Class.Key=\"value\"");
    }
    const ClassChain chain = classes(path.getClassName());
    if (chain.empty()) {
        throw CimError(CimStatus::InvalidClass, "no class \"" + path.getClassName() + "\" is served");
    }
    return typedKeys(path, chain, classes);
}

const Argument* findArgument(const std::vector<Argument>& arguments, std::string_view name) {
    const auto found = std::find_if(arguments.begin(), arguments.end(),
                                    [&](const Argument& argument) { return sameName(argument.name, name); });
    return found == arguments.end() ? nullptr : &*found;
}

/// The arguments with their declared names and types.
std::vector<Argument> typedArguments(const MethodDeclaration& method, const std::vector<Argument>& arguments,
                                     const ClassLookup& classes) {
    std::vector<Argument> result;
    for (const Argument& given : arguments) {
        const auto declared =
            std::find_if(method.parameters.begin(), method.parameters.end(),
                         [&](const auto& parameter) { return sameName(parameter.name, given.name); });
        if (declared == method.parameters.end()) {
            refuse(method.name + " has no parameter " + given.name);
        }
        if (findArgument(result, declared->name) != nullptr) {
            refuse(declared->name + " is given twice");
        }
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
