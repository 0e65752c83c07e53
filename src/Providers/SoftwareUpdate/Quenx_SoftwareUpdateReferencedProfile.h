#pragma once

#include "Framework/Classes/CimClass.h"
#include "Providers/Schema/CIM_ReferencedProfile.h"

/// The Ethernet port profile refers to the Software Update profile.
class Quenx_SoftwareUpdateReferencedProfile : public CIM_ReferencedProfile {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_SoftwareUpdateReferencedProfile() override;
};

/// Rebuilt on every enumeration; empty where one of the two profiles is not registered.
class Quenx_SoftwareUpdateReferencedProfileClass : public core::CimClass {
  public:
    using Instance = Quenx_SoftwareUpdateReferencedProfile;

    std::string getClassName() override;
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

  private:
    core::InstanceList m_instances;
};
