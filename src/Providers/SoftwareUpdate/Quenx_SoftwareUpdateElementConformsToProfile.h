#pragma once

#include "Framework/Classes/CimClass.h"
#include "Providers/Schema/CIM_ElementConformsToProfile.h"

/// The service conforms to the Software Update profile.
class Quenx_SoftwareUpdateElementConformsToProfile : public CIM_ElementConformsToProfile {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_SoftwareUpdateElementConformsToProfile() override;
};

/// Rebuilt on every enumeration.
class Quenx_SoftwareUpdateElementConformsToProfileClass : public core::CimClass {
  public:
    using Instance = Quenx_SoftwareUpdateElementConformsToProfile;

    std::string getClassName() override;
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

  private:
    core::InstanceList m_instances;
};
