// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentityResource.h"

#include "Utils/Os/Linux/linux.h"

Quenx_SoftwareIdentityResource::Quenx_SoftwareIdentityResource(inventory::FirmwareFile file)
    : m_file(std::move(file)) {
    SystemCreationClassName = "CIM_ComputerSystem";
    SystemName = os::getHostname();
    CreationClassName = getClassName();
    Name = "Quenx:" + getUniqId();
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
    EnabledState = 2;         // enabled
    RequestedState = 12;      // not applicable
    OperationalStatus = {2};  // OK
}

Quenx_SoftwareIdentityResourceClass::Quenx_SoftwareIdentityResourceClass(
    std::shared_ptr<inventory::FirmwareCatalog> catalog)
    : m_catalog(std::move(catalog)) {}

core::InstanceList::Iterator Quenx_SoftwareIdentityResourceClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_SoftwareIdentityResourceClass::getInstances");
    return serve(readAll());
}

core::CimInstance* Quenx_SoftwareIdentityResourceClass::findInstance(const core::CimPath& path) {
    return find(readAll(), path);
}

KeyParts<inventory::FirmwareFile> Quenx_SoftwareIdentityResourceClass::readAll() const {
    const auto content = m_catalog->scan();
    return {{content, &content->files}};
}
