// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <limits>
#include <optional>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Utils/Export.h"

namespace utils {

/// A text is not TOML, or its keys are not those that were wanted.
class QUENX_EXPORT TomlError : public std::runtime_error {
  public:
    TomlError(const std::string& text, std::size_t line) : std::runtime_error(text), m_line(line) {}
    ~TomlError() override;
    std::size_t line() const { return m_line; }
    /// "FILE, line 3: TEXT"
    std::string in(const std::string& fileName) const;

  private:
    std::size_t m_line;
};

}  // namespace utils

// toml++ asserts what a bad file can break ("[[["), and reports the mistake in the branch behind. So its
// assertions must neither end the process nor, with NDEBUG, be taken for granted by the compiler.
#pragma push_macro("NDEBUG")
#undef NDEBUG
#define TOML_ASSERT(condition) static_cast<void>(0)
#include <toml++/toml.h>
#pragma pop_macro("NDEBUG")

namespace utils {

/// Reads a text as TOML. @throws TomlError
QUENX_EXPORT toml::table parseToml(std::string_view text);

/// Reads the keys of one TOML table, and says of what it cannot take which key it is, in which line, and what
/// would be right. Every operation throws TomlError. `subject` names the table in these texts ("adapter
/// \"eth0\"").
class QUENX_EXPORT TomlTable {
  public:
    TomlTable(const toml::table& table, std::string subject)
        : m_table(table), m_subject(std::move(subject)) {}

    bool has(std::string_view key) const { return m_table.contains(key); }
    std::optional<std::string> text(std::string_view key) const;
    std::string requiredText(std::string_view key, std::string_view example) const;
    /// A whole number from 0 to the highest.
    template <class T>
    std::optional<T> number(std::string_view key, T highest = std::numeric_limits<T>::max()) const {
        const auto value = wholeNumber(key, static_cast<std::int64_t>(highest));
        return value ? std::optional(static_cast<T>(*value)) : std::nullopt;
    }
    bool flag(std::string_view key, bool otherwise) const;
    /// The tables of an array of tables; none when the key is not there.
    std::vector<const toml::table*> tables(std::string_view key) const;
    /// A list of texts.
    /// @param isRight  what each of them has to be; `expected` says it in words, for the whole list
    std::optional<std::vector<std::string>> texts(std::string_view key, bool (*isRight)(std::string_view),
                                                  const std::string& expected) const;
    /// One of the names, as its index.
    std::optional<std::size_t> choice(std::string_view key, std::span<const std::string_view> names) const;
    std::size_t requiredChoice(std::string_view key, std::span<const std::string_view> names) const;

    /// The line of a key; that of the table when the key is not there.
    std::size_t line(std::string_view key) const;

    void allowOnly(std::span<const std::string_view> keys) const;
    /// Refuses the value of a key: "KEY is VALUE, it must be EXPECTED".
    [[noreturn]] void refuse(std::string_view key, std::string_view value, const std::string& expected) const;
    [[noreturn]] void fail(std::string_view key, const std::string& what) const;
    TomlTable inner(const toml::table& table, std::string subject) const {
        return {table, std::move(subject)};
    }

  private:
    std::optional<std::int64_t> wholeNumber(std::string_view key, std::int64_t highest) const;
    const toml::source_region& placeOf(std::string_view key) const;
    [[noreturn]] void failAt(const toml::source_region& where, const std::string& what) const;

    const toml::table& m_table;
    std::string m_subject;
};

/// A text from a file as it may be shown, in quotes: no control characters, cut at a readable length.
QUENX_EXPORT std::string inQuotes(std::string_view text);

}  // namespace utils
