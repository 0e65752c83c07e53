// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/InteropNamespace.h"

#include <algorithm>
#include <array>

#include "Framework/Model/CimError.h"
#include "Framework/Requests/DeclaredTypes.h"

namespace host {

namespace {

using core::CimPath;
using core::CimScalar;
using core::InstanceValue;

/// What is shown of the providers' classes: these and what derives from them.
constexpr std::array<const char*, 3> kShown{"CIM_RegisteredProfile", "CIM_ReferencedProfile",
                                            "CIM_ElementConformsToProfile"};

InstanceValue filtered(InstanceValue instance, const core::PropertyFilter& filter) {
    std::erase_if(instance.properties, [&](const core::PropertyValue& property) {
        return !core::isWanted(filter, property.name);
    });
    return instance;
}

[[noreturn]] void refuseClass(core::CimStatus status, const std::string& className,
                              const std::string& place) {
    throw core::CimError(status, "no class \"" + className + "\" in " + place);
}

}  // namespace

InteropNamespace::InteropNamespace(std::string name, std::shared_ptr<core::CimOperations> implementation,
                                   std::shared_ptr<const InteropModel> model)
    : m_name(std::move(name)), m_implementation(std::move(implementation)), m_model(std::move(model)) {}

bool InteropNamespace::isShown(const core::ClassChain& chain) const {
    return std::any_of(kShown.begin(), kShown.end(), [&](const char* shown) {
        // A superclass of what is shown is shown as well: a client reads its declaration.
        const core::ClassChain base = m_implementation->getClass(shown);
        return core::derivesFrom(chain, shown) || core::derivesFrom(base, chain.front()->name);
    });
}

std::vector<std::string> InteropNamespace::sources(const std::string& className) const {
    const core::ClassChain chain = m_implementation->getClass(className);
    std::vector<std::string> names;
    for (const char* shown : kShown) {
        if (!chain.empty() && core::derivesFrom(chain, shown)) return {className};
        if (core::derivesFrom(m_implementation->getClass(shown), className)) names.emplace_back(shown);
    }
    return names;
}

core::CimPath InteropNamespace::relocated(const CimPath& path) const {
    std::vector<core::CimKey> keys = path.getKeys();
    for (core::CimKey& key : keys) {
        if (auto* reference = std::get_if<CimPath>(&key.value)) *reference = relocated(*reference);
    }
    CimPath moved(path.getClassName(), std::move(keys));
    const core::ClassChain chain = m_implementation->getClass(path.getClassName());
    moved.setNamespace(!chain.empty() && isShown(chain) ? m_name : m_implementation->getNamespace());
    return moved;
}

InstanceValue InteropNamespace::relocated(InstanceValue instance) const {
    instance.path = relocated(instance.path);
    for (core::PropertyValue& property : instance.properties) {
        auto* scalar = std::get_if<CimScalar>(&property.value.data);
        auto* reference = scalar == nullptr ? nullptr : std::get_if<CimPath>(scalar);
        if (reference != nullptr) *reference = relocated(*reference);
    }
    return instance;
}

std::vector<CimPath> InteropNamespace::relocated(const std::vector<CimPath>& paths) const {
    std::vector<CimPath> moved;
    moved.reserve(paths.size());
    for (const CimPath& path : paths)
        moved.push_back(relocated(path));
    return moved;
}

std::vector<InstanceValue> InteropNamespace::relocated(std::vector<InstanceValue> instances) const {
    for (InstanceValue& instance : instances)
        instance = relocated(std::move(instance));
    return instances;
}

std::vector<InstanceValue> InteropNamespace::enumerateInstances(const std::string& className,
                                                                const core::PropertyFilter& filter) {
    if (getClass(className).empty()) refuseClass(core::CimStatus::InvalidClass, className, m_name);
    std::vector<InstanceValue> result;
    for (const InstanceValue& own : m_model->instances(m_name)) {
        if (core::derivesFrom(m_model->findClass(own.path.getClassName()), className)) {
            result.push_back(filtered(own, filter));
        }
    }
    for (const std::string& source : sources(className)) {
        for (InstanceValue& instance : relocated(m_implementation->enumerateInstances(source, filter))) {
            result.push_back(std::move(instance));
        }
    }
    return result;
}

std::vector<CimPath> InteropNamespace::enumerateInstanceNames(const std::string& className) {
    std::vector<CimPath> paths;
    const core::PropertyFilter none{std::vector<std::string>()};
    for (InstanceValue& instance : enumerateInstances(className, none)) {
        paths.push_back(std::move(instance.path));
    }
    return paths;
}

InstanceValue InteropNamespace::getInstance(const CimPath& path, const core::PropertyFilter& filter) {
    if (!sources(path.getClassName()).empty()) return relocated(m_implementation->getInstance(path, filter));
    const CimPath typed =
        core::typedPath(path, [this](const std::string& name) { return m_model->findClass(name); });
    // The manager's own instances are few: they are made anew for each request.
    for (InstanceValue& own : m_model->instances(m_name)) {
        if (own.path.isSameObjectAs(typed)) return filtered(std::move(own), filter);
    }
    throw core::CimError(core::CimStatus::NotFound, path.toString() + " names no instance");
}

bool InteropNamespace::hasAssociations(const CimPath& path, const core::AssociationFilter& by) {
    bool leads = true;
    for (const std::string& name : {by.associationClass, by.resultClass}) {
        if (name.empty() || !m_implementation->getClass(name).empty()) continue;
        if (m_model->findClass(name).empty()) {
            throw core::CimError(core::CimStatus::InvalidParameter, "no class \"" + name + "\"");
        }
        leads = false;
    }
    if (!sources(path.getClassName()).empty()) return leads;
    core::typedPath(path, [this](const std::string& name) { return m_model->findClass(name); });
    return false;
}

std::vector<InstanceValue> InteropNamespace::associators(const CimPath& path,
                                                         const core::AssociationFilter& by,
                                                         const core::PropertyFilter& filter) {
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->associators(path, by, filter));
}

std::vector<CimPath> InteropNamespace::associatorNames(const CimPath& path,
                                                       const core::AssociationFilter& by) {
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->associatorNames(path, by));
}

std::vector<InstanceValue> InteropNamespace::references(const CimPath& path,
                                                        const core::AssociationFilter& by,
                                                        const core::PropertyFilter& filter) {
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->references(path, by, filter));
}

std::vector<CimPath> InteropNamespace::referenceNames(const CimPath& path,
                                                      const core::AssociationFilter& by) {
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->referenceNames(path, by));
}

core::MethodResult InteropNamespace::invokeMethod(const CimPath& path, const std::string& method,
                                                  const std::vector<core::Argument>&) {
    if (getClass(path.getClassName()).empty())
        refuseClass(core::CimStatus::NotFound, path.getClassName(), m_name);
    throw core::CimError(core::CimStatus::MethodNotFound, path.getClassName() + " has no method " + method);
}

void InteropNamespace::deleteInstance(const CimPath& path) {
    getInstance(path, core::PropertyFilter(std::vector<std::string>()));
    throw core::CimError(core::CimStatus::NotSupported,
                         "instances of " + path.getClassName() + " cannot be deleted");
}

core::ClassChain InteropNamespace::getClass(const std::string& className) {
    core::ClassChain own = m_model->findClass(className);
    if (!own.empty()) return own;
    core::ClassChain chain = m_implementation->getClass(className);
    return chain.empty() || isShown(chain) ? chain : core::ClassChain();
}

std::vector<core::ClassChain> InteropNamespace::enumerateClasses(const std::string& className, bool deep) {
    if (!className.empty() && getClass(className).empty())
        refuseClass(core::CimStatus::InvalidClass, className, m_name);
    std::vector<core::ClassChain> known = m_model->classes();
    for (core::ClassChain& chain : m_implementation->enumerateClasses("", true)) {
        if (m_model->findClass(chain.front()->name).empty() && isShown(chain)) {
            known.push_back(std::move(chain));
        }
    }
    std::erase_if(known,
                  [&](const core::ClassChain& chain) { return !core::isBelow(chain, className, deep); });
    return known;
}

}  // namespace host
