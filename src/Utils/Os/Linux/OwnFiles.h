// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>

#include "Utils/Export.h"

/// Files and folders that are this user's alone and must survive a power cut. Operations throw
/// std::system_error, which names the file and the reason; any thread may call.
namespace os {

class Descriptor;

/// Another user's file or folder in the place of one of this user's. what() says what to do, too.
class QUENX_EXPORT ForeignFile : public std::runtime_error {
  public:
    /// @param purpose  the beginning of the text: "cannot lock"
    ForeignFile(const std::string& path, uid_t owner, const std::string& purpose);
};

/// Opens a file that is this user's alone, and makes it if need be: a regular one, with one name, no link,
/// and a number above 2, since what others write to streams that their process has closed must not reach it.
/// @param access  O_WRONLY or O_RDWR
/// @param purpose  the beginning of the error's text: "cannot lock"
/// @return a descriptor that the caller closes
/// @throws ForeignFile "PURPOSE PATH: it belongs to user N, ..." as well
QUENX_EXPORT int openOwnFile(const std::string& path, int access, const std::string& purpose);

/// Leaves the rights to an open file or folder to its owner alone. False with errno set where that fails.
QUENX_EXPORT bool closeToOthers(int descriptor) noexcept;

/// Closes a folder of this user's to all others: whoever can open a file can also lock it, and so hold up
/// whoever else wants to. A link is refused, and a folder that is another user's or that another can
/// exchange, because the one that it lies in is theirs (ForeignFile) or writable for all
/// (std::runtime_error). False when there is none.
QUENX_EXPORT bool closeFolderToOthers(const std::string& path);

/// Makes a folder that is this user's alone, and those above it, or takes one that is there, unless others
/// may look into it: they may need it as it is. Refused as above, and with what would be right
/// (std::runtime_error).
QUENX_EXPORT void makeOwnFolder(const std::string& path);

/// How others than root and this user could change an open file or folder, and what ends that: "belongs to
/// user 5, who could change it; run: chown root PATH". Empty where they cannot.
/// @param path  for the text
QUENX_EXPORT std::string whoElseMayChange(const Descriptor& opened, const std::string& path);

/// The bytes from the file's position on, `most` of them or as many as there are.
/// @throws std::system_error  whose code is errno
QUENX_EXPORT std::string readUpTo(const Descriptor& file, std::size_t most);

/// Writes all bytes at the file's position.
/// @param what  the beginning of the error's text: "cannot write to the flash"
QUENX_EXPORT void writeAll(int file, std::span<const std::uint8_t> bytes, const std::string& what);

/// Gives a file this content and mode. It is written beside and renamed over it, so that a reader finds the
/// old file or the new one, never half of it; a link is replaced by a file.
/// @throws std::system_error "cannot write PATH: REASON"; the old file is as it was
QUENX_EXPORT void replaceFile(const std::string& path, std::string_view content, mode_t mode);

/// Returns when the entries of a folder (files made, renamed or removed in it) are on the medium.
QUENX_EXPORT void syncFolder(const std::string& path);

}  // namespace os
