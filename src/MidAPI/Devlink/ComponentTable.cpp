// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/ComponentTable.h"

#include <algorithm>
#include <map>

#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

using utils::FirmwareType;
using Fields = utils::StringArray;

/// Nothing where a field is empty or has anything but digits.
std::optional<Fields> decimalFields(std::string_view text) {
    Fields fields = utils::split(text, '.');
    const auto isNumber = [](const std::string& field) {
        return !field.empty() && std::ranges::all_of(field, utils::isDigit);
    };
    return std::ranges::all_of(fields, isNumber) ? std::optional(std::move(fields)) : std::nullopt;
}

/// Makers count builds and dates in fields, which no integer type is sure to hold.
std::strong_ordering compareFields(std::string_view left, std::string_view right) {
    left.remove_prefix(std::min(left.find_first_not_of('0'), left.size()));
    right.remove_prefix(std::min(right.find_first_not_of('0'), right.size()));
    const auto byLength = left.size() <=> right.size();
    return byLength != 0 ? byLength : left.compare(right) <=> 0;
}

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

std::uint32_t versionNumber(std::string_view text) {
    constexpr std::size_t kMostFields = 4;
    const Fields fields = utils::split(text, '.');
    if (fields.size() > kMostFields) return 0;
    std::uint32_t number = 0;
    for (std::size_t index = 0; index < kMostFields; ++index) {
        const auto field =
            index < fields.size() ? utils::parseNumber<std::uint8_t>(fields[index]) : std::uint8_t{0};
        if (!field) return 0;
        number = number << 8 | *field;
    }
    return number;
}

std::optional<std::strong_ordering> compareVersions(std::string_view left, std::string_view right) {
    if (left == right) return std::strong_ordering::equal;
    const auto leftFields = decimalFields(left);
    const auto rightFields = decimalFields(right);
    if (!leftFields || !rightFields) return std::nullopt;
    for (std::size_t index = 0; index < std::max(leftFields->size(), rightFields->size()); ++index) {
        const auto order = compareFields(index < leftFields->size() ? (*leftFields)[index] : "",
                                         index < rightFields->size() ? (*rightFields)[index] : "");
        if (order != 0) return order;
    }
    return std::strong_ordering::equal;
}

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

std::string_view versionInFlash(const std::vector<NamedVersion>& versions, std::string_view name) {
    const NamedVersion* found = rowOf(versions, &NamedVersion::name, name);
    if (found == nullptr) return {};
    return found->stored.empty() ? found->running : found->stored;
}

}  // namespace ma::devlink
