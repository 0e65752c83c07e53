#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Model/CimError.h"
#include "Framework/Model/CimValue.h"
#include "Framework/Model/ClassDeclaration.h"

namespace core {

/// A property of an instance, as a value.
struct PropertyValue {
    std::string name;
    CimValue value;
    bool isKey = false;
    std::string referenceClass;  ///< empty unless a reference
};

/// An instance, as a value: a copy taken under the instance's lock.
struct QUENX_EXPORT InstanceValue {
    CimPath path;
    std::vector<PropertyValue> properties;

    /// The property of that name, without regard to case; null when it is not there.
    const PropertyValue* find(std::string_view name) const;
};

/// An argument of a method call, by name.
struct Argument {
    std::string name;
    CimValue value;
};

struct MethodResult {
    std::uint32_t returnValue = 0;
    std::vector<Argument> outputs;  ///< those that are not null
};

/// Which properties an answer holds: all without a list, else those named (names that no class has are
/// ignored).
using PropertyFilter = std::optional<std::vector<std::string>>;

/// What narrows a walk over associations (DSP0200 5.4.2.8 to 5.4.2.11). An empty text narrows nothing.
struct AssociationFilter {
    std::string associationClass;
    std::string resultClass;
    std::string role;
    std::string resultRole;
};

/// The request layer: what every front (command line, CIM-XML, an object manager) calls. Thread-safe.
///
/// Each operation is a request scope of its own and returns values only, in which the namespace of paths and
/// of references is filled in. Classes are served in one namespace; the namespace of paths passed in is not
/// looked at. Errors are CimError; an exception out of a provider becomes CimStatus::Failed with its text.
class QUENX_EXPORT CimRequests {
  public:
    explicit CimRequests(std::string namespaceName, CimBroker* broker = GetCimBroker());

    const std::string& getNamespace() const { return m_namespace; }

    /// Instances of the class and its subclasses. InvalidClass for an unknown class. Paths that are equal are
    /// served once.
    std::vector<InstanceValue> enumerateInstances(const std::string& className,
                                                  const PropertyFilter& filter = std::nullopt) const;
    std::vector<CimPath> enumerateInstanceNames(const std::string& className) const;
    /// NotFound when the class is served and no instance answers to the path; InvalidClass when it is not.
    InstanceValue getInstance(CimPath path, const PropertyFilter& filter = std::nullopt) const;

    /// Instances at the other ends of associations that refer to the path. An end whose instance cannot be
    /// found any more is left out.
    std::vector<InstanceValue> associators(const CimPath& path, const AssociationFilter& by,
                                           const PropertyFilter& filter = std::nullopt) const;
    std::vector<CimPath> associatorNames(const CimPath& path, const AssociationFilter& by) const;
    /// Association instances that refer to the path; only associationClass (also taken from resultClass) and
    /// role are looked at.
    std::vector<InstanceValue> references(const CimPath& path, const AssociationFilter& by,
                                          const PropertyFilter& filter = std::nullopt) const;
    std::vector<CimPath> referenceNames(const CimPath& path, const AssociationFilter& by) const;

    /// Checks the arguments against the method's declaration, completes the list (outputs and optional inputs
    /// that are not given are passed as null, required ones stay absent), calls the method, and gathers the
    /// outputs; an instance handed back is the output "Job".
    MethodResult invokeMethod(CimPath path, const std::string& method,
                              const std::vector<Argument>& arguments) const;

    /// NotSupported for a class whose instances cannot be deleted; NotFound when the path names none.
    void deleteInstance(CimPath path) const;

    /// Every class that is served or is a superclass of one that is.
    std::vector<ClassDeclaration> enumerateClasses(const std::string& className, bool deep) const;
    /// NotFound for an unknown class. The chain holds the class first, its superclasses behind it.
    ClassChain getClass(const std::string& className) const;

  private:
    std::string m_namespace;
    CimBroker* m_broker;
};

}  // namespace core
