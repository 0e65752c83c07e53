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

constexpr Key kKeys[] = {{"administrators", readAdministrators}};

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
