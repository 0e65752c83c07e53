#include "Host/Operations/ProviderNamespace.h"

namespace host {

std::vector<core::InstanceValue> ProviderNamespace::enumerateInstances(
    const std::string& className, const core::PropertyFilter& filter) const {
    return m_requests.enumerateInstances(className, filter);
}

std::vector<core::CimPath> ProviderNamespace::enumerateInstanceNames(const std::string& className) const {
    return m_requests.enumerateInstanceNames(className);
}

core::InstanceValue ProviderNamespace::getInstance(const core::CimPath& path,
                                                   const core::PropertyFilter& filter) const {
    return m_requests.getInstance(path, filter);
}

std::vector<core::InstanceValue> ProviderNamespace::associators(const core::CimPath& path,
                                                                const core::AssociationFilter& by,
                                                                const core::PropertyFilter& filter) const {
    return m_requests.associators(path, by, filter);
}

std::vector<core::CimPath> ProviderNamespace::associatorNames(const core::CimPath& path,
                                                              const core::AssociationFilter& by) const {
    return m_requests.associatorNames(path, by);
}

std::vector<core::InstanceValue> ProviderNamespace::references(const core::CimPath& path,
                                                               const core::AssociationFilter& by,
                                                               const core::PropertyFilter& filter) const {
    return m_requests.references(path, by, filter);
}

std::vector<core::CimPath> ProviderNamespace::referenceNames(const core::CimPath& path,
                                                             const core::AssociationFilter& by) const {
    return m_requests.referenceNames(path, by);
}

core::MethodResult ProviderNamespace::invokeMethod(const core::CimPath& path, const std::string& method,
                                                   const std::vector<core::Argument>& arguments) const {
    return m_requests.invokeMethod(path, method, arguments);
}

void ProviderNamespace::deleteInstance(const core::CimPath& path) const {
    m_requests.deleteInstance(path);
}

core::ClassChain ProviderNamespace::getClass(const std::string& className) const {
    return m_requests.getClass(className);
}

std::vector<core::ClassChain> ProviderNamespace::classes(const std::string& className, bool deep) const {
    std::vector<core::ClassChain> chains;
    for (const core::ClassDeclaration& declaration : m_requests.enumerateClasses(className, deep)) {
        chains.push_back(m_requests.getClass(declaration.name));
    }
    return chains;
}

}  // namespace host
