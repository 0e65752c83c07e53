// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <functional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Devlink/ComponentTable.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

namespace ma::devlink {

/// The PCI function that a file is held against.
struct PackageTarget {
    PciIds ids;
    std::string hindrance;  ///< why it can never be updated; empty where it can
    std::vector<NamedVersion> versions;
    std::uint32_t largestImage = UINT32_MAX;  ///< bytes
    const ComponentTable& table;
    /// Asks the driver, without writing anything, whether it takes a component of this name.
    std::function<bool(const std::string& component)> accepts;
};

/// The verdict on a file, and what it takes to write it.
struct PackageVerdict : ImageVerdict {
    std::vector<utils::FirmwareType> types = {};  ///< ascending; none for the whole device
    std::vector<std::string> components = {};     ///< to name in flash requests, one for each type
};

/// Holds a file against a function, without writing anything: whether it may be written, and what could not
/// be checked. A file in no known format is for the driver to judge. The order of the tests: its size, the
/// card that it is for, damage, whether the function can be updated, the requested types (type 0 ignored;
/// none stands for the whole device), versions. Free of state; never reads outside `file`.
QUENX_EXPORT PackageVerdict assessPackage(const PackageTarget& target, std::span<const std::uint8_t> file,
                                          const std::vector<utils::FirmwareType>& requested);

}  // namespace ma::devlink
