// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Framework/Model/CimProperty.h"

namespace core {

/// The arguments of a method call, or the new values of a modification. Owns its properties. Belongs to one
/// thread.
class QUENX_EXPORT CimPropertyList {
  public:
    CimPropertyList();
    CimPropertyList(CimPropertyList&&) noexcept;
    CimPropertyList& operator=(CimPropertyList&&) noexcept;
    ~CimPropertyList();

    /// The property of that name (compared without regard to case), or null when it was not passed.
    CimProperty* getPropertyByName(std::string name) const;

    void add(std::unique_ptr<CimProperty> property);
    const std::vector<std::unique_ptr<CimProperty>>& getProperties() const { return m_properties; }

    /// A property of the kind that the type asks for, holding the value. The list keeps the name.
    /// CimError (invalid parameter) for a type that no property kind has.
    CimProperty& add(const std::string& name, const CimValue& value);

  private:
    // Properties keep pointers to their names.
    std::vector<std::unique_ptr<std::string>> m_names;
    std::vector<std::unique_ptr<CimProperty>> m_properties;
};

}  // namespace core
