// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "History/Record.h"

/// How a record is served: its properties in the class Quenx_LogEntry, beside those of CIM_LogEntry. Whoever
/// reads the log from afar makes the record again by the same tables.
namespace history {

inline constexpr const char* kLogClass = "Quenx_RecordLog";
inline constexpr const char* kLogEntryClass = "Quenx_LogEntry";

template <class Value>
struct LogProperty {
    const char* name;
    Value Record::*member;
    bool isPersonal = false;  ///< only administrators see it
};

inline constexpr LogProperty<std::string> kLogTexts[] = {
    {"Outcome", &Record::outcome},
    {"Reason", &Record::reason},
    {"ReasonID", &Record::reasonId},
    {"UserName", &Record::user, true},
    {"ClientAddress", &Record::address, true},
    {"Front", &Record::front},
    {"HostName", &Record::host},
    {"BootID", &Record::boot},
    {"TargetPath", &Record::target},
    {"AdapterName", &Record::adapter},
    {"Backend", &Record::backend},
    {"PCIAddress", &Record::pciAddress},
    {"SerialNumber", &Record::serial},
    {"URI", &Record::uri},
    {"ImageSHA256", &Record::sha256},
    {"SignedBy", &Record::signedBy},
    {"ImageVersions", &Record::imageVersions},
    {"ImageTypes", &Record::types},
    {"InstallOptions", &Record::options},
    {"InstallOptionsValues", &Record::optionValues},
    {"VersionsBefore", &Record::versionsBefore},
    {"VersionsAfter", &Record::versionsAfter},
    {"JobID", &Record::job},
};

inline constexpr LogProperty<Record::Number> kLogNumbers[] = {
    {"ReturnValue", &Record::returnValue},       {"ErrorCode", &Record::errorCode},
    {"PercentComplete", &Record::percent},       {"ImageBytes", &Record::bytes},
    {"DurationMicroseconds", &Record::duration},
};

/// Datetimes.
inline constexpr LogProperty<Record::Number> kLogTimes[] = {
    {"EndTime", &Record::ended},
    {"ActiveTime", &Record::active},
};

}  // namespace history
