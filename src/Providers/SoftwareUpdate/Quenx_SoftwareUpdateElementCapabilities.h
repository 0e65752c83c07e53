// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ElementCapabilities.h"

/// The service has its capabilities.
class Quenx_SoftwareUpdateElementCapabilities : public CIM_ElementCapabilities {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_SoftwareUpdateElementCapabilities() override;
};

/// Built at the first enumeration and kept. Throws the assertion unless there is one service and one
/// capabilities instance.
class Quenx_SoftwareUpdateElementCapabilitiesClass
    : public ListedClass<Quenx_SoftwareUpdateElementCapabilities> {
  public:
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

  private:
    utils::Mutex m_creation;
};
