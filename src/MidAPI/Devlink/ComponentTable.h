// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <compare>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

namespace ma::devlink {

// Versions as drivers and packages write them: free texts, most of them numbers with dots between.

/// A version of one to four decimal fields, each below 256, as one number: the first field in the highest
/// byte, so that numbers are ordered as versions are ("1.2" is 0x01020000). 0 for any other text.
QUENX_EXPORT std::uint32_t versionNumber(std::string_view text);

/// How two versions of decimal fields compare, field by field; fields that one does not have count as 0, and
/// a field may be of any length. Nothing where a field is not a number, unless the texts are the same.
QUENX_EXPORT std::optional<std::strong_ordering> compareVersions(std::string_view left,
                                                                 std::string_view right);

/// What drivers call the firmware types: the component that a flash request names, and the version that tells
/// what is installed. Values; any thread may read.
class QUENX_EXPORT ComponentTable {
  public:
    struct Row {
        utils::FirmwareType type = utils::FirmwareType::None;
        std::string component;  ///< of a flash request
        std::string version;    ///< the name under which the driver tells it
    };
    /// What a package calls a component, and the version that tells what is installed of it.
    struct PackageRow {
        std::uint16_t identifier = 0;
        std::string version;
    };

    /// The names that are usual among drivers; no package row, since each maker counts his own way.
    ComponentTable();
    /// Rows of a type replace the one that the table has of it.
    void set(Row row);
    void set(PackageRow row);

    /// The component of a type; empty for one that the table does not have.
    std::string_view componentOf(utils::FirmwareType type) const;
    /// The type that a version of the driver's belongs to; FirmwareType::None for one of none.
    utils::FirmwareType typeOf(std::string_view versionName) const;
    /// The version that belongs to a component of a package; empty where that is not known.
    std::string_view versionOf(std::uint16_t packageIdentifier) const;

    /// What is installed by the running versions that a driver tells, ascending by type, each once. All that
    /// the table does not name is one entry of type 0, with the version of the firmware as a whole.
    std::vector<utils::FirmwareVersionInfo> installed(const std::vector<NamedVersion>& versions) const;

  private:
    std::vector<Row> m_rows;
    std::vector<PackageRow> m_packageRows;
};

/// The running version of a name; empty where the driver does not tell it.
QUENX_EXPORT std::string_view runningVersion(const std::vector<NamedVersion>& versions,
                                             std::string_view name);
/// The same of the flash: what runs, unless something else waits for a reset.
QUENX_EXPORT std::string_view versionInFlash(const std::vector<NamedVersion>& versions,
                                             std::string_view name);

}  // namespace ma::devlink
