// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/ComponentTable.h"

#include <algorithm>
#include <map>

#include "MidAPI/Devlink/VersionText.h"

namespace ma::devlink {
namespace {

using utils::FirmwareType;

// Of these only fw.undi is a name of the kernel's own. The others stand for drivers that may come to have
// them; a driver refuses what it does not know.
const ComponentTable::Row kUsualRows[] = {
    {FirmwareType::CLP, "fw.clp", "fw.clp"},    {FirmwareType::iSCSI, "fw.iscsi", "fw.iscsi"},
    {FirmwareType::PXE, "fw.undi", "fw.undi"},  {FirmwareType::UEFI, "fw.uefi", "fw.uefi"},
    {FirmwareType::FCoE, "fw.fcoe", "fw.fcoe"},
};

/// Under which of its names the driver tells the firmware as a whole: the first one that there is.
constexpr std::string_view kWholeNames[] = {"fw", "fw.mgmt"};

template <class Rows, class Key>
auto rowOf(Rows& rows, Key member, const auto& key) {
    const auto found = std::ranges::find(rows, key, member);
    return found == rows.end() ? nullptr : &*found;
}

}  // namespace

ComponentTable::ComponentTable() : m_rows(std::begin(kUsualRows), std::end(kUsualRows)) {}

void ComponentTable::set(Row row) {
    std::erase_if(m_rows, [&row](const Row& each) { return each.type == row.type; });
    m_rows.push_back(std::move(row));
}

void ComponentTable::set(PackageRow row) {
    std::erase_if(m_packageRows,
                  [&row](const PackageRow& each) { return each.identifier == row.identifier; });
    m_packageRows.push_back(std::move(row));
}

std::string_view ComponentTable::componentOf(FirmwareType type) const {
    const Row* row = rowOf(m_rows, &Row::type, type);
    return row == nullptr ? std::string_view() : row->component;
}

std::string_view ComponentTable::versionOf(std::uint16_t packageIdentifier) const {
    const PackageRow* row = rowOf(m_packageRows, &PackageRow::identifier, packageIdentifier);
    return row == nullptr ? std::string_view() : row->version;
}

FirmwareType ComponentTable::typeOf(std::string_view versionName) const {
    const Row* row = rowOf(m_rows, &Row::version, versionName);
    return row == nullptr ? FirmwareType::None : row->type;
}

std::vector<utils::FirmwareVersionInfo> ComponentTable::installed(
    const std::vector<NamedVersion>& versions) const {
    std::map<FirmwareType, std::uint32_t> found;
    for (const NamedVersion& version : versions)
        if (!version.running.empty()) found.emplace(typeOf(version.name), versionNumber(version.running));
    if (const auto whole = found.find(FirmwareType::None); whole != found.end()) {
        for (const std::string_view name : kWholeNames) {
            if (runningVersion(versions, name).empty()) continue;
            whole->second = versionNumber(runningVersion(versions, name));
            break;
        }
    }
    std::vector<utils::FirmwareVersionInfo> components;
    for (const auto& [type, version] : found)
        components.push_back({type, version});
    return components;
}

std::string_view runningVersion(const std::vector<NamedVersion>& versions, std::string_view name) {
    const NamedVersion* found = rowOf(versions, &NamedVersion::name, name);
    return found == nullptr ? std::string_view() : found->running;
}

}  // namespace ma::devlink
