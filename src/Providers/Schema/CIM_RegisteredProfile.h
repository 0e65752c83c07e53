// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_RegisteredSpecification.h"
#include "Utils/Export.h"

/// DMTF CIM_RegisteredProfile: a management profile that elements conform to.
class QUENX_EXPORT CIM_RegisteredProfile : public CIM_RegisteredSpecification {
  public:
    static const core::CimClassInfo classInfo;

    CIM_RegisteredProfile();
    ~CIM_RegisteredProfile() override;

    core::CimPropertyUint16 SpecificationType{"SpecificationType", this};
    core::CimPropertyString_arr ImplementedFeatures{"ImplementedFeatures", this};

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyString OtherSpecificationType{"OtherSpecificationType", this};
    core::CimPropertyUint16 RegisteredOrganization{"RegisteredOrganization", this};
    core::CimPropertyString OtherRegisteredOrganization{"OtherRegisteredOrganization", this};
    core::CimPropertyString RegisteredName{"RegisteredName", this};
    core::CimPropertyString RegisteredVersion{"RegisteredVersion", this};
    core::CimPropertyUint16_arr AdvertiseTypes{"AdvertiseTypes", this};
    core::CimPropertyString_arr AdvertiseTypeDescriptions{"AdvertiseTypeDescriptions", this};
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyString Description{"Description", this};
    core::CimPropertyString ElementName{"ElementName", this};
    core::CimPropertyUint64 Generation{"Generation", this};
};
