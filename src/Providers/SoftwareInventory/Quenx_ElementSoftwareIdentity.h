#pragma once

#include "Framework/Classes/CimClass.h"
#include "Providers/Schema/CIM_ElementSoftwareIdentity.h"

/// What is installed (Antecedent) on a port (Dependent).
class Quenx_ElementSoftwareIdentity : public CIM_ElementSoftwareIdentity {
  public:
    static const core::CimClassInfo classInfo;

    Quenx_ElementSoftwareIdentity();
    std::string getClassName() const override;
    ~Quenx_ElementSoftwareIdentity() override;
};

/// Serves an association for each installed component, rebuilt on every call.
class Quenx_ElementSoftwareIdentityClass : public core::CimClass {
  public:
    using Instance = Quenx_ElementSoftwareIdentity;

    std::string getClassName() override;
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

  private:
    core::InstanceList m_list;
};
