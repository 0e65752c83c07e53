// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentity.h"

#include <algorithm>

#include "Utils/Utils.h"

namespace {

/// Values of CIM_SoftwareIdentity.Classifications.
enum Classification : std::uint16_t { Driver = 2, Firmware = 10, Bios = 11 };

/// Values of CIM_ManagedSystemElement.OperationalStatus.
enum OperationalStatusValue : std::uint16_t { Ok = 2, Dormant = 15 };

std::vector<std::uint16_t> classify(const std::vector<inventory::FirmwareComponent>& components) {
    const auto isDriver = [](const inventory::FirmwareComponent& part) { return part.type == "IMG_UEFI"; };
    const auto isBios = [&](const inventory::FirmwareComponent& part) {
        return !part.type.empty() && !isDriver(part);
    };
    std::vector<std::uint16_t> result{Firmware};
    if (std::any_of(components.begin(), components.end(), isDriver)) result.push_back(Driver);
    if (std::any_of(components.begin(), components.end(), isBios)) result.push_back(Bios);
    return result;
}

/// The numbers of "20.5.13"; none for a text of another kind, which no numbers can stand for.
std::vector<std::uint16_t> numbersIn(const std::string& version) {
    std::vector<std::uint16_t> numbers;
    for (const std::string& field : utils::split(version, '.')) {
        const auto number = utils::parseNumber<std::uint16_t>(field);
        if (!number) return {};
        numbers.push_back(*number);
    }
    return numbers;
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
    const bool isSimulated = m_firmware.backend == ma::kSimulatorBackend;
    const std::string adapter = (isSimulated ? "simulated adapter " : "adapter ") + m_firmware.adapter;
    IsEntity = isInstalled;
    Description = isInstalled ? "Firmware of " + adapter : "Firmware image for PCI device " + m_firmware.ids;
    const bool isDormant = m_firmware.waitsFor.has_value();
    OperationalStatus = {static_cast<std::uint16_t>(isDormant ? Dormant : Ok)};
    setOrNull(StatusDescriptions, isDormant, std::vector<std::string>{"Takes effect after a reset"});
}

void Quenx_SoftwareIdentity::setVersions() {
    std::uint32_t highest = 0;
    std::string text;
    std::vector<std::string> values{m_firmware.ids};
    std::vector<std::string> types{"Quenx:PCI Vendor and Device ID"};
    for (const inventory::FirmwareComponent& part : m_firmware.components) {
        highest = std::max(highest, part.version);
        text += (text.empty() ? "" : ", ") + part.label() + " " + part.versionText();
        const bool isNumber = !part.type.empty() && !m_firmware.waitsFor;
        values.push_back(isNumber ? std::to_string(part.version) : part.text);
        types.push_back("Quenx:" + part.label());
    }
    if (m_firmware.waitsFor) {
        values.emplace_back(inventory::resetText(*m_firmware.waitsFor));
        types.emplace_back("Quenx:Reset Needed");
    }
    ElementName = text.empty() ? m_firmware.ids : m_firmware.ids + " " + text;
    IdentityInfoValue = std::move(values);
    IdentityInfoType = std::move(types);
    if (m_firmware.components.size() == 1 && !m_firmware.components.front().text.empty())
        return setToldVersion(m_firmware.components.front().text);
    setOrNull(VersionString, !text.empty(), text);
    // Code revisions of images have 16 bits.
    setOrNull(MajorVersion, !m_firmware.components.empty(), static_cast<std::uint16_t>(highest));
}

void Quenx_SoftwareIdentity::setToldVersion(const std::string& text) {
    VersionString = text;
    const std::vector<std::uint16_t> numbers = numbersIn(text);
    std::size_t next = 0;
    for (core::CimPropertyUint16* each : {&MajorVersion, &MinorVersion, &RevisionNumber, &BuildNumber}) {
        const bool isThere = next < numbers.size();
        setOrNull(*each, isThere, isThere ? numbers[next] : std::uint16_t{0});
        ++next;
    }
}

utils::StringArray Quenx_SoftwareIdentity::getTargetTypes() const {
    utils::StringArray types;
    for (const inventory::FirmwareComponent& part : m_firmware.components)
        if (!part.type.empty()) types.push_back(part.type);
    return types;
}

Quenx_SoftwareIdentityClass::Quenx_SoftwareIdentityClass(std::shared_ptr<inventory::FirmwareCatalog> catalog)
    : m_catalog(std::move(catalog)) {}

core::InstanceList::Iterator Quenx_SoftwareIdentityClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_SoftwareIdentityClass::getInstances");
    return serve(readAll());
}

core::CimInstance* Quenx_SoftwareIdentityClass::findInstance(const core::CimPath& path) {
    return find(readAll(), path);
}

KeyParts<inventory::Firmware> Quenx_SoftwareIdentityClass::readAll() const {
    const auto content = m_catalog->scan();
    return {{content, &content->firmware},
            std::make_shared<const std::vector<inventory::Firmware>>(
                inventory::readInstalled(inventory::readPorts()))};
}
