#pragma once

#include <string>
#include <vector>

#include "Framework/Requests/CimRequests.h"

namespace host {

/// One namespace as clients see it. Operations and errors are those of core::CimRequests; paths handed in are
/// typed, their namespace is not looked at. Thread-safe.
class NamespaceModel {
  public:
    NamespaceModel() = default;
    NamespaceModel(const NamespaceModel&) = delete;
    NamespaceModel& operator=(const NamespaceModel&) = delete;
    virtual ~NamespaceModel() = default;

    virtual const std::string& name() const = 0;

    virtual std::vector<core::InstanceValue> enumerateInstances(const std::string& className,
                                                                const core::PropertyFilter& filter) const = 0;
    virtual std::vector<core::CimPath> enumerateInstanceNames(const std::string& className) const = 0;
    virtual core::InstanceValue getInstance(const core::CimPath& path,
                                            const core::PropertyFilter& filter) const = 0;
    virtual std::vector<core::InstanceValue> associators(const core::CimPath& path,
                                                         const core::AssociationFilter& by,
                                                         const core::PropertyFilter& filter) const = 0;
    virtual std::vector<core::CimPath> associatorNames(const core::CimPath& path,
                                                       const core::AssociationFilter& by) const = 0;
    virtual std::vector<core::InstanceValue> references(const core::CimPath& path,
                                                        const core::AssociationFilter& by,
                                                        const core::PropertyFilter& filter) const = 0;
    virtual std::vector<core::CimPath> referenceNames(const core::CimPath& path,
                                                      const core::AssociationFilter& by) const = 0;
    virtual core::MethodResult invokeMethod(const core::CimPath& path, const std::string& method,
                                            const std::vector<core::Argument>& arguments) const = 0;
    virtual void deleteInstance(const core::CimPath& path) const = 0;

    /// NotFound for an unknown class.
    virtual core::ClassChain getClass(const std::string& className) const = 0;
    /// The classes below the named one, or from the top for an empty name; the direct ones only unless deep.
    virtual std::vector<core::ClassChain> classes(const std::string& className, bool deep) const = 0;

    /// Whether a walk over associations may be narrowed to the class: it may lead to other namespaces.
    virtual bool knowsClass(const std::string& className) const { return !findClass(className).empty(); }

    /// As getClass(), but InvalidClass for an unknown class, as instance operations answer.
    core::ClassChain requireClass(const std::string& className) const;
    /// As getClass(), but an empty chain for an unknown class.
    core::ClassChain findClass(const std::string& className) const;
};

}  // namespace host
