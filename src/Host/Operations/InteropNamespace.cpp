#include "Host/Operations/InteropNamespace.h"

#include <algorithm>
#include <array>

namespace host {

namespace {

using core::CimPath;
using core::CimScalar;
using core::InstanceValue;

/// What is shown of the providers' classes: these and what derives from them.
constexpr std::array<const char*, 3> kShown{"CIM_RegisteredProfile", "CIM_ReferencedProfile",
                                            "CIM_ElementConformsToProfile"};

InstanceValue filtered(InstanceValue instance, const core::PropertyFilter& filter) {
    if (!filter) return instance;
    std::erase_if(instance.properties, [&](const core::PropertyValue& property) {
        return std::none_of(filter->begin(), filter->end(),
                            [&](const std::string& name) { return core::sameName(name, property.name); });
    });
    return instance;
}

}  // namespace

InteropNamespace::InteropNamespace(std::string name, std::shared_ptr<const NamespaceModel> implementation,
                                   std::shared_ptr<const InteropModel> model)
    : m_name(std::move(name)), m_implementation(std::move(implementation)), m_model(std::move(model)) {}

bool InteropNamespace::isShown(const core::ClassChain& chain) const {
    return std::any_of(kShown.begin(), kShown.end(), [&](const char* shown) {
        // A superclass of what is shown is shown as well: a client reads its declaration.
        const core::ClassChain base = m_implementation->findClass(shown);
        return core::derivesFrom(chain, shown) || core::derivesFrom(base, chain.front()->name);
    });
}

std::vector<std::string> InteropNamespace::sources(const std::string& className) const {
    const core::ClassChain chain = m_implementation->findClass(className);
    std::vector<std::string> names;
    for (const char* shown : kShown) {
        if (!chain.empty() && core::derivesFrom(chain, shown)) return {className};
        if (core::derivesFrom(m_implementation->findClass(shown), className)) names.emplace_back(shown);
    }
    return names;
}

core::CimPath InteropNamespace::relocated(const CimPath& path) const {
    std::vector<core::CimKey> keys = path.getKeys();
    for (core::CimKey& key : keys) {
        if (auto* reference = std::get_if<CimPath>(&key.value)) *reference = relocated(*reference);
    }
    CimPath moved(path.getClassName(), std::move(keys));
    const core::ClassChain chain = m_implementation->findClass(path.getClassName());
    moved.setNamespace(!chain.empty() && isShown(chain) ? m_name : m_implementation->name());
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
                                                                const core::PropertyFilter& filter) const {
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

std::vector<CimPath> InteropNamespace::enumerateInstanceNames(const std::string& className) const {
    std::vector<CimPath> paths;
    const core::PropertyFilter none{std::vector<std::string>()};
    for (InstanceValue& instance : enumerateInstances(className, none)) {
        paths.push_back(std::move(instance.path));
    }
    return paths;
}

InstanceValue InteropNamespace::getInstance(const CimPath& path, const core::PropertyFilter& filter) const {
    for (const InstanceValue& own : m_model->instances(m_name)) {
        if (own.path.names(path)) return filtered(own, filter);
    }
    if (sources(path.getClassName()).empty()) {
        requireClass(path.getClassName());
        throw core::CimError(core::CimStatus::NotFound, path.toString() + " names no instance");
    }
    return relocated(m_implementation->getInstance(path, filter));
}

std::vector<InstanceValue> InteropNamespace::associators(const CimPath& path,
                                                         const core::AssociationFilter& by,
                                                         const core::PropertyFilter& filter) const {
    return relocated(m_implementation->associators(path, by, filter));
}

std::vector<CimPath> InteropNamespace::associatorNames(const CimPath& path,
                                                       const core::AssociationFilter& by) const {
    return relocated(m_implementation->associatorNames(path, by));
}

std::vector<InstanceValue> InteropNamespace::references(const CimPath& path,
                                                        const core::AssociationFilter& by,
                                                        const core::PropertyFilter& filter) const {
    return relocated(m_implementation->references(path, by, filter));
}

std::vector<CimPath> InteropNamespace::referenceNames(const CimPath& path,
                                                      const core::AssociationFilter& by) const {
    return relocated(m_implementation->referenceNames(path, by));
}

core::MethodResult InteropNamespace::invokeMethod(const CimPath& path, const std::string& method,
                                                  const std::vector<core::Argument>&) const {
    throw core::CimError(core::CimStatus::MethodNotFound, path.getClassName() + " has no method " + method);
}

void InteropNamespace::deleteInstance(const CimPath& path) const {
    getInstance(path, core::PropertyFilter(std::vector<std::string>()));
    throw core::CimError(core::CimStatus::NotSupported,
                         "instances of " + path.getClassName() + " cannot be deleted");
}

core::ClassChain InteropNamespace::getClass(const std::string& className) const {
    core::ClassChain own = m_model->findClass(className);
    if (!own.empty()) return own;
    core::ClassChain chain = m_implementation->getClass(className);
    if (!isShown(chain)) {
        throw core::CimError(core::CimStatus::NotFound, "no class " + className + " in " + m_name);
    }
    return chain;
}

std::vector<core::ClassChain> InteropNamespace::classes(const std::string& className, bool deep) const {
    std::vector<core::ClassChain> known = m_model->classes();
    for (core::ClassChain& chain : m_implementation->classes("", true)) {
        if (m_model->findClass(chain.front()->name).empty() && isShown(chain)) {
            known.push_back(std::move(chain));
        }
    }
    std::erase_if(known, [&](const core::ClassChain& chain) {
        const core::ClassDeclaration& first = *chain.front();
        if (className.empty()) return !deep && !first.superclass.empty();
        if (core::sameName(first.name, className)) return true;
        return deep ? !core::derivesFrom(chain, className) : !core::sameName(first.superclass, className);
    });
    return known;
}

}  // namespace host
