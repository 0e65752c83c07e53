// SPDX-License-Identifier: Apache-2.0
#include "Utils/Policy.h"

#include <algorithm>

#include "Utils/Toml.h"
#include "Utils/Utils.h"

namespace utils {

namespace {

constexpr std::size_t kLongestName = 256;

/// "@wheel" and "*" mean groups and everybody in other files; whoever writes them here must not believe that
/// they do.
bool isUserName(std::string_view name) {
    return !name.empty() && name.size() <= kLongestName && name.front() != '@' && name == trimOf(name, " ") &&
           std::ranges::none_of(name, [](char c) { return isControl(c) || c == '*'; });
}

/// A key of the file, and how it is read. One that names a table reads that table whole, with rows of its
/// own.
struct Key {
    std::string_view name;
    void (*read)(const TomlTable& table, std::string_view key, const std::string& fileName, Policy& policy);
};

void readAdministrators(const TomlTable& table, std::string_view key, const std::string& fileName,
                        Policy& policy) {
    policy.administrators = table.texts(key, isUserName, "user names, such as [\"root\", \"alice\"]");
    policy.administratorsPlace = fileName + ", line " + std::to_string(table.line(key));
}

void readHistory(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    // In the order of the rules.
    constexpr std::string_view kNames[] = {"off", "wanted", "required"};
    if (const auto index = table.choice(key, kNames)) policy.history = static_cast<HistoryRule>(*index);
}

void readHistoryRecords(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    constexpr std::int64_t kMost = 10'000'000;
    const auto records = table.number<std::int64_t>(key, kMost);
    // Fewer than are shown at once would make the list forget what it has just shown.
    constexpr std::int64_t kFewest = 1000;
    if (records && *records < kFewest)
        table.refuse(key, std::to_string(*records), "at least " + std::to_string(kFewest));
    policy.historyRecords = records.value_or(policy.historyRecords);
}

void readHistoryServed(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    policy.historyServed = table.flag(key, policy.historyServed);
}

void readReleaseClaim(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    if (table.has(key)) policy.releaseClaimAfterCheck = table.flag(key, false);
}

bool isWholePath(std::string_view path) {
    return path.starts_with('/');
}

/// Nothing where the file has no such key.
std::optional<std::string> folderIn(const TomlTable& table, std::string_view key) {
    std::optional<std::string> folder = table.text(key);
    if (folder && !isWholePath(*folder)) table.refuse(key, *folder, "the whole path of a folder");
    return folder;
}

void readKeepImages(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    policy.keepImages = folderIn(table, key).value_or("");
}

void readImageDirectories(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    policy.imageDirectories = table.texts(key, isWholePath, "whole paths, such as [\"/srv/firmware\"]");
}

void readLargestImage(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    constexpr std::int64_t kMost = INT32_MAX;  // no image is larger for the adapter API
    const auto bytes = table.number<std::int64_t>(key, kMost);
    if (bytes && *bytes < 1) table.refuse(key, std::to_string(*bytes), "a number of bytes");
    policy.largestImage = bytes.value_or(policy.largestImage);
}

void readTrust(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    // In the order of the rules.
    constexpr std::string_view kNames[] = {"off", "signature"};
    if (const auto index = table.choice(key, kNames)) policy.trust = static_cast<TrustRule>(*index);
}

void readTrustKeys(const TomlTable& table, std::string_view key, const std::string&, Policy& policy) {
    policy.trustKeys = folderIn(table, key).value_or(policy.trustKeys);
}

constexpr Key kKeys[] = {{"administrators", readAdministrators},
                         {"history", readHistory},
                         {"history_records", readHistoryRecords},
                         {"history_served", readHistoryServed},
                         {"release_claim_after_check", readReleaseClaim},
                         {"keep_images", readKeepImages},
                         {"image_directories", readImageDirectories},
                         {"largest_image", readLargestImage},
                         {"trust", readTrust},
                         {"trust_keys", readTrustKeys}};

}  // namespace

PolicyError::~PolicyError() = default;

Policy parsePolicy(std::string_view text, const std::string& fileName) try {
    const toml::table parsed = parseToml(text);
    const TomlTable table(parsed, "the policy");
    std::vector<std::string_view> names;
    for (const Key& key : kKeys)
        names.push_back(key.name);
    table.allowOnly(names);
    Policy policy;
    for (const Key& key : kKeys)
        key.read(table, key.name, fileName, policy);
    return policy;
} catch (const TomlError& error) {
    throw PolicyError(error.in(fileName));
}

}  // namespace utils
