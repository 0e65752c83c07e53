// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentity.h"

#include <algorithm>
#include <set>

namespace {

/// Values of CIM_SoftwareIdentity.Classifications.
enum Classification : std::uint16_t { Driver = 2, Firmware = 10, Bios = 11 };

std::vector<std::uint16_t> classify(const std::vector<inventory::FirmwareComponent>& components) {
    const auto isDriver = [](const inventory::FirmwareComponent& part) { return part.type == "IMG_UEFI"; };
    std::vector<std::uint16_t> result{Firmware};
    if (std::any_of(components.begin(), components.end(), isDriver)) result.push_back(Driver);
    if (!std::all_of(components.begin(), components.end(), isDriver)) result.push_back(Bios);
    return result;
}

}  // namespace

Quenx_SoftwareIdentity::Quenx_SoftwareIdentity(inventory::Firmware firmware)
    : m_firmware(std::move(firmware)) {
    InstanceID = "Quenx:" + getUniqId();
}

void Quenx_SoftwareIdentity::refresh() {
    const core::RecursiveLocker lock(getMutex());
    setKind();
    setVersions();
    setOrNull(Manufacturer, !m_firmware.manufacturer.empty(), m_firmware.manufacturer);
    setOrNull(Name, !m_firmware.product.empty(), m_firmware.product);
    TargetTypes = getTargetTypes();
    Classifications = classify(m_firmware.components);
}

void Quenx_SoftwareIdentity::setKind() {
    const bool isInstalled = m_firmware.typeCode == InstalledComponent;
    IsEntity = isInstalled;
    Description = isInstalled ? "Firmware of adapter " + m_firmware.adapter
                              : "Firmware image for PCI device " + m_firmware.ids;
    OperationalStatus = {2};  // OK
}

void Quenx_SoftwareIdentity::setVersions() {
    std::uint32_t highest = 0;
    std::string text;
    std::vector<std::string> values{m_firmware.ids};
    std::vector<std::string> types{"Quenx:PCI Vendor and Device ID"};
    for (const inventory::FirmwareComponent& part : m_firmware.components) {
        const std::string version = std::to_string(part.version);
        highest = std::max(highest, part.version);
        text += (text.empty() ? "" : ", ") + part.type + " " + version;
        values.push_back(version);
        types.push_back("Quenx:" + part.type);
    }
    setOrNull(VersionString, !text.empty(), text);
    ElementName = text.empty() ? m_firmware.ids : m_firmware.ids + " " + text;
    IdentityInfoValue = std::move(values);
    IdentityInfoType = std::move(types);
    // Code revisions of images have 16 bits.
    setOrNull(MajorVersion, !m_firmware.components.empty(), static_cast<std::uint16_t>(highest));
}

utils::StringArray Quenx_SoftwareIdentity::getTargetTypes() const {
    utils::StringArray types;
    for (const inventory::FirmwareComponent& part : m_firmware.components)
        types.push_back(part.type);
    return types;
}

Quenx_SoftwareIdentityClass::Quenx_SoftwareIdentityClass(std::shared_ptr<inventory::FirmwareCatalog> catalog)
    : m_catalog(std::move(catalog)) {}

core::InstanceList::Iterator Quenx_SoftwareIdentityClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_SoftwareIdentityClass::getInstances");
    std::vector<inventory::Firmware> all;
    std::set<std::string> identifiers;
    for (const auto& file : m_catalog->scan()) {
        // Equal files are one firmware with several resources.
        if (identifiers.insert(file->firmware.identifier).second) all.push_back(file->firmware);
    }
    for (inventory::Firmware& installed : inventory::readInstalled(inventory::readPorts())) {
        all.push_back(std::move(installed));
    }
    return serve(all);
}
