#pragma once

#include "Host/Operations/NamespaceModel.h"

namespace host {

/// The implementation namespace: whatever the loaded providers serve.
class ProviderNamespace : public NamespaceModel {
  public:
    explicit ProviderNamespace(const std::string& name) : m_requests(name) {}

    const std::string& name() const override { return m_requests.getNamespace(); }
    std::vector<core::InstanceValue> enumerateInstances(const std::string& className,
                                                        const core::PropertyFilter& filter) const override;
    std::vector<core::CimPath> enumerateInstanceNames(const std::string& className) const override;
    core::InstanceValue getInstance(const core::CimPath& path,
                                    const core::PropertyFilter& filter) const override;
    std::vector<core::InstanceValue> associators(const core::CimPath& path, const core::AssociationFilter& by,
                                                 const core::PropertyFilter& filter) const override;
    std::vector<core::CimPath> associatorNames(const core::CimPath& path,
                                               const core::AssociationFilter& by) const override;
    std::vector<core::InstanceValue> references(const core::CimPath& path, const core::AssociationFilter& by,
                                                const core::PropertyFilter& filter) const override;
    std::vector<core::CimPath> referenceNames(const core::CimPath& path,
                                              const core::AssociationFilter& by) const override;
    core::MethodResult invokeMethod(const core::CimPath& path, const std::string& method,
                                    const std::vector<core::Argument>& arguments) const override;
    void deleteInstance(const core::CimPath& path) const override;
    core::ClassChain getClass(const std::string& className) const override;
    std::vector<core::ClassChain> classes(const std::string& className, bool deep) const override;

  private:
    core::CimRequests m_requests;
};

}  // namespace host
