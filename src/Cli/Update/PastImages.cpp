// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/PastImages.h"

#include <unistd.h>

#include "History/History.h"
#include "History/KeptImages.h"
#include "History/Look.h"

namespace cli {

namespace {

using history::Record;

/// The newest first.
std::vector<Record> recordsOf(const Connection& connection, const Adapter& adapter, std::int64_t most) try {
    if (connection.history == nullptr) return {};
    return connection.history->find({.adapter = adapter.name, .most = most});
} catch (const history::HistoryError& error) {
    throw CommandError(ExitStatus::Failed, std::string("The history cannot be read: ") + error.what() + ".",
                       "");
}

/// The slot may have had another card.
bool isOfThisCard(const Record& record, const history::AdapterLook& look) {
    return record.serial == look.serial;
}

/// A failure that was noticed in time.
bool hasChangedNothing(const Record& record) {
    return !record.versionsAfter.empty() && record.versionsAfter == record.versionsBefore;
}

/// Whether the later update found what the earlier one had left: not where another one wrote some types in
/// between. What nobody has seen run says nothing of it, since the later one names what ran.
bool isBefore(const Record& earlier, const Record& later) {
    // Of some types only, and the later one wrote others besides: of those nobody knows what was there.
    if (!earlier.optionValues.empty() && earlier.optionValues != later.optionValues) return false;
    const bool isTelling = earlier.active && !earlier.versionsAfter.empty() && !later.versionsBefore.empty();
    return !isTelling || earlier.versionsAfter == later.versionsBefore;
}

}  // namespace

PastImages pastImagesOf(const Connection& connection, const Adapter& adapter) {
    PastImages past;
    constexpr std::int64_t kMost = 1000;
    const std::vector<Record> records = recordsOf(connection, adapter, kMost);
    const auto look = records.empty() ? std::nullopt : history::lookAt(adapter.name);
    if (!look) return past;
    Record first;  // of those in a row that wrote the last image
    for (const Record& record : records) {
        if (!isOfThisCard(record, *look) || record.outcome == history::kRefused) continue;
        const bool isWritten = record.outcome == history::kWritten;
        if (!past.last && !isWritten && !past.failed && !hasChangedNothing(record)) past.failed = record;
        if (!isWritten || record.sha256.empty()) continue;
        if (!past.last) {
            past.last = record;
            first = record;
        } else if (record.sha256 == past.last->sha256) {
            first = record;
        } else {
            if (isBefore(record, first)) past.before = record;
            break;
        }
    }
    past.isUnchanged = !past.failed && past.last && !past.last->versionsAfter.empty() &&
                       past.last->versionsAfter == look->stored;
    return past;
}

bool isLastWritten(const Connection& connection, const Candidate& candidate) try {
    if (!candidate.image || candidate.image->problem) return false;
    const PastImages past = pastImagesOf(connection, candidate.adapter);
    // Of some of its types the others may be missing.
    return past.isUnchanged && past.last->optionValues == joined(candidate.types, "+") &&
           history::hasSum(candidate.image->path, past.last->sha256, past.last->bytes.value_or(0));
} catch (const CommandError&) {
    return false;
}

std::int64_t ownRecordOf(const Connection& connection, const Adapter& adapter) try {
    const std::vector<Record> records = recordsOf(connection, adapter, 1);
    return records.empty() || records.front().process != ::getpid() ? 0 : records.front().id;
} catch (const CommandError&) {
    return 0;
}

}  // namespace cli
