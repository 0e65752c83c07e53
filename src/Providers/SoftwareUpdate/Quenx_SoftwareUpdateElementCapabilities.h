#pragma once

#include "Framework/Classes/CimClass.h"
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
class Quenx_SoftwareUpdateElementCapabilitiesClass : public core::CimClass {
  public:
    using Instance = Quenx_SoftwareUpdateElementCapabilities;

    std::string getClassName() override;
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

  private:
    core::InstanceList m_instances;
    utils::Mutex m_creation;
};
