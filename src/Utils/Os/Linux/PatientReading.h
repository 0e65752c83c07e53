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
};

enum class FileKind { Regular, Directory, CannotBeOpened, CannotBeLookedAt };

struct FileMeasure {
    FileKind kind = FileKind::CannotBeOpened;
    std::int64_t size = 0;  ///< of a regular file
};

struct FileContent {
    std::unique_ptr<std::uint8_t[]> bytes;
    std::size_t count = 0;  ///< how many could be read
};

/// What a path names. Only regular files and directories are opened: a FIFO never blocks, and a device is not
/// touched. Nothing when the file was given up; then `patience` is over, and further calls for this path
/// answer so at once until the one that hangs has come back.
QUENX_EXPORT std::optional<FileMeasure> measureFile(const std::string& path, Patience& patience);

/// The first `size` bytes of a regular file, or as many as it has. Nothing likewise.
/// @throws std::bad_alloc
QUENX_EXPORT std::optional<FileContent> readFile(const std::string& path, std::size_t size,
                                                 Patience& patience);

/// A test's own file system: called with the path before each system call for a file, and may block. Null
/// unless a test sets it.
QUENX_EXPORT extern std::atomic<void (*)(const std::string& path)> beforeFileAccess;

}  // namespace os
