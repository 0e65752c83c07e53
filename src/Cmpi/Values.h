// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Cmpi/Cmpi.h"
#include "Framework/Model/CimValue.h"

/// Values and paths on their way between the object manager and the request layer. Nothing here may be kept
/// beyond the call that it is made in.
namespace cmpi {

/// The code of a CIM type, and of arrays of it.
Type typeCode(core::CimType type, bool isArray = false);

/// The manager that a call came from, and the namespaces that a class may be asked for in: object managers
/// serve it wherever they have registered it, the request layer in one namespace.
struct Place {
    const Broker& broker;
    std::string requested;  ///< the namespace of the call
    std::string served;     ///< the request layer's
};

// What follows throws core::CimError: for a value that cannot be taken (invalid parameter), and where the
// object manager does not make what is asked of it (failed).

/// The path, without a namespace where it is that of the call.
core::CimPath pathFrom(const Place& place, const ObjectPath* path);
/// The value, by its state and type; a type that CIM does not have is refused.
core::CimValue valueFrom(const Place& place, const Data& data);

/// A path of the object manager's; that of the call in place of the served namespace.
ObjectPath* newPath(const Place& place, const core::CimPath& path);

/// A value as the functions take it that set one. The text of a string is not copied: what it was made of has
/// to outlive it.
class Given {
  public:
    Given(const Place& place, const core::CimValue& value);
    Given(const Place& place, core::CimType type, const core::CimScalar& scalar);
    Given(const Given&) = delete;
    Given& operator=(const Given&) = delete;

    /// Null for the CIM null.
    const Value* value() const { return m_given; }
    Type type() const { return m_type; }

  private:
    void hold(const Place& place, core::CimType type, const core::CimScalar& scalar);
    Array* newArray(const Place& place, core::CimType type, const std::vector<core::CimScalar>& elements);

    Type m_type;
    Value m_value{};
    const Value* m_given = nullptr;
};

}  // namespace cmpi
