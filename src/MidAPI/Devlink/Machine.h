// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>

#include "Utils/Export.h"
#include "Utils/Os/Linux/FileLock.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/StringArray.h"

namespace ma::devlink {

/// What the devlink backend has of the machine that it runs on: every file, socket and lock. Tests bring
/// machines of their own. What reads never throws; what changes something, and the sockets, throw
/// std::system_error, which says what could not be done and why. A folder or a lock that is another user's is
/// os::ForeignFile. Any thread may call.
class QUENX_EXPORT Machine {
  public:
    Machine() = default;
    Machine(const Machine&) = delete;
    Machine& operator=(const Machine&) = delete;
    virtual ~Machine();

    /// The content of a file of sysfs or procfs, 1 MiB at most, without the newline at its end; nothing when
    /// it cannot be read.
    virtual std::optional<std::string> readFile(const std::string& path) = 0;
    /// What a symbolic link holds; nothing for anything else.
    virtual std::optional<std::string> readLink(const std::string& path) = 0;
    /// The names in a folder, sorted: none where there is no such folder. Nothing when it cannot be read,
    /// which is not the same: this process may have too many files open.
    virtual std::optional<utils::StringArray> listFolder(const std::string& path) = 0;
    virtual bool folderExists(const std::string& path) = 0;
    /// True for a folder in which this process may make files: it lets it, and is not on a read-only system.
    virtual bool folderIsWritable(const std::string& path) = 0;
    /// The kernel's release, "6.1.0-18-amd64": by uname(), since a service may be kept from most of procfs.
    virtual std::string kernelRelease() = 0;

    /// A generic-netlink socket, bound, with the kernel's texts for errors and short acknowledgements.
    virtual os::Descriptor openNetlink() = 0;
    /// Has a socket receive the notifications of a multicast group.
    virtual void joinGroup(const os::Descriptor& socket, std::uint32_t group) = 0;
    /// Sends one message. The kernel does what it asks for within the call, however long that takes.
    virtual void send(const os::Descriptor& socket, std::span<const std::uint8_t> message) = 0;
    /// One datagram of the kernel's, or nothing when none comes in time. Its length; what does not fit is an
    /// error, as is ENOBUFS: some were lost, and later ones can be received.
    virtual std::optional<std::size_t> receive(const os::Descriptor& socket, std::span<std::uint8_t> buffer,
                                               std::chrono::milliseconds patience) = 0;
    /// How long an answer may take once the kernel has done what it was asked for.
    virtual std::chrono::milliseconds patience() const { return std::chrono::seconds(5); }

    /// Makes a folder, its owner's alone. One that is there must be this user's and is closed to others.
    virtual void makeFolder(const std::string& path) = 0;
    /// Makes a new file, its owner's alone, and opens it for writing. Never follows a link or takes a file
    /// that is there.
    virtual os::Descriptor createFile(const std::string& path) = 0;
    virtual void writeFile(const os::Descriptor& file, std::span<const std::uint8_t> bytes) = 0;
    /// Returns when the content is on the medium.
    virtual void syncFile(const os::Descriptor& file) = 0;
    /// Returns when the entries of the folder are on the medium.
    virtual void syncFolder(const std::string& path) = 0;
    /// Removes a file; one that is not there is no error.
    virtual void removeFile(const std::string& path) = 0;

    /// The lock of this name, taken or, when somebody else holds it for longer than `patience`, not; see
    /// os::FileLock::isHeld(). All processes of the machine share it.
    virtual std::unique_ptr<os::FileLock> lock(const std::string& path,
                                               std::chrono::milliseconds patience) = 0;
};

/// The machine that this process runs on.
class QUENX_EXPORT LinuxMachine : public Machine {
  public:
    std::optional<std::string> readFile(const std::string& path) override;
    std::optional<std::string> readLink(const std::string& path) override;
    std::optional<utils::StringArray> listFolder(const std::string& path) override;
    bool folderExists(const std::string& path) override;
    bool folderIsWritable(const std::string& path) override;
    std::string kernelRelease() override;
    os::Descriptor openNetlink() override;
    void joinGroup(const os::Descriptor& socket, std::uint32_t group) override;
    void send(const os::Descriptor& socket, std::span<const std::uint8_t> message) override;
    std::optional<std::size_t> receive(const os::Descriptor& socket, std::span<std::uint8_t> buffer,
                                       std::chrono::milliseconds patience) override;
    void makeFolder(const std::string& path) override;
    os::Descriptor createFile(const std::string& path) override;
    void writeFile(const os::Descriptor& file, std::span<const std::uint8_t> bytes) override;
    void syncFile(const os::Descriptor& file) override;
    void syncFolder(const std::string& path) override;
    void removeFile(const std::string& path) override;
    std::unique_ptr<os::FileLock> lock(const std::string& path, std::chrono::milliseconds patience) override;
};

}  // namespace ma::devlink
