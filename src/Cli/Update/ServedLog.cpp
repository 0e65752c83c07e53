// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/ServedLog.h"

#include <algorithm>

#include "History/Log/LogProperties.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using history::Record;

/// Microseconds since the Unix epoch, of which servers tell milliseconds; nothing for no timestamp.
Record::Number timeOf(const core::InstanceValue& entry, const char* property) {
    const auto time = entry.get<utils::Time>(property);
    if (!time || time->isPeriod()) return std::nullopt;
    constexpr std::uint64_t kMillisecond = 1000;
    return static_cast<std::int64_t>(time->getMiliseconds() * kMillisecond);
}

Record recordOf(const core::InstanceValue& entry) {
    Record record;
    record.id = utils::parseNumber<std::int64_t>(entry.text("RecordID")).value_or(0);
    record.begun = timeOf(entry, "CreationTimeStamp").value_or(0);
    for (const auto& property : history::kLogTexts)
        record.*property.member = entry.text(property.name);
    for (const auto& property : history::kLogNumbers)
        if (const auto number = entry.get<std::uint64_t>(property.name))
            record.*property.member = static_cast<std::int64_t>(*number);
    for (const auto& property : history::kLogTimes)
        record.*property.member = timeOf(entry, property.name);
    return record;
}

bool isWanted(const Record& record, const history::Filter& filter) {
    const bool isOfAdapter =
        filter.adapter.empty() || record.adapter == filter.adapter || record.pciAddress == filter.adapter;
    return isOfAdapter && (!filter.failedOnly || record.isFailure()) &&
           (!filter.since || record.begun >= *filter.since) && (!filter.after || record.id > *filter.after);
}

std::vector<Record> readServed(core::CimOperations& operations, const history::Filter& filter) {
    std::vector<Record> records;
    for (const core::InstanceValue& entry : operations.enumerateInstances(history::kLogEntryClass)) {
        Record record = recordOf(entry);
        if (isWanted(record, filter)) records.push_back(std::move(record));
    }
    std::ranges::sort(records, {}, &Record::id);
    if (!filter.after) std::ranges::reverse(records);
    return records;
}

std::vector<Record> readFile(const Connection& connection, const history::Filter& filter) try {
    if (connection.history) return connection.history->find(filter);
    throw CommandError(ExitStatus::Failed, "No history is kept: QUENX_HISTORY is off.",
                       "Unset QUENX_HISTORY.");
} catch (const history::HistoryError& error) {
    throw CommandError(ExitStatus::Failed, std::string("The history cannot be read: ") + error.what() + ".",
                       "");
}

}  // namespace

std::vector<Record> readHistory(const Connection& connection, const history::Filter& filter) try {
    return connection.isInProcess ? readFile(connection, filter) : readServed(*connection.operations, filter);
} catch (const core::CimError& error) {
    if (error.status() != core::CimStatus::InvalidClass) throw;
    throw CommandError(ExitStatus::Failed, "The server does not serve its history.",
                       "Put \"history_served = true\" into the policy of its machine, and restart it.");
}

std::string toldReason(const Connection& connection, const std::string& adapter, const std::string& uri,
                       std::uint32_t returnValue, core::ReasonId id) {
    if (connection.isInProcess) return connection.refusals ? connection.refusals->lastReason() : "";
    try {
        for (const Record& record : readServed(*connection.operations, {.adapter = adapter}))
            if (record.outcome == history::kRefused) {
                const bool isIt = record.uri == uri && record.returnValue == returnValue &&
                                  (id == core::ReasonId::None || record.reasonId == core::reasonCode(id));
                return isIt ? record.reason : "";
            }
    } catch (const core::CimError&) {
        // What explains an answer must not stand in its way.
    } catch (const CommandError&) {
    }
    return "";
}

}  // namespace cli
