// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "Utils/Export.h"
#include "Utils/StringArray.h"

/// What this system asks the operating system for. Any thread may call.
namespace os {

struct FileLook;

/// The variable's value, null when it is not set. Owned by the environment.
QUENX_EXPORT const char* getEnvVariable(const char* name) noexcept;

/// The wall clock, microseconds since the Unix epoch.
QUENX_EXPORT std::uint64_t getuSecondsSinceEpoch() noexcept;

/// Microseconds on a clock that nobody sets; only differences mean something.
QUENX_EXPORT std::uint64_t getMonotonicuSeconds() noexcept;

/// How many forks are between the process that loaded this library and this one. A thread that was started
/// at another number is not here.
QUENX_EXPORT unsigned int forkCount() noexcept;

/// The host's name, "localhost" when it cannot be had.
QUENX_EXPORT std::string getHostname();

/// Opens /dev/null where standard input, output or error is closed, so that no other file gets their numbers
/// and what is written to them. For the first line of main().
QUENX_EXPORT void openStandardDescriptors() noexcept;

/// The size in bytes of a regular file.
/// @throws utils::Exception "Could not open the file %s" for what does not exist, cannot be opened, has a NUL
/// in its path, is larger than 2^31-1 bytes, did not answer for 30 seconds or is neither a file nor
/// a directory, which is told before it is opened: a FIFO never blocks; "Could not get info about the file
/// %s"; "The specyfied URI %s points to a directory"
QUENX_EXPORT std::int32_t getFileSize(const std::string& path);
/// The same for a file that has been looked at.
QUENX_EXPORT std::int32_t getFileSize(const std::string& path, const FileLook& look);

/// Fills the buffer from the beginning of a regular file. Returns the bytes read: fewer than asked for when
/// the file is shorter, cannot be read on, or is none. Never blocks on a FIFO or a device, never throws.
QUENX_EXPORT std::size_t readFile(const std::string& path, std::span<std::uint8_t> buffer) noexcept;

/// The first `most` bytes of a file, or as many as it has; nothing when there is no file of that name. A FIFO
/// never blocks. @throws std::system_error "cannot read PATH: REASON"
QUENX_EXPORT std::optional<std::vector<std::uint8_t>> readWholeFile(const std::string& path,
                                                                    std::size_t most);

/// True for a FIFO, a device and the like: what a person named by mistake for a file, and should not be
/// opened.
QUENX_EXPORT bool isSpecialFile(const std::string& path) noexcept;

/// The text of a file that a person named: settings, a certificate. Nothing when there is no such file.
/// @throws std::system_error "cannot read PATH: REASON"
/// @throws UnusableFile "is not a regular file", "is larger than 1 MiB"
QUENX_EXPORT std::optional<std::string> readTextFile(const std::string& path);
class QUENX_EXPORT UnusableFile : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// The first `most` bytes of a file of the system's own, of procfs or sysfs; nothing when it cannot be read,
/// whatever the reason.
QUENX_EXPORT std::optional<std::string> readSystemText(const std::string& path,
                                                       std::size_t most = std::size_t{1} << 20);

/// Has this process ignore the signals that mean nothing to it and would end it, in a flash too: a client or
/// a reader that goes away, a file that may not grow, timers and user signals. To be called before anything
/// that such an end would harm.
QUENX_EXPORT void ignoreOtherSignals() noexcept;

/// True exactly when the path can be opened as a directory.
QUENX_EXPORT bool isThisADir(const std::string& path) noexcept;

/// The names in a directory without "." and "..", sorted; empty when it cannot be read.
QUENX_EXPORT utils::StringArray listDirectory(const std::string& path);

/// Owns a file descriptor; a negative number is none. Not for use by two threads at once.
class Descriptor {
  public:
    explicit Descriptor(int number) noexcept : m_number(number) {}
    ~Descriptor() {
        if (isOpen()) ::close(m_number);
    }
    Descriptor(Descriptor&& other) noexcept : m_number(std::exchange(other.m_number, -1)) {}
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    bool isOpen() const noexcept { return m_number >= 0; }
    int number() const noexcept { return m_number; }

  private:
    int m_number;
};

}  // namespace os
