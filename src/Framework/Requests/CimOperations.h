// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Model/CimError.h"
#include "Framework/Model/ClassDeclaration.h"
#include "Framework/Requests/RequestValues.h"

namespace core {

/// What a client may ask of one namespace. The providers of this process answer it (CimRequests), and so may
/// whatever stands in front of them or far away: another namespace, a connection to a server.
///
/// All results are values, in which the namespace of paths and of references is filled in; the namespace of
/// paths passed in is not looked at. The keys of those paths may be texts: they are read as the class
/// declares them. Errors are CimError, with the status in the order that clients expect: the class before the
/// keys, the keys before the instance. Thread-safe, unless an implementation says otherwise.
class QUENX_EXPORT CimOperations {
  public:
    CimOperations() = default;
    CimOperations(const CimOperations&) = delete;
    CimOperations& operator=(const CimOperations&) = delete;
    virtual ~CimOperations();

    virtual const std::string& getNamespace() const = 0;

    /// Instances of the class and its subclasses, each path once. InvalidClass for an unknown class.
    virtual std::vector<InstanceValue> enumerateInstances(const std::string& className,
                                                          const PropertyFilter& filter = std::nullopt) = 0;
    virtual std::vector<CimPath> enumerateInstanceNames(const std::string& className) = 0;
    /// InvalidClass for an unknown class, InvalidParameter for keys that are not those of the class, NotFound
    /// when no instance has them.
    virtual InstanceValue getInstance(const CimPath& path, const PropertyFilter& filter = std::nullopt) = 0;

    /// Instances at the other ends of associations that refer to the path. An end whose instance cannot be
    /// found any more is left out. Errors as getInstance(), but a path that names no instance has no
    /// associations; InvalidParameter for an unknown class in the filter.
    virtual std::vector<InstanceValue> associators(const CimPath& path, const AssociationFilter& by,
                                                   const PropertyFilter& filter = std::nullopt) = 0;
    virtual std::vector<CimPath> associatorNames(const CimPath& path, const AssociationFilter& by) = 0;
    /// Association instances that refer to the path; only associationClass (also taken from resultClass) and
    /// role are looked at.
    virtual std::vector<InstanceValue> references(const CimPath& path, const AssociationFilter& by,
                                                  const PropertyFilter& filter = std::nullopt) = 0;
    virtual std::vector<CimPath> referenceNames(const CimPath& path, const AssociationFilter& by) = 0;

    /// NotFound for an unknown class, MethodNotFound, MethodNotAvailable for a path without keys,
    /// InvalidParameter for arguments that are not those that the method declares.
    virtual MethodResult invokeMethod(const CimPath& path, const std::string& method,
                                      const std::vector<Argument>& arguments) = 0;

    /// NotSupported for a class whose instances cannot be deleted; else errors as getInstance().
    virtual void deleteInstance(const CimPath& path) = 0;

    /// The class first, its superclasses behind it; empty for an unknown class.
    virtual ClassChain getClass(const std::string& className) = 0;
    /// Each class that is served, is a superclass of one that is, or is named by a parameter, of those below
    /// the named one: the direct subclasses, or all with `deep`. An empty name stands above the roots.
    /// InvalidClass for an unknown class.
    virtual std::vector<ClassChain> enumerateClasses(const std::string& className, bool deep) = 0;
};

}  // namespace core
