// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_SoftwareInstallationService.h"

#include "Framework/Model/CimClassInfo.h"
#include "Providers/Schema/ValueMapTexts.h"

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

constexpr CimParameterInfo kJobInfo = out(reference("Job", "CIM_ConcreteJob"));
constexpr CimParameterInfo kUriInfo = in("URI", CimType::String, false);
constexpr CimParameterInfo kSourceInfo = reference("Source", "CIM_SoftwareIdentity");
constexpr CimParameterInfo kTargetInfo = reference("Target", "CIM_ManagedElement");
constexpr CimParameterInfo kCollectionInfo = reference("Collection", "CIM_Collection");
constexpr CimParameterInfo kOptionsInfo = in("InstallOptions", CimType::Uint16, true);
constexpr CimParameterInfo kValuesInfo = optional(in("InstallOptionsValues", CimType::String, true));
constexpr CimParameterInfo kCharacteristicsInfo = out(in("InstallCharacteristics", CimType::Uint16, true));

// Of target and collection exactly one is given, so a client may leave out either.
constexpr CimParameterInfo kCheckSoftwareIdentity[] = {
    kSourceInfo,
    optional(kTargetInfo),
    optional(kCollectionInfo),
    kCharacteristicsInfo,
};
constexpr CimParameterInfo kInstallFromSoftwareIdentity[] = {
    kJobInfo, kOptionsInfo, kValuesInfo, kSourceInfo, optional(kTargetInfo), optional(kCollectionInfo),
};
constexpr CimParameterInfo kInstallFromUri[] = {
    kJobInfo, kUriInfo, kTargetInfo, kOptionsInfo, kValuesInfo,
};

constexpr core::CimMethodInfo kMethods[] = {
    {"CheckSoftwareIdentity", CimType::Uint32, kCheckSoftwareIdentity},
    {"InstallFromSoftwareIdentity", CimType::Uint32, kInstallFromSoftwareIdentity},
    {"InstallFromURI", CimType::Uint32, kInstallFromUri},
};

constexpr const char* kInstallResults =
    "0=Job Completed with No Error;1=Not Supported;2=Unspecified Error;3=Timeout;4=Failed;5=Invalid "
    "Parameter;6=Target In Use;..=DMTF Reserved;4096=Method Parameters Checked - Job "
    "Started;4097=Unsupported TargetType;4098=Unattended/silent installation not "
    "supported;4099=Downgrade/Reinstall not supported;4100=Not enough memory;4101=Not enough swap "
    "space;4102=Unsupported version transition;4103=Not enough disk space;4104=Software and target operating "
    "system mismatch;4105=Missing dependencies;4106=Not applicable to target;4107=No supported path to "
    "image;4108=Cannot add to Collection;4109=Asynchronous Job already in progress;..=Method "
    "Reserved;32768..65535=Vendor Specific";

constexpr const char* kSource = "The software to install.";
constexpr const char* kTarget = "The element to install it on.";
constexpr const char* kCollectionParameter = "Always refused: collections are not supported.";
constexpr const char* kJob = "The job that was started.";

constexpr core::CimElementText kTexts[] = {
    {"", "A service that installs software, firmware included."},
    {"CheckSoftwareIdentity", "Says whether a software identity could be installed on a target.",
     kInstallResults},
    {"CheckSoftwareIdentity.Source", kSource},
    {"CheckSoftwareIdentity.Target", kTarget},
    {"CheckSoftwareIdentity.Collection", kCollectionParameter},
    {"CheckSoftwareIdentity.InstallCharacteristics", "What an installation would bring with it.",
     "2=Target automatic reset;3=System automatic reset;4=Separate target reset Required;5=Separate system "
     "reset Required;6=Manual Reboot Required;7=No Reboot Required;8=User Intervention Recommended;9=MAY be "
     "added to specified Collection;..=DMTF Reserved;0x7FFF..0xFFFF=Vendor Specific"},
    {"InstallFromSoftwareIdentity", "Starts a job that installs a software identity on a target.",
     kInstallResults},
    {"InstallFromSoftwareIdentity.Job", kJob},
    {"InstallFromSoftwareIdentity.Source", kSource},
    {"InstallFromSoftwareIdentity.Target", kTarget},
    {"InstallFromSoftwareIdentity.Collection", kCollectionParameter},
    {"InstallFromSoftwareIdentity.InstallOptions", "How to install; 5 (Update) has to be among them.",
     schema::kInstallOptions},
    {"InstallFromSoftwareIdentity.InstallOptionsValues", "Values for the options, at the same places."},
    {"InstallFromURI", "Starts a job that installs the image at a URI on a target.", kInstallResults},
    {"InstallFromURI.Job", kJob},
    {"InstallFromURI.URI", "Where the image is."},
    {"InstallFromURI.Target", kTarget},
    {"InstallFromURI.InstallOptions",
     "How to install; 5 (Update) has to be among them. 32768 chooses image types.", schema::kInstallOptions},
    {"InstallFromURI.InstallOptionsValues",
     "Values for the options, at the same places; for 32768 the image types, joined by plus signs."},
};

constexpr core::CimElementText kCollectionTexts[] = {{"", "Elements that belong together."}};

constinit const core::CimClassInfo kCollection{
    "CIM_Collection", &CIM_ManagedElement::classInfo, false, {}, nullptr, kCollectionTexts};

constexpr const core::CimClassInfo* kMentioned[] = {&kCollection};

}  // namespace

constinit const core::CimClassInfo CIM_SoftwareInstallationService::classInfo{
    "CIM_SoftwareInstallationService",
    &CIM_Service::classInfo,
    false,
    kMethods,
    &core::makeSample<CIM_SoftwareInstallationService>,
    kTexts,
    kMentioned};

CIM_SoftwareInstallationService::CIM_SoftwareInstallationService() {
    SystemCreationClassName.setKey();
    SystemName.setKey();
    CreationClassName.setKey();
    Name.setKey();
    declareClass(classInfo);
}

CIM_SoftwareInstallationService::~CIM_SoftwareInstallationService() = default;
