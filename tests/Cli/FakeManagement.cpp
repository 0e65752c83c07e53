#include "Cli/FakeManagement.h"

#include "Cli/Failure.h"
#include "Cli/Values.h"

namespace test {

namespace {

constexpr const char* PORT = "root/cimv2:Quenx_EthernetPort.DeviceID=\"eth0\"";
constexpr const char* OTHER_PORT = "root/cimv2:Quenx_EthernetPort.DeviceID=\"eth3\"";
constexpr const char* JOB = "root/cimv2:Quenx_ConcreteJob.InstanceID=\"Quenx:FirmwareUpdate@Job#1\"";

core::InstanceValue port(const char* path, const std::string& name, const std::string& pci,
                         const std::string& ids, bool updatable) {
    return instance(
        path,
        {text("Name", name),
         texts("OtherIdentifyingInfo", {pci, ids, updatable ? "Supported" : "Not Supported"}),
         texts("IdentifyingDescriptions", {"PCI Address", "PCI Vendor and Device ID", "Firmware Update"})});
}

core::InstanceValue component(const std::string& type, std::uint64_t version) {
    return instance("Quenx_SoftwareIdentity.InstanceID=\"" + type + "\"",
                    {texts("TargetTypes", {type}), number("MajorVersion", version)});
}

}  // namespace

core::PropertyValue text(const std::string& name, const std::string& value) {
    return {name, core::CimValue::of(core::CimType::String, value), false, {}};
}

core::PropertyValue texts(const std::string& name, const std::vector<std::string>& values) {
    return {name, core::CimValue::arrayOf(core::CimType::String, {values.begin(), values.end()}), false, {}};
}

core::PropertyValue number(const std::string& name, std::uint64_t value) {
    return {name, core::CimValue::of(core::CimType::Uint32, value), false, {}};
}

core::InstanceValue instance(const std::string& path, std::vector<core::PropertyValue> properties) {
    return {core::CimPath(path), std::move(properties)};
}

std::vector<core::InstanceValue> installed(std::uint32_t pxe, std::uint32_t uefi) {
    return {component("IMG_PXE", pxe), component("IMG_UEFI", uefi)};
}

core::InstanceValue jobState(std::uint64_t state, std::uint64_t percent, std::uint64_t errorCode,
                             const std::string& error) {
    return instance(JOB, {number("JobState", state), number("PercentComplete", percent),
                          number("ErrorCode", errorCode), text("ErrorDescription", error)});
}

void fillModel(FakeManagement& model, std::uint32_t pxe, std::uint32_t uefi) {
    model.instances["Quenx_EthernetPort"] = {port(PORT, "eth0", "03:00.0", "1af4:1041", true),
                                             port(OTHER_PORT, "eth3", "05:00.0", "1022:2000", false)};
    model.associated[PORT] = installed(pxe, uefi);
    model.instances["Quenx_SoftwareInstallationService"] = {
        instance("Quenx_SoftwareInstallationService.Name=\"Quenx:FirmwareUpdate\"", {})};
    model.instances["Quenx_SoftwareInstallationServiceCapabilities"] = {instance(
        "Quenx_SoftwareInstallationServiceCapabilities.InstanceID=\"x\"",
        {texts("SupportedTargetTypes", {"IMG_CLP", "IMG_iSCSI", "IMG_PXE", "IMG_UEFI", "IMG_FCoE"})})};
    model.answer = {4096, {{"Job", core::CimValue::of(core::CimType::Reference, core::CimPath(JOB))}}};
    model.jobStates = {jobState(3, 0), jobState(4, 40), jobState(7, 100)};
}

std::vector<core::InstanceValue> FakeManagement::enumerateInstances(const std::string& className) {
    return instances[className];
}

std::vector<core::CimPath> FakeManagement::enumerateInstanceNames(const std::string& className) {
    std::vector<core::CimPath> paths;
    for (const core::InstanceValue& one : instances[className])
        paths.push_back(one.path);
    return paths;
}

core::InstanceValue FakeManagement::getInstance(const core::CimPath&) {
    if (unanswered > 0) {
        --unanswered;
        throw cli::Failure(cli::ExitStatus::Failed, "No answer.", "Wait.");
    }
    const core::InstanceValue state = jobStates.front();
    if (jobStates.size() > 1) jobStates.pop_front();
    if (jobStates.size() == 1 && !associatedAfterJob.empty()) associated[PORT] = associatedAfterJob;
    return state;
}

std::vector<core::InstanceValue> FakeManagement::associators(const core::CimPath& path,
                                                             const core::AssociationFilter&) {
    return associated[path.toString()];
}

core::MethodResult FakeManagement::invokeMethod(const core::CimPath&, const std::string& method,
                                                const std::vector<core::Argument>& given) {
    calledMethod = method;
    arguments = given;
    return answer;
}

std::string FakeManagement::argument(const std::string& name) const {
    for (const core::Argument& one : arguments) {
        if (one.name == name) return cli::displayText(one.value);
    }
    return "absent";
}

}  // namespace test
