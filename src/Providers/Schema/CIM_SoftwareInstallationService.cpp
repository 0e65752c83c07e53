#include "Providers/Schema/CIM_SoftwareInstallationService.h"

namespace {

using core::CimDirection;
using core::CimParameterInfo;
using core::CimType;

constexpr CimParameterInfo in(const char* name, CimType type, bool isArray) {
    return {name, type, isArray, CimDirection::In, false, nullptr};
}
constexpr CimParameterInfo reference(const char* name, const char* className) {
    return {name, CimType::Reference, false, CimDirection::In, false, className};
}
constexpr CimParameterInfo out(CimParameterInfo parameter) {
    parameter.direction = CimDirection::Out;
    return parameter;
}
constexpr CimParameterInfo optional(CimParameterInfo parameter) {
    parameter.optional = true;
    return parameter;
}

constexpr CimParameterInfo job = out(reference("Job", "CIM_ConcreteJob"));
constexpr CimParameterInfo uri = in("URI", CimType::String, false);
constexpr CimParameterInfo source = reference("Source", "CIM_SoftwareIdentity");
constexpr CimParameterInfo target = reference("Target", "CIM_ManagedElement");
constexpr CimParameterInfo collection = reference("Collection", "CIM_Collection");
constexpr CimParameterInfo options = in("InstallOptions", CimType::Uint16, true);
constexpr CimParameterInfo values = optional(in("InstallOptionsValues", CimType::String, true));
constexpr CimParameterInfo characteristics = out(in("InstallCharacteristics", CimType::Uint16, true));

// Of target and collection exactly one is given, so a client may leave out either.
constexpr CimParameterInfo checkSoftwareIdentity[] = {
    source,
    optional(target),
    optional(collection),
    characteristics,
};
constexpr CimParameterInfo installFromSoftwareIdentity[] = {
    job, options, values, source, optional(target), optional(collection),
};
constexpr CimParameterInfo installFromUri[] = {
    job, uri, target, options, values,
};

constexpr core::CimMethodInfo methods[] = {
    {"CheckSoftwareIdentity", CimType::Uint32, checkSoftwareIdentity},
    {"InstallFromSoftwareIdentity", CimType::Uint32, installFromSoftwareIdentity},
    {"InstallFromURI", CimType::Uint32, installFromUri},
};

}  // namespace

constinit const core::CimClassInfo CIM_SoftwareInstallationService::classInfo{
    "CIM_SoftwareInstallationService", &CIM_Service::classInfo, false, methods,
    &core::makeSample<CIM_SoftwareInstallationService>};

CIM_SoftwareInstallationService::CIM_SoftwareInstallationService() {
    SystemCreationClassName.setKey();
    SystemName.setKey();
    CreationClassName.setKey();
    Name.setKey();
    declareClass(classInfo);
}

CIM_SoftwareInstallationService::~CIM_SoftwareInstallationService() = default;
