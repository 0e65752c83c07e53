#include "Host/Operations/PathTyping.h"

#include <algorithm>

#include "CimXml/ValueReader.h"

namespace host {

namespace {

using core::CimError;
using core::CimKey;
using core::CimPath;
using core::CimScalar;
using core::CimStatus;

/// The key properties of a class, the nearest declaration of each.
std::vector<core::PropertyDeclaration> keysOf(const core::ClassChain& chain) {
    std::vector<core::PropertyDeclaration> keys;
    for (const auto& declaration : chain) {
        for (const core::PropertyDeclaration& property : declaration->properties) {
            const bool known = std::any_of(keys.begin(), keys.end(), [&](const auto& key) {
                return core::sameName(key.name, property.name);
            });
            if (property.isKey && !known) keys.push_back(property);
        }
    }
    return keys;
}

[[noreturn]] void refuse(const std::string& text) {
    throw CimError(CimStatus::InvalidParameter, text);
}

CimScalar typedKey(const NamespaceModel& model, const core::PropertyDeclaration& declared,
                   const CimScalar& value) {
    const auto* text = std::get_if<std::string>(&value);
    const auto typed =
        text != nullptr ? core::parseScalar(declared.type, *text) : core::convertScalar(declared.type, value);
    if (!typed) {
        refuse("key " + declared.name + " is no " + std::string(core::typeName(declared.type)));
    }
    if (const auto* path = std::get_if<CimPath>(&*typed)) return typedReference(model, *path);
    return *typed;
}

CimPath withPlace(std::vector<CimKey> keys, const std::string& className, const CimPath& place) {
    CimPath path(className, std::move(keys));
    path.setNamespace(place.getNamespace());
    path.setHost(place.getHost());
    return path;
}

void typeReferences(const NamespaceModel& model, core::CimValue& value) {
    if (auto* scalar = std::get_if<CimScalar>(&value.data)) {
        if (auto* path = std::get_if<CimPath>(scalar)) *path = typedReference(model, *path);
    } else if (auto* elements = std::get_if<std::vector<CimScalar>>(&value.data)) {
        for (CimScalar& element : *elements) {
            if (auto* path = std::get_if<CimPath>(&element)) *path = typedReference(model, *path);
        }
    }
}

}  // namespace

CimPath typedPath(const NamespaceModel& model, const core::ClassChain& chain, const CimPath& path) {
    const std::vector<core::PropertyDeclaration> declared = keysOf(chain);
    const std::string& className = chain.front()->name;
    if (declared.empty() || path.getKeys().size() != declared.size()) {
        refuse(className + " has " + std::to_string(declared.size()) + " keys, not " +
               std::to_string(path.getKeys().size()));
    }
    std::vector<CimKey> keys;
    for (const CimKey& key : path.getKeys()) {
        const auto found = std::find_if(declared.begin(), declared.end(), [&](const auto& each) {
            return core::sameName(each.name, key.name) || (key.name.empty() && declared.size() == 1);
        });
        if (found == declared.end()) refuse(className + " has no key " + key.name);
        if (std::any_of(keys.begin(), keys.end(),
                        [&](const CimKey& seen) { return seen.name == found->name; })) {
            refuse("key " + found->name + " is given twice");
        }
        keys.push_back({found->name, typedKey(model, *found, key.value)});
    }
    return withPlace(std::move(keys), className, path);
}

CimPath typedReference(const NamespaceModel& model, const CimPath& path) {
    const core::ClassChain chain = model.findClass(path.getClassName());
    if (chain.empty() || !path.isInstancePath()) return path;
    try {
        return typedPath(model, chain, path);
    } catch (const CimError&) {
        return path;
    }
}

std::vector<core::Argument> typedArguments(const NamespaceModel& model, const core::MethodDeclaration& method,
                                           const std::vector<cimxml::RawArgument>& arguments) {
    std::vector<core::Argument> typed;
    for (const cimxml::RawArgument& argument : arguments) {
        const auto found =
            std::find_if(method.parameters.begin(), method.parameters.end(),
                         [&](const auto& each) { return core::sameName(each.name, argument.name); });
        if (found == method.parameters.end()) refuse(method.name + " has no parameter " + argument.name);
        auto value = cimxml::typedValueOf(argument.value, found->type, found->isArray);
        if (!value) {
            refuse("parameter " + found->name + " is no " + std::string(core::typeName(found->type)) +
                   (found->isArray ? " array" : ""));
        }
        typeReferences(model, *value);
        typed.push_back({found->name, std::move(*value)});
    }
    return typed;
}

}  // namespace host
