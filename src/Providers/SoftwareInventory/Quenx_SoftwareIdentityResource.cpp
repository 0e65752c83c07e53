// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentityResource.h"

#include "Utils/Debug.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"

constinit const core::CimClassInfo Quenx_SoftwareIdentityResource::classInfo{
    "Quenx_SoftwareIdentityResource", &CIM_SoftwareIdentityResource::classInfo, false, {}, nullptr};

Quenx_SoftwareIdentityResource::Quenx_SoftwareIdentityResource(inventory::FirmwareFile file)
    : m_file(std::move(file)) {
    declareClass(classInfo);
    SystemCreationClassName = "CIM_ComputerSystem";
    SystemName = os::getHostname();
    CreationClassName = getClassName();
    Name = "Quenx:" + getUniqId();
}

Quenx_SoftwareIdentityResource::~Quenx_SoftwareIdentityResource() = default;

std::string Quenx_SoftwareIdentityResource::getClassName() const {
    return classInfo.name;
}

std::string Quenx_SoftwareIdentityResource::getUniqId() const {
    return m_file.path;
}

void Quenx_SoftwareIdentityResource::refresh() {
    const core::RecursiveLocker lock(getMutex());
    AccessInfo = getAccessInfo();
    InfoFormat = 200;  // URL
    ResourceType = 4;  // payload
    ElementName = m_file.path.substr(m_file.path.rfind('/') + 1);
    Description = "File of firmware image " + m_file.firmware.identifier;
    // With the path, since several files may hold one firmware.
    InstanceID = "Quenx:" + m_file.firmware.identifier + "@" + m_file.path;
    EnabledState = 2;                                   // enabled
    RequestedState = 12;                                // not applicable
    OperationalStatus = std::vector<std::uint16_t>{2};  // OK
}

std::string Quenx_SoftwareIdentityResource::getFirmwareFileID() const {
    return m_file.firmware.identifier;
}

std::string Quenx_SoftwareIdentityResource::getAccessInfo() const {
    return "file://" + m_file.path;  // never percent-encoded: nothing decodes it
}

Quenx_SoftwareIdentityResourceClass::Quenx_SoftwareIdentityResourceClass(
    std::shared_ptr<inventory::FirmwareCatalog> catalog)
    : m_catalog(std::move(catalog)) {}

utils::SafeList<core::CimInstance*>::Iterator Quenx_SoftwareIdentityResourceClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_SoftwareIdentityResourceClass::getInstances");
    std::vector<inventory::FirmwareFile> files;
    for (const auto& file : m_catalog->scan())
        files.push_back(*file);
    return serve(files);
}
