// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_SoftwareInstallationServiceCapabilities.h"

#include "Framework/Model/CimClassInfo.h"
#include "Providers/Schema/ValueMapTexts.h"

namespace {

constexpr const char* kInstallActions =
    "2=None supported;3=Install From Software Identity;4=Install from ByteStream;5=Install from URI;..=DMTF "
    "Reserved;0x8000..0xFFFF=Vendor Reserved";

constexpr core::CimElementText kTexts[] = {
    {"", "What a software installation service is able to do."},
    {"SupportedAsynchronousActions", "Methods that start a job.", kInstallActions},
    {"SupportedSynchronousActions", "Methods that do without a job.", kInstallActions},
    {"SupportedInstallOptions", "Install options that are supported.", schema::kInstallOptions},
    {"SupportedURISchemes", "URI schemes that are supported.",
     "2=data;3=file;4=ftp;5=http;6=https;7=nfs;8=tftp;..=DMTF Reserved;0x8000..0xFFFF=Vendor Specific"},
    {"SupportedExtendedResourceTypes", "Package types that are supported.", schema::kExtendedResourceTypes},
};

}  // namespace

constinit const core::CimClassInfo CIM_SoftwareInstallationServiceCapabilities::classInfo{
    "CIM_SoftwareInstallationServiceCapabilities",
    &CIM_Capabilities::classInfo,
    false,
    {},
    &core::makeSample<CIM_SoftwareInstallationServiceCapabilities>,
    kTexts};

CIM_SoftwareInstallationServiceCapabilities::CIM_SoftwareInstallationServiceCapabilities() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_SoftwareInstallationServiceCapabilities::~CIM_SoftwareInstallationServiceCapabilities() = default;
