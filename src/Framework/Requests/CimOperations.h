// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Model/CimError.h"
#include "Framework/Model/ClassDeclaration.h"

namespace core {

class CimInstance;

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

    /// Its value; nothing for a property that is null, absent or of another type.
    template <class T>
    std::optional<T> get(std::string_view name) const {
        const PropertyValue* property = find(name);
        const T* value = property == nullptr ? nullptr : property->value.get<T>();
        return value == nullptr ? std::nullopt : std::optional<T>(*value);
    }
    /// The same; empty, or 0, where get() gives nothing.
    std::string text(std::string_view name) const { return get<std::string>(name).value_or(""); }
    std::uint64_t number(std::string_view name) const { return get<std::uint64_t>(name).value_or(0); }
    /// The elements of an array of strings; none where the property is anything else.
    std::vector<std::string> texts(std::string_view name) const;
};

/// Which properties an answer holds: all without a list, else those named (names that no class has are
/// ignored).
using PropertyFilter = std::optional<std::vector<std::string>>;

/// A filter made ready for one request: a client may send thousands of names, and every property is looked up
/// among them, once for all instances of one shape. The filter must outlive it. Used by one thread.
class QUENX_EXPORT WantedProperties {
  public:
    explicit WantedProperties(const PropertyFilter& filter);
    bool includes(std::string_view name) const;

    struct Choice {
        std::vector<std::size_t> properties;  ///< which of all; those that are served, in their order
        bool hasReferences = false;           ///< among them, or among the keys
    };
    /// To be called under the instance's lock. The choice lives as long as this.
    const Choice& among(const CimInstance& instance);

  private:
    /// Sorted and not hashed: whoever sends the names could choose some that collide.
    std::optional<std::vector<std::string_view>> m_names;
    /// By shape; an answer has instances of a few.
    std::map<const void*, Choice> m_choices;
};

/// A copy of the instance, under its lock; paths in it are completed with the namespace.
InstanceValue readInstance(CimInstance& instance, CimPath path, WantedProperties& wanted,
                           const std::string& namespaceName);
/// The same of all its properties, with the path of its own.
InstanceValue readInstance(CimInstance& instance, const std::string& namespaceName);

/// An instance where it is, its lock held: the properties that are wanted, none of them a reference.
struct InstanceCells {
    const CimInstance& instance;
    const std::vector<std::size_t>& wanted;  ///< which of all its properties; the same object for its shape
};

/// Takes the instances of an answer, and writes them down at once.
class QUENX_EXPORT InstanceSink {
  public:
    InstanceSink() = default;
    InstanceSink(const InstanceSink&) = delete;
    InstanceSink& operator=(const InstanceSink&) = delete;
    virtual ~InstanceSink();

    /// Both return how many bytes more the answer takes. The first is called under the instance's lock, and
    /// so must not wait for anything, nor call back.
    virtual std::size_t take(const InstanceCells& instance) = 0;
    virtual std::size_t take(const InstanceValue& instance) = 0;
};

/// What narrows a walk over associations (DSP0200 5.4.2.8 to 5.4.2.11). An empty text narrows nothing.
struct AssociationFilter {
    std::string associationClass;
    std::string resultClass;
    std::string role;
    std::string resultRole;
};

/// An argument of a method call, by name.
struct Argument {
    std::string name;
    CimValue value;
    /// The sender did not say of what type the texts in the value are: the declaration does.
    bool isUntyped = false;
};

struct MethodResult {
    std::uint32_t returnValue = 0;
    std::vector<Argument> outputs;  ///< those that are not null
    CimType returnType = CimType::Uint32;
};

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
    /// The same, one by one. What the sink throws ends the enumeration. Keeps no more than one of them as a
    /// value, where the implementation can do without.
    virtual void streamInstances(const std::string& className, const PropertyFilter& filter,
                                 InstanceSink& sink);
    /// InvalidClass for an unknown class, InvalidParameter for keys that are not those of the class, NotFound
    /// when no instance has them.
    virtual InstanceValue getInstance(const CimPath& path, const PropertyFilter& filter = std::nullopt) = 0;
    /// The same, without a copy of the instance where the implementation can do without.
    virtual void streamInstance(const CimPath& path, const PropertyFilter& filter, InstanceSink& sink);

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

    /// Makes an instance and returns its path. InvalidClass for an unknown class, NotSupported for one whose
    /// instances cannot be made, InvalidParameter for properties that do not describe one.
    /// @param instance  the class in its path; keys may be missing where the implementation can fill them in
    virtual CimPath createInstance(const InstanceValue& instance);
    /// Changes the properties that are given and, where there is a list, in it. NotSupported for those that
    /// cannot be changed; else errors as getInstance().
    virtual void modifyInstance(const InstanceValue& instance, const PropertyFilter& properties);

    /// The class first, its superclasses behind it; empty for an unknown class.
    virtual ClassChain getClass(const std::string& className) = 0;
    /// Each class that is served, is a superclass of one that is, or is named by a parameter, of those below
    /// the named one: the direct subclasses, or all with `deep`. An empty name stands above the roots.
    /// InvalidClass for an unknown class.
    virtual std::vector<ClassChain> enumerateClasses(const std::string& className, bool deep) = 0;
};

// For implementations of it.

/// Finds a class with its superclasses; empty for an unknown class.
using ClassLookup = std::function<ClassChain(const std::string&)>;

/// Gives the keys of an instance's path, which a client may send as texts, the types and the spelling that
/// the class declares. A single key without a name gets that of the class's one key.
/// CimError: invalid parameter for a path that names nothing, invalid class for an unknown class, invalid
/// parameter when the keys are not exactly those of the class or a text does not read as its key's type.
QUENX_EXPORT CimPath typedPath(const CimPath& path, const ClassLookup& classes);

/// The path for a message; of one that is longer than anybody reads, how long it is.
QUENX_EXPORT std::string shownPath(const CimPath& path);

/// The arguments with their declared names and types; references in them as typedPath() makes them, where
/// they fit. CimError (invalid parameter) for one that the method does not declare or that comes twice, and
/// for a value of another kind than declared. Integers may come in any width that holds the value.
std::vector<Argument> typedArguments(const MethodDeclaration& method, const std::vector<Argument>& arguments,
                                     const ClassLookup& classes);

}  // namespace core
