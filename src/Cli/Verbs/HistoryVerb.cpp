// SPDX-License-Identifier: Apache-2.0
// What the adapters of this machine were asked to install.
#include <algorithm>
#include <cstdio>
#include <ctime>

#include "Cli/Display/Records.h"
#include "Cli/Display/Terminal.h"
#include "Cli/Update/ServedLog.h"
#include "Cli/Verbs/Verbs.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using history::Record;

constexpr std::int64_t kSecond = 1'000'000;  // microseconds

/// Minutes east of UTC in "Z", "+01:00" or "-0130"; nothing for another text.
std::optional<int> zoneOf(std::string_view text) {
    if (text == "Z" || text == "z") return 0;
    const bool isWest = text.starts_with('-');
    if (!isWest && !text.starts_with('+')) return std::nullopt;
    std::string digits(text.substr(1));
    if (digits.size() == 5 && digits[2] == ':') digits.erase(2, 1);
    if (digits.size() != 4 || !std::ranges::all_of(digits, utils::isDigit)) return std::nullopt;
    const int number = utils::parseNumber<int>(digits).value_or(0);
    const int minutes = number / 100 * 60 + number % 100;
    return isWest ? -minutes : minutes;
}

std::int64_t timeOf(const std::string& text) {
    std::string plain = text;
    utils::replaceCharacter(plain, ' ', 'T');
    for (const char* format : {"%Y-%m-%dT%H:%M:%S", "%Y-%m-%dT%H:%M", "%Y-%m-%d"}) {
        std::tm time{};
        time.tm_isdst = -1;  // as the zone has it at that time
        const char* rest = ::strptime(plain.c_str(), format, &time);
        if (rest == nullptr) continue;
        const int day = time.tm_mday;
        // There is no 31st of February, which the library would take for one of March.
        if (std::tm copy = time; ::timegm(&copy) == -1 || copy.tm_mday != day) break;
        if (*rest == '\0') return std::int64_t{::mktime(&time)} * kSecond;
        constexpr std::int64_t kMinute = 60 * kSecond;
        if (const auto zone = zoneOf(rest)) return ::timegm(&time) * kSecond - *zone * kMinute;
    }
    throw CommandError(ExitStatus::WrongUse, "--since is \"" + text + "\", which is not a time.",
                       "Write it as 2026-11-22 or 2026-11-22T16:00, with Z or +01:00 for a zone.");
}

history::Filter filterOf(const HistoryOptions& options) {
    history::Filter filter;
    filter.adapter = options.adapter;
    // The domain 0 is left out elsewhere, too.
    const bool isShort = std::ranges::count(options.adapter, ':') == 1;
    if (isShort) filter.adapter = "0000:" + options.adapter;
    filter.failedOnly = options.failedOnly;
    if (!options.since.empty()) filter.since = timeOf(options.since);
    if (options.after.empty()) return filter;
    filter.after = utils::parseNumber<std::int64_t>(options.after);
    if (!filter.after)
        throw CommandError(ExitStatus::WrongUse, "--after is \"" + options.after + "\", which is not an id.",
                           "Give it the id of a record, a whole number.");
    return filter;
}

std::string detailsOf(const Record& record) {
    if (record.isRunning()) return std::to_string(record.percent.value_or(0)) + " %";
    if (record.isFailure()) return record.reason;
    return record.versionsBefore + " -> " +
           (record.versionsAfter.empty() ? record.imageVersions : record.versionsAfter);
}

std::string userText(const Record& record) {
    const bool isHere = record.address.empty() || record.address == "local";
    return isHere ? record.user : record.user + " at " + record.address;
}

/// The file's name; a long one would push the details off every line. --json has it whole.
std::string imageText(const Record& record) {
    constexpr std::size_t kLongest = 40;
    return elideMiddle(record.uri.substr(record.uri.rfind('/') + 1), kLongest);
}

void printRecords(std::ostream& out, const std::vector<Record>& records) {
    Rows rows{{"ID", "TIME", "ADAPTER", "OUTCOME", "USER", "THROUGH", "IMAGE", "DETAILS"}};
    const auto orDash = [](const std::string& text) { return text.empty() ? "-" : text; };
    for (const Record& record : records) {
        rows.push_back({std::to_string(record.id),
                        localTimeText(record.begun),
                        orDash(labelOf(record.adapter, record.backend)),
                        {outcomeText(record), record.isFailure() ? Look::Failure : Look::Plain},
                        orDash(userText(record)),
                        orDash(record.front),
                        orDash(imageText(record)),
                        detailsOf(record)});
    }
    printTable(out, rows);
}

}  // namespace

ExitStatus showHistory(Context& context, const VerbOptions& options) {
    const std::vector<Record> records = readHistory(context.connection, filterOf(options.history));
    if (options.history.asLines) {
        for (const Record& record : records) {
            // Who asks for what comes after the last id must not miss how this one ends.
            if (!options.history.after.empty() && record.isRunning()) break;
            context.out << jsonLine(record) << '\n';
        }
    } else if (context.json) {
        Json list = Json::array();
        for (const Record& record : records)
            list.push_back(record);
        printJson(context.out, {{"records", list}});
    } else if (records.empty()) {
        context.out << "There are no records.\n";
    } else {
        printRecords(context.out, records);
    }
    return ExitStatus::Done;
}

}  // namespace cli
