// SPDX-License-Identifier: Apache-2.0
#include "Cli/Display/Records.h"

#include <array>
#include <ctime>

#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr std::int64_t kSecond = 1'000'000;  // microseconds

/// "2026-11-22T15:20:03.123456Z"; null for none.
Json utcText(const history::Record::Number& microseconds) {
    if (!microseconds) return nullptr;
    const auto seconds = static_cast<std::time_t>(*microseconds / kSecond);
    std::tm time{};
    if (gmtime_r(&seconds, &time) == nullptr) return nullptr;
    return utils::formatStr("%04d-%02d-%02dT%02d:%02d:%02d.%06dZ", time.tm_year + 1900, time.tm_mon + 1,
                            time.tm_mday, time.tm_hour, time.tm_min, time.tm_sec,
                            static_cast<int>(*microseconds % kSecond));
}

}  // namespace

std::string localTimeText(std::int64_t microseconds) {
    const auto seconds = static_cast<std::time_t>(microseconds / kSecond);
    std::tm time{};
    if (localtime_r(&seconds, &time) == nullptr) return "-";
    std::array<char, sizeof "9999-12-31 23:59:59 +0000"> text{};
    return {text.data(), std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M:%S %z", &time)};
}

std::string outcomeText(const history::Record& record) {
    return record.active ? "active" : record.outcome;
}

}  // namespace cli

namespace history {

void to_json(cli::Json& json, const Record& record) {
    using cli::Json;
    using cli::utcText;
    const auto orNull = [](const std::string& text) { return text.empty() ? Json() : Json(text); };
    const auto number = [](const Record::Number& value) { return value ? Json(*value) : Json(); };
    json = {{"id", record.id},
            {"begun", utcText(record.begun)},
            {"ended", utcText(record.ended)},
            {"durationMicroseconds", number(record.duration)},
            {"outcome", record.outcome},
            {"active", utcText(record.active)},
            {"percentComplete", number(record.percent)},
            {"returnValue", number(record.returnValue)},
            {"errorCode", number(record.errorCode)},
            {"reason", orNull(record.reason)},
            {"reasonId", orNull(record.reasonId)},
            {"user", orNull(record.user)},
            {"address", orNull(record.address)},
            {"front", orNull(record.front)},
            {"process", record.process == 0 ? Json() : Json(record.process)},  // a server does not tell
            {"boot", orNull(record.boot)},
            {"host", orNull(record.host)},
            {"target", orNull(record.target)},
            {"adapter", orNull(record.adapter)},
            {"backend", orNull(record.backend)},
            {"pciAddress", orNull(record.pciAddress)},
            {"serialNumber", orNull(record.serial)},
            {"uri", orNull(record.uri)},
            {"sha256", orNull(record.sha256)},
            {"signedBy", orNull(record.signedBy)},
            {"bytes", number(record.bytes)},
            {"imageVersions", orNull(record.imageVersions)},
            {"types", orNull(record.types)},
            {"options", orNull(record.options)},
            {"optionValues", orNull(record.optionValues)},
            {"versionsBefore", orNull(record.versionsBefore)},
            {"versionsAfter", orNull(record.versionsAfter)},
            {"job", orNull(record.job)}};
}

}  // namespace history
