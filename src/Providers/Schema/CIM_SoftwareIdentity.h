// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_LogicalElement.h"
#include "Utils/Export.h"

/// DMTF CIM_SoftwareIdentity: a piece of software, installed or not, with its version.
class QUENX_EXPORT CIM_SoftwareIdentity : public CIM_LogicalElement {
  public:
    static const core::CimClassInfo classInfo;

    CIM_SoftwareIdentity();
    ~CIM_SoftwareIdentity() override;

    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyUint16 MajorVersion{"MajorVersion", this};
    core::CimPropertyUint16 MinorVersion{"MinorVersion", this};
    core::CimPropertyUint16 RevisionNumber{"RevisionNumber", this};
    core::CimPropertyUint16 BuildNumber{"BuildNumber", this};
    core::CimPropertyString VersionString{"VersionString", this};
    core::CimPropertyString_arr TargetOperatingSystems{"TargetOperatingSystems", this};
    core::CimPropertyString Manufacturer{"Manufacturer", this};
    core::CimPropertyString_arr Languages{"Languages", this};
    core::CimPropertyUint16_arr Classifications{"Classifications", this};
    core::CimPropertyString_arr ClassificationDescriptions{"ClassificationDescriptions", this};
    core::CimPropertyString SerialNumber{"SerialNumber", this};
    core::CimPropertyString_arr TargetTypes{"TargetTypes", this};
    core::CimPropertyString_arr IdentityInfoValue{"IdentityInfoValue", this};
    core::CimPropertyString_arr IdentityInfoType{"IdentityInfoType", this};
    core::CimPropertyDatetime ReleaseDate{"ReleaseDate", this};
    core::CimPropertyBoolean IsEntity{"IsEntity", this};
    core::CimPropertyUint16 ExtendedResourceType{"ExtendedResourceType", this};
    core::CimPropertyString OtherExtendedResourceTypeDescription{"OtherExtendedResourceTypeDescription",
                                                                 this};
    core::CimPropertyUint16 MinExtendedResourceTypeMajorVersion{"MinExtendedResourceTypeMajorVersion", this};
    core::CimPropertyUint16 MinExtendedResourceTypeMinorVersion{"MinExtendedResourceTypeMinorVersion", this};
    core::CimPropertyUint16 MinExtendedResourceTypeRevisionNumber{"MinExtendedResourceTypeRevisionNumber",
                                                                  this};
    core::CimPropertyUint16 MinExtendedResourceTypeBuildNumber{"MinExtendedResourceTypeBuildNumber", this};
    core::CimPropertyUint16_arr TargetOSTypes{"TargetOSTypes", this};
    core::CimPropertyUint32 LargeBuildNumber{"LargeBuildNumber", this};
    core::CimPropertyBoolean IsLargeBuildNumber{"IsLargeBuildNumber", this};
};
