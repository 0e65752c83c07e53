#include "Providers/Schema/CIM_SoftwareInstallationServiceCapabilities.h"

constinit const core::CimClassInfo CIM_SoftwareInstallationServiceCapabilities::classInfo{
    "CIM_SoftwareInstallationServiceCapabilities",
    &CIM_Capabilities::classInfo,
    false,
    {},
    &core::makeSample<CIM_SoftwareInstallationServiceCapabilities>};

CIM_SoftwareInstallationServiceCapabilities::CIM_SoftwareInstallationServiceCapabilities() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_SoftwareInstallationServiceCapabilities::~CIM_SoftwareInstallationServiceCapabilities() = default;
