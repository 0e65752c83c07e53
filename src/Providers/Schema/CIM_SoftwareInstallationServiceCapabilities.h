// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_Capabilities.h"
#include "Utils/Export.h"

/// DMTF CIM_SoftwareInstallationServiceCapabilities: what an installation service can install, from where and
/// onto what.
class QUENX_EXPORT CIM_SoftwareInstallationServiceCapabilities : public CIM_Capabilities {
  public:
    static const core::CimClassInfo classInfo;

    CIM_SoftwareInstallationServiceCapabilities();
    ~CIM_SoftwareInstallationServiceCapabilities() override;

    core::CimPropertyUint16_arr SupportedAsynchronousActions{"SupportedAsynchronousActions", this};
    core::CimPropertyUint16_arr SupportedSynchronousActions{"SupportedSynchronousActions", this};
    core::CimPropertyString_arr SupportedTargetTypes{"SupportedTargetTypes", this};
    core::CimPropertyUint16_arr SupportedExtendedResourceTypes{"SupportedExtendedResourceTypes", this};
    core::CimPropertyBoolean CanAddToCollection{"CanAddToCollection", this};
    core::CimPropertyUint16_arr SupportedInstallOptions{"SupportedInstallOptions", this};
    core::CimPropertyString_arr OtherSupportedExtendedResourceTypeDescriptions{
        "OtherSupportedExtendedResourceTypeDescriptions", this};
    core::CimPropertyUint16_arr SupportedExtendedResourceTypesMajorVersions{
        "SupportedExtendedResourceTypesMajorVersions", this};
    core::CimPropertyUint16_arr SupportedExtendedResourceTypesMinorVersions{
        "SupportedExtendedResourceTypesMinorVersions", this};
    core::CimPropertyUint16_arr SupportedExtendedResourceTypesRevisionNumbers{
        "SupportedExtendedResourceTypesRevisionNumbers", this};
    core::CimPropertyUint16_arr SupportedExtendedResourceTypesBuildNumbers{
        "SupportedExtendedResourceTypesBuildNumbers", this};
    core::CimPropertyUint16_arr SupportedURISchemes{"SupportedURISchemes", this};

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyString ElementName{"ElementName", this};
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyString Description{"Description", this};
    core::CimPropertyUint64 Generation{"Generation", this};
};
