// SPDX-License-Identifier: Apache-2.0
#include "History/Log/LogClasses.h"

#include "Framework/Model/CimInstance.h"
#include "History/Log/LogProperties.h"

namespace {

using core::CimClassInfo;
using history::Record;

constexpr core::CimElementText kLogElementTexts[] = {
    {"", "A log of any kind."},
    {"OverwritePolicy", "What happens when the log is full.",
     "0=Unknown;2=Wraps When Full;7=Never Overwrites;..=DMTF Reserved;32768..65535=Vendor Reserved"},
    {"LogState", "The state of the log.",
     "0=Unknown;2=Normal;3=Erasing;4=Not Applicable;..=DMTF Reserved;32768..65535=Vendor Reserved"},
};
constexpr core::CimElementText kRecordLogTexts[] = {{"", "A log of records."}};
constexpr core::CimElementText kRecordForLogTexts[] = {
    {"", "A record of a log."},
    {"PerceivedSeverity", "How bad it is.",
     "0=Unknown;1=Other;2=Information;3=Degraded/Warning;4=Minor;5=Major;6=Critical;7=Fatal/"
     "NonRecoverable;..=DMTF Reserved"},
};
constexpr core::CimElementText kLogEntryTexts[] = {{"", "A record that can be addressed by itself."}};
constexpr core::CimElementText kManagesTexts[] = {{"", "A log and one of its records."}};
constexpr core::CimElementText kAttemptTexts[] = {
    {"", "An attempt to install an image on an adapter."},
    {"Outcome", "How it ended: running, refused, failed, written or interrupted."},
    {"Reason", "Why nothing was written, in words."},
    {"ReasonID", "The same as an id that stays from release to release: QX-0123."},
};

constexpr std::uint16_t kInformation = 2;
constexpr std::uint16_t kWarning = 3;
constexpr std::uint16_t kMajor = 5;

std::uint16_t severityOf(const Record& record) {
    if (!record.isFailure()) return kInformation;
    return record.outcome == history::kRefused ? kWarning : kMajor;
}

/// "Install of file:///new.rom on eth0: refused. There is no such file"
std::string messageOf(const Record& record) {
    const auto orNothing = [](const std::string& text) { return text.empty() ? "(unknown)" : text; };
    const std::string reason = record.isFailure() ? ". " + record.reason : "";
    return "Install of " + orNothing(record.uri) + " on " + orNothing(record.adapter) + ": " +
           record.outcome + reason;
}

/// What is not known stays null.
template <class Property>
void setKnown(Property& property, const std::string& text) {
    if (!text.empty()) property = text;
}

}  // namespace

constinit const CimClassInfo CIM_Log::classInfo{
    "CIM_Log",       &CIM_EnabledLogicalElement::classInfo, false, {}, &core::makeSample<CIM_Log>,
    kLogElementTexts};

constinit const CimClassInfo CIM_RecordLog::classInfo{
    "CIM_RecordLog", &CIM_Log::classInfo, false, {}, &core::makeSample<CIM_RecordLog>, kRecordLogTexts};

CIM_RecordLog::CIM_RecordLog() {
    InstanceID.setKey();
    declareClass(classInfo);
}

constinit const CimClassInfo CIM_RecordForLog::classInfo{
    "CIM_RecordForLog", &CIM_ManagedElement::classInfo, false, {}, &core::makeSample<CIM_RecordForLog>,
    kRecordForLogTexts};

constinit const CimClassInfo CIM_LogEntry::classInfo{
    "CIM_LogEntry", &CIM_RecordForLog::classInfo, false, {}, &core::makeSample<CIM_LogEntry>, kLogEntryTexts};

CIM_LogEntry::CIM_LogEntry() {
    InstanceID.setKey();
    declareClass(classInfo);
}

LogReference::LogReference(const char* name, core::CimInstance* owner, const char* className)
    : CimPropertyRef(name, owner) {
    setReferenceClass(className);
}

constinit const CimClassInfo CIM_LogManagesRecord::classInfo{
    "CIM_LogManagesRecord", nullptr, true, {}, &core::makeSample<CIM_LogManagesRecord>, kManagesTexts};

CIM_LogManagesRecord::CIM_LogManagesRecord() {
    Log.setKey();
    Record.setKey();
    declareClass(classInfo);
}

void Quenx_RecordLog::refresh(std::int64_t records, std::int64_t most) {
    constexpr std::uint16_t kWrapsWhenFull = 2;
    constexpr std::uint16_t kNormal = 2;
    const core::RecursiveLocker lock(getMutex());
    InstanceID = "Quenx:" + getUniqId();
    Name = getUniqId();
    ElementName = "Firmware updates";
    Description = "The newest attempts to install firmware; \"quenxctl history\" lists all";
    MaxNumberOfRecords = static_cast<std::uint64_t>(most);
    CurrentNumberOfRecords = static_cast<std::uint64_t>(records);
    OverwritePolicy = kWrapsWhenFull;
    LogState = kNormal;
    EnabledState = 2;         // enabled
    RequestedState = 12;      // not applicable
    OperationalStatus = {2};  // OK
}

constinit const CimClassInfo Quenx_LogEntry::classInfo{
    "Quenx_LogEntry", &CIM_LogEntry::classInfo, false, {}, &core::makeSample<Quenx_LogEntry>, kAttemptTexts};

Quenx_LogEntry::Quenx_LogEntry() {
    for (const auto& property : history::kLogTexts)
        m_texts.emplace_back(property.name, this);
    for (const auto& property : history::kLogNumbers)
        m_numbers.emplace_back(property.name, this);
    for (const auto& property : history::kLogTimes)
        m_times.emplace_back(property.name, this);
    declareClass(classInfo);
}

void Quenx_LogEntry::refresh(const Record& record, bool showsPersons) {
    const auto number = [](const Record::Number& value) { return static_cast<std::uint64_t>(*value); };
    const core::RecursiveLocker lock(getMutex());
    const std::string log = "Quenx:" + Quenx_RecordLog::getUniqId();
    InstanceID = log + "@Entry#" + std::to_string(record.id);
    LogInstanceID = log;
    LogName = Quenx_RecordLog::getUniqId();
    RecordID = std::to_string(record.id);
    CreationTimeStamp = utils::Time::fromEpoch(static_cast<std::uint64_t>(record.begun));
    Message = messageOf(record);
    OwningEntity = "Quenx";
    PerceivedSeverity = severityOf(record);
    ElementName = "Update " + std::to_string(record.id);
    for (std::size_t i = 0; i < m_texts.size(); ++i) {
        const auto& property = history::kLogTexts[i];
        if (showsPersons || !property.isPersonal) setKnown(m_texts[i], record.*property.member);
    }
    for (std::size_t i = 0; i < m_numbers.size(); ++i) {
        const Record::Number& value = record.*history::kLogNumbers[i].member;
        if (value) m_numbers[i] = number(value);
    }
    for (std::size_t i = 0; i < m_times.size(); ++i) {
        const Record::Number& value = record.*history::kLogTimes[i].member;
        if (value) m_times[i] = utils::Time::fromEpoch(number(value));
    }
}
