// SPDX-License-Identifier: Apache-2.0
#include "Host/Operations/InteropNamespace.h"

#include <algorithm>
#include <array>
#include <iterator>

#include "Framework/Requests/CimOperations.h"
#include "Host/Operations/Operations.h"
#include "Indications/Subscriptions/Subscriptions.h"

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

std::vector<CimPath> pathsOf(std::vector<InstanceValue> instances) {
    std::vector<CimPath> paths;
    for (InstanceValue& instance : instances)
        paths.push_back(std::move(instance.path));
    return paths;
}

/// To the operations for references the association is the result.
core::AssociationFilter asReferences(const core::AssociationFilter& by) {
    return {by.associationClass.empty() ? by.resultClass : by.associationClass, "", by.role, ""};
}

}  // namespace

InteropNamespace::InteropNamespace(std::string name, std::shared_ptr<core::CimOperations> implementation,
                                   InteropModel model,
                                   std::shared_ptr<indications::Subscriptions> subscriptions)
    : m_name(std::move(name)),
      m_implementation(std::move(implementation)),
      m_model(std::move(model)),
      m_subscriptions(std::move(subscriptions)) {}

InteropNamespace::~InteropNamespace() = default;

core::ClassChain InteropNamespace::findOwnClass(const std::string& className) const {
    const auto found = std::find_if(
        m_model.classes.begin(), m_model.classes.end(),
        [&](const core::ClassChain& chain) { return core::sameName(chain.front()->name, className); });
    return found == m_model.classes.end() ? core::ClassChain() : *found;
}

CimPath InteropNamespace::typedOwnPath(const CimPath& path) const {
    return core::typedPath(path, [this](const std::string& name) { return findOwnClass(name); });
}

bool InteropNamespace::isOfSubscriptions(const CimPath& path) const {
    return m_subscriptions != nullptr && indications::Subscriptions::serves(path.getClassName());
}

InstanceValue InteropNamespace::placed(InstanceValue instance) const {
    instance.path.completeNamespace(m_name);
    for (core::PropertyValue& property : instance.properties)
        property.value.completeNamespace(m_name);
    return instance;
}

std::vector<InstanceValue> InteropNamespace::ownInstances() const {
    std::vector<InstanceValue> all = m_model.instances;
    if (m_subscriptions != nullptr) std::ranges::move(m_subscriptions->instances(), std::back_inserter(all));
    return all;
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
    for (const InstanceValue& own : ownInstances()) {
        if (core::derivesFrom(findOwnClass(own.path.getClassName()), className))
            result.push_back(filtered(placed(own), filter));
    }
    for (const std::string& source : sources(className)) {
        for (InstanceValue& instance : relocated(m_implementation->enumerateInstances(source, filter)))
            result.push_back(std::move(instance));
    }
    return result;
}

std::vector<CimPath> InteropNamespace::enumerateInstanceNames(const std::string& className) {
    return pathsOf(enumerateInstances(className, kNoProperties));
}

InstanceValue InteropNamespace::getInstance(const CimPath& path, const core::PropertyFilter& filter) {
    if (!sources(path.getClassName()).empty()) {
        InstanceValue instance = m_implementation->getInstance(atProviders(path), filter);
        relocate(instance);
        return instance;
    }
    const CimPath typed = typedOwnPath(path);
    if (isOfSubscriptions(path)) return filtered(placed(m_subscriptions->get(typed)), filter);
    for (const InstanceValue& own : ownInstances()) {
        if (placed(own).path.isSameObjectAs(typed)) return filtered(placed(own), filter);
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

std::vector<InstanceValue> InteropNamespace::subscriptionsOf(const CimPath& path,
                                                             const core::AssociationFilter& by) const {
    std::vector<InstanceValue> found = m_subscriptions->referring(path);
    std::erase_if(found, [&](const InstanceValue& subscription) {
        if (!by.associationClass.empty() &&
            !core::derivesFrom(findOwnClass(subscription.path.getClassName()), by.associationClass))
            return true;
        if (by.role.empty()) return false;
        const auto end = subscription.get<CimPath>(by.role);
        return !end || !core::sameName(end->getClassName(), path.getClassName());
    });
    for (InstanceValue& each : found)
        each = placed(std::move(each));
    return found;
}

std::vector<InstanceValue> InteropNamespace::associators(const CimPath& path,
                                                         const core::AssociationFilter& by,
                                                         const core::PropertyFilter& filter) {
    const bool leads = hasAssociations(path, by);
    if (isOfSubscriptions(path)) {
        std::vector<InstanceValue> found;
        for (const InstanceValue& subscription : subscriptionsOf(path, by)) {
            for (const core::CimKey& end : subscription.path.getKeys()) {
                const auto& other = std::get<CimPath>(end.value);
                if (core::sameName(other.getClassName(), path.getClassName())) continue;
                if (!by.resultRole.empty() && !core::sameName(end.name, by.resultRole)) continue;
                if (!by.resultClass.empty() &&
                    !core::derivesFrom(findOwnClass(other.getClassName()), by.resultClass))
                    continue;
                found.push_back(getInstance(other, filter));
            }
        }
        return found;
    }
    if (!leads) return {};
    return relocated(m_implementation->associators(atProviders(path), by, filter));
}

std::vector<CimPath> InteropNamespace::associatorNames(const CimPath& path,
                                                       const core::AssociationFilter& by) {
    if (isOfSubscriptions(path)) return pathsOf(associators(path, by, kNoProperties));
    if (!hasAssociations(path, by)) return {};
    return relocated(m_implementation->associatorNames(atProviders(path), by));
}

std::vector<InstanceValue> InteropNamespace::references(const CimPath& path,
                                                        const core::AssociationFilter& by,
                                                        const core::PropertyFilter& filter) {
    const bool leads = hasAssociations(path, by);
    if (isOfSubscriptions(path)) {
        std::vector<InstanceValue> found;
        for (InstanceValue& each : subscriptionsOf(path, asReferences(by)))
            found.push_back(filtered(std::move(each), filter));
        return found;
    }
    if (!leads) return {};
    return relocated(m_implementation->references(atProviders(path), by, filter));
}

std::vector<CimPath> InteropNamespace::referenceNames(const CimPath& path,
                                                      const core::AssociationFilter& by) {
    if (isOfSubscriptions(path)) return pathsOf(references(path, by, kNoProperties));
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
    if (isOfSubscriptions(path)) return m_subscriptions->remove(typedOwnPath(path));
    throw core::CimError(core::CimStatus::NotSupported,
                         "instances of " + path.getClassName() + " cannot be deleted");
}

CimPath InteropNamespace::createInstance(const InstanceValue& instance) {
    if (!isOfSubscriptions(instance.path)) return CimOperations::createInstance(instance);
    CimPath path = m_subscriptions->create(instance);
    path.completeNamespace(m_name);
    return path;
}

void InteropNamespace::modifyInstance(const InstanceValue& instance, const core::PropertyFilter& properties) {
    if (!isOfSubscriptions(instance.path)) return CimOperations::modifyInstance(instance, properties);
    m_subscriptions->modify({typedOwnPath(instance.path), instance.properties}, properties);
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
