// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Utils/Export.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/StringArray.h"

namespace os {

/// What is known of a file without reading it.
struct FileState {
    // What changes with its content or with the right to read it. All zero for a file that is not there.
    std::uint64_t device = 0;
    std::uint64_t inode = 0;
    std::int64_t size = 0;
    std::int64_t modified = 0;  ///< nanoseconds, as is the next
    std::int64_t changed = 0;

    bool isOther = false;      ///< a directory, a device and the like
    bool isElsewhere = false;  ///< also reached by another name, which no watch of its folder sees

    bool operator==(const FileState&) const = default;
};

/// What a link leads to, for a link.
QUENX_EXPORT FileState stateOf(const std::string& path) noexcept;

/// Tells whether something in some folders may have changed, at the price of one system call and one for each
/// folder, however many files there are. The kernel queues a change before the call that makes it returns.
/// A folder on a file system that other machines may write to, or that is not known here, is never quiet.
/// What is written through a memory map shows when the file is closed. Not for use by two threads at once.
class QUENX_EXPORT FolderWatch {
  public:
    /// Watches these folders, which need not exist. Whatever happens after the call shows in isQuiet().
    void watch(const utils::StringArray& folders);
    /// Whether just these folders are watched and nothing has happened there since; false where that cannot
    /// be told, as in a child of the process.
    bool isQuiet(const utils::StringArray& folders) const noexcept;

    /// False for a file in the folders that may change without a word of the kernel: it has further names, or
    /// something is mounted there. A second name that it gets later is not noticed.
    bool sees(const FileState& file) const noexcept;

  private:
    struct Folder {
        std::string path;
        FileState state;
        bool operator==(const Folder&) const = default;
    };
    using Folders = std::vector<Folder>;

    bool isSame(const Folders& folders) const noexcept;
    bool begin(const Folders& folders) noexcept;

    Folders m_folders;
    std::optional<Descriptor> m_queue;
    bool m_isComplete = false;  ///< nothing that can be watched is left out
    unsigned int m_forks = 0;   ///< os::forkCount() where the queue was made
};

}  // namespace os
