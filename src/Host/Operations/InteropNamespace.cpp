// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/InteropNamespace.h"

#include <algorithm>
#include <array>

#include "Framework/Requests/CimOperations.h"
#include "Host/Operations/Operations.h"

namespace host {

namespace {

using core::CimPath;
using core::CimScalar;
using core::InstanceValue;

/// What is shown of the providers' classes: these and what derives from them.
constexpr std::array<const char*, 3> kShown{"CIM_RegisteredProfile", "CIM_ReferencedProfile",
                                            "CIM_ElementConformsToProfile"};

const core::PropertyFilter kNoProperties{std::vector<std::string>()};

InstanceValue filtered(InstanceValue instance, const core::PropertyFilter& filter) {
    const core::WantedProperties wanted(filter);
    std::erase_if(instance.properties,
                  [&](const core::PropertyValue& property) { return !wanted.includes(property.name); });
    return instance;
}

}  // namespace

InteropNamespace::InteropNamespace(std::string name, std::shared_ptr<core::CimOperations> implementation,
                                   InteropModel model)
    : m_name(std::move(name)), m_implementation(std::move(implementation)), m_model(std::move(model)) {
    for (InstanceValue& own : m_model.instances)
        own.path.setNamespace(m_name);
}

core::ClassChain InteropNamespace::findOwnClass(const std::string& className) const {
    const auto found = std::find_if(
        m_model.classes.begin(), m_model.classes.end(),
        [&](const core::ClassChain& chain) { return core::sameName(chain.front()->name, className); });
    return found == m_model.classes.end() ? core::ClassChain() : *found;
}

CimPath InteropNamespace::typedOwnPath(const CimPath& path) const {
    return core::typedPath(path, [this](const std::string& name) { return findOwnClass(name); });
}

bool InteropNamespace::isShown(const core::ClassChain& chain) const {
    return std::any_of(kShown.begin(), kShown.end(), [&](const char* shown) {
        // If a class is shown, so are its superclasses: a client reads their declarations.
        return core::derivesFrom(chain, shown) ||
               core::derivesFrom(m_implementation->getClass(shown), chain.front()->name);
    });
}

std::vector<std::string> InteropNamespace::sources(const std::string& className) const {
    // If the class is a superclass such as CIM_ManagedElement, the shown classes below it: the providers have
    // others below it that are not shown.
    const core::ClassChain chain = m_implementation->getClass(className);
    std::vector<std::string> names;
    for (const char* shown : kShown) {
        if (!chain.empty() && core::derivesFrom(chain, shown)) return {className};
        if (core::derivesFrom(m_implementation->getClass(shown), className)) names.emplace_back(shown);
    }
    return names;
}

CimPath InteropNamespace::atProviders(CimPath path) const {
    if (!path.getNamespace().empty() && !core::sameName(path.getNamespace(), m_name))
        throw core::CimError(core::CimStatus::NotFound, core::shownPath(path) + " names no instance");
    path.setNamespace("");
    return path;
}

void InteropNamespace::relocate(CimPath& path) const {
    // A client comes back with the path, so it has to name the namespace in which its instance is served.
    std::vector<core::CimKey> keys = path.getKeys();
    for (core::CimKey& key : keys) {
        if (auto* reference = std::get_if<CimPath>(&key.value)) relocate(*reference);
    }
    const core::ClassChain chain = m_implementation->getClass(path.getClassName());
    path = CimPath(path.getClassName(), std::move(keys));
    path.setNamespace(!chain.empty() && isShown(chain) ? m_name : m_implementation->getNamespace());
}

void InteropNamespace::relocate(InstanceValue& instance) const {
    relocate(instance.path);
    for (core::PropertyValue& property : instance.properties) {
        property.value.forEach([this](CimScalar& scalar) {
            if (auto* reference = std::get_if<CimPath>(&scalar)) relocate(*reference);
        });
    }
}

std::vector<InstanceValue> InteropNamespace::enumerateInstances(const std::string& className,
                                                                const core::PropertyFilter& filter) {
    requireClass(*this, className, core::CimStatus::InvalidClass);
    std::vector<InstanceValue> result;
    for (const InstanceValue& own : m_model.instances) {
        if (core::derivesFrom(findOwnClass(own.path.getClassName()), className))
            result.push_back(filtered(own, filter));
    }
    for (const std::string& source : sources(className)) {
        for (InstanceValue& instance : relocated(m_implementation->enumerateInstances(source, filter)))
            result.push_back(std::move(instance));
    }
    return result;
}

std::vector<CimPath> InteropNamespace::enumerateInstanceNames(const std::string& className) {
    std::vector<CimPath> paths;
    for (InstanceValue& instance : enumerateInstances(className, kNoProperties))
        paths.push_back(std::move(instance.path));
    return paths;
}

InstanceValue InteropNamespace::getInstance(const CimPath& path, const core::PropertyFilter& filter) {
    if (!sources(path.getClassName()).empty()) {
        InstanceValue instance = m_implementation->getInstance(atProviders(path), filter);
        relocate(instance);
        return instance;
    }
    const CimPath typed = typedOwnPath(path);
    for (const InstanceValue& own : m_model.instances) {
        if (own.path.isSameObjectAs(typed)) return filtered(own, filter);
    }
    throw core::CimError(core::CimStatus::NotFound, core::shownPath(path) + " names no instance");
}

bool InteropNamespace::hasAssociations(const CimPath& path, const core::AssociationFilter& by) const {
    bool leads = true;
    for (const std::string& name : {by.associationClass, by.resultClass}) {
        if (name.empty() || !m_implementation->getClass(name).empty()) continue;
        if (findOwnClass(name).empty())
            throw core::CimError(core::CimStatus::InvalidParameter, "no class \"" + name + "\"");
        leads = false;  // the filter allows the manager's own classes alone, and those have no associations
    }
    if (!sources(path.getClassName()).empty()) return leads;
    atProviders(typedOwnPath(path));
    return false;
}

std::vector<InstanceValue> InteropNamespace::associators(const CimPath& path,
                                                         const core::AssociationFilter& by,
                                                         const core::PropertyFilter& filter) {
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->associators(atProviders(path), by, filter));
}

std::vector<CimPath> InteropNamespace::associatorNames(const CimPath& path,
                                                       const core::AssociationFilter& by) {
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->associatorNames(atProviders(path), by));
}

std::vector<InstanceValue> InteropNamespace::references(const CimPath& path,
                                                        const core::AssociationFilter& by,
                                                        const core::PropertyFilter& filter) {
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->references(atProviders(path), by, filter));
}

std::vector<CimPath> InteropNamespace::referenceNames(const CimPath& path,
                                                      const core::AssociationFilter& by) {
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->referenceNames(atProviders(path), by));
}

core::MethodResult InteropNamespace::invokeMethod(const CimPath& path, const std::string& method,
                                                  const std::vector<core::Argument>&) {
    requireClass(*this, path.getClassName(), core::CimStatus::NotFound);
    throw core::CimError(core::CimStatus::MethodNotFound, path.getClassName() + " has no method " + method);
}

void InteropNamespace::deleteInstance(const CimPath& path) {
    // A client that is wrong about the instance hears that first.
    getInstance(path, kNoProperties);
    throw core::CimError(core::CimStatus::NotSupported,
                         "instances of " + path.getClassName() + " cannot be deleted");
}

core::ClassChain InteropNamespace::getClass(const std::string& className) {
    core::ClassChain own = findOwnClass(className);
    if (!own.empty()) return own;
    core::ClassChain chain = m_implementation->getClass(className);
    return chain.empty() || isShown(chain) ? chain : core::ClassChain();
}

std::vector<core::ClassChain> InteropNamespace::enumerateClasses(const std::string& className, bool deep) {
    if (!className.empty()) requireClass(*this, className, core::CimStatus::InvalidClass);
    std::vector<core::ClassChain> known = m_model.classes;
    for (core::ClassChain& chain : m_implementation->enumerateClasses("", true)) {
        if (findOwnClass(chain.front()->name).empty() && isShown(chain)) known.push_back(std::move(chain));
    }
    std::erase_if(known,
                  [&](const core::ClassChain& chain) { return !core::isBelow(chain, className, deep); });
    return known;
}

}  // namespace host
