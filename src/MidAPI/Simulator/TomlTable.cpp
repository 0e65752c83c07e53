#include "MidAPI/Simulator/TomlTable.h"

#include <algorithm>

#include "MidAPI/AdapterError.h"

namespace ma {

std::string inQuotes(std::string_view text) {
    constexpr std::size_t LONGEST = 60;
    std::string result = "\"";
    for (const char character : text.substr(0, LONGEST))
        result += static_cast<unsigned char>(character) < 0x20 || character == 0x7F ? '?' : character;
    return result + (text.size() > LONGEST ? "...\"" : "\"");
}

std::string listOf(std::span<const std::string_view> names) {
    std::string result;
    for (std::size_t index = 0; index < names.size(); ++index) {
        if (index != 0) result += index + 1 == names.size() ? " or " : ", ";
        result += names[index];
    }
    return result;
}

void TomlTable::failAt(const toml::source_region& where, const std::string& what) const {
    throw AdapterError(m_fileName + ", line " + std::to_string(where.begin.line) + ": " + m_subject + ": " +
                       what);
}

void TomlTable::fail(std::string_view key, const std::string& what) const {
    const toml::node* node = m_table.get(key);
    failAt(node != nullptr ? node->source() : m_table.source(), what);
}

std::optional<std::string> TomlTable::text(std::string_view key) const {
    const toml::node* node = m_table.get(key);
    if (node == nullptr) return std::nullopt;
    if (const auto* value = node->as_string()) return value->get();
    fail(key, "\"" + std::string(key) + "\" must be a text in quotes");
}

std::string TomlTable::requiredText(std::string_view key, std::string_view example) const {
    if (std::optional<std::string> value = text(key)) return *value;
    fail(key, "\"" + std::string(key) + "\" is missing; write for example " + std::string(key) + " = \"" +
                  std::string(example) + "\"");
}

std::optional<uint64_t> TomlTable::number(std::string_view key, uint64_t highest) const {
    const toml::node* node = m_table.get(key);
    if (node == nullptr) return std::nullopt;
    const auto* value = node->as_integer();
    if (value != nullptr && value->get() >= 0 && static_cast<uint64_t>(value->get()) <= highest)
        return static_cast<uint64_t>(value->get());
    fail(key, "\"" + std::string(key) + "\" must be a whole number from 0 to " + std::to_string(highest));
}

bool TomlTable::flag(std::string_view key, bool otherwise) const {
    const toml::node* node = m_table.get(key);
    if (node == nullptr) return otherwise;
    if (const auto* value = node->as_boolean()) return value->get();
    fail(key, "\"" + std::string(key) + "\" must be true or false");
}

std::vector<const toml::table*> TomlTable::tables(std::string_view key) const {
    std::vector<const toml::table*> result;
    const toml::node* node = m_table.get(key);
    if (node == nullptr) return result;
    if (const toml::array* array = node->as_array())
        for (const toml::node& element : *array)
            result.push_back(element.as_table());
    if (node->is_array() && std::find(result.begin(), result.end(), nullptr) == result.end()) return result;
    fail(key, "\"" + std::string(key) + "\" must be a list of tables");
}

std::optional<std::size_t> TomlTable::choice(std::string_view key,
                                             std::span<const std::string_view> names) const {
    const std::optional<std::string> value = text(key);
    if (!value) return std::nullopt;
    const auto found = std::find(names.begin(), names.end(), *value);
    if (found != names.end()) return static_cast<std::size_t>(found - names.begin());
    fail(key, "\"" + std::string(key) + "\" is " + inQuotes(*value) + ", it must be " + listOf(names));
}

void TomlTable::allowOnly(std::span<const std::string_view> keys) const {
    for (const auto& [key, node] : m_table) {
        if (std::find(keys.begin(), keys.end(), key.str()) != keys.end()) continue;
        failAt(key.source(), "unknown key " + inQuotes(key.str()) + "; the keys are " + listOf(keys));
    }
}

}  // namespace ma
