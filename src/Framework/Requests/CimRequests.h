// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Requests/CimOperations.h"

namespace core {

/// The request layer: what the providers loaded into this process answer. Every front (`quenxctl` in process,
/// `quenx-cimd`) calls it. Classes are served in one namespace; a path of another one names nothing. Each
/// operation is a request scope of its own; an exception out of a provider becomes CimStatus::Failed with its
/// text. Methods and deletions need the leave of the policy (see PolicyDecision), and are refused with
/// CimStatus::AccessDenied without it.
class QUENX_EXPORT CimRequests : public CimOperations {
  public:
    explicit CimRequests(std::string namespaceName);

    const std::string& getNamespace() const override { return m_namespace; }

    std::vector<InstanceValue> enumerateInstances(const std::string& className,
                                                  const PropertyFilter& filter = std::nullopt) override;
    void streamInstances(const std::string& className, const PropertyFilter& filter,
                         InstanceSink& sink) override;
    std::vector<CimPath> enumerateInstanceNames(const std::string& className) override;
    InstanceValue getInstance(const CimPath& path, const PropertyFilter& filter = std::nullopt) override;
    void streamInstance(const CimPath& path, const PropertyFilter& filter, InstanceSink& sink) override;

    std::vector<InstanceValue> associators(const CimPath& path, const AssociationFilter& by,
                                           const PropertyFilter& filter = std::nullopt) override;
    std::vector<CimPath> associatorNames(const CimPath& path, const AssociationFilter& by) override;
    std::vector<InstanceValue> references(const CimPath& path, const AssociationFilter& by,
                                          const PropertyFilter& filter = std::nullopt) override;
    std::vector<CimPath> referenceNames(const CimPath& path, const AssociationFilter& by) override;

    /// Checks the arguments against the method's declaration, completes the list (outputs and optional inputs
    /// that are not given are passed as null, required ones stay absent), calls the method, and gathers the
    /// outputs; an instance handed back is the output "Job".
    MethodResult invokeMethod(const CimPath& path, const std::string& method,
                              const std::vector<Argument>& arguments) override;

    void deleteInstance(const CimPath& path) override;

    ClassChain getClass(const std::string& className) override;
    std::vector<ClassChain> enumerateClasses(const std::string& className, bool deep) override;

  private:
    std::string m_namespace;
};

}  // namespace core
