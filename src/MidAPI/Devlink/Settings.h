// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "MidAPI/Devlink/ComponentTable.h"
#include "Utils/Export.h"

namespace ma::devlink {

/// What an administrator may set for real adapters. packaging/devlink.toml explains every key.
struct Settings {
    std::string firmwareFolder;  ///< where images are staged; empty for the first writable of the kernel's
    std::uint32_t largestImage = UINT32_MAX;  ///< bytes
    ComponentTable components;
};

/// Reads settings, whole. @throws AdapterError naming file, line and what would be right
/// @param fileName  for the texts
QUENX_EXPORT Settings parseSettings(std::string_view text, const std::string& fileName);

/// The settings of this machine: those in the file that QUENX_DEVLINK names, else in
/// /etc/quenx-devlink.toml, else the defaults. @throws AdapterError also for a file that is named and cannot
/// be read
QUENX_EXPORT Settings loadSettings();

}  // namespace ma::devlink
