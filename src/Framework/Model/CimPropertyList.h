// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <list>
#include <memory>
#include <string>
#include <vector>

#include "Framework/Model/CimProperty.h"

namespace core {

/// The arguments of a method call, or the new values of a modification. Owns its properties. Belongs to one
/// thread.
class QUENX_EXPORT CimPropertyList {
  public:
    /// The property of that name (compared without regard to case), or null when it was not passed.
    CimProperty* getPropertyByName(std::string name) const;

    const std::vector<std::unique_ptr<CimProperty>>& getProperties() const { return m_properties; }

    /// A property of the kind that the type asks for, holding the value. The list keeps the name.
    /// CimError (invalid parameter) for a type that no property kind has.
    CimProperty& add(const std::string& name, const CimValue& value);

  private:
    // A list, since properties keep pointers to their names.
    std::list<std::string> m_names;
    std::vector<std::unique_ptr<CimProperty>> m_properties;
};

}  // namespace core
