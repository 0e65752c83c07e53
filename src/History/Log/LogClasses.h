// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <deque>
#include <string>

#include "Framework/Model/CimClassInfo.h"
#include "Framework/Model/CimProperty.h"
#include "History/Record.h"
#include "Providers/Schema/CIM_EnabledLogicalElement.h"

// The classes of a record log (DMTF Record Log profile, DSP1010), and those that are served.

/// DMTF CIM_Log: a log of any kind.
class CIM_Log : public CIM_EnabledLogicalElement {
  public:
    static const core::CimClassInfo classInfo;
    CIM_Log() { declareClass(classInfo); }

    core::CimPropertyUint64 MaxNumberOfRecords{"MaxNumberOfRecords", this};
    core::CimPropertyUint64 CurrentNumberOfRecords{"CurrentNumberOfRecords", this};
    core::CimPropertyUint16 OverwritePolicy{"OverwritePolicy", this};
    core::CimPropertyUint16 LogState{"LogState", this};
};

/// DMTF CIM_RecordLog: a log of records.
class CIM_RecordLog : public CIM_Log {
  public:
    static const core::CimClassInfo classInfo;
    CIM_RecordLog();

    core::CimPropertyString InstanceID{"InstanceID", this};
};

/// DMTF CIM_RecordForLog: a record of any kind of log.
class CIM_RecordForLog : public CIM_ManagedElement {
  public:
    static const core::CimClassInfo classInfo;
    CIM_RecordForLog() { declareClass(classInfo); }

    core::CimPropertyString RecordFormat{"RecordFormat", this};
    core::CimPropertyString RecordData{"RecordData", this};
    core::CimPropertyString Locale{"Locale", this};
    core::CimPropertyUint16 PerceivedSeverity{"PerceivedSeverity", this};
};

/// DMTF CIM_LogEntry: a record that can be addressed by itself.
class CIM_LogEntry : public CIM_RecordForLog {
  public:
    static const core::CimClassInfo classInfo;
    CIM_LogEntry();

    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyString LogInstanceID{"LogInstanceID", this};
    core::CimPropertyString LogName{"LogName", this};
    core::CimPropertyString RecordID{"RecordID", this};
    core::CimPropertyDatetime CreationTimeStamp{"CreationTimeStamp", this};
    core::CimPropertyString MessageID{"MessageID", this};
    core::CimPropertyString Message{"Message", this};
    core::CimPropertyString_arr MessageArgs{"MessageArgs", this};
    core::CimPropertyString OwningEntity{"OwningEntity", this};
};

/// A reference to an instance of a class that is named.
class LogReference : public core::CimPropertyRef {
  public:
    LogReference(const char* name, core::CimInstance* owner, const char* className);
    void refer(const core::CimInstance& target) { assign(&target); }
};

/// DMTF CIM_LogManagesRecord: a log and one of its records.
class CIM_LogManagesRecord : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;
    CIM_LogManagesRecord();

    LogReference Log{"Log", this, "CIM_Log"};
    LogReference Record{"Record", this, "CIM_RecordForLog"};
};

/// The history of updates.
class Quenx_RecordLog : public CIM_RecordLog {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_RecordLog", &CIM_RecordLog::classInfo};

    std::string getClassName() const override { return classInfo.name; }
    static std::string getUniqId() { return "UpdateLog"; }
    /// @param records,most  that the history has, and may have
    void refresh(std::int64_t records, std::int64_t most);
};

/// An attempt to install.
class Quenx_LogEntry : public CIM_LogEntry {
  public:
    static const core::CimClassInfo classInfo;
    Quenx_LogEntry();

    std::string getClassName() const override { return classInfo.name; }
    /// @param showsPersons  also who asked, and from where
    void refresh(const history::Record& record, bool showsPersons);

  private:
    // In the order of the tables in LogProperties.h.
    std::deque<core::CimPropertyString> m_texts;
    std::deque<core::CimPropertyUint64> m_numbers;
    std::deque<core::CimPropertyDatetime> m_times;
};

/// The history and an attempt.
class Quenx_LogManagesRecord : public CIM_LogManagesRecord {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_LogManagesRecord", &CIM_LogManagesRecord::classInfo,
                                                  true};

    std::string getClassName() const override { return classInfo.name; }
};
