// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

namespace ma::devlink {

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

}  // namespace ma::devlink
