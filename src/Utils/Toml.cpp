// SPDX-License-Identifier: Apache-2.0
#include "Utils/Toml.h"

#include <algorithm>

#include "Utils/Utils.h"

namespace utils {
namespace {

constexpr std::string_view kBlanks = " \t\r\n";
constexpr std::string_view kEndsOfWords = " \t\r\n,]}#";

bool isAscii(char c) {
    return (static_cast<unsigned char>(c) & 0x80) == 0;
}

bool isBracket(char c) {
    return c == '[' || c == '{';
}

bool isKeyCharacter(char c) {
    return isLetter(c) || isDigit(c) || c == '_' || c == '-' || c == '.';
}

/// TOML allows characters beyond ASCII in quotes and comments alone. Anywhere else toml++ 3.3 asks whether
/// they are blanks, and that question has undefined behaviour; so they are refused before it sees them. Up to
/// the first other mistake, where the parser stops, this class finds quotes and comments where the parser
/// does.
class AsciiCheck {
  public:
    explicit AsciiCheck(std::string_view text) : m_text(text) {
        if (m_text.starts_with("\xEF\xBB\xBF")) m_at = m_wordBegin = 3;  // the byte order mark is allowed
    }

    /// @throws TomlError
    void run() {
        for (; m_at < m_text.size(); ++m_at) {
            const char c = m_text[m_at];
            if (c == '#') m_at = std::min(m_text.find('\n', m_at), m_text.size() - 1);
            if (c == '"' || c == '\'')
                passQuoted(c);
            else if (kEndsOfWords.find(c) == std::string_view::npos)
                requireAscii(m_at);
            else
                m_wordBegin = m_at + 1;
        }
    }

  private:
    void requireAscii(std::size_t place) const {
        if (place >= m_text.size() || isAscii(m_text[place])) return;
        const auto lines =
            std::count(m_text.begin(), m_text.begin() + static_cast<std::ptrdiff_t>(place), '\n');
        throw TomlError("a character beyond ASCII stands outside a text in quotes",
                        static_cast<std::size_t>(lines) + 1);
    }

    /// Brackets, a key and "=" may stand right before a quote. In other words, numbers above all, the parser
    /// takes no notice of quotes.
    bool isQuoteAtItsPlace() const {
        std::string_view word = m_text.substr(m_wordBegin, m_at - m_wordBegin);
        const auto skip = [&word](bool (*belongs)(char)) {
            word.remove_prefix(
                static_cast<std::size_t>(std::find_if_not(word.begin(), word.end(), belongs) - word.begin()));
        };
        skip(isBracket);
        if (word.starts_with('_') || (!word.empty() && isLetter(word[0]))) skip(isKeyCharacter);
        if (word.starts_with('=')) word.remove_prefix(1);
        skip(isBracket);
        return word.empty();
    }

    /// Ends on the last character of a quoted text, or at the end of its line when it is not closed.
    void passQuoted(char quote) {
        const bool isAtItsPlace = isQuoteAtItsPlace();
        const std::string three(3, quote);
        const bool hasLines = m_text.substr(m_at).starts_with(three);
        const auto isEnd = [&] {
            return hasLines ? m_text.substr(m_at).starts_with(three)
                            : m_text[m_at] == quote || m_text[m_at] == '\n';
        };
        for (m_at += hasLines ? 3 : 1; m_at < m_text.size() && !isEnd(); ++m_at) {
            if (!isAtItsPlace) requireAscii(m_at);
            if (m_text[m_at] == '\\' && quote == '"') passEscape(hasLines);
        }
        // The end of a text with lines may follow on one or two quotes that belong to it.
        if (hasLines && m_at < m_text.size())
            m_at = std::min(m_text.find_first_not_of(quote, m_at), m_at + 5) - 1;
        // To the parser the word goes on behind a quote that it did not notice.
        if (isAtItsPlace) m_wordBegin = m_at + 1;
    }

    /// A backslash at the end of a line continues it at the next character that is not a blank.
    void passEscape(bool hasLines) {
        if (hasLines) requireAscii(m_text.find_first_not_of(kBlanks, m_at + 1));
        ++m_at;
    }

    std::string_view m_text;
    std::size_t m_at = 0;
    std::size_t m_wordBegin = 0;
};

/// "a, b or c"
std::string listOf(std::span<const std::string_view> names) {
    std::string result;
    for (std::size_t index = 0; index < names.size(); ++index) {
        if (index != 0) result += index + 1 == names.size() ? " or " : ", ";
        result += names[index];
    }
    return result;
}

}  // namespace

TomlError::~TomlError() = default;

std::string TomlError::in(const std::string& fileName) const {
    return fileName + ", line " + std::to_string(m_line) + ": " + what();
}

toml::table parseToml(std::string_view text) {
    AsciiCheck(text).run();
    try {
        return toml::parse(text);
    } catch (const toml::parse_error& error) {
        throw TomlError(std::string(error.description()), error.source().begin.line);
    }
}

std::string inQuotes(std::string_view text) {
    constexpr std::size_t kLongest = 60;
    std::string result = "\"";
    for (const char character : text.substr(0, kLongest))
        result += isControl(character) ? '?' : character;
    return result + (text.size() > kLongest ? "...\"" : "\"");
}

void TomlTable::failAt(const toml::source_region& where, const std::string& what) const {
    throw TomlError(m_subject + ": " + what, where.begin.line);
}

const toml::source_region& TomlTable::placeOf(std::string_view key) const {
    const toml::node* node = m_table.get(key);
    return node != nullptr ? node->source() : m_table.source();
}

std::size_t TomlTable::line(std::string_view key) const {
    return placeOf(key).begin.line;
}

void TomlTable::fail(std::string_view key, const std::string& what) const {
    failAt(placeOf(key), what);
}

void TomlTable::refuse(std::string_view key, std::string_view value, const std::string& expected) const {
    fail(key, "\"" + std::string(key) + "\" is " + inQuotes(value) + ", it must be " + expected);
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

std::optional<std::int64_t> TomlTable::wholeNumber(std::string_view key, std::int64_t highest) const {
    const toml::node* node = m_table.get(key);
    if (node == nullptr) return std::nullopt;
    const auto* value = node->as_integer();
    if (value != nullptr && value->get() >= 0 && value->get() <= highest) return value->get();
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

std::optional<std::vector<std::string>> TomlTable::texts(std::string_view key,
                                                         bool (*isRight)(std::string_view),
                                                         const std::string& expected) const {
    const toml::node* node = m_table.get(key);
    if (node == nullptr) return std::nullopt;
    const std::string shouldBe = "\"" + std::string(key) + "\" must be a list of " + expected;
    const toml::array* array = node->as_array();
    if (array == nullptr) fail(key, shouldBe);
    std::vector<std::string> result;
    for (const toml::node& element : *array) {
        const auto* text = element.as_string();
        if (text == nullptr) failAt(element.source(), shouldBe);
        if (!isRight(text->get())) failAt(element.source(), shouldBe + ", not " + inQuotes(text->get()));
        result.push_back(text->get());
    }
    return result;
}

std::optional<std::size_t> TomlTable::choice(std::string_view key,
                                             std::span<const std::string_view> names) const {
    const std::optional<std::string> value = text(key);
    if (!value) return std::nullopt;
    const auto found = std::find(names.begin(), names.end(), *value);
    if (found != names.end()) return static_cast<std::size_t>(found - names.begin());
    refuse(key, *value, listOf(names));
}

std::size_t TomlTable::requiredChoice(std::string_view key, std::span<const std::string_view> names) const {
    if (const std::optional<std::size_t> index = choice(key, names)) return *index;
    fail(key, "\"" + std::string(key) + "\" is missing; it must be " + listOf(names));
}

void TomlTable::allowOnly(std::span<const std::string_view> keys) const {
    for (const auto& [key, node] : m_table) {
        if (std::find(keys.begin(), keys.end(), key.str()) != keys.end()) continue;
        failAt(key.source(), "unknown key " + inQuotes(key.str()) + "; the keys are " + listOf(keys));
    }
}

}  // namespace utils
