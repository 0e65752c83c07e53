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
        : silence(limit), left(limit + limit / 4) {}

    const std::chrono::milliseconds silence;
    std::chrono::milliseconds left;  ///< for all silences of more than a second together
    bool isOver = false;             ///< a file was given up, in this request or an earlier one
    unsigned int hungFiles = 0;      ///< if they were too many to begin another one
};

enum class FileKind { Regular, Directory, CannotBeOpened, CannotBeLookedAt };

/// What a path names, and what could be read of it.
struct FileLook {
    FileKind kind = FileKind::CannotBeOpened;
    std::int64_t size = 0;  ///< of a regular file, when it was opened
    std::unique_ptr<std::uint8_t[]> bytes;
    std::size_t count = 0;         ///< how many could be read; fewer than `size` if the file shrank
    bool isWithoutMemory = false;  ///< there was no room for `size` bytes
};

/// Opens what the path names, once, and reads a regular file of at most `most` bytes whole. Only regular
/// files and directories are opened: a FIFO never blocks, and a device is not touched. Nothing when the file
/// was given up; then `patience` is over, and further calls for this path answer so at once until the one
/// that hangs has come back. errno tells why a file cannot be opened.
/// @param most  a larger file is not read; -1 reads none
/// @throws std::bad_alloc  before the file is touched
QUENX_EXPORT std::optional<FileLook> lookAtFile(const std::string& path, std::int64_t most,
                                                Patience& patience);

/// A test's own file system: called with the path before each system call for a file, and may block. Null
/// unless a test sets it.
QUENX_EXPORT extern std::atomic<void (*)(const std::string& path)> beforeFileAccess;

}  // namespace os
