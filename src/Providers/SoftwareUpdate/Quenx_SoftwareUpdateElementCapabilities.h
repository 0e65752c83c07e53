// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ElementCapabilities.h"

/// The service has its capabilities.
class Quenx_SoftwareUpdateElementCapabilities : public CIM_ElementCapabilities {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_ElementCapabilities",
                                                  &CIM_ElementCapabilities::classInfo, true};

    std::string getClassName() const override { return classInfo.name; }
};

/// Built at the first enumeration and kept. Throws the assertion unless there is one service and one
/// capabilities instance.
class Quenx_SoftwareUpdateElementCapabilitiesClass
    : public ListedClass<Quenx_SoftwareUpdateElementCapabilities> {
  public:
    core::InstanceList::Iterator getInstances() override;

  private:
    utils::Mutex m_creation;
};
