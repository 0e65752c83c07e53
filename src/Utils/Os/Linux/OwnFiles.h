// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <span>
#include <string>

#include "Utils/Export.h"

/// Files and folders that are this user's alone and must survive a power cut. All operations throw
/// std::system_error, which names the file and the reason; any thread may call.
namespace os {

/// Closes a folder of this user's to all others: whoever can open a file can also lock it, and so hold up
/// whoever else wants to. A folder that is another user's, and a link, is refused. False when there is none.
QUENX_EXPORT bool closeFolderToOthers(const std::string& path);

/// Writes all bytes at the file's position.
/// @param what  the beginning of the error's text: "cannot write to the flash"
QUENX_EXPORT void writeAll(int file, std::span<const std::uint8_t> bytes, const std::string& what);

/// Returns when the entries of a folder (files made, renamed or removed in it) are on the medium.
QUENX_EXPORT void syncFolder(const std::string& path);

}  // namespace os
