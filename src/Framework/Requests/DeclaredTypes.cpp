#include "Framework/Requests/TypedPath.h"

#include <algorithm>

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimValue.h"

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

}  // namespace core
