// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Simulator/Fault.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

namespace ma {

/// One simulated adapter port as the description file has it. packaging/adapters.toml explains every key.
struct AdapterDescription {
    std::string name;
    std::string description;
    utils::PCIAddr address;
    PciIds ids;
    std::array<std::uint8_t, 6> mac{};
    std::uint64_t speed = 0;  ///< bits per second
    bool linkUp = true;
    bool canBeUpdated = true;
    std::uint64_t writeSpeed = 0;  ///< bytes per second; 0: as fast as it goes
    BootType bootType = BootType::None;
    std::string flashFile;  ///< absolute, or relative to the description file; empty for none
    std::vector<utils::FirmwareVersionInfo> components;
    std::vector<Fault> faults;
};

/// Reads a description (TOML). Throws AdapterError, which names file, line, what is wrong and what would be
/// right.
/// @param fileName  what to call the text in an error
QUENX_EXPORT std::vector<AdapterDescription> parseAdapterDescriptions(std::string_view text,
                                                                      const std::string& fileName);

/// Reads a description file. Relative paths in it are made relative to its folder. Throws AdapterError.
QUENX_EXPORT std::vector<AdapterDescription> loadAdapterDescriptions(const std::string& path);

}  // namespace ma
