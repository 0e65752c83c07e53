// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace history {

/// How an attempt ended, or that it has not: the texts in the file and in JSON.
inline constexpr const char* kRunning = "running";
inline constexpr const char* kRefused = "refused";
inline constexpr const char* kFailed = "failed";
inline constexpr const char* kWritten = "written";
inline constexpr const char* kInterrupted = "interrupted";

/// An attempt to update an adapter. Times are in microseconds since the Unix epoch; what is not known is
/// empty.
struct Record {
    using Number = std::optional<std::int64_t>;

    std::int64_t id = 0;  ///< rises with each record, and is never given twice
    std::int64_t begun = 0;
    Number ended;          ///< of an interrupted one, when somebody found it
    Number active;         ///< when the firmware was first seen to run
    Number duration;       ///< microseconds from the call to the end
    std::string outcome;   ///< one of the texts above
    Number returnValue;    ///< of the method, where it was refused
    Number errorCode;      ///< of the adapter API, at the end of the flash
    std::string reason;    ///< in words, of what was not written
    std::string reasonId;  ///< "QX-0123"
    Number percent;        ///< the progress, as it was last seen
    std::string user;
    std::string address;
    std::string front;  ///< the program that carried it out
    std::int64_t process = 0;
    std::string owner;  ///< the name of the file that this process keeps locked
    std::string boot;   ///< the id of the machine's start, by the kernel
    std::string host;
    std::string target;
    std::string adapter;
    std::string backend;
    std::string pciAddress;
    std::string serial;
    std::string uri;
    std::string sha256;
    std::string signedBy;  ///< the key by which the image was trusted
    Number bytes;
    std::string imageVersions;  ///< "IMG_PXE 2, IMG_UEFI 2"
    std::string types;          ///< that were written: "IMG_PXE+IMG_UEFI"
    std::string options;        ///< the codes: "5,3"
    std::string optionValues;
    std::string versionsBefore;  ///< that ran before
    std::string versionsAfter;   ///< in the flash afterwards
    std::string job;

    bool isRunning() const { return outcome == kRunning; }
    bool isFailure() const { return outcome != kRunning && outcome != kWritten; }
};

/// Which records are wanted.
struct Filter {
    std::string adapter = {};   ///< name or PCI address; empty for all
    bool failedOnly = false;    ///< those that are no success and not running
    Record::Number since = {};  ///< begun then or later
    std::optional<std::int64_t> after =
        {};  ///< with an id above this, the oldest first; else the newest first
    std::int64_t most = 1000;
};

}  // namespace history
