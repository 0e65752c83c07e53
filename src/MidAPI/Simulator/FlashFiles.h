// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <span>
#include <string>

#include "Utils/Export.h"

namespace ma {

/// Every change that the simulator makes to files, one system call each: the seam at which a test cuts the
/// power. All operations throw std::system_error with the reason, which names the file where the operation
/// has its path. No state; may be used from any thread.
class QUENX_EXPORT FlashFiles {
  public:
    FlashFiles() = default;
    FlashFiles(const FlashFiles&) = delete;
    FlashFiles& operator=(const FlashFiles&) = delete;
    virtual ~FlashFiles();

    /// Makes one folder; it may be there already.
    virtual void makeFolder(const std::string& path);
    /// Opens an empty file for writing, emptying one that is there; the caller closes the descriptor. Throws
    /// os::ForeignFile as well.
    virtual int create(const std::string& path);
    /// Writes all bytes at the end of what was written so far.
    virtual void write(int descriptor, std::span<const std::uint8_t> bytes);
    /// Returns when what was written is on the medium.
    virtual void sync(int descriptor);
    virtual void rename(const std::string& from, const std::string& to);
    /// Returns when the entries of a folder (files made or renamed in it) are on the medium.
    virtual void syncFolder(const std::string& path);

    /// How long a change of a record waits for another process's.
    virtual std::chrono::milliseconds patience() const { return std::chrono::seconds(30); }
};

}  // namespace ma
