// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "Utils/Export.h"
#include "Utils/StringArray.h"

namespace ma::devlink {

class Machine;

/// Where the kernel looks for firmware, first folder first: what this machine's administrator has set, then
/// the kernel's own.
QUENX_EXPORT utils::StringArray firmwareFolders(Machine& machine);

/// Of those, the one to stage images in: `configured`, or where that is empty the first in which this process
/// may make files. Changes nothing.
/// @throws AdapterError saying which folders there are, and what to do
QUENX_EXPORT std::string chooseFirmwareFolder(Machine& machine, const std::string& configured);

/// An image as a file that the kernel finds, for as long as this lives. The file is its owner's alone, in a
/// folder that is so, too, and has a name that nobody had before: the kernel shares what it has just read
/// under one name. For one thread.
class QUENX_EXPORT StagedImage {
  public:
    /// Makes the file, and brings it to the medium. Removes what an earlier process has left of the same
    /// card, so whoever calls holds the card's lock.
    /// @param folder  what chooseFirmwareFolder() gave
    /// @param card    a name of the card, in letters, digits, dots, colons and underscores
    /// @throws std::system_error naming the folder, and why; nothing is left then
    /// @throws os::ForeignFile where the folder in it is another user's
    StagedImage(Machine& machine, const std::string& folder, std::string_view card,
                std::span<const std::uint8_t> image);
    StagedImage(const StagedImage&) = delete;
    StagedImage& operator=(const StagedImage&) = delete;
    /// Removes the file; the log says so where that fails.
    ~StagedImage();

    /// What to ask the kernel for: the name below its folder.
    const std::string& name() const { return m_name; }

  private:
    void remove() noexcept;

    Machine& m_machine;
    const std::string m_name;
    const std::string m_path;
};

}  // namespace ma::devlink
