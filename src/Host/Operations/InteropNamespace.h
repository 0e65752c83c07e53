// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>

#include "Framework/Requests/CimOperations.h"

namespace indications {
class Subscriptions;
}

namespace host {

/// What the object manager serves of itself: its own instance, and one for each namespace.
struct InteropModel {
    /// The names of all namespaces, and that of the machine.
    InteropModel(const std::vector<std::string>& namespaces, const std::string& systemName);

    std::vector<core::ClassChain> classes;       ///< superclasses included
    std::vector<core::InstanceValue> instances;  ///< paths without a namespace
};

/// The namespace in which a client finds out what is served: the object manager, the namespaces, and the
/// registered profiles with what conforms to them and what they refer to. The profiles come from the
/// providers; here their paths are in this namespace, while those of the elements that conform to them are in
/// the implementation namespace, where a client goes on. Here clients subscribe to indications, too.
class InteropNamespace : public core::CimOperations {
  public:
    /// @param subscriptions  null where nobody can subscribe
    InteropNamespace(std::string name, std::shared_ptr<core::CimOperations> implementation,
                     InteropModel model, std::shared_ptr<indications::Subscriptions> subscriptions = nullptr);
    ~InteropNamespace() override;

    const std::string& getNamespace() const override { return m_name; }
    std::vector<core::InstanceValue> enumerateInstances(const std::string& className,
                                                        const core::PropertyFilter& filter) override;
    std::vector<core::CimPath> enumerateInstanceNames(const std::string& className) override;
    core::InstanceValue getInstance(const core::CimPath& path, const core::PropertyFilter& filter) override;
    std::vector<core::InstanceValue> associators(const core::CimPath& path, const core::AssociationFilter& by,
                                                 const core::PropertyFilter& filter) override;
    std::vector<core::CimPath> associatorNames(const core::CimPath& path,
                                               const core::AssociationFilter& by) override;
    std::vector<core::InstanceValue> references(const core::CimPath& path, const core::AssociationFilter& by,
                                                const core::PropertyFilter& filter) override;
    std::vector<core::CimPath> referenceNames(const core::CimPath& path,
                                              const core::AssociationFilter& by) override;
    /// No class here has methods that can be called.
    core::MethodResult invokeMethod(const core::CimPath& path, const std::string& method,
                                    const std::vector<core::Argument>& arguments) override;
    void deleteInstance(const core::CimPath& path) override;
    /// Of what clients subscribe with.
    core::CimPath createInstance(const core::InstanceValue& instance) override;
    void modifyInstance(const core::InstanceValue& instance, const core::PropertyFilter& properties) override;
    core::ClassChain getClass(const std::string& className) override;
    std::vector<core::ClassChain> enumerateClasses(const std::string& className, bool deep) override;

  private:
    core::ClassChain findOwnClass(const std::string& className) const;
    core::CimPath typedOwnPath(const core::CimPath& path) const;
    bool isOfSubscriptions(const core::CimPath& path) const;
    std::vector<core::InstanceValue> ownInstances() const;
    /// As it stands in this namespace.
    core::InstanceValue placed(core::InstanceValue instance) const;
    /// The subscriptions that refer to the path, as far as the filter lets them through.
    std::vector<core::InstanceValue> subscriptionsOf(const core::CimPath& path,
                                                     const core::AssociationFilter& by) const;
    /// Whether the providers' class is shown here.
    bool isShown(const core::ClassChain& chain) const;
    /// The providers' classes to enumerate for the instances of a class here.
    std::vector<std::string> sources(const std::string& className) const;
    /// Whether associations may lead from the path through the filter. If the path or the filter names one of
    /// the manager's own classes, none do. CimError when the path or the filter is wrong.
    bool hasAssociations(const core::CimPath& path, const core::AssociationFilter& by) const;

    /// The path as the providers know it. CimError (not found) for that of another namespace than this one.
    core::CimPath atProviders(core::CimPath path) const;

    void relocate(core::CimPath& path) const;
    void relocate(core::InstanceValue& instance) const;
    /// What the providers answer, as it stands in this namespace.
    template <class Object>
    std::vector<Object> relocated(std::vector<Object> objects) const {
        for (Object& object : objects)
            relocate(object);
        return objects;
    }

    const std::string m_name;
    const std::shared_ptr<core::CimOperations> m_implementation;
    InteropModel m_model;
    const std::shared_ptr<indications::Subscriptions> m_subscriptions;
};

}  // namespace host
