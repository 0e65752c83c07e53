// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>

#include "Framework/Model/CimProperty.h"

namespace core {

/// A reference to another instance. It keeps the target's path, taken when it was set, so it can be served
/// after the target has gone; the target itself is not kept alive, since it may belong to a library that
/// unloads first.
class QUENX_EXPORT CimPropertyRef : public CimProperty {
  public:
    CimPropertyRef(const char* name, CimInstance* owner);

    /// The text form of the target's path; empty when null.
    std::string toString() override;
    CimType getType() override;
    void modify(CimProperty* requested) override;
    void verify(CimProperty* requested) override;

    /// The target's path; one that names nothing when null.
    CimPath getPath() const;
    /// Refers to whatever the path names.
    void setPath(CimPath path);
    /// The target while it is listed somewhere; null when it has gone or only a path was given.
    std::shared_ptr<CimInstance> getInstance() const;

  protected:
    /// Stores the instance's path and a weak hold. A null pointer makes the property null.
    void assign(const CimInstance* target);

    void load(CimValue& value) const override;
    void store(const CimValue& value) override;

  private:
    std::shared_ptr<const CimPath> m_path;
    std::weak_ptr<CimInstance> m_target;
};

}  // namespace core
