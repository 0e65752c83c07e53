// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "Utils/Export.h"

/// Looking at files and reading them where the file system may never answer, as one whose server is gone. No
/// signal ends such a call, so each is made on a thread of its own, which is left behind when patience ends.
/// This is a library of its own that is never unmapped, since such a thread returns whenever it likes.
namespace os {

/// How long one request waits for files. Not for use by two threads at once.
struct Patience {
    /// @param limit  the longest silence: until a file is open, until its next bytes come
    explicit Patience(std::chrono::milliseconds limit = std::chrono::seconds(30))
        : silence(limit), total(limit + limit / 4), left(total) {}

    const std::chrono::milliseconds silence;
    const std::chrono::milliseconds total;  ///< for all silences of more than a second together
    std::chrono::milliseconds left;         ///< of `total`
    bool isUsedUp = false;       ///< a file was given up because nothing was left, not for one long silence
    unsigned int hungFiles = 0;  ///< if they were too many to begin another one
};

enum class FileKind { Regular, Directory, CannotBeOpened, CannotBeLookedAt };

/// What a path names, and what could be read of it.
struct FileLook {
    FileKind kind = FileKind::CannotBeOpened;
    std::int64_t size = 0;  ///< of a regular file, when it was opened
    std::unique_ptr<std::uint8_t[]> bytes;
    std::size_t count = 0;         ///< how many could be read; fewer than `size` if the file shrank
    bool isWithoutMemory = false;  ///< there was no room for `size` bytes
    /// Where the file was that was opened, without links; empty where the system does not tell.
    std::string realPath = {};
};

/// Opens what the path names, once, and reads a regular file of at most `most` bytes whole. Only regular
/// files and directories are opened: a FIFO never blocks, and a device is not touched. A medium that gives a
/// page a second uses up patience for the first 64 KiB alone: then pages are asked for. Nothing when the file
/// was given up; further calls for this path answer so at once until the one that hangs has come back. errno
/// tells why a file cannot be opened.
/// @param most  a larger file is not read; -1 reads none
/// @throws std::bad_alloc  before the file is touched
QUENX_EXPORT std::optional<FileLook> lookAtFile(const std::string& path, std::int64_t most,
                                                Patience& patience);

/// Opens a file for reading, close-on-exec. Never blocks on a FIFO. For a file that somebody has a lease on
/// it waits until the kernel has taken that back, which takes 45 seconds at most unless the system says
/// otherwise.
/// @return -1 with errno set where that fails
QUENX_EXPORT int openForReading(const std::string& path) noexcept;

/// A test's own file system: called with the path before each system call for a file, and may block. Null
/// unless a test sets it.
QUENX_EXPORT extern std::atomic<void (*)(const std::string& path)> beforeFileAccess;

}  // namespace os
