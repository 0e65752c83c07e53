// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_RemoteServiceAccessPoint.h"
#include "Utils/Export.h"

/// DMTF CIM_SoftwareIdentityResource: where the file of a software identity is.
class QUENX_EXPORT CIM_SoftwareIdentityResource : public CIM_RemoteServiceAccessPoint {
  public:
    static const core::CimClassInfo classInfo;

    CIM_SoftwareIdentityResource();
    ~CIM_SoftwareIdentityResource() override;

    core::CimPropertyUint16 ResourceType{"ResourceType", this};
    core::CimPropertyString OtherResourceType{"OtherResourceType", this};
    core::CimPropertyUint16 ExtendedResourceType{"ExtendedResourceType", this};
    core::CimPropertyString OtherExtendedResourceTypeDescription{"OtherExtendedResourceTypeDescription",
                                                                 this};
    core::CimPropertyUint16 ExtendedResourceTypeMajorVersion{"ExtendedResourceTypeMajorVersion", this};
    core::CimPropertyUint16 ExtendedResourceTypeMinorVersion{"ExtendedResourceTypeMinorVersion", this};
    core::CimPropertyUint16 ExtendedResourceTypeRevisionNumber{"ExtendedResourceTypeRevisionNumber", this};
    core::CimPropertyUint16 ExtendedResourceTypeBuildNumber{"ExtendedResourceTypeBuildNumber", this};
};
